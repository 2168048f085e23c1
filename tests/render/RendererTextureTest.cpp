// Renderers with textures: sampler binding, render targets drawn before they
// are sampled, and a textured quad read back pixel for pixel.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "GlContext.h"
#include "GlRecorder.h"
#include "Painters.h"
#include "Pictures.h"
#include "Render/Drawable.h"
#include "Render/GeometryRectangle.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"

using vitest::GlCall;
using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;
using vitest::uniformFloats;

namespace {

const char* const kQuadVertex =
    "attribute vec3 aPosition;\n"
    "attribute vec2 aTexCoord;\n"
    "uniform mat4 uModelViewProjectionMatrix;\n"
    "varying vec2 vTexCoord;\n"
    "void main() {\n"
    "  vTexCoord = aTexCoord;\n"
    "  gl_Position = uModelViewProjectionMatrix * vec4(aPosition, 1.0);\n"
    "}\n";
const char* const kTwoSamplersFragment =
    "precision mediump float;\n"
    "uniform sampler2D uFirst;\n"
    "uniform sampler2D uSecond;\n"
    "uniform vec2 uFirstSize;\n"
    "uniform vec2 uFirstTexelSize;\n"
    "uniform vec2 uSecondTexelSize;\n"
    "varying vec2 vTexCoord;\n"
    "void main() {\n"
    "  gl_FragColor = texture2D(uFirst, vTexCoord * uFirstSize * uFirstTexelSize)\n"
    "               + texture2D(uSecond, vTexCoord + uSecondTexelSize);\n"
    "}\n";

constexpr int kTexels = 4;

// Distinct colour per texel, rows in memory order (row 0 first).
std::vector<std::uint8_t> texelPattern() {
    std::vector<std::uint8_t> pixels;
    for (int y = 0; y < kTexels; ++y)
        for (int x = 0; x < kTexels; ++x)
            pixels.insert(pixels.end(), {std::uint8_t(10 + 60 * x), std::uint8_t(20 + 60 * y),
                                         std::uint8_t(200 - 10 * x * y), 255});
    return pixels;
}

std::uint32_t texel(const std::vector<std::uint8_t>& pixels, int x, int y) {
    return vitest::rgba(&pixels[std::size_t(4 * (y * kTexels + x))]);
}

// A quad over the whole viewport, drawn from a rectangle's arrays.
struct ScreenQuad {
    ScreenQuad() {
        rectangle.construct(glm::vec3(-1.0f, -1.0f, 0.0f), glm::vec2(2.0f, 2.0f));
        drawable.mode = rectangle.mode;
        drawable.indices = rectangle.indices.data();
        drawable.elementCount = unsigned(rectangle.indices.size());
        drawable.vertexCount = unsigned(rectangle.positions.size());
        drawable.positions = &rectangle.positions[0].x;
        drawable.texCoords = &rectangle.texCoords[0].x;
    }
    vi::GeometryRectangle rectangle;
    vi::Drawable drawable;
};

class RendererTextureTest : public ::testing::Test {
protected:
    void TearDown() override { GlRecorder::stop(); }

    GlContext mGl{16, 16};
};

}  // namespace

TEST_F(RendererTextureTest, SamplersGetUnitsInOrderWithSizeUniformsAndNullOrUnknownOnesAreDropped) {
    vi::ShaderProgram program(kQuadVertex, kTwoSamplersFragment);
    ScreenQuad quad;
    vi::Renderer renderer(program, quad.drawable);
    std::vector<std::uint8_t> pixels = texelPattern();
    vi::Texture first(pixels.data(), 4, 2, true, false, false, false, false, 4, false);
    vi::Texture second(pixels.data(), 2, 8, false, false, false, false, false, 4, false);
    vi::Texture unused(pixels.data(), 2, 2, true, false, false, false, false, 4, false);
    const size_t uniformsBefore = renderer.uniforms.size();

    // Neither a null texture nor an unknown sampler leaves a trace.
    EXPECT_EQ(renderer.addTexture("uFirst", nullptr), -1);
    EXPECT_EQ(renderer.addTexture("uMissing", &unused), -1);
    EXPECT_EQ(renderer.addTexture("uFirst", &first), 0);
    EXPECT_EQ(renderer.addTexture("uSecond", &second), 1);
    // uFirstSize, uFirstTexelSize and uSecondTexelSize: the program has no uSecondSize.
    EXPECT_EQ(renderer.uniforms.size(), uniformsBefore + 3);

    GlRecording recording;
    renderer.render();
    GlRecorder::stop();
    const GLint firstLocation = glGetUniformLocation(program.program, "uFirst");
    const GLint secondLocation = glGetUniformLocation(program.program, "uSecond");
    const std::vector<GlCall> binds = GlRecorder::callsNamed("glUniform1i");
    ASSERT_EQ(binds.size(), 2u);
    EXPECT_EQ(binds[0].args, (std::vector<double>{double(firstLocation), 0}));
    EXPECT_EQ(binds[1].args, (std::vector<double>{double(secondLocation), 1}));
    // Uniforms before textures, textures before the draw.
    const std::vector<std::string> order =
        GlRecorder::names({"glUniform2fv", "glActiveTexture", "glDrawElements"});
    EXPECT_EQ(order, (std::vector<std::string>{"glUniform2fv", "glUniform2fv", "glUniform2fv", "glActiveTexture",
                                               "glActiveTexture", "glDrawElements"}));

    EXPECT_EQ(uniformFloats(program.program, "uFirstSize", 2), (std::vector<float>{4, 2}));
    EXPECT_EQ(uniformFloats(program.program, "uFirstTexelSize", 2), (std::vector<float>{0.25f, 0.5f}));
    EXPECT_EQ(uniformFloats(program.program, "uSecondTexelSize", 2), (std::vector<float>{0.5f, 0.125f}));
}

TEST_F(RendererTextureTest, TexturedQuadReadsBackAsTheTextureWithItsTopRowUp) {
    vi::ShaderProgram program(kQuadVertex, vitest::textureFragmentShader());
    ScreenQuad quad;
    std::vector<std::uint8_t> pixels = texelPattern();
    vi::Texture texture(pixels.data(), kTexels, kTexels, true, false, false, false, false, 4, false);
    vi::Renderer renderer(program, quad.drawable);
    renderer.addAttribute("aPosition", quad.drawable.positions, 3, true);
    renderer.addAttribute("aTexCoord", quad.drawable.texCoords, 2, true);
    renderer.addTexture("uTexture", &texture);

    glClearColor(0.0f, 0.0f, 0.0f, 0.0f);
    glClear(GL_COLOR_BUFFER_BIT);
    renderer.render();
    const int size = mGl.width();
    const std::vector<std::uint32_t> frame = vitest::readWords(0, 0, size, size);
    const int scale = size / kTexels;
    for (int y = 0; y < size; ++y)
        for (int x = 0; x < size; ++x)
            ASSERT_EQ(frame[std::size_t(y * size + x)], texel(pixels, x / scale, kTexels - 1 - y / scale))
                << "pixel " << x << ", " << y;
}
