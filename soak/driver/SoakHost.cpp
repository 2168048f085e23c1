#include "SoakHost.h"

#include <GLES2/gl2.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <set>

#include "Application/AnimationManager.h"
#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Application/Scene.h"
#include "GlContext.h"
#include "Natives.h"
#include "Render/BackgroundRenderer.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"
#include "SoakSceneApi.h"
#include "TestSceneRecord.h"

namespace visoak {

namespace {

const int kCanvas = 64;      // the pbuffer the host draws into
const int kTestDrawResult = 7;
const char* const kTestNames[] = {"one", "two", "three"};

// Roles of the image names the host uses.
enum NameRole { RolePhoto, RoleExtra, RoleGhost };

int clampSize(int value) { return value < 1 ? 1 : value; }

// The host's packed ARGB ints of an image: a pattern of its own per number.
std::vector<jint> hostPixels(int pattern, unsigned width, unsigned height) {
    std::vector<jint> pixels(std::size_t(width) * height);
    for (unsigned y = 0; y < height; ++y) {
        for (unsigned x = 0; x < width; ++x) {
            const unsigned alpha = pattern == 3 ? 0x80u : 0xFFu;
            const unsigned red = (x * 37u + unsigned(pattern) * 50u) & 0xFFu;
            const unsigned green = (y * 59u + unsigned(pattern) * 20u) & 0xFFu;
            const unsigned blue = (x * y + unsigned(pattern) * 90u) & 0xFFu;
            pixels[std::size_t(y) * width + x] = jint(alpha << 24 | red << 16 | green << 8 | blue);
        }
    }
    return pixels;
}

// Red and blue exchanged: what the host's array holds after the load, and,
// as bytes in memory, what the texture's buffer holds.
jint swapped(jint value) {
    const std::uint32_t v = std::uint32_t(value);
    return jint((v & 0xFF00FF00u) | ((v >> 16) & 0xFFu) | ((v & 0xFFu) << 16));
}

void imageSize(int choice, unsigned& width, unsigned& height) {
    static const unsigned kSizes[][2] = {{0, 7}, {5, 0}, {1, 1}, {2, 1}, {3, 2}, {4, 3}, {7, 5},
                                         {16, 16}, {33, 17}, {64, 64}, {128, 96}, {1080, 1920}};
    int index;
    if (choice < 2)
        index = choice;
    else if (choice < 12)
        index = 2 + (choice - 2) % 5;
    else if (choice < 30)
        index = 7 + (choice - 12) % 3;
    else if (choice < 39)
        index = 10;
    else
        index = 11;
    width = kSizes[index][0];
    height = kSizes[index][1];
}

std::string text(const char* format, ...) __attribute__((format(printf, 1, 2)));
std::string text(const char* format, ...) {
    char buffer[512];
    va_list arguments;
    va_start(arguments, format);
    std::vsnprintf(buffer, sizeof(buffer), format, arguments);
    va_end(arguments);
    return buffer;
}

std::uint64_t pictureHash(const std::vector<std::uint8_t>& pixels) {
    std::uint64_t hash = 0xCBF29CE484222325ull;
    for (std::uint8_t byte : pixels) hash = (hash ^ byte) * 0x100000001B3ull;
    return hash;
}

void writePpm(const std::string& path, const std::vector<std::uint8_t>& rgba) {
    FILE* file = std::fopen(path.c_str(), "wb");
    if (!file) return;
    std::fprintf(file, "P6\n%d %d\n255\n", kCanvas, kCanvas);
    // GL's rows run bottom up.
    for (int y = kCanvas - 1; y >= 0; --y)
        for (int x = 0; x < kCanvas; ++x) std::fwrite(&rgba[std::size_t(y * kCanvas + x) * 4], 1, 3, file);
    std::fclose(file);
}

}  // namespace

struct SoakHost::Step {
    Snapshot before;
    int expected[3][SceneEventCount];
    int expectedSoakDraws = 0;
    bool checkDeltas = true;
    int expectedUtfChars = 0;
    std::string fault;

