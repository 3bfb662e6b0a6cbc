// Scene access: the three roots, the manager and container accessors, scene-wide actions, scene
// properties and defaults, the transient object container and the complex-undo bracket.
#include <utility>
#include <vector>

#include <ut/platform/detail/boundary.h>
#include <ut/scene.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/play.h>
#include <ut/sdk/scene_defaults.h>
#include <ut/sdk/transient.h>
#include <ut/sdk/views.h>
#include <ut/time.h>

#include "scene/scene_access.h"
#include "util/host_variant.h"

namespace ut::scene {
namespace {

// The server contexts the roots create in: a content container may come from a handler, a
// property set only from an in-process server.
constexpr DWORD kContainerContext = CLSCTX_INPROC_SERVER | CLSCTX_INPROC_HANDLER;
constexpr DWORD kPropertyContext = CLSCTX_INPROC_SERVER;
// How a property set made on demand is filed with the scene.
constexpr LONG kAddedPropertyKind = 4;
constexpr ULONG kAddedPropertyFlags = 0x8000;
// The flags an object added to the transient object container through its IUnknown gets.
constexpr ULONG kTransientFlags = 1;
// What the transient object container answers for an object it does not hold.
constexpr HRESULT kNotHeld = S_FALSE;

// Any success as S_OK.
HRESULT Normalised(HRESULT hr) {
    return FAILED(hr) ? hr : S_OK;
}

// A host that answers success without the object it was asked for breaks its contract; that
// ends the call rather than the process.
template <class Interface>
HRESULT Held(HRESULT hr, const ut::ComPtr<Interface>& object) {
    return SUCCEEDED(hr) && !object ? E_UNEXPECTED : hr;
}

// The roots every member starts from; a content container is made when none is current.
HRESULT Reach(ut::ComPtr<I3DSceneManager>& manager) {
    return KXGetSceneManager(IID_I3DSceneManager, manager.PutVoid(), 1);
}
HRESULT Reach(ut::ComPtr<I3DScene>& scene) {
    return KXGetCurrentScene(IID_I3DScene, scene.PutVoid());
}
HRESULT Reach(ut::ComPtr<IGWContentContainer>& container) {
    return KXGet3DContentContainer(IID_IGWContentContainer, container.PutVoid(), 1);
}

// Reaches the root and runs one operation on it; the root is released on every path.
template <class Root, class Operation>
HRESULT On(Operation operation) {
    ut::ComPtr<Root> root;
    if (HRESULT hr = Reach(root); FAILED(hr))
        return hr;
    return operation(*root);
}

// The object the content container keeps under `key`, asked for `iid`.
HRESULT ContentMember(REFGUID key, REFIID iid, void** out) {
    return On<IGWContentContainer>(
        [&](IGWContentContainer& container) { return container.FindObject(key, iid, out); });
}

HRESULT SceneContainer(REFGUID key, REFIID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return On<I3DScene>([&](I3DScene& scene) { return scene.GetContainer(key, iid, out); });
}

// Runs `operation` on the scene defaults of the current (or a new) content container.
template <class Operation>
HRESULT OnSceneDefaults(Operation operation) {
    ut::ComPtr<I3DSceneDefaults> defaults;
    HRESULT hr = ContentMember(GUID_3DSceneDefaultsKey, IID_I3DSceneDefaults, defaults.PutVoid());
    if (hr = Held(hr, defaults); FAILED(hr))
        return hr;
    return operation(*defaults);
}

// S_OK stays; every other answer, failures included, is S_FALSE.
HRESULT OkOrFalse(HRESULT hr) {
    return hr == S_OK ? S_OK : S_FALSE;
}

template <class Operation>
HRESULT OnTransientContainer(Operation operation) {
    ut::ComPtr<I3DTransientObjectContainer> container;
    HRESULT hr = F3DGetTransientObjectContainer(IID_I3DTransientObjectContainer, container.PutVoid());
    if (hr = Held(hr, container); FAILED(hr))
        return hr;
    return operation(*container);
}

// Runs a form that takes a hierarchy on what `object` answers for IGWComponentHierarchy.
template <class Form>
HRESULT AsHierarchy(IUnknown* object, Form form) {
    if (!object)
        return E_POINTER;
    ut::ComPtr<IGWComponentHierarchy> hierarchy;
    if (HRESULT hr = object->QueryInterface(IID_IGWComponentHierarchy, hierarchy.PutVoid()); FAILED(hr))
        return hr;
    return form(hierarchy.Get());
}

using Members = std::vector<ut::ComPtr<IGWProperties>>;

// The members of class `filter` of `set`, counted then fetched. S_FALSE when it has none; any
// failure, or a member missing from what was fetched, is E_FAIL.
HRESULT FetchMembers(IGWProperties& set, REFGUID filter, Members& members) {
    ULONG count = 0;
    if (FAILED(set.CountMembers(filter, &count)))
        return E_FAIL;
    if (count == 0)
        return S_FALSE;
    members.reserve(count); // before the host hands out references, so that adopting cannot throw
    std::vector<IGWProperties*> slots(count, nullptr);
    HRESULT hr = set.GetMembers(filter, 0, count, slots.data());
    for (IGWProperties* slot : slots)
        members.push_back(ut::ComPtr<IGWProperties>::Adopt(slot));
    if (FAILED(hr))
        return E_FAIL;
    for (const ut::ComPtr<IGWProperties>& member : members)
        if (!member)
            return E_FAIL;
    return S_OK;
}

// Appends one element pointing at `target` to `list`; E_FAIL when any step fails.
HRESULT AppendElement(I3DList& list, IUnknown* target) {
    ut::ComPtr<I3DElemRef> element;
    HRESULT hr = list.NewElement(IID_I3DElemRef, element.PutVoid());
    if (FAILED(Held(hr, element)) || FAILED(element->SetTarget(target, nullptr)) ||
        FAILED(list.Append(element.Get())))
        return E_FAIL;
    return S_OK;
}

// Appends every property of class `propertyClass` of every set in `sets` to `list`.
HRESULT AppendProperties(IGWProperties& sets, REFGUID propertyClass, I3DList& list, ULONG& appended) {
    Members items;
    if (HRESULT hr = FetchMembers(sets, GUID_GWPropertySetKind, items); hr != S_OK)
        return hr;
    for (const ut::ComPtr<IGWProperties>& item : items) {
        Members properties;
        if (FAILED(FetchMembers(*item, propertyClass, properties)))
            return E_FAIL;
        for (const ut::ComPtr<IGWProperties>& property : properties) {
            if (FAILED(AppendElement(list, property.Get())))
                return E_FAIL;
            ++appended;
        }
    }
    return S_OK;
}

HRESULT PropsList(I3DObject& object, REFGUID propertyClass, I3DList** out) {
    ut::ComPtr<I3DList> list;
    if (FAILED(Held(KXCreateInstance(CLSID_3DList, IID_I3DList, list.PutVoid()), list)))
        return E_FAIL;
    ut::ComPtr<IGWPropertyOwner> owner;
    if (FAILED(object.QueryInterface(IID_IGWPropertyOwner, owner.PutVoid())))
        return E_FAIL;
    if (!owner)
        return S_FALSE;
    ut::ComPtr<IGWProperties> sets;
    if (FAILED(owner->GetPropertySets(sets.Put())))
        return E_FAIL;
    if (!sets)
        return S_FALSE;
    ULONG appended = 0;
    if (HRESULT hr = AppendProperties(*sets, propertyClass, *list, appended); hr != S_OK)
        return hr;
    if (FAILED(list->QueryInterface(IID_I3DList, reinterpret_cast<void**>(out))))
        return E_FAIL;
    return appended ? S_OK : S_FALSE;
}

// The play-control record of a reset: the whole setup, or only an undefined range.
tagGWPLAYCONTROLSETTINGS ResetSettings(bool full) {
    tagGWPLAYCONTROLSETTINGS settings{};
    settings.size = sizeof settings;
    if (!full) {
        settings.mask = GWPLAYSET_SPAN;
        settings.span = CGWTimeSpan::Undefined.ToRecord();
        return settings;
    }
    settings.mask = GWPLAYSET_ALL & ~GWPLAYSET_REALTIME;
    const CGWTimeSpan span(CGWTime(GWTIMEFORMAT_SECONDS, 1.0, 1.0),
                           CGWTime(GWTIMEFORMAT_SECONDS, 100.0, 1.0));
    settings.span = span.ToRecord();
    settings.position = span.GetStart().GetTime();
    settings.loop = 0;
    settings.preroll = 15;
    settings.mode = GWPLAYMODE_ALLFRAMES;
    settings.format = GWTIMEFORMAT_SECONDS;
    settings.speed = 1.0;
    settings.step = 5;
    return settings;
}

} // namespace

HRESULT CurrentSceneContainer(REFGUID key, REFIID iid, void** out) {
    return SceneContainer(key, iid, out);
}

HRESULT AppendToList(I3DList& list, IUnknown* target) {
    return AppendElement(list, target);
}

} // namespace ut::scene

