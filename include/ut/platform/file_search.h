// File search on both homes: FindFirstFileW, FindNextFileW and FindClose with the Windows
// records, and an owner that closes a search on every path.
//
// On POSIX a name whose last part holds `*` or `?` lists the entries of its folder that match it
// as the shell matches (case-sensitive; "." and ".." match "*", as on Windows), in no particular
// order; any other name finds that one entry, a folder included. Attributes reported there:
// FILE_ATTRIBUTE_DIRECTORY, FILE_ATTRIBUTE_READONLY (no write permission), FILE_ATTRIBUTE_REPARSE_POINT
// (a symbolic link, described by what it leads to) and FILE_ATTRIBUTE_NORMAL when none applies. A
// backslash separates folders as a slash does, and a listing reads its folder as it goes, so a
// folder of any size is listed in constant memory.
#pragma once

#include <compare>
#include <cstdint>

#include <ut/platform/com.h>
#include <ut/platform/native/file_search.h>

namespace ut::platform {

// Owns a search handle; FindFirstFileW's failure value is held as nothing to close.
class UniqueFind {
public:
    explicit UniqueFind(HANDLE search) noexcept : search_(search) {}
    ~UniqueFind() {
        if (Valid())
            FindClose(search_);
    }
    UniqueFind(const UniqueFind&) = delete;
    UniqueFind& operator=(const UniqueFind&) = delete;

    HANDLE Get() const noexcept { return search_; }
    bool Valid() const noexcept { return search_ != INVALID_HANDLE_VALUE; }

private:
    HANDLE search_;
};

// What tells a folder from every other one on the machine however it is reached (through links
// too): the volume and the file number.
struct FolderIdentity {
    std::uint64_t volume = 0;
    std::uint64_t file = 0;
    friend bool operator==(const FolderIdentity&, const FolderIdentity&) = default;
};

// The identity of the folder `path` names, links followed; false when it is no folder or cannot
// be reached.
UT_PLATFORM_API bool IdentifyFolder(const wchar_t* path, FolderIdentity& identity);

} // namespace ut::platform
