// The built ripple plug-in, loaded with dlopen and driven through the
// runtime's handlers on a headless 90 x 160 context, as a host drives it.
// The runtime's clock is the test's: clock_gettime(CLOCK_REALTIME) is defined
// here, and the runtime, a shared library, calls this definition.

#include <dlfcn.h>
#include <time.h>

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include <GLES2/gl2.h>
#include <gtest/gtest.h>

#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "GlContext.h"
#include "Render/Texture.h"
#include "Tools/DirectoryAssetManager.h"
#include "Tools/File.h"

namespace {

double gFakeSeconds = 5000.0;

}  // namespace

extern "C" int clock_gettime(clockid_t clock, struct timespec* tp) __THROW {
    if (clock != CLOCK_REALTIME) {
        using Real = int (*)(clockid_t, struct timespec*);
        static Real real = reinterpret_cast<Real>(dlsym(RTLD_NEXT, "clock_gettime"));
        return real(clock, tp);
    }
    tp->tv_sec = time_t(gFakeSeconds);
    tp->tv_nsec = long((gFakeSeconds - std::floor(gFakeSeconds)) * 1e9);
    return 0;
}

namespace {

constexpr int kWidth = 90;
constexpr int kHeight = 160;

struct Rgb {
    int r, g, b;
    int luminance() const { return (r * 3 + g * 6 + b) / 10; }
};

Rgb pixelAt(int x, int y) {
    std::uint32_t p = vitest::readPixel(x, y);
    return Rgb{int(p >> 24), int((p >> 16) & 0xFF), int((p >> 8) & 0xFF)};
}

// A pixel at a normalised position of a viewport (origin bottom left, as the scene's).
Rgb pixelAtNormalised(float x, float y, int width = kWidth, int height = kHeight) {
    return pixelAt(int(x * float(width)), int(y * float(height)));
}

// The loaded plug-in and the context, once per process.
class PluginEnvironment : public testing::Environment {
public:
    void SetUp() override {
        mContext = new vitest::GlContext(kWidth, kHeight);
        void* library = dlopen(RIPPLE_LIBRARY, RTLD_NOW);
        ASSERT_NE(library, nullptr) << dlerror();
        vi::gCreateScene = reinterpret_cast<vi::CreateSceneFunction>(dlsym(library, "createScene"));
        ASSERT_NE(vi::gCreateScene, nullptr);
        vi::File::getAssetManager() = vi::DirectoryAssetManager::create(RIPPLE_ASSETS);
    }
    void TearDown() override { delete mContext; }

private:
    vitest::GlContext* mContext = nullptr;
};

testing::Environment* const gEnvironment = testing::AddGlobalTestEnvironment(new PluginEnvironment);

// A host wallpaper: uniform grey, or grey with vertical stripes, which show refraction.
vi::Texture* fileWallpaper(bool striped) {
    const unsigned int width = 64, height = 128;
    auto* pixels = static_cast<std::uint8_t*>(std::malloc(width * height * 4));
    for (unsigned int y = 0; y < height; ++y)
        for (unsigned int x = 0; x < width; ++x) {
            std::uint8_t level = striped && (x / 4) % 2 ? 160 : 60;
            std::uint8_t* p = pixels + (y * width + x) * 4;
            p[0] = p[1] = p[2] = level;
            p[3] = 255;
        }
    auto* texture = new vi::Texture(pixels, width, height, true, true, false, true, false, 4, false);
    texture->setDeletable(true);
    vi::ApplicationVar::msTexturesMap["wallpaper"] = texture;
    return texture;
}

// A started and initialised scene; the clock advances only through at().
class RunningScene {
public:
    explicit RunningScene(vi::Texture* wallpaper) : mWallpaper(wallpaper) {
        gFakeSeconds = 5000.0;
        mNames = vi::Application::handleStart(0, 0, kWidth, kHeight);
        vi::Application::handleInitEffect();
    }
    ~RunningScene() {
        vi::Application::handleStop();
        if (mWallpaper) {
            vi::ApplicationVar::msTexturesMap.erase("wallpaper");
            delete mWallpaper;
        }
    }

