// The reference host's 3D objects and models: a name, flags, families, property sets and the
// objects below; the component hierarchy over the object, its property sets and their
// parameters; and the set-value proxy that sets those parameters.
//
// Components: the object is kind 1 (id 0); its n-th property set kind 2 (id n, from 1); the m-th
// parameter of that set kind 3 (id n, m in the first four data bytes).
#pragma once

#include <string>
#include <vector>

#include <ut/host/reference_scene.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/components.h>
#include <ut/sdk/scene.h>

#include "property_set.h"

namespace ut::host {

class SceneObject final
    : public ut::sdk::ComObject<I3DObject, I3DModel, IGWPropertyOwner, IGWComponentHierarchy, IGWActiveData> {
public:
    SceneObject(std::wstring name, bool model) : name_(std::move(name)), model_(model) {}
    // The objects below outlive this one only when someone else holds them; then they have no parent.
    ~SceneObject() override { RemoveChildren(); }

    // The object `description` describes with everything below it; null when memory ran out.
    static ut::ComPtr<SceneObject> Build(const ObjectDescription& description);
    ObjectDescription Describe() const;
    // `object` as the host's own SceneObject; null for an object of another kind.
    static ut::ComPtr<SceneObject> Own(IUnknown* object);

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetName(LPOLESTR* name) override;
    HRESULT STDMETHODCALLTYPE SetName(const wchar_t* name) override;
    HRESULT STDMETHODCALLTYPE GetParent(I3DObject** parent) override;
    HRESULT STDMETHODCALLTYPE GetChildren(I3DList** children) override;

    HRESULT STDMETHODCALLTYPE GetRootProperty(REFGUID clsid, REFIID iid, void** property,
                                              LONG existingOnly) override;

    HRESULT STDMETHODCALLTYPE GetPropertySets(IGWProperties** sets) override;

    HRESULT STDMETHODCALLTYPE GetRootComponent(tagGWComponent* root) override;
    HRESULT STDMETHODCALLTYPE GetComponentGuid(const tagGWComponent& component, GUID* guid) override;
    HRESULT STDMETHODCALLTYPE GetFirstChild(const tagGWComponent& component, USHORT depth,
                                            tagGWComponent* child) override;
    HRESULT STDMETHODCALLTYPE GetNextSibling(const tagGWComponent& component, USHORT depth,
                                             tagGWComponent* sibling) override;

    HRESULT STDMETHODCALLTYPE GetFlags(ULONG* flags) override;
    HRESULT STDMETHODCALLTYPE FindParameter(REFGUID id, tagGWComponent* parameter) override;

    // The hierarchy, for the scene manager.
    const std::wstring& Name() const { return name_; }
    SceneObject* Parent() const { return parent_; }
    const std::vector<ut::ComPtr<SceneObject>>& Children() const { return children_; }
    bool InFamily(REFGUID family) const;
    // Whether the object is a scene's root or below one.
    bool InScene() const;
    void MakeRoot() { root_ = true; }
    // Puts `child` last below this object; false when memory ran out.
    bool AddChild(SceneObject& child);
    // Takes this object out from below its parent.
    void Detach();
    // Takes every object out from below this one.
    void RemoveChildren();
    void Select(bool selected);
    void SetPrimitive(IUnknown* primitive) { primitive_ = ut::ComPtr<IUnknown>(primitive); }
    // The first object named `name` at or below this one, depth first.
    SceneObject* FindByName(std::wstring_view name);
    // Every object below this one, depth first.
    void CollectBelow(std::vector<SceneObject*>& objects);

    // Sets the parameter a kind-3 component addresses.
    HRESULT SetParameter(const tagGWComponent& parameter, const GWVARIANT* value);

private:
    std::vector<ut::ComPtr<PropertySet>>& Sets();
    const std::vector<ut::ComPtr<PropertySet>>& Sets() const;
    // The parameter a kind-3 component addresses; null for any other address.
    ParameterDescription* ParameterAt(const tagGWComponent& component);

    std::wstring name_;
    bool model_;
    bool root_ = false;
    ULONG flags_ = 0;
    std::vector<GUID> families_;
    // The collection that GetPropertySets hands out; its members are the object's sets.
    ut::ComPtr<PropertySet> sets_;
    ut::ComPtr<IUnknown> primitive_;
    SceneObject* parent_ = nullptr; // the parent holds this object
    std::vector<ut::ComPtr<SceneObject>> children_;
};

// Sets parameters of the host's own objects.
class SetValueProxy final : public ut::sdk::ComObject<IGWSetValueProxy> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE SetValue(ULONG request, IGWComponentHierarchy* hierarchy,
                                       const tagGWComponent& parameter, ULONG flags, const GWVARIANT* value,
                                       double seconds) override;
};

} // namespace ut::host
