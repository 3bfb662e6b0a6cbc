// What the running host says about itself, turned into the version codes that loaders test.
#include <memory>
#include <string_view>

#include <ut/persist.h>
#include <ut/sdk/ambient.h>
#include <ut/sdk/database.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/version.h>

#include "module/state.h"

namespace ut::persist {
namespace {

using TaskText = std::unique_ptr<wchar_t, ut::TaskMemDeleter>;

// One string of the host's version information, or null when the host does not have it.
TaskText HostVersionString(IGWVersionInfo* info, ULONG index) {
    wchar_t* text = nullptr;
    if (!info || info->GetVersionString(index, &text) != S_OK)
        return nullptr;
    return TaskText(text);
}

// The last build of major version 2000 that wrote each revision, oldest first; a newer build
// falls through to ePersistedVersion1511.
struct BuildBound {
    std::wstring_view lastBuild;
    tagVersion version;
};
constexpr BuildBound kBuildBounds[] = {
    {L"0901", ePersistedVersion1500},
    {L"1023", ePersistedVersion1510},
    {L"1109", ePersistedVersion1520},
};

// Builds are compared as text, code unit by code unit, as the host writes them (four digits).
tagVersion VersionOfBuild(std::wstring_view build) {
    for (const BuildBound& bound : kBuildBounds)
        if (build.compare(bound.lastBuild) <= 0)
            return bound.version;
    return ePersistedVersion1511;
}

} // namespace
} // namespace ut::persist

tagVersion F3DGetVersionPersisted(HRESULT openResult, ULONG) {
    using namespace ut::persist;
    ut::ComPtr<IGWVersionInfo> info;
    GWQueryGenericObject(CLSID_GWVersionInfo, IID_IGWVersionInfo, info.PutVoid());
    TaskText build = HostVersionString(info.Get(), GWVERSION_BUILD);
    if (openResult == STG_E_INVALIDHEADER)
        return ePersistedVersion1000;
    TaskText major = HostVersionString(info.Get(), GWVERSION_MAJOR);
    if (!major || std::wstring_view(major.get()) != L"2000")
        return ePersistedVersion1531;
    if (!build)
        return ePersistedVersion1511;
    return VersionOfBuild(build.get());
}

HRESULT F3DGetVersionIdFromMode(ULONG& versionId) {
    if (!ut::module::Loaded())
        return E_UNEXPECTED;
    ut::ComPtr<IGWAmbientValues> ambient;
    if (HRESULT hr = KXGetAmbientValuesMgr(ambient.Put()); FAILED(hr))
        return hr;
    LONG mode = 0;
    if (HRESULT hr = ambient->GetInt(L"context.constructionmode", &mode); FAILED(hr))
        return hr;
    // Construction modes 0 to 3 are written by version ids 3 to 6.
    constexpr LONG kModes = 4;
    constexpr ULONG kFirstVersionId = 3;
    if (mode >= 0 && mode < kModes)
        versionId = kFirstVersionId + static_cast<ULONG>(mode);
    return S_OK;
}

int IsCurrentActiveDBMode(ULONG mode) {
    ut::ComPtr<IGWActiveDatabase> database;
    if (FAILED(GWQueryGenericObject(CLSID_GWActiveDatabase, IID_IGWActiveDatabase, database.PutVoid())))
        return 0;
    ULONG current = 0;
    if (FAILED(database->GetCurrentMode(&current)))
        return 0;
    return current == mode ? 1 : 0;
}
