// The recovery figures. A set of renderers (each with its drawable, two
// static attributes, a uniform of its own and a texture) sharing one program
// per 25 renderers, and as many textures. A recovery: the set's context is
// destroyed and a new one made current (not timed), then the frame's context
// check rebuilds the set (timed). "recovery" sets the recovery of 100 against
// making the same 100 from nothing in a new context; "recovery-scaling" fits
// how the recovery of one object grows from sets of 100 to sets of 1000, the
// programs growing with the set so that every size rebuilds the same mix.

#include <benchmark/benchmark.h>

#include <cmath>
#include <memory>
#include <string>
#include <vector>

#include "Application/ContextRecovery.h"
#include "BenchContext.h"
#include "BenchShaders.h"
#include "PairedTimes.h"
#include "Render/Drawable.h"
#include "Render/GL.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"
#include "Render/Uniform.h"

namespace {

const int kRenderersPerProgram = 25;
const unsigned int kTextureSide = 32;

const float kPositions[] = {-0.1f, -0.1f, 0.1f, -0.1f, -0.1f, 0.1f, 0.1f, 0.1f};
const float kTexCoords[] = {0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 1.0f, 1.0f, 1.0f};
const unsigned short kIndices[] = {0, 1, 2, 2, 1, 3};

// The programs differ in a comment, so that each is compiled on its own, as
// the different programs of an effect are.
std::string variant(const char* source, int index) { return "// program " + std::to_string(index) + "\n" + source; }

class RendererSet {
public:
    RendererSet(int count, const std::vector<unsigned int>& pixels) : mOffsets(std::size_t(count)) {
        const int programs = (count + kRenderersPerProgram - 1) / kRenderersPerProgram;
        for (int p = 0; p < programs; ++p)
            mPrograms.emplace_back(new vi::ShaderProgram(variant(vibench::kQuadVertex, p),
                                                         variant(vibench::kQuadFragment, p)));
        for (int i = 0; i < count; ++i) {
            vi::Drawable* drawable = new vi::Drawable();
            drawable->mode = GL_TRIANGLES;
            drawable->indices = kIndices;
            drawable->elementCount = 6;
            drawable->vertexCount = 4;
            mDrawables.emplace_back(drawable);
            vi::Texture* texture = new vi::Texture(const_cast<unsigned int*>(pixels.data()), kTextureSide,
                                                   kTextureSide, true, false, false, true, false, 4, false);
            mTextures.emplace_back(texture);
            mOffsets[std::size_t(i)] = glm::vec2(float(i % 10) * 0.1f - 0.5f, float(i / 10 % 10) * 0.1f - 0.5f);
            vi::Renderer* renderer = new vi::Renderer(*mPrograms[std::size_t(i / kRenderersPerProgram)], *drawable);
            renderer->addAttribute("aPosition", kPositions, 2, true);
            renderer->addAttribute("aTexCoord", kTexCoords, 2, true);
            renderer->addUniform("uOffset", &mOffsets[std::size_t(i)], vi::Uniform::Float2, 1);
            renderer->addTexture("uTexture", texture);
            mRenderers.emplace_back(renderer);
        }
    }
    // Renderers first: they point at the programs, drawables and textures.
    ~RendererSet() {
        mRenderers.clear();
        mTextures.clear();
        mPrograms.clear();
        mDrawables.clear();
    }

private:
    std::vector<glm::vec2> mOffsets;
    std::vector<std::unique_ptr<vi::ShaderProgram>> mPrograms;
    std::vector<std::unique_ptr<vi::Drawable>> mDrawables;
    std::vector<std::unique_ptr<vi::Texture>> mTextures;
    std::vector<std::unique_ptr<vi::Renderer>> mRenderers;
};

std::vector<unsigned int> texturePixels() { return std::vector<unsigned int>(kTextureSide * kTextureSide, 0xFF4080C0u); }

void checkRebuilt(std::size_t renderers) {
    if (vi::Renderer::mAllRenderers.size() != renderers || vi::Texture::mAllTextures.size() != renderers)
        vibench::benchFail("recovery: the registries do not hold exactly the set");
    if (vi::Renderer::mEglContext != eglGetCurrentContext() ||
        glIsProgram(vi::Renderer::mAllRenderers.back()->program->program) != GL_TRUE ||
        glIsTexture(vi::Texture::mAllTextures.back()->mId) != GL_TRUE)
        vibench::benchFail("recovery: the set was not rebuilt in the new context");
}

// One recovery: the context is lost (not timed) and the frame's check rebuilds.
double timeRecovery(vitest::GlContext& context) {
    context.recreate();
    const double start = vibench::threadSeconds();
    vi::ContextRecovery::recoverIfLost();
    glFinish();
    return vibench::threadSeconds() - start;
}

// One fresh making: the set is deleted and the context replaced (not timed),
// then the set is made anew.
double timeFresh(vitest::GlContext& context, std::unique_ptr<RendererSet>& set, int count,
                 const std::vector<unsigned int>& pixels) {
    set.reset();
    context.recreate();
    // The runtime's own check notices the new context before the making, so
    // that neither side pays for noticing it.
    vi::ContextRecovery::invalidateIfLost();
    const double start = vibench::threadSeconds();
    set.reset(new RendererSet(count, pixels));
    glFinish();
    return vibench::threadSeconds() - start;
}

// "recovery": rebuilding 100 after a loss against making 100 from nothing.
void recoveryAgainstFresh(benchmark::State& state) {
    const int count = 100;
    vitest::GlContext& context = vibench::recoveryContext();
    const std::vector<unsigned int> pixels = texturePixels();
    std::unique_ptr<RendererSet> set(new RendererSet(count, pixels));
    vibench::PairedTimes times(state);
    for (auto _ : state) {
        double measured;
        double baseline;
        if (times.measuredFirst()) {
            measured = timeRecovery(context);
            baseline = timeFresh(context, set, count, pixels);
        } else {
            baseline = timeFresh(context, set, count, pixels);
            measured = timeRecovery(context);
        }
        times.add(measured, baseline, 1);
    }
    times.finish();
    vi::ContextRecovery::recoverIfLost();
    checkRebuilt(std::size_t(count));
    set.reset();
    vibench::mainContext();
}

// The registry entries of a set that is not the one being rebuilt are kept
// aside: the recovery walks every registered object, and each side must find
// only its own set.
struct Registries {
    std::vector<vi::Renderer*> renderers;
    std::vector<vi::Texture*> textures;

