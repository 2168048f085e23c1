// Render-to-texture targets on a real context: what allocation builds and
// destruction deletes, that every pass leaves the binding, viewport, statics
// and matrices as it found them (nested passes too), read-back and write,
// anchors and clearing, and when a sampled target is drawn again.
#include <gtest/gtest.h>

#include <glm/gtc/matrix_transform.hpp>

#include <cstdint>
#include <string>
#include <vector>

#include "GlContext.h"
#include "GlRecorder.h"
#include "Painters.h"
#include "Render/RenderableTexture.h"

using vi::RenderableTexture;
using vitest::GlCall;
using vitest::GlRecorder;
using vitest::GlRecording;
using Args = std::vector<double>;
using Names = std::vector<std::string>;
using Words = std::vector<std::uint32_t>;

namespace {

constexpr int kWindow = 64;
constexpr std::uint32_t kRed = 0xFF0000FF, kGreen = 0x00FF00FF, kBlack = 0x000000FF;

// The binding as GL and the statics see it: framebuffer and viewport, then
// the static framebuffer, position and size.
std::vector<int> bindingNow() {
    GLint frameBuffer = -1, viewport[4] = {};
    glGetIntegerv(GL_FRAMEBUFFER_BINDING, &frameBuffer);
    glGetIntegerv(GL_VIEWPORT, viewport);
    const glm::ivec2 position = RenderableTexture::mCurrentFrameBufferPosition;
    const glm::ivec2 size = RenderableTexture::mCurrentFrameBufferSize;
    return {frameBuffer, viewport[0], viewport[1], viewport[2], viewport[3],
            int(RenderableTexture::mCurrentFrameBuffer), position.x, position.y, size.x, size.y};
}

std::vector<int> bindingOf(GLuint frameBuffer, int x, int y, int width, int height) {
    return {int(frameBuffer), x, y, width, height, int(frameBuffer), x, y, width, height};
}

Words readTarget(RenderableTexture& target) {
    std::vector<std::uint8_t> bytes(std::size_t(target.mWidth) * target.mHeight * 4);
    target.readBuffer(bytes.data());
    Words pixels;
    for (std::size_t i = 0; i < bytes.size(); i += 4) pixels.push_back(vitest::rgba(&bytes[i]));
    return pixels;
}

Args argumentsOf(const std::string& name, std::size_t index) {
    Args values;
    for (const GlCall& call : GlRecorder::callsNamed(name)) values.push_back(call.args[index]);
    return values;
}

class RenderTargetTest : public testing::Test {
protected:
    // What an effect does before its first pass: it stores the window's
    // viewport. The bound framebuffer is the window's from the start.
    void SetUp() override {
        RenderableTexture::mCurrentFrameBufferPosition = glm::ivec2(0, 0);
        RenderableTexture::mCurrentFrameBufferSize = glm::ivec2(kWindow, kWindow);
    }

    void TearDown() override {
        GlRecorder::stop();
        vi::Drawable::mViewMatrix = vi::Drawable::mProjectionMatrix = glm::mat4(1.0f);
    }

