#include "CrashReport.h"

#include <dlfcn.h>
#include <execinfo.h>
#include <fcntl.h>
#include <link.h>
#include <poll.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <ucontext.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <climits>
#include <cstdint>
#include <cstring>
#include <ctime>

#include "FatalExit.h"

namespace {

const int kSignals[] = {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT};
// How deep the stack is searched for the effect's frame.
constexpr int kMostFrames = 64;
// The plug-ins whose frames are the effect's: the one running and the one
// before, which the live window starts again when a new build does not load.
constexpr int kEffects = 2;
// How long addr2line or rm may take before the process ends without them,
// and how long the handler waits for a write under way.
constexpr int kHelperMilliseconds = 10000;
// The effect's frames named, from the fault out, to find the first in the
// author's own sources.
constexpr int kMostNamed = 16;
// The lines read from addr2line: for each frame, its address and a pair of
// lines for it and each function inlined into it.
constexpr int kMostLines = 512;
// A symbol the JDK's signal chaining library defines: only with it loaded may
// a handler for the JVM's signals be installed.
const char kChainingSymbol[] = "JVM_begin_signal_setting";

struct Effect {
    char path[PATH_MAX] = {};
    int file = -1;
};

// A message or a program's output, built without the heap.
template <std::size_t Capacity>
struct Text {
    char data[Capacity] = {};
    std::size_t size = 0;

