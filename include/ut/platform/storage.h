// Structured storage on both homes: IStorage, ILockBytes and IEnumSTATSTG over compound files,
// the format the system writes and standard tools read. On Windows these are the system's own;
// on POSIX they are ours (read through libgsf) and answer as the system does:
// - a file that is not a compound file (too short, another signature) is refused with
//   STG_E_FILEALREADYEXISTS, a damaged header with STG_E_INVALIDHEADER, damaged tables or a
//   damaged directory with STG_E_DOCFILECORRUPT, a missing file with STG_E_FILENOTFOUND;
// - elements are named by at most 31 characters, none of \ / : !, compared without case, and
//   listed shorter names first, then by upper-case name; streams and storages inside a storage
//   are opened with STGM_SHARE_EXCLUSIVE and once at a time;
// - destroying an open element, or reverting a transacted root, leaves its holders answering
//   STG_E_REVERTED.
// On POSIX a writable storage builds the next file in a temporary file beside the original: a
// stream of 4096 bytes or more goes there as it is written (a few bytes at a time are gathered
// in memory first), shorter ones stay in memory. The root's commit (and, unless transacted, its
// release) adds the rest, flushes the file to the disk and renames it over the original, so
// that a crash leaves the old file or the new one, never a mix. Storages inside the root are
// part of its transaction. POSIX takes no share locks: a second open of the same file is not
// refused.
#pragma once

#include <ut/platform/com.h>
#include <ut/platform/global.h>
#include <ut/platform/native/storage.h>
#include <ut/platform/stream.h>

namespace ut::platform {

// A byte array over a file, for the storage calls that take one. `mode` takes the STGM access
// flags, STGM_CREATE to create or empty the file, and STGM_DELETEONRELEASE to delete the file
// with the last reference. Without STGM_CREATE a missing file answers STG_E_FILENOTFOUND.
// Stat reports STGTY_LOCKBYTES, the size, the open mode and the file's path.
UT_PLATFORM_API HRESULT OpenFileLockBytes(const wchar_t* path, DWORD mode, ILockBytes** bytes);

} // namespace ut::platform

template <>
struct ut::InterfaceId<ILockBytes> : ut::Iid<IID_ILockBytes> {};
template <>
struct ut::InterfaceId<IStorage> : ut::Iid<IID_IStorage> {};
template <>
struct ut::InterfaceId<IEnumSTATSTG> : ut::Iid<IID_IEnumSTATSTG> {};
