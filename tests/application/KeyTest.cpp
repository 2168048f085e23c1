// Key codes: the host's keys and unknown codes reach the scene unchanged, the
// developer keys do their one thing, and nothing acts before the scene is ready.
#include <poll.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include "RecordedScene.h"

using namespace apptest;
using vi::Application;

using Keys = RecordedScene;

TEST_F(Keys, HostKeysAndUnknownCodesReachKeyPressedUnchangedAfterTheClock) {
    startReadyScene();
    const unsigned int codes[] = {0, 1, 2, 3, 66, 84 + 256, 1000, 0xFFFFFFFFu};
    for (unsigned int code : codes) {
        vi::AnimationManager::mNow = -1.0f;
        Application::handleKey(code);
        ASSERT_EQ(testSceneEventCount(), 1) << code;
        const TestSceneEvent event = testSceneEventAt(0);
        EXPECT_EQ(event.kind, TestSceneKeyPressed);
        EXPECT_EQ(unsigned(event.a), code);
        EXPECT_GE(event.now, 0.0f);
        testSceneClearEvents();
    }
}

TEST_F(Keys, LetterAOnlyCallsAffordanceAndLetterUOnlyUnlock) {
    startReadyScene();
    Application::handleKey(65);
    EXPECT_EQ(kindsOf(allEvents()), (std::vector<int>{TestSceneAffordance}));
    testSceneClearEvents();
    Application::handleKey(85);
    EXPECT_EQ(kindsOf(allEvents()), (std::vector<int>{TestSceneUnlock}));
}

TEST_F(Keys, NoKeyActsAndNoRandomNumberIsDrawnBeforeTheSceneIsReady) {
    srand48(1234);
    const long firstDraw = lrand48();
    const unsigned int codes[] = {0, 1, 2, 65, 67, 84, 85, 1000};
    // No scene, then a started but uninitialised one, then one switched to an
    // orientation it was never initialised for.
    for (int state = 0; state < 3; ++state) {
        if (state == 1) Application::handleStart(0, 0, 540, 960);
        if (state == 2) {
            Application::handleInitEffect();
            Application::handleSetOrientation(vi::Orientation::Alternate);
        }
        testSceneClearEvents();
        srand48(1234);
        vi::AnimationManager::mNow = 42.0f;
        for (unsigned int code : codes) Application::handleKey(code);
        EXPECT_EQ(testSceneEventCount(), 0) << state;
        EXPECT_EQ(vi::AnimationManager::mNow, 42.0f) << state;
        EXPECT_EQ(lrand48(), firstDraw) << state;
    }
}

// handleClearEffect takes the lock the key handler already holds: the thread
// never comes back. Shown in a child, which reports just before the key and
// would report again after it; it is given two seconds and then killed.
TEST_F(Keys, LetterCBlocksTheCallingThreadForGood) {
    int reports[2];
    ASSERT_EQ(pipe(reports), 0);
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        close(reports[0]);
        startReadyScene();
        const char before = 'B', after = 'A';
        if (write(reports[1], &before, 1) != 1) _exit(2);
        Application::handleKey(67);
        if (write(reports[1], &after, 1) != 1) _exit(3);
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
