#include "SelfTestReplay.h"

#include <stdlib.h>

#include <algorithm>

#include "TestSceneRecord.h"

namespace apptest {

Plan replay(long seed, Window window) {
    Plan plan;
    plan.window = window;
    srand48(seed);
    auto count = [] { return unsigned(lrand48() % 100); };
    auto touch = [&plan](int kind) {
        const long rx = lrand48();
        const long ry = lrand48();
        const Window& w = plan.window;
        const int x = w.left + int(rx % w.width);
        const int y = w.top + int(ry % w.height);
        plan.touches.push_back(
            {kind, glm::vec2(float(x - w.left) / float(w.width), 1.0f - float(y - w.top) / float(w.height))});
        ++plan.frames;
    };
    auto orientationRestarts = [&plan, &count] {
        const unsigned int n = count();
        for (unsigned int i = 0; i < n; ++i) {
            ++plan.scenes;
            plan.sizes.emplace_back(plan.window.width, plan.window.height);
            ++plan.initEffect;
            plan.orientation = int(i & 1);
            if (plan.orientation == 1) ++plan.initEffectAlternate;
            ++plan.frames;
        }
        return n;
    };

    plan.phase1Passes = orientationRestarts();

    const unsigned int gestures = count();
    for (unsigned int i = 0; i < gestures; ++i) {
        touch(TestSceneTouchDown);
        for (const unsigned int moves = count(); i < moves; ++i) touch(TestSceneTouchMove);
        touch(TestSceneTouchUp);
    }

    plan.variant = int(lrand48() % 3);
    if (plan.variant == 0) {
        orientationRestarts();
    } else if (plan.variant == 1) {
        const unsigned int n = count();
        for (unsigned int g = 0; g < n; ++g) {
            touch(TestSceneTouchDown);
            const unsigned int moves = count();
            for (unsigned int j = 0; j < moves; ++j) touch(TestSceneTouchMove);
            touch(TestSceneTouchUp);
        }
    } else {
        const unsigned int n = count();
        for (unsigned int k = 0; k < n; ++k) {
            ++plan.scenes;
            plan.sizes.emplace_back(plan.window.width, plan.window.height);
            ++plan.initEffect;
            plan.orientation = 0;
            plan.window.left = int(lrand48() % 1080);
            plan.window.top = int(lrand48() % 1920);
            plan.window.width = std::max(int(lrand48() % 1080), 1);
            plan.window.height = std::max(int(lrand48() % 1920), 1);
            ++plan.frames;
        }
    }
    plan.nextDraw = lrand48();
    return plan;
}

long findSeed(Window window, const std::function<bool(const Plan&)>& wanted) {
    for (long seed = 1;; ++seed)
        if (wanted(replay(seed, window))) return seed;
}

}  // namespace apptest
