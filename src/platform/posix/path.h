// Paths on POSIX: wide text as the library holds it, UTF-8 as the system takes it.
#pragma once

#include <cerrno>
#include <cstdlib>
#include <string>
#include <string_view>

#include <ut/platform/text.h>

namespace ut::platform::posix {

// The system's form of a path: UTF-8, with a backslash read as a folder separator.
inline std::string SystemPath(std::wstring_view path) {
    std::string text = Utf8FromWide(path);
    for (char& c : text)
        if (c == '\\')
            c = '/';
    return text;
}

// A file of the user's in one of the folders the desktop's base directories name: below the
// folder the environment variable `variable` holds when it is an absolute path, else below
// $HOME/`homeDefault` (".local/share", ".local/state"); empty when there is no home either.
inline std::string UserFolderFile(const char* variable, const char* homeDefault, const char* relative) {
    if (const char* folder = std::getenv(variable); folder && *folder == '/')
        return std::string(folder) + "/" + relative;
    if (const char* home = std::getenv("HOME"); home && *home)
        return std::string(home) + "/" + homeDefault + "/" + relative;
    return std::string();
}

// The storage code for a failed file operation.
inline HRESULT StorageError(int error, HRESULT fallback) {
    switch (error) {
    case ENOENT:
    case ENOTDIR:
        return STG_E_FILENOTFOUND;
    case EACCES:
    case EPERM:
    case EROFS:
    case EISDIR:
        return STG_E_ACCESSDENIED;
    case ENOSPC:
    case EFBIG:
        return STG_E_MEDIUMFULL;
    case ENOMEM:
        return STG_E_INSUFFICIENTMEMORY;
    case EEXIST:
        return STG_E_FILEALREADYEXISTS;
    default:
        return fallback;
    }
}

} // namespace ut::platform::posix
