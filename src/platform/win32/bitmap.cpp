// Reading a device bitmap's pixels on Windows, through the system's GetDIBits.
#include <ut/platform/bitmap.h>
#include <ut/platform/detail/boundary.h>

namespace ut::platform {

HRESULT ReadBitmapPixels(HBITMAP bitmap, BitmapPixels& out) {
    BITMAP shape{};
    if (!bitmap || GetObjectW(bitmap, sizeof shape, &shape) == 0)
        return E_INVALIDARG;
    return ut::ExportBoundary([&] {
        BITMAPINFO info{};
        info.bmiHeader.biSize = sizeof(BITMAPINFOHEADER);
        info.bmiHeader.biWidth = shape.bmWidth;
        info.bmiHeader.biHeight = -shape.bmHeight; // top row first
        info.bmiHeader.biPlanes = 1;
        info.bmiHeader.biBitCount = 32;
        info.bmiHeader.biCompression = BI_RGB;
        out.width = shape.bmWidth;
        out.height = shape.bmHeight;
        out.pixels.assign(static_cast<std::size_t>(shape.bmWidth) * shape.bmHeight, 0);
        HDC screen = GetDC(nullptr);
        int rows = GetDIBits(screen, bitmap, 0, static_cast<UINT>(shape.bmHeight), out.pixels.data(), &info,
                             DIB_RGB_COLORS);
        (void)ReleaseDC(nullptr, screen); // the screen context goes back whatever GetDIBits answered
        return rows == shape.bmHeight ? S_OK : E_FAIL;
    });
}

} // namespace ut::platform
