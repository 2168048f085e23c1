#pragma once

// What the soak scene reports to the driver: the calls it received, the
// scenes made and destroyed, the GL objects the live scene owns, and a key
// that names everything its picture depends on. The scene's picture is a
// function of the calls it received (never of the clock) and of the host's
// texture it shows, so two frames with the same key and the same host texture
// must show the same pixels. Written only from inside the scene's
// operations, which the runtime serialises; read while the runtime is idle.

#if defined(__GNUC__)
#define SOAKSCENE_API __attribute__((visibility("default")))
#else
#define SOAKSCENE_API
#endif

#ifdef __cplusplus
extern "C" {
#endif

enum SoakSceneCall {
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
    SoakSceneCallCount
};

// Bits of SoakSceneView::pictureKey beyond the scene's own state.
enum SoakScenePictureBits {
    SoakSceneShowsChecker = 1 << 16,  // the background's texture still has its pixels
    SoakSceneShowsPhoto = 1 << 17,    // the host's picture is shown (it still has its pixels)
    SoakSceneShowsAlternate = 1 << 18
};

struct SoakSceneView {
    int created;    // scenes made since the process started
    int destroyed;  // scenes destroyed
    int destroyedTwice;
    int overlaps;   // calls that began while another call into a scene was running
    int calls[SoakSceneCallCount];
    int animationUpdates;
    int lastDrawResult;
    // Of the live scene (all 0 when none):
    int initialisedByCalls[2];  // its initEffect / initEffectAlternate ran
    unsigned int pictureKey;    // of its last frame
    void* photo;                // the host texture its last frame showed, or null
};

// The host texture name the scenes made from now on show (kept as given).
SOAKSCENE_API void soakSceneSetPhotoName(const char* name);
SOAKSCENE_API void soakSceneGetView(struct SoakSceneView* view);
// The live scene's renderers and textures; returns how many there are
// (writes at most `capacity`).
SOAKSCENE_API int soakSceneOwnedRenderers(void** renderers, int capacity);
SOAKSCENE_API int soakSceneOwnedTextures(void** textures, int capacity);
// The live scene's animation in vi::AnimationManager::mStorage, or null.
SOAKSCENE_API void* soakSceneAnimation(void);

#ifdef __cplusplus
}
#endif
