#include "Supervisor.h"

#include <sys/mman.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#include <sanitizer/common_interface_defs.h>
#define VI_SOAK_SANITIZED 1
#endif

namespace visoak {

namespace {

const int kFaultExit = 3;
const int kMaxReplays = 400;
const double kShrinkSeconds = 180.0;

// Shared between the supervising parent and its children.
struct Progress {
    volatile int sequence;
    volatile int call;  // index in the sequence of the call running; -1: between calls
    volatile int faulted;
    volatile int originSequence;  // a differing frame: where the earlier frame of its state was drawn
    volatile int originCall;
    char fault[1024];
    volatile long sequences;
    SoakStats stats;
};

Progress* gProgress = nullptr;

double monotonicSeconds() {
    timespec now;
    clock_gettime(CLOCK_MONOTONIC, &now);
    return double(now.tv_sec) + double(now.tv_nsec) * 1e-9;
}

void resetProgress() {
    std::memset(static_cast<void*>(gProgress), 0, sizeof(Progress));
    gProgress->call = -1;
    gProgress->originSequence = -1;
    gProgress->originCall = -1;
}

void noteFault(const std::string& fault, const SoakHost* host) {
    if (gProgress->faulted) return;
    std::snprintf(gProgress->fault, sizeof(gProgress->fault), "%s", fault.c_str());
    if (host) {
        gProgress->originSequence = host->faultOriginSequence();
        gProgress->originCall = host->faultOriginCall();
    }
    gProgress->faulted = 1;
}

#ifdef VI_SOAK_SANITIZED
void onSanitizerDeath() { noteFault("a sanitizer stopped the process (see its report above)", nullptr); }
#endif

// Plays one sequence, or the listed calls of it.
bool playSequence(SoakHost& host, std::uint64_t seed, const SequencePart& part, bool verbose) {
    const std::vector<Call> calls = makeSequence(seed, part.sequence);
    gProgress->sequence = part.sequence;
    host.beginSequence(seed, part.sequence);
    std::vector<int> order = part.calls;
    if (order.empty())
        for (int i = 0; i < int(calls.size()); ++i) order.push_back(i);
    std::string fault;
    for (int i : order) {
        if (i < 0 || i >= int(calls.size())) continue;
        gProgress->call = i;
        if (verbose) std::printf("  %3d: %s\n", i, describe(calls[std::size_t(i)]).c_str());
        if (!host.run(calls[std::size_t(i)], i, fault)) {
            noteFault(fault, &host);
            return false;
        }
    }
    gProgress->call = -1;
    if (!host.endSequence(fault)) {
        noteFault("at the end of the sequence: " + fault, &host);
        return false;
    }
    return true;
}

bool playParts(SoakHost& host, const SoakOptions& options, const std::vector<SequencePart>& parts, bool verbose) {
    for (const SequencePart& part : parts) {
        if (verbose) std::printf("sequence %d:\n", part.sequence);
        if (!playSequence(host, options.seed, part, verbose)) return false;
    }
    return true;
}

void runWorker(const SoakOptions& options) {
#ifdef VI_SOAK_SANITIZED
    __sanitizer_set_death_callback(onSanitizerDeath);
#endif
    const double deadline = monotonicSeconds() + options.minutes * 60.0;
    bool ok = true;
    {
        SoakHost host(options.paths, options.avoid);
        for (long index = 0; index < options.sequences && monotonicSeconds() < deadline; ++index) {
            SequencePart part;
            part.sequence = int(index);
            if (!playSequence(host, options.seed, part, false)) {
                ok = false;
                break;
            }
            gProgress->sequences = index + 1;
            gProgress->stats = host.stats();
        }
        gProgress->stats = host.stats();
    }
    if (ok) gProgress->sequence = -1;
    std::fflush(stdout);
    // A normal exit, so that the leak checker looks at what is left.
    std::exit(ok ? 0 : kFaultExit);
}

void runReplayChild(const SoakOptions& options, const std::vector<SequencePart>& parts) {
#ifdef VI_SOAK_SANITIZED
    __sanitizer_set_death_callback(onSanitizerDeath);
#endif
    // Quiet: the parent only wants the outcome.
    if (!std::freopen("/dev/null", "w", stderr)) std::exit(kFaultExit);
    bool ok;
    {
        SoakHost host(options.paths, options.avoid);
        ok = playParts(host, options, parts, false);
    }
    std::exit(ok ? 0 : kFaultExit);
}

// Runs `child` in a fresh process; false when it faulted, with what it said.
template <typename Child>
bool inChild(Child child, std::string& fault) {
    resetProgress();
    std::fflush(stdout);
    std::fflush(stderr);
    const pid_t pid = fork();
    if (pid == 0) {
        child();
        std::_Exit(kFaultExit);
    }
    int status = 0;
    waitpid(pid, &status, 0);
    if (WIFEXITED(status) && WEXITSTATUS(status) == 0 && !gProgress->faulted) return true;
    if (gProgress->faulted)
        fault = gProgress->fault;
    else if (WIFSIGNALED(status))
        fault = "the process died of signal " + std::to_string(WTERMSIG(status));
    else
        fault = "the process exited with status " + std::to_string(WEXITSTATUS(status)) +
                (gProgress->sequence == -1 ? " after all sequences passed (a leak report above?)"
                                           : " (a sanitizer report above?)");
    return false;
}

// Faults are the same kind when their texts agree but for numbers.
std::string signature(const std::string& fault) {
    std::string kind;
    for (char c : fault)
        if (!std::isdigit(static_cast<unsigned char>(c))) kind += c;
    return kind;
}

std::string avoidFlags(const SoakOptions& options) {
    std::string flags;
    if (options.avoid.replaceBeforeFirstUpload) flags += " --avoid-replace-before-first-upload";
    if (!options.avoid.initAfterContextChange) flags += " --with-init-after-context-change";
    return flags;
}

// One call of one sequence.
struct Step {
    int part;
    int call;
};

std::vector<SequencePart> partsOf(const std::vector<SequencePart>& shape, const std::vector<Step>& steps) {
    std::vector<SequencePart> parts = shape;
    for (SequencePart& part : parts) part.calls.clear();
    for (const Step& step : steps) parts[std::size_t(step.part)].calls.push_back(step.call);
    // A part left without calls would replay all of its calls.
    std::vector<SequencePart> kept;
    for (const SequencePart& part : parts)
        if (!part.calls.empty()) kept.push_back(part);
    return kept;
}

// The shortest piece found that fails as `fault` did: first the prefixes up
// to the failing call (and, when the failure is a frame that differs from an
// earlier frame drawn in another sequence, that sequence up to that frame
// before it), then steps dropped while it still fails the same way.
void shrink(const SoakOptions& options, int index, int failingCall, int originSequence, int originCall,
            const std::string& fault) {
    std::vector<SequencePart> shape;
    std::vector<Step> steps;
    auto addPrefix = [&](int sequence, int last) {
        const int size = int(makeSequence(options.seed, sequence).size());
        if (last < 0 || last >= size) last = size - 1;
        SequencePart part;
        part.sequence = sequence;
        shape.push_back(part);
        for (int i = 0; i <= last; ++i) steps.push_back(Step{int(shape.size()) - 1, i});
    };
    if (originSequence >= 0 && originSequence != index) addPrefix(originSequence, originCall);
    addPrefix(index, failingCall);

    const std::string kind = signature(fault);
    const double deadline = monotonicSeconds() + kShrinkSeconds;
    int replays = 0;
    auto fails = [&](const std::vector<Step>& candidate) {
        ++replays;
        std::string got;
        const std::vector<SequencePart> parts = partsOf(shape, candidate);
        if (inChild([&] { runReplayChild(options, parts); }, got)) return false;
        return signature(got) == kind;
    };

    std::printf("soak: shrinking %zu calls by replaying pieces of them...\n", steps.size());
    std::fflush(stdout);
    if (!fails(steps)) {
        std::printf("soak: the failure does not come back from a fresh start with these calls alone; "
                    "replay the whole run with --seed %llu --sequences %d%s\n",
                    (unsigned long long)options.seed, index + 1, avoidFlags(options).c_str());
        return;
    }
    std::size_t chunks = 2;
    while (steps.size() > 1 && replays < kMaxReplays && monotonicSeconds() < deadline) {
        const std::size_t size = std::max<std::size_t>(1, steps.size() / chunks);
        bool removed = false;
        for (std::size_t start = 0; start < steps.size() && replays < kMaxReplays; start += size) {
            std::vector<Step> candidate(steps.begin(), steps.begin() + long(start));
            candidate.insert(candidate.end(), steps.begin() + long(std::min(start + size, steps.size())), steps.end());
            if (candidate.empty() || !fails(candidate)) continue;
            steps = candidate;
            chunks = std::max<std::size_t>(chunks - 1, 2);
            removed = true;
            break;
        }
        if (!removed) {
            if (size == 1) break;
            chunks = std::min(steps.size(), chunks * 2);
        }
    }

    const std::vector<SequencePart> parts = partsOf(shape, steps);
    std::printf("soak: shortest failing piece found (%zu calls, after %d replays), seed %llu:\n", steps.size(),
                replays, (unsigned long long)options.seed);
    std::string command = "scripts/soak soak --seed " + std::to_string(options.seed);
    for (const SequencePart& part : parts) {
        const std::vector<Call> calls = makeSequence(options.seed, part.sequence);
        std::printf("  sequence %d:\n", part.sequence);
        std::string list;
        for (int i : part.calls) {
            std::printf("    %3d: %s\n", i, describe(calls[std::size_t(i)]).c_str());
            list += (list.empty() ? "" : ",") + std::to_string(i);
        }
        command += " --replay " + std::to_string(part.sequence) + ":" + list;
    }
    std::printf("soak: replay it with: %s%s\n", command.c_str(), avoidFlags(options).c_str());
}

Progress* sharedProgress() {
    void* memory = mmap(nullptr, sizeof(Progress), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (memory == MAP_FAILED) {
        std::perror("soak: mmap");
        std::exit(2);
    }
    return static_cast<Progress*>(memory);
}

}  // namespace

int superviseSoak(const SoakOptions& options) {
    gProgress = sharedProgress();
    std::printf("soak: seed %llu, at most %ld sequences in %.1f minutes%s\n", (unsigned long long)options.seed,
                options.sequences, options.minutes, avoidFlags(options).c_str());
    std::fflush(stdout);
    const double started = monotonicSeconds();
    std::string fault;
    const bool ok = inChild([&] { runWorker(options); }, fault);
    const SoakStats stats = gProgress->stats;
    const long sequences = gProgress->sequences;
    if (ok) {
        std::printf("soak: %ld calls skipped as invalid for the host, %ld context switches, %ld times no context, "
                    "%ld ready frames (%ld compared with an earlier frame of the same state), %ld self-tests, "
                    "%.0f s\n",
                    stats.skipped, stats.switches, stats.noContext, stats.frames, stats.compared, stats.selfTests,
                    monotonicSeconds() - started);
        std::printf("soak: %ld sequences, %ld calls, %ld context losses, 0 faults\n", sequences, stats.calls,
                    stats.losses);
        return 0;
    }
    const int index = gProgress->sequence;
    const int call = gProgress->call;
    const int originSequence = gProgress->originSequence;
    const int originCall = gProgress->originCall;
    std::printf("soak: FAULT with seed %llu in sequence %d at call %d: %s\n", (unsigned long long)options.seed, index,
                call, fault.c_str());
    std::printf("soak: %ld sequences, %ld calls, %ld context losses, 1 fault\n", sequences, stats.calls, stats.losses);
    if (index >= 0) shrink(options, index, call, originSequence, originCall, fault);
    return 1;
}

int replaySequences(const SoakOptions& options) {
    gProgress = sharedProgress();
    resetProgress();
    std::printf("soak: replaying with seed %llu%s\n", (unsigned long long)options.seed, avoidFlags(options).c_str());
    bool ok;
    {
        SoakHost host(options.paths, options.avoid);
        ok = playParts(host, options, options.replay, true);
    }
    if (ok) {
        std::printf("soak: the replay passed\n");
        return 0;
    }
    std::printf("soak: FAULT in sequence %d at call %d: %s\n", gProgress->sequence, gProgress->call,
                gProgress->fault);
    return 1;
}

}  // namespace visoak
