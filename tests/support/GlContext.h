#pragma once

// A real GL ES 2 context on Mesa's llvmpipe through a headless EGL display
// (EGL_PLATFORM_SURFACELESS_MESA) with a small pbuffer, and what the tests
// need to stage a lost context: a second context, destroying the current one
// and making a new one, and leaving no context current.

#include <EGL/egl.h>

#include <cstdint>
#include <vector>

namespace vitest {

class GlContext {
public:
    // Makes a context and a width x height pbuffer current on the calling thread.
    GlContext(int width = 64, int height = 64);
    ~GlContext();
    GlContext(const GlContext&) = delete;
    GlContext& operator=(const GlContext&) = delete;

    void makeCurrent();
    // Makes a second context (made on first use, kept) current with this pbuffer.
    void makeSecondCurrent();
    // Destroys this object's context and makes a fresh one current (Mesa may hand back the same handle).
    void recreate();
    static void releaseCurrent();

private:
    void use(EGLContext context);

    EGLConfig mConfig = nullptr;
    EGLSurface mSurface;
    EGLContext mContext;
    EGLContext mSecond = EGL_NO_CONTEXT;
    int mWidth, mHeight;
};

// RGBA bytes of the current framebuffer's rectangle, bottom row first (as GL reads).
std::vector<std::uint8_t> readPixels(int x, int y, int width, int height);

}  // namespace vitest
