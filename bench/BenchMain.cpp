// The runtime's performance figures. Each figure is the time of the
// runtime's own code over the time of a hand-written baseline measured in the
// same run, the two sides alternating batch by batch (PairedTimes); the
// figure printed is the median of the repetitions' ratios, and the run fails
// when a figure exceeds its limit. The repetitions of the figures are
// interleaved in random order.
//
// Output, one line each: "ratio <name> <value> <limit>", then
// "allocations-per-frame <n>" for the sample effect.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "BenchContext.h"
#include "RatioReporter.h"
#include "SampleFrames.h"

namespace {

struct Figure {
    const char* name;  // also the benchmark's name
    double limit;      // 0: shown for information, never fails the run
};

const Figure kFigures[] = {
    {"frame", 1.15},
    {"render", 1.10},
    {"host-image", 1.6},
    {"recovery", 1.2},
    {"recovery-scaling", 1.15},
    {"host-image-cold", 0.0},
};

const int kSampleFrames = 60;

// Defaults that the command line may override (later flags win).
const char* const kDefaultFlags[] = {
    "--benchmark_repetitions=15",
    "--benchmark_enable_random_interleaving=true",
    "--benchmark_min_time=0.05",
};

bool takeOption(std::vector<char*>& arguments, const char* prefix, std::string& value) {
    for (std::size_t i = 1; i < arguments.size(); ++i) {
        if (std::strncmp(arguments[i], prefix, std::strlen(prefix)) == 0) {
            value = arguments[i] + std::strlen(prefix);
            arguments.erase(arguments.begin() + long(i));
            return true;
        }
    }
    return false;
}

}  // namespace

int main(int argc, char** argv) {
    // The software rasteriser's worker threads would compete with the
    // measuring thread for the two cores; rasterising on the calling thread
    // keeps the repetitions steady. Must be set before the first EGL call.
    setenv("LP_NUM_THREADS", "0", 0);
    // The main context lives from here to the end, so that what the driver
    // keeps per process while a context exists does not depend on which
    // figures ran before (see mainContext()).
    vibench::mainContext();
    std::vector<char*> arguments(argv, argv + argc);
    std::string samplePath = VI_BENCH_SAMPLE_PLUGIN;
    takeOption(arguments, "--sample=", samplePath);
    std::string skipSample;
    const bool noSample = takeOption(arguments, "--no-sample", skipSample);

    std::vector<char*> flags;
    flags.push_back(arguments[0]);
    for (const char* flag : kDefaultFlags) flags.push_back(const_cast<char*>(flag));
    flags.insert(flags.end(), arguments.begin() + 1, arguments.end());
    int flagCount = int(flags.size());
    benchmark::Initialize(&flagCount, flags.data());
    if (benchmark::ReportUnrecognizedArguments(flagCount, flags.data())) return 2;

    vibench::RatioReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();

    bool failed = false;
    std::printf("\n");
    for (const Figure& figure : kFigures) {
        const double ratio = reporter.medianRatio(figure.name);
        if (ratio < 0.0) continue;  // filtered out on the command line
        if (figure.limit == 0.0) {
            std::printf("info %s %.3f\n", figure.name, ratio);
        } else {
            std::printf("ratio %s %.3f %.2f\n", figure.name, ratio, figure.limit);
            if (ratio > figure.limit) failed = true;
        }
        std::printf("  %s: %.1f ns against %.1f ns per operation (medians of %d repetitions)\n", figure.name,
                    reporter.medianMeasured(figure.name), reporter.medianBaseline(figure.name),
                    reporter.repetitions(figure.name));
    }

    if (!noSample) {
        const vibench::SampleFrames sample = vibench::countSampleFrames(samplePath, kSampleFrames);
        if (!sample.loaded) {
            std::printf("allocations-per-frame unavailable (sample not loaded: %s)\n", samplePath.c_str());
            failed = true;
        } else {
            const double perFrame = double(sample.count.news + sample.count.watchedMallocs) / sample.frames;
            std::printf("allocations-per-frame %g\n", perFrame);
            std::printf("  over %d frames of %s (%.1f ms each): %ld operator new, %ld malloc from the runtime "
                        "or the sample; not counted: %ld malloc from the GL driver and the C library\n",
                        sample.frames, samplePath.c_str(), sample.millisecondsPerFrame, sample.count.news,
                        sample.count.watchedMallocs, sample.count.otherMallocs);
            std::printf("  the scene's start and initialisation, for comparison: %ld operator new, %ld malloc\n",
                        sample.setUpCount.news, sample.setUpCount.watchedMallocs);
            if (perFrame > 0.0) failed = true;
            if (sample.setUpCount.news + sample.setUpCount.watchedMallocs == 0) {
                std::printf("  the allocation counter saw nothing at all: it does not work in this build\n");
                failed = true;
            }
        }
    }
    std::fflush(stdout);
    return failed ? 1 : 0;
}
