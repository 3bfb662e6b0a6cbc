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
#include <ut/sdk/curves.h>
#include <ut/sdk/hierarchy.h>
#include <ut/sdk/scene.h>

#include "media.h"
#include "property_set.h"

namespace ut::host {

class SceneObject final
    : public ut::sdk::ComObject<I3DObject, I3DModel, IGWPropertyOwner, IGWComponentHierarchy, IGWActiveData,
                                IGWComponentAccess, IGWValidObject, IGWHierarchyNode, I3DBoundingBox> {
public:
    SceneObject(std::wstring name, bool model);
    // The objects below outlive this one only when someone else holds them; then they have no parent.
    ~SceneObject() override;

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
    // The root component of an object that references a model stands for that model.
    HRESULT STDMETHODCALLTYPE GetNestedHierarchy(const tagGWComponent& component, REFIID iid,
                                                 void** nested) override;

    HRESULT STDMETHODCALLTYPE GetFlags(ULONG* flags) override;
    HRESULT STDMETHODCALLTYPE FindParameter(REFGUID id, tagGWComponent* parameter) override;
    // GWQUERY_NESTED: the objects right below this one (each a hierarchy of its own), then the
    // model it references; `filter` keeps those of that family. GWQUERY_OPERATORS: the operator
    // stack, top first (`filter` a class); GWQUERY_OWNERS: the parent.
    HRESULT STDMETHODCALLTYPE QueryObjects(ULONG query, ULONG scope, ULONG depth, REFGUID filter, REFIID iid,
                                           IGWEnumObjects** objects) override;

    // S_OK while the object is in a scene.
    HRESULT STDMETHODCALLTYPE IsValid() override;

    // Moves. An object is addressed here by its serial number (a kind-4 component); any object of
    // the host resolves. A model is a node of kind 1, any other object an item parent (kind 3).
    HRESULT STDMETHODCALLTYPE MoveComponent(const tagGWComponent& component, LONG destination,
                                            const tagGWComponent* reference) override;
    HRESULT STDMETHODCALLTYPE ResolveObject(IUnknown* object, ULONG* handle) override;
    HRESULT STDMETHODCALLTYPE GetComponentRecord(ULONG handle, tagGWComponent* component) override;
    HRESULT STDMETHODCALLTYPE CheckComponent(const tagGWComponent& component) override;
    HRESULT STDMETHODCALLTYPE FollowUp(const tagGWComponent& component, ULONG* handle) override;
    HRESULT STDMETHODCALLTYPE FetchObject(ULONG handle, LONG index, REFIID iid, void** object) override;
    HRESULT STDMETHODCALLTYPE GetNodeInfo(tagGWHierNodeInfo* info) override;
    // The extents of the object (and, with `withChildren`, of everything below it), each moved by
    // the positions down to it (from the object itself in E3DSPACE_LOCAL, from the top otherwise),
    // then through `matrix` (row-major; scale and translation).
    HRESULT STDMETHODCALLTYPE GetBoundingBox(const tagGWTIME* time, LONG withChildren, LONG flags,
                                             E3DSpaceTag space, const double* matrix, LONG option, LONG exact,
                                             C3DBBox* box) override;

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
    // The object of serial number `serial`; null when there is none.
    static SceneObject* BySerial(ULONG serial);
    // Whether this object is `ancestor` or below it.
    bool IsWithin(const SceneObject* ancestor) const;

    // Sets the parameter a kind-3 component addresses.
    HRESULT SetParameter(const tagGWComponent& parameter, const GWVARIANT* value);

private:
    std::vector<ut::ComPtr<PropertySet>>& Sets();
    const std::vector<ut::ComPtr<PropertySet>>& Sets() const;
    // The parameter a kind-3 component addresses; null for any other address.
    ParameterDescription* ParameterAt(const tagGWComponent& component);
    void AddExtents(double (&offset)[3], bool withChildren, const double* matrix, C3DBBox& box) const;
    // The model this object references; null when it references none or the name is not a model.
    SceneObject* Referenced();
    HRESULT HandOutStacked(ULONG query, REFGUID filter, REFIID iid, IGWEnumObjects** objects);

    std::wstring name_;
    bool model_;
    bool root_ = false;
    ULONG flags_ = 0;
    std::vector<GUID> families_;
    std::wstring references_;
    std::vector<ut::ComPtr<StackedOperator>> operators_; // top first
    std::vector<double> extent_;
    std::vector<double> position_;
    ULONG serial_;
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
