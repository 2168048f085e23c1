#pragma once

// Counts heap allocations while switched on; the bench and the allocation
// test compile it in. It replaces the global operator new (every caller
// counts) and malloc (only calls from watched code count: the GL driver's and
// the C library's own bookkeeping is not the runtime's business). The runtime
// and the sample call neither calloc nor realloc. The sanitizers own malloc:
// under them only operator new counts.

namespace vibench {

// news: operator new and new[], any caller; mallocs: malloc called from watched code.
struct Allocations { long news, mallocs; };

namespace AllocationCounter {
// Watches the code of the loaded object (executable or library) holding `function`.
bool watchCodeOf(const void* function);
bool countsMallocs();
void start();
Allocations stop();
}  // namespace AllocationCounter

}  // namespace vibench
