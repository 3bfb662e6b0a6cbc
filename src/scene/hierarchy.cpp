// Hierarchy moves, hierarchy roots and the scene's bounding box.
#include <ut/hierarchy.h>
#include <ut/scene.h>
#include <ut/sdk/components.h>

namespace {

// The fetch index that hands out what the active data answers for a moved object.
constexpr LONG kMovedObjectIndex = -2;
// Arguments of the box requests: the whole hierarchy below, and an exact box from an object.
constexpr LONG kWithChildren = 1;
constexpr LONG kExact = 1;

bool Answers(IUnknown* object, REFIID iid) {
    ut::ComPtr<IUnknown> part;
    return SUCCEEDED(object->QueryInterface(iid, part.PutVoid())) && part;
}

// Under a model only models go: a marked object is refused as an invalid argument, any other as
// a bad pointer.
HRESULT AsModel(IUnknown* object, ut::ComPtr<IUnknown>& model) {
    if (SUCCEEDED(object->QueryInterface(IID_I3DModel, model.PutVoid())) && model)
        return S_OK;
    return Answers(object, IID_IGWNotUnderModel) ? E_INVALIDARG : E_POINTER;
}

// Under an item parent an object goes as its hierarchy item when it has one, else as itself.
ut::ComPtr<IUnknown> AsItem(IUnknown* object) {
    ut::ComPtr<IUnknown> item;
    if (SUCCEEDED(object->QueryInterface(IID_IGWHierarchyItem, item.PutVoid())) && item)
        return item;
    if (SUCCEEDED(object->QueryInterface(IID_IGWSecondaryItem, item.PutVoid())) && item)
        return item;
    ut::ComPtr<IGWHierarchyItemProvider> provider;
    if (SUCCEEDED(object->QueryInterface(IID_IGWHierarchyItemProvider, provider.PutVoid())) && provider &&
        SUCCEEDED(provider->GetHierarchyItem(item.Put())) && item)
        return item;
    return ut::ComPtr<IUnknown>(object);
}

// What the parent holds the moved object and the reference as.
HRESULT Resolve(IUnknown* parent, IUnknown* object, IUnknown* reference, ut::ComPtr<IUnknown>& moved,
                ut::ComPtr<IUnknown>& anchor) {
    ut::ComPtr<IGWHierarchyNode> node;
    if (SUCCEEDED(parent->QueryInterface(IID_IGWHierarchyNode, node.PutVoid())) && node) {
        tagGWHierNodeInfo info{sizeof info, GWHIERNODE_ITEMS};
        if (HRESULT hr = node->GetNodeInfo(&info); FAILED(hr))
            return hr;
        if (info.kind == GWHIERNODE_ITEMS) {
            moved = AsItem(object);
            anchor = reference ? AsItem(reference) : nullptr;
            return S_OK;
        }
        if (HRESULT hr = AsModel(object, moved); FAILED(hr))
            return hr;
        return reference ? AsModel(reference, anchor) : S_OK;
    }
    ut::ComPtr<IPersist> persist;
    CLSID kind = GUID_NULL;
    if (FAILED(parent->QueryInterface(IID_IPersist, persist.PutVoid())) || !persist ||
        FAILED(persist->GetClassID(&kind)))
        return E_INVALIDARG;
    if (!IsEqualGUID(kind, GUID_3DLayerContainer) && !IsEqualGUID(kind, GUID_3DPassContainer) &&
        !IsEqualGUID(kind, CLSID_3DPlainContainer))
        return E_INVALIDARG;
    moved = ut::ComPtr<IUnknown>(object);
    anchor = ut::ComPtr<IUnknown>(reference);
    return S_OK;
}

// The component of `object` in the parent's hierarchy: the look-up must answer S_OK.
HRESULT ComponentOf(IGWActiveData& data, IUnknown* object, tagGWComponent& component) {
    ULONG handle = 0;
    if (data.ResolveObject(object, &handle) != S_OK)
        return E_INVALIDARG;
    return data.GetComponentRecord(handle, &component);
}

// What the parent's active data hands out for the moved component, when it checks.
HRESULT HandOutMoved(IGWActiveData& data, const tagGWComponent& component, IUnknown** out) {
    if (data.CheckComponent(component) != S_OK)
        return S_OK;
    ULONG handle = 0;
    if (HRESULT hr = data.FollowUp(component, &handle); FAILED(hr))
        return hr;
    return data.FetchObject(handle, kMovedObjectIndex, IID_IUnknown, reinterpret_cast<void**>(out));
}

// Whether `parent` is `model`, by the identity of their model interfaces.
bool IsModel(I3DObject* parent, I3DModel* model) {
    ut::ComPtr<I3DModel> asModel;
    return SUCCEEDED(parent->QueryInterface(IID_I3DModel, asModel.PutVoid())) && asModel.Get() == model;
}

} // namespace

