// Families by name and membership, the watch map, the linear-hashing map against std::map, and the
// shared-GUID cache over a reference scene with shared and referenced models.
#include <algorithm>
#include <cstring>
#include <map>
#include <random>
#include <string>
#include <tuple>

#include <gtest/gtest.h>

#include <ut/families.h>
#include <ut/scene.h>
#include <ut/sdk/testing.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"
#include "support/registrations.h"
#include "test_scene.h"

namespace {

using ut::test::Result;
using ut::test::TestGuid;

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
