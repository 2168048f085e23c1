#pragma once

// A replay of the developer key 'T' from its random sequence: what the
// self-test must do to a ready scene in orientation 0 (every scene it makes
// starts there), given the seed and the window before the key.

#include <functional>
#include <utility>
#include <vector>

#include <glm/glm.hpp>

namespace apptest {

struct Window {
    int left, top, width, height;
};

struct Touch {
    int kind;  // TestSceneTouchDown, TestSceneTouchMove or TestSceneTouchUp
    glm::vec2 point;
};

struct Plan {
    unsigned int phase1Passes = 0;
    int variant = -1;
    int scenes = 0;
    int initEffect = 0;
    int initEffectAlternate = 0;
    int frames = 0;
    std::vector<std::pair<int, int>> sizes;  // given to the factory, in order
    std::vector<Touch> touches;
    Window window{};  // after the test
    int orientation = 0;
    long nextDraw = 0;  // the first number drawn after the test
};

// Seeds the generator with `seed` and draws what the self-test draws.
Plan replay(long seed, Window window);

// The first seed from 1 up whose replay is wanted.
long findSeed(Window window, const std::function<bool(const Plan&)>& wanted);

}  // namespace apptest
