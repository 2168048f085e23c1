#pragma once

// What the figures share. A figure is the time of the runtime's own code over
// the time of a hand-written baseline doing the same work, both measured in
// the same benchmark run, alternating pass by pass and switching which side
// goes first each time, so that a change in the machine's load falls on both
// alike. Times are the calling thread's CPU time: all the work measured runs
// on that thread (the driver is told to rasterise there too), and CPU time
// leaves out the moments another process holds the core.

#include <time.h>

#include <benchmark/benchmark.h>

#include <memory>
#include <vector>

#include "GlContext.h"
#include "Painters.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"

namespace vibench {

// The headless EGL context of the frame, render and host-image figures, made
// at start (64 x 64) and kept to the end; current after the call. Every
// figure builds its GL objects in its setup and deletes them at its end, so
// that the runtime's registries hold only its own objects while it runs.
vitest::GlContext& mainContext();

// Ends the run: a figure that measured something else than intended must not
// print a ratio.
[[noreturn]] void benchFail(const char* what);

// Seconds of the thread's CPU time that `count` runs of `operation` take,
// with the GL work they queued.
template <typename Operation>
double timeOf(int count, Operation&& operation) {
    timespec start, end;
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &start);
    for (int i = 0; i < count; ++i) operation();
    glFinish();
    benchmark::ClobberMemory();
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &end);
    return double(end.tv_sec - start.tv_sec) + double(end.tv_nsec - start.tv_nsec) * 1e-9;
}

// The two sides' times over one repetition, published as the counters
// "measured" and "baseline" (nanoseconds per operation) and their "ratio".
class PairedTimes {
public:
    explicit PairedTimes(benchmark::State& state) : mState(state) {}

    // One pass: each side once, the first one switching from pass to pass.
    // Each side returns the seconds its timed part took.
    template <typename Measured, typename Baseline>
    void pass(int operations, Measured&& measured, Baseline&& baseline) {
        const bool measuredFirst = mPasses++ % 2 == 0;
        const double first = measuredFirst ? measured() : baseline();
        const double second = measuredFirst ? baseline() : measured();
        mMeasured += measuredFirst ? first : second;
        mBaseline += measuredFirst ? second : first;
        mOperations += operations;
        mState.SetIterationTime(first + second);
    }

    // One pass of `batch` operations of each side.
    template <typename Measured, typename Baseline>
    void passBatches(int batch, Measured&& measured, Baseline&& baseline) {
        pass(batch, [&] { return timeOf(batch, measured); }, [&] { return timeOf(batch, baseline); });
    }

    // After the loop.
    void finish() { publish(mState, mMeasured * 1e9 / mOperations, mBaseline * 1e9 / mOperations); }

    static void publish(benchmark::State& state, double measuredNanoseconds, double baselineNanoseconds) {
        state.counters["measured"] = measuredNanoseconds;
        state.counters["baseline"] = baselineNanoseconds;
        state.counters["ratio"] = measuredNanoseconds / baselineNanoseconds;
    }

private:
    benchmark::State& mState;
    double mMeasured = 0.0, mBaseline = 0.0;
    long mOperations = 0, mPasses = 0;
};

// The objects of the frame and recovery figures: the test bed's quad,
// textured and tinted (a uniform of its own), drawn with a program made of
// vitest::quadVertexShader() and kTexturedFragment.
const char* const kTexturedFragment =
    "precision mediump float;\n"
    "uniform sampler2D uTexture;\n"
    "uniform vec4 uTint;\n"
    "varying vec2 vUv;\n"
    "void main() { gl_FragColor = texture2D(uTexture, vUv) * uTint; }\n";

struct TexturedQuad {
    TexturedQuad(vi::ShaderProgram& program, void* pixels, unsigned int side)
        : texture(pixels, side, side, true, false, false, true, false, 4, false), renderer(program, quad) {
        if (renderer.addAttribute("aPosition", quad.positions, 2, true) < 0 ||
            renderer.addUniform("uTint", &tint[0], vi::Uniform::Float4, 1) < 0 ||
            renderer.addTexture("uTexture", &texture) < 0)
            benchFail("the quad's renderer did not bind every input");
    }

    vi::Texture texture;
    vitest::Quad quad;
    glm::vec4 tint{1.0f, 0.9f, 0.8f, 1.0f};
    vi::Renderer renderer;  // last: destroyed first, it points at the others
};

}  // namespace vibench
