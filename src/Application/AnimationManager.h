#pragma once

#include <vector>

#include "Application/Animation.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT AnimationManager {
public:
    static float mNow;                         // seconds since the last timer restart
    static std::vector<Animation*> mStorage;  // updated once per ready frame, not owned
};

}  // namespace vi
