#include "GlRecorder.h"

#include <EGL/egl.h>
#include <GLES2/gl2.h>
#include <GLES2/gl2ext.h>

#include <algorithm>
#include <atomic>
#include <cstdint>

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
    std::lock_guard<std::mutex> lock(gLogMutex);
    std::vector<GlCall> result;
    for (const GlCall& call : gLog)
        if (call.name == name) result.push_back(call);
    return result;
}

std::vector<std::string> GlRecorder::names() {
    std::lock_guard<std::mutex> lock(gLogMutex);
    std::vector<std::string> result;
    for (const GlCall& call : gLog) result.push_back(call.name);
    return result;
}

std::vector<std::string> GlRecorder::names(const std::vector<std::string>& filter) {
    std::vector<std::string> result;
    for (const std::string& name : names())
        if (std::find(filter.begin(), filter.end(), name) != filter.end()) result.push_back(name);
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
double ptr(const void* p) { return double(reinterpret_cast<std::uintptr_t>(p)); }
}  // namespace

// Each wrapper records its call (calls with a result get the result as their
// last argument; glGen* get the first generated name) and forwards to the driver.
#define FORWARD0(ret, name, params, args, ...)                  \
    extern "C" ret __real_##name params;                        \
    extern "C" ret __wrap_##name params {                       \
        GlRecorder::record(#name, {__VA_ARGS__});               \
        return __real_##name args;                              \
    }

FORWARD0(void, glActiveTexture, (GLenum t), (t), double(t))
FORWARD0(void, glAttachShader, (GLuint p, GLuint s), (p, s), double(p), double(s))
FORWARD0(void, glBindBuffer, (GLenum t, GLuint b), (t, b), double(t), double(b))
FORWARD0(void, glBindFramebuffer, (GLenum t, GLuint b), (t, b), double(t), double(b))
FORWARD0(void, glBindRenderbuffer, (GLenum t, GLuint b), (t, b), double(t), double(b))
FORWARD0(void, glBindTexture, (GLenum t, GLuint b), (t, b), double(t), double(b))
FORWARD0(void, glBlendFunc, (GLenum s, GLenum d), (s, d), double(s), double(d))
FORWARD0(void, glBufferData, (GLenum t, GLsizeiptr n, const void* d, GLenum u), (t, n, d, u), double(t), double(n),
         ptr(d), double(u))
FORWARD0(void, glClear, (GLbitfield m), (m), double(m))
FORWARD0(void, glClearColor, (GLfloat r, GLfloat g, GLfloat b, GLfloat a), (r, g, b, a), r, g, b, a)
FORWARD0(void, glColorMask, (GLboolean r, GLboolean g, GLboolean b, GLboolean a), (r, g, b, a), double(r), double(g),
         double(b), double(a))
FORWARD0(void, glCompileShader, (GLuint s), (s), double(s))
FORWARD0(void, glCompressedTexImage2D,
         (GLenum t, GLint l, GLenum f, GLsizei w, GLsizei h, GLint b, GLsizei n, const void* d),
         (t, l, f, w, h, b, n, d), double(t), double(l), double(f), double(w), double(h), double(b), double(n), ptr(d))
FORWARD0(void, glCullFace, (GLenum m), (m), double(m))
FORWARD0(void, glDeleteProgram, (GLuint p), (p), double(p))
FORWARD0(void, glDeleteShader, (GLuint s), (s), double(s))
FORWARD0(void, glDepthFunc, (GLenum f), (f), double(f))
FORWARD0(void, glDepthMask, (GLboolean f), (f), double(f))
FORWARD0(void, glDetachShader, (GLuint p, GLuint s), (p, s), double(p), double(s))
FORWARD0(void, glDisable, (GLenum c), (c), double(c))
FORWARD0(void, glDrawArrays, (GLenum m, GLint f, GLsizei c), (m, f, c), double(m), double(f), double(c))
FORWARD0(void, glDrawElements, (GLenum m, GLsizei c, GLenum t, const void* i), (m, c, t, i), double(m), double(c),
         double(t), ptr(i))
