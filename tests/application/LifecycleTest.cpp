// Starting, initialising, re-orienting, restarting and stopping the scene, and
// the host's one-shot events.
#include <climits>
#include <cstring>

#include "RecordedScene.h"

using namespace apptest;
using vi::Application;
using vi::ApplicationVar;

// The host's entry point, called as the JVM would (it reads neither argument).
extern "C" int Java_com_tarq_android_visualeffect_common_Native_prehandleSetOrientation(void* env, void* thiz,
                                                                                        int orientation);

namespace {

bool sameTime(const timespec& a, const timespec& b) { return a.tv_sec == b.tv_sec && a.tv_nsec == b.tv_nsec; }

// A starting point no restart can produce, to see whether one happened.
const timespec kLongAgo = {1, 0};

}  // namespace

using Lifecycle = RecordedScene;

TEST_F(Lifecycle, StartClampsTheWindowAndGivesTheFactoryTheSizeAndBothMaps) {
    const char* names[] = {"sky", "glass"};
    testSceneSetNames(names, 2);
    std::vector<std::string>& returned = Application::handleStart(5, 7, 0, -3);
    EXPECT_EQ(windowRectangle(), (std::vector<int>{5, 7, 1, 1}));
    const std::vector<TestSceneEvent> created = eventsOf(TestSceneCreated);
    ASSERT_EQ(created.size(), 1u);
    EXPECT_EQ(created[0].a, 1);
    EXPECT_EQ(created[0].b, 1);
    EXPECT_EQ(testSceneLastModelsMap(), &ApplicationVar::msModelsMap);
    EXPECT_EQ(testSceneLastTexturesMap(), &ApplicationVar::msTexturesMap);
    ASSERT_NE(vi::gpScene, nullptr);
    EXPECT_EQ(&returned, &vi::gpScene->mNames);
    EXPECT_EQ(returned, (std::vector<std::string>{"sky", "glass"}));
}

TEST_F(Lifecycle, StartDeletesTheOldSceneAndLeavesTheNewOneUnready) {
    startReadyScene();
    testSceneSetDrawResult(3);
    Application::handleStart(0, 0, 540, 960);
    EXPECT_EQ(kindsOf(allEvents()), (std::vector<int>{TestSceneDestroyed, TestSceneCreated}));
    EXPECT_EQ(allEvents()[0].scene, 1);
    EXPECT_EQ(allEvents()[1].scene, 2);
    EXPECT_FALSE(Application::isReady());
    EXPECT_EQ(Application::handleDraw(), 0);
    Application::handleInitEffect();
    EXPECT_EQ(Application::handleDraw(), 3);
}

TEST_F(Lifecycle, InitialisingTwiceInitialisesOnceButRestartsTheClockBothTimes) {
    Application::handleStart(0, 0, 540, 960);
    vi::Timer::mStartingCnt = kLongAgo;
    Application::handleInitEffect();
    EXPECT_FALSE(sameTime(vi::Timer::mStartingCnt, kLongAgo));
    vi::Timer::mStartingCnt = kLongAgo;
    Application::handleInitEffect();
    EXPECT_FALSE(sameTime(vi::Timer::mStartingCnt, kLongAgo));
    EXPECT_EQ(testSceneCount(TestSceneInitEffect), 1);
    EXPECT_EQ(testSceneCount(TestSceneInitEffectAlternate), 0);
    EXPECT_TRUE(vi::gpScene->mInitialised[0]);
    EXPECT_FALSE(vi::gpScene->mInitialised[1]);
}

TEST_F(Lifecycle, SwitchToAnUninitialisedOrientationUnreadiesUntilInitialisedAndBackIsReadyAtOnce) {
    startReadyScene();
    Application::handleSetOrientation(vi::Orientation::Alternate);
    EXPECT_EQ(Application::handleDraw(), 0);
    Application::handleParam(1, 2);
    EXPECT_EQ(testSceneEventCount(), 0);
    Application::handleInitEffect();
    EXPECT_EQ(kindsOf(allEvents()), (std::vector<int>{TestSceneInitEffectAlternate}));
    Application::handleSetOrientation(vi::Orientation::Initial);
    Application::handleDraw();
    EXPECT_EQ(kindsOf(allEvents()), (std::vector<int>{TestSceneInitEffectAlternate, TestSceneDraw}));
    EXPECT_EQ(allEvents()[1].orientation, 0);
}

// The host may send any int: every value but 0 is the one alternate
// orientation, initialised once; the scene keeps the value as sent. Under
// ASan/UBSan a value used as an index is reported at once.
TEST_F(Lifecycle, EveryNonZeroOrientationFromTheHostIsTheOneAlternateOrientation) {
    startReadyScene();
    testSceneSetDrawResult(5);
    Java_com_tarq_android_visualeffect_common_Native_prehandleSetOrientation(nullptr, nullptr, 7);
    EXPECT_EQ(Application::handleDraw(), 0) << "not yet initialised for the alternate orientation";
    Application::handleInitEffect();
    for (int value : {7, -1, 2, INT_MAX, INT_MIN, 1, 0, INT_MIN}) {
        SCOPED_TRACE(value);
        Java_com_tarq_android_visualeffect_common_Native_prehandleSetOrientation(nullptr, nullptr, value);
        EXPECT_EQ(int(vi::gpScene->mOrientation), value);
        EXPECT_EQ(Application::handleDraw(), 5);
        Application::handleInitEffect();
    }
    EXPECT_EQ(testSceneCount(TestSceneInitEffectAlternate), 1);
    EXPECT_EQ(testSceneCount(TestSceneInitEffect), 0);
    EXPECT_EQ(testSceneCount(TestSceneDraw), 8);
}

TEST_F(Lifecycle, OneShotEventsReachOnlyAReadySceneAfterTheClock) {
    Application::handleStart(0, 0, 540, 960);
    Application::handleClearEffect();
    Application::handleAffordance();
    Application::handleUnlock();
    Application::handleParam(1, 2);
    EXPECT_EQ(testSceneCount(TestSceneCreated), 1);
    EXPECT_EQ(testSceneEventCount(), 1);

    Application::handleInitEffect();
    testSceneClearEvents();
    vi::AnimationManager::mNow = -1.0f;
    Application::handleAffordance();
    Application::handleUnlock();
    Application::handleParam(-5, 123456789);
    const std::vector<TestSceneEvent> events = allEvents();
    ASSERT_EQ(kindsOf(events),
              (std::vector<int>{TestSceneClearEffect, TestSceneAffordance, TestSceneUnlock, TestSceneParam}));
    for (const TestSceneEvent& event : events) EXPECT_GE(event.now, 0.0f);
    EXPECT_EQ(events[3].a, -5);
    EXPECT_EQ(events[3].b, 123456789);
}

TEST_F(Lifecycle, ClearEffectRestartsTheClockAfterTheScene) {
    startReadyScene();
    vi::Timer::mStartingCnt = kLongAgo;
    vi::AnimationManager::mNow = -1.0f;
    Application::handleClearEffect();
    const std::vector<TestSceneEvent> events = allEvents();
    ASSERT_EQ(kindsOf(events), (std::vector<int>{TestSceneClearEffect}));
    EXPECT_EQ(events[0].now, -1.0f) << "the clock is not advanced before the scene clears";
    EXPECT_FALSE(sameTime(vi::Timer::mStartingCnt, kLongAgo));
    EXPECT_GE(vi::AnimationManager::mNow, 0.0f);
}

