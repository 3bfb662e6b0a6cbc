// The scene: the scene manager (found through its factory, with its registry of generic managers),
// the current scene with its containers and scene properties, the 3D objects and models of its
// hierarchy, and the bracket the application puts around deleting everything.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/list.h>
#include <ut/sdk/properties.h>

// {C628A561-425A-11D0-B148-00A02485CECB}: the scene-manager factory, an application service that
// answers the scene manager's interfaces.
inline constexpr CLSID CLSID_3DSceneManagerFactory = {
    0xC628A561, 0x425A, 0x11D0, {0xB1, 0x48, 0x00, 0xA0, 0x24, 0x85, 0xCE, 0xCB}};
// {2F64A102-425B-11D0-B148-00A02485CECB}
inline constexpr IID IID_I3DSceneManager = {
    0x2F64A102, 0x425B, 0x11D0, {0xB1, 0x48, 0x00, 0xA0, 0x24, 0x85, 0xCE, 0xCB}};
// {99ADE845-59E3-11D1-8E88-00A0248F947C}
inline constexpr IID IID_IGWManagerRegistry = {
    0x99ADE845, 0x59E3, 0x11D1, {0x8E, 0x88, 0x00, 0xA0, 0x24, 0x8F, 0x94, 0x7C}};
// {34CF77C1-4256-11D0-B148-00A02485CECB}
inline constexpr IID IID_I3DScene = {
    0x34CF77C1, 0x4256, 0x11D0, {0xB1, 0x48, 0x00, 0xA0, 0x24, 0x85, 0xCE, 0xCB}};
// {6B579D20-3DC5-11D0-9449-00AA006D3165}
inline constexpr IID IID_I3DModel = {
    0x6B579D20, 0x3DC5, 0x11D0, {0x94, 0x49, 0x00, 0xAA, 0x00, 0x6D, 0x31, 0x65}};
// The next four are not fixed by the application; these are the ones this SDK declares.
// {98079B53-8E47-4A94-A2DE-F23E4E0F1D46}
inline constexpr IID IID_I3DObject = {
    0x98079B53, 0x8E47, 0x4A94, {0xA2, 0xDE, 0xF2, 0x3E, 0x4E, 0x0F, 0x1D, 0x46}};
// {EFE82E85-6B92-47DE-9F0C-3C226A1DBFF6}
inline constexpr IID IID_I3DGroup = {
    0xEFE82E85, 0x6B92, 0x47DE, {0x9F, 0x0C, 0x3C, 0x22, 0x6A, 0x1D, 0xBF, 0xF6}};
// {B096D918-33C8-4739-8C3B-D3F723D1A642}
inline constexpr IID IID_I3DPrimitive = {
    0xB096D918, 0x33C8, 0x4739, {0x8C, 0x3B, 0xD3, 0xF7, 0x23, 0xD1, 0xA6, 0x42}};
// {FD3AFAF2-C184-4553-BC66-B9E01FC8F2B3}
inline constexpr IID IID_IGWExecContext = {
    0xFD3AFAF2, 0xC184, 0x4553, {0xBC, 0x66, 0xB9, 0xE0, 0x1F, 0xC8, 0xF2, 0xB3}};

// The scene's containers, by key: layers and passes (both IKXLayerContainer), parameter types and
// environments (asked for under the caller's interface).
// {FD0EA020-390C-11D1-B0B3-00A024C79287}
inline constexpr GUID GUID_3DLayerContainer = {
    0xFD0EA020, 0x390C, 0x11D1, {0xB0, 0xB3, 0x00, 0xA0, 0x24, 0xC7, 0x92, 0x87}};
// {1A66378B-490A-4D5E-904B-28631EA027C9}
inline constexpr GUID GUID_3DPassContainer = {
    0x1A66378B, 0x490A, 0x4D5E, {0x90, 0x4B, 0x28, 0x63, 0x1E, 0xA0, 0x27, 0xC9}};
// {CCDA3B90-3903-11D1-B0B3-00A024C79287}
inline constexpr IID IID_IKXLayerContainer = {
    0xCCDA3B90, 0x3903, 0x11D1, {0xB0, 0xB3, 0x00, 0xA0, 0x24, 0xC7, 0x92, 0x87}};
// {E0F12030-3AF8-11D3-A1F7-00A0248F9567}
inline constexpr GUID GUID_3DParTypeContainer = {
    0xE0F12030, 0x3AF8, 0x11D3, {0xA1, 0xF7, 0x00, 0xA0, 0x24, 0x8F, 0x95, 0x67}};
// {0091ED92-CF66-4779-BE32-D51584138ECA}
inline constexpr GUID GUID_3DEnvironmentContainer = {
    0x0091ED92, 0xCF66, 0x4779, {0xBE, 0x32, 0xD5, 0x15, 0x84, 0x13, 0x8E, 0xCA}};

