// The soak: random sequences of host calls, each played in a child process of
// its own into the runtime built with the sanitizers; this process, which
// never touches GL, watches. A fault is a crash, a sanitizer report, a hang
// (no end within the time limit), or a failed check of the player; the
// failing sequence is then shrunk to a short reproduction. See soak/README.md.
//
//   vi_soak [--seed N] [--sequences N] [--minutes M]
//   vi_soak --seed N --replay SEQUENCE[:i,j,k]
#include <signal.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <random>
#include <string>

#include "Player.h"

namespace {

using visoak::Player;

const double kSequenceSeconds = 60.0;
const int kMaxReplays = 300;
const double kShrinkSeconds = 180.0;
const int kHang = -1;

// Written by the child, read by this process once the child has ended.
struct Progress {
    int call;  // the call being played
    long calls, losses, equalFrames;
};
Progress* gProgress;

double seconds() {
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

// Plays sequence `index`, or only the calls `only` of it; the exit status.
int play(std::uint64_t seed, int index, const std::vector<int>& only, bool verbose) {
    const std::vector<visoak::Call> calls = visoak::makeSequence(seed, index);
    std::vector<int> order = only;
    for (int i = 0; only.empty() && i < int(calls.size()); ++i) order.push_back(i);
    Player player;
    for (int i : order) {
        if (i < 0 || i >= int(calls.size())) continue;
        gProgress->call = i;
        if (verbose) std::printf("  %3d: %s\n", i, visoak::describe(calls[std::size_t(i)]).c_str());
        std::string fault;
        const Player::Outcome outcome = player.play(calls[std::size_t(i)], fault);
        if (outcome == Player::Skipped && verbose) std::printf("       skipped: not a call a host makes now\n");
        if (outcome == Player::Skipped) continue;
        ++gProgress->calls;
        gProgress->losses += calls[std::size_t(i)].kind == visoak::CallContextLoss;
        gProgress->equalFrames = player.equalFrames();
        if (outcome != Player::Played) {
            std::printf("soak: sequence %d, call %d: %s\n", index, i, fault.c_str());
            return outcome == Player::FrameDiffers ? 3 : 4;
        }
    }
    return 0;
}

// Plays in a fresh child within the time limit; its exit status, kHang, or
// 128 + the signal that ended it.
int inChild(std::uint64_t seed, int index, const std::vector<int>& only, bool quiet) {
    *gProgress = Progress{-1, 0, 0, 0};
    std::fflush(stdout);
    const pid_t pid = fork();
    if (pid == 0) {
        if (quiet && (!std::freopen("/dev/null", "w", stdout) || !std::freopen("/dev/null", "w", stderr))) _exit(2);
        std::exit(play(seed, index, only, false));  // exit, not _exit: the leak checker looks at what is left
    }
    sigset_t childEnded;
    sigemptyset(&childEnded);
    sigaddset(&childEnded, SIGCHLD);
    const double deadline = seconds() + kSequenceSeconds;
    int status = 0;
    while (waitpid(pid, &status, WNOHANG) == 0) {
        const double left = deadline - seconds();
        if (left <= 0) {
            kill(pid, SIGKILL);
            waitpid(pid, &status, 0);
            return kHang;
        }
        const timespec wait = {time_t(left), long((left - double(time_t(left))) * 1e9)};
        sigtimedwait(&childEnded, nullptr, &wait);
    }
    return WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
}

std::string faultOf(int status) {
    switch (status) {
        case kHang: return "no end within " + std::to_string(int(kSequenceSeconds)) + " s (a hang)";
        case 1: return "exit status 1 (a sanitizer report above)";
        case 3: return "a frame after a context change differs from the frame before it";
        case 4: return "a JNI misuse";
        case 23: return "exit status 23 (a leak report above)";
        default:
            return status > 128 ? "killed by signal " + std::to_string(status - 128)
                                : "exit status " + std::to_string(status);
    }
}

std::string joined(const std::vector<int>& calls) {
    std::string list;
    for (int i : calls) list += (list.empty() ? "" : ",") + std::to_string(i);
    return list;
}

// Delta debugging: drops chunks of calls, halving the chunk size when none can
// go, while the rest still fails the same way in a fresh child.
void shrink(std::uint64_t seed, int index, int failingCall, int status) {
    std::vector<int> calls;
    const int size = int(visoak::makeSequence(seed, index).size());
    for (int i = 0; i < size && (failingCall < 0 || i <= failingCall); ++i) calls.push_back(i);
    const double deadline = seconds() + kShrinkSeconds;
    int replays = 0;
    auto fails = [&](const std::vector<int>& candidate) {
        ++replays;
        return inChild(seed, index, candidate, true) == status;
    };
    std::printf("soak: shrinking %zu calls...\n", calls.size());
    if (!fails(calls)) {
        for (int i = int(calls.size()); i < size; ++i) calls.push_back(i);
        if (!fails(calls)) {
            std::printf("soak: the sequence does not fail again from a fresh start\n");
            return;
        }
    }
    for (std::size_t chunk = calls.size() / 2; chunk >= 1 && replays < kMaxReplays && seconds() < deadline;) {
        bool dropped = false;
        for (std::size_t start = 0; start < calls.size() && replays < kMaxReplays && seconds() < deadline;) {
            std::vector<int> candidate(calls.begin(), calls.begin() + long(start));
            candidate.insert(candidate.end(), calls.begin() + long(std::min(start + chunk, calls.size())), calls.end());
            if (!candidate.empty() && fails(candidate)) {
                calls = candidate;
                dropped = true;
            } else {
                start += chunk;
            }
        }
        chunk = dropped ? std::min(chunk, std::max<std::size_t>(calls.size() / 2, 1)) : chunk / 2;
    }
    const std::vector<visoak::Call> sequence = visoak::makeSequence(seed, index);
    std::printf("soak: reproduction (%zu calls, after %d replays), seed %llu, sequence %d:\n", calls.size(), replays,
                (unsigned long long)seed, index);
    for (int i : calls) std::printf("  %3d: %s\n", i, visoak::describe(sequence[std::size_t(i)]).c_str());
    std::printf("soak: replay it with: scripts/soak soak --seed %llu --replay %d:%s\n", (unsigned long long)seed, index,
                joined(calls).c_str());
}

int usage() {
    std::fprintf(stderr, "usage: vi_soak [--seed N] [--sequences N] [--minutes M]\n"
                         "       vi_soak --seed N --replay SEQUENCE[:i,j,k]\n");
    return 2;
}

}  // namespace

int main(int argc, char** argv) {
    std::uint64_t seed = std::random_device()() % 1000000;
    long sequences = 1000000;
    double minutes = 3.5;
    std::string replay;
    bool seedGiven = false;
    for (int i = 1; i + 1 < argc; i += 2) {
        const std::string option = argv[i];
        if (option == "--seed") {
            seed = std::strtoull(argv[i + 1], nullptr, 10);
            seedGiven = true;
        } else if (option == "--sequences") {
            sequences = std::strtol(argv[i + 1], nullptr, 10);
        } else if (option == "--minutes") {
            minutes = std::strtod(argv[i + 1], nullptr);
        } else if (option == "--replay") {
            replay = argv[i + 1];
        } else {
            return usage();
        }
    }
    if (argc % 2 == 0 || (!replay.empty() && !seedGiven)) return usage();
    setvbuf(stdout, nullptr, _IOLBF, 0);
    gProgress = static_cast<Progress*>(
        mmap(nullptr, sizeof(Progress), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0));

    if (!replay.empty()) {
        // SEQUENCE or SEQUENCE:i,j,k, played in this process, each call printed.
        std::vector<int> only;
        const std::size_t colon = replay.find(':');
        for (std::size_t at = colon; at != std::string::npos; at = replay.find(',', at + 1))
            only.push_back(std::atoi(replay.c_str() + at + 1));
        std::printf("soak: replaying sequence %d of seed %llu\n", std::atoi(replay.c_str()), (unsigned long long)seed);
        const int status = play(seed, std::atoi(replay.c_str()), only, true);
        std::printf("soak: %s\n", status ? "the replay failed" : "the replay passed");
        return status;
    }

    // SIGCHLD stays pending for sigtimedwait.
    sigset_t childEnded;
    sigemptyset(&childEnded);
    sigaddset(&childEnded, SIGCHLD);
    sigprocmask(SIG_BLOCK, &childEnded, nullptr);
    std::printf("soak: seed %llu, at most %ld sequences in %.1f minutes\n", (unsigned long long)seed, sequences, minutes);
    const double started = seconds();
    const double deadline = started + minutes * 60.0;
    long played = 0, calls = 0, losses = 0, equalFrames = 0, faults = 0;
    for (int index = 0; index < sequences && seconds() < deadline; ++index) {
        const int status = inChild(seed, index, {}, false);
        ++played;
        calls += gProgress->calls;
        losses += gProgress->losses;
        equalFrames += gProgress->equalFrames;
        if (status == 0) continue;
        ++faults;
        const int call = gProgress->call;
        std::printf("soak: FAULT with seed %llu in sequence %d at call %d: %s\n", (unsigned long long)seed, index, call,
                    faultOf(status).c_str());
        shrink(seed, index, call, status);
        break;
    }
    std::printf("soak: %ld frames after a context change equal to the frame before it, %.0f s\n", equalFrames,
                seconds() - started);
    std::printf("soak: %ld sequences, %ld calls, %ld context losses, %ld fault%s\n", played, calls, losses, faults,
                faults == 1 ? "" : "s");
    return faults ? 1 : 0;
}
