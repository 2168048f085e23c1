#include "Application/Application.h"

#include <pthread.h>

#include <cstddef>
#include <cstdio>
#include <cstdlib>

#include "Application/AnimationManager.h"
#include "Application/ApplicationVar.h"
#include "Application/ContextRecovery.h"
#include "Application/Timer.h"
#include "Render/Texture.h"

namespace vi {

namespace {

void lock() { pthread_mutex_lock(&ApplicationVar::msCriticalSection); }
void unlock() { pthread_mutex_unlock(&ApplicationVar::msCriticalSection); }

// A width or height below 1 becomes 1, so that normalising a touch never
// divides by zero.
void storeWindowRectangle(int left, int top, int width, int height) {
    ApplicationVar::msWindowLeft = left;
    ApplicationVar::msWindowTop = top;
    ApplicationVar::msWindowWidth = width < 1 ? 1 : width;
    ApplicationVar::msWindowHeight = height < 1 ? 1 : height;
}

// The count is taken once: an animation added by an update waits for the next
// frame. The clock is read afresh for each call, since an update may move it.
void updateAnimations() {
    const std::size_t count = AnimationManager::mStorage.size();
    for (std::size_t i = 0; i < count; ++i) AnimationManager::mStorage[i]->update(AnimationManager::mNow);
}

// handleStop and destroyScene are one operation. Only invalidates GL names:
// the next ready frame re-creates them in whatever context is current then.
void stopScene() {
    lock();
    ContextRecovery::invalidateIfLost();
    if (gpScene) delete gpScene;
    gpScene = nullptr;
    unlock();
}

// The entry of mInitialised for the scene's current orientation: any value
// the host sent maps to one of the two entries, never past them.
bool& initialisedForCurrentOrientation(Scene& scene) {
    return scene.mInitialised[Orientation::initialisedIndex(scene.mOrientation)];
}

}  // namespace

bool Application::isReady() { return gpScene && initialisedForCurrentOrientation(*gpScene); }

glm::vec2 Application::mouseNormalize(int x, int y) {
    // y is flipped: the bottom edge of the window is 0, the top edge 1.
    return glm::vec2(float(x - ApplicationVar::msWindowLeft) / float(ApplicationVar::msWindowWidth),
                     1.0f - float(y - ApplicationVar::msWindowTop) / float(ApplicationVar::msWindowHeight));
}

// --- Lifecycle ---------------------------------------------------------------

namespace {

// Steps 2 to 6 of a start; callers hold the lock.
void startScene(int left, int top, int width, int height) {
    storeWindowRectangle(left, top, width, height);
    Timer::restart();
    ContextRecovery::invalidateIfLost();
    // Not cleared after the delete: the factory's result overwrites it at once.
    if (gpScene) delete gpScene;
    int size[2] = {ApplicationVar::msWindowWidth, ApplicationVar::msWindowHeight};
    gpScene = gCreateScene(size, &ApplicationVar::msModelsMap, &ApplicationVar::msTexturesMap);
}

}  // namespace

std::vector<std::string>& Application::handleStart(int left, int top, int width, int height) {
    lock();
    startScene(left, top, width, height);
    std::vector<std::string>& names = gpScene->mNames;
    unlock();
    return names;
}

void Application::handleStart(int left, int top, int width, int height, std::vector<std::string>& namesCopy) {
    lock();
    startScene(left, top, width, height);
    // A count no vector can hold cannot be copied: the host gets no answer.
    if (gpScene->mNames.size() > namesCopy.max_size()) {
        std::puts("out of memory\n");
        std::abort();
    }
    namesCopy = gpScene->mNames;
    unlock();
}

void Application::handleInitEffect() {
    lock();
    if (gpScene) {
        // Restarted also when the scene is already initialised.
        Timer::restart();
        bool& initialised = initialisedForCurrentOrientation(*gpScene);
        if (!initialised) {
            if (gpScene->mOrientation == Orientation::Initial)
                gpScene->initEffect();
            else
                gpScene->initEffectAlternate();
            initialised = true;
        }
    }
    unlock();
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

void Application::handleClearEffect() {
    lock();
    if (isReady()) {
        gpScene->clearEffect();
        Timer::restart();
    }
    unlock();
}

// Needs a scene but not a ready one. The aspect comes from the scene's own
// size, never from the window. No initialisation here: a scene switched to an
// orientation it was never initialised for waits for handleInitEffect.
void Application::handleSetOrientation(Orientation::OrientationEnum orientation) {
    lock();
    if (gpScene) {
        Timer::update();
        if (orientation != gpScene->mOrientation) {
            gpScene->mAspect = gpScene->mSize.x / gpScene->mSize.y;
            gpScene->mOrientation = orientation;
            if (gpScene->mAspect < 1.0f)
                gpScene->mScale = glm::vec2(1.0f, gpScene->mSize.y / gpScene->mSize.x);
            else
                gpScene->mScale = glm::vec2(gpScene->mAspect, 1.0f);
        }
    }
    unlock();
}

void Application::handleAffordance() {
    lock();
    if (isReady()) {
        Timer::update();
        gpScene->clearEffect();
        gpScene->affordance();
    }
    unlock();
}

void Application::handleUnlock() {
    lock();
    if (isReady()) {
        Timer::update();
        gpScene->unlock();
    }
    unlock();
}

void Application::handleParam(int a, int b) {
    lock();
    if (isReady()) {
        Timer::update();
        gpScene->param(a, b);
    }
    unlock();
}

// --- Frames and touches ------------------------------------------------------

int Application::handleDraw() {
    lock();
    if (!isReady()) {
        unlock();
        return 0;
    }
    ContextRecovery::recoverIfLost();
    Timer::update();
    updateAnimations();
    const int result = gpScene->draw();
    unlock();
    return result;
}

void Application::handleMouseDown(int x, int y) {
    lock();
    if (isReady()) {
        Timer::update();
        const glm::vec2 position = mouseNormalize(x, y);
        gpScene->touchDown(position);
    }
    unlock();
}

void Application::handleMouseUp(int x, int y) {
    lock();
    if (isReady()) {
        Timer::update();
        const glm::vec2 position = mouseNormalize(x, y);
        gpScene->touchUp(position);
    }
    unlock();
}

void Application::handleMouseMove(int x, int y) {
    lock();
    if (isReady()) {
        Timer::update();
        const glm::vec2 position = mouseNormalize(x, y);
        gpScene->touchMove(position);
    }
    unlock();
}

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