// {9F43B240-58E5-11D0-8469-00A024C7919C}: the family of cameras.
inline constexpr GUID GUID_3DCameraFamily = {
    0x9F43B240, 0x58E5, 0x11D0, {0x84, 0x69, 0x00, 0xA0, 0x24, 0xC7, 0x91, 0x9C}};
// {4A3193B2-9199-11D0-B05B-00A0C90640EC}: the scene property that maps scene time to output time.
inline constexpr GUID GUID_GWTimeMappingProperty = {
    0x4A3193B2, 0x9199, 0x11D0, {0xB0, 0x5B, 0x00, 0xA0, 0xC9, 0x06, 0x40, 0xEC}};
// {3A9ECA62-4F91-11D0-AA46-00A0243E34C4}: the component category of materials.
inline constexpr GUID CATID_3DMaterial = {
    0x3A9ECA62, 0x4F91, 0x11D0, {0xAA, 0x46, 0x00, 0xA0, 0x24, 0x3E, 0x34, 0xC4}};

// {368229BD-0046-472F-9AEC-4CB6F8BE3794}
inline constexpr CLSID CLSID_GWDeleteAllBracket = {
    0x368229BD, 0x0046, 0x472F, {0x9A, 0xEC, 0x4C, 0xB6, 0xF8, 0xBE, 0x37, 0x94}};
// {6FB73EC6-5775-4491-9FB9-24E2E2DE17B9}
inline constexpr IID IID_IGWDeleteAllBracket = {
    0x6FB73EC6, 0x5775, 0x4491, {0x9F, 0xB9, 0x24, 0xE2, 0xE2, 0xDE, 0x17, 0xB9}};

// How a scene lists objects: the root model's children only, or its whole hierarchy.
inline constexpr LONG GW3DLIST_CHILDREN = 1;
inline constexpr LONG GW3DLIST_HIERARCHY = 2;
// The scene manager's notification modes: changes are held back, or sent again.
inline constexpr LONG GW3DNOTIFY_QUIET = 1;
inline constexpr LONG GW3DNOTIFY_NORMAL = 3;

// A group of objects that an element reference can be made to stand for; its operations belong
// to the grouping features.
struct I3DGroup : IUnknown {
protected:
    ~I3DGroup() = default;
};

// What generates an object's geometry; the scene manager turns one into an object.
struct I3DPrimitive : IUnknown {
protected:
    ~I3DPrimitive() = default;
};

// The context a stored command runs in; handed through to the application.
struct IGWExecContext : IUnknown {
protected:
    ~IGWExecContext() = default;
};

// A container of layers (or of passes); handed out as it is.
struct IKXLayerContainer : IUnknown {
protected:
    ~IKXLayerContainer() = default;
};

// An object of the scene hierarchy. Outputs are cleared first; a null one answers E_POINTER.
struct I3DObject : IUnknown {
    // The name, in task memory that the caller frees.
    virtual HRESULT STDMETHODCALLTYPE GetName(LPOLESTR* name) = 0;
    virtual HRESULT STDMETHODCALLTYPE SetName(const wchar_t* name) = 0;
    // The object above; S_FALSE and null for the scene's root and for objects not in a scene.
    virtual HRESULT STDMETHODCALLTYPE GetParent(I3DObject** parent) = 0;
    // A new list of the objects right below, in order; S_FALSE when there are none.
    virtual HRESULT STDMETHODCALLTYPE GetChildren(I3DList** children) = 0;

protected:
    ~I3DObject() = default;
};

// A model: an object that holds a hierarchy of its own and root properties.
struct I3DModel : IUnknown {
    // The model's property set of class `clsid`, through `iid`. With `existingOnly` non-zero a
    // missing set answers S_FALSE and null; otherwise it is made.
    virtual HRESULT STDMETHODCALLTYPE GetRootProperty(REFGUID clsid, REFIID iid, void** property,
                                                      LONG existingOnly) = 0;

protected:
    ~I3DModel() = default;
};

// Outputs are cleared first; a null one answers E_POINTER.
struct I3DScene : IUnknown {
    // The container kept under `key`, through `iid`; DISP_E_MEMBERNOTFOUND for a key the scene
    // has no container for.
    virtual HRESULT STDMETHODCALLTYPE GetContainer(REFGUID key, REFIID iid, void** container) = 0;
    // The scene's property set of class `clsid`, through `iid`; DISP_E_MEMBERNOTFOUND without one.
    virtual HRESULT STDMETHODCALLTYPE GetSceneProperty(REFGUID clsid, REFIID iid, void** property) = 0;
    // Adds `set` as the scene's property set of class `clsid`; `kind` and `flags` are how the
    // application files and saves it (the library passes 4 and 0x8000).
    virtual HRESULT STDMETHODCALLTYPE AddProperty(REFGUID clsid, IGWProperties* set, LONG kind,
                                                  ULONG flags) = 0;
    // A new list of the objects of `family`, as GW3DLIST_* says; S_FALSE when there are none.
    virtual HRESULT STDMETHODCALLTYPE ListObjects(REFGUID family, LONG how, I3DList** objects) = 0;
    // The scene's root model; S_FALSE and null for a scene without one.
    virtual HRESULT STDMETHODCALLTYPE GetModel(IUnknown** model) = 0;

protected:
    ~I3DScene() = default;
};

