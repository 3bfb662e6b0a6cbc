// Scene access on the reference scene, what a plug-in sees when it works on a real scene; and the
// notification sinks: the application sink, the active database's events, the load guard, the
// property forwarders and the curve cache.
#include <string>
#include <tuple>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/notify.h>
#include <ut/scene.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/play.h>
#include <ut/sdk/scene_defaults.h>
#include <ut/sdk/transient.h>

#include "support/ref_tracker.h"
#include "support/scene_mocks.h"
#include "test_scene.h"

namespace {

using ::testing::_;
using ::testing::Return;
using ut::test::Find;
using ut::test::Held;
using ut::test::Result;
using ut::test::Service;

// The names of the objects a list points at, in order.
std::vector<std::wstring> Names(I3DList* list) {
    std::vector<std::wstring> names;
    ULONG count = 0;
    EXPECT_EQ(list->GetCount(&count), S_OK);
    for (ULONG i = 0; i < count; ++i) {
        ut::ComPtr<I3DElemRef> element;
        ut::ComPtr<I3DObject> object;
        ut::ComPtr<IGWProperties> set;
        LPOLESTR name = nullptr;
        EXPECT_EQ(list->GetItem(i, element.Put()), S_OK);
        if (SUCCEEDED(element->GetTarget(IID_I3DObject, object.PutVoid(), 1)) && object)
            object->GetName(&name);
        else if (SUCCEEDED(element->GetTarget(IID_IGWProperties, set.PutVoid(), 1)) && set)
            names.push_back(L"set");
        if (name)
            names.push_back(name);
        CoTaskMemFree(name);
    }
    return names;
}

// Whether `get` hands out an object, the same one both times it is called.
template <class Get>
bool SameTwice(Get get) {
    IUnknown *first = nullptr, *second = nullptr;
    bool same = get(&first) == S_OK && get(&second) == S_OK && first && first == second;
    Held(first), Held(second);
    return same;
}

class ReferenceScene : public ::testing::Test {
protected:
    ut::test::LiveObjectCheck live;
    ut::host::ReferenceHost host{ut::test::TestScene()};
};

TEST_F(ReferenceScene, ObjectsAreCreatedAddedFoundByNameAndRemoved) {
    ut::test::MockPrimitive primitive; // outlives the objects that hold it
    ut::ComPtr<I3DObject> robot = Find(L"Robot"), model, cube;
    ASSERT_EQ(KXCreate3DModelObject(L"Rig", IID_I3DObject, model.PutVoid()), S_OK);
    wchar_t cubeName[] = L"Cube";
    ASSERT_EQ(F3DCreate3DObjectFromPrimitive(&primitive, cubeName, cube.Put()), S_OK);
    // Not in the scene until added; then selected when asked; twice is refused.
    I3DObject* found = nullptr;
    EXPECT_EQ(F3DGet3DObjectFromName(cubeName, &found), S_FALSE);
    EXPECT_EQ(F3DAdd3DObjectToScene(model.Get(), nullptr, 0), S_OK);
    EXPECT_EQ(F3DAdd3DObjectToScene(cube.Get(), robot.Get(), 1), S_OK);
    EXPECT_EQ(F3DAdd3DObjectToScene(cube.Get(), nullptr, 0), E_INVALIDARG);
    EXPECT_TRUE(KXIsActiveDataSelected(cube.Get()));
    EXPECT_FALSE(KXIsActiveDataSelected(model.Get()));
    EXPECT_TRUE(Find(L"Cube") == cube);
    ut::ComPtr<I3DList> children;
    EXPECT_EQ(robot->GetChildren(children.Put()), S_OK);
    EXPECT_EQ(Names(children.Get()), (std::vector<std::wstring>{L"Arm", L"Cube"}));
    // Removed with what is below it; a second removal finds it in no scene.
    EXPECT_EQ(F3DRemove3DObjectFromScene(robot.Get()), S_OK);
    EXPECT_EQ(F3DRemove3DObjectFromScene(robot.Get()), S_FALSE);
    EXPECT_EQ(F3DGet3DObjectFromName(cubeName, &found), S_FALSE);
    std::vector<std::wstring> top;
    for (const ut::host::ObjectDescription& object : host.DescribeScene().objects)
        top.push_back(object.name);
    EXPECT_EQ(top, (std::vector<std::wstring>{L"Camera1", L"Light", L"Rig"}));
    EXPECT_EQ(KXDeleteAll(0), S_OK);
    EXPECT_TRUE(host.DescribeScene().objects.empty());
}

TEST_F(ReferenceScene, PropsListListsThePropertiesOfAClassOrAnswersFalse) {
    ut::ComPtr<I3DObject> arm = Find(L"Arm"), light = Find(L"Light");
    // The object and the property class; the result and the names listed, "-" for no list at all.
    const std::tuple<I3DObject*, GUID, HRESULT, std::vector<std::wstring>> cases[] = {
        {arm.Get(), ut::test::kColor, S_OK, {L"set", L"set"}},
        {arm.Get(), ut::test::kX, S_FALSE, {}},
        {light.Get(), ut::test::kColor, S_FALSE, {L"-"}}};
    for (const auto& [object, propertyClass, expected, names] : cases) {
        ut::ComPtr<I3DList> list;
        EXPECT_EQ(F3DGetPropsList(object, propertyClass, list.Put()), expected) << propertyClass.Data1;
        EXPECT_EQ(list ? Names(list.Get()) : std::vector<std::wstring>{L"-"}, names) << propertyClass.Data1;
    }
}

TEST_F(ReferenceScene, AComplexUndoBracketNestsIntoTheOuterOneAndClosesOnce) {
    {
        C3DComplexUndo outer(L"Move arm");
        {
            C3DComplexUndo nested(L"Nudge");
            C3DComplexUndo skipped(false, L"Never");
        }
        EXPECT_TRUE(host.UndoSteps().empty());
    }
    { C3DComplexUndo next(L"Rename"); }
    EXPECT_EQ(host.UndoSteps(), (std::vector<std::wstring>{L"Move arm", L"Rename"}));
}

TEST_F(ReferenceScene, TheTimeControlResetIsReadBackFromThePlayControl) {
    auto play = Service<IGWPlayControl>(CLSID_GWPlayControl);
    tagGWPLAYCONTROLSETTINGS before{}, after{};
    play->GetSettings(&before);
    ASSERT_EQ(KXTimeControlReset(1), S_OK);
    play->GetSettings(&after);
    EXPECT_EQ(std::vector<double>({after.span.start.time, after.span.end.time, after.position, after.speed}),
              std::vector<double>({1.0, 100.0, 1.0, 1.0}));
    EXPECT_EQ(
        std::vector<LONG>({after.loop, after.preroll, after.mode, after.format, after.step, after.realTime}),
        std::vector<LONG>({0, 15, 2, 10, 5, before.realTime}));
    tagGWTIMESPAN span{};
    ASSERT_EQ(KXTimeControlReset(0), S_OK);
    EXPECT_EQ(play->GetTimeSpan(&span), S_OK);
    EXPECT_FALSE(CGWTime(span.start).IsDefined() || CGWTime(span.end).IsDefined());
}

TEST(ReferenceSceneWithoutContainer, EveryContentMemberMakesOne) {
    ut::test::LiveObjectCheck live;
    ut::host::ReferenceHost bare(ut::test::TestScene(false));
    I3DRefPlaneFolder* planes = nullptr;
    EXPECT_EQ(F3DGetRefPlaneFolder(&planes), S_OK);
    EXPECT_EQ(Held(planes), "set");
    // Each call works on a container of its own: what one adds the next does not hold.
    ut::ComPtr<I3DObject> arm = Find(L"Arm");
    EXPECT_EQ(F3DAddObjectToTransientObjectContainer(static_cast<IUnknown*>(arm.Get())), S_OK);
    EXPECT_EQ(F3DIsObjectInTransientObjectContainer(static_cast<IUnknown*>(arm.Get())), S_FALSE);
}

TEST_F(ReferenceScene, TheTransientContainerHoldsObjectsByIdentityUntilRemovedOrReset) {
    ut::ComPtr<I3DObject> arm = Find(L"Arm"), light = Find(L"Light");
    ut::test::MockGroup notAComponent;
    ut::ComPtr<IGWComponentHierarchy> hierarchy;
    ASSERT_EQ(arm.As(hierarchy), S_OK);
    const std::pair<HRESULT, HRESULT> steps[] = {
        {F3DIsObjectInTransientObjectContainer(hierarchy.Get()), S_FALSE},
        {F3DAddObjectToTransientObjectContainer(hierarchy.Get(), 4), S_OK},
        {F3DAddObjectToTransientObjectContainer(static_cast<IUnknown*>(arm.Get())), S_OK},
        {F3DIsObjectInTransientObjectContainer(static_cast<IUnknown*>(arm.Get())), S_OK},
        {F3DRemoveObjectFromTransientObjectContainer(static_cast<IUnknown*>(arm.Get())), S_OK},
        {F3DRemoveObjectFromTransientObjectContainer(hierarchy.Get()), S_FALSE},
        {F3DAddObjectToTransientObjectContainer(static_cast<IUnknown*>(light.Get())), S_OK},
        {F3DTransientObjectContainerReset(), S_OK},
        {F3DIsObjectInTransientObjectContainer(static_cast<IUnknown*>(light.Get())), S_FALSE},
        {F3DAddObjectToTransientObjectContainer(static_cast<IUnknown*>(&notAComponent)), E_NOINTERFACE},
    };
    for (size_t i = 0; i < std::size(steps); ++i)
        EXPECT_EQ(Result(steps[i].first), Result(steps[i].second)) << "step " << i;
}

TEST_F(ReferenceScene, ScenePropertiesAreFoundMadeOnDemandAndReadAsTheTimeMapping) {
    IGWProperties* mapping = nullptr;
    EXPECT_EQ(KXGetCurrentSceneTimeMapping(&mapping), S_OK);
    EXPECT_EQ(Held(mapping), "set");
    CGWVariant value;
    EXPECT_EQ(KXGetCurrentSceneProperty(ut::test::kMaterial, value, 0), S_OK);
    EXPECT_EQ(value.vt, VT_EMPTY);
    // Only a creatable class is made; the made set is the scene's from then on.
    EXPECT_EQ(KXGetCurrentSceneProperty(ut::test::kMaterial, value, 1), REGDB_E_CLASSNOTREG);
    ut::host::Settings settings = ut::test::TestScene();
    settings.scene.properties.clear();
    settings.propertyClasses = {GUID_GWTimeMappingProperty, ut::test::kMaterial};
    ut::host::ReferenceHost other(settings);
    EXPECT_EQ(KXGetCurrentSceneTimeMapping(&mapping), S_FALSE);
    EXPECT_EQ(KXGetCurrentSceneProperty(GUID_GWTimeMappingProperty, value, 1), S_OK);
    EXPECT_EQ(value.vt, VT_UNKNOWN);
    value.Clear();
    EXPECT_EQ(KXGetCurrentSceneTimeMapping(&mapping), S_OK);
    EXPECT_EQ(Held(mapping), "set");
    EXPECT_EQ(
        KXGetSceneProperty(GUID_GWTimeMappingProperty, IID_IGWProperties, reinterpret_cast<void**>(&mapping)),
        S_OK);
    EXPECT_EQ(Held(mapping), "set");
    // The model's root property: made the first time, the same one afterwards.
    EXPECT_TRUE(SameTwice([](IUnknown** out) {
        return KXGetSceneRootProperty(ut::test::kMaterial, IID_IUnknown, reinterpret_cast<void**>(out));
    }));
    EXPECT_EQ(other.DescribeScene().properties.size(), 1u);
}

TEST_F(ReferenceScene, CamerasManagersAndDefaultsAreTheScenesOwn) {
    ut::test::MockViewManager manager;
    I3DList* cameras = nullptr;
    ASSERT_EQ(KXGetListOfSceneCameras(&cameras), S_OK);
    EXPECT_EQ(Names(cameras), std::vector<std::wstring>{L"Camera1"});
    Held(cameras);
    ut::ComPtr<IGWManagerRegistry> registry;
    ASSERT_EQ(KXGetSceneManager(IID_IGWManagerRegistry, registry.PutVoid(), 1), S_OK);
    EXPECT_EQ(registry->RegisterManager(ut::test::kColor, &manager), S_OK);
    void* out = nullptr;
    EXPECT_EQ(KXGetGenericManager(ut::test::kColor, IID_IGWViewManager, &out), S_OK);
    EXPECT_EQ(out, &manager);
    manager.Release();
    EXPECT_EQ(registry->RegisterManager(ut::test::kColor, nullptr), S_OK);
    // The same default object every time; new instances of the creatable classes only.
    EXPECT_TRUE(SameTwice([](IUnknown** out) { return KXGetSceneDefaultsObject(ut::test::kColor, out); }));
    EXPECT_EQ(KXCreateDefaultInstance(ut::test::kColor, IID_IUnknown, &out, nullptr), S_FALSE);
    EXPECT_EQ(F3DGetEnvironmentContainer(IID_IKXLayerContainer, &out), E_NOINTERFACE);
}

TEST_F(ReferenceScene, ASetValueCommandSetsTheObjectsParameterAndAGroupIsSetThroughAnElement) {
    ut::test::MockGroup group;
    ut::ComPtr<I3DObject> arm = Find(L"Arm");
    CGWVariant four(4.0);
    EXPECT_EQ(F3DSetComponentValueCmd(arm.Get(), ut::test::kX, &four), S_OK);
    EXPECT_EQ(F3DSetComponentValueCmd(arm.Get(), ut::test::kColor, &four), DISP_E_MEMBERNOTFOUND);
    const ut::host::SceneDescription now = host.DescribeScene();
    EXPECT_EQ(std::get<double>(now.objects[0].children[0].properties[0].parameters[0].value), 4.0);
    ut::ComPtr<I3DList> list;
    ut::ComPtr<I3DElemRef> element;
    ASSERT_EQ(KXCreateInstance(CLSID_3DList, IID_I3DList, list.PutVoid()), S_OK);
    ASSERT_EQ(list->NewElement(IID_I3DElemRef, element.PutVoid()), S_OK);
    EXPECT_EQ(F3DSetAs3DGroup(&group, element.Get(), nullptr), E_UNEXPECTED); // it points at nothing yet
    element->SetTarget(arm.Get(), nullptr);
    EXPECT_EQ(F3DSetAs3DGroup(&group, element.Get(), nullptr), S_OK);
    EXPECT_EQ(group.Extra(), 1u);
}

// Records which handler ran and answers S_FALSE from each, so that the answer is seen to come back.
class Recording final : public CKXAppNotifySink {
public:
    std::string seen;
    HRESULT Note(std::string what) {
        seen += (seen.empty() ? "" : " ") + what;
        return S_FALSE;
    }
    HRESULT OnTerminate() override { return Note("Terminate"); }
    HRESULT OnPreCloseProject() override { return Note("PreClose"); }
    HRESULT OnStartup() override { return Note("Startup"); }
    HRESULT OnNewProject() override { return Note("New"); }
    HRESULT OnPostCloseProject() override { return Note("PostClose"); }
    HRESULT OnSelectionChange(ULONG kind, const VARIANT*) override {
        return Note("Selection" + std::to_string(kind));
    }
    HRESULT OnActiveListChange(ULONG kind, const VARIANT*) override {
        return Note("Active" + std::to_string(kind));
    }
    HRESULT OnChangedProject() override { return Note("Changed"); }
    HRESULT OnActivate(bool active) override { return Note(active ? "Activate" : "Deactivate"); }
    HRESULT OnMinimize() override { return Note("Minimize"); }
    HRESULT OnMaximize() override { return Note("Maximize"); }
};

VARIANT Integer(LONG value) {
    VARIANT variant;
    VariantInit(&variant);
    variant.vt = VT_I4;
    variant.lVal = value;
    return variant;
}

// The notifications in the order of the sink's bits.
const wchar_t* const kNames[] = {L"GWAPP_STATE_CHANGE",   L"KX3D_SELECTION_LIST", L"KX3D_ACTIVE_LIST",
                                 L"DesktopAppActivation", L"DesktopAppMinimized", L"DesktopAppRestore"};

TEST(AppNotifySink, DispatchesEachNotificationByItsExactName) {
    // The notification, its kind and value (-1: none); the result and the handlers that ran.
    const wchar_t *state = L"GWAPP_STATE_CHANGE", *activation = L"DesktopAppActivation";
    // clang-format off
    const std::tuple<const wchar_t*, ULONG, LONG, std::string> cases[] = {
        {state, 1, 8, "S_FALSE Terminate"}, {state, 1, 2, "S_FALSE PreClose"},
        {state, 1, 1, "S_FALSE Startup"}, {state, 1, 4, "S_FALSE New"}, {state, 1, 16, "S_FALSE PostClose"},
        {state, 1, 0x10100, "S_FALSE Changed"}, // the low 16 bits
        {state, 1, 3, "S_OK "}, {state, 2, 8, "E_INVALIDARG "}, {state, 1, -1, "E_INVALIDARG "},
        {L"gwapp_state_change", 1, 8, "S_OK "},
        {L"KX3D_SELECTION_LIST", 5, -1, "S_FALSE Selection5"}, {L"KX3D_ACTIVE_LIST", 6, 0, "S_FALSE Active6"},
        {activation, 1, 1, "S_FALSE Activate"}, {activation, 0, 1, "E_INVALIDARG "},
        {activation, 1, 0, "S_FALSE Deactivate"}, {L"DesktopAppMinimized", 0, -1, "S_FALSE Minimize"},
        {L"DesktopAppRestore", 0, -1, "S_FALSE Maximize"}};
    // clang-format on
    for (const auto& [name, kind, number, expected] : cases) {
        auto* sink = new Recording;
        VARIANT value = Integer(number);
        HRESULT hr = sink->PropertyChanged(name, kind, number < 0 ? nullptr : &value, 0);
        EXPECT_EQ(Result(hr) + " " + sink->seen, expected) << ut::test::Narrow(name) << " " << number;
        sink->Release();
    }
}

TEST(AppNotifySink, AdvisesAllOrNothingInItsBitOrderAndHearsTheService) {
    ut::test::MockNotificationService service;
    {
        ut::test::ScopedGenericObject installed(CLSID_GWNotificationService, &service);
        auto* sink = new Recording;
        ::testing::InSequence order;
        for (const wchar_t* name : kNames)
            EXPECT_CALL(service, Advise(::testing::StrEq(name), _)).WillOnce(Return(S_OK));
        EXPECT_CALL(service, Unadvise(::testing::StrEq(L"KX3D_SELECTION_LIST"), _)).WillOnce(Return(E_FAIL));
        EXPECT_EQ(sink->Advise(63), S_OK);
        EXPECT_EQ(sink->Advise(3), S_FALSE);
        EXPECT_EQ(sink->Unadvise(2), E_FAIL);
        EXPECT_EQ(sink->Unadvise(2), S_FALSE);
        EXPECT_EQ(sink->Flags(), 61u);
        sink->Release();
    }
    EXPECT_EQ(service.Extra(), 0u);

    // On the reference service, each notification reaches the handler it names.
    ut::host::ReferenceHost host;
    auto real = Service<IGWNotificationService>(CLSID_GWNotificationService);
    auto* sink = new Recording;
    ASSERT_EQ(sink->Advise(1), S_OK);
    EXPECT_EQ(sink->Advise(3), S_FALSE);
    ASSERT_EQ(sink->Advise(62), S_OK);
    VARIANT closing = Integer(2), active = Integer(1);
    const std::pair<ULONG, VARIANT*> payloads[] = {{1, &closing}, {3, nullptr}, {4, nullptr},
                                                   {1, &active},  {0, nullptr}, {0, nullptr}};
    for (int i = 0; i < 6; ++i)
        real->Broadcast(kNames[i], payloads[i].first, payloads[i].second);
    EXPECT_EQ(sink->seen, "PreClose Selection3 Active4 Activate Minimize Maximize");
    EXPECT_EQ(sink->Unadvise(63), S_OK);
    real->Broadcast(L"DesktopAppRestore", 0, nullptr);
    EXPECT_EQ(sink->seen.find("Maximize Maximize"), std::string::npos);
    sink->Release();
}

class ActiveDatabase : public ::testing::Test {
protected:
    ut::test::MockEventSink events;
    ut::host::ReferenceHost host{ut::test::TestScene()};
    ut::ComPtr<IGWActiveDatabaseNotifier> notifier =
        Service<IGWActiveDatabaseNotifier>(CLSID_GWActiveDatabase);
};

TEST_F(ActiveDatabase, TellsAdvisedSinksOfRemovedObjectsAndTheFinalEndOfLoad) {
    ut::ComPtr<I3DObject> light = Find(L"Light"), camera = Find(L"Camera1");
    EXPECT_EQ(KXAdviseOnActiveDBEx(nullptr, 1, 2), E_POINTER);
    EXPECT_CALL(events, OnObjectRemoved(static_cast<IUnknown*>(light.Get()))).WillOnce(Return(S_OK));
    EXPECT_CALL(events, OnFinalEndLoad(77)).WillOnce(Return(S_OK));
    EXPECT_CALL(events, OnEndLoad()).Times(0);
    ASSERT_EQ(KXAdviseOnActiveDBEx(&events, 1, GWDB_EVENT_REMOVED), S_OK);
    EXPECT_EQ(F3DRemove3DObjectFromScene(light.Get()), S_OK);
    // Registering for the final end of load withdraws the masked advice first.
    ASSERT_EQ(KXAdviseOnActiveDBForFinalEndLoad(&events, 77), S_OK);
    EXPECT_EQ(F3DRemove3DObjectFromScene(camera.Get()), S_OK);
    EXPECT_EQ(notifier->Fire(GWDB_EVENT_LOAD_SAVE, nullptr), S_OK);
    EXPECT_EQ(KXAdviseOnActiveDB(&events, 0), S_OK);
    EXPECT_EQ(notifier->Fire(GWDB_EVENT_LOAD_SAVE, nullptr), S_FALSE);
    EXPECT_EQ(events.Extra(), 0u);
}

TEST_F(ActiveDatabase, TheLoadGuardSwitchesResolvingOnForItsLifetime) {
    auto database = Service<IGWActiveDatabase>(CLSID_GWActiveDatabase);
    const ULONG resolving = GWDB_STATE_RESOLVE_ALL | GWDB_STATE_RESOLVE_DURING_LOAD;
    {
        CKXResolveAllDuringLoadHelper guard;
        EXPECT_EQ(database->TestStateFlags(resolving), S_OK);
    }
    EXPECT_EQ(database->TestStateFlags(GWDB_STATE_RESOLVE_ALL), S_FALSE);
    EXPECT_EQ(F3DWasLoadCancelled(), 0);
    database->SetStateFlags(GWDB_STATE_LOAD_CANCELLED, TRUE);
    EXPECT_EQ(F3DWasLoadCancelled(), 1);
}

TEST_F(ActiveDatabase, PropertyNotificationsGoOutWithTheirKindQuietlyWhenSeveralListen) {
    ut::test::MockPropertySink first, second;
    std::map<IGwPropertyNotifySink*, unsigned long> one = {{&first, 0}},
                                                    both = {{&first, 0}, {&second, 1u << 2}};
    std::string seen;
    auto note = [&](ULONG kind, REFGUID, const VARIANT*, IUnknown*, const GWPARAMS*, USHORT, USHORT) {
        seen += std::to_string(kind) + (host.SceneNotificationMode() == GW3DNOTIFY_QUIET ? "q " : "n ");
        return S_OK;
    };
    EXPECT_CALL(first, OnPropertyNotify).WillRepeatedly(note);
    EXPECT_CALL(second, OnPropertyNotify).WillRepeatedly(note);
    EXPECT_EQ(FPropertyChangedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, one), S_OK);
    EXPECT_EQ(FPropertyAddedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, both), S_OK);
    EXPECT_EQ(FPropertyChangedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, both), S_OK);
    EXPECT_EQ(FPropertyRemovedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, both), S_OK);
    // The second sink takes only changes.
    EXPECT_EQ(seen, "2n 1q 2q 2q 3q ");
    EXPECT_EQ(host.SceneNotificationMode(), GW3DNOTIFY_NORMAL);
}

