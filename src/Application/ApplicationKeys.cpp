// Key handling: the host's three keys go to the scene unchanged; four letter
// codes, which no host entry produces, are developer keys for driving the
// runtime by hand, kept exactly as they are (including the one that blocks).
#include "Application/Application.h"
#include "Application/ApplicationLock.h"
#include "Application/ApplicationVar.h"
#include "Application/SelfTestKey.h"
#include "Application/Timer.h"

namespace vi {

namespace {

const unsigned int kSelfTestKey = 'T';     // 84
const unsigned int kClearEffectKey = 'C';  // 67
const unsigned int kUnlockKey = 'U';       // 85
const unsigned int kAffordanceKey = 'A';   // 65

}  // namespace

void Application::handleKey(unsigned int key) {
    ApplicationLock lock;
    // No key, not even a developer key, acts before the scene is ready.
    if (!isReady()) return;
    Timer::update();
    if (key == kSelfTestKey) {
        // The handlers the test calls take the lock for themselves; it is
        // taken back before the guard releases it.
        lock.unlock();
        SelfTestKey::run();
        lock.lock();
    } else if (key == kClearEffectKey) {
        // handleClearEffect takes the plain, non-recursive lock this thread
        // already holds: the thread blocks for good. Kept so deliberately.
        handleClearEffect();
    } else if (key == kUnlockKey) {
        gpScene->unlock();
    } else if (key == kAffordanceKey) {
        // Unlike handleAffordance, no clearEffect first: on purpose.
        gpScene->affordance();
    } else {
        gpScene->keyPressed(key);
    }
}

}  // namespace vi