    vitest::GlContext mContext{kWindow, kWindow};
};

TEST_F(RenderTargetTest, AllocationAttachesTheTextureOverTheRenderbufferAndDestructionDeletesAll) {
    auto* target = new RenderableTexture(0, 0, 16, 8, false, true, false, true, true);
    EXPECT_EQ(target->mFormat, GLenum(GL_RGBA));
    const std::vector<int> window = bindingNow();
    GlRecording recording;
    target->allocate();
    target->allocate();
    EXPECT_EQ(GlRecorder::names({"glGenTextures", "glBindTexture", "glTexImage2D", "glGenRenderbuffers",
                                 "glBindRenderbuffer", "glRenderbufferStorage", "glGenFramebuffers",
                                 "glBindFramebuffer", "glFramebufferRenderbuffer", "glFramebufferTexture2D",
                                 "glCheckFramebufferStatus"}),
              (Names{"glGenTextures", "glBindTexture", "glBindTexture", "glTexImage2D", "glGenRenderbuffers",
                     "glBindRenderbuffer", "glRenderbufferStorage", "glBindRenderbuffer", "glGenFramebuffers",
                     "glBindFramebuffer", "glFramebufferRenderbuffer", "glFramebufferTexture2D",
                     "glGenRenderbuffers", "glBindRenderbuffer", "glRenderbufferStorage", "glBindRenderbuffer",
                     "glFramebufferRenderbuffer", "glCheckFramebufferStatus", "glBindFramebuffer"}));
    EXPECT_EQ(argumentsOf("glRenderbufferStorage", 1), (Args{GL_RGBA4, GL_DEPTH_COMPONENT16}));
    EXPECT_EQ(argumentsOf("glGenRenderbuffers", 0), (Args{1, 1}));  // one name each
    EXPECT_EQ(argumentsOf("glBindRenderbuffer", 1), (Args{double(target->mColorBuffer), 0,
                                                          double(target->mDepthBuffer), 0}));
    EXPECT_EQ(bindingNow(), window);

    const Args names = {double(target->mFrameBuffer), double(target->mColorBuffer), double(target->mDepthBuffer)};
    GlRecorder::start();
    delete target;
    EXPECT_EQ(GlRecorder::names({"glBindRenderbuffer", "glDeleteFramebuffers", "glDeleteRenderbuffers"}),
              (Names{"glBindRenderbuffer", "glDeleteFramebuffers", "glDeleteRenderbuffers", "glDeleteRenderbuffers"}));
    EXPECT_EQ(argumentsOf("glBindRenderbuffer", 1), Args{0});
    Args deleted = argumentsOf("glDeleteFramebuffers", 1);
    for (double name : argumentsOf("glDeleteRenderbuffers", 1)) deleted.push_back(name);
    EXPECT_EQ(deleted, names);

    // After a lost context the old names may be another object's: a target
    // destroyed before it was made again deletes nothing.
    auto* lost = new RenderableTexture(0, 0, 4, 4, false, false, false, false, true);
    lost->allocate();
    mContext.recreate();
    lost->contextChanged();
    GlRecorder::start();
    delete lost;
    EXPECT_EQ(GlRecorder::names(), Names{});
}

TEST_F(RenderTargetTest, NestedTargetIsDrawnFirstInsideTheOuterPassAndTheWindowIsBoundAgain) {
    // The inner target draws a red quad through its own projection, halved.
    vitest::ColourPainter innerPainter(glm::vec4(1, 0, 0, 1));
    std::vector<vi::Renderer*> innerRenderers = {innerPainter.renderer()};
    RenderableTexture inner(innerRenderers, 0, 0, 8, 8, false, false, false, false, false);
    inner.mTargetProjectionMatrix = glm::scale(glm::mat4(1.0f), glm::vec3(0.5f, 0.5f, 1.0f));
    vitest::TexturePainter outerPainter(&inner);
    std::vector<vi::Renderer*> outerRenderers = {outerPainter.renderer()};
    RenderableTexture outer(outerRenderers, 0, 0, 32, 32, false, false, false, false, true);
    outer.allocate();
    const glm::mat4 view = glm::translate(glm::mat4(1.0f), glm::vec3(0.0f, 0.3f, 0.0f));
    const glm::mat4 projection = glm::scale(glm::mat4(1.0f), glm::vec3(2.0f, 2.0f, 1.0f));
    vi::Drawable::mViewMatrix = view;
    vi::Drawable::mProjectionMatrix = projection;

    GlRecording recording;
    outer.renderFrame();
    GlRecorder::stop();
    EXPECT_EQ(GlRecorder::names({"glBindFramebuffer", "glViewport", "glClear", "glDrawArrays"}),
              (Names{"glBindFramebuffer", "glViewport", "glClear", "glBindFramebuffer", "glViewport", "glClear",
                     "glDrawArrays", "glBindFramebuffer", "glViewport", "glDrawArrays", "glBindFramebuffer",
                     "glViewport"}));
    EXPECT_EQ(argumentsOf("glBindFramebuffer", 1),
              (Args{double(outer.mFrameBuffer), double(inner.mFrameBuffer), double(outer.mFrameBuffer), 0}));
    EXPECT_EQ(argumentsOf("glViewport", 2), (Args{32, 8, 32, kWindow}));
    EXPECT_EQ(GlRecorder::callsNamed("glClearColor")[0].args, (Args{0, 0, 0, 1}));
    EXPECT_EQ(GlRecorder::callsNamed("glClear")[0].args[0], double(GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT));
    EXPECT_EQ(bindingNow(), bindingOf(0, 0, 0, kWindow, kWindow));
    EXPECT_EQ(vi::Drawable::mViewMatrix, view);
    EXPECT_EQ(vi::Drawable::mProjectionMatrix, projection);

    // The outer quad filled the outer viewport with the inner picture.
    const Words pixels = readTarget(outer);
    EXPECT_EQ(pixels[0], kBlack);
    EXPECT_EQ(pixels[16 * 32 + 16], kRed);
    EXPECT_EQ(pixels[31 * 32 + 31], kBlack);
}

TEST_F(RenderTargetTest, WrittenPixelsReadBackFromThePosition) {
    std::vector<std::uint8_t> pattern(8 * 8 * 4);
    for (std::size_t i = 0; i < pattern.size(); ++i) pattern[i] = std::uint8_t(i * 7 + 3);
    RenderableTexture origin(0, 0, 8, 8, false, false, false, false, false);
    origin.allocate();
    GlRecording recording;
    origin.writeBuffer(pattern.data());
    EXPECT_EQ(GlRecorder::callsNamed("glPixelStorei")[0].args, (Args{GL_PACK_ALIGNMENT, 1}));
    std::vector<std::uint8_t> back(pattern.size(), 0);
    GlRecorder::start();
    origin.readBuffer(back.data());
    EXPECT_EQ(back, pattern);
    EXPECT_EQ(GlRecorder::callsNamed("glPixelStorei")[0].args, (Args{GL_UNPACK_ALIGNMENT, 1}));

    RenderableTexture offset(2, 3, 8, 8, false, false, false, false, false);
    offset.writeBuffer(pattern.data());
    GlRecorder::start();
    offset.readBuffer(back.data());
    const Args read = GlRecorder::callsNamed("glReadPixels")[0].args;
    EXPECT_EQ(Args(read.begin(), read.begin() + 4), (Args{2, 3, 8, 8}));
    // Row r, column c of what was read is texel (2 + c, 3 + r) of the target.
    for (int r = 0; r < 5; ++r)
        for (int c = 0; c < 6; ++c)
            ASSERT_EQ(vitest::rgba(&back[std::size_t(r * 8 + c) * 4]),
                      vitest::rgba(&pattern[std::size_t((3 + r) * 8 + 2 + c) * 4])) << r << ", " << c;
    EXPECT_EQ(bindingNow(), bindingOf(0, 0, 0, kWindow, kWindow));
}

TEST_F(RenderTargetTest, ClearInsideAnAnchorFillsOnlyItsTargetAndAnchorsRestoreWhatTheyFound) {
    RenderableTexture a(0, 0, 8, 8, false, false, false, false, false);
    RenderableTexture b(0, 0, 4, 4, false, false, false, false, false);
    a.allocate();
    a.enableAnchor();
    EXPECT_EQ(bindingNow(), bindingOf(a.mFrameBuffer, 0, 0, 8, 8));
    glClearColor(1, 0, 0, 1);
    glClear(GL_COLOR_BUFFER_BIT);
    b.clear(glm::vec4(0, 1, 0, 1));
    EXPECT_EQ(bindingNow(), bindingOf(a.mFrameBuffer, 0, 0, 8, 8));
    b.enableAnchor();
    EXPECT_EQ(RenderableTexture::getViewportSize(), glm::ivec2(4, 4));
    b.disableAnchor();
    a.disableAnchor();
    EXPECT_EQ(bindingNow(), bindingOf(0, 0, 0, kWindow, kWindow));
    EXPECT_EQ(readTarget(a), Words(64, kRed));
    EXPECT_EQ(readTarget(b), Words(16, kGreen));
}

// The target is sampled on the second unit, beside a blue texture on the first.
TEST_F(RenderTargetTest, SampledDynamicTargetIsRedrawnForEveryDrawAndAStaticOneOnlyOnRequest) {
    vitest::ColourPainter dynamicSource(glm::vec4(1, 0, 0, 1)), staticSource(glm::vec4(1, 0, 0, 1));
    std::vector<vi::Renderer*> dynamicRenderers = {dynamicSource.renderer()};
    std::vector<vi::Renderer*> staticRenderers = {staticSource.renderer()};
    RenderableTexture dynamicTarget(dynamicRenderers, 0, 0, 4, 4, false, false, false, false, false);
    RenderableTexture staticTarget(staticRenderers, 0, 0, 4, 4, true, false, false, false, false);
    std::uint8_t blue[4] = {0, 0, 255, 255};
    vi::Texture plain(blue, 1, 1, true, false, false, false, false, 4, false);
    vitest::QuadPainter mixed("precision mediump float;\nuniform sampler2D uPlain;\nuniform sampler2D uTarget;\n"
                              "varying vec2 vUv;\nvoid main() {\n"
                              "  gl_FragColor = mix(texture2D(uPlain, vUv), texture2D(uTarget, vUv), 0.5);\n}\n");
    mixed.renderer()->addTexture("uPlain", &plain);
    mixed.renderer()->addTexture("uTarget", &dynamicTarget);
    vitest::TexturePainter showStatic(&staticTarget);
    staticTarget.renderFrame();

    GlRecording recording;
    EXPECT_TRUE(vitest::near(mixed.draw(4, 4)[5], 0x800080FF, 1));
    dynamicSource.colour = glm::vec4(0, 1, 0, 1);
    EXPECT_TRUE(vitest::near(mixed.draw(4, 4)[5], 0x008080FF, 1));
    EXPECT_EQ(GlRecorder::count("glClear"), 2);

    GlRecorder::start();
    staticSource.colour = glm::vec4(0, 1, 0, 1);
    EXPECT_EQ(showStatic.draw(4, 4)[5], kRed);
    EXPECT_EQ(GlRecorder::count("glClear"), 0);
    staticTarget.renderFrame();
    EXPECT_EQ(showStatic.draw(4, 4)[5], kGreen);
}

}  // namespace
