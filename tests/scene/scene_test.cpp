// Scene access on the reference scene: what a plug-in sees when it works on a real scene.
#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include <ut/scene.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/play.h>
#include <ut/sdk/scene_defaults.h>
#include <ut/sdk/transient.h>

#include "support/ref_tracker.h"
#include "support/scene_mocks.h"
#include "test_scene.h"

namespace {

using ut::test::Find;
using ut::test::Held;
using ut::test::Result;

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
    ut::ComPtr<IGWPlayControl> play;
    ASSERT_EQ(GWQueryGenericObject(CLSID_GWPlayControl, IID_IGWPlayControl, play.PutVoid()), S_OK);
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
    void* out = nullptr;
    EXPECT_EQ(KXGet3DContentContainer(IID_IGWContentContainer, &out, 0), E_FAIL);
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
    IUnknown* first = nullptr;
    IUnknown* second = nullptr;
    EXPECT_EQ(KXGetSceneRootProperty(ut::test::kMaterial, IID_IUnknown, reinterpret_cast<void**>(&first)),
              S_OK);
    EXPECT_EQ(KXGetSceneRootProperty(ut::test::kMaterial, IID_IUnknown, reinterpret_cast<void**>(&second)),
              S_OK);
    EXPECT_EQ(first, second);
    Held(first), Held(second);
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
    IUnknown* first = nullptr;
    IUnknown* again = nullptr;
    EXPECT_EQ(KXGetSceneDefaultsObject(ut::test::kColor, &first), S_OK);
    EXPECT_EQ(KXGetSceneDefaultsObject(ut::test::kColor, &again), S_OK);
    EXPECT_EQ(first, again);
    Held(first), Held(again);
    EXPECT_EQ(KXCreateDefaultInstance(ut::test::kColor, IID_IUnknown, &out, nullptr), S_FALSE);
    EXPECT_EQ(F3DGetEnvironmentContainer(IID_IKXLayerContainer, &out), E_NOINTERFACE);
}

TEST_F(ReferenceScene, ASetValueCommandSetsTheObjectsParameterAndAGroupIsSetThroughAnElement) {
    ut::test::MockGroup group;
    ut::ComPtr<I3DObject> arm = Find(L"Arm");
    CGWVariant four(4.0), text;
    text.vt = VT_BSTR;
    text.bstrVal = SysAllocString(L"four");
    EXPECT_EQ(F3DSetComponentValueCmd(arm.Get(), ut::test::kX, &text), S_OK); // refused, and still S_OK
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

} // namespace
