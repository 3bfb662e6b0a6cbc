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

// The walk of an export that hands out an object through `o`, named by its call.
#define HANDING(Interface, call, ...)                                                                        \
    Walk(#call, Handing<Interface>([&](auto o) { return call; }), __VA_ARGS__)

// Lifts the fault for the rest of a scenario, which then puts the scene back as it was.
void Lift() {
    ut::sdk::SetHostFaultHook(nullptr);
}

// A scenario that gives the result of `call` only; `undo` then puts the scene back, fault lifted.
template <class Call, class Undo = void (*)()>
std::function<std::string()> Says(
    Call call, Undo undo = [] {}) {
    return [call, undo] {
        HRESULT hr = call();
        Lift();
        undo();
        return Result(hr);
    };
}

// The walk of an export that gives a result only, named by its call; SAYS_THEN puts back what it
// changed with `undo`. TELLS walks an expression that gives its outcome as text.
// clang-format off
#define SAYS(call, ...) Walk(#call, Says([&] { return call; }), __VA_ARGS__)
#define SAYS_THEN(call, undo, ...) Walk(#call, Says([&] { return call; }, [&] { (void)undo; }), __VA_ARGS__)
#define TELLS(text, ...) Walk(#text, [&] { return text; }, __VA_ARGS__)
// clang-format on

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
    ut::ComPtr<I3DObject> arm_ = ut::test::Find(L"Arm"), light_ = ut::test::Find(L"Light"),
                          robot_ = ut::test::Find(L"Robot"), camera_ = ut::test::Find(L"Camera1"), rig_;
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
    // What the scenarios share; each puts back what it changed.
    CGWVariant two(2.0);
    GUID found{}, cameras = GUID_3DCameraFamily;
    C3DBBox box;
    IUnknown *armObject = arm_.Get(), *light = light_.Get();
    ut::test::MockEventSink events;
    std::map<IGwPropertyNotifySink*, unsigned long> sinks = {{&firstSink_, 0}, {&secondSink_, 0}};
    auto putBack = [&] { (void)F3DAddObjectToTransientObjectContainer(armHierarchy_.Get(), 1); };
    auto withdraw = [&] { (void)KXAdviseOnActiveDB(&events, 0); };
    const Walk walks[] = {
        // The roots; a failing look-up of the current container is answered with a new one.
        HANDING(void, KXGetSceneManager(IID_I3DSceneManager, o, 1), {denied}),
        HANDING(void, KXGetCurrentScene(IID_I3DScene, o), {denied}),
        HANDING(void, KXGet3DContentContainer(IID_IGWContentContainer, o, 1), {"S_OK set"}),
        HANDING(void, KXGet3DContentContainer(IID_IGWContentContainer, o, 0), {denied}),
        // Managers and views; a content-container member works on a new container when the
        // current one cannot be had.
        HANDING(void, KXGetCacheManager(IID_I3DCacheMgr, o), made),
        HANDING(I3DCacheMgr, KXGetCacheManager(o), made),
        HANDING(void, KXGetViewManager(IID_IUnknown, o), {denied}),
        HANDING(void, KXGetViewerControler(IID_IGWViewerController, o), {denied}),
        HANDING(void, KXGetGenericManager(ut::test::kColor, IID_IUnknown, o), {denied}),
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
        HANDING(I3DObject, F3DGet3DObjectFromName(arm, o), {denied}),
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
        SAYS(F3DSceneNotificationQuietOff(), {"DENIED"}, "S_OK"),
        HANDING(I3DObject, F3DCreate3DObjectFromPrimitive(&primitive_, cube, o), {denied}),
        HANDING(void, KXCreate3DModelObject(L"Model", IID_I3DModel, o), {denied}),
        // The removal answers S_FALSE when it was not added.
        SAYS_THEN(F3DAdd3DObjectToScene(rig_.Get(), arm_.Get(), 1), F3DRemove3DObjectFromScene(rig_.Get()),
                  {"DENIED"}, "S_OK"),
        // The adding back answers E_INVALIDARG when it stayed; telling the database may fail.
        SAYS_THEN(F3DRemove3DObjectFromScene(light_.Get()), F3DAdd3DObjectToScene(light_.Get(), nullptr, 0),
                  {"DENIED", "DENIED", "S_OK"}, "S_OK"),
        SAYS(F3DSetAs3DGroup(&group_, element_.Get(), nullptr), {"DENIED"}, "S_OK"),
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
        HANDING(IKXLayerContainer, F3DGetLayerContainer(o), {denied}),
        HANDING(IKXLayerContainer, F3DGetPassContainer(o), {denied}),
        HANDING(void, F3DGetParTypeContainer(IID_IUnknown, o), {denied}),
        HANDING(void, F3DGetEnvironmentContainer(IID_IUnknown, o), {denied}),
        HANDING(I3DRefPlaneFolder, F3DGetRefPlaneFolder(o), made),
        HANDING(void, F3DGetDeviceManager(IID_IUnknown, o), made),
        HANDING(void, F3DGetTransientObjectContainer(IID_IUnknown, o), made),
        // Scene defaults: the stream and the new instance turn every failure into S_FALSE.
        HANDING(IUnknown, KXGetSceneDefaultsObject(ut::test::kColor, o), {"S_OK set", denied, denied}),
        HANDING(IStream, KXGetStreamFromSceneDefaults(ut::test::kColor, o),
                {"S_OK set", "S_FALSE null", "S_FALSE null"}),
        HANDING(void, KXCreateDefaultInstance(CLSID_3DList, IID_I3DList, o, nullptr),
                {"S_OK set", "S_FALSE null", "S_FALSE null", "S_FALSE null"}),
        // Scene properties and the model; a failing read of the time mapping means there is none.
        HANDING(void, KXGetSceneProperty(GUID_GWTimeMappingProperty, IID_IUnknown, o), {denied}),
        HANDING(I3DList, KXGetListOfSceneCameras(o), {denied}),
        HANDING(void, KXGetCurrentSceneModel(IID_I3DModel, o), {denied}),
        HANDING(IGWProperties, KXGetCurrentSceneTimeMapping(o), {denied, denied, "S_FALSE null"}),
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
        HANDING(void, KXGetSceneRootProperty(kNew, IID_IGWProperties, o), {denied}),
        // Any failure on the way to the list is E_FAIL.
        HANDING(I3DList, F3DGetPropsList(arm_.Get(), ut::test::kColor, o), {"E_FAIL null"}),
        // The transient object container, each put back afterwards.
        SAYS_THEN(F3DAddObjectToTransientObjectContainer(light),
                  F3DRemoveObjectFromTransientObjectContainer(light), {"S_OK", "DENIED", "DENIED"}, "S_OK"),
        SAYS_THEN(F3DRemoveObjectFromTransientObjectContainer(armObject), putBack(),
                  {"S_FALSE", "DENIED", "DENIED"}, "S_OK"),
        SAYS(F3DIsObjectInTransientObjectContainer(armObject), {"S_FALSE", "DENIED", "DENIED"}, "S_OK"),
        SAYS_THEN(F3DTransientObjectContainerReset(), putBack(), {"S_OK", "DENIED", "DENIED"}, "S_OK"),
        // Reaching the parameter and the proxy fails the command; the current time and the set do not.
        SAYS(KXTimeControlReset(1), {"DENIED"}, "S_OK"),
        SAYS(F3DSetComponentValueCmd(arm_.Get(), ut::test::kX, &two),
             {"DENIED", "DENIED", "S_OK", "S_OK", "S_OK"}, "S_OK"),
        TELLS(std::string(KXIsActiveDataSelected(arm_.Get()) ? "yes" : "no"), {"no"}, "yes"),
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
        SAYS(KXFindFamily(L"cameras", &found), {"DENIED"}, "S_OK"),
        TELLS(std::to_string(F3DIsCLSIDInFamily(kLens, GUID_3DCameraFamily)),
              {std::to_string(kFault), "0"}, "1"),
        SAYS(KXValidateObjectFamily(&cameras, 1, kLens), {"DENIED"}, "S_OK"),
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
        SAYS_THEN(KXAdviseOnActiveDBEx(&events, 1, GWDB_EVENT_REMOVED), withdraw(), {"DENIED"}, "S_OK"),
        SAYS_THEN(KXAdviseOnActiveDBForFinalEndLoad(&events, 5), withdraw(), {"DENIED"}, "S_OK"),
        {"CKXResolveAllDuringLoadHelper, F3DWasLoadCancelled",
         [&] {
             std::string seen;
             {
                 CKXResolveAllDuringLoadHelper guard;
                 seen = std::to_string(F3DWasLoadCancelled());
             }
             Lift();
             auto database = ut::test::Service<IGWActiveDatabase>(CLSID_GWActiveDatabase);
             seen += " " + Result(database->TestStateFlags(GWDB_STATE_RESOLVE_ALL));
             (void)database->SetStateFlags(GWDB_STATE_RESOLVE_ALL | GWDB_STATE_RESOLVE_DURING_LOAD, FALSE);
             return seen;
         },
         // Only a failing switch-off leaves resolving on.
         {"0 S_FALSE", "0 S_FALSE", "0 S_FALSE", "0 S_FALSE", "0 S_FALSE", "0 S_OK", "0 S_OK"},
         "0 S_FALSE"},
        // Quiet is switched off again when the bracket failed to close.
        SAYS_THEN(FPropertyChangedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, sinks),
                  F3DSceneNotificationQuietOff(), {"S_OK"}, "S_OK"),
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
        // Hierarchy moves and roots. A failing look-up of the object is a refusal; a failing check only
        // skips `out`. The move is put back; the removal answers S_FALSE when it did not move.
        SAYS_THEN(KXMoveObjectInHier(robot_.Get(), rig_.Get(), GWDEST_LAST, nullptr,
                                     ut::ComPtr<IUnknown>().Put()), // released at once
                  F3DRemove3DObjectFromScene(rig_.Get()),
                  {"DENIED", "E_INVALIDARG", "DENIED", "S_OK", "DENIED"}, "S_OK"),
        HANDING(I3DObject, KXGet3DObjectHierarchyRoot(arm_.Get(), o), {denied}),
        {"KXGet3DObjectHierarchyRootInModel",
         Handing<I3DObject>([&](auto o) {
             ut::ComPtr<I3DModel> model;
             (void)robot_.As(model); // a model of the reference scene
             return KXGet3DObjectHierarchyRootInModel(arm_.Get(), model.Get(), o);
         }),
         {denied}},
        SAYS(KXGetSceneBBox(nullptr, nullptr, 0, E3DSPACE_GLOBAL, nullptr, 0, &box), {"DENIED"}, "S_FALSE"),
    };
    int walked = 0;
    for (const Walk& walk : walks) {
        (void)walk.run(); // once clean, so that what the host makes on first use exists already
        auto references = [&] {
            return std::pair(ut::test::RefTracker::References(arm_.Get()),
                             ut::test::RefTracker::References(registry_.Get()));
        };
        const auto before = references();
        const std::vector<std::string>& f = walk.failures;
        std::size_t failed = 0;
        ut::test::WalkHostFaults(
            walk.run,
            [&](int row, const std::string& outcome) {
                const bool allowed = walk.anyOf && std::count(f.begin(), f.end(), outcome);
                const std::string documented = row == 0        ? walk.clean
                                               : allowed       ? outcome
                                               : f.size() == 1 ? f[0]
                                               : row <= static_cast<int>(f.size())
                                                   ? f[row - 1]
                                                   : "(more host calls than documented)";
                EXPECT_EQ(outcome, documented) << walk.name << ", host call " << row << " failing (0: none)";
                failed += row != 0;
            },
            kFault);
        walked += static_cast<int>(failed);
        EXPECT_EQ(references(), before) << walk.name << " left references behind";
        EXPECT_EQ(failed, f.size() > 1 && !walk.anyOf ? f.size() : failed)
            << walk.name << " makes another number of host calls";
    }
    std::cout << "[ walked   ] " << walked << " failure paths in " << std::size(walks) << " scenarios\n";
}

} // namespace
