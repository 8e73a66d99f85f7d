#ifndef BENCH_BENCH_RATIO_H
#define BENCH_BENCH_RATIO_H

#include <benchmark/benchmark.h>

#include <cstdio>
#include <map>
#include <string>
#include <vector>

// Console output plus one summary line per pair: how long the measured
// benchmark took relative to its baseline over the same bytes. CPU time, not
// wall time, so that other load on a shared machine does not skew the pair.
class RatioReporter : public benchmark::ConsoleReporter {
public:
    struct Pair {
        std::string measured, baseline, label;
    };
    explicit RatioReporter(std::vector<Pair> pairs) : mPairs(std::move(pairs)) {}

    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& r : runs) {
            if (r.run_type == Run::RT_Iteration && !r.error_occurred) {
                mNanos[r.benchmark_name()] = r.GetAdjustedCPUTime() * benchmark::GetTimeUnitMultiplier(benchmark::kNanosecond) /
                                             benchmark::GetTimeUnitMultiplier(r.time_unit);
            }
        }
    }

    void printRatios() const {
        for (const Pair& p : mPairs) {
            auto m = mNanos.find(p.measured), b = mNanos.find(p.baseline);
            if (m == mNanos.end() || b == mNanos.end()) continue;
            printf("%s: time %s / %s = %.2f, throughput ratio %.2f\n", p.label.c_str(), p.measured.c_str(),
                   p.baseline.c_str(), m->second / b->second, b->second / m->second);
        }
    }

private:
    std::vector<Pair> mPairs;
    std::map<std::string, double> mNanos;
};

inline int runWithRatios(int argc, char** argv, std::vector<RatioReporter::Pair> pairs) {
    benchmark::Initialize(&argc, argv);
    RatioReporter reporter(std::move(pairs));
    benchmark::RunSpecifiedBenchmarks(&reporter);
    reporter.printRatios();
    benchmark::Shutdown();
    return 0;
}

#endif
