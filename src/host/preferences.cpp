// The reference host's preferences, one registry value each.
#include "preferences.h"

#include <string>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/testing.h>

#include "host_support.h"

namespace ut::host {

std::span<const CGWCOMObject::InterfaceEntry> Preferences::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<Preferences, IGWPreferences>(IID_IGWPreferences)};
    return map;
}

HRESULT Preferences::GetText(const wchar_t* name, wchar_t** text) {
    if (!name || !text)
        return E_POINTER;
    *text = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWPreferences::GetText"); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        UniqueHKey key = sdk::OpenKey(HKEY_CURRENT_USER, sdk::kPreferencesBranch);
        std::wstring value;
        LONG read = key ? sdk::ReadText(key.get(), name, value) : ERROR_FILE_NOT_FOUND;
        if (read == ERROR_INVALID_DATA)
            return DISP_E_TYPEMISMATCH;
        if (read != ERROR_SUCCESS)
            return HRESULT_FROM_WIN32(static_cast<DWORD>(read));
        return CopyToTaskMemory(value, text);
    });
}

HRESULT Preferences::SetText(const wchar_t* name, const wchar_t* text) {
    if (!name || !text)
        return E_POINTER;
    if (HRESULT hr = sdk::CheckHostFault("IGWPreferences::SetText"); FAILED(hr))
        return hr;
    UniqueHKey key;
    LONG written = sdk::CreateKey(HKEY_CURRENT_USER, sdk::kPreferencesBranch, key);
    if (written == ERROR_SUCCESS)
        written = sdk::SetText(key.get(), name, text);
    return written == ERROR_SUCCESS ? S_OK : HRESULT_FROM_WIN32(static_cast<DWORD>(written));
}

} // namespace ut::host
