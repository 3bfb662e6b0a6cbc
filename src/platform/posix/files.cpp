// Files on POSIX: temporary names from mkstemps, file search over opendir with Windows-style
// patterns, deletion, access tests with Windows' notion of read-only, and path splitting.
#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <cwctype>
#include <dirent.h>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/files.h>

#include "posix/letters.h"
#include "posix/path.h"

namespace {

using ut::platform::WideFromUtf8;
using ut::platform::posix::SameLetter;
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

FILETIME FileTimeOf(const timespec& time) {
    constexpr ULONGLONG kSecondsFrom1601 = 11644473600ull;
    ULONGLONG ticks = (static_cast<ULONGLONG>(time.tv_sec) + kSecondsFrom1601) * 10000000ull +
                      static_cast<ULONGLONG>(time.tv_nsec) / 100;
    return {static_cast<DWORD>(ticks), static_cast<DWORD>(ticks >> 32)};
}

// Copies `text` into a buffer of `capacity` characters, cut to fit, always terminated.
void CopyCut(std::wstring_view text, wchar_t* buffer, std::size_t capacity) {
    if (!buffer || capacity == 0)
        return;
    std::size_t length = std::min(text.size(), capacity - 1);
    std::wmemcpy(buffer, text.data(), length);
    buffer[length] = L'\0';
}

// Windows patterns: '*' any run, '?' one character, letters without case; "*.*" is everything.
bool Matches(std::wstring_view pattern, std::wstring_view name) {
    if (pattern == L"*.*")
        pattern = L"*";
    std::size_t p = 0, n = 0, starP = std::wstring_view::npos, starN = 0;
    while (n < name.size()) {
        if (p < pattern.size() && (pattern[p] == L'?' || SameLetter(pattern[p], name[n]))) {
            ++p;
            ++n;
        } else if (p < pattern.size() && pattern[p] == L'*') {
            starP = p++;
            starN = n;
        } else if (starP != std::wstring_view::npos) {
            p = starP + 1;
            n = ++starN;
        } else {
            return false;
        }
    }
    while (p < pattern.size() && pattern[p] == L'*')
        ++p;
    return p == pattern.size();
}

struct Search {
    std::string folder;
    std::vector<std::string> names;
    std::size_t next = 0;
};

struct SearchTable {
    std::mutex mutex;
    std::map<HANDLE, std::unique_ptr<Search>> searches;
};

SearchTable& Searches() {
    static SearchTable* table = new SearchTable;
    return *table;
}

bool Fill(const std::string& folder, const std::string& name, WIN32_FIND_DATAW* found) {
    std::string path = folder.empty() ? name : folder + "/" + name;
    struct stat info {};
    if (::stat(path.c_str(), &info) != 0 && ::lstat(path.c_str(), &info) != 0)
        return false;
    std::memset(found, 0, sizeof *found);
    bool folderEntry = S_ISDIR(info.st_mode);
    found->dwFileAttributes = folderEntry ? FILE_ATTRIBUTE_DIRECTORY : FILE_ATTRIBUTE_ARCHIVE;
    if (!(info.st_mode & (S_IWUSR | S_IWGRP | S_IWOTH)))
        found->dwFileAttributes |= FILE_ATTRIBUTE_READONLY;
    if (name.size() > 1 && name[0] == '.' && name != "..")
        found->dwFileAttributes |= FILE_ATTRIBUTE_HIDDEN;
    found->ftCreationTime = FileTimeOf(info.st_ctim);
    found->ftLastAccessTime = FileTimeOf(info.st_atim);
    found->ftLastWriteTime = FileTimeOf(info.st_mtim);
    ULONGLONG size = folderEntry ? 0 : static_cast<ULONGLONG>(info.st_size);
    found->nFileSizeHigh = static_cast<DWORD>(size >> 32);
    found->nFileSizeLow = static_cast<DWORD>(size);
    CopyCut(WideFromUtf8(name), found->cFileName, MAX_PATH);
    return true;
}

// Lists the entries of `folder` whose names match `pattern`: "." and ".." first, then the
// others by name without case, as an NTFS folder lists them.
DWORD Collect(const std::string& folder, std::wstring_view pattern, std::vector<std::string>& names) {
    DIR* dir = ::opendir(folder.empty() ? "." : folder.c_str());
    if (!dir)
        return ERROR_PATH_NOT_FOUND;
    while (dirent* entry = ::readdir(dir))
        if (Matches(pattern, WideFromUtf8(entry->d_name)))
            names.emplace_back(entry->d_name);
    ::closedir(dir);
    auto rank = [](const std::string& name) { return name == "." ? 0 : name == ".." ? 1 : 2; };
    std::sort(names.begin(), names.end(), [&](const std::string& a, const std::string& b) {
        if (rank(a) != rank(b))
            return rank(a) < rank(b);
        return ::strcasecmp(a.c_str(), b.c_str()) < 0;
    });
    return names.empty() ? ERROR_FILE_NOT_FOUND : ERROR_SUCCESS;
}

HANDLE StartSearch(const wchar_t* pattern, WIN32_FIND_DATAW* found) {
    std::wstring_view text(pattern);
    std::size_t cut = text.find_last_of(L"/\\");
    std::string folder = cut == std::wstring_view::npos ? std::string() : SystemPath(text.substr(0, cut + 1));
    if (folder.size() > 1 && folder.back() == '/')
        folder.pop_back();
    std::wstring_view last = cut == std::wstring_view::npos ? text : text.substr(cut + 1);
    auto search = std::make_unique<Search>();
    search->folder = folder;
    DWORD error = ERROR_SUCCESS;
    if (last.empty()) {
        error = ERROR_FILE_NOT_FOUND;
    } else if (last.find_first_of(L"*?") == std::wstring_view::npos) {
        struct stat info {};
        std::string path = SystemPath(text);
        if (::stat(path.c_str(), &info) == 0)
            search->names.push_back(SystemPath(last));
        else
            error = ErrorFromErrno(errno);
    } else {
        error = Collect(folder, last, search->names);
    }
    if (error != ERROR_SUCCESS || !Fill(search->folder, search->names[0], found)) {
        SetLastError(error != ERROR_SUCCESS ? error : ERROR_FILE_NOT_FOUND);
        return INVALID_HANDLE_VALUE;
    }
    search->next = 1;
    HANDLE handle = search.get();
    SearchTable& table = Searches();
    std::lock_guard lock(table.mutex);
    table.searches.emplace(handle, std::move(search));
    return handle;
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

HANDLE FindFirstFileW(LPCWSTR pattern, WIN32_FIND_DATAW* found) {
    if (!pattern || !found) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return INVALID_HANDLE_VALUE;
    }
    return ut::ExportBoundary([&] { return StartSearch(pattern, found); }, INVALID_HANDLE_VALUE);
}

BOOL FindNextFileW(HANDLE handle, WIN32_FIND_DATAW* found) {
    SearchTable& table = Searches();
    std::lock_guard lock(table.mutex);
    auto entry = table.searches.find(handle);
    if (entry == table.searches.end() || !found) {
        SetLastError(entry == table.searches.end() ? ERROR_INVALID_HANDLE : ERROR_INVALID_PARAMETER);
        return FALSE;
    }
    Search& search = *entry->second;
    while (search.next < search.names.size())
        if (Fill(search.folder, search.names[search.next++], found))
            return TRUE;
    SetLastError(ERROR_NO_MORE_FILES);
    return FALSE;
}

BOOL FindClose(HANDLE handle) {
    SearchTable& table = Searches();
    std::lock_guard lock(table.mutex);
    if (table.searches.erase(handle) == 0) {
        SetLastError(ERROR_INVALID_HANDLE);
        return FALSE;
    }
    return TRUE;
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
