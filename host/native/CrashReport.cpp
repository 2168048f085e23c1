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
// How near the stack pointer a fault is the stack's end, and what that is.
constexpr uintptr_t kOverflowReach = 64 * 1024;
const char kOverflow[] = "a stack overflow: a recursion that does not end, or too much on the stack";
// The render thread's own stack for the JVM's handler and this one.
constexpr std::size_t kOwnStackBytes = 256 * 1024;
// The files to remove that fit on rm's command line at most.
constexpr std::size_t kMostRemoved = 64;

char gProgram[64];
std::atomic<pid_t> gReporter{0};
// The thread writing into the files the handler removes, while it writes.
std::atomic<pid_t> gWriter{0};
FixedText<4096> gMessage;
CrashPlace::Detail gDetail;
const char* gArguments[kMostRemoved + 4];

pid_t currentThread() { return pid_t(syscall(SYS_gettid)); }

// What the signal's context says of the interrupted code: the one place that knows the CPU.
struct Registers {
    uintptr_t instruction = 0;
    uintptr_t stack = 0;
    uintptr_t link = 0;  // where the current call returns to, when it is kept in a register
};

Registers registersOf(const void* context) {
    const auto* state = static_cast<const ucontext_t*>(context);
    Registers registers;
#if defined(__x86_64__)
    registers.instruction = uintptr_t(state->uc_mcontext.gregs[REG_RIP]);
    registers.stack = uintptr_t(state->uc_mcontext.gregs[REG_RSP]);
#elif defined(__aarch64__)
    registers.instruction = uintptr_t(state->uc_mcontext.pc);
    registers.stack = uintptr_t(state->uc_mcontext.sp);
    registers.link = uintptr_t(state->uc_mcontext.regs[30]);
#else
    (void)state;
#endif
    return registers;
}

// Where a call to the faulting instruction returns to. Read only when that
// is in no library: then the fault was the call itself, through a bad
// function pointer, and nothing has run since.
uintptr_t returnAddress(const Registers& registers) {
    Dl_info info;
    if (registers.stack == 0 || dladdr(reinterpret_cast<void*>(registers.instruction), &info)) return 0;
    // A call on this CPU leaves the address on the stack, where there is no link register.
    return registers.link != 0 ? registers.link : *reinterpret_cast<const uintptr_t*>(registers.stack);
}

// A fault this close to the stack pointer is the stack's end: no frame fits any more.
bool isStackOverflow(const siginfo_t* info, const Registers& registers) {
    const uintptr_t address = uintptr_t(info->si_addr);
    const uintptr_t distance = address > registers.stack ? address - registers.stack : registers.stack - address;
    return info->si_code > 0 && distance < kOverflowReach;
}

// A stack overflow faults where no frame can be pushed, so that the kernel
// can call a handler (the JVM's first) only on a stack of its own. The JVM
// installs its handler without one: its flags get SA_ONSTACK through the C
// library's own sigaction (the chaining library's would keep the change to
// itself), and the calling thread, the host's render thread, gets the stack.
void overflowsOnOwnStack() {
    alignas(16) static char stack[kOwnStackBytes];
    stack_t own = {};
    own.ss_sp = stack;
    own.ss_size = sizeof(stack);
    if (sigaltstack(&own, nullptr) != 0) return;
    using Sigaction = int (*)(int, const struct sigaction*, struct sigaction*);
    void* library = dlopen("libc.so.6", RTLD_NOW | RTLD_NOLOAD);
    auto sigactionOfC = reinterpret_cast<Sigaction>(library ? dlsym(library, "sigaction") : nullptr);
    struct sigaction jvm = {};
    if (sigactionOfC && sigactionOfC(SIGSEGV, nullptr, &jvm) == 0) {
        jvm.sa_flags |= SA_ONSTACK;
        sigactionOfC(SIGSEGV, &jvm, nullptr);
    }
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
    const Registers registers = registersOf(context);
    const bool inEffect = CrashPlace::describe(registers.instruction, returnAddress(registers), gDetail);
    const bool overflow = signal == SIGSEGV && isStackOverflow(info, registers);
    gMessage << (inEffect ? "the effect crashed: SIG" : "a crash outside the effect: SIG") << sigabbrev_np(signal)
             << " (" << (overflow ? kOverflow : explanation(signal));
    // The address is the fault's only when the kernel sent the signal.
    if ((signal == SIGSEGV || signal == SIGBUS) && info->si_code > 0 && !overflow) {
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
    // The newest: the live window adds a folder for each reload, and removes all but the one loading.
    const std::size_t oldest = paths.size() > kMostRemoved ? paths.size() - kMostRemoved : 0;
    for (std::size_t path = oldest; path < paths.size(); ++path) gArguments[count++] = paths[path].c_str();
    gArguments[count] = nullptr;
    HelperProgram::run(gArguments, -1, nullptr, 0);
}

}  // namespace

void CrashReport::watch(const std::string& program) {
    std::strncpy(gProgram, program.c_str(), sizeof(gProgram) - 1);
    static bool installed = false;
    if (installed || !dlsym(RTLD_DEFAULT, kChainingSymbol)) return;
    CrashPlace::prepare();
    overflowsOnOwnStack();
    struct sigaction action = {};
    action.sa_sigaction = onSignal;
    // Not deferred, so that a fault in the handler itself finds it again and ends the process.
    action.sa_flags = SA_SIGINFO | SA_NODEFER;
    sigemptyset(&action.sa_mask);
    for (int signal : kSignals) sigaction(signal, &action, nullptr);
    installed = true;
}

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
