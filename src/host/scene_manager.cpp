// The reference host's scene and scene manager.
#include "scene_manager.h"

#include <ut/sdk/presets.h>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/database.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

#include "host_support.h"
#include "list.h"

namespace ut::host {
namespace {

// The scene's containers: their keys, roles, and where a description names their members.
struct ContainerKind {
    const GUID* key;
    Folder::Role role;
    std::vector<std::wstring> ContainersDescription::*members;
};

const ContainerKind kSceneContainers[] = {
    {&GUID_3DLayerContainer, Folder::Role::kLayers, &ContainersDescription::layers},
    {&GUID_3DPassContainer, Folder::Role::kLayers, &ContainersDescription::passes},
    {&GUID_3DParTypeContainer, Folder::Role::kPlain, &ContainersDescription::parameterTypes},
    {&GUID_3DEnvironmentContainer, Folder::Role::kPlain, &ContainersDescription::environments},
};

// Clears `out` and lets the fault hook fail `operation`.
template <class Out>
HRESULT Begin(const char* operation, Out** out) {
    if (!out)
        return E_POINTER;
    *out = nullptr;
    return ut::sdk::CheckHostFault(operation);
}

} // namespace

ut::ComPtr<Scene> Scene::Build(const SceneDescription& description) {
    ut::ComPtr<Scene> scene = Make<Scene>();
    ObjectDescription root;
    root.name = description.name;
    root.model = true;
    root.children = description.objects;
    if (!scene || !(scene->root_ = SceneObject::Build(root)) ||
        !AddPropertySets(description.properties, scene->Data().members))
        return nullptr;
    scene->root_->MakeRoot();
    for (const ContainerKind& kind : kSceneContainers) {
        ut::ComPtr<Folder> folder = Make<Folder>(kind.role, description.containers.*kind.members);
        if (!folder)
            return nullptr;
        scene->containers_.emplace_back(*kind.key, std::move(folder));
    }
    if (!BuildMedia(description, scene->sources_, scene->clips_))
        return nullptr;
    return scene;
}

SceneDescription Scene::Describe() const {
    SceneDescription description;
    ObjectDescription root = root_->Describe();
    description.name = root.name;
    description.objects = std::move(root.children);
    description.properties = DescribePropertySets(Data().members);
    for (size_t i = 0; i < containers_.size(); ++i)
        description.containers.*kSceneContainers[i].members = containers_[i].second->Members();
    for (const ut::ComPtr<MediaItem>& source : sources_->Members())
        description.sources.push_back(source->DescribeSource());
    for (const ut::ComPtr<MediaItem>& clip : clips_->Members())
        description.clips.push_back(clip->DescribeClip());
    return description;
}

std::span<const CGWCOMObject::InterfaceEntry> Scene::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<Scene, I3DScene>(IID_I3DScene),
                                         ut::sdk::Entry<Scene, IGWProperties>(IID_IGWProperties)};
    return map;
}

HRESULT Scene::GetContainer(REFGUID key, REFIID iid, void** container) {
    if (HRESULT hr = Begin("I3DScene::GetContainer", container); FAILED(hr))
        return hr;
    for (const auto& [own, folder] : containers_)
        if (IsEqualGUID(own, key))
            return folder->QueryInterface(iid, container);
    if (IsEqualGUID(key, GUID_3DSourcesContainerKey))
        return sources_->QueryInterface(iid, container);
    if (IsEqualGUID(key, GUID_3DClipsContainerKey))
        return clips_->QueryInterface(iid, container);
    return DISP_E_MEMBERNOTFOUND;
}

HRESULT Scene::GetSceneProperty(REFGUID clsid, REFIID iid, void** property) {
    if (HRESULT hr = Begin("I3DScene::GetSceneProperty", property); FAILED(hr))
        return hr;
    for (const ut::ComPtr<PropertySet>& set : Data().members)
        if (IsEqualGUID(set->Data().clsid, clsid))
            return set->QueryInterface(iid, property);
    return DISP_E_MEMBERNOTFOUND;
}

