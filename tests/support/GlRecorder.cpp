#include "GlRecorder.h"

#include <EGL/egl.h>
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

void GlRecorder::stop() { gRecording = false; }

void GlRecorder::clear() {
    std::lock_guard<std::mutex> lock(gLogMutex);
    gLog.clear();
}

bool GlRecorder::isRecording() { return gRecording; }

std::vector<GlCall> GlRecorder::calls() {
    std::lock_guard<std::mutex> lock(gLogMutex);
    return gLog;
}

std::vector<GlCall> GlRecorder::callsNamed(const std::string& name) {
    std::vector<GlCall> result;
    for (const GlCall& call : calls())
        if (call.name == name) result.push_back(call);
    return result;
}

std::vector<std::string> GlRecorder::names(const std::vector<std::string>& filter) {
    std::vector<std::string> result;
    for (const GlCall& call : calls())
        if (filter.empty() || std::find(filter.begin(), filter.end(), call.name) != filter.end())
            result.push_back(call.name);
    return result;
}

int GlRecorder::count(const std::string& name) { return int(callsNamed(name).size()); }

void GlRecorder::setRendererOverride(const char* renderer) { gRendererOverride = renderer; }

const char* GlRecorder::rendererOverride() { return gRendererOverride; }

void GlRecorder::record(const char* name, std::initializer_list<double> args, const char* text) {
    if (!gRecording) return;
    std::lock_guard<std::mutex> lock(gLogMutex);
    gLog.push_back(GlCall{name, std::vector<double>(args), text ? text : ""});
}

}  // namespace vitest

using vitest::GlRecorder;

namespace {

template <class T>
double number(T value) {
    if constexpr (std::is_pointer_v<T>) return double(reinterpret_cast<std::uintptr_t>(value));
    else return double(value);
}

// Records a call with its arguments as numbers.
struct Record {
    const char* name;
    template <class... T>
    void operator()(T... values) const { GlRecorder::record(name, {number(values)...}); }
};

}  // namespace

// Each wrapper records its call, then forwards it to the driver.
#define WRAP(name, params, args)      \
    extern "C" void __real_##name params; \
    extern "C" void __wrap_##name params { \
        Record{#name} args;               \
        __real_##name args;               \
    }

WRAP(glActiveTexture, (GLenum a), (a))
WRAP(glAttachShader, (GLuint a, GLuint b), (a, b))
WRAP(glBindBuffer, (GLenum a, GLuint b), (a, b))
WRAP(glBindFramebuffer, (GLenum a, GLuint b), (a, b))
WRAP(glBindRenderbuffer, (GLenum a, GLuint b), (a, b))
WRAP(glBindTexture, (GLenum a, GLuint b), (a, b))
WRAP(glBlendFunc, (GLenum a, GLenum b), (a, b))
WRAP(glBufferData, (GLenum a, GLsizeiptr b, const void* c, GLenum d), (a, b, c, d))
WRAP(glClear, (GLbitfield a), (a))
WRAP(glClearColor, (GLfloat a, GLfloat b, GLfloat c, GLfloat d), (a, b, c, d))
WRAP(glColorMask, (GLboolean a, GLboolean b, GLboolean c, GLboolean d), (a, b, c, d))
WRAP(glCompileShader, (GLuint a), (a))
WRAP(glCompressedTexImage2D, (GLenum a, GLint b, GLenum c, GLsizei d, GLsizei e, GLint f, GLsizei g, const void* h),
     (a, b, c, d, e, f, g, h))
WRAP(glCullFace, (GLenum a), (a))
WRAP(glDeleteProgram, (GLuint a), (a))
WRAP(glDeleteShader, (GLuint a), (a))
WRAP(glDepthFunc, (GLenum a), (a))
WRAP(glDepthMask, (GLboolean a), (a))
WRAP(glDetachShader, (GLuint a, GLuint b), (a, b))
WRAP(glDisable, (GLenum a), (a))
WRAP(glDrawArrays, (GLenum a, GLint b, GLsizei c), (a, b, c))
WRAP(glDrawElements, (GLenum a, GLsizei b, GLenum c, const void* d), (a, b, c, d))
WRAP(glEnable, (GLenum a), (a))
WRAP(glEnableVertexAttribArray, (GLuint a), (a))
WRAP(glFramebufferRenderbuffer, (GLenum a, GLenum b, GLenum c, GLuint d), (a, b, c, d))
WRAP(glFramebufferTexture2D, (GLenum a, GLenum b, GLenum c, GLuint d, GLint e), (a, b, c, d, e))
WRAP(glGetProgramInfoLog, (GLuint a, GLsizei b, GLsizei* c, GLchar* d), (a, b, c, d))
WRAP(glGetProgramiv, (GLuint a, GLenum b, GLint* c), (a, b, c))
WRAP(glGetShaderInfoLog, (GLuint a, GLsizei b, GLsizei* c, GLchar* d), (a, b, c, d))
WRAP(glGetShaderiv, (GLuint a, GLenum b, GLint* c), (a, b, c))
WRAP(glLinkProgram, (GLuint a), (a))
WRAP(glPixelStorei, (GLenum a, GLint b), (a, b))
WRAP(glReadPixels, (GLint a, GLint b, GLsizei c, GLsizei d, GLenum e, GLenum f, void* g), (a, b, c, d, e, f, g))
WRAP(glRenderbufferStorage, (GLenum a, GLenum b, GLsizei c, GLsizei d), (a, b, c, d))
WRAP(glTexImage2D, (GLenum a, GLint b, GLint c, GLsizei d, GLsizei e, GLint f, GLenum g, GLenum h, const void* i),
     (a, b, c, d, e, f, g, h, i))
