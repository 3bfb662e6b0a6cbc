// The reference host's content container: a scene root that keeps, under their keys, the key
// time (a property set whose value parameter is a frame count), the transient object container,
// the scene defaults, and the reference-plane, device and cache folders.
#pragma once

#include <map>
#include <utility>
#include <vector>

#include <ut/host/reference_host.h>
#include <ut/platform/stream.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/content.h>
#include <ut/sdk/scene_defaults.h>
#include <ut/sdk/transient.h>

namespace ut::host {

// Holds objects by identity (their IUnknown), with the flags they were added with.
class TransientObjectContainer final : public ut::sdk::ComObject<I3DTransientObjectContainer> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE Add(IGWComponentHierarchy* object, ULONG flags) override;
    HRESULT STDMETHODCALLTYPE Remove(IGWComponentHierarchy* object) override;
    HRESULT STDMETHODCALLTYPE Contains(IGWComponentHierarchy* object) override;
    HRESULT STDMETHODCALLTYPE Reset() override;

private:
    std::map<IUnknown*, std::pair<ut::ComPtr<IUnknown>, ULONG>> held_;
};

// Per class, a default object (an empty property set of the class) and a default stream (empty),
// both made on first request and kept.
class SceneDefaults final : public ut::sdk::ComObject<I3DSceneDefaults> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetObjectForClass(GUID clsid, IUnknown** object) override;
    HRESULT STDMETHODCALLTYPE GetStreamForClass(GUID clsid, IStream** stream) override;
    // Creates through the installed classes; the preset is not applied.
    HRESULT STDMETHODCALLTYPE CreateDefaultInstance(REFCLSID clsid, REFIID iid, void** object,
                                                    IGWPreset* preset) override;

private:
    std::map<GUID, ut::ComPtr<IUnknown>, ut::GuidLess> objects_;
    std::map<GUID, ut::ComPtr<IStream>, ut::GuidLess> streams_;
};

class ContentContainer final : public ut::sdk::ComObject<IGWContentContainer> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;
    // Makes the members as the settings say.
    HRESULT Build(const Settings& settings);

    HRESULT STDMETHODCALLTYPE FindObject(REFGUID key, REFIID iid, void** object) override;

private:
    std::vector<std::pair<GUID, ut::ComPtr<IUnknown>>> members_;
};

// A content container started from `settings`, for the class factory of content containers.
HRESULT MakeContentContainer(const Settings& settings, IUnknown** made);

} // namespace ut::host