HRESULT Scene::AddProperty(REFGUID clsid, IGWProperties* set, LONG, ULONG) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DScene::AddProperty"); FAILED(hr))
        return hr;
    if (!set)
        return E_POINTER;
    ut::ComPtr<PropertySet> own = OwnPropertySet(set);
    if (!own)
        return E_INVALIDARG;
    // One set per class: a set of a class the scene has replaces the one it had.
    std::vector<ut::ComPtr<PropertySet>>& members = Data().members;
    own->Data().clsid = clsid;
    for (ut::ComPtr<PropertySet>& member : members) {
        if (IsEqualGUID(member->Data().clsid, clsid)) {
            member = std::move(own);
            return S_OK;
        }
    }
    return ut::ExportBoundary([&] {
        members.push_back(std::move(own));
        return S_OK;
    });
}

HRESULT Scene::ListObjects(REFGUID family, LONG how, I3DList** objects) {
    if (HRESULT hr = Begin("I3DScene::ListObjects", objects); FAILED(hr))
        return hr;
    if (how != GW3DLIST_CHILDREN && how != GW3DLIST_HIERARCHY)
        return E_INVALIDARG;
    return ut::ExportBoundary([&] {
        std::vector<SceneObject*> candidates;
        if (how == GW3DLIST_HIERARCHY)
            root_->CollectBelow(candidates);
        else
            for (const ut::ComPtr<SceneObject>& child : root_->Children())
                candidates.push_back(child.Get());
        std::vector<IUnknown*> members;
        for (SceneObject* candidate : candidates)
            if (candidate->InFamily(family))
                members.push_back(static_cast<I3DObject*>(candidate));
        return HandOutList(members, objects);
    });
}

HRESULT Scene::GetModel(IUnknown** model) {
    if (HRESULT hr = Begin("I3DScene::GetModel", model); FAILED(hr))
        return hr;
    return root_->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(model));
}

HRESULT SceneManager::QueryInterface(REFIID iid, void** object) {
    if (presets_ && IsEqualGUID(iid, IID_IGWPresetManager))
        return presets_->QueryInterface(iid, object);
    return ComObject::QueryInterface(iid, object);
}

std::span<const CGWCOMObject::InterfaceEntry> SceneManager::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<SceneManager, I3DSceneManager>(IID_I3DSceneManager),
        ut::sdk::Entry<SceneManager, IGWManagerRegistry>(IID_IGWManagerRegistry),
        ut::sdk::Entry<SceneManager, IGWHierarchyRoots>(IID_IGWHierarchyRoots)};
    return map;
}

HRESULT SceneManager::GetCurrentScene(IUnknown** scene) {
    if (HRESULT hr = Begin("I3DSceneManager::GetCurrentScene", scene); FAILED(hr))
        return hr;
    if (!scene_)
        return E_FAIL;
    return scene_->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(scene));
}

HRESULT SceneManager::FindObjectByName(const wchar_t* name, I3DObject** object) {
    if (HRESULT hr = Begin("I3DSceneManager::FindObjectByName", object); FAILED(hr))
        return hr;
    if (!name)
        return E_POINTER;
    if (!scene_)
        return E_FAIL;
    SceneObject* found = scene_->Root().FindByName(name);
    if (!found)
        return S_FALSE;
    *object = found;
    found->AddRef();
    return S_OK;
}

HRESULT SceneManager::CreateObjectFromPrimitive(I3DPrimitive* primitive, const wchar_t* name,
                                                I3DObject** object) {
    if (HRESULT hr = Begin("I3DSceneManager::CreateObjectFromPrimitive", object); FAILED(hr))
        return hr;
    if (!primitive || !name)
        return E_POINTER;
    return ut::ExportBoundary([&] {
        ut::ComPtr<SceneObject> made = Make<SceneObject>(name, false);
        if (made)
            made->SetPrimitive(primitive);
        return HandOut(made, IID_I3DObject, reinterpret_cast<void**>(object));
    });
}

HRESULT SceneManager::CreateModelObject(const wchar_t* name, REFIID iid, void** model) {
    if (HRESULT hr = Begin("I3DSceneManager::CreateModelObject", model); FAILED(hr))
        return hr;
    if (!name)
        return E_POINTER;
    return ut::ExportBoundary([&] { return HandOut(Make<SceneObject>(name, true), iid, model); });
}