HRESULT KXMoveObjectInHier(IUnknown* parent, IUnknown* object, tagEGWDestination destination,
                           IUnknown* reference, IUnknown** out) {
    if (!object)
        return E_POINTER;
    bool relative = destination == GWDEST_BEFORE || destination == GWDEST_AFTER;
    if (relative && !reference)
        return E_POINTER;
    if (destination == GWDEST_FIRST || destination == GWDEST_LAST)
        reference = nullptr;
    if (out)
        *out = nullptr;
    if (!parent)
        return E_POINTER;
    ut::ComPtr<IUnknown> moved, anchor;
    if (HRESULT hr = Resolve(parent, object, reference, moved, anchor); FAILED(hr))
        return hr;
    ut::ComPtr<IGWActiveData> data;
    if (FAILED(parent->QueryInterface(IID_IGWActiveData, data.PutVoid())) || !data)
        return E_POINTER;
    tagGWComponent component{}, anchorComponent{};
    if (HRESULT hr = ComponentOf(*data, moved.Get(), component); FAILED(hr))
        return hr;
    if (out)
        if (HRESULT hr = HandOutMoved(*data, component, out); FAILED(hr))
            return hr;
    if (anchor)
        if (HRESULT hr = ComponentOf(*data, anchor.Get(), anchorComponent); FAILED(hr))
            return hr;
    ut::ComPtr<IGWComponentHierarchy> hierarchy;
    if (FAILED(data->QueryInterface(IID_IGWComponentHierarchy, hierarchy.PutVoid())) || !hierarchy)
        return E_NOINTERFACE;
    if (destination < GWDEST_FIRST || destination > GWDEST_LAST)
        return S_FALSE;
    return hierarchy->MoveComponent(component, destination, relative ? &anchorComponent : nullptr);
}

HRESULT KXGet3DObjectHierarchyRoot(I3DObject* object, I3DObject** root) {
    if (!object || !root)
        return E_POINTER;
    *root = nullptr;
    ut::ComPtr<IGWHierarchyRoots> roots;
    if (HRESULT hr = KXGetSceneManager(IID_IGWHierarchyRoots, roots.PutVoid(), 1); FAILED(hr))
        return hr;
    HRESULT hr = roots->GetHierarchyRoot(object, root);
    return FAILED(hr) ? hr : S_OK;
}

HRESULT KXGet3DObjectHierarchyRootInModel(I3DObject* object, I3DModel* model, I3DObject** root) {
    if (!object || !model || !root)
        return E_POINTER;
    *root = nullptr;
    ut::ComPtr<I3DModel> identity;
    if (HRESULT hr = model->QueryInterface(IID_I3DModel, identity.PutVoid()); FAILED(hr))
        return hr;
    ut::ComPtr<I3DObject> current(object), parent;
    if (HRESULT hr = object->GetParent(parent.Put()); FAILED(hr))
        return hr;
    if (!parent)
        return S_FALSE;
    while (!IsModel(parent.Get(), identity.Get())) {
        current = parent;
        if (HRESULT hr = current->GetParent(parent.Put()); FAILED(hr))
            return hr;
        if (!parent)
            return E_UNEXPECTED;
    }
    *root = current.Detach();
    return S_OK;
}

HRESULT KXGetSceneBBox(tagGWTIME* time, I3DView* view, int first, E3DSpaceTag space, C3DTransfo* transform,
                       int second, C3DBBox* box) {
    if (!box)
        return E_POINTER;
    ut::ComPtr<I3DScene> scene;
    if (HRESULT hr = KXGetCurrentScene(IID_I3DScene, scene.PutVoid()); FAILED(hr))
        return hr;
    ut::ComPtr<IUnknown> root;
    if (HRESULT hr = scene->GetModel(root.Put()); FAILED(hr))
        return hr;
    if (!root)
        return E_UNEXPECTED;
    if (transform && transform->IsStale())
        transform->Combine();
    const double* matrix = transform ? transform->Matrix() : nullptr;
    HRESULT hr = S_OK;
    if (view) {
        hr = view->GetObjectBoundingBox(time, root.Get(), kWithChildren, space, matrix, second, box);
    } else {
        ut::ComPtr<I3DBoundingBox> measured;
        if (hr = root->QueryInterface(IID_I3DBoundingBox, measured.PutVoid()); FAILED(hr))
            return hr;
        hr = measured->GetBoundingBox(time, kWithChildren, first, space, matrix, second, kExact, box);
    }
    return hr;
}
