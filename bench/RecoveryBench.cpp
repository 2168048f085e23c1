// The recovery figures. A set of renderers (textured quads: each with its
// drawable, a static attribute, a uniform of its own and a texture) sharing
// one program per 25 renderers. A recovery: the set's context is
// destroyed and a new one made current (not timed), then the frame's context
// check rebuilds the set (timed). "recovery" sets the recovery of 100 against
// making the same 100 from nothing in a new context; "recovery-scaling" fits
// how the recovery of one object grows from sets of 100 to sets of 1000, the
// programs growing with the set so that every size rebuilds the same mix.

#include <cmath>
#include <string>

#include "Application/ContextRecovery.h"
#include "Bench.h"

namespace {

const int kRenderersPerProgram = 25;
const unsigned int kTextureSide = 32;

struct RendererSet {
    RendererSet(int count, unsigned int* pixels) {
        // The programs differ in a comment, so that each is compiled on its
        // own, as the different programs of an effect are.
        for (int p = 0; p * kRenderersPerProgram < count; ++p) {
            const std::string tag = "// program " + std::to_string(p) + "\n";
            programs.emplace_back(new vi::ShaderProgram(tag + vitest::quadVertexShader(), tag + vibench::kTexturedFragment));
        }
        for (int i = 0; i < count; ++i)
            quads.emplace_back(new vibench::TexturedQuad(*programs[i / kRenderersPerProgram], pixels, kTextureSide));
    }

    // Puts the registry entries kept here in the runtime's registries, and
    // keeps what they held (see recoveryScaling).
    void swapRegistries() {
        renderers.swap(vi::Renderer::mAllRenderers);
        textures.swap(vi::Texture::mAllTextures);
    }

    std::vector<std::unique_ptr<vi::ShaderProgram>> programs;
    std::vector<std::unique_ptr<vibench::TexturedQuad>> quads;  // after the programs: destroyed first
    std::vector<vi::Renderer*> renderers;
    std::vector<vi::Texture*> textures;
};

void checkRebuilt(std::size_t renderers) {
    if (vi::Renderer::mAllRenderers.size() != renderers || vi::Texture::mAllTextures.size() != renderers ||
        vi::Renderer::mEglContext != eglGetCurrentContext() ||
        glIsProgram(vi::Renderer::mAllRenderers.back()->program->program) != GL_TRUE ||
        glIsTexture(vi::Texture::mAllTextures.back()->mId) != GL_TRUE)
        vibench::benchFail("recovery: the registries do not hold exactly the set, rebuilt in the new context");
}

// One recovery: the context is lost (not timed) and the frame's check rebuilds.
double timeRecovery(vitest::GlContext& context) {
    context.recreate();
    return vibench::timeOf(1, vi::ContextRecovery::recoverIfLost);
}

// One fresh making: the set is deleted and the context replaced (not timed),
// then the set is made anew.
double timeFresh(vitest::GlContext& context, std::unique_ptr<RendererSet>& set, int count, unsigned int* pixels) {
    set.reset();
    context.recreate();
    // The runtime's own check notices the new context before the making, so
    // that neither side pays for noticing it.
    vi::ContextRecovery::invalidateIfLost();
    return vibench::timeOf(1, [&] { set.reset(new RendererSet(count, pixels)); });
}

// "recovery": rebuilding 100 after a loss against making 100 from nothing.
void recoveryAgainstFresh(benchmark::State& state) {
    const int count = 100;
    vitest::GlContext context;  // destroyed and re-created: one of their own
    unsigned int pixels[kTextureSide * kTextureSide] = {};
    std::unique_ptr<RendererSet> set(new RendererSet(count, pixels));
    vibench::PairedTimes times(state);
    for (auto _ : state)
        times.pass(1, [&] { return timeRecovery(context); }, [&] { return timeFresh(context, set, count, pixels); });
    times.finish();
    vi::ContextRecovery::recoverIfLost();
    checkRebuilt(std::size_t(count));
}

// "recovery-scaling": how the cost of one object's recovery grows with the
// number of objects. Sets of 100 to 1000 are rebuilt in turn, each pass
// starting at another size; a straight line fitted through log(time) against
// log(count) over all sizes gives the exponent k, and the figure is the cost
// per object at 1000 against that at 100 along the line, 10^(k - 1): 1 when
// recovery is linear. Fitted over five sizes it moves far less from run to
// run than one pair of sizes did.
void recoveryScaling(benchmark::State& state) {
    const std::vector<int> sizes = {100, 200, 400, 700, 1000};
    vitest::GlContext context;  // destroyed and re-created: one of their own
    unsigned int pixels[kTextureSide * kTextureSide] = {};
    // Made one after the other, each into empty registries, and its entries
    // kept aside: the recovery walks every registered object, and each set
    // must find only its own.
    std::vector<std::unique_ptr<RendererSet>> sets;
    for (int size : sizes) {
        sets.emplace_back(new RendererSet(size, pixels));
        sets.back()->swapRegistries();
    }

    std::vector<double> seconds(sizes.size(), 0.0);
    std::size_t pass = 0;
    for (auto _ : state) {
        double passSeconds = 0.0;
        for (std::size_t step = 0; step < sizes.size(); ++step) {
            const std::size_t i = (pass + step) % sizes.size();
            sets[i]->swapRegistries();
            const double t = timeRecovery(context);
            sets[i]->swapRegistries();
            seconds[i] += t;
            passSeconds += t;
        }
        state.SetIterationTime(passSeconds);
        ++pass;
    }

    // Least squares of log(seconds) on log(count).
    double sx = 0.0, sy = 0.0, sxx = 0.0, sxy = 0.0;
    const double n = double(sizes.size());
    for (std::size_t i = 0; i < sizes.size(); ++i) {
        const double x = std::log(double(sizes[i]));
        const double y = std::log(seconds[i] / double(pass));
        sx += x;
        sy += y;
        sxx += x * x;
        sxy += x * y;
    }
    const double k = (n * sxy - sx * sy) / (n * sxx - sx * sx);
    const double alpha = (sy - k * sx) / n;
    auto perObjectNanoseconds = [&](double count) { return std::exp(alpha + k * std::log(count)) / count * 1e9; };
    vibench::PairedTimes::publish(state, perObjectNanoseconds(1000.0), perObjectNanoseconds(100.0));

    // Each set is deleted while its names are valid in the current context.
    // A set put back into the registries may find another set's objects
    // under its own names in the current context, which the probes would take
    // for its own: each is rebuilt in a new context instead.
    for (std::size_t i = sets.size(); i-- > 0;) {
        sets[i]->swapRegistries();
        timeRecovery(context);
        checkRebuilt(std::size_t(sizes[i]));
        sets[i].reset();
    }
}

}  // namespace

BENCHMARK(recoveryAgainstFresh)->Name("recovery")->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(recoveryScaling)->Name("recovery-scaling")->UseManualTime()->Unit(benchmark::kMillisecond);
