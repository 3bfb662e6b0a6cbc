// The application's preset manager, the favourite folder and family command of a class, and
// paths resolved through the host's file-path object.
#include <ut/sdk/presets.h>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/paths.h>
#include <ut/sdk/scene.h>

namespace {

HRESULT Resolve(const CKXString& path, CKXString& resolved) {
    resolved = L"";
    ut::ComPtr<IGWFilePath> file;
    if (HRESULT hr = KXCreateInstance(CLSID_GWFilePath, IID_IGWFilePath, file.PutVoid()); FAILED(hr))
        return hr;
    if (HRESULT hr = file->SetPath(path); FAILED(hr))
        return hr;
    wchar_t* text = nullptr;
    HRESULT hr = file->GetResolvedPath(&text);
    if (FAILED(hr)) {
        CoTaskMemFree(text);
        return hr;
    }
    resolved.Attach_OLE(text);
    return S_OK;
}

} // namespace

HRESULT GWGetPresetManager(IGWPresetManager** manager) {
    if (!manager)
        return E_POINTER;
    return GWQueryGenericObject(CLSID_3DSceneManagerFactory, IID_IGWPresetManager,
                                reinterpret_cast<void**>(manager));
}

HRESULT GWGetFavoritePresetPath(REFCLSID clsid, wchar_t** folder) {
    if (!folder)
        return E_POINTER;
    *folder = nullptr;
    ut::ComPtr<IGWPresetManager> manager;
    if (HRESULT hr = GWGetPresetManager(manager.Put()); FAILED(hr))
        return hr;
    HRESULT hr = manager->GetFavoriteFolder(clsid, folder);
    if (FAILED(hr)) {
        CoTaskMemFree(*folder);
        *folder = nullptr;
    }
    return hr;
}

HRESULT GWGetFamilyCommand(REFCLSID clsid, CLSID* command) {
    if (!command)
        return E_POINTER;
    *command = GUID_NULL;
    ut::ComPtr<IGWPresetManager> manager;
    if (HRESULT hr = GWGetPresetManager(manager.Put()); FAILED(hr))
        return hr;
    return manager->GetFamilyCommand(clsid, command);
}

HRESULT CKXPathHelper::GetResolvedPath(const CKXString& path, CKXString& resolved) {
    return ut::ExportBoundary([&] {
        HRESULT hr = Resolve(path, resolved);
        return FAILED(hr) ? hr : KXIsFileExist(resolved) ? S_OK : S_FALSE;
    });
}

HRESULT CKXPathHelper::GetResolvedPathNoIO(const CKXString& path, CKXString& resolved) {
    return ut::ExportBoundary([&] { return Resolve(path, resolved); });
}
