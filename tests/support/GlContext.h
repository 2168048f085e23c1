#pragma once

// A real GL ES 2 context on Mesa's llvmpipe through a headless EGL display
// (EGL_PLATFORM_SURFACELESS_MESA) with a small pbuffer. Everything the tests
// need to stage a lost context: a second context, destroying the current one
// and creating a new one, and leaving no context current.

#include <EGL/egl.h>

#include <cstdint>
#include <vector>

namespace vitest {

class GlContext {
public:
    // Creates the display (once per process), a context and a width x height
    // pbuffer, and makes them current on the calling thread.
    GlContext(int width = 64, int height = 64);
    ~GlContext();

    GlContext(const GlContext&) = delete;
    GlContext& operator=(const GlContext&) = delete;

    void makeCurrent();
    // Makes a second context (made on first use, kept) current with this pbuffer.
    void makeSecondCurrent();
    // Destroys the current context of this object and makes a fresh one current.
    // Mesa may hand back the same handle.
    void recreate();
    // Leaves no context current on this thread.
    static void releaseCurrent();

    static EGLDisplay sharedDisplay();

private:
    EGLContext createContext();

    EGLDisplay mDisplay;
    EGLConfig mConfig;
    EGLSurface mSurface;
    EGLContext mContext;
    EGLContext mSecond;
    int mWidth;
    int mHeight;
};

// RGBA bytes of the current framebuffer's rectangle, bottom row first (as GL reads).
std::vector<std::uint8_t> readPixels(int x, int y, int width, int height);
// One pixel as 0xRRGGBBAA.
std::uint32_t readPixel(int x, int y);

}  // namespace vitest
