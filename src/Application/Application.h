#pragma once

// The static handlers the JNI entry points forward to. Each takes the
// application lock for its whole run (except handleWindowRectangle and
// handleRecycleTextures, on purpose), acts only on a ready scene where it says
// so, updates the clock and calls one operation of the scene.

#include <string>
#include <vector>

#include <glm/glm.hpp>

#include "Application/Orientation.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT Application {
public:
    // Lifecycle and one-shot events.
    static std::vector<std::string>& handleStart(int left, int top, int width, int height);
    // The same start, with the new scene's names copied before the lock is
    // released: a stop on another thread cannot free them under the copy.
    // What the host's start entry point uses.
    static void handleStart(int left, int top, int width, int height, std::vector<std::string>& namesCopy);
    static void handleInitEffect();
    static void handleWindowRectangle(int left, int top, int width, int height);
    static void handleRestart();
    static void handleStop();
    static void destroyScene();
    static void handleClearEffect();
    static void handleSetOrientation(Orientation::OrientationEnum orientation);
    static void handleAffordance();
    static void handleUnlock();
    static void handleParam(int a, int b);

    // Frames and touches.
    static int handleDraw();
    static void handleMouseDown(int x, int y);
    static void handleMouseUp(int x, int y);
    static void handleMouseMove(int x, int y);

    // Keys, including the developer keys.
    static void handleKey(unsigned int key);

    // Drops the client-side pixels of textures already uploaded. No lock.
    static void handleRecycleTextures();

    // Window pixels to the scene's coordinates: origin bottom left, y up.
    static glm::vec2 mouseNormalize(int x, int y);

    // True when a scene exists and is initialised for its current orientation.
    // Callers hold the lock.
    static bool isReady();
};

}  // namespace vi
