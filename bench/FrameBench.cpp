// The frame figure: vi::Application::handleDraw of a ready scene whose draw
// does nothing, with the context intact and a few animations, against the
// irreducible work of such a frame written out by hand: the lock, the context
// handle, the two probes, one clock reading, the animation updates and the
// scene's draw.
#include <pthread.h>
#include <time.h>

#include <benchmark/benchmark.h>

#include <vector>

#include "Application/Animation.h"
#include "Application/AnimationManager.h"
#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Application/Scene.h"
#include "Application/Timer.h"
#include "BenchContext.h"
#include "BenchShaders.h"
#include "PairedTimes.h"
#include "Render/Drawable.h"
#include "Render/GL.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"

namespace {

const int kAnimations = 4;

class EmptyScene : public vi::Scene {
public:
    explicit EmptyScene(const int* size) : vi::Scene(size) {}
    int draw() override { return 0; }
};

vi::Scene* createEmptyScene(int* size, vi::ModelsMap*, vi::TexturesMap*) { return new EmptyScene(size); }

class LinearAnimation : public vi::Animation {
public:
    explicit LinearAnimation(float rate) : mRate(rate), mValue(0.0f) {}
    void update(float now) override { mValue = mRate * now; }

private:
    float mRate;
    float mValue;
};

// A started and initialised scene, one renderer (so the frame probes a
// program) and one allocated texture (so it probes a texture), and the
// animations; all gone again at the end of the run.
class ReadyFrame {
public:
    ReadyFrame()
        : mProgram(vibench::kQuadVertex, vibench::kQuadFragment),
          mRenderer(mProgram, mDrawable),
          mPixels(16 * 16, 0xFF336699u),
          mTexture(mPixels.data(), 16, 16, true, false, false, true, false, 4, false) {
        if (vi::Renderer::mAllRenderers.size() != 1 || vi::Texture::mAllTextures.size() != 1)
            vibench::benchFail("frame: the registries hold objects of another figure");
        mTexture.allocate();
        for (int i = 0; i < kAnimations; ++i) mAnimations.emplace_back(0.5f + float(i));
        for (LinearAnimation& animation : mAnimations) vi::AnimationManager::mStorage.push_back(&animation);
        vi::gCreateScene = createEmptyScene;
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

    GLuint programName() const { return mProgram.program; }
    GLuint textureName() const { return mTexture.mId; }

private:
    vi::ShaderProgram mProgram;
    vi::Drawable mDrawable;
    vi::Renderer mRenderer;
    std::vector<unsigned int> mPixels;
    vi::Texture mTexture;
    std::vector<LinearAnimation> mAnimations;
};

// Frames per batch of each side: enough for the clock's resolution.
const int kBatch = 2000;

void frame(benchmark::State& state) {
    vibench::mainContext();
    ReadyFrame frame;
    const EGLContext context = eglGetCurrentContext();
    const GLuint program = frame.programName();
    const GLuint texture = frame.textureName();
    const timespec start = vi::Timer::mStartingCnt;
    auto byHand = [&] {
        pthread_mutex_lock(&vi::ApplicationVar::msCriticalSection);
        int result = 0;
        if (vi::gpScene) {
            if (eglGetCurrentContext() == context) {
                benchmark::DoNotOptimize(glIsProgram(program));
                benchmark::DoNotOptimize(glIsTexture(texture));
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
    vibench::PairedTimes times(state);
    for (auto _ : state) times.pass(kBatch, [] { benchmark::DoNotOptimize(vi::Application::handleDraw()); }, byHand);
    times.finish();
}

}  // namespace

BENCHMARK(frame)->Name("frame")->UseManualTime();
