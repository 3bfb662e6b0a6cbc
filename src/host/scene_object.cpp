// The reference host's 3D objects, their component hierarchy and the set-value proxy.
#include "scene_object.h"

#include <algorithm>
#include <cstring>
#include <map>
#include <new>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/testing.h>

#include "host_support.h"
#include "list.h"

namespace ut::host {
namespace {

// {BB0D8A56-8468-4A65-977E-21DCB0FD333F}: answers the SceneObject itself, so that the scene
// manager takes only objects of its own kind.
constexpr IID IID_ReferenceSceneObject = {
    0xBB0D8A56, 0x8468, 0x4A65, {0x97, 0x7E, 0x21, 0xDC, 0xB0, 0xFD, 0x33, 0x3F}};

enum ComponentKind : BYTE { kObject = 1, kPropertySet = 2, kParameter = 3 };

tagGWComponent Component(ComponentKind kind, ULONG set = 0, ULONG parameter = 0) {
    tagGWComponent component{};
    component.kind = kind;
    component.size = kind == kParameter ? 8 : 4;
    component.id = set;
    std::memcpy(component.data, &parameter, sizeof parameter);
    return component;
}

ULONG ParameterIndex(const tagGWComponent& component) {
    ULONG index = 0;
    std::memcpy(&index, component.data, sizeof index);
    return index;
}

ULONG FlagsOf(const ObjectDescription& description) {
    return (description.selected ? GWACTIVEDATA_SELECTED : 0) |
           (description.hidden ? GWACTIVEDATA_HIDDEN : 0);
}

} // namespace

namespace {

// Every live object by its serial number, for moves to address objects by number. Never
// destroyed: a host kept in a static of the application releases its objects at exit, possibly
// after this file's statics are gone. Built in static storage, so nothing is left on the heap
// once the objects are.
using SerialMap = std::map<ULONG, SceneObject*>;
SerialMap& Serials() {
    alignas(SerialMap) static unsigned char storage[sizeof(SerialMap)];
    static SerialMap* serials = new (storage) SerialMap;
    return *serials;
}
ULONG nextSerial = 1;
constexpr BYTE kMovedObject = 4;
constexpr ULONG kModelNode = 1;
constexpr LONG kPresentParent = -2;

} // namespace

SceneObject::SceneObject(std::wstring name, bool model)
    : name_(std::move(name)), model_(model), serial_(nextSerial++) {
    Serials()[serial_] = this;
}

SceneObject::~SceneObject() {
    RemoveChildren();
    Serials().erase(serial_);
}

SceneObject* SceneObject::BySerial(ULONG serial) {
    auto found = Serials().find(serial);
    return found == Serials().end() ? nullptr : found->second;
}

bool SceneObject::IsWithin(const SceneObject* ancestor) const {
    for (const SceneObject* at = this; at; at = at->parent_)
        if (at == ancestor)
            return true;
    return false;
}

ut::ComPtr<SceneObject> SceneObject::Build(const ObjectDescription& description) {
    ut::ComPtr<SceneObject> object = Make<SceneObject>(description.name, description.model);
    if (!object)
        return object;
    object->flags_ = FlagsOf(description);
    object->families_ = description.families;
    object->references_ = description.references;
    object->extent_ = description.extent;
    object->position_ = description.position;
    for (const GUID& clsid : description.operators) {
        object->operators_.push_back(Make<StackedOperator>(clsid));
        if (!object->operators_.back())
            return nullptr;
    }
    if (!description.properties.empty()) {
        object->sets_ = Make<PropertySet>();
        if (!object->sets_ || !AddPropertySets(description.properties, object->Sets()))
            return nullptr;
    }
    for (const ObjectDescription& child : description.children) {
        ut::ComPtr<SceneObject> built = Build(child);
        if (!built || !object->AddChild(*built))
            return nullptr;
    }
    return object;
}

ObjectDescription SceneObject::Describe() const {
    ObjectDescription description{name_,
                                  model_,
                                  (flags_ & GWACTIVEDATA_SELECTED) != 0,
                                  (flags_ & GWACTIVEDATA_HIDDEN) != 0,
                                  families_,
                                  DescribePropertySets(Sets()),
                                  {},
                                  references_,
                                  extent_,
                                  position_,
                                  {}};
    for (const ut::ComPtr<StackedOperator>& stacked : operators_) {
        CLSID clsid = GUID_NULL;
        (void)stacked->GetClassID(&clsid); // the host's own object: it answers
        description.operators.push_back(clsid);
    }
    for (const ut::ComPtr<SceneObject>& child : children_)
        description.children.push_back(child->Describe());
    return description;
}

ut::ComPtr<SceneObject> SceneObject::Own(IUnknown* object) {
    ut::ComPtr<SceneObject> own;
    if (object)
        (void)object->QueryInterface(IID_ReferenceSceneObject, own.PutVoid()); // null when not ours
    return own;
}

std::span<const CGWCOMObject::InterfaceEntry> SceneObject::GetInterfaceMap() const {
    static const InterfaceEntry object[] = {
        ut::sdk::Entry<SceneObject, I3DObject>(IID_I3DObject),
        ut::sdk::Entry<SceneObject, IGWPropertyOwner>(IID_IGWPropertyOwner),
        ut::sdk::Entry<SceneObject, IGWComponentHierarchy>(IID_IGWComponentHierarchy),
        ut::sdk::Entry<SceneObject, IGWActiveData>(IID_IGWActiveData),
        ut::sdk::Entry<SceneObject, IGWComponentAccess>(IID_IGWComponentAccess),
        ut::sdk::Entry<SceneObject, IGWValidObject>(IID_IGWValidObject),
        ut::sdk::Entry<SceneObject, IGWHierarchyNode>(IID_IGWHierarchyNode),
        ut::sdk::Entry<SceneObject, I3DBoundingBox>(IID_I3DBoundingBox),
        ut::sdk::Entry<SceneObject, SceneObject>(IID_ReferenceSceneObject)};
    static const InterfaceEntry model[] = {
        ut::sdk::Entry<SceneObject, I3DObject>(IID_I3DObject),
        ut::sdk::Entry<SceneObject, I3DModel>(IID_I3DModel),
        ut::sdk::Entry<SceneObject, IGWPropertyOwner>(IID_IGWPropertyOwner),
        ut::sdk::Entry<SceneObject, IGWComponentHierarchy>(IID_IGWComponentHierarchy),
        ut::sdk::Entry<SceneObject, IGWActiveData>(IID_IGWActiveData),
        ut::sdk::Entry<SceneObject, IGWComponentAccess>(IID_IGWComponentAccess),
        ut::sdk::Entry<SceneObject, IGWValidObject>(IID_IGWValidObject),
        ut::sdk::Entry<SceneObject, IGWHierarchyNode>(IID_IGWHierarchyNode),
        ut::sdk::Entry<SceneObject, I3DBoundingBox>(IID_I3DBoundingBox),
        ut::sdk::Entry<SceneObject, SceneObject>(IID_ReferenceSceneObject)};
    if (model_)
        return model;
    return object;
}

HRESULT SceneObject::GetName(LPOLESTR* name) {
    if (name)
        *name = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DObject::GetName"); FAILED(hr))
        return hr;
    return CopyToTaskMemory(name_, name);
}

HRESULT SceneObject::SetName(const wchar_t* name) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DObject::SetName"); FAILED(hr))
        return hr;
    if (!name)
        return E_POINTER;
    return ut::ExportBoundary([&] {
        name_ = name;
        return S_OK;
    });
}

