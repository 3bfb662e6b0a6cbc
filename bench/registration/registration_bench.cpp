// The registration family's costs, timed with a plain clock so that one program runs on both
// homes: natively against the POSIX registry store, and cross-built for Windows under wine against
// the system's registry (`./run bench-registration` puts the two side by side):
//
//   list          KXGetCLSIDList over a category of N classes
//   names         KXGetKeyName of every class of that category, one call each
//   register      KXRegisterOperator of 10,000 classes, call by call
//   unregister    KXUnRegisterOperator of them, call by call
//   ... batched   the same inside one registry transaction, as a host that wraps a plug-in's
//                 register entry point in one
//
// Each workload runs 5 times. The table gives the median, the spread (slowest minus fastest) and
// the median per class; `--tsv` prints "workload<TAB>N<TAB>median s<TAB>spread s" lines instead,
// and `--sizes` or `--cycle` runs only the category sizes or the register/unregister cycle.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include <ut/detail/names.h>
#include <ut/host/reference_host.h>
#include <ut/platform/process.h>
#include <ut/platform/registry.h>
#include <ut/registration.h>
#include <ut/sdk/resources.h>

#include "support/registry_scratch.h"

namespace {

constexpr int kRepetitions = 5;
constexpr int kCycleClasses = 10'000;
constexpr int kSizes[] = {100, 1'000, 10'000, 100'000};

struct Timing {
    double median;
    double spread;
};

Timing Time(const std::function<void()>& setUp, const std::function<void()>& work,
            const std::function<void()>& tearDown) {
    std::vector<double> seconds;
    for (int i = 0; i < kRepetitions; ++i) {
        setUp();
        auto start = std::chrono::steady_clock::now();
        work();
        seconds.push_back(std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
        tearDown();
    }
    std::sort(seconds.begin(), seconds.end());
    return {seconds[seconds.size() / 2], seconds.back() - seconds.front()};
}

void Report(bool tsv, const char* workload, int count, Timing timing) {
    if (tsv)
        std::printf("%s\t%d\t%.6f\t%.6f\n", workload, count, timing.median, timing.spread);
    else
        std::printf("%-22s %7d %11.2f ms  +- %9.2f ms %10.2f us per class\n", workload, count,
                    timing.median * 1e3, timing.spread * 1e3, timing.median * 1e6 / count);
    std::fflush(stdout);
}

[[noreturn]] void Fail(const char* what, long result) {
    std::fprintf(stderr, "ut_bench_registration: %s failed (%ld)\n", what, result);
    std::exit(1);
}

GUID ClassNumber(int group, int n) {
    return {static_cast<ULONG>(n), 0xBE7C, static_cast<USHORT>(group), {0x8A, 0x11, 0, 0, 0, 0, 0, 0x42}};
}

std::wstring NameOf(int n) {
    return L"Benchmark class " + std::to_wstring(n);
}

// The library's registry base key, under HKEY_LOCAL_MACHINE.
std::wstring BaseKey() {
    wchar_t key[ut::kPathCapacity];
    if (GWResourceConstructRegKey(KXDictFindInstance(ut::kDictionaryName), L"", key, ut::kPathCapacity) !=
        ERROR_SUCCESS)
        Fail("finding the library's registry key", 0);
    return key;
}

void DeleteCategory(const std::wstring& category) {
    (void)RegDeleteTreeW(HKEY_LOCAL_MACHINE, (BaseKey() + category).c_str()); // gone already is fine
}

// A category of `count` classes with names, written in one transaction where the registry has
// them.
void Populate(const std::wstring& category, int count) {
    ut::platform::RegistryTransaction transaction;
    for (int n = 0; n < count; ++n) {
        GUID clsid = ClassNumber(1, n);
        if (HRESULT hr = KXAddRegistryKey(clsid, category.c_str(), L"Name", NameOf(n).c_str()); hr != S_OK)
            Fail("populating", hr);
    }
    if (transaction.Status() == ERROR_SUCCESS && transaction.Commit() != ERROR_SUCCESS)
        Fail("committing", 0);
}

void List(const std::wstring& category, int count) {
    DWORD listed = 0;
    GUID* list = nullptr;
    HRESULT hr = KXGetCLSIDList(category.c_str(), &listed, &list);
    CoTaskMemFree(list);
    if (hr != S_OK || listed != static_cast<DWORD>(count))
        Fail("KXGetCLSIDList", hr);
}

void Names(const std::wstring& category, int count) {
    wchar_t name[80];
    for (int n = 0; n < count; ++n) {
        DWORD bytes = sizeof name;
        name[0] = L'\0';
        HRESULT hr = KXGetKeyName(category.c_str(), ClassNumber(1, n), name, &bytes);
        if (hr != S_OK || NameOf(n) != name)
            Fail("KXGetKeyName", hr);
    }
}

void RegisterAll(HINSTANCE module, bool batched) {
    std::optional<ut::platform::RegistryTransaction> transaction;
    if (batched)
        transaction.emplace();
    for (int n = 0; n < kCycleClasses; ++n)
        if (HRESULT hr = KXRegisterOperator(ClassNumber(2, n), module, NameOf(n).c_str()); hr != S_OK)
            Fail("KXRegisterOperator", hr);
    if (transaction && transaction->Status() == ERROR_SUCCESS && transaction->Commit() != ERROR_SUCCESS)
        Fail("committing", 0);
}

void UnregisterAll(bool batched) {
    std::optional<ut::platform::RegistryTransaction> transaction;
    if (batched)
        transaction.emplace();
    for (int n = 0; n < kCycleClasses; ++n)
        if (HRESULT hr = KXUnRegisterOperator(ClassNumber(2, n)); hr != S_OK)
            Fail("KXUnRegisterOperator", hr);
    if (transaction && transaction->Status() == ERROR_SUCCESS && transaction->Commit() != ERROR_SUCCESS)
        Fail("committing", 0);
}

} // namespace

int main(int argc, char** argv) {
    bool tsv = false, sizes = true, cycle = true;
    for (int i = 1; i < argc; ++i) {
        tsv |= std::strcmp(argv[i], "--tsv") == 0;
        sizes &= std::strcmp(argv[i], "--cycle") != 0;
        cycle &= std::strcmp(argv[i], "--sizes") != 0;
    }
    ut::test::UsePrivateRegistryStore();
    ut::host::ReferenceHost host;
    HINSTANCE module = ut::platform::ModuleOf(reinterpret_cast<const void*>(&Report));
    auto nothing = [] {};

    for (int count : kSizes) {
        if (!sizes)
            break;
        std::wstring category = L"Bench" + std::to_wstring(count);
        DeleteCategory(category);
        Populate(category, count);
        Report(tsv, "list", count,
               Time(
                   nothing, [&] { List(category, count); }, nothing));
        Report(tsv, "names", count,
               Time(
                   nothing, [&] { Names(category, count); }, nothing));
        DeleteCategory(category);
    }

    for (bool batched : {false, true}) {
        if (!cycle)
            break;
        for (int n = 0; n < kCycleClasses; ++n)
            (void)KXUnRegisterOperator(
                ClassNumber(2, n)); // what an interrupted earlier run left, if anything
        Report(tsv, batched ? "register (batched)" : "register", kCycleClasses,
               Time(
                   nothing, [&] { RegisterAll(module, batched); }, [&] { UnregisterAll(batched); }));
        Report(tsv, batched ? "unregister (batched)" : "unregister", kCycleClasses,
               Time([&] { RegisterAll(module, batched); }, [&] { UnregisterAll(batched); }, nothing));
    }
    return 0;
}
