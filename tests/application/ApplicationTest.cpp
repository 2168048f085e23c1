// The application handlers as a host and an effect see them, driven from C++
// with the recording test scene: the lifecycle, what reaches a scene and
// when, the window and touches, the clock and animations, the keys, and the
// lock around the scene on many threads (also run under ThreadSanitizer).
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <cstdio>
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

using vi::AnimationManager;
using vi::Application;
using vi::ApplicationVar;
using Ints = std::vector<int>;

namespace {

std::vector<TestSceneEvent> events() {
    std::vector<TestSceneEvent> all;
    for (int i = 0; i < testSceneEventCount(); ++i) all.push_back(testSceneEventAt(i));
    return all;
}

// The kinds of the events so far; the record is cleared for the next step.
Ints takeKinds() {
    Ints kinds;
    for (const TestSceneEvent& event : events()) kinds.push_back(event.kind);
    testSceneClearEvents();
    return kinds;
}

Ints window() {
    return {ApplicationVar::msWindowLeft, ApplicationVar::msWindowTop, ApplicationVar::msWindowWidth,
            ApplicationVar::msWindowHeight};
}

// Each handler a host may call that must not reach a scene that is not ready.
void everyEventButInitialisation() {
    Application::handleDraw();
    Application::handleClearEffect();
    Application::handleAffordance();
    Application::handleUnlock();
    Application::handleParam(1, 2);
    Application::handleMouseDown(1, 1);
    Application::handleKey(0);
    Application::handleKey('U');
}

const timespec kLongAgo = {1, 0};  // a start no restart can produce

class Handlers : public ::testing::Test {
protected:
    void SetUp() override {
        Application::handleStop();
        AnimationManager::mStorage.clear();
        testSceneReset();
        vi::gCreateScene = createScene;
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
    EXPECT_EQ(vi::gpScene, nullptr);
    EXPECT_EQ(AnimationManager::mNow, 0.0f);
}

TEST_F(Handlers, StartInitRestartAndStopAndOnlyAReadySceneHearsAnything) {
    const char* names[] = {"sky", "glass"};
    testSceneSetNames(names, 2);
    testSceneSetDrawResult(3);
    std::vector<std::string>& returned = Application::handleStart(5, 7, 0, -3);
    EXPECT_EQ(window(), (Ints{5, 7, 1, 1})) << "clamped to one pixel";
    EXPECT_EQ(&returned, &vi::gpScene->mNames);
    EXPECT_EQ(returned, (std::vector<std::string>{"sky", "glass"}));
    EXPECT_EQ(testSceneLastModelsMap(), &ApplicationVar::msModelsMap);
    EXPECT_EQ(testSceneLastTexturesMap(), &ApplicationVar::msTexturesMap);
    EXPECT_EQ(testSceneEventAt(0).a * 10 + testSceneEventAt(0).b, 11) << "the factory gets the clamped size";
    everyEventButInitialisation();
    EXPECT_EQ(Application::handleDraw(), 0);
    EXPECT_EQ(takeKinds(), Ints{TestSceneCreated});

    // Initialised once, but the clock restarts at each call.
    for (int call = 0; call < 2; ++call) {
        vi::Timer::mStartingCnt = kLongAgo;
        Application::handleInitEffect();
        EXPECT_NE(vi::Timer::mStartingCnt.tv_sec, kLongAgo.tv_sec);
    }
    EXPECT_EQ(takeKinds(), Ints{TestSceneInitEffect});

    // Each event advances the clock before the scene hears it.
    AnimationManager::mNow = -1.0f;
    Application::handleAffordance();
    Application::handleUnlock();
    Application::handleParam(-5, 123456789);
    EXPECT_EQ(Application::handleDraw(), 3);
    const std::vector<TestSceneEvent> heard = events();
    EXPECT_EQ(takeKinds(), (Ints{TestSceneClearEffect, TestSceneAffordance, TestSceneUnlock, TestSceneParam,
                                 TestSceneDraw}));
    for (const TestSceneEvent& event : heard) EXPECT_GE(event.now, 0.0f) << event.kind;
    EXPECT_EQ(heard[3].a, -5);
    EXPECT_EQ(heard[3].b, 123456789);

    // A clear restarts the clock after the scene cleared, not before.
    vi::Timer::mStartingCnt = kLongAgo;
    AnimationManager::mNow = -1.0f;
    Application::handleClearEffect();
    EXPECT_EQ(testSceneEventAt(0).now, -1.0f);
    EXPECT_NE(vi::Timer::mStartingCnt.tv_sec, kLongAgo.tv_sec);
    EXPECT_GE(AnimationManager::mNow, 0.0f);
    EXPECT_EQ(takeKinds(), Ints{TestSceneClearEffect});

    Application::handleRestart();
    EXPECT_EQ(testSceneEventAt(0).scene * 10 + testSceneEventAt(1).scene, 12);
    EXPECT_EQ(testSceneEventAt(1).a * 10 + testSceneEventAt(1).b, 11) << "the same window";
    EXPECT_EQ(takeKinds(), (Ints{TestSceneDestroyed, TestSceneCreated, TestSceneInitEffect}));
    Application::handleStart(0, 0, 540, 960);
    EXPECT_EQ(takeKinds(), (Ints{TestSceneDestroyed, TestSceneCreated}));
    EXPECT_EQ(Application::handleDraw(), 0) << "a new scene waits for its initialisation";
    Application::handleStop();
    EXPECT_EQ(vi::gpScene, nullptr);
    everyEventButInitialisation();
    Application::handleInitEffect();
    EXPECT_EQ(takeKinds(), Ints{TestSceneDestroyed});
}

// The host may send any int: every value but 0 is the one alternate
// orientation, initialised once, and a scene hears nothing in an orientation
// it was not initialised for. Under ASan/UBSan a value used as an index is
// reported at once.
TEST_F(Handlers, EveryNonZeroOrientationIsTheOneAlternateAndWaitsForItsInitialisation) {
    startReady(0, 0, 540, 960);
    testSceneSetDrawResult(5);
    Java_com_tarq_android_visualeffect_common_Native_prehandleSetOrientation(nullptr, nullptr, 7);
    everyEventButInitialisation();
    EXPECT_EQ(Application::handleDraw(), 0);
    EXPECT_EQ(takeKinds(), Ints{});
    Application::handleInitEffect();
    for (int value : {7, -1, 2, INT_MAX, INT_MIN, 1, 0, INT_MIN}) {
        SCOPED_TRACE(value);
        Java_com_tarq_android_visualeffect_common_Native_prehandleSetOrientation(nullptr, nullptr, value);
        EXPECT_EQ(Application::handleDraw(), 5);
        EXPECT_EQ(events().back().orientation, value);
        Application::handleInitEffect();
    }
    EXPECT_EQ(testSceneCount(TestSceneInitEffectAlternate), 1);
    EXPECT_EQ(testSceneCount(TestSceneInitEffect), 0);
    EXPECT_EQ(testSceneCount(TestSceneDraw), 8);
}

TEST_F(Handlers, WindowRectangleIsClampedSilentlyAndTouchesAreNormalisedFromItsCorner) {
    startReady(30, 40, 200, 100);
    Application::handleWindowRectangle(-3, -4, 0, -20);
    EXPECT_EQ(window(), (Ints{-3, -4, 1, 1}));
    EXPECT_EQ(vi::gpScene->mSize, glm::vec2(200.0f, 100.0f)) << "the scene is not told";
    Application::handleWindowRectangle(30, 40, 200, 100);
    AnimationManager::mNow = -7.0f;
    Application::handleMouseDown(80, 65);
    Application::handleMouseMove(130, 90);
    Application::handleMouseUp(30, 140);
    const std::vector<TestSceneEvent> touches = events();
    EXPECT_EQ(takeKinds(), (Ints{TestSceneTouchDown, TestSceneTouchMove, TestSceneTouchUp}));
    const glm::vec2 expected[] = {{0.25f, 0.75f}, {0.5f, 0.5f}, {0.0f, 0.0f}};
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ(glm::vec2(touches[i].x, touches[i].y), expected[i]) << i;
        EXPECT_GE(touches[i].now, 0.0f) << "the clock is advanced first";
    }
}

TEST(Clock, SecondsAndNanosecondsAreConvertedSeparatelyInSinglePrecision) {
    timespec now;
    clock_gettime(CLOCK_REALTIME, &now);
    // A long run with a negative nanosecond difference: at a million seconds a
    // float keeps sixteenths, so only the single-precision sum of the two
    // converted differences comes out exactly.
    vi::Timer::mStartingCnt = {now.tv_sec - 1000003, 999999999};
    vi::Timer::update();
    const timespec& read = vi::Timer::mCurrentCnt;
    const float seconds = float(std::int32_t(read.tv_sec - now.tv_sec + 1000003));
    EXPECT_EQ(AnimationManager::mNow, float(std::int32_t(read.tv_nsec - 999999999)) * 1e-9f + seconds);
    EXPECT_NEAR(AnimationManager::mNow, seconds - 1.0 + read.tv_nsec * 1e-9, 0.07);
}

namespace {

// Notes its calls in a shared log; may move the clock or add an animation.
struct LoggingAnimation : vi::Animation {
    LoggingAnimation(int id, std::vector<std::pair<int, float>>& log) : id(id), log(log) {}
    void update(float now) override {
        log.emplace_back(id, now);
        AnimationManager::mNow += clockShift;
        if (toAdd) AnimationManager::mStorage.push_back(toAdd);
        toAdd = nullptr;
    }
    int id;
    std::vector<std::pair<int, float>>& log;
    float clockShift = 0.0f;
    vi::Animation* toAdd = nullptr;
};

}  // namespace

TEST_F(Handlers, AReadyFrameUpdatesTheAnimationsInOrderWithTheClockReadAfreshBeforeTheScene) {
    std::vector<std::pair<int, float>> log;
    LoggingAnimation first(1, log), second(2, log), third(3, log), late(4, log);
    first.clockShift = 100.0f;
    second.toAdd = &late;
    AnimationManager::mStorage = {&first, &second, &third};
    Application::handleStart(0, 0, 540, 960);
    Application::handleDraw();
    EXPECT_TRUE(log.empty()) << "no update before the scene is ready";
    Application::handleInitEffect();
    Application::handleDraw();
    ASSERT_EQ(log.size(), 3u) << "an animation added during the loop waits for the next frame";
    EXPECT_EQ(log[0].first * 100 + log[1].first * 10 + log[2].first, 123);
    EXPECT_TRUE(log[0].second >= 0.0f && log[0].second < 100.0f) << log[0].second;
    EXPECT_EQ(log[1].second, log[0].second + 100.0f);
    EXPECT_EQ(log[2].second, log[1].second);
    EXPECT_EQ(events().back().now, log[2].second) << "the animations run before the scene draws";
    first.clockShift = 0.0f;
    Application::handleDraw();
    ASSERT_EQ(log.size(), 7u);
    EXPECT_EQ(log[6].first, 4);
}

TEST_F(Handlers, HandlersOnManyThreadsNeverOverlapInsideTheScene) {
    const int kCalls = 10000;
    startReady(0, 0, 540, 960);
    auto drawing = [] {
        for (int i = 0; i < kCalls; ++i) Application::handleDraw();
    };
    std::thread threads[] = {
        std::thread(drawing), std::thread(drawing),
        std::thread([] {
            for (int i = 0; i < kCalls; ++i)
                (i % 3 == 0 ? Application::handleMouseDown
                            : i % 3 == 1 ? Application::handleMouseMove : Application::handleMouseUp)(i % 540, i);
        }),
        std::thread([] {
            for (int i = 0; i < kCalls; ++i) Application::handleParam(i, -i);
        }),
        // The host's keys and the two developer keys that stay under the lock.
        std::thread([] {
            for (int i = 0; i < kCalls; ++i) Application::handleKey("\x00\x01\x02" "AU"[i % 5]);
        })};
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(testSceneOverlaps(), 0);
    EXPECT_EQ(testSceneCount(TestSceneDraw), 2 * kCalls);
    EXPECT_EQ(testSceneCount(TestSceneTouchDown) + testSceneCount(TestSceneTouchMove) +
                  testSceneCount(TestSceneTouchUp), kCalls);
    EXPECT_EQ(testSceneCount(TestSceneParam), kCalls);
    EXPECT_EQ(testSceneCount(TestSceneKeyPressed), kCalls * 3 / 5);
    EXPECT_EQ(testSceneCount(TestSceneAffordance), kCalls / 5);
    EXPECT_EQ(testSceneCount(TestSceneUnlock), kCalls / 5);
    EXPECT_EQ(testSceneCount(TestSceneClearEffect), 0) << "the key 'A' skips the clear";
    int keys = 0;
    for (const TestSceneEvent& event : events()) keys += event.kind == TestSceneKeyPressed ? event.a : 0;
    EXPECT_EQ(keys, kCalls / 5 * 3) << "the host's keys 0, 1 and 2 reach the scene unchanged";
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
        if (write(reports[1], "A", 1) != 1) _exit(3);
        _exit(0);
    }
    close(reports[1]);
    char report = 0;
    ASSERT_EQ(read(reports[0], &report, 1), 1);
    EXPECT_EQ(report, 'B');
    pollfd afterKey = {reports[0], POLLIN, 0};
    EXPECT_EQ(poll(&afterKey, 1, 2000), 0) << "the key returned (or the child ended)";
    kill(child, SIGKILL);
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
    close(reports[0]);
}