    // Draws frames, 30 per second of clock time, up to `seconds` after the
    // initialisation, and returns the last frame's result.
    int at(double seconds) {
        const double target = 5000.0 + seconds;
        while (gFakeSeconds + 1.0 / 30.0 < target) {
            gFakeSeconds += 1.0 / 30.0;
            vi::Application::handleDraw();
        }
        gFakeSeconds = target;
        return vi::Application::handleDraw();
    }

    std::vector<std::string> mNames;

private:
    vi::Texture* mWallpaper;
};

// The rectangle that a touch at (0.2, 0.25) disturbs in its first second; the
// gem (around (0.5, 0.6)) and the first drop (0.8 s) stay out of it.
std::vector<std::uint8_t> touchRegion() { return vitest::readPixels(0, 0, 60, 70); }

int largestDifference(const std::vector<std::uint8_t>& a, const std::vector<std::uint8_t>& b) {
    int largest = 0;
    for (std::size_t i = 0; i < a.size(); ++i) largest = std::max(largest, std::abs(int(a[i]) - int(b[i])));
    return largest;
}

TEST(RipplePlugin, ATouchDisturbsTheWaterAndAClearCalmsIt) {
    RunningScene scene(fileWallpaper(true));
    scene.at(0.1);
    const std::vector<std::uint8_t> still = touchRegion();
    vi::Application::handleMouseDown(int(0.2f * kWidth), int(0.75f * kHeight));
    scene.at(0.55);
    EXPECT_GT(largestDifference(touchRegion(), still), 40);
    vi::Application::handleClearEffect();
    scene.at(1.1);
    EXPECT_LE(largestDifference(touchRegion(), still), 2);
}

TEST(RipplePlugin, TheGemFadesOnUnlockAndReturnsOnClear) {
    RunningScene scene(fileWallpaper(false));
    scene.at(0.2);
    const int water = pixelAtNormalised(0.1f, 0.6f).luminance();
    const int gem = pixelAtNormalised(0.5f, 0.6f).luminance();
    EXPECT_GT(gem, water + 30);
    vi::Application::handleUnlock();
    scene.at(1.2);
    EXPECT_LT(std::abs(pixelAtNormalised(0.5f, 0.6f).luminance() - water), 10);
    vi::Application::handleClearEffect();
    scene.at(2.5);
    EXPECT_GT(pixelAtNormalised(0.5f, 0.6f).luminance(), water + 30);
}

TEST(RipplePlugin, LandscapeMovesTheGemRightAndKeepsToTheHostsViewport) {
    RunningScene scene(fileWallpaper(false));
    scene.at(0.1);
    // The host's surface turned: a 90 x 50 viewport at the bottom of the pbuffer.
    glViewport(0, 0, 90, 50);
    glClearColor(1.0f, 0.0f, 1.0f, 1.0f);
    glClear(GL_COLOR_BUFFER_BIT);
    vi::Application::handleWindowRectangle(0, 0, 90, 50);
    vi::Application::handleSetOrientation(vi::Orientation::Alternate);
    vi::Application::handleInitEffect();
    EXPECT_EQ(scene.at(0.3), 1);
    const int water = pixelAtNormalised(0.28f, 0.55f, 90, 50).luminance();
    EXPECT_GT(pixelAtNormalised(0.72f, 0.55f, 90, 50).luminance(), water + 30);
    // Nothing outside the viewport was touched.
    Rgb above = pixelAt(45, 120);
    EXPECT_EQ(above.r, 255);
    EXPECT_EQ(above.g, 0);
    EXPECT_EQ(above.b, 255);
    glViewport(0, 0, kWidth, kHeight);
}

}  // namespace
