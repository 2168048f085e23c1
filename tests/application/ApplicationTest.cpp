// The application handlers as a host and an effect see them, driven from C++
// with the recording test scene: the lifecycle, what reaches a scene and
// when, the window and touches, the clock and animations, the keys, and the
// lock around the scene on many threads (also run under ThreadSanitizer).
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <climits>
#include <string>
#include <thread>
#include <vector>

#include "Application/AnimationManager.h"
#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Application/Timer.h"
#include "TestSceneRecord.h"

extern "C" vi::Scene* createScene(int* size, vi::ModelsMap* models, vi::TexturesMap* textures);
// The host's entry point, called as the JVM would (it reads neither argument).
extern "C" int Java_com_tarq_android_visualeffect_common_Native_prehandleSetOrientation(void*, void*, int);

using namespace vi;
using Ints = std::vector<int>;

namespace {

// One letter per event kind, in the order of TestSceneEventKind.
const char kLetters[] = "CDcaltIAFdumkp";

// The record so far as letters (a touch with its point, a key with its code),
// then cleared for the next step.
std::string taken(bool withPoints = true) {
    std::string seen;
    for (int i = 0; i < testSceneEventCount(); ++i) {
        const TestSceneEvent e = testSceneEventAt(i);
        seen += kLetters[e.kind];
        if (withPoints && e.kind >= TestSceneTouchDown && e.kind <= TestSceneTouchMove)
            seen += "(" + std::to_string(e.x) + "," + std::to_string(e.y) + ")";
        if (e.kind == TestSceneKeyPressed || e.kind == TestSceneParam) seen += std::to_string(e.a);
    }
    testSceneClearEvents();
    return seen;
}

Ints window() {
    return {ApplicationVar::msWindowLeft, ApplicationVar::msWindowTop, ApplicationVar::msWindowWidth,
            ApplicationVar::msWindowHeight};
}

// Each call a host may make that must not reach a scene that is not ready.
void everyEventButInitialisation() {
    EXPECT_EQ(0, Application::handleDraw());
    Application::handleClearEffect();
    Application::handleAffordance();
    Application::handleUnlock();
    Application::handleParam(1, 2);
    Application::handleMouseDown(1, 1);
    for (unsigned key : {0u, 85u, 84u}) Application::handleKey(key);
}

class Handlers : public ::testing::Test {
protected:
    void SetUp() override {
        Application::handleStop();
        AnimationManager::mStorage.clear();
        testSceneReset();
        gCreateScene = createScene;
    }
    void TearDown() override { SetUp(); }
    static void startReady(int left, int top, int width, int height) {
        Application::handleStart(left, top, width, height);
        Application::handleInitEffect();
        testSceneClearEvents();
    }
};

}  // namespace

// Needs a process in which no handler has run yet (CTest runs each test alone).
TEST(DefaultWindow, IsFiveFortyByNineSixtyAtTheOriginAndNormalisesItsCentreToOneHalf) {
    EXPECT_EQ(window(), (Ints{0, 0, 540, 960}));
    EXPECT_EQ(Application::mouseNormalize(270, 480), glm::vec2(0.5f, 0.5f));
    EXPECT_EQ(gpScene, nullptr);
    EXPECT_EQ(AnimationManager::mNow, 0.0f);
}

