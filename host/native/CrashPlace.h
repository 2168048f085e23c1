// Where a crash happened, in an author's terms: from the faulting frame out,
// the first place on the stack in the effect's own sources (not a system
// header, not the kit's helpers or headers), with its frame's function, read from the plug-in's debug
// information by addr2line. Runs in the crash handler: fixed buffers only.
#pragma once

#include <cstdint>
#include <string>

#include "FixedText.h"

class CrashPlace {
public:
    using Detail = FixedText<4096>;

    // The plug-in the runtime is about to open: its frames are the effect's.
    // The file is held open, so that its debug information can be read even
    // after the file itself has gone (the live window runs from copies).
    static void watchEffect(const std::string& path);
    // Loads the unwinder, which it does on its first use: call before any crash.
    static void prepare();
    // Appends "  in FUNCTION at FILE:LINE" and a line end to `detail`, or
    // the library and offset where there is no debug information. True when
    // the place is the effect's; else it is the innermost frame in any library.
    // `caller` is the return address of a call to `faulting` where no code
    // is (a bad function pointer), else 0.
    static bool describe(uintptr_t faulting, uintptr_t caller, Detail& detail);
};
