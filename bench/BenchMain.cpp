// The runtime's performance figures. Each figure is printed as the median of
// its repetitions' ratios (the repetitions of all figures interleaved in
// random order), and the run fails when a figure exceeds its limit. Output,
// one line each: "ratio <name> <value> <limit>", then, given --sample=PLUGIN,
// "allocations-per-frame <n>" for that effect, which fails the run unless 0.
#include <dlfcn.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <string>

#include "AllocationCounter.h"
#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Bench.h"

namespace {

struct Figure { const char* name; double limit; };  // name: the benchmark's

const Figure kFigures[] = {
    {"frame", 1.15}, {"render", 1.10}, {"host-image", 1.6}, {"recovery", 1.2}, {"recovery-scaling", 1.15},
};

// Defaults that the command line may override (later flags win).
const char* const kDefaultFlags[] = {"--benchmark_repetitions=15", "--benchmark_enable_random_interleaving=true",
                                     "--benchmark_min_time=0.05", "--benchmark_display_aggregates_only=true"};

// Google Benchmark's console output, keeping the median of each figure's
// "ratio" counter.
struct FigureReporter : benchmark::ConsoleReporter {
    void ReportRuns(const std::vector<Run>& runs) override {
        for (const Run& run : runs)
            if (run.aggregate_name == "median" && run.counters.count("ratio"))
                ratios[run.run_name.function_name] = run.counters.at("ratio");
        ConsoleReporter::ReportRuns(runs);
    }

    std::map<std::string, double> ratios;
};

// Heap allocations per steady frame of the sample effect (540 x 960, its
// wallpaper filed, ripples under way), counted over 60 frames through the
// application handlers; the scene's start and initialisation are counted too,
// to show that the counter sees the runtime's and the sample's allocations.
bool sampleAllocatesNothing(const char* pluginPath) {
    const int width = 540, height = 960, frames = 60;
    void* plugin = dlopen(pluginPath, RTLD_NOW);
    vi::gCreateScene = plugin ? reinterpret_cast<vi::CreateSceneFunction>(dlsym(plugin, "createScene")) : nullptr;
    if (!vi::gCreateScene || !vibench::AllocationCounter::watchCodeOf(reinterpret_cast<void*>(vi::gCreateScene)) ||
        !vibench::AllocationCounter::watchCodeOf(reinterpret_cast<void*>(&vi::Application::handleDraw))) {
        std::printf("allocations-per-frame unavailable (sample not loaded: %s)\n", pluginPath);
        return false;
    }
    vitest::GlContext context(width, height);
    // What the host's texture loading files under the sample's wallpaper name.
    auto* wallpaper = new vi::Texture(std::calloc(std::size_t(width) * height, 4), width, height, true, true, false,
                                      true, false, 4, false);
    wallpaper->setDeletable(true);
    vi::ApplicationVar::msTexturesMap["wallpaper"] = wallpaper;

    vibench::AllocationCounter::start();
    vi::Application::handleStart(0, 0, width, height);
    vi::Application::handleInitEffect();
    const vibench::Allocations setUp = vibench::AllocationCounter::stop();
    vi::Application::handleMouseDown(width / 3, height / 2);
    for (int i = 0; i < 20; ++i) {
        vi::Application::handleMouseMove(width / 3 + i * 8, height / 2 - i * 8);
        vi::Application::handleDraw();
    }
    vi::Application::handleMouseUp(width / 3, height / 2);
    vi::Application::handleDraw();
    vibench::AllocationCounter::start();
    for (int i = 0; i < frames; ++i) vi::Application::handleDraw();
    const vibench::Allocations steady = vibench::AllocationCounter::stop();
    vi::Application::handleStop();
    vi::ApplicationVar::msTexturesMap.erase("wallpaper");
    delete wallpaper;

    std::printf("allocations-per-frame %g\n", double(steady.news + steady.mallocs) / frames);
    std::printf("  over %d frames: %ld operator new, %ld malloc; the scene's start and initialisation: %ld, %ld\n",
                frames, steady.news, steady.mallocs, setUp.news, setUp.mallocs);
    return steady.news + steady.mallocs == 0 && setUp.news > 0 && setUp.mallocs > 0;
}

}  // namespace

namespace vibench {

vitest::GlContext& mainContext() {
    static vitest::GlContext context(64, 64);
    context.makeCurrent();
    // The driver builds its shader compiler's built-in library when a context
    // first compiles, and drops it when no context that compiled is left. A
    // program built here, in a context kept for the whole run, keeps it, so
    // that the recovery figures, which destroy their contexts, do not pay for
    // it anew in each pass.
    static const vi::ShaderProgram kKept(vitest::quadVertexShader(), vibench::kTexturedFragment);
    return context;
}

void benchFail(const char* what) {
    std::fprintf(stderr, "bench: %s\n", what);
    std::exit(2);
}

}  // namespace vibench

int main(int argc, char** argv) {
    // The software rasteriser's worker threads would compete with the
    // measuring thread for the two cores; rasterising on the calling thread
    // keeps the repetitions steady. Must be set before the first EGL call.
    setenv("LP_NUM_THREADS", "0", 0);
    vibench::mainContext();
    const char* samplePath = nullptr;
    std::vector<char*> flags = {argv[0]};
    for (const char* flag : kDefaultFlags) flags.push_back(const_cast<char*>(flag));
    for (int i = 1; i < argc; ++i) {
        if (std::strncmp(argv[i], "--sample=", 9) == 0)
            samplePath = argv[i] + 9;
        else
            flags.push_back(argv[i]);
    }
    int flagCount = int(flags.size());
    benchmark::Initialize(&flagCount, flags.data());
    if (benchmark::ReportUnrecognizedArguments(flagCount, flags.data())) return 2;
    FigureReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();

    bool failed = false;
    std::printf("\n");
    for (const Figure& figure : kFigures) {
        if (!reporter.ratios.count(figure.name)) continue;  // filtered out on the command line
        const double ratio = reporter.ratios.at(figure.name);
        std::printf("ratio %s %.3f %.2f\n", figure.name, ratio, figure.limit);
        failed = failed || ratio > figure.limit;
    }
    if (samplePath) failed = !sampleAllocatesNothing(samplePath) || failed;
    std::fflush(stdout);
    return failed ? 1 : 0;
}
