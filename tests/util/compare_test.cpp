#include <clocale>
#include <cstdlib>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/compare.h>

namespace {

int Sign(int value) {
    return (value > 0) - (value < 0);
}

std::wstring Widen(const std::string& ascii) {
    return std::wstring(ascii.begin(), ascii.end());
}

const unsigned char* Bytes(const std::string& text) {
    return reinterpret_cast<const unsigned char*>(text.c_str());
}

// The sign of each form on the same ASCII text; they must agree.
struct Signs {
    int wide, multibyte, narrow;
};
Signs Compare(const std::string& lhs, const std::string& rhs) {
    return {Sign(F3Dwcsicmpnum(Widen(lhs).c_str(), Widen(rhs).c_str())),
            Sign(F3Dmbsicmpnum(Bytes(lhs), Bytes(rhs))), Sign(F3Dstricmpnum(lhs.c_str(), rhs.c_str()))};
}

TEST(NumericCompare, OrdersTrailingNumbersByValueInEveryForm) {
    struct Case {
        const char *lhs, *rhs;
        int sign;
    };
    const Case cases[] = {
        {"clip9", "clip10", -1},
        {"Clip10", "clip10", 0},
        {"shot2a", "shot10a", 1}, // no trailing digits: plain text, '2' after '1'
        {"ab12", "abc12", -1},    // the shorter prefix first
        {"ab_1", "ab1", 1},
        {"abc", "abc1", -1},
        {"abc", "abc0", 1}, // equal values: the longer run first
        {"x007", "x7", -1},
        {"12", "9", 1},
        {"", "", 0},
        {"", "5", -1},
        {"", "a", -1},
        {"SHOT_12", "shot_9", 1}, // case only in the prefix
        {"a_b", "A_B", 0},
        {"a_", "aa", -1}, // folding goes to lower case: '_' before 'a'
        {"a0", "a", -1},
        {"a00", "a0", -1},
        {"v2147483648", "v2147483647", 0},   // the larger saturates to the smaller
        {"v99999999999", "v2147483648", -1}, // saturated alike, more digits first
        {"1a2", "1a10", -1},
        {"-5", "-10", -1}, // a minus sign belongs to the prefix
    };
    for (const Case& c : cases) {
        Signs signs = Compare(c.lhs, c.rhs);
        EXPECT_EQ((std::vector{signs.wide, signs.multibyte, signs.narrow}), std::vector(3, c.sign))
            << c.lhs << " vs " << c.rhs << " (wide, multibyte, narrow)";
    }
}

// Names built from prefixes and trailing runs that probe every step of the comparison.
std::vector<std::string> GeneratedNames() {
    const char* prefixes[] = {"", "a", "A", "a_", "ab", "aB", "abc", "shot_", "Shot_", "x1y", "x.", "_"};
    const char* runs[] = {"",   "0",   "00",         "007",        "7",          "9",
                          "10", "010", "2147483647", "2147483648", "99999999999"};
    std::vector<std::string> names;
    for (const char* prefix : prefixes)
        for (const char* run : runs)
            names.push_back(std::string(prefix) + run);
    return names;
}

// Antisymmetric, alike in every form, and transitive, so that sorting is consistent.
TEST(NumericCompare, IsAConsistentOrderAlikeInEveryFormOnGeneratedNames) {
    const std::vector<std::string> names = GeneratedNames();
    const std::size_t n = names.size();
    std::vector<int> sign(n * n);
    for (std::size_t i = 0; i < n; ++i) {
        for (std::size_t j = 0; j < n; ++j) {
            SCOPED_TRACE(names[i] + " vs " + names[j]);
            Signs forward = Compare(names[i], names[j]);
            ASSERT_EQ(forward.wide, -Sign(F3Dwcsicmpnum(Widen(names[j]).c_str(), Widen(names[i]).c_str())));
            ASSERT_EQ(forward.multibyte, forward.wide);
            ASSERT_EQ(forward.narrow, forward.wide);
            sign[i * n + j] = forward.wide;
        }
    }
    for (std::size_t i = 0; i < n; ++i)
        for (std::size_t j = 0; j < n; ++j)
            for (std::size_t k = 0; k < n && sign[i * n + j] <= 0; ++k)
                ASSERT_TRUE(sign[j * n + k] > 0 || sign[i * n + k] <= 0)
                    << names[i] << " <= " << names[j] << " <= " << names[k];
}

// Switches LC_ALL to the first of `names` the C library knows, and back at the end.
struct LocaleScope {
    explicit LocaleScope(std::initializer_list<const char*> names) {
        for (const char* name : names)
            if ((active = std::setlocale(LC_ALL, name) != nullptr))
                return;
    }
    ~LocaleScope() { std::setlocale(LC_ALL, previous.c_str()); }

    std::string previous = std::setlocale(LC_ALL, nullptr);
    bool active = false;
};

TEST(NumericCompare, FoldsCaseBeyondAsciiUnderTheCurrentLocale) {
    LocaleScope locale({"C.UTF-8", "en_US.UTF-8", ".UTF-8", "English_United States.1252"});
    if (!locale.active)
        GTEST_SKIP() << "no locale with case folding beyond ASCII";
    EXPECT_EQ(Sign(F3Dwcsicmpnum(L"\u00C9clair10", L"\u00E9clair9")), 1);
    EXPECT_EQ(Sign(F3Dwcsicmpnum(L"\u00C9t\u00C9", L"\u00E9t\u00E9")), 0);
    EXPECT_EQ(Sign(F3Dwcsicmpnum(L"\u03947", L"\u03B407")), 1);
}

TEST(NumericCompare, MultibyteFormSeeksDigitsAtTheCharacterCountAsByteOffset) {
    LocaleScope locale({"C.UTF-8", "en_US.UTF-8", ".UTF-8"});
    if (!locale.active || MB_CUR_MAX < 2)
        GTEST_SKIP() << "no UTF-8 locale";
    // "éé12" has 4 characters in 6 bytes: the search starts at byte 4 and finds no digit before
    // it, so both sides compare as plain text, '1' before '5'. The narrow form sees 12 and 5.
    const std::string lhs = "\u00E9\u00E912", rhs = "\u00E9\u00E95";
    EXPECT_EQ(Sign(F3Dmbsicmpnum(Bytes(lhs), Bytes(rhs))), -1);
    EXPECT_EQ(Sign(F3Dstricmpnum(lhs.c_str(), rhs.c_str())), 1);
    // Case folds by character, not by byte.
    EXPECT_EQ(Sign(F3Dmbsicmpnum(Bytes("\xC3\x89t\xC3\xA9"), Bytes("\xC3\xA9T\xC3\x89"))), 0);
}

} // namespace
