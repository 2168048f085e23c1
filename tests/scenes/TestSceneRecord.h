#pragma once

// What the recording test scene saw: one event per call it received, with
// the call's arguments and what the runtime keeps in the scene during the
// call. Kept in the plug-in; read by the C++ tests through these functions
// and by the Java tests through com.tarq.test.TestScene. Written only from
// inside the scene's operations, which the runtime serialises; read while the
// runtime is idle.

#define TESTSCENE_API __attribute__((visibility("default")))

#ifdef __cplusplus
extern "C" {
#endif

enum TestSceneEventKind {
    TestSceneCreated, TestSceneDestroyed, TestSceneClearEffect, TestSceneAffordance, TestSceneUnlock,
    TestSceneTextureUpdated, TestSceneInitEffect, TestSceneInitEffectAlternate, TestSceneDraw,
    TestSceneTouchDown, TestSceneTouchUp, TestSceneTouchMove, TestSceneKeyPressed, TestSceneParam,
    TestSceneEventKindCount
};

struct TestSceneEvent {
    int kind;
    int scene;        // serial number of the scene, from 1 after a reset
    int factory;      // 1: createScene, 2: createSecondScene
    int a, b;         // Created: the size given to the factory; Param: a, b; KeyPressed: a is the key
    float x, y;       // touches: the normalised point
    int orientation;  // the scene's orientation during the call
    float now;        // vi::AnimationManager::mNow during the call
};

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
TESTSCENE_API int testSceneCount(int kind);
// Calls that began while another call into a scene was still running.
TESTSCENE_API int testSceneOverlaps(void);

#ifdef __cplusplus
}
#endif
