#pragma once

// The two plug-ins the soak starts (the soak scene and the recording test
// scene), read through their own reporting functions into one shape: how
// many calls of each kind their scenes received, how many scenes they made
// and destroyed, and whether a call ever began inside another.

#include <string>

namespace visoak {

enum Plugin { PluginNone, PluginSoak, PluginTest };

const char* pluginName(Plugin plugin);

enum SceneEvent {
    EventCreated,
    EventDestroyed,
    EventClearEffect,
    EventAffordance,
    EventUnlock,
    EventTextureUpdated,
    EventInitEffect,
    EventInitEffectAlternate,
    EventDraw,
    EventTouchDown,
    EventTouchUp,
    EventTouchMove,
    EventKeyPressed,
    EventParam,
    SceneEventCount
};

const char* eventName(SceneEvent event);

struct PluginCounts {
    int events[SceneEventCount];
    int overlaps;
    int destroyedTwice;
    int animationUpdates;  // soak scene only
};

struct Snapshot {
    PluginCounts plugins[3];  // indexed by Plugin; PluginNone stays zero
};

Snapshot takeSnapshot();

}  // namespace visoak
