// A short tour of the library on the reference host.
#include <cstdio>
#include <string>

#include <ut/host/reference_host.h>
#include <ut/platform/process.h>
#include <ut/platform/stream.h>
#include <ut/platform/text.h>
#include <ut/sdk/resources.h>
#include <ut/ut.h>

#include "commands.h"

namespace ut::tool {
namespace {

std::string Narrow(const std::wstring& text) { return ut::platform::Utf8FromWide(text); }

int ShowModule() {
    HINSTANCE library = KXDictFindInstance(L"QVXUT");
    if (!library) {
        std::printf("module      the library did not register its dictionary: it failed to load\n");
        return 1;
    }
    wchar_t key[260];
    if (GWResourceConstructRegKey(library, L"", key, 260) != ERROR_SUCCESS) {
        std::printf("module      no registry base key\n");
        return 1;
    }
    std::printf("module      %s\n", Narrow(ut::platform::ModuleFileName(library)).c_str());
    std::printf("base key    HKEY_LOCAL_MACHINE\\%s\n", Narrow(key).c_str());
    std::printf("features    scene format version %u\n",
                static_cast<unsigned>(g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureCurrent]));
    return 0;
}

int ShowGuidRoundTrip() {
    constexpr GUID compressor = {0x1C36C8C0, 0xA6A4, 0x11D3, {0xB4, 0xB3, 0x00, 0xA0, 0x24, 0x4E, 0xEB, 0x76}};
    std::wstring text = ut::GuidToString(compressor);
    GUID back{};
    bool same = SUCCEEDED(ut::ParseGuid(text.c_str(), &back)) && IsEqualGUID(back, compressor);
    std::printf("guid        %s -> %s\n", Narrow(text).c_str(), same ? "same GUID back" : "MISMATCH");
    return same ? 0 : 1;
}

int ShowStreamRoundTrip() {
    ut::ComPtr<IStream> stream;
    const char payload[] = "scene data";
    if (FAILED(ut::platform::CreateMemoryStream(stream.Put())) ||
        FAILED(stream->Write(payload, sizeof payload - 1, nullptr)))
        return 1;
    LARGE_INTEGER start{};
    stream->Seek(start, STREAM_SEEK_SET, nullptr);
    char back[sizeof payload] = {};
    ULONG read = 0;
    stream->Read(back, sizeof payload - 1, &read);
    std::printf("stream      wrote %u bytes, read back \"%s\"\n", static_cast<unsigned>(read), back);
    return std::string(back) == payload ? 0 : 1;
}

} // namespace

int Demo(const Arguments&) {
    ut::host::ReferenceHost host;
    if (FAILED(host.Status())) {
        std::fprintf(stderr, "ut: the reference host did not start\n");
        return 1;
    }
    int failures = ShowModule() + ShowGuidRoundTrip() + ShowStreamRoundTrip();
    return failures ? 1 : 0;
}

} // namespace ut::tool
