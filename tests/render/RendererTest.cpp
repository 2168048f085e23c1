// Renderers on a real context: what they bind by name, what they upload at
// each draw, the matrices they derive, the sampler units and the registry.
#include <gtest/gtest.h>

#include <glm/gtc/matrix_transform.hpp>

#include <cstdint>
#include <string>
#include <vector>

#include "GlContext.h"
#include "GlRecorder.h"
#include "Pictures.h"
#include "Render/Drawable.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"

using vitest::GlCall;
using vitest::GlRecorder;
using vitest::uniformFloats;
using Args = std::vector<double>;
using Names = std::vector<std::string>;

namespace {

const char* const kStandardVertex =
    "attribute vec3 aPosition;\n"
    "uniform mat4 uModelMatrix;\n"
    "uniform mat4 uViewMatrix;\n"
    "uniform mat3 uNormalMatrix;\n"
    "uniform mat4 uProjectionMatrix;\n"
    "uniform mat4 uModelViewProjectionMatrix;\n"
    "varying vec3 vNormal;\n"
    "void main() {\n"
    "  vNormal = uNormalMatrix * aPosition;\n"
    "  gl_Position = uModelViewProjectionMatrix * vec4(aPosition, 1.0)\n"
    "              + uProjectionMatrix * uViewMatrix * uModelMatrix * vec4(vNormal, 0.0);\n"
    "}\n";
const char* const kOpacityFragment =
    "precision mediump float;\n"
    "uniform float uOpacity;\n"
    "varying vec3 vNormal;\n"
    "void main() { gl_FragColor = vec4(vNormal, uOpacity); }\n";
const char* const kTwoAttributesVertex =
    "attribute vec2 aPosition;\n"
    "attribute vec2 aOffset;\n"
    "void main() { gl_Position = vec4(aPosition + aOffset, 0.0, 1.0); }\n";
const char* const kPlainFragment = "precision mediump float;\nvoid main() { gl_FragColor = vec4(1.0); }\n";

double address(const void* p) { return double(reinterpret_cast<std::uintptr_t>(p)); }

template <int N>
void expectNear(const glm::mat<N, N, float>& actual, const glm::mat<N, N, float>& expected, float tolerance = 1e-5f) {
    for (int c = 0; c < N; ++c)
        for (int r = 0; r < N; ++r) EXPECT_NEAR(actual[c][r], expected[c][r], tolerance) << c << ", " << r;
}

// A turned, unevenly scaled and moved model: its normal matrix is not its rotation.
glm::mat4 skewedModel() {
    const glm::mat4 moved = glm::translate(glm::mat4(1.0f), glm::vec3(0.5f, -1.0f, -3.0f));
    return glm::scale(glm::rotate(moved, 0.6f, glm::vec3(1, 2, 0.5f)), glm::vec3(2.0f, 0.5f, 1.5f));
}

class RendererTest : public testing::Test {
protected:
    void TearDown() override {
        GlRecorder::stop();
        vi::Drawable::mProjectionMatrix = vi::Drawable::mViewMatrix = glm::mat4(1.0f);
    }

    vitest::GlContext mGl{16, 16};
};

}  // namespace

TEST_F(RendererTest, StandardUniformsAreBoundByNameAndReadFromTheDrawableAtEachDraw) {
    vi::ShaderProgram program(kStandardVertex, kOpacityFragment);
    vi::Drawable drawable;
    vitest::GlRecording recording;
    vi::Renderer renderer(program, drawable);
    Names looked;
    for (const GlCall& call : GlRecorder::callsNamed("glGetUniformLocation")) looked.push_back(call.text);
    EXPECT_EQ(looked, (Names{"uModelMatrix", "uViewMatrix", "uNormalMatrix", "uProjectionMatrix",
                             "uModelViewProjectionMatrix", "uOpacity"}));
    float value = 0.5f;
    EXPECT_EQ(renderer.addUniform("uMissing", &value, vi::Uniform::Float, 1), -1);
    EXPECT_EQ(renderer.addAttribute("aMissing", &value, 1, true), -1);
    EXPECT_EQ(renderer.uniforms.size(), 6u);
    EXPECT_TRUE(renderer.attributes.empty());

    vi::Drawable::mProjectionMatrix = glm::perspective(0.8f, 0.75f, 0.5f, 20.0f);
    vi::Drawable::mViewMatrix = glm::lookAt(glm::vec3(1, 2, 5), glm::vec3(0), glm::vec3(0, 1, 0));
    drawable.modelMatrix = skewedModel();
    drawable.opacity = 0.25f;
    renderer.render();
    const GLuint p = program.program;
    EXPECT_EQ(uniformFloats(p, "uViewMatrix", 16), std::vector<float>(&vi::Drawable::mViewMatrix[0][0],
                                                                      &vi::Drawable::mViewMatrix[0][0] + 16));
    EXPECT_EQ(uniformFloats(p, "uModelMatrix", 16)[12], 0.5f);
    EXPECT_EQ(uniformFloats(p, "uNormalMatrix", 9)[4], drawable.normalMatrix[1][1]);
    EXPECT_EQ(uniformFloats(p, "uModelViewProjectionMatrix", 16)[14], drawable.modelViewProjectionMatrix[3][2]);
    EXPECT_EQ(uniformFloats(p, "uOpacity", 1), std::vector<float>{0.25f});
}

