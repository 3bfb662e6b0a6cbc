// Scene access: the current scene, its managers and containers, scene-wide actions, the
// transient object container, and C3DComplexUndo, the bracket that makes several edits one
// undo step.
//
// Every call asks the application again; nothing is kept between calls. Out-parameters are
// cleared first and stay null on failure; a null one answers E_POINTER unless said otherwise.
// A failing host call ends a function with that call's result, after everything obtained is
// released.
#pragma once

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/platform/stream.h>
#include <ut/sdk/components.h>
#include <ut/sdk/content.h>
#include <ut/sdk/list.h>
#include <ut/sdk/presets.h>
#include <ut/sdk/scene.h>
#include <ut/sdk/undo.h>
#include <ut/sdk/variant.h>

// The three roots.
// The scene-manager factory asked for `iid`. A null `out` answers E_UNEXPECTED; the last argument
// is not used.
UT_API HRESULT KXGetSceneManager(REFGUID iid, void** out, int);
// The current scene asked for `iid`; S_OK or the first failure.
UT_API HRESULT KXGetCurrentScene(REFGUID iid, void** out);
// The current content container asked for `iid`; when there is none and `createIfNone` is
// non-zero, a new one (CoCreateInstance of CLSID_GWContentContainer, in-process server or
// handler). A null `out` answers E_UNEXPECTED.
UT_API HRESULT KXGet3DContentContainer(REFGUID iid, void** out, int createIfNone);

// Managers. The content-container members below make a content container when none is current.
// The cache manager asked for `iid`; any success is S_OK.
UT_API HRESULT KXGetCacheManager(REFGUID iid, void** out);
UT_API HRESULT KXGetCacheManager(I3DCacheMgr** out);
// The view manager; `iid` is not used (the manager comes as IGWViewManager). A null `out`
// answers E_UNEXPECTED.
UT_API HRESULT KXGetViewManager(REFGUID iid, void** out);
// A new viewer controller asked for `iid`. A null `out` answers E_UNEXPECTED.
UT_API HRESULT KXGetViewerControler(REFGUID iid, void** out);
// The manager registered with the scene manager under `managerId`, asked for `iid`.
UT_API HRESULT KXGetGenericManager(REFGUID managerId, REFGUID iid, void** out);

// Commands and scene-wide actions of the scene manager; each answers what the manager answers.
UT_API HRESULT KXStoreCommand(REFGUID command, REFGUID target, IGWExecContext* context);
UT_API HRESULT KXPostCommand();
// E_POINTER for a null `name` too.
UT_API HRESULT F3DGet3DObjectFromName(wchar_t* name, I3DObject** out);
UT_API HRESULT F3DSceneNotificationQuietOn();
UT_API HRESULT F3DSceneNotificationQuietOff();
UT_API HRESULT F3DCreate3DObjectFromPrimitive(I3DPrimitive* primitive, wchar_t* name, I3DObject** out);
UT_API HRESULT KXCreate3DModelObject(const wchar_t* name, REFGUID iid, void** out);
// `select` is handed to the scene manager.
UT_API HRESULT F3DAdd3DObjectToScene(I3DObject* object, I3DObject* parent, int select);
UT_API HRESULT F3DRemove3DObjectFromScene(I3DObject* object);
// Makes `element` stand for `group` in the current scene and applies it; the last argument is
// not used. S_OK or the first failure.
UT_API HRESULT F3DSetAs3DGroup(I3DGroup* group, I3DElemRef* element, IUnknown*);
// Every object below the scene's root is deleted, inside the application's delete-all bracket
// when it has one. E_FAIL without a scene manager.
UT_API HRESULT KXDeleteAll(int flags);

// The scene's containers; the first three answer S_OK for any success.
UT_API HRESULT F3DGetLayerContainer(IKXLayerContainer** out);
UT_API HRESULT F3DGetPassContainer(IKXLayerContainer** out);
UT_API HRESULT F3DGetParTypeContainer(REFGUID iid, void** out);
UT_API HRESULT F3DGetEnvironmentContainer(REFGUID iid, void** out);
// The content container's members.
UT_API HRESULT F3DGetRefPlaneFolder(I3DRefPlaneFolder** out);
UT_API HRESULT F3DGetDeviceManager(REFGUID iid, void** out);
// `out` is not checked: a null one goes to the container's lookup as it is.
UT_API HRESULT F3DGetTransientObjectContainer(REFGUID iid, void** out);

// Scene defaults. The first answers what the defaults answer; the other two answer S_OK or, for
// any other result (failures included), S_FALSE.
UT_API HRESULT KXGetSceneDefaultsObject(GUID clsid, IUnknown** out);
UT_API HRESULT KXGetStreamFromSceneDefaults(GUID clsid, IStream** out);
UT_API HRESULT KXCreateDefaultInstance(REFGUID clsid, REFGUID iid, void** out, IGWPreset* preset);

