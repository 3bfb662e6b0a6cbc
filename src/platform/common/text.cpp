// Text conversions shared by both homes. wchar_t is UTF-32 on POSIX and UTF-16 on Windows; the
// code below asks which at compile time instead of asking which home it is on.
#include <bit>
#include <cstring>

#include <ut/platform/text.h>

namespace ut::platform {
namespace {

constexpr char32_t kReplacement = 0xFFFD;
constexpr bool kWideIsUtf16 = sizeof(wchar_t) == 2;

bool IsHighSurrogate(char32_t c) {
    return c >= 0xD800 && c <= 0xDBFF;
}
bool IsLowSurrogate(char32_t c) {
    return c >= 0xDC00 && c <= 0xDFFF;
}
bool IsSurrogate(char32_t c) {
    return c >= 0xD800 && c <= 0xDFFF;
}
// Takes char32_t so that the test also compiles where wchar_t cannot hold such a value.
bool NeedsSurrogatePair(char32_t c) {
    return c > 0xFFFF && c <= 0x10FFFF;
}

void AppendWide(char32_t code, std::wstring& out) {
    if (kWideIsUtf16 && code > 0xFFFF) {
        code -= 0x10000;
        out.push_back(static_cast<wchar_t>(0xD800 + (code >> 10)));
        out.push_back(static_cast<wchar_t>(0xDC00 + (code & 0x3FF)));
        return;
    }
    out.push_back(static_cast<wchar_t>(code));
}

// Calls visit(code point) for each character of wide text, pairing surrogates where wchar_t is
// UTF-16 and replacing unpaired ones.
template <class Visit>
void ForEachCodePoint(std::wstring_view text, Visit visit) {
    for (std::size_t i = 0; i < text.size(); ++i) {
        char32_t c = static_cast<char32_t>(text[i]);
        if (kWideIsUtf16 && IsHighSurrogate(c) && i + 1 < text.size() &&
            IsLowSurrogate(static_cast<char32_t>(text[i + 1]))) {
            c = 0x10000 + ((c - 0xD800) << 10) + (static_cast<char32_t>(text[i + 1]) - 0xDC00);
            ++i;
        } else if (IsSurrogate(c) || c > 0x10FFFF) {
            c = kReplacement;
        }
        visit(c);
    }
}

} // namespace

std::wstring WideFromUtf8(std::string_view text) {
    std::wstring out;
    out.reserve(text.size());
    std::size_t i = 0;
    while (i < text.size()) {
        unsigned char lead = static_cast<unsigned char>(text[i]);
        int extra = lead < 0x80           ? 0
                    : (lead >> 5) == 0x6  ? 1
                    : (lead >> 4) == 0xE  ? 2
                    : (lead >> 3) == 0x1E ? 3
                                          : -1;
        if (extra < 0 || i + static_cast<std::size_t>(extra) >= text.size()) {
            out.push_back(static_cast<wchar_t>(kReplacement));
            ++i;
            continue;
        }
        char32_t code = extra == 0 ? lead : lead & (0x3F >> extra);
        bool valid = true;
        for (int k = 1; k <= extra; ++k) {
            unsigned char next = static_cast<unsigned char>(text[i + static_cast<std::size_t>(k)]);
            if ((next & 0xC0) != 0x80) {
                valid = false;
                break;
            }
            code = (code << 6) | (next & 0x3F);
        }
        static constexpr char32_t kSmallest[] = {0, 0x80, 0x800, 0x10000};
        if (!valid || code < kSmallest[extra] || code > 0x10FFFF || IsSurrogate(code)) {
            out.push_back(static_cast<wchar_t>(kReplacement));
            ++i;
            continue;
        }
        AppendWide(code, out);
        i += static_cast<std::size_t>(extra) + 1;
    }
    return out;
}

std::string Utf8FromWide(std::wstring_view text) {
    std::string out;
    out.reserve(text.size());
    ForEachCodePoint(text, [&](char32_t c) {
        if (c < 0x80) {
            out.push_back(static_cast<char>(c));
        } else if (c < 0x800) {
            out.push_back(static_cast<char>(0xC0 | (c >> 6)));
            out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
        } else if (c < 0x10000) {
            out.push_back(static_cast<char>(0xE0 | (c >> 12)));
            out.push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
            out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
        } else {
            out.push_back(static_cast<char>(0xF0 | (c >> 18)));
            out.push_back(static_cast<char>(0x80 | ((c >> 12) & 0x3F)));
            out.push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
            out.push_back(static_cast<char>(0x80 | (c & 0x3F)));
        }
    });
    return out;
}

std::size_t Utf16Length(std::wstring_view text) {
    if constexpr (kWideIsUtf16)
        return text.size();
    std::size_t units = 0;
    for (wchar_t c : text)
        units += NeedsSurrogatePair(static_cast<char32_t>(c)) ? 2 : 1;
    return units;
}

void AppendUtf16Le(std::wstring_view text, std::string& out) {
    std::size_t start = out.size();
    out.resize(start + 2 * Utf16Length(text));
    WriteUtf16Le(text, reinterpret_cast<std::uint8_t*>(out.data() + start));
}

std::size_t WriteUtf16Le(std::wstring_view text, std::uint8_t* out) {
    std::uint8_t* next = out;
    auto put = [&next](char32_t unit) {
        next[0] = static_cast<std::uint8_t>(unit & 0xFF);
        next[1] = static_cast<std::uint8_t>((unit >> 8) & 0xFF);
        next += 2;
    };
    for (wchar_t wide : text) {
        char32_t c = static_cast<char32_t>(wide);
        if (kWideIsUtf16 || c <= 0xFFFF) {
            put(c);
        } else if (c > 0x10FFFF) {
            put(kReplacement);
        } else {
            c -= 0x10000;
            put(0xD800 + (c >> 10));
            put(0xDC00 + (c & 0x3FF));
        }
    }
    return static_cast<std::size_t>(next - out) / 2;
}

std::wstring WideFromUtf16Le(const std::uint8_t* bytes, std::size_t units) {
    std::wstring out(units, L'\0');
    out.resize(DecodeUtf16Le(bytes, units, out.data()));
    return out;
}

std::size_t DecodeUtf16Le(const std::uint8_t* bytes, std::size_t units, wchar_t* out) {
    auto unit = [bytes](std::size_t i) {
        if constexpr (std::endian::native == std::endian::little) {
            std::uint16_t value = 0;
            std::memcpy(&value, bytes + 2 * i, 2);
            return static_cast<char32_t>(value);
        }
        return static_cast<char32_t>(bytes[2 * i] | (static_cast<unsigned>(bytes[2 * i + 1]) << 8));
    };
    // Text without surrogates, nearly all of it, is widened in one pass the compiler can
    // vectorise; the pairing below redoes the rest.
    unsigned surrogates = 0;
    for (std::size_t i = 0; i < units; ++i) {
        const char32_t c = unit(i);
        out[i] = static_cast<wchar_t>(c);
        surrogates |= static_cast<unsigned>(c - 0xD800u < 0x800u);
    }
    if (kWideIsUtf16 || surrogates == 0)
        return units;
    wchar_t* next = out;
    for (std::size_t i = 0; i < units; ++i) {
        char32_t c = unit(i);
        if (kWideIsUtf16 || !IsSurrogate(c)) {
            *next++ = static_cast<wchar_t>(c);
        } else if (IsHighSurrogate(c) && i + 1 < units && IsLowSurrogate(unit(i + 1))) {
            *next++ = static_cast<wchar_t>(0x10000 + ((c - 0xD800) << 10) + (unit(i + 1) - 0xDC00));
            ++i;
        } else {
            *next++ = static_cast<wchar_t>(kReplacement);
        }
    }
    return static_cast<std::size_t>(next - out);
}

} // namespace ut::platform
