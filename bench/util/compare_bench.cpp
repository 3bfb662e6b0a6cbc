// Sorting generated file names with each comparison, side by side in one run:
//   sort/F3Dwcsicmpnum, sort/F3Dstricmpnum, sort/F3Dmbsicmpnum   the library's comparisons
//   sort/wcscmp                                                   plain wide comparison (no numbers, no case)
//   sort/strverscmp                                               glibc's version order on the narrow form
// Each repetition sorts a fresh copy of the same shuffled names. After the runs a table gives the
// median rate in names per second, the spread of the repetitions, and each rate against strverscmp.
#include <algorithm>
#include <cstring>
#include <cwchar>
#include <functional>
#include <iomanip>
#include <map>
#include <random>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>

#include <ut/compare.h>

#include "support/rate_reporter.h"

namespace {

constexpr std::size_t kNames = 1'000'000;

// Names of renders and plates: mostly a trailing number (a version or a padded frame), some an
// extension after it, in mixed case. Each form is held in one block, terminated name after name,
// as a tool holds text it converted once; every comparison sorts the same pointers into it.
struct Names {
    std::string narrow;
    std::wstring wide;
    std::vector<std::size_t> starts;
};

const Names& Generated() {
    static const Names names = [] {
        const char* words[] = {"shot", "Shot", "SHOT",   "plate",  "Plate", "clip",
                               "Clip", "comp", "render", "Render", "bg",    "FG"};
        std::mt19937 random(12);
        std::uniform_int_distribution<int> word(0, 11), shot(1, 400), version(1, 30), frame(1, 2400),
            kind(0, 19);
        Names made;
        for (std::size_t i = 0; i < kNames; ++i) {
            std::string name = std::string(words[word(random)]) + "_" + std::to_string(shot(random)) + "_v" +
                               std::to_string(version(random));
            int shape = kind(random);
            if (shape < 5) {
                char padded[16];
                std::snprintf(padded, sizeof padded, ".%04d", frame(random));
                name += padded;
            } else if (shape < 8) {
                name += ".exr";
            }
            made.starts.push_back(made.narrow.size());
            made.narrow.append(name).push_back('\0');
        }
        made.wide.assign(made.narrow.begin(), made.narrow.end());
        return made;
    }();
    return names;
}

template <class Char>
const std::vector<const Char*>& Pointers() {
    static const std::vector<const Char*> pointers = [] {
        const Names& names = Generated();
        std::vector<const Char*> made;
        for (std::size_t start : names.starts) {
            if constexpr (sizeof(Char) == sizeof(char))
                made.push_back(reinterpret_cast<const Char*>(names.narrow.data() + start));
            else
                made.push_back(names.wide.data() + start);
        }
        return made;
    }();
    return pointers;
}

// Sorts the first state.range(0) names.
template <class Char, int (*Compare)(const Char*, const Char*)>
void Sort(benchmark::State& state) {
    const std::vector<const Char*>& all = Pointers<Char>();
    const std::vector<const Char*> names(all.begin(), all.begin() + state.range(0));
    std::vector<const Char*> order;
    for (auto _ : state) {
        state.PauseTiming();
        order = names;
        state.ResumeTiming();
        std::sort(order.begin(), order.end(), [](const Char* a, const Char* b) { return Compare(a, b) < 0; });
        benchmark::DoNotOptimize(order.data());
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * names.size()));
}

int Wcscmp(const wchar_t* a, const wchar_t* b) {
    return std::wcscmp(a, b);
}
int Strverscmp(const char* a, const char* b) {
    return ::strverscmp(a, b);
}

// A million names, whose strings mostly miss the caches, and 50 000, whose strings mostly stay in
// them, so that the table shows the cost of the memory apart from the cost of the comparison.
void Register(const char* name, void (*run)(benchmark::State&)) {
    benchmark::RegisterBenchmark((std::string("sort/") + name).c_str(), run)
        ->Unit(benchmark::kMillisecond)
        ->Arg(static_cast<std::int64_t>(kNames))
        ->Arg(50'000)
        ->Repetitions(5);
}

// The console output, followed by the median rate of each comparison, the spread of its
// repetitions and its rate against strverscmp.
class RatioReporter : public ut::bench::RateReporter {
public:
    void Finalize() override {
        ConsoleReporter::Finalize();
        std::ostream& out = GetOutputStream();
        out << "\nmillions of names sorted per second (median of the repetitions, min-max), against "
               "strverscmp\n";
        out << std::fixed;
        for (auto& [names, byComparison] : rates_) {
            double reference = Median(byComparison["strverscmp"]);
            for (auto& [comparison, rates] : byComparison) {
                std::sort(rates.begin(), rates.end());
                out << std::setw(8) << names << " names  " << std::left << std::setw(15) << comparison
                    << std::right << std::setprecision(2) << std::setw(7) << Median(rates) / 1e6 << "  ("
                    << rates.front() / 1e6 << "-" << rates.back() / 1e6 << ")" << std::setw(7)
                    << (reference > 0 ? Median(rates) / reference : 0) << "x\n";
            }
        }
    }

private:
    // "sort/strverscmp" with argument "50000" is comparison "strverscmp" over 50000 names.
    void Record(const Run& run, double rate) override {
        std::string comparison = run.run_name.function_name.substr(run.run_name.function_name.find('/') + 1);
        rates_[std::stol(run.run_name.args)][comparison].push_back(rate);
    }

    static double Median(std::vector<double> rates) {
        if (rates.empty())
            return 0;
        std::sort(rates.begin(), rates.end());
        return rates[rates.size() / 2];
    }

    std::map<long, std::map<std::string, std::vector<double>>, std::greater<>> rates_;
};

} // namespace

int main(int argc, char** argv) {
    Generated(); // outside the timings
    Pointers<char>();
    Pointers<unsigned char>();
    Pointers<wchar_t>();
    Register("strverscmp", Sort<char, Strverscmp>);
    Register("F3Dstricmpnum", Sort<char, F3Dstricmpnum>);
    Register("wcscmp", Sort<wchar_t, Wcscmp>);
    Register("F3Dwcsicmpnum", Sort<wchar_t, F3Dwcsicmpnum>);
    Register("F3Dmbsicmpnum", Sort<unsigned char, F3Dmbsicmpnum>);
    // Repetitions of all comparisons in random order, so that a busy machine slows them alike.
    std::vector<char*> arguments(argv, argv + argc);
    char interleave[] = "--benchmark_enable_random_interleaving=true";
    arguments.insert(arguments.begin() + 1, interleave);
    argc = static_cast<int>(arguments.size());
    argv = arguments.data();
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    RatioReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    return 0;
}