    Text& operator<<(const char* text) {
        while (*text && size + 1 < sizeof(data)) data[size++] = *text++;
        data[size] = '\0';
        return *this;
    }
    Text& number(uintmax_t value, unsigned base) {
        char digits[24];
        int count = 0;
        do {
            digits[count++] = "0123456789abcdef"[value % base];
            value /= base;
        } while (value > 0);
        if (base == 16) *this << "0x";
        while (count > 0) {
            const char digit[2] = {digits[--count], '\0'};
            *this << digit;
        }
        return *this;
    }
    void clear() {
        size = 0;
        data[0] = '\0';
    }
};

char gProgram[64];
Effect gEffects[kEffects];
std::atomic<pid_t> gReporter{0};
// The thread writing into the files the handler removes, while it writes.
std::atomic<pid_t> gWriter{0};
void* gFrames[kMostFrames];
Text<4096> gMessage;
Text<4096> gDetail;
Text<32768> gOutput;
Text<24> gOffsets[kMostNamed + 1];
Text<32> gEffectFile;
const char* gArguments[128];

// The instruction that faulted, from the signal's context: the one place that knows the CPU.
uintptr_t faultingInstruction(const void* context) {
    const auto* state = static_cast<const ucontext_t*>(context);
#if defined(__x86_64__)
    return uintptr_t(state->uc_mcontext.gregs[REG_RIP]);
#elif defined(__aarch64__)
    return uintptr_t(state->uc_mcontext.pc);
#else
    (void)state;
    return 0;
#endif
}

const char* explanation(int signal) {
    switch (signal) {
        case SIGSEGV: return "a read or write through a bad pointer";
        case SIGBUS: return "a read or write of memory that is not there";
        case SIGFPE: return "an arithmetic fault, such as an integer division by zero";
        case SIGILL: return "an instruction the processor refuses, such as a trap";
        case SIGABRT: return "abort() was called: a failed assertion, or an exception nobody caught";
    }
    return "a fatal signal";
}

const Effect* effectAt(const char* path) {
    for (const Effect& effect : gEffects) {
        if (effect.file >= 0 && std::strcmp(effect.path, path) == 0) return &effect;
    }
    return nullptr;
}

int64_t monotonicMilliseconds() {
    timespec now;
    clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * 1000 + now.tv_nsec / 1000000;
}

// Runs a program, found on the PATH, with its standard output into `output`
// when given and its standard error discarded, for at most
// kHelperMilliseconds; `keep`, if open, stays open in it. Returns its exit
// status, or -1. Forked without the fork handlers, which may need the heap.
int run(const char* const arguments[], int keep, Text<32768>* output) {
    int pipe[2];
    if (pipe2(pipe, O_CLOEXEC) != 0) return -1;
    const pid_t child = _Fork();
    if (child == 0) {
        dup2(pipe[1], STDOUT_FILENO);
        const int nowhere = open("/dev/null", O_WRONLY);
        if (nowhere >= 0) dup2(nowhere, STDERR_FILENO);
        if (keep >= 0) fcntl(keep, F_SETFD, 0);
        execvp(arguments[0], const_cast<char* const*>(arguments));
        _exit(127);
    }
    close(pipe[1]);
    if (child < 0) {
        close(pipe[0]);
        return -1;
    }
    const int64_t deadline = monotonicMilliseconds() + kHelperMilliseconds;
    bool ended = false;
    while (!ended) {
        const int64_t left = deadline - monotonicMilliseconds();
        pollfd readable = {pipe[0], POLLIN, 0};
        if (left <= 0 || poll(&readable, 1, int(left)) == 0) break;
        char chunk[512];
        const ssize_t count = read(pipe[0], chunk, sizeof(chunk) - 1);
        if (count < 0 && errno == EINTR) continue;
        ended = count <= 0;
        if (count > 0 && output) {
            chunk[count] = '\0';
            *output << chunk;
        }
    }
    close(pipe[0]);
    if (!ended) kill(child, SIGKILL);
    int status = 0;
    while (waitpid(child, &status, 0) < 0 && errno == EINTR) {}
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

bool isUnknown(const char* place) { return std::strncmp(place, "??", 2) == 0; }

bool isSystemHeader(const char* place) {
    return std::strncmp(place, "/usr/include/", 13) == 0 || std::strncmp(place, "/usr/lib/", 9) == 0;
}

// Splits a text into its lines, in place.
int splitLines(char* text, char* lines[], int most) {
    int count = 0;
    for (char* line = text; *line && count < most;) {
        lines[count++] = line;
        char* end = std::strchr(line, '\n');
        if (!end) break;
        *end = '\0';
        line = end + 1;
    }
    return count;
}

// The compiler's notes on how it built the code mean nothing to the author.
void dropCompilerNotes(char* function, char* place) {
    char* clone = std::strstr(function, " [clone ");
    if (clone) *clone = '\0';
    char* discriminator = place ? std::strstr(place, " (discriminator") : nullptr;
    if (discriminator) *discriminator = '\0';
}

// addr2line's answer names, for each address (a line "0x..."), the frame's
// function, then file:line pairs from the innermost inlined function out,
// each after the name of the function it is in. The place told is the first
// in the author's own sources, not a system header's, with its frame's
// function; the fault's own place when there is none. Without debug
// information there is no place, and the symbol table may still name the
// fault's function: false, with that name in `function` when it has one.
bool describePlace(char* answer, char*& function) {
    char* lines[kMostLines];
    const int count = splitLines(answer, lines, kMostLines);
    char* place = nullptr;
    function = count > 1 && !isUnknown(lines[1]) ? lines[1] : nullptr;
    int frame = -1;
    for (int line = 0; line < count; ++line) {
        if (std::strncmp(lines[line], "0x", 2) == 0) {
            frame = line + 1;
        } else if (frame >= 0 && (line - frame) % 2 == 1 && !isUnknown(lines[line])) {
            const bool own = !isSystemHeader(lines[line]);
            if (!place || own) {
                function = lines[frame];
                place = lines[line];
            }
            if (own) break;
        }
    }
    if (function) dropCompilerNotes(function, place);
    if (!place) return false;
    gDetail << "  in " << function << " at " << place;
    return true;
}

const char* baseName(const char* path) {
    const char* slash = std::strrchr(path, '/');
    return slash ? slash + 1 : path;
}

// Names the first `count` of gOffsets in the library `file`, from its debug
// information; `keep` is the library's open file, if the name is a
// descriptor's. Its name and the fault's offset when it has no debug information.
void describe(const char* file, int count, int keep, const char* library, bool inEffect) {
    std::size_t argument = 0;
    for (const char* word : {"addr2line", "-a", "-f", "-C", "-i", "-e", file}) gArguments[argument++] = word;
    for (int offset = 0; offset < count; ++offset) gArguments[argument++] = gOffsets[offset].data;
    gArguments[argument] = nullptr;
    const int status = run(gArguments, keep, &gOutput);
    char* function = nullptr;
    if (status == 0 && describePlace(gOutput.data, function)) {
        if (!inEffect) gDetail << " (" << library << ")";
        gDetail << "\n";
        return;
    }
    gDetail << (function ? "  in " : "") << (function ? function : "") << "  at " + (function ? 1 : 0) << library
            << "+" << gOffsets[0].data
            << (status == 127 ? ": addr2line (binutils) is not installed to name the function and line\n"
                              : ": the library has no debug information; build it with -g to see the file and line\n");
}

// From the faulting frame out (found on the stack by its address), the
// frames in the effect; the innermost one in any library when none is.
// Returns whether the effect's were found.
bool describeStack(uintptr_t faulting) {
    int count = backtrace(gFrames, kMostFrames);
    int first = 0;
    while (first < count && uintptr_t(gFrames[first]) != faulting) ++first;
    if (first == count) {
        // The unwinder did not get past the handler: the faulting frame alone.
        gFrames[0] = reinterpret_cast<void*>(faulting);
        first = 0;
        count = 1;
    }
    const Effect* effect = nullptr;
    int named = 0;
    const char* outside = nullptr;
    for (int frame = first; frame < count && named < kMostNamed; ++frame) {
        // A caller's frame holds the address after its call: one back is the call.
        const uintptr_t address = uintptr_t(gFrames[frame]) - (frame == first ? 0 : 1);
        Dl_info info;
        link_map* library = nullptr;
        if (!dladdr1(reinterpret_cast<void*>(address), &info, reinterpret_cast<void**>(&library), RTLD_DL_LINKMAP) ||
            !info.dli_fname || !library) {
            continue;
        }
        const Effect* in = effectAt(info.dli_fname);
        if (in && (!effect || in == effect)) {
            effect = in;
            gOffsets[named].clear();
            gOffsets[named++].number(address - library->l_addr, 16);
        } else if (!in && !effect && !outside) {
            outside = info.dli_fname;
            gOffsets[kMostNamed].clear();
            gOffsets[kMostNamed].number(address - library->l_addr, 16);
        }
    }
    if (effect) {
        gEffectFile << "/proc/self/fd/";
        gEffectFile.number(unsigned(effect->file), 10);
        describe(gEffectFile.data, named, effect->file, baseName(effect->path), true);
    } else if (outside) {
        gOffsets[0] = gOffsets[kMostNamed];
        describe(outside, 1, -1, baseName(outside), false);
    }
    return effect != nullptr;
}

// Removes what the host was half-way through writing, once a write under way
// on another thread has ended; no write begins after the reporter is chosen.
void removeHalfWritten(pid_t self) {
    const int64_t deadline = monotonicMilliseconds() + kHelperMilliseconds;
    const timespec millisecond = {0, 1000000};
    while (gWriter != 0 && gWriter != self && monotonicMilliseconds() < deadline) nanosleep(&millisecond, nullptr);
    const std::vector<std::string>& paths = FatalExit::pathsToRemove();
    if (paths.empty()) return;
    std::size_t count = 0;
    for (const char* word : {"rm", "-rf", "--"}) gArguments[count++] = word;
    for (std::size_t path = 0; path < paths.size() && count + 1 < sizeof(gArguments) / sizeof(gArguments[0]); ++path) {
        gArguments[count++] = paths[path].c_str();
    }
    gArguments[count] = nullptr;
    run(gArguments, -1, nullptr);
}

}  // namespace

void CrashReport::watch(const std::string& program) {
    std::strncpy(gProgram, program.c_str(), sizeof(gProgram) - 1);
    static bool installed = false;
    if (installed || !dlsym(RTLD_DEFAULT, kChainingSymbol)) return;
    // The unwinder is loaded on the first call: now, not in the handler.
    backtrace(gFrames, 1);
    struct sigaction action = {};
    action.sa_sigaction = onSignal;
    // Not deferred, so that a fault in the handler itself finds it again and ends the process.
    action.sa_flags = SA_SIGINFO | SA_NODEFER;
    sigemptyset(&action.sa_mask);
    for (int signal : kSignals) sigaction(signal, &action, nullptr);
    installed = true;
}

void CrashReport::watchEffect(const std::string& path) {
    if (path.size() >= sizeof(gEffects[0].path) || path == gEffects[0].path) return;
    if (path == gEffects[1].path) {
        std::swap(gEffects[0], gEffects[1]);
        return;
    }
    if (gEffects[1].file >= 0) close(gEffects[1].file);
    gEffects[1] = gEffects[0];
    std::strcpy(gEffects[0].path, path.c_str());
    gEffects[0].file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
}

void CrashReport::beginWrite() {
    gWriter = pid_t(syscall(SYS_gettid));
    if (gReporter != 0) {
        gWriter = 0;
        for (;;) pause();
    }
}

void CrashReport::endWrite() { gWriter = 0; }

void CrashReport::onSignal(int signal, siginfo_t* info, void* context) {
    const pid_t self = pid_t(syscall(SYS_gettid));
    pid_t reporter = 0;
    if (!gReporter.compare_exchange_strong(reporter, self)) {
        // A fault while reporting ends the process at once; a fault on another
        // thread waits for the first report, which ends the process.
        if (reporter == self) _exit(128 + signal);
        for (;;) pause();
    }
    if (info->si_code == SI_USER && info->si_pid != getpid()) {
        // Sent by another process (kill -SEGV): no fault, and no place to name.
        gMessage << gProgram << ": error: ended by SIG" << sigabbrev_np(signal) << " from process ";
        gMessage.number(unsigned(info->si_pid), 10) << "\n";
    } else {
        const bool inEffect = describeStack(faultingInstruction(context));
        gMessage << gProgram << ": error: " << (inEffect ? "the effect crashed: SIG" : "a crash outside the effect: SIG")
                 << sigabbrev_np(signal) << " (" << explanation(signal);
        if ((signal == SIGSEGV || signal == SIGBUS) && info->si_code > 0) {
            gMessage << ", at ";
            gMessage.number(uintptr_t(info->si_addr), 16);
        }
        gMessage << ")\n" << gDetail.data;
    }
    ssize_t written = 0;
    while (written < ssize_t(gMessage.size)) {
        const ssize_t count = write(STDERR_FILENO, gMessage.data + written, gMessage.size - std::size_t(written));
        if (count <= 0 && errno != EINTR) break;
        if (count > 0) written += count;
    }
    removeHalfWritten(self);
    _exit(128 + signal);
}
