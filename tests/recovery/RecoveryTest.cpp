// A ready scene showing the host's image across lost contexts, driven through
// the handlers and the JNI entry point: a frame after the host replaced,
// destroyed or dropped the context, or after the driver lost objects under
// the same context handle, re-creates every program, buffer and texture before
// the scene draws, and looks exactly like the frame before. Then the host's
// images themselves: replaced, replaced early, unloaded, and converted.
#include <gtest/gtest.h>
#include <pthread.h>

#include <algorithm>
#include <cstdint>

#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Entry/HostImage.h"
#include "FakeJni.h"
#include "GlRecorder.h"
#include "Painters.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"
#include "TestSceneRecord.h"

extern "C" void __real_free(void* p);
extern "C" void __wrap_free(void* p) {
    if (p) vitest::GlRecorder::record("free", {vitest::address(p)});
    __real_free(p);
}

using namespace vi;
using namespace vitest;
using Frame = std::vector<std::uint32_t>;
using Names = std::vector<std::string>;

namespace {

constexpr int kSize = 64;

class Recovery : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE(Renderer::mAllRenderers.empty() && Texture::mAllTextures.empty()) << "left by a test";
        context.reset(new GlContext(kSize, kSize));
        gCreateScene = createScene;
        gTestScene.reset();
        gTestScene.names = {"sky"};
        gTestScene.picture = true;
        gTestScene.drawResult = 7;
        load("sky", {jint(0xFFD02010), jint(0xFF20C030), jint(0xFF3040B0), jint(0x80E0E0E0)}, 2, 2);
        load("sea", {1, 2}, 1, 2);
        Application::handleStart(0, 0, kSize, kSize);
        Application::handleInitEffect();
        EXPECT_NE(reference = frame(), Frame(kSize * kSize, 0x000000FFu)) << "the picture shows";
    }
    void TearDown() override {
        context->makeCurrent();
        Application::handleStop();
        ApplicationVar::msTexturesMap.clear();
        while (!Texture::mAllTextures.empty()) delete Texture::mAllTextures.front();  // the host's images
        EXPECT_EQ(0, jni.outstanding()) << "JNI chars or elements not given back";
    }

    // The host's call: a name and its pixels (none: an unload).
    Texture* load(const char* name, std::vector<jint> px, int w, int h) {
        VI_NATIVE(loadTexture)(jni.env(), nullptr, jni.string(name), px.empty() ? nullptr : jni.intArray(px), w, h);
        jni.reset();
        return ApplicationVar::msTexturesMap[name];
    }
    static Frame frame() {
        EXPECT_EQ(7, Application::handleDraw());
        return readWords(0, 0, kSize, kSize);
    }

    std::unique_ptr<vitest::GlContext> context;
    vitest::FakeJni jni;
    Frame reference;
};

}  // namespace

// In the first frame in another context the order is the behaviour: every
// name is forgotten, the renderers are made again in registry order, then the
// textures, all before the scene's first call, without asking a probe; the
// next frame only asks the two probes.
TEST_F(Recovery, FrameStaysTheSameThroughManyContextsRestartsAndFramesWithoutOne) {
    const Names made = {"glCreateProgram", "glIsProgram", "glGenBuffers",
                        "glGenTextures",   "glIsTexture", "glDrawArrays"};
    const Names firstFrame = {"glCreateProgram", "glGenBuffers", "glGenTextures", "glGenTextures", "glDrawArrays"};
    for (int round = 0; round < 15; ++round) {
        SCOPED_TRACE(round);
        if (round % 5 == 0 || round % 5 == 3) context->makeSecondCurrent();
        if (round % 5 == 1) context->recreate();
        // Without a context a frame only forgets every name: nothing can be made.
        if (round % 5 == 2) {
            vitest::GlContext::releaseCurrent();
            Application::handleDraw();
        }
        if (round % 5 == 2 || round % 5 == 4) context->makeCurrent();
        // A start in another context only forgets; the first ready frame makes again.
        if (round % 5 == 3) Application::handleRestart();
        const bool forgotten = round % 5 == 2 || round % 5 == 3;  // every name, and nothing made yet
        for (Renderer* renderer : Renderer::mAllRenderers) EXPECT_TRUE(!forgotten || !renderer->program->program);
        for (Texture* texture : Texture::mAllTextures) EXPECT_TRUE(!forgotten || !texture->mId);
        GlRecording recording;
        ASSERT_EQ(reference, frame());
        if (round == 0) {
            EXPECT_EQ(GlRecorder::names(made), firstFrame);
        }
        GlRecorder::clear();
        ASSERT_EQ(reference, frame());
        EXPECT_EQ(GlRecorder::names(made), (Names{"glIsProgram", "glIsTexture", "glDrawArrays"}));
    }
}

// A driver may hand a new context the handle of a lost one: the first
// renderer's program and the first texture with a name are asked on every
// frame, and either one gone means everything is made again.
TEST_F(Recovery, ObjectsGoneUnderTheSameContextHandleAreNoticed) {
    for (int gone = 0; gone < 2; ++gone) {
        SCOPED_TRACE(gone ? "texture" : "program");
        GlRecording recording;
        frame();
        EXPECT_EQ(Renderer::mAllRenderers[0]->program->program, GlRecorder::callsNamed("glIsProgram").at(0).args[0]);
        EXPECT_EQ(Texture::mAllTextures.front()->mId, GlRecorder::callsNamed("glIsTexture").at(0).args[0]);
        glUseProgram(0);  // so that a deleted program is gone at once
        if (gone)
            glDeleteTextures(1, &Texture::mAllTextures.front()->mId);
        else
            glDeleteProgram(Renderer::mAllRenderers.front()->program->program);
        GlRecorder::clear();
        EXPECT_TRUE(reference == frame() && GlRecorder::count("glGenTextures") == 2) << "everything made again";
    }
}

