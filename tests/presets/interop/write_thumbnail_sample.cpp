// Writes the scene file that the thumbnail interoperability tests read with standard tools: a
// summary stream with a code page and a title, laid out as another program writes one, then the
// library's thumbnail of a rendered view of a small scene put in beside them.
#include <cstdint>
#include <cstdio>
#include <string>

#include <ut/host/reference_host.h>
#include <ut/paths.h>
#include <ut/platform/text.h>
#include <ut/presets.h>
#include <ut/sdk/thumbnails.h>

namespace {

std::string Le(std::uint32_t value) {
    return {char(value), char(value >> 8), char(value >> 16), char(value >> 24)};
}

// One summary set: code page 1252 (a short) and the title "Shot 10" (an 8-bit string).
std::string TitledSummary() {
    const std::string fmtid("\xE0\x85\x9F\xF2\xF9\x4F\x68\x10\xAB\x91\x08\x00\x2B\x27\xB3\xD9", 16);
    std::string set = Le(48) + Le(2) + Le(1) + Le(24) + Le(2) + Le(32) + Le(2) + Le(1252) + Le(30) + Le(8) +
                      std::string("Shot 10\0", 8);
    return std::string("\xFE\xFF\0\0\x06\0\x02\0", 8) + std::string(16, '\0') + Le(1) + fmtid + Le(48) + set;
}

bool WriteScene(const std::wstring& path) {
    ut::ComPtr<IStorage> storage;
    ut::ComPtr<ILockBytes> bytes;
    ut::ComPtr<IStream> stream;
    const std::string summary = TitledSummary();
    constexpr DWORD kCreate = STGM_CREATE | STGM_READWRITE | STGM_SHARE_EXCLUSIVE;
    return SUCCEEDED(F3DOpenStorageOnFile(path.c_str(), kCreate, 1, storage.Put(), bytes.Put())) &&
           SUCCEEDED(storage->CreateStream(kGWSummaryInformationStream, kCreate, 0, 0, stream.Put())) &&
           SUCCEEDED(stream->Write(summary.data(), static_cast<ULONG>(summary.size()), nullptr)) &&
           SUCCEEDED(storage->Commit(STGC_DEFAULT));
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fprintf(stderr, "usage: %s FILE\n", argv[0]);
        return 2;
    }
    std::wstring path = ut::platform::WideFromUtf8(argv[1]);
    if (!WriteScene(path)) {
        std::fprintf(stderr, "%s: the scene file could not be written\n", argv[1]);
        return 1;
    }
    ut::host::Settings settings{.thumbnailRender = true};
    settings.scene.objects = {{.name = L"Robot", .children = {{.name = L"Arm"}}}, {.name = L"Light"}};
    ut::host::ReferenceHost host(settings);
    HRESULT hr = KXPutThumnailInFile(CKXString(path.c_str()));
    if (hr != S_OK) {
        std::fprintf(stderr, "%s: the thumbnail did not go in (0x%08lX)\n", argv[1],
                     static_cast<unsigned long>(hr));
        return 1;
    }
    return 0;
}
