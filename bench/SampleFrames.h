#pragma once

// Heap allocations per steady-state frame of the sample effect, driven
// through the application handlers on a window-sized headless context.

#include <string>

#include "AllocationCounter.h"

namespace vibench {

struct SampleFrames {
    bool loaded;            // false: the plug-in could not be opened
    int frames;             // frames counted
    AllocationCount count;  // over all counted frames
    AllocationCount setUpCount;  // the scene's start and initialisation, for comparison
    double millisecondsPerFrame;
};

SampleFrames countSampleFrames(const std::string& pluginPath, int frames);

}  // namespace vibench
