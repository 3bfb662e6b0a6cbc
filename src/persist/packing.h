// The packed forms of 32-bit integers and doubles on compact streams. The first byte is a tag:
// its high nibble names the form, its low nibble carries the value's lowest four bits (integers)
// or the whole form (doubles). Every Pack function writes at most kMaxPacked bytes.
#pragma once

#include <cmath>
#include <cstring>

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

inline ULONG Put(BYTE* out, BYTE tag, const void* payload, ULONG size) {
    out[0] = tag;
    if (size)
        std::memcpy(out + 1, payload, size);
    return size + 1;
}

// The forms below the whole one: tag | low nibble, then (v >> 4) in 0, 1, 2 or 3 bytes.
inline ULONG PutShifted(BYTE* out, BYTE tag, ULONG bits, ULONG payloadBytes) {
    out[0] = static_cast<BYTE>(tag | (bits & 15));
    ULONG shifted = bits >> 4;
    if (static_cast<LONG>(bits) < 0)
        shifted |= 0xF0000000u; // arithmetic shift for negative values
    std::memcpy(out + 1, &shifted, 4);
    return payloadBytes + 1;
}

} // namespace detail

inline ULONG PackUInt32(ULONG value, BYTE* out) {
    if (value < 0x10)
        return detail::PutShifted(out, kTagNibble, value, 0);
    if (value < 0x1000)
        return detail::PutShifted(out, kTagByte, value, 1);
    if (value < 0x100000)
        return detail::PutShifted(out, kTagWord, value, 2);
    if (value < 0x10000000)
        return detail::PutShifted(out, kTagTriple, value, 3);
    return detail::Put(out, kTagWhole, &value, 4);
}

// The bounds are symmetric on purpose: -8, -2048, -524288 and -8388608 take the next form.
inline ULONG PackInt32(LONG value, BYTE* out) {
    bool negative = value < 0;
    ULONG bits = static_cast<ULONG>(value);
    if (value >= -7 && value <= 7)
        return detail::PutShifted(out, negative ? kTagNegNibble : kTagNibble, bits, 0);
    if (value >= -2047 && value <= 2047)
        return detail::PutShifted(out, negative ? kTagNegByte : kTagByte, bits, 1);
    if (value >= -524287 && value <= 524287)
        return detail::PutShifted(out, negative ? kTagNegWord : kTagWord, bits, 2);
    if (value >= -8388607 && value <= 8388607)
        return detail::PutShifted(out, negative ? kTagNegTriple : kTagTriple, bits, 3);
    return detail::Put(out, negative ? kTagNegWhole : kTagWhole, &value, 4);
}

// -0.0 compares equal to 0.0 and so reads back as +0.0. Large integral values skip the float
// form on purpose.
inline ULONG PackDouble(double value, BYTE* out) {
    if (value == 0.0)
        return detail::Put(out, kDoubleZero, nullptr, 0);
    if (value == 1.0)
        return detail::Put(out, kDoubleOne, nullptr, 0);
    if (value == -1.0)
        return detail::Put(out, kDoubleMinusOne, nullptr, 0);
    if (std::ceil(value) == value) {
        if (value >= -127 && value <= 127) {
            auto small = static_cast<signed char>(value);
            return detail::Put(out, kDoubleInt8, &small, 1);
        }
        if (value >= -32767 && value <= 32767) {
            auto small = static_cast<SHORT>(value);
            return detail::Put(out, kDoubleInt16, &small, 2);
        }
        return detail::Put(out, kDoubleWhole, &value, 8);
    }
    if (value >= -3.4e38 && value <= 3.4e38) {
        auto single = static_cast<float>(value);
        if (static_cast<double>(single) == value)
            return detail::Put(out, kDoubleFloat, &single, 4);
    }
    return detail::Put(out, kDoubleWhole, &value, 8);
}

// The value of a signed form once its payload is known: the fill of the negative forms, the
// payload shifted past the tag's nibble, and the nibble.
inline LONG UnpackInt32(BYTE tag, ULONG payload) {
    ULONG fill = 0;
    switch (tag & 0xF0) {
    case kTagNegNibble:
        fill = 0xFFFFFFF0u;
        break;
    case kTagNegByte:
        fill = 0xFFFFF000u;
        break;
    case kTagNegWord:
        fill = 0xFFF00000u;
        break;
    case kTagNegTriple:
        fill = 0xF0000000u;
        break;
    default:
        break;
    }
    return static_cast<LONG>(fill | (payload << 4) | (tag & 15u));
}

// Payload bytes after the tag of an integer form (whole forms excluded), or -1.
inline int PayloadBytes(BYTE tag) {
    switch (tag & 0xF0) {
    case kTagNibble:
    case kTagNegNibble:
        return 0;
    case kTagByte:
    case kTagNegByte:
        return 1;
    case kTagWord:
    case kTagNegWord:
        return 2;
    case kTagTriple:
    case kTagNegTriple:
        return 3;
    default:
        return -1;
    }
}

} // namespace ut::persist
