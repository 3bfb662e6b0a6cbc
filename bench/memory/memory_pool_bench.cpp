// CMemoryPool side by side with glibc malloc/free and mimalloc, and the floor below, in one run:
//   pair/<allocator>/<size>  allocate and free one block of a fixed size
//   churn/<allocator>        free a random one of 4096 live blocks and allocate a new one of a
//                            random size 1..4096 in its place
// Operations are single calls (an allocation or a free). After the runs a table gives the pool's
// rate against each of its peers.
//
// Linked in, mimalloc's library replaces malloc and free for the whole program, as it does in an
// application that links it: the pool's own blocks come from mimalloc then. It takes over glibc's
// internal names as well (__libc_malloc, __libc_free), so the "glibc" runs look glibc's allocator
// up in the C library itself.
#include <cstdio>
#include <cstdlib>
#include <iomanip>
#include <map>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>
#include <dlfcn.h>
#include <gnu/lib-names.h>
#include <mimalloc.h>

#include <ut/host/reference_host.h>
#include <ut/memory.h>

#include "support/rate_reporter.h"

namespace {

struct PoolAllocator {
    static constexpr const char* kName = "pool";
    void* Allocate(std::size_t size) { return pool.Allocate(static_cast<LONG>(size)); }
    void Free(void* block) { pool.Deallocate(block); }
    CMemoryPool pool;
};

// glibc's malloc and free as the C library defines them, whatever replaces them in the program.
class GlibcAllocator {
public:
    static constexpr const char* kName = "glibc";
    GlibcAllocator() : library_(dlopen(LIBC_SO, RTLD_NOW | RTLD_NOLOAD)) {
        if (library_) {
            malloc_ = reinterpret_cast<MallocFunction>(dlsym(library_.get(), "malloc"));
            free_ = reinterpret_cast<FreeFunction>(dlsym(library_.get(), "free"));
        }
        if (!malloc_ || !free_) {
            std::fprintf(stderr, "glibc's malloc and free are not found in %s\n", LIBC_SO);
            std::exit(1);
        }
    }
    void* Allocate(std::size_t size) { return malloc_(size); }
    void Free(void* block) { free_(block); }

private:
    using MallocFunction = void* (*)(std::size_t);
    using FreeFunction = void (*)(void*);
    struct Closer {
        void operator()(void* library) const { dlclose(library); }
    };
    std::unique_ptr<void, Closer> library_;
    MallocFunction malloc_ = nullptr;
    FreeFunction free_ = nullptr;
};

struct MimallocAllocator {
    static constexpr const char* kName = "mimalloc";
    void* Allocate(std::size_t size) { return mi_malloc(size); }
    void Free(void* block) { mi_free(block); }
};

// Not a peer but a floor: freed blocks wait on a stack per 16-byte class, the class in a word in
// front of the block. An allocator that reads a header to free a block, and hands out blocks
// freed long before, cannot do a step for less than this.
class FloorAllocator {
public:
    static constexpr const char* kName = "floor";
    ~FloorAllocator() {
        for (std::vector<void*>& kept : kept_)
            for (void* block : kept)
                std::free(Header(block));
    }
    void* Allocate(std::size_t size) {
        std::size_t sizeClass = (size - 1) / kGranule;
        std::vector<void*>& kept = kept_[sizeClass];
        if (kept.empty()) {
            auto* header = static_cast<std::size_t*>(std::malloc(kGranule * (sizeClass + 2)));
            header[0] = sizeClass;
            return header + kGranule / sizeof(std::size_t);
        }
        void* block = kept.back();
        kept.pop_back();
        return block;
    }
    void Free(void* block) { kept_[*Header(block)].push_back(block); }

private:
    static constexpr std::size_t kGranule = 16;
    static std::size_t* Header(void* block) {
        return reinterpret_cast<std::size_t*>(static_cast<char*>(block) - kGranule);
    }
    std::vector<void*> kept_[CMemoryPool::kSizeClasses];
};

// Touches the block as a caller would, so that no allocator gets away with handing out memory
// it never brings into the cache.
void* Use(void* block) {
    *static_cast<volatile char*>(block) = 1;
    return block;
}

// Blocks of the pairs' size that stay allocated while the pairs run, as a program's live objects
// do. Without them an allocator that works by pages (mimalloc) may find the page of the freed block
// empty on every free and give it back, work that no program holding such objects makes it do.
constexpr std::size_t kResidentBlocks = 16;

template <class Allocator>
void AllocateFreePair(benchmark::State& state) {
    Allocator allocator;
    auto size = static_cast<std::size_t>(state.range(0));
    std::vector<void*> resident(kResidentBlocks);
    for (void*& block : resident)
        block = Use(allocator.Allocate(size));
    for (auto _ : state) {
        void* block = Use(allocator.Allocate(size));
        benchmark::DoNotOptimize(block);
        allocator.Free(block);
    }
    for (void* block : resident)
        allocator.Free(block);
    state.SetItemsProcessed(state.iterations() * 2);
}

constexpr std::size_t kLiveBlocks = 4096;
constexpr std::size_t kPlannedSteps = 1 << 16;

// The same random steps for every allocator: which live block goes, and the size of its successor.
struct ChurnPlan {
    std::vector<std::size_t> slots;
    std::vector<std::size_t> sizes;
};

const ChurnPlan& Plan() {
    static const ChurnPlan plan = [] {
        std::mt19937 random(42);
        std::uniform_int_distribution<std::size_t> slot(0, kLiveBlocks - 1), size(1, 4096);
        ChurnPlan made;
        for (std::size_t i = 0; i < kPlannedSteps; ++i) {
            made.slots.push_back(slot(random));
            made.sizes.push_back(size(random));
        }
        return made;
    }();
    return plan;
}

template <class Allocator>
void Churn(benchmark::State& state) {
    Allocator allocator;
    const ChurnPlan& plan = Plan();
    std::vector<void*> live(kLiveBlocks);
    for (std::size_t i = 0; i < kLiveBlocks; ++i)
        live[i] = Use(allocator.Allocate(plan.sizes[kPlannedSteps - 1 - i]));
    std::size_t step = 0;
    for (auto _ : state) {
        void*& slot = live[plan.slots[step]];
        allocator.Free(slot);
        slot = Use(allocator.Allocate(plan.sizes[step]));
        step = (step + 1) % kPlannedSteps;
    }
    for (void* block : live)
        allocator.Free(block);
    state.SetItemsProcessed(state.iterations() * 2);
}

// Scenario by scenario, the allocators one after the other, so that a busy machine slows
// the runs that are compared with each other alike. Each warms up first: otherwise the first run
// of the program (the pool's 16-byte pairs) alone pays for the processor's clock ramping up.
constexpr double kWarmUpSeconds = 0.1;

template <class... Allocators>
void RegisterSideBySide() {
    for (int size = 16; size <= 4096; size *= 4)
        (benchmark::RegisterBenchmark((std::string("pair/") + Allocators::kName).c_str(),
                                      AllocateFreePair<Allocators>)
             ->Arg(size)
             ->MinWarmUpTime(kWarmUpSeconds),
         ...);
    (benchmark::RegisterBenchmark((std::string("churn/") + Allocators::kName).c_str(), Churn<Allocators>)
         ->MinWarmUpTime(kWarmUpSeconds),
     ...);
}

// The console output, followed by the pool's rate against each other allocator per scenario.
class RatioReporter : public ut::bench::RateReporter {
public:
    void Finalize() override {
        ConsoleReporter::Finalize();
        std::ostream& out = GetOutputStream();
        out << "\nmillions of operations per second, and the pool's rate against the others\n"
            << std::left << std::setw(12) << "scenario" << std::right;
        for (const char* column : {"pool", "glibc", "mimalloc", "floor", "vs glibc", "vs mimalloc"})
            out << std::setw(13) << column;
        out << "\n" << std::fixed << std::setprecision(1);
        for (auto& [scenario, rates] : rates_) {
            out << std::left << std::setw(12) << scenario << std::right;
            for (const char* allocator : {"pool", "glibc", "mimalloc", "floor"})
                out << std::setw(13) << Mean(rates, allocator) / 1e6;
            out << std::setprecision(2) << std::setw(12) << Ratio(rates, "glibc") << "x" << std::setw(12)
                << Ratio(rates, "mimalloc") << "x\n"
                << std::setprecision(1);
        }
    }

private:
    struct Sum {
        double total = 0;
        int count = 0;
    };
    using Rates = std::map<std::string, Sum>;

