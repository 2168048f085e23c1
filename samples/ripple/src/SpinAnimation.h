#pragma once

// Turns the gem: an angle that grows at a steady rate with the runtime's
// clock. Lives in vi::AnimationManager::mStorage while the scene does; the
// runtime calls update() once per drawn frame. A clock restart (the reading
// goes back) adds only the time since the restart, so the gem never jumps back.

#include "Application/Animation.h"

namespace vi {

class SpinAnimation : public Animation {
public:
    explicit SpinAnimation(float radiansPerSecond) : mRate(radiansPerSecond) {}

    void restart() override;
    void update(float now) override;

    float angle() const { return mAngle; }

private:
    float mRate;
    float mAngle = 0.0f;
    float mLastNow = 0.0f;
};

}  // namespace vi
