// Every scene export on the reference scene, with its 1st, 2nd, ... host call failing in turn
// until it runs clean: each step gives the documented failure, leaves its out-parameters null,
// and leaves no object and no reference behind. One table drives them all.
#include <algorithm>
#include <functional>
#include <iostream>
#include <map>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/families.h>
#include <ut/hierarchy.h>
#include <ut/host/reference_shaders.h>
#include <ut/notify.h>
#include <ut/scene.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>
#include <ut/shaders.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"
#include "support/registrations.h"
#include "support/scene_mocks.h"
#include "test_scene.h"

namespace {

using ut::test::Held;
using ut::test::Result;

constexpr HRESULT kFault = E_ACCESSDENIED;

// A scenario that calls an export with an out-parameter of its own: the result, and "set" or
// "null" for the out-parameter.
template <class Interface = void, class Call>
std::function<std::string()> Handing(Call call) {
    return [call] {
        Interface* out = nullptr;
        HRESULT hr = call(&out);
        auto* held = static_cast<IUnknown*>(out);
        return Result(hr) + " " + Held(held);
    };
}

// Lifts the fault for the rest of a scenario, which then puts the scene back as it was.
void Lift() {
    ut::sdk::SetHostFaultHook(nullptr);
}

struct Walk {
    const char* name;
    std::function<std::string()> run;
    // The outcome of every failing call when there is one; otherwise one per call, in order.
    std::vector<std::string> failures;
    std::string clean = "S_OK set";
    // A walk that passes over some host failures by design (a scan that goes on without the part
    // that failed) lists the outcomes it may give instead, in any order.
    bool anyOf = false;
};

class SceneFaults : public ::testing::Test {
protected:
    void SetUp() override {
        wchar_t arm[] = L"Arm", light[] = L"Light", robot[] = L"Robot", camera[] = L"Camera1";
        ASSERT_EQ(F3DGet3DObjectFromName(arm, arm_.Put()), S_OK);
        ASSERT_EQ(F3DGet3DObjectFromName(light, light_.Put()), S_OK);
        ASSERT_EQ(F3DGet3DObjectFromName(robot, robot_.Put()), S_OK);
        ASSERT_EQ(F3DGet3DObjectFromName(camera, camera_.Put()), S_OK);
        ASSERT_EQ(KXCreate3DModelObject(L"Rig", IID_I3DObject, rig_.PutVoid()), S_OK);
        ASSERT_EQ(arm_.As(armHierarchy_), S_OK);
        ASSERT_EQ(F3DAddObjectToTransientObjectContainer(armHierarchy_.Get(), 1), S_OK);
        ASSERT_EQ(KXGetSceneManager(IID_IGWManagerRegistry, registry_.PutVoid(), 1), S_OK);
        ASSERT_EQ(registry_->RegisterManager(ut::test::kColor, &manager_), S_OK);
        ut::ComPtr<I3DList> list;
        ASSERT_EQ(KXCreateInstance(CLSID_3DList, IID_I3DList, list.PutVoid()), S_OK);
        ASSERT_EQ(list->NewElement(IID_I3DElemRef, element_.PutVoid()), S_OK);
        ASSERT_EQ(element_->SetTarget(arm_.Get(), nullptr), S_OK);
        ASSERT_TRUE(families_);
        ON_CALL(curve_, GetParentObject)
            .WillByDefault(ut::test::GiveOut<0>(static_cast<IUnknown*>(arm_.Get())));
    }
    void TearDown() override { registry_->RegisterManager(ut::test::kColor, nullptr); }

