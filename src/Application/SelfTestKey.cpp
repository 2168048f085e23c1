#include "Application/SelfTestKey.h"

#include <stdlib.h>

#include "Application/Application.h"
#include "Application/ApplicationVar.h"

namespace vi {

namespace {

// The number of random draws never depends on the scene's state: a handler
// that finds no ready scene does nothing, and the loops go on.

enum class TouchKind { Down, Move, Up };

unsigned int drawCount() { return static_cast<unsigned int>(lrand48() % 100); }

void frame() { Application::handleDraw(); }

// rx and ry are both drawn, in this order, whatever the scene's state.
void touch(TouchKind kind) {
    const long rx = lrand48();
    const long ry = lrand48();
    const int x = ApplicationVar::msWindowLeft + int(rx % ApplicationVar::msWindowWidth);
    const int y = ApplicationVar::msWindowTop + int(ry % ApplicationVar::msWindowHeight);
    switch (kind) {
    case TouchKind::Down:
        Application::handleMouseDown(x, y);
        break;
    case TouchKind::Move:
        Application::handleMouseMove(x, y);
        break;
    case TouchKind::Up:
        Application::handleMouseUp(x, y);
        break;
    }
    frame();
}

void restartWithCurrentWindow() {
    Application::handleStart(ApplicationVar::msWindowLeft, ApplicationVar::msWindowTop, ApplicationVar::msWindowWidth,
                             ApplicationVar::msWindowHeight);
}

// Fresh scenes, switched to the orientations 0, 1, 0, 1, ... in turn.
void orientationRestarts() {
    const unsigned int n = drawCount();
    for (unsigned int i = 0; i < n; ++i) {
        restartWithCurrentWindow();
        Application::handleInitEffect();
        Application::handleSetOrientation(static_cast<Orientation::OrientationEnum>(i & 1));
        Application::handleInitEffect();
        frame();
    }
}

// The moves advance the phase's own counter, not one of their own: once it has
// reached a gesture's move count, later gestures make no moves until a fresh
// count lies above it again. Kept so on purpose.
void gesturesSharingOneCounter() {
    const unsigned int n = drawCount();
    unsigned int i = 0;
    while (i < n) {
        touch(TouchKind::Down);
        const unsigned int m = drawCount();
        while (i < m) {
            touch(TouchKind::Move);
            ++i;
        }
        touch(TouchKind::Up);
        ++i;
    }
}

void gesturesWithSeparateCounters() {
    const unsigned int n = drawCount();
    for (unsigned int gesture = 0; gesture < n; ++gesture) {
        touch(TouchKind::Down);
        const unsigned int m = drawCount();
        for (unsigned int move = 0; move < m; ++move) touch(TouchKind::Move);
        touch(TouchKind::Up);
    }
}

// Writes the window globals directly, without the lock and without
// handleWindowRectangle, on purpose; the last rectangle stays in force.
void randomWindowRectangles() {
    const unsigned int n = drawCount();
    for (unsigned int pass = 0; pass < n; ++pass) {
        restartWithCurrentWindow();
        Application::handleInitEffect();
        ApplicationVar::msWindowLeft = int(lrand48() % 1080);
        ApplicationVar::msWindowTop = int(lrand48() % 1920);
        ApplicationVar::msWindowWidth = int(lrand48() % 1080);
        if (ApplicationVar::msWindowWidth < 1) ApplicationVar::msWindowWidth = 1;
        ApplicationVar::msWindowHeight = int(lrand48() % 1920);
        if (ApplicationVar::msWindowHeight < 1) ApplicationVar::msWindowHeight = 1;
        Application::handleInitEffect();
        frame();
    }
}

}  // namespace

void SelfTestKey::run() {
    orientationRestarts();
    gesturesSharingOneCounter();
    switch (lrand48() % 3) {
    case 0:
        orientationRestarts();
        break;
    case 1:
        gesturesWithSeparateCounters();
        break;
    case 2:
        randomWindowRectangles();
        break;
    }
}

}  // namespace vi
