// A steady frame allocates nothing: repeated draws of a renderer with a
// dynamic attribute, uniforms, plain, dynamic and curve textures and a
// dynamic render target make no heap allocation after the first frame. The
// bench's counter sees every operator new, and the mallocs made from this
// executable, which holds the runtime (not the GL driver's bookkeeping).
#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <vector>

#include "AllocationCounter.h"
#include "Painters.h"
#include "Render/Curves.h"
#include "Render/RenderableTexture.h"

namespace {

// Any function of this executable: the counter watches the code holding it.
void* volatile gRaw;
int* volatile gMade;
void allocateRaw() { gRaw = std::malloc(16); }

TEST(SteadyFrame, AllocatesNothingAfterTheFirstFrameAndTheCounterSeesAllocations) {
    ASSERT_TRUE(vibench::AllocationCounter::watchCodeOf(reinterpret_cast<void*>(&allocateRaw)));
    vibench::AllocationCounter::start();
    gMade = new int(3);
    allocateRaw();
    const vibench::Allocations noticed = vibench::AllocationCounter::stop();
    delete gMade;
    std::free(gRaw);
    EXPECT_EQ(noticed.news, 1);
    EXPECT_EQ(noticed.mallocs, vibench::AllocationCounter::countsMallocs() ? 1 : 0);

    vitest::GlContext context(32, 32);
    vi::RenderableTexture::mCurrentFrameBufferSize = glm::ivec2(32, 32);
    std::vector<std::uint8_t> picture(4 * 4 * 4, 200), live(4 * 4 * 4, 30);
    vi::Texture pictureTexture(picture.data(), 4, 4, true, true, false, true, false, 4, false);
    vi::Texture liveTexture(live.data(), 4, 4, false, false, false, false, false, 4, false);
    const glm::vec2 points[] = {{0, 20}, {255, 230}};
    vi::Curves curves(points, 2, points, 2, points, 2);
    vitest::ColourPainter targetPainter(glm::vec4(0.2f, 0.4f, 0.6f, 1.0f));
    std::vector<vi::Renderer*> targetRenderers = {targetPainter.renderer()};
    vi::RenderableTexture target(targetRenderers, 0, 0, 8, 8, false, false, false, true, true);
    vitest::QuadPainter painter(
        "precision mediump float;\nuniform sampler2D uPicture;\nuniform sampler2D uLive;\n"
        "uniform sampler2D uCurve;\nuniform sampler2D uTarget;\nuniform vec4 uTint;\nuniform int uMode;\n"
        "varying vec2 vUv;\nvoid main() {\n  vec4 c = texture2D(uPicture, vUv) * uTint + texture2D(uLive, vUv);\n"
        "  c.r = texture2D(uCurve, vec2(0.5, c.r)).r;\n"
        "  gl_FragColor = mix(c, texture2D(uTarget, vUv), float(uMode) * 0.5);\n}\n");
    vi::Renderer& renderer = *painter.renderer();
    float offsets[8] = {};
    ASSERT_GE(renderer.addAttribute("aPosition", offsets, 2, false), 0);  // a second, dynamic copy
    glm::vec4 tint(1.0f);
    int mode = 1;
    renderer.addUniform("uTint", &tint[0], vi::Uniform::Float4, 1);
    renderer.addUniform("uMode", &mode, vi::Uniform::Int, 1);
    for (auto [name, texture] : {std::pair<const char*, vi::Texture*>{"uPicture", &pictureTexture},
                                 {"uLive", &liveTexture}, {"uCurve", curves.getTexture()}, {"uTarget", &target}})
        ASSERT_GE(renderer.addTexture(name, texture), 0) << name;
    renderer.render();  // the first frame may set things up

    vibench::AllocationCounter::start();
    for (int frame = 0; frame < 20; ++frame) {
        tint.g = 0.05f * float(frame);
        live[0] = std::uint8_t(frame);
        targetPainter.colour.r = 0.04f * float(frame);
        renderer.render();
    }
    glFinish();
    const vibench::Allocations counted = vibench::AllocationCounter::stop();
    EXPECT_EQ(counted.news, 0);
    EXPECT_EQ(counted.mallocs, 0);
}

}  // namespace
