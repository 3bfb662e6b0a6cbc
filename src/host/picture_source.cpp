// The reference host's scene viewer, its picture source, and the view of the scene it renders.
#include "picture_source.h"

#include <algorithm>
#include <cstdint>
#include <new>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/testing.h>

#include "host_support.h"
#include "image_library.h"

namespace ut::host {
namespace {

struct Box {
    std::wstring name;
    int depth;
};

void CollectBoxes(const std::vector<ObjectDescription>& objects, int depth, std::vector<Box>& boxes) {
    for (const ObjectDescription& object : objects) {
        if (object.hidden)
            continue;
        boxes.push_back({object.name, depth});
        CollectBoxes(object.children, depth + 1, boxes);
    }
}

// A colour that stays the same for a name from run to run (a small multiplicative hash).
std::uint32_t ColourOf(const std::wstring& name) {
    std::uint32_t hash = 2166136261u;
    for (wchar_t c : name)
        hash = (hash ^ static_cast<std::uint32_t>(c)) * 16777619u;
    return hash;
}

void Fill(std::vector<std::uint8_t>& pixels, ULONG x0, ULONG y0, ULONG x1, ULONG y1,
          const std::uint8_t rgba[4]) {
    for (ULONG y = y0; y < y1 && y < kRenderHeight; ++y)
        for (ULONG x = x0; x < x1 && x < kRenderWidth; ++x)
            for (int c = 0; c < 4; ++c)
                pixels[(std::size_t{y} * kRenderWidth + x) * 4 + static_cast<std::size_t>(c)] = rgba[c];
}

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> SceneViewer::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<SceneViewer, IGWSceneViewer>(IID_IGWSceneViewer)};
    return map;
}

PictureSource::PictureSource(const Settings& settings)
    : file_(settings.thumbnailImage), scene_(settings.scene) {}

std::span<const CGWCOMObject::InterfaceEntry> PictureSource::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<PictureSource, IGWPictureSource>(IID_IGWPictureSource)};
    return map;
}

HRESULT PictureSource::GetImage(ULONG index, IGWImage** image) {
    if (!image)
        return E_POINTER;
    *image = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWPictureSource::GetImage"); FAILED(hr))
        return hr;
    if (index != 0)
        return E_INVALIDARG;
    if (file_.empty())
        return RenderScene(scene_, image);
    ut::ComPtr<IGWImageLoader> loader;
    if (HRESULT hr = KXGetImageLoader(loader.Put()); FAILED(hr))
        return hr;
    return loader->LoadFile(file_.c_str(), image);
}

HRESULT RenderScene(const SceneDescription& scene, IGWImage** image) {
    return ExportBoundary([&] {
        std::vector<std::uint8_t> pixels(std::size_t{kRenderWidth} * kRenderHeight * 4);
        for (ULONG y = 0; y < kRenderHeight; ++y) {
            auto shade = [y](int top, int bottom) {
                return static_cast<std::uint8_t>(top + (bottom - top) * static_cast<int>(y) /
                                                           static_cast<int>(kRenderHeight - 1));
            };
            const std::uint8_t sky[] = {shade(30, 170), shade(50, 190), shade(110, 220), 255};
            Fill(pixels, 0, y, kRenderWidth, y + 1, sky);
        }
        std::vector<Box> boxes;
        CollectBoxes(scene.objects, 0, boxes);
        if (!boxes.empty()) {
            ULONG column = (kRenderWidth - 8) / static_cast<ULONG>(boxes.size());
            for (std::size_t i = 0; i < boxes.size() && column > 2; ++i) {
                std::uint32_t colour = ColourOf(boxes[i].name);
                const std::uint8_t fill[] = {static_cast<std::uint8_t>(colour),
                                             static_cast<std::uint8_t>(colour >> 8),
                                             static_cast<std::uint8_t>(colour >> 16), 255};
                auto left = static_cast<ULONG>(4 + i * column + 1);
                ULONG top = kRenderHeight / 4 + std::min<ULONG>(static_cast<ULONG>(boxes[i].depth) * 12, 60);
                Fill(pixels, left, top, left + column - 2, kRenderHeight - 8, fill);
            }
        }
        *image = new Image(kRenderWidth, kRenderHeight, GWPIXELFORMAT_RGBA32, std::move(pixels));
        return S_OK;
    });
}

std::vector<std::pair<CLSID, ut::ComPtr<IUnknown>>> PictureServices(const Settings& settings) {
    if (settings.thumbnailImage.empty() && !settings.thumbnailRender)
        return {};
    // A service that could not be made goes in as null, which the installation reports.
    auto made = [](CGWCOMObject* service) { return ut::ComPtr<IUnknown>::Adopt(service); };
    return {{CLSID_GWSceneViewer, made(new (std::nothrow) SceneViewer(settings))},
            {CLSID_GWPictureSource, made(new (std::nothrow) PictureSource(settings))}};
}

} // namespace ut::host
