// Tells the author where the effect crashed: on SIGSEGV, SIGBUS, SIGFPE,
// SIGILL or SIGABRT, one short message naming the signal and the effect's
// function with its source file and line, then the host's half-written files
// go and the process ends with 128 + the signal's number, leaving no core.
//
// The JVM takes SIGSEGV and the others for itself (safepoints, null checks in
// compiled code), so the handler only ever runs second: the launchers preload
// the JDK's signal chaining library, the JVM's handlers stay in place, and the
// JVM calls this one only for a fault it does not own. Without that library
// nothing is installed and the JVM reports crashes in its own way.
//
// The handler cannot trust the heap (the effect may have broken it), so it
// allocates nothing; what needs memory is done by programs it starts
// (CrashPlace names the place, rm removes the host's half-written files).
#pragma once

#include <csignal>
#include <string>

class CrashReport {
public:
    // Installs the handler once; `program` starts each message ("vi-player").
    static void watch(const std::string& program);
    // Around each write into the files the handler removes (one writing
    // thread): the handler waits for a write under way, and a write that
    // would begin after the handler has started waits for the process to end.
    static void beginWrite();
    static void endWrite();

private:
    static void onSignal(int signal, siginfo_t* info, void* context);
};
