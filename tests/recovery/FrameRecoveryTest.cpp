// A ready scene across lost contexts, driven through the handlers: a frame
// after the host replaced, destroyed or dropped the context re-creates every
// program, buffer and texture before the scene draws, and looks exactly like
// the frame before.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <vector>

#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "Application/ContextRecovery.h"
#include "GlContext.h"
#include "GlRecorder.h"
#include "Pictures.h"
#include "RecoveryScene.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"

using recoverytest::RecoveryScene;
using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;

namespace {

constexpr int kSize = 64;
constexpr GLuint kNoBuffer = 0xFFFFFFFF;

using Frame = std::vector<std::uint32_t>;

Frame drawFrame() {
    EXPECT_EQ(RecoveryScene::kDrawResult, vi::Application::handleDraw());
    return vitest::readWords(0, 0, kSize, kSize);
}

bool frameHolds(const Frame& frame, std::uint32_t rgba) {
    return std::find(frame.begin(), frame.end(), rgba) != frame.end();
}

// Every texel of the three textures is on screen: a texture that came back
// empty or was never uploaded would lose its colours.
void expectEveryTexelShows(const Frame& frame) {
    for (const auto* texels : {&recoverytest::kBackgroundTexels, &recoverytest::kCheckerTexels,
                               &recoverytest::kDynamicTexels})
        for (std::uint32_t texel : *texels) EXPECT_TRUE(frameHolds(frame, texel)) << std::hex << texel;
}

bool allProgramsValid() {
    for (vi::Renderer* renderer : vi::Renderer::mAllRenderers)
        if (renderer->program->program == 0 || glIsProgram(renderer->program->program) != GL_TRUE) return false;
    return true;
}

class ReadyScene : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE(vi::Renderer::mAllRenderers.empty()) << "a previous test left renderers";
        ASSERT_TRUE(vi::Texture::mAllTextures.empty()) << "a previous test left textures";
        context.reset(new GlContext(kSize, kSize));
        vi::gCreateScene = &RecoveryScene::create;
        vi::Application::handleStart(0, 0, kSize, kSize);
        vi::Application::handleInitEffect();
        reference = drawFrame();
        expectEveryTexelShows(reference);
    }

    void TearDown() override {
        context->makeCurrent();
        vi::Application::handleStop();
        context.reset();
    }

    std::unique_ptr<GlContext> context;
    Frame reference;
};

TEST_F(ReadyScene, FrameInASecondContextIsRebuiltBeforeTheSceneDrawsAndMatches) {
    context->makeSecondCurrent();
    {
        GlRecording recording;
        EXPECT_EQ(reference, drawFrame());
        // Everything is made again before the scene's first call.
        const std::vector<std::string> names = GlRecorder::names();
        const std::ptrdiff_t firstClear = std::find(names.begin(), names.end(), "glClear") - names.begin();
        ASSERT_LT(firstClear, std::ptrdiff_t(names.size()));
        for (const char* creation : {"glCreateProgram", "glGenBuffers", "glGenTextures"}) {
            const auto last = std::find(names.rbegin(), names.rend(), creation);
            ASSERT_NE(names.rend(), last) << creation;
            EXPECT_LT(names.rend() - last - 1, firstClear) << creation;
        }
        EXPECT_EQ(3, GlRecorder::count("glGenTextures"));
    }
    EXPECT_EQ(context->secondContext(), vi::Renderer::mEglContext);
    EXPECT_TRUE(allProgramsValid());
    // The next frame in the same context rebuilds nothing.
    GlRecording recording;
    EXPECT_EQ(reference, drawFrame());
    EXPECT_EQ(0, GlRecorder::count("glCreateProgram"));
}

TEST_F(ReadyScene, FrameWithoutACurrentContextForgetsNamesAndRebuildsInTheNextContext) {
    GlContext::releaseCurrent();
    {
        GlRecording recording;
        vi::Application::handleDraw();
        EXPECT_EQ(0, GlRecorder::count("glCreateProgram") + GlRecorder::count("glGenTextures"));
    }
    EXPECT_EQ(EGL_NO_CONTEXT, vi::Renderer::mEglContext);
    for (vi::Renderer* renderer : vi::Renderer::mAllRenderers) {
        EXPECT_EQ(0u, renderer->program->program);
        EXPECT_EQ(kNoBuffer, renderer->indexBuffer);
        for (vi::Attribute* attribute : renderer->attributes) EXPECT_EQ(kNoBuffer, attribute->buffer);
    }
    for (vi::Texture* texture : vi::Texture::mAllTextures) EXPECT_EQ(0u, texture->mId);

    context->makeCurrent();
    EXPECT_EQ(reference, drawFrame());
    EXPECT_TRUE(allProgramsValid());
}

TEST_F(ReadyScene, LossNoticedByStartLeavesProgramNamesZeroUntilTheFirstReadyFrame) {
    // A renderer that outlives the scene, as one kept by an effect across restarts would.
    vi::ShaderProgram survivorProgram(RecoveryScene::current().quadProgram->vertexSource,
                                      RecoveryScene::current().quadProgram->fragmentSource);
    vi::Drawable survivorDrawable;
    vi::Renderer survivor(survivorProgram, survivorDrawable);

    context->makeSecondCurrent();
    vi::Application::handleStart(0, 0, kSize, kSize);
    EXPECT_EQ(context->secondContext(), vi::Renderer::mEglContext);
    EXPECT_EQ(0u, survivorProgram.program);

    EXPECT_EQ(0, vi::Application::handleDraw());  // not ready yet
    EXPECT_EQ(0u, survivorProgram.program);
    vi::Application::handleInitEffect();
    EXPECT_EQ(0u, survivorProgram.program);

    EXPECT_EQ(reference, drawFrame());
    EXPECT_NE(0u, survivorProgram.program);
    EXPECT_EQ(GLboolean(GL_TRUE), glIsProgram(survivorProgram.program));
    vi::Application::handleStop();
}

TEST_F(ReadyScene, RecycledStaticTexturesComeBackAfterALoss) {
    vi::Application::handleRecycleTextures();
    RecoveryScene& scene = RecoveryScene::current();
    ASSERT_EQ(nullptr, scene.backgroundTexture->mBuffer);
    ASSERT_EQ(nullptr, scene.checkerTexture->mBuffer);

    context->makeSecondCurrent();
    {
        GlRecording recording;
        EXPECT_EQ(RecoveryScene::kDrawResult, vi::Application::handleDraw());
        // Storage of undefined contents is made from the null buffer.
        int nullUploads = 0;
        for (const vitest::GlCall& call : GlRecorder::callsNamed("glTexImage2D"))
            if (call.args.back() == 0.0) ++nullUploads;
        EXPECT_EQ(2, nullUploads);
    }
    // The dynamic texture kept its pixels and still shows them.
    const Frame frame = vitest::readWords(0, 0, kSize, kSize);
    for (std::uint32_t texel : recoverytest::kDynamicTexels) EXPECT_TRUE(frameHolds(frame, texel));
}

TEST_F(ReadyScene, ManyAlternationsOfSecondAndDestroyedContextsKeepTheFrameIdentical) {
    for (int round = 0; round < 12; ++round) {
        switch (round % 3) {
            case 0: context->makeSecondCurrent(); break;
            case 1: context->makeCurrent(); break;
            case 2: context->recreate(); break;
        }
        ASSERT_EQ(reference, drawFrame()) << "round " << round;
        ASSERT_TRUE(allProgramsValid()) << "round " << round;
    }
}

}  // namespace
