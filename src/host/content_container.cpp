// The reference host's content container and the members it keeps.
#include "content_container.h"

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

#include "folder.h"
#include "host_support.h"
#include "property_set.h"

namespace ut::host {
namespace {

// The object the container is asked about, by identity.
ut::ComPtr<IUnknown> Identity(IGWComponentHierarchy* object) {
    ut::ComPtr<IUnknown> identity;
    if (object)
        (void)object->QueryInterface(IID_IUnknown, identity.PutVoid()); // every object answers IUnknown
    return identity;
}

template <class Object, class... Arguments>
ut::ComPtr<IUnknown> Member(Arguments&&... arguments) {
    ut::ComPtr<Object> made = Make<Object>(std::forward<Arguments>(arguments)...);
    ut::ComPtr<IUnknown> member;
    if (made)
        (void)made->QueryInterface(IID_IUnknown, member.PutVoid()); // every object answers IUnknown
    return member;
}

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> TransientObjectContainer::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<TransientObjectContainer, I3DTransientObjectContainer>(
            IID_I3DTransientObjectContainer)};
    return map;
}

HRESULT TransientObjectContainer::Add(IGWComponentHierarchy* object, ULONG flags) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DTransientObjectContainer::Add"); FAILED(hr))
        return hr;
    ut::ComPtr<IUnknown> identity = Identity(object);
    if (!identity)
        return E_POINTER;
    return ut::ExportBoundary([&] {
        auto [entry, added] = held_.try_emplace(identity.Get(), identity, flags);
        return added ? S_OK : S_FALSE;
    });
}

HRESULT TransientObjectContainer::Remove(IGWComponentHierarchy* object) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DTransientObjectContainer::Remove"); FAILED(hr))
        return hr;
    ut::ComPtr<IUnknown> identity = Identity(object);
    if (!identity)
        return E_POINTER;
    return held_.erase(identity.Get()) ? S_OK : S_FALSE;
}

HRESULT TransientObjectContainer::Contains(IGWComponentHierarchy* object) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DTransientObjectContainer::Contains"); FAILED(hr))
        return hr;
    ut::ComPtr<IUnknown> identity = Identity(object);
    if (!identity)
        return E_POINTER;
    return held_.count(identity.Get()) ? S_OK : S_FALSE;
}

HRESULT TransientObjectContainer::Reset() {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DTransientObjectContainer::Reset"); FAILED(hr))
        return hr;
    held_.clear();
    return S_OK;
}

std::span<const CGWCOMObject::InterfaceEntry> SceneDefaults::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<SceneDefaults, I3DSceneDefaults>(IID_I3DSceneDefaults)};
    return map;
}

HRESULT SceneDefaults::GetObjectForClass(GUID clsid, IUnknown** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSceneDefaults::GetObjectForClass"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        ut::ComPtr<IUnknown>& kept = objects_[clsid];
        if (!kept)
            kept = Member<PropertySet>(PropertySetDescription{clsid, L"Defaults", {}, {}});
        return kept ? kept.CopyTo(object) : E_OUTOFMEMORY;
    });
}

HRESULT SceneDefaults::GetStreamForClass(GUID clsid, IStream** stream) {
    if (!stream)
        return E_POINTER;
    *stream = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSceneDefaults::GetStreamForClass"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        ut::ComPtr<IStream>& kept = streams_[clsid];
        if (!kept)
            if (HRESULT hr = ut::platform::CreateMemoryStream(kept.Put()); FAILED(hr))
                return hr;
        const LARGE_INTEGER start{};
        if (HRESULT hr = kept->Seek(start, STREAM_SEEK_SET, nullptr); FAILED(hr))
            return hr;
        return kept.CopyTo(stream);
    });
}

HRESULT SceneDefaults::CreateDefaultInstance(REFCLSID clsid, REFIID iid, void** object, IGWPreset*) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSceneDefaults::CreateDefaultInstance"); FAILED(hr))
        return hr;
    return KXCreateInstance(clsid, iid, object);
}

std::span<const CGWCOMObject::InterfaceEntry> ContentContainer::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<ContentContainer, IGWContentContainer>(IID_IGWContentContainer)};
    return map;
}

HRESULT ContentContainer::Build(const Settings& settings) {
    return ut::ExportBoundary([&] {
        const ContainersDescription& names = settings.scene.containers;
        const PropertySetDescription keyTime{
            GUID_GWKeyTimeProperty, L"Key time", {{GUID_GWValueParameter, L"frames", settings.keyFrame}}, {}};
        members_ = {
            {GUID_GWKeyTimeProperty, Member<PropertySet>(keyTime)},
            {GUID_3DTransientObjectContainerKey, Member<TransientObjectContainer>()},
            {GUID_3DSceneDefaultsKey, Member<SceneDefaults>()},
            {GUID_3DRefPlaneFolderKey, Member<Folder>(Folder::Role::kReferencePlanes, names.referencePlanes)},
            {GUID_3DDeviceManagerKey, Member<Folder>(Folder::Role::kPlain, names.devices)},
            {GUID_3DCacheManagerKey, Member<Folder>(Folder::Role::kCaches, names.caches)},
        };
        for (const auto& [key, member] : members_)
            if (!member)
                return E_OUTOFMEMORY;
        return S_OK;
    });
}

HRESULT ContentContainer::FindObject(REFGUID key, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWContentContainer::FindObject"); FAILED(hr))
        return hr;
    for (const auto& [own, member] : members_)
        if (IsEqualGUID(own, key))
            return member->QueryInterface(iid, object);
    return DISP_E_MEMBERNOTFOUND;
}

HRESULT MakeContentContainer(const Settings& settings, IUnknown** made) {
    ut::ComPtr<ContentContainer> container = Make<ContentContainer>();
    if (!container)
        return E_OUTOFMEMORY;
    if (HRESULT hr = container->Build(settings); FAILED(hr))
        return hr;
    return container->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(made));
}

} // namespace ut::host
