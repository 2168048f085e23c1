#include "GlContext.h"

#include <EGL/eglext.h>
#include <GLES2/gl2.h>

#include <cstdio>
#include <cstdlib>

namespace vitest {

namespace {

// A failure of the test bed itself ends the process at once.
template <class T>
T check(T value, bool ok, const char* what) {
    if (ok) return value;
    std::fprintf(stderr, "test bed: %s failed (EGL error 0x%x)\n", what, eglGetError());
    std::abort();
}

EGLDisplay display() {
    static EGLDisplay shared = [] {
        auto get = reinterpret_cast<PFNEGLGETPLATFORMDISPLAYEXTPROC>(eglGetProcAddress("eglGetPlatformDisplayEXT"));
        EGLDisplay d = get ? get(EGL_PLATFORM_SURFACELESS_MESA, EGL_DEFAULT_DISPLAY, nullptr) : EGL_NO_DISPLAY;
        return check(d, d != EGL_NO_DISPLAY && eglInitialize(d, nullptr, nullptr) && eglBindAPI(EGL_OPENGL_ES_API),
                     "the EGL display");
    }();
    return shared;
}

EGLContext createContext(EGLConfig config) {
    const EGLint attributes[] = {EGL_CONTEXT_CLIENT_VERSION, 2, EGL_NONE};
    EGLContext context = eglCreateContext(display(), config, EGL_NO_CONTEXT, attributes);
    return check(context, context != EGL_NO_CONTEXT, "eglCreateContext");
}

}  // namespace

GlContext::GlContext(int width, int height) : mWidth(width), mHeight(height) {
    const EGLint configAttributes[] = {EGL_SURFACE_TYPE, EGL_PBUFFER_BIT, EGL_RENDERABLE_TYPE, EGL_OPENGL_ES2_BIT,
                                       EGL_RED_SIZE, 8, EGL_GREEN_SIZE, 8, EGL_BLUE_SIZE, 8, EGL_ALPHA_SIZE, 8,
                                       EGL_DEPTH_SIZE, 16, EGL_NONE};
    EGLint count = 0;
    check(0, eglChooseConfig(display(), configAttributes, &mConfig, 1, &count) && count == 1, "eglChooseConfig");
    const EGLint surfaceAttributes[] = {EGL_WIDTH, width, EGL_HEIGHT, height, EGL_NONE};
    mSurface = eglCreatePbufferSurface(display(), mConfig, surfaceAttributes);
    check(0, mSurface != EGL_NO_SURFACE, "eglCreatePbufferSurface");
    mContext = createContext(mConfig);
    makeCurrent();
}

GlContext::~GlContext() {
    releaseCurrent();
    if (mSecond != EGL_NO_CONTEXT) eglDestroyContext(display(), mSecond);
    eglDestroyContext(display(), mContext);
    eglDestroySurface(display(), mSurface);
}

void GlContext::use(EGLContext context) {
    check(0, eglMakeCurrent(display(), mSurface, mSurface, context), "eglMakeCurrent");
    glViewport(0, 0, mWidth, mHeight);
}

void GlContext::makeCurrent() { use(mContext); }

void GlContext::makeSecondCurrent() {
    if (mSecond == EGL_NO_CONTEXT) mSecond = createContext(mConfig);
    use(mSecond);
}

void GlContext::recreate() {
    releaseCurrent();
    eglDestroyContext(display(), mContext);
    mContext = createContext(mConfig);
    makeCurrent();
}

void GlContext::releaseCurrent() { eglMakeCurrent(display(), EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT); }

std::vector<std::uint8_t> readPixels(int x, int y, int width, int height) {
    std::vector<std::uint8_t> pixels(std::size_t(width) * height * 4);
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    glReadPixels(x, y, width, height, GL_RGBA, GL_UNSIGNED_BYTE, pixels.data());
    return pixels;
}

}  // namespace vitest
