// Puts arbitrary bytes in a compound file as its summary-information stream, then reads the
// thumbnail, writes a new one over it and reads again. Nothing may crash or read outside the
// input; a refusal must be a documented one, and a thumbnail that was written must read back.
#include <cstdint>
#include <cstdlib>

#include <ut/host/reference_host.h>
#include <ut/platform/storage.h>
#include <ut/sdk/image.h>
#include <ut/sdk/thumbnails.h>

namespace {

constexpr DWORD kExclusive = STGM_READWRITE | STGM_SHARE_EXCLUSIVE;

bool IsDocumentedRefusal(HRESULT hr) {
    return hr == STG_E_INVALIDHEADER || hr == E_NOTIMPL || hr == E_OUTOFMEMORY;
}

// The summary stream as given, in a new compound file in memory.
HRESULT StorageWithSummary(const std::uint8_t* data, std::size_t size, ut::ComPtr<IStorage>& storage) {
    ut::ComPtr<ILockBytes> bytes;
    ut::ComPtr<IStream> summary;
    HRESULT hr = CreateILockBytesOnHGlobal(nullptr, TRUE, bytes.Put());
    if (SUCCEEDED(hr))
        hr = StgCreateDocfileOnILockBytes(bytes.Get(), STGM_CREATE | kExclusive, 0, storage.Put());
    if (SUCCEEDED(hr))
        hr =
            storage->CreateStream(kGWSummaryInformationStream, STGM_CREATE | kExclusive, 0, 0, summary.Put());
    if (SUCCEEDED(hr))
        hr = summary->Write(data, static_cast<ULONG>(size), nullptr);
    return hr;
}

// A 3 x 2 picture to write over whatever the stream holds.
HRESULT SmallImage(ut::ComPtr<IGWImage>& image) {
    const std::uint32_t pixels[6] = {0xFF0000FF, 0xFF00FF00, 0xFFFF0000, 0xFFFFFFFF, 0xFF000000, 0xFF808080};
    ut::ComPtr<IGWImageLoader> loader;
    HRESULT hr = KXGetImageLoader(loader.Put());
    return SUCCEEDED(hr) ? loader->CreateImage(3, 2, GWPIXELFORMAT_RGBA32, pixels, image.Put()) : hr;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static const ut::host::ReferenceHost host; // the image library's classes, for the whole run
    ut::ComPtr<IStorage> storage;
    ut::ComPtr<IGWImage> image;
    if (size > (1u << 20) || FAILED(StorageWithSummary(data, size, storage)))
        return 0;
    if (FAILED(SmallImage(image)))
        std::abort(); // the host's image library is always there
    ut::ComPtr<IGWImage> found;
    HRESULT read = GWGetThumbnail(storage.Get(), found.Put());
    if (FAILED(read) && !IsDocumentedRefusal(read))
        std::abort();
    HRESULT written = GWSetThumbnail(image.Get(), storage.Get());
    if (FAILED(written) && !IsDocumentedRefusal(written))
        std::abort();
    if (FAILED(written))
        return 0;
    ut::ComPtr<IGWImage> back;
    ULONG width = 0, height = 0;
    if (GWGetThumbnail(storage.Get(), back.Put()) != S_OK || FAILED(back->GetSize(&width, &height)) ||
        width != 3 || height != 2)
        std::abort(); // what was just written must read back
    return 0;
}