using ut::scene::ClearOut;
using ut::scene::Normalised;
using ut::scene::On;

HRESULT KXGetSceneManager(REFGUID iid, void** out, int) {
    if (HRESULT hr = ClearOut(out, E_UNEXPECTED); FAILED(hr))
        return hr;
    ut::ComPtr<IUnknown> factory;
    if (HRESULT hr = GWQueryGenericObject(CLSID_3DSceneManagerFactory, factory.PutVoid()); FAILED(hr))
        return hr;
    return factory->QueryInterface(iid, out);
}

HRESULT KXGetCurrentScene(REFGUID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return On<I3DSceneManager>([&](I3DSceneManager& manager) {
        ut::ComPtr<IUnknown> scene;
        if (HRESULT hr = ut::scene::Held(manager.GetCurrentScene(scene.Put()), scene); FAILED(hr))
            return hr;
        return Normalised(scene->QueryInterface(iid, out));
    });
}

HRESULT KXGet3DContentContainer(REFGUID iid, void** out, int createIfNone) {
    if (HRESULT hr = ClearOut(out, E_UNEXPECTED); FAILED(hr))
        return hr;
    HRESULT hr = GWContentGetCurrentContainer(iid, out);
    if (FAILED(hr) && createIfNone)
        hr = ut::sdk::CreateInstance(CLSID_GWContentContainer, ut::scene::kContainerContext, iid, out);
    return hr;
}