TEST_F(Handlers, StartInitRestartAndStopAndOnlyAReadySceneHearsAnything) {
    const char* names[] = {"sky", "glass"};
    testSceneSetNames(names, 2);
    testSceneSetDrawResult(3);
    std::vector<std::string>& returned = Application::handleStart(5, 7, 0, -3);
    EXPECT_EQ(window(), (Ints{5, 7, 1, 1})) << "clamped to one pixel";
    EXPECT_EQ(&returned, &gpScene->mNames);
    EXPECT_EQ(returned, (std::vector<std::string>{"sky", "glass"}));
    EXPECT_EQ(testSceneLastModelsMap(), &ApplicationVar::msModelsMap);
    EXPECT_EQ(testSceneLastTexturesMap(), &ApplicationVar::msTexturesMap);
    EXPECT_EQ(testSceneEventAt(0).a + testSceneEventAt(0).b, 2) << "the factory gets the clamped size";
    everyEventButInitialisation();
    EXPECT_EQ(taken(), "C");
    for (int call = 0; call < 2; ++call) {  // initialised once, but the clock restarts each time
        Timer::mStartingCnt = {1, 0};
        Application::handleInitEffect();
        EXPECT_NE(Timer::mStartingCnt.tv_sec, 1);
    }
    // Each event advances the clock before the scene hears it.
    AnimationManager::mNow = -1.0f;
    Application::handleAffordance();
    Application::handleUnlock();
    Application::handleParam(-5, 123456789);
    Application::handleKey(1000);
    EXPECT_EQ(Application::handleDraw(), 3);
    for (int i = 0; i < testSceneEventCount(); ++i) EXPECT_GE(testSceneEventAt(i).now, 0.0f) << i;
    EXPECT_EQ(testSceneEventAt(4).b, 123456789);
    EXPECT_EQ(taken(), "Icalp-5k1000F");
    // A clear restarts the clock after the scene cleared, not before.
    Timer::mStartingCnt = {1, 0};
    AnimationManager::mNow = -1.0f;
    Application::handleClearEffect();
    EXPECT_EQ(testSceneEventAt(0).now, -1.0f);
    EXPECT_NE(Timer::mStartingCnt.tv_sec, 1);
    EXPECT_GE(AnimationManager::mNow, 0.0f);
    Application::handleRestart();  // the same window
    EXPECT_EQ(testSceneEventAt(2).scene * 10 + testSceneEventAt(2).a + testSceneEventAt(2).b, 22);
    Application::handleStart(0, 0, 540, 960);
    EXPECT_EQ(0, Application::handleDraw()) << "a new scene waits for its initialisation";
    Application::handleStop();
    everyEventButInitialisation();
    Application::handleInitEffect();
    EXPECT_EQ(taken(), "cDCIDCD");
    EXPECT_EQ(gpScene, nullptr);
}

// The host may send any int: every value but 0 is the one alternate
// orientation, initialised once, and a scene hears nothing in an orientation
// it was not initialised for. Under ASan/UBSan a value used as an index is
// reported at once.
TEST_F(Handlers, EveryNonZeroOrientationIsTheOneAlternateAndWaitsForItsInitialisation) {
    startReady(0, 0, 540, 960);
    Java_com_tarq_android_visualeffect_common_Native_prehandleSetOrientation(nullptr, nullptr, 7);
    everyEventButInitialisation();
    for (int value : {7, -1, 2, INT_MAX, INT_MIN, 1, 0, INT_MIN}) {
        Application::handleInitEffect();
        Java_com_tarq_android_visualeffect_common_Native_prehandleSetOrientation(nullptr, nullptr, value);
        Application::handleDraw();
        EXPECT_EQ(testSceneEventAt(testSceneEventCount() - 1).orientation, value);
    }
    EXPECT_EQ(taken(), "AFFFFFFFF");
}

TEST_F(Handlers, WindowRectangleIsClampedSilentlyAndTouchesAreNormalisedFromItsCorner) {
    startReady(30, 40, 200, 100);
    Application::handleWindowRectangle(-3, -4, 0, -20);
    EXPECT_EQ(window(), (Ints{-3, -4, 1, 1}));
    EXPECT_EQ(gpScene->mSize, glm::vec2(200.0f, 100.0f)) << "the scene is not told";
    Application::handleWindowRectangle(30, 40, 200, 100);
    AnimationManager::mNow = -7.0f;
    Application::handleMouseDown(80, 65);
    Application::handleMouseMove(130, 90);
    Application::handleMouseUp(30, 140);
    EXPECT_GE(testSceneEventAt(0).now, 0.0f) << "the clock is advanced first";
    EXPECT_EQ(taken(), "d(0.250000,0.750000)m(0.500000,0.500000)u(0.000000,0.000000)");
}