// Scene properties and the scene's model.
// The scene's property set of class `propertyId` asked for `iid`; any success is S_OK.
UT_API HRESULT KXGetSceneProperty(REFGUID propertyId, REFGUID iid, void** out);
// The scene's cameras (all of the hierarchy), as the scene answers.
UT_API HRESULT KXGetListOfSceneCameras(I3DList** out);
// The scene's root model asked for `iid`; S_FALSE and null when the scene has no model.
UT_API HRESULT KXGetCurrentSceneModel(REFGUID iid, void** out);
// The property set that the scene's time-mapping property holds; S_FALSE and null when the scene
// has no time mapping. E_NOINTERFACE when the property holds no object.
UT_API HRESULT KXGetCurrentSceneTimeMapping(IGWProperties** out);
// Reads the scene's property `propertyClass` into `value`. A read that does not answer S_OK still
// answers S_OK, with `value` as the read left it, unless `createIfMissing` is non-zero: then a
// property set of that class is made (CoCreateInstance, in-process server), added to the scene,
// and handed back in `value` as VT_UNKNOWN.
UT_API HRESULT KXGetCurrentSceneProperty(GUID propertyClass, CGWVariant& value, int createIfMissing);
// The root property (clsid `a`, interface `b`) of the scene's model, made when missing. E_FAIL
// when `b`, or else `a`, is GUID_NULL; S_OK with null when the scene has no model.
UT_API HRESULT KXGetSceneRootProperty(REFGUID a, REFGUID b, void** out);
// Every property of class `propertyClass` in the object's property sets, as a list: S_OK when it
// holds any, S_FALSE when empty. S_FALSE with no list when the object has no property sets; a
// host failure on the way answers E_FAIL.
UT_API HRESULT F3DGetPropsList(I3DObject* object, REFGUID propertyClass, I3DList** out);

// The transient object container. Add and reset answer S_OK for any success; remove answers
// S_FALSE when the object was not held; the test answers S_OK only when the container holds the
// object and the object does not answer IID_GWNotTransient, else S_FALSE. The IUnknown forms ask
// the object for IGWComponentHierarchy first and add with flags 1.
UT_API HRESULT F3DAddObjectToTransientObjectContainer(IGWComponentHierarchy* object, ULONG flags);
UT_API HRESULT F3DAddObjectToTransientObjectContainer(IUnknown* object);
UT_API HRESULT F3DRemoveObjectFromTransientObjectContainer(IGWComponentHierarchy* object);
UT_API HRESULT F3DRemoveObjectFromTransientObjectContainer(IUnknown* object);
UT_API HRESULT F3DIsObjectInTransientObjectContainer(IGWComponentHierarchy* object);
UT_API HRESULT F3DIsObjectInTransientObjectContainer(IUnknown* object);
UT_API HRESULT F3DTransientObjectContainerReset();

// Resets the play control: with `reset` zero only its range, to CGWTimeSpan::Undefined; otherwise
// the range 1 to 100 seconds, the position at its start, no loop, a preroll of 15, every frame
// played, times in seconds, real-time speed and a step of 5 (mask 0x77F).
UT_API HRESULT KXTimeControlReset(int reset);
// Sets `component`'s parameter `parameterId` to `value` at the current time through the
// application's set-value proxy, as a command. S_OK whatever the set answers; E_POINTER for a
// null component; a failure to reach the parameter or the proxy is returned.
UT_API HRESULT F3DSetComponentValueCmd(IUnknown* component, REFGUID parameterId, const GWVARIANT* value);
// Whether the object's active data says it is selected; false without active data.
UT_API bool KXIsActiveDataSelected(IUnknown* data);

// The component category of materials (CATID_3DMaterial). The translation answers that category
// for itself and every other identifier as it is.
UT_API GUID F3DGetMaterialCatID();
UT_API GUID F3DTranslateMaterialCATID(REFGUID id);

// One named undo step around the edits made while it lives. It opens a complex undo when the
// application has an undo manager and no complex undo is open; otherwise (nesting included) it is
// inert, and the edits join the step already open. A copy shares the bracket and closes it again
// when it goes, so keep one instance per bracket.
class UT_API C3DComplexUndo {
public:
    explicit C3DComplexUndo(const wchar_t* name);
    // With `open` false nothing is asked of the application and the bracket is inert.
    C3DComplexUndo(bool open, const wchar_t* name);
    C3DComplexUndo(const C3DComplexUndo& other);
    // Takes the other's manager; the bracket held before is not closed.
    C3DComplexUndo& operator=(const C3DComplexUndo& other);
    virtual ~C3DComplexUndo();

private:
    void Open(const wchar_t* name);

    ut::ComPtr<IGWUndoManager> m_undoManager;
};
