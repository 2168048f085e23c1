#pragma once

// The animation clock: seconds of CLOCK_REALTIME since the last restart, kept
// in vi::AnimationManager::mNow. Called with the application lock held.

#include <time.h>

#include "Tools/Export.h"

namespace vi {

class VI_EXPORT Timer {
public:
    static void restart();
    static void update();

    static timespec mStartingCnt;
    static timespec mCurrentCnt;
};

}  // namespace vi