HRESULT KXGetCacheManager(REFGUID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return Normalised(ut::scene::ContentMember(GUID_3DCacheManagerKey, iid, out));
}

HRESULT KXGetCacheManager(I3DCacheMgr** out) {
    return KXGetCacheManager(IID_I3DCacheMgr, reinterpret_cast<void**>(out));
}

HRESULT KXGetViewManager(REFGUID, void** out) {
    if (HRESULT hr = ClearOut(out, E_UNEXPECTED); FAILED(hr))
        return hr;
    return GWQueryGenericObject(CLSID_GWViewManager, IID_IGWViewManager, out);
}

HRESULT KXGetViewerControler(REFGUID iid, void** out) {
    if (HRESULT hr = ClearOut(out, E_UNEXPECTED); FAILED(hr))
        return hr;
    ut::ComPtr<IUnknown> object;
    if (HRESULT hr = GWQueryGenericObject(CLSID_GWViewerControllerFactory, object.PutVoid()); FAILED(hr))
        return hr;
    ut::ComPtr<IGWViewerControllerFactory> factory;
    if (HRESULT hr = object.As(factory); FAILED(hr))
        return hr;
    return factory->CreateController(iid, out);
}

HRESULT KXGetGenericManager(REFGUID managerId, REFGUID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    ut::ComPtr<IGWManagerRegistry> registry;
    if (HRESULT hr = KXGetSceneManager(IID_IGWManagerRegistry, registry.PutVoid(), 1); FAILED(hr))
        return hr;
    return registry->FindManager(managerId, iid, out);
}

