// The host's texture loading seen from the JNI stand-in: which JNI
// functions it calls and in what order relative to the context check and the
// GL upload, that the application lock is never held, and what the replace
// path does in what order; unloading. Freed buffers are logged with the GL calls (the
// test binary wraps free).
#include <gtest/gtest.h>
#include <jni.h>

#include <pthread.h>

#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "Application/ApplicationVar.h"
#include "Application/ContextRecovery.h"
#include "FakeJni.h"
#include "GlContext.h"
#include "GlRecorder.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"

extern "C" void __real_free(void* p);
extern "C" void __wrap_free(void* p) {
    if (p) vitest::GlRecorder::record("free", {double(reinterpret_cast<std::uintptr_t>(p))});
    __real_free(p);
}

using vitest::GlCall;
using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;

namespace {

double address(const void* p) { return double(reinterpret_cast<std::uintptr_t>(p)); }

// Logged with the GL calls; every JNI call also checks that the lock is free.
bool gLockWasHeld = false;
void logJni(const char* function) {
    if (pthread_mutex_trylock(&vi::ApplicationVar::msCriticalSection) == 0)
        pthread_mutex_unlock(&vi::ApplicationVar::msCriticalSection);
    else
        gLockWasHeld = true;
    GlRecorder::record(function, {});
}

class CountingScene : public vi::Scene {
public:
    void textureUpdated() override { GlRecorder::record("textureUpdated", {}); }
};

class HostLoading : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE(vi::Renderer::mAllRenderers.empty()) << "a previous test left renderers";
        ASSERT_TRUE(vi::Texture::mAllTextures.empty()) << "a previous test left textures";
        context.reset(new GlContext(16, 16));
        vi::ContextRecovery::invalidate();
        gLockWasHeld = false;
        vi::gpScene = &scene;
        jni.setObserver(logJni);
    }

    void TearDown() override {
        EXPECT_TRUE(jni.misuses().empty());
        EXPECT_EQ(0, jni.outstandingUtfChars() + jni.outstandingElements()) << "JNI copies not released";
        vi::gpScene = nullptr;
        for (const std::string& name : loaded) {
            delete vi::ApplicationVar::msTexturesMap[name];
            vi::ApplicationVar::msTexturesMap.erase(name);
        }
        context.reset();
    }

    vi::Texture* filed(const std::string& name) {
        loaded.push_back(name);
        return vi::ApplicationVar::msTexturesMap[name];
    }

    // The host's call: a name and its pixels (none: an unload).
    void load(const char* name, const std::vector<jint>* pixels, int width, int height) {
        VI_NATIVE(loadTexture)(jni.env(), nullptr, jni.string(name), pixels ? jni.intArray(*pixels) : nullptr,
                               width, height);
        jni.reset();
    }

    std::unique_ptr<GlContext> context;
    vitest::FakeJni jni;
    CountingScene scene;
    std::vector<std::string> loaded;
};

TEST_F(HostLoading, ReplaceFreesThenUploadsAtTheNewSizeThenTellsTheSceneWithoutTheLock) {
    std::vector<jint> small = {1, 2};
    load("replaced", &small, 2, 1);
    vi::Texture* texture = filed("replaced");
    texture->allocate();  // as the scene would, before binding it
    void* const firstBuffer = texture->mBuffer;
    const GLuint id = texture->mId;

    std::vector<jint> large(6, jint(0xFF102030u));
    GlRecording recording;
    load("replaced", &large, 3, 2);
    EXPECT_EQ(texture, vi::ApplicationVar::msTexturesMap["replaced"]);
    EXPECT_EQ((std::vector<std::string>{"eglGetCurrentContext", "GetStringUTFChars", "GetIntArrayElements", "free",
                                        "glBindTexture", "glTexImage2D", "textureUpdated",
                                        "ReleaseIntArrayElements", "ReleaseStringUTFChars"}),
              GlRecorder::names({"eglGetCurrentContext", "GetStringUTFChars", "GetIntArrayElements",
                                "ReleaseIntArrayElements", "ReleaseStringUTFChars", "glGenTextures",
                                "glBindTexture", "glTexImage2D", "free", "textureUpdated"}));
    EXPECT_EQ(address(firstBuffer), GlRecorder::callsNamed("free")[0].args[0]);
    EXPECT_EQ(double(id), GlRecorder::callsNamed("glBindTexture")[0].args[1]);
    const std::vector<double> upload = GlRecorder::callsNamed("glTexImage2D")[0].args;
    EXPECT_EQ((std::vector<double>{3, 2}), std::vector<double>(upload.begin() + 3, upload.begin() + 5));
    EXPECT_EQ(address(texture->mBuffer), upload[8]);
    EXPECT_FALSE(gLockWasHeld);
    EXPECT_EQ(glm::vec2(1.0f / 3.0f, 0.5f), texture->mTexelSize);
}

// A host may replace an image before anything allocated it (a second load
// before the first frame). The upload then has no texture of its own, so the
// first allocation must still define the storage in full and show the new pixels.
TEST_F(HostLoading, ReplaceBeforeTheFirstAllocationStillShowsTheNewPixelsOnceAllocated) {
    std::vector<jint> first = {jint(0xFF0000FFu)};
    load("early", &first, 1, 1);
    std::vector<jint> second(4, jint(0xFF00FF00u));
    load("early", &second, 2, 2);
    vi::Texture* texture = filed("early");
    ASSERT_EQ(0u, texture->mId);

    GlRecording recording;
    texture->allocate();
    ASSERT_EQ(1u, GlRecorder::callsNamed("glTexImage2D").size());
    EXPECT_TRUE(GlRecorder::callsNamed("glTexSubImage2D").empty());

    EXPECT_EQ(2, GlRecorder::callsNamed("glTexImage2D")[0].args[3]);
}

// Unloading a name never loaded files a null entry that a later load fills;
// unloading a loaded one deletes the texture and leaves the stale pointer filed.
TEST_F(HostLoading, UnloadFilesANullEntryOrKeepsTheStalePointer) {
    load("later", nullptr, 4, 4);
    ASSERT_EQ(1u, vi::ApplicationVar::msTexturesMap.count("later"));
    EXPECT_EQ(nullptr, vi::ApplicationVar::msTexturesMap["later"]);
    std::vector<jint> pixels = {jint(0x7F123456u)};
    load("later", &pixels, 1, 1);
    vi::Texture* texture = vi::ApplicationVar::msTexturesMap["later"];
    ASSERT_NE(nullptr, texture);
    EXPECT_EQ(1u, vi::Texture::mAllTextures.size());

    load("later", nullptr, 1, 1);
    EXPECT_TRUE(vi::Texture::mAllTextures.empty()) << "the texture is deleted";
    EXPECT_EQ(texture, vi::ApplicationVar::msTexturesMap["later"]) << "the entry keeps the old pointer";
    vi::ApplicationVar::msTexturesMap.erase("later");
}

}  // namespace
