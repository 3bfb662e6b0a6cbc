// Installs the reference host's services and revokes them again.
#include <ut/host/reference_host.h>

#include <new>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/components.h>
#include <ut/sdk/undo.h>

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

#include "active_database.h"
#include "ambient_values.h"
#include "application.h"
#include "content_container.h"
#include "families_manager.h"
#include "file_dialogs.h"
#include "file_path.h"
#include "host_support.h"
#include "image_library.h"
#include "image_loader.h"
#include "install_locations.h"
#include "list.h"
#include "notification_service.h"
#include "picture_source.h"
#include "preferences.h"
#include "preset_manager.h"
#include "property_set.h"
#include "scene_manager.h"
#include "scene_object.h"
#include "scene_services.h"
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
    InstallService(CLSID_GWActiveDatabase, NewService<ActiveDatabase>(settings).Get());
    InstallService(CLSID_GWNotificationService, NewService<NotificationService>(settings).Get());
    InstallService(CLSID_GWTimeManager, NewService<TimeManager>(settings).Get());
    InstallService(CLSID_GWPlayControl, NewService<PlayControl>(settings).Get());
    InstallService(CLSID_GWFileDialogs, NewService<FileDialogs>(settings).Get());
    // The containers it makes start from a copy of the settings.
    InstallClass(CLSID_GWContentContainer, Make<ClassFactory>([settings](IUnknown** made) {
                                               return MakeContentContainer(settings, made);
                                           }).Get());
    InstallScene(settings);
    if (settings.currentContainer)
        OpenContainer();
    InstallService(CLSID_GWFamiliesManager, NewService<FamiliesManager>(settings).Get());
    InstallService(CLSID_GWViewManager, NewService<ViewManager>(settings).Get());
    InstallService(CLSID_GWPreferences, NewService<Preferences>(settings).Get());
    InstallService(CLSID_GWProjectManager, NewService<InstallLocations>(settings).Get());
    InstallService(CLSID_KXPluginRegistry, NewService<PluginRegistry>(settings).Get());
    InstallService(CLSID_GWImageLoader, NewService<ImageLoader>(settings).Get());
    InstallClass(CLSID_GWImage, Make<ClassFactory>(&MakeImage).Get());
    for (const auto& [clsid, service] : PictureServices(settings)) // none without a picture
        InstallService(clsid, service.Get());
    for (const auto& [command, service] : PresetCommandServices(settings))
        InstallService(command, service.Get());
    for (const auto& [clsid, factory] : PluginClassFactories(settings))
        InstallClass(clsid, factory.Get());
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

HRESULT ReferenceHost::InstallScene(const Settings& settings) {
    HRESULT built = ut::ExportBoundary([&] {
        containerFolders_ = settings.scene.containers;
        ut::ComPtr<Scene> scene = Scene::Build(settings.scene);
        sceneManager_ = scene ? Make<SceneManager>(std::move(scene)) : nullptr;
        if (sceneManager_)
            sceneManager_->SetPresetManager(ut::ComPtr<IUnknown>(NewService<PresetManager>(settings)));
        return sceneManager_ ? S_OK : E_OUTOFMEMORY;
    });
    if (FAILED(Record(built)))
        return built;
    undoManager_ = Make<UndoManager>();
    // Services go in as their CGWCOMObject, the IUnknown of their identity.
    auto asUnknown = [](const auto& object) -> IUnknown* { return static_cast<CGWCOMObject*>(object.Get()); };
    InstallService(CLSID_3DSceneManagerFactory, asUnknown(sceneManager_));
    InstallService(CLSID_GWUndoManager, asUnknown(undoManager_));
    InstallService(CLSID_GWDeleteAllBracket, asUnknown(Make<DeleteAllBracket>()));
    InstallService(CLSID_GWViewerControllerFactory, asUnknown(Make<ViewerControllerFactory>()));
    InstallService(CLSID_GWSetValueProxy, asUnknown(Make<SetValueProxy>()));
    InstallService(CLSID_GWParamDict, asUnknown(Make<ParamDictionary>(settings.parameterAliases)));
    ut::ComPtr<IClassFactory> lists;
    Record(ut::sdk::CreateClassFactory(&ut::sdk::NewObject<List>, lists.Put()));
    InstallClass(CLSID_3DList, lists.Get());
    for (const CLSID& clsid : settings.propertyClasses)
        InstallClass(clsid, Make<ClassFactory>([clsid](IUnknown** made) {
                                return MakePropertySet(clsid, made);
                            }).Get());
    return status_;
}

SceneDescription ReferenceHost::DescribeScene() const {
    if (!sceneManager_)
        return {};
    SceneDescription description = sceneManager_->CurrentScene()->Describe();
    description.containers.referencePlanes = containerFolders_.referencePlanes;
    description.containers.devices = containerFolders_.devices;
    description.containers.caches = containerFolders_.caches;
    return description;
}

std::vector<std::wstring> ReferenceHost::UndoSteps() const {
    return undoManager_ ? undoManager_->Steps() : std::vector<std::wstring>();
}

LONG ReferenceHost::SceneNotificationMode() const {
    return sceneManager_ ? sceneManager_->NotificationMode() : GW3DNOTIFY_NORMAL;
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
