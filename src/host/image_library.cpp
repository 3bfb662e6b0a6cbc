// The reference host's images and its image class.
#include "image_library.h"

#include <new>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/testing.h>

namespace ut::host {
namespace {

constexpr ULONG kMaxSide = 1u << 15;

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> Image::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<Image, IGWImage>(IID_IGWImage),
                                         sdk::Entry<Image, IGWImageSetup>(IID_IGWImageSetup)};
    return map;
}

HRESULT Image::GetSize(ULONG* width, ULONG* height) {
    if (!width || !height)
        return E_POINTER;
    if (HRESULT hr = sdk::CheckHostFault("IGWImage::GetSize"); FAILED(hr))
        return hr;
    *width = width_;
    *height = height_;
    return S_OK;
}

HRESULT Image::GetPixelFormat(GUID* format) {
    if (!format)
        return E_POINTER;
    if (HRESULT hr = sdk::CheckHostFault("IGWImage::GetPixelFormat"); FAILED(hr))
        return hr;
    *format = format_;
    return S_OK;
}

HRESULT Image::GetPixels(void** pixels) {
    if (!pixels)
        return E_POINTER;
    if (HRESULT hr = sdk::CheckHostFault("IGWImage::GetPixels"); FAILED(hr))
        return hr;
    *pixels = pixels_.data();
    return S_OK;
}

HRESULT Image::SetPixelFormat(REFGUID format) {
    if (HRESULT hr = sdk::CheckHostFault("IGWImageSetup::SetPixelFormat"); FAILED(hr))
        return hr;
    return Reshape(width_, height_, format);
}

HRESULT Image::SetSize(ULONG width, ULONG height) {
    if (HRESULT hr = sdk::CheckHostFault("IGWImageSetup::SetSize"); FAILED(hr))
        return hr;
    return Reshape(width, height, format_);
}

HRESULT Image::Reshape(ULONG width, ULONG height, const GUID& format) {
    std::size_t size = GWPixelFormatSize(format);
    if (!size || width > kMaxSide || height > kMaxSide)
        return E_INVALIDARG;
    return ExportBoundary([&] {
        pixels_.assign(std::size_t{width} * height * size, 0);
        width_ = width;
        height_ = height;
        format_ = format;
        return S_OK;
    });
}

HRESULT MakeImage(IUnknown** made) {
    CGWCOMObject* image = new (std::nothrow) Image();
    *made = image;
    return image ? S_OK : E_OUTOFMEMORY;
}

} // namespace ut::host