// Recycling frees the static textures' pixels; after a loss they come back
// as storage of undefined contents (and the scene leaves the picture out).
TEST_F(Recovery, RecycledStaticTexturesComeBackAfterALoss) {
    const double sky = address(ApplicationVar::msTexturesMap["sky"]->mBuffer);
    GlRecording recording;
    Application::handleRecycleTextures();
    EXPECT_TRUE(GlRecorder::callsNamed("free").size() == 2 && GlRecorder::callsNamed("free")[0].args[0] == sky);
    context->makeSecondCurrent();
    frame();
    const std::vector<GlCall> uploads = GlRecorder::callsNamed("glTexImage2D");
    EXPECT_EQ(2, std::count_if(uploads.begin(), uploads.end(), [](const GlCall& c) { return c.args.back() == 0.0; }));
}

// Replacing frees the old pixels and uploads the new ones at the new size
// into the same texture, shown at the next frame; the scene is told, and no
// lock is taken (the test holds it: a replace that took it would never return).
TEST_F(Recovery, HostImagesReplacedEarlyOrLate) {
    Texture* sky = ApplicationVar::msTexturesMap["sky"];
    const double firstBuffer = address(sky->mBuffer);
    GlRecording recording;
    pthread_mutex_lock(&ApplicationVar::msCriticalSection);
    EXPECT_EQ(sky, load("sky", std::vector<jint>(6, jint(0xFF102030u)), 3, 2));
    pthread_mutex_unlock(&ApplicationVar::msCriticalSection);
    EXPECT_EQ(GlRecorder::names({"free", "glTexImage2D"}), (Names{"free", "glTexImage2D"}));
    EXPECT_EQ(firstBuffer, GlRecorder::callsNamed("free")[0].args[0]);
    const std::vector<double> upload = GlRecorder::callsNamed("glTexImage2D")[0].args;
    EXPECT_TRUE(upload[3] == 3 && upload[4] == 2 && sky->mTexelSize == glm::vec2(1.0f / 3.0f, 0.5f));
    EXPECT_EQ('t', gTestScene.events.back().kind) << "the scene is told";
    EXPECT_EQ(Frame(kSize * kSize, 0x102030FFu), frame());
    // A second load before anything allocated the image: the upload had no
    // texture of its own, so the first allocation defines the storage in full.
    GlRecorder::clear();
    load("early", {jint(0xFF0000FFu)}, 1, 1);
    load("early", {1, 2, 3, 4}, 2, 2)->allocate();
    EXPECT_EQ(GlRecorder::names({"glTexImage2D", "glTexSubImage2D"}), (Names{"glTexImage2D", "glTexImage2D"}));
    EXPECT_EQ(2, GlRecorder::callsNamed("glTexImage2D").at(1).args[3]);
}


// The form each CPU the runtime ships for must take: a build that falls back
// to the portable loop (NEON or SSSE3 not compiled in) fails here. Then every
// form on every length from 1 to 67 (each tail, several whole vectors) with
// both pointers at each misalignment, and on a full 1080 x 1920 screen: each
// pixel's bytes 0 and 2 trade places in the host's array and in the texture's
// bytes, and nothing outside the pixels moves.
TEST(HostImage, TakesThisCpusShuffleAndEveryFormAgreesOnOddLengthsAndUnalignedPointers) {
#if defined(__aarch64__)
    EXPECT_TRUE(HostImage::hasShuffle() && std::string(HostImage::shuffleName()) == "NEON");
#elif defined(__x86_64__)
    EXPECT_TRUE(HostImage::hasShuffle() == (__builtin_cpu_supports("ssse3") != 0) &&
                std::string(HostImage::shuffleName()) == "SSSE3");
#endif
    std::vector<void (*)(void*, void*, std::size_t)> forms = {HostImage::toTextureBytes,
                                                              HostImage::toTextureBytesPortable};
    if (HostImage::hasShuffle()) forms.push_back(HostImage::toTextureBytesShuffled);
    auto byte = [](std::size_t i) { return (unsigned char)(i * 37 + i / 256 + 1); };
    for (auto form : forms)
        for (std::size_t count = 1; count <= 68; ++count)
            for (std::size_t offsets = count < 68 ? 0 : 14; offsets < 16; ++offsets) {
                const std::size_t n = count < 68 ? count : 1080 * 1920, hostAt = offsets / 4, textureAt = offsets % 4;
                std::vector<unsigned char> host(n * 4 + 8, 0x5A), texture = host, wantHost = host, wantTexture = host;
                for (std::size_t i = 0; i < n * 4; ++i) {
                    host[hostAt + i] = byte(i);
                    wantHost[hostAt + i] = wantTexture[textureAt + i] = byte(i % 2 ? i : i ^ 2);
                }
                form(&host[hostAt], &texture[textureAt], n);
                ASSERT_TRUE(host == wantHost && texture == wantTexture) << n << " " << hostAt << " " << textureAt;
            }
}