HRESULT SceneObject::GetParent(I3DObject** parent) {
    if (!parent)
        return E_POINTER;
    *parent = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DObject::GetParent"); FAILED(hr))
        return hr;
    if (!parent_)
        return S_FALSE;
    *parent = parent_;
    parent_->AddRef();
    return S_OK;
}

HRESULT SceneObject::GetChildren(I3DList** children) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DObject::GetChildren"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        std::vector<IUnknown*> objects;
        for (const ut::ComPtr<SceneObject>& child : children_)
            objects.push_back(static_cast<I3DObject*>(child.Get()));
        return HandOutList(objects, children);
    });
}

HRESULT SceneObject::GetRootProperty(REFGUID clsid, REFIID iid, void** property, LONG existingOnly) {
    if (!property)
        return E_POINTER;
    *property = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DModel::GetRootProperty"); FAILED(hr))
        return hr;
    for (const ut::ComPtr<PropertySet>& set : Sets())
        if (IsEqualGUID(set->Data().clsid, clsid))
            return set->QueryInterface(iid, property);
    if (existingOnly)
        return S_FALSE;
    return ut::ExportBoundary([&] {
        ut::ComPtr<PropertySet> made = Make<PropertySet>();
        if (!sets_)
            sets_ = Make<PropertySet>();
        if (!made || !sets_)
            return E_OUTOFMEMORY;
        made->Data().clsid = clsid;
        Sets().push_back(made);
        return made->QueryInterface(iid, property);
    });
}

