// The reference host's version-information object.
#include "version_info.h"

#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

#include "host_support.h"

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
    return CopyToTaskMemory(strings_[index], text);
}

} // namespace ut::host
