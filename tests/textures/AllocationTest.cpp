// A steady frame allocates nothing: repeated draws of a renderer with
// attributes, uniforms, plain, dynamic and curve textures and a dynamic
// render target make no heap allocation after the first frame. The counter
// (the bench's) sees every operator new, and the mallocs made from this
// executable, which holds the runtime (not the GL driver's bookkeeping).
#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <vector>

#include "AllocationCounter.h"
#include "GlContext.h"
#include "Painters.h"
#include "Render/Curves.h"
#include "Render/RenderableTexture.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"

namespace {

// Any function of this executable: the counter watches the code holding it.
void* volatile gRaw;
void allocateRaw() { gRaw = std::malloc(16); }

const char* const kVertex =
    "attribute vec2 aPosition;\n"
    "attribute vec2 aOffset;\n"
    "uniform mat4 uModelViewProjectionMatrix;\n"
    "varying vec2 vUv;\n"
    "void main() {\n"
    "  vUv = aPosition * 0.5 + 0.5;\n"
    "  gl_Position = uModelViewProjectionMatrix * vec4(aPosition + aOffset, 0.0, 1.0);\n"
    "}\n";
const char* const kFragment =
    "precision mediump float;\n"
    "uniform sampler2D uPicture;\n"
    "uniform sampler2D uLive;\n"
    "uniform sampler2D uCurve;\n"
    "uniform sampler2D uTarget;\n"
    "uniform vec4 uTint;\n"
    "uniform float uMix;\n"
    "uniform int uMode;\n"
    "varying vec2 vUv;\n"
    "void main() {\n"
    "  vec4 c = texture2D(uPicture, vUv) * uTint + texture2D(uLive, vUv) * uMix;\n"
    "  c.r = texture2D(uCurve, vec2(0.5, c.r)).r;\n"
    "  gl_FragColor = mix(c, texture2D(uTarget, vUv), float(uMode) * 0.5);\n"
    "}\n";

TEST(SteadyFrame, AllocatesNothingAfterTheFirstFrame) {
    vitest::GlContext context(32, 32);
    vi::RenderableTexture::mCurrentFrameBufferSize = glm::ivec2(32, 32);

    std::vector<std::uint8_t> picture(4 * 4 * 4, 200);
    std::vector<std::uint8_t> live(4 * 4 * 4, 30);
    vi::Texture pictureTexture(picture.data(), 4, 4, true, true, false, true, false, 4, false);
    vi::Texture liveTexture(live.data(), 4, 4, false, false, false, false, false, 4, false);
    const glm::vec2 curvePoints[] = {{0, 20}, {255, 230}};
    vi::Curves curves(curvePoints, 2, curvePoints, 2, curvePoints, 2);

    vitest::ColourPainter targetPainter(glm::vec4(0.2f, 0.4f, 0.6f, 1.0f));
    std::vector<vi::Renderer*> targetRenderers = {targetPainter.renderer()};
    vi::RenderableTexture target(targetRenderers, 0, 0, 8, 8, false, false, false, true, true);

    vitest::Quad quad;
    float offsets[8] = {};
    vi::ShaderProgram program(kVertex, kFragment);
    vi::Renderer renderer(program, quad);
    renderer.addAttribute("aPosition", quad.positions, 2, true);
    ASSERT_GE(renderer.addAttribute("aOffset", offsets, 2, false), 0);
    glm::vec4 tint(1.0f);
    float mixing = 0.5f;
    int mode = 1;
    renderer.addUniform("uTint", &tint[0], vi::Uniform::Float4, 1);
    renderer.addUniform("uMix", &mixing, vi::Uniform::Float, 1);
    renderer.addUniform("uMode", &mode, vi::Uniform::Int, 1);
    renderer.addTexture("uPicture", &pictureTexture);
    renderer.addTexture("uLive", &liveTexture);
    renderer.addTexture("uCurve", curves.getTexture());
    renderer.addTexture("uTarget", &target);
    ASSERT_EQ(renderer.textures.size(), 4u);
    ASSERT_EQ(renderer.renderTargets.size(), 1u);

    renderer.render();  // the first frame may set things up

    ASSERT_TRUE(vibench::AllocationCounter::watchCodeOf(reinterpret_cast<void*>(&allocateRaw)));
    vibench::AllocationCounter::start();
    for (int frame = 0; frame < 20; ++frame) {
        tint.g = 0.05f * float(frame);
        live[0] = std::uint8_t(frame);
        offsets[0] = 0.01f * float(frame);
        targetPainter.colour.r = 0.04f * float(frame);
        renderer.render();
    }
    glFinish();
    const vibench::Allocations counted = vibench::AllocationCounter::stop();
    EXPECT_EQ(counted.news, 0);
    EXPECT_EQ(counted.mallocs, 0);
}

// The counter itself must see what it is meant to see.
int* volatile gMade;

TEST(SteadyFrame, CountersNoticeAllocations) {
    ASSERT_TRUE(vibench::AllocationCounter::watchCodeOf(reinterpret_cast<void*>(&allocateRaw)));
    vibench::AllocationCounter::start();
    gMade = new int(3);
    allocateRaw();
    const vibench::Allocations counted = vibench::AllocationCounter::stop();
    EXPECT_EQ(counted.news, 1);
    EXPECT_EQ(counted.mallocs, vibench::AllocationCounter::countsMallocs() ? 1 : 0);
    std::free(gRaw);
    delete gMade;
}

}  // namespace
