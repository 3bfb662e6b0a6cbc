// The reference host's version-information object: the product, build and major strings of its
// settings, fixed for the object's lifetime.
#pragma once

#include <array>
#include <string>

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/version.h>

namespace ut::host {

class VersionInfo final : public ut::sdk::ComObject<IGWVersionInfo> {
public:
    explicit VersionInfo(const Settings& settings);

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetVersionString(ULONG index, wchar_t** text) override;

private:
    // Indexed by GWVersionString; an empty entry is a string the host does not have.
    std::array<std::wstring, 3> strings_;
};

} // namespace ut::host
