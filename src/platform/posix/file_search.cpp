// File search over the POSIX file system: a search handle holds the entries still to hand out.
#include <algorithm>
#include <cstring>
#include <dirent.h>
#include <fnmatch.h>
#include <memory>
#include <new>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

#include <ut/platform/file_search.h>
#include <ut/platform/text.h>

namespace {

struct Search {
    std::vector<WIN32_FIND_DATAW> remaining; // handed out from the back
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

void ListMatches(const std::string& folder, const std::string& pattern, Search& search) {
    DIR* directory = ::opendir(folder.empty() ? "." : folder.c_str());
    if (!directory)
        return;
    while (const dirent* entry = ::readdir(directory)) {
        std::string name = entry->d_name;
        if (::fnmatch(pattern.c_str(), name.c_str(), 0) != 0)
            continue;
        WIN32_FIND_DATAW found;
        if (Describe(folder.empty() ? name : folder + "/" + name, name, found))
            search.remaining.push_back(found);
    }
    ::closedir(directory);
}

} // namespace

HANDLE FindFirstFileW(LPCWSTR name, WIN32_FIND_DATAW* found) {
    if (!name || !found || !*name)
        return INVALID_HANDLE_VALUE;
    try {
        std::string path = ut::platform::Utf8FromWide(name);
        std::size_t slash = path.find_last_of('/');
        std::string folder = slash == std::string::npos ? std::string() : path.substr(0, slash);
        std::string last = slash == std::string::npos ? path : path.substr(slash + 1);
        auto search = std::make_unique<Search>();
        if (last.find_first_of("*?") != std::string::npos) {
            ListMatches(folder, last, *search);
        } else {
            WIN32_FIND_DATAW entry;
            if (Describe(path, last, entry))
                search->remaining.push_back(entry);
        }
        if (search->remaining.empty())
            return INVALID_HANDLE_VALUE;
        *found = search->remaining.back();
        search->remaining.pop_back();
        return search.release();
    } catch (const std::bad_alloc&) {
        return INVALID_HANDLE_VALUE;
    }
}

BOOL FindNextFileW(HANDLE handle, WIN32_FIND_DATAW* found) {
    auto* search = static_cast<Search*>(handle);
    if (!search || handle == INVALID_HANDLE_VALUE || !found || search->remaining.empty())
        return FALSE;
    *found = search->remaining.back();
    search->remaining.pop_back();
    return TRUE;
}

BOOL FindClose(HANDLE handle) {
    if (!handle || handle == INVALID_HANDLE_VALUE)
        return FALSE;
    delete static_cast<Search*>(handle);
    return TRUE;
}
