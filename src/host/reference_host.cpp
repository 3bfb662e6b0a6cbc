// Installs the reference host's services and revokes them again.
#include <ut/host/reference_host.h>

#include <new>

#include <ut/sdk/ambient.h>
#include <ut/sdk/content.h>
#include <ut/sdk/database.h>
#include <ut/sdk/dialogs.h>
#include <ut/sdk/families.h>
#include <ut/sdk/notify.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/preferences.h>
#include <ut/sdk/version.h>
#include <ut/sdk/views.h>

#include "ambient_values.h"
#include "application.h"
#include "content_container.h"
#include "families_manager.h"
#include "file_dialogs.h"
#include "file_path.h"
#include "image_loader.h"
#include "install_locations.h"
#include "notification_service.h"
#include "preferences.h"
#include "time_manager.h"
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
    InstallService(CLSID_GWActiveDatabase, NewService<Application>(settings).Get());
    InstallService(CLSID_GWNotificationService, NewService<NotificationService>(settings).Get());
    InstallService(CLSID_GWTimeManager, NewService<TimeManager>(settings).Get());
    InstallService(CLSID_GWPlayControl, NewService<PlayControl>(settings).Get());
    InstallService(CLSID_GWFileDialogs, NewService<FileDialogs>(settings).Get());
    ut::ComPtr<IClassFactory> containers =
        ut::ComPtr<IClassFactory>::Adopt(new (std::nothrow) ContentContainerFactory(settings));
    InstallClass(CLSID_GWContentContainer, containers.Get());
    if (settings.currentContainer)
        OpenContainer();
    InstallService(CLSID_GWFamiliesManager, NewService<FamiliesManager>(settings).Get());
    InstallService(CLSID_GWViewManager, NewService<ViewManager>(settings).Get());
    InstallService(CLSID_GWPreferences, NewService<Preferences>(settings).Get());
    InstallService(CLSID_GWProjectManager, NewService<InstallLocations>(settings).Get());
    InstallService(CLSID_KXPluginRegistry, NewService<PluginRegistry>(settings).Get());
    InstallService(CLSID_GWImageLoader, NewService<ImageLoader>(settings).Get());
    InstallClass(CLSID_GWFilePath,
                 ut::ComPtr<IClassFactory>::Adopt(new (std::nothrow) FilePathFactory(settings)).Get());
}

ReferenceHost::~ReferenceHost() {
    if (containerOpened_)
        (void)GWContentSetCurrentContainer(nullptr); // cannot fail
    for (const CLSID& clsid : classes_)
        (void)GWRevokeClassFactory(clsid); // S_FALSE when another host revoked it first
    for (const CLSID& clsid : services_)
        GWRevokeGenericObject(clsid);
}

HRESULT ReferenceHost::Record(HRESULT hr) {
    if (FAILED(hr))
        status_ = hr;
    return hr;
}

HRESULT ReferenceHost::InstallService(REFCLSID clsid, IUnknown* service) {
    HRESULT hr = Record(GWRegisterGenericObject(clsid, service));
    if (SUCCEEDED(hr))
        services_.push_back(clsid);
    return hr;
}

HRESULT ReferenceHost::InstallClass(REFCLSID clsid, IClassFactory* factory) {
    HRESULT hr = Record(GWRegisterClassFactory(clsid, factory));
    if (SUCCEEDED(hr))
        classes_.push_back(clsid);
    return hr;
}

HRESULT ReferenceHost::OpenContainer() {
    ut::ComPtr<IUnknown> container;
    if (HRESULT hr = Record(KXCreateInstance(CLSID_GWContentContainer, IID_IUnknown, container.PutVoid()));
        FAILED(hr))
        return hr;
    containerOpened_ = true;
    return Record(GWContentSetCurrentContainer(container.Get()));
}

} // namespace ut::host
