#include "Application/Application.h"

#include <cstddef>
#include <cstdio>
#include <cstdlib>

#include "Application/AnimationManager.h"
#include "Application/ApplicationLock.h"
#include "Application/ApplicationVar.h"
#include "Application/ContextRecovery.h"
#include "Application/Timer.h"
#include "Render/Texture.h"

namespace vi {

namespace {

// Every handler that acts only on a ready scene has this shape: the lock for
// the whole run, the ready test, then `action` on the scene. Its result, or a
// default one (0 for a frame) when the scene is not ready.
template <typename Action>
auto withReadyScene(Action action) -> decltype(action(*gpScene)) {
    ApplicationLock lock;
    if (!Application::isReady()) return decltype(action(*gpScene))();
    return action(*gpScene);
}

// A width or height below 1 becomes 1, so that normalising a touch never
// divides by zero.
void storeWindowRectangle(int left, int top, int width, int height) {
    ApplicationVar::msWindowLeft = left;
    ApplicationVar::msWindowTop = top;
    ApplicationVar::msWindowWidth = width < 1 ? 1 : width;
    ApplicationVar::msWindowHeight = height < 1 ? 1 : height;
}

// The entry of mInitialised for the scene's current orientation: any value
// the host sent maps to one of the two entries, never past them.
bool& initialisedForCurrentOrientation(Scene& scene) {
    return scene.mInitialised[Orientation::initialisedIndex(scene.mOrientation)];
}

// A start up to the new scene; callers hold the lock.
void startScene(int left, int top, int width, int height) {
    storeWindowRectangle(left, top, width, height);
    Timer::restart();
    ContextRecovery::invalidateIfLost();
    // Not cleared after the delete: the factory's result overwrites it at once.
    if (gpScene) delete gpScene;
    int size[2] = {ApplicationVar::msWindowWidth, ApplicationVar::msWindowHeight};
    gpScene = gCreateScene(size, &ApplicationVar::msModelsMap, &ApplicationVar::msTexturesMap);
}

// handleStop and destroyScene are one operation. Only invalidates GL names:
// the next ready frame re-creates them in whatever context is current then.
void stopScene() {
    ApplicationLock lock;
    ContextRecovery::invalidateIfLost();
    if (gpScene) delete gpScene;
    gpScene = nullptr;
}

// The count is taken once: an animation added by an update waits for the next
// frame. The clock is read afresh for each call, since an update may move it.
void updateAnimations() {
    const std::size_t count = AnimationManager::mStorage.size();
    for (std::size_t i = 0; i < count; ++i) AnimationManager::mStorage[i]->update(AnimationManager::mNow);
}

void deliverTouch(int x, int y, void (Scene::*operation)(const glm::vec2&)) {
    withReadyScene([&](Scene& scene) {
        Timer::update();
        (scene.*operation)(Application::mouseNormalize(x, y));
    });
}

}  // namespace

bool Application::isReady() { return gpScene && initialisedForCurrentOrientation(*gpScene); }

glm::vec2 Application::mouseNormalize(int x, int y) {
    // y is flipped: the bottom edge of the window is 0, the top edge 1.
    return glm::vec2(float(x - ApplicationVar::msWindowLeft) / float(ApplicationVar::msWindowWidth),
                     1.0f - float(y - ApplicationVar::msWindowTop) / float(ApplicationVar::msWindowHeight));
}

// --- Lifecycle ---------------------------------------------------------------

std::vector<std::string>& Application::handleStart(int left, int top, int width, int height) {
    ApplicationLock lock;
    startScene(left, top, width, height);
    return gpScene->mNames;
}

void Application::handleStart(int left, int top, int width, int height, std::vector<std::string>& namesCopy) {
    ApplicationLock lock;
    startScene(left, top, width, height);
    // A count no vector can hold cannot be copied: the host gets no answer.
    if (gpScene->mNames.size() > namesCopy.max_size()) {
        std::puts("out of memory\n");
        std::abort();
    }
    namesCopy = gpScene->mNames;
}

// The context is not checked here, deliberately (start, stop, draw and the
// host's image loading check it): right after a context change, objects that
// outlive a scene (shared programs, host images, the scene's own renderers
// after a restart) still hold names of the old context, and an initialisation
// that binds them binds stale names. The next ready frame notices the change
// and rebuilds every object, including what the initialisation made.
void Application::handleInitEffect() {
    ApplicationLock lock;
    if (!gpScene) return;
    // Restarted also when the scene is already initialised.
    Timer::restart();
    bool& initialised = initialisedForCurrentOrientation(*gpScene);
    if (initialised) return;
    if (gpScene->mOrientation == Orientation::Initial)
        gpScene->initEffect();
    else
        gpScene->initEffectAlternate();
    initialised = true;
}

// No lock and no word to the scene, on purpose: the host sets the rectangle
// from its own thread when the window moves.
void Application::handleWindowRectangle(int left, int top, int width, int height) {
    storeWindowRectangle(left, top, width, height);
}

// Two lock sections in a row, never nested: another thread's handler may run
// between the creation and the initialisation of the new scene.
void Application::handleRestart() {
    handleStart(ApplicationVar::msWindowLeft, ApplicationVar::msWindowTop, ApplicationVar::msWindowWidth,
                ApplicationVar::msWindowHeight);
    handleInitEffect();
}

void Application::handleStop() { stopScene(); }

void Application::destroyScene() { stopScene(); }

// --- One-shot events ---------------------------------------------------------

// The clock restarts after the scene cleared, and is not advanced before.
void Application::handleClearEffect() {
    withReadyScene([](Scene& scene) {
        scene.clearEffect();
        Timer::restart();
    });
}

// Needs a scene but not a ready one. The aspect comes from the scene's own
// size, never from the window. No initialisation here: a scene switched to an
// orientation it was never initialised for waits for handleInitEffect.
void Application::handleSetOrientation(Orientation::OrientationEnum orientation) {
    ApplicationLock lock;
    if (!gpScene) return;
    Timer::update();
    if (orientation == gpScene->mOrientation) return;
    gpScene->mAspect = gpScene->mSize.x / gpScene->mSize.y;
    gpScene->mOrientation = orientation;
    if (gpScene->mAspect < 1.0f)
        gpScene->mScale = glm::vec2(1.0f, gpScene->mSize.y / gpScene->mSize.x);
    else
        gpScene->mScale = glm::vec2(gpScene->mAspect, 1.0f);
}

void Application::handleAffordance() {
    withReadyScene([](Scene& scene) {
        Timer::update();
        scene.clearEffect();
        scene.affordance();
    });
}

void Application::handleUnlock() {
    withReadyScene([](Scene& scene) {
        Timer::update();
        scene.unlock();
    });
}

void Application::handleParam(int a, int b) {
    withReadyScene([&](Scene& scene) {
        Timer::update();
        scene.param(a, b);
    });
}

// --- Frames and touches ------------------------------------------------------

// Not ready: 0, and neither the context nor the clock is touched.
int Application::handleDraw() {
    return withReadyScene([](Scene& scene) {
        ContextRecovery::recoverIfLost();
        Timer::update();
        updateAnimations();
        return scene.draw();
    });
}

void Application::handleMouseDown(int x, int y) { deliverTouch(x, y, &Scene::touchDown); }

void Application::handleMouseUp(int x, int y) { deliverTouch(x, y, &Scene::touchUp); }

void Application::handleMouseMove(int x, int y) { deliverTouch(x, y, &Scene::touchMove); }

// --- Texture recycling -------------------------------------------------------

// No lock, on purpose: the host calls it on the render thread between frames.
// A static texture has its pixels in GL already; a dynamic one re-uploads on
// every bind and keeps them. A buffer that is not deletable belongs to whoever
// handed it in: only the pointer is dropped.
void Application::handleRecycleTextures() {
    for (Texture* texture : Texture::mAllTextures) {
        if (texture->mIsStatic) {
            if (texture->mIsDeletable) free(texture->mBuffer);
            texture->mBuffer = nullptr;
        }
    }
}

}  // namespace vi
