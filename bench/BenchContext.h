#pragma once

// The GL contexts the figures are measured on: real headless EGL contexts on
// the machine's driver. The main one serves the frame, render and host-image
// figures; the recovery figures destroy and re-create contexts, so they get
// one of their own, and the sample's frames want a window-sized surface.
// Every figure builds its GL objects in its setup and deletes them again at
// its end, so that the runtime's registries hold only its own objects while it runs.

#include "GlContext.h"

namespace vibench {

// Made on first use (64 x 64), current after the call.
vitest::GlContext& mainContext();
// Made on first use (64 x 64), current after the call.
vitest::GlContext& recoveryContext();

// Fails the run loudly: a figure that measured something else than intended
// must not print a ratio.
[[noreturn]] void benchFail(const char* what);

}  // namespace vibench