TEST(Clock, SecondsAndNanosecondsAreConvertedSeparatelyInSinglePrecision) {
    // A long run with a negative nanosecond difference: at a million seconds a
    // float keeps sixteenths, so only the single-precision sum of the two
    // converted differences comes out exactly.
    timespec now;
    clock_gettime(CLOCK_REALTIME, &now);
    Timer::mStartingCnt = {now.tv_sec - 1000003, 999999999};
    Timer::update();
    const float seconds = float(std::int32_t(Timer::mCurrentCnt.tv_sec - now.tv_sec + 1000003));
    EXPECT_EQ(AnimationManager::mNow, float(std::int32_t(Timer::mCurrentCnt.tv_nsec - 999999999)) * 1e-9f + seconds);
    EXPECT_NEAR(AnimationManager::mNow, seconds - 1.0 + Timer::mCurrentCnt.tv_nsec * 1e-9, 0.07);
}

namespace {

// Notes its update in a shared log; may move the clock or add an animation.
struct LoggingAnimation : Animation {
    LoggingAnimation(std::vector<float>& log, float shift, Animation* add) : log(log), shift(shift), add(add) {}
    void update(float now) override {
        log.push_back(now);
        AnimationManager::mNow += shift;
        if (add) AnimationManager::mStorage.push_back(add), add = nullptr;
    }
    std::vector<float>& log;
    float shift;
    Animation* add;
};

}  // namespace

TEST_F(Handlers, AReadyFrameUpdatesTheAnimationsInOrderWithTheClockReadAfreshBeforeTheScene) {
    std::vector<float> log[4];
    LoggingAnimation late(log[3], 0.0f, nullptr), third(log[2], 0.0f, nullptr), second(log[1], 0.0f, &late);
    LoggingAnimation first(log[0], 100.0f, nullptr);
    AnimationManager::mStorage = {&first, &second, &third};
    Application::handleStart(0, 0, 540, 960);
    Application::handleDraw();
    EXPECT_TRUE(log[0].empty()) << "no update before the scene is ready";
    Application::handleInitEffect();
    Application::handleDraw();
    ASSERT_EQ(log[1].size() + log[2].size() + log[3].size(), 2u) << "one added during the loop waits a frame";
    EXPECT_TRUE(log[0][0] >= 0.0f && log[0][0] < 100.0f) << log[0][0];
    EXPECT_EQ(log[1][0], log[0][0] + 100.0f);
    EXPECT_EQ(log[2][0], log[1][0]);
    EXPECT_EQ(testSceneEventAt(testSceneEventCount() - 1).now, log[2][0]) << "the scene draws after them";
    Application::handleDraw();
    EXPECT_EQ(log[3].size(), 1u);
}

TEST_F(Handlers, HandlersOnManyThreadsNeverOverlapInsideTheScene) {
    const int kCalls = 10000;
    startReady(0, 0, 540, 960);
    auto drawing = [] {
        for (int i = 0; i < kCalls; ++i) Application::handleDraw();
    };
    std::thread threads[] = {std::thread(drawing), std::thread(drawing), std::thread([] {
                                 for (int i = 0; i < kCalls; i += 2)
                                     Application::handleMouseDown(i, i), Application::handleMouseUp(i, i);
                             }),
                             std::thread([] {
                                 for (int i = 0; i < kCalls; ++i) Application::handleParam(i, -i);
                             }),
                             std::thread([] {  // the host's keys and the developer keys that stay under the lock
                                 for (int i = 0; i < kCalls; ++i) Application::handleKey(Ints{0, 1, 2, 'A', 'U'}[i % 5]);
                             })};
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(testSceneOverlaps(), 0);
    int counts[TestSceneEventKindCount] = {}, keys = 0;
    for (int i = 0; i < testSceneEventCount(); ++i) {
        ++counts[testSceneEventAt(i).kind];
        keys += testSceneEventAt(i).kind == TestSceneKeyPressed ? testSceneEventAt(i).a : 0;
    }
    EXPECT_EQ(Ints(counts, counts + TestSceneEventKindCount),
              (Ints{0, 0, 0, 2000, 2000, 0, 0, 0, 20000, 5000, 5000, 0, 6000, 10000}));
    EXPECT_EQ(keys, 6000) << "the host's keys reach the scene unchanged";
}

