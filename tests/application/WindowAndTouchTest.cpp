// The window rectangle, the normalisation of window pixels and the touch
// handlers. The defaults test runs first: it needs a process in which no
// handler has run yet (CTest gives each test its own process).
#include <climits>

#include "RecordedScene.h"

using namespace apptest;
using vi::Application;
using vi::ApplicationVar;

TEST(DefaultWindow, IsFiveFortyByNineSixtyAtTheOriginAndNormalisesItsCentreToOneHalf) {
    EXPECT_EQ(ApplicationVar::msWindowLeft, 0);
    EXPECT_EQ(ApplicationVar::msWindowTop, 0);
    EXPECT_EQ(ApplicationVar::msWindowWidth, 540);
    EXPECT_EQ(ApplicationVar::msWindowHeight, 960);
    EXPECT_EQ(Application::mouseNormalize(270, 480), glm::vec2(0.5f, 0.5f));
    EXPECT_EQ(vi::gpScene, nullptr);
    EXPECT_EQ(vi::AnimationManager::mNow, 0.0f);
}

using WindowAndTouch = RecordedScene;

TEST_F(WindowAndTouch, NormalisationFlipsYAndDoesNotClip) {
    Application::handleWindowRectangle(100, 200, 400, 800);
    EXPECT_EQ(Application::mouseNormalize(100, 200), glm::vec2(0.0f, 1.0f));
    EXPECT_EQ(Application::mouseNormalize(500, 1000), glm::vec2(1.0f, 0.0f));
    EXPECT_EQ(Application::mouseNormalize(300, 400), glm::vec2(0.5f, 0.75f));
    EXPECT_EQ(Application::mouseNormalize(37, 200).y, 1.0f);
    EXPECT_EQ(Application::mouseNormalize(37, 1000).y, 0.0f);
    EXPECT_EQ(Application::mouseNormalize(60, 1080), glm::vec2(-0.1f, 1.0f - 880.0f / 800.0f));
}

TEST_F(WindowAndTouch, WindowRectangleIsClampedAndNotToldToTheScene) {
    startReadyScene();
    Application::handleWindowRectangle(-3, -4, 0, -20);
    EXPECT_EQ(ApplicationVar::msWindowLeft, -3);
    EXPECT_EQ(ApplicationVar::msWindowTop, -4);
    EXPECT_EQ(ApplicationVar::msWindowWidth, 1);
    EXPECT_EQ(ApplicationVar::msWindowHeight, 1);
    EXPECT_EQ(testSceneEventCount(), 0);
    EXPECT_EQ(vi::gpScene->mSize, glm::vec2(540.0f, 960.0f));
}

TEST_F(WindowAndTouch, TouchesReachTheSceneNormalisedWithYUp) {
    startReadyScene();
    Application::handleMouseDown(0, 0);
    Application::handleMouseMove(-54, 1056);
    Application::handleMouseUp(540, 960);
    const std::vector<TestSceneEvent> events = allEvents();
    ASSERT_EQ(kindsOf(events), (std::vector<int>{TestSceneTouchDown, TestSceneTouchMove, TestSceneTouchUp}));
    EXPECT_EQ(glm::vec2(events[0].x, events[0].y), glm::vec2(0.0f, 1.0f));
    EXPECT_FLOAT_EQ(events[1].x, -0.1f);
    EXPECT_FLOAT_EQ(events[1].y, -0.1f);
    EXPECT_EQ(glm::vec2(events[2].x, events[2].y), glm::vec2(1.0f, 0.0f));
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

TEST_F(WindowAndTouch, TouchesAndFramesAreDroppedWithoutAReadyScene) {
    testSceneSetDrawResult(9);
    vi::AnimationManager::mNow = 42.0f;
    EXPECT_EQ(Application::handleDraw(), 0);
    Application::handleMouseDown(1, 1);
    Application::handleStart(0, 0, 540, 960);
    testSceneClearEvents();
    EXPECT_EQ(Application::handleDraw(), 0);
    Application::handleMouseDown(1, 1);
    Application::handleMouseMove(1, 1);
    Application::handleMouseUp(1, 1);
    EXPECT_EQ(testSceneEventCount(), 0);
    vi::AnimationManager::mNow = 42.0f;
    EXPECT_EQ(Application::handleDraw(), 0);
    EXPECT_EQ(vi::AnimationManager::mNow, 42.0f);
}

TEST_F(WindowAndTouch, DrawReturnsTheSceneResultUnchangedWithTheClockAdvanced) {
    startReadyScene();
    for (int result : {7, -1, INT_MIN, INT_MAX}) {
        testSceneSetDrawResult(result);
        vi::AnimationManager::mNow = -7.0f;
        EXPECT_EQ(Application::handleDraw(), result);
        EXPECT_GE(eventsOf(TestSceneDraw).back().now, 0.0f);
    }
    EXPECT_EQ(testSceneCount(TestSceneDraw), 4);
}
