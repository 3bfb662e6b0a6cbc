// The reference host's folders: preferences first, then the environment, then the defaults.
#include "install_locations.h"

#include <cstdlib>
#include <cwctype>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/text.h>
#include <ut/sdk/paths.h>
#include <ut/sdk/preferences.h>
#include <ut/sdk/testing.h>

#include "host_support.h"

namespace ut::host {
namespace {

// A copy in task memory; S_FALSE for an empty text, which is still handed out.
HRESULT TaskText(const std::wstring& text, wchar_t** out) {
    HRESULT hr = CopyToTaskMemory(text, out);
    return SUCCEEDED(hr) && text.empty() ? S_FALSE : hr;
}

std::wstring Environment(const char* name) {
    const char* value = std::getenv(name);
    return value ? ut::platform::WideFromUtf8(value) : std::wstring();
}

std::wstring WithoutTrailingSeparator(std::wstring path) {
    while (path.size() > 1 && (path.back() == L'\\' || path.back() == L'/'))
        path.pop_back();
    return path;
}

std::wstring UserFolder() {
    std::wstring user = LocationSetting(L"user");
    if (!user.empty())
        return user;
    std::wstring home = Environment("HOME");
    if (home.empty())
        home = Environment("USERPROFILE");
    return home.empty() ? std::wstring() : WithoutTrailingSeparator(home) + L"\\ut";
}

// Item `index` of a list separated by ';', empty past its end.
std::wstring ListItem(const std::wstring& list, ULONG index) {
    std::size_t start = 0;
    for (ULONG i = 0; start <= list.size(); ++i) {
        std::size_t end = list.find(L';', start);
        if (end == std::wstring::npos)
            end = list.size();
        if (i == index)
            return WithoutTrailingSeparator(list.substr(start, end - start));
        start = end + 1;
    }
    return {};
}

std::wstring Folder(GWLocation kind, ULONG index) {
    switch (kind) {
    case GWLOCATION_USER:
        return index ? std::wstring() : UserFolder();
    case GWLOCATION_WORKGROUP:
        return ListItem(LocationSetting(L"workgroups"), index);
    case GWLOCATION_SITE:
        return index ? std::wstring() : LocationSetting(L"site");
    case GWLOCATION_ADDONS: {
        std::wstring addons = LocationSetting(L"addons");
        CKXString factory;
        if (addons.empty() && SUCCEEDED(KXGetFactoryPath(factory)))
            addons = std::wstring(factory) + L"\\Addons";
        return index ? std::wstring() : addons;
    }
    case GWLOCATION_USER_ADDONS: {
        std::wstring addons = LocationSetting(L"user_addons");
        if (addons.empty() && !UserFolder().empty())
            addons = UserFolder() + L"\\Addons";
        return index ? std::wstring() : addons;
    }
    }
    return {};
}

} // namespace

std::wstring LocationSetting(const std::wstring& name) {
    ut::ComPtr<IGWPreferences> preferences;
    if (SUCCEEDED(KXGetPreferencesMgr(preferences.Put()))) {
        wchar_t* text = nullptr;
        (void)preferences->GetText((L"paths." + name).c_str(), &text); // a missing one leaves it null
        std::wstring value = text ? text : L"";
        CoTaskMemFree(text);
        if (!value.empty())
            return WithoutTrailingSeparator(value);
    }
    std::string variable = "UT_";
    for (wchar_t c : name)
        variable += static_cast<char>(std::towupper(c));
    return WithoutTrailingSeparator(Environment((variable + "_PATH").c_str()));
}

std::span<const CGWCOMObject::InterfaceEntry> InstallLocations::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        sdk::Entry<InstallLocations, IGWProjectManager>(IID_IGWProjectManager),
        sdk::Entry<InstallLocations, IGWInstallLocations>(IID_IGWInstallLocations)};
    return map;
}

HRESULT InstallLocations::GetActiveProject(GWProjectInfo** project) {
    if (!project)
        return E_POINTER;
    *project = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWProjectManager::GetActiveProject"); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        auto record = std::make_unique<Project>();
        record->path = LocationSetting(L"project");
        std::size_t cut = record->path.find_last_of(L"/\\");
        record->info.path = record->path.c_str();
        record->info.name = record->info.path + (cut == std::wstring::npos ? 0 : cut + 1);
        *project = &record->info;
        projects_.emplace(*project, std::move(record));
        return S_OK;
    });
}

HRESULT InstallLocations::ReleaseProject(GWProjectInfo* project) {
    if (HRESULT hr = sdk::CheckHostFault("IGWProjectManager::ReleaseProject"); FAILED(hr))
        return hr;
    return projects_.erase(project) ? S_OK : E_INVALIDARG;
}

HRESULT InstallLocations::GetLocation(GWLocation kind, ULONG index, wchar_t** path) {
    if (!path)
        return E_POINTER;
    *path = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWInstallLocations::GetLocation"); FAILED(hr))
        return hr;
    if (kind < GWLOCATION_USER || kind > GWLOCATION_USER_ADDONS)
        return E_INVALIDARG;
    return ExportBoundary([&] { return TaskText(Folder(kind, index), path); });
}

} // namespace ut::host
