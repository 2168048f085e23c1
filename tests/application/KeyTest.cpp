// Key 67 blocks for good (the other keys are tested from the JVM).
#include <poll.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include "RecordedScene.h"

using namespace apptest;
using vi::Application;

using Keys = RecordedScene;

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
