// IStream on both homes, and the two streams the library opens itself: one in memory and one over
// a file. On Windows these are the system's own behind a thin wrapper; on POSIX they are ours.
// Both homes answer alike: a read that reaches the end succeeds with S_OK; bytes skipped by a
// write or SetSize past the end read as zeros; a Seek before the start or with an unknown origin
// answers STG_E_INVALIDFUNCTION and keeps the position; a memory stream holds at most 4 GiB - 1
// bytes; reads and writes that the open mode forbids answer STG_E_ACCESSDENIED; null pointers
// answer STG_E_INVALIDPOINTER; Stat reports STGTY_STREAM and the open mode. Other failure codes
// are the home's own.
#pragma once

#include <ut/platform/com.h>
#include <ut/platform/native/stream.h>

namespace ut::platform {

// A growable stream in memory, positioned at 0. Stat reports no name.
UT_PLATFORM_API HRESULT CreateMemoryStream(IStream** stream);

// A stream over a file. `mode` takes the STGM access flags (STGM_READ, STGM_WRITE or
// STGM_READWRITE), and STGM_CREATE to create or truncate the file; without STGM_CREATE a missing
// file (or folder) answers STG_E_FILENOTFOUND, and a folder STG_E_ACCESSDENIED. Stat reports the
// path as given as the stream's name.
UT_PLATFORM_API HRESULT OpenFileStream(const wchar_t* path, DWORD mode, IStream** stream);

} // namespace ut::platform

template <>
struct ut::InterfaceId<ISequentialStream> : ut::Iid<IID_ISequentialStream> {};
template <>
struct ut::InterfaceId<IStream> : ut::Iid<IID_IStream> {};
