#pragma once

// The host calls the soak plays. A sequence is made in full from the seed and
// its number before it runs, so a run, and any part of one sequence, can be
// played again from the same two numbers.

#include <cstdint>
#include <string>
#include <vector>

namespace visoak {

enum CallKind {
    CallStart,           // a: which library, b, c: width, height
    CallInitEffect,
    CallRestart,
    CallStop,
    CallPause,
    CallRecycleTextures,
    CallDraw,
    CallTouch,           // a, b: window pixel, c: action
    CallMenu,
    CallVolumeUp,
    CallVolumeDown,
    CallKey,             // a: key code, never 67 nor 84
    CallParam,           // a, b
    CallClearEffect,
    CallAffordance,
    CallUnlock,
    CallSetOrientation,  // a: any int
    CallLoadModel,
    CallLoadTexture,     // a: which name, b: pixel pattern, c: which size, d: 1 to unload
    CallWindow,          // a, b, c, d: left, top, width, height
    CallContextSwitch,   // to the other of two contexts
    CallContextLoss,     // the context destroyed, a new one current
    CallContextNone,     // no context current
    CallKindCount
};

struct Call {
    CallKind kind;
    int a, b, c, d;
};

std::vector<Call> makeSequence(std::uint64_t seed, int index);
std::string describe(const Call& call);

}  // namespace visoak
