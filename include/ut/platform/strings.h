// The C runtime's text helpers that the Windows home has and POSIX lacks: case-insensitive
// comparisons, multibyte lengths and digit tests, and number conversions with a 32-bit long.
// They follow the C library's current locale on both homes (LC_CTYPE; on Windows also the
// current multibyte code page); the library sets neither.
#pragma once

#include <cctype>
#include <cstddef>
#include <cstdint>
#include <cwctype>

#include <ut/platform/com.h>
#include <ut/platform/native/strings.h>

namespace ut::platform {

// The current locale's lower-case forms of the first `size` character codes, for loops that fold
// runs of text: `folds[c]` is what towlower (wide) or tolower (bytes) gives for c < size. Valid
// until the locale changes: ask again for every comparison, never keep it.
struct FoldTable {
    const std::int32_t* folds = nullptr;
    std::uint32_t size = 0;
};

// The ASCII characters as wide characters, kept per thread and refreshed when the locale changes;
// empty where the home cannot tell cheaply that it changed.
UT_PLATFORM_API FoldTable WideFoldTable();
// All 256 byte values, straight from the C library's own table; empty where it lends none.
inline FoldTable ByteFoldTable() {
    const std::int32_t* folds = native::ByteFoldTable();
    return folds ? FoldTable{folds, 256} : FoldTable{};
}

// The case folding of the comparisons below, for the span of one comparison: the lower-case form
// that the current locale gives (towlower; tolower of the byte taken unsigned). ASCII other than
// the upper-case letters is answered at once; other characters come from the fold table, asked
// once and only when a character needs it, and what the table does not hold from the C library.
class CaseFolder {
public:
    std::uint32_t operator()(wchar_t c) {
        auto code = static_cast<std::uint32_t>(c);
        if (FoldsToItself(code))
            return code;
        FoldTable table = Table(c);
        if (code < table.size)
            return static_cast<std::uint32_t>(table.folds[code]);
        return static_cast<std::uint32_t>(std::towlower(static_cast<std::wint_t>(c)));
    }
    std::uint32_t operator()(char c) {
        auto code = static_cast<std::uint32_t>(static_cast<unsigned char>(c));
        if (FoldsToItself(code))
            return code;
        FoldTable table = Table(c);
        if (code < table.size)
            return static_cast<std::uint32_t>(table.folds[code]);
        return static_cast<std::uint32_t>(std::tolower(static_cast<int>(code)));
    }

    FoldTable Table(wchar_t) {
        if (!asked_) {
            table_ = WideFoldTable();
            asked_ = true;
        }
        return table_;
    }
    FoldTable Table(char) {
        if (!asked_) {
            table_ = ByteFoldTable();
            asked_ = true;
        }
        return table_;
    }

    // Only upper-case letters fold, and no locale takes an ASCII character other than A to Z
    // for one (a to z are always lower case), so the rest of ASCII folds to itself.
    static bool FoldsToItself(std::uint32_t code) { return code < 0x80 && !(code >= 'A' && code <= 'Z'); }

private:

    // One folder folds one kind of text, so one table serves it.
    FoldTable table_;
    bool asked_ = false;
};

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

// _wtol and atol with the 32-bit long of Windows: leading white space and a sign are taken,
// parsing stops at the first non-digit, and values out of range saturate, as strtol does (some
// Windows runtimes' atol wraps instead; these never do).
UT_PLATFORM_API LONG WideToLong(const wchar_t* text);
UT_PLATFORM_API LONG BytesToLong(const char* text);

} // namespace ut::platform
