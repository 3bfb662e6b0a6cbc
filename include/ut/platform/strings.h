// The C runtime's text helpers that the Windows home has and POSIX lacks: case-insensitive
// comparisons, multibyte lengths and digit tests, and number conversions with a 32-bit long.
// They follow the C library's current locale on both homes (LC_CTYPE; on Windows also the
// current multibyte code page); the library sets neither.
#pragma once

#include <cstddef>

#include <ut/platform/com.h>

namespace ut::platform {

// _wcsicmp and _wcsnicmp (`count` in characters): compare with each character folded to lower
// case; negative, zero or positive as lhs orders before, with or after rhs.
UT_PLATFORM_API int CompareWideNoCase(const wchar_t* lhs, const wchar_t* rhs);
UT_PLATFORM_API int CompareWideNoCase(const wchar_t* lhs, const wchar_t* rhs, std::size_t count);

// _stricmp and _strnicmp (`count` in bytes): the same over single bytes.
UT_PLATFORM_API int CompareBytesNoCase(const char* lhs, const char* rhs);
UT_PLATFORM_API int CompareBytesNoCase(const char* lhs, const char* rhs, std::size_t count);

// _mbsicmp and _mbsnbicmp (`bytes` counts bytes): the same over the characters of the current
// multibyte encoding. A byte that starts no valid character, or a character cut by `bytes`,
// compares as the byte's own value.
UT_PLATFORM_API int CompareMultibyteNoCase(const unsigned char* lhs, const unsigned char* rhs);
UT_PLATFORM_API int CompareMultibyteNoCase(const unsigned char* lhs, const unsigned char* rhs,
                                           std::size_t bytes);

// _mbslen: the number of multibyte characters before the terminator; a byte that starts no
// valid character counts as one.
UT_PLATFORM_API std::size_t MultibyteLength(const unsigned char* text);

// _ismbcdigit: whether `character` (one byte, or a double-byte code as lead * 256 + trail) is a
// decimal digit of the current multibyte encoding.
UT_PLATFORM_API bool IsMultibyteDigit(unsigned int character);

// _wtol and atol as Windows has them, where long is 32-bit: leading white space and a sign are
// taken, parsing stops at the first non-digit, and values out of range saturate.
UT_PLATFORM_API LONG WideToLong(const wchar_t* text);
UT_PLATFORM_API LONG BytesToLong(const char* text);

} // namespace ut::platform
