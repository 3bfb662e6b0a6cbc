// Numeric-aware name comparison over wide, multibyte and single-byte text.
//
// The comparison, step by step: find each string's trailing run of digits; when neither has one,
// compare the strings case-insensitively; otherwise compare the text before the runs (the
// prefixes) case-insensitively up to the shorter one, then order the shorter prefix first, then
// the runs' values, then the longer run first. The multibyte form takes these steps as they are.
// The wide and narrow forms reach the same answer in another order (see CompareInOneWalk).
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <cwchar>
#include <cwctype>
#include <optional>

#include <ut/compare.h>
#include <ut/platform/strings.h>

namespace ut {
namespace {

// The value of a run of ASCII digits too short to overflow 32 bits, read here because the C
// runtime's conversion costs more than the rest of a comparison; nothing for other runs, which
// the runtime converts as only it knows how (other digits, overflow).
template <class Char>
std::optional<LONG> ShortDecimal(const Char* run, const Char* end) {
    while (run != end && *run == Char('0'))
        ++run;
    if (end - run > 9)
        return std::nullopt;
    LONG value = 0;
    for (; run != end; ++run) {
        if (*run < Char('0') || *run > Char('9'))
            return std::nullopt;
        value = value * 10 + static_cast<LONG>(*run - Char('0'));
    }
    return value;
}

// Each text model says what a digit is and what a run of digits is worth,
// as its C-runtime counterparts do.
struct WideText {
    using Char = wchar_t;
    static bool IsDigit(wchar_t c) {
        // ASCII answers alike in every locale; only the rest needs the library's tables.
        if (static_cast<std::uint32_t>(c) < 0x80)
            return c >= L'0' && c <= L'9';
        return std::iswdigit(static_cast<std::wint_t>(c)) != 0;
    }
    static LONG Value(const wchar_t* run, const wchar_t* end) {
        std::optional<LONG> value = ShortDecimal(run, end);
        return value ? *value : platform::WideToLong(run);
    }
};

struct ByteText {
    using Char = char;
    // The byte is taken sign-extended, so from 0x80 upwards it is never a digit.
    static bool IsDigit(char c) { return c >= '0' && c <= '9'; }
    static LONG Value(const char* run, const char* end) {
        std::optional<LONG> value = ShortDecimal(run, end);
        return value ? *value : platform::BytesToLong(run);
    }
};

// The last steps, once the prefixes are known to compare equal up to the shorter one.
template <class Number>
int CompareAfterPrefixes(std::size_t leftPrefix, std::size_t rightPrefix, Number leftValue, Number rightValue,
                         std::size_t leftDigits, std::size_t rightDigits) {
    if (leftPrefix != rightPrefix)
        return leftPrefix < rightPrefix ? -1 : 1;
    // The difference wraps in 32 bits, as it always has.
    if (leftValue != rightValue)
        return static_cast<int>(static_cast<std::uint32_t>(leftValue) -
                                static_cast<std::uint32_t>(rightValue));
    // More digits (more leading zeros) order first: x007 before x7.
    return leftDigits == rightDigits ? 0 : (leftDigits > rightDigits ? -1 : 1);
}

// The character as a number, never negative.
inline std::uint32_t Code(wchar_t c) {
    return static_cast<std::uint32_t>(c);
}
inline std::uint32_t Code(char c) {
    return static_cast<unsigned char>(c);
}

// Where two strings first fold apart, and the sign of the folded difference there.
struct FoldedDifference {
    std::size_t at;
    int sign;
};

// The first position where the two strings fold apart and the sign of the folded difference
// there; nothing when they end together, equal once folded. Equal characters are passed first;
// where the strings differ in characters that fold to themselves, they are decided without the
// locale. Otherwise the walk goes on folding through the locale's table, so that names that
// differ in case only ("Shot" and "shot") cost little more than equal ones.
template <class Char>
std::optional<FoldedDifference> FoldApart(const Char* lhs, const Char* rhs, platform::CaseFolder& fold) {
    std::size_t i = 0;
    while (lhs[i] == rhs[i] && lhs[i] != 0)
        ++i;
    if (lhs[i] == rhs[i])
        return std::nullopt;
    if (platform::CaseFolder::FoldsToItself(Code(lhs[i])) && platform::CaseFolder::FoldsToItself(Code(rhs[i])))
        return FoldedDifference{i, Code(lhs[i]) < Code(rhs[i]) ? -1 : 1};
    const platform::FoldTable table = fold.Table(Char());
    for (;; ++i) {
        const std::uint32_t left = Code(lhs[i]);
        const std::uint32_t right = Code(rhs[i]);
        std::uint32_t foldedLeft;
        std::uint32_t foldedRight;
        if (left < table.size && right < table.size) {
            foldedLeft = static_cast<std::uint32_t>(table.folds[left]);
            foldedRight = static_cast<std::uint32_t>(table.folds[right]);
        } else {
            foldedLeft = fold(lhs[i]);
            foldedRight = fold(rhs[i]);
        }
        if (foldedLeft != foldedRight)
            return FoldedDifference{i, foldedLeft < foldedRight ? -1 : 1};
        // Only the terminator folds to 0.
        if (left == 0)
            return std::nullopt;
    }
}

// The steps above, taken in the order that settles most names soonest and reads no further into
// them than needed. Up to the first position i where the two strings fold apart nothing needs
// deciding: digits fold only to themselves, so both strings hold the same digits there. Past the
// digits at i (if any), a string either goes on with text, and then its prefix reaches past i, or
// ends, and then its trailing run holds the digits at i and its prefix ends at or before i.
// - Both go on: i lies inside both prefixes, so the characters at i decide, as the prefix (or the
//   plain) comparison would.
// - One goes on: the prefixes agree up to the shorter one, which is the other's: it orders first.
// - Neither: both runs start where the digits before i start, so the prefixes are equal and the
//   runs decide.
template <class Text>
int CompareInOneWalk(const typename Text::Char* lhs, const typename Text::Char* rhs) {
    platform::CaseFolder fold;
    std::optional<FoldedDifference> difference = FoldApart(lhs, rhs, fold);
    if (!difference)
        return 0;
    const std::size_t i = difference->at;
    std::size_t leftEnd = i;
    while (Text::IsDigit(lhs[leftEnd]))
        ++leftEnd;
    std::size_t rightEnd = i;
    while (Text::IsDigit(rhs[rightEnd]))
        ++rightEnd;
    const bool leftGoesOn = lhs[leftEnd] != 0;
    const bool rightGoesOn = rhs[rightEnd] != 0;
    if (leftGoesOn && rightGoesOn)
        return difference->sign;
    if (leftGoesOn != rightGoesOn)
        return leftGoesOn ? 1 : -1;
    std::size_t run = i;
    while (run > 0 && Text::IsDigit(lhs[run - 1]))
        --run;
    return CompareAfterPrefixes(run, run, Text::Value(lhs + run, lhs + leftEnd),
                                Text::Value(rhs + run, rhs + rightEnd), leftEnd - run, rightEnd - run);
}

// The multibyte form keeps its steps as they are, with its own arithmetic: the character count
// is taken as the byte offset where the search for trailing digits begins.
struct MultibyteSplit {
    const unsigned char* run;
    const unsigned char* end;

