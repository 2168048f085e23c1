// The host's texture loading seen from a stand-in JNI environment: which JNI
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
#include "GlContext.h"
#include "GlRecorder.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"

extern "C" JNIEXPORT void JNICALL Java_com_tarq_android_visualeffect_common_Native_loadTexture(
    JNIEnv* env, jclass, jstring name, jintArray pixels, jint width, jint height);

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
void logJni(const char* name, std::initializer_list<double> args = {}) {
    if (pthread_mutex_trylock(&vi::ApplicationVar::msCriticalSection) == 0)
        pthread_mutex_unlock(&vi::ApplicationVar::msCriticalSection);
    else
        gLockWasHeld = true;
    GlRecorder::record(name, args);
}

// A jstring is the name's characters, a jintArray the host's ints themselves.
const char* JNICALL getStringUTFChars(JNIEnv*, jstring name, jboolean*) {
    logJni("GetStringUTFChars");
    return reinterpret_cast<const char*>(name);
}
void JNICALL releaseStringUTFChars(JNIEnv*, jstring, const char* chars) {
    logJni("ReleaseStringUTFChars", {address(chars)});
}
jint* JNICALL getIntArrayElements(JNIEnv*, jintArray array, jboolean*) {
    logJni("GetIntArrayElements");
    return reinterpret_cast<jint*>(array);
}
void JNICALL releaseIntArrayElements(JNIEnv*, jintArray, jint* elements, jint mode) {
    logJni("ReleaseIntArrayElements", {address(elements), double(mode)});
}

// Only the four functions the loading may use; any other call crashes the test.
class StandInJni {
public:
    StandInJni() : mTable() {
        mTable.GetStringUTFChars = getStringUTFChars;
        mTable.ReleaseStringUTFChars = releaseStringUTFChars;
        mTable.GetIntArrayElements = getIntArrayElements;
        mTable.ReleaseIntArrayElements = releaseIntArrayElements;
        mEnv.functions = &mTable;
    }

    void load(const char* name, std::vector<jint>* pixels, int width, int height) {
        Java_com_tarq_android_visualeffect_common_Native_loadTexture(
            &mEnv, nullptr, reinterpret_cast<jstring>(const_cast<char*>(name)),
            pixels ? reinterpret_cast<jintArray>(pixels->data()) : nullptr, width, height);
    }

private:
    JNINativeInterface_ mTable;
    JNIEnv mEnv;
};

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
    }

    void TearDown() override {
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

    std::unique_ptr<GlContext> context;
    StandInJni jni;
    CountingScene scene;
    std::vector<std::string> loaded;
};

TEST_F(HostLoading, ReplaceFreesThenUploadsAtTheNewSizeThenTellsTheSceneWithoutTheLock) {
    std::vector<jint> small = {1, 2};
    jni.load("replaced", &small, 2, 1);
    vi::Texture* texture = filed("replaced");
    texture->allocate();  // as the scene would, before binding it
    void* const firstBuffer = texture->mBuffer;
    const GLuint id = texture->mId;

    std::vector<jint> large(6, jint(0xFF102030u));
    GlRecording recording;
    jni.load("replaced", &large, 3, 2);
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
    jni.load("early", &first, 1, 1);
    std::vector<jint> second(4, jint(0xFF00FF00u));
    jni.load("early", &second, 2, 2);
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
    jni.load("later", nullptr, 4, 4);
    ASSERT_EQ(1u, vi::ApplicationVar::msTexturesMap.count("later"));
    EXPECT_EQ(nullptr, vi::ApplicationVar::msTexturesMap["later"]);
    std::vector<jint> pixels = {jint(0x7F123456u)};
    jni.load("later", &pixels, 1, 1);
    vi::Texture* texture = vi::ApplicationVar::msTexturesMap["later"];
    ASSERT_NE(nullptr, texture);
    EXPECT_EQ(1u, vi::Texture::mAllTextures.size());

    jni.load("later", nullptr, 1, 1);
    EXPECT_TRUE(vi::Texture::mAllTextures.empty()) << "the texture is deleted";
    EXPECT_EQ(texture, vi::ApplicationVar::msTexturesMap["later"]) << "the entry keeps the old pointer";
    vi::ApplicationVar::msTexturesMap.erase("later");
}

}  // namespace
