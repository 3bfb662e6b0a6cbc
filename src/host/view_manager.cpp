// The reference host's views: every module's "View" category in the registry.
#include "view_manager.h"

#include <cwctype>
#include <string>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/testing.h>

namespace ut::host {
namespace {

constexpr HRESULT kNotFound = HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND);

HRESULT FromRegistry(LONG error) {
    return error == ERROR_SUCCESS ? S_OK : HRESULT_FROM_WIN32(static_cast<DWORD>(error));
}

bool EqualCaseless(const std::wstring& a, const wchar_t* b) {
    std::size_t i = 0;
    for (; i < a.size() && b[i]; ++i)
        if (std::towupper(static_cast<wint_t>(a[i])) != std::towupper(static_cast<wint_t>(b[i])))
            return false;
    return i == a.size() && !b[i];
}

// Calls `visit(module's "View" key, name of a view class's key)` for every registered view,
// until it answers false. ERROR_SUCCESS when the walk ends, or the registry's failure.
template <class Visit>
LONG ForEachView(Visit&& visit) {
    UniqueHKey modules = sdk::OpenKey(HKEY_LOCAL_MACHINE, sdk::kModulesBranch);
    if (!modules)
        return ERROR_SUCCESS;
    bool going = true;
    return sdk::ForEachSubKey(modules.get(), [&](const wchar_t* module) {
        UniqueHKey views = sdk::OpenKey(modules.get(), (std::wstring(module) + L"\\View").c_str());
        if (views) {
            LONG walked = sdk::ForEachSubKey(views.get(), [&](const wchar_t* view) {
                going = visit(views.get(), view);
                return going;
            });
            going &= walked == ERROR_SUCCESS;
        }
        return going;
    });
}

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> ViewManager::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<ViewManager, IGWViewManager>(IID_IGWViewManager)};
    return map;
}

HRESULT ViewManager::GetViewName(REFCLSID view, wchar_t* name, ULONG capacity) {
    if (!name)
        return E_POINTER;
    if (capacity == 0)
        return E_INVALIDARG;
    name[0] = L'\0';
    if (HRESULT hr = sdk::CheckHostFault("IGWViewManager::GetViewName"); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        std::wstring wanted = GuidToString(view), found;
        bool known = false;
        LONG walked = ForEachView([&](HKEY views, const wchar_t* key) {
            GUID id{};
            if (FAILED(ParseGuid(key, &id)) || !IsEqualGUID(id, view))
                return true;
            UniqueHKey entry = sdk::OpenKey(views, key);
            known = entry && sdk::ReadText(entry.get(), L"Name", found) == ERROR_SUCCESS;
            return !known;
        });
        if (!known)
            return walked == ERROR_SUCCESS ? kNotFound : FromRegistry(walked);
        if (found.size() >= capacity)
            return HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER);
        found.copy(name, found.size());
        name[found.size()] = L'\0';
        return S_OK;
    });
}

HRESULT ViewManager::GetViewClass(const wchar_t* name, CLSID* view) {
    if (!name || !view)
        return E_POINTER;
    *view = GUID_NULL;
    if (HRESULT hr = sdk::CheckHostFault("IGWViewManager::GetViewClass"); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        bool known = false;
        LONG walked = ForEachView([&](HKEY views, const wchar_t* key) {
            GUID id{};
            std::wstring text;
            UniqueHKey entry = sdk::OpenKey(views, key);
            if (SUCCEEDED(ParseGuid(key, &id)) && entry &&
                sdk::ReadText(entry.get(), L"Name", text) == ERROR_SUCCESS && EqualCaseless(text, name)) {
                *view = id;
                known = true;
            }
            return !known;
        });
        if (known)
            return S_OK;
        return walked == ERROR_SUCCESS ? kNotFound : FromRegistry(walked);
    });
}

} // namespace ut::host
