#include "RatioReporter.h"

#include <algorithm>
#include <cstdlib>

namespace vibench {

namespace {

double median(std::vector<double> values) {
    if (values.empty()) return -1.0;
    std::sort(values.begin(), values.end());
    const std::size_t n = values.size();
    return n % 2 ? values[n / 2] : 0.5 * (values[n / 2 - 1] + values[n / 2]);
}

}  // namespace

RatioReporter::RatioReporter()
    : benchmark::ConsoleReporter(OO_Tabular), mShowRuns(std::getenv("VI_BENCH_SHOW_RUNS") != nullptr) {}

void RatioReporter::ReportRuns(const std::vector<Run>& runs) {
    std::vector<Run> shown;
    for (const Run& run : runs) {
        if (run.error_occurred) {
            shown.push_back(run);
            continue;
        }
        if (run.run_type == Run::RT_Iteration) {
            auto measured = run.counters.find("measured");
            auto baseline = run.counters.find("baseline");
            if (measured != run.counters.end() && baseline != run.counters.end() && baseline->second.value > 0.0) {
                Samples& samples = mSamples[run.run_name.function_name];
                samples.measured.push_back(measured->second.value);
                samples.baseline.push_back(baseline->second.value);
                samples.ratio.push_back(measured->second.value / baseline->second.value);
            }
            if (mShowRuns) shown.push_back(run);
        } else if (run.aggregate_name == "median") {
            shown.push_back(run);
        }
    }
    if (!shown.empty()) ConsoleReporter::ReportRuns(shown);
}

const RatioReporter::Samples* RatioReporter::find(const std::string& name) const {
    auto entry = mSamples.find(name);
    return entry == mSamples.end() || entry->second.ratio.empty() ? nullptr : &entry->second;
}

double RatioReporter::medianRatio(const std::string& name) const {
    const Samples* samples = find(name);
    return samples ? median(samples->ratio) : -1.0;
}

double RatioReporter::medianMeasured(const std::string& name) const {
    const Samples* samples = find(name);
    return samples ? median(samples->measured) : -1.0;
}

double RatioReporter::medianBaseline(const std::string& name) const {
    const Samples* samples = find(name);
    return samples ? median(samples->baseline) : -1.0;
}

int RatioReporter::repetitions(const std::string& name) const {
    const Samples* samples = find(name);
    return samples ? int(samples->ratio.size()) : 0;
}

}  // namespace vibench
