#pragma once

// Notices that the host replaced (or dropped) the GL context and rebuilds every
// program, buffer, location and texture from what the renderers and textures
// keep on the client side. Run by the handlers under the lock, and by the
// host's texture loading without it. GL thread only.

#include "Tools/Export.h"

namespace vi {

class VI_EXPORT ContextRecovery {
public:
    // Detection with both probes, then invalidation when the context changed
    // or the probes failed: what start and stop run.
    static void invalidateIfLost();
    // The same, followed by re-creation when a context is current: what a
    // ready frame runs before the scene draws.
    static void recoverIfLost();
    // Contexts compared by identity only, no probes: what the host's texture
    // loading runs before it files a texture.
    static void recoverIfContextChanged();

    // The steps, for the entry points above and for tests.
    static bool isLost();      // detection, with probes
    static void invalidate();  // remembers the current context, forgets every GL name
    static void recreate();    // rebuilds in registry order; only when a context is current
};

}  // namespace vi
