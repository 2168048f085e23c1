#include "AllocationCounter.h"

#include <link.h>

#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <new>

namespace {

const int kMaxRanges = 8;
std::uintptr_t gRanges[kMaxRanges][2];  // watched code: [begin, end)
std::atomic<int> gRangeCount{0};
std::atomic<bool> gCounting{false};
std::atomic<long> gNews{0};
std::atomic<long> gMallocs{0};

// dl_iterate_phdr callback: watches the loaded segment that holds `function`.
int watchSegmentHolding(dl_phdr_info* info, size_t, void* function) {
    const auto address = reinterpret_cast<std::uintptr_t>(function);
    for (int i = 0; i < info->dlpi_phnum && gRangeCount < kMaxRanges; ++i) {
        const ElfW(Phdr)& segment = info->dlpi_phdr[i];
        const std::uintptr_t begin = info->dlpi_addr + segment.p_vaddr;
        if (segment.p_type != PT_LOAD || address < begin || address >= begin + segment.p_memsz) continue;
        gRanges[gRangeCount][0] = begin;
        gRanges[gRangeCount][1] = begin + segment.p_memsz;
        return ++gRangeCount;
    }
    return 0;
}

}  // namespace

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
bool vibench::AllocationCounter::countsMallocs() { return false; }
static void* heapAllocate(std::size_t size) { return std::malloc(size); }
#else
bool vibench::AllocationCounter::countsMallocs() { return true; }
extern "C" void* __libc_malloc(size_t size);
// Not through malloc, so that operator new's own call is not counted again.
static void* heapAllocate(std::size_t size) { return __libc_malloc(size); }

extern "C" void* malloc(size_t size) {
    const auto caller = reinterpret_cast<std::uintptr_t>(__builtin_return_address(0));
    for (int i = 0; gCounting && i < gRangeCount; ++i)
        if (caller >= gRanges[i][0] && caller < gRanges[i][1]) {
            ++gMallocs;
            break;
        }
    return __libc_malloc(size);
}
#endif

// Every form that the replaced deletes free, the nothrow ones too: the GL
// driver's compiler allocates with those and frees through operator delete.
void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    if (gCounting) ++gNews;
    return heapAllocate(size ? size : 1);
}
void* operator new[](std::size_t size, const std::nothrow_t& tag) noexcept { return operator new(size, tag); }
void* operator new(std::size_t size) {
    if (void* pointer = operator new(size, std::nothrow)) return pointer;
    throw std::bad_alloc();
}
void* operator new[](std::size_t size) { return operator new(size); }
void operator delete(void* pointer) noexcept { std::free(pointer); }
void operator delete[](void* pointer) noexcept { std::free(pointer); }
void operator delete(void* pointer, std::size_t) noexcept { std::free(pointer); }
void operator delete[](void* pointer, std::size_t) noexcept { std::free(pointer); }

namespace vibench {

bool AllocationCounter::watchCodeOf(const void* function) {
    return dl_iterate_phdr(watchSegmentHolding, const_cast<void*>(function)) != 0;
}

void AllocationCounter::start() {
    gNews = 0;
    gMallocs = 0;
    gCounting = true;
}

Allocations AllocationCounter::stop() {
    gCounting = false;
    return Allocations{gNews, gMallocs};
}

}  // namespace vibench
