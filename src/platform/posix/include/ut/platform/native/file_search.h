// POSIX home: the file-search records and calls with the Windows layout.
#pragma once

#include <cstdint>

#include <ut/platform/native/com.h>

using HANDLE = void*;
inline HANDLE const INVALID_HANDLE_VALUE = reinterpret_cast<HANDLE>(static_cast<std::intptr_t>(-1));

inline constexpr DWORD FILE_ATTRIBUTE_READONLY = 0x00000001;
inline constexpr DWORD FILE_ATTRIBUTE_DIRECTORY = 0x00000010;
inline constexpr DWORD FILE_ATTRIBUTE_NORMAL = 0x00000080;
// The entry is a symbolic link (its other attributes are those of what it leads to).
inline constexpr DWORD FILE_ATTRIBUTE_REPARSE_POINT = 0x00000400;

struct WIN32_FIND_DATAW {
    DWORD dwFileAttributes;
    FILETIME ftCreationTime;
    FILETIME ftLastAccessTime;
    FILETIME ftLastWriteTime;
    DWORD nFileSizeHigh;
    DWORD nFileSizeLow;
    DWORD dwReserved0;
    DWORD dwReserved1;
    WCHAR cFileName[260];
    WCHAR cAlternateFileName[14];
};

extern "C" {
// INVALID_HANDLE_VALUE when nothing matches.
UT_PLATFORM_API HANDLE FindFirstFileW(LPCWSTR name, WIN32_FIND_DATAW* found);
// FALSE when no entry is left.
UT_PLATFORM_API BOOL FindNextFileW(HANDLE search, WIN32_FIND_DATAW* found);
UT_PLATFORM_API BOOL FindClose(HANDLE search);
}
