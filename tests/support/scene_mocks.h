// GoogleMock host objects of the scene family, one per host interface, and the action that hands
// an object out through an out-parameter as the host does.
#pragma once

#include <cstddef>
#include <tuple>

#include <gmock/gmock.h>

#include <ut/sdk/components.h>
#include <ut/sdk/content.h>
#include <ut/sdk/curves.h>
#include <ut/sdk/database.h>
#include <ut/sdk/hierarchy.h>
#include <ut/sdk/list.h>
#include <ut/sdk/notify.h>
#include <ut/sdk/play.h>
#include <ut/sdk/presets.h>
#include <ut/sdk/properties.h>
#include <ut/sdk/scene.h>
#include <ut/sdk/scene_defaults.h>
#include <ut/sdk/transient.h>
#include <ut/sdk/undo.h>
#include <ut/sdk/views.h>

#include "support/com_mock.h"

namespace ut::test {

// Writes `object` (with a reference added) through argument N and answers `hr`.
template <std::size_t N, class Object>
auto GiveOut(Object* object, HRESULT hr = S_OK) {
    return [object, hr](auto&&... arguments) -> HRESULT {
        auto* out = std::get<N>(std::forward_as_tuple(arguments...));
        object->AddRef();
        *reinterpret_cast<Object**>(out) = object;
        return hr;
    };
}

#define UT_MOCK(result, name, arguments)                                                                     \
    MOCK_METHOD(result, name, arguments, (override, Calltype(STDMETHODCALLTYPE)))

struct MockSceneManager : ComMock<I3DSceneManager> {
    UT_MOCK(HRESULT, GetCurrentScene, (IUnknown**));
    UT_MOCK(HRESULT, FindObjectByName, (const wchar_t*, I3DObject**));
    UT_MOCK(HRESULT, CreateObjectFromPrimitive, (I3DPrimitive*, const wchar_t*, I3DObject**));
    UT_MOCK(HRESULT, CreateModelObject, (const wchar_t*, REFIID, void**));
    UT_MOCK(HRESULT, AddObject, (I3DObject*, I3DObject*, int));
    UT_MOCK(HRESULT, RemoveObject, (I3DObject*));
    UT_MOCK(HRESULT, DeleteAll, (int));
    UT_MOCK(HRESULT, SetNotificationMode, (LONG, LONG));
    UT_MOCK(HRESULT, StoreCommand, (REFGUID, REFGUID, IGWExecContext*));
    UT_MOCK(HRESULT, PostCommand, ());
};

struct MockManagerRegistry : ComMock<IGWManagerRegistry> {
    UT_MOCK(HRESULT, FindManager, (REFGUID, REFIID, void**));
    UT_MOCK(HRESULT, RegisterManager, (REFGUID, IUnknown*));
};

struct MockScene : ComMock<I3DScene> {
    UT_MOCK(HRESULT, GetContainer, (REFGUID, REFIID, void**));
    UT_MOCK(HRESULT, GetSceneProperty, (REFGUID, REFIID, void**));
    UT_MOCK(HRESULT, AddProperty, (REFGUID, IGWProperties*, LONG, ULONG));
    UT_MOCK(HRESULT, ListObjects, (REFGUID, LONG, I3DList**));
    UT_MOCK(HRESULT, GetModel, (IUnknown**));
};

struct MockObject : ComMock<I3DObject> {
    UT_MOCK(HRESULT, GetName, (LPOLESTR*));
    UT_MOCK(HRESULT, SetName, (const wchar_t*));
    UT_MOCK(HRESULT, GetParent, (I3DObject**));
    UT_MOCK(HRESULT, GetChildren, (I3DList**));
};

struct MockModel : ComMock<I3DModel> {
    UT_MOCK(HRESULT, GetRootProperty, (REFGUID, REFIID, void**, LONG));
};

struct MockProperties : ComMock<IGWProperties> {
    UT_MOCK(HRESULT, GetParameterValue, (REFGUID, GWVARIANT*));
    UT_MOCK(HRESULT, SetValue, (const tagGWREQUEST*, const GWVARIANT*));
    UT_MOCK(HRESULT, Refresh, (const tagGWREQUEST*, BOOL, LONG, LONG));
    UT_MOCK(HRESULT, GetProperty, (REFGUID, GWVARIANT*, LONG));
    UT_MOCK(HRESULT, CountMembers, (REFGUID, ULONG*));
    UT_MOCK(HRESULT, GetMembers, (REFGUID, ULONG, ULONG, IGWProperties**));
    UT_MOCK(HRESULT, EnumProperties, (ULONG, IEnumGWProperties**));
};

struct MockEnumProperties : ComMock<IEnumGWProperties> {
    UT_MOCK(HRESULT, Next, (ULONG, tagGWPROPERTY*, ULONG*));
    UT_MOCK(HRESULT, Skip, (ULONG));
    UT_MOCK(HRESULT, Reset, ());
    UT_MOCK(HRESULT, Clone, (IEnumGWProperties**));
};

struct MockPropertyOwner : ComMock<IGWPropertyOwner> {
    UT_MOCK(HRESULT, GetPropertySets, (IGWProperties**));
};

struct MockContentContainer : ComMock<IGWContentContainer> {
    UT_MOCK(HRESULT, FindObject, (REFGUID, REFIID, void**));
};

struct MockList : ComMock<I3DList> {
    UT_MOCK(HRESULT, GetCount, (ULONG*));
    UT_MOCK(HRESULT, GetItem, (ULONG, I3DElemRef**));
    UT_MOCK(HRESULT, NewElement, (REFIID, void**));
    UT_MOCK(HRESULT, Append, (I3DElemRef*));
    UT_MOCK(HRESULT, EnumElements, (IEnum3DElemRef**));
};

struct MockElemRef : ComMock<I3DElemRef> {
    UT_MOCK(HRESULT, SetTarget, (IUnknown*, const tagGWComponent*));
    UT_MOCK(HRESULT, GetTarget, (REFIID, void**, LONG));
    UT_MOCK(HRESULT, SetAsGroup, (IUnknown*, I3DGroup*));
    UT_MOCK(HRESULT, Update, (LONG));
};

struct MockEnumElemRef : ComMock<IEnum3DElemRef> {
    UT_MOCK(HRESULT, Next, (ULONG, I3DElemRef**, ULONG*));
    UT_MOCK(HRESULT, Skip, (ULONG));
    UT_MOCK(HRESULT, Reset, ());
    UT_MOCK(HRESULT, Clone, (IEnum3DElemRef**));
};

struct MockComponentHierarchy : ComMock<IGWComponentHierarchy> {
    UT_MOCK(HRESULT, GetRootComponent, (tagGWComponent*));
    UT_MOCK(HRESULT, GetComponentGuid, (const tagGWComponent&, GUID*));
    UT_MOCK(HRESULT, GetFirstChild, (const tagGWComponent&, USHORT, tagGWComponent*));
    UT_MOCK(HRESULT, GetNextSibling, (const tagGWComponent&, USHORT, tagGWComponent*));
    UT_MOCK(HRESULT, GetNestedHierarchy, (const tagGWComponent&, REFIID, void**));
    UT_MOCK(HRESULT, MoveComponent, (const tagGWComponent&, LONG, const tagGWComponent*));
};

struct MockActiveData : ComMock<IGWActiveData> {
    UT_MOCK(HRESULT, GetFlags, (ULONG*));
    UT_MOCK(HRESULT, FindParameter, (REFGUID, tagGWComponent*));
    UT_MOCK(HRESULT, QueryObjects, (ULONG, ULONG, ULONG, REFGUID, REFIID, IGWEnumObjects**));
    UT_MOCK(HRESULT, ResolveObject, (IUnknown*, ULONG*));
    UT_MOCK(HRESULT, GetComponentRecord, (ULONG, tagGWComponent*));
    UT_MOCK(HRESULT, CheckComponent, (const tagGWComponent&));
    UT_MOCK(HRESULT, FollowUp, (const tagGWComponent&, ULONG*));
    UT_MOCK(HRESULT, FetchObject, (ULONG, LONG, REFIID, void**));
};

struct MockHierarchyNode : ComMock<IGWHierarchyNode> {
    UT_MOCK(HRESULT, GetNodeInfo, (tagGWHierNodeInfo*));
};

struct MockPersist : ComMock<IPersist> {
    MockPersist() : ComMock(IID_IPersist) {}
    UT_MOCK(HRESULT, GetClassID, (CLSID*));
};

struct MockView : ComMock<I3DView> {
    UT_MOCK(HRESULT, GetObjectBoundingBox,
            (const tagGWTIME*, IUnknown*, LONG, E3DSpaceTag, const double*, LONG, C3DBBox*));
};

struct MockFCurve : ComMock<IFCurve> {
    UT_MOCK(HRESULT, GetParentObject, (IUnknown**));
};

struct MockEventSink : ComMock<IGWObjectEventSink> {
    UT_MOCK(HRESULT, OnObjectAdded, (IUnknown*));
    UT_MOCK(HRESULT, OnObjectRemoved, (IUnknown*));
    UT_MOCK(HRESULT, OnObjectIDChanged, (IUnknown*));
    UT_MOCK(HRESULT, OnBeginLoad, ());
    UT_MOCK(HRESULT, OnBeginSave, ());
    UT_MOCK(HRESULT, OnEndLoad, ());
    UT_MOCK(HRESULT, OnEndSave, ());
    UT_MOCK(HRESULT, OnFinalEndLoad, (ULONG));
};

struct MockPropertySink : ComMock<IGwPropertyNotifySink> {
    UT_MOCK(HRESULT, OnPropertyNotify,
            (ULONG, REFGUID, const VARIANT*, IUnknown*, const GWPARAMS*, USHORT, USHORT));
};

struct MockNotificationService : ComMock<IGWNotificationService> {
    UT_MOCK(HRESULT, Advise, (const wchar_t*, IGwNotifySink*));
    UT_MOCK(HRESULT, Unadvise, (const wchar_t*, IGwNotifySink*));
    UT_MOCK(HRESULT, Broadcast, (const wchar_t*, ULONG, const VARIANT*));
};

struct MockSetValueProxy : ComMock<IGWSetValueProxy> {
    UT_MOCK(HRESULT, SetValue,
            (ULONG, IGWComponentHierarchy*, const tagGWComponent&, ULONG, const GWVARIANT*, double));
};

struct MockTransientContainer : ComMock<I3DTransientObjectContainer> {
    UT_MOCK(HRESULT, Add, (IGWComponentHierarchy*, ULONG));
    UT_MOCK(HRESULT, Remove, (IGWComponentHierarchy*));
    UT_MOCK(HRESULT, Contains, (IGWComponentHierarchy*));
    UT_MOCK(HRESULT, Reset, ());
};

struct MockSceneDefaults : ComMock<I3DSceneDefaults> {
    UT_MOCK(HRESULT, GetObjectForClass, (GUID, IUnknown**));
    UT_MOCK(HRESULT, GetStreamForClass, (GUID, IStream**));
    UT_MOCK(HRESULT, CreateDefaultInstance, (REFCLSID, REFIID, void**, IGWPreset*));
};

struct MockUndoManager : ComMock<IGWUndoManager> {
    UT_MOCK(HRESULT, IsInComplexUndo, (BOOL*));
    UT_MOCK(HRESULT, OpenComplexUndo, (const wchar_t*, LONG));
    UT_MOCK(HRESULT, CloseComplexUndo, ());
};

struct MockPlayControl : ComMock<IGWPlayControl> {
    UT_MOCK(HRESULT, GetTime, (tagGWTIME*));
    UT_MOCK(HRESULT, GetTimeSpan, (tagGWTIMESPAN*));
    UT_MOCK(HRESULT, SetSettings, (const tagGWPLAYCONTROLSETTINGS*));
    UT_MOCK(HRESULT, GetSettings, (tagGWPLAYCONTROLSETTINGS*));
};

struct MockDeleteAllBracket : ComMock<IGWDeleteAllBracket> {
    UT_MOCK(HRESULT, Begin, ());
    UT_MOCK(HRESULT, End, ());
};

struct MockViewerControllerFactory : ComMock<IGWViewerControllerFactory> {
    UT_MOCK(HRESULT, CreateController, (REFIID, void**));
};

struct MockViewManager : ComMock<IGWViewManager> {
    UT_MOCK(HRESULT, GetViewName, (REFCLSID, wchar_t*, ULONG));
    UT_MOCK(HRESULT, GetViewClass, (const wchar_t*, CLSID*));
};

struct MockClassFactory : ComMock<IClassFactory> {
    UT_MOCK(HRESULT, CreateInstance, (IUnknown*, REFIID, void**));
    UT_MOCK(HRESULT, LockServer, (BOOL));
};

#undef UT_MOCK

// The interfaces without operations of their own.
using MockCacheMgr = ComMock<I3DCacheMgr>;
using MockRefPlaneFolder = ComMock<I3DRefPlaneFolder>;
using MockLayerContainer = ComMock<IKXLayerContainer>;
using MockGroup = ComMock<I3DGroup>;
using MockPrimitive = ComMock<I3DPrimitive>;
using MockExecContext = ComMock<IGWExecContext>;
class MockPreset : public ComMock<IGWPreset> {
public:
    MOCK_METHOD(HRESULT, GetObjectClass, (CLSID*), (override, Calltype(STDMETHODCALLTYPE)));
};
using MockViewerController = ComMock<IGWViewerController>;

} // namespace ut::test
