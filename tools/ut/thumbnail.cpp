// ut thumbnail put | get: a scene file's thumbnail made from an image (or from a rendered view of
// the sample scene) on the reference host, and read back as a BMP file.
#include <cstdio>
#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include <ut/host/reference_host.h>
#include <ut/paths.h>
#include <ut/platform/text.h>
#include <ut/presets.h>
#include <ut/sdk/thumbnails.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct ThumbnailOptions {
    std::string scene;
    std::string image; // put: the picture; get: the BMP file to write
};

void Put(const ThumbnailOptions& options) {
    ut::host::Settings settings;
    if (options.image.empty()) {
        settings.scene = SampleScene();
        settings.thumbnailRender = true;
    } else {
        settings.thumbnailImage = platform::WideFromUtf8(options.image);
    }
    ut::host::ReferenceHost host(settings);
    if (FAILED(host.Status()))
        Fail(kExitUsage, "the reference host did not start");
    HRESULT hr = KXPutThumnailInFile(CKXString(platform::WideFromUtf8(options.scene).c_str()));
    if (hr == S_FALSE)
        Fail(kExitUsage, options.image + ": not an image the host can read");
    if (FAILED(hr))
        Fail(kExitUsage, options.scene + ": not a compound file that can be updated");
    std::printf("%s: thumbnail 64x64 from %s\n", options.scene.c_str(),
                options.image.empty() ? "the sample scene" : options.image.c_str());
}

void Get(const ThumbnailOptions& options) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IStorage> storage;
    ut::ComPtr<ILockBytes> bytes;
    ut::ComPtr<IGWImage> image;
    std::wstring scene = platform::WideFromUtf8(options.scene);
    if (FAILED(F3DOpenStorageOnFile(scene.c_str(), STGM_READ | STGM_SHARE_EXCLUSIVE, 0, storage.Put(),
                                    bytes.Put())))
        Fail(kExitUsage, options.scene + ": not a compound file");
    HRESULT hr = GWGetThumbnail(storage.Get(), image.Put());
    if (hr == S_FALSE)
        Fail(kExitNo, options.scene + ": no thumbnail");
    if (FAILED(hr))
        Fail(kExitUsage, options.scene + ": the thumbnail cannot be read");
    ULONG width = 0, height = 0;
    platform::UniqueBitmap bitmap;
    hr = image->GetSize(&width, &height);
    if (SUCCEEDED(hr))
        hr = KXImageHlp::CreateBitmapFromImage(image.Get(), bitmap.Put());
    if (SUCCEEDED(hr))
        hr = platform::WriteBitmapFile(bitmap.Get(), platform::WideFromUtf8(options.image).c_str());
    if (FAILED(hr))
        Fail(kExitUsage, options.image + ": the bitmap could not be written");
    std::printf("%s %lux%lu\n", options.image.c_str(), static_cast<unsigned long>(width),
                static_cast<unsigned long>(height));
}

} // namespace

void AddThumbnailCommand(CLI::App& app) {
    CLI::App* thumbnail =
        app.add_subcommand("thumbnail", "Put a 64x64 thumbnail into a scene file, or get it out.");
    thumbnail->require_subcommand(1);
    auto options = std::make_shared<ThumbnailOptions>();
    CLI::App* put = thumbnail->add_subcommand(
        "put", "Write IMAGE (a BMP file), fitted into 64x64, as the thumbnail of the compound file SCENE.");
    put->add_option("SCENE", options->scene, "an existing compound file")->required();
    put->add_option("IMAGE", options->image, "the picture; without it, a rendered view of the sample scene");
    put->callback([options] { Put(*options); });
    CLI::App* get = thumbnail->add_subcommand("get", "Write the thumbnail of SCENE as the BMP file OUT.");
    get->add_option("SCENE", options->scene, "a compound file")->required();
    get->add_option("OUT", options->image, "the BMP file to write")->required();
    get->callback([options] { Get(*options); });
    thumbnail->footer(
        "The thumbnail is the summary-information picture that file managers show. Exit status 1 "
        "when SCENE has none.\nExample:\n  ut thumbnail put shot.scn plate.bmp\n  shot.scn: thumbnail "
        "64x64 from plate.bmp\n  ut thumbnail get shot.scn shot.bmp\n  shot.bmp 64x64");
}

} // namespace ut::tool
