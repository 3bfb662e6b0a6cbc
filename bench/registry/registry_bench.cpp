// The registry workloads under Google Benchmark, against the POSIX store:
//   enumerate/<N>            walk N sub-keys one index at a time, opening each and reading a value
//   create_delete/<batched>  create 10,000 keys and delete them, call by call or in one transaction
// The same workloads run against the system's registry under wine with ut_bench_registry_table
// (./run bench-windows puts both side by side).
#include <map>
#include <memory>

#include <benchmark/benchmark.h>

#include "registry_workloads.h"

namespace {

// One populated key per size, made on first use and kept for the whole run.
HKEY Populated(int count) {
    static std::map<int, std::unique_ptr<ut::bench::BenchKey>> keys;
    std::unique_ptr<ut::bench::BenchKey>& key = keys[count];
    if (!key) {
        key = std::make_unique<ut::bench::BenchKey>();
        ut::bench::Populate(key->Get(), count);
    }
    return key->Get();
}

void Enumerate(benchmark::State& state) {
    int count = static_cast<int>(state.range(0));
    HKEY key = Populated(count);
    for (auto _ : state)
        benchmark::DoNotOptimize(ut::bench::EnumerateAndRead(key));
    state.SetItemsProcessed(state.iterations() * count);
}
BENCHMARK(Enumerate)
    ->Name("enumerate")
    ->RangeMultiplier(10)
    ->Range(100, 100000)
    ->Unit(benchmark::kMillisecond);

void CreateDelete(benchmark::State& state) {
    ut::bench::BenchKey key;
    for (auto _ : state)
        ut::bench::CreateAndDelete(key.Get(), 10000, state.range(0) != 0);
    state.SetItemsProcessed(state.iterations() * 10000);
}
BENCHMARK(CreateDelete)->Name("create_delete")->Arg(0)->Arg(1)->Iterations(1)->Unit(benchmark::kMillisecond);

} // namespace

int main(int argc, char** argv) {
    ut::bench::UsePrivateStore();
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
