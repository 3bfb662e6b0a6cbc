// Device contexts, sections, stretching onto the screen device, and reading a bitmap, alike on both homes.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/bitmap.h>

#include "support/temp_folder.h"

namespace {

constexpr std::uint32_t kColour = 0x00FFFFFF; // drawing need not keep the fourth byte

// A 32-bit bottom-up section whose pixels, top row first, are `topDown`.
HBITMAP Section(HDC dc, LONG width, LONG height, const std::vector<std::uint32_t>& topDown) {
    BITMAPINFO info{{sizeof(BITMAPINFOHEADER), width, height, 1, 32, BI_RGB, 0, 0, 0, 0, 0}, {}};
    void* bits = nullptr;
    HBITMAP section = CreateDIBSection(dc, &info, DIB_RGB_COLORS, &bits, nullptr, 0);
    EXPECT_NE(section, nullptr);
    EXPECT_NE(bits, nullptr);
    auto* pixels = static_cast<std::uint32_t*>(bits);
    for (LONG y = 0; section && y < height; ++y)
        for (LONG x = 0; x < width; ++x)
            pixels[(height - 1 - y) * width + x] = topDown[static_cast<std::size_t>(y * width + x)];
    return section;
}

std::vector<std::uint32_t> Colours(HBITMAP bitmap, LONG& width, LONG& height) {
    ut::platform::BitmapPixels read;
    EXPECT_EQ(ut::platform::ReadBitmapPixels(bitmap, read), S_OK);
    width = read.width;
    height = read.height;
    for (std::uint32_t& pixel : read.pixels)
        pixel &= kColour;
    return read.pixels;
}

class BitmapTest : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE((screen_ = GetDC(nullptr)) && (source_ = CreateCompatibleDC(screen_)) &&
                    (target_ = CreateCompatibleDC(screen_)));
    }
    void TearDown() override {
        EXPECT_TRUE(DeleteDC(source_));
        EXPECT_TRUE(DeleteDC(target_));
        EXPECT_EQ(ReleaseDC(nullptr, screen_), 1);
    }

    // Stretches a section of `width` by `height` pixels onto a new screen-compatible bitmap of
    // `targetWidth` by `targetHeight`, as an image is fitted into a rectangle, and reads it back.
    std::vector<std::uint32_t> Stretch(LONG width, LONG height, const std::vector<std::uint32_t>& pixels,
                                       LONG targetWidth, LONG targetHeight, RECT to) {
        HBITMAP section = Section(screen_, width, height, pixels);
        HBITMAP bitmap = CreateCompatibleBitmap(screen_, targetWidth, targetHeight);
        EXPECT_NE(bitmap, nullptr);
        HGDIOBJ oldSource = SelectObject(source_, section);
        HGDIOBJ oldTarget = SelectObject(target_, bitmap);
        EXPECT_TRUE(oldSource && oldTarget);
        EXPECT_NE(SetStretchBltMode(target_, COLORONCOLOR), 0);
        EXPECT_TRUE(StretchBlt(target_, to.left, to.top, to.right - to.left, to.bottom - to.top, source_, 0,
                               0, width, height, SRCCOPY));
        SelectObject(source_, oldSource);
        SelectObject(target_, oldTarget);
        EXPECT_TRUE(DeleteObject(section));
        LONG w = 0, h = 0;
        std::vector<std::uint32_t> result = Colours(bitmap, w, h);
        EXPECT_EQ(w, targetWidth);
        EXPECT_EQ(h, targetHeight);
        EXPECT_TRUE(DeleteObject(bitmap));
        return result;
    }

    HDC screen_ = nullptr, source_ = nullptr, target_ = nullptr;
};

TEST_F(BitmapTest, StretchingCopiesScalesAndClips) {
    const std::uint32_t A = 0x112233, B = 0x445566, C = 0x778899, D = 0xAABBCC, Z = 0;
    struct Case {
        const char* what;
        LONG width, height;
        std::vector<std::uint32_t> pixels;
        LONG targetWidth, targetHeight;
        RECT to;
        std::vector<std::uint32_t> expected;
    } cases[] = {
        // clang-format off
        {"copy", 2, 2, {A, B, C, D}, 2, 2, {0, 0, 2, 2}, {A, B, C, D}},
        {"twice as large", 2, 2, {A, B, C, D}, 4, 4, {0, 0, 4, 4}, {A, A, B, B, A, A, B, B, C, C, D, D, C, C, D, D}},
        {"half as large", 4, 2, {A, A, B, B, A, A, B, B}, 2, 1, {0, 0, 2, 1}, {A, B}},
        {"offset inside", 1, 1, {D}, 3, 3, {1, 1, 2, 2}, {Z, Z, Z, Z, D, Z, Z, Z, Z}},
        {"clipped at the top left", 2, 2, {A, B, C, D}, 3, 3, {-1, -1, 1, 1}, {D, Z, Z, Z, Z, Z, Z, Z, Z}},
        {"wide into tall", 2, 1, {A, B}, 2, 4, {0, 1, 2, 3}, {Z, Z, A, B, A, B, Z, Z}},
        // clang-format on
    };
    for (const Case& c : cases)
        EXPECT_EQ(Stretch(c.width, c.height, c.pixels, c.targetWidth, c.targetHeight, c.to), c.expected)
            << c.what;
}

TEST_F(BitmapTest, SelectionFollowsTheSystemsRules) {
    HBITMAP section = Section(screen_, 2, 2, {1, 2, 3, 4});
    HGDIOBJ stock = SelectObject(source_, section);
    ASSERT_NE(stock, nullptr);
    EXPECT_EQ(SelectObject(target_, section), nullptr);
    EXPECT_EQ(SelectObject(screen_, section), nullptr);
    EXPECT_EQ(SelectObject(source_, stock), section);
    EXPECT_EQ(CreateCompatibleBitmap(screen_, 0, 0), stock);
    EXPECT_EQ(SetStretchBltMode(target_, COLORONCOLOR), BLACKONWHITE);
    EXPECT_EQ(SetStretchBltMode(target_, COLORONCOLOR), COLORONCOLOR);
    EXPECT_TRUE(DeleteObject(section));
    HDC screen = GetDC(nullptr);
    EXPECT_TRUE(DeleteDC(screen));
}

TEST_F(BitmapTest, ABitmapIsReadTopRowFirstAndWrittenAsABmpFile) {
    HBITMAP section = Section(screen_, 3, 2, {1, 2, 3, 4, 5, 6});
    LONG width = 0, height = 0;
    EXPECT_EQ(Colours(section, width, height), (std::vector<std::uint32_t>{1, 2, 3, 4, 5, 6}));
    ut::test::TempFolder folder;
    std::wstring path = folder / L"picture.bmp";
    ASSERT_EQ(ut::platform::WriteBitmapFile(section, path.c_str()), S_OK);
    std::string file = ut::test::FileContent(path);
    ASSERT_EQ(file.size(), 54u + 3 * 2 * 4);
    EXPECT_EQ(file.substr(0, 2), "BM");
    EXPECT_EQ(file[28], 32); // bits per pixel
    // Rows from the bottom up: the first stored pixel is the bottom row's first, 4.
    EXPECT_EQ(file[54], 4);
    EXPECT_EQ(file[54 + 12], 1);
    EXPECT_TRUE(DeleteObject(section));
    ut::platform::BitmapPixels none;
    EXPECT_EQ(ut::platform::ReadBitmapPixels(nullptr, none), E_INVALIDARG);
}

} // namespace