// The key 'C' takes the lock the key handler already holds: the thread never
// comes back. Shown in a child, which reports just before the key and would
// report again after it; it is given two seconds and then killed.
TEST_F(Handlers, LetterCBlocksTheCallingThreadForGood) {
    int reports[2];
    ASSERT_EQ(pipe(reports), 0);
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        startReady(0, 0, 540, 960);
        if (write(reports[1], "B", 1) != 1) _exit(2);
        Application::handleKey('C');
        _exit(write(reports[1], "A", 1));
    }
    close(reports[1]);
    char report = 0;
    EXPECT_EQ(read(reports[0], &report, 1), 1);
    EXPECT_EQ(report, 'B');
    pollfd afterKey = {reports[0], POLLIN, 0};
    EXPECT_EQ(poll(&afterKey, 1, 2000), 0) << "the key returned (or the child ended)";
    kill(child, SIGKILL);
    int status = 0;
    EXPECT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
    close(reports[0]);
}

namespace {

// What the scene's record must show after the self-test key, worked out from
// the same random numbers by following the key's published steps.
struct SelfTestSteps {
    int left, top, width, height;
    std::string seen;

    unsigned count() { return unsigned(lrand48() % 100); }
    void touch(char kind) {
        const long rx = lrand48(), ry = lrand48();
        seen += kind + ("(" + std::to_string(float(int(rx % width)) / float(width)) + "," +
                        std::to_string(1.0f - float(int(ry % height)) / float(height)) + ")F");
    }
    void orientationRestarts() {
        for (unsigned i = 0, n = count(); i < n; ++i) seen += i & 1 ? "DCIAF" : "DCIF";
    }
    void gestures(bool sharedCounter) {
        unsigned i = 0, n = count();
        for (unsigned gesture = 0; sharedCounter ? i < n : gesture < n; ++gesture, ++i) {
            touch('d');
            const unsigned m = count();
            for (unsigned move = 0; sharedCounter ? i < m : move < m; ++move, i += sharedCounter) touch('m');
            touch('u');
        }
    }
    void windowRectangles() {
        for (unsigned pass = 0, n = count(); pass < n; ++pass) {
            seen += "DCIF";
            left = int(lrand48() % 1080);
            top = int(lrand48() % 1920);
            width = std::max(1, int(lrand48() % 1080));
            height = std::max(1, int(lrand48() % 1920));
        }
    }
    int run() {
        orientationRestarts();
        gestures(true);
        const int third = int(lrand48() % 3);
        if (third == 0) orientationRestarts();
        if (third == 1) gestures(false);
        if (third == 2) windowRectangles();
        return third;
    }
};

}  // namespace

// The developer key 'T': whatever the seed, every step of its random run
// reaches the scene in order, it draws exactly the random numbers its steps
// name, and it leaves the last window it set. Before the scene is ready it
// does nothing and draws nothing.
TEST_F(Handlers, SelfTestKeyRunsEveryStepOfItsRandomSequence) {
    srand48(1);
    const long first = lrand48();
    srand48(1);
    Application::handleKey('T');
    EXPECT_EQ(lrand48(), first);
    bool thirdPhases[3] = {false, false, false};
    for (long seed = 1; seed <= 8; ++seed) {
        SCOPED_TRACE(testing::Message() << "seed " << seed);
        startReady(10, 20, 300, 500);
        SelfTestSteps steps = {10, 20, 300, 500, ""};
        srand48(seed);
        thirdPhases[steps.run()] = true;
        const long next = lrand48();
        srand48(seed);
        Application::handleKey('T');
        EXPECT_EQ(lrand48(), next) << "the random numbers drawn";
        EXPECT_TRUE(taken() == steps.seen) << "the scene's record differs from the steps";
        EXPECT_EQ(window(), (Ints{steps.left, steps.top, steps.width, steps.height}));
        EXPECT_EQ(testSceneOverlaps(), 0);
        EXPECT_TRUE(Application::isReady());
    }
    EXPECT_TRUE(thirdPhases[0] && thirdPhases[1] && thirdPhases[2]) << "seeds that reach every third phase";
}
