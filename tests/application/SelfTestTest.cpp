// The developer key 'T': a randomised run of the handlers. Whatever the random
// sequence, its shape holds: every scene it makes is initialised once and
// drawn once, every touch is a frame inside a gesture of down, moves, up at a
// normalised point, nothing overlaps, and the scene is ready at the end in a
// window of at least one pixel.
#include <stdlib.h>

#include "RecordedScene.h"

using namespace apptest;
using vi::Application;

namespace {

class SelfTest : public RecordedScene {};

TEST_F(SelfTest, EverySeedGivesScenesInitialisedAndDrawnOnceAndWholeGestures) {
    for (long seed = 1; seed <= 6; ++seed) {
        SCOPED_TRACE(testing::Message() << "seed " << seed);
        Application::handleStart(10, 20, 300, 500);
        Application::handleInitEffect();
        testSceneClearEvents();
        srand48(seed);
        Application::handleKey(84);

        const int scenes = testSceneCount(TestSceneCreated);
        EXPECT_GT(scenes, 0);
        EXPECT_EQ(testSceneCount(TestSceneDestroyed), scenes);
        EXPECT_EQ(testSceneCount(TestSceneInitEffect), scenes);
        EXPECT_LE(testSceneCount(TestSceneInitEffectAlternate), scenes);
        EXPECT_EQ(testSceneOverlaps(), 0);

        int touches = 0;
        bool down = false;
        for (const TestSceneEvent& event : allEvents()) {
            if (event.kind != TestSceneTouchDown && event.kind != TestSceneTouchMove && event.kind != TestSceneTouchUp)
                continue;
            ++touches;
            EXPECT_EQ(event.kind == TestSceneTouchDown, !down) << "touch " << touches;
            down = event.kind != TestSceneTouchUp;
            EXPECT_TRUE(event.x >= 0.0f && event.x < 1.0f) << event.x;
            EXPECT_TRUE(event.y > 0.0f && event.y <= 1.0f) << event.y;
        }
        EXPECT_FALSE(down) << "every gesture ends with a touch up";
        EXPECT_EQ(testSceneCount(TestSceneDraw), scenes + touches);

        EXPECT_TRUE(Application::isReady());
        const std::vector<int> window = windowRectangle();
        EXPECT_TRUE(window[2] >= 1 && window[2] < 1080) << "width " << window[2];
        EXPECT_TRUE(window[3] >= 1 && window[3] < 1920) << "height " << window[3];
    }
}

}  // namespace
