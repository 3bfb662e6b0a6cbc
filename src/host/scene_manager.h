// The reference host's scene and scene manager: one current scene, a root model with the objects
// below it, the scene's own property sets and containers, and the manager's registry of generic
// managers, notification mode and stored command.
#pragma once

#include <map>
#include <optional>
#include <utility>
#include <vector>

#include <ut/host/reference_scene.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/hierarchy.h>
#include <ut/sdk/scene.h>

#include "folder.h"
#include "property_set.h"
#include "scene_object.h"

namespace ut::host {

class Scene final : public PropertiesObject<I3DScene> {
public:
    // The scene `description` describes; null when memory ran out.
    static ut::ComPtr<Scene> Build(const SceneDescription& description);
    SceneDescription Describe() const;

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetContainer(REFGUID key, REFIID iid, void** container) override;
    HRESULT STDMETHODCALLTYPE GetSceneProperty(REFGUID clsid, REFIID iid, void** property) override;
    // Takes only the host's own property sets (E_INVALIDARG for others), one per class: a set of a
    // class the scene has replaces the one it had. `kind` and `flags` are not kept.
    HRESULT STDMETHODCALLTYPE AddProperty(REFGUID clsid, IGWProperties* set, LONG kind, ULONG flags) override;
    HRESULT STDMETHODCALLTYPE ListObjects(REFGUID family, LONG how, I3DList** objects) override;
    HRESULT STDMETHODCALLTYPE GetModel(IUnknown** model) override;

    SceneObject& Root() { return *root_; }

private:
    ut::ComPtr<SceneObject> root_;
    std::vector<std::pair<GUID, ut::ComPtr<Folder>>> containers_;
    ut::ComPtr<MediaContainer> sources_, clips_;
};

class SceneManager final : public ut::sdk::ComObject<I3DSceneManager, IGWManagerRegistry, IGWHierarchyRoots> {
public:
    explicit SceneManager(ut::ComPtr<Scene> scene) : scene_(std::move(scene)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;
    // Also answers the preset manager's interfaces, with the preset manager (an object of its own).
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override;
    void SetPresetManager(ut::ComPtr<IUnknown> presets) { presets_ = std::move(presets); }

    HRESULT STDMETHODCALLTYPE GetCurrentScene(IUnknown** scene) override;
    HRESULT STDMETHODCALLTYPE FindObjectByName(const wchar_t* name, I3DObject** object) override;
    HRESULT STDMETHODCALLTYPE CreateObjectFromPrimitive(I3DPrimitive* primitive, const wchar_t* name,
                                                        I3DObject** object) override;
    HRESULT STDMETHODCALLTYPE CreateModelObject(const wchar_t* name, REFIID iid, void** model) override;
    // Only the host's own objects are taken (E_INVALIDARG for others).
    HRESULT STDMETHODCALLTYPE AddObject(I3DObject* object, I3DObject* parent, int select) override;
    HRESULT STDMETHODCALLTYPE RemoveObject(I3DObject* object) override;
    HRESULT STDMETHODCALLTYPE DeleteAll(int flags) override;
    // E_INVALIDARG for a mode other than GW3DNOTIFY_QUIET and GW3DNOTIFY_NORMAL.
    HRESULT STDMETHODCALLTYPE SetNotificationMode(LONG mode, LONG reserved) override;
    HRESULT STDMETHODCALLTYPE StoreCommand(REFGUID command, REFGUID target, IGWExecContext* context) override;
    HRESULT STDMETHODCALLTYPE PostCommand() override;

    HRESULT STDMETHODCALLTYPE FindManager(REFGUID id, REFIID iid, void** manager) override;
    HRESULT STDMETHODCALLTYPE RegisterManager(REFGUID id, IUnknown* manager) override;

    // The object's ancestor right below the scene's root (the object itself when it is there); for
    // an object in no scene, the top of its own hierarchy.
    HRESULT STDMETHODCALLTYPE GetHierarchyRoot(I3DObject* object, I3DObject** root) override;

    Scene* CurrentScene() const { return scene_.Get(); }
    LONG NotificationMode() const { return notificationMode_; }
    // The ids of the commands run, in order.
    const std::vector<GUID>& PostedCommands() const { return posted_; }

private:
    struct StoredCommand {
        GUID command;
        GUID target;
        ut::ComPtr<IGWExecContext> context;
    };

    ut::ComPtr<Scene> scene_;
    std::map<GUID, ut::ComPtr<IUnknown>, ut::GuidLess> managers_;
    LONG notificationMode_ = GW3DNOTIFY_NORMAL;
    std::optional<StoredCommand> stored_;
    std::vector<GUID> posted_;
    ut::ComPtr<IUnknown> presets_;
};

} // namespace ut::host
