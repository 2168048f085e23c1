#pragma once

// A fixture around the recording test scene: no scene, a fresh record, the
// plug-in's factory in vi::gCreateScene, the default window and no animations.

#include <gtest/gtest.h>

#include <vector>

#include "Application/AnimationManager.h"
#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Application/Timer.h"
#include "TestSceneRecord.h"

extern "C" vi::Scene* createScene(int* size, vi::ModelsMap* models, vi::TexturesMap* textures);

namespace apptest {

std::vector<TestSceneEvent> allEvents();
std::vector<TestSceneEvent> eventsOf(int kind);
std::vector<int> kindsOf(const std::vector<TestSceneEvent>& events);
// The window globals: left, top, width, height.
std::vector<int> windowRectangle();

class RecordedScene : public ::testing::Test {
protected:
    void SetUp() override;
    void TearDown() override;

    // A scene started in a window of the given size at (0, 0) and initialised,
    // with the record cleared afterwards.
    void startReadyScene(int width = 540, int height = 960);
};

}  // namespace apptest
