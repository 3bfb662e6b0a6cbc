// Hierarchy moves (under models, items and containers known by their class), roots in and outside
// a model and the scene box on the reference scene; shader traversal; families by name and
// membership, the watch map, the linear-hashing map against std::map, and the shared-GUID cache
// over a reference scene with shared and referenced models.
#include <algorithm>
#include <cstring>
#include <map>
#include <random>
#include <string>
#include <tuple>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/families.h>
#include <ut/hierarchy.h>
#include <ut/host/reference_shaders.h>
#include <ut/scene.h>
#include <ut/sdk/testing.h>
#include <ut/shaders.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"
#include "support/registrations.h"
#include "support/scene_mocks.h"
#include "test_scene.h"

namespace {

using ::testing::_;
using ::testing::Return;
using ut::host::ShaderDescription;
using ut::test::Find;
using ut::test::NameOf;
using ut::test::Result;
using ut::test::TestGuid;

class Hierarchy : public ::testing::Test {
protected:
    static ut::host::Settings Scene() {
        ut::host::Settings settings = ut::test::TestScene();
        settings.scene.objects[0].position = {10, 0, 0};
        settings.scene.objects[0].children[0].extent = {-1, -1, -1, 1, 1, 1};
        settings.scene.objects[0].children[0].position = {0, 2, 0};
        settings.scene.objects[2].extent = {0, 0, 0, 1, 1, 1};
        return settings;
    }
    std::string Names(const std::vector<ut::host::ObjectDescription>& objects) {
        std::string names;
        for (const auto& object : objects)
            names += ut::test::Narrow(object.name.c_str()) + " ";
        return names;
    }
    ut::test::LiveObjectCheck live;
    ut::host::ReferenceHost host{Scene()};
    ut::ComPtr<I3DObject> robot = Find(L"Robot"), arm = Find(L"Arm"), light = Find(L"Light"),
                          camera = Find(L"Camera1");
};

TEST_F(Hierarchy, MovesChecksTheirArgumentsInOrderAndMoveUnderModelsAndItems) {
    ut::ComPtr<I3DObject> rig, root;
    ASSERT_EQ(KXCreate3DModelObject(L"Rig", IID_I3DObject, rig.PutVoid()), S_OK);
    ASSERT_EQ(KXGetCurrentSceneModel(IID_I3DObject, root.PutVoid()), S_OK);
    ut::test::ComMock<IUnknown> marked(IID_IGWNotUnderModel);
    IUnknown* out = nullptr;
    // Parent, object, destination, reference; the result and the name of what `out` received.
    const std::tuple<IUnknown*, IUnknown*, LONG, IUnknown*, std::string> cases[] = {
        {robot.Get(), nullptr, GWDEST_LAST, nullptr, "E_POINTER null"},
        {robot.Get(), rig.Get(), GWDEST_AFTER, nullptr, "E_POINTER null"},
        {nullptr, rig.Get(), GWDEST_LAST, nullptr, "E_POINTER null"},
        // Under a model only models go; a marked object is an invalid argument, the reference too.
        {robot.Get(), light.Get(), GWDEST_LAST, nullptr, "E_POINTER null"},
        {robot.Get(), &marked, GWDEST_LAST, nullptr, "E_INVALIDARG null"},
        {root.Get(), rig.Get(), GWDEST_BEFORE, &marked, "E_INVALIDARG null"},
        // A reference is ignored, unchecked, first and last; an unknown destination moves nothing.
        {robot.Get(), rig.Get(), GWDEST_LAST, &marked, "S_OK null"},
        {root.Get(), rig.Get(), 4, nullptr, "S_FALSE Robot"},
        {root.Get(), rig.Get(), GWDEST_BEFORE, robot.Get(), "S_OK Robot"},
        // Anything goes under an object that holds items; never into what is below it.
        {arm.Get(), light.Get(), GWDEST_LAST, camera.Get(), "S_OK Shot"},
        {arm.Get(), camera.Get(), GWDEST_BEFORE, light.Get(), "S_OK Shot"},
        {arm.Get(), robot.Get(), GWDEST_FIRST, nullptr, "E_INVALIDARG Shot"},
    };
    int row = 0;
    for (const auto& [parent, object, destination, reference, expected] : cases) {
        HRESULT hr =
            KXMoveObjectInHier(parent, object, static_cast<tagEGWDestination>(destination), reference, &out);
        EXPECT_EQ(Result(hr) + " " + NameOf(out), expected) << "row " << row++;
    }
    ut::host::SceneDescription scene = host.DescribeScene();
    EXPECT_EQ(Names(scene.objects), "Rig Robot ");
    EXPECT_EQ(Names(scene.objects[1].children[0].children), "Camera1 Light ");
    EXPECT_EQ(marked.Extra(), 0u);
}

TEST(HierarchyContainers, LayersPassesAndPlainContainersTakeObjectsAsTheyAre) {
    struct Parent {
        ut::test::MockPersist persist;
        ::testing::NiceMock<ut::test::MockActiveData> data;
        ::testing::NiceMock<ut::test::MockComponentHierarchy> hierarchy;
    };
    ut::test::ComMock<IUnknown> object(IID_IUnknown);
    const GUID other = ut::test::kX;
    // The parent's class, what resolving the object answers, whether the parent has active data and
    // a hierarchy; the result and whether the hierarchy moved the object.
    const std::tuple<const GUID*, HRESULT, bool, bool, std::string> cases[] = {
        {&GUID_3DLayerContainer, S_OK, true, true, "S_OK 3"},
        {&GUID_3DPassContainer, S_OK, true, true, "S_OK 3"},
        {&CLSID_3DPlainContainer, S_OK, true, true, "S_OK 3"},
        {&other, S_OK, true, true, "E_INVALIDARG 0"},
        {&CLSID_3DPlainContainer, S_OK, false, true, "E_POINTER 0"},
        {&CLSID_3DPlainContainer, S_FALSE, true, true, "E_INVALIDARG 0"},
        {&CLSID_3DPlainContainer, S_OK, true, false, "E_NOINTERFACE 0"}};
    int row = 0;
    for (const auto& [kind, resolved, withData, withHierarchy, expected] : cases) {
        Parent parent;
        EXPECT_CALL(parent.persist, GetClassID(_)).WillRepeatedly([&](CLSID* clsid) {
            *clsid = *kind;
            return S_OK;
        });
        if (withData)
            parent.persist.Also(IID_IGWActiveData, &parent.data);
        if (withHierarchy)
            parent.data.Also(IID_IGWComponentHierarchy, &parent.hierarchy);
        ON_CALL(parent.data, ResolveObject(&object, _)).WillByDefault(Return(resolved));
        int moved = 0;
        ON_CALL(parent.hierarchy, MoveComponent(_, GWDEST_LAST, nullptr)).WillByDefault([&](auto&&...) {
            moved = 3;
            return S_OK;
        });
        HRESULT hr = KXMoveObjectInHier(&parent.persist, &object, GWDEST_LAST, nullptr, nullptr);
        EXPECT_EQ(Result(hr) + " " + std::to_string(moved), expected) << "row " << row++;
    }
}

TEST_F(Hierarchy, RootsAreFoundInTheSceneAndBelowAModel) {
    ut::ComPtr<I3DModel> model;
    ut::ComPtr<I3DObject> found, rig;
    ASSERT_EQ(robot.As(model), S_OK);
    ASSERT_EQ(KXCreate3DModelObject(L"Rig", IID_I3DObject, rig.PutVoid()), S_OK);
    ASSERT_EQ(KXMoveObjectInHier(arm.Get(), light.Get(), GWDEST_LAST, nullptr, nullptr), S_OK);
    EXPECT_EQ(KXGet3DObjectHierarchyRoot(light.Get(), found.Put()), S_OK);
    EXPECT_TRUE(found == robot);
    EXPECT_EQ(KXGet3DObjectHierarchyRoot(nullptr, found.Put()), E_POINTER);
    const std::pair<I3DObject*, std::string> cases[] = {{arm.Get(), "S_OK Arm"},
                                                        {light.Get(), "S_OK Arm"},
                                                        {camera.Get(), "E_UNEXPECTED null"},
                                                        {rig.Get(), "S_FALSE null"}};
    for (const auto& [object, expected] : cases) {
        I3DObject* root = nullptr;
        HRESULT hr = KXGet3DObjectHierarchyRootInModel(object, model.Get(), &root);
        EXPECT_EQ(Result(hr) + " " + NameOf(root), expected) << expected;
    }
    EXPECT_EQ(KXGet3DObjectHierarchyRootInModel(arm.Get(), nullptr, found.Put()), E_POINTER);
}

TEST_F(Hierarchy, TheSceneBoxCoversEveryExtentMovedByPositionsAndTheTransform) {
    C3DTransfo doubled;
    doubled.SetScale(2, 2, 2);
    C3DBBox box;
    EXPECT_EQ(KXGetSceneBBox(nullptr, nullptr, 0, E3DSPACE_GLOBAL, &doubled, 0, nullptr), E_POINTER);
    ASSERT_EQ(KXGetSceneBBox(nullptr, nullptr, 0, E3DSPACE_GLOBAL, &doubled, 0, &box), S_OK);
    EXPECT_FALSE(doubled.IsStale());
    // Arm: 9..11, 1..3, -1..1 at Robot's 10 plus its own 2; Light: the unit cube.
    EXPECT_EQ(std::vector<double>(box.min, box.min + 3), (std::vector<double>{0, 0, -2}));
    EXPECT_EQ(std::vector<double>(box.max, box.max + 3), (std::vector<double>{22, 6, 2}));
    // Through a view, which gets the scene's root and the second integer.
    ut::test::MockView view;
    EXPECT_CALL(view, GetObjectBoundingBox(nullptr, _, 1, E3DSPACE_LOCAL, doubled.Matrix(), 7, &box))
        .WillOnce(Return(S_FALSE));
    EXPECT_EQ(KXGetSceneBBox(nullptr, &view, 5, E3DSPACE_LOCAL, &doubled, 7, &box), S_FALSE);
}

// A shader network with a shared sub-network, an opaque node, a plain hierarchy and a cycle.
// Surface's output port 0 leads to Noise but is not followed; port 2 nests ports 3 and 4.
ut::host::ShaderNetwork TestNetwork() {
    const std::vector<ShaderDescription> shaders = {
        {.name = L"Surface",
         .skippedPort = 0,
         .ports = {{0, L"Noise"}, {1, L"Mix"}, {2, L"", {{3, L"Texture"}, {4, L"Opaque"}}}},
         .nameSpace = L"Scene"},
        {.name = L"Mix", .ports = {{1, L"Texture"}, {2, L"Noise"}}, .preferredNameSpace = L"Library"},
        {.name = L"Texture", .ports = {{1, L"Noise"}}},
        {.name = L"Noise"},
        {.name = L"Opaque", .opaque = true, .ports = {{1, L"Noise"}}},
        {.name = L"Plain", .node = false, .ports = {{1, L"Noise"}}},
        {.name = L"Loop1", .ports = {{1, L"Loop2"}}},
        {.name = L"Loop2", .ports = {{1, L"Loop1"}}}};
    return ut::host::ShaderNetwork(shaders, {L"Scene", L"Library"});
}

// Records the nodes visited by name; answers `stop` at the `stopAt`-th visit, or at the first
// node visited twice when `stopAt` is 0 and `stop` is not.
struct Recorder : C3DShaderTraverserCallback {
    const ut::host::ShaderNetwork& network;
    int stopAt = -1;
    long stop = 0;
    std::string seen;
    long OnShader(IUnknown* shader) override {
        std::string name;
        for (const wchar_t* candidate :
             {L"Surface", L"Mix", L"Texture", L"Noise", L"Opaque", L"Plain", L"Loop1", L"Loop2"})
            if (static_cast<IUnknown*>(network.Node(candidate).Get()) == shader)
                name = ut::test::Narrow(candidate);
        bool repeat = seen.find(name) != std::string::npos;
        seen += (seen.empty() ? "" : " ") + name;
        int visits = static_cast<int>(std::count(seen.begin(), seen.end(), ' ')) + 1;
        return (stopAt == visits || (stopAt == 0 && repeat)) ? stop : 0;
    }
    explicit Recorder(const ut::host::ShaderNetwork& n) : network(n) {}
};

TEST(ShaderTraverser, WalksConnectedPortsDepthFirstAndStopsWhenTold) {
    ut::test::LiveObjectCheck live;
    ut::host::ShaderNetwork network = TestNetwork();
    // The root, the visit to stop at and what to answer there; the result and the visits.
    const std::tuple<const wchar_t*, int, long, std::string> cases[] = {
        // The output port is skipped, a nested port is followed, Noise is reached three times and
        // the opaque node not at all.
        {L"Surface", -1, 0, "S_OK: Surface Mix Texture Noise Noise Texture Noise"},
        {L"Plain", -1, 0, "S_OK: "},
        {L"Surface", 1, 5, "5: Surface"},
        {L"Surface", 3, -7, "-7: Surface Mix Texture"},
        // A cycle goes round until the callback stops it.
        {L"Loop1", 0, 9, "9: Loop1 Loop2 Loop1"}};
    for (const auto& [root, stopAt, stop, expected] : cases) {
        Recorder recorder(network);
        recorder.stopAt = stopAt;
        recorder.stop = stop;
        C3DShaderTraverser traverser;
        HRESULT hr = traverser.Traverse(network.Node(root).Get(), &recorder, false);
        EXPECT_EQ(ut::test::Result(hr) + ": " + recorder.seen, expected)
            << ut::test::Narrow(root) << " " << stopAt;
    }
}

TEST(ShaderTraverser, WalksARootOnceWithTheOnceOption) {
    ut::host::ShaderNetwork network = TestNetwork();
    Recorder recorder(network);
    C3DShaderTraverser traverser;
    auto noise = network.Node(L"Noise");
    EXPECT_EQ(traverser.Traverse(nullptr, &recorder, true), E_POINTER);
    EXPECT_EQ(traverser.Traverse(noise.Get(), nullptr, true), E_POINTER);
    EXPECT_EQ(traverser.Traverse(noise.Get(), &recorder, true), S_OK);
    EXPECT_EQ(traverser.Traverse(noise.Get(), &recorder, true), S_FALSE);
    EXPECT_EQ(traverser.Traverse(noise.Get(), &recorder, false), S_OK);
    C3DShaderTraverser copy(traverser);
    EXPECT_EQ(copy.Traverse(noise.Get(), &recorder, true), S_FALSE); // the set is copied
    EXPECT_EQ(recorder.seen, "Noise Noise");
}

TEST(ShaderNameSpaceTraverser, NamesEveryShaderInItsPreferredOrTheGivenNameSpace) {
    ut::test::LiveObjectCheck live;
    ut::host::ShaderNetwork network = TestNetwork();
    C3DShaderNameSpaceTraverser naming;
    auto surface = network.Node(L"Surface");
    EXPECT_EQ(naming.Traverse(nullptr, network.NameSpace(L"Scene").Get()), E_POINTER);
    EXPECT_EQ(naming.Traverse(surface.Get(), network.NameSpace(L"Scene").Get()), S_OK);
    EXPECT_EQ(network.Members(L"Scene"), (std::vector<std::wstring>{L"Surface", L"Texture", L"Noise"}));
    EXPECT_EQ(network.Members(L"Library"), std::vector<std::wstring>{L"Mix"});
    C3DShaderNameSpaceTraverser copy(naming);
    EXPECT_EQ(copy.Traverse(surface.Get(), network.NameSpace(L"Library").Get()), S_FALSE);
}

const GUID kLights = TestGuid(1), kCameras = TestGuid(2), kFog = TestGuid(3);
const GUID kSpot = TestGuid(11), kLens = TestGuid(12), kLoner = TestGuid(13);

class Families : public ::testing::Test {
protected:
    void SetUp() override {
        for (auto [family, name] : {std::pair(kLights, L"Lights"), std::pair(kCameras, L"Cameras")})
            ASSERT_EQ(GWRegisterFamily(family, family, GUID_NULL, name, L"", nullptr, GUID_NULL, GUID_NULL),
                      S_OK);
        ASSERT_EQ(GWRegisterObjectFamilies(kSpot, 1, &kLights, true, L"Spot", nullptr), S_OK);
        const GUID both[] = {kCameras, kLights};
        ASSERT_EQ(GWRegisterObjectFamilies(kLens, 2, both, true, L"Lens", nullptr), S_OK);
    }
    ut::test::RegistrationScope scope;
    ut::host::ReferenceHost host;
};

TEST_F(Families, FoundByNameWhateverTheCaseAndTestedByMembership) {
    const std::pair<const wchar_t*, std::string> names[] = {
        {L"Lights", "S_OK 1"}, {L"lights", "S_OK 1"}, {L"CAMERAS", "S_OK 2"}, {L"Fog", "E_FAIL 0"}};
    for (const auto& [name, expected] : names) {
        GUID found = GUID_NULL;
        HRESULT hr = KXFindFamily(name, &found);
        EXPECT_EQ(Result(hr) + " " + std::to_string(found.Data1), expected) << ut::test::Narrow(name);
    }
    GUID out{};
    EXPECT_EQ(KXFindFamily(nullptr, &out), E_POINTER);
    EXPECT_EQ(KXFindFamily(L"Lights", nullptr), E_POINTER);

    EXPECT_EQ(F3DIsCLSIDInFamily(kLens, kCameras), 1);
    EXPECT_EQ(F3DIsCLSIDInFamily(kSpot, kCameras), 0);
    GUID lightsOrFog[] = {kFog, kLights}, fog[] = {kFog};
    const std::tuple<GUID*, unsigned long, GUID, HRESULT> validations[] = {
        {lightsOrFog, 2, kSpot, S_OK},
        {fog, 1, kSpot, S_FALSE},
        {lightsOrFog, 2, kLoner, S_FALSE},
        {nullptr, 1, kSpot, E_POINTER},
        {lightsOrFog, 0, kSpot, E_INVALIDARG}};
    for (const auto& [families, count, clsid, expected] : validations)
        EXPECT_EQ(Result(KXValidateObjectFamily(families, count, clsid)), Result(expected)) << clsid.Data1;
}

TEST(WatchMap, KeepsOneEntryPerValueAndCopies) {
    GUID a = kSpot, sameAsA = kSpot, b = kLens;
    C3DWatchMap map;
    EXPECT_EQ(map.Add(&a), S_OK);
    EXPECT_EQ(map.Add(&sameAsA), S_OK);
    EXPECT_EQ(map.Add(nullptr), E_POINTER);
    EXPECT_EQ(map.Count(), 1u);
    EXPECT_EQ(map.Find(b), 0);
    EXPECT_EQ(map.Add(&b), S_OK);
    C3DWatchMap copy(map), assigned;
    assigned = copy;
    EXPECT_EQ(assigned.Find(kLens) + assigned.Find(kSpot) + int(assigned.Count()), 4);
}

// The table's shape: mask + 1 a power of two that the buckets in use fill past half (or the one
// bucket of the start); every key in the bucket it hashes to, keys in order, nothing past the limit.
void ExpectInvariants(const C3DCompHierMap& map, const std::map<GUID, int, ut::GuidLess>& model) {
    unsigned int span = map.Mask() + 1, entries = 0;
    ASSERT_EQ(span & map.Mask(), 0u);
    ASSERT_TRUE(map.Limit() <= span && (map.Limit() > span / 2 || map.Limit() == 1)) << map.Limit();
    ASSERT_LE(map.Limit(), map.Buckets());
    for (unsigned int i = 0; i < map.Buckets(); ++i) {
        auto bucket = map.Bucket(i);
        entries += static_cast<unsigned int>(bucket.size());
        ASSERT_TRUE(i < map.Limit() || bucket.empty()) << i;
        for (std::size_t k = 0; k < bucket.size(); ++k) {
            ASSERT_EQ(map.BucketOf(bucket[k].key), i);
            ASSERT_EQ(bucket[k].info->component.id, static_cast<ULONG>(model.at(bucket[k].key)));
            if (k > 0) {
                std::int32_t left[4], right[4];
                std::memcpy(left, &bucket[k - 1].key, 16);
                std::memcpy(right, &bucket[k].key, 16);
                ASSERT_TRUE(std::lexicographical_compare(left, left + 4, right, right + 4));
            }
        }
    }
    ASSERT_EQ(entries, model.size());
    ASSERT_EQ(map.Count(), model.size());
}

TEST(CompHierMap, AgreesWithStdMapOverRandomInsertsFindsAndClears) {
    std::mt19937 random(7);
    C3DCompHierMap map;
    std::map<GUID, int, ut::GuidLess> model;
    auto randomGuid = [&] {
        // Few distinct first words and signs in every word, so that buckets collide and order matters.
        GUID guid{static_cast<ULONG>(random() % 64 * 0x9E3779B1u),
                  static_cast<USHORT>(random() % 4),
                  static_cast<USHORT>(random()),
                  {}};
        for (BYTE& byte : guid.Data4)
            byte = static_cast<BYTE>(random() % 3 == 0 ? 0x80 : random());
        return guid;
    };
    for (int step = 0; step < 6000; ++step) {
        GUID key = randomGuid();
        if (step % 2000 == 1999) {
            map.RemoveAll();
            model.clear();
            EXPECT_EQ(map.Mask() * 100 + map.Limit() * 10 + map.Buckets(), 118u);
        } else if (random() % 3 == 0) {
            EXPECT_EQ(map.FindInfo(key) != nullptr, model.count(key) == 1);
        } else {
            auto* info = new tagComponentHierarchy{nullptr, {}};
            info->component.id = step;
            HRESULT hr = map.Insert(key, info);
            EXPECT_EQ(hr, model.emplace(key, step).second ? S_OK : S_FALSE);
            if (hr == S_FALSE)
                delete info;
        }
        if (step % 97 == 0)
            ExpectInvariants(map, model);
    }
    ExpectInvariants(map, model);
    C3DCompHierMap copy(map);
    ExpectInvariants(copy, model);
    for (const auto& [key, id] : model)
        ASSERT_NE(copy.FindInfo(key), map.FindInfo(key)); // entries of their own
}

// A scene whose model "Prop" is referenced from two objects, with a parameter known by an alias.
const GUID kAlias = TestGuid(21), kAliased = TestGuid(22), kDeep = TestGuid(23);

ut::host::Settings SharedScene(int references) {
    using namespace ut::host;
    Settings settings = ut::test::TestScene();
    settings.parameterAliases = {{kAliased, kAlias}};
    ObjectDescription prop{.name = L"Prop",
                           .model = true,
                           .properties = {{.clsid = ut::test::kMaterial,
                                           .parameters = {{kDeep, L"deep", 2.0}, {kAliased, L"a", 1.0}}}}};
    settings.scene.objects.push_back(prop);
    for (int i = 0; i < references; ++i)
        settings.scene.objects.push_back({.name = L"Ref" + std::to_wstring(i), .references = L"Prop"});
    return settings;
}

// The number of component GUIDs a BuildCache reads, and what it finds for each watched GUID.
std::string BuildAndFind(int references, std::vector<GUID> watched, unsigned int* size = nullptr) {
    ut::host::ReferenceHost host(SharedScene(references));
    ut::ComPtr<IGWComponentHierarchy> root;
    EXPECT_EQ(KXGetCurrentSceneModel(IID_IGWComponentHierarchy, root.PutVoid()), S_OK);
    CSharedGuid cache;
    EXPECT_EQ(cache.Construct(), S_OK);
    for (GUID& guid : watched)
        EXPECT_EQ(cache.AddGuid(&guid), S_OK);
    int reads = 0;
    ut::sdk::SetHostFaultHook([&](std::string_view operation) {
        reads += operation == "IGWComponentHierarchy::GetComponentGuid";
        return S_OK;
    });
    EXPECT_EQ(cache.BuildCache(root.Get()), S_OK);
    ut::sdk::SetHostFaultHook(nullptr);
    std::string found = std::to_string(reads);
    for (const GUID& guid : watched) {
        unsigned long id = 0;
        ut::ComPtr<I3DObject> object;
        HRESULT hr = cache.FindCOMPIDFromGUID(guid, &id, IID_I3DObject, object.PutVoid());
        LPOLESTR name = nullptr;
        if (object)
            (void)object->GetName(&name);
        found += " " + Result(hr) + (name ? ":" + ut::test::Narrow(name) + "#" + std::to_string(id) : "");
        CoTaskMemFree(name);
    }
    if (size)
        *size = cache.GetMemSize();
    return found;
}

TEST(SharedGuid, FindsWatchedGuidsAndAliasesAndScansAReferencedModelOnce) {
    ut::test::LiveObjectCheck live;
    std::string once = BuildAndFind(1, {kDeep, kAlias, ut::test::kX, kFog});
    EXPECT_EQ(once.substr(once.find(' ')), " S_OK:Prop#1 S_OK:Prop#1 S_OK:Arm#1 E_FAIL");
    // Two more references to Prop read no more GUIDs than one.
    std::string thrice = BuildAndFind(3, {kDeep, kAlias, ut::test::kX, kFog});
    EXPECT_EQ(thrice, once);
    unsigned int size = 0;
    (void)BuildAndFind(1, {kDeep, kFog}, &size);
    EXPECT_EQ(size, 32 + 24 * 1 + 8 * sizeof(GUID*));
    CSharedGuid empty;
    unsigned long id = 0;
    void* object = nullptr;
    EXPECT_EQ(empty.FindCOMPIDFromGUID(kDeep, nullptr, IID_IUnknown, &object), E_INVALIDARG);
    EXPECT_EQ(empty.FindCOMPIDFromGUID(kDeep, &id, IID_IUnknown, nullptr), E_INVALIDARG);
    EXPECT_EQ(empty.BuildCache(nullptr), S_OK);
}

} // namespace
