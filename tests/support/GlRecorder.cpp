#include "GlRecorder.h"

#include <GLES2/gl2.h>

#include <algorithm>
#include <atomic>
#include <cstdint>
#include <mutex>
#include <type_traits>

namespace vitest {

namespace {
std::mutex gLogMutex;
std::vector<GlCall> gLog;
std::atomic<bool> gRecording{false};
std::atomic<const char*> gRendererOverride{nullptr};
}  // namespace

void GlRecorder::start() {
    clear();
    gRecording = true;
}

void GlRecorder::clear() {
    std::lock_guard<std::mutex> lock(gLogMutex);
    gLog.clear();
}

void GlRecorder::stop() { gRecording = false; }

std::vector<GlCall> GlRecorder::calls(const std::vector<std::string>& filter) {
    std::lock_guard<std::mutex> lock(gLogMutex);
    std::vector<GlCall> result;
    for (const GlCall& call : gLog)
        if (filter.empty() || std::find(filter.begin(), filter.end(), call.name) != filter.end()) result.push_back(call);
    return result;
}

std::vector<GlCall> GlRecorder::callsNamed(const std::string& name) { return calls({name}); }

std::vector<std::string> GlRecorder::names(const std::vector<std::string>& filter) {
    std::vector<std::string> result;
    for (const GlCall& call : calls(filter)) result.push_back(call.name);
    return result;
}

int GlRecorder::count(const std::string& name) { return int(calls({name}).size()); }

bool GlRecorder::setRendererOverride(const char* renderer) {
    gRendererOverride = renderer;
    return true;
}

void GlRecorder::record(const char* name, std::vector<double> args, const char* text) {
    if (!gRecording) return;
    std::lock_guard<std::mutex> lock(gLogMutex);
    gLog.push_back(GlCall{name, std::move(args), text ? text : ""});
}

}  // namespace vitest

namespace {

// A shader's source is kept as the call's text; the first of an array of
// names (made ones are read after the call) as a number; other pointers as
// addresses.
template <class T>
void add(std::vector<double>& args, const char*& text, T value) {
    if constexpr (std::is_same_v<T, const GLchar* const*>) text = value[0];
    else if constexpr (std::is_same_v<T, GLuint*> || std::is_same_v<T, const GLuint*>)
        args.push_back(double(*value));
    else if constexpr (std::is_pointer_v<T>) args.push_back(double(reinterpret_cast<std::uintptr_t>(value)));
    else args.push_back(double(value));
}

// Calls the driver, then records the call with its arguments and result.
template <class R, class Real>
auto forward(const char* name, Real real) {
    return [=](auto... values) -> R {
        std::vector<double> args;
        const char* text = nullptr;
        if constexpr (std::is_void_v<R>) {
            real();
            (add(args, text, values), ...);
            vitest::GlRecorder::record(name, args, text);
        } else {
            const R result = real();
            (add(args, text, values), ..., add(args, text, result));
            vitest::GlRecorder::record(name, args, text);
            return result;
        }
    };
}

}  // namespace

#define WRAP(ret, name, params, args)     \
    extern "C" ret __real_##name params;  \
    extern "C" ret __wrap_##name params { return forward<ret>(#name, [&] { return __real_##name args; }) args; }

// The list vi_link_recorded() wraps is read from the lines below.
WRAP(void, glAttachShader, (GLuint a, GLuint b), (a, b))
WRAP(void, glBindBuffer, (GLenum a, GLuint b), (a, b))
WRAP(void, glBindFramebuffer, (GLenum a, GLuint b), (a, b))
WRAP(void, glBindRenderbuffer, (GLenum a, GLuint b), (a, b))
WRAP(void, glBindTexture, (GLenum a, GLuint b), (a, b))
WRAP(void, glBufferData, (GLenum a, GLsizeiptr b, const void* c, GLenum d), (a, b, c, d))
WRAP(GLenum, glCheckFramebufferStatus, (GLenum a), (a))
WRAP(void, glClear, (GLbitfield a), (a))
WRAP(void, glCompileShader, (GLuint a), (a))
WRAP(void, glCompressedTexImage2D, (GLenum a, GLint b, GLenum c, GLsizei d, GLsizei e, GLint f, GLsizei g,
                                    const void* h), (a, b, c, d, e, f, g, h))
