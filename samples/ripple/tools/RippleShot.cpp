// ripple-shot: renders the ripple sample headless and writes PNG pictures of
// a fixed time line, for looking at the effect while working on it. Not a
// test. Build with -DRIPPLE_BUILD_TOOLS=ON (or VI_SAMPLE_TOOLS=ON in the main
// build), run:
//   ripple-shot <libripple.so> <assets dir> <output dir> [photo]
// With "photo" a generated landscape picture is filed as the host's
// "wallpaper"; without it the scene shows its own fallback.
//
// Time is the driver's: clock_gettime is defined here, and since the
// runtime's clock calls resolve to the executable's definition, the runtime
// sees exactly the seconds the time line sets.

#include <EGL/egl.h>
#include <EGL/eglext.h>
#include <GLES2/gl2.h>
#include <dlfcn.h>
#include <time.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Render/Texture.h"
#include "Tools/DirectoryAssetManager.h"
#include "Tools/File.h"

namespace {

double gFakeSeconds = 1000.0;

}  // namespace

extern "C" int clock_gettime(clockid_t, struct timespec* tp) __THROW {
    tp->tv_sec = time_t(gFakeSeconds);
    tp->tv_nsec = long((gFakeSeconds - std::floor(gFakeSeconds)) * 1e9);
    return 0;
}

namespace {

[[noreturn]] void fail(const char* what) {
    std::fprintf(stderr, "ripple-shot: %s failed (EGL 0x%x)\n", what, eglGetError());
    std::exit(1);
}

class Surfaces {
public:
    Surfaces() {
        auto getPlatformDisplay =
            reinterpret_cast<PFNEGLGETPLATFORMDISPLAYEXTPROC>(eglGetProcAddress("eglGetPlatformDisplayEXT"));
        if (!getPlatformDisplay) fail("eglGetPlatformDisplayEXT");
        mDisplay = getPlatformDisplay(EGL_PLATFORM_SURFACELESS_MESA, EGL_DEFAULT_DISPLAY, nullptr);
        if (mDisplay == EGL_NO_DISPLAY || !eglInitialize(mDisplay, nullptr, nullptr)) fail("eglInitialize");
        eglBindAPI(EGL_OPENGL_ES_API);
        const EGLint configAttributes[] = {EGL_SURFACE_TYPE, EGL_PBUFFER_BIT, EGL_RENDERABLE_TYPE, EGL_OPENGL_ES2_BIT,
                                           EGL_RED_SIZE, 8, EGL_GREEN_SIZE, 8, EGL_BLUE_SIZE, 8, EGL_ALPHA_SIZE, 8,
                                           EGL_DEPTH_SIZE, 16, EGL_NONE};
        EGLint count = 0;
        if (!eglChooseConfig(mDisplay, configAttributes, &mConfig, 1, &count) || count < 1) fail("eglChooseConfig");
        const EGLint contextAttributes[] = {EGL_CONTEXT_CLIENT_VERSION, 2, EGL_NONE};
        mContext = eglCreateContext(mDisplay, mConfig, EGL_NO_CONTEXT, contextAttributes);
        if (mContext == EGL_NO_CONTEXT) fail("eglCreateContext");
    }

    void use(int width, int height) {
        const EGLint attributes[] = {EGL_WIDTH, width, EGL_HEIGHT, height, EGL_NONE};
        EGLSurface surface = eglCreatePbufferSurface(mDisplay, mConfig, attributes);
        if (surface == EGL_NO_SURFACE) fail("eglCreatePbufferSurface");
        if (!eglMakeCurrent(mDisplay, surface, surface, mContext)) fail("eglMakeCurrent");
        glViewport(0, 0, width, height);
        mWidth = width;
        mHeight = height;
    }

