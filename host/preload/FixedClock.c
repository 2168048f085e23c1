/* A clock the player sets, preloaded into its JVM for fixed-step renders.
 *
 * The runtime reads clock_gettime(CLOCK_REALTIME). Preloaded, this definition
 * comes first in the process's lookup order, so the runtime's calls reach it
 * without any change to the runtime. Until the player engages it, every
 * reading is the real one; once engaged, CLOCK_REALTIME reads exactly what
 * the player last set, and the other clocks stay real (the JVM times itself
 * with CLOCK_MONOTONIC). */
#define _GNU_SOURCE
#include <dlfcn.h>
#include <stdatomic.h>
#include <stdint.h>
#include <time.h>

typedef int (*ClockFunction)(clockid_t, struct timespec*);

static atomic_int gEngaged;
static _Atomic int64_t gNanoseconds;

static ClockFunction realClock(void) {
    static _Atomic(ClockFunction) real;
    ClockFunction function = atomic_load(&real);
    if (!function) {
        function = (ClockFunction)dlsym(RTLD_NEXT, "clock_gettime");
        atomic_store(&real, function);
    }
    return function;
}

__attribute__((visibility("default"))) void vi_fixed_clock_set(int64_t nanoseconds) {
    atomic_store(&gNanoseconds, nanoseconds);
    atomic_store(&gEngaged, 1);
}

__attribute__((visibility("default"))) int clock_gettime(clockid_t clock, struct timespec* time) {
    if (clock == CLOCK_REALTIME && atomic_load(&gEngaged)) {
        const int64_t now = atomic_load(&gNanoseconds);
        time->tv_sec = (time_t)(now / 1000000000);
        time->tv_nsec = (long)(now % 1000000000);
        return 0;
    }
    return realClock()(clock, time);
}
