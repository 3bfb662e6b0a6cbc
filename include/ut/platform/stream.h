// IStream on both homes, and the two streams the library opens itself: one in memory and one over
// a file. On Windows these are the system's own; on POSIX they are ours with the same behaviour.
#pragma once

#include <ut/platform/com.h>
#include <ut/platform/native/stream.h>

namespace ut::platform {

// A growable stream in memory, positioned at 0. Stat reports no name.
UT_PLATFORM_API HRESULT CreateMemoryStream(IStream** stream);

// A stream over a file. `mode` takes the STGM access flags (STGM_READ, STGM_WRITE or
// STGM_READWRITE), and STGM_CREATE to create or truncate the file; without STGM_CREATE a missing
// file answers STG_E_FILENOTFOUND. Stat reports the path as the stream's name.
UT_PLATFORM_API HRESULT OpenFileStream(const wchar_t* path, DWORD mode, IStream** stream);

} // namespace ut::platform

UT_INTERFACE_ID(ISequentialStream, IID_ISequentialStream);
UT_INTERFACE_ID(IStream, IID_IStream);