WRAP(glTexParameteri, (GLenum a, GLenum b, GLint c), (a, b, c))
WRAP(glTexSubImage2D, (GLenum a, GLint b, GLint c, GLint d, GLsizei e, GLsizei f, GLenum g, GLenum h, const void* i),
     (a, b, c, d, e, f, g, h, i))
WRAP(glUniform1i, (GLint a, GLint b), (a, b))
WRAP(glUseProgram, (GLuint a), (a))
WRAP(glVertexAttribPointer, (GLuint a, GLint b, GLenum c, GLboolean d, GLsizei e, const void* f), (a, b, c, d, e, f))
WRAP(glViewport, (GLint a, GLint b, GLsizei c, GLsizei d), (a, b, c, d))

// Uniforms: location, count, then the first element's components (up to
// four); matrices: location, count, transpose, then the first four elements.
#define WRAP_UNIFORM(name, type, n)                                                                      \
    extern "C" void __real_##name(GLint l, GLsizei c, const type* v);                                    \
    extern "C" void __wrap_##name(GLint l, GLsizei c, const type* v) {                                   \
        Record{#name}(l, c, v[0], n > 1 ? v[1] : 0, n > 2 ? v[2] : 0, n > 3 ? v[3] : 0);                 \
        __real_##name(l, c, v);                                                                          \
    }
WRAP_UNIFORM(glUniform1iv, GLint, 1)
WRAP_UNIFORM(glUniform2iv, GLint, 2)
WRAP_UNIFORM(glUniform3iv, GLint, 3)
WRAP_UNIFORM(glUniform4iv, GLint, 4)
WRAP_UNIFORM(glUniform1fv, GLfloat, 1)
WRAP_UNIFORM(glUniform2fv, GLfloat, 2)
WRAP_UNIFORM(glUniform3fv, GLfloat, 3)
WRAP_UNIFORM(glUniform4fv, GLfloat, 4)
#define WRAP_MATRIX(name)                                                                 \
    extern "C" void __real_##name(GLint l, GLsizei c, GLboolean t, const GLfloat* v);     \
    extern "C" void __wrap_##name(GLint l, GLsizei c, GLboolean t, const GLfloat* v) {    \
        Record{#name}(l, c, t, v[0], v[1], v[2], v[3]);                                   \
        __real_##name(l, c, t, v);                                                        \
    }
WRAP_MATRIX(glUniformMatrix2fv)
WRAP_MATRIX(glUniformMatrix3fv)
WRAP_MATRIX(glUniformMatrix4fv)

// Names made and deleted: the count and the first name (made ones after the call).
#define WRAP_NAMES(name, type, before, after)                  \
    extern "C" void __real_##name(GLsizei n, type* names);     \
    extern "C" void __wrap_##name(GLsizei n, type* names) {    \
        if (before) Record{#name}(n, names[0]);                \
        __real_##name(n, names);                               \
        if (after) Record{#name}(n, names[0]);                 \
    }
WRAP_NAMES(glGenBuffers, GLuint, false, true)
WRAP_NAMES(glGenFramebuffers, GLuint, false, true)
WRAP_NAMES(glGenRenderbuffers, GLuint, false, true)
WRAP_NAMES(glGenTextures, GLuint, false, true)
WRAP_NAMES(glDeleteBuffers, const GLuint, true, false)
WRAP_NAMES(glDeleteFramebuffers, const GLuint, true, false)
WRAP_NAMES(glDeleteRenderbuffers, const GLuint, true, false)
WRAP_NAMES(glDeleteTextures, const GLuint, true, false)

// Calls with a result: the result is recorded after the arguments; a name
// looked up is kept as the call's text.
#define WRAP_RESULT(ret, name, params, args, text, ...)  \
    extern "C" ret __real_##name params;                 \
    extern "C" ret __wrap_##name params {                \
        ret result = __real_##name args;                 \
        GlRecorder::record(#name, {__VA_ARGS__}, text);  \
        return result;                                   \
    }
WRAP_RESULT(GLenum, glCheckFramebufferStatus, (GLenum t), (t), nullptr, double(t), double(result))
WRAP_RESULT(GLuint, glCreateProgram, (), (), nullptr, double(result))
WRAP_RESULT(GLuint, glCreateShader, (GLenum t), (t), nullptr, double(t), double(result))
WRAP_RESULT(GLint, glGetAttribLocation, (GLuint p, const GLchar* n), (p, n), n, double(p), double(result))
WRAP_RESULT(GLint, glGetUniformLocation, (GLuint p, const GLchar* n), (p, n), n, double(p), double(result))
WRAP_RESULT(GLboolean, glIsProgram, (GLuint p), (p), nullptr, double(p), double(result))
WRAP_RESULT(GLboolean, glIsTexture, (GLuint t), (t), nullptr, double(t), double(result))
WRAP_RESULT(EGLContext, eglGetCurrentContext, (), (), nullptr, number(result))

extern "C" const GLubyte* __real_glGetString(GLenum e);
extern "C" const GLubyte* __wrap_glGetString(GLenum e) {
    Record{"glGetString"}(e);
    const char* override = GlRecorder::rendererOverride();
    if (e == GL_RENDERER && override) return reinterpret_cast<const GLubyte*>(override);
    return __real_glGetString(e);
}

extern "C" void __real_glShaderSource(GLuint s, GLsizei c, const GLchar* const* t, const GLint* l);
extern "C" void __wrap_glShaderSource(GLuint s, GLsizei c, const GLchar* const* t, const GLint* l) {
    GlRecorder::record("glShaderSource", {double(s), double(c), number(l)}, c > 0 ? t[0] : nullptr);
    __real_glShaderSource(s, c, t, l);
}
