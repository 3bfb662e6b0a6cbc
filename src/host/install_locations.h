// The reference host's project manager and install locations, read from the preferences, the
// environment and the defaults that ut/sdk/locations.h describes.
#pragma once

#include <map>
#include <memory>
#include <string>

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/locations.h>

namespace ut::host {

class InstallLocations final : public ut::sdk::ComObject<IGWProjectManager, IGWInstallLocations> {
public:
    explicit InstallLocations(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetActiveProject(GWProjectInfo** project) override;
    HRESULT STDMETHODCALLTYPE ReleaseProject(GWProjectInfo* project) override;
    HRESULT STDMETHODCALLTYPE GetLocation(GWLocation kind, ULONG index, wchar_t** path) override;

private:
    // Each record handed out, read from the settings when it was asked for; what a caller never
    // gives back goes with the manager.
    struct Project {
        std::wstring path;
        GWProjectInfo info;
    };
    std::map<GWProjectInfo*, std::unique_ptr<Project>> projects_;
};

// The setting `name` ("project", "user", ...): the preference "paths.<name>", else the
// environment's UT_<NAME>_PATH, else empty.
std::wstring LocationSetting(const std::wstring& name);

} // namespace ut::host