FORWARD0(void, glEnable, (GLenum c), (c), double(c))
FORWARD0(void, glEnableVertexAttribArray, (GLuint i), (i), double(i))
FORWARD0(void, glFramebufferRenderbuffer, (GLenum t, GLenum a, GLenum rt, GLuint r), (t, a, rt, r), double(t),
         double(a), double(rt), double(r))
FORWARD0(void, glFramebufferTexture2D, (GLenum t, GLenum a, GLenum tt, GLuint tex, GLint l), (t, a, tt, tex, l),
         double(t), double(a), double(tt), double(tex), double(l))
FORWARD0(void, glGetProgramInfoLog, (GLuint p, GLsizei n, GLsizei* l, GLchar* s), (p, n, l, s), double(p), double(n))
FORWARD0(void, glGetProgramiv, (GLuint p, GLenum e, GLint* v), (p, e, v), double(p), double(e))
FORWARD0(void, glGetShaderInfoLog, (GLuint p, GLsizei n, GLsizei* l, GLchar* s), (p, n, l, s), double(p), double(n))
FORWARD0(void, glGetShaderiv, (GLuint p, GLenum e, GLint* v), (p, e, v), double(p), double(e))
FORWARD0(void, glLinkProgram, (GLuint p), (p), double(p))
FORWARD0(void, glPixelStorei, (GLenum e, GLint v), (e, v), double(e), double(v))
FORWARD0(void, glReadPixels, (GLint x, GLint y, GLsizei w, GLsizei h, GLenum f, GLenum t, void* p),
         (x, y, w, h, f, t, p), double(x), double(y), double(w), double(h), double(f), double(t), ptr(p))
FORWARD0(void, glRenderbufferStorage, (GLenum t, GLenum f, GLsizei w, GLsizei h), (t, f, w, h), double(t), double(f),
         double(w), double(h))
FORWARD0(void, glTexImage2D,
         (GLenum t, GLint l, GLint i, GLsizei w, GLsizei h, GLint b, GLenum f, GLenum ty, const void* p),
         (t, l, i, w, h, b, f, ty, p), double(t), double(l), double(i), double(w), double(h), double(b), double(f),
         double(ty), ptr(p))
FORWARD0(void, glTexParameteri, (GLenum t, GLenum p, GLint v), (t, p, v), double(t), double(p), double(v))
FORWARD0(void, glTexSubImage2D,
         (GLenum t, GLint l, GLint x, GLint y, GLsizei w, GLsizei h, GLenum f, GLenum ty, const void* p),
         (t, l, x, y, w, h, f, ty, p), double(t), double(l), double(x), double(y), double(w), double(h), double(f),
         double(ty), ptr(p))
FORWARD0(void, glUniform1i, (GLint l, GLint v), (l, v), double(l), double(v))
FORWARD0(void, glUseProgram, (GLuint p), (p), double(p))
FORWARD0(void, glVertexAttribPointer, (GLuint i, GLint s, GLenum t, GLboolean n, GLsizei st, const void* p),
         (i, s, t, n, st, p), double(i), double(s), double(t), double(n), double(st), ptr(p))
FORWARD0(void, glViewport, (GLint x, GLint y, GLsizei w, GLsizei h), (x, y, w, h), double(x), double(y), double(w),
         double(h))

// Uniform arrays: location, count, then the first element's components.
#define FORWARD_UNIFORM(name, type, n)                                              \
    extern "C" void __real_##name(GLint l, GLsizei c, const type* v);               \
    extern "C" void __wrap_##name(GLint l, GLsizei c, const type* v) {              \
        if (GlRecorder::isRecording()) {                                            \
            double e[4] = {0, 0, 0, 0};                                             \
            for (int i = 0; i < n && v; ++i) e[i] = double(v[i]);                   \
            GlRecorder::record(#name, {double(l), double(c), e[0], e[1], e[2], e[3]}); \
        }                                                                           \
        __real_##name(l, c, v);                                                     \
    }
FORWARD_UNIFORM(glUniform1iv, GLint, 1)
FORWARD_UNIFORM(glUniform2iv, GLint, 2)
FORWARD_UNIFORM(glUniform3iv, GLint, 3)
FORWARD_UNIFORM(glUniform4iv, GLint, 4)
FORWARD_UNIFORM(glUniform1fv, GLfloat, 1)
FORWARD_UNIFORM(glUniform2fv, GLfloat, 2)
FORWARD_UNIFORM(glUniform3fv, GLfloat, 3)
FORWARD_UNIFORM(glUniform4fv, GLfloat, 4)

