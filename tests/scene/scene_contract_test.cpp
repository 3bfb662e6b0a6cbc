// Scene access against GoogleMock host objects: which host operation each function calls, with
// which arguments and in which order, how its answer is mapped, and that no reference is left.
#include <functional>
#include <string>
#include <tuple>
#include <vector>

#include <gmock/gmock.h>

#include <ut/scene.h>
#include <ut/sdk/objects.h>

#include "support/scene_mocks.h"
#include "test_scene.h"

namespace {

using ::testing::_;
using ::testing::DoAll;
using ::testing::InSequence;
using ::testing::Return;
using ::testing::SetArgPointee;
using ::testing::StrEq;
using ::testing::StrictMock;
using ut::test::GiveOut;
using ut::test::Result;

constexpr GUID kSomeId = {0x1, 0x2, 0x3, {4, 5, 6, 7, 8, 9, 10, 11}};
constexpr GUID kOtherId = {0xA, 0xB, 0xC, {1, 1, 1, 1, 1, 1, 1, 1}};
constexpr HRESULT kRefused = E_ACCESSDENIED;

// Installs a class factory for one scope.
struct ScopedClass {
    CLSID clsid;
    ScopedClass(REFCLSID id, IClassFactory* factory) : clsid(id) { GWRegisterClassFactory(id, factory); }
    ~ScopedClass() { GWRevokeClassFactory(clsid); }
};

// One host object of each kind; the scene-manager factory, undo manager, play control and
// current content container are installed. Every test ends with no reference left behind.
class SceneContract : public ::testing::Test {
protected:
    SceneContract() {
        factory.Also(IID_IGWManagerRegistry, &registry);
        scene.Also(IID_IGWProperties, &sceneProperties);
        object.Also(IID_IGWPropertyOwner, &owner);
        component.Also(IID_IGWComponentHierarchy, &hierarchy);
        GWContentSetCurrentContainer(&content);
    }
    void TearDown() override {
        GWContentSetCurrentContainer(nullptr);
        ExpectLeft(1, factory, undo, play);
        ExpectLeft(0, registry, scene, sceneProperties, content, defaults, transient, model, object, owner,
                   component, hierarchy, proxy, list, element, group, primitive, context, preset, cache);
    }
    template <class... Mocks>
    static void ExpectLeft(ULONG installed, const Mocks&... mocks) {
        ([&] { EXPECT_EQ(mocks.Extra(), installed); }(), ...);
    }
    void SceneIsCurrent() {
        EXPECT_CALL(factory, GetCurrentScene(_))
            .WillOnce(GiveOut<0>(static_cast<IUnknown*>(&scene)))
            .RetiresOnSaturation();
    }

