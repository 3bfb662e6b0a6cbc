// Install paths and file helpers over the host's locations, preferences, plug-in registry and
// application object, and structured storage on a file.
#include <ut/paths.h>

#include <algorithm>
#include <cstring>
#include <cwctype>

#include <ut/detail/names.h>
#include <ut/platform/detail/boundary.h>
#include <ut/platform/files.h>
#include <ut/platform/text.h>
#include <ut/sdk/locations.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/preferences.h>
#include <ut/sdk/storage.h>

#include "module/state.h"

namespace {

constexpr DWORD kDeleteOnRelease = 0x4000000;

HRESULT NotEmpty(const CKXString& path) {
    return path.Length() ? S_OK : S_FALSE;
}

// The active project's folder; `path` stays empty without one.
HRESULT ActiveProject(CKXString& path) {
    ut::ComPtr<IGWProjectManager> manager;
    if (HRESULT hr = GWGetIGWProjectManager(manager.Put()); FAILED(hr))
        return hr;
    GWProjectInfo* project = nullptr;
    if (HRESULT hr = manager->GetActiveProject(&project); FAILED(hr))
        return hr;
    path = project->path;
    // An empty folder answers at once, as the application's own helper always has.
    if (!path.Length())
        return S_FALSE;
    if (HRESULT hr = manager->ReleaseProject(project); FAILED(hr))
        return hr;
    return S_OK;
}

HRESULT WorkgroupAddons(const CKXString& workgroup, CKXString& path) {
    path = workgroup.Length() ? workgroup + L"\\" + L"Addons" : workgroup;
    return NotEmpty(path);
}

HRESULT OneFolder(tagE3D_INSTALL_PATH_TYPE type, CKXString& path) {
    path = L"";
    switch (type) {
    case E3D_INSTALL_PATH_PROJECT:
        return ActiveProject(path);
    case E3D_INSTALL_PATH_USER:
        (void)KXGetUserPath(path); // an unanswered folder is an empty one
        break;
    case E3D_INSTALL_PATH_WORKGROUP:
        (void)KXGetDefaultWorkgroupPath(path); // as above
        break;
    case E3D_INSTALL_PATH_ROOT_LOCATION:
        (void)CKXRootLocationMgr::GetRootLocationPath(3, path); // as above
        break;
    case E3D_INSTALL_PATH_ADDONS:
        (void)KXGetAddonsPath(path, false); // as above
        break;
    case E3D_INSTALL_PATH_USER_ADDONS:
        (void)KXGetAddonsPath(path, true); // as above
        break;
    case E3D_INSTALL_PATH_WORKGROUP_ADDONS: {
        CKXString workgroup;
        (void)KXGetDefaultWorkgroupPath(workgroup); // as above
        return WorkgroupAddons(workgroup, path);
    }
    case E3D_INSTALL_PATH_NONE:
        break;
    }
    return NotEmpty(path);
}

std::wstring Preference(const wchar_t* name) {
    ut::ComPtr<IGWPreferences> preferences;
    if (FAILED(KXGetPreferencesMgr(preferences.Put())))
        return {};
    wchar_t* text = nullptr;
    (void)preferences->GetText(name, &text); // a preference never set reads as empty
    std::wstring value = text ? text : L"";
    CoTaskMemFree(text);
    return value;
}

ut::ComPtr<IGWApplication> ApplicationObject() {
    ut::ComPtr<IGWApplication> application;
    (void)GWQueryGenericObject(CLSID_GWApplication, IID_IGWApplication,
                               application.PutVoid()); // null without
    return application;
}

bool Started(IGWApplication* application) {
    LONG started = 0;
    return SUCCEEDED(application->GetStateFlag(GWAPP_STATE_STARTED, &started)) && started == 1;
}

char* LookForRecoveryFile(IGWApplication* application) {
    using Recovery = ut::module::FileState::Recovery;
    ut::module::FileState& files = ut::module::Files();
    if (files.recovery != Recovery::NotLooked) {
        if (!Started(application))
            return nullptr;
        return files.recovery == Recovery::Found ? files.recoveryFile : nullptr;
    }
    GWSaveType save{};
    GWLoadType load{};
    if (FAILED(KXGetCurrentGWSavingState(&save, &load)) || load == GWLOAD_NORECOVERY) {
        files.recovery = Recovery::None;
        return nullptr;
    }
    std::wstring name = Preference(L"data_management.load_recovery_filename");
    if (name.empty()) {
        files.recovery = Recovery::None;
        return nullptr;
    }
    files.recovery = Recovery::Found;
    // Cut to the buffer: a longer name could never be a file to open.
    std::string narrow = ut::platform::Utf8FromWide(name);
    std::size_t length = std::min(narrow.size(), sizeof files.recoveryFile - 1);
    std::memcpy(files.recoveryFile, narrow.data(), length);
    files.recoveryFile[length] = '\0';
    return Started(application) ? files.recoveryFile : nullptr;
}

} // namespace

