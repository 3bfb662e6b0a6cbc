// Numeric-aware name comparison: one algorithm over wide, multibyte and single-byte text.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <cwchar>
#include <cwctype>

#include <ut/compare.h>
#include <ut/platform/strings.h>

namespace ut {
namespace {

// Each text model says how long a string is, what a digit is, how text compares without case
// and how long a run of digits is, as its C-runtime counterparts do.
struct WideText {
    using Char = wchar_t;
    static std::size_t Length(const wchar_t* text) { return std::wcslen(text); }
    static bool IsDigit(wchar_t c) {
        // ASCII answers alike in every locale; only the rest needs the library's tables.
        if (c < 0x80)
            return c >= L'0' && c <= L'9';
        return std::iswdigit(static_cast<std::wint_t>(c)) != 0;
    }
    static int Compare(const wchar_t* lhs, const wchar_t* rhs) {
        return platform::CompareWideNoCase(lhs, rhs);
    }
    static int CompareFirst(const wchar_t* lhs, const wchar_t* rhs, std::size_t count) {
        return platform::CompareWideNoCase(lhs, rhs, count);
    }
    static LONG Value(const wchar_t* run) { return platform::WideToLong(run); }
    static std::size_t RunLength(const wchar_t* run, const wchar_t* end) {
        return static_cast<std::size_t>(end - run);
    }
};

struct ByteText {
    using Char = char;
    static std::size_t Length(const char* text) { return std::strlen(text); }
    // The byte is taken sign-extended, so from 0x80 upwards it is never a digit.
    static bool IsDigit(char c) { return c >= '0' && c <= '9'; }
    static int Compare(const char* lhs, const char* rhs) { return platform::CompareBytesNoCase(lhs, rhs); }
    static int CompareFirst(const char* lhs, const char* rhs, std::size_t count) {
        return platform::CompareBytesNoCase(lhs, rhs, count);
    }
    static LONG Value(const char* run) { return platform::BytesToLong(run); }
    static std::size_t RunLength(const char* run, const char* end) {
        return static_cast<std::size_t>(end - run);
    }
};

struct MultibyteText {
    using Char = unsigned char;
    // The character count, which the search for trailing digits then takes as a byte offset.
    static std::size_t Length(const unsigned char* text) { return platform::MultibyteLength(text); }
    static bool IsDigit(unsigned char c) { return platform::IsMultibyteDigit(c); }
    static int Compare(const unsigned char* lhs, const unsigned char* rhs) {
        return platform::CompareMultibyteNoCase(lhs, rhs);
    }
    static int CompareFirst(const unsigned char* lhs, const unsigned char* rhs, std::size_t bytes) {
        return platform::CompareMultibyteNoCase(lhs, rhs, bytes);
    }
    static LONG Value(const unsigned char* run) {
        return platform::BytesToLong(reinterpret_cast<const char*>(run));
    }
    static std::size_t RunLength(const unsigned char* run, const unsigned char*) {
        return platform::MultibyteLength(run);
    }
};

template <class Text>
struct Split {
    const typename Text::Char* start;
    const typename Text::Char* run; // first character of the trailing digits
    const typename Text::Char* end; // where the search for them began

    Split(const typename Text::Char* text) : start(text), run(text + Text::Length(text)), end(run) {
        while (run != start && Text::IsDigit(run[-1]))
            --run;
    }
    bool HasDigits() const { return run != end; }
    std::size_t Prefix() const { return static_cast<std::size_t>(run - start); }
};

template <class Text>
int CompareNumberAware(const typename Text::Char* lhs, const typename Text::Char* rhs) {
    Split<Text> left(lhs);
    Split<Text> right(rhs);
    if (!left.HasDigits() && !right.HasDigits())
        return Text::Compare(lhs, rhs);
    std::size_t leftPrefix = left.Prefix();
    std::size_t rightPrefix = right.Prefix();
    if (int prefixes = Text::CompareFirst(lhs, rhs, std::min(leftPrefix, rightPrefix)))
        return prefixes;
    if (leftPrefix != rightPrefix)
        return leftPrefix < rightPrefix ? -1 : 1;
    LONG leftValue = Text::Value(left.run);
    LONG rightValue = Text::Value(right.run);
    // The difference wraps in 32 bits, as it always has.
    if (leftValue != rightValue)
        return static_cast<int>(static_cast<std::uint32_t>(leftValue) -
                                static_cast<std::uint32_t>(rightValue));
    // More digits (more leading zeros) order first: x007 before x7.
    std::size_t leftDigits = Text::RunLength(left.run, left.end);
    std::size_t rightDigits = Text::RunLength(right.run, right.end);
    return leftDigits == rightDigits ? 0 : (leftDigits > rightDigits ? -1 : 1);
}

} // namespace
} // namespace ut

extern "C" {

int F3Dwcsicmpnum(const wchar_t* lhs, const wchar_t* rhs) {
    return ut::CompareNumberAware<ut::WideText>(lhs, rhs);
}

int F3Dmbsicmpnum(const unsigned char* lhs, const unsigned char* rhs) {
    return ut::CompareNumberAware<ut::MultibyteText>(lhs, rhs);
}

int F3Dstricmpnum(const char* lhs, const char* rhs) {
    return ut::CompareNumberAware<ut::ByteText>(lhs, rhs);
}

} // extern "C"
