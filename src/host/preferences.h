// The reference host's preferences: the user's settings by name, kept in the registry as
// ut/sdk/preferences.h describes.
#pragma once

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/preferences.h>

namespace ut::host {

class Preferences final : public ut::sdk::ComObject<IGWPreferences> {
public:
    explicit Preferences(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetText(const wchar_t* name, wchar_t** text) override;
    HRESULT STDMETHODCALLTYPE SetText(const wchar_t* name, const wchar_t* text) override;
};

} // namespace ut::host
