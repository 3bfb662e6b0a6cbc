// POSIX home: temporary names, access tests and path splitting with the Windows
// semantics. Paths are wide text, handed to the system in UTF-8; a backslash separates folders
// as a slash does.
#pragma once

#include <cstdint>

#include <ut/platform/native/com.h>
#include <ut/platform/native/file_search.h>

inline constexpr DWORD MAX_PATH = 260;
inline constexpr int _MAX_DRIVE = 3;
inline constexpr int _MAX_DIR = 256;
inline constexpr int _MAX_FNAME = 256;
inline constexpr int _MAX_EXT = 256;

extern "C" {
// The temporary folder ($TMPDIR, else /tmp) with a trailing separator. Returns its length, or
// the capacity it needs (terminator included) when `capacity` is too small.
UT_PLATFORM_API DWORD GetTempPathW(DWORD capacity, LPWSTR buffer);
// With `unique` 0, creates a new empty file <path>/<prefix, 3 characters><6 random characters>.tmp
// with mkstemps and returns a nonzero number; otherwise only forms <path>/<prefix><unique in hex>.tmp.
// `name` holds MAX_PATH characters. 0 on failure.
UT_PLATFORM_API UINT GetTempFileNameW(LPCWSTR path, LPCWSTR prefix, UINT unique, LPWSTR name);
UT_PLATFORM_API BOOL DeleteFileW(LPCWSTR path);
// Mode 0 tests existence, 2 writing, 4 reading, 6 both. A file without any write permission
// bit is read-only for every user, the superuser included, as a read-only file is on Windows.
UT_PLATFORM_API int _waccess(const wchar_t* path, int mode);
UT_PLATFORM_API void _wsplitpath(const wchar_t* path, wchar_t* drive, wchar_t* dir, wchar_t* name,
                                 wchar_t* extension);
}
