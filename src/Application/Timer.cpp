#include "Application/Timer.h"

#include <cstdint>

#include "Application/AnimationManager.h"

namespace vi {

timespec Timer::mStartingCnt = {0, 0};
timespec Timer::mCurrentCnt = {0, 0};

void Timer::restart() {
    clock_gettime(CLOCK_REALTIME, &mStartingCnt);
    mCurrentCnt = mStartingCnt;
    update();
}

void Timer::update() {
    clock_gettime(CLOCK_REALTIME, &mCurrentCnt);
    // Both differences as 32-bit signed values, each converted on its own and
    // combined in single precision: a negative nanosecond difference (a step
    // across a second boundary) is absorbed by the seconds.
    const std::int32_t seconds = std::int32_t(mCurrentCnt.tv_sec - mStartingCnt.tv_sec);
    const std::int32_t nanoseconds = std::int32_t(mCurrentCnt.tv_nsec - mStartingCnt.tv_nsec);
    AnimationManager::mNow = float(nanoseconds) * 1e-9f + float(seconds);
}

}  // namespace vi
