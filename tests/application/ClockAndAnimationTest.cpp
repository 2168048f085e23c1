// The animation clock and the per-frame animation update.
#include <cstdint>

#include "RecordedScene.h"

using namespace apptest;
using vi::AnimationManager;
using vi::Application;
using vi::Timer;

namespace {

// The clock as the runtime must compute it from its two readings.
float expectedNow() {
    const std::int32_t seconds = std::int32_t(Timer::mCurrentCnt.tv_sec - Timer::mStartingCnt.tv_sec);
    const std::int32_t nanoseconds = std::int32_t(Timer::mCurrentCnt.tv_nsec - Timer::mStartingCnt.tv_nsec);
    return float(nanoseconds) * 1e-9f + float(seconds);
}

}  // namespace

TEST(Clock, SecondsAndNanosecondsAreConvertedSeparatelyInSinglePrecision) {
    timespec now;
    clock_gettime(CLOCK_REALTIME, &now);
    // A long run with a negative nanosecond difference: at a million seconds a
    // float keeps sixteenths, so the result is the single-precision sum.
    Timer::mStartingCnt = {now.tv_sec - 1000003, 999999999};
    Timer::update();
    const float now32 = AnimationManager::mNow;
    EXPECT_EQ(now32, expectedNow());
    const double combined = double(Timer::mCurrentCnt.tv_sec - Timer::mStartingCnt.tv_sec) +
                            double(Timer::mCurrentCnt.tv_nsec - Timer::mStartingCnt.tv_nsec) * 1e-9;
    EXPECT_NEAR(now32, combined, 0.07);
}

namespace {

// Notes its calls in a shared log; may change the clock or add an animation.
class LoggingAnimation : public vi::Animation {
public:
    LoggingAnimation(int id, std::vector<std::pair<int, float>>& log) : mId(id), mLog(log) {}
    void update(float now) override {
        mLog.emplace_back(mId, now);
        if (mClockShift != 0.0f) AnimationManager::mNow += mClockShift;
        if (mToAdd) AnimationManager::mStorage.push_back(mToAdd);
        mToAdd = nullptr;
    }

    float mClockShift = 0.0f;
    vi::Animation* mToAdd = nullptr;

private:
    int mId;
    std::vector<std::pair<int, float>>& mLog;
};

}  // namespace

using Animations = RecordedScene;

TEST_F(Animations, ReadyFrameUpdatesEachInOrderWithTheClockReadAfreshBeforeTheScene) {
    std::vector<std::pair<int, float>> log;
    LoggingAnimation first(1, log), second(2, log), third(3, log), late(4, log);
    first.mClockShift = 100.0f;
    second.mToAdd = &late;
    AnimationManager::mStorage = {&first, &second, &third};
    Application::handleStart(0, 0, 540, 960);
    Application::handleDraw();
    EXPECT_TRUE(log.empty()) << "no update before the scene is ready";

    Application::handleInitEffect();
    Application::handleDraw();
    ASSERT_EQ(log.size(), 3u) << "an animation added during the loop waits for the next frame";
    EXPECT_EQ(log[0].first, 1);
    EXPECT_EQ(log[1].first, 2);
    EXPECT_EQ(log[2].first, 3);
    EXPECT_GE(log[0].second, 0.0f);
    EXPECT_LT(log[0].second, 100.0f);
    EXPECT_EQ(log[1].second, log[0].second + 100.0f);
    EXPECT_EQ(log[2].second, log[1].second);
    EXPECT_EQ(eventsOf(TestSceneDraw).back().now, log[2].second) << "animations run before the scene draws";

    log.clear();
    first.mClockShift = 0.0f;
    Application::handleDraw();
    ASSERT_EQ(log.size(), 4u);
    EXPECT_EQ(log[3].first, 4);
}
