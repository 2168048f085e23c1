#include "AllocationCounter.h"

#include <link.h>

#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <new>

extern "C" {
void* __libc_malloc(size_t size);
void* __libc_calloc(size_t count, size_t size);
void* __libc_realloc(void* pointer, size_t size);
void __libc_free(void* pointer);
}

namespace {

struct Range {
    std::uintptr_t begin;
    std::uintptr_t end;
};

const int kMaxRanges = 16;
Range gRanges[kMaxRanges];
std::atomic<int> gRangeCount(0);
std::atomic<bool> gCounting(false);
std::atomic<long> gNews(0);
std::atomic<long> gWatchedMallocs(0);
std::atomic<long> gOtherMallocs(0);

bool isWatched(const void* caller) {
    const std::uintptr_t address = reinterpret_cast<std::uintptr_t>(caller);
    const int count = gRangeCount.load(std::memory_order_relaxed);
    for (int i = 0; i < count; ++i)
        if (address >= gRanges[i].begin && address < gRanges[i].end) return true;
    return false;
}

void noteMalloc(const void* caller) {
    if (!gCounting.load(std::memory_order_relaxed)) return;
    if (isWatched(caller))
        gWatchedMallocs.fetch_add(1, std::memory_order_relaxed);
    else
        gOtherMallocs.fetch_add(1, std::memory_order_relaxed);
}

void noteNew() {
    if (gCounting.load(std::memory_order_relaxed)) gNews.fetch_add(1, std::memory_order_relaxed);
}

void* allocate(std::size_t size) {
    noteNew();
    void* pointer = __libc_malloc(size ? size : 1);
    if (!pointer) throw std::bad_alloc();
    return pointer;
}

int addRanges(dl_phdr_info* info, size_t, void* data) {
    const char* pathPart = static_cast<const char*>(data);
    if (!info->dlpi_name || !std::strstr(info->dlpi_name, pathPart)) return 0;
    for (int i = 0; i < info->dlpi_phnum; ++i) {
        const ElfW(Phdr)& header = info->dlpi_phdr[i];
        if (header.p_type != PT_LOAD || !(header.p_flags & PF_X)) continue;
        const int index = gRangeCount.load();
        if (index == kMaxRanges) return 1;
        gRanges[index].begin = info->dlpi_addr + header.p_vaddr;
        gRanges[index].end = gRanges[index].begin + header.p_memsz;
        gRangeCount.store(index + 1);
    }
    return 1;
}

}  // namespace

extern "C" {

void* malloc(size_t size) {
    noteMalloc(__builtin_return_address(0));
    return __libc_malloc(size);
}

void* calloc(size_t count, size_t size) {
    noteMalloc(__builtin_return_address(0));
    return __libc_calloc(count, size);
}

void* realloc(void* pointer, size_t size) {
    noteMalloc(__builtin_return_address(0));
    return __libc_realloc(pointer, size);
}

void free(void* pointer) { __libc_free(pointer); }

}  // extern "C"

void* operator new(std::size_t size) { return allocate(size); }
void* operator new[](std::size_t size) { return allocate(size); }
void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    noteNew();
    return __libc_malloc(size ? size : 1);
}
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept {
    noteNew();
    return __libc_malloc(size ? size : 1);
}
void operator delete(void* pointer) noexcept { __libc_free(pointer); }
void operator delete[](void* pointer) noexcept { __libc_free(pointer); }
void operator delete(void* pointer, std::size_t) noexcept { __libc_free(pointer); }
void operator delete[](void* pointer, std::size_t) noexcept { __libc_free(pointer); }

namespace vibench {

bool AllocationCounter::watchLibrary(const char* pathPart) {
    const int before = gRangeCount.load();
    dl_iterate_phdr(addRanges, const_cast<char*>(pathPart));
    return gRangeCount.load() > before;
}

void AllocationCounter::start() {
    gNews = 0;
    gWatchedMallocs = 0;
    gOtherMallocs = 0;
    gCounting = true;
}

AllocationCount AllocationCounter::stop() {
    gCounting = false;
    return AllocationCount{gNews.load(), gWatchedMallocs.load(), gOtherMallocs.load()};
}

}  // namespace vibench
