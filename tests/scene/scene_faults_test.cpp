// Every scene export on the reference scene, with its 1st, 2nd, ... host call failing in turn
// until it runs clean: each step gives the documented failure, leaves its out-parameters null,
// and leaves no object and no reference behind. One table drives them all.
#include <functional>
#include <iostream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/scene.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"
#include "support/scene_mocks.h"
#include "test_scene.h"

namespace {

using ut::test::Held;
using ut::test::Result;

constexpr HRESULT kFault = E_ACCESSDENIED;

// The result and whether the out-parameter came back set.
template <class Interface>
std::string Out(HRESULT hr, Interface*& out) {
    return Result(hr) + " " + Held(out);
}
std::string Out(HRESULT hr, void*& out) {
    return Out(hr, reinterpret_cast<IUnknown*&>(out));
}

// Lifts the fault for the rest of a scenario, which then puts the scene back as it was.
void Lift() {
    ut::sdk::SetHostFaultHook(nullptr);
}

struct Walk {
    const char* name;
    std::function<std::string()> run;
    std::string clean;
    // The outcome of every failing call when there is one; otherwise one per call, in order.
    std::vector<std::string> failures;
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
};

TEST_F(SceneFaults, EveryExportGivesItsDocumentedFailureAtEveryFailingHostCall) {
    const std::string denied = "DENIED null";
    const GUID kNew = {0x51, 0x52, 0x53, {1, 2, 3, 4, 5, 6, 7, 8}}; // a root property the model makes
    wchar_t arm[] = L"Arm", cube[] = L"Cube";
    const Walk walks[] = {
        // The roots.
        {"KXGetSceneManager",
         [] {
             void* out = nullptr;
             return Out(KXGetSceneManager(IID_I3DSceneManager, &out, 1), out);
         },
         "S_OK set",
         {denied}},
        {"KXGetCurrentScene",
         [] {
             void* out = nullptr;
             return Out(KXGetCurrentScene(IID_I3DScene, &out), out);
         },
         "S_OK set",
         {denied}},
        // A failing look-up of the current container is answered with a new one.
        {"KXGet3DContentContainer",
         [] {
             void* out = nullptr;
             return Out(KXGet3DContentContainer(IID_IGWContentContainer, &out, 1), out);
         },
         "S_OK set",
         {"S_OK set"}},
        {"KXGet3DContentContainer without creation",
         [] {
             void* out = nullptr;
             return Out(KXGet3DContentContainer(IID_IGWContentContainer, &out, 0), out);
         },
         "S_OK set",
         {denied}},
        // Managers and views.
        {"KXGetCacheManager",
         [] {
             void* out = nullptr;
             return Out(KXGetCacheManager(IID_I3DCacheMgr, &out), out);
         },
         "S_OK set",
         {"S_OK set", denied}},
        {"KXGetCacheManager(I3DCacheMgr**)",
         [] {
             I3DCacheMgr* out = nullptr;
             return Out(KXGetCacheManager(&out), out);
         },
         "S_OK set",
         {"S_OK set", denied}},
        {"KXGetViewManager",
         [] {
             void* out = nullptr;
             return Out(KXGetViewManager(IID_IUnknown, &out), out);
         },
         "S_OK set",
         {denied}},
        {"KXGetViewerControler",
         [] {
             void* out = nullptr;
             return Out(KXGetViewerControler(IID_IGWViewerController, &out), out);
         },
         "S_OK set",
         {denied}},
        {"KXGetGenericManager",
         [] {
             void* out = nullptr;
             return Out(KXGetGenericManager(ut::test::kColor, IID_IUnknown, &out), out);
         },
         "S_OK set",
         {denied}},
        // Scene-wide actions, each put back afterwards.
        {"KXStoreCommand and KXPostCommand",
         [&] {
             HRESULT stored = KXStoreCommand(ut::test::kColor, ut::test::kX, &context_);
             HRESULT posted = KXPostCommand();
             Lift();
             (void)KXPostCommand(); // forgets a command that was stored but not posted
             return Result(stored) + " " + Result(posted);
         },
         "S_OK S_OK",
         {"DENIED S_FALSE", "DENIED S_FALSE", "S_OK DENIED", "S_OK DENIED"}},
        {"F3DGet3DObjectFromName",
         [&] {
             I3DObject* out = nullptr;
             return Out(F3DGet3DObjectFromName(arm, &out), out);
         },
         "S_OK set",
         {denied}},
        {"F3DSceneNotificationQuietOn",
         [&] {
             HRESULT hr = F3DSceneNotificationQuietOn();
             Lift();
             std::string mode = std::to_string(host_.SceneNotificationMode());
             (void)F3DSceneNotificationQuietOff();
             return Result(hr) + " " + mode;
         },
         "S_OK 1",
         {"DENIED 3"}},
        {"F3DSceneNotificationQuietOff",
         [] { return Result(F3DSceneNotificationQuietOff()); },
         "S_OK",
         {"DENIED"}},
        {"F3DCreate3DObjectFromPrimitive",
         [&] {
             I3DObject* out = nullptr;
             return Out(F3DCreate3DObjectFromPrimitive(&primitive_, cube, &out), out);
         },
         "S_OK set",
         {denied}},
        {"KXCreate3DModelObject",
         [] {
             void* out = nullptr;
             return Out(KXCreate3DModelObject(L"Model", IID_I3DModel, &out), out);
         },
         "S_OK set",
         {denied}},
        {"F3DAdd3DObjectToScene",
         [&] {
             HRESULT hr = F3DAdd3DObjectToScene(rig_.Get(), arm_.Get(), 1);
             Lift();
             (void)F3DRemove3DObjectFromScene(rig_.Get()); // S_FALSE when it was not added
             return Result(hr);
         },
         "S_OK",
         {"DENIED"}},
        {"F3DRemove3DObjectFromScene",
         [&] {
             HRESULT hr = F3DRemove3DObjectFromScene(light_.Get());
             Lift();
             (void)F3DAdd3DObjectToScene(light_.Get(), nullptr, 0); // E_INVALIDARG when it stayed
             return Result(hr);
         },
         "S_OK",
         {"DENIED"}},
        {"F3DSetAs3DGroup",
         [&] { return Result(F3DSetAs3DGroup(&group_, element_.Get(), nullptr)); },
         "S_OK",
         {"DENIED"}},
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
         "S_OK 0",
         {"S_OK 0", "S_OK 0", "E_FAIL 3", "DENIED 3", "S_OK 0"}},
        // Containers.
        {"F3DGetLayerContainer",
         [] {
             IKXLayerContainer* out = nullptr;
             return Out(F3DGetLayerContainer(&out), out);
         },
         "S_OK set",
         {denied}},
        {"F3DGetPassContainer",
         [] {
             IKXLayerContainer* out = nullptr;
             return Out(F3DGetPassContainer(&out), out);
         },
         "S_OK set",
         {denied}},
        {"F3DGetParTypeContainer",
         [] {
             void* out = nullptr;
             return Out(F3DGetParTypeContainer(IID_IUnknown, &out), out);
         },
         "S_OK set",
         {denied}},
        {"F3DGetEnvironmentContainer",
         [] {
             void* out = nullptr;
             return Out(F3DGetEnvironmentContainer(IID_IUnknown, &out), out);
         },
         "S_OK set",
         {denied}},
        {"F3DGetRefPlaneFolder",
         [] {
             I3DRefPlaneFolder* out = nullptr;
             return Out(F3DGetRefPlaneFolder(&out), out);
         },
         "S_OK set",
         {"S_OK set", denied}},
        {"F3DGetDeviceManager",
         [] {
             void* out = nullptr;
             return Out(F3DGetDeviceManager(IID_IUnknown, &out), out);
         },
         "S_OK set",
         {"S_OK set", denied}},
        {"F3DGetTransientObjectContainer",
         [] {
             void* out = nullptr;
             return Out(F3DGetTransientObjectContainer(IID_IUnknown, &out), out);
         },
         "S_OK set",
         {"S_OK set", denied}},
        // Scene defaults: the stream and the new instance turn every failure into S_FALSE.
        {"KXGetSceneDefaultsObject",
         [] {
             IUnknown* out = nullptr;
             return Out(KXGetSceneDefaultsObject(ut::test::kColor, &out), out);
         },
         "S_OK set",
         {"S_OK set", denied, denied}},
        {"KXGetStreamFromSceneDefaults",
         [] {
             IStream* out = nullptr;
             return Out(KXGetStreamFromSceneDefaults(ut::test::kColor, &out), out);
         },
         "S_OK set",
         {"S_OK set", "S_FALSE null", "S_FALSE null"}},
        {"KXCreateDefaultInstance",
         [] {
             void* out = nullptr;
             return Out(KXCreateDefaultInstance(CLSID_3DList, IID_I3DList, &out, nullptr), out);
         },
         "S_OK set",
         {"S_OK set", "S_FALSE null", "S_FALSE null", "S_FALSE null"}},
        // Scene properties and the model.
        {"KXGetSceneProperty",
         [] {
             void* out = nullptr;
             return Out(KXGetSceneProperty(GUID_GWTimeMappingProperty, IID_IUnknown, &out), out);
         },
         "S_OK set",
         {denied}},
        {"KXGetListOfSceneCameras",
         [] {
             I3DList* out = nullptr;
             return Out(KXGetListOfSceneCameras(&out), out);
         },
         "S_OK set",
         {denied}},
        {"KXGetCurrentSceneModel",
         [] {
             void* out = nullptr;
             return Out(KXGetCurrentSceneModel(IID_I3DModel, &out), out);
         },
         "S_OK set",
         {denied}},
        // A failing read of the time-mapping property means the scene has none.
        {"KXGetCurrentSceneTimeMapping",
         [] {
             IGWProperties* out = nullptr;
             return Out(KXGetCurrentSceneTimeMapping(&out), out);
         },
         "S_OK set",
         {denied, denied, "S_FALSE null"}},
        // A failing read makes the property again, which replaces the scene's (the failures of making
        // it are the contract test's).
        {"KXGetCurrentSceneProperty",
         [&] {
             CGWVariant value;
             HRESULT hr = KXGetCurrentSceneProperty(GUID_GWTimeMappingProperty, value, 1);
             return Result(hr) + " " + std::to_string(value.vt);
         },
         "S_OK 13",
         {"DENIED 0", "DENIED 0", "S_OK 13"}},
        {"KXGetSceneRootProperty",
         [&] {
             void* out = nullptr;
             return Out(KXGetSceneRootProperty(kNew, IID_IGWProperties, &out), out);
         },
         "S_OK set",
         {denied, denied, denied, denied}},
        // Any failure on the way to the list is E_FAIL.
        {"F3DGetPropsList",
         [&] {
             I3DList* out = nullptr;
             return Out(F3DGetPropsList(arm_.Get(), ut::test::kColor, &out), out);
         },
         "S_OK set",
         {"E_FAIL null"}},
        // The transient object container, each put back afterwards.
        {"F3DAddObjectToTransientObjectContainer",
         [&] {
             HRESULT hr = F3DAddObjectToTransientObjectContainer(static_cast<IUnknown*>(light_.Get()));
             Lift();
             (void)F3DRemoveObjectFromTransientObjectContainer(static_cast<IUnknown*>(light_.Get()));
             return Result(hr);
         },
         "S_OK",
         {"S_OK", "DENIED", "DENIED"}},
        {"F3DRemoveObjectFromTransientObjectContainer",
         [&] {
             HRESULT hr = F3DRemoveObjectFromTransientObjectContainer(static_cast<IUnknown*>(arm_.Get()));
             Lift();
             (void)F3DAddObjectToTransientObjectContainer(armHierarchy_.Get(), 1);
             return Result(hr);
         },
         "S_OK",
         {"S_FALSE", "DENIED", "DENIED"}},
        {"F3DIsObjectInTransientObjectContainer",
         [&] { return Result(F3DIsObjectInTransientObjectContainer(static_cast<IUnknown*>(arm_.Get()))); },
         "S_OK",
         {"S_FALSE", "DENIED", "DENIED"}},
        {"F3DTransientObjectContainerReset",
         [&] {
             HRESULT hr = F3DTransientObjectContainerReset();
             Lift();
             (void)F3DAddObjectToTransientObjectContainer(armHierarchy_.Get(), 1);
             return Result(hr);
         },
         "S_OK",
         {"S_OK", "DENIED", "DENIED"}},
        // The play control, the set-value command and the selection.
        {"KXTimeControlReset", [] { return Result(KXTimeControlReset(1)); }, "S_OK", {"DENIED"}},
        // Reaching the parameter and the proxy fails the command; the current time and the set do not.
        {"F3DSetComponentValueCmd",
         [&] {
             CGWVariant value(2.0);
             return Result(F3DSetComponentValueCmd(arm_.Get(), ut::test::kX, &value));
         },
         "S_OK",
         {"DENIED", "DENIED", "S_OK", "S_OK", "S_OK"}},
        {"KXIsActiveDataSelected",
         [&] { return std::string(KXIsActiveDataSelected(arm_.Get()) ? "yes" : "no"); },
         "yes",
         {"no"}},
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
         "1",
         {"0", "0", "0", "0"}},
        {"F3DGetMaterialCatID and F3DTranslateMaterialCATID",
         [] {
             return std::string(
                 IsEqualGUID(F3DTranslateMaterialCATID(F3DGetMaterialCatID()), CATID_3DMaterial) ? "same"
                                                                                                 : "other");
         },
         "same",
         {}},
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
                const std::string& documented =
                    walk.failures.size() == 1 ? walk.failures[0]
                                              : (row <= static_cast<int>(walk.failures.size())
                                                     ? walk.failures[row - 1]
                                                     : std::string("(more host calls than documented)"));
                EXPECT_EQ(outcome, documented) << walk.name << ", host call " << row << " failing";
            },
            kFault);
        EXPECT_EQ(references, (std::vector<ULONG>{ut::test::RefTracker::References(arm_.Get()),
                                                  ut::test::RefTracker::References(registry_.Get())}))
            << walk.name << " left references behind";
        if (walk.failures.size() > 1) {
            EXPECT_EQ(seen.size(), walk.failures.size())
                << walk.name << " makes another number of host calls";
        }
    }
    std::cout << "[ walked   ] " << walked << " failure paths of " << std::size(walks) << " exports\n";
}

} // namespace
