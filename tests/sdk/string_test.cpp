// CKXString's operations.
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <vector>

#include <gtest/gtest.h>

#include <ut/sdk/string.h>

namespace {

TEST(CKXString, SlicesClampOutOfRangeCounts) {
    struct Case {
        int count;
        const wchar_t *left, *right, *truncatedLeft, *truncatedRight;
    };
    const Case cases[] = {
        {0, L"", L"", L"scene", L"scene"},  {2, L"sc", L"ne", L"ene", L"sce"},
        {5, L"scene", L"scene", L"", L""},  {9, L"scene", L"scene", L"", L""},
        {-3, L"", L"", L"scene", L"scene"},
    };
    for (const Case& c : cases) {
        CKXString s(L"scene");
        EXPECT_EQ(s.Left(c.count), c.left) << c.count;
        EXPECT_EQ(s.Right(c.count), c.right) << c.count;
        CKXString a = s, b = s;
        a.TruncateLeft(c.count);
        b.TruncateRight(c.count);
        EXPECT_EQ(a, c.truncatedLeft) << c.count;
        EXPECT_EQ(b, c.truncatedRight) << c.count;
    }
}

TEST(CKXString, ComparesWithAndWithoutCaseAndFinds) {
    CKXString s(L"Render"), dotted(L"a.b.c");
    EXPECT_EQ(s.Compare(L"Render"), 0);
    EXPECT_LT(s.Compare(L"render"), 0);
    EXPECT_EQ(s.Compare(L"RENDER", true), 0);
    EXPECT_TRUE(s.CaseLessEqual(L"render"));
    EXPECT_FALSE(s.CaseLessEqual(L"renders"));
    EXPECT_LT(s.Compare(L"Renderer"), 0);
    EXPECT_GT(s.Compare(nullptr), 0);
    EXPECT_EQ(CKXString().Compare(nullptr), 0);
    const int found[] = {dotted.Find(L'.'),    dotted.Find(L'.', 2),
                         dotted.Find(L"b.c"),  dotted.Find(L'x'),
                         dotted.Find(L'.', 9), dotted.Find(static_cast<const wchar_t*>(nullptr))};
    EXPECT_EQ(std::vector<int>(std::begin(found), std::end(found)), (std::vector<int>{1, 3, 2, -1, -1, -1}));
}

TEST(CKXString, AttachTakesOverBuffersOfBothAllocators) {
    auto* crt =
        static_cast<wchar_t*>(std::memcpy(std::malloc(8 * sizeof(wchar_t)), L"crt", 4 * sizeof(wchar_t)));
    CKXString a;
    a.Attach_CRT(crt);
    EXPECT_EQ(a, L"crt");
    auto* ole =
        static_cast<wchar_t*>(std::memcpy(CoTaskMemAlloc(8 * sizeof(wchar_t)), L"ole", 4 * sizeof(wchar_t)));
    a.Attach_OLE(ole);
    EXPECT_EQ(a, L"ole");

    a.Attach_CRT(nullptr);
    EXPECT_TRUE(a.IsEmpty());
}

TEST(CKXString, BuildsFromGuidsAndConcatenates) {
    constexpr GUID g = {0x12A36560, 0x3333, 0x11D4, {0x89, 0x4D, 0x00, 0xD0, 0xB7, 0x1D, 0xA4, 0x1F}};
    CKXString key = CKXString(L"Software\\") + CKXString::FromGUID(g) + L"\\";
    EXPECT_EQ(key, L"Software\\{12A36560-3333-11D4-894D-00D0B71DA41F}\\");
    EXPECT_EQ(key.Length(), 9 + 38 + 1);
    EXPECT_EQ(CKXString(L"abc", 2), L"ab");
    EXPECT_EQ(CKXString(static_cast<const wchar_t*>(nullptr)), L"");
}

} // namespace
