// The image library's functions: the host's image loader, new images, scaling and translating one
// image into another, and an image as a device bitmap.
#include <ut/sdk/image.h>

#include <cmath>
#include <cstring>

#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

#include "pixels.h"

std::size_t GWPixelFormatSize(REFGUID format) {
    if (format == GWPIXELFORMAT_GREY8)
        return 1;
    if (format == GWPIXELFORMAT_GREY16)
        return 2;
    if (format == GWPIXELFORMAT_RGBA32)
        return 4;
    return format == GWPIXELFORMAT_RGBA64 ? 8 : 0;
}

namespace ut::sdk {
namespace {

std::uint8_t Grey(Rgba value) {
    return static_cast<std::uint8_t>(std::lround(0.299 * value.r + 0.587 * value.g + 0.114 * value.b));
}

// One channel of a sampled pixel, rounded half up and kept inside a byte.
std::uint8_t Channel(double value) {
    double rounded = std::floor(value + 0.5);
    return static_cast<std::uint8_t>(rounded < 0 ? 0 : rounded > 255 ? 255 : rounded);
}

// The source pixel under the continuous position (u, v), which lies inside the source.
Rgba Nearest(const ImageView& source, double u, double v) {
    auto x = static_cast<ULONG>(u), y = static_cast<ULONG>(v);
    return source.Read(x < source.width ? x : source.width - 1, y < source.height ? y : source.height - 1);
}

// The four pixel centres around (u, v) weighed by their nearness, edge pixels repeated outward.
Rgba Bilinear(const ImageView& source, double u, double v) {
    double fx = u - 0.5, fy = v - 0.5;
    double x0 = std::floor(fx), y0 = std::floor(fy);
    double wx = fx - x0, wy = fy - y0;
    auto clamp = [](double i, ULONG size) {
        return static_cast<ULONG>(i < 0 ? 0 : i >= size ? size - 1 : i);
    };
    ULONG left = clamp(x0, source.width), right = clamp(x0 + 1, source.width);
    ULONG top = clamp(y0, source.height), bottom = clamp(y0 + 1, source.height);
    Rgba p[4] = {source.Read(left, top), source.Read(right, top), source.Read(left, bottom),
                 source.Read(right, bottom)};
    auto mix = [&](std::uint8_t Rgba::*channel) {
        double upper = p[0].*channel * (1 - wx) + p[1].*channel * wx;
        double lower = p[2].*channel * (1 - wx) + p[3].*channel * wx;
        return Channel(upper * (1 - wy) + lower * wy);
    };
    return {mix(&Rgba::r), mix(&Rgba::g), mix(&Rgba::b), mix(&Rgba::a)};
}

bool UsableScale(double scale) {
    return std::isfinite(scale) && scale > 0;
}

} // namespace

Rgba ImageView::Read(ULONG x, ULONG y) const {
    const std::uint8_t* p = At(x, y);
    switch (bytesPerPixel) {
    case 1:
        return {p[0], p[0], p[0], 255};
    case 2:
        return {p[1], p[1], p[1], 255};
    case 4:
        return {p[0], p[1], p[2], p[3]};
    default:
        return {p[1], p[3], p[5], p[7]};
    }
}

void ImageView::Write(ULONG x, ULONG y, Rgba value) const {
    std::uint8_t* p = At(x, y);
    switch (bytesPerPixel) {
    case 1:
        p[0] = Grey(value);
        break;
    case 2:
        p[0] = p[1] = Grey(value);
        break;
    case 4:
        p[0] = value.r;
        p[1] = value.g;
        p[2] = value.b;
        p[3] = value.a;
        break;
    default: {
        const std::uint8_t channels[] = {value.r, value.g, value.b, value.a};
        for (int i = 0; i < 4; ++i)
            p[2 * i] = p[2 * i + 1] = channels[i];
    }
    }
}

HRESULT ViewImage(IGWImage* image, ImageView& view) {
    void* pixels = nullptr;
    if (HRESULT hr = image->GetSize(&view.width, &view.height); FAILED(hr))
        return hr;
    if (HRESULT hr = image->GetPixelFormat(&view.format); FAILED(hr))
        return hr;
    view.bytesPerPixel = ::GWPixelFormatSize(view.format);
    if (!view.bytesPerPixel)
        return E_INVALIDARG;
    if (HRESULT hr = image->GetPixels(&pixels); FAILED(hr))
        return hr;
    view.pixels = static_cast<std::uint8_t*>(pixels);
    return view.pixels || !view.width || !view.height ? S_OK : E_UNEXPECTED;
}

HRESULT CreateShapedImage(ULONG width, ULONG height, REFGUID format, ut::ComPtr<IGWImage>& image) {
    ut::ComPtr<IGWImageSetup> setup;
    if (HRESULT hr = kxILCreateImage(nullptr, CLSID_GWImage, image.Put()); FAILED(hr))
        return hr;
    HRESULT hr = image.As(setup);
    if (SUCCEEDED(hr))
        hr = setup->SetPixelFormat(format);
    if (SUCCEEDED(hr))
        hr = setup->SetSize(width, height);
    if (FAILED(hr))
        image.Reset();
    return hr;
}

} // namespace ut::sdk

