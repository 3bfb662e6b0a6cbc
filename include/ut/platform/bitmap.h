// Device bitmaps on both homes: the part of the system's drawing interface that turns images
// into bitmaps (GetDC, CreateCompatibleDC, CreateDIBSection, CreateCompatibleBitmap,
// SelectObject, SetStretchBltMode, StretchBlt, DeleteObject, DeleteDC, ReleaseDC), and two ways
// to look at the result. On Windows these are the system's; on POSIX ours, 32-bit surfaces only.
#pragma once

#include <cstdint>
#include <utility>
#include <vector>

#include <ut/platform/com.h>
#include <ut/platform/native/bitmap.h>

namespace ut::platform {

// A bitmap's pixels, top row first, each the bytes blue, green, red and a fourth byte (what
// the bitmap holds there, which drawing may not keep).
struct BitmapPixels {
    LONG width = 0;
    LONG height = 0;
    std::vector<std::uint32_t> pixels;
};

// Owns a device bitmap until it is handed on; a bitmap that will not go is left alone.
class UniqueBitmap {
public:
    UniqueBitmap() = default;
    UniqueBitmap(const UniqueBitmap&) = delete;
    UniqueBitmap& operator=(const UniqueBitmap&) = delete;
    ~UniqueBitmap() {
        if (bitmap_)
            (void)DeleteObject(bitmap_); // nothing to do about a bitmap that will not go
    }
    HBITMAP* Put() noexcept { return &bitmap_; }
    HBITMAP Get() const noexcept { return bitmap_; }
    HBITMAP Detach() noexcept { return std::exchange(bitmap_, nullptr); }

private:
    HBITMAP bitmap_ = nullptr;
};

// Reads the pixels of a bitmap that is not selected into a device context.
UT_PLATFORM_API HRESULT ReadBitmapPixels(HBITMAP bitmap, BitmapPixels& out);

// Writes the bitmap as a 32-bit BMP file, for a person or a tool to look at.
UT_PLATFORM_API HRESULT WriteBitmapFile(HBITMAP bitmap, const wchar_t* path);

} // namespace ut::platform