HRESULT SceneManager::AddObject(I3DObject* object, I3DObject* parent, int select) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSceneManager::AddObject"); FAILED(hr))
        return hr;
    if (!object)
        return E_POINTER;
    if (!scene_)
        return E_FAIL;
    ut::ComPtr<SceneObject> child = SceneObject::Own(object);
    ut::ComPtr<SceneObject> under =
        parent ? SceneObject::Own(parent) : ut::ComPtr<SceneObject>(&scene_->Root());
    if (!child || child->Parent() || child->InScene() || !under || !under->InScene())
        return E_INVALIDARG;
    if (!under->AddChild(*child))
        return E_OUTOFMEMORY;
    if (select)
        child->Select(true);
    return S_OK;
}

HRESULT SceneManager::RemoveObject(I3DObject* object) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSceneManager::RemoveObject"); FAILED(hr))
        return hr;
    if (!object)
        return E_POINTER;
    ut::ComPtr<SceneObject> own = SceneObject::Own(object);
    if (!own || (scene_ && own.Get() == &scene_->Root()))
        return E_INVALIDARG;
    if (!own->InScene())
        return S_FALSE;
    own->Detach();
    ut::ComPtr<IGWActiveDatabaseNotifier> database;
    if (SUCCEEDED(
            GWQueryGenericObject(CLSID_GWActiveDatabase, IID_IGWActiveDatabaseNotifier, database.PutVoid())))
        (void)database->Fire(GWDB_EVENT_REMOVED,
                             static_cast<I3DObject*>(own.Get())); // told or not, it is gone
    return S_OK;
}

HRESULT SceneManager::GetHierarchyRoot(I3DObject* object, I3DObject** root) {
    if (!root)
        return E_POINTER;
    *root = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWHierarchyRoots::GetHierarchyRoot"); FAILED(hr))
        return hr;
    ut::ComPtr<SceneObject> own = SceneObject::Own(object);
    if (!own)
        return E_INVALIDARG;
    SceneObject* top = own.Get();
    while (top->Parent() && !(scene_ && top->Parent() == &scene_->Root()))
        top = top->Parent();
    return top->QueryInterface(IID_I3DObject, reinterpret_cast<void**>(root));
}

HRESULT SceneManager::DeleteAll(int) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSceneManager::DeleteAll"); FAILED(hr))
        return hr;
    if (!scene_)
        return E_FAIL;
    scene_->Root().RemoveChildren();
    return S_OK;
}

HRESULT SceneManager::SetNotificationMode(LONG mode, LONG) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSceneManager::SetNotificationMode"); FAILED(hr))
        return hr;
    if (mode != GW3DNOTIFY_QUIET && mode != GW3DNOTIFY_NORMAL)
        return E_INVALIDARG;
    notificationMode_ = mode;
    return S_OK;
}

HRESULT SceneManager::StoreCommand(REFGUID command, REFGUID target, IGWExecContext* context) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSceneManager::StoreCommand"); FAILED(hr))
        return hr;
    stored_ = StoredCommand{command, target, ut::ComPtr<IGWExecContext>(context)};
    return S_OK;
}

HRESULT SceneManager::PostCommand() {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSceneManager::PostCommand"); FAILED(hr))
        return hr;
    if (!stored_)
        return S_FALSE;
    return ut::ExportBoundary([&] {
        posted_.push_back(stored_->command);
        stored_.reset();
        return S_OK;
    });
}

HRESULT SceneManager::FindManager(REFGUID id, REFIID iid, void** manager) {
    if (HRESULT hr = Begin("IGWManagerRegistry::FindManager", manager); FAILED(hr))
        return hr;
    auto found = managers_.find(id);
    return found == managers_.end() ? DISP_E_MEMBERNOTFOUND : found->second->QueryInterface(iid, manager);
}

HRESULT SceneManager::RegisterManager(REFGUID id, IUnknown* manager) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWManagerRegistry::RegisterManager"); FAILED(hr))
        return hr;
    if (!manager)
        return managers_.erase(id) ? S_OK : S_FALSE;
    return ut::ExportBoundary([&] {
        ut::ComPtr<IUnknown>& slot = managers_[id];
        HRESULT hr = slot ? S_FALSE : S_OK;
        slot = ut::ComPtr<IUnknown>(manager);
        return hr;
    });
}

} // namespace ut::host
