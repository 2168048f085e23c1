#pragma once

// The ripple scene's own time line, in seconds, built from the runtime's clock
// (vi::AnimationManager::mNow). The runtime restarts its clock at every
// initialisation and after every clear, so mNow jumps back to about zero; this
// clock never goes backwards: a reading below the previous one counts as the
// time since the restart. Everything that moves in the scene is a function of
// this time and of the events, never of the wall clock.

namespace vi {

class SceneClock {
public:
    // Takes a reading of the runtime's clock; returns the scene time.
    float observe(float now);
    float time() const { return mTime; }

private:
    float mTime = 0.0f;
    float mLastNow = 0.0f;
};

}  // namespace vi
