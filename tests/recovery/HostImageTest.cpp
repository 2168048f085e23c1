// The host's images: the conversion of its ARGB ints into RGBA bytes (the
// byte-shuffle form of this CPU against the portable one), and loading,
// replacing and unloading an image by name through the JNI entry point.
#include <gtest/gtest.h>
#include <pthread.h>

#include <cstdint>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "Application/ApplicationVar.h"
#include "Application/ContextRecovery.h"
#include "Entry/HostImage.h"
#include "FakeJni.h"
#include "GlContext.h"
#include "GlRecorder.h"
#include "Pictures.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"

using vi::HostImage;
using vitest::GlRecorder;
using vitest::GlRecording;

namespace {

// The form each CPU the runtime ships for must take: a build that falls back
// to the portable loop (NEON or SSSE3 not compiled in) fails here.
TEST(HostImage, TakesTheByteShuffleOfThisCpu) {
#if defined(__aarch64__)
    EXPECT_STREQ(HostImage::shuffleName(), "NEON");
    EXPECT_TRUE(HostImage::hasShuffle());
#elif defined(__x86_64__)
    EXPECT_STREQ(HostImage::shuffleName(), "SSSE3");
    EXPECT_EQ(HostImage::hasShuffle(), __builtin_cpu_supports("ssse3") != 0);
#else
    GTEST_SKIP() << "no byte shuffle is expected on this CPU";
#endif
}

// Every form on every length from 1 to 67 (each tail, several whole vectors)
// with both pointers at each misalignment, and on a full 1080 x 1920 screen:
// each pixel's bytes 0 and 2 trade places in the host's array and in the
// texture's bytes, and nothing outside the pixels moves.
TEST(HostImage, FormsAgreeOnOddLengthsAndUnalignedPointers) {
    struct Form {
        const char* name;
        void (*convert)(void*, void*, std::size_t);
    };
    std::vector<Form> forms = {{"chosen", HostImage::toTextureBytes}, {"portable", HostImage::toTextureBytesPortable}};
    if (HostImage::hasShuffle()) forms.push_back({HostImage::shuffleName(), HostImage::toTextureBytesShuffled});
    auto check = [](const Form& form, std::size_t count, std::size_t hostOffset, std::size_t textureOffset) {
        const unsigned char kGuard = 0x5A;
        std::vector<unsigned char> host(count * 4 + 8, kGuard), texture(count * 4 + 8, kGuard), expected(count * 4);
        for (std::size_t i = 0; i < count * 4; ++i) host[hostOffset + i] = (unsigned char)(i * 37 + i / 256 + 1);
        for (std::size_t i = 0; i < count * 4; ++i) expected[i] = host[hostOffset + (i ^ (i % 4 == 1 || i % 4 == 3 ? 0 : 2))];
        form.convert(&host[hostOffset], &texture[textureOffset], count);
        SCOPED_TRACE(::testing::Message() << form.name << " length " << count << " offsets " << hostOffset << " "
                                          << textureOffset);
        EXPECT_EQ(0, std::memcmp(expected.data(), &host[hostOffset], count * 4));
        EXPECT_EQ(0, std::memcmp(expected.data(), &texture[textureOffset], count * 4));
        for (std::size_t i = 0; i < 8; ++i) {
            EXPECT_EQ(kGuard, host[i < hostOffset ? i : count * 4 + i]);
            EXPECT_EQ(kGuard, texture[i < textureOffset ? i : count * 4 + i]);
        }
    };
    for (const Form& form : forms) {
        for (std::size_t count = 1; count <= 67 && !::testing::Test::HasFailure(); ++count)
            for (std::size_t hostOffset = 0; hostOffset < 4; ++hostOffset)
                for (std::size_t textureOffset = 0; textureOffset < 4; ++textureOffset)
                    check(form, count, hostOffset, textureOffset);
        check(form, 1080 * 1920, 1, 3);
    }
}

// Records the calls to it, and whether the lock was held at the time.
class ToldScene : public vi::Scene {
public:
    void textureUpdated() override {
        lockWasFree = pthread_mutex_trylock(&vi::ApplicationVar::msCriticalSection) == 0;
        if (lockWasFree) pthread_mutex_unlock(&vi::ApplicationVar::msCriticalSection);
        GlRecorder::record("textureUpdated", {});
    }
    bool lockWasFree = false;
};

class HostImages : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE(vi::Renderer::mAllRenderers.empty() && vi::Texture::mAllTextures.empty()) << "left by a test";
        context.reset(new vitest::GlContext(16, 16));
        vi::ContextRecovery::invalidate();
        vi::gpScene = &scene;
    }
    void TearDown() override {
        EXPECT_TRUE(jni.misuses().empty());
        EXPECT_EQ(0, jni.outstandingUtfChars() + jni.outstandingElements()) << "JNI copies not released";
        vi::gpScene = nullptr;
        for (auto& filed : vi::ApplicationVar::msTexturesMap)
            if (std::count(vi::Texture::mAllTextures.begin(), vi::Texture::mAllTextures.end(), filed.second)) delete filed.second;
        vi::ApplicationVar::msTexturesMap.clear();
        context.reset();
    }

    // The host's call: a name and its pixels (none: an unload).
    vi::Texture* load(const char* name, std::vector<jint> pixels, int width, int height) {
        VI_NATIVE(loadTexture)(jni.env(), nullptr, jni.string(name), pixels.empty() ? nullptr : jni.intArray(pixels),
                               width, height);
        jni.reset();
        return vi::ApplicationVar::msTexturesMap[name];
    }

    std::unique_ptr<vitest::GlContext> context;
    vitest::FakeJni jni;
    ToldScene scene;
};

