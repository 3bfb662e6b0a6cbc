// UTF-8 and UTF-16LE conversion of wide text.
#include <algorithm>
#include <utility>

#include <gtest/gtest.h>

#include <ut/platform/text.h>

namespace {

using ut::platform::AppendUtf16Le;
using ut::platform::Utf16Length;
using ut::platform::Utf8FromWide;
using ut::platform::WideFromUtf16Le;
using ut::platform::WideFromUtf8;

TEST(Text, Utf8RoundTripsEveryPlane) {
    const std::string samples[] = {"", "plain", "caf\xC3\xA9", "\xE2\x82\xAC 5", "\xF0\x9F\x8E\xAC clip"};
    for (const std::string& utf8 : samples)
        EXPECT_EQ(Utf8FromWide(WideFromUtf8(utf8)), utf8);
}

TEST(Text, BrokenUtf8BecomesReplacementCharacters) {
    // The input, and how many replacement characters it becomes.
    const std::pair<std::string, std::size_t> cases[] = {
        {"\xC3", 1},         // truncated sequence
        {"\x80", 1},         // stray continuation byte
        {"\xC0\xAF", 2},     // overlong encoding
        {"\xED\xA0\x80", 3}, // encoded surrogate
        {"a\xFF\x62", 1},    // byte that never starts a sequence
    };
    for (const auto& [input, replacements] : cases) {
        std::wstring wide = WideFromUtf8(input);
        EXPECT_EQ(static_cast<std::size_t>(std::count(wide.begin(), wide.end(), L'\xFFFD')), replacements)
            << "input of " << input.size() << " bytes";
    }
}

TEST(Text, Utf16LeBytesAreTheSameOnBothHomes) {
    std::wstring text = WideFromUtf8("A\xC3\xA9\xF0\x9F\x8E\xAC");
    std::string bytes;
    AppendUtf16Le(text, bytes);
    EXPECT_EQ(bytes, std::string("A\0\xE9\0\x3C\xD8\xAC\xDF", 8));
    EXPECT_EQ(Utf16Length(text), 4u);
    EXPECT_EQ(WideFromUtf16Le(reinterpret_cast<const std::uint8_t*>(bytes.data()), 4), text);
}

} // namespace
