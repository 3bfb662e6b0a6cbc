// The packed forms of 32-bit integers and doubles on compact streams. The first byte is a tag:
// its high nibble names the form, its low nibble carries the value's lowest four bits (integers)
// or the whole form (doubles). Every Pack function writes at most kMaxPacked bytes.
#pragma once

#include <bit>
#include <cmath>
#include <cstdint>
#include <cstring>
#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include <ut/platform/com.h>

namespace ut::persist {

inline constexpr ULONG kMaxPacked = 9;

// Tags of the integer forms (high nibble).
inline constexpr BYTE kTagNibble = 0xF0; // value in the tag
inline constexpr BYTE kTagByte = 0xE0;   // one more byte
inline constexpr BYTE kTagWord = 0xD0;   // two more bytes
inline constexpr BYTE kTagTriple = 0xC0; // three more bytes
inline constexpr BYTE kTagWhole = 0xB0;  // the whole value follows
// Negative forms of the signed integers, in the same order.
inline constexpr BYTE kTagNegNibble = 0xA0;
inline constexpr BYTE kTagNegByte = 0x90;
inline constexpr BYTE kTagNegWord = 0x80;
inline constexpr BYTE kTagNegTriple = 0x70;
inline constexpr BYTE kTagNegWhole = 0x60;

// Tags of the double forms (whole byte).
inline constexpr BYTE kDoubleInt8 = 0xF8;
inline constexpr BYTE kDoubleInt16 = 0xF9;
inline constexpr BYTE kDoubleFloat = 0xFB;
inline constexpr BYTE kDoubleWhole = 0xFC;
inline constexpr BYTE kDoubleMinusOne = 0xFD;
inline constexpr BYTE kDoubleOne = 0xFE;
inline constexpr BYTE kDoubleZero = 0xFF;

namespace detail {

// The integer forms by the number of bits a magnitude needs: the form's place in the tag order
// (0: the nibble form ... 4: the whole form). Unsigned values keep 4 bits in the tag and 8, 16
// or 24 after it; signed ones stop one bit short of each, hence their symmetric bounds.
inline constexpr BYTE kUnsignedForm[33] = {0, 0, 0, 0, 0, 1, 1, 1, 1, 1, 1, 1, 1, 2, 2, 2, 2,
                                           2, 2, 2, 2, 3, 3, 3, 3, 3, 3, 3, 3, 4, 4, 4, 4};
inline constexpr BYTE kSignedForm[33] = {0, 0, 0, 0, 1, 1, 1, 1, 1, 1, 1, 1, 2, 2, 2, 2, 2,
                                         2, 2, 2, 3, 3, 3, 3, 4, 4, 4, 4, 4, 4, 4, 4, 4};
inline constexpr BYTE kPositiveTags[5] = {kTagNibble, kTagByte, kTagWord, kTagTriple, kTagWhole};
inline constexpr BYTE kNegativeTags[5] = {kTagNegNibble, kTagNegByte, kTagNegWord, kTagNegTriple,
                                          kTagNegWhole};
inline constexpr BYTE kPayloadOfForm[5] = {0, 1, 2, 3, 4};

// Writes the tag and the payload of `form` for the 32 bits of a value; `shifted` is the value
// shifted right by 4 (arithmetically for signed values). Always stores 5 bytes.
inline ULONG PutForm(BYTE* out, BYTE tag, unsigned form, ULONG bits, ULONG shifted) {
    bool whole = form == 4;
    out[0] = static_cast<BYTE>(whole ? tag : tag | (bits & 15));
    ULONG payload = whole ? bits : shifted;
    std::memcpy(out + 1, &payload, 4);
    return kPayloadOfForm[form] + 1u;
}

} // namespace detail

// The form is looked up from the value's bit width rather than found by comparisons, so that a
// mix of magnitudes costs no mispredicted branches.
inline ULONG PackUInt32(ULONG value, BYTE* out) {
    unsigned form = detail::kUnsignedForm[std::bit_width(value)];
    return detail::PutForm(out, detail::kPositiveTags[form], form, value, value >> 4);
}

// The bounds are symmetric on purpose: -8, -2048, -524288 and -8388608 take the next form.
inline ULONG PackInt32(LONG value, BYTE* out) {
    bool negative = value < 0;
    auto bits = static_cast<ULONG>(value);
    ULONG magnitude = negative ? 0u - bits : bits;
    unsigned form = detail::kSignedForm[std::bit_width(magnitude)];
    auto shifted = static_cast<ULONG>(value >> 4); // arithmetic: negative forms keep their sign
    return detail::PutForm(out, negative ? detail::kNegativeTags[form] : detail::kPositiveTags[form], form,
                           bits, shifted);
}

namespace detail {

// What follows the tag of a double form.
enum DoublePayload : BYTE { kPayloadInteger, kPayloadSingle, kPayloadDouble };

struct DoubleForm {
    BYTE tag;
    BYTE length;
    DoublePayload payload;
};

// The integer forms of an integral value, by how far it fits: 0 wider than 16 bits, 1 in 16,
// 2 in 8, and 3, 4, 5 for -1, 0 and 1.
inline constexpr DoubleForm kIntegralForms[6] = {
    {kDoubleWhole, 9, kPayloadDouble}, {kDoubleInt16, 3, kPayloadInteger},
    {kDoubleInt8, 2, kPayloadInteger}, {kDoubleMinusOne, 1, kPayloadDouble},
    {kDoubleZero, 1, kPayloadDouble},  {kDoubleOne, 1, kPayloadDouble}};

// The forms PackDouble chooses between, by its key: the integer fit above times 4, plus 2 when
// the value is float-exact below 2^31, plus 1 when it is integral. A value that is not integral
// is written as a float or whole, whatever its truncation would fit.
inline constexpr auto kDoubleForms = [] {
    struct Table {
        DoubleForm forms[24];
    } table{};
    for (unsigned key = 0; key < 24; ++key)
        table.forms[key] = key & 1u   ? kIntegralForms[key >> 2]
                           : key & 2u ? DoubleForm{kDoubleFloat, 5, kPayloadSingle}
                                      : DoubleForm{kDoubleWhole, 9, kPayloadDouble};
    return table;
}();

// The value truncated toward zero when it fits 32 bits; anything else (NaN included) gives
// INT32_MIN, as the processor's own conversion answers.
inline LONG TruncatedInt32(double value) {
#if defined(__SSE2__)
    return _mm_cvttsd_si32(_mm_set_sd(value));
#else
    return value > -2147483649.0 && value < 2147483648.0 ? static_cast<LONG>(value) : INT32_MIN;
#endif
}

// Bit 0: `whole` gives the value back. Bit 1: the value rounded to single precision (`single`)
// gives it back; huge values round to an infinity, never a trap. Both comparisons are made at
// once, and NaN fails both.
inline unsigned RoundTrips(double value, LONG whole, float& single) {
#if defined(__SSE2__)
    const __m128d x = _mm_set_sd(value);
    const __m128 rounded = _mm_cvtsd_ss(_mm_setzero_ps(), x);
    single = _mm_cvtss_f32(rounded);
    const __m128d back = _mm_unpacklo_pd(_mm_cvtsi32_sd(x, whole), _mm_cvtss_sd(x, rounded));
    return static_cast<unsigned>(_mm_movemask_pd(_mm_cmpeq_pd(back, _mm_unpacklo_pd(x, x))));
#else
    single = std::fabs(value) <= 3.4e38 ? static_cast<float>(value) : 0.0f;
    return unsigned{static_cast<double>(whole) == value} | unsigned{static_cast<double>(single) == value}
                                                               << 1;
#endif
}

} // namespace detail

// The rules, in order: 0 (and -0.0, which so reads back as +0.0), 1 and -1; integral values of
// 8 and 16 bits; other integral values whole (on purpose, even when a float would hold them);
// float-exact values; the rest whole. One 32-bit truncation answers every integral question:
// outside 32 bits a non-integral value cannot be float-exact and an integral one is written
// whole, so the float form is only open below 2^31. The tests are added up into a key of one
// table of forms rather than chained as conditions, which the compiler would turn into branches
// that a mix of values mispredicts.
inline ULONG PackDouble(double value, BYTE* out) {
    const LONG whole = detail::TruncatedInt32(value);
    float single = 0;
    const unsigned trips = detail::RoundTrips(value, whole, single);
    const auto bits = static_cast<ULONG>(whole);

    const unsigned special = bits + 1u <= 2u; // -1, 0 or 1
    const unsigned fit = (bits + 127u <= 254u) + (bits + 32767u <= 65534u) + ((bits + 2u) & (0u - special));
    const unsigned floatBelow31 = trips & (whole == INT32_MIN ? 1u : 3u);
    const detail::DoubleForm form = detail::kDoubleForms.forms[fit * 4u + floatBelow31];

    const ULONGLONG payloads[3] = {bits, std::bit_cast<ULONG>(single), std::bit_cast<ULONGLONG>(value)};
    out[0] = form.tag;
    std::memcpy(out + 1, &payloads[form.payload], 8);
    return form.length;
}

// Room a decoder wants in front of it to decode any form from memory.
inline constexpr ULONG kDecodeWindow = 9;

namespace detail {

// An integer form, by the tag's high nibble.
struct IntegerForm {
    BYTE length; // bytes after the tag
    bool whole;  // the value follows the tag as it is
    ULONG mask;  // the payload's share of the four bytes after the tag
    ULONG fill;  // the high bits of a negative form
};

inline constexpr IntegerForm kIntegerForms[16] = {
    {},
    {},
    {},
    {},
    {},
    {},
    {4, true, 0, 0},                   // 0x60
    {3, false, 0xFFFFFF, 0xF0000000u}, // 0x70
    {2, false, 0xFFFF, 0xFFF00000u},   // 0x80
    {1, false, 0xFF, 0xFFFFF000u},     // 0x90
    {0, false, 0, 0xFFFFFFF0u},        // 0xA0
    {4, true, 0, 0},                   // 0xB0
    {3, false, 0xFFFFFF, 0},           // 0xC0
    {2, false, 0xFFFF, 0},             // 0xD0
    {1, false, 0xFF, 0},               // 0xE0
    {0, false, 0, 0},                  // 0xF0
};

// The bytes of each form with its tag, four bits per high nibble of the tag: the same lengths
// as the table above, but found by a shift rather than a load. A decoder's position moves by
// this length before the next value can be read, so its latency is paid on every value.
inline constexpr ULONGLONG kIntegerLengths = [] {
    ULONGLONG lengths = 0;
    for (unsigned nibble = 0; nibble < 16; ++nibble)
        lengths |= ULONGLONG{kIntegerForms[nibble].length + 1u} << (4 * nibble);
    return lengths;
}();

} // namespace detail

// Decodes the integer form at `bytes` (kDecodeWindow readable bytes; the tag already known to
// be valid) without branching on the form, and returns the bytes it takes.
inline ULONG UnpackInteger(const BYTE* bytes, ULONG& value) {
    const BYTE tag = bytes[0];
    const detail::IntegerForm& form = detail::kIntegerForms[tag >> 4];
    ULONG word = 0;
    std::memcpy(&word, bytes + 1, 4);
    ULONG packed = form.fill | ((word & form.mask) << 4) | (tag & 15u);
    value = form.whole ? word : packed;
    return static_cast<ULONG>(detail::kIntegerLengths >> ((tag >> 2) & 0x3Cu)) & 15u;
}

// Payload bytes after the tag of an integer form, from the tag.
inline ULONG PayloadBytes(BYTE tag) {
    return detail::kIntegerForms[tag >> 4].length;
}

namespace detail {

// How to decode each double form, by the tag's distance from kDoubleInt8. The value's bits are
// the OR of every candidate's bits under its mask, so exactly one candidate survives.
struct DoubleDecode {
    ULONGLONG integerMask; // the payload as an integer of `64 - shift` bits
    ULONGLONG wholeMask;   // the payload as the double itself
    ULONGLONG constant;    // -1.0, 1.0 or 0.0, which carry no payload
    ULONG singleMask;      // the payload as a float
    BYTE shift;
    BYTE length; // bytes of the form with its tag; 0 for 0xFA, which is no form
};

inline constexpr ULONGLONG kAll = ~0ull;
inline constexpr DoubleDecode kDoubleDecodes[8] = {
    {kAll, 0, 0, 0, 56, 2},                          // 0xF8: Int8
    {kAll, 0, 0, 0, 48, 3},                          // 0xF9: Int16
    {0, 0, 0, 0, 0, 0},                              // 0xFA
    {0, 0, 0, ~0u, 0, 5},                            // 0xFB: float
    {0, kAll, 0, 0, 0, 9},                           // 0xFC: double
    {0, 0, std::bit_cast<ULONGLONG>(-1.0), 0, 0, 1}, // 0xFD
    {0, 0, std::bit_cast<ULONGLONG>(1.0), 0, 0, 1},  // 0xFE
    {0, 0, 0, 0, 0, 1},                              // 0xFF
};

// The bytes of each form with its tag, four bits per form in the order of kDoubleDecodes (see
// kIntegerLengths for why).
inline constexpr ULONG kDoubleLengths = [] {
    ULONG lengths = 0;
    for (unsigned form = 0; form < 8; ++form)
        lengths |= ULONG{kDoubleDecodes[form].length} << (4 * form);
    return lengths;
}();

} // namespace detail

// Decodes the double form at `bytes` (kDecodeWindow readable bytes) and returns the bytes it
// takes, or 0 for a tag no form has. Every candidate is computed in registers and masked, so
// that a mix of forms costs neither mispredicted branches nor a table of candidates in memory
// (whose stores the load of the chosen one would wait for). The float candidate is converted
// only from the payload's bits under its mask, so other forms never convert a subnormal.
inline ULONG UnpackDouble(const BYTE* bytes, double& value) {
    const BYTE tag = bytes[0];
    if (tag < kDoubleInt8)
        return 0;
    const detail::DoubleDecode& form = detail::kDoubleDecodes[tag - kDoubleInt8];
    if (form.length == 0)
        return 0;
    ULONGLONG payload = 0;
    std::memcpy(&payload, bytes + 1, 8);
    const auto integer = static_cast<LONGLONG>(payload << form.shift) >> form.shift;
    const float single = std::bit_cast<float>(static_cast<ULONG>(payload) & form.singleMask);
    const ULONGLONG bits = (std::bit_cast<ULONGLONG>(static_cast<double>(integer)) & form.integerMask) |
                           std::bit_cast<ULONGLONG>(static_cast<double>(single)) |
                           (payload & form.wholeMask) | form.constant;
    value = std::bit_cast<double>(bits);
    return (detail::kDoubleLengths >> ((tag & 7u) * 4)) & 15u;
}

} // namespace ut::persist
