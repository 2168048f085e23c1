#include "Player.h"

#include <algorithm>

#include "Application/Application.h"
#include "TestSceneRecord.h"

namespace visoak {

namespace {

const int kCanvas = 64;     // the pbuffer the host draws into
const int kDrawResult = 7;  // what the test scene's frames return: a frame was drawn
const int kSizes[][2] = {{0, 7}, {5, 0}, {1, 1}, {3, 2}, {7, 5}, {16, 16}, {33, 17}, {64, 64}, {128, 96}, {1080, 1920}};

std::vector<jint> hostPixels(int pattern, int width, int height) {
    std::vector<jint> pixels(std::size_t(width) * std::size_t(height));
    for (std::size_t i = 0; i < pixels.size(); ++i)
        pixels[i] = jint((pattern == 3 ? 0x80000000u : 0xFF000000u) | (unsigned(i) * 2654435761u + unsigned(pattern)) >> 8);
    return pixels;
}

}  // namespace

Player::Player()
    : mGl(kCanvas, kCanvas), mContext(ContextMain), mStarted(false), mSceneMayLive(false), mGeneration{0, 0},
      mEqualFrames(0) {
    testSceneReset();
    testSceneSetDrawResult(kDrawResult);
    testSceneSetClearColour(1, 0.25f, 0.5f, 0.75f, 1.0f);
    testSceneSetPicture(1);
    nameScenePicture();
}

// As a host leaves: the scene stopped, its images unloaded with a context current.
Player::~Player() {
    if (mContext == ContextNone) mGl.makeCurrent();
    VI_NATIVE(prehandleStop)(mJni.env(), mJni.thiz());
    for (const std::string& image : mLoaded) VI_NATIVE(loadTexture)(mJni.env(), nullptr, mJni.string(image), nullptr, 0, 0);
}

std::string Player::imageName(int kind) const {
    return (kind == 0 ? "picture-" : "image-") + std::to_string(mGeneration[kind]);
}

// The scene shows the image filed under its first name.
void Player::nameScenePicture() {
    const std::string picture = imageName(0);
    const char* names[] = {picture.c_str(), "other"};
    testSceneSetNames(names, 2);
}

Player::Outcome Player::play(const Call& call, std::string& fault) {
    JNIEnv* env = mJni.env();
    jobject thiz = mJni.thiz();
    // Only the frame right after a context change is compared with the one before it.
    const std::vector<std::uint8_t> beforeChange = std::move(mBeforeChange);
    mBeforeChange.clear();
    Outcome outcome = Played;
    switch (call.kind) {
        case CallStart: outcome = start(call) ? Played : Skipped; break;
        case CallInitEffect: VI_NATIVE(prehandleInitEffect)(env, thiz); break;
        case CallRestart:
            if (!mStarted) return Skipped;
            VI_NATIVE(prehandleRestart)(env, thiz);
            mSceneMayLive = true;
            break;
        case CallStop:
        case CallPause:
            (call.kind == CallStop ? VI_NATIVE(prehandleStop) : VI_NATIVE(prehandlePause))(env, thiz);
            mSceneMayLive = false;
            break;
        case CallRecycleTextures: VI_NATIVE(prehandleRecycleTextures)(env, thiz); break;
        case CallDraw: outcome = compare(beforeChange, frame(), fault); break;
        case CallTouch: VI_NATIVE(prehandleTouch)(env, thiz, call.a, call.b, call.c); break;
        case CallMenu: VI_NATIVE(prehandleMenuPressed)(env, thiz); break;
        case CallVolumeUp: VI_NATIVE(prehandleVolumeUpPressed)(env, thiz); break;
        case CallVolumeDown: VI_NATIVE(prehandleVolumeDownPressed)(env, thiz); break;
        case CallKey: vi::Application::handleKey(unsigned(call.a)); break;
        case CallParam: VI_NATIVE(prehandleParam)(env, thiz, call.a, call.b); break;
        case CallClearEffect: VI_NATIVE(prehandleClearEffect)(env, thiz); break;
        case CallAffordance: VI_NATIVE(prehandleAffordance)(env, thiz); break;
        case CallUnlock: VI_NATIVE(prehandleUnlock)(env, thiz); break;
        case CallSetOrientation: VI_NATIVE(prehandleSetOrientation)(env, thiz, call.a); break;
        case CallLoadModel: VI_NATIVE(loadModel)(env, thiz, mJni.string("model")); break;
        case CallLoadTexture: outcome = loadTexture(call) ? Played : Skipped; break;
        case CallWindow: vi::Application::handleWindowRectangle(call.a, call.b, call.c, call.d); break;
        case CallContextSwitch:
        case CallContextLoss:
        case CallContextNone:
            mBeforeChange = frame();
            outcome = compare(beforeChange, mBeforeChange, fault);
            if (call.kind == CallContextNone) {
                vitest::GlContext::releaseCurrent();
                mContext = ContextNone;
            } else if (call.kind == CallContextSwitch && mContext == ContextMain) {
                mGl.makeSecondCurrent();
                mContext = ContextSecond;
            } else {
                call.kind == CallContextLoss ? mGl.recreate() : mGl.makeCurrent();
                mContext = ContextMain;
            }
            break;
        case CallKindCount: return Skipped;
    }
    if (!mJni.misuses().empty()) {
        fault = "JNI misuse: " + mJni.misuses().front();
        outcome = JniMisuse;
    }
    mJni.reset();
    return outcome;
}

bool Player::start(const Call& call) {
    const std::string library = call.a < 15 ? VI_SOAK_TEST_PLUGIN
                                : call.a < 17 ? VI_SOAK_NOFACTORY_PLUGIN
                                              : "/nonexistent/libmissing-effect.so";
    if (mBroken.count(library)) return false;
    mStarted = VI_NATIVE(prehandleStart)(mJni.env(), mJni.thiz(), mJni.string(library), call.b, call.c) != nullptr;
    mSceneMayLive = mStarted;
    if (!mStarted) mBroken.insert(library);
    return true;
}

bool Player::loadTexture(const Call& call) {
    const int kind = call.a < 6 ? 0 : 1;  // the scene's picture, or another image
    const std::string image = imageName(kind);
    if (mContext == ContextNone || (call.d == 0 && kind == 0 && mSceneMayLive)) return false;
    if (call.d == 0) {
        VI_NATIVE(loadTexture)(mJni.env(), nullptr, mJni.string(image), nullptr, 0, 0);
        // The entry keeps the deleted texture's pointer: the name is done with.
        if (mLoaded.erase(image)) ++mGeneration[kind];
        nameScenePicture();
        return true;
    }
    const int* size = kSizes[call.c < 39 ? call.c % 9 : 9];
    VI_NATIVE(loadTexture)(mJni.env(), nullptr, mJni.string(image), mJni.intArray(hostPixels(call.b, size[0], size[1])),
                           size[0], size[1]);
    mLoaded.insert(image);
    return true;
}

// A frame of a ready scene with a context current, read back; empty when the
// scene drew nothing or nothing can be read.
std::vector<std::uint8_t> Player::frame() {
    const bool drawn = VI_NATIVE(prehandleDraw)(mJni.env(), mJni.thiz()) == kDrawResult;
    if (!drawn || mContext == ContextNone) return {};
    return vitest::readPixels(0, 0, kCanvas, kCanvas);
}

Player::Outcome Player::compare(const std::vector<std::uint8_t>& before, const std::vector<std::uint8_t>& after,
                                std::string& fault) {
    if (before.empty() || after.empty()) return Played;
    int differing = 0;
    for (std::size_t i = 0; i < after.size(); i += 4) differing += std::equal(&after[i], &after[i] + 4, &before[i]) ? 0 : 1;
    mEqualFrames += differing == 0;
    if (differing) fault = "the first frame after a context change differs from the frame before it in " +
                           std::to_string(differing) + " of " + std::to_string(kCanvas * kCanvas) + " pixels";
    return differing ? FrameDiffers : Played;
}

}  // namespace visoak
