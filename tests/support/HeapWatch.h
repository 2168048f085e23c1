#pragma once

// Tells a freed pixel buffer from a kept one by what the C heap has handed
// out before and after. Under AddressSanitizer the heap is not glibc's; there
// the sanitizer itself reports leaks and double frees, and these checks pass.

#include <malloc.h>

#include <cstddef>
#include <cstdlib>
#include <cstring>

namespace vitest {

// Big enough to stand out from any bookkeeping done meanwhile.
constexpr std::size_t kBigBuffer = 4u << 20;

inline void* bigBuffer(int fill) {
    void* buffer = std::malloc(kBigBuffer);
    std::memset(buffer, fill, kBigBuffer);
    return buffer;
}

class HeapWatch {
public:
    HeapWatch() : mBefore(inUse()) {}

    // At least `bytes` went back to the heap since construction.
    bool gaveBack(std::size_t bytes) const { return !kMeasurable || released() >= static_cast<long long>(bytes); }
    // Less than `bytes` went back.
    bool keptAll(std::size_t bytes) const { return !kMeasurable || released() < static_cast<long long>(bytes); }

private:
#if defined(__SANITIZE_ADDRESS__)
    static constexpr bool kMeasurable = false;
#else
    static constexpr bool kMeasurable = true;
#endif

    static long long inUse() {
        struct mallinfo2 info = mallinfo2();
        return static_cast<long long>(info.uordblks + info.hblkhd);
    }
    long long released() const { return mBefore - inUse(); }

    long long mBefore;
};

}  // namespace vitest
