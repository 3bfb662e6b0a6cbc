// The install locations and the project manager as the library reaches them.
#include <ut/platform/detail/boundary.h>
#include <ut/platform/files.h>
#include <ut/sdk/locations.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/paths.h>

namespace {

// One folder from the host: S_OK with it, S_FALSE when empty.
HRESULT Location(GWLocation kind, ULONG index, CKXString& path) {
    return ut::ExportBoundary([&] {
        path = L"";
        ut::ComPtr<IGWInstallLocations> locations;
        if (HRESULT hr =
                GWQueryGenericObject(CLSID_GWProjectManager, IID_IGWInstallLocations, locations.PutVoid());
            FAILED(hr))
            return hr;
        wchar_t* text = nullptr;
        HRESULT hr = locations->GetLocation(kind, index, &text);
        path.Attach_OLE(text);
        if (FAILED(hr))
            return hr;
        return path.Length() ? S_OK : S_FALSE;
    });
}

} // namespace

HRESULT GWGetIGWProjectManager(IGWProjectManager** manager) {
    if (!manager)
        return E_POINTER;
    return GWQueryGenericObject(CLSID_GWProjectManager, IID_IGWProjectManager,
                                reinterpret_cast<void**>(manager));
}

HRESULT KXGetUserPath(CKXString& path) {
    return Location(GWLOCATION_USER, 0, path);
}

HRESULT KXGetDefaultWorkgroupPath(CKXString& path) {
    return Location(GWLOCATION_WORKGROUP, 0, path);
}

HRESULT KXGetAddonsPath(CKXString& path, bool user) {
    return Location(user ? GWLOCATION_USER_ADDONS : GWLOCATION_ADDONS, 0, path);
}

HRESULT KXGetFactoryResourcePath(CKXString& path) {
    if (HRESULT hr = KXGetFactoryPath(path); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        path += L"\\Resources";
        return S_OK;
    });
}

HRESULT CKXRootLocationMgr::GetRootLocationPath(int kind, CKXString& path) {
    switch (kind) {
    case 0:
        return KXGetFactoryPath(path);
    case 1:
        return KXGetUserPath(path);
    case 2:
        return KXGetDefaultWorkgroupPath(path);
    case 3:
        return Location(GWLOCATION_SITE, 0, path);
    default:
        path = L"";
        return E_INVALIDARG;
    }
}

HRESULT CKXRootLocationMgr::GetWorkgroupPaths(int which, std::vector<CKXString>& paths) {
    return ut::ExportBoundary([&] {
        for (ULONG index = which < 0 ? 0 : static_cast<ULONG>(which);; ++index) {
            CKXString path;
            HRESULT hr = Location(GWLOCATION_WORKGROUP, index, path);
            if (hr != S_OK)
                return SUCCEEDED(hr) ? S_OK : hr;
            paths.push_back(path);
            if (which >= 0)
                return S_OK;
        }
    });
}

int KXaccess(const wchar_t* path, int mode) {
    return _waccess(path, mode);
}