WRAP(GLuint, glCreateProgram, (), ())
WRAP(GLuint, glCreateShader, (GLenum a), (a))
WRAP(void, glDeleteFramebuffers, (GLsizei a, const GLuint* b), (a, b))
WRAP(void, glDeleteProgram, (GLuint a), (a))
WRAP(void, glDeleteRenderbuffers, (GLsizei a, const GLuint* b), (a, b))
WRAP(void, glDeleteShader, (GLuint a), (a))
WRAP(void, glDeleteTextures, (GLsizei a, const GLuint* b), (a, b))
WRAP(void, glDetachShader, (GLuint a, GLuint b), (a, b))
WRAP(void, glDrawArrays, (GLenum a, GLint b, GLsizei c), (a, b, c))
WRAP(void, glDrawElements, (GLenum a, GLsizei b, GLenum c, const void* d), (a, b, c, d))
WRAP(void, glFramebufferRenderbuffer, (GLenum a, GLenum b, GLenum c, GLuint d), (a, b, c, d))
WRAP(void, glFramebufferTexture2D, (GLenum a, GLenum b, GLenum c, GLuint d, GLint e), (a, b, c, d, e))
WRAP(void, glGenBuffers, (GLsizei a, GLuint* b), (a, b))
WRAP(void, glGenFramebuffers, (GLsizei a, GLuint* b), (a, b))
WRAP(void, glGenRenderbuffers, (GLsizei a, GLuint* b), (a, b))
WRAP(void, glGenTextures, (GLsizei a, GLuint* b), (a, b))
WRAP(void, glGetProgramInfoLog, (GLuint a, GLsizei b, GLsizei* c, GLchar* d), (a, b, c, d))
WRAP(void, glGetProgramiv, (GLuint a, GLenum b, GLint* c), (a, b, c))
WRAP(void, glGetShaderInfoLog, (GLuint a, GLsizei b, GLsizei* c, GLchar* d), (a, b, c, d))
WRAP(void, glGetShaderiv, (GLuint a, GLenum b, GLint* c), (a, b, c))
WRAP(GLboolean, glIsProgram, (GLuint a), (a))
WRAP(GLboolean, glIsTexture, (GLuint a), (a))
WRAP(void, glLinkProgram, (GLuint a), (a))
WRAP(void, glPixelStorei, (GLenum a, GLint b), (a, b))
WRAP(void, glRenderbufferStorage, (GLenum a, GLenum b, GLsizei c, GLsizei d), (a, b, c, d))
WRAP(void, glShaderSource, (GLuint a, GLsizei b, const GLchar* const* c, const GLint* d), (a, b, c, d))
WRAP(void, glTexImage2D, (GLenum a, GLint b, GLint c, GLsizei d, GLsizei e, GLint f, GLenum g, GLenum h,
                          const void* i), (a, b, c, d, e, f, g, h, i))
WRAP(void, glTexParameteri, (GLenum a, GLenum b, GLint c), (a, b, c))
WRAP(void, glTexSubImage2D, (GLenum a, GLint b, GLint c, GLint d, GLsizei e, GLsizei f, GLenum g, GLenum h,
                             const void* i), (a, b, c, d, e, f, g, h, i))
WRAP(void, glUseProgram, (GLuint a), (a))
WRAP(void, glVertexAttribPointer, (GLuint a, GLint b, GLenum c, GLboolean d, GLsizei e, const void* f),
     (a, b, c, d, e, f))
WRAP(void, glViewport, (GLint a, GLint b, GLsizei c, GLsizei d), (a, b, c, d))

// glGetString answers the faked renderer when there is one.
extern "C" const GLubyte* __real_glGetString(GLenum name);
extern "C" const GLubyte* __wrap_glGetString(GLenum name) {
    vitest::GlRecorder::record("glGetString", {double(name)});
    const char* faked = vitest::gRendererOverride;
    return name == GL_RENDERER && faked ? reinterpret_cast<const GLubyte*>(faked) : __real_glGetString(name);
}
