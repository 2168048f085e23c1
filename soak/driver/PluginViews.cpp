#include "PluginViews.h"

#include <cstring>

#include "SoakSceneApi.h"
#include "TestSceneRecord.h"

namespace visoak {

namespace {

// The soak scene's calls by event; created and destroyed come from its counts.
const int kSoakCallOf[SceneEventCount] = {
    -1,
    -1,
    SoakSceneClearEffect,
    SoakSceneAffordance,
    SoakSceneUnlock,
    SoakSceneTextureUpdated,
    SoakSceneInitEffect,
    SoakSceneInitEffectAlternate,
    SoakSceneDraw,
    SoakSceneTouchDown,
    SoakSceneTouchUp,
    SoakSceneTouchMove,
    SoakSceneKeyPressed,
    SoakSceneParam,
};

const int kTestKindOf[SceneEventCount] = {
    TestSceneCreated,     TestSceneDestroyed,          TestSceneClearEffect, TestSceneAffordance,
    TestSceneUnlock,      TestSceneTextureUpdated,     TestSceneInitEffect,  TestSceneInitEffectAlternate,
    TestSceneDraw,        TestSceneTouchDown,          TestSceneTouchUp,     TestSceneTouchMove,
    TestSceneKeyPressed,  TestSceneParam,
};

}  // namespace

const char* pluginName(Plugin plugin) {
    switch (plugin) {
        case PluginNone: return "none";
        case PluginSoak: return "soak scene";
        case PluginTest: return "test scene";
    }
    return "?";
}

const char* eventName(SceneEvent event) {
    switch (event) {
        case EventCreated: return "created";
        case EventDestroyed: return "destroyed";
        case EventClearEffect: return "clearEffect";
        case EventAffordance: return "affordance";
        case EventUnlock: return "unlock";
        case EventTextureUpdated: return "textureUpdated";
        case EventInitEffect: return "initEffect";
        case EventInitEffectAlternate: return "initEffectAlternate";
        case EventDraw: return "draw";
        case EventTouchDown: return "touchDown";
        case EventTouchUp: return "touchUp";
        case EventTouchMove: return "touchMove";
        case EventKeyPressed: return "keyPressed";
        case EventParam: return "param";
        case SceneEventCount: return "?";
    }
    return "?";
}

Snapshot takeSnapshot() {
    Snapshot snapshot;
    std::memset(&snapshot, 0, sizeof(snapshot));

    SoakSceneView view;
    soakSceneGetView(&view);
    PluginCounts& soak = snapshot.plugins[PluginSoak];
    soak.events[EventCreated] = view.created;
    soak.events[EventDestroyed] = view.destroyed;
    for (int event = EventClearEffect; event < SceneEventCount; ++event)
        soak.events[event] = view.calls[kSoakCallOf[event]];
    soak.overlaps = view.overlaps;
    soak.destroyedTwice = view.destroyedTwice;
    soak.animationUpdates = view.animationUpdates;

    PluginCounts& test = snapshot.plugins[PluginTest];
    for (int event = 0; event < SceneEventCount; ++event) test.events[event] = testSceneCount(kTestKindOf[event]);
    test.overlaps = testSceneOverlaps();
    return snapshot;
}

}  // namespace visoak
