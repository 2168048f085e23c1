#include "SoakScene.h"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <set>
#include <thread>

#include "Application/AnimationManager.h"
#include "Render/Background.h"
#include "Render/GL.h"
#include "Render/RenderableTexture.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"
#include "Render/Uniform.h"
#include "SoakSceneApi.h"

namespace visoak {

namespace {

const char* const kTileVertex =
    "attribute vec2 aPosition;\n"
    "attribute vec2 aTexCoord;\n"
    "uniform mat4 uModelViewProjectionMatrix;\n"
    "varying vec2 vTexCoord;\n"
    "void main() {\n"
    "    vTexCoord = aTexCoord;\n"
    "    gl_Position = uModelViewProjectionMatrix * vec4(aPosition, 0.0, 1.0);\n"
    "}\n";

const char* const kTileFragment =
    "precision mediump float;\n"
    "uniform sampler2D uTexture;\n"
    "uniform vec2 uTextureTexelSize;\n"
    "uniform vec4 uTint;\n"
    "uniform float uMix;\n"
    "varying vec2 vTexCoord;\n"
    "void main() {\n"
    "    vec4 texel = texture2D(uTexture, vTexCoord + 0.25 * uTextureTexelSize);\n"
    "    gl_FragColor = mix(texel, uTint, uMix);\n"
    "}\n";

const char* const kShapeVertex =
    "attribute vec2 aPosition;\n"
    "attribute vec3 aColour;\n"
    "uniform float uOpacity;\n"
    "varying vec4 vColour;\n"
    "void main() {\n"
    "    vColour = vec4(aColour, uOpacity);\n"
    "    gl_Position = vec4(aPosition, 0.0, 1.0);\n"
    "}\n";

const char* const kShapeFragment =
    "precision mediump float;\n"
    "varying vec4 vColour;\n"
    "void main() { gl_FragColor = vColour; }\n";

const float kTexCoords[] = {0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 1.0f, 1.0f, 1.0f};
const unsigned short kQuadIndices[] = {0, 1, 2, 2, 1, 3};
const unsigned short kShapeIndices[] = {0, 1, 2, 0, 2, 3, 0, 3, 4, 0, 4, 5, 0, 5, 6, 0, 6, 1};
const unsigned int kPatternSide = 16;
const unsigned int kCheckerSide = 8;
const unsigned int kTargetSide = 32;

const glm::vec4 kTints[] = {glm::vec4(1.0f, 0.2f, 0.2f, 1.0f), glm::vec4(0.2f, 1.0f, 0.3f, 1.0f),
                            glm::vec4(0.3f, 0.4f, 1.0f, 1.0f), glm::vec4(1.0f, 1.0f, 0.2f, 0.5f)};

// The record the driver reads.
SoakSceneView gView;
std::set<int> gDestroyedSerials;
std::string gPhotoName = "photo";
SoakScene* gLive = nullptr;
std::atomic<bool> gInside(false);

}  // namespace

// Marks the time spent inside the scene; gives up the processor once inside,
// so that a call let in beside it would find the flag set.
class Inside {
public:
    explicit Inside(int call) {
        if (gInside.exchange(true)) ++gView.overlaps;
        if (call >= 0) ++gView.calls[call];
        std::this_thread::yield();
    }
    ~Inside() { gInside.store(false); }
};

void CountingAnimation::update(float now) {
    mLast = now;
    ++gView.animationUpdates;
}

void SoakScene::Tile::place(float left, float bottom, float right, float top) {
    const float corners[8] = {left, bottom, right, bottom, left, top, right, top};
    std::memcpy(positions, corners, sizeof(corners));
    drawable.mode = GL_TRIANGLES;
    drawable.indices = kQuadIndices;
    drawable.elementCount = 6;
    drawable.vertexCount = 4;
    drawable.positions = positions;
    drawable.texCoords = kTexCoords;
    drawable.positionsStatic = true;
    drawable.texCoordsStatic = true;
}

SoakScene::SoakScene(const int* size, vi::TexturesMap* textures, const std::string& photoName)
    : vi::Scene(size),
      mSerial(++gView.created),
      mInitialisedByCalls{false, false},
      mPictureKey(0),
      mShownPhoto(nullptr),
      mTextures(textures),
      mPhotoName(photoName),
      mIsSetUp(false),
      mTint(0),
      mKeys(0),
      mTouches(0),
      mAffordance(false),
      mUnlocked(false),
      mTileProgram(nullptr),
      mShapeProgram(nullptr),
      mPattern(nullptr),
      mChecker(nullptr),
      mTarget(nullptr),
      mBackground(nullptr),
      mPatternRenderer(nullptr),
      mTargetTileRenderer(nullptr),
      mPhotoRenderer(nullptr),
      mAlternateRenderer(nullptr),
      mPhoto(nullptr),
      mShapeRenderer(nullptr),
      mTintColour(kTints[0]),
      mAlternateTint(0.1f, 0.1f, 0.1f, 1.0f),
      mMix(0.0f) {
    mNames.push_back(photoName);
    mNames.push_back("soak");
    gLive = this;
}

SoakScene::~SoakScene() {
    Inside inside(-1);
    std::vector<vi::Animation*>& storage = vi::AnimationManager::mStorage;
    storage.erase(std::remove(storage.begin(), storage.end(), static_cast<vi::Animation*>(&mAnimation)),
                  storage.end());
    delete mAlternateRenderer;
    delete mPhotoRenderer;
    delete mTargetTileRenderer;
    delete mPatternRenderer;
    delete mShapeRenderer;
    delete mBackground;
    delete mTarget;
    delete mChecker;
    delete mPattern;
    delete mShapeProgram;
    delete mTileProgram;
    if (!gDestroyedSerials.insert(mSerial).second) ++gView.destroyedTwice;
    ++gView.destroyed;
    if (gLive == this) gLive = nullptr;
}

void SoakScene::setUp() {
    if (mIsSetUp) return;
    mIsSetUp = true;
    mTileProgram = new vi::ShaderProgram(kTileVertex, kTileFragment);
    mShapeProgram = new vi::ShaderProgram(kShapeVertex, kShapeFragment);

    // A dynamic texture: its pixels follow the state and are uploaded at each bind.
    mPatternPixels.assign(kPatternSide * kPatternSide, 0);
    mPattern = new vi::Texture(mPatternPixels.data(), kPatternSide, kPatternSide, false, true, false, false, false, 4,
                               false);
    refreshPattern();

    // A static texture that owns its malloc'ed pixels, as the host's do:
    // texture recycling may take them.
    unsigned int* checker = static_cast<unsigned int*>(std::malloc(kCheckerSide * kCheckerSide * 4));
    for (unsigned int y = 0; y < kCheckerSide; ++y)
        for (unsigned int x = 0; x < kCheckerSide; ++x)
            checker[y * kCheckerSide + x] = ((x ^ y) & 1) ? 0xFF604020u : 0xFF20A0C0u;
    mChecker = new vi::Texture(checker, kCheckerSide, kCheckerSide, true, true, false, false, false, 4, false);
    mChecker->setDeletable(true);
    mBackground = new vi::Background(*mChecker);

    // The shape is drawn into the target every time a tile samples it.
    for (int i = 0; i < 7; ++i) {
        const float shade = float(i) / 6.0f;
        mShapeColours[i * 3 + 0] = shade;
        mShapeColours[i * 3 + 1] = 1.0f - shade;
        mShapeColours[i * 3 + 2] = 0.5f;
    }
    placeShape();
    mShape.mode = GL_TRIANGLES;
    mShape.indices = kShapeIndices;
    mShape.elementCount = 18;
    mShape.vertexCount = 7;
    mShape.positions = mShapePositions;
    mShape.positionsStatic = false;
    mShapeRenderer = new vi::Renderer(*mShapeProgram, mShape);
    mShapeRenderer->addAttribute("aPosition", mShapePositions, 2, false);
    mShapeRenderer->addAttribute("aColour", mShapeColours, 3, true);
    mTargetRenderers.assign(1, mShapeRenderer);
    mTarget = new vi::RenderableTexture(mTargetRenderers, 0, 0, kTargetSide, kTargetSide, false, false, false, false,
                                        false);

    mPatternTile.place(-0.9f, -0.9f, -0.1f, -0.1f);
    mTargetTile.place(-0.9f, 0.1f, -0.1f, 0.9f);
    mPhotoTile.place(0.1f, 0.1f, 0.9f, 0.9f);
    mAlternateTile.place(0.1f, -0.9f, 0.9f, -0.1f);
    mPatternRenderer = makeTileRenderer(mPatternTile, mPattern, &mTintColour);
    mTargetTileRenderer = makeTileRenderer(mTargetTile, mTarget, &mTintColour);

    vi::AnimationManager::mStorage.push_back(&mAnimation);
}

// Only the alternate orientation's first set-up adds a tile: the registries
// then differ between scenes that saw it and scenes that did not.
void SoakScene::makeAlternate() {
    if (mAlternateRenderer) return;
    mAlternateRenderer = makeTileRenderer(mAlternateTile, mPattern, &mAlternateTint);
}

vi::Renderer* SoakScene::makeTileRenderer(Tile& tile, vi::Texture* texture, const glm::vec4* tint) {
    vi::Renderer* renderer = new vi::Renderer(*mTileProgram, tile.drawable);
    renderer->addAttribute("aPosition", tile.positions, 2, true);
    renderer->addAttribute("aTexCoord", kTexCoords, 2, true);
    renderer->addUniform("uTint", tint, vi::Uniform::Float4, 1);
    renderer->addUniform("uMix", &mMix, vi::Uniform::Float, 1);
    renderer->addTexture("uTexture", texture);
    return renderer;
}

void SoakScene::refreshPattern() {
    for (unsigned int y = 0; y < kPatternSide; ++y) {
        for (unsigned int x = 0; x < kPatternSide; ++x) {
            unsigned int r = (x * 16) & 0xFF;
            unsigned int g = (y * 16) & 0xFF;
            unsigned int b = mAffordance ? 0xE0 : 0x20;
            if (mUnlocked && ((x + y) & 2)) r = 0xFF - r;
            mPatternPixels[y * kPatternSide + x] = 0xFF000000u | (b << 16) | (g << 8) | r;
        }
    }
}

// A hexagon around the target's middle, turned by a step per touch.
void SoakScene::placeShape() {
    const float turn = float(mTouches % 3) * 0.7f;
    mShapePositions[0] = 0.0f;
    mShapePositions[1] = 0.0f;
    for (int i = 0; i < 6; ++i) {
        const float angle = turn + float(i) * 1.0471976f;
        mShapePositions[2 + i * 2] = 0.8f * std::cos(angle);
        mShapePositions[3 + i * 2] = 0.8f * std::sin(angle);
    }
}

unsigned int SoakScene::stateKey() const {
    return unsigned(mTint) | unsigned(mKeys % 2) << 2 | unsigned(mTouches % 3) << 3 | unsigned(mAffordance) << 5 |
           unsigned(mUnlocked) << 6 | unsigned(mOrientation != 0) << 7;
}

void SoakScene::initEffect() {
    Inside inside(SoakSceneInitEffect);
    setUp();
    mInitialisedByCalls[0] = true;
}

void SoakScene::initEffectAlternate() {
    Inside inside(SoakSceneInitEffectAlternate);
    setUp();
    makeAlternate();
    mInitialisedByCalls[1] = true;
}

int SoakScene::draw() {
    Inside inside(SoakSceneDraw);
    // The window's framebuffer and viewport, for the target's passes to restore.
    GLint frameBuffer = 0;
    GLint viewport[4] = {0, 0, 64, 64};
    glGetIntegerv(GL_FRAMEBUFFER_BINDING, &frameBuffer);
    glGetIntegerv(GL_VIEWPORT, viewport);
    vi::RenderableTexture::mCurrentFrameBuffer = GLuint(frameBuffer);
    vi::RenderableTexture::mCurrentFrameBufferPosition = glm::ivec2(viewport[0], viewport[1]);
    vi::RenderableTexture::mCurrentFrameBufferSize = glm::ivec2(viewport[2], viewport[3]);
    vi::Drawable::mProjectionMatrix = glm::mat4(1.0f);
    vi::Drawable::mViewMatrix = glm::mat4(1.0f);

    // The host's picture, looked up each frame: a newly filed texture gets a
    // renderer of its own; one replaced in place keeps it. Not while no
    // context is current: the new renderer's names would be looked up in none.
    vi::Texture* photo = nullptr;
    auto entry = mTextures->find(mPhotoName);
    if (entry != mTextures->end()) photo = entry->second;
    if (photo != mPhoto && eglGetCurrentContext() != EGL_NO_CONTEXT) {
        delete mPhotoRenderer;
        mPhotoRenderer = photo ? makeTileRenderer(mPhotoTile, photo, &mTintColour) : nullptr;
        mPhoto = photo;
    }

    // Mirrored in the alternate orientation.
    const glm::mat4 placement = mOrientation != 0 ? glm::mat4(glm::vec4(-1, 0, 0, 0), glm::vec4(0, 1, 0, 0),
                                                              glm::vec4(0, 0, 1, 0), glm::vec4(0, 0, 0, 1))
                                                  : glm::mat4(1.0f);
    mPatternTile.drawable.modelMatrix = placement;
    mTargetTile.drawable.modelMatrix = placement;
    mPhotoTile.drawable.modelMatrix = placement;
    mAlternateTile.drawable.modelMatrix = placement;

    glDisable(GL_BLEND);
    glDisable(GL_DEPTH_TEST);
    glDisable(GL_CULL_FACE);
    glClearColor(0.0f, 0.0f, mAffordance ? 0.5f : 0.0f, 1.0f);
    glClear(GL_COLOR_BUFFER_BIT);

    // A texture that lost its pixels to recycling may come back from a lost
    // context without them: what it would show is undefined, so it is not drawn.
    unsigned int key = stateKey();
    if (mChecker->mBuffer) {
        mBackground->renderFrame();
        key |= SoakSceneShowsChecker;
    }
    mPatternRenderer->render();
    mTargetTileRenderer->render();
    mShownPhoto = nullptr;
    if (mPhotoRenderer && mPhoto == photo && mPhoto->mBuffer) {
        mPhotoRenderer->render();
        mShownPhoto = mPhoto;
        key |= SoakSceneShowsPhoto;
    }
    if (mAlternateRenderer) {
        mAlternateRenderer->render();
        key |= SoakSceneShowsAlternate;
    }
    mPictureKey = key;
    gView.lastDrawResult = 1 + mKeys % 5;
    return gView.lastDrawResult;
}

void SoakScene::clearEffect() {
    Inside inside(SoakSceneClearEffect);
    mAffordance = false;
    mUnlocked = false;
    mTouches = 0;
    if (mIsSetUp) {
        refreshPattern();
        placeShape();
    }
}

void SoakScene::affordance() {
    Inside inside(SoakSceneAffordance);
    mAffordance = !mAffordance;
    if (mIsSetUp) refreshPattern();
}

void SoakScene::unlock() {
    Inside inside(SoakSceneUnlock);
    mUnlocked = true;
    if (mIsSetUp) refreshPattern();
}

void SoakScene::textureUpdated() { Inside inside(SoakSceneTextureUpdated); }

void SoakScene::touchDown(const glm::vec2&) {
    Inside inside(SoakSceneTouchDown);
    ++mTouches;
    if (mIsSetUp) placeShape();
}

void SoakScene::touchUp(const glm::vec2&) {
    Inside inside(SoakSceneTouchUp);
    ++mTouches;
    if (mIsSetUp) placeShape();
}

void SoakScene::touchMove(const glm::vec2&) {
    Inside inside(SoakSceneTouchMove);
    ++mTouches;
    if (mIsSetUp) placeShape();
}

void SoakScene::keyPressed(unsigned int) {
    Inside inside(SoakSceneKeyPressed);
    ++mKeys;
    mMix = float(mKeys % 2) * 0.5f;
}

void SoakScene::param(int a, int) {
    Inside inside(SoakSceneParam);
    mTint = ((a % 4) + 4) % 4;
    mTintColour = kTints[mTint];
}

std::vector<vi::Renderer*> SoakScene::ownedRenderers() const {
    std::vector<vi::Renderer*> renderers;
    if (mBackground) renderers.push_back(mBackground->getRenderer());
    for (vi::Renderer* renderer :
         {mShapeRenderer, mPatternRenderer, mTargetTileRenderer, mPhotoRenderer, mAlternateRenderer})
        if (renderer) renderers.push_back(renderer);
    return renderers;
}

std::vector<vi::Texture*> SoakScene::ownedTextures() const {
    std::vector<vi::Texture*> textures;
    for (vi::Texture* texture : {mPattern, mChecker, static_cast<vi::Texture*>(mTarget)})
        if (texture) textures.push_back(texture);
    return textures;
}

}  // namespace visoak

