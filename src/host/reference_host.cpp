#include <ut/host/reference_host.h>
#include <ut/sdk/objects.h>

#include "notification_service.h"

namespace ut::host {

ReferenceHost::ReferenceHost(const Settings&) {
    auto notifications = ComPtr<NotificationService>::Adopt(new NotificationService());
    InstallService(CLSID_GWNotificationService, static_cast<CGWCOMObject*>(notifications.Get()));
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
