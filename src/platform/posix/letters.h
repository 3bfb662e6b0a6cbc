// Letters without case, as the system compares names: ASCII at once, the rest through the C
// library's case tables.
#pragma once

#include <cwctype>

namespace ut::platform::posix {

inline wchar_t UpperLetter(wchar_t c) {
    if (c < 0x80)
        return c >= L'a' && c <= L'z' ? static_cast<wchar_t>(c - (L'a' - L'A')) : c;
    return static_cast<wchar_t>(std::towupper(static_cast<wint_t>(c)));
}

inline bool SameLetter(wchar_t a, wchar_t b) {
    return a == b || UpperLetter(a) == UpperLetter(b);
}

} // namespace ut::platform::posix
