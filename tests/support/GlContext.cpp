#include "GlContext.h"

#include <EGL/eglext.h>
#include <GLES2/gl2.h>

#include <cstdio>
#include <cstdlib>

namespace vitest {

namespace {

[[noreturn]] void fail(const char* what) {
    std::fprintf(stderr, "test bed: %s failed (EGL error 0x%x)\n", what, eglGetError());
    std::abort();
}

}  // namespace

EGLDisplay GlContext::sharedDisplay() {
    static EGLDisplay display = [] {
        auto getPlatformDisplay =
            reinterpret_cast<PFNEGLGETPLATFORMDISPLAYEXTPROC>(eglGetProcAddress("eglGetPlatformDisplayEXT"));
        if (!getPlatformDisplay) fail("eglGetPlatformDisplayEXT lookup");
        EGLDisplay d = getPlatformDisplay(EGL_PLATFORM_SURFACELESS_MESA, EGL_DEFAULT_DISPLAY, nullptr);
        if (d == EGL_NO_DISPLAY) fail("eglGetPlatformDisplayEXT");
        if (!eglInitialize(d, nullptr, nullptr)) fail("eglInitialize");
        if (!eglBindAPI(EGL_OPENGL_ES_API)) fail("eglBindAPI");
        return d;
    }();
    return display;
}

GlContext::GlContext(int width, int height)
    : mDisplay(sharedDisplay()), mConfig(nullptr), mSurface(EGL_NO_SURFACE), mContext(EGL_NO_CONTEXT),
      mSecond(EGL_NO_CONTEXT), mWidth(width), mHeight(height) {
    const EGLint configAttributes[] = {EGL_SURFACE_TYPE, EGL_PBUFFER_BIT, EGL_RENDERABLE_TYPE, EGL_OPENGL_ES2_BIT,
                                       EGL_RED_SIZE, 8, EGL_GREEN_SIZE, 8, EGL_BLUE_SIZE, 8, EGL_ALPHA_SIZE, 8,
                                       EGL_DEPTH_SIZE, 16, EGL_NONE};
    EGLint count = 0;
    if (!eglChooseConfig(mDisplay, configAttributes, &mConfig, 1, &count) || count < 1) fail("eglChooseConfig");
    const EGLint surfaceAttributes[] = {EGL_WIDTH, width, EGL_HEIGHT, height, EGL_NONE};
    mSurface = eglCreatePbufferSurface(mDisplay, mConfig, surfaceAttributes);
    if (mSurface == EGL_NO_SURFACE) fail("eglCreatePbufferSurface");
    mContext = createContext();
    makeCurrent();
}

GlContext::~GlContext() {
    eglMakeCurrent(mDisplay, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT);
    if (mSecond != EGL_NO_CONTEXT) eglDestroyContext(mDisplay, mSecond);
    eglDestroyContext(mDisplay, mContext);
    eglDestroySurface(mDisplay, mSurface);
}

EGLContext GlContext::createContext() {
    const EGLint contextAttributes[] = {EGL_CONTEXT_CLIENT_VERSION, 2, EGL_NONE};
    EGLContext context = eglCreateContext(mDisplay, mConfig, EGL_NO_CONTEXT, contextAttributes);
    if (context == EGL_NO_CONTEXT) fail("eglCreateContext");
    return context;
}

void GlContext::makeCurrent() {
    if (!eglMakeCurrent(mDisplay, mSurface, mSurface, mContext)) fail("eglMakeCurrent");
    glViewport(0, 0, mWidth, mHeight);
}

void GlContext::makeSecondCurrent() {
    if (mSecond == EGL_NO_CONTEXT) mSecond = createContext();
    if (!eglMakeCurrent(mDisplay, mSurface, mSurface, mSecond)) fail("eglMakeCurrent (second)");
    glViewport(0, 0, mWidth, mHeight);
}

void GlContext::recreate() {
    eglMakeCurrent(mDisplay, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT);
    eglDestroyContext(mDisplay, mContext);
    mContext = createContext();
    makeCurrent();
}

void GlContext::releaseCurrent() {
    eglMakeCurrent(sharedDisplay(), EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT);
}

std::vector<std::uint8_t> readPixels(int x, int y, int width, int height) {
    std::vector<std::uint8_t> pixels(std::size_t(width) * height * 4);
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    glReadPixels(x, y, width, height, GL_RGBA, GL_UNSIGNED_BYTE, pixels.data());
    return pixels;
}

std::uint32_t readPixel(int x, int y) {
    std::vector<std::uint8_t> p = readPixels(x, y, 1, 1);
    return (std::uint32_t(p[0]) << 24) | (std::uint32_t(p[1]) << 16) | (std::uint32_t(p[2]) << 8) | p[3];
}

}  // namespace vitest
