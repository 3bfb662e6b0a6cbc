// Image pixels to device pixels, and an image fitted into a device bitmap.
#include <ut/bitmap.h>

#include <cstdint>
#include <cstring>
#include <utility>

namespace {

using Byte = std::uint8_t;

void SwapRedAndBlue(Byte* pixels, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i)
        std::swap(pixels[4 * i], pixels[4 * i + 2]);
}

// Writes each pixel of the region from `pick(sourcePixel, targetPixel)`.
template <class Pick>
void ForRegion(const Byte* source, Byte* target, unsigned long width, std::size_t size, unsigned long x0,
               unsigned long x1, unsigned long y0, unsigned long y1, Pick pick) {
    if (y0 >= y1 || x0 >= x1)
        return;
    for (unsigned long y = y0; y < y1; ++y)
        for (unsigned long x = x0; x < x1; ++x)
            pick(source + (std::size_t{y} * width + x) * size,
                 target + ((y - y0) * (x1 - x0) + (x - x0)) * 4);
}

HRESULT LastError() {
    return HRESULT_FROM_WIN32(GetLastError());
}

struct Fit {
    LONG left, top, right, bottom;
};

// Deliberately measured from the right or bottom edge, not the width or height.
Fit FitImage(const RECT& rect, ULONG w, ULONG h) {
    Fit fit{rect.left, rect.top, rect.right, rect.bottom};
    if (w < h) {
        auto fw = static_cast<LONG>(static_cast<long long>(rect.right) * w / h);
        LONG offset = (rect.right - rect.left - fw) / 2;
        fit.left = rect.left + offset;
        fit.right = fw + offset;
    } else if (w > h) {
        auto fh = static_cast<LONG>(static_cast<long long>(rect.bottom) * h / w);
        LONG offset = (rect.bottom - rect.top - fh) / 2;
        fit.bottom = fh + offset;
        fit.top = rect.top + offset;
    }
    return fit;
}

} // namespace

void KXRearrangeByteToGdiFormat(unsigned long* source, unsigned long* destination, unsigned long width,
                                unsigned long height, unsigned long x0, unsigned long x1, unsigned long y0,
                                unsigned long y1, GUID format) {
    const auto* from = reinterpret_cast<const Byte*>(source);
    auto* to = reinterpret_cast<Byte*>(destination);
    std::size_t region = y0 < y1 && x0 < x1 ? std::size_t{y1 - y0} * (x1 - x0) : 0;
    if (format == GWPIXELFORMAT_GREY8 || format == GWPIXELFORMAT_GREY16) {
        std::size_t size = format == GWPIXELFORMAT_GREY8 ? 1 : 2;
        ForRegion(from, to, width, size, x0, x1, y0, y1, [size](const Byte* p, Byte* q) {
            Byte grey = p[size - 1];
            q[0] = q[1] = q[2] = grey;
            q[3] = 255;
        });
    } else if (format == GWPIXELFORMAT_RGBA32) {
        if (x0 == 0 && y0 == 0 && x1 == width && y1 == height) {
            std::memcpy(to, from, std::size_t{width} * height * 4);
        } else if (y0 < y1 && x0 < x1) {
            for (unsigned long y = y0; y < y1; ++y)
                std::memcpy(to + std::size_t{y - y0} * (x1 - x0) * 4,
                            from + (std::size_t{y} * width + x0) * 4, std::size_t{x1 - x0} * 4);
        }
        SwapRedAndBlue(to, region);
    } else if (format == GWPIXELFORMAT_RGBA64) {
        ForRegion(from, to, width, 8, x0, x1, y0, y1, [](const Byte* p, Byte* q) {
            for (int i = 0; i < 4; ++i)
                q[i] = p[2 * i + 1];
        });
        SwapRedAndBlue(to, region);
    }
}

HRESULT KXGetGWImageAsHBitmap(IGWImage* image, RECT* rect, HBITMAP* bitmap) {
    if (!image || !bitmap || !rect)
        return E_POINTER;
    *bitmap = nullptr;
    ULONG w = 0, h = 0;
    GUID format{};
    (void)image->GetSize(&w, &h);         // an image that does not answer is an empty one
    (void)image->GetPixelFormat(&format); // and of no format
    Fit fit = FitImage(*rect, w, h);

    HRESULT hr = S_OK;
    HDC sectionContext = CreateCompatibleDC(nullptr);
    if (!sectionContext)
        hr = LastError();
    if (FAILED(hr))
        return hr;
    BITMAPINFO info{};
    info.bmiHeader.biSize = sizeof(BITMAPINFOHEADER);
    info.bmiHeader.biWidth = static_cast<LONG>(w);
    info.bmiHeader.biHeight = static_cast<LONG>(h);
    info.bmiHeader.biPlanes = 1;
    info.bmiHeader.biBitCount = 32;
    info.bmiHeader.biCompression = BI_RGB;
    void* bits = nullptr;
    HBITMAP section = CreateDIBSection(sectionContext, &info, DIB_RGB_COLORS, &bits, nullptr, 0);
    void* pixels = nullptr;
    (void)image->GetPixels(&pixels); // unchecked, as the section is: no pixel is written below
    // The region is passed as (0, 0, w, h) in the order (x0, x1, y0, y1): an empty column range,
    // so the section keeps the black it was created with. Kept so on purpose.
    KXRearrangeByteToGdiFormat(static_cast<unsigned long*>(pixels), static_cast<unsigned long*>(bits), w, h,
                               0, 0, w, h, format);
    HGDIOBJ oldSection = SelectObject(sectionContext, section);
    if (!oldSection)
        hr = LastError();
    HDC screen = nullptr;
    HDC bitmapContext = nullptr;
    HGDIOBJ oldBitmap = nullptr;
    if (SUCCEEDED(hr)) {
        screen = GetDC(nullptr);
        if (!screen)
            hr = LastError();
    }
    if (SUCCEEDED(hr)) {
        *bitmap = CreateCompatibleBitmap(screen, rect->right - rect->left, rect->bottom - rect->top);
        bitmapContext = CreateCompatibleDC(screen);
        oldBitmap = bitmapContext && *bitmap ? SelectObject(bitmapContext, *bitmap) : nullptr;
        if (!oldBitmap)
            hr = E_FAIL;
    }
    if (SUCCEEDED(hr)) {
        (void)SetStretchBltMode(bitmapContext, COLORONCOLOR); // the previous mode is not wanted back
        int x = fit.left > 0 ? fit.left - 1 : fit.left;
        int y = fit.top > 0 ? fit.top - 2 : fit.top - 1;
        // A draw that fails leaves the bitmap as created; only the contexts' failures are reported.
        (void)StretchBlt(bitmapContext, x, y, fit.right - fit.left, fit.bottom - fit.top, sectionContext, 0,
                         0, static_cast<int>(w), static_cast<int>(h), SRCCOPY);
    }
    if (oldBitmap)
        (void)SelectObject(bitmapContext, oldBitmap); // gives the bitmap back to the caller
    if (oldSection)
        (void)SelectObject(sectionContext, oldSection); // frees the section for deletion
    if (section)
        (void)DeleteObject(section); // the section was only a source
    (void)DeleteDC(sectionContext);  // the contexts go in every case; nothing to report
    if (bitmapContext)
        (void)DeleteDC(bitmapContext); // as above
    if (screen)
        (void)DeleteDC(screen); // deleted, not released, as the application always has
    return hr;
}