// Replacing frees the old pixels, uploads the new ones at the new size into
// the same texture, and only then tells the scene, without the lock.
TEST_F(HostImages, ReplaceFreesThenUploadsAtTheNewSizeThenTellsTheSceneWithoutTheLock) {
    vi::Texture* texture = load("sky", {1, 2}, 2, 1);
    texture->allocate();  // as the scene would, before binding it
    const double firstBuffer = double(reinterpret_cast<std::uintptr_t>(texture->mBuffer));
    GlRecording recording;
    EXPECT_EQ(texture, load("sky", std::vector<jint>(6, jint(0xFF102030u)), 3, 2));
    EXPECT_EQ(GlRecorder::names({"free", "glTexImage2D", "textureUpdated"}),
              (std::vector<std::string>{"free", "glTexImage2D", "textureUpdated"}));
    EXPECT_EQ(firstBuffer, GlRecorder::callsNamed("free")[0].args[0]);
    const std::vector<double> upload = GlRecorder::callsNamed("glTexImage2D")[0].args;
    EXPECT_EQ((std::vector<double>{3, 2}), std::vector<double>(upload.begin() + 3, upload.begin() + 5));
    EXPECT_EQ(double(reinterpret_cast<std::uintptr_t>(texture->mBuffer)), upload[8]);
    EXPECT_EQ(0x102030FFu, vitest::rgba(static_cast<std::uint8_t*>(texture->mBuffer)));
    EXPECT_TRUE(scene.lockWasFree);
    EXPECT_EQ(glm::vec2(1.0f / 3.0f, 0.5f), texture->mTexelSize);
}

// A second load before anything allocated the image: the upload had no
// texture of its own, so the first allocation defines the storage in full.
TEST_F(HostImages, ReplaceBeforeTheFirstAllocationIsUploadedInFullWhenAllocated) {
    load("early", {jint(0xFF0000FFu)}, 1, 1);
    vi::Texture* texture = load("early", std::vector<jint>(4, jint(0xFF00FF00u)), 2, 2);
    GlRecording recording;
    texture->allocate();
    ASSERT_EQ(1u, GlRecorder::callsNamed("glTexImage2D").size());
    EXPECT_EQ(0, GlRecorder::count("glTexSubImage2D"));
    EXPECT_EQ(2, GlRecorder::callsNamed("glTexImage2D")[0].args[3]);
}

// Unloading a name never loaded files a null entry that a later load fills;
// unloading a loaded one deletes the texture and leaves the stale pointer.
TEST_F(HostImages, UnloadFilesANullEntryOrDeletesTheTextureAndKeepsItsPointer) {
    EXPECT_EQ(nullptr, load("later", {}, 4, 4));
    EXPECT_EQ(1u, vi::ApplicationVar::msTexturesMap.count("later"));
    vi::Texture* texture = load("later", {jint(0x7F123456u)}, 1, 1);
    ASSERT_NE(nullptr, texture);
    EXPECT_EQ(texture, load("later", {}, 1, 1));
    EXPECT_TRUE(vi::Texture::mAllTextures.empty());
}

// Loading compares context handles only: under the same handle nothing is
// asked or made, whatever became of the objects; in another context every
// texture is made again, without a probe.
TEST_F(HostImages, LoadingRebuildsOnlyWhenTheContextHandleChanged) {
    vi::Texture* sky = load("sky", {1}, 1, 1);
    sky->allocate();
    load("sea", {2}, 1, 1)->allocate();
    glDeleteTextures(1, &sky->mId);
    {
        GlRecording recording;
        load("land", {3}, 1, 1);
        EXPECT_EQ(std::vector<std::string>{"eglGetCurrentContext"}, GlRecorder::names());
    }
    context->makeSecondCurrent();
    GlRecording recording;
    load("land", {4}, 1, 1);
    EXPECT_EQ(3, GlRecorder::count("glGenTextures"));
    EXPECT_EQ(0, GlRecorder::count("glIsTexture"));
    EXPECT_EQ(context->secondContext(), vi::Renderer::mEglContext);
}

}  // namespace