HRESULT KXStoreCommand(REFGUID command, REFGUID target, IGWExecContext* context) {
    return On<I3DSceneManager>(
        [&](I3DSceneManager& manager) { return manager.StoreCommand(command, target, context); });
}

HRESULT KXPostCommand() {
    return On<I3DSceneManager>([](I3DSceneManager& manager) { return manager.PostCommand(); });
}

HRESULT F3DGet3DObjectFromName(wchar_t* name, I3DObject** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    if (!name)
        return E_POINTER;
    return On<I3DSceneManager>([&](I3DSceneManager& manager) { return manager.FindObjectByName(name, out); });
}

HRESULT F3DSceneNotificationQuietOn() {
    return On<I3DSceneManager>(
        [](I3DSceneManager& manager) { return manager.SetNotificationMode(GW3DNOTIFY_QUIET, 0); });
}

HRESULT F3DSceneNotificationQuietOff() {
    return On<I3DSceneManager>(
        [](I3DSceneManager& manager) { return manager.SetNotificationMode(GW3DNOTIFY_NORMAL, 0); });
}

HRESULT F3DCreate3DObjectFromPrimitive(I3DPrimitive* primitive, wchar_t* name, I3DObject** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return On<I3DSceneManager>(
        [&](I3DSceneManager& manager) { return manager.CreateObjectFromPrimitive(primitive, name, out); });
}

HRESULT KXCreate3DModelObject(const wchar_t* name, REFGUID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return On<I3DSceneManager>(
        [&](I3DSceneManager& manager) { return manager.CreateModelObject(name, iid, out); });
}

HRESULT F3DAdd3DObjectToScene(I3DObject* object, I3DObject* parent, int select) {
    return On<I3DSceneManager>(
        [&](I3DSceneManager& manager) { return manager.AddObject(object, parent, select); });
}

HRESULT F3DRemove3DObjectFromScene(I3DObject* object) {
    return On<I3DSceneManager>([&](I3DSceneManager& manager) { return manager.RemoveObject(object); });
}

HRESULT F3DSetAs3DGroup(I3DGroup* group, I3DElemRef* element, IUnknown*) {
    if (!element)
        return E_POINTER;
    return On<I3DSceneManager>([&](I3DSceneManager& manager) {
        ut::ComPtr<IUnknown> scene;
        if (HRESULT hr = ut::scene::Held(manager.GetCurrentScene(scene.Put()), scene); FAILED(hr))
            return hr;
        if (HRESULT hr = element->SetAsGroup(scene.Get(), group); FAILED(hr))
            return hr;
        return Normalised(element->Update(1));
    });
}

HRESULT KXDeleteAll(int flags) {
    // The application may have no bracket; then the deletion runs without one.
    ut::ComPtr<IGWDeleteAllBracket> bracket;
    (void)GWQueryGenericObject(CLSID_GWDeleteAllBracket, IID_IGWDeleteAllBracket, bracket.PutVoid());
    if (bracket)
        (void)bracket->Begin(); // the deletion goes ahead whatever the bracket answers
    ut::ComPtr<I3DSceneManager> manager;
    HRESULT hr = E_FAIL;
    if (SUCCEEDED(ut::scene::Reach(manager)))
        hr = manager->DeleteAll(flags);
    if (bracket)
        (void)bracket->End(); // the deletion's result is what is reported
    manager.Reset();
    return hr;
}

HRESULT F3DGetLayerContainer(IKXLayerContainer** out) {
    return Normalised(ut::scene::SceneContainer(GUID_3DLayerContainer, IID_IKXLayerContainer,
                                                reinterpret_cast<void**>(out)));
}

HRESULT F3DGetPassContainer(IKXLayerContainer** out) {
    return Normalised(ut::scene::SceneContainer(GUID_3DPassContainer, IID_IKXLayerContainer,
                                                reinterpret_cast<void**>(out)));
}