    explicit MultibyteSplit(const unsigned char* text)
        : run(text + platform::MultibyteLength(text)), end(run) {
        while (run != text && platform::IsMultibyteDigit(run[-1]))
            --run;
    }
};

int CompareMultibyte(const unsigned char* lhs, const unsigned char* rhs) {
    MultibyteSplit left(lhs);
    MultibyteSplit right(rhs);
    if (left.run == left.end && right.run == right.end)
        return platform::CompareMultibyteNoCase(lhs, rhs);
    std::size_t leftPrefix = static_cast<std::size_t>(left.run - lhs);
    std::size_t rightPrefix = static_cast<std::size_t>(right.run - rhs);
    if (int prefixes = platform::CompareMultibyteNoCase(lhs, rhs, std::min(leftPrefix, rightPrefix)))
        return prefixes;
    // The conversion reads on past `end`, to the real end of the text.
    return CompareAfterPrefixes(leftPrefix, rightPrefix,
                                platform::BytesToLong(reinterpret_cast<const char*>(left.run)),
                                platform::BytesToLong(reinterpret_cast<const char*>(right.run)),
                                platform::MultibyteLength(left.run), platform::MultibyteLength(right.run));
}

} // namespace
} // namespace ut

extern "C" {

int F3Dwcsicmpnum(const wchar_t* lhs, const wchar_t* rhs) {
    return ut::CompareInOneWalk<ut::WideText>(lhs, rhs);
}

int F3Dmbsicmpnum(const unsigned char* lhs, const unsigned char* rhs) {
    return ut::CompareMultibyte(lhs, rhs);
}

int F3Dstricmpnum(const char* lhs, const char* rhs) {
    return ut::CompareInOneWalk<ut::ByteText>(lhs, rhs);
}

} // extern "C"
