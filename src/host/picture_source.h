// The reference host's scene viewer and its picture source: the picture of the scene that
// thumbnails are made from, an image file or a rendered view of the reference scene.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/thumbnails.h>

namespace ut::host {

class SceneViewer final : public ut::sdk::ComObject<IGWSceneViewer> {
public:
    explicit SceneViewer(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;
};

// Picture 0 is, on every request, the image file read anew (with the host's image loader) or
// the scene rendered anew.
class PictureSource final : public ut::sdk::ComObject<IGWPictureSource> {
public:
    explicit PictureSource(const Settings& settings);

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetImage(ULONG index, IGWImage** image) override;

private:
    std::wstring file_;
    SceneDescription scene_;
};

// The rendered view: kRenderWidth x kRenderHeight, 4-byte colour, a vertical gradient from
// dark blue at the top to pale blue at the bottom, and each visible object of the scene, depth
// first, a box of a colour drawn from its name standing in one row, deeper objects shorter.
inline constexpr ULONG kRenderWidth = 160;
inline constexpr ULONG kRenderHeight = 120;
HRESULT RenderScene(const SceneDescription& scene, IGWImage** image);

// The viewer and the picture source under their class ids, or nothing when the settings give
// no picture.
std::vector<std::pair<CLSID, ut::ComPtr<IUnknown>>> PictureServices(const Settings& settings);

} // namespace ut::host
