// Render-to-texture targets on a real context: what allocation builds, that
// every pass leaves the binding, viewport, statics and matrices as it found
// them (nested passes too), read-back and write, anchors, and when a sampled
// target is drawn again.
#include <gtest/gtest.h>

#include <glm/gtc/matrix_transform.hpp>

#include <cstdint>
#include <string>
#include <vector>

#include "GlContext.h"
#include "GlRecorder.h"
#include "Painters.h"
#include "Render/Drawable.h"
#include "Render/RenderableTexture.h"
#include "Render/Renderer.h"
#include "Pictures.h"

using vitest::ColourPainter;
using vitest::GlCall;
using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;
using vitest::TexturePainter;
using vi::RenderableTexture;

namespace {

constexpr int kWindow = 64;
const glm::vec4 kRed(1, 0, 0, 1);
const glm::vec4 kGreen(0, 1, 0, 1);
constexpr std::uint32_t kRedPixel = 0xFF0000FF, kGreenPixel = 0x00FF00FF;
constexpr std::uint32_t kClearPixel = 0x000000FF;

// The binding as GL and the statics see it: frame buffer, viewport, then
// the static frame buffer, position and size.
using Binding = std::vector<int>;

Binding bindingNow() {
    GLint frameBuffer = 0;
    GLint viewport[4] = {};
    glGetIntegerv(GL_FRAMEBUFFER_BINDING, &frameBuffer);
    glGetIntegerv(GL_VIEWPORT, viewport);
    const glm::ivec2 position = RenderableTexture::mCurrentFrameBufferPosition;
    const glm::ivec2 size = RenderableTexture::mCurrentFrameBufferSize;
    return {frameBuffer, viewport[0], viewport[1], viewport[2], viewport[3],
            int(RenderableTexture::mCurrentFrameBuffer), position.x, position.y, size.x, size.y};
}

Binding bindingOf(GLuint frameBuffer, int x, int y, int width, int height) {
    return {int(frameBuffer), x, y, width, height, int(frameBuffer), x, y, width, height};
}

// The arguments of every recorded call of `name`.
std::vector<std::vector<double>> argumentsOf(const std::string& name) {
    std::vector<std::vector<double>> result;
    for (const GlCall& call : GlRecorder::callsNamed(name)) result.push_back(call.args);
    return result;
}

std::vector<std::uint32_t> readTarget(RenderableTexture& target) {
    std::vector<std::uint8_t> bytes(std::size_t(target.mWidth) * target.mHeight * 4);
    target.readBuffer(bytes.data());
    std::vector<std::uint32_t> pixels;
    for (std::size_t i = 0; i < bytes.size(); i += 4) pixels.push_back(vitest::rgba(&bytes[i]));
    return pixels;
}

std::uint32_t pixelOf(const std::vector<std::uint32_t>& pixels, const RenderableTexture& target, int x, int y) {
    return pixels[std::size_t(y) * target.mWidth + std::size_t(x)];
}

class RenderTargetTest : public ::testing::Test {
protected:
    // What an effect does before drawing to the window.
    void SetUp() override {
        RenderableTexture::mCurrentFrameBuffer = 0;
        RenderableTexture::mCurrentFrameBufferPosition = glm::ivec2(0, 0);
        RenderableTexture::mCurrentFrameBufferSize = glm::ivec2(kWindow, kWindow);
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glViewport(0, 0, kWindow, kWindow);
    }

    void TearDown() override {
        GlRecorder::stop();
        vi::Drawable::mViewMatrix = glm::mat4(1.0f);
        vi::Drawable::mProjectionMatrix = glm::mat4(1.0f);
    }

