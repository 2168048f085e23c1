// The application handlers as a host and an effect see them, driven from C++
// with the recording test scene: the lifecycle, what reaches a scene and
// when, the window and touches, the clock, the keys, and the
// lock around the scene on many threads (also run under ThreadSanitizer).
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <thread>

#include "Application/AnimationManager.h"
#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Application/Timer.h"
#include "FakeJni.h"
#include "TestSceneRecord.h"

// The host's entry point, called as the JVM would (it reads neither the JNI environment nor the object).
const auto setOrientation = VI_NATIVE(prehandleSetOrientation);

using namespace vi;
using App = vi::Application;
using Ints = std::vector<int>;

namespace {

Ints window() {
    return {ApplicationVar::msWindowLeft, ApplicationVar::msWindowTop, ApplicationVar::msWindowWidth,
            ApplicationVar::msWindowHeight};
}

// Each call a host may make that must not reach a scene that is not ready.
void everyEventButInitialisation() {
    EXPECT_EQ(0, App::handleDraw());
    for (void (*event)() : {App::handleClearEffect, App::handleAffordance, App::handleUnlock}) event();
    App::handleParam(1, 2);
    App::handleMouseDown(1, 1);
    for (unsigned key : {0u, unsigned('U'), unsigned('T')}) App::handleKey(key);
}

class Handlers : public ::testing::Test {
protected:
    void SetUp() override {
        App::handleStop();
        gTestScene.reset();
        gCreateScene = createScene;
    }
    void TearDown() override { SetUp(); }
    static void startReady(int l, int t, int w, int h) {
        App::handleStart(l, t, w, h);
        App::handleInitEffect();
        gTestScene.taken();
    }
};

// The self-test key's published steps, followed with the same random numbers:
// what the scene's record must show afterwards.
struct SelfTestSteps {
    int left, top, width, height;
    std::string seen;

    unsigned count() { return unsigned(lrand48() % 100); }
    std::string started() { return "DC" + std::to_string(width) + "," + std::to_string(height) + "I"; }
    void touch(char kind) {
        const long rx = lrand48(), ry = lrand48();
        seen += kind + ("(" + std::to_string(float(int(rx % width)) / float(width)) + "," +
                        std::to_string(1.0f - float(int(ry % height)) / float(height)) + ")F");
    }
    void orientationRestarts() {
        for (unsigned i = 0, n = count(); i < n; ++i) seen += started() + (i & 1 ? "AF" : "F");
    }
    // With a shared counter the moves advance the phase's own counter.
    void gestures(bool sharedCounter) {
        unsigned i = 0;
        for (unsigned gesture = 0, n = count(); sharedCounter ? i < n : gesture < n; ++gesture) {
            touch('d');
            for (unsigned move = 0, m = count(); sharedCounter ? i < m : move < m; ++move) {
                touch('m');
                i += sharedCounter;
            }
            touch('u');
            ++i;
        }
    }
    void windowRectangles() {
        for (unsigned pass = 0, n = count(); pass < n; ++pass) {
            seen += started() + "F";
            left = int(lrand48() % 1080);
            top = int(lrand48() % 1920);
            width = std::max(1, int(lrand48() % 1080));
            height = std::max(1, int(lrand48() % 1920));
        }
    }
    void run() {
        orientationRestarts();
        gestures(true);
        const long third = lrand48() % 3;
        if (third == 0) orientationRestarts();
        if (third == 1) gestures(false);
        if (third == 2) windowRectangles();
    }
};

}  // namespace

// Needs a process in which no handler has run yet (CTest runs each test alone).
TEST(DefaultWindow, IsFiveFortyByNineSixtyAtTheOriginAndNormalisesItsCentreToOneHalf) {
    EXPECT_TRUE(window() == (Ints{0, 0, 540, 960}) && App::mouseNormalize(270, 480) == glm::vec2(0.5f, 0.5f) &&
                gpScene == nullptr && AnimationManager::mNow == 0.0f);
}

