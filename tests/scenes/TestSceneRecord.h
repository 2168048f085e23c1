#pragma once

// What the recording test scene saw: one event per call it received, with
// the call's arguments and what the runtime keeps in the scene during the
// call. Kept in the plug-in; read by the C++ tests through these functions
// and by the Java tests through com.tarq.test.TestScene. Written only from
// inside the scene's operations, which the runtime serialises; read while the
// runtime is idle.

#define TESTSCENE_API __attribute__((visibility("default")))

extern "C" {

enum TestSceneEventKind {
    TestSceneCreated, TestSceneDestroyed, TestSceneClearEffect, TestSceneAffordance, TestSceneUnlock,
    TestSceneTextureUpdated, TestSceneInitEffect, TestSceneInitEffectAlternate, TestSceneDraw, TestSceneTouchDown,
    TestSceneTouchUp, TestSceneTouchMove, TestSceneKeyPressed, TestSceneParam, TestSceneEventKindCount
};

// scene: the scene's serial number, from 1 after a reset; factory: 1 for
// createScene, 2 for createSecondScene; a and b: a start's size given to the
// factory, a parameter's two values, a key's code; x and y: a touch's
// normalised point; orientation: the scene's during the call; now:
// vi::AnimationManager::mNow during the call.
struct TestSceneEvent { int kind, scene, factory, a, b; float x, y; int orientation; float now; };

// Forgets every event and the overlaps, and restores the defaults: no names,
// draw result 0, no clearing, no picture, scene serials from 1.
TESTSCENE_API void testSceneReset(void);
// Forgets the events and overlaps only.
TESTSCENE_API void testSceneClearEvents(void);
TESTSCENE_API void testSceneSetNames(const char* const* names, int count);
TESTSCENE_API void testSceneSetDrawResult(int result);
// When enabled, draw clears the colour buffer of the current context.
TESTSCENE_API void testSceneSetClearColour(int enabled, float red, float green, float blue, float alpha);
// When enabled, draw then shows the host's image filed under the scene's
// first name over the whole frame (while it has client pixels).
TESTSCENE_API void testSceneSetPicture(int enabled);

TESTSCENE_API int testSceneEventCount(void);
// index from 0 to testSceneEventCount() - 1
TESTSCENE_API struct TestSceneEvent testSceneEventAt(int index);
// Calls that began while another call into a scene was still running.
TESTSCENE_API int testSceneOverlaps(void);
}
