// Installs the reference host's services and revokes them again.
#include <ut/host/reference_host.h>

#include <new>

#include <ut/sdk/ambient.h>
#include <ut/sdk/database.h>
#include <ut/sdk/families.h>
#include <ut/sdk/notify.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/preferences.h>
#include <ut/sdk/version.h>
#include <ut/sdk/views.h>

#include "active_database.h"
#include "ambient_values.h"
#include "families_manager.h"
#include "notification_service.h"
#include "preferences.h"
#include "version_info.h"
#include "view_manager.h"

namespace ut::host {
namespace {

// A service built from the settings, owned by the returned pointer; null when memory ran out,
// which InstallService then reports.
template <class Service>
ut::ComPtr<IUnknown> NewService(const Settings& settings) {
    CGWCOMObject* service = new (std::nothrow) Service(settings);
    return ut::ComPtr<IUnknown>::Adopt(service);
}

} // namespace

ReferenceHost::ReferenceHost(const Settings& settings) {
    InstallService(CLSID_GWVersionInfo, NewService<VersionInfo>(settings).Get());
    InstallService(CLSID_GWAmbientValues, NewService<AmbientValues>(settings).Get());
    InstallService(CLSID_GWActiveDatabase, NewService<ActiveDatabase>(settings).Get());
    InstallService(CLSID_GWNotificationService, NewService<NotificationService>(settings).Get());
    InstallService(CLSID_GWFamiliesManager, NewService<FamiliesManager>(settings).Get());
    InstallService(CLSID_GWViewManager, NewService<ViewManager>(settings).Get());
    InstallService(CLSID_GWPreferences, NewService<Preferences>(settings).Get());
}

ReferenceHost::~ReferenceHost() {
    for (const CLSID& clsid : services_)
        GWRevokeGenericObject(clsid);
}

HRESULT ReferenceHost::InstallService(REFCLSID clsid, IUnknown* service) {
    HRESULT hr = GWRegisterGenericObject(clsid, service);
    if (FAILED(hr)) {
        status_ = hr;
        return hr;
    }
    services_.push_back(clsid);
    return hr;
}

} // namespace ut::host