    int mWidth = 0;
    int mHeight = 0;

private:
    EGLDisplay mDisplay;
    EGLConfig mConfig;
    EGLContext mContext;
};

std::uint32_t crc32(const std::uint8_t* data, std::size_t size, std::uint32_t crc = 0) {
    crc = ~crc;
    for (std::size_t i = 0; i < size; ++i) {
        crc ^= data[i];
        for (int k = 0; k < 8; ++k) crc = (crc >> 1) ^ (0xEDB88320u & (0u - (crc & 1u)));
    }
    return ~crc;
}

void putU32(std::vector<std::uint8_t>& out, std::uint32_t v) {
    for (int shift = 24; shift >= 0; shift -= 8) out.push_back(std::uint8_t(v >> shift));
}

void chunk(std::vector<std::uint8_t>& png, const char* type, const std::vector<std::uint8_t>& data) {
    putU32(png, std::uint32_t(data.size()));
    std::vector<std::uint8_t> body(type, type + 4);
    body.insert(body.end(), data.begin(), data.end());
    png.insert(png.end(), body.begin(), body.end());
    putU32(png, crc32(body.data(), body.size()));
}

// An RGB PNG with stored (uncompressed) deflate blocks: no zlib needed.
void writePng(const std::string& path, int width, int height, const std::vector<std::uint8_t>& rgbaBottomUp) {
    std::vector<std::uint8_t> raw;
    for (int y = height - 1; y >= 0; --y) {
        raw.push_back(0);
        for (int x = 0; x < width; ++x)
            for (int c = 0; c < 3; ++c) raw.push_back(rgbaBottomUp[(std::size_t(y) * width + x) * 4 + c]);
    }
    std::vector<std::uint8_t> z = {0x78, 0x01};
    std::uint32_t a = 1, b = 0;
    for (std::uint8_t byte : raw) {
        a = (a + byte) % 65521;
        b = (b + a) % 65521;
    }
    for (std::size_t at = 0; at < raw.size(); at += 65535) {
        std::size_t n = std::min<std::size_t>(65535, raw.size() - at);
        z.push_back(at + n == raw.size() ? 1 : 0);
        z.push_back(std::uint8_t(n));
        z.push_back(std::uint8_t(n >> 8));
        z.push_back(std::uint8_t(~n));
        z.push_back(std::uint8_t(~n >> 8));
        z.insert(z.end(), raw.begin() + long(at), raw.begin() + long(at + n));
    }
    putU32(z, (b << 16) | a);
    std::vector<std::uint8_t> png = {0x89, 'P', 'N', 'G', '\r', '\n', 0x1A, '\n'};
    std::vector<std::uint8_t> header;
    putU32(header, std::uint32_t(width));
    putU32(header, std::uint32_t(height));
    header.insert(header.end(), {8, 2, 0, 0, 0});
    chunk(png, "IHDR", header);
    chunk(png, "IDAT", z);
    chunk(png, "IEND", {});
    std::FILE* f = std::fopen(path.c_str(), "wb");
    if (!f) return;
    std::fwrite(png.data(), 1, png.size(), f);
    std::fclose(f);
}

// A landscape "photo" wider than the screen: sky, sun, hills and a lake.
vi::Texture* makePhoto(unsigned int width, unsigned int height) {
    auto* pixels = static_cast<std::uint8_t*>(std::malloc(std::size_t(width) * height * 4));
    for (unsigned int y = 0; y < height; ++y)
        for (unsigned int x = 0; x < width; ++x) {
            float u = float(x) / float(width), v = float(y) / float(height);
            float r, g, b;
            float hill = 0.55f + 0.06f * std::sin(u * 9.0f) + 0.03f * std::sin(u * 23.0f + 1.0f);
            if (v < hill) {
                r = 0.95f - 0.5f * v;
                g = 0.55f + 0.2f * v;
                b = 0.35f + 0.6f * v;
                float sun = std::hypot((u - 0.62f) * 1.33f, v - 0.38f);
                float glow = std::exp(-sun * sun / 0.004f);
                r += glow;
                g += 0.8f * glow;
                b += 0.4f * glow;
            } else if (v < 0.68f) {
                r = 0.15f;
                g = 0.12f + 0.1f * (v - hill);
                b = 0.18f;
            } else {
                r = 0.55f - 0.4f * (v - 0.68f);
                g = 0.35f + 0.1f * (v - 0.68f);
                b = 0.42f + 0.3f * (v - 0.68f);
                r += 0.25f * std::exp(-std::pow((u - 0.62f) / 0.03f, 2.0f));
                g += 0.15f * std::exp(-std::pow((u - 0.62f) / 0.03f, 2.0f));
            }
            std::uint8_t* p = pixels + (std::size_t(y) * width + x) * 4;
            p[0] = std::uint8_t(std::fmin(r, 1.0f) * 255);
            p[1] = std::uint8_t(std::fmin(g, 1.0f) * 255);
            p[2] = std::uint8_t(std::fmin(b, 1.0f) * 255);
            p[3] = 255;
        }
    auto* texture = new vi::Texture(pixels, width, height, true, true, false, true, false, 4, false);
    texture->setDeletable(true);
    return texture;
}

class TimeLine {
public:
    TimeLine(Surfaces& surfaces, std::string out) : mSurfaces(surfaces), mOut(std::move(out)) {}

