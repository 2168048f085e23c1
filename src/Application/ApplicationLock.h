#pragma once

// Holds ApplicationVar::msCriticalSection from construction to destruction,
// so that every handler releases it on every path. unlock() and lock() exist
// for the one handler that gives it up midway (the self-test key) and must
// take it back before the guard ends. Internal to the runtime.

#include <pthread.h>

#include "Application/ApplicationVar.h"

namespace vi {

class ApplicationLock {
public:
    ApplicationLock() { lock(); }
    ~ApplicationLock() { unlock(); }

    ApplicationLock(const ApplicationLock&) = delete;
    ApplicationLock& operator=(const ApplicationLock&) = delete;

    void lock() { pthread_mutex_lock(&ApplicationVar::msCriticalSection); }
    void unlock() { pthread_mutex_unlock(&ApplicationVar::msCriticalSection); }
};

}  // namespace vi