    StrictMock<ut::test::MockSceneManager> factory;
    StrictMock<ut::test::MockManagerRegistry> registry;
    StrictMock<ut::test::MockScene> scene;
    StrictMock<ut::test::MockProperties> sceneProperties;
    StrictMock<ut::test::MockContentContainer> content;
    StrictMock<ut::test::MockSceneDefaults> defaults;
    StrictMock<ut::test::MockTransientContainer> transient;
    StrictMock<ut::test::MockModel> model;
    StrictMock<ut::test::MockObject> object;
    StrictMock<ut::test::MockPropertyOwner> owner;
    StrictMock<ut::test::MockActiveData> component;
    StrictMock<ut::test::MockComponentHierarchy> hierarchy;
    StrictMock<ut::test::MockSetValueProxy> proxy;
    StrictMock<ut::test::MockUndoManager> undo;
    StrictMock<ut::test::MockPlayControl> play;
    StrictMock<ut::test::MockList> list;
    StrictMock<ut::test::MockElemRef> element;
    ut::test::MockGroup group;
    ut::test::MockPrimitive primitive;
    ut::test::MockExecContext context;
    ut::test::MockPreset preset;
    ut::test::MockCacheMgr cache;
    ut::test::ScopedGenericObject installedFactory{CLSID_3DSceneManagerFactory, &factory};
    ut::test::ScopedGenericObject installedUndo{CLSID_GWUndoManager, &undo};
    ut::test::ScopedGenericObject installedPlay{CLSID_GWPlayControl, &play};
};

// How a function maps the one host answer it passes on.
using Mapping = HRESULT (*)(HRESULT);
constexpr Mapping kAsIs = [](HRESULT answer) { return answer; };
constexpr Mapping kOk = [](HRESULT answer) { return FAILED(answer) ? answer : S_OK; };
constexpr Mapping kOkOrFalse = [](HRESULT answer) { return answer == S_OK ? S_OK : S_FALSE; };
constexpr Mapping kFalseOrOk = [](HRESULT answer) {
    return FAILED(answer) || answer == S_FALSE ? answer : S_OK;
};

TEST_F(SceneContract, EachMemberCallsItsOneOperationWithTheCallersArgumentsAndMapsTheAnswer) {
    // Each row runs once for each answer; every operation is expected as often as its rows run
    // and gives the answer of the moment, so a row that called another operation, or another's
    // arguments, fails the count.
    const HRESULT answers[] = {S_FALSE, 2, kRefused};
    const int runs = static_cast<int>(std::size(answers));
    HRESULT answer = S_OK;
    void* out = nullptr;
    I3DObject* found = nullptr;
    wchar_t cube[] = L"Cube";
    auto each = [&](auto& expectation, int rows = 1) {
        expectation.Times(runs * rows).WillRepeatedly(::testing::ReturnPointee(&answer));
    };
    each(EXPECT_CALL(factory, StoreCommand(kSomeId, kOtherId, &context)));
    each(EXPECT_CALL(factory, PostCommand()));
    each(EXPECT_CALL(factory, FindObjectByName(StrEq(L"Cube"), &found)));
    each(EXPECT_CALL(factory, SetNotificationMode(1, 0)));
    each(EXPECT_CALL(factory, SetNotificationMode(3, 0)));
    each(EXPECT_CALL(factory, CreateObjectFromPrimitive(&primitive, StrEq(L"Cube"), &found)));
    each(EXPECT_CALL(factory, CreateModelObject(StrEq(L"Robot"), kSomeId, &out)));
    each(EXPECT_CALL(factory, AddObject(&object, nullptr, 7)));
    each(EXPECT_CALL(factory, RemoveObject(&object)));
    each(EXPECT_CALL(registry, FindManager(kSomeId, kOtherId, &out)));
    EXPECT_CALL(factory, GetCurrentScene(_))
        .Times(runs * 6)
        .WillRepeatedly(GiveOut<0>(static_cast<IUnknown*>(&scene)));
    each(EXPECT_CALL(scene, GetContainer(GUID_3DLayerContainer, IID_IKXLayerContainer, _)));
    each(EXPECT_CALL(scene, GetContainer(GUID_3DPassContainer, IID_IKXLayerContainer, _)));
    each(EXPECT_CALL(scene, GetContainer(GUID_3DParTypeContainer, kSomeId, &out)));
    each(EXPECT_CALL(scene, GetContainer(GUID_3DEnvironmentContainer, kSomeId, &out)));
    each(EXPECT_CALL(scene, GetSceneProperty(kSomeId, kOtherId, &out)));
    each(EXPECT_CALL(scene, ListObjects(GUID_3DCameraFamily, 2, _)));
    each(EXPECT_CALL(content, FindObject(GUID_3DCacheManagerKey, kSomeId, &out)));
    each(EXPECT_CALL(content, FindObject(GUID_3DCacheManagerKey, IID_I3DCacheMgr, _)));
    each(EXPECT_CALL(content, FindObject(GUID_3DRefPlaneFolderKey, IID_I3DRefPlaneFolder, _)));
    each(EXPECT_CALL(content, FindObject(GUID_3DDeviceManagerKey, kSomeId, &out)));
    each(EXPECT_CALL(content, FindObject(GUID_3DTransientObjectContainerKey, kSomeId, &out)));
    EXPECT_CALL(content, FindObject(GUID_3DSceneDefaultsKey, IID_I3DSceneDefaults, _))
        .Times(runs * 3)
        .WillRepeatedly(GiveOut<2>(&defaults));
    each(EXPECT_CALL(defaults, GetObjectForClass(kSomeId, _)));
    each(EXPECT_CALL(defaults, GetStreamForClass(kSomeId, _)));
    each(EXPECT_CALL(defaults, CreateDefaultInstance(kSomeId, kOtherId, &out, &preset)));
    EXPECT_CALL(content, FindObject(GUID_3DTransientObjectContainerKey, IID_I3DTransientObjectContainer, _))
        .Times(runs * 5)
        .WillRepeatedly(GiveOut<2>(&transient));
    each(EXPECT_CALL(transient, Add(&hierarchy, 5)));
    each(EXPECT_CALL(transient, Add(&hierarchy, 1)));
    each(EXPECT_CALL(transient, Remove(&hierarchy)));
    each(EXPECT_CALL(transient, Contains(&hierarchy))); // it does not declare itself not transient
    each(EXPECT_CALL(transient, Reset()));
    struct Row {
        const char* call;
        Mapping mapping;
        std::function<HRESULT()> run;
    };
    IUnknown* asUnknown = &component;
#define ROW(mapping, call) Row(#call, mapping, [&] { return call; })
    const Row rows[] = {
        ROW(kAsIs, KXStoreCommand(kSomeId, kOtherId, &context)),
        ROW(kAsIs, KXPostCommand()),
        ROW(kAsIs, F3DGet3DObjectFromName(cube, &found)),
        ROW(kAsIs, F3DSceneNotificationQuietOn()),
        ROW(kAsIs, F3DSceneNotificationQuietOff()),
        ROW(kAsIs, F3DCreate3DObjectFromPrimitive(&primitive, cube, &found)),
        ROW(kAsIs, KXCreate3DModelObject(L"Robot", kSomeId, &out)),
        ROW(kAsIs, F3DAdd3DObjectToScene(&object, nullptr, 7)),
        ROW(kAsIs, F3DRemove3DObjectFromScene(&object)),
        ROW(kAsIs, KXGetGenericManager(kSomeId, kOtherId, &out)),
        ROW(kOk, F3DGetLayerContainer(reinterpret_cast<IKXLayerContainer**>(&out))),
        ROW(kOk, F3DGetPassContainer(reinterpret_cast<IKXLayerContainer**>(&out))),
        ROW(kOk, F3DGetParTypeContainer(kSomeId, &out)),
        ROW(kAsIs, F3DGetEnvironmentContainer(kSomeId, &out)),
        ROW(kOk, KXGetSceneProperty(kSomeId, kOtherId, &out)),
        ROW(kAsIs, KXGetListOfSceneCameras(reinterpret_cast<I3DList**>(&out))),
        ROW(kOk, KXGetCacheManager(kSomeId, &out)),
        ROW(kOk, KXGetCacheManager(reinterpret_cast<I3DCacheMgr**>(&out))),
        ROW(kAsIs, F3DGetRefPlaneFolder(reinterpret_cast<I3DRefPlaneFolder**>(&out))),
        ROW(kAsIs, F3DGetDeviceManager(kSomeId, &out)),
        ROW(kAsIs, F3DGetTransientObjectContainer(kSomeId, &out)),
        ROW(kAsIs, KXGetSceneDefaultsObject(kSomeId, reinterpret_cast<IUnknown**>(&out))),
        ROW(kOkOrFalse, KXGetStreamFromSceneDefaults(kSomeId, reinterpret_cast<IStream**>(&out))),
        ROW(kOkOrFalse, KXCreateDefaultInstance(kSomeId, kOtherId, &out, &preset)),
        ROW(kOk, F3DAddObjectToTransientObjectContainer(&hierarchy, 5)),
        ROW(kOk, F3DAddObjectToTransientObjectContainer(asUnknown)),
        ROW(kFalseOrOk, F3DRemoveObjectFromTransientObjectContainer(asUnknown)),
        ROW(kFalseOrOk, F3DIsObjectInTransientObjectContainer(&hierarchy)),
        ROW(kOk, F3DTransientObjectContainerReset()),
    };
#undef ROW
    for (HRESULT given : answers) {
        answer = given;
        for (const Row& row : rows)
            EXPECT_EQ(row.run(), row.mapping(given)) << row.call << " answered " << given;
    }
}

TEST_F(SceneContract, ANullOutParameterIsRefusedBeforeAnyHostCall) {
    wchar_t name[] = L"x";
    void* some = name; // a non-null out-parameter beside a null argument
    IGWComponentHierarchy* noHierarchy = nullptr;
    IUnknown* noObject = nullptr;
    auto all = [](HRESULT expected, std::initializer_list<HRESULT> results) {
        int row = 0;
        for (HRESULT hr : results)
            EXPECT_EQ(Result(hr), Result(expected)) << "row " << row++;
    };
    all(E_UNEXPECTED, {KXGetSceneManager(kSomeId, nullptr, 1), KXGet3DContentContainer(kSomeId, nullptr, 1),
                       KXGetViewManager(kSomeId, nullptr), KXGetViewerControler(kSomeId, nullptr)});
    // clang-format off
    all(E_POINTER, {
        KXGetCurrentScene(kSomeId, nullptr), KXGetCacheManager(kSomeId, nullptr),
        KXGetGenericManager(kSomeId, kSomeId, nullptr), F3DGet3DObjectFromName(name, nullptr),
        F3DGet3DObjectFromName(nullptr, reinterpret_cast<I3DObject**>(&some)),
        F3DCreate3DObjectFromPrimitive(&primitive, name, nullptr), F3DSetAs3DGroup(&group, nullptr, nullptr),
        KXCreate3DModelObject(name, kSomeId, nullptr), F3DGetLayerContainer(nullptr),
        F3DGetParTypeContainer(kSomeId, nullptr), F3DGetEnvironmentContainer(kSomeId, nullptr),
        F3DGetRefPlaneFolder(nullptr), F3DGetDeviceManager(kSomeId, nullptr), F3DGetPassContainer(nullptr),
        KXGetSceneDefaultsObject(kSomeId, nullptr), KXGetStreamFromSceneDefaults(kSomeId, nullptr),
        KXCreateDefaultInstance(kSomeId, kSomeId, nullptr, nullptr), KXGetListOfSceneCameras(nullptr),
        KXGetSceneProperty(kSomeId, kSomeId, nullptr), KXGetCurrentSceneModel(kSomeId, nullptr),
        KXGetCurrentSceneTimeMapping(nullptr), KXGetSceneRootProperty(kSomeId, kSomeId, nullptr),
        F3DGetPropsList(&object, kSomeId, nullptr),
        F3DGetPropsList(nullptr, kSomeId, reinterpret_cast<I3DList**>(&some)),
        F3DAddObjectToTransientObjectContainer(noHierarchy, 1),
        F3DAddObjectToTransientObjectContainer(noObject),
        F3DRemoveObjectFromTransientObjectContainer(noHierarchy),
        F3DRemoveObjectFromTransientObjectContainer(noObject),
        F3DIsObjectInTransientObjectContainer(noHierarchy), F3DIsObjectInTransientObjectContainer(noObject),
        F3DSetComponentValueCmd(nullptr, kSomeId, nullptr)});
    // clang-format on
    // Either identifier null: E_FAIL before the scene is asked.
    all(E_FAIL, {KXGetSceneRootProperty(GUID_NULL, kSomeId, &some),
                 KXGetSceneRootProperty(kSomeId, GUID_NULL, &some)});
    EXPECT_FALSE(KXIsActiveDataSelected(nullptr));
    // The transient container's lookup is handed the caller's out-parameter, null or not.
    EXPECT_CALL(content, FindObject(GUID_3DTransientObjectContainerKey, kSomeId, nullptr))
        .WillOnce(Return(E_POINTER));
    EXPECT_EQ(F3DGetTransientObjectContainer(kSomeId, nullptr), E_POINTER);
}

TEST_F(SceneContract, TheRootsHandOutWhatTheirQueryAnswersAndNothingElse) {
    void* out = &out;
    EXPECT_EQ(KXGetSceneManager(IID_IGWManagerRegistry, &out, 0), S_OK);
    EXPECT_EQ(out, static_cast<IGWManagerRegistry*>(&registry));
    registry.Release();
    EXPECT_EQ(KXGetSceneManager(IID_I3DObject, &out, 1), E_NOINTERFACE);
    EXPECT_EQ(out, nullptr);
    // The current scene: asked for the interface, normalised; or the manager's failure.
    EXPECT_CALL(factory, GetCurrentScene(_)).WillOnce(Return(kRefused));
    EXPECT_EQ(KXGetCurrentScene(IID_I3DScene, &out), kRefused);
    SceneIsCurrent();
    EXPECT_EQ(KXGetCurrentScene(IID_I3DObject, &out), E_NOINTERFACE);
    SceneIsCurrent();
    EXPECT_EQ(KXGetCurrentScene(IID_IGWProperties, &out), S_OK);
    EXPECT_EQ(out, static_cast<IGWProperties*>(&sceneProperties));
    sceneProperties.Release();
    // Without a current container, one is made only when asked to.
    GWContentSetCurrentContainer(nullptr);
    EXPECT_EQ(KXGet3DContentContainer(IID_IGWContentContainer, &out, 0), E_FAIL);
    StrictMock<ut::test::MockClassFactory> containers;
    ScopedClass installed(CLSID_GWContentContainer, &containers);
    EXPECT_CALL(containers, CreateInstance(nullptr, IID_IGWContentContainer, &out))
        .WillOnce(GiveOut<2>(&content));
    EXPECT_EQ(KXGet3DContentContainer(IID_IGWContentContainer, &out, 1), S_OK);
    EXPECT_EQ(out, &content);
    content.Release();
    // A missing service is the query's failure.
    GWRevokeGenericObject(CLSID_3DSceneManagerFactory);
    EXPECT_EQ(KXGetSceneManager(IID_I3DSceneManager, &out, 1), REGDB_E_CLASSNOTREG);
    GWRegisterGenericObject(CLSID_3DSceneManagerFactory, &factory);
}

TEST_F(SceneContract, ViewsComeFromTheirServices) {
    ut::test::MockViewManager views;
    StrictMock<ut::test::MockViewerControllerFactory> controllers;
    ut::test::MockViewerController controller;
    ut::test::ScopedGenericObject a(CLSID_GWViewManager, &views),
        b(CLSID_GWViewerControllerFactory, &controllers);
    void* out = nullptr;
    // The view manager comes as itself whatever interface is asked for.
    EXPECT_EQ(KXGetViewManager(IID_I3DObject, &out), S_OK);
    EXPECT_EQ(out, &views);
    views.Release();
    EXPECT_CALL(controllers, CreateController(kSomeId, &out)).WillOnce(GiveOut<1>(&controller, S_FALSE));
    EXPECT_EQ(KXGetViewerControler(kSomeId, &out), S_FALSE);
    controller.Release();
    EXPECT_EQ(controllers.Extra() + controller.Extra() + views.Extra(), 2u); // the two installations
}

TEST_F(SceneContract, SetAsGroupSetsThenUpdatesWithTheCurrentScene) {
    for (HRESULT setAnswer : {S_OK, kRefused}) {
        InSequence order;
        SceneIsCurrent();
        EXPECT_CALL(element, SetAsGroup(static_cast<IUnknown*>(&scene), &group)).WillOnce(Return(setAnswer));
        if (setAnswer == S_OK)
            EXPECT_CALL(element, Update(1)).WillOnce(Return(S_FALSE));
        EXPECT_EQ(F3DSetAs3DGroup(&group, &element, &object), setAnswer);
    }
}

TEST_F(SceneContract, DeleteAllRunsInsideTheBracketWhenThereIsOne) {
    StrictMock<ut::test::MockDeleteAllBracket> bracket;
    {
        ut::test::ScopedGenericObject installed(CLSID_GWDeleteAllBracket, &bracket);
        InSequence order;
        EXPECT_CALL(bracket, Begin()).WillOnce(Return(kRefused));
        EXPECT_CALL(factory, DeleteAll(6)).WillOnce(Return(S_FALSE));
        EXPECT_CALL(bracket, End()).WillOnce(Return(kRefused));
        EXPECT_EQ(KXDeleteAll(6), S_FALSE);
        // Without a scene manager: E_FAIL, still bracketed.
        EXPECT_CALL(bracket, Begin());
        EXPECT_CALL(bracket, End());
        GWRevokeGenericObject(CLSID_3DSceneManagerFactory);
        EXPECT_EQ(KXDeleteAll(0), E_FAIL);
        GWRegisterGenericObject(CLSID_3DSceneManagerFactory, &factory);
    }
    EXPECT_CALL(factory, DeleteAll(1)).WillOnce(Return(kRefused));
    EXPECT_EQ(KXDeleteAll(1), kRefused);
    EXPECT_EQ(bracket.Extra(), 0u);
}

TEST_F(SceneContract, TimeControlResetWritesTheWholeRecordOrOnlyAnUndefinedSpan) {
    std::vector<tagGWPLAYCONTROLSETTINGS> written;
    EXPECT_CALL(play, SetSettings(_)).Times(3).WillRepeatedly([&](const tagGWPLAYCONTROLSETTINGS* settings) {
        written.push_back(*settings);
        return written.size() == 3 ? kRefused : S_FALSE;
    });
    EXPECT_EQ(KXTimeControlReset(0), S_OK);
    EXPECT_EQ(KXTimeControlReset(-1), S_OK);
    EXPECT_EQ(KXTimeControlReset(1), kRefused);
    const tagGWPLAYCONTROLSETTINGS& partial = written[0];
    EXPECT_EQ(partial.size, 448u);
    EXPECT_EQ(partial.mask, 1u);
    EXPECT_TRUE(std::isnan(partial.span.start.time) && std::isnan(partial.span.end.time));
    const tagGWPLAYCONTROLSETTINGS& full = written[1];
    EXPECT_EQ(full.mask, 0x77Fu);
    EXPECT_EQ(full.span.start.format, GWTIMEFORMAT_SECONDS);
    EXPECT_EQ(full.span.end.format, GWTIMEFORMAT_SECONDS);
    EXPECT_EQ(std::vector<double>({full.span.start.time, full.span.end.time, full.position, full.speed}),
              std::vector<double>({1.0, 100.0, 1.0, 1.0}));
    EXPECT_EQ(std::vector<LONG>({full.loop, full.preroll, full.mode, full.format, full.realTime, full.step,
                                 full.scrub, full.audioOffset}),
              std::vector<LONG>({0, 15, 2, 10, 0, 5, 0, 0}));
    for (BYTE reserved : full.reserved)
        ASSERT_EQ(reserved, 0);
}

TEST_F(SceneContract, SetComponentValueAsksForTheParameterAndProxyAndReportsOkWhateverTheSetAnswers) {
    tagGWComponent parameter{3, 8, 0, 2, {1}};
    tagGWTIME now = {GWTIMEFORMAT_PAL, 25.0, 2.5};
    CGWVariant value(4.0);
    {
        ut::test::ScopedGenericObject installedProxy(CLSID_GWSetValueProxy, &proxy);
        EXPECT_CALL(component, FindParameter(kSomeId, _))
            .WillOnce(DoAll(SetArgPointee<1>(parameter), Return(S_OK)));
        EXPECT_CALL(play, GetTime(_)).WillOnce(DoAll(SetArgPointee<0>(now), Return(S_OK)));
        EXPECT_CALL(proxy, SetValue(0, &hierarchy, _, 0, &value, 2.5))
            .WillOnce([&](ULONG, IGWComponentHierarchy*, const tagGWComponent& given, ULONG, const GWVARIANT*,
                          double) {
                EXPECT_EQ(given.id, 2u);
                return kRefused;
            });
        EXPECT_EQ(F3DSetComponentValueCmd(&component, kSomeId, &value), S_OK);
        // A parameter the object lacks, or an object without a hierarchy, ends it before the proxy.
        EXPECT_CALL(component, FindParameter(kOtherId, _)).WillOnce(Return(DISP_E_MEMBERNOTFOUND));
        EXPECT_EQ(F3DSetComponentValueCmd(&component, kOtherId, &value), DISP_E_MEMBERNOTFOUND);
        EXPECT_EQ(F3DSetComponentValueCmd(&hierarchy, kOtherId, &value), E_NOINTERFACE);
    }
    EXPECT_CALL(component, FindParameter(kSomeId, _)).WillOnce(Return(S_OK));
    EXPECT_EQ(F3DSetComponentValueCmd(&component, kSomeId, &value), REGDB_E_CLASSNOTREG);
}

TEST_F(SceneContract, SelectionIsBitZeroOfTheActiveDataFlags) {
    const std::pair<ULONG, bool> flags[] = {
        {0, false}, {1, true}, {2, false}, {0x8, false}, {0xFFFFFFFF, true}};
    for (auto [word, selected] : flags) {
        EXPECT_CALL(component, GetFlags(_)).WillOnce(DoAll(SetArgPointee<0>(word), Return(S_OK)));
        EXPECT_EQ(KXIsActiveDataSelected(&component), selected) << word;
    }
    EXPECT_CALL(component, GetFlags(_)).WillOnce(DoAll(SetArgPointee<0>(1), Return(kRefused)));
    EXPECT_FALSE(KXIsActiveDataSelected(&component));
    EXPECT_FALSE(KXIsActiveDataSelected(&hierarchy));
}

TEST_F(SceneContract, TheModelIsAskedForTheRootPropertyThenToMakeIt) {
    void* out = nullptr;
    auto modelIsCurrent = [&](HRESULT answer) {
        SceneIsCurrent();
        EXPECT_CALL(scene, GetModel(_)).WillOnce(GiveOut<0>(static_cast<IUnknown*>(&model), answer));
    };
    {
        InSequence order;
        modelIsCurrent(S_OK);
        EXPECT_CALL(model, GetRootProperty(kSomeId, kOtherId, &out, 1)).WillOnce(Return(S_FALSE));
        EXPECT_CALL(model, GetRootProperty(kSomeId, kOtherId, &out, 0)).WillOnce(GiveOut<2>(&cache, S_FALSE));
    }
    EXPECT_EQ(KXGetSceneRootProperty(kSomeId, kOtherId, &out), S_OK);
    EXPECT_EQ(out, &cache);
    cache.Release();
    modelIsCurrent(S_OK);
    EXPECT_CALL(model, GetRootProperty(kSomeId, kOtherId, &out, 1)).WillOnce(Return(kRefused));
    EXPECT_EQ(KXGetSceneRootProperty(kSomeId, kOtherId, &out), kRefused);
    // A scene without a model: S_OK and nothing, from the model accessor S_FALSE.
    SceneIsCurrent();
    EXPECT_CALL(scene, GetModel(_)).WillOnce(Return(S_FALSE));
    EXPECT_EQ(KXGetSceneRootProperty(kSomeId, kOtherId, &out), S_OK);
    SceneIsCurrent();
    EXPECT_CALL(scene, GetModel(_)).WillOnce(Return(S_FALSE));
    EXPECT_EQ(KXGetCurrentSceneModel(IID_I3DModel, &out), S_FALSE);
    EXPECT_EQ(out, nullptr);
}

TEST_F(SceneContract, TheTimeMappingIsTheSetHeldByTheScenesTimeMappingProperty) {
    ut::test::MockProperties mapping;
    IGWProperties* out = nullptr;
    // What the property holds and what reading it answers; the result.
    const std::tuple<VARTYPE, HRESULT, HRESULT> cases[] = {{VT_UNKNOWN, S_OK, S_OK},
                                                           {VT_UNKNOWN, S_FALSE, S_OK},
                                                           {VT_I4, S_OK, E_NOINTERFACE},
                                                           {VT_EMPTY, kRefused, S_FALSE}};
    for (const auto& [type, read, expected] : cases) {
        SCOPED_TRACE(::testing::Message() << "type " << type << ", read " << Result(read));
        SceneIsCurrent();
        EXPECT_CALL(sceneProperties, GetProperty(GUID_GWTimeMappingProperty, _, 0))
            .WillOnce([&](REFGUID, GWVARIANT* value, LONG) {
                value->vt = type;
                value->punkVal = type == VT_UNKNOWN ? static_cast<IUnknown*>(&mapping) : nullptr;
                if (value->punkVal)
                    mapping.AddRef();
                return read;
            });
        EXPECT_EQ(KXGetCurrentSceneTimeMapping(&out), expected);
        EXPECT_EQ(out, expected == S_OK ? &mapping : nullptr);
        if (out)
            out->Release();
        EXPECT_EQ(mapping.Extra(), 0u) << "the variant is cleared";
    }
}

TEST_F(SceneContract, AScenePropertyIsMadeAndAddedOnlyWhenMissingAndAskedFor) {
    StrictMock<ut::test::MockClassFactory> classes;
    ut::test::MockProperties made;
    ScopedClass installed(kSomeId, &classes);
    // What reading the property answers, whether to make it; the result and the value's type.
    const std::tuple<HRESULT, int, HRESULT, VARTYPE> cases[] = {{S_OK, 1, S_OK, VT_R8},
                                                                {S_FALSE, 0, S_OK, VT_R8},
                                                                {kRefused, 0, S_OK, VT_R8},
                                                                {S_FALSE, 1, S_OK, VT_UNKNOWN},
                                                                {kRefused, 1, kRefused, VT_R8}};
    for (const auto& [read, create, expected, type] : cases) {
        SCOPED_TRACE(::testing::Message() << "read " << Result(read) << ", create " << create);
        CGWVariant value;
        SceneIsCurrent();
        EXPECT_CALL(sceneProperties, GetProperty(kSomeId, &value, 0))
            .WillOnce([&](REFGUID, GWVARIANT* held, LONG) {
                held->vt = VT_R8;
                return read;
            });
        if (read != S_OK && create) {
            SceneIsCurrent();
            EXPECT_CALL(classes, CreateInstance(nullptr, IID_IGWProperties, _)).WillOnce(GiveOut<2>(&made));
            EXPECT_CALL(scene, AddProperty(kSomeId, &made, 4, 0x8000u)).WillOnce(Return(expected));
        }
        EXPECT_EQ(KXGetCurrentSceneProperty(kSomeId, value, create), expected);
        EXPECT_EQ(value.vt, type);
        EXPECT_TRUE(type != VT_UNKNOWN || value.punkVal == static_cast<IUnknown*>(&made));
    }
    EXPECT_EQ(made.Extra(), 0u);
}

TEST_F(SceneContract, PropsListWalksTheSetsOfKindPropertySetAndListsTheirPropertiesOfTheClass) {
    StrictMock<ut::test::MockClassFactory> lists;
    StrictMock<ut::test::MockProperties> sets, first, second, property;
    ScopedClass installed(CLSID_3DList, &lists);
    I3DList* out = nullptr;
    {
        InSequence order;
        EXPECT_CALL(lists, CreateInstance(nullptr, IID_I3DList, _)).WillOnce(GiveOut<2>(&list));
        EXPECT_CALL(owner, GetPropertySets(_)).WillOnce(GiveOut<0>(&sets));
        EXPECT_CALL(sets, CountMembers(GUID_GWPropertySetKind, _))
            .WillOnce(DoAll(SetArgPointee<1>(2), Return(S_OK)));
        EXPECT_CALL(sets, GetMembers(GUID_GWPropertySetKind, 0, 2, _))
            .WillOnce([&](REFGUID, ULONG, ULONG, IGWProperties** items) {
                items[0] = &first, items[1] = &second;
                first.AddRef(), second.AddRef();
                return S_OK;
            });
        EXPECT_CALL(first, CountMembers(kSomeId, _)).WillOnce(DoAll(SetArgPointee<1>(0), Return(S_OK)));
        EXPECT_CALL(second, CountMembers(kSomeId, _)).WillOnce(DoAll(SetArgPointee<1>(1), Return(S_OK)));
        EXPECT_CALL(second, GetMembers(kSomeId, 0, 1, _)).WillOnce(GiveOut<3>(&property));
        EXPECT_CALL(list, NewElement(IID_I3DElemRef, _)).WillOnce(GiveOut<1>(&element));
        EXPECT_CALL(element, SetTarget(static_cast<IUnknown*>(&property), nullptr)).WillOnce(Return(S_OK));
        EXPECT_CALL(list, Append(&element)).WillOnce(Return(S_OK));
    }
    EXPECT_EQ(F3DGetPropsList(&object, kSomeId, &out), S_OK);
    EXPECT_EQ(out, &list);
    list.Release();
    // Any failure on the way is E_FAIL with nothing handed out; no sets at all is S_FALSE.
    EXPECT_CALL(lists, CreateInstance(nullptr, IID_I3DList, _)).WillRepeatedly(GiveOut<2>(&list));
    EXPECT_CALL(owner, GetPropertySets(_)).WillOnce(GiveOut<0>(&sets)).WillOnce(Return(S_OK));
    EXPECT_CALL(sets, CountMembers(GUID_GWPropertySetKind, _)).WillOnce(Return(kRefused));
    EXPECT_EQ(F3DGetPropsList(&object, kSomeId, &out), E_FAIL);
    EXPECT_EQ(F3DGetPropsList(&object, kSomeId, &out), S_FALSE);
    EXPECT_EQ(out, nullptr);
    ExpectLeft(0, sets, first, second, property);
}

TEST_F(SceneContract, AnObjectThatDeclaresItselfNotTransientIsNotInTheContainer) {
    StrictMock<ut::test::MockComponentHierarchy> marked;
    ut::test::MockGroup marker;
    marked.Also(IID_GWNotTransient, &marker);
    EXPECT_CALL(content, FindObject(GUID_3DTransientObjectContainerKey, IID_I3DTransientObjectContainer, _))
        .WillOnce(GiveOut<2>(&transient));
    EXPECT_CALL(transient, Contains(&marked)).WillOnce(Return(S_OK));
    EXPECT_EQ(F3DIsObjectInTransientObjectContainer(&marked), S_FALSE);
    EXPECT_EQ(marker.Extra(), 0u);
}

TEST_F(SceneContract, TheComplexUndoBracketOpensOnlyOutsideAnotherAndClosesOncePerInstance) {
    auto outside = [&](BOOL inside) {
        EXPECT_CALL(undo, IsInComplexUndo(_)).WillOnce(DoAll(SetArgPointee<0>(inside), Return(S_OK)));
    };
    {
        InSequence order;
        outside(FALSE);
        EXPECT_CALL(undo, OpenComplexUndo(StrEq(L"Move"), 0)).WillOnce(Return(S_OK));
        outside(TRUE); // the nested one stays inert
        EXPECT_CALL(undo, CloseComplexUndo())
            .Times(2)
            .WillRepeatedly(Return(kRefused)); // the copy closes again
    }
    {
        C3DComplexUndo bracket(L"Move");
        C3DComplexUndo nested(L"Nested");
        C3DComplexUndo copy(bracket);
        C3DComplexUndo inert(false, L"Never");
        inert = nested; // takes nothing to close
        EXPECT_EQ(undo.Extra(), 3u);
    }
    outside(FALSE);
    EXPECT_CALL(undo, OpenComplexUndo(StrEq(L"Refused"), 0)).WillOnce(Return(kRefused));
    { C3DComplexUndo refused(L"Refused"); }
    GWRevokeGenericObject(CLSID_GWUndoManager);
    { C3DComplexUndo withoutManager(L"Alone"); }
    GWRegisterGenericObject(CLSID_GWUndoManager, &undo);
}

TEST(MaterialCategory, OnlyTheMaterialCategoryIsTranslatedAndEveryOtherIdComesBackAsItIs) {
    EXPECT_TRUE(IsEqualGUID(F3DGetMaterialCatID(), CATID_3DMaterial));
    for (const GUID& id : {CATID_3DMaterial, GUID_NULL, kSomeId, IID_I3DList})
        EXPECT_TRUE(IsEqualGUID(F3DTranslateMaterialCATID(id), id));
}

} // namespace
