#include "MemoryCeiling.h"

#include <sys/resource.h>
#include <sys/stat.h>

#include <limits>

// gcc names the sanitizers with macros, clang with __has_feature.
#if defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer) || __has_feature(memory_sanitizer)
#define VI_SANITIZED 1
#endif
#endif
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define VI_SANITIZED 1
#endif

namespace vi {

std::uint64_t MemoryCeiling::forInput(std::uint64_t inputBytes) {
    const std::uint64_t most = std::numeric_limits<std::uint64_t>::max();
    if (inputBytes > (most - kBaseBytes) / kBytesPerInputByte) return most;
    return kBaseBytes + kBytesPerInputByte * inputBytes;
}

void MemoryCeiling::apply(const std::string& inputPath) {
#ifndef VI_SANITIZED
    struct stat status;
    if (::stat(inputPath.c_str(), &status) != 0) return;  // the import says why
    rlimit limit;
    if (::getrlimit(RLIMIT_AS, &limit) != 0) return;
    const std::uint64_t ceiling = forInput(std::uint64_t(status.st_size));
    if (limit.rlim_cur != RLIM_INFINITY && limit.rlim_cur <= ceiling) return;
    limit.rlim_cur = rlim_t(ceiling);
    ::setrlimit(RLIMIT_AS, &limit);
#else
    (void)inputPath;
#endif
}

std::uint64_t MemoryCeiling::current() {
    rlimit limit;
    if (::getrlimit(RLIMIT_AS, &limit) != 0 || limit.rlim_cur == RLIM_INFINITY) return 0;
    return std::uint64_t(limit.rlim_cur);
}

}  // namespace vi
