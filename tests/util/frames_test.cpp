#include <climits>
#include <string>

#include <gtest/gtest.h>

#include <ut/detail/names.h>
#include <ut/frames.h>

namespace {

constexpr std::size_t kCapacity = static_cast<std::size_t>(ut::kPathCapacity);
constexpr wchar_t kGuard = L'\x7F';

// Runs `call` into an out buffer followed by guard characters, and checks the guards survive.
template <class Call>
std::wstring Run(Call call) {
    std::wstring buffer(kCapacity + 16, kGuard);
    call(buffer.data());
    EXPECT_EQ(buffer.substr(kCapacity), std::wstring(16, kGuard)) << "written past the buffer";
    return buffer.c_str();
}

std::wstring Expand(const std::wstring& pattern, long frame) {
    return Run([&](wchar_t* out) { KXExpandFramePadding(pattern.c_str(), frame, out); });
}
std::wstring Range(const std::wstring& pattern, long first, long last) {
    return Run([&](wchar_t* out) { KXExpandFramePadding_Range(pattern.c_str(), first, last, out); });
}
std::wstring Strip(const std::wstring& pattern) {
    return Run([&](wchar_t* out) { KXRemoveFramePadding(pattern.c_str(), out); });
}

TEST(FramePadding, AllThreeFormsOfEachPattern) {
    struct Case {
        const wchar_t* pattern;
        const wchar_t* expanded; // frame 7
        const wchar_t* range;    // 7 to 12
        const wchar_t* stripped;
    };
    const Case cases[] = {
        {L"shot.###.pic", L"shot.007.pic", L"shot.007_012.pic", L"shot.pic"},
        {L"shot_####.tga", L"shot_0007.tga", L"shot_0007_0012.tga", L"shot_.tga"},
        {L"out#.exr", L"out7.exr", L"out7_12.exr", L"out.exr"},
        {L"a.##.b.####", L"a.07.b.0007", L"a.07_12.b.0007_0012", L"a.b"},
        {L"render.pic", L"render.pic", L"render.pic", L"render.pic"},
        {L"C:\\img\\###.pic", L"C:\\img\\007.pic", L"C:\\img\\007_012.pic", L"C:\\img.pic"},
        {L"###", L"007", L"007_012", L""},
        {L"", L"", L"", L""},
        {L"#a#", L"7a7", L"7_12a7_12", L"a"},
        {L"###.x", L"007.x", L"007_012.x", L".x"}, // a run at the start has nothing to take
        {L".###", L".007", L".007_012", L""},      // a full stop first is still taken
        {L"a-##\\b\\\\#", L"a-07\\b\\\\7", L"a-07_12\\b\\\\7_12", L"a-\\b\\"},
        {L"v\x00E9.##", L"v\x00E9.07", L"v\x00E9.07_12", L"v\x00E9"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(testing::Message() << "pattern \"" << c.pattern << "\"");
        EXPECT_EQ(Expand(c.pattern, 7), c.expanded);
        EXPECT_EQ(Range(c.pattern, 7, 12), c.range);
        EXPECT_EQ(Strip(c.pattern), c.stripped);
    }
}

TEST(FramePadding, NumbersKeepTheirWholeWidthAndSign) {
    struct Case {
        const wchar_t* pattern;
        long frame;
        std::wstring expanded;
    };
    const Case cases[] = {
        {L"x.##.y", 1234, L"x.1234.y"},
        {L"x.###.y", -5, L"x.-05.y"},
        {L"x.#.y", -5, L"x.-5.y"},
        {L"#", 0, L"0"},
        {L"####", 0, L"0000"},
        {L"#", LONG_MAX, std::to_wstring(LONG_MAX)},
        {L"#", LONG_MIN, std::to_wstring(LONG_MIN)},
    };
    for (const Case& c : cases)
        EXPECT_EQ(Expand(c.pattern, c.frame), c.expanded) << c.pattern << " with " << c.frame;
    EXPECT_EQ(Range(L"f.##", -3, 100), L"f.-3_100");
}

TEST(FramePadding, LongPatternsAndResultsAreCutAtTheWorkingCopy) {
    const std::wstring longest(kCapacity - 1, L'a');
    const std::wstring tooLong = std::wstring(kCapacity + 40, L'a') + L"###";
    struct Case {
        std::wstring pattern;
        std::wstring expanded; // frame 12345
        std::wstring stripped;
    };
    const Case cases[] = {
        {tooLong, longest, longest},
        {longest, longest, longest},
        // The result grows past the copy: the tail is dropped.
        {std::wstring(kCapacity - 3, L'a') + L"#", std::wstring(kCapacity - 3, L'a') + L"12",
         std::wstring(kCapacity - 3, L'a')},
        // A later run that the first one pushes out of the copy is lost.
        {L"#" + std::wstring(kCapacity - 4, L'b') + L"##", L"12345" + std::wstring(kCapacity - 6, L'b'),
         std::wstring(kCapacity - 4, L'b')},
        {std::wstring(kCapacity + 10, L'#'), std::wstring(kCapacity - 6, L'0') + L"12345", L""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(testing::Message() << "pattern of " << c.pattern.size() << " characters");
        EXPECT_EQ(Expand(c.pattern, 12345), c.expanded);
        EXPECT_EQ(Strip(c.pattern), c.stripped);
        EXPECT_LE(Range(c.pattern, 12345, 12345).size(), kCapacity - 1);
    }
}

} // namespace
