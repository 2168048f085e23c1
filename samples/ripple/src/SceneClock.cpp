#include "SceneClock.h"

namespace vi {

float SceneClock::observe(float now) {
    float delta = now - mLastNow;
    if (delta < 0.0f) delta = now > 0.0f ? now : 0.0f;
    mTime += delta;
    mLastNow = now;
    return mTime;
}

}  // namespace vi