TEST_F(Handlers, StartInitRestartAndStopAndOnlyAReadySceneHearsAnything) {
    gTestScene.names = {"sky", "glass"};
    gTestScene.drawResult = 3;
    std::vector<std::string>& returned = App::handleStart(5, 7, 0, -3);
    EXPECT_EQ(window(), (Ints{5, 7, 1, 1})) << "clamped to one pixel";
    EXPECT_TRUE(&returned == &gpScene->mNames && returned == gTestScene.names);
    everyEventButInitialisation();
    EXPECT_EQ(gTestScene.taken(), "C1,1");
    App::handleInitEffect();
    Timer::mStartingCnt = {1, 0};
    App::handleInitEffect();  // initialises once, but restarts the clock
    EXPECT_NE(Timer::mStartingCnt.tv_sec, 1);
    AnimationManager::mNow = -1.0f;
    for (void (*event)() : {App::handleAffordance, App::handleUnlock}) event();
    App::handleParam(-5, 123456789);
    App::handleKey(1000);
    // The host's menu and volume keys are key codes 0, 1 and 2; each entry point answers 0.
    for (auto key : {VI_NATIVE(prehandleMenuPressed), VI_NATIVE(prehandleVolumeUpPressed),
                     VI_NATIVE(prehandleVolumeDownPressed)})
        EXPECT_EQ(key(nullptr, nullptr), 0);
    App::handleMouseMove(5, 7);  // the window's top left corner
    EXPECT_EQ(App::handleDraw(), 3);
    for (const TestSceneEvent& e : gTestScene.events) EXPECT_GE(e.now, 0.0f) << "the clock first";
    EXPECT_EQ(gTestScene.taken(), "Icalp-5,123456789k1000k0k1k2m(0.000000,1.000000)F");
    // The host moves the window: no lock, and no word to the scene.
    App::handleWindowRectangle(-3, -4, 0, -20);
    EXPECT_TRUE(window() == (Ints{-3, -4, 1, 1}) && gpScene->mSize == glm::vec2(1.0f) && gTestScene.taken().empty());
    // A clear restarts the clock after the scene cleared, not before.
    Timer::mStartingCnt = {1, 0};
    AnimationManager::mNow = -1.0f;
    App::handleClearEffect();
    EXPECT_EQ(gTestScene.events.at(0).now, -1.0f);
    EXPECT_TRUE(Timer::mStartingCnt.tv_sec != 1 && AnimationManager::mNow >= 0.0f);
    App::handleRestart();
    App::handleStart(0, 0, 540, 960);
    everyEventButInitialisation();  // the new scene waits for its initialisation
    App::handleStop();
    everyEventButInitialisation();
    App::handleInitEffect();
    EXPECT_TRUE(gTestScene.taken() == "cDC1,1IDC540,960D" && gpScene == nullptr);
    // Through the host's entry point a start gives the path's chars back (the loader hands over this very copy).
    vitest::FakeJni jni;
    EXPECT_NE(VI_NATIVE(prehandleStart)(jni.env(), nullptr, jni.string(VI_TESTSCENE_PATH), 8, 8), nullptr);
    EXPECT_EQ(jni.outstanding(), 0);
}

// The host may send any int: every value but 0 is the one alternate
// orientation, initialised once, and a scene hears nothing in an orientation
// it was not initialised for. Under ASan/UBSan a value used as an index is
// reported at once.
TEST_F(Handlers, EveryNonZeroOrientationIsTheOneAlternateAndWaitsForItsInitialisation) {
    startReady(0, 0, 540, 960);
    setOrientation(nullptr, nullptr, 7);
    everyEventButInitialisation();
    for (int value : {7, -1, 2, INT_MAX, INT_MIN, 1, 0, INT_MIN}) {
        App::handleInitEffect();
        setOrientation(nullptr, nullptr, value);
        App::handleDraw();
        EXPECT_EQ(gTestScene.events.back().orientation, value);
    }
    EXPECT_EQ(gTestScene.taken(), "AFFFFFFFF");
}

TEST_F(Handlers, HandlersOnManyThreadsNeverOverlapInsideTheScene) {
    const int kCalls = 10000;
    startReady(0, 0, 540, 960);
    auto run = [](auto call) { return std::thread([call] { for (int i = 0; i < kCalls; ++i) call(i); }); };
    std::thread threads[] = {run([](int) { App::handleDraw(); }), run([](int) { App::handleDraw(); }),
                             run([](int i) { (i % 2 ? App::handleMouseUp : App::handleMouseDown)(i, i); }),
                             run([](int i) { App::handleParam(i, -i); }),
                             // the host's keys, and the developer keys that stay under the lock
                             run([](int i) { App::handleKey(Ints{0, 1, 2, 'A', 'U'}[i % 5]); })};
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(gTestScene.overlaps, 0);
    EXPECT_EQ(gTestScene.events.size(), std::size_t(5 * kCalls)) << "one event a call, 'A' too";
}

// The key 'C' takes the lock the key handler already holds: the thread never
// comes back. Shown in a child, which reports just before the key and would
// report again after it; it is given two seconds and then killed.
TEST_F(Handlers, LetterCBlocksTheCallingThreadForGood) {
    int reports[2], status = 0;
    ASSERT_EQ(pipe(reports), 0);
    const pid_t child = fork();
    if (child == 0) {
        startReady(0, 0, 540, 960);
        if (write(reports[1], "B", 1) == 1) App::handleKey('C');
        _exit(int(write(reports[1], "A", 1)));
    }
    char report = 0;
    pollfd afterKey = {reports[0], POLLIN, 0};
    EXPECT_TRUE(read(reports[0], &report, 1) == 1 && report == 'B');
    EXPECT_EQ(poll(&afterKey, 1, 2000), 0) << "the key returned (or the child ended)";
    EXPECT_TRUE(kill(child, SIGKILL) == 0 && waitpid(child, &status, 0) == child && WIFSIGNALED(status));
}


// The developer key 'T': whatever the seed, every step of its random run
// reaches the scene in order, it draws exactly the random numbers its steps
// name, and it leaves the last window it set. Seeds 1 to 8 reach each of the
// three last phases.
TEST_F(Handlers, SelfTestKeyRunsEveryStepOfItsRandomSequence) {
    for (long seed = 1; seed <= 8; ++seed) {
        SCOPED_TRACE(testing::Message() << "seed " << seed);
        startReady(10, 20, 300, 500);
        SelfTestSteps steps = {10, 20, 300, 500, ""};
        srand48(seed);
        steps.run();
        const long next = lrand48();
        srand48(seed);
        App::handleKey('T');
        EXPECT_EQ(lrand48(), next) << "the random numbers drawn";
        EXPECT_TRUE(gTestScene.taken() == steps.seen) << "the scene's record differs from the steps";
        EXPECT_TRUE(window() == (Ints{steps.left, steps.top, steps.width, steps.height}) && !gTestScene.overlaps);
    }
}
