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
#include "SamplerProbe.h"

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
const glm::vec4 kBlue(0, 0, 1, 1);
constexpr std::uint32_t kRedPixel = 0xFF0000FF, kGreenPixel = 0x00FF00FF, kBluePixel = 0x0000FFFF;
constexpr std::uint32_t kClearPixel = 0x000000FF;

// The binding as GL and the statics see it.
struct Binding {
    GLint frameBuffer;
    GLint viewport[4];
    GLuint staticFrameBuffer;
    glm::ivec2 staticPosition, staticSize;

    static Binding now() {
        Binding b{};
        glGetIntegerv(GL_FRAMEBUFFER_BINDING, &b.frameBuffer);
        glGetIntegerv(GL_VIEWPORT, b.viewport);
        b.staticFrameBuffer = RenderableTexture::mCurrentFrameBuffer;
        b.staticPosition = RenderableTexture::mCurrentFrameBufferPosition;
        b.staticSize = RenderableTexture::mCurrentFrameBufferSize;
        return b;
    }
    static Binding of(GLuint frameBuffer, int x, int y, int width, int height) {
        return Binding{GLint(frameBuffer), {x, y, width, height}, frameBuffer, {x, y}, {width, height}};
    }
    bool operator==(const Binding& o) const {
        return frameBuffer == o.frameBuffer && viewport[0] == o.viewport[0] && viewport[1] == o.viewport[1] &&
               viewport[2] == o.viewport[2] && viewport[3] == o.viewport[3] &&
               staticFrameBuffer == o.staticFrameBuffer && staticPosition == o.staticPosition &&
               staticSize == o.staticSize;
    }
};

std::ostream& operator<<(std::ostream& out, const Binding& b) {
    return out << "GL fb " << b.frameBuffer << " viewport " << b.viewport[0] << "," << b.viewport[1] << " "
               << b.viewport[2] << "x" << b.viewport[3] << "; statics fb " << b.staticFrameBuffer << " at "
               << b.staticPosition.x << "," << b.staticPosition.y << " " << b.staticSize.x << "x" << b.staticSize.y;
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
    void SetUp() override { useWindow(); }

    void TearDown() override {
        GlRecorder::stop();
        vi::Drawable::mViewMatrix = glm::mat4(1.0f);
        vi::Drawable::mProjectionMatrix = glm::mat4(1.0f);
    }

    // What an effect does before drawing to the window.
    void useWindow() {
        RenderableTexture::mCurrentFrameBuffer = 0;
        RenderableTexture::mCurrentFrameBufferPosition = glm::ivec2(0, 0);
        RenderableTexture::mCurrentFrameBufferSize = glm::ivec2(kWindow, kWindow);
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glViewport(0, 0, kWindow, kWindow);
    }

    GlContext mContext{kWindow, kWindow};
};

TEST_F(RenderTargetTest, PassWithoutRenderersMakesNoGlCall) {
    std::vector<vi::Renderer*> none;
    RenderableTexture listless(0, 0, 8, 8, false, false, false, false, false);
    RenderableTexture empty(none, 0, 0, 8, 8, false, false, false, false, false);
    EXPECT_EQ(listless.mRenderers, nullptr);
    EXPECT_EQ(empty.mRenderers, &none);
    EXPECT_EQ(listless.mKind, 1u);
    empty.allocate();
    GlRecording recording;
    listless.renderFrame();
    empty.renderFrame();
    EXPECT_TRUE(GlRecorder::names().empty());
}

