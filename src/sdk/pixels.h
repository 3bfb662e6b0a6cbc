// Pixels of the image library's four formats, read and written through 8-bit channels, and an
// image's shape and pixels in one place: what the image functions and the thumbnails share.
#pragma once

#include <cstddef>
#include <cstdint>

#include <ut/sdk/image.h>

namespace ut::sdk {

struct Rgba {
    std::uint8_t r = 0, g = 0, b = 0, a = 0;
};

// An image's size, format and pixels as its interface gives them.
struct ImageView {
    ULONG width = 0;
    ULONG height = 0;
    GUID format = GUID_NULL;
    std::size_t bytesPerPixel = 0;
    std::uint8_t* pixels = nullptr;

    std::uint8_t* At(ULONG x, ULONG y) const { return pixels + (std::size_t{y} * width + x) * bytesPerPixel; }
    Rgba Read(ULONG x, ULONG y) const;
    void Write(ULONG x, ULONG y, Rgba value) const;
};

// Asks the image for its size, format and pixels: E_INVALIDARG for an unknown format,
// E_UNEXPECTED for an image with pixels to have and none given; its own failures pass through.
HRESULT ViewImage(IGWImage* image, ImageView& view);

// A new image of the library's class, `format`, `width` by `height`, all bytes 0.
HRESULT CreateShapedImage(ULONG width, ULONG height, REFGUID format, ut::ComPtr<IGWImage>& image);

} // namespace ut::sdk
