// The console output of a benchmark run, with the rate (items per second) of every iteration run
// handed on, for the tables of ratios that benchmarks print after their runs.
#pragma once

#include <vector>

#include <benchmark/benchmark.h>

namespace ut::bench {

class RateReporter : public benchmark::ConsoleReporter {
public:
    RateReporter() : ConsoleReporter(OO_Tabular) {}

    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& run : runs) {
            auto rate = run.counters.find("items_per_second");
            if (run.run_type == Run::RT_Iteration && !run.error_occurred && rate != run.counters.end())
                Record(run, rate->second.value);
        }
    }

protected:
    virtual void Record(const Run& run, double rate) = 0;
};

} // namespace ut::bench