    void swapWithRuntime() {
        renderers.swap(vi::Renderer::mAllRenderers);
        textures.swap(vi::Texture::mAllTextures);
    }
};

// "recovery-scaling": how the cost of one object's recovery grows with the
// number of objects. Sets of 100 to 1000 are rebuilt in turn, each pass
// starting at another size; a straight line fitted through log(time) against
// log(count) over all sizes gives the exponent k, and the figure is the cost
// per object at 1000 against that at 100 along the line, 10^(k - 1): 1 when
// recovery is linear. Fitted over five sizes it moves far less from run to
// run than one pair of sizes did.
void recoveryScaling(benchmark::State& state) {
    const std::vector<int> sizes = {100, 200, 400, 700, 1000};
    vitest::GlContext& context = vibench::recoveryContext();
    const std::vector<unsigned int> pixels = texturePixels();
    // Made one after the other, each into empty registries.
    std::vector<Registries> entries(sizes.size());
    std::vector<std::unique_ptr<RendererSet>> sets;
    for (std::size_t i = 0; i < sizes.size(); ++i) {
        sets.emplace_back(new RendererSet(sizes[i], pixels));
        entries[i].swapWithRuntime();
    }

    std::vector<double> seconds(sizes.size(), 0.0);
    std::size_t pass = 0;
    for (auto _ : state) {
        double passSeconds = 0.0;
        for (std::size_t step = 0; step < sizes.size(); ++step) {
            const std::size_t i = (pass + step) % sizes.size();
            entries[i].swapWithRuntime();
            const double t = timeRecovery(context);
            entries[i].swapWithRuntime();
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
    state.counters["measured"] = benchmark::Counter(perObjectNanoseconds(1000.0));
    state.counters["baseline"] = benchmark::Counter(perObjectNanoseconds(100.0));

    // Each set is deleted while its names are valid in the current context.
    // A set put back into the registries may find another set's objects
    // under its own names in the current context, which the probes would take
    // for its own: each is rebuilt in a new context instead.
    for (std::size_t i = sets.size(); i-- > 0;) {
        entries[i].swapWithRuntime();
        timeRecovery(context);
        checkRebuilt(std::size_t(sizes[i]));
        sets[i].reset();
    }
    vibench::mainContext();
}

}  // namespace

BENCHMARK(recoveryAgainstFresh)->Name("recovery")->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(recoveryScaling)->Name("recovery-scaling")->UseManualTime()->Unit(benchmark::kMillisecond);
