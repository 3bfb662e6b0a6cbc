// The reference host's ambient values, read and written by name.
#include "ambient_values.h"

#include <new>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

namespace ut::host {

AmbientValues::AmbientValues(const Settings& settings)
    : values_{{L"referencing.importingdelta", settings.importingDelta ? 1 : 0},
              {L"context.constructionmode", settings.constructionMode}} {}

std::span<const CGWCOMObject::InterfaceEntry> AmbientValues::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<AmbientValues, IGWAmbientValues>(IID_IGWAmbientValues)};
    return map;
}

HRESULT AmbientValues::GetBool(const wchar_t* name, BOOL* value) {
    if (!value)
        return E_POINTER;
    LONG stored = 0;
    HRESULT hr = Read("IGWAmbientValues::GetBool", name, &stored);
    if (hr == S_OK)
        *value = stored != 0 ? TRUE : FALSE;
    return hr;
}

HRESULT AmbientValues::GetInt(const wchar_t* name, LONG* value) {
    return Read("IGWAmbientValues::GetInt", name, value);
}

HRESULT AmbientValues::SetBool(const wchar_t* name, BOOL value) {
    return Write("IGWAmbientValues::SetBool", name, value ? 1 : 0);
}

HRESULT AmbientValues::SetInt(const wchar_t* name, LONG value) {
    return Write("IGWAmbientValues::SetInt", name, value);
}

HRESULT AmbientValues::Read(std::string_view operation, const wchar_t* name, LONG* value) {
    if (!name || !value)
        return E_POINTER;
    if (HRESULT hr = ut::sdk::CheckHostFault(operation); FAILED(hr))
        return hr;
    std::lock_guard lock(mutex_);
    auto found = values_.find(std::wstring_view(name));
    if (found == values_.end())
        return DISP_E_MEMBERNOTFOUND;
    *value = found->second;
    return S_OK;
}

HRESULT AmbientValues::Write(std::string_view operation, const wchar_t* name, LONG value) {
    if (!name)
        return E_POINTER;
    if (HRESULT hr = ut::sdk::CheckHostFault(operation); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        std::lock_guard lock(mutex_);
        values_.insert_or_assign(std::wstring(name), value);
        return S_OK;
    });
}

} // namespace ut::host
