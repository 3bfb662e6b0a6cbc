// Compares arbitrary strings with the three numeric-aware comparisons. Each must be antisymmetric
// and answer zero for a string against itself; the wide and narrow forms must be transitive; on
// ASCII text all three must agree, and in the "C" locale (where every byte is one character) the
// narrow and multibyte forms agree on any bytes.
//
// Input: one flag byte (bit 0: a UTF-8 locale instead of "C"; bit 1: wide text decoded from
// UTF-8 instead of widened byte by byte), then up to three strings separated by NUL bytes.
#include <climits>
#include <clocale>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include <ut/compare.h>
#include <ut/platform/text.h>

namespace {

int Sign(int value) {
    return (value > 0) - (value < 0);
}

void UseLocale(bool utf8) {
    static int current = -1;
    if (current == static_cast<int>(utf8))
        return;
    current = utf8;
    if (!utf8 || !std::setlocale(LC_ALL, "C.UTF-8"))
        std::setlocale(LC_ALL, "C");
}

// The multibyte form may wrap its value difference to INT_MIN, which is negative both ways round;
// that is its documented arithmetic, not a fault.
template <class Compare, class Text>
void CheckPair(Compare compare, const Text& a, const Text& b, bool wraps) {
    int forward = compare(a, b);
    int backward = compare(b, a);
    if (wraps && (forward == INT_MIN || backward == INT_MIN))
        return;
    if (Sign(forward) != -Sign(backward))
        std::abort();
}

template <class Compare, class Text>
void Check(Compare compare, const std::vector<Text>& texts, bool transitive, bool wraps) {
    for (const Text& a : texts) {
        if (compare(a, a) != 0)
            std::abort();
        for (const Text& b : texts)
            CheckPair(compare, a, b, wraps);
    }
    if (!transitive)
        return;
    for (const Text& a : texts)
        for (const Text& b : texts)
            for (const Text& c : texts)
                if (compare(a, b) <= 0 && compare(b, c) <= 0 && compare(a, c) > 0)
                    std::abort();
}

bool IsAscii(const std::string& text) {
    for (char c : text)
        if (static_cast<unsigned char>(c) >= 0x80)
            return false;
    return true;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size < 1)
        return 0;
    const std::uint8_t flags = data[0];
    UseLocale(flags & 1);
    std::vector<std::string> narrow(1);
    for (std::size_t i = 1; i < size; ++i) {
        if (data[i] != 0)
            narrow.back().push_back(static_cast<char>(data[i]));
        else if (narrow.size() < 3)
            narrow.emplace_back();
        else
            break;
    }
    std::vector<std::wstring> wide;
    for (const std::string& text : narrow)
        wide.push_back((flags & 2)
                           ? ut::platform::WideFromUtf8(text)
                           : std::wstring(reinterpret_cast<const unsigned char*>(text.data()),
                                          reinterpret_cast<const unsigned char*>(text.data()) + text.size()));

    auto narrowCompare = [](const std::string& a, const std::string& b) {
        return F3Dstricmpnum(a.c_str(), b.c_str());
    };
    auto multibyteCompare = [](const std::string& a, const std::string& b) {
        return F3Dmbsicmpnum(reinterpret_cast<const unsigned char*>(a.c_str()),
                             reinterpret_cast<const unsigned char*>(b.c_str()));
    };
    auto wideCompare = [](const std::wstring& a, const std::wstring& b) {
        return F3Dwcsicmpnum(a.c_str(), b.c_str());
    };
    Check(narrowCompare, narrow, true, false);
    Check(multibyteCompare, narrow, false, true);
    Check(wideCompare, wide, true, false);

    const bool singleBytes = !(flags & 1);
    for (std::size_t i = 0; i < narrow.size(); ++i)
        for (std::size_t j = 0; j < narrow.size(); ++j) {
            const bool ascii = IsAscii(narrow[i]) && IsAscii(narrow[j]);
            int expected = Sign(narrowCompare(narrow[i], narrow[j]));
            if ((ascii || singleBytes) && Sign(multibyteCompare(narrow[i], narrow[j])) != expected)
                std::abort();
            if (ascii && Sign(wideCompare(wide[i], wide[j])) != expected)
                std::abort();
        }
    return 0;
}