    Step() { std::memset(expected, 0, sizeof(expected)); }
};

SoakHost::SoakHost(const PluginPaths& paths, const SoakAvoid& avoid)
    : mPaths(paths),
      mAvoid(avoid),
      mContext(new vitest::GlContext(kCanvas, kCanvas)),
      mContextState(ContextMain),
      mSequence(0),
      mPhotoGeneration(0),
      mExtraGeneration(0),
      mGhostGeneration(0),
      mTestInitialOrientation(0),
      mCallIndex(-1),
      mContextChangedSinceFrame(false),
      mObjectsStale(false) {
    testSceneReset();
}

SoakHost::~SoakHost() {
    vi::Application::handleStop();
    unloadAll();
    mJni.reset();
}

// --- The sequence's frame ----------------------------------------------------

void SoakHost::beginSequence(std::uint64_t seed, int index) {
    mSequence = index;
    mPhotoGeneration = mExtraGeneration = mGhostGeneration = 0;
    mImages.clear();
    // Pixels are kept within a sequence only; the hashes of every state stay.
    mPictures.clear();
    mContextChangedSinceFrame = false;
    mObjectsStale = false;

    // A fresh context, no scene, the soak scene's library loaded and its
    // factory in place: the same start for every sequence, whatever ran before.
    mContext->recreate();
    mContextState = ContextMain;
    soakSceneSetPhotoName(photoName().c_str());
    jobjectArray names = VI_SOAK_NATIVE(prehandleStart)(mJni.env(), mJni.thiz(), mJni.string(mPaths.soak), 540, 960);
    (void)names;
    VI_SOAK_NATIVE(prehandleStop)(mJni.env(), mJni.thiz());
    mJni.reset();
    vi::Application::handleWindowRectangle(0, 0, 540, 960);

    testSceneReset();
    const std::uint64_t choice = mixSeed(seed, 0x7E57ull + std::uint64_t(index));
    mTestInitialOrientation = int(choice & 1);
    testSceneSetInitialOrientation(mTestInitialOrientation);
    testSceneSetDrawResult(kTestDrawResult);
    testSceneSetClearColour(1, 0.25f, 0.5f, 0.75f, 1.0f);
    mTestNames.clear();
    if (choice & 2) {
        testSceneSetNames(kTestNames, 3);
        mTestNames.assign(kTestNames, kTestNames + 3);
    }

    mExpected = Expected();
    mExpected.factory = PluginSoak;
    mExpected.rememberedPath = mPaths.soak;
    mExpected.rememberedHandle = true;
}

bool SoakHost::endSequence(std::string& fault) {
    Call stopCall = {CallStop, 0, 0, 0, 0, 0};
    if (!run(stopCall, -1, fault)) return false;
    mContextState = ContextMain;
    mContext->makeCurrent();
    unloadAll();
    const Snapshot snapshot = takeSnapshot();
    for (Plugin plugin : {PluginSoak, PluginTest}) {
        const PluginCounts& counts = snapshot.plugins[plugin];
        if (counts.events[EventCreated] != counts.events[EventDestroyed] || counts.destroyedTwice) {
            fault = text("%s: %d scenes made, %d destroyed (%d twice) at the end of the sequence", pluginName(plugin),
                         counts.events[EventCreated], counts.events[EventDestroyed], counts.destroyedTwice);
            return false;
        }
    }
    if (!vi::Renderer::mAllRenderers.empty() || !vi::Texture::mAllTextures.empty()) {
        fault = text("with no scene and no host image, %zu renderers and %zu textures are still registered",
                     vi::Renderer::mAllRenderers.size(), vi::Texture::mAllTextures.size());
        return false;
    }
    return true;
}

void SoakHost::unloadAll() {
    if (mContextState == ContextNone) {
        mContext->makeCurrent();
        mContextState = ContextMain;
    }
    for (auto& entry : mImages) {
        if (!entry.second.live) continue;
        VI_SOAK_NATIVE(loadTexture)(mJni.env(), nullptr, mJni.string(entry.first), nullptr, 0, 0);
        entry.second.live = false;
    }
    mJni.reset();
}

// --- One call ------------------------------------------------------------------

bool SoakHost::run(const Call& call, int index, std::string& fault) {
    Step step;
    mCallIndex = index;
    mFaultOrigin = Picture();
    step.before = takeSnapshot();
    if (!runCall(call, step)) {
        ++mStats.skipped;
        mJni.reset();
        return true;
    }
    ++mStats.calls;
    if (step.fault.empty()) check(call, step);
    mJni.reset();
    fault = step.fault;
    return fault.empty();
}

void SoakHost::fail(Step& step, const std::string& what) {
    if (step.fault.empty()) step.fault = what;
}

void SoakHost::expectDelivered(Step& step, SceneEvent event, int count) {
    step.expected[mExpected.live][event] += count;
    if (event == EventDraw && mExpected.live == PluginSoak) step.expectedSoakDraws += count;
}

void SoakHost::destroyLive(Step& step) {
    if (!mExpected.exists) return;
    step.expected[mExpected.live][EventDestroyed] += 1;
    mExpected.exists = false;
    mExpected.live = PluginNone;
}

bool SoakHost::sceneReadyForGl() const { return mContextState != ContextNone; }

std::string SoakHost::photoName() const { return text("photo-%d-%d", mSequence, mPhotoGeneration); }

// False: the call is not one the host could make in this state; skipped.
bool SoakHost::runCall(const Call& call, Step& step) {
    JNIEnv* env = mJni.env();
    jobject thiz = mJni.thiz();
    const bool ready = mExpected.ready();
    switch (call.kind) {
        case CallStart:
            start(call, step);
            return step.fault != "skip";
        case CallInitEffect:
            if (mExpected.exists && !mExpected.initialised[mExpected.orientation != 0] &&
                mExpected.live == PluginSoak && !sceneReadyForGl())
                return false;  // the scene's set-up compiles shaders: the host has a context then
            if (mAvoid.initAfterContextChange && mObjectsStale && mExpected.exists &&
                !mExpected.initialised[mExpected.orientation != 0])
                return false;
            initEffect(step);
            return true;
        case CallRestart:
            if (mExpected.factory == PluginNone) return false;  // the runtime requires a valid factory
            if (mExpected.factory == PluginSoak && !sceneReadyForGl()) return false;
            restart(step);
            return true;
        case CallStop:
        case CallPause:
            stop(call.kind == CallPause, step);
            return true;
        case CallRecycleTextures:
            VI_SOAK_NATIVE(prehandleRecycleTextures)(env, thiz);
            for (vi::Texture* texture : vi::Texture::mAllTextures)
                if (texture->mIsStatic && texture->mBuffer)
                    fail(step, "after recycling, a static texture still has its client pixels");
            return true;
        case CallDraw:
            draw(step);
            return true;
        case CallTouch:
            if (ready && call.c == 0) expectDelivered(step, EventTouchDown);
            if (ready && call.c == 1) expectDelivered(step, EventTouchUp);
            if (ready && call.c == 2) expectDelivered(step, EventTouchMove);
            VI_SOAK_NATIVE(prehandleTouch)(env, thiz, call.a, call.b, call.c);
            return true;
        case CallMenu:
        case CallVolumeUp:
        case CallVolumeDown:
            if (ready) expectDelivered(step, EventKeyPressed);
            if (call.kind == CallMenu) VI_SOAK_NATIVE(prehandleMenuPressed)(env, thiz);
            if (call.kind == CallVolumeUp) VI_SOAK_NATIVE(prehandleVolumeUpPressed)(env, thiz);
            if (call.kind == CallVolumeDown) VI_SOAK_NATIVE(prehandleVolumeDownPressed)(env, thiz);
            return true;
        case CallParam:
            if (ready) expectDelivered(step, EventParam);
            VI_SOAK_NATIVE(prehandleParam)(env, thiz, call.a, call.b);
            return true;
        case CallClearEffect:
            if (ready) expectDelivered(step, EventClearEffect);
            VI_SOAK_NATIVE(prehandleClearEffect)(env, thiz);
            return true;
        case CallAffordance:
            if (ready) {
                expectDelivered(step, EventClearEffect);
                expectDelivered(step, EventAffordance);
            }
            VI_SOAK_NATIVE(prehandleAffordance)(env, thiz);
            return true;
        case CallUnlock:
            if (ready) expectDelivered(step, EventUnlock);
            VI_SOAK_NATIVE(prehandleUnlock)(env, thiz);
            return true;
        case CallSetOrientation:
            if (mExpected.exists) mExpected.orientation = call.a;
            VI_SOAK_NATIVE(prehandleSetOrientation)(env, thiz, call.a);
            return true;
        case CallLoadModel:
            VI_SOAK_NATIVE(loadModel)(env, thiz, mJni.string("gem"));
            return true;
        case CallLoadTexture:
            if (!sceneReadyForGl()) return false;  // the host loads on its render thread, with its context
            loadTexture(call, step);
            return step.fault != "skip";
        case CallKey:
            if (call.a == 84) {
                if (ready && !sceneReadyForGl()) return false;
                selfTest(call, step);
                return true;
            }
            if (ready) {
                if (call.a == 85)
                    expectDelivered(step, EventUnlock);
                else if (call.a == 65)
                    expectDelivered(step, EventAffordance);  // the key skips clearEffect, on purpose
                else
                    expectDelivered(step, EventKeyPressed);
            }
            vi::Application::handleKey(unsigned(call.a));
            return true;
        case CallWindow:
            vi::Application::handleWindowRectangle(call.a, call.b, call.c, call.d);
            mExpected.left = call.a;
            mExpected.top = call.b;
            mExpected.width = clampSize(call.c);
            mExpected.height = clampSize(call.d);
            return true;
        case CallContextSwitch:
        case CallContextLoss:
        case CallContextNone:
            changeContext(call.kind, step);
            return true;
        case CallKindCount:
            return false;
    }
    return false;
}

void SoakHost::start(const Call& call, Step& step) {
    Plugin plugin;
    std::string path;
    if (call.a < 14) {
        plugin = PluginSoak;
        path = mPaths.soak;
    } else if (call.a < 17) {
        plugin = PluginTest;
        path = mPaths.test;
    } else if (call.a < 18) {
        plugin = PluginNone;
        path = mPaths.noFactory;
    } else {
        plugin = PluginNone;
        path = mPaths.missing;
    }

    // What the library loading will do: skip the loading when this very path
    // is open already, else open it and look the factory up.
    Expected& e = mExpected;
    const bool reuse = !e.rememberedPath.empty() ? (path == e.rememberedPath && e.rememberedHandle) : e.rememberedHandle;
    if (reuse && e.factory == PluginNone) {
        // A second start of a library without a factory: the runtime would
        // start with a null factory, which a host must not ask for.
        step.fault = "skip";
        return;
    }
    destroyLive(step);
    bool succeeds = true;
    if (!reuse) {
        e.rememberedPath = path;
        e.rememberedHandle = path != mPaths.missing;
        if (!e.rememberedHandle) {
            succeeds = false;  // the factory stays what it was
        } else {
            e.factory = plugin;
            succeeds = plugin != PluginNone;
        }
    }
    std::vector<std::string> expectedNames;
    if (succeeds) {
        e.left = 0;
        e.top = 0;
        e.width = clampSize(call.b);
        e.height = clampSize(call.c);
        e.exists = true;
        e.live = e.factory;
        e.orientation = e.live == PluginTest ? mTestInitialOrientation : 0;
        e.initialised[0] = e.initialised[1] = false;
        step.expected[e.live][EventCreated] += 1;
        if (e.live == PluginSoak)
            expectedNames = {photoName(), "soak"};
        else
            expectedNames = mTestNames;
    } else {
        // The path's UTF chars are kept by the runtime on this path, on purpose.
        step.expectedUtfChars = 1;
    }

    jobjectArray names = VI_SOAK_NATIVE(prehandleStart)(mJni.env(), mJni.thiz(), mJni.string(path), call.b, call.c);
    if (!succeeds) {
        if (names) fail(step, "a start that could not load its plug-in returned names");
        return;
    }
    std::vector<std::string> actual;
    if (!names || !mJni.stringArrayValues(names, actual)) {
        fail(step, "a successful start returned no String[]");
        return;
    }
    if (actual != expectedNames) fail(step, "the String[] of a start differs from the scene's names");
}

void SoakHost::restart(Step& step) {
    destroyLive(step);
    Expected& e = mExpected;
    e.exists = true;
    e.live = e.factory;
    e.orientation = e.live == PluginTest ? mTestInitialOrientation : 0;
    e.initialised[0] = e.initialised[1] = false;
    step.expected[e.live][EventCreated] += 1;
    expectDelivered(step, e.orientation == 0 ? EventInitEffect : EventInitEffectAlternate);
    e.initialised[e.orientation != 0] = true;
    VI_SOAK_NATIVE(prehandleRestart)(mJni.env(), mJni.thiz());
}

void SoakHost::stop(bool pause, Step& step) {
    destroyLive(step);
    if (pause)
        VI_SOAK_NATIVE(prehandlePause)(mJni.env(), mJni.thiz());
    else
        VI_SOAK_NATIVE(prehandleStop)(mJni.env(), mJni.thiz());
}

void SoakHost::initEffect(Step& step) {
    Expected& e = mExpected;
    if (e.exists && !e.initialised[e.orientation != 0]) {
        expectDelivered(step, e.orientation == 0 ? EventInitEffect : EventInitEffectAlternate);
        e.initialised[e.orientation != 0] = true;
    }
    VI_SOAK_NATIVE(prehandleInitEffect)(mJni.env(), mJni.thiz());
}

void SoakHost::draw(Step& step) {
    const bool ready = mExpected.ready();
    if (ready) expectDelivered(step, EventDraw);
    const int result = VI_SOAK_NATIVE(prehandleDraw)(mJni.env(), mJni.thiz());
    if (!ready) {
        if (result != 0) fail(step, text("a frame without a ready scene returned %d, not 0", result));
        return;
    }
    int expected = kTestDrawResult;
    if (mExpected.live == PluginSoak) {
        SoakSceneView view;
        soakSceneGetView(&view);
        expected = view.lastDrawResult;
    }
    if (result != expected) fail(step, text("a ready frame returned %d, the scene's draw %d", result, expected));
    ++mStats.frames;
    if (mContextState != ContextNone) {
        mObjectsStale = false;
        checkPicture(step);
    }
}

void SoakHost::changeContext(CallKind kind, Step& step) {
    // The frame the next one is compared with: the same state, drawn before the change.
    if (mExpected.ready() && mContextState != ContextNone) draw(step);
    switch (kind) {
        case CallContextSwitch:
            if (mContextState == ContextMain) {
                mContext->makeSecondCurrent();
                mContextState = ContextSecond;
            } else {
                mContext->makeCurrent();
                mContextState = ContextMain;
            }
            ++mStats.switches;
            break;
        case CallContextLoss:
            mContext->recreate();
            mContextState = ContextMain;
            ++mStats.losses;
            break;
        case CallContextNone:
            vitest::GlContext::releaseCurrent();
            mContextState = ContextNone;
            ++mStats.noContext;
            break;
        default:
            break;
    }
    mContextChangedSinceFrame = true;
    mObjectsStale = true;
}

// Names: the scenes' picture ("photo"), images no scene uses ("extra"), and
// names first unloaded and then loaded ("ghost"). A name is never loaded
// again after it was unloaded while loaded: the next of its kind is used.
std::string SoakHost::nameFor(int choice, int& role) {
    if (choice < 5) {
        role = RolePhoto;
        return photoName();
    }
    if (choice < 8) {
        role = RoleExtra;
        return text("extra-%d-%d", mSequence, mExtraGeneration);
    }
    role = RoleGhost;
    return text("ghost-%d-%d", mSequence, mGhostGeneration);
}

void SoakHost::loadTexture(const Call& call, Step& step) {
    int role = RolePhoto;
    const std::string name = nameFor(call.a, role);
    HostImage& image = mImages[name];
    const bool unload = call.d != 0;
    std::map<std::string, vi::Texture*>& map = vi::ApplicationVar::msTexturesMap;

    if (unload) {
        if (image.live && role == RolePhoto && mExpected.exists) {
            // A scene shows it: the host unloads its picture only when no scene is left.
            step.fault = "skip";
            return;
        }
        if (!image.live && role == RoleExtra) {
            step.fault = "skip";
            return;
        }
        const bool wasLive = image.live;
        VI_SOAK_NATIVE(loadTexture)(mJni.env(), nullptr, mJni.string(name), nullptr, 0, 0);
        auto entry = map.find(name);
        if (entry == map.end()) {
            fail(step, "an unloaded name is no longer filed in the textures map");
            return;
        }
        if (wasLive) {
            image.live = false;
            if (entry->second != image.texture) fail(step, "an unloaded name's entry no longer holds its old pointer");
            // The name is done with; later images of its kind get a new one.
            if (role == RolePhoto) {
                ++mPhotoGeneration;
                soakSceneSetPhotoName(photoName().c_str());
            } else if (role == RoleExtra) {
                ++mExtraGeneration;
            } else {
                ++mGhostGeneration;
            }
        } else if (!image.texture) {
            image.nullEntry = true;
            if (entry->second != nullptr) fail(step, "unloading a name never loaded filed a non-null pointer");
        }
        return;
    }

    unsigned width = 0;
    unsigned height = 0;
    imageSize(call.c, width, height);
    const std::vector<jint> pixels = hostPixels(call.b, width, height);
    jintArray array = mJni.intArray(pixels);
    const bool replace = image.live;
    if (replace && mAvoid.replaceBeforeFirstUpload && image.texture->mId == 0) {
        step.fault = "skip";
        return;
    }
    if (replace && mExpected.exists) expectDelivered(step, EventTextureUpdated);
    const std::size_t registered = vi::Texture::mAllTextures.size();

    VI_SOAK_NATIVE(loadTexture)(mJni.env(), nullptr, mJni.string(name), array, jint(width), jint(height));

    auto entry = map.find(name);
    vi::Texture* texture = entry == map.end() ? nullptr : entry->second;
    if (!texture) {
        fail(step, "a loaded image is not filed under its name");
        return;
    }
    if (replace && texture != image.texture) fail(step, "a replaced image got a new texture object");
    if (!replace && vi::Texture::mAllTextures.size() != registered + 1)
        fail(step, "a new image did not add exactly one texture to the registry");
    if (texture->mWidth != width || texture->mHeight != height || !texture->mIsDeletable || !texture->mIsStatic)
        fail(step, "a loaded image's texture has the wrong size or flags");
    if (texture->mSize != glm::vec2(float(width), float(height)))
        fail(step, "a loaded image's texture has the wrong float size");

    const std::vector<jint> after = mJni.intArrayValues(array);
    std::vector<jint> converted(pixels.size());
    for (std::size_t i = 0; i < pixels.size(); ++i) converted[i] = swapped(pixels[i]);
    if (after != converted) fail(step, "the host's array was not left with red and blue exchanged");
    if (!converted.empty() &&
        (!texture->mBuffer || std::memcmp(texture->mBuffer, converted.data(), converted.size() * 4) != 0))
        fail(step, "a loaded image's texture does not hold the pixels as RGBA bytes");

    image.texture = texture;
    image.live = true;
    image.nullEntry = false;
    image.pattern = call.b;
    image.width = width;
    image.height = height;
}

void SoakHost::selfTest(const Call& call, Step& step) {
    ++mStats.selfTests;
    // The runtime draws its numbers from lrand48: seeded from the call, so a
    // replay of the call runs the same test.
    srand48(long(call.random & 0x7FFFFFFF));
    vi::Application::handleKey(84);
    step.checkDeltas = false;
    // What the test left: a scene of the same factory, in whatever
    // orientation and window it ended with.
    Expected& e = mExpected;
    if (e.exists) {
        e.exists = vi::gpScene != nullptr;
        if (vi::gpScene) {
            e.orientation = vi::gpScene->mOrientation;
            e.initialised[0] = vi::gpScene->mInitialised[0];
            e.initialised[1] = vi::gpScene->mInitialised[1];
        }
    }
    e.left = vi::ApplicationVar::msWindowLeft;
    e.top = vi::ApplicationVar::msWindowTop;
    e.width = vi::ApplicationVar::msWindowWidth;
    e.height = vi::ApplicationVar::msWindowHeight;
    if (e.width < 1 || e.height < 1) fail(step, "the self-test left a window narrower than 1 pixel");
}

// --- Checks ----------------------------------------------------------------------

bool SoakHost::check(const Call& call, Step& step) {
    const Snapshot after = takeSnapshot();
    for (Plugin plugin : {PluginSoak, PluginTest}) {
        const PluginCounts& now = after.plugins[plugin];
        const PluginCounts& then = step.before.plugins[plugin];
        if (now.overlaps != then.overlaps)
            fail(step, text("%s: a call began while another call into a scene was running", pluginName(plugin)));
        if (now.destroyedTwice) fail(step, text("%s: a scene was destroyed twice", pluginName(plugin)));
        const int live = now.events[EventCreated] - now.events[EventDestroyed];
        const int expectedLive = mExpected.exists && mExpected.live == plugin ? 1 : 0;
        if (live != expectedLive)
            fail(step, text("%s: %d live scenes, expected %d", pluginName(plugin), live, expectedLive));
        if (!step.checkDeltas) continue;
        for (int event = 0; event < SceneEventCount; ++event) {
            const int got = now.events[event] - then.events[event];
            if (got != step.expected[plugin][event])
                fail(step, text("%s received %d %s calls, expected %d", pluginName(plugin), got,
                                eventName(SceneEvent(event)), step.expected[plugin][event]));
        }
        if (plugin == PluginSoak && now.animationUpdates - then.animationUpdates != step.expectedSoakDraws)
            fail(step, text("the soak scene's animation was updated %d times in %d ready frames",
                            now.animationUpdates - then.animationUpdates, step.expectedSoakDraws));
    }
    checkScene(step);
    if (call.kind == CallSetOrientation && vi::gpScene && step.fault.empty()) {
        const vi::Scene& scene = *vi::gpScene;
        const float aspect = scene.mSize.x / scene.mSize.y;
        const glm::vec2 scale = aspect < 1.0f ? glm::vec2(1.0f, scene.mSize.y / scene.mSize.x) : glm::vec2(aspect, 1.0f);
        // Computed only when the orientation changes; the scene's constructor
        // computes the same values from the same size.
        if (scene.mAspect != aspect || scene.mScale != scale)
            fail(step, "after an orientation change the scene's aspect or scale is not its size's");
    }
    checkRegistries(step);
    checkHostImages(step);
    checkJni(step, step.expectedUtfChars);
    return step.fault.empty();
}

void SoakHost::checkScene(Step& step) {
    const Expected& e = mExpected;
    if ((vi::gpScene != nullptr) != e.exists) {
        fail(step, e.exists ? "no scene, where one should exist" : "a scene exists, where none should");
        return;
    }
    if (vi::Application::isReady() != e.ready())
        fail(step, e.ready() ? "the scene is not ready, where it should be" : "the scene is ready, where it should not be");
    if (vi::gpScene) {
        const vi::Scene& scene = *vi::gpScene;
        if (int(scene.mOrientation) != e.orientation) fail(step, "the scene's orientation is not the last one set");
        if (scene.mInitialised[0] != e.initialised[0] || scene.mInitialised[1] != e.initialised[1])
            fail(step, "the scene's initialisation flags differ from the initialisations made");
        if (e.live == PluginSoak) {
            SoakSceneView view;
            soakSceneGetView(&view);
            if (bool(view.initialisedByCalls[0]) != scene.mInitialised[0] ||
                bool(view.initialisedByCalls[1]) != scene.mInitialised[1])
                fail(step, "the runtime's ready state disagrees with the initialisations the scene received");
        }
    }
    if (vi::ApplicationVar::msWindowLeft != e.left || vi::ApplicationVar::msWindowTop != e.top ||
        vi::ApplicationVar::msWindowWidth != e.width || vi::ApplicationVar::msWindowHeight != e.height)
        fail(step, text("the window is %d,%d %dx%d, expected %d,%d %dx%d", vi::ApplicationVar::msWindowLeft,
                        vi::ApplicationVar::msWindowTop, vi::ApplicationVar::msWindowWidth,
                        vi::ApplicationVar::msWindowHeight, e.left, e.top, e.width, e.height));
}

void SoakHost::checkRegistries(Step& step) {
    void* owned[64];
    const bool soakLive = mExpected.exists && mExpected.live == PluginSoak;

    std::vector<void*> expectedRenderers;
    if (soakLive) {
        const int count = soakSceneOwnedRenderers(owned, 64);
        expectedRenderers.assign(owned, owned + std::min(count, 64));
    }
    std::vector<void*> renderers(vi::Renderer::mAllRenderers.begin(), vi::Renderer::mAllRenderers.end());
    std::sort(expectedRenderers.begin(), expectedRenderers.end());
    std::sort(renderers.begin(), renderers.end());
    if (renderers != expectedRenderers)
        fail(step, text("the renderer registry holds %zu renderers, the live scene owns %zu", renderers.size(),
                        expectedRenderers.size()));

    std::vector<void*> expectedTextures;
    if (soakLive) {
        const int count = soakSceneOwnedTextures(owned, 64);
        expectedTextures.assign(owned, owned + std::min(count, 64));
    }
    for (const auto& entry : mImages)
        if (entry.second.live) expectedTextures.push_back(entry.second.texture);
    std::vector<void*> textures(vi::Texture::mAllTextures.begin(), vi::Texture::mAllTextures.end());
    std::sort(expectedTextures.begin(), expectedTextures.end());
    std::sort(textures.begin(), textures.end());
    if (textures != expectedTextures)
        fail(step, text("the texture registry holds %zu textures, the live scene and the host own %zu",
                        textures.size(), expectedTextures.size()));

    // The scene's animation is in the storage while its scene lives, and only then.
    void* animation = soakLive ? soakSceneAnimation() : nullptr;
    const std::vector<vi::Animation*>& storage = vi::AnimationManager::mStorage;
    if (storage.size() != (animation ? 1u : 0u) || (animation && storage[0] != animation))
        fail(step, text("the animation storage holds %zu animations, the live scene has %d", storage.size(),
                        animation ? 1 : 0));

    // The background's built-in program lives exactly while a background does.
    const unsigned backgrounds = animation ? 1u : 0u;  // a set-up soak scene has one background
    if (vi::BackgroundRenderer::msUseCount != backgrounds ||
        (vi::BackgroundRenderer::msShaderProgram != nullptr) != (backgrounds != 0))
        fail(step, text("the background program's use count is %u with %u backgrounds",
                        vi::BackgroundRenderer::msUseCount, backgrounds));
}

void SoakHost::checkHostImages(Step& step) {
    const std::map<std::string, vi::Texture*>& map = vi::ApplicationVar::msTexturesMap;
    for (const auto& entry : mImages) {
        const HostImage& image = entry.second;
        auto filed = map.find(entry.first);
        if (image.live) {
            if (filed == map.end() || filed->second != image.texture) {
                fail(step, "a loaded image is no longer filed under its name");
                continue;
            }
            if (image.texture->mWidth != image.width || image.texture->mHeight != image.height)
                fail(step, "a loaded image's texture changed its size");
        } else if (image.texture) {
            if (filed == map.end() || filed->second != image.texture)
                fail(step, "an unloaded name's entry lost its stale pointer");
        } else if (image.nullEntry) {
            if (filed == map.end() || filed->second != nullptr)
                fail(step, "a name unloaded before any load is not filed with a null pointer");
        }
    }
}

void SoakHost::checkJni(Step& step, int expectedUtfChars) {
    if (!mJni.misuses().empty()) fail(step, "JNI misuse: " + mJni.misuses().front());
    mJni.clearMisuses();
    if (mJni.outstandingElements() != 0) fail(step, "int array elements were not released");
    if (mJni.outstandingUtfChars() != expectedUtfChars)
        fail(step, text("%d UTF chars outstanding after the call, expected %d", mJni.outstandingUtfChars(),
                        expectedUtfChars));
    // Kept by the runtime on a failed start, by design; freed here so that
    // the leak checker at the end reports only what it should.
    mJni.dropOutstandingUtfChars();
}

void SoakHost::checkPicture(Step& step) {
    std::string key;
    if (mExpected.live == PluginTest) {
        key = "test";
    } else {
        SoakSceneView view;
        soakSceneGetView(&view);
        key = text("soak %x", view.pictureKey);
        if (view.pictureKey & SoakSceneShowsPhoto) {
            const HostImage* shown = nullptr;
            for (const auto& entry : mImages)
                if (entry.second.live && entry.second.texture == view.photo) shown = &entry.second;
            if (!shown) {
                fail(step, "the scene shows a texture the host has not loaded");
                return;
            }
            key += text(" photo %d %ux%u", shown->pattern, shown->width, shown->height);
        }
    }
    const std::vector<std::uint8_t> pixels = vitest::readPixels(0, 0, kCanvas, kCanvas);
    const std::uint64_t hash = pictureHash(pixels);
    const bool afterChange = mContextChangedSinceFrame;
    mContextChangedSinceFrame = false;
    auto known = mPictureHashes.find(key);
    if (known == mPictureHashes.end()) {
        Picture first;
        first.hash = hash;
        first.sequence = mSequence;
        first.call = mCallIndex;
        mPictureHashes.emplace(key, first);
        mPictures.emplace(key, pixels);
        return;
    }
    ++mStats.compared;
    if (known->second.hash == hash) {
        mPictures.emplace(key, pixels);
        return;
    }
    const std::string stem = text("/tmp/soak-%d-picture", int(getpid()));
    writePpm(stem + "-actual.ppm", pixels);
    std::string detail = text("(%s-actual.ppm)", stem.c_str());
    auto earlier = mPictures.find(key);
    if (earlier != mPictures.end()) {
        int differing = 0;
        for (std::size_t i = 0; i < pixels.size(); i += 4)
            if (std::memcmp(&pixels[i], &earlier->second[i], 4) != 0) ++differing;
        writePpm(stem + "-expected.ppm", earlier->second);
        detail = text("in %d of %d pixels (%s-expected.ppm, %s-actual.ppm)", differing, kCanvas * kCanvas,
                      stem.c_str(), stem.c_str());
    }
    mFaultOrigin = known->second;
    fail(step, text("%s frame of state [%s] differs from the frame of the same state drawn in sequence %d at call "
                    "%d %s",
                    afterChange ? "the first" : "a", key.c_str(), known->second.sequence, known->second.call,
                    detail.c_str()));
    if (afterChange) step.fault = "after a context change, " + step.fault;
}

}  // namespace visoak