HRESULT KXGetInstallPath(tagE3D_INSTALL_PATH_TYPE type, CKXString& path) {
    if (static_cast<unsigned>(type) > E3D_INSTALL_PATH_NONE)
        return E_FAIL;
    return ut::ExportBoundary([&] { return OneFolder(type, path); });
}

HRESULT KXGetInstallPaths(tagE3D_INSTALL_PATH_TYPE type, std::vector<CKXString>& paths) {
    if (static_cast<unsigned>(type) > E3D_INSTALL_PATH_NONE)
        return E_FAIL;
    return ut::ExportBoundary([&] {
        if (type == E3D_INSTALL_PATH_WORKGROUP || type == E3D_INSTALL_PATH_WORKGROUP_ADDONS) {
            std::vector<CKXString> workgroups;
            (void)CKXRootLocationMgr::GetWorkgroupPaths(-1, workgroups); // none when unanswered
            for (const CKXString& workgroup : workgroups) {
                CKXString path = workgroup;
                if (type == E3D_INSTALL_PATH_WORKGROUP || WorkgroupAddons(workgroup, path) == S_OK)
                    paths.push_back(path);
            }
        } else {
            CKXString path;
            if (OneFolder(type, path) == S_OK)
                paths.push_back(path);
        }
        return paths.empty() ? S_FALSE : S_OK;
    });
}

int KXIsFileRelativeToProject(const CKXString& project, const CKXString& file) {
    return ut::ExportBoundary([&] { return file.Left(project.Length()).CaseLessEqual(project) ? 1 : 0; }, 0);
}

HRESULT F3DOpenStorageOnFile(const wchar_t* path, unsigned long mode, int create, IStorage** storage,
                             ILockBytes** lockBytes) {
    if (!storage || !lockBytes)
        return E_POINTER;
    wchar_t temporary[ut::kPathCapacity];
    if (!path) {
        wchar_t folder[ut::kPathCapacity];
        if (!GetTempPathW(ut::kPathCapacity, folder) || !GetTempFileNameW(folder, L"K3D", 0, temporary))
            return E_FAIL;
        (void)DeleteFileW(temporary); // only the name is wanted; the storage makes the file
        path = temporary;
        mode |= kDeleteOnRelease;
    }
    bool exists = _waccess(path, 0) == 0;
    if (!exists && !create)
        return STG_E_FILENOTFOUND;
    if (!exists || create)
        (void)DeleteFileW(path); // creating replaces the file; a missing one has nothing to delete
    if (FAILED(GWOpenOrCreateILockBytes(path, mode, !create, lockBytes)))
        return E_INVALIDARG;
    return GWOpenOrCreateStorage2(nullptr, path, nullptr, mode, !create, storage, *lockBytes);
}

HRESULT KXGetUserPrefDefaultImage(CKXString* path) {
    if (!path)
        return E_POINTER;
    return ut::ExportBoundary([&] {
        std::wstring chosen = Preference(L"rendering.default_image_source_windows");
        if (!chosen.empty() && KXaccess(chosen.c_str(), 4) == 0) {
            *path = chosen.c_str();
            return S_OK;
        }
        CKXString factory;
        (void)KXGetFactoryResourcePath(factory); // an unknown factory leaves the bare name
        *path = factory.Left(ut::kPathCapacity) + L"\\" + L"noIcon.pic";
        return S_OK;
    });
}

HRESULT KXIsPluginItem(CKXString* name, const GUID& kind, IKXPluginItem** item) {
    if (!name)
        return E_POINTER;
    if (item)
        *item = nullptr;
    ut::ComPtr<IKXPluginRegistry> registry;
    if (HRESULT hr = GWQueryGenericObject(CLSID_KXPluginRegistry, IID_IKXPluginRegistry, registry.PutVoid());
        FAILED(hr))
        return hr;
    ut::ComPtr<IKXPluginItem> found;
    if (registry->GetItem(0, kind, *name, found.Put()) != S_OK)
        return S_FALSE;
    if (item)
        *item = found.Detach();
    return S_OK;
}

char* KXFindRecoveryFile() {
    return ut::ExportBoundary(
        [] {
            ut::ComPtr<IGWApplication> application = ApplicationObject();
            return application ? LookForRecoveryFile(application.Get()) : nullptr;
        },
        static_cast<char*>(nullptr));
}