TEST_F(RenderTargetTest, AllocationAttachesTheTextureOverTheRenderbufferAndReturnsToTheWindow) {
    RenderableTexture target(0, 0, 16, 8, false, true, false, true, true);
    const Binding before = Binding::now();
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
    EXPECT_EQ(GlRecorder::callsNamed("glTexImage2D")[0].args,
              (std::vector<double>{GL_TEXTURE_2D, 0, GL_RGBA, 16, 8, 0, GL_RGBA, GL_UNSIGNED_BYTE, 0}));
    EXPECT_EQ(GlRecorder::callsNamed("glBindFramebuffer").back().args, (std::vector<double>{GL_FRAMEBUFFER, 0}));
    EXPECT_EQ(Binding::now(), before);

    // The colour target in effect is the texture; the depth renderbuffer is attached.
    glBindFramebuffer(GL_FRAMEBUFFER, target.mFrameBuffer);
    GLint type = 0, name = 0, depthType = 0;
    glGetFramebufferAttachmentParameteriv(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0,
                                          GL_FRAMEBUFFER_ATTACHMENT_OBJECT_TYPE, &type);
    glGetFramebufferAttachmentParameteriv(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0,
                                          GL_FRAMEBUFFER_ATTACHMENT_OBJECT_NAME, &name);
    glGetFramebufferAttachmentParameteriv(GL_FRAMEBUFFER, GL_DEPTH_ATTACHMENT,
                                          GL_FRAMEBUFFER_ATTACHMENT_OBJECT_TYPE, &depthType);
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
    EXPECT_EQ(type, GL_TEXTURE);
    EXPECT_EQ(GLuint(name), target.mId);
    EXPECT_EQ(depthType, GL_RENDERBUFFER);
    EXPECT_EQ(glIsRenderbuffer(target.mColorBuffer), GL_TRUE);

    GlRecording again;
    target.allocate();
    EXPECT_TRUE(GlRecorder::names().empty());
}

TEST_F(RenderTargetTest, StaticTargetGetsItsStorageOnceAndBindNeverUploads) {
    RenderableTexture target(0, 0, 4, 4, true, false, false, false, false);
    GlRecording recording;
    target.allocate();
    EXPECT_EQ(GlRecorder::count("glTexImage2D"), 1);
    EXPECT_EQ(GlRecorder::count("glGenRenderbuffers"), 1);

    GlRecorder::clear();
    target.bind(4, 1);
    EXPECT_EQ(GlRecorder::names(), (std::vector<std::string>{"glActiveTexture", "glBindTexture", "glUniform1i"}));
    EXPECT_EQ(GlRecorder::callsNamed("glActiveTexture")[0].args[0], double(GL_TEXTURE1));
    EXPECT_EQ(GlRecorder::callsNamed("glBindTexture")[0].args,
              (std::vector<double>{GL_TEXTURE_2D, double(target.mId)}));
    EXPECT_EQ(GlRecorder::callsNamed("glUniform1i")[0].args, (std::vector<double>{4, 1}));

    // A dynamic target's bind does not upload either.
    RenderableTexture dynamic(0, 0, 4, 4, false, false, false, false, false);
    dynamic.allocate();
    GlRecorder::clear();
    dynamic.bind(0, 0);
    EXPECT_EQ(GlRecorder::names(), (std::vector<std::string>{"glActiveTexture", "glBindTexture", "glUniform1i"}));
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
    const Binding before = Binding::now();

    GlRecording recording;
    target.renderFrame();
    GlRecorder::stop();

    EXPECT_EQ(Binding::now(), before);
    EXPECT_EQ(vi::Drawable::mViewMatrix, view);
    EXPECT_EQ(vi::Drawable::mProjectionMatrix, projection);
    EXPECT_EQ(GlRecorder::callsNamed("glClearColor")[0].args, (std::vector<double>{0, 0, 0, 1}));
    EXPECT_EQ(GlRecorder::callsNamed("glClear")[0].args[0], double(GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT));

    // The quad, halved by the target's projection, sits in the middle.
    const std::vector<std::uint32_t> pixels = readTarget(target);
    EXPECT_EQ(pixelOf(pixels, target, 8, 8), kRedPixel);
    EXPECT_EQ(pixelOf(pixels, target, 5, 10), kRedPixel);
    EXPECT_EQ(pixelOf(pixels, target, 1, 1), kClearPixel);
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
    const Binding before = Binding::now();

    GlRecording recording;
    outer.renderFrame();
    GlRecorder::stop();

    std::vector<std::string> sequence;
    std::vector<std::vector<double>> arguments;
    for (const GlCall& call : GlRecorder::calls())
        if (call.name == "glBindFramebuffer" || call.name == "glViewport" || call.name == "glClear" ||
            call.name == "glDrawArrays") {
            sequence.push_back(call.name);
            arguments.push_back(call.args);
        }
    const std::vector<std::string> expected = {
        "glBindFramebuffer", "glViewport",   "glClear",           "glBindFramebuffer", "glViewport", "glClear",
        "glDrawArrays",      "glBindFramebuffer", "glViewport",   "glDrawArrays",      "glBindFramebuffer",
        "glViewport"};
    ASSERT_EQ(sequence, expected);
    const double o = outer.mFrameBuffer, i = inner.mFrameBuffer;
    EXPECT_EQ(arguments[0], (std::vector<double>{GL_FRAMEBUFFER, o}));
    EXPECT_EQ(arguments[1], (std::vector<double>{0, 0, 32, 32}));
    EXPECT_EQ(arguments[3], (std::vector<double>{GL_FRAMEBUFFER, i}));
    EXPECT_EQ(arguments[4], (std::vector<double>{0, 0, 8, 8}));
    EXPECT_EQ(arguments[7], (std::vector<double>{GL_FRAMEBUFFER, o}));
    EXPECT_EQ(arguments[8], (std::vector<double>{0, 0, 32, 32}));
    EXPECT_EQ(arguments[10], (std::vector<double>{GL_FRAMEBUFFER, 0}));
    EXPECT_EQ(arguments[11], (std::vector<double>{0, 0, kWindow, kWindow}));

    EXPECT_EQ(Binding::now(), before);
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
    const bool wasUploaded = origin.mIsUploaded;
    GlRecording recording;
    origin.writeBuffer(pattern.data());
    EXPECT_EQ(GlRecorder::names(), (std::vector<std::string>{"glBindTexture", "glPixelStorei", "glTexSubImage2D"}));
    EXPECT_EQ(GlRecorder::callsNamed("glPixelStorei")[0].args, (std::vector<double>{GL_PACK_ALIGNMENT, 1}));
    EXPECT_EQ(origin.mIsUploaded, wasUploaded);

    std::vector<std::uint8_t> back(pattern.size(), 0);
    GlRecorder::clear();
    origin.readBuffer(back.data());
    EXPECT_EQ(back, pattern);
    EXPECT_EQ(GlRecorder::names(), (std::vector<std::string>{"glBindFramebuffer", "glViewport", "glPixelStorei",
                                                             "glReadPixels", "glBindFramebuffer", "glViewport"}));
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
    EXPECT_EQ(Binding::now(), Binding::of(0, 0, 0, kWindow, kWindow));
}

