// How long the repair of a lost context takes on this machine's driver, for
// 10, 100 and 1000 renderers and as many textures: a measurement to read, not
// a test. Each round destroys the context, makes a new one current and runs the
// frame's check, which then rebuilds everything; the median of the rounds is
// printed per renderer, so that growth beyond linear shows as a rising figure.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <memory>
#include <vector>

#include "Application/ContextRecovery.h"
#include "GlContext.h"
#include "Render/Drawable.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"

namespace {

const char* const kVertex =
    "attribute vec2 aPosition;\n"
    "attribute vec2 aTexCoord;\n"
    "uniform vec2 uOffset;\n"
    "varying vec2 vTexCoord;\n"
    "void main() { vTexCoord = aTexCoord; gl_Position = vec4(aPosition + uOffset, 0.0, 1.0); }\n";
const char* const kFragment =
    "precision mediump float;\n"
    "uniform sampler2D uTexture;\n"
    "varying vec2 vTexCoord;\n"
    "void main() { gl_FragColor = texture2D(uTexture, vTexCoord); }\n";

const float kPositions[] = {0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 1.0f, 1.0f, 1.0f};
const float kTexCoords[] = {0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 1.0f, 1.0f, 1.0f};
const unsigned short kIndices[] = {0, 1, 2, 2, 1, 3};
const float kOffset[] = {0.0f, 0.0f};

struct Set {
    std::vector<std::unique_ptr<vi::ShaderProgram>> programs;
    std::vector<std::unique_ptr<vi::Drawable>> drawables;
    std::vector<std::unique_ptr<vi::Renderer>> renderers;
    std::vector<std::unique_ptr<vi::Texture>> textures;
};

// `count` indexed quads with two attributes, a uniform and a sampler each, and
// `count` static 32x32 RGBA textures; `programs` programs shared round-robin.
void build(Set& set, int count, int programs, std::vector<unsigned char>& pixels) {
    for (int i = 0; i < programs; ++i) {
        // A distinct text per program, so that no driver cache joins them.
        const std::string fragment = std::string(kFragment) + "// " + std::to_string(i) + "\n";
        set.programs.emplace_back(new vi::ShaderProgram(kVertex, fragment));
    }
    for (int i = 0; i < count; ++i) {
        set.textures.emplace_back(new vi::Texture(pixels.data(), 32, 32, true, false, false, true, false, 4, false));
        set.drawables.emplace_back(new vi::Drawable);
        vi::Drawable& quad = *set.drawables.back();
        quad.mode = GL_TRIANGLES;
        quad.indices = kIndices;
        quad.elementCount = 6;
        quad.vertexCount = 4;
        set.renderers.emplace_back(new vi::Renderer(*set.programs[std::size_t(i % programs)], quad));
        vi::Renderer& renderer = *set.renderers.back();
        renderer.addAttribute("aPosition", kPositions, 2, true);
        renderer.addAttribute("aTexCoord", kTexCoords, 2, true);
        renderer.addUniform("uOffset", kOffset, vi::Uniform::Float2, 1);
        renderer.addTexture("uTexture", set.textures.back().get());
    }
}

double medianMilliseconds(vitest::GlContext& context, int rounds) {
    std::vector<double> times;
    for (int round = 0; round < rounds; ++round) {
        // Destroyed and made anew, as a host does: objects left in a context
        // that lives on would pile up over the rounds.
        context.recreate();
        const auto start = std::chrono::steady_clock::now();
        vi::ContextRecovery::recoverIfLost();
        glFinish();
        times.push_back(std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count());
    }
    std::sort(times.begin(), times.end());
    return times[times.size() / 2];
}

// The intact frame's check, for comparison: two queries at most.
double intactMicroseconds(int rounds) {
    const auto start = std::chrono::steady_clock::now();
    for (int round = 0; round < rounds; ++round) vi::ContextRecovery::recoverIfLost();
    return std::chrono::duration<double, std::micro>(std::chrono::steady_clock::now() - start).count() / rounds;
}

}  // namespace

int main() {
    vitest::GlContext context(64, 64);
    std::vector<unsigned char> pixels(32 * 32 * 4, 0x80);
    std::printf("%-8s %-9s %12s %16s %14s\n", "objects", "programs", "median ms", "us per renderer",
                "intact us");
    for (int programsPerSet : {1, 0}) {
        for (int count : {10, 100, 1000}) {
            const int programs = programsPerSet ? programsPerSet : count;
            Set set;
            build(set, count, programs, pixels);
            vi::ContextRecovery::invalidate();  // the current context is the remembered one
            const double ms = medianMilliseconds(context, count >= 1000 ? 7 : 15);
            const double intact = intactMicroseconds(1000);
            // The figures are only worth reading if the last round rebuilt everything.
            for (const auto& texture : set.textures)
                if (glIsTexture(texture->mId) != GL_TRUE) std::printf("a texture was not rebuilt\n");
            for (const auto& program : set.programs)
                if (glIsProgram(program->program) != GL_TRUE) std::printf("a program was not rebuilt\n");
            std::printf("%-8d %-9d %12.2f %16.1f %14.2f\n", count, programs, ms, ms * 1000.0 / count, intact);
        }
    }
    return 0;
}
