// Windows home: the C runtime's own case-insensitive comparisons, multibyte helpers and number
// conversions (long is 32-bit here).
#include <cstdlib>
#include <cstring>
#include <cwchar>

#include <ut/platform/strings.h>

#include <mbstring.h> // last: the C runtime's multibyte headers define short macros

namespace ut::platform {

// The CRT gives no cheap sign that the locale changed, so every letter is folded as it comes.
FoldTable WideFoldTable() {
    return {};
}

int CompareWideNoCase(const wchar_t* lhs, const wchar_t* rhs) {
    return _wcsicmp(lhs, rhs);
}

int CompareWideNoCase(const wchar_t* lhs, const wchar_t* rhs, std::size_t count) {
    return _wcsnicmp(lhs, rhs, count);
}

int CompareBytesNoCase(const char* lhs, const char* rhs) {
    return _stricmp(lhs, rhs);
}

int CompareBytesNoCase(const char* lhs, const char* rhs, std::size_t count) {
    return _strnicmp(lhs, rhs, count);
}

int CompareMultibyteNoCase(const unsigned char* lhs, const unsigned char* rhs) {
    return _mbsicmp(lhs, rhs);
}

int CompareMultibyteNoCase(const unsigned char* lhs, const unsigned char* rhs, std::size_t bytes) {
    return _mbsnbicmp(lhs, rhs, bytes);
}

std::size_t MultibyteLength(const unsigned char* text) {
    return _mbslen(text);
}

bool IsMultibyteDigit(unsigned int character) {
    return _ismbcdigit(character) != 0;
}

// The older runtimes' atol wraps where _wtol saturates; strtol and wcstol saturate by the
// standard, so both forms answer alike, here and on POSIX.
LONG WideToLong(const wchar_t* text) {
    return std::wcstol(text, nullptr, 10);
}

LONG BytesToLong(const char* text) {
    return std::strtol(text, nullptr, 10);
}

} // namespace ut::platform