    // Draws frames at 30 per second of fake time up to t.
    void runTo(double t) {
        while (mNow + 1.0 / 30.0 < t) {
            mNow += 1.0 / 30.0;
            gFakeSeconds = 1000.0 + mNow;
            vi::Application::handleDraw();
        }
        mNow = t;
        gFakeSeconds = 1000.0 + mNow;
    }
    void frame() { vi::Application::handleDraw(); }
    void shot(const std::string& name) {
        int result = vi::Application::handleDraw();
        std::vector<std::uint8_t> pixels(std::size_t(mSurfaces.mWidth) * mSurfaces.mHeight * 4);
        glPixelStorei(GL_PACK_ALIGNMENT, 1);
        glReadPixels(0, 0, mSurfaces.mWidth, mSurfaces.mHeight, GL_RGBA, GL_UNSIGNED_BYTE, pixels.data());
        writePng(mOut + "/" + name + ".png", mSurfaces.mWidth, mSurfaces.mHeight, pixels);
        std::printf("%s at %.2f s (draw returned %d)\n", name.c_str(), mNow, result);
    }

private:
    Surfaces& mSurfaces;
    std::string mOut;
    double mNow = 0.0;
};

}  // namespace

int main(int argc, char** argv) {
    if (argc < 4) {
        std::fprintf(stderr, "usage: ripple-shot <libripple.so> <assets dir> <output dir> [photo]\n");
        return 2;
    }
    Surfaces surfaces;
    surfaces.use(540, 960);

    void* library = dlopen(argv[1], RTLD_NOW);
    if (!library) {
        std::fprintf(stderr, "ripple-shot: %s\n", dlerror());
        return 1;
    }
    vi::gCreateScene = reinterpret_cast<vi::CreateSceneFunction>(dlsym(library, "createScene"));
    if (!vi::gCreateScene) return 1;
    vi::File::getAssetManager() = vi::DirectoryAssetManager::create(argv[2]);
    if (argc > 4 && std::string(argv[4]) == "photo") {
        vi::ApplicationVar::msTexturesMap["wallpaper"] = makePhoto(1024, 768);
    }

    TimeLine line(surfaces, argv[3]);
    line.runTo(0.0);
    std::vector<std::string>& names = vi::Application::handleStart(0, 0, 540, 960);
    for (const std::string& name : names) std::printf("scene asks for \"%s\"\n", name.c_str());
    vi::Application::handleInitEffect();
    line.runTo(0.1);
    line.shot("01-start");
    line.runTo(0.5);
    vi::Application::handleMouseDown(160, 420);
    line.runTo(0.6);
    vi::Application::handleMouseMove(220, 470);
    line.runTo(0.7);
    vi::Application::handleMouseMove(300, 520);
    line.runTo(0.8);
    vi::Application::handleMouseUp(330, 540);
    line.runTo(1.3);
    line.shot("02-touch");
    line.runTo(2.2);
    line.shot("03-spreading");
    vi::Application::handleParam(1, 100);
    line.runTo(3.0);
    line.shot("04-golden-hour");
    vi::Application::handleParam(2, 100);
    line.runTo(3.8);
    line.shot("05-moonlight");
    vi::Application::handleParam(3, 100);
    line.runTo(4.6);
    line.shot("06-teal-and-amber");
    vi::Application::handleParam(4, 100);
    line.runTo(5.4);
    line.shot("07-faded-film");
    vi::Application::handleParam(0, 100);
    line.runTo(6.0);
    vi::Application::handleAffordance();
    line.runTo(6.6);
    line.shot("08-affordance");
    line.runTo(7.4);
    line.shot("09-affordance-later");
    vi::Application::handleUnlock();
    line.runTo(7.7);
    line.shot("10-unlocking");
    line.runTo(8.6);
    line.shot("11-unlocked");
    vi::Application::handleClearEffect();
    line.runTo(9.8);
    line.shot("12-cleared");

    surfaces.use(960, 540);
    vi::Application::handleWindowRectangle(0, 0, 960, 540);
    vi::Application::handleSetOrientation(vi::Orientation::Alternate);
    vi::Application::handleInitEffect();
    line.runTo(10.2);
    vi::Application::handleMouseDown(300, 300);
    line.runTo(10.9);
    line.shot("13-landscape");
    vi::Application::handleStop();
    return 0;
}
