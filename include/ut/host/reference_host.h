// The reference host: small, real, in-process implementations of the application services that
// the library reaches through the SDK. Tools and integration tests run on it; an application
// that embeds the library installs its own services instead.
#pragma once

#include <string>
#include <vector>

#include <ut/platform/com.h>

namespace ut::host {

// What the reference host answers where a real application would consult itself. The defaults
// describe a recent host: it names itself, and its major version and build are past every
// boundary that older stream formats are told apart by, so nothing is loaded in a legacy mode.
struct Settings {
    // Strings of the version-information object; an empty one is a string the host does not have.
    std::wstring productName = L"ut reference host";
    std::wstring build = L"1200"; // four digits
    std::wstring major = L"2003";
    // The mode the active database reports.
    ULONG activeDatabaseMode = 0;
    // Seeds of the ambient values "referencing.importingdelta" and "context.constructionmode".
    bool importingDelta = false;
    LONG constructionMode = 0;
};

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
