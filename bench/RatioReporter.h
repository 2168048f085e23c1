#pragma once

// The console reporter of Google Benchmark that also keeps, for every figure,
// what each repetition measured: the two sides' times per operation (the
// counters "measured" and "baseline" of PairedTimes) and their ratio. Shows
// the median line of each figure, or every repetition with
// VI_BENCH_SHOW_RUNS set in the environment.

#include <benchmark/benchmark.h>

#include <map>
#include <string>
#include <vector>

namespace vibench {

class RatioReporter : public benchmark::ConsoleReporter {
public:
    RatioReporter();
    void ReportRuns(const std::vector<Run>& runs) override;

    // Medians over the repetitions of the benchmark named `name`; negative
    // when it did not run.
    double medianRatio(const std::string& name) const;
    double medianMeasured(const std::string& name) const;  // nanoseconds per operation
    double medianBaseline(const std::string& name) const;
    int repetitions(const std::string& name) const;

private:
    struct Samples {
        std::vector<double> measured;
        std::vector<double> baseline;
        std::vector<double> ratio;
    };
    const Samples* find(const std::string& name) const;

    bool mShowRuns;
    std::map<std::string, Samples> mSamples;
};

}  // namespace vibench
