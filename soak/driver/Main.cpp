// The soak: random sequences of host calls, each played in a child process of
// its own into the runtime built with the sanitizers, while this process,
// which never touches GL, watches. A fault is a crash, a sanitizer report, a
// hang (no end within the time limit) or a failed check of the player; the
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
#include <random>

#include "Player.h"

namespace {

using visoak::Player;

const double kSequenceSeconds = 60.0;
const double kShrinkSeconds = 180.0;
const int kMaxReplays = 300;
const int kHang = 1000;  // a status no child exits with

// Written by the child, read by this process once the child has ended.
struct Progress {
    int call;  // the call being played
    long calls, losses, equalFrames;
};
Progress* gProgress;

double seconds() { return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count(); }

// Plays sequence `index`, or only the calls `only` of it; the exit status.
int play(std::uint64_t seed, int index, const std::vector<int>& only, bool verbose) {
    const std::vector<visoak::Call> calls = visoak::makeSequence(seed, index);
    std::vector<int> order = only;
    for (int i = 0; only.empty() && i < int(calls.size()); ++i) order.push_back(i);
    Player player;
    for (int i : order) {
        if (i < 0 || i >= int(calls.size())) continue;
        const visoak::Call& call = calls[std::size_t(i)];
        gProgress->call = i;
        if (verbose) std::printf("  %3d: %s\n", i, visoak::describe(call).c_str());
        std::string fault;
        const Player::Outcome outcome = player.play(call, fault);
        if (outcome == Player::Skipped) {
            if (verbose) std::printf("       skipped: not a call a host makes now\n");
            continue;
        }
        ++gProgress->calls;
        gProgress->losses += call.kind == visoak::CallContextLoss;
        gProgress->equalFrames = player.equalFrames();
        if (outcome != Player::Played) {
            std::printf("soak: sequence %d, call %d: %s\n", index, i, fault.c_str());
            return outcome == Player::FrameDiffers ? 3 : 4;
        }
    }
    return 0;
}

// Plays in a fresh child within the time limit; its exit status, 128 + the
// signal that ended it, or kHang.
int inChild(std::uint64_t seed, int index, const std::vector<int>& only, bool quiet) {
    *gProgress = Progress{-1, 0, 0, 0};
    const pid_t pid = fork();
    if (pid == 0) {
        if (quiet && (!std::freopen("/dev/null", "w", stdout) || !std::freopen("/dev/null", "w", stderr))) _exit(2);
        std::exit(play(seed, index, only, false));  // not _exit: the leak checker looks at what is left
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
        sigtimedwait(&childEnded, nullptr, &wait);  // SIGCHLD is blocked, so it waits here
    }
    return WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
}

std::string faultOf(int status) {
    if (status == kHang) return "no end within " + std::to_string(int(kSequenceSeconds)) + " s (a hang)";
    if (status == 1) return "exit status 1 (a sanitizer report above)";
    if (status == 3) return "a frame after a context change differs from the frame before it";
    if (status == 4) return "a JNI misuse";
    if (status == 23) return "exit status 23 (a leak report above)";
    return status > 128 ? "killed by signal " + std::to_string(status - 128) : "exit status " + std::to_string(status);
}

// Delta debugging: drops chunks of calls while the rest still fails the same
// way in a fresh child, halving the chunks when none can go.
void shrink(std::uint64_t seed, int index, int failingCall, int status) {
    const std::vector<visoak::Call> sequence = visoak::makeSequence(seed, index);
    std::vector<int> calls;
    for (int i = 0; i < int(sequence.size()); ++i) calls.push_back(i);
    const double deadline = seconds() + kShrinkSeconds;
    int replays = 0;
    auto fails = [&](const std::vector<int>& candidate) {
        if (replays == kMaxReplays || seconds() >= deadline) return false;
        ++replays;
        return inChild(seed, index, candidate, true) == status;
    };
    std::printf("soak: shrinking...\n");
    const std::vector<int> prefix(calls.begin(), calls.begin() + std::min<long>(failingCall + 1, long(calls.size())));
    if (failingCall >= 0 && fails(prefix)) calls = prefix;
    for (std::size_t chunk = calls.size() / 2; chunk >= 1 && replays < kMaxReplays;) {
        bool dropped = false;
        for (std::size_t start = 0; start < calls.size() && replays < kMaxReplays;) {
            std::vector<int> candidate(calls.begin(), calls.begin() + long(start));
            candidate.insert(candidate.end(), calls.begin() + long(std::min(start + chunk, calls.size())), calls.end());
            if (!candidate.empty() && fails(candidate))
                calls = candidate, dropped = true;
            else
                start += chunk;
        }
        chunk = dropped ? std::min(chunk, std::max<std::size_t>(calls.size() / 2, 1)) : chunk / 2;
    }
    std::string list;
    std::printf("soak: reproduction (%zu calls, after %d replays), seed %llu, sequence %d:\n", calls.size(), replays,
                (unsigned long long)seed, index);
    for (int i : calls) {
        std::printf("  %3d: %s\n", i, visoak::describe(sequence[std::size_t(i)]).c_str());
        list += (list.empty() ? "" : ",") + std::to_string(i);
    }
    std::printf("soak: replay it with: scripts/soak soak --seed %llu --replay %d:%s\n", (unsigned long long)seed, index,
                list.c_str());
}

}  // namespace