TEST_F(RenderTargetTest, AnchorsOfTwoTargetsNest) {
    RenderableTexture a(1, 2, 8, 8, false, false, false, false, false);
    RenderableTexture b(0, 0, 4, 4, false, false, false, false, false);
    a.allocate();
    b.allocate();
    const Binding window = Binding::now();

    a.enableAnchor();
    EXPECT_EQ(Binding::now(), Binding::of(a.mFrameBuffer, 1, 2, 8, 8));
    b.enableAnchor();
    EXPECT_EQ(Binding::now(), Binding::of(b.mFrameBuffer, 0, 0, 4, 4));
    EXPECT_EQ(RenderableTexture::getViewportSize(), glm::ivec2(4, 4));
    EXPECT_EQ(&RenderableTexture::getViewportSize(), &RenderableTexture::mCurrentFrameBufferSize);
    glClearColor(0, 1, 0, 1);
    glClear(GL_COLOR_BUFFER_BIT);
    b.disableAnchor();
    EXPECT_EQ(Binding::now(), Binding::of(a.mFrameBuffer, 1, 2, 8, 8));
    a.disableAnchor();
    EXPECT_EQ(Binding::now(), window);

    // What was drawn between B's anchor calls went to B.
    EXPECT_EQ(readTarget(b), std::vector<std::uint32_t>(16, kGreenPixel));
}

