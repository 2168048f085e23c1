#include "Player.h"

#include "Application/Application.h"
#include "TestSceneRecord.h"

namespace visoak {

namespace {

const int kCanvas = 64;      // the pbuffer the host draws into
const int kDrawResult = 7;   // what the test scene's frames return: a frame was drawn
const char* const kMissingLibrary = "/nonexistent/libmissing-effect.so";

std::vector<jint> hostPixels(int pattern, int width, int height) {
    std::vector<jint> pixels(std::size_t(width) * std::size_t(height));
    for (std::size_t i = 0; i < pixels.size(); ++i)
        pixels[i] = jint((pattern == 3 ? 0x80000000u : 0xFF000000u) | ((unsigned(i) * 2654435761u + unsigned(pattern)) >> 8));
    return pixels;
}

}  // namespace

Player::Player() : mGl(kCanvas, kCanvas), mContext(ContextMain), mStarted(false), mSceneMayLive(false), mGeneration{0, 0}, mEqualFrames(0) {
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
    for (const std::string& loaded : mLoaded)
        VI_NATIVE(loadTexture)(mJni.env(), nullptr, mJni.string(loaded), nullptr, 0, 0);
}

std::string Player::name(int kind) const {
    return (kind == 0 ? "picture-" : "image-") + std::to_string(mGeneration[kind]);
}

// The scene shows the image filed under its first name.
void Player::nameScenePicture() {
    const std::string picture = name(0);
    const char* names[] = {picture.c_str(), "other"};
    testSceneSetNames(names, 2);
}

Player::Outcome Player::play(const Call& call, std::string& fault) {
    JNIEnv* env = mJni.env();
    jobject thiz = mJni.thiz();
    // Only a frame right after a context change is compared with the one before it.
    const std::vector<std::uint8_t> beforeChange = std::move(mBeforeChange);
    mBeforeChange.clear();
    Outcome outcome = Played;
    switch (call.kind) {
        case CallStart: start(call, outcome); break;
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
        case CallLoadTexture: loadTexture(call, outcome); break;
        case CallWindow: vi::Application::handleWindowRectangle(call.a, call.b, call.c, call.d); break;
        case CallContextSwitch:
        case CallContextLoss:
        case CallContextNone: {
            std::vector<std::uint8_t> before = frame();
            outcome = compare(beforeChange, before, fault);
            if (call.kind == CallContextNone) {
                vitest::GlContext::releaseCurrent();
                mContext = ContextNone;
            } else if (call.kind == CallContextLoss) {
                mGl.recreate();
                mContext = ContextMain;
            } else if (mContext == ContextSecond) {
                mGl.makeCurrent();
                mContext = ContextMain;
            } else {
                mGl.makeSecondCurrent();
                mContext = ContextSecond;
            }
            mBeforeChange = std::move(before);
            break;
        }
        case CallKindCount: return Skipped;
    }
    if (!mJni.misuses().empty()) {
        fault = "JNI misuse: " + mJni.misuses().front();
        outcome = JniMisuse;
    }
    mJni.reset();
    return outcome;
}

void Player::start(const Call& call, Outcome& outcome) {
    const std::string library = call.a < 15 ? VI_SOAK_TEST_PLUGIN : call.a < 17 ? VI_SOAK_NOFACTORY_PLUGIN : kMissingLibrary;
    if (mBroken.count(library)) {
        outcome = Skipped;
        return;
    }
    mStarted = VI_NATIVE(prehandleStart)(mJni.env(), mJni.thiz(), mJni.string(library), call.b, call.c) != nullptr;
    mSceneMayLive = mStarted;
    if (!mStarted) mBroken.insert(library);
}

void Player::loadTexture(const Call& call, Outcome& outcome) {
    const int kind = call.a < 6 ? 0 : 1;
    const bool unload = call.d != 0;
    // The host loads on its render thread, with its context; it unloads the
    // scene's picture only once no scene can show it.
    if (mContext == ContextNone || (unload && kind == 0 && mSceneMayLive)) {
        outcome = Skipped;
        return;
    }
    const std::string image = name(kind);
    if (unload) {
        VI_NATIVE(loadTexture)(mJni.env(), nullptr, mJni.string(image), nullptr, 0, 0);
        // The entry keeps the deleted texture's pointer: the name is done with.
        if (mLoaded.erase(image)) ++mGeneration[kind];
        if (kind == 0) nameScenePicture();
        return;
    }
    static const int kSizes[][2] = {{0, 7}, {5, 0}, {1, 1}, {3, 2}, {7, 5}, {16, 16}, {33, 17}, {64, 64}, {128, 96}};
    const int* size = call.c == 39 ? nullptr : kSizes[call.c % 9];
    const int width = size ? size[0] : 1080;
    const int height = size ? size[1] : 1920;
    VI_NATIVE(loadTexture)(mJni.env(), nullptr, mJni.string(image), mJni.intArray(hostPixels(call.b, width, height)),
                           width, height);
    mLoaded.insert(image);
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
    mEqualFrames += before == after;
    if (before == after) return Played;
    int differing = 0;
    for (std::size_t i = 0; i < after.size(); i += 4)
        differing += before[i] != after[i] || before[i + 1] != after[i + 1] || before[i + 2] != after[i + 2] ||
                     before[i + 3] != after[i + 3];
    fault = "the first frame after a context change differs from the frame before it in " +
            std::to_string(differing) + " of " + std::to_string(kCanvas * kCanvas) + " pixels";
    return FrameDiffers;
}

}  // namespace visoak