    // "pair/glibc/64" is allocator "glibc" in scenario "pair/64".
    void Record(const Run& run, double rate) override {
        std::string name = run.benchmark_name();
        name = name.substr(0, name.find("/min_warmup_time"));
        std::size_t first = name.find('/');
        std::size_t second = name.find('/', first + 1);
        std::string allocator = name.substr(first + 1, second - first - 1);
        std::string scenario =
            name.substr(0, first) + (second == std::string::npos ? "" : name.substr(second));
        Sum& sum = rates_[scenario][allocator];
        sum.total += rate;
        ++sum.count;
    }

    static double Mean(const Rates& rates, const std::string& allocator) {
        auto found = rates.find(allocator);
        return found == rates.end() || found->second.count == 0 ? 0
                                                                : found->second.total / found->second.count;
    }

    static double Ratio(const Rates& rates, const std::string& other) {
        double rate = Mean(rates, other);
        return rate == 0 ? 0 : Mean(rates, "pool") / rate;
    }

    std::map<std::string, Rates> rates_;
};

} // namespace

// Our own main (it takes precedence over benchmark_main's): the ratio table needs its reporter.
int main(int argc, char** argv) {
    // With the host's notification service installed the pool registers once, as in the
    // application; without it every allocation would ask the host again.
    ut::host::ReferenceHost host;
    RegisterSideBySide<PoolAllocator, GlibcAllocator, MimallocAllocator, FloorAllocator>();
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    RatioReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    return 0;
}
