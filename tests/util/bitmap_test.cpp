#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include <ut/bitmap.h>
#include <ut/host/reference_host.h>

namespace {

using Bytes = std::vector<std::uint8_t>;
constexpr GUID kOtherFormat = {0x0CB91361, 0x5A29, 0x11CE, {0xBA, 0xBC, 0x00, 0xAA, 0x00, 0x62, 0x92, 0x84}};

TEST(RearrangeByteToGdiFormat, ConvertsEachFormatsRegion) {
    constexpr std::uint8_t E = 0xEE; // the destination before the call
    struct Case {
        const char* what;
        GUID format;
        unsigned long width, height, x0, x1, y0, y1;
        Bytes source, expected;
    } cases[] = {
        // clang-format off
        {"grey8 whole", GWPIXELFORMAT_GREY8, 2, 2, 0, 2, 0, 2, {10, 20, 30, 40},
         {10, 10, 10, 255, 20, 20, 20, 255, 30, 30, 30, 255, 40, 40, 40, 255}},
        {"grey8 right column", GWPIXELFORMAT_GREY8, 2, 2, 1, 2, 0, 2, {10, 20, 30, 40},
         {20, 20, 20, 255, 40, 40, 40, 255, E, E, E, E}},
        {"grey16 high bytes", GWPIXELFORMAT_GREY16, 2, 1, 0, 2, 0, 1, {0x01, 0xAA, 0x02, 0xBB},
         {0xAA, 0xAA, 0xAA, 255, 0xBB, 0xBB, 0xBB, 255}},
        {"rgba32 whole", GWPIXELFORMAT_RGBA32, 2, 1, 0, 2, 0, 1, {1, 2, 3, 4, 5, 6, 7, 8}, {3, 2, 1, 4, 7, 6, 5, 8}},
        {"rgba32 second row", GWPIXELFORMAT_RGBA32, 1, 2, 0, 1, 1, 2, {1, 2, 3, 4, 5, 6, 7, 8}, {7, 6, 5, 8, E, E}},
        {"rgba64 high bytes", GWPIXELFORMAT_RGBA64, 1, 1, 0, 1, 0, 1, {0, 1, 0, 2, 0, 3, 0, 4}, {3, 2, 1, 4}},
        {"unknown format", kOtherFormat, 1, 1, 0, 1, 0, 1, {1, 2, 3, 4}, {E, E, E, E}},
        // clang-format on
    };
    for (const Case& c : cases) {
        Bytes source = c.source;
        source.resize(64);
        for (bool emptyColumns : {false, true}) {
            Bytes target(64, E);
            unsigned long x1 = emptyColumns ? c.x0 : c.x1;
            KXRearrangeByteToGdiFormat(reinterpret_cast<unsigned long*>(source.data()),
                                       reinterpret_cast<unsigned long*>(target.data()), c.width, c.height,
                                       c.x0, x1, c.y0, c.y1, c.format);
            Bytes expected = emptyColumns ? Bytes{} : c.expected;
            expected.resize(64, E);
            EXPECT_EQ(target, expected) << c.what << (emptyColumns ? " without columns" : "");
        }
    }
}

TEST(GWImageAsHBitmap, MakesABitmapOfTheRectanglesSize) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWImageLoader> loader;
    ASSERT_EQ(KXGetImageLoader(loader.Put()), S_OK);
    struct Case {
        ULONG width, height;
        RECT rect;
    } cases[] = {
        {4, 4, {0, 0, 8, 8}},   {8, 2, {0, 0, 16, 10}}, {2, 8, {0, 0, 10, 16}},
        {3, 5, {4, 6, 20, 12}}, {5, 3, {-4, -6, 7, 9}},
    };
    for (const Case& c : cases) {
        Bytes pixels(std::size_t{c.width} * c.height * 4, 0xFF);
        ut::ComPtr<IGWImage> image;
        ASSERT_EQ(loader->CreateImage(c.width, c.height, GWPIXELFORMAT_RGBA32, pixels.data(), image.Put()),
                  S_OK);
        RECT rect = c.rect;
        HBITMAP bitmap = nullptr;
        ASSERT_EQ(KXGetGWImageAsHBitmap(image.Get(), &rect, &bitmap), S_OK) << c.width << "x" << c.height;
        ut::platform::BitmapPixels read;
        ASSERT_EQ(ut::platform::ReadBitmapPixels(bitmap, read), S_OK);
        EXPECT_EQ(read.width, c.rect.right - c.rect.left);
        EXPECT_EQ(read.height, c.rect.bottom - c.rect.top);
        // No pixel of the image reaches the section: what is drawn is black.
        for (std::uint32_t pixel : read.pixels)
            ASSERT_EQ(pixel & 0xFFFFFF, 0u);
        EXPECT_TRUE(DeleteObject(bitmap));
    }
    RECT rect{0, 0, 4, 4};
    HBITMAP bitmap = reinterpret_cast<HBITMAP>(&rect);
    ut::ComPtr<IGWImage> image;
    ASSERT_EQ(loader->CreateImage(0, 0, GWPIXELFORMAT_RGBA32, nullptr, image.Put()), S_OK);
    EXPECT_EQ(KXGetGWImageAsHBitmap(nullptr, &rect, &bitmap), E_POINTER);
    EXPECT_EQ(KXGetGWImageAsHBitmap(image.Get(), &rect, nullptr), E_POINTER);
}

} // namespace
