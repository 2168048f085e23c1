#pragma once

// Counts heap allocations while switched on: every operator new, wherever it
// is called from, and every malloc, calloc and realloc, told apart by whether
// the call came from the code of a watched library (the runtime, a plug-in)
// or from elsewhere (the GL driver, the C library). The bench binary defines
// the allocation functions itself and forwards them to the C library's.

#include <cstddef>

namespace vibench {

struct AllocationCount {
    long news;             // operator new and new[], any caller
    long watchedMallocs;   // malloc family called from a watched library
    long otherMallocs;     // malloc family called from anywhere else
};

class AllocationCounter {
public:
    // Watches the executable code of the loaded library whose path contains
    // `pathPart`. False when no such library is loaded.
    static bool watchLibrary(const char* pathPart);
    static void start();
    static AllocationCount stop();
};

}  // namespace vibench