    // Held by the host across runs; declared first so that they outlive what holds them.
    ut::test::MockViewManager manager_;
    ut::test::MockGroup group_;
    ut::test::MockPrimitive primitive_;
    ut::test::MockExecContext context_;
    ut::host::ReferenceHost host_{ut::test::TestScene()};
    ut::ComPtr<I3DObject> arm_, light_, robot_, camera_, rig_;
    ut::ComPtr<IGWComponentHierarchy> armHierarchy_;
    ut::ComPtr<IGWManagerRegistry> registry_;
    ut::ComPtr<I3DElemRef> element_;
    // A class of the camera family, and a watched parameter of the scene.
    const GUID kLens = ut::test::TestGuid(12);
    GUID watched_ = ut::test::kX;
    ut::test::RegistrationScope registrations_;
    bool families_ =
        SUCCEEDED(GWRegisterFamily(GUID_3DCameraFamily, GUID_3DCameraFamily, GUID_NULL, L"Cameras", L"",
                                   nullptr, GUID_NULL, GUID_NULL)) &&
        SUCCEEDED(GWRegisterObjectFamilies(kLens, 1, &GUID_3DCameraFamily, true, L"Lens", nullptr));
    // Surface leads to Mix and Noise; Mix to Noise.
    ut::host::ShaderNetwork shaders_{
        {{.name = L"Surface", .ports = {{1, L"Mix"}, {2, L"", {{3, L"Noise"}}}}},
         {.name = L"Mix", .ports = {{1, L"Noise"}}, .preferredNameSpace = L"Library"},
         {.name = L"Noise"}},
        {L"Scene", L"Library"}};
    ::testing::NiceMock<ut::test::MockPropertySink> firstSink_, secondSink_;
    ::testing::NiceMock<ut::test::MockFCurve> curve_;
};

TEST_F(SceneFaults, EveryExportGivesItsDocumentedFailureAtEveryFailingHostCall) {
    const std::string denied = "DENIED null";
    const std::vector<std::string> made = {"S_OK set", denied};
    const GUID kNew = {0x51, 0x52, 0x53, {1, 2, 3, 4, 5, 6, 7, 8}}; // a root property the model makes
    wchar_t arm[] = L"Arm", cube[] = L"Cube";
    const Walk walks[] = {
        // The roots; a failing look-up of the current container is answered with a new one.
        {"KXGetSceneManager",
         Handing([](void** o) { return KXGetSceneManager(IID_I3DSceneManager, o, 1); }),
         {denied}},
        {"KXGetCurrentScene", Handing([](void** o) { return KXGetCurrentScene(IID_I3DScene, o); }), {denied}},
        {"KXGet3DContentContainer",
         Handing([](void** o) { return KXGet3DContentContainer(IID_IGWContentContainer, o, 1); }),
         {"S_OK set"}},
        {"KXGet3DContentContainer, no creation",
         Handing([](void** o) { return KXGet3DContentContainer(IID_IGWContentContainer, o, 0); }),
         {denied}},
        // Managers and views; a content-container member works on a new container when the
        // current one cannot be had.
        {"KXGetCacheManager", Handing([](void** o) { return KXGetCacheManager(IID_I3DCacheMgr, o); }), made},
        {"KXGetCacheManager(I3DCacheMgr**)",
         Handing<I3DCacheMgr>([](auto o) { return KXGetCacheManager(o); }), made},
        {"KXGetViewManager", Handing([](void** o) { return KXGetViewManager(IID_IUnknown, o); }), {denied}},
        {"KXGetViewerControler",
         Handing([](void** o) { return KXGetViewerControler(IID_IGWViewerController, o); }),
         {denied}},
        {"KXGetGenericManager",
         Handing([](void** o) { return KXGetGenericManager(ut::test::kColor, IID_IUnknown, o); }),
         {denied}},
        // Scene-wide actions, each put back afterwards.
        {"KXStoreCommand, KXPostCommand",
         [&] {
             HRESULT stored = KXStoreCommand(ut::test::kColor, ut::test::kX, &context_),
                     posted = KXPostCommand();
             Lift();
             (void)KXPostCommand(); // forgets a command that was stored but not posted
             return Result(stored) + " " + Result(posted);
         },
         {"DENIED S_FALSE", "DENIED S_FALSE", "S_OK DENIED", "S_OK DENIED"},
         "S_OK S_OK"},
        {"F3DGet3DObjectFromName",
         Handing<I3DObject>([&](auto o) { return F3DGet3DObjectFromName(arm, o); }),
         {denied}},
        {"F3DSceneNotificationQuietOn",
         [&] {
             HRESULT hr = F3DSceneNotificationQuietOn();
             Lift();
             std::string mode = std::to_string(host_.SceneNotificationMode());
             (void)F3DSceneNotificationQuietOff();
             return Result(hr) + " " + mode;
         },
         {"DENIED 3"},
         "S_OK 1"},
        {"F3DSceneNotificationQuietOff",
         [] { return Result(F3DSceneNotificationQuietOff()); },
         {"DENIED"},
         "S_OK"},
        {"F3DCreate3DObjectFromPrimitive",
         Handing<I3DObject>([&](auto o) { return F3DCreate3DObjectFromPrimitive(&primitive_, cube, o); }),
         {denied}},
        {"KXCreate3DModelObject",
         Handing([](void** o) { return KXCreate3DModelObject(L"Model", IID_I3DModel, o); }),
         {denied}},
        {"F3DAdd3DObjectToScene",
         [&] {
             HRESULT hr = F3DAdd3DObjectToScene(rig_.Get(), arm_.Get(), 1);
             Lift();
             (void)F3DRemove3DObjectFromScene(rig_.Get()); // S_FALSE when it was not added
             return Result(hr);
         },
         {"DENIED"},
         "S_OK"},
        {"F3DRemove3DObjectFromScene",
         [&] {
             HRESULT hr = F3DRemove3DObjectFromScene(light_.Get());
             Lift();
             (void)F3DAdd3DObjectToScene(light_.Get(), nullptr, 0); // E_INVALIDARG when it stayed
             return Result(hr);
         },
         {"DENIED", "DENIED", "S_OK"}, // telling the database of the removal may fail
         "S_OK"},
        {"F3DSetAs3DGroup",
         [&] { return Result(F3DSetAs3DGroup(&group_, element_.Get(), nullptr)); },
         {"DENIED"},
         "S_OK"},
        // The delete-all bracket is optional, and what it answers is not reported.
        {"KXDeleteAll",
         [&] {
             HRESULT hr = KXDeleteAll(0);
             Lift();
             std::string left = std::to_string(host_.DescribeScene().objects.size());
             for (I3DObject* top : {robot_.Get(), camera_.Get(), light_.Get()})
                 (void)F3DAdd3DObjectToScene(top, nullptr, 0); // E_INVALIDARG for those still there
             return Result(hr) + " " + left;
         },
         {"S_OK 0", "S_OK 0", "E_FAIL 3", "DENIED 3", "S_OK 0"},
         "S_OK 0"},
        // Containers.
        {"F3DGetLayerContainer",
         Handing<IKXLayerContainer>([](auto o) { return F3DGetLayerContainer(o); }),
         {denied}},
        {"F3DGetPassContainer",
         Handing<IKXLayerContainer>([](auto o) { return F3DGetPassContainer(o); }),
         {denied}},
        {"F3DGetParTypeContainer",
         Handing([](void** o) { return F3DGetParTypeContainer(IID_IUnknown, o); }),
         {denied}},
        {"F3DGetEnvironmentContainer",
         Handing([](void** o) { return F3DGetEnvironmentContainer(IID_IUnknown, o); }),
         {denied}},
        {"F3DGetRefPlaneFolder", Handing<I3DRefPlaneFolder>([](auto o) { return F3DGetRefPlaneFolder(o); }),
         made},
        {"F3DGetDeviceManager", Handing([](void** o) { return F3DGetDeviceManager(IID_IUnknown, o); }), made},
        {"F3DGetTransientObjectContainer",
         Handing([](void** o) { return F3DGetTransientObjectContainer(IID_IUnknown, o); }), made},
        // Scene defaults: the stream and the new instance turn every failure into S_FALSE.
        {"KXGetSceneDefaultsObject",
         Handing<IUnknown>([](auto o) { return KXGetSceneDefaultsObject(ut::test::kColor, o); }),
         {"S_OK set", denied, denied}},
        {"KXGetStreamFromSceneDefaults",
         Handing<IStream>([](auto o) { return KXGetStreamFromSceneDefaults(ut::test::kColor, o); }),
         {"S_OK set", "S_FALSE null", "S_FALSE null"}},
        {"KXCreateDefaultInstance",
         Handing([](void** o) { return KXCreateDefaultInstance(CLSID_3DList, IID_I3DList, o, nullptr); }),
         {"S_OK set", "S_FALSE null", "S_FALSE null", "S_FALSE null"}},
        // Scene properties and the model; a failing read of the time mapping means there is none.
        {"KXGetSceneProperty",
         Handing([](void** o) { return KXGetSceneProperty(GUID_GWTimeMappingProperty, IID_IUnknown, o); }),
         {denied}},
        {"KXGetListOfSceneCameras",
         Handing<I3DList>([](auto o) { return KXGetListOfSceneCameras(o); }),
         {denied}},
        {"KXGetCurrentSceneModel",
         Handing([](void** o) { return KXGetCurrentSceneModel(IID_I3DModel, o); }),
         {denied}},
        {"KXGetCurrentSceneTimeMapping",
         Handing<IGWProperties>([](auto o) { return KXGetCurrentSceneTimeMapping(o); }),
         {denied, denied, "S_FALSE null"}},
        // A failing read makes the property again, which replaces the scene's (the failures of
        // making it are the contract test's).
        {"KXGetCurrentSceneProperty",
         [&] {
             CGWVariant value;
             HRESULT hr = KXGetCurrentSceneProperty(GUID_GWTimeMappingProperty, value, 1);
             return Result(hr) + " " + std::to_string(value.vt);
         },
         {"DENIED 0", "DENIED 0", "S_OK 13"},
         "S_OK 13"},
        {"KXGetSceneRootProperty",
         Handing([&](void** o) { return KXGetSceneRootProperty(kNew, IID_IGWProperties, o); }),
         {denied}},
        // Any failure on the way to the list is E_FAIL.
        {"F3DGetPropsList",
         Handing<I3DList>([&](auto o) { return F3DGetPropsList(arm_.Get(), ut::test::kColor, o); }),
         {"E_FAIL null"}},
        // The transient object container, each put back afterwards.
        {"F3DAddObjectToTransientObjectContainer",
         [&] {
             HRESULT hr = F3DAddObjectToTransientObjectContainer(static_cast<IUnknown*>(light_.Get()));
             Lift();
             (void)F3DRemoveObjectFromTransientObjectContainer(static_cast<IUnknown*>(light_.Get()));
             return Result(hr);
         },
         {"S_OK", "DENIED", "DENIED"},
         "S_OK"},
        {"F3DRemoveObjectFromTransientObjectContainer",
         [&] {
             HRESULT hr = F3DRemoveObjectFromTransientObjectContainer(static_cast<IUnknown*>(arm_.Get()));
             Lift();
             (void)F3DAddObjectToTransientObjectContainer(armHierarchy_.Get(), 1);
             return Result(hr);
         },
         {"S_FALSE", "DENIED", "DENIED"},
         "S_OK"},
        {"F3DIsObjectInTransientObjectContainer",
         [&] { return Result(F3DIsObjectInTransientObjectContainer(static_cast<IUnknown*>(arm_.Get()))); },
         {"S_FALSE", "DENIED", "DENIED"},
         "S_OK"},
        {"F3DTransientObjectContainerReset",
         [&] {
             HRESULT hr = F3DTransientObjectContainerReset();
             Lift();
             (void)F3DAddObjectToTransientObjectContainer(armHierarchy_.Get(), 1);
             return Result(hr);
         },
         {"S_OK", "DENIED", "DENIED"},
         "S_OK"},
        // Reaching the parameter and the proxy fails the command; the current time and the set do not.
        {"KXTimeControlReset", [] { return Result(KXTimeControlReset(1)); }, {"DENIED"}, "S_OK"},
        {"F3DSetComponentValueCmd",
         [&] {
             CGWVariant value(2.0);
             return Result(F3DSetComponentValueCmd(arm_.Get(), ut::test::kX, &value));
         },
         {"DENIED", "DENIED", "S_OK", "S_OK", "S_OK"},
         "S_OK"},
        {"KXIsActiveDataSelected",
         [&] { return std::string(KXIsActiveDataSelected(arm_.Get()) ? "yes" : "no"); },
         {"no"},
         "yes"},
        // The undo bracket: a step is recorded only when it opened and closed.
        {"C3DComplexUndo",
         [&] {
             size_t before = host_.UndoSteps().size();
             { C3DComplexUndo step(L"Step"); }
             Lift();
             std::string recorded = std::to_string(host_.UndoSteps().size() - before);
             ut::ComPtr<IGWUndoManager> undo;
             BOOL open = FALSE;
             if (SUCCEEDED(GWQueryGenericObject(CLSID_GWUndoManager, IID_IGWUndoManager, undo.PutVoid())) &&
                 SUCCEEDED(undo->IsInComplexUndo(&open)) && open)
                 (void)undo->CloseComplexUndo(); // the step whose closing failed
             return recorded;
         },
         {"0", "0", "0", "0"},
         "1"},
        // Families: the manager's failures come back, except that membership is then "no".
        {"KXFindFamily",
         [] {
             GUID f{};
             return Result(KXFindFamily(L"cameras", &f));
         },
         {"DENIED"},
         "S_OK"},
        {"F3DIsCLSIDInFamily",
         [&] { return std::to_string(F3DIsCLSIDInFamily(kLens, GUID_3DCameraFamily)); },
         {std::to_string(kFault), "0"},
         "1"},
        {"KXValidateObjectFamily",
         [&] {
             GUID cameras[] = {GUID_3DCameraFamily};
             return Result(KXValidateObjectFamily(cameras, 1, kLens));
         },
         {"DENIED"},
         "S_OK"},
        // A failure inside a child's scan leaves that child out; the rest are returned.
        {"CSharedGuid",
         [&] {
             CSharedGuid cache;
             ut::ComPtr<IGWComponentHierarchy> root;
             (void)KXGetCurrentSceneModel(IID_IGWComponentHierarchy, root.PutVoid()); // null on failure
             HRESULT built = cache.Construct();
             if (SUCCEEDED(built))
                 built = cache.AddGuid(&watched_);
             if (SUCCEEDED(built))
                 built = cache.BuildCache(root.Get());
             unsigned long id = 0;
             ut::ComPtr<IUnknown> found;
             HRESULT hr = cache.FindCOMPIDFromGUID(watched_, &id, IID_IUnknown, found.PutVoid());
             return Result(built) + " " + Result(hr);
         },
         {"DENIED E_FAIL", "S_OK E_FAIL", "S_OK S_OK", "DENIED S_OK"},
         "S_OK S_OK",
         true},
        {"C3DShaderTraverser",
         [&] {
             struct : C3DShaderTraverserCallback {
                 int visits = 0;
                 long OnShader(IUnknown*) override { return ++visits, 0; }
             } counting;
             C3DShaderTraverser traverser;
             HRESULT hr = traverser.Traverse(shaders_.Node(L"Surface").Get(), &counting, true);
             return Result(hr) + (SUCCEEDED(hr) ? "" : " " + std::to_string(counting.visits));
         },
         // Only the port walk's own answers are passed over (a run of siblings ends); a failing
         // connection ends the walk after the nodes visited before it.
         {"S_OK", "DENIED 0", "DENIED 1", "DENIED 2", "DENIED 3"},
         "S_OK",
         true},
        {"C3DShaderNameSpaceTraverser",
         [&] {
             C3DShaderNameSpaceTraverser naming;
             HRESULT hr =
                 naming.Traverse(shaders_.Node(L"Surface").Get(), shaders_.NameSpace(L"Scene").Get());
             return Result(hr);
         },
         {"S_OK", "DENIED"},
         "S_OK",
         true},
        // Notification sinks; the service's failure comes back with the bits already recorded.
        {"CKXAppNotifySink",
         [&] {
             ut::ComPtr<CKXAppNotifySink> sink = ut::ComPtr<CKXAppNotifySink>::Adopt(new CKXAppNotifySink);
             HRESULT advised = sink->Advise(3);
             unsigned long flags = sink->Flags();
             Lift();
             (void)sink->Unadvise(3); // withdraws what was advised
             return Result(advised) + " " + std::to_string(flags);
         },
         {"DENIED 3"},
         "S_OK 3"},
        {"KXAdviseOnActiveDBEx",
         [&] {
             ut::test::MockEventSink events;
             HRESULT hr = KXAdviseOnActiveDBEx(&events, 1, GWDB_EVENT_REMOVED);
             Lift();
             (void)KXAdviseOnActiveDB(&events, 0); // withdraws it
             return Result(hr);
         },
         {"DENIED"},
         "S_OK"},
        {"KXAdviseOnActiveDBForFinalEndLoad",
         [&] {
             ut::test::MockEventSink events;
             HRESULT hr = KXAdviseOnActiveDBForFinalEndLoad(&events, 5);
             Lift();
             (void)KXAdviseOnActiveDB(&events, 0); // withdraws it
             return Result(hr);
         },
         {"DENIED"},
         "S_OK"},
        {"CKXResolveAllDuringLoadHelper, F3DWasLoadCancelled",
         [&] {
             std::string seen;
             {
                 CKXResolveAllDuringLoadHelper guard;
                 seen = std::to_string(F3DWasLoadCancelled());
             }
             Lift();
             ut::ComPtr<IGWActiveDatabase> database;
             (void)GWQueryGenericObject(CLSID_GWActiveDatabase, IID_IGWActiveDatabase, database.PutVoid());
             seen += " " + Result(database->TestStateFlags(GWDB_STATE_RESOLVE_ALL));
             (void)database->SetStateFlags(GWDB_STATE_RESOLVE_ALL | GWDB_STATE_RESOLVE_DURING_LOAD, FALSE);
             return seen;
         },
         // Only a failing switch-off leaves resolving on.
         {"0 S_FALSE", "0 S_FALSE", "0 S_FALSE", "0 S_FALSE", "0 S_FALSE", "0 S_OK", "0 S_OK"},
         "0 S_FALSE"},
        {"FPropertyChangedNotify",
         [&] {
             std::map<IGwPropertyNotifySink*, unsigned long> sinks = {{&firstSink_, 0}, {&secondSink_, 0}};
             HRESULT hr = FPropertyChangedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, sinks);
             Lift();
             (void)F3DSceneNotificationQuietOff(); // when the bracket failed to close
             return Result(hr);
         },
         {"S_OK"},
         "S_OK"},
        {"C3DFCurveKeySelectionCache",
         [&] {
             C3DFCurveKeySelectionCache* cache = KXGetFCurveKeySelectionCache();
             cache->AddCurve(&curve_);
             cache->ValidateCurve(&curve_);
             std::string seen = std::to_string(cache->IsCurveInCache(&curve_));
             cache->Clear();
             return seen + " " + std::to_string(cache->Listening());
         },
         {"1 0"},
         "1 0"},
        // Hierarchy moves and roots, each move put back afterwards.
        {"KXMoveObjectInHier",
         [&] {
             ut::ComPtr<IUnknown> previous;
             HRESULT hr = KXMoveObjectInHier(robot_.Get(), rig_.Get(), GWDEST_LAST, nullptr, previous.Put());
             Lift();
             (void)F3DRemove3DObjectFromScene(rig_.Get()); // S_FALSE when it did not move
             return Result(hr);
         },
         // A failing look-up of the object is a refusal; a failing check only skips `out`.
         {"DENIED", "E_INVALIDARG", "DENIED", "S_OK", "DENIED"},
         "S_OK"},
        {"KXGet3DObjectHierarchyRoot",
         Handing<I3DObject>([&](auto o) { return KXGet3DObjectHierarchyRoot(arm_.Get(), o); }),
         {denied}},
        {"KXGet3DObjectHierarchyRootInModel",
         Handing<I3DObject>([&](auto o) {
             ut::ComPtr<I3DModel> model;
             (void)robot_.As(model); // a model of the reference scene
             return KXGet3DObjectHierarchyRootInModel(arm_.Get(), model.Get(), o);
         }),
         {denied}},
        {"KXGetSceneBBox",
         [] {
             C3DBBox box;
             return Result(KXGetSceneBBox(nullptr, nullptr, 0, E3DSPACE_GLOBAL, nullptr, 0, &box));
         },
         {"DENIED"},
         "S_FALSE"},
        {"F3DGetMaterialCatID, F3DTranslateMaterialCATID",
         [] {
             return Result(
                 IsEqualGUID(F3DTranslateMaterialCATID(F3DGetMaterialCatID()), CATID_3DMaterial) ? 0 : 1);
         },
         {},
         "S_OK"},
    };
    int walked = 0;
    for (const Walk& walk : walks) {
        (void)walk.run(); // once clean, so that what the host makes on first use exists already
        std::vector<std::string> seen;
        std::vector<ULONG> references = {ut::test::RefTracker::References(arm_.Get()),
                                         ut::test::RefTracker::References(registry_.Get())};
        ut::test::WalkHostFaults(
            walk.run,
            [&](int row, const std::string& outcome) {
                if (row == 0) {
                    EXPECT_EQ(outcome, walk.clean) << walk.name << " without a failure";
                    return;
                }
                ++walked;
                seen.push_back(outcome);
                bool allowed = walk.anyOf && std::count(walk.failures.begin(), walk.failures.end(), outcome);
                const std::string& documented =
                    allowed                     ? outcome
                    : walk.failures.size() == 1 ? walk.failures[0]
                                              : (row <= static_cast<int>(walk.failures.size())
                                                     ? walk.failures[row - 1]
                                                     : std::string("(more host calls than documented)"));
                EXPECT_EQ(outcome, documented) << walk.name << ", host call " << row << " failing";
            },
            kFault);
        EXPECT_EQ(references, (std::vector<ULONG>{ut::test::RefTracker::References(arm_.Get()),
                                                  ut::test::RefTracker::References(registry_.Get())}))
            << walk.name << " left references behind";
        if (walk.failures.size() > 1 && !walk.anyOf) {
            EXPECT_EQ(seen.size(), walk.failures.size())
                << walk.name << " makes another number of host calls";
        }
    }
    std::cout << "[ walked   ] " << walked << " failure paths in " << std::size(walks) << " scenarios\n";
}

} // namespace