extern "C" {

SOAKSCENE_API vi::Scene* createScene(int* size, vi::ModelsMap*, vi::TexturesMap* textures) {
    visoak::Inside inside(-1);
    return new visoak::SoakScene(size, textures, visoak::gPhotoName);
}

void soakSceneSetPhotoName(const char* name) { visoak::gPhotoName = name; }

void soakSceneGetView(SoakSceneView* view) {
    *view = visoak::gView;
    visoak::SoakScene* live = visoak::gLive;
    view->initialisedByCalls[0] = live && live->mInitialisedByCalls[0];
    view->initialisedByCalls[1] = live && live->mInitialisedByCalls[1];
    view->pictureKey = live ? live->mPictureKey : 0;
    view->photo = live ? live->mShownPhoto : nullptr;
}

int soakSceneOwnedRenderers(void** renderers, int capacity) {
    if (!visoak::gLive) return 0;
    const std::vector<vi::Renderer*> owned = visoak::gLive->ownedRenderers();
    for (int i = 0; i < int(owned.size()) && i < capacity; ++i) renderers[i] = owned[std::size_t(i)];
    return int(owned.size());
}

int soakSceneOwnedTextures(void** textures, int capacity) {
    if (!visoak::gLive) return 0;
    const std::vector<vi::Texture*> owned = visoak::gLive->ownedTextures();
    for (int i = 0; i < int(owned.size()) && i < capacity; ++i) textures[i] = owned[std::size_t(i)];
    return int(owned.size());
}

void* soakSceneAnimation(void) { return visoak::gLive ? visoak::gLive->animation() : nullptr; }

}  // extern "C"
