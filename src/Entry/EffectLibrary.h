#pragma once

// The effect plug-in the runtime loads with the dynamic loader. Remembers, for
// the life of the process, the last path it opened and the handle it got, so
// that the same path is opened only once; plug-ins are never closed. Writes
// vi::gCreateScene. Called by the host's start entry point only.

#include <string>

#include "Tools/Export.h"

namespace vi {

class VI_HIDDEN EffectLibrary {
public:
    // Makes vi::gCreateScene the factory of the plug-in at `path`, opening it
    // and looking the factory up unless the remembered handle stands for it.
    // False when the plug-in cannot be opened or has no "createScene".
    static bool load(const char* path);

    static std::string mPath;  // empty until the first open
    static void* mHandle;      // null until an open succeeds; null again when another path comes
};

}  // namespace vi
