#pragma once

// An opacity that moves towards a target at a fixed rate, for the gem that
// fades out on unlock and back in when the scene is cleared. Lives in
// vi::AnimationManager::mStorage; clock restarts are handled as in SpinAnimation.

#include "Application/Animation.h"

namespace vi {

class FadeAnimation : public Animation {
public:
    FadeAnimation(float value, float seconds) : mValue(value), mTarget(value), mSeconds(seconds) {}

    void restart() override { mLastNow = 0.0f; }
    void update(float now) override;

    void setTarget(float target) { mTarget = target; }
    float target() const { return mTarget; }
    float value() const { return mValue; }

private:
    float mValue;
    float mTarget;
    float mSeconds;  // time for a full 0 to 1 change
    float mLastNow = 0.0f;
};

}  // namespace vi
