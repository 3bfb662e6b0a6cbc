#include <climits>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include <ut/platform/strings.h>

namespace {

using namespace ut::platform;

int Sign(int value) {
    return (value > 0) - (value < 0);
}

const unsigned char* Bytes(const char* text) {
    return reinterpret_cast<const unsigned char*>(text);
}

// The same answers from the C runtime on Windows and from our own on POSIX, in the "C" locale.
TEST(PlatformStrings, CaseInsensitiveComparisonsAgreeInEveryForm) {
    struct Case {
        const char* lhs;
        const char* rhs;
        std::size_t count;
        int sign;      // of the whole strings
        int signFirst; // of the first `count` characters
    };
    const Case cases[] = {
        {"Shot", "shot", 4, 0, 0}, {"abc", "abd", 2, -1, 0},    {"ab", "abc", 2, -1, 0},
        {"a_", "aa", 1, -1, 0},    {"B", "a", 1, 1, 1},         {"", "", 0, 0, 0},
        {"x10", "X9", 3, -1, -1},  {"ZEBRA", "apple", 0, 1, 0}, {"same", "same", 10, 0, 0},
    };
    for (const Case& c : cases) {
        std::wstring lhs(c.lhs, c.lhs + std::char_traits<char>::length(c.lhs));
        std::wstring rhs(c.rhs, c.rhs + std::char_traits<char>::length(c.rhs));
        SCOPED_TRACE(testing::Message() << c.lhs << " vs " << c.rhs << " (" << c.count << ")");
        EXPECT_EQ(Sign(CompareWideNoCase(lhs.c_str(), rhs.c_str())), c.sign);
        EXPECT_EQ(Sign(CompareBytesNoCase(c.lhs, c.rhs)), c.sign);
        EXPECT_EQ(Sign(CompareMultibyteNoCase(Bytes(c.lhs), Bytes(c.rhs))), c.sign);
        EXPECT_EQ(Sign(CompareWideNoCase(lhs.c_str(), rhs.c_str(), c.count)), c.signFirst);
        EXPECT_EQ(Sign(CompareBytesNoCase(c.lhs, c.rhs, c.count)), c.signFirst);
        EXPECT_EQ(Sign(CompareMultibyteNoCase(Bytes(c.lhs), Bytes(c.rhs), c.count)), c.signFirst);
    }
}

TEST(PlatformStrings, FoldingLengthsDigitsAndNumbers) {
    CaseFolder fold;
    for (char c : std::string("AZaz09_ -~"))
        EXPECT_EQ(fold(c), static_cast<std::uint32_t>(c >= 'A' && c <= 'Z' ? c + 32 : c)) << c;
    EXPECT_EQ(fold(L'Q'), static_cast<std::uint32_t>(L'q'));

    EXPECT_EQ(MultibyteLength(Bytes("")), 0u);
    EXPECT_EQ(MultibyteLength(Bytes("clip10")), 6u);
    for (unsigned c : {48u, 53u, 57u}) // '0' '5' '9'
        EXPECT_TRUE(IsMultibyteDigit(c)) << c;
    for (unsigned c : {97u, 47u, 58u, 32u, 0u}) // 'a' '/' ':' ' ' NUL
        EXPECT_FALSE(IsMultibyteDigit(c)) << c;

    // clang-format off
    const std::pair<const char*, LONG> numbers[] = {{"42", 42}, {"  -17x", -17}, {"+8", 8}, {"x1", 0}, {"", 0}, {"007", 7},
                              {"2147483647", INT32_MAX}, {"-2147483648", INT32_MIN}};
    // clang-format on
    for (const auto& [text, value] : numbers) {
        std::string narrow = text;
        EXPECT_EQ(BytesToLong(text), value) << text;
        EXPECT_EQ(WideToLong(std::wstring(narrow.begin(), narrow.end()).c_str()), value) << text;
    }
}

} // namespace