TEST_F(RendererTest, DynamicAttributesAndChangedIndicesGoUpAgainAtTheDrawStaticOnesOnce) {
    vi::ShaderProgram program(kTwoAttributesVertex, kPlainFragment);
    const unsigned short indices[6] = {0, 1, 2, 2, 1, 3};
    const float positions[8] = {-1, -1, -1, 1, 1, -1, 1, 1};
    const float offsets[8] = {};
    vi::Drawable drawable;
    drawable.mode = GL_TRIANGLES;
    drawable.vertexCount = 4;
    drawable.elementCount = 6;
    drawable.indices = indices;
    vitest::GlRecording recording;
    vi::Renderer renderer(program, drawable);
    EXPECT_EQ(renderer.addAttribute("aPosition", positions, 2, true), 0);
    EXPECT_EQ(renderer.addAttribute("aOffset", offsets, 2, false), 1);
    const std::vector<GlCall> made = GlRecorder::callsNamed("glBufferData");
    EXPECT_EQ(made[0].args, (Args{GL_ELEMENT_ARRAY_BUFFER, 12, address(indices), GL_STATIC_DRAW}));
    EXPECT_EQ(made[1].args, (Args{GL_ARRAY_BUFFER, 32, address(positions), GL_STATIC_DRAW}));
    EXPECT_EQ(made[2].args, (Args{GL_ARRAY_BUFFER, 32, address(offsets), GL_STREAM_DRAW}));

    // Counts are read at draw time; indices go up again only when marked changed.
    const Names draw = {"glUseProgram", "glBindBuffer", "glVertexAttribPointer", "glBindBuffer", "glBufferData",
                        "glVertexAttribPointer", "glBindBuffer", "glDrawElements"};
    GlRecorder::start();
    renderer.render();
    EXPECT_EQ(GlRecorder::names(), draw);
    EXPECT_EQ(GlRecorder::calls()[3].args[1], renderer.attributes[1]->buffer);
    EXPECT_EQ(GlRecorder::calls()[7].args, (Args{GL_TRIANGLES, 6, GL_UNSIGNED_SHORT, 0}));
    drawable.vertexCount = 3;
    drawable.elementCount = 3;
    drawable.indicesChanged = true;
    GlRecorder::start();
    renderer.render();
    EXPECT_FALSE(drawable.indicesChanged);
    const std::vector<GlCall> uploads = GlRecorder::callsNamed("glBufferData");
    ASSERT_EQ(uploads.size(), 2u);
    EXPECT_EQ(uploads[0].args[1], 24);
    EXPECT_EQ(uploads[1].args, (Args{GL_ELEMENT_ARRAY_BUFFER, 6, address(indices), GL_STATIC_DRAW}));
    EXPECT_EQ(GlRecorder::calls().back().args[1], 3);
}