HRESULT F3DGetParTypeContainer(REFGUID iid, void** out) {
    return Normalised(ut::scene::SceneContainer(GUID_3DParTypeContainer, iid, out));
}

HRESULT F3DGetEnvironmentContainer(REFGUID iid, void** out) {
    return ut::scene::SceneContainer(GUID_3DEnvironmentContainer, iid, out);
}

HRESULT F3DGetRefPlaneFolder(I3DRefPlaneFolder** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return ut::scene::ContentMember(GUID_3DRefPlaneFolderKey, IID_I3DRefPlaneFolder,
                                    reinterpret_cast<void**>(out));
}

HRESULT F3DGetDeviceManager(REFGUID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return ut::scene::ContentMember(GUID_3DDeviceManagerKey, iid, out);
}

HRESULT F3DGetTransientObjectContainer(REFGUID iid, void** out) {
    return ut::scene::ContentMember(GUID_3DTransientObjectContainerKey, iid, out);
}

HRESULT KXGetSceneDefaultsObject(GUID clsid, IUnknown** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return ut::scene::OnSceneDefaults(
        [&](I3DSceneDefaults& defaults) { return defaults.GetObjectForClass(clsid, out); });
}

HRESULT KXGetStreamFromSceneDefaults(GUID clsid, IStream** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return ut::scene::OkOrFalse(ut::scene::OnSceneDefaults(
        [&](I3DSceneDefaults& defaults) { return defaults.GetStreamForClass(clsid, out); }));
}

HRESULT KXCreateDefaultInstance(REFGUID clsid, REFGUID iid, void** out, IGWPreset* preset) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return ut::scene::OkOrFalse(ut::scene::OnSceneDefaults(
        [&](I3DSceneDefaults& defaults) { return defaults.CreateDefaultInstance(clsid, iid, out, preset); }));
}

HRESULT KXGetSceneProperty(REFGUID propertyId, REFGUID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return Normalised(
        On<I3DScene>([&](I3DScene& scene) { return scene.GetSceneProperty(propertyId, iid, out); }));
}

HRESULT KXGetListOfSceneCameras(I3DList** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return On<I3DScene>(
        [&](I3DScene& scene) { return scene.ListObjects(GUID_3DCameraFamily, GW3DLIST_HIERARCHY, out); });
}

HRESULT KXGetCurrentSceneModel(REFGUID iid, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    return On<I3DScene>([&](I3DScene& scene) {
        ut::ComPtr<IUnknown> model;
        HRESULT hr = scene.GetModel(model.Put());
        if (FAILED(hr) || !model)
            return FAILED(hr) ? hr : S_FALSE;
        return model->QueryInterface(iid, out);
    });
}

HRESULT KXGetCurrentSceneTimeMapping(IGWProperties** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    ut::ComPtr<IGWProperties> scene;
    if (HRESULT hr = KXGetCurrentScene(IID_IGWProperties, scene.PutVoid()); FAILED(hr))
        return hr;
    ut::util::HostVariant mapping;
    if (FAILED(scene->GetProperty(GUID_GWTimeMappingProperty, mapping.Get(), 0)))
        return S_FALSE;
    const GWVARIANT& held = *mapping.Get();
    if ((held.vt != VT_UNKNOWN && held.vt != VT_DISPATCH) || !held.punkVal)
        return E_NOINTERFACE;
    return held.punkVal->QueryInterface(IID_IGWProperties, reinterpret_cast<void**>(out));
}

