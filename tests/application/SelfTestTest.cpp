// The developer key 'T': a randomised run of the handlers. Its shape is checked
// against a replay of the same random sequence: how many scenes, which
// initialisations, how many frames, which touches where, and the window it
// leaves behind.
#include <stdlib.h>

#include "RecordedScene.h"
#include "SelfTestReplay.h"

using namespace apptest;
using vi::Application;
using vi::ApplicationVar;

namespace {

const Window kWindow = {10, 20, 300, 500};

class SelfTest : public RecordedScene {
protected:
    // Runs the key on a ready scene in kWindow and compares with the replay.
    Plan runAndCompare(long seed) {
        const Plan plan = replay(seed, kWindow);
        Application::handleStart(kWindow.left, kWindow.top, kWindow.width, kWindow.height);
        Application::handleInitEffect();
        testSceneClearEvents();
        srand48(seed);
        Application::handleKey(84);

        EXPECT_EQ(testSceneCount(TestSceneCreated), plan.scenes);
        EXPECT_EQ(testSceneCount(TestSceneDestroyed), plan.scenes);
        EXPECT_EQ(testSceneCount(TestSceneInitEffect), plan.initEffect);
        EXPECT_EQ(testSceneCount(TestSceneInitEffectAlternate), plan.initEffectAlternate);
        EXPECT_EQ(testSceneCount(TestSceneDraw), plan.frames);
        EXPECT_EQ(testSceneOverlaps(), 0);

        std::vector<std::pair<int, int>> sizes;
        std::vector<Touch> touches;
        for (const TestSceneEvent& event : allEvents()) {
            if (event.kind == TestSceneCreated) sizes.emplace_back(event.a, event.b);
            if (event.kind == TestSceneTouchDown || event.kind == TestSceneTouchMove || event.kind == TestSceneTouchUp)
                touches.push_back({event.kind, glm::vec2(event.x, event.y)});
        }
        EXPECT_EQ(sizes, plan.sizes);
        EXPECT_EQ(touches.size(), plan.touches.size());
        for (std::size_t i = 0; i < std::min(touches.size(), plan.touches.size()); ++i) {
            EXPECT_EQ(touches[i].kind, plan.touches[i].kind) << "touch " << i;
            EXPECT_EQ(touches[i].point, plan.touches[i].point) << "touch " << i;
        }
        EXPECT_EQ(ApplicationVar::msWindowLeft, plan.window.left);
        EXPECT_EQ(ApplicationVar::msWindowTop, plan.window.top);
        EXPECT_EQ(ApplicationVar::msWindowWidth, plan.window.width);
        EXPECT_EQ(ApplicationVar::msWindowHeight, plan.window.height);
        EXPECT_EQ(vi::gpScene->mOrientation, plan.orientation);
        EXPECT_TRUE(Application::isReady());
        EXPECT_EQ(lrand48(), plan.nextDraw) << "as many numbers drawn as the replay draws";
        return plan;
    }
};

}  // namespace

TEST_F(SelfTest, EndingWithOrientationRestartsMatchesTheReplay) {
    const Plan plan = runAndCompare(findSeed(kWindow, [](const Plan& p) { return p.variant == 0 && p.phase1Passes > 1; }));
    EXPECT_GT(plan.initEffectAlternate, 0);
}

TEST_F(SelfTest, EndingWithSeparateGesturesMatchesTheReplay) {
    runAndCompare(findSeed(kWindow, [](const Plan& p) { return p.variant == 1; }));
}

TEST_F(SelfTest, EndingWithRandomWindowsLeavesTheLastRectangleOfAtLeastOnePixel) {
    const Plan plan = runAndCompare(findSeed(kWindow, [](const Plan& p) {
        return p.variant == 2 && p.sizes.size() > p.phase1Passes + 1;
    }));
    EXPECT_LT(ApplicationVar::msWindowLeft, 1080);
    EXPECT_LT(ApplicationVar::msWindowTop, 1920);
    EXPECT_GE(ApplicationVar::msWindowWidth, 1);
    EXPECT_LT(ApplicationVar::msWindowWidth, 1080);
    EXPECT_GE(ApplicationVar::msWindowHeight, 1);
    EXPECT_LT(ApplicationVar::msWindowHeight, 1920);
    EXPECT_NE(plan.window.width, kWindow.width);
}