TEST_F(RendererTest, EveryUniformTypeReachesTheProgramAndAnUnknownTypeUploadsNothing) {
    vi::ShaderProgram program("attribute vec2 aPosition;\nuniform mat2 uM2;\nuniform mat3 uM3;\nuniform mat4 uM4;\n"
                              "uniform int uI1;\nuniform ivec2 uI2;\nuniform ivec3 uI3;\nuniform ivec4 uI4;\n"
                              "uniform float uF1;\nuniform vec2 uF2;\nuniform vec3 uF3;\nuniform vec4 uF4[2];\n"
                              "uniform float uUnknown;\nvoid main() {\n"
                              "  float s = (uM2 * vec2(1.0)).x + (uM3 * vec3(1.0)).y + (uM4 * vec4(1.0)).z\n"
                              "    + float(uI1 + uI2.y + uI3.z + uI4.w) + uF1 + uF2.y + uF3.z + uF4[0].w + uF4[1].x\n"
                              "    + uUnknown;\n  gl_Position = vec4(aPosition, s, 1.0);\n}\n",
                              kPlainFragment);
    vi::Drawable drawable;
    vi::Renderer renderer(program, drawable);
    const float f[16] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16};
    const int i[4] = {7, 8, 9, 10};
    const char* const names[] = {"uM2", "uM3", "uM4", "uI1", "uI2", "uI3", "uI4", "uF1", "uF2", "uF3", "uF4"};
    for (int type = 0; type < 11; ++type)
        renderer.addUniform(names[type], type >= 3 && type <= 6 ? static_cast<const void*>(i) : f,
                            vi::Uniform::UniformType(type), type == 10 ? 2 : 1);
    EXPECT_EQ(renderer.addUniform("uUnknown", f, vi::Uniform::UniformType(11), 1), 11);
    vitest::GlRecording recording;
    renderer.render();
    const Names uploads = {"glUniformMatrix2fv", "glUniformMatrix3fv", "glUniformMatrix4fv", "glUniform1iv",
                           "glUniform2iv",       "glUniform3iv",       "glUniform4iv",       "glUniform1fv",
                           "glUniform2fv",       "glUniform3fv",       "glUniform4fv"};
    EXPECT_EQ(GlRecorder::names(uploads), uploads);
    const GLuint p = program.program;
    EXPECT_EQ(uniformFloats(p, "uM3", 9), std::vector<float>(f, f + 9));
    EXPECT_EQ(uniformFloats(p, "uF4[1]", 4), std::vector<float>(f + 4, f + 8));
    EXPECT_EQ(uniformFloats(p, "uUnknown", 1), std::vector<float>{0.0f});
    GLint ints[4] = {};
    glGetUniformiv(p, glGetUniformLocation(p, "uI3"), ints);
    EXPECT_EQ(std::vector<int>(ints, ints + 3), (std::vector<int>{7, 8, 9}));
}

TEST_F(RendererTest, DerivedMatricesTakeTheCentredAffineShortcutAndMatchGlmWhereItHolds) {
    vi::Drawable drawable;
    auto derive = [&](const glm::mat4& projection, const glm::mat4& view, const glm::mat4& model) {
        vi::Drawable::mProjectionMatrix = projection;
        vi::Drawable::mViewMatrix = view;
        drawable.modelMatrix = model;
        drawable.deriveMatrices();
    };
    const glm::mat4 view = glm::lookAt(glm::vec3(-2, 3, 6), glm::vec3(0, 1, 0), glm::vec3(0, 1, 0));
    const glm::mat4 model = skewedModel();
    const glm::mat4 perspective = glm::perspective(1.1f, 0.6f, 0.1f, 50.0f);
    derive(perspective, view, model);
    expectNear(drawable.normalMatrix, glm::transpose(glm::inverse(glm::mat3(model))));
    expectNear(drawable.modelViewMatrix, view * model);
    expectNear(drawable.modelViewProjectionMatrix, perspective * view * model, 1e-4f);

    // An off-centre frustum: only elements 0, 5, 10, 11, 12, 13, 14 and 15 count.
    const glm::mat4 frustum = glm::frustum(-1.0f, 3.0f, -2.0f, 1.0f, 1.0f, 10.0f);
    glm::mat4 centred(0.0f);
    for (int e : {0, 5, 10, 11, 12, 13, 14, 15}) centred[e / 4][e % 4] = frustum[e / 4][e % 4];
    derive(frustum, view, model);
    expectNear(drawable.modelViewProjectionMatrix, centred * view * model, 1e-4f);

    // The bottom rows of the view and the model are never read.
    glm::mat4 oddView = view, oddModel = model;
    oddView[0][3] = 0.3f;
    oddView[3][3] = 2.0f;
    oddModel[1][3] = -0.4f;
    derive(glm::mat4(1.0f), oddView, oddModel);
    expectNear(drawable.modelViewProjectionMatrix, view * model);
}