TEST_F(ActiveDatabase, TheCurveCacheHoldsEachCurveOnceListensWhileItHoldsAndIsPruned) {
    C3DFCurveKeySelectionCache* cache = KXGetFCurveKeySelectionCache();
    ASSERT_TRUE(cache != nullptr);
    EXPECT_EQ(cache, KXGetFCurveKeySelectionCache());
    cache->Clear(); // empty and never listening: nothing to withdraw
    EXPECT_FALSE(cache->Listening());
    ut::ComPtr<I3DObject> arm = Find(L"Arm"), light = Find(L"Light");
    ut::test::MockFCurve onArm, onLight, orphan;
    for (auto [curve, parent] : {std::pair(&onArm, arm.Get()), std::pair(&onLight, light.Get())})
        EXPECT_CALL(*curve, GetParentObject)
            .WillRepeatedly(ut::test::GiveOut<0>(static_cast<IUnknown*>(parent)));
    EXPECT_CALL(orphan, GetParentObject).WillRepeatedly(Return(S_FALSE));
    for (IFCurve* curve : {&onArm, &onLight, &onArm, &orphan})
        cache->AddCurve(curve);
    cache->AddCurve(nullptr);
    EXPECT_TRUE(cache->Listening());
    EXPECT_EQ(onArm.Extra(), 1u);
    int listed = 0;
    cache->Reset();
    while (IFCurve* curve = cache->Next()) {
        ++listed;
        curve->Release();
    }
    EXPECT_EQ(listed, 3);
    // A curve without an object, and one whose object left the scene, are dropped on validation.
    EXPECT_EQ(F3DRemove3DObjectFromScene(light.Get()), S_OK);
    for (IFCurve* curve : {&onArm, &onLight, &orphan})
        cache->ValidateCurve(curve);
    EXPECT_TRUE(cache->IsCurveInCache(&onArm) && !cache->IsCurveInCache(&onLight) &&
                !cache->IsCurveInCache(&orphan));
    // A removed curve is pruned through the database; closing the project empties the cache.
    EXPECT_EQ(notifier->Fire(GWDB_EVENT_REMOVED, &onArm), S_OK);
    EXPECT_TRUE(cache->IsEmpty());
    cache->AddCurve(&onArm);
    VARIANT closing = Integer(2);
    EXPECT_EQ(Service<IGWNotificationService>(CLSID_GWNotificationService)
                  ->Broadcast(L"GWAPP_STATE_CHANGE", 1, &closing),
              S_OK);
    EXPECT_TRUE(cache->IsEmpty());
    EXPECT_FALSE(cache->Listening());
    EXPECT_FALSE(cache->RemoveCurve(&onArm));
    EXPECT_EQ(onArm.Extra() + onLight.Extra() + orphan.Extra(), 0u);
}

} // namespace
