// The reference host's images: pixels in memory of one of the image library's four formats, shaped
// by whoever makes them, and the creatable image class (CLSID_GWImage).
#pragma once

#include <cstdint>
#include <vector>

#include <ut/sdk/comobject.h>
#include <ut/sdk/image.h>

namespace ut::host {

class Image final : public ut::sdk::ComObject<IGWImage, IGWImageSetup> {
public:
    // A 0 x 0 image of the 4-byte colour format, as the image class makes them.
    Image() = default;
    Image(ULONG width, ULONG height, const GUID& format, std::vector<std::uint8_t> pixels)
        : width_(width), height_(height), format_(format), pixels_(std::move(pixels)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetSize(ULONG* width, ULONG* height) override;
    HRESULT STDMETHODCALLTYPE GetPixelFormat(GUID* format) override;
    HRESULT STDMETHODCALLTYPE GetPixels(void** pixels) override;
    HRESULT STDMETHODCALLTYPE SetPixelFormat(REFGUID format) override;
    HRESULT STDMETHODCALLTYPE SetSize(ULONG width, ULONG height) override;

private:
    // New pixels, all 0, for the current shape.
    HRESULT Reshape(ULONG width, ULONG height, const GUID& format);

    ULONG width_ = 0, height_ = 0;
    GUID format_ = GWPIXELFORMAT_RGBA32;
    std::vector<std::uint8_t> pixels_;
};

// The image class's factory function: a new empty image.
HRESULT MakeImage(IUnknown** made);

} // namespace ut::host
