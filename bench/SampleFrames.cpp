#include "SampleFrames.h"

#include <dlfcn.h>
#include <time.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Application/Scene.h"
#include "GlContext.h"
#include "Render/GL.h"
#include "Render/Texture.h"

namespace vibench {

namespace {

const int kWidth = 540;
const int kHeight = 960;
const int kWarmUpFrames = 20;

double wallSeconds() {
    timespec now;
    clock_gettime(CLOCK_MONOTONIC, &now);
    return double(now.tv_sec) + double(now.tv_nsec) * 1e-9;
}

// What the host's texture loading files under the sample's wallpaper name: a
// deletable malloc'ed RGBA buffer, uploaded once.
vi::Texture* fileWallpaper() {
    unsigned char* pixels = static_cast<unsigned char*>(std::malloc(std::size_t(kWidth) * kHeight * 4));
    for (int y = 0; y < kHeight; ++y) {
        for (int x = 0; x < kWidth; ++x) {
            unsigned char* p = pixels + (std::size_t(y) * kWidth + x) * 4;
            p[0] = (unsigned char)(x * 255 / kWidth);
            p[1] = (unsigned char)(y * 255 / kHeight);
            p[2] = (unsigned char)((x ^ y) & 0xFF);
            p[3] = 0xFF;
        }
    }
    vi::Texture* texture = new vi::Texture(pixels, kWidth, kHeight, true, true, false, true, false, 4, false);
    texture->setDeletable(true);
    vi::ApplicationVar::msTexturesMap["wallpaper"] = texture;
    return texture;
}

}  // namespace

SampleFrames countSampleFrames(const std::string& pluginPath, int frames) {
    SampleFrames result = {false, frames, {0, 0, 0}, {0, 0, 0}, 0.0};
    void* handle = dlopen(pluginPath.c_str(), RTLD_NOW);
    if (!handle) {
        std::fprintf(stderr, "bench: cannot open the sample: %s\n", dlerror());
        return result;
    }
    vi::gCreateScene = reinterpret_cast<vi::CreateSceneFunction>(dlsym(handle, "createScene"));
    if (!vi::gCreateScene) return result;
    if (!AllocationCounter::watchLibrary("libtarqvevyncommon") || !AllocationCounter::watchLibrary(pluginPath.c_str()))
        return result;
    result.loaded = true;

    vitest::GlContext context(kWidth, kHeight);
    vi::Texture* wallpaper = fileWallpaper();
    // The scene's making and set-up allocate: counting them shows that the
    // counter sees the runtime's and the plug-in's allocations at all.
    AllocationCounter::start();
    vi::Application::handleStart(0, 0, kWidth, kHeight);
    vi::Application::handleInitEffect();
    result.setUpCount = AllocationCounter::stop();
    // Ripples under way during the counted frames; the touches are not counted.
    vi::Application::handleMouseDown(kWidth / 3, kHeight / 2);
    for (int i = 0; i < kWarmUpFrames; ++i) {
        vi::Application::handleMouseMove(kWidth / 3 + i * 8, kHeight / 2 - i * 8);
        vi::Application::handleDraw();
    }
    vi::Application::handleMouseUp(kWidth / 3, kHeight / 2);
    vi::Application::handleDraw();
    glFinish();

    const double start = wallSeconds();
    AllocationCounter::start();
    for (int i = 0; i < frames; ++i) vi::Application::handleDraw();
    result.count = AllocationCounter::stop();
    glFinish();
    result.millisecondsPerFrame = (wallSeconds() - start) * 1000.0 / frames;

    vi::Application::handleStop();
    delete wallpaper;
    vi::ApplicationVar::msTexturesMap.erase("wallpaper");
    return result;
}

}  // namespace vibench