TEST_F(RenderTargetTest, ClearAndSingleRendererPassesUseTheCurrentMatricesAndRestore) {
    RenderableTexture target(0, 0, 16, 16, false, false, false, false, false);
    ColourPainter red(kRed);
    ColourPainter green(kGreen);
    target.mTargetProjectionMatrix = glm::scale(glm::mat4(1.0f), glm::vec3(0.1f));
    vi::Drawable::mProjectionMatrix = glm::scale(glm::mat4(1.0f), glm::vec3(0.5f, 0.5f, 1.0f));
    const Binding window = Binding::now();

    target.clear(kBlue);
    EXPECT_EQ(Binding::now(), window);
    EXPECT_EQ(readTarget(target), std::vector<std::uint32_t>(256, kBluePixel));

    target.renderFrame(red.renderer(), false, kGreen);
    EXPECT_EQ(Binding::now(), window);
    std::vector<std::uint32_t> pixels = readTarget(target);
    EXPECT_EQ(pixelOf(pixels, target, 8, 8), kRedPixel);
    EXPECT_EQ(pixelOf(pixels, target, 4, 4), kRedPixel);  // the caller's half-size projection
    EXPECT_EQ(pixelOf(pixels, target, 1, 1), kBluePixel);

    vi::Drawable::mProjectionMatrix = glm::mat4(1.0f);
    green.colour = glm::vec4(0, 1, 0, 1);
    target.renderFrame(green.renderer(), true, glm::vec4(1, 1, 1, 1));
    pixels = readTarget(target);
    EXPECT_EQ(pixelOf(pixels, target, 1, 1), kGreenPixel);
    EXPECT_EQ(Binding::now(), window);
}

TEST_F(RenderTargetTest, DestructionReleasesFramebufferObjectsOnlyOnceAllocated) {
    auto* untouched = new RenderableTexture(0, 0, 4, 4, false, false, false, false, true);
    GlRecording recording;
    delete untouched;
    EXPECT_TRUE(GlRecorder::names().empty());

    auto* target = new RenderableTexture(0, 0, 4, 4, false, false, false, false, true);
    target->allocate();
    const double frameBuffer = target->mFrameBuffer, colour = target->mColorBuffer, depth = target->mDepthBuffer,
                 texture = target->mId;
    RenderableTexture::mCurrentFrameBuffer = 77;
    GlRecorder::clear();
    delete target;
    GlRecorder::stop();
    EXPECT_EQ(RenderableTexture::mCurrentFrameBuffer, 77u);
    const std::vector<GlCall> calls = GlRecorder::calls();
    ASSERT_EQ(calls.size(), 7u);
    const std::vector<std::pair<std::string, std::vector<double>>> expected = {
        {"glBindFramebuffer", {GL_FRAMEBUFFER, 0}},  {"glBindRenderbuffer", {GL_RENDERBUFFER, 0}},
        {"glDeleteFramebuffers", {1, frameBuffer}},  {"glDeleteRenderbuffers", {1, colour}},
        {"glDeleteRenderbuffers", {1, depth}},       {"glBindTexture", {GL_TEXTURE_2D, 0}},
        {"glDeleteTextures", {1, texture}}};
    for (std::size_t k = 0; k < expected.size(); ++k) {
        EXPECT_EQ(calls[k].name, expected[k].first);
        EXPECT_EQ(calls[k].args, expected[k].second) << calls[k].name;
    }
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
    EXPECT_EQ(showDynamic.renderer()->renderTargets.size(), 1u);
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

TEST_F(RenderTargetTest, LostContextRebuildsTheTarget) {
    RenderableTexture target(0, 0, 4, 4, false, false, false, false, true);
    target.allocate();
    mContext.recreate();
    useWindow();
    target.contextChanged();
    EXPECT_EQ(target.mFrameBuffer, 0u);
    EXPECT_EQ(target.mId, 0u);
    EXPECT_FALSE(target.mIsUploaded);

    GlRecording recording;
    target.clear(kBlue);
    GlRecorder::stop();
    EXPECT_EQ(GlRecorder::count("glGenFramebuffers"), 1);
    EXPECT_EQ(GlRecorder::count("glGenTextures"), 1);
    EXPECT_EQ(readTarget(target), std::vector<std::uint32_t>(16, kBluePixel));
}

}  // namespace
