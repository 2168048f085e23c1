// Start and stop cycles of the sample effect, as the host makes them when
// the lock screen comes and goes, under the leak checker. Each cycle: start
// (through the JNI entry point, which opens the plug-in only the first time),
// initialise, a frame, stop or pause. Now and then the host also hands in a
// new wallpaper, recycles textures, loses its context, or asks for a
// plug-in that cannot be started. At the end the registries, the maps and
// the animation storage must be as large as after the first cycle: nothing
// the design keeps may grow with the number of cycles. The leak checker then
// reports, at exit, anything unreachable beyond the leaks the design keeps on
// purpose, which soak/lsan.supp names.
//
//   vi_soak_cycles [--cycles N] [--sample PATH]
#include <array>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "Application/AnimationManager.h"
#include "Application/ApplicationVar.h"
#include "FakeJni.h"
#include "GlContext.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"

namespace {

const int kWallpaperEvery = 50;
const int kRecycleEvery = 70;
const int kLossEvery = 90;
const int kFailedStartEvery = 250;

// Renderers and textures registered, textures and models filed, animations.
using Sizes = std::array<std::size_t, 5>;

Sizes sizes() {
    return Sizes{vi::Renderer::mAllRenderers.size(), vi::Texture::mAllTextures.size(),
                 vi::ApplicationVar::msTexturesMap.size(), vi::ApplicationVar::msModelsMap.size(),
                 vi::AnimationManager::mStorage.size()};
}

std::vector<jint> wallpaper(int cycle, int width, int height) {
    std::vector<jint> pixels(std::size_t(width) * height);
    for (int i = 0; i < width * height; ++i) pixels[std::size_t(i)] = jint(0xFF000000u | unsigned(i * 2654435761u + unsigned(cycle)) >> 8);
    return pixels;
}

}  // namespace

int main(int argc, char** argv) {
    int cycles = 10000;
    std::string sample = VI_CYCLES_SAMPLE_PLUGIN;
    std::string noFactory = VI_CYCLES_NOFACTORY_PLUGIN;
    for (int i = 1; i < argc; i += 2) {
        const std::string option = argv[i];
        if (i + 1 < argc && option == "--cycles") cycles = std::atoi(argv[i + 1]);
        else if (i + 1 < argc && option == "--sample") sample = argv[i + 1];
        else return std::fprintf(stderr, "usage: vi_soak_cycles [--cycles N] [--sample PATH]\n"), 2;
    }
    setvbuf(stdout, nullptr, _IOLBF, 0);

    vitest::GlContext context(64, 64);
    vitest::FakeJni jni;
    JNIEnv* env = jni.env();
    jobject thiz = jni.thiz();
    Sizes first = {};
    int failedStarts = 0;

    for (int cycle = 0; cycle < cycles; ++cycle) {
        if (cycle % kFailedStartEvery == kFailedStartEvery - 1) {
            // A library without a factory: null, and the path's UTF chars
            // kept by the runtime, as designed. The host's next start names
            // the sample again, which the runtime then opens anew.
            if (VI_NATIVE(prehandleStart)(env, thiz, jni.string(noFactory), 540, 960)) {
                std::printf("cycles: a start of a library without a factory returned names\n");
                return 1;
            }
            ++failedStarts;
            // As a JVM would: the chars stay allocated and nobody holds them.
            jni.forgetOutstandingUtfChars();
        }
        jobjectArray names = VI_NATIVE(prehandleStart)(env, thiz, jni.string(sample), 540, 960);
        std::vector<std::string> values;
        if (!names || !jni.stringArrayValues(names, values)) {
            std::printf("cycles: cycle %d: the sample did not start (%s)\n", cycle, sample.c_str());
            return 1;
        }
        if (cycle % kWallpaperEvery == 0 && !values.empty()) {
            const int width = 40 + cycle % 7;
            const int height = 72 + cycle % 5;
            VI_NATIVE(loadTexture)(env, nullptr, jni.string(values[0]), jni.intArray(wallpaper(cycle, width, height)),
                                        width, height);
        }
        VI_NATIVE(prehandleInitEffect)(env, thiz);
        VI_NATIVE(prehandleDraw)(env, thiz);
        if (cycle % kRecycleEvery == kRecycleEvery - 1) VI_NATIVE(prehandleRecycleTextures)(env, thiz);
        if (cycle % kLossEvery == kLossEvery - 1) {
            context.recreate();
            VI_NATIVE(prehandleDraw)(env, thiz);
        }
        if (cycle % 2)
            VI_NATIVE(prehandlePause)(env, thiz);
        else
            VI_NATIVE(prehandleStop)(env, thiz);
        if (!jni.misuses().empty() || jni.outstandingElements() || jni.outstandingUtfChars()) {
            std::printf("cycles: cycle %d misused JNI or left strings or arrays unreleased\n", cycle);
            return 1;
        }
        jni.reset();
        if (cycle == 0) first = sizes();
        if ((cycle + 1) % 1000 == 0) std::printf("cycles: %d done\n", cycle + 1);
    }

    const Sizes last = sizes();
    std::printf("cycles: renderers and textures registered, textures and models filed, animations: "
                "%zu %zu %zu %zu %zu after the first cycle, %zu %zu %zu %zu %zu after the last\n",
                first[0], first[1], first[2], first[3], first[4], last[0], last[1], last[2], last[3], last[4]);
    if (last != first) {
        std::printf("cycles: FAULT: what the runtime keeps grew over %d cycles\n", cycles);
        return 1;
    }
    std::printf("cycles: %d start and stop cycles, %d failed starts, nothing grew\n", cycles, failedStarts);
    return 0;
}