// Matrices: location, count, transpose, then the first four elements.
#define FORWARD_MATRIX(name)                                                                  \
    extern "C" void __real_##name(GLint l, GLsizei c, GLboolean t, const GLfloat* v);          \
    extern "C" void __wrap_##name(GLint l, GLsizei c, GLboolean t, const GLfloat* v) {         \
        GlRecorder::record(#name, {double(l), double(c), double(t), v ? v[0] : 0.0, v ? v[1] : 0.0, \
                                   v ? v[2] : 0.0, v ? v[3] : 0.0});                           \
        __real_##name(l, c, t, v);                                                             \
    }
FORWARD_MATRIX(glUniformMatrix2fv)
FORWARD_MATRIX(glUniformMatrix3fv)
FORWARD_MATRIX(glUniformMatrix4fv)

// Name generation: count and the first generated name.
#define FORWARD_GEN(name)                                      \
    extern "C" void __real_##name(GLsizei n, GLuint* names);   \
    extern "C" void __wrap_##name(GLsizei n, GLuint* names) {  \
        __real_##name(n, names);                               \
        GlRecorder::record(#name, {double(n), double(names[0])}); \
    }
FORWARD_GEN(glGenBuffers)
FORWARD_GEN(glGenFramebuffers)
FORWARD_GEN(glGenRenderbuffers)
FORWARD_GEN(glGenTextures)

FORWARD0(void, glDeleteBuffers, (GLsizei n, const GLuint* b), (n, b), double(n), double(b[0]))
FORWARD0(void, glDeleteFramebuffers, (GLsizei n, const GLuint* b), (n, b), double(n), double(b[0]))
FORWARD0(void, glDeleteRenderbuffers, (GLsizei n, const GLuint* b), (n, b), double(n), double(b[0]))
FORWARD0(void, glDeleteTextures, (GLsizei n, const GLuint* b), (n, b), double(n), double(b[0]))

// Calls with a result: the result is recorded after the arguments.
#define FORWARD_RESULT(ret, name, params, args, text, ...)  \
    extern "C" ret __real_##name params;                    \
    extern "C" ret __wrap_##name params {                   \
        ret result = __real_##name args;                    \
        GlRecorder::record(#name, {__VA_ARGS__}, text);     \
        return result;                                      \
    }
FORWARD_RESULT(GLenum, glCheckFramebufferStatus, (GLenum t), (t), nullptr, double(t), double(result))
FORWARD_RESULT(GLuint, glCreateProgram, (), (), nullptr, double(result))
FORWARD_RESULT(GLuint, glCreateShader, (GLenum t), (t), nullptr, double(t), double(result))
FORWARD_RESULT(GLint, glGetAttribLocation, (GLuint p, const GLchar* n), (p, n), n, double(p), double(result))
FORWARD_RESULT(GLint, glGetUniformLocation, (GLuint p, const GLchar* n), (p, n), n, double(p), double(result))
FORWARD_RESULT(GLboolean, glIsProgram, (GLuint p), (p), nullptr, double(p), double(result))
FORWARD_RESULT(GLboolean, glIsTexture, (GLuint t), (t), nullptr, double(t), double(result))
FORWARD_RESULT(EGLContext, eglGetCurrentContext, (), (), nullptr, ptr(result))

extern "C" const GLubyte* __real_glGetString(GLenum e);
extern "C" const GLubyte* __wrap_glGetString(GLenum e) {
    GlRecorder::record("glGetString", {double(e)});
    const char* override = GlRecorder::rendererOverride();
    if (e == GL_RENDERER && override) return reinterpret_cast<const GLubyte*>(override);
    return __real_glGetString(e);
}

extern "C" void __real_glShaderSource(GLuint s, GLsizei c, const GLchar* const* t, const GLint* l);
extern "C" void __wrap_glShaderSource(GLuint s, GLsizei c, const GLchar* const* t, const GLint* l) {
    GlRecorder::record("glShaderSource", {double(s), double(c), ptr(l)}, c > 0 ? t[0] : nullptr);
    __real_glShaderSource(s, c, t, l);
}
