#pragma once

// The recording test scene's settings and what it saw: one event per call it
// received, with the call's arguments and what the runtime keeps in the scene
// during the call. Kept in the plug-in; used by the C++ tests and the soak
// through gTestScene and by the Java tests through com.tarq.test.TestScene.
// Events are written only from inside the scene's operations, which the
// runtime serialises; read while the runtime is idle.

#include <string>
#include <vector>

#include "Application/Scene.h"

// kind: the call's letter: C created, D destroyed, c clearEffect, a affordance,
// l unlock, t textureUpdated, I initEffect, A initEffectAlternate, F draw,
// d, u and m a touch down, up and move, k keyPressed, p param. factory: 1
// for createScene, 2 for createSecondScene; a and b: a start's size given to
// the factory, a parameter's two values, a key's code; x and y: a touch's
// normalised point; orientation: the scene's during the call; now:
// vi::AnimationManager::mNow during the call.
struct TestSceneEvent {
    int kind, factory, a, b, orientation;
    float x, y, now;
};

struct __attribute__((visibility("default"))) TestSceneState {
    std::vector<std::string> names;  // a new scene's
    int drawResult = 0;
    // When set, draw clears the colour buffer of the current context to opaque
    // black, then shows the host's image filed under the scene's first name
    // over the whole frame (while it has client pixels).
    bool picture = false;
    std::vector<TestSceneEvent> events;
    int overlaps = 0;  // calls that began while another call into a scene was still running

    // The events so far, then cleared (the overlaps too): each event's letter
    // ('S' for a scene the second factory made), with the
    // arguments of a start, a touch, a key and a parameter.
    std::string taken();
    // Forgets every event and restores the defaults.
    void reset() { *this = TestSceneState(); }
};

extern __attribute__((visibility("default"))) TestSceneState gTestScene;
// The recording scene's factory.
extern "C" vi::Scene* createScene(int* size, vi::ModelsMap* models, vi::TexturesMap* textures);
