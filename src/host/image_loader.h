// The reference host's image library: images in memory and a loader of BMP files, as
// ut/sdk/image.h describes.
#pragma once

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/image.h>

namespace ut::host {

class ImageLoader final : public ut::sdk::ComObject<IGWImageLoader> {
public:
    explicit ImageLoader(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE LoadFile(const wchar_t* path, IGWImage** image) override;
    HRESULT STDMETHODCALLTYPE CreateImage(ULONG width, ULONG height, REFGUID format, const void* pixels,
                                          IGWImage** image) override;
};

} // namespace ut::host
