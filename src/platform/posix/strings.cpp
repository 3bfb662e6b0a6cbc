// POSIX home: the C runtime's case-insensitive comparisons, multibyte helpers and 32-bit number
// conversions, written over the C library's locale-aware character functions.
#include <algorithm>
#include <cctype>
#include <climits>
#include <cstdint>
#include <cstdlib>
#include <cwchar>
#include <cwctype>
#include <langinfo.h>
#include <strings.h>

#include <ut/platform/strings.h>

namespace ut::platform {
namespace {

LONG SaturateToLong(long long value) {
    if (value > INT32_MAX)
        return INT32_MAX;
    if (value < INT32_MIN)
        return INT32_MIN;
    return static_cast<LONG>(value);
}

// One character of multibyte text: its wide value (or the byte's own, for a byte that starts no
// valid character) and its length in bytes.
struct Unit {
    wchar_t value;
    bool decoded;
    std::size_t bytes;
};

// The character at `text` (not the terminator), decoded from at most `limit` bytes.
Unit ReadUnit(const unsigned char* text, std::size_t limit) {
    if (text[0] < 0x80)
        return {static_cast<wchar_t>(text[0]), true, 1};
    // Never let the decoder look past the terminator or the limit.
    std::size_t most = std::min<std::size_t>(limit, MB_CUR_MAX);
    std::size_t available = 1;
    while (available < most && text[available] != 0)
        ++available;
    std::mbstate_t state{};
    wchar_t wide = 0;
    std::size_t used = std::mbrtowc(&wide, reinterpret_cast<const char*>(text), available, &state);
    // 0 cannot happen (no terminator here); -1 and -2 are invalid and cut-short characters.
    if (used == 0 || used > available)
        return {static_cast<wchar_t>(text[0]), false, 1};
    return {wide, true, used};
}

bool AtEnd(const unsigned char* text, std::size_t offset, std::size_t limit) {
    return offset >= limit || text[offset] == 0;
}

} // namespace

FoldTable WideFoldTable() {
#ifdef __GLIBC__
    // towlower follows the LC_CTYPE of the thread, or the global one, which any thread may change;
    // its codeset name lies in that locale's data, which glibc keeps loaded, so the name's address
    // tells whether the folds still hold.
    struct Cache {
        const char* codeset = nullptr;
        std::int32_t folds[128];
    };
    thread_local Cache cache;
    const char* codeset = ::nl_langinfo(CODESET);
    if (cache.codeset != codeset) {
        for (std::uint32_t c = 0; c < 128; ++c)
            cache.folds[c] = static_cast<std::int32_t>(std::towlower(static_cast<std::wint_t>(c)));
        cache.codeset = codeset;
    }
    return {cache.folds, 128};
#else
    return {};
#endif
}

int CompareWideNoCase(const wchar_t* lhs, const wchar_t* rhs) {
    return CompareWideNoCase(lhs, rhs, SIZE_MAX);
}

int CompareWideNoCase(const wchar_t* lhs, const wchar_t* rhs, std::size_t count) {
    CaseFolder fold;
    for (; count; --count, ++lhs, ++rhs) {
        wchar_t a = *lhs;
        wchar_t b = *rhs;
        // Equal characters fold alike whatever the locale: only differing ones are folded.
        if (a != b) {
            std::uint32_t foldedA = fold(a);
            std::uint32_t foldedB = fold(b);
            if (foldedA != foldedB)
                return foldedA < foldedB ? -1 : 1;
        }
        // Here a folds like b, and only the terminator folds to 0.
        if (a == 0)
            return 0;
    }
    return 0;
}

int CompareBytesNoCase(const char* lhs, const char* rhs) {
    return ::strcasecmp(lhs, rhs);
}

int CompareBytesNoCase(const char* lhs, const char* rhs, std::size_t count) {
    return ::strncasecmp(lhs, rhs, count);
}

int CompareMultibyteNoCase(const unsigned char* lhs, const unsigned char* rhs) {
    return CompareMultibyteNoCase(lhs, rhs, SIZE_MAX);
}

int CompareMultibyteNoCase(const unsigned char* lhs, const unsigned char* rhs, std::size_t bytes) {
    CaseFolder fold;
    auto folded = [&fold](const Unit& unit) {
        return unit.decoded ? fold(unit.value) : static_cast<std::uint32_t>(unit.value);
    };
    std::size_t left = 0;
    std::size_t right = 0;
    for (;;) {
        bool leftEnds = AtEnd(lhs, left, bytes);
        bool rightEnds = AtEnd(rhs, right, bytes);
        if (leftEnds || rightEnds)
            return leftEnds == rightEnds ? 0 : (leftEnds ? -1 : 1);
        Unit a = ReadUnit(lhs + left, bytes - left);
        Unit b = ReadUnit(rhs + right, bytes - right);
        std::uint32_t foldedA = folded(a);
        std::uint32_t foldedB = folded(b);
        if (foldedA != foldedB)
            return foldedA < foldedB ? -1 : 1;
        left += a.bytes;
        right += b.bytes;
    }
}

std::size_t MultibyteLength(const unsigned char* text) {
    std::size_t characters = 0;
    for (std::size_t offset = 0; text[offset] != 0; ++characters)
        offset += ReadUnit(text + offset, SIZE_MAX).bytes;
    return characters;
}

bool IsMultibyteDigit(unsigned int character) {
    if (character < 0x80)
        return character >= '0' && character <= '9';
    char bytes[2] = {static_cast<char>(character >> 8), static_cast<char>(character & 0xFF)};
    const char* start = character < 0x100 ? bytes + 1 : bytes;
    std::size_t length = character < 0x100 ? 1 : 2;
    if (character > 0xFFFF || start[0] == 0)
        return false;
    std::mbstate_t state{};
    wchar_t wide = 0;
    return std::mbrtowc(&wide, start, length, &state) == length &&
           std::iswdigit(static_cast<std::wint_t>(wide));
}

LONG WideToLong(const wchar_t* text) {
    return SaturateToLong(std::wcstoll(text, nullptr, 10));
}

LONG BytesToLong(const char* text) {
    return SaturateToLong(std::strtoll(text, nullptr, 10));
}

} // namespace ut::platform