namespace {

// What the scene's record must show after the self-test key, worked out from
// the same random numbers by following the key's published steps: "D" a scene
// destroyed, "C<w>x<h>" one created, "I" and "A" initialised for the first
// and the alternate orientation, "F" a frame, "d", "m", "u" a touch down,
// move or up with its normalised point.
struct SelfTestSteps {
    int left, top, width, height;
    std::vector<std::string> seen;

    unsigned count() { return unsigned(lrand48() % 100); }
    void frame() { seen.push_back("F"); }
    void startAndInitialise() {
        seen.insert(seen.end(), {"D", "C" + std::to_string(width) + "x" + std::to_string(height), "I"});
    }
    void touch(const char* kind) {
        const long rx = lrand48(), ry = lrand48();
        seen.push_back(touchText(kind, float(int(rx % width)) / float(width),
                                 1.0f - float(int(ry % height)) / float(height)));
        frame();
    }
    static std::string touchText(const char* kind, float x, float y) {
        char text[64];
        snprintf(text, sizeof text, "%s %a %a", kind, x, y);
        return text;
    }
    void orientationRestarts() {
        for (unsigned i = 0, n = count(); i < n; ++i) {
            startAndInitialise();
            if (i & 1) seen.push_back("A");
            frame();
        }
    }
    void gestures(bool sharedCounter) {
        unsigned i = 0, n = count();
        for (unsigned gesture = 0; sharedCounter ? i < n : gesture < n; ++gesture, ++i) {
            touch("d");
            const unsigned m = count();
            for (unsigned move = 0; sharedCounter ? i < m : move < m; ++move, i += sharedCounter) touch("m");
            touch("u");
        }
    }
    void windowRectangles() {
        for (unsigned pass = 0, n = count(); pass < n; ++pass) {
            startAndInitialise();
            left = int(lrand48() % 1080);
            top = int(lrand48() % 1920);
            width = std::max(1, int(lrand48() % 1080));
            height = std::max(1, int(lrand48() % 1920));
            frame();
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

std::vector<std::string> recordAsSteps() {
    std::vector<std::string> seen;
    for (const TestSceneEvent& e : events()) {
        switch (e.kind) {
        case TestSceneDestroyed: seen.push_back("D"); break;
        case TestSceneCreated: seen.push_back("C" + std::to_string(e.a) + "x" + std::to_string(e.b)); break;
        case TestSceneInitEffect: seen.push_back("I"); break;
        case TestSceneInitEffectAlternate: seen.push_back("A"); break;
        case TestSceneDraw: seen.push_back("F"); break;
        case TestSceneTouchDown: seen.push_back(SelfTestSteps::touchText("d", e.x, e.y)); break;
        case TestSceneTouchMove: seen.push_back(SelfTestSteps::touchText("m", e.x, e.y)); break;
        case TestSceneTouchUp: seen.push_back(SelfTestSteps::touchText("u", e.x, e.y)); break;
        default: seen.push_back("other " + std::to_string(e.kind));
        }
    }
    return seen;
}

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
        SelfTestSteps steps = {10, 20, 300, 500, {}};
        srand48(seed);
        thirdPhases[steps.run()] = true;
        const long next = lrand48();
        srand48(seed);
        Application::handleKey('T');
        EXPECT_EQ(lrand48(), next) << "the random numbers drawn";
        const std::vector<std::string> seen = recordAsSteps();
        const auto differ = std::mismatch(seen.begin(), seen.end(), steps.seen.begin(), steps.seen.end());
        EXPECT_TRUE(differ.first == seen.end() && differ.second == steps.seen.end())
            << "from step " << (differ.first - seen.begin()) << " of " << seen.size() << "/" << steps.seen.size()
            << ": " << (differ.first == seen.end() ? "end" : *differ.first) << " instead of "
            << (differ.second == steps.seen.end() ? "end" : *differ.second);
        EXPECT_EQ(window(), (Ints{steps.left, steps.top, steps.width, steps.height}));
        EXPECT_EQ(testSceneOverlaps(), 0);
        EXPECT_TRUE(Application::isReady());
    }
    EXPECT_TRUE(thirdPhases[0] && thirdPhases[1] && thirdPhases[2]) << "seeds that reach every third phase";
}
