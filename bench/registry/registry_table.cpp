// The registry workloads timed with a plain clock and printed as a table, so that the same program
// runs on both homes: natively against the POSIX store, and cross-built under wine against the
// system's registry. `--tsv` prints "workload<TAB>N<TAB>seconds" lines for side-by-side tables.
#include <chrono>
#include <cstdio>
#include <cstring>
#include <functional>

#include "registry_workloads.h"

namespace {

double Seconds(const std::function<void()>& work) {
    auto start = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

void Report(bool tsv, const char* workload, int count, double seconds) {
    if (tsv)
        std::printf("%s\t%d\t%.6f\n", workload, count, seconds);
    else
        std::printf("%-28s %8d %10.4f s %10.2f us per key\n", workload, count, seconds,
                    seconds * 1e6 / count);
    std::fflush(stdout);
}

} // namespace

int main(int argc, char** argv) {
    bool tsv = argc > 1 && std::strcmp(argv[1], "--tsv") == 0;
    ut::bench::UsePrivateStore();
    for (int count : {100, 1000, 10000, 100000}) {
        ut::bench::BenchKey key;
        Report(tsv, "populate (one transaction)", count,
               Seconds([&] { ut::bench::Populate(key.Get(), count); }));
        int read = 0;
        Report(tsv, "enumerate and read", count,
               Seconds([&] { read = ut::bench::EnumerateAndRead(key.Get()); }));
        if (read != count)
            return 1;
    }
    for (bool batched : {false, true}) {
        ut::bench::BenchKey key;
        Report(tsv, batched ? "create/delete (one transaction)" : "create/delete (call by call)", 10000,
               Seconds([&] { ut::bench::CreateAndDelete(key.Get(), 10000, batched); }));
    }
    return 0;
}
