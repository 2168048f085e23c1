#include "FadeAnimation.h"

#include <glm/glm.hpp>

namespace vi {

void FadeAnimation::update(float now) {
    float delta = now - mLastNow;
    if (delta < 0.0f) delta = now > 0.0f ? now : 0.0f;
    mLastNow = now;
    float step = delta / mSeconds;
    mValue = mValue < mTarget ? glm::min(mValue + step, mTarget) : glm::max(mValue - step, mTarget);
}

}  // namespace vi
