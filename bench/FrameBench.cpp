// The frame figure: vi::Application::handleDraw of a ready scene whose draw
// does nothing, with the context intact and a few animations, against the
// irreducible work of such a frame written out by hand: the lock, the context
// handle, the two probes, one clock reading, the animation updates and the
// scene's draw.
#include "Application/AnimationManager.h"
#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Application/Timer.h"
#include "Bench.h"

namespace {

const int kBatch = 2000;  // frames per pass of each side: enough for the clock's resolution

struct EmptyScene : vi::Scene {
    explicit EmptyScene(const int* size) : vi::Scene(size) {}
    int draw() override { return 0; }
};

struct LinearAnimation : vi::Animation {
    LinearAnimation(float rate) : rate(rate) {}
    void update(float now) override { value = rate * now; }
    float rate, value = 0.0f;
};

// A started and initialised scene, one textured quad (so that the frame
// probes a program and a texture) and the animations; all gone at the end.
struct ReadyFrame {
    ReadyFrame() : program(vitest::quadVertexShader(), vibench::kTexturedFragment), quad(program, pixels, 16) {
        if (vi::Renderer::mAllRenderers.size() != 1 || vi::Texture::mAllTextures.size() != 1)
            vibench::benchFail("frame: the registries hold objects of another figure");
        quad.texture.allocate();
        for (LinearAnimation& animation : animations) vi::AnimationManager::mStorage.push_back(&animation);
        vi::gCreateScene = [](int* size, vi::ModelsMap*, vi::TexturesMap*) -> vi::Scene* { return new EmptyScene(size); };
        vi::Application::handleStart(0, 0, 64, 64);
        vi::Application::handleInitEffect();
        // The first frame finds a context it has not seen and rebuilds; from
        // then on the context is intact.
        vi::Application::handleDraw();
    }
    ~ReadyFrame() {
        vi::Application::handleStop();
        vi::AnimationManager::mStorage.clear();
    }

    unsigned int pixels[16 * 16] = {};
    vi::ShaderProgram program;
    vibench::TexturedQuad quad;
    std::vector<LinearAnimation> animations{0.5f, 1.5f, 2.5f, 3.5f};
};

void frame(benchmark::State& state) {
    vibench::mainContext();
    ReadyFrame ready;
    const EGLContext context = eglGetCurrentContext();
    const timespec start = vi::Timer::mStartingCnt;
    auto byHand = [&] {
        pthread_mutex_lock(&vi::ApplicationVar::msCriticalSection);
        int result = 0;
        if (vi::gpScene) {
            if (eglGetCurrentContext() == context) {
                benchmark::DoNotOptimize(glIsProgram(ready.program.program));
                benchmark::DoNotOptimize(glIsTexture(ready.quad.texture.mId));
            }
            timespec now;
            clock_gettime(CLOCK_REALTIME, &now);
            const float seconds =
                float(int(now.tv_sec - start.tv_sec)) + float(int(now.tv_nsec - start.tv_nsec)) * 1e-9f;
            for (vi::Animation* animation : vi::AnimationManager::mStorage) animation->update(seconds);
            result = vi::gpScene->draw();
        }
        pthread_mutex_unlock(&vi::ApplicationVar::msCriticalSection);
        benchmark::DoNotOptimize(result);
    };
    auto handleDraw = [] { benchmark::DoNotOptimize(vi::Application::handleDraw()); };
    vibench::PairedTimes times(state);
    for (auto _ : state) times.passBatches(kBatch, handleDraw, byHand);
    times.finish();
}

}  // namespace

BENCHMARK(frame)->Name("frame")->UseManualTime();
