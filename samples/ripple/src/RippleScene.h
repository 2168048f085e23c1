#pragma once

// The ripple effect: the host's wallpaper under water. Touches send ripples
// across it, drops fall by themselves now and then, the picture is graded
// through tone curves the host picks with param(a, b), and a faceted gem
// turns slowly above the water, lit by a point light; it rises and fades
// away on unlock. Affordance shows pulsing rings near the bottom; a clear
// calms the water and brings the gem back.
//
// Frame: the water (wallpaper, ripples, grade, the gem's shadow) is drawn
// into a render target the size of the window; a vi::Background shows that
// target on the window (re-rendering it first, since it is dynamic); then the
// gem and the hint are drawn over it.
//
// Owns its programs, renderers, render target, background, curves, its own
// textures, and the gem model unless the models map already held one; never
// the host's textures. All GL resources are made at the first initialisation
// and released by the destructor. Runs on the host's render thread, under
// the runtime's lock.

#include <string>
#include <vector>

#include <glm/glm.hpp>

#include "Application/Scene.h"
#include "FadeAnimation.h"
#include "Helpers/FullScreenQuad.h"
#include "Render/Drawable.h"
#include "Render/GeometryRectangle.h"
#include "RippleField.h"
#include "SceneClock.h"
#include "SpinAnimation.h"

namespace vi {

class Background;
class Curves;
class HintRenderer;
class LightRenderer;
class ModelObject;
class RenderableTexture;
class Renderer;
class ShaderProgram;
class Texture;
class WaterRenderer;

class RippleScene : public Scene {
public:
    RippleScene(const int* size, ModelsMap* models, TexturesMap* textures);
    ~RippleScene() override;

    void clearEffect() override;
    void affordance() override;
    void unlock() override;
    void textureUpdated() override;
    void initEffect() override;
    void initEffectAlternate() override;
    int draw() override;
    void touchDown(const glm::vec2& position) override;
    void touchUp(const glm::vec2& position) override;
    void touchMove(const glm::vec2& position) override;
    void keyPressed(unsigned int key) override;
    void param(int a, int b) override;

    // The texture the scene asks the host for, and the model asset it loads (+ ".bin").
    static const char* const kWallpaperName;
    static const char* const kModelName;

    // Where things go on screen (normalised, origin bottom left); sizes are
    // fractions of the shorter side.
    struct Layout {
        glm::vec2 gemCentre;
        float gemRadius;
        float gemTilt;  // radians, top towards the viewer
        glm::vec2 hintCentre;
        float hintRadius;
    };
    // The initial orientation (a phone held upright): the gem above the
    // middle; the alternate one (landscape): the gem to the right, smaller.
    static Layout layoutFor(Orientation::OrientationEnum orientation);

private:
    void setUp();
    Texture* findWallpaper();
    void useWallpaper(Texture* wallpaper);
    void fitTarget(const glm::ivec2& size);
    void advance(float time, float delta);
    void placeShadow(const Layout& layout);
    void drawGem(const Layout& layout, const glm::vec2& viewport, float time);
    void drawHint(const Layout& layout, const glm::vec2& viewport);
    float observeTime();

    ModelsMap* mModels;
    TexturesMap* mTextures;
    bool mIsSetUp;

    SceneClock mClock;
    float mLastFrameTime;
    RippleField mField;
    glm::vec2 mTrailPoint;
    float mTrailTime;

    // The water and the window.
    ShaderProgram* mWaterProgram;
    FullScreenQuad mScreenQuad;
    WaterRenderer* mWaterRenderer;
    std::vector<Renderer*> mWaterRenderers;
    RenderableTexture* mWaterTarget;
    glm::ivec2 mTargetSize;
    Background* mScreen;
    Texture* mWallpaper;
    Texture* mFallbackWallpaper;
    bool mWallpaperChanged;
    glm::vec4 mWallpaperTransform;
    glm::vec2 mScreenScale;
    glm::vec4 mGemShadow;

    // The grade: the previous curves fade into the current ones.
    Curves* mGradeFrom;
    Curves* mGradeTo;
    int mGrade;
    float mGradeBlend;
    float mGradeStrength;
    float mGradeStrengthTarget;

    // The gem.
    ModelObject* mGemModel;
    bool mOwnsGemModel;
    Drawable mGemDrawable;
    Texture* mGemTexture;
    LightRenderer* mGemRenderer;
    SpinAnimation mSpin;
    FadeAnimation mFade;
    glm::vec3 mLightPosition;
    glm::vec3 mEyePosition;
    float mAmbient;
    float mDiffuse;
    float mSpecular;
    float mShininess;

    // The affordance hint.
    ShaderProgram* mHintProgram;
    GeometryRectangle mHintQuad;
    Drawable mHintDrawable;
    HintRenderer* mHintRenderer;
    bool mHintActive;
    float mHintStart;
    int mHintPulses;
    float mHintPhase;
    float mHintAlpha;
    glm::vec3 mHintColour;
};

}  // namespace vi
