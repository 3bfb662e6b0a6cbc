// File search over the POSIX file system: a search handle reads its folder as it is asked for
// entries, so a folder of any size costs one entry of memory at a time.
#include <algorithm>
#include <cstring>
#include <dirent.h>
#include <fnmatch.h>
#include <memory>
#include <new>
#include <optional>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

#include <ut/platform/file_search.h>
#include <ut/platform/text.h>

#include "posix/path.h"

namespace {

struct DirectoryCloser {
    void operator()(DIR* directory) const noexcept { ::closedir(directory); }
};

// A listing in progress (`directory` set) or the one entry a name without wildcards found.
struct Search {
    std::unique_ptr<DIR, DirectoryCloser> directory;
    std::string folder, pattern;
    std::optional<WIN32_FIND_DATAW> single;
};

// Seconds since 1970 as 100-nanosecond ticks since 1601.
FILETIME FileTimeOf(const timespec& time) {
    constexpr std::uint64_t kEpochDifference = 11644473600ull;
    std::uint64_t ticks = (static_cast<std::uint64_t>(time.tv_sec) + kEpochDifference) * 10000000ull +
                          static_cast<std::uint64_t>(time.tv_nsec) / 100;
    return {static_cast<DWORD>(ticks), static_cast<DWORD>(ticks >> 32)};
}

bool Describe(const std::string& path, const std::string& name, WIN32_FIND_DATAW& found) {
    struct stat info {};
    if (::stat(path.c_str(), &info) != 0)
        return false;
    found = {};
    if (S_ISDIR(info.st_mode))
        found.dwFileAttributes |= FILE_ATTRIBUTE_DIRECTORY;
    if (::access(path.c_str(), W_OK) != 0)
        found.dwFileAttributes |= FILE_ATTRIBUTE_READONLY;
    struct stat link {};
    if (::lstat(path.c_str(), &link) == 0 && S_ISLNK(link.st_mode))
        found.dwFileAttributes |= FILE_ATTRIBUTE_REPARSE_POINT;
    if (found.dwFileAttributes == 0)
        found.dwFileAttributes = FILE_ATTRIBUTE_NORMAL;
    found.ftCreationTime = FileTimeOf(info.st_ctim);
    found.ftLastAccessTime = FileTimeOf(info.st_atim);
    found.ftLastWriteTime = FileTimeOf(info.st_mtim);
    // A folder has no size of its own, as on Windows.
    auto size = S_ISDIR(info.st_mode) ? 0 : static_cast<std::uint64_t>(info.st_size);
    found.nFileSizeHigh = static_cast<DWORD>(size >> 32);
    found.nFileSizeLow = static_cast<DWORD>(size);
    std::wstring wide = ut::platform::WideFromUtf8(name);
    std::size_t count = std::min(wide.size(), std::size(found.cFileName) - 1);
    std::wmemcpy(found.cFileName, wide.data(), count);
    return true;
}

// The next entry of the listing that matches its pattern; false when the folder is read through.
bool NextMatch(Search& search, WIN32_FIND_DATAW& found) {
    if (!search.directory) {
        if (!search.single)
            return false;
        found = *search.single;
        search.single.reset();
        return true;
    }
    while (const dirent* entry = ::readdir(search.directory.get())) {
        std::string name = entry->d_name;
        if (::fnmatch(search.pattern.c_str(), name.c_str(), 0) != 0)
            continue;
        if (Describe(search.folder.empty() ? name : search.folder + "/" + name, name, found))
            return true;
    }
    return false;
}

} // namespace

HANDLE FindFirstFileW(LPCWSTR name, WIN32_FIND_DATAW* found) {
    if (!name || !found || !*name)
        return INVALID_HANDLE_VALUE;
    try {
        std::string path = ut::platform::posix::SystemPath(name);
        std::size_t slash = path.find_last_of('/');
        auto search = std::make_unique<Search>();
        search->folder = slash == std::string::npos ? std::string() : path.substr(0, slash);
        std::string last = slash == std::string::npos ? path : path.substr(slash + 1);
        if (last.find_first_of("*?") != std::string::npos) {
            search->pattern = last;
            search->directory.reset(::opendir(search->folder.empty() ? "." : search->folder.c_str()));
            if (!search->directory)
                return INVALID_HANDLE_VALUE;
        } else if (WIN32_FIND_DATAW entry; Describe(path, last, entry)) {
            search->single = entry;
        }
        if (!NextMatch(*search, *found))
            return INVALID_HANDLE_VALUE;
        return search.release();
    } catch (const std::bad_alloc&) {
        return INVALID_HANDLE_VALUE;
    }
}

BOOL FindNextFileW(HANDLE handle, WIN32_FIND_DATAW* found) {
    auto* search = static_cast<Search*>(handle);
    if (!search || handle == INVALID_HANDLE_VALUE || !found)
        return FALSE;
    try {
        return NextMatch(*search, *found) ? TRUE : FALSE;
    } catch (const std::bad_alloc&) {
        return FALSE;
    }
}

BOOL FindClose(HANDLE handle) {
    if (!handle || handle == INVALID_HANDLE_VALUE)
        return FALSE;
    delete static_cast<Search*>(handle);
    return TRUE;
}

namespace ut::platform {

bool IdentifyFolder(const wchar_t* path, FolderIdentity& identity) {
    struct stat info {};
    if (!path || ::stat(posix::SystemPath(path).c_str(), &info) != 0 || !S_ISDIR(info.st_mode))
        return false;
    identity = {static_cast<std::uint64_t>(info.st_dev), static_cast<std::uint64_t>(info.st_ino)};
    return true;
}

} // namespace ut::platform