HRESULT SceneObject::GetPropertySets(IGWProperties** sets) {
    if (!sets)
        return E_POINTER;
    *sets = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWPropertyOwner::GetPropertySets"); FAILED(hr))
        return hr;
    if (!Sets().empty()) {
        *sets = sets_.Get();
        (*sets)->AddRef();
    }
    return S_OK;
}

HRESULT SceneObject::GetRootComponent(tagGWComponent* root) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWComponentHierarchy::GetRootComponent"); FAILED(hr))
        return hr;
    if (!root)
        return E_POINTER;
    *root = Component(kObject);
    return S_OK;
}

HRESULT SceneObject::GetComponentGuid(const tagGWComponent& component, GUID* guid) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWComponentHierarchy::GetComponentGuid"); FAILED(hr))
        return hr;
    if (!guid)
        return E_POINTER;
    if (component.kind == kObject) {
        *guid = GUID_NULL;
        return S_OK;
    }
    if (component.kind == kPropertySet && component.id >= 1 && component.id <= Sets().size()) {
        *guid = Sets()[component.id - 1]->Data().clsid;
        return S_OK;
    }
    const ParameterDescription* parameter = ParameterAt(component);
    if (!parameter)
        return E_INVALIDARG;
    *guid = parameter->id;
    return S_OK;
}

HRESULT SceneObject::GetFirstChild(const tagGWComponent& component, USHORT, tagGWComponent* child) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWComponentHierarchy::GetFirstChild"); FAILED(hr))
        return hr;
    if (!child)
        return E_POINTER;
    if (component.kind == kObject) {
        if (Sets().empty())
            return S_FALSE;
        *child = Component(kPropertySet, 1);
        return S_OK;
    }
    if (component.kind == kPropertySet && component.id >= 1 && component.id <= Sets().size()) {
        if (Sets()[component.id - 1]->Data().parameters.empty())
            return S_FALSE;
        *child = Component(kParameter, component.id, 0);
        return S_OK;
    }
    return ParameterAt(component) ? S_FALSE : E_INVALIDARG;
}

HRESULT SceneObject::GetNextSibling(const tagGWComponent& component, USHORT, tagGWComponent* sibling) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWComponentHierarchy::GetNextSibling"); FAILED(hr))
        return hr;
    if (!sibling)
        return E_POINTER;
    if (component.kind == kObject)
        return S_FALSE;
    if (component.kind == kPropertySet && component.id >= 1 && component.id <= Sets().size()) {
        if (component.id == Sets().size())
            return S_FALSE;
        *sibling = Component(kPropertySet, component.id + 1);
        return S_OK;
    }
    if (!ParameterAt(component))
        return E_INVALIDARG;
    ULONG next = ParameterIndex(component) + 1;
    if (next == Sets()[component.id - 1]->Data().parameters.size())
        return S_FALSE;
    *sibling = Component(kParameter, component.id, next);
    return S_OK;
}

