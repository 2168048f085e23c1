// The full-screen background on a real context: orientation and stretch of
// the picture read back, opacity ignored and the shared program's life.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "GlContext.h"
#include "Pictures.h"
#include "GlRecorder.h"
#include "Painters.h"
#include "Render/Background.h"
#include "Render/BackgroundRenderer.h"
#include "Render/RenderableTexture.h"
#include "Render/Renderer.h"

using vitest::GlRecorder;
using vitest::pixelAt;
using vitest::PixelTexture;
using vitest::Rgba;

namespace {

const Rgba kRed{255, 0, 0, 255};
const Rgba kGreen{0, 255, 0, 255};
const Rgba kBlue{0, 0, 255, 255};
const Rgba kWhite{255, 255, 255, 255};
const Rgba kBlack{0, 0, 0, 255};

class BackgroundTest : public testing::Test {
protected:
    void clear() {
        glClearColor(0.0f, 0.0f, 0.0f, 1.0f);
        glClear(GL_COLOR_BUFFER_BIT);
    }

    vitest::GlContext gl{64, 64};
    // First row red, green; second row blue, white.
    PixelTexture quadrants{2, 2, {kRed, kGreen, kBlue, kWhite}};
};

}  // namespace

TEST_F(BackgroundTest, FirstTextureRowShowsAtTheTopStretchedToTheViewport) {
    vi::Background background(quadrants.texture());
    clear();
    // A viewport as wide as the surface and half as high: the picture follows it.
    glViewport(0, 0, 64, 32);

    background.renderFrame();

    EXPECT_EQ(pixelAt(1, 30), kRed);
    EXPECT_EQ(pixelAt(32, 16), kGreen);
    EXPECT_EQ(pixelAt(31, 15), kBlue);
    EXPECT_EQ(pixelAt(62, 1), kWhite);
    EXPECT_EQ(pixelAt(8, 40), kBlack);
}

TEST_F(BackgroundTest, ChangingOpacityChangesNothing) {
    vi::Background background(quadrants.texture());
    vi::Renderer::setBlending(true);
    clear();
    background.renderFrame();
    std::vector<std::uint8_t> opaque = vitest::readPixels(0, 0, 64, 64);

    background.drawable.opacity = 0.25f;
    clear();
    background.renderFrame();

    EXPECT_EQ(vitest::readPixels(0, 0, 64, 64), opaque);
    EXPECT_EQ(pixelAt(1, 62), kRed);
    vi::Renderer::setBlending(false);
}

TEST_F(BackgroundTest, BackgroundsShareOneProgramUntilTheLastIsDeleted) {
    vitest::GlRecording recording;
    auto first = std::make_unique<vi::Background>(quadrants.texture());
    auto second = std::make_unique<vi::Background>(quadrants.texture());
    EXPECT_EQ(GlRecorder::count("glCreateProgram"), 1);
    // The fragment text keeps its two declarations on one line, and with them the unused opacity.
    ASSERT_EQ(GlRecorder::count("glShaderSource"), 2);
    EXPECT_NE(GlRecorder::callsNamed("glShaderSource")[1].text.find(
                  "\nuniform float uOpacity;varying vec2 vTextureCoord;\nvoid main()\n"),
              std::string::npos);
    ASSERT_NE(vi::BackgroundRenderer::msShaderProgram, nullptr);
    EXPECT_EQ(first->renderer->program, vi::BackgroundRenderer::msShaderProgram);
    EXPECT_EQ(second->renderer->program, vi::BackgroundRenderer::msShaderProgram);
    GLuint shared = vi::BackgroundRenderer::msShaderProgram->program;

    first.reset();
    EXPECT_TRUE(glIsProgram(shared));
    second.reset();
    EXPECT_EQ(vi::BackgroundRenderer::msShaderProgram, nullptr);
    EXPECT_EQ(vi::BackgroundRenderer::msUseCount, 0u);
    EXPECT_FALSE(glIsProgram(shared));

    vi::Background third(quadrants.texture());
    EXPECT_EQ(GlRecorder::count("glCreateProgram"), 2);
    ASSERT_NE(vi::BackgroundRenderer::msShaderProgram, nullptr);
    EXPECT_TRUE(glIsProgram(vi::BackgroundRenderer::msShaderProgram->program));
}

TEST_F(BackgroundTest, OutsideRequestForTheProgramKeepsItAlive) {
    vi::ShaderProgram* outside = vi::BackgroundRenderer::getShaderProgram();
    {
        vi::Background background(quadrants.texture());
        EXPECT_EQ(background.renderer->program, outside);
    }
    EXPECT_EQ(vi::BackgroundRenderer::msShaderProgram, outside);
    EXPECT_EQ(vi::BackgroundRenderer::msUseCount, 1u);
    EXPECT_TRUE(glIsProgram(outside->program));

    // The outside caller has no way to give it back; this test tidies up by hand.
    delete vi::BackgroundRenderer::msShaderProgram;
    vi::BackgroundRenderer::msShaderProgram = nullptr;
    vi::BackgroundRenderer::msUseCount = 0;
}

TEST_F(BackgroundTest, DynamicRenderTargetBehindItIsDrawnAgainForEveryFrame) {
    // The target's own scene: a quad in a colour the test changes between frames.
    vitest::ColourPainter painter(glm::vec4(1.0f, 0.0f, 0.0f, 1.0f));
    std::vector<vi::Renderer*> targetScene{painter.renderer()};
    vi::RenderableTexture target(targetScene, 0, 0, 16, 16, false, false, false, false, false);
    // The window's viewport, which each pass restores when it ends.
    vi::RenderableTexture::mCurrentFrameBuffer = 0;
    vi::RenderableTexture::mCurrentFrameBufferPosition = glm::ivec2(0, 0);
    vi::RenderableTexture::mCurrentFrameBufferSize = glm::ivec2(64, 64);
    vi::Background background(target);

    clear();
    background.renderFrame();
    EXPECT_EQ(pixelAt(32, 32), kRed);

    painter.colour = glm::vec4(0.0f, 1.0f, 0.0f, 1.0f);
    clear();
    background.renderFrame();
    EXPECT_EQ(pixelAt(1, 1), kGreen);
    EXPECT_EQ(pixelAt(62, 62), kGreen);
}
