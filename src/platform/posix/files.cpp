// Files on POSIX: temporary names from mkstemps, deletion, access tests with Windows' notion of read-only, and path splitting.
#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <functional>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/files.h>

#include "posix/path.h"

namespace {

using ut::platform::WideFromUtf8;
using ut::platform::posix::SystemPath;

constexpr DWORD ERROR_BUFFER_OVERFLOW = 111;

bool IsSeparator(wchar_t c) {
    return c == L'/' || c == L'\\';
}

DWORD ErrorFromErrno(int error) {
    switch (error) {
    case ENOENT:
        return ERROR_FILE_NOT_FOUND;
    case ENOTDIR:
        return ERROR_PATH_NOT_FOUND;
    case EACCES:
    case EPERM:
    case EISDIR:
    case EROFS:
        return ERROR_ACCESS_DENIED;
    case EEXIST:
        return ERROR_FILE_EXISTS;
    case ENOMEM:
        return ERROR_NOT_ENOUGH_MEMORY;
    default:
        return ERROR_INVALID_PARAMETER;
    }
}

// Copies `text` into a buffer of `capacity` characters, cut to fit, always terminated.
void CopyCut(std::wstring_view text, wchar_t* buffer, std::size_t capacity) {
    if (!buffer || capacity == 0)
        return;
    std::size_t length = std::min(text.size(), capacity - 1);
    std::wmemcpy(buffer, text.data(), length);
    buffer[length] = L'\0';
}

// A new name for a temporary file, made and created by mkstemps; its number is the random
// part's hash, never 0.
UINT CreateUniqueFile(const std::wstring& start, LPWSTR name) {
    std::string path = SystemPath(start) + "XXXXXX.tmp";
    if (start.size() + 10 >= MAX_PATH) {
        SetLastError(ERROR_BUFFER_OVERFLOW);
        return 0;
    }
    int fd = ::mkstemps(path.data(), 4);
    if (fd < 0) {
        SetLastError(ErrorFromErrno(errno) == ERROR_FILE_NOT_FOUND ? ERROR_PATH_NOT_FOUND
                                                                   : ErrorFromErrno(errno));
        return 0;
    }
    ::close(fd);
    std::wstring random = WideFromUtf8(path.substr(path.size() - 10, 6));
    CopyCut(start + random + L".tmp", name, MAX_PATH);
    return static_cast<UINT>(std::hash<std::wstring>{}(random) % 0xFFFF) + 1;
}

} // namespace

extern "C" {

DWORD GetTempPathW(DWORD capacity, LPWSTR buffer) {
    const char* folder = std::getenv("TMPDIR");
    std::wstring path = WideFromUtf8(folder && *folder ? folder : "/tmp");
    if (!IsSeparator(path.back()))
        path += L'/';
    if (!buffer || path.size() + 1 > capacity)
        return static_cast<DWORD>(path.size() + 1);
    CopyCut(path, buffer, capacity);
    return static_cast<DWORD>(path.size());
}

UINT GetTempFileNameW(LPCWSTR path, LPCWSTR prefix, UINT unique, LPWSTR name) {
    if (!path || !name) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return 0;
    }
    std::wstring start = path;
    if (!start.empty() && !IsSeparator(start.back()))
        start += L'/';
    if (prefix)
        start.append(prefix, std::min<std::size_t>(std::wcslen(prefix), 3));
    if (unique == 0)
        return CreateUniqueFile(start, name);
    wchar_t number[8];
    std::swprintf(number, 8, L"%x", unique & 0xFFFF);
    std::wstring formed = start + number + L".tmp";
    if (formed.size() >= MAX_PATH) {
        SetLastError(ERROR_BUFFER_OVERFLOW);
        return 0;
    }
    CopyCut(formed, name, MAX_PATH);
    return unique;
}

BOOL DeleteFileW(LPCWSTR path) {
    if (!path) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return FALSE;
    }
    if (::unlink(SystemPath(path).c_str()) == 0)
        return TRUE;
    SetLastError(ErrorFromErrno(errno));
    return FALSE;
}

int _waccess(const wchar_t* path, int mode) {
    if (!path || (mode & ~6) != 0) {
        errno = EINVAL;
        return -1;
    }
    std::string system = SystemPath(path);
    struct stat info {};
    if (::stat(system.c_str(), &info) != 0)
        return -1;
    bool readOnly = !(info.st_mode & (S_IWUSR | S_IWGRP | S_IWOTH));
    if ((mode & 2) && readOnly) {
        errno = EACCES;
        return -1;
    }
    int wanted = ((mode & 2) ? W_OK : 0) | ((mode & 4) ? R_OK : 0);
    return ::access(system.c_str(), wanted ? wanted : F_OK);
}

void _wsplitpath(const wchar_t* path, wchar_t* drive, wchar_t* dir, wchar_t* name, wchar_t* extension) {
    std::wstring_view rest = path ? path : L"";
    std::wstring_view driveText;
    if (rest.size() >= 2 && rest[1] == L':') {
        driveText = rest.substr(0, 2);
        rest.remove_prefix(2);
    }
    std::size_t cut = rest.find_last_of(L"/\\");
    std::wstring_view dirText =
        cut == std::wstring_view::npos ? std::wstring_view() : rest.substr(0, cut + 1);
    std::wstring_view file = cut == std::wstring_view::npos ? rest : rest.substr(cut + 1);
    std::size_t dot = file.find_last_of(L'.');
    CopyCut(driveText, drive, _MAX_DRIVE);
    CopyCut(dirText, dir, _MAX_DIR);
    CopyCut(dot == std::wstring_view::npos ? file : file.substr(0, dot), name, _MAX_FNAME);
    CopyCut(dot == std::wstring_view::npos ? std::wstring_view() : file.substr(dot), extension, _MAX_EXT);
}

} // extern "C"
