// The reference host: small, real, in-process implementations of the application services that
// the library reaches through the SDK. Tools and integration tests run on it; an application
// that embeds the library installs its own services instead.
#pragma once

#include <string>
#include <vector>

#include <ut/platform/com.h>

namespace ut::host {

// What the reference host answers where a real application would consult itself.
struct Settings {};

// Installs the reference services for its lifetime and revokes exactly what it installed.
// One at a time: installing a second one replaces the first one's services.
class ReferenceHost {
public:
    explicit ReferenceHost(const Settings& settings = {});
    ~ReferenceHost();
    ReferenceHost(const ReferenceHost&) = delete;
    ReferenceHost& operator=(const ReferenceHost&) = delete;

    // S_OK when every service was installed.
    HRESULT Status() const { return status_; }

private:
    HRESULT InstallService(REFCLSID clsid, IUnknown* service);

    std::vector<CLSID> services_;
    HRESULT status_ = S_OK;
};

} // namespace ut::host
