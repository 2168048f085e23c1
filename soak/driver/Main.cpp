// The soak: random sequences of host calls played into the runtime, built
// with the address and undefined-behaviour sanitizers, every invariant
// checked after every call. See soak/README.md.
//
//   vi_soak [--seed N] [--sequences N] [--minutes M] [--avoid-...]
//   vi_soak --seed N --replay SEQUENCE[:i,j,k] [--replay ...] [--avoid-...]
#include <fcntl.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "Supervisor.h"

namespace {

std::uint64_t randomSeed() {
    std::uint64_t seed = 0;
    const int file = open("/dev/urandom", O_RDONLY);
    if (file >= 0) {
        if (read(file, &seed, sizeof(seed)) != ssize_t(sizeof(seed))) seed = 0;
        close(file);
    }
    return seed ? seed % 1000000000000ull : std::uint64_t(time(nullptr));
}

std::vector<int> parseList(const char* text) {
    std::vector<int> values;
    const char* p = text;
    while (*p) {
        char* end = nullptr;
        values.push_back(int(std::strtol(p, &end, 10)));
        if (end == p) break;
        p = *end == ',' ? end + 1 : end;
    }
    return values;
}

int usage() {
    std::fprintf(stderr,
                 "usage: vi_soak [--seed N] [--sequences N] [--minutes M] [--avoid-...]\n"
                 "       vi_soak --seed N --replay SEQUENCE[:i,j,k] [--replay ...] [--avoid-...]\n"
                 "  --avoid-replace-before-first-upload: leave out loading a name again before its first\n"
                 "    allocation\n"
                 "  --avoid-init-after-context-change: leave out initialising after a context change and\n"
                 "    before the next frame (the default: the runtime does not check the context there)\n"
                 "  --with-init-after-context-change: keep that pattern in (it is expected to fault)\n");
    return 2;
}

}  // namespace

int main(int argc, char** argv) {
    visoak::SoakOptions options;
    // Initialising before the first frame after a context change meets stale
    // program names by the runtime's own rules (the context is checked only where
    // it checks it), so the default run leaves that host pattern out.
    options.avoid.initAfterContextChange = true;
    bool seedGiven = false;
    for (int i = 1; i < argc; ++i) {
        const std::string argument = argv[i];
        const bool hasValue = i + 1 < argc;
        if (argument == "--seed" && hasValue) {
            options.seed = std::strtoull(argv[++i], nullptr, 10);
            seedGiven = true;
        } else if (argument == "--sequences" && hasValue) {
            options.sequences = std::strtol(argv[++i], nullptr, 10);
        } else if (argument == "--minutes" && hasValue) {
            options.minutes = std::strtod(argv[++i], nullptr);
        } else if (argument == "--replay" && hasValue) {
            // SEQUENCE or SEQUENCE:i,j,k
            const std::string value = argv[++i];
            visoak::SequencePart part;
            part.sequence = std::atoi(value.c_str());
            const std::string::size_type colon = value.find(':');
            if (colon != std::string::npos) part.calls = parseList(value.c_str() + colon + 1);
            options.replay.push_back(part);
        } else if (argument == "--avoid-replace-before-first-upload") {
            options.avoid.replaceBeforeFirstUpload = true;
        } else if (argument == "--avoid-init-after-context-change") {
            options.avoid.initAfterContextChange = true;
        } else if (argument == "--with-init-after-context-change") {
            options.avoid.initAfterContextChange = false;
        } else {
            return usage();
        }
    }
    if (!seedGiven) options.seed = randomSeed();
    if (!options.replay.empty() && !seedGiven) return usage();

    options.paths.soak = VI_SOAK_SCENE_PLUGIN;
    options.paths.test = VI_SOAK_TEST_PLUGIN;
    options.paths.noFactory = VI_SOAK_NOFACTORY_PLUGIN;
    options.paths.missing = "/nonexistent/libmissing-effect.so";
    setvbuf(stdout, nullptr, _IOLBF, 0);
    return options.replay.empty() ? visoak::superviseSoak(options) : visoak::replaySequences(options);
}