    GlContext mContext{kWindow, kWindow};
};

TEST_F(RenderTargetTest, PassWithoutRenderersAndDestroyingANeverAllocatedTargetMakeNoGlCall) {
    std::vector<vi::Renderer*> none;
    RenderableTexture listless(0, 0, 8, 8, false, false, false, false, false);
    RenderableTexture empty(none, 0, 0, 8, 8, false, false, false, false, false);
    empty.allocate();
    auto* untouched = new RenderableTexture(0, 0, 4, 4, false, false, false, false, true);
    GlRecording recording;
    listless.renderFrame();
    empty.renderFrame();
    delete untouched;
    EXPECT_TRUE(GlRecorder::names().empty());
}

TEST_F(RenderTargetTest, AllocationAttachesTheTextureOverTheRenderbufferAndReturnsToTheWindow) {
    RenderableTexture target(0, 0, 16, 8, false, true, false, true, true);
    const Binding before = bindingNow();
    GlRecording recording;
    target.allocate();
    GlRecorder::stop();

    const std::vector<std::string> expected = {
        "glGenTextures",     "glBindTexture",         "glTexParameteri",           "glTexParameteri",
        "glTexParameteri",   "glTexParameteri",       "glBindTexture",             "glPixelStorei",
        "glTexImage2D",      "glGenRenderbuffers",    "glBindRenderbuffer",        "glRenderbufferStorage",
        "glBindRenderbuffer", "glGenFramebuffers",    "glBindFramebuffer",         "glFramebufferRenderbuffer",
        "glFramebufferTexture2D", "glGenRenderbuffers", "glBindRenderbuffer",      "glRenderbufferStorage",
        "glBindRenderbuffer", "glFramebufferRenderbuffer", "glCheckFramebufferStatus", "glBindFramebuffer"};
    std::vector<std::string> names;
    for (const std::string& name : GlRecorder::names())
        if (name != "glGetString") names.push_back(name);
    ASSERT_EQ(names, expected);

    const std::vector<GlCall> storage = GlRecorder::callsNamed("glRenderbufferStorage");
    EXPECT_EQ(storage[0].args, (std::vector<double>{GL_RENDERBUFFER, GL_RGBA4, 16, 8}));
    EXPECT_EQ(storage[1].args, (std::vector<double>{GL_RENDERBUFFER, GL_DEPTH_COMPONENT16, 16, 8}));
    EXPECT_EQ(bindingNow(), before);

    GlRecording again;
    target.allocate();
    EXPECT_TRUE(GlRecorder::names().empty());
}

TEST_F(RenderTargetTest, PassDrawsWithTheTargetMatricesAndRestoresEverything) {
    ColourPainter painter(kRed);
    std::vector<vi::Renderer*> renderers = {painter.renderer()};
    RenderableTexture target(renderers, 0, 0, 16, 16, false, false, false, false, false);
    target.allocate();
    target.mTargetProjectionMatrix = glm::scale(glm::mat4(1.0f), glm::vec3(0.5f, 0.5f, 1.0f));
    const glm::mat4 view = glm::translate(glm::mat4(1.0f), glm::vec3(0.9f, 0.0f, 0.0f));
    const glm::mat4 projection = glm::scale(glm::mat4(1.0f), glm::vec3(2.0f, 2.0f, 1.0f));
    vi::Drawable::mViewMatrix = view;
    vi::Drawable::mProjectionMatrix = projection;
    const Binding before = bindingNow();

    GlRecording recording;
    target.renderFrame();
    GlRecorder::stop();

    EXPECT_EQ(bindingNow(), before);
    EXPECT_EQ(vi::Drawable::mViewMatrix, view);
    EXPECT_EQ(vi::Drawable::mProjectionMatrix, projection);
    EXPECT_EQ(GlRecorder::callsNamed("glClearColor")[0].args, (std::vector<double>{0, 0, 0, 1}));
    EXPECT_EQ(GlRecorder::callsNamed("glClear")[0].args[0], double(GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT));

    // The quad, halved by the target's projection, sits in the middle.
    const std::vector<std::uint32_t> pixels = readTarget(target);
    EXPECT_EQ(pixelOf(pixels, target, 5, 10), kRedPixel);
    EXPECT_EQ(pixelOf(pixels, target, 14, 8), kClearPixel);
}

TEST_F(RenderTargetTest, NestedTargetIsDrawnFirstInsideTheOuterPass) {
    ColourPainter innerPainter(kRed);
    std::vector<vi::Renderer*> innerRenderers = {innerPainter.renderer()};
    RenderableTexture inner(innerRenderers, 0, 0, 8, 8, false, false, false, false, false);
    inner.allocate();
    TexturePainter outerPainter(&inner);
    std::vector<vi::Renderer*> outerRenderers = {outerPainter.renderer()};
    RenderableTexture outer(outerRenderers, 0, 0, 32, 32, false, false, false, false, true);
    outer.allocate();
    const glm::mat4 view = glm::translate(glm::mat4(1.0f), glm::vec3(0.0f, 0.3f, 0.0f));
    vi::Drawable::mViewMatrix = view;
    const Binding before = bindingNow();

    GlRecording recording;
    outer.renderFrame();
    GlRecorder::stop();

    const std::vector<std::string> expected = {
        "glBindFramebuffer", "glViewport",   "glClear",           "glBindFramebuffer", "glViewport", "glClear",
        "glDrawArrays",      "glBindFramebuffer", "glViewport",   "glDrawArrays",      "glBindFramebuffer",
        "glViewport"};
    ASSERT_EQ(GlRecorder::names({"glBindFramebuffer", "glViewport", "glClear", "glDrawArrays"}), expected);
    const double o = outer.mFrameBuffer, i = inner.mFrameBuffer;
    EXPECT_EQ(argumentsOf("glBindFramebuffer"), (std::vector<std::vector<double>>{
                                                    {GL_FRAMEBUFFER, o}, {GL_FRAMEBUFFER, i}, {GL_FRAMEBUFFER, o},
                                                    {GL_FRAMEBUFFER, 0}}));
    EXPECT_EQ(argumentsOf("glViewport"), (std::vector<std::vector<double>>{
                                             {0, 0, 32, 32}, {0, 0, 8, 8}, {0, 0, 32, 32}, {0, 0, kWindow, kWindow}}));

    EXPECT_EQ(bindingNow(), before);
    EXPECT_EQ(vi::Drawable::mViewMatrix, view);
    EXPECT_EQ(vi::Drawable::mProjectionMatrix, glm::mat4(1.0f));
    // The outer quad filled the outer viewport, not the inner one.
    const std::vector<std::uint32_t> pixels = readTarget(outer);
    EXPECT_EQ(pixelOf(pixels, outer, 0, 0), kRedPixel);
    EXPECT_EQ(pixelOf(pixels, outer, 31, 31), kRedPixel);
}

TEST_F(RenderTargetTest, WrittenPixelsReadBackFromThePosition) {
    std::vector<std::uint8_t> pattern(8 * 8 * 4);
    for (std::size_t i = 0; i < pattern.size(); ++i) pattern[i] = std::uint8_t(i * 7 + 3);

    RenderableTexture origin(0, 0, 8, 8, false, false, false, false, false);
    origin.allocate();
    GlRecording recording;
    origin.writeBuffer(pattern.data());
    EXPECT_EQ(GlRecorder::callsNamed("glPixelStorei")[0].args, (std::vector<double>{GL_PACK_ALIGNMENT, 1}));

    std::vector<std::uint8_t> back(pattern.size(), 0);
    GlRecorder::clear();
    origin.readBuffer(back.data());
    EXPECT_EQ(back, pattern);
    EXPECT_EQ(GlRecorder::callsNamed("glPixelStorei")[0].args, (std::vector<double>{GL_UNPACK_ALIGNMENT, 1}));

    RenderableTexture offset(2, 3, 8, 8, false, false, false, false, false);
    offset.writeBuffer(pattern.data());
    std::vector<std::uint8_t> window(pattern.size(), 0);
    GlRecorder::clear();
    offset.readBuffer(window.data());
    GlRecorder::stop();
    const std::vector<double> read = GlRecorder::callsNamed("glReadPixels")[0].args;
    EXPECT_EQ(std::vector<double>(read.begin(), read.begin() + 4), (std::vector<double>{2, 3, 8, 8}));
    // Row r, column c of what was read is texel (2 + c, 3 + r) of the target.
    for (int r = 0; r < 5; ++r)
        for (int c = 0; c < 6; ++c)
            ASSERT_EQ(vitest::rgba(&window[std::size_t(r * 8 + c) * 4]),
                      vitest::rgba(&pattern[std::size_t((3 + r) * 8 + 2 + c) * 4]))
                << "row " << r << " column " << c;
    EXPECT_EQ(bindingNow(), bindingOf(0, 0, 0, kWindow, kWindow));
}

TEST_F(RenderTargetTest, AnchorsOfTwoTargetsNest) {
    RenderableTexture a(1, 2, 8, 8, false, false, false, false, false);
    RenderableTexture b(0, 0, 4, 4, false, false, false, false, false);
    a.allocate();
    b.allocate();
    const Binding window = bindingNow();

    a.enableAnchor();
    EXPECT_EQ(bindingNow(), bindingOf(a.mFrameBuffer, 1, 2, 8, 8));
    b.enableAnchor();
    EXPECT_EQ(bindingNow(), bindingOf(b.mFrameBuffer, 0, 0, 4, 4));
    EXPECT_EQ(RenderableTexture::getViewportSize(), glm::ivec2(4, 4));
    glClearColor(0, 1, 0, 1);
    glClear(GL_COLOR_BUFFER_BIT);
    b.disableAnchor();
    EXPECT_EQ(bindingNow(), bindingOf(a.mFrameBuffer, 1, 2, 8, 8));
    a.disableAnchor();
    EXPECT_EQ(bindingNow(), window);

    // What was drawn between B's anchor calls went to B.
    EXPECT_EQ(readTarget(b), std::vector<std::uint32_t>(16, kGreenPixel));
}

TEST_F(RenderTargetTest, SampledDynamicTargetIsRedrawnForEveryDrawAndAStaticOneOnlyOnRequest) {
    ColourPainter dynamicSource(kRed);
    ColourPainter staticSource(kRed);
    std::vector<vi::Renderer*> dynamicRenderers = {dynamicSource.renderer()};
    std::vector<vi::Renderer*> staticRenderers = {staticSource.renderer()};
    RenderableTexture dynamicTarget(dynamicRenderers, 0, 0, 4, 4, false, false, false, false, false);
    RenderableTexture staticTarget(staticRenderers, 0, 0, 4, 4, true, false, false, false, false);
    TexturePainter showDynamic(&dynamicTarget);
    TexturePainter showStatic(&staticTarget);
    staticTarget.renderFrame();

    GlRecording recording;
    showDynamic.renderer()->render();
    EXPECT_EQ(vitest::readPixel(10, 10), kRedPixel);
    dynamicSource.colour = kGreen;
    showDynamic.renderer()->render();
    EXPECT_EQ(vitest::readPixel(10, 10), kGreenPixel);
    EXPECT_EQ(GlRecorder::count("glClear"), 2);

    GlRecorder::clear();
    staticSource.colour = kGreen;
    showStatic.renderer()->render();
    showStatic.renderer()->render();
    EXPECT_EQ(vitest::readPixel(10, 10), kRedPixel);
    EXPECT_EQ(GlRecorder::count("glClear"), 0);
    staticTarget.renderFrame();
    showStatic.renderer()->render();
    EXPECT_EQ(vitest::readPixel(10, 10), kGreenPixel);
}

}  // namespace