HRESULT KXGetCurrentSceneProperty(GUID propertyClass, CGWVariant& value, int createIfMissing) {
    ut::ComPtr<IGWProperties> properties;
    if (HRESULT hr = KXGetCurrentScene(IID_IGWProperties, properties.PutVoid()); FAILED(hr))
        return hr;
    if (properties->GetProperty(propertyClass, &value, 0) == S_OK || !createIfMissing)
        return S_OK;
    ut::ComPtr<I3DScene> scene;
    if (HRESULT hr = KXGetCurrentScene(IID_I3DScene, scene.PutVoid()); FAILED(hr))
        return hr;
    ut::ComPtr<IGWProperties> created;
    if (HRESULT hr = ut::sdk::CreateInstance(propertyClass, ut::scene::kPropertyContext, IID_IGWProperties,
                                             created.PutVoid());
        FAILED(hr))
        return hr;
    if (HRESULT hr = scene->AddProperty(propertyClass, created.Get(), ut::scene::kAddedPropertyKind,
                                        ut::scene::kAddedPropertyFlags);
        FAILED(hr))
        return hr;
    value.Clear();
    if (HRESULT hr = created->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&value.punkVal));
        FAILED(hr))
        return hr;
    value.vt = VT_UNKNOWN;
    return S_OK;
}

HRESULT KXGetSceneRootProperty(REFGUID a, REFGUID b, void** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr))
        return hr;
    if (IsEqualGUID(b, GUID_NULL) || IsEqualGUID(a, GUID_NULL))
        return E_FAIL;
    ut::ComPtr<I3DModel> model;
    HRESULT hr = KXGetCurrentSceneModel(IID_I3DModel, model.PutVoid());
    if (FAILED(hr) || hr == S_FALSE)
        return FAILED(hr) ? hr : S_OK;
    if (hr = model->GetRootProperty(a, b, out, 1); SUCCEEDED(hr) && !*out)
        hr = model->GetRootProperty(a, b, out, 0);
    return Normalised(hr);
}

HRESULT F3DGetPropsList(I3DObject* object, REFGUID propertyClass, I3DList** out) {
    if (HRESULT hr = ClearOut(out); FAILED(hr) || !object)
        return E_POINTER;
    return ut::ExportBoundary([&] { return ut::scene::PropsList(*object, propertyClass, out); },
                              HRESULT{E_FAIL});
}

HRESULT F3DAddObjectToTransientObjectContainer(IGWComponentHierarchy* object, ULONG flags) {
    if (!object)
        return E_POINTER;
    return Normalised(ut::scene::OnTransientContainer(
        [&](I3DTransientObjectContainer& container) { return container.Add(object, flags); }));
}

HRESULT F3DAddObjectToTransientObjectContainer(IUnknown* object) {
    return ut::scene::AsHierarchy(object, [](IGWComponentHierarchy* hierarchy) {
        return F3DAddObjectToTransientObjectContainer(hierarchy, ut::scene::kTransientFlags);
    });
}

HRESULT F3DRemoveObjectFromTransientObjectContainer(IGWComponentHierarchy* object) {
    if (!object)
        return E_POINTER;
    HRESULT hr = ut::scene::OnTransientContainer(
        [&](I3DTransientObjectContainer& container) { return container.Remove(object); });
    return hr == ut::scene::kNotHeld ? S_FALSE : Normalised(hr);
}

HRESULT F3DRemoveObjectFromTransientObjectContainer(IUnknown* object) {
    return ut::scene::AsHierarchy(object, [](IGWComponentHierarchy* hierarchy) {
        return F3DRemoveObjectFromTransientObjectContainer(hierarchy);
    });
}

HRESULT F3DIsObjectInTransientObjectContainer(IGWComponentHierarchy* object) {
    if (!object)
        return E_POINTER;
    HRESULT hr = ut::scene::OnTransientContainer(
        [&](I3DTransientObjectContainer& container) { return container.Contains(object); });
    if (FAILED(hr) || hr == ut::scene::kNotHeld)
        return hr;
    // An object that declares itself not transient is not, even when the container holds it.
    ut::ComPtr<IUnknown> marker;
    return SUCCEEDED(object->QueryInterface(IID_GWNotTransient, marker.PutVoid())) ? S_FALSE : S_OK;
}

