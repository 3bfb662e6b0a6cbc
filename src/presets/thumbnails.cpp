// A 64 x 64 picture of the current scene, as a device bitmap or inside a scene file.
#include <ut/presets.h>

#include <ut/paths.h>
#include <ut/platform/bitmap.h>
#include <ut/sdk/image.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/thumbnails.h>

namespace {

using ut::ComPtr;

constexpr ULONG kThumbnailSide = 64;
// The scene file is ours alone while the picture goes in.
constexpr unsigned long kOpenForUpdate = STGM_READWRITE | STGM_SHARE_EXCLUSIVE;

// The application's picture source: its scene viewer first, then the source itself.
HRESULT FindPictureSource(ComPtr<IGWPictureSource>& source) {
    ComPtr<IGWSceneViewer> viewer;
    if (HRESULT hr = GWQueryGenericObject(CLSID_GWSceneViewer, IID_IGWSceneViewer, viewer.PutVoid());
        FAILED(hr))
        return hr;
    return GWQueryGenericObject(CLSID_GWPictureSource, IID_IGWPictureSource, source.PutVoid());
}

// One scale for both axes that fits the picture inside the thumbnail, aspect kept.
double FitScale(ULONG width, ULONG height) {
    double scale = kThumbnailSide / static_cast<double>(width);
    double vertical = kThumbnailSide / static_cast<double>(height);
    return vertical <= scale ? vertical : scale;
}

// An empty thumbnail-sized image of the 4-byte colour format; the library's failure as it came.
HRESULT CreateThumbnailImage(ComPtr<IGWImage>& image) {
    ComPtr<IGWImageSetup> setup;
    HRESULT hr = kxILCreateImage(nullptr, CLSID_GWImage, image.Put());
    if (SUCCEEDED(hr))
        hr = image.As(setup);
    if (SUCCEEDED(hr))
        hr = setup->SetPixelFormat(GWPIXELFORMAT_RGBA32);
    if (SUCCEEDED(hr))
        hr = setup->SetSize(kThumbnailSide, kThumbnailSide);
    return hr;
}

} // namespace

HRESULT KXIsThumbnailAvaiable(int* available) {
    if (!available)
        return E_POINTER;
    ComPtr<IGWPictureSource> source;
    *available = SUCCEEDED(FindPictureSource(source)) && source ? 1 : 0;
    return S_OK;
}

HRESULT KXGetThumbnail(HBITMAP* bitmap) {
    if (!bitmap)
        return E_POINTER;
    *bitmap = nullptr;
    ComPtr<IGWPictureSource> source;
    ComPtr<IGWImage> picture, target;
    ULONG width = 0, height = 0;
    if (FAILED(FindPictureSource(source)) || !source || FAILED(source->GetImage(0, picture.Put())) ||
        !picture || FAILED(picture->GetSize(&width, &height)) || !width || !height)
        return E_FAIL;
    if (HRESULT hr = CreateThumbnailImage(target); FAILED(hr))
        return hr;
    double scale = FitScale(width, height);
    ut::platform::UniqueBitmap made;
    if (FAILED(kxILScaleTranslateImage(picture.Get(), target.Get(), scale, scale, 0.0, 0.0,
                                       KXIL_INTERPOLATE_BILINEAR)) ||
        FAILED(KXImageHlp::CreateBitmapFromImage(target.Get(), made.Put())) || !made.Get())
        return E_FAIL;
    *bitmap = made.Detach();
    return S_OK;
}

HRESULT KXPutThumnailInFile(const CKXString& fileName) {
    ComPtr<IStorage> storage;
    ComPtr<ILockBytes> lockBytes;
    ComPtr<IGWImage> image;
    {
        ut::platform::UniqueBitmap bitmap;
        // No picture is no reason to refuse the save: the file simply gets no thumbnail.
        if (FAILED(KXGetThumbnail(bitmap.Put())) ||
            FAILED(GWGetGwImageFromThumbnail(bitmap.Get(), kThumbnailSide, kThumbnailSide,
                                             GWPIXELFORMAT_RGBA32, image.Put())))
            return S_FALSE;
    }
    if (HRESULT hr = F3DOpenStorageOnFile(fileName, kOpenForUpdate, 0, storage.Put(), lockBytes.Put());
        FAILED(hr))
        return hr;
    return GWSetThumbnail(image.Get(), storage.Get());
}
