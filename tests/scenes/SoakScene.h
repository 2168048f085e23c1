#pragma once

// The scene the soak drives: a small effect that uses what real effects use
// (shader programs shared by several renderers, indexed drawables with static
// and dynamic attributes, own uniforms, a static and a dynamic texture, a
// render target re-rendered every frame, a background, the host's picture,
// an animation) and whose picture depends only on the calls it received.
// Owns every GL object it makes and deletes them all in its destructor.

#include <string>
#include <vector>

#include <glm/glm.hpp>

#include "Application/Animation.h"
#include "Application/Scene.h"
#include "Render/Drawable.h"

namespace vi {
class Background;
class RenderableTexture;
class Renderer;
class ShaderProgram;
class Texture;
}  // namespace vi

namespace visoak {

class CountingAnimation : public vi::Animation {
public:
    void update(float now) override;
    float mLast = 0.0f;
};

class SoakScene : public vi::Scene {
public:
    SoakScene(const int* size, vi::TexturesMap* textures, const std::string& photoName);
    ~SoakScene() override;

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

    int mSerial;
    bool mInitialisedByCalls[2];
    unsigned int mPictureKey;
    vi::Texture* mShownPhoto;

    std::vector<vi::Renderer*> ownedRenderers() const;
    std::vector<vi::Texture*> ownedTextures() const;
    vi::Animation* animation() { return mIsSetUp ? &mAnimation : nullptr; }

private:
    // One quad of the picture, in clip space.
    struct Tile {
        float positions[8];
        vi::Drawable drawable;
        void place(float left, float bottom, float right, float top);
    };

    void setUp();
    void makeAlternate();
    void refreshPattern();
    void placeShape();
    vi::Renderer* makeTileRenderer(Tile& tile, vi::Texture* texture, const glm::vec4* tint);
    unsigned int stateKey() const;

    vi::TexturesMap* mTextures;
    std::string mPhotoName;
    bool mIsSetUp;
    CountingAnimation mAnimation;

    // The state the picture shows.
    int mTint;
    int mKeys;
    int mTouches;
    bool mAffordance;
    bool mUnlocked;

    vi::ShaderProgram* mTileProgram;
    vi::ShaderProgram* mShapeProgram;
    std::vector<unsigned int> mPatternPixels;
    vi::Texture* mPattern;
    vi::Texture* mChecker;
    vi::RenderableTexture* mTarget;
    std::vector<vi::Renderer*> mTargetRenderers;
    vi::Background* mBackground;

    Tile mPatternTile;
    Tile mTargetTile;
    Tile mPhotoTile;
    Tile mAlternateTile;
    vi::Renderer* mPatternRenderer;
    vi::Renderer* mTargetTileRenderer;
    vi::Renderer* mPhotoRenderer;
    vi::Renderer* mAlternateRenderer;
    vi::Texture* mPhoto;

    float mShapePositions[14];
    float mShapeColours[21];
    vi::Drawable mShape;
    vi::Renderer* mShapeRenderer;

    glm::vec4 mTintColour;
    glm::vec4 mAlternateTint;
    float mMix;
};

}  // namespace visoak
