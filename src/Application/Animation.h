#pragma once

// Base of what vi::AnimationManager::mStorage holds. The runtime calls only
// update(), the fourth entry of the virtual table (two destructor entries,
// restart(), update()), once per ready frame with the clock in seconds.

namespace vi {

class Animation {
public:
    virtual ~Animation() {}
    virtual void restart() {}
    virtual void update(float now) = 0;
};

}  // namespace vi
