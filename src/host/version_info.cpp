// The reference host's version-information object.
#include "version_info.h"

#include <cwchar>

#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

namespace ut::host {

VersionInfo::VersionInfo(const Settings& settings)
    : strings_{settings.productName, settings.build, settings.major} {}

std::span<const CGWCOMObject::InterfaceEntry> VersionInfo::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<VersionInfo, IGWVersionInfo>(IID_IGWVersionInfo)};
    return map;
}

HRESULT VersionInfo::GetVersionString(ULONG index, wchar_t** text) {
    if (!text)
        return E_POINTER;
    *text = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWVersionInfo::GetVersionString"); FAILED(hr))
        return hr;
    if (index >= strings_.size() || strings_[index].empty())
        return S_FALSE;
    const std::wstring& source = strings_[index];
    auto* copy = static_cast<wchar_t*>(CoTaskMemAlloc((source.size() + 1) * sizeof(wchar_t)));
    if (!copy)
        return E_OUTOFMEMORY;
    std::wmemcpy(copy, source.c_str(), source.size() + 1);
    *text = copy;
    return S_OK;
}

} // namespace ut::host
