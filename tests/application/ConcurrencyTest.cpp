// Several host threads at once: the lock keeps every call into the scene to
// itself (the scene notices a call that begins inside another). Also run
// under ThreadSanitizer.
#include <stdlib.h>

#include <thread>

#include "RecordedScene.h"

using namespace apptest;
using vi::Application;

namespace {

const int kCalls = 10000;

void drawing() {
    for (int i = 0; i < kCalls; ++i) Application::handleDraw();
}

void touching() {
    for (int i = 0; i < kCalls; ++i) {
        switch (i % 3) {
        case 0:
            Application::handleMouseDown(i % 540, i % 960);
            break;
        case 1:
            Application::handleMouseMove(i % 540, i % 960);
            break;
        case 2:
            Application::handleMouseUp(i % 540, i % 960);
            break;
        }
    }
}

void sendingParams() {
    for (int i = 0; i < kCalls; ++i) Application::handleParam(i, -i);
}

// The host's keys and the two developer keys that stay under the lock.
const unsigned int kKeys[] = {0, 1, 2, 65, 85};

void pressingKeys() {
    for (int i = 0; i < kCalls; ++i) Application::handleKey(kKeys[i % 5]);
}

}  // namespace

using Concurrency = RecordedScene;

TEST_F(Concurrency, HandlersOnManyThreadsNeverOverlapInsideTheScene) {
    startReadyScene();
    std::thread threads[] = {std::thread(drawing), std::thread(drawing), std::thread(touching),
                             std::thread(sendingParams), std::thread(pressingKeys)};
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(testSceneOverlaps(), 0);
    EXPECT_EQ(testSceneCount(TestSceneDraw), 2 * kCalls);
    EXPECT_EQ(testSceneCount(TestSceneTouchDown) + testSceneCount(TestSceneTouchMove) +
                  testSceneCount(TestSceneTouchUp),
              kCalls);
    EXPECT_EQ(testSceneCount(TestSceneParam), kCalls);
    EXPECT_EQ(testSceneCount(TestSceneKeyPressed), kCalls * 3 / 5);
    EXPECT_EQ(testSceneCount(TestSceneAffordance), kCalls / 5);
    EXPECT_EQ(testSceneCount(TestSceneUnlock), kCalls / 5);
}

