#include "SpinAnimation.h"

#include <cmath>

namespace vi {

void SpinAnimation::restart() {
    mAngle = 0.0f;
    mLastNow = 0.0f;
}

void SpinAnimation::update(float now) {
    float delta = now - mLastNow;
    if (delta < 0.0f) delta = now > 0.0f ? now : 0.0f;
    mLastNow = now;
    // Kept within one turn so the angle keeps its precision over hours.
    mAngle = std::fmod(mAngle + mRate * delta, 6.28318531f);
}

}  // namespace vi