HRESULT SceneObject::GetNestedHierarchy(const tagGWComponent& component, REFIID iid, void** nested) {
    if (!nested)
        return E_POINTER;
    *nested = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWComponentHierarchy::GetNestedHierarchy"); FAILED(hr))
        return hr;
    SceneObject* model = component.kind == kObject ? Referenced() : nullptr;
    if (!model)
        return S_FALSE;
    return model->QueryInterface(iid, nested);
}

HRESULT SceneObject::GetFlags(ULONG* flags) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveData::GetFlags"); FAILED(hr))
        return hr;
    if (!flags)
        return E_POINTER;
    *flags = flags_;
    return S_OK;
}

HRESULT SceneObject::FindParameter(REFGUID id, tagGWComponent* parameter) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveData::FindParameter"); FAILED(hr))
        return hr;
    if (!parameter)
        return E_POINTER;
    for (ULONG set = 0; set < Sets().size(); ++set) {
        const std::vector<ParameterDescription>& parameters = Sets()[set]->Data().parameters;
        for (ULONG index = 0; index < parameters.size(); ++index) {
            if (IsEqualGUID(parameters[index].id, id)) {
                *parameter = Component(kParameter, set + 1, index);
                return S_OK;
            }
        }
    }
    return DISP_E_MEMBERNOTFOUND;
}

HRESULT SceneObject::QueryObjects(ULONG query, ULONG, ULONG, REFGUID filter, REFIID iid,
                                  IGWEnumObjects** objects) {
    if (!objects)
        return E_POINTER;
    *objects = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveData::QueryObjects"); FAILED(hr))
        return hr;
    if (query == GWQUERY_OPERATORS || query == GWQUERY_OWNERS)
        return ut::ExportBoundary([&] { return HandOutStacked(query, filter, iid, objects); });
    if (query != GWQUERY_NESTED)
        return E_INVALIDARG;
    return ut::ExportBoundary([&] {
        std::vector<SceneObject*> models;
        for (const ut::ComPtr<SceneObject>& child : children_)
            models.push_back(child.Get());
        if (SceneObject* referenced = Referenced())
            models.push_back(referenced);
        std::vector<ut::ComPtr<IUnknown>> answered;
        for (SceneObject* model : models) {
            ut::ComPtr<IUnknown> one;
            if (IsEqualGUID(filter, GUID_NULL) || model->InFamily(filter))
                if (SUCCEEDED(model->QueryInterface(iid, one.PutVoid())))
                    answered.push_back(std::move(one));
        }
        return HandOutObjects(std::move(answered), objects);
    });
}

HRESULT SceneObject::HandOutStacked(ULONG query, REFGUID filter, REFIID iid, IGWEnumObjects** objects) {
    std::vector<ut::ComPtr<IUnknown>> answered;
    if (query == GWQUERY_OWNERS && parent_) {
        ut::ComPtr<IUnknown> owner;
        if (SUCCEEDED(parent_->QueryInterface(iid, owner.PutVoid())))
            answered.push_back(std::move(owner));
    }
    if (query == GWQUERY_OPERATORS)
        AppendOfClass(operators_, filter, iid, answered);
    return HandOutObjects(std::move(answered), objects);
}

SceneObject* SceneObject::Referenced() {
    if (references_.empty())
        return nullptr;
    SceneObject* top = this;
    while (top->parent_)
        top = top->parent_;
    SceneObject* found = top->FindByName(references_);
    return found && found->model_ && found != this ? found : nullptr;
}

HRESULT SceneObject::IsValid() {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWValidObject::IsValid"); FAILED(hr))
        return hr;
    return InScene() ? S_OK : S_FALSE;
}

HRESULT SceneObject::ResolveObject(IUnknown* object, ULONG* handle) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveData::ResolveObject"); FAILED(hr))
        return hr;
    if (!handle)
        return E_POINTER;
    ut::ComPtr<SceneObject> own = Own(object);
    if (!own)
        return S_FALSE;
    *handle = own->serial_;
    return S_OK;
}

