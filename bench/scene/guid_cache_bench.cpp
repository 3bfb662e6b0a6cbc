// CSharedGuid against std::unordered_map, over reference scenes of 10 000 and 100 000 components
// with 1 000 watched GUIDs:
//   build/CSharedGuid, build/unordered_map   a whole BuildCache, or the same walk into the map
//   find/CSharedGuid, find/unordered_map     the 1 000 look-ups, each answering the hierarchy
// Rates are in cache builds or look-ups per second.
#include <cstdint>
#include <cstring>
#include <memory>
#include <unordered_map>
#include <unordered_set>
#include <utility>
#include <vector>

#include <benchmark/benchmark.h>

#include <ut/families.h>
#include <ut/host/reference_host.h>
#include <ut/scene.h>

namespace {

constexpr int kWatched = 1000;
constexpr int kParametersPerObject = 8;
constexpr int kObjectsPerModel = 10;
// An object is its root component, one property set and its parameters.
constexpr int kComponentsPerObject = kParametersPerObject + 2;

GUID ParameterId(int n) {
    return GUID{static_cast<ULONG>(static_cast<ULONG>(n) * 2654435761u),
                0x5EED,
                static_cast<USHORT>(n),
                {1, 2, 3, 4, 5, 6, 7, 8}};
}

struct GuidHash {
    std::size_t operator()(const GUID& guid) const {
        std::uint64_t halves[2];
        std::memcpy(halves, &guid, sizeof halves);
        return std::hash<std::uint64_t>()(halves[0] * 31 + halves[1]);
    }
};
struct GuidEqual {
    bool operator()(const GUID& a, const GUID& b) const { return IsEqualGUID(a, b); }
};

// Models of ten objects below the root; every object's parameters have ids of their own.
struct Scene {
    explicit Scene(int components) {
        ut::host::Settings settings;
        int objects = components / kComponentsPerObject, parameter = 0;
        for (int m = 0; m < objects / kObjectsPerModel; ++m) {
            ut::host::ObjectDescription model{.name = L"Model", .model = true};
            for (int o = 0; o < kObjectsPerModel; ++o) {
                ut::host::PropertySetDescription set{.clsid = ParameterId(-1)};
                for (int p = 0; p < kParametersPerObject; ++p)
                    set.parameters.push_back({ParameterId(parameter++), L"p", 1.0});
                model.children.push_back({.name = L"Object", .properties = {set}});
            }
            settings.scene.objects.push_back(std::move(model));
        }
        for (int w = 0; w < kWatched; ++w)
            watched.push_back(ParameterId(w * (parameter / kWatched)));
        host = std::make_unique<ut::host::ReferenceHost>(settings);
        (void)KXGetCurrentSceneModel(IID_IGWComponentHierarchy, root.PutVoid()); // checked by the runs
    }
    std::vector<GUID> watched;
    std::unique_ptr<ut::host::ReferenceHost> host;
    ut::ComPtr<IGWComponentHierarchy> root;
};

// One scene at a time, as there is one reference host at a time: the old one (and its host) goes
// before a scene of another size is made.
Scene& SceneOf(int components) {
    static std::unique_ptr<Scene> scene;
    static int made = 0;
    if (!scene || made != components) {
        scene.reset();
        scene = std::make_unique<Scene>(components);
        made = components;
    }
    return *scene;
}

// What a user would write with a standard map: the same walk, every watched GUID to its hierarchy.
struct Found {
    ut::ComPtr<IGWComponentHierarchy> hierarchy;
    tagGWComponent component;
};
using Map = std::unordered_map<GUID, Found, GuidHash, GuidEqual>;
using Watch = std::unordered_set<GUID, GuidHash, GuidEqual>;

void Walk(IGWComponentHierarchy* hierarchy, const tagGWComponent& component, const Watch& watch, Map& map) {
    GUID guid{};
    if (SUCCEEDED(hierarchy->GetComponentGuid(component, &guid)) && watch.count(guid))
        map.try_emplace(guid, Found{ut::ComPtr<IGWComponentHierarchy>(hierarchy), component});
    tagGWComponent child{}, next{};
    for (HRESULT hr = hierarchy->GetFirstChild(component, GWCOMPONENT_ANY_DEPTH, &child); hr == S_OK;
         hr = hierarchy->GetNextSibling(child, GWCOMPONENT_ANY_DEPTH, &next), child = next)
        Walk(hierarchy, child, watch, map);
}

void WalkObjects(IGWComponentHierarchy* hierarchy, const Watch& watch, Map& map) {
    ut::ComPtr<IGWActiveData> data;
    ut::ComPtr<IGWEnumObjects> nested;
    if (SUCCEEDED(hierarchy->QueryInterface(IID_IGWActiveData, data.PutVoid())) &&
        SUCCEEDED(
            data->QueryObjects(GWQUERY_NESTED, 16, 4, GUID_NULL, IID_IGWComponentHierarchy, nested.Put())))
        for (ut::ComPtr<IUnknown> object; nested->Next(object.Put()) == S_OK;)
            WalkObjects(static_cast<IGWComponentHierarchy*>(object.Get()), watch, map);
    tagGWComponent root{};
    if (SUCCEEDED(hierarchy->GetRootComponent(&root)))
        Walk(hierarchy, root, watch, map);
}

void BuildShared(benchmark::State& state) {
    Scene& scene = SceneOf(static_cast<int>(state.range(0)));
    CSharedGuid cache;
    (void)cache.Construct(); // without the dictionary only direct matches count
    for (GUID& guid : scene.watched)
        (void)cache.AddGuid(&guid);
    for (auto _ : state)
        if (cache.BuildCache(scene.root.Get()) != S_OK)
            state.SkipWithError("BuildCache failed");
    state.SetItemsProcessed(state.iterations());
}

void BuildStd(benchmark::State& state) {
    Scene& scene = SceneOf(static_cast<int>(state.range(0)));
    Watch watch(scene.watched.begin(), scene.watched.end());
    for (auto _ : state) {
        Map map;
        WalkObjects(scene.root.Get(), watch, map);
        if (map.size() != watch.size())
            state.SkipWithError("the walk missed GUIDs");
    }
    state.SetItemsProcessed(state.iterations());
}

void FindShared(benchmark::State& state) {
    Scene& scene = SceneOf(static_cast<int>(state.range(0)));
    CSharedGuid cache;
    (void)cache.Construct();
    for (GUID& guid : scene.watched)
        (void)cache.AddGuid(&guid);
    (void)cache.BuildCache(scene.root.Get());
    for (auto _ : state) {
        for (const GUID& guid : scene.watched) {
            unsigned long id = 0;
            IGWComponentHierarchy* found = nullptr;
            if (cache.FindCOMPIDFromGUID(guid, &id, IID_IGWComponentHierarchy,
                                         reinterpret_cast<void**>(&found)) != S_OK)
                state.SkipWithError("a GUID was not found");
            else
                found->Release();
        }
    }
    state.SetItemsProcessed(state.iterations() * kWatched);
}

void FindStd(benchmark::State& state) {
    Scene& scene = SceneOf(static_cast<int>(state.range(0)));
    Watch watch(scene.watched.begin(), scene.watched.end());
    Map map;
    WalkObjects(scene.root.Get(), watch, map);
    for (auto _ : state) {
        for (const GUID& guid : scene.watched) {
            auto at = map.find(guid);
            IGWComponentHierarchy* found = nullptr;
            if (at == map.end() || FAILED(at->second.hierarchy->QueryInterface(
                                       IID_IGWComponentHierarchy, reinterpret_cast<void**>(&found))))
                state.SkipWithError("a GUID was not found");
            else
                found->Release();
            benchmark::DoNotOptimize(at->second.component.id);
        }
    }
    state.SetItemsProcessed(state.iterations() * kWatched);
}

struct Run {
    const char* name;
    void (*run)(benchmark::State&);
};

const bool registered = [] {
    const Run runs[] = {{"build/CSharedGuid", BuildShared},
                        {"build/unordered_map", BuildStd},
                        {"find/CSharedGuid", FindShared},
                        {"find/unordered_map", FindStd}};
    for (const Run& run : runs)
        benchmark::RegisterBenchmark(run.name, run.run)
            ->Arg(10'000)
            ->Arg(100'000)
            ->Unit(benchmark::kMicrosecond);
    return true;
}();

} // namespace