HRESULT KXGetImageLoader(IGWImageLoader** loader) {
    if (!loader)
        return E_POINTER;
    return GWQueryGenericObject(CLSID_GWImageLoader, IID_IGWImageLoader, reinterpret_cast<void**>(loader));
}

HRESULT kxILCreateImage(IUnknown* outer, REFCLSID imageClass, IGWImage** image) {
    if (!image)
        return E_POINTER;
    *image = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("kxILCreateImage"); FAILED(hr))
        return hr;
    if (outer)
        return CLASS_E_NOAGGREGATION;
    return KXCreateInstance(imageClass, IID_IGWImage, reinterpret_cast<void**>(image));
}

HRESULT kxILScaleTranslateImage(IGWImage* source, IGWImage* target, double scaleX, double scaleY,
                                double translateX, double translateY, int interpolation) {
    using namespace ut::sdk;
    if (!source || !target)
        return E_POINTER;
    if (!UsableScale(scaleX) || !UsableScale(scaleY) || !std::isfinite(translateX) ||
        !std::isfinite(translateY) ||
        (interpolation != KXIL_INTERPOLATE_NEAREST && interpolation != KXIL_INTERPOLATE_BILINEAR))
        return E_INVALIDARG;
    if (HRESULT hr = CheckHostFault("kxILScaleTranslateImage"); FAILED(hr))
        return hr;
    ImageView from, to;
    if (HRESULT hr = ViewImage(source, from); FAILED(hr))
        return hr;
    if (HRESULT hr = ViewImage(target, to); FAILED(hr))
        return hr;
    for (ULONG y = 0; y < to.height; ++y) {
        double v = (y + 0.5 - translateY) / scaleY;
        if (!(v >= 0 && v < from.height))
            continue;
        for (ULONG x = 0; x < to.width; ++x) {
            double u = (x + 0.5 - translateX) / scaleX;
            if (!(u >= 0 && u < from.width))
                continue;
            to.Write(x, y,
                     interpolation == KXIL_INTERPOLATE_NEAREST ? Nearest(from, u, v) : Bilinear(from, u, v));
        }
    }
    return S_OK;
}

HRESULT KXImageHlp::CreateBitmapFromImage(IGWImage* image, HBITMAP* bitmap) {
    using namespace ut::sdk;
    if (!image || !bitmap)
        return E_POINTER;
    *bitmap = nullptr;
    if (HRESULT hr = CheckHostFault("KXImageHlp::CreateBitmapFromImage"); FAILED(hr))
        return hr;
    ImageView view;
    if (HRESULT hr = ViewImage(image, view); FAILED(hr))
        return hr;
    if (!view.width || !view.height || view.width > 1u << 15 || view.height > 1u << 15)
        return E_INVALIDARG;
    BITMAPINFO info{};
    info.bmiHeader.biSize = sizeof(BITMAPINFOHEADER);
    info.bmiHeader.biWidth = static_cast<LONG>(view.width);
    info.bmiHeader.biHeight = -static_cast<LONG>(view.height); // top row first, as the image's
    info.bmiHeader.biPlanes = 1;
    info.bmiHeader.biBitCount = 32;
    info.bmiHeader.biCompression = BI_RGB;
    void* bits = nullptr;
    HBITMAP made = CreateDIBSection(nullptr, &info, DIB_RGB_COLORS, &bits, nullptr, 0);
    if (!made || !bits) {
        if (made)
            (void)DeleteObject(made); // a section without pixels is of no use
        return E_OUTOFMEMORY;
    }
    auto* out = static_cast<std::uint8_t*>(bits);
    for (ULONG y = 0; y < view.height; ++y)
        for (ULONG x = 0; x < view.width; ++x, out += 4) {
            Rgba p = view.Read(x, y);
            const std::uint8_t device[] = {p.b, p.g, p.r, p.a};
            std::memcpy(out, device, 4);
        }
    *bitmap = made;
    return S_OK;
}
