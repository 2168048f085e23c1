#pragma once

// The host calls the soak plays, and their random generation. A sequence is
// made in full from its seed before it runs; what a call's arguments stand
// for (which plug-in, which image name) is decided when it runs, from the
// state the earlier calls left, and a call that would be invalid for the host
// to make in that state is skipped. So every subsequence of a sequence is
// itself a valid sequence, which is what shrinking a failure needs.

#include <cstdint>
#include <string>
#include <vector>

namespace visoak {

enum CallKind {
    CallStart,           // a: plug-in choice, b: width, c: height
    CallInitEffect,
    CallRestart,
    CallStop,
    CallPause,
    CallRecycleTextures,
    CallDraw,
    CallTouch,           // a: x, b: y, c: action (0 to 2, sometimes another code)
    CallMenu,
    CallVolumeUp,
    CallVolumeDown,
    CallParam,           // a, b
    CallClearEffect,
    CallAffordance,
    CallUnlock,
    CallSetOrientation,  // a: 0 or 1
    CallLoadModel,
    CallLoadTexture,     // a: which name, b: image pattern, c: size choice, d: unload when 1
    CallKey,             // a: key code (never 67)
    CallWindow,          // a, b, c, d: left, top, width, height
    CallContextSwitch,   // to the other of two contexts
    CallContextLoss,     // the current context destroyed, a new one current
    CallContextNone,     // no context current
    CallKindCount
};

struct Call {
    CallKind kind;
    int a, b, c, d;
    std::uint64_t random;  // for the runtime's own random numbers (key 84)
};

const char* callName(CallKind kind);
std::string describe(const Call& call);

// The calls of sequence `index` of the run with seed `seed`.
std::vector<Call> makeSequence(std::uint64_t seed, int index);

// The same split of a seed into independent streams everywhere.
std::uint64_t mixSeed(std::uint64_t seed, std::uint64_t stream);

}  // namespace visoak