HRESULT F3DIsObjectInTransientObjectContainer(IUnknown* object) {
    return ut::scene::AsHierarchy(object, [](IGWComponentHierarchy* hierarchy) {
        return F3DIsObjectInTransientObjectContainer(hierarchy);
    });
}

HRESULT F3DTransientObjectContainerReset() {
    return Normalised(ut::scene::OnTransientContainer(
        [](I3DTransientObjectContainer& container) { return container.Reset(); }));
}

HRESULT KXTimeControlReset(int reset) {
    ut::ComPtr<IGWPlayControl> play;
    if (HRESULT hr = GWQueryGenericObject(CLSID_GWPlayControl, IID_IGWPlayControl, play.PutVoid());
        FAILED(hr))
        return hr;
    const tagGWPLAYCONTROLSETTINGS settings = ut::scene::ResetSettings(reset != 0);
    return Normalised(play->SetSettings(&settings));
}

HRESULT F3DSetComponentValueCmd(IUnknown* component, REFGUID parameterId, const GWVARIANT* value) {
    if (!component)
        return E_POINTER;
    ut::ComPtr<IGWActiveData> data;
    if (HRESULT hr = component->QueryInterface(IID_IGWActiveData, data.PutVoid()); FAILED(hr))
        return hr;
    tagGWComponent parameter{};
    if (HRESULT hr = data->FindParameter(parameterId, &parameter); FAILED(hr))
        return hr;
    ut::ComPtr<IGWComponentHierarchy> hierarchy;
    if (HRESULT hr = component->QueryInterface(IID_IGWComponentHierarchy, hierarchy.PutVoid()); FAILED(hr))
        return hr;
    ut::ComPtr<IGWSetValueProxy> proxy;
    if (HRESULT hr = GWGetSetValueProxy(hierarchy.Get(), IID_IGWSetValueProxy, proxy.PutVoid()); FAILED(hr))
        return hr;
    CGWTime now;
    tagGWTIME record = now.ToRecord();
    if (SUCCEEDED(KXGetCurrentTime(&record)))
        now = CGWTime(record);
    // A command the application refuses is its to report; the caller only asked for it to be made.
    (void)proxy->SetValue(0, hierarchy.Get(), parameter, 0, value, now.GetTime());
    return S_OK;
}

bool KXIsActiveDataSelected(IUnknown* data) {
    if (!data)
        return false;
    ut::ComPtr<IGWActiveData> active;
    if (FAILED(data->QueryInterface(IID_IGWActiveData, active.PutVoid())))
        return false;
    ULONG flags = 0;
    return SUCCEEDED(active->GetFlags(&flags)) && (flags & GWACTIVEDATA_SELECTED) != 0;
}

GUID F3DGetMaterialCatID() {
    return CATID_3DMaterial;
}

GUID F3DTranslateMaterialCATID(REFGUID id) {
    return IsEqualGUID(id, CATID_3DMaterial) ? F3DGetMaterialCatID() : id;
}

C3DComplexUndo::C3DComplexUndo(const wchar_t* name) {
    Open(name);
}

C3DComplexUndo::C3DComplexUndo(bool open, const wchar_t* name) {
    if (open)
        Open(name);
}

C3DComplexUndo::C3DComplexUndo(const C3DComplexUndo& other) = default;
C3DComplexUndo& C3DComplexUndo::operator=(const C3DComplexUndo& other) = default;

C3DComplexUndo::~C3DComplexUndo() {
    if (m_undoManager)
        (void)m_undoManager->CloseComplexUndo(); // a destructor has no one to tell
}

void C3DComplexUndo::Open(const wchar_t* name) {
    if (FAILED(GWQueryGenericObject(CLSID_GWUndoManager, IID_IGWUndoManager, m_undoManager.PutVoid())))
        return;
    BOOL inside = TRUE;
    // Inside an open step, or where the step cannot be opened, the edits join whatever is open.
    if (FAILED(m_undoManager->IsInComplexUndo(&inside)) || inside ||
        FAILED(m_undoManager->OpenComplexUndo(name, 0)))
        m_undoManager.Reset();
}