// Outputs are cleared first; a null one answers E_POINTER.
struct I3DSceneManager : IUnknown {
    // The scene being edited; E_FAIL when none is open.
    virtual HRESULT STDMETHODCALLTYPE GetCurrentScene(IUnknown** scene) = 0;
    // The first object of the current scene named `name` (depth first); S_FALSE and null for none.
    virtual HRESULT STDMETHODCALLTYPE FindObjectByName(const wchar_t* name, I3DObject** object) = 0;
    // A new object named `name` whose geometry `primitive` makes; it is in no scene yet.
    virtual HRESULT STDMETHODCALLTYPE CreateObjectFromPrimitive(I3DPrimitive* primitive, const wchar_t* name,
                                                                I3DObject** object) = 0;
    // A new model named `name`, through `iid`; it is in no scene yet.
    virtual HRESULT STDMETHODCALLTYPE CreateModelObject(const wchar_t* name, REFIID iid, void** model) = 0;
    // Puts `object` under `parent` (null: the scene's root), last; `select` non-zero also selects
    // it. E_INVALIDARG for an object already in a scene or a parent that is not.
    virtual HRESULT STDMETHODCALLTYPE AddObject(I3DObject* object, I3DObject* parent, int select) = 0;
    // Takes `object`, with everything below it, out of the scene; S_FALSE when it is in none.
    virtual HRESULT STDMETHODCALLTYPE RemoveObject(I3DObject* object) = 0;
    // Takes every object below the root out of the scene; `flags` are the application's options.
    virtual HRESULT STDMETHODCALLTYPE DeleteAll(int flags) = 0;
    // GW3DNOTIFY_QUIET holds change notifications back, GW3DNOTIFY_NORMAL sends them again.
    // `reserved` is 0.
    virtual HRESULT STDMETHODCALLTYPE SetNotificationMode(LONG mode, LONG reserved) = 0;
    // Keeps a command (its id and the id of what it applies to) to run in `context` on PostCommand.
    virtual HRESULT STDMETHODCALLTYPE StoreCommand(REFGUID command, REFGUID target,
                                                   IGWExecContext* context) = 0;
    // Runs the command kept last and forgets it; S_FALSE when none is kept.
    virtual HRESULT STDMETHODCALLTYPE PostCommand() = 0;

protected:
    ~I3DSceneManager() = default;
};

// The managers the application registers with the scene manager, each under its own id.
struct IGWManagerRegistry : IUnknown {
    // The manager registered under `id`, through `iid`; DISP_E_MEMBERNOTFOUND when there is none.
    virtual HRESULT STDMETHODCALLTYPE FindManager(REFGUID id, REFIID iid, void** manager) = 0;
    // Registers `manager` under `id` (S_FALSE when it replaces one); null withdraws the id.
    virtual HRESULT STDMETHODCALLTYPE RegisterManager(REFGUID id, IUnknown* manager) = 0;

protected:
    ~IGWManagerRegistry() = default;
};

// What the application does around deleting everything (closing views and editors first).
struct IGWDeleteAllBracket : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE Begin() = 0;
    // E_UNEXPECTED without a Begin.
    virtual HRESULT STDMETHODCALLTYPE End() = 0;

protected:
    ~IGWDeleteAllBracket() = default;
};

template <>
struct ut::InterfaceId<I3DGroup> : ut::Iid<IID_I3DGroup> {};
template <>
struct ut::InterfaceId<I3DPrimitive> : ut::Iid<IID_I3DPrimitive> {};
template <>
struct ut::InterfaceId<IGWExecContext> : ut::Iid<IID_IGWExecContext> {};
template <>
struct ut::InterfaceId<IKXLayerContainer> : ut::Iid<IID_IKXLayerContainer> {};
template <>
struct ut::InterfaceId<I3DObject> : ut::Iid<IID_I3DObject> {};
template <>
struct ut::InterfaceId<I3DModel> : ut::Iid<IID_I3DModel> {};
template <>
struct ut::InterfaceId<I3DScene> : ut::Iid<IID_I3DScene> {};
template <>
struct ut::InterfaceId<I3DSceneManager> : ut::Iid<IID_I3DSceneManager> {};
template <>
struct ut::InterfaceId<IGWManagerRegistry> : ut::Iid<IID_IGWManagerRegistry> {};
template <>
struct ut::InterfaceId<IGWDeleteAllBracket> : ut::Iid<IID_IGWDeleteAllBracket> {};