HRESULT SceneObject::GetComponentRecord(ULONG handle, tagGWComponent* component) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveData::GetComponentRecord"); FAILED(hr))
        return hr;
    if (!component)
        return E_POINTER;
    if (!BySerial(handle))
        return E_INVALIDARG;
    *component = tagGWComponent{kMovedObject, 4, 0, handle, {}};
    return S_OK;
}

HRESULT SceneObject::CheckComponent(const tagGWComponent& component) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveData::CheckComponent"); FAILED(hr))
        return hr;
    SceneObject* object = component.kind == kMovedObject ? BySerial(component.id) : nullptr;
    return object && object->InScene() ? S_OK : S_FALSE;
}

HRESULT SceneObject::FollowUp(const tagGWComponent& component, ULONG* handle) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveData::FollowUp"); FAILED(hr))
        return hr;
    if (!handle)
        return E_POINTER;
    *handle = component.id;
    return component.kind == kMovedObject && BySerial(component.id) ? S_OK : E_INVALIDARG;
}

HRESULT SceneObject::FetchObject(ULONG handle, LONG index, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveData::FetchObject"); FAILED(hr))
        return hr;
    SceneObject* found = BySerial(handle);
    if (!found || index != kPresentParent)
        return E_INVALIDARG;
    return found->parent_ ? found->parent_->QueryInterface(iid, object) : S_FALSE;
}

HRESULT SceneObject::MoveComponent(const tagGWComponent& component, LONG destination,
                                   const tagGWComponent* reference) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWComponentHierarchy::MoveComponent"); FAILED(hr))
        return hr;
    ut::ComPtr<SceneObject> moved(component.kind == kMovedObject ? BySerial(component.id) : nullptr);
    SceneObject* anchor = reference ? BySerial(reference->id) : nullptr;
    bool relative = destination == GWDEST_BEFORE || destination == GWDEST_AFTER;
    if (!moved || IsWithin(moved.Get()) || moved->root_ ||
        (relative && (!anchor || anchor->parent_ != this)) || anchor == moved.Get() ||
        destination < GWDEST_FIRST || destination > GWDEST_LAST)
        return E_INVALIDARG;
    return ut::ExportBoundary([&] {
        children_.reserve(children_.size() + 1); // the detach below cannot be undone
        moved->Detach();
        auto at = destination == GWDEST_FIRST ? children_.begin()
                  : destination == GWDEST_LAST
                      ? children_.end()
                      : std::find_if(children_.begin(), children_.end(),
                                     [&](const auto& child) { return child.Get() == anchor; });
        if (destination == GWDEST_AFTER)
            ++at;
        children_.insert(at, moved);
        moved->parent_ = this;
        return S_OK;
    });
}

HRESULT SceneObject::GetNodeInfo(tagGWHierNodeInfo* info) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWHierarchyNode::GetNodeInfo"); FAILED(hr))
        return hr;
    if (!info)
        return E_POINTER;
    info->kind = model_ ? kModelNode : GWHIERNODE_ITEMS;
    return S_OK;
}

HRESULT SceneObject::GetBoundingBox(const tagGWTIME*, LONG withChildren, LONG, E3DSpaceTag space,
                                    const double* matrix, LONG, LONG, C3DBBox* box) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DBoundingBox::GetBoundingBox"); FAILED(hr))
        return hr;
    if (!box)
        return E_POINTER;
    *box = C3DBBox{};
    double offset[3] = {0, 0, 0};
    for (const SceneObject* at = space == E3DSPACE_LOCAL ? nullptr : parent_; at; at = at->parent_)
        for (std::size_t i = 0; i < 3 && at->position_.size() == 3; ++i)
            offset[i] += at->position_[i];
    AddExtents(offset, withChildren != 0, matrix, *box);
    return box->empty ? S_FALSE : S_OK;
}

