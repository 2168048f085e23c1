#include "RippleScene.h"

#include <algorithm>
#include <cmath>
#include <iterator>

#include <glm/gtc/matrix_transform.hpp>

#include "Application/AnimationManager.h"
#include "AssetAccess.h"
#include "Helpers/DrawableArrays.h"
#include "HintRenderer.h"
#include "ProceduralTextures.h"
#include "Render/Background.h"
#include "Render/Curves.h"
#include "Render/GL.h"
#include "Render/LightRenderer.h"
#include "Render/ModelObject.h"
#include "Render/RenderableTexture.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"
#include "Render/Uniform.h"
#include "ToneGrades.h"
#include "WaterRenderer.h"

namespace vi {

const char* const RippleScene::kWallpaperName = "wallpaper";
const char* const RippleScene::kModelName = "gem";

namespace {

// Touches: a press makes a full ripple, a drag leaves a trail of smaller ones
// at least kTrailSpacing apart (in shorter screen sides) or kTrailInterval apart in time.
constexpr float kTouchAmplitude = 1.0f;
constexpr float kTrailAmplitude = 0.55f;
constexpr float kTrailSpacing = 0.07f;
constexpr float kTrailInterval = 0.15f;
constexpr float kUnlockAmplitude = 1.3f;
constexpr float kNewPictureAmplitude = 0.8f;

// The hint: kHintPulses rings, one every kHintPulse seconds, each with a small ripple.
constexpr int kHintPulses = 3;
constexpr float kHintPulse = 1.1f;
constexpr float kHintAmplitude = 0.35f;

// Seconds for a change of grade to complete, and for the strength to go from 0 to 1.
constexpr float kGradeChange = 0.6f;
constexpr float kStrengthChange = 0.5f;

// The gem: a turn every 14 s; a fade (unlock, clear) over 0.7 s.
constexpr float kSpinRate = 6.2831853f / 14.0f;
constexpr float kFadeSeconds = 0.7f;
constexpr float kCameraDistance = 6.0f;
constexpr float kFieldOfView = 0.5235988f;  // 30 degrees, vertical

// Keys the host passes on: volume up and down step through the grades, menu drops a stone.
constexpr unsigned int kKeyMenu = 0;
constexpr unsigned int kKeyVolumeUp = 1;
constexpr unsigned int kKeyVolumeDown = 2;

// The fallback wallpaper's and the gem texture's sizes in texels.
constexpr unsigned int kFallbackWidth = 360;
constexpr unsigned int kFallbackHeight = 640;
constexpr unsigned int kGemTextureWidth = 64;
constexpr unsigned int kGemTextureHeight = 32;

template <typename T>
void deleteAndClear(T*& pointer) {
    delete pointer;
    pointer = nullptr;
}

}  // namespace

RippleScene::Layout RippleScene::layoutFor(Orientation::OrientationEnum orientation) {
    if (orientation == Orientation::Initial) return Layout{{0.5f, 0.60f}, 0.23f, 0.38f, {0.5f, 0.13f}, 0.15f};
    return Layout{{0.72f, 0.55f}, 0.19f, 0.34f, {0.5f, 0.14f}, 0.16f};
}

RippleScene::RippleScene(const int* size, ModelsMap* models, TexturesMap* textures)
    : Scene(size),
      mModels(models),
      mTextures(textures),
      mIsSetUp(false),
      mLastFrameTime(0.0f),
      mTrailPoint(-10.0f),
      mTrailTime(-10.0f),
      mWaterProgram(nullptr),
      mWaterRenderer(nullptr),
      mWaterTarget(nullptr),
      mTargetSize(0),
      mScreen(nullptr),
      mWallpaper(nullptr),
      mFallbackWallpaper(nullptr),
      mWallpaperChanged(false),
      mWallpaperTransform(1.0f, -1.0f, 0.0f, 1.0f),
      mScreenScale(1.0f),
      mGemShadow(0.0f),
      mGradeFrom(nullptr),
      mGradeTo(nullptr),
      mGrade(0),
      mGradeBlend(1.0f),
      mGradeStrength(1.0f),
      mGradeStrengthTarget(1.0f),
      mGemModel(nullptr),
      mOwnsGemModel(false),
      mGemTexture(nullptr),
      mGemRenderer(nullptr),
      mSpin(kSpinRate),
      mFade(1.0f, kFadeSeconds),
      mLightPosition(-2.2f, 0.9f, 6.0f),
      mEyePosition(0.0f, 0.0f, kCameraDistance),
      mAmbient(0.42f),
      mDiffuse(0.75f),
      mSpecular(1.1f),
      mShininess(18.0f),
      mHintProgram(nullptr),
      mHintRenderer(nullptr),
      mHintActive(false),
      mHintStart(0.0f),
      mHintPulses(0),
      mHintPhase(0.0f),
      mHintAlpha(0.0f),
      mHintColour(0.86f, 0.96f, 1.0f) {
    mNames.push_back(kWallpaperName);
}

RippleScene::~RippleScene() {
    std::vector<Animation*>& storage = AnimationManager::mStorage;
    storage.erase(std::remove(storage.begin(), storage.end(), static_cast<Animation*>(&mSpin)), storage.end());
    storage.erase(std::remove(storage.begin(), storage.end(), static_cast<Animation*>(&mFade)), storage.end());

    deleteAndClear(mHintRenderer);
    deleteAndClear(mGemRenderer);
    deleteAndClear(mScreen);
    deleteAndClear(mWaterRenderer);
    deleteAndClear(mWaterTarget);
    deleteAndClear(mHintProgram);
    deleteAndClear(mWaterProgram);
    deleteAndClear(mGradeFrom);
    deleteAndClear(mGradeTo);
    deleteAndClear(mGemTexture);
    deleteAndClear(mFallbackWallpaper);
    if (mOwnsGemModel) {
        auto entry = mModels->find(kModelName);
        if (entry != mModels->end() && entry->second == mGemModel) mModels->erase(entry);
        deleteAndClear(mGemModel);
    }
}

float RippleScene::observeTime() { return mClock.observe(AnimationManager::mNow); }

void RippleScene::initEffect() { setUp(); }

void RippleScene::initEffectAlternate() { setUp(); }

void RippleScene::setUp() {
    // One set of resources serves both orientations; only the layout differs.
    if (mIsSetUp) return;
    mIsSetUp = true;

    mWaterProgram = new ShaderProgram(WaterRenderer::vertexSource(), WaterRenderer::fragmentSource());
    mGradeFrom = ToneGrades::create(mGrade);
    mGradeTo = ToneGrades::create(mGrade);

    mHintQuad.construct(glm::vec3(-0.1f, -0.1f, 0.0f), glm::vec2(0.2f, 0.2f));
    DrawableArrays::pointAt(mHintDrawable, mHintQuad, true);  // placed anew for each layout
    mHintProgram = new ShaderProgram(HintRenderer::vertexSource(), HintRenderer::fragmentSource());
    mHintRenderer = new HintRenderer(*mHintProgram, mHintDrawable, HintRenderer::Inputs{&mHintPhase, &mHintAlpha,
                                                                                       &mHintColour});

    // The gem: shared through the models map when someone already loaded it.
    auto entry = mModels->find(kModelName);
    if (entry != mModels->end() && entry->second) {
        mGemModel = entry->second;
    } else if (AssetAccess::exists(std::string(kModelName) + ".bin")) {
        mGemModel = new ModelObject(kModelName);
        mOwnsGemModel = true;
        (*mModels)[kModelName] = mGemModel;
    }
    if (mGemModel) {
        mGemModel->fillDrawable(mGemDrawable);
        mGemTexture = ProceduralTextures::createGemColours(kGemTextureWidth, kGemTextureHeight);
        mGemDrawable.texture = mGemTexture;
        mGemRenderer = new LightRenderer(mGemDrawable);
        mGemRenderer->addUniform("uLightPosition", &mLightPosition, Uniform::Float3, 1);
        mGemRenderer->addUniform("uEyePosition", &mEyePosition, Uniform::Float3, 1);
        mGemRenderer->addUniform("uAmbient", &mAmbient, Uniform::Float, 1);
        mGemRenderer->addUniform("uDiffuse", &mDiffuse, Uniform::Float, 1);
        mGemRenderer->addUniform("uSpecular", &mSpecular, Uniform::Float, 1);
        mGemRenderer->addUniform("uShininess", &mShininess, Uniform::Float, 1);
    }
    AnimationManager::mStorage.push_back(&mSpin);
    AnimationManager::mStorage.push_back(&mFade);

    useWallpaper(findWallpaper());
    mLastFrameTime = observeTime();
}

Texture* RippleScene::findWallpaper() {
    auto entry = mTextures->find(kWallpaperName);
    if (entry != mTextures->end() && entry->second) return entry->second;
    if (!mFallbackWallpaper) mFallbackWallpaper = ProceduralTextures::createFallbackWallpaper(kFallbackWidth,
                                                                                            kFallbackHeight);
    return mFallbackWallpaper;
}

void RippleScene::useWallpaper(Texture* wallpaper) {
    // A renderer's sampler list cannot be edited, so a new picture object
    // gets a new renderer; a picture replaced in place keeps it.
    if (wallpaper == mWallpaper && mWaterRenderer) return;
    mWallpaper = wallpaper;
    delete mWaterRenderer;
    WaterRenderer::Inputs inputs{mField.mRipples, mField.mAmplitudes, &mWallpaperTransform, &mScreenScale,
                                 &mGradeBlend,    &mGradeStrength,    &mGemShadow};
    mWaterRenderer = new WaterRenderer(*mWaterProgram, mScreenQuad.drawable(), mWallpaper, mGradeFrom->getTexture(),
                                       mGradeTo->getTexture(), inputs);
    mWaterRenderers.assign(1, mWaterRenderer);
}

void RippleScene::fitTarget(const glm::ivec2& size) {
    // The target follows the window so the water is drawn at full resolution
    // in either orientation.
    if (mWaterTarget && size == mTargetSize) return;
    deleteAndClear(mScreen);
    deleteAndClear(mWaterTarget);
    mTargetSize = size;
    mWaterTarget = new RenderableTexture(mWaterRenderers, 0, 0, unsigned(size.x), unsigned(size.y), false, false,
                                         false, true, false);
    mScreen = new Background(*mWaterTarget);
}

void RippleScene::advance(float time, float delta) {
    mField.update(time);

    mGradeBlend = glm::min(1.0f, mGradeBlend + delta / kGradeChange);
    float step = delta / kStrengthChange;
    mGradeStrength = mGradeStrength < mGradeStrengthTarget ? glm::min(mGradeStrength + step, mGradeStrengthTarget)
                                                           : glm::max(mGradeStrength - step, mGradeStrengthTarget);

    if (mHintActive) {
        float elapsed = time - mHintStart;
        const Layout layout = layoutFor(mOrientation);
        while (mHintPulses < kHintPulses && elapsed >= kHintPulse * float(mHintPulses)) {
            mField.add(layout.hintCentre, mHintStart + kHintPulse * float(mHintPulses), kHintAmplitude);
            ++mHintPulses;
        }
        mHintPhase = elapsed / kHintPulse;
        const float total = kHintPulse * float(kHintPulses);
        mHintAlpha = glm::clamp(elapsed / 0.25f, 0.0f, 1.0f) * glm::clamp((total - elapsed) / 0.5f, 0.0f, 1.0f);
        if (elapsed >= total) mHintActive = false;
    }
    if (!mHintActive) mHintAlpha = 0.0f;
}

int RippleScene::draw() {
    const float time = observeTime();
    const float delta = glm::max(time - mLastFrameTime, 0.0f);
    mLastFrameTime = time;

    // The framework's render targets restore the binding they find recorded
    // here; the window's is whatever the host left bound.
    GLint frameBuffer = 0;
    GLint viewport[4] = {0, 0, 1, 1};
    glGetIntegerv(GL_FRAMEBUFFER_BINDING, &frameBuffer);
    glGetIntegerv(GL_VIEWPORT, viewport);
    RenderableTexture::mCurrentFrameBuffer = GLuint(frameBuffer);
    RenderableTexture::mCurrentFrameBufferPosition = glm::ivec2(viewport[0], viewport[1]);
    RenderableTexture::mCurrentFrameBufferSize = glm::ivec2(viewport[2], viewport[3]);
    const glm::ivec2 windowSize(std::max(viewport[2], 1), std::max(viewport[3], 1));
    const glm::vec2 windowExtent(windowSize);

    if (mWallpaperChanged || findWallpaper() != mWallpaper) {
        mWallpaperChanged = false;
        useWallpaper(findWallpaper());
    }
    fitTarget(windowSize);
    mScreenScale = windowExtent / std::min(windowExtent.x, windowExtent.y);
    mWallpaperTransform = WaterRenderer::coverTransform(mWallpaper->mSize, windowExtent);
    advance(time, delta);
    const Layout layout = layoutFor(mOrientation);
    placeShadow(layout);

    Renderer::setDepthTest(false, true, false);
    Renderer::setCullFace(false, true);
    Renderer::setBlending(false);
    mScreen->renderFrame();

    drawGem(layout, windowExtent, time);
    drawHint(layout, windowExtent);
    return 1;
}

void RippleScene::placeShadow(const Layout& layout) {
    // Below and to the right of the gem, away from the light; it goes with the gem.
    if (!mGemRenderer) return;
    const glm::vec2 offset = glm::vec2(0.05f, -1.25f * layout.gemRadius) / mScreenScale;
    mGemShadow = glm::vec4(layout.gemCentre + offset, 0.9f * layout.gemRadius, 0.45f * mFade.value());
}

void RippleScene::drawGem(const Layout& layout, const glm::vec2& viewport, float time) {
    const float opacity = mFade.value();
    if (!mGemRenderer || opacity <= 0.0f) return;
    const float aspect = viewport.x / viewport.y;
    Drawable::mProjectionMatrix = glm::perspective(kFieldOfView, aspect, 0.5f, 20.0f);
    Drawable::mViewMatrix = glm::lookAt(mEyePosition, glm::vec3(0.0f), glm::vec3(0.0f, 1.0f, 0.0f));

    // Screen placement to the plane z = 0, where the gem floats.
    const float halfHeight = std::tan(0.5f * kFieldOfView) * kCameraDistance;
    const float shorter = std::min(viewport.x, viewport.y);
    const float radius = layout.gemRadius * shorter / (0.5f * viewport.y) * halfHeight;
    glm::vec3 centre((2.0f * layout.gemCentre.x - 1.0f) * halfHeight * aspect,
                     (2.0f * layout.gemCentre.y - 1.0f) * halfHeight, 0.0f);
    // It rides the water a little, and rises as it fades out.
    centre.y += radius * (0.04f * std::sin(1.3f * time) + 0.35f * (1.0f - opacity));
    glm::mat4 model = glm::translate(glm::mat4(1.0f), centre);
    model = glm::scale(model, glm::vec3(radius * (1.0f + 0.2f * (1.0f - opacity))));
    model = glm::rotate(model, layout.gemTilt + 0.05f * std::sin(0.9f * time), glm::vec3(1.0f, 0.0f, 0.0f));
    model = glm::rotate(model, mSpin.angle(), glm::vec3(0.0f, 1.0f, 0.0f));
    mGemDrawable.modelMatrix = model;
    mGemDrawable.opacity = opacity;

    // The gem is convex: culling alone hides its far side, so it also looks
    // right on a window without a depth buffer.
    Renderer::clearDepth();
    Renderer::setDepthTest(true, true, false);
    Renderer::setCullFace(true, true);
    Renderer::setBlending(opacity < 1.0f);
    mGemRenderer->render();
    Renderer::setBlending(false);
    Renderer::setCullFace(false, true);
    Renderer::setDepthTest(false, true, false);
}

void RippleScene::drawHint(const Layout& layout, const glm::vec2& viewport) {
    if (mHintAlpha <= 0.0f) return;
    // A square on screen: its clip-space size depends on the window's shape.
    const float shorter = std::min(viewport.x, viewport.y);
    const glm::vec2 half(layout.hintRadius * shorter / (0.5f * viewport.x),
                         layout.hintRadius * shorter / (0.5f * viewport.y));
    const glm::vec2 centre = 2.0f * layout.hintCentre - 1.0f;
    mHintQuad.update(glm::vec3(centre - half, 0.0f), 2.0f * half);
    Renderer::setBlending(true);
    mHintRenderer->render();
    Renderer::setBlending(false);
}

void RippleScene::touchDown(const glm::vec2& position) {
    const float time = observeTime();
    mField.add(position, time, kTouchAmplitude);
    mTrailPoint = position;
    mTrailTime = time;
}

void RippleScene::touchMove(const glm::vec2& position) {
    const float time = observeTime();
    const glm::vec2 moved = (position - mTrailPoint) * mScreenScale;
    if (glm::length(moved) < kTrailSpacing && time - mTrailTime < kTrailInterval) return;
    mField.add(position, time, kTrailAmplitude);
    mTrailPoint = position;
    mTrailTime = time;
}

void RippleScene::touchUp(const glm::vec2& position) { touchMove(position); }

void RippleScene::clearEffect() {
    mField.calm(observeTime());
    mHintActive = false;
    mHintAlpha = 0.0f;
    mFade.setTarget(1.0f);
}

void RippleScene::affordance() {
    mHintActive = true;
    mHintStart = observeTime();
    mHintPulses = 0;
}

void RippleScene::unlock() {
    const float time = observeTime();
    mHintActive = false;
    if (mFade.target() > 0.0f && mGemRenderer) mField.add(layoutFor(mOrientation).gemCentre, time, kUnlockAmplitude);
    mFade.setTarget(0.0f);
}

void RippleScene::textureUpdated() {
    // New pixels for a texture already filed: if it is the wallpaper, the
    // renderer keeps it and the cover fit follows its new size at the next
    // frame; a ripple from the middle greets the new picture.
    mWallpaperChanged = true;
    if (mIsSetUp) mField.add(glm::vec2(0.5f), mClock.time(), kNewPictureAmplitude);
}

void RippleScene::keyPressed(unsigned int key) {
    if (key == kKeyVolumeUp || key == kKeyVolumeDown) {
        param(mGrade + (key == kKeyVolumeUp ? 1 : -1), int(mGradeStrengthTarget * 100.0f + 0.5f));
    } else if (key == kKeyMenu) {
        mField.add(glm::vec2(0.5f), observeTime(), kTouchAmplitude);
    }
}

void RippleScene::param(int a, int b) {
    mGradeStrengthTarget = ToneGrades::strength(b);
    const int grade = ToneGrades::normalise(a);
    if (grade == mGrade || !mGradeTo) return;
    // The picture moves from what it shows now towards the new grade.
    std::copy(std::begin(mGradeTo->mTable), std::end(mGradeTo->mTable), std::begin(mGradeFrom->mTable));
    ToneGrades::write(grade, *mGradeTo);
    mGrade = grade;
    mGradeBlend = 0.0f;
}

}  // namespace vi
