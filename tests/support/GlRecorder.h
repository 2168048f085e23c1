#pragma once

// Records the GL calls the runtime makes, on their
// way to the real driver: binaries linked with vi_link_recorded() route every
// call of the functions wrapped in GlRecorder.cpp through -Wl,--wrap wrappers
// that call the driver and then append the call to a log.

#include <cstdint>
#include <string>
#include <vector>

namespace vitest {

// A pointer argument as the log keeps it.
inline double address(const void* p) { return double(reinterpret_cast<std::uintptr_t>(p)); }

struct GlCall {
    std::string name;          // "glTexImage2D"
    std::vector<double> args;  // numbers in order, then the result; a name array or a
                               // value array as its first element, other pointers as addresses
    std::string text;          // glShaderSource: the source
};

class GlRecorder {
public:
    // Clears the log and starts recording; stop() ends it. Recording is off at start.
    static void start();
    static void stop();
    static void clear();

    // The recorded calls (or their names) in order; with a filter, only those named in it.
    static std::vector<GlCall> calls(const std::vector<std::string>& filter = {});
    static std::vector<GlCall> callsNamed(const std::string& name);
    static std::vector<std::string> names(const std::vector<std::string>& filter = {});
    static int count(const std::string& name);

    // Makes glGetString(GL_RENDERER) answer `renderer`. For a test binary of
    // its own: the runtime reads it once per process. True, for a static initialiser.
    static bool setRendererOverride(const char* renderer);

    static void record(const char* name, std::vector<double> args, const char* text = nullptr);
};

// Records for the lifetime of the object.
struct GlRecording {
    GlRecording() { GlRecorder::start(); }
    ~GlRecording() { GlRecorder::stop(); }
};

}  // namespace vitest