TEST_F(RendererTest, SamplersTakeUnitsInOrderWithSizeUniformsAndNullOrUnknownOnesAreDropped) {
    vi::ShaderProgram program("attribute vec2 aPosition;\nvoid main() { gl_Position = vec4(aPosition, 0.0, 1.0); }\n",
                              "precision mediump float;\nuniform sampler2D uFirst;\nuniform sampler2D uSecond;\n"
                              "uniform vec2 uFirstSize;\nuniform vec2 uFirstTexelSize;\nuniform vec2 uSecondTexelSize;\n"
                              "void main() { gl_FragColor = texture2D(uFirst, uFirstSize * uFirstTexelSize)\n"
                              "  + texture2D(uSecond, uSecondTexelSize); }\n");
    vi::Drawable drawable;
    vi::Renderer renderer(program, drawable);
    std::vector<std::uint8_t> pixels(64 * 4, 9);
    vi::Texture first(pixels.data(), 4, 2, true, false, false, false, false, 4, false);
    vi::Texture second(pixels.data(), 2, 8, false, false, false, false, false, 4, false);
    EXPECT_EQ(renderer.addTexture("uFirst", nullptr), -1);
    EXPECT_EQ(renderer.addTexture("uMissing", &first), -1);
    EXPECT_EQ(first.mId, 0u);
    EXPECT_EQ(renderer.addTexture("uFirst", &first), 0);
    EXPECT_EQ(renderer.addTexture("uSecond", &second), 1);
    EXPECT_EQ(renderer.uniforms.size(), 3u);  // the program has no uSecondSize

    vitest::GlRecording recording;
    renderer.render();
    const std::vector<GlCall> binds = GlRecorder::callsNamed("glUniform1i");
    ASSERT_EQ(binds.size(), 2u);
    EXPECT_EQ(binds[0].args, (Args{double(glGetUniformLocation(program.program, "uFirst")), 0}));
    EXPECT_EQ(binds[1].args, (Args{double(glGetUniformLocation(program.program, "uSecond")), 1}));
    EXPECT_EQ(GlRecorder::names({"glUniform2fv", "glActiveTexture", "glDrawArrays"}),
              (Names{"glUniform2fv", "glUniform2fv", "glUniform2fv", "glActiveTexture", "glActiveTexture",
                     "glDrawArrays"}));
    EXPECT_EQ(uniformFloats(program.program, "uFirstSize", 2), (std::vector<float>{4, 2}));
    EXPECT_EQ(uniformFloats(program.program, "uFirstTexelSize", 2), (std::vector<float>{0.25f, 0.5f}));
    EXPECT_EQ(uniformFloats(program.program, "uSecondTexelSize", 2), (std::vector<float>{0.5f, 0.125f}));
}

TEST_F(RendererTest, DestroyingOneRendererReleasesOnlyItsBuffersAndKeepsTheOthersInOrder) {
    vi::ShaderProgram program(kTwoAttributesVertex, kPlainFragment);
    const unsigned short indices[3] = {0, 1, 2};
    const float positions[6] = {};
    vi::Drawable drawable;
    drawable.indices = indices;
    const std::vector<vi::Renderer*> before = vi::Renderer::mAllRenderers;
    auto* first = new vi::Renderer(program, drawable);
    auto* second = new vi::Renderer(program, drawable);
    auto* third = new vi::Renderer(program, drawable);
    second->addAttribute("aPosition", positions, 2, true);
    second->addAttribute("aOffset", positions, 2, true);
    const Args own = {double(second->indexBuffer), double(second->attributes[0]->buffer),
                      double(second->attributes[1]->buffer)};
    vitest::GlRecording recording;
    delete second;
    std::vector<vi::Renderer*> expected = before;
    expected.insert(expected.end(), {first, third});
    EXPECT_EQ(vi::Renderer::mAllRenderers, expected);
    Args deleted;
    for (const GlCall& call : GlRecorder::callsNamed("glDeleteBuffers")) deleted.push_back(call.args[1]);
    EXPECT_EQ(deleted, own);
    delete first;
    delete third;
    EXPECT_EQ(vi::Renderer::mAllRenderers, before);
}

TEST_F(RendererTest, DepthTestWithoutLessOrGreaterIsEqualAndDisablingKeepsTheFunction) {
    GLint function = -1;
    vi::Renderer::setDepthTest(true, false, true);
    glGetIntegerv(GL_DEPTH_FUNC, &function);
    EXPECT_EQ(function, GL_EQUAL);
    EXPECT_TRUE(glIsEnabled(GL_DEPTH_TEST));
    vi::Renderer::setDepthTest(true, false, false);
    vi::Renderer::setDepthTest(false, true, true);
    glGetIntegerv(GL_DEPTH_FUNC, &function);
    EXPECT_EQ(function, GL_GREATER);
    EXPECT_FALSE(glIsEnabled(GL_DEPTH_TEST));
}
