#include "CrashReport.h"

#include <dlfcn.h>
#include <sys/syscall.h>
#include <ucontext.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstring>
#include <ctime>

#include "CrashPlace.h"
#include "FatalExit.h"
#include "HelperProgram.h"

namespace {

const int kSignals[] = {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT};
// A symbol the JDK's signal chaining library defines: only with it loaded may
// a handler for the JVM's signals be installed.
const char kChainingSymbol[] = "JVM_begin_signal_setting";
// The files to remove that fit on rm's command line.
constexpr std::size_t kMostRemoved = 64;

char gProgram[64];
std::atomic<pid_t> gReporter{0};
// The thread writing into the files the handler removes, while it writes.
std::atomic<pid_t> gWriter{0};
FixedText<4096> gMessage;
CrashPlace::Detail gDetail;
const char* gArguments[kMostRemoved + 4];

pid_t currentThread() { return pid_t(syscall(SYS_gettid)); }

// The instruction that faulted, from the signal's context. This and
// returnAddress are the places that know the CPU.
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

// Where a call to `faulting` returns to. Read only when `faulting` is in no
// library: then the fault was the call itself, through a bad function
// pointer, and nothing has run since.
uintptr_t returnAddress(uintptr_t faulting, const void* context) {
    Dl_info info;
    if (dladdr(reinterpret_cast<void*>(faulting), &info)) return 0;
    const auto* state = static_cast<const ucontext_t*>(context);
#if defined(__x86_64__)
    return *reinterpret_cast<const uintptr_t*>(state->uc_mcontext.gregs[REG_RSP]);
#elif defined(__aarch64__)
    return uintptr_t(state->uc_mcontext.regs[30]);
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

void compose(int signal, const siginfo_t* info, const void* context) {
    gMessage << gProgram << ": error: ";
    if (info->si_code == SI_USER && info->si_pid != getpid()) {
        // Sent by another process (kill -SEGV): no fault, and no place to name.
        gMessage << "ended by SIG" << sigabbrev_np(signal) << " from process ";
        gMessage.number(unsigned(info->si_pid), 10) << "\n";
        return;
    }
    const uintptr_t faulting = faultingInstruction(context);
    const bool inEffect = CrashPlace::describe(faulting, returnAddress(faulting, context), gDetail);
    gMessage << (inEffect ? "the effect crashed: SIG" : "a crash outside the effect: SIG") << sigabbrev_np(signal)
             << " (" << explanation(signal);
    // The address is the fault's only when the kernel sent the signal.
    if ((signal == SIGSEGV || signal == SIGBUS) && info->si_code > 0) {
        gMessage << ", at ";
        gMessage.number(uintptr_t(info->si_addr), 16);
    }
    gMessage << ")\n" << gDetail.data;
}

void tell() {
    std::size_t written = 0;
    while (written < gMessage.size) {
        const ssize_t count = write(STDERR_FILENO, gMessage.data + written, gMessage.size - written);
        if (count < 0 && errno == EINTR) continue;
        if (count <= 0) return;
        written += std::size_t(count);
    }
}

// Removes what the host was half-way through writing, once a write under way
// on another thread has ended (none begins once there is a reporter).
void removeHalfWritten(pid_t reporter) {
    const int64_t deadline = HelperProgram::monotonicMilliseconds() + HelperProgram::kLimitMilliseconds;
    const timespec millisecond = {0, 1000000};
    while (gWriter != 0 && gWriter != reporter && HelperProgram::monotonicMilliseconds() < deadline) {
        nanosleep(&millisecond, nullptr);
    }
    const std::vector<std::string>& paths = FatalExit::pathsToRemove();
    if (paths.empty()) return;
    std::size_t count = 0;
    for (const char* word : {"rm", "-rf", "--"}) gArguments[count++] = word;
    for (std::size_t path = 0; path < paths.size() && path < kMostRemoved; ++path) {
        gArguments[count++] = paths[path].c_str();
    }
    gArguments[count] = nullptr;
    HelperProgram::run(gArguments, -1, nullptr, 0);
}

}  // namespace

void CrashReport::watch(const std::string& program) {
    std::strncpy(gProgram, program.c_str(), sizeof(gProgram) - 1);
    static bool installed = false;
    if (installed || !dlsym(RTLD_DEFAULT, kChainingSymbol)) return;
    CrashPlace::prepare();
    struct sigaction action = {};
    action.sa_sigaction = onSignal;
    // Not deferred, so that a fault in the handler itself finds it again and ends the process.
    action.sa_flags = SA_SIGINFO | SA_NODEFER;
    sigemptyset(&action.sa_mask);
    for (int signal : kSignals) sigaction(signal, &action, nullptr);
    installed = true;
}

void CrashReport::watchEffect(const std::string& path) { CrashPlace::watchEffect(path); }

void CrashReport::beginWrite() {
    gWriter = currentThread();
    if (gReporter != 0) {
        gWriter = 0;
        for (;;) pause();
    }
}

void CrashReport::endWrite() { gWriter = 0; }

void CrashReport::onSignal(int signal, siginfo_t* info, void* context) {
    const pid_t self = currentThread();
    pid_t reporter = 0;
    if (!gReporter.compare_exchange_strong(reporter, self)) {
        // A fault while reporting ends the process at once; a fault on another
        // thread waits for the first report, which ends the process.
        if (reporter == self) _exit(128 + signal);
        for (;;) pause();
    }
    compose(signal, info, context);
    tell();
    removeHalfWritten(self);
    _exit(128 + signal);
}
