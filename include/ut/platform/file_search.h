// File search on both homes: FindFirstFileW, FindNextFileW and FindClose with the Windows
// records, and an owner that closes a search on every path.
//
// On POSIX a name whose last part holds `*` or `?` lists the entries of its folder that match it
// as the shell matches (case-sensitive; "." and ".." match "*", as on Windows), in no particular
// order; any other name finds that one entry, a folder included. Attributes reported there:
// FILE_ATTRIBUTE_DIRECTORY, FILE_ATTRIBUTE_READONLY (no write permission) and FILE_ATTRIBUTE_NORMAL when
// neither applies.
#pragma once

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

} // namespace ut::platform
