#include "RecordedScene.h"

namespace apptest {

std::vector<TestSceneEvent> allEvents() {
    std::vector<TestSceneEvent> events;
    for (int i = 0; i < testSceneEventCount(); ++i) events.push_back(testSceneEventAt(i));
    return events;
}

std::vector<TestSceneEvent> eventsOf(int kind) {
    std::vector<TestSceneEvent> events;
    for (const TestSceneEvent& event : allEvents())
        if (event.kind == kind) events.push_back(event);
    return events;
}

std::vector<int> kindsOf(const std::vector<TestSceneEvent>& events) {
    std::vector<int> kinds;
    for (const TestSceneEvent& event : events) kinds.push_back(event.kind);
    return kinds;
}

std::vector<int> windowRectangle() {
    return {vi::ApplicationVar::msWindowLeft, vi::ApplicationVar::msWindowTop, vi::ApplicationVar::msWindowWidth,
            vi::ApplicationVar::msWindowHeight};
}

void RecordedScene::SetUp() {
    vi::Application::handleStop();
    vi::AnimationManager::mStorage.clear();
    testSceneReset();
    vi::gCreateScene = createScene;
    vi::Application::handleWindowRectangle(0, 0, 540, 960);
}

void RecordedScene::TearDown() {
    vi::Application::handleStop();
    vi::AnimationManager::mStorage.clear();
}

void RecordedScene::startReadyScene(int width, int height) {
    vi::Application::handleStart(0, 0, width, height);
    vi::Application::handleInitEffect();
    testSceneClearEvents();
}

}  // namespace apptest
