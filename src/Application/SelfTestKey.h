#pragma once

// The developer key 'T': a randomised self-test that hammers the handlers
// exactly as the host would, each handler taking the lock for itself, with
// random numbers from lrand48() (never seeded by the runtime). Run by the key
// handler with the lock released. Internal to the runtime.

#include "Tools/Export.h"

namespace vi {

class VI_HIDDEN SelfTestKey {
public:
    static void run();
};

}  // namespace vi
