// The window rectangle, the normalisation of window pixels and the touch
// handlers. The defaults test runs first: it needs a process in which no
// handler has run yet (CTest gives each test its own process).
#include <climits>

#include "RecordedScene.h"

using namespace apptest;
using vi::Application;

TEST(DefaultWindow, IsFiveFortyByNineSixtyAtTheOriginAndNormalisesItsCentreToOneHalf) {
    EXPECT_EQ(windowRectangle(), (std::vector<int>{0, 0, 540, 960}));
    EXPECT_EQ(Application::mouseNormalize(270, 480), glm::vec2(0.5f, 0.5f));
    EXPECT_EQ(vi::gpScene, nullptr);
    EXPECT_EQ(vi::AnimationManager::mNow, 0.0f);
}

using WindowAndTouch = RecordedScene;

TEST_F(WindowAndTouch, WindowRectangleIsClampedAndNotToldToTheScene) {
    startReadyScene();
    Application::handleWindowRectangle(-3, -4, 0, -20);
    EXPECT_EQ(windowRectangle(), (std::vector<int>{-3, -4, 1, 1}));
    EXPECT_EQ(testSceneEventCount(), 0);
    EXPECT_EQ(vi::gpScene->mSize, glm::vec2(540.0f, 960.0f));
}

TEST_F(WindowAndTouch, TouchesUseTheWindowOffsetAndAdvanceTheClockFirst) {
    Application::handleStart(30, 40, 200, 100);
    Application::handleInitEffect();
    testSceneClearEvents();
    vi::AnimationManager::mNow = -7.0f;
    Application::handleMouseMove(80, 65);
    const std::vector<TestSceneEvent> moves = eventsOf(TestSceneTouchMove);
    ASSERT_EQ(moves.size(), 1u);
    EXPECT_EQ(glm::vec2(moves[0].x, moves[0].y), glm::vec2(0.25f, 0.75f));
    EXPECT_GE(moves[0].now, 0.0f);
}

