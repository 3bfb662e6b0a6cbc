// Paths on POSIX: wide text as the library holds it, UTF-8 as the system takes it.
#pragma once

#include <cerrno>
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
