#pragma once

// Runs the soak in a child process and watches it: a sanitizer stops the
// child at the first error, so the parent, which never touches GL, is the one
// that reports, finds which sequence and call were running, and shrinks the
// failing sequence by replaying pieces of it in fresh children.

#include <cstdint>
#include <string>
#include <vector>

#include "SoakHost.h"

namespace visoak {

// Calls of one sequence to play (all of them when `calls` is empty).
struct SequencePart {
    int sequence = 0;
    std::vector<int> calls;
};

struct SoakOptions {
    std::uint64_t seed = 0;
    long sequences = 1000000;  // at most
    double minutes = 3.5;      // no sequence starts after this
    std::vector<SequencePart> replay;  // not empty: replay these, one after the other
    PluginPaths paths;
    SoakAvoid avoid;
};

// The whole run: prints the seed, runs, on a fault shrinks; the exit status.
int superviseSoak(const SoakOptions& options);
// Replays `options.replay` in this process, printing each call.
int replaySequences(const SoakOptions& options);

}  // namespace visoak