int main(int argc, char** argv) {
    std::uint64_t seed = std::random_device()() % 1000000;
    long sequences = 1000000;
    double minutes = 3.5;
    std::string replay;
    for (int i = 1; i < argc; i += 2) {
        const std::string option = argv[i];
        const char* value = i + 1 < argc ? argv[i + 1] : nullptr;
        if (value && option == "--seed") seed = std::strtoull(value, nullptr, 10);
        else if (value && option == "--sequences") sequences = std::strtol(value, nullptr, 10);
        else if (value && option == "--minutes") minutes = std::strtod(value, nullptr);
        else if (value && option == "--replay") replay = value;
        else return std::fprintf(stderr, "usage: vi_soak [--seed N] [--sequences N] [--minutes M]\n"
                                         "       vi_soak --seed N --replay SEQUENCE[:i,j,k]\n"), 2;
    }
    setvbuf(stdout, nullptr, _IOLBF, 0);
    gProgress = static_cast<Progress*>(mmap(nullptr, sizeof(Progress), PROT_READ | PROT_WRITE,
                                            MAP_SHARED | MAP_ANONYMOUS, -1, 0));
    if (!replay.empty()) {
        // Played in this process, each call printed.
        std::vector<int> only;
        for (std::size_t at = replay.find(':'); at != std::string::npos; at = replay.find(',', at + 1))
            only.push_back(std::atoi(replay.c_str() + at + 1));
        std::printf("soak: replaying sequence %d of seed %llu\n", std::atoi(replay.c_str()), (unsigned long long)seed);
        const int status = play(seed, std::atoi(replay.c_str()), only, true);
        std::printf("soak: the replay %s\n", status ? "failed" : "passed");
        return status;
    }

    sigset_t childEnded;
    sigemptyset(&childEnded);
    sigaddset(&childEnded, SIGCHLD);
    sigprocmask(SIG_BLOCK, &childEnded, nullptr);
    std::printf("soak: seed %llu, at most %ld sequences in %.1f minutes\n", (unsigned long long)seed, sequences, minutes);
    const double started = seconds();
    long played = 0, calls = 0, losses = 0, equalFrames = 0, faults = 0;
    while (played < sequences && seconds() < started + minutes * 60.0 && !faults) {
        const int index = int(played++);
        const int status = inChild(seed, index, {}, false);
        calls += gProgress->calls;
        losses += gProgress->losses;
        equalFrames += gProgress->equalFrames;
        if (status == 0) continue;
        faults = 1;
        std::printf("soak: FAULT with seed %llu in sequence %d at call %d: %s\n", (unsigned long long)seed, index,
                    gProgress->call, faultOf(status).c_str());
        shrink(seed, index, gProgress->call, status);
    }
    std::printf("soak: %ld frames after a context change equal to the frame before it, %.0f s\n", equalFrames,
                seconds() - started);
    std::printf("soak: %ld sequences, %ld calls, %ld context losses, %ld fault%s\n", played, calls, losses, faults,
                faults == 1 ? "" : "s");
    return faults ? 1 : 0;
}