void SceneObject::AddExtents(double (&offset)[3], bool withChildren, const double* matrix,
                             C3DBBox& box) const {
    double here[3] = {offset[0], offset[1], offset[2]};
    for (std::size_t i = 0; i < 3 && position_.size() == 3; ++i)
        here[i] += position_[i];
    if (extent_.size() == 6) {
        for (int corner = 0; corner < 8; ++corner) {
            double point[3], moved[3];
            for (int i = 0; i < 3; ++i)
                point[i] = here[i] + extent_[(corner >> i & 1) ? 3 + i : i];
            for (int i = 0; i < 3; ++i)
                moved[i] = matrix ? point[0] * matrix[i] + point[1] * matrix[4 + i] +
                                        point[2] * matrix[8 + i] + matrix[12 + i]
                                  : point[i];
            box.Add(moved);
        }
    }
    if (withChildren)
        for (const ut::ComPtr<SceneObject>& child : children_)
            child->AddExtents(here, true, matrix, box);
}

bool SceneObject::InFamily(REFGUID family) const {
    return std::any_of(families_.begin(), families_.end(),
                       [&](const GUID& own) { return IsEqualGUID(own, family); });
}

bool SceneObject::InScene() const {
    const SceneObject* top = this;
    while (top->parent_)
        top = top->parent_;
    return top->root_;
}

bool SceneObject::AddChild(SceneObject& child) {
    return ut::ExportBoundary(
        [&] {
            children_.emplace_back(&child);
            child.parent_ = this;
            return true;
        },
        false);
}

void SceneObject::Detach() {
    SceneObject* parent = std::exchange(parent_, nullptr);
    if (!parent)
        return;
    ut::ComPtr<SceneObject> keep(this); // the parent's reference may be the last one
    auto& siblings = parent->children_;
    siblings.erase(std::find(siblings.begin(), siblings.end(), keep));
}

void SceneObject::RemoveChildren() {
    for (const ut::ComPtr<SceneObject>& child : children_)
        child->parent_ = nullptr;
    children_.clear();
}

void SceneObject::Select(bool selected) {
    flags_ = selected ? (flags_ | GWACTIVEDATA_SELECTED) : (flags_ & ~GWACTIVEDATA_SELECTED);
}

SceneObject* SceneObject::FindByName(std::wstring_view name) {
    if (name_ == name)
        return this;
    for (const ut::ComPtr<SceneObject>& child : children_)
        if (SceneObject* found = child->FindByName(name))
            return found;
    return nullptr;
}

void SceneObject::CollectBelow(std::vector<SceneObject*>& objects) {
    for (const ut::ComPtr<SceneObject>& child : children_) {
        objects.push_back(child.Get());
        child->CollectBelow(objects);
    }
}

HRESULT SceneObject::SetParameter(const tagGWComponent& parameter, const GWVARIANT* value) {
    ParameterDescription* target = ParameterAt(parameter);
    return target ? FromVariant(value, target->value) : E_INVALIDARG;
}

std::vector<ut::ComPtr<PropertySet>>& SceneObject::Sets() {
    static std::vector<ut::ComPtr<PropertySet>> none;
    return sets_ ? sets_->Data().members : none;
}

const std::vector<ut::ComPtr<PropertySet>>& SceneObject::Sets() const {
    static const std::vector<ut::ComPtr<PropertySet>> none;
    return sets_ ? sets_->Data().members : none;
}

ParameterDescription* SceneObject::ParameterAt(const tagGWComponent& component) {
    if (component.kind != kParameter || component.id < 1 || component.id > Sets().size())
        return nullptr;
    std::vector<ParameterDescription>& parameters = Sets()[component.id - 1]->Data().parameters;
    ULONG index = ParameterIndex(component);
    return index < parameters.size() ? &parameters[index] : nullptr;
}

std::span<const CGWCOMObject::InterfaceEntry> SetValueProxy::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<SetValueProxy, IGWSetValueProxy>(IID_IGWSetValueProxy)};
    return map;
}

HRESULT SetValueProxy::SetValue(ULONG, IGWComponentHierarchy* hierarchy, const tagGWComponent& parameter,
                                ULONG, const GWVARIANT* value, double) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWSetValueProxy::SetValue"); FAILED(hr))
        return hr;
    ut::ComPtr<SceneObject> object = SceneObject::Own(hierarchy);
    return object ? object->SetParameter(parameter, value) : E_INVALIDARG;
}

} // namespace ut::host
