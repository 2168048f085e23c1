// Renderers on a real context: what they bind by name, what they upload at
// each draw, the matrices they derive and the registry.
#include <gtest/gtest.h>

#include <glm/gtc/matrix_transform.hpp>

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include "GlContext.h"
#include "GlRecorder.h"
#include "Pictures.h"
#include "Render/Drawable.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"

using vitest::GlCall;
using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;
using vitest::uniformFloats;

namespace {

const char* const kStandardVertex =
    "attribute vec3 aPosition;\n"
    "attribute vec3 aNormal;\n"
    "uniform mat4 uModelMatrix;\n"
    "uniform mat4 uViewMatrix;\n"
    "uniform mat3 uNormalMatrix;\n"
    "uniform mat4 uProjectionMatrix;\n"
    "uniform mat4 uModelViewProjectionMatrix;\n"
    "varying vec3 vNormal;\n"
    "void main() {\n"
    "  vNormal = uNormalMatrix * aNormal;\n"
    "  gl_Position = uModelViewProjectionMatrix * vec4(aPosition, 1.0)\n"
    "              + uProjectionMatrix * uViewMatrix * uModelMatrix * vec4(vNormal, 0.0);\n"
    "}\n";
const char* const kFragmentWithOpacity =
    "precision mediump float;\n"
    "uniform float uOpacity;\n"
    "varying vec3 vNormal;\n"
    "void main() { gl_FragColor = vec4(vNormal, uOpacity); }\n";
const char* const kFragmentWithoutOpacity =
    "precision mediump float;\n"
    "varying vec3 vNormal;\n"
    "void main() { gl_FragColor = vec4(vNormal, 1.0); }\n";

const char* const kTwoAttributesVertex =
    "attribute vec2 aPosition;\n"
    "attribute vec2 aOffset;\n"
    "void main() { gl_Position = vec4(aPosition + aOffset, 0.0, 1.0); }\n";
const char* const kPlainFragment =
    "precision mediump float;\n"
    "void main() { gl_FragColor = vec4(1.0); }\n";

const char* const kAllTypesVertex =
    "attribute vec2 aPosition;\n"
    "uniform mat2 uM2;\n"
    "uniform mat3 uM3;\n"
    "uniform mat4 uM4;\n"
    "uniform int uI1;\n"
    "uniform ivec2 uI2;\n"
    "uniform ivec3 uI3;\n"
    "uniform ivec4 uI4;\n"
    "uniform float uF1;\n"
    "uniform vec2 uF2;\n"
    "uniform vec3 uF3;\n"
    "uniform vec4 uF4[2];\n"
    "uniform float uUnknownType;\n"
    "void main() {\n"
    "  float s = (uM2 * vec2(1.0)).x + (uM3 * vec3(1.0)).y + (uM4 * vec4(1.0)).z\n"
    "          + float(uI1 + uI2.y + uI3.z + uI4.w) + uF1 + uF2.y + uF3.z + uF4[0].w + uF4[1].x\n"
    "          + uUnknownType;\n"
    "  gl_Position = vec4(aPosition, s, 1.0);\n"
    "}\n";

const std::vector<std::string> kUploads = {
    "glUniformMatrix2fv", "glUniformMatrix3fv", "glUniformMatrix4fv", "glUniform1iv", "glUniform2iv", "glUniform3iv",
    "glUniform4iv",       "glUniform1fv",       "glUniform2fv",       "glUniform3fv", "glUniform4fv"};

std::vector<int> uniformInts(GLuint program, const char* name, int n) {
    std::vector<int> values(4, -99);
    glGetUniformiv(program, glGetUniformLocation(program, name), values.data());
    values.resize(n);
    return values;
}

std::vector<float> floatsOf(const float* values, int n) { return std::vector<float>(values, values + n); }

template <int N>
std::vector<float> floatsOf(const glm::mat<N, N, float>& m) { return floatsOf(&m[0][0], N * N); }

template <int N>
void expectMatrixNear(const glm::mat<N, N, float>& actual, const glm::mat<N, N, float>& expected,
                      float tolerance = 1e-5f) {
    for (int c = 0; c < N; ++c)
        for (int r = 0; r < N; ++r)
            EXPECT_NEAR(actual[c][r], expected[c][r], tolerance) << "column " << c << " row " << r;
}

float largestDifference(const glm::mat4& a, const glm::mat4& b) {
    float largest = 0.0f;
    for (int c = 0; c < 4; ++c)
        for (int r = 0; r < 4; ++r) largest = std::max(largest, std::abs(a[c][r] - b[c][r]));
    return largest;
}

// A turned, unevenly scaled and moved model: its normal matrix is not its rotation.
glm::mat4 skewedModel() {
    glm::mat4 model = glm::translate(glm::mat4(1.0f), glm::vec3(0.5f, -1.0f, -3.0f));
    model = glm::rotate(model, 0.6f, glm::vec3(1.0f, 2.0f, 0.5f));
    return glm::scale(model, glm::vec3(2.0f, 0.5f, 1.5f));
}

class RendererTest : public ::testing::Test {
protected:
    void TearDown() override {
        GlRecorder::stop();
        vi::Drawable::mProjectionMatrix = glm::mat4(1.0f);
        vi::Drawable::mViewMatrix = glm::mat4(1.0f);
    }

    GlContext mGl{16, 16};
};

}  // namespace

TEST_F(RendererTest, StandardUniformsCarryTheDrawablesValuesAtEachDraw) {
    vi::ShaderProgram program(kStandardVertex, kFragmentWithOpacity);
    vi::Drawable drawable;
    drawable.mode = GL_TRIANGLES;
    GlRecording recording;
    vi::Renderer renderer(program, drawable);
    GlRecorder::stop();

    std::vector<std::string> looked;
    for (const GlCall& call : GlRecorder::callsNamed("glGetUniformLocation")) looked.push_back(call.text);
    EXPECT_EQ(looked, (std::vector<std::string>{"uModelMatrix", "uViewMatrix", "uNormalMatrix", "uProjectionMatrix",
                                                "uModelViewProjectionMatrix", "uOpacity"}));

    // Values are read from the caller's memory when drawing, not when binding.
    vi::Drawable::mProjectionMatrix = glm::perspective(0.8f, 0.75f, 0.5f, 20.0f);
    vi::Drawable::mViewMatrix = glm::lookAt(glm::vec3(1, 2, 5), glm::vec3(0), glm::vec3(0, 1, 0));
    drawable.modelMatrix = skewedModel();
    drawable.opacity = 0.25f;
    renderer.render();

    const GLuint p = program.program;
    EXPECT_EQ(uniformFloats(p, "uViewMatrix", 16), floatsOf(vi::Drawable::mViewMatrix));
    EXPECT_EQ(uniformFloats(p, "uNormalMatrix", 9), floatsOf(drawable.normalMatrix));
    EXPECT_EQ(uniformFloats(p, "uModelViewProjectionMatrix", 16), floatsOf(drawable.modelViewProjectionMatrix));
    EXPECT_EQ(uniformFloats(p, "uOpacity", 1), std::vector<float>{0.25f});
}

TEST_F(RendererTest, NamesTheProgramLacksAreDroppedAndTheRestStillDraw) {
    vi::ShaderProgram program(kStandardVertex, kFragmentWithoutOpacity);
    vi::Drawable drawable;
    vi::Renderer renderer(program, drawable);
    ASSERT_EQ(renderer.uniforms.size(), 5u);
    float opacity = 0.5f;
    EXPECT_EQ(renderer.addUniform("uOpacity", &opacity, vi::Uniform::Float, 1), -1);
    EXPECT_EQ(renderer.addAttribute("aMissing", &opacity, 1, true), -1);
    EXPECT_TRUE(renderer.attributes.empty());
    EXPECT_EQ(renderer.uniforms.size(), 5u);

    drawable.modelMatrix = glm::translate(glm::mat4(1.0f), glm::vec3(1, 2, 3));
    GlRecording recording;
    renderer.render();
    GlRecorder::stop();
    EXPECT_EQ(GlRecorder::count("glUniformMatrix4fv"), 4);
    EXPECT_EQ(GlRecorder::count("glUniformMatrix3fv"), 1);
    EXPECT_EQ(GlRecorder::count("glUniform1fv"), 0);
}

TEST_F(RendererTest, StaticAttributesUploadOnceAndDynamicOnesAtEveryDraw) {
    vi::ShaderProgram program(kTwoAttributesVertex, kPlainFragment);
    vi::Drawable drawable;
    drawable.mode = GL_TRIANGLE_STRIP;
    drawable.vertexCount = 4;
    drawable.elementCount = 4;
    const float positions[8] = {-1, -1, -1, 1, 1, -1, 1, 1};
    const float offsets[8] = {};

    GlRecording recording;
    vi::Renderer renderer(program, drawable);
    EXPECT_EQ(renderer.indexBuffer, 0xFFFFFFFFu);

    GlRecorder::start();
    EXPECT_EQ(renderer.addAttribute("aPosition", positions, 2, true), 0);
    EXPECT_EQ(renderer.addAttribute("aOffset", offsets, 2, false), 1);
    const std::vector<GlCall> added = GlRecorder::callsNamed("glBufferData");
    const vi::Attribute& offset = *renderer.attributes[1];
    EXPECT_EQ(added[0].args, (std::vector<double>{GL_ARRAY_BUFFER, 32, double(uintptr_t(positions)), GL_STATIC_DRAW}));
    EXPECT_EQ(added[1].args, (std::vector<double>{GL_ARRAY_BUFFER, 32, double(uintptr_t(offsets)), GL_STREAM_DRAW}));

    // The renderer sees the drawable's vertex count as it is at draw time.
    GlRecorder::start();
    renderer.render();
    drawable.vertexCount = 3;
    drawable.elementCount = 3;
    renderer.render();
    GlRecorder::stop();
    const std::vector<std::string> oneDraw = {"glUseProgram",  "glBindBuffer", "glVertexAttribPointer",
                                              "glBindBuffer",  "glBufferData", "glVertexAttribPointer",
                                              "glDrawArrays"};
    std::vector<std::string> twoDraws = oneDraw;
    twoDraws.insert(twoDraws.end(), oneDraw.begin(), oneDraw.end());
    ASSERT_EQ(GlRecorder::names(), twoDraws);
    const std::vector<GlCall> drawn = GlRecorder::calls();
    EXPECT_EQ(drawn[3].args[1], offset.buffer);
    EXPECT_EQ(drawn[4].args, (std::vector<double>{GL_ARRAY_BUFFER, 32, double(uintptr_t(offsets)), GL_STREAM_DRAW}));
    EXPECT_EQ(drawn[6].args, (std::vector<double>{GL_TRIANGLE_STRIP, 0, 4}));
    EXPECT_EQ(drawn[11].args[1], 24);
    EXPECT_EQ(drawn[13].args, (std::vector<double>{GL_TRIANGLE_STRIP, 0, 3}));
}

TEST_F(RendererTest, IndicesUploadAtConstructionAndAgainOnlyWhenMarkedChanged) {
    vi::ShaderProgram program(kTwoAttributesVertex, kPlainFragment);
    const unsigned short indices[6] = {0, 1, 2, 2, 1, 3};
    vi::Drawable drawable;
    drawable.mode = GL_TRIANGLES;
    drawable.indices = indices;
    drawable.elementCount = 6;
    drawable.vertexCount = 4;

    GlRecording recording;
    vi::Renderer renderer(program, drawable);
    GlRecorder::stop();
    ASSERT_NE(renderer.indexBuffer, 0xFFFFFFFFu);
    EXPECT_EQ(GlRecorder::callsNamed("glBufferData")[0].args,
              (std::vector<double>{GL_ELEMENT_ARRAY_BUFFER, 12, double(uintptr_t(indices)), GL_STATIC_DRAW}));

    const std::vector<std::string> drawCalls = {"glBindBuffer", "glBufferData", "glDrawElements", "glDrawArrays"};
    GlRecorder::start();
    renderer.render();
    EXPECT_EQ(GlRecorder::names(drawCalls), (std::vector<std::string>{"glBindBuffer", "glDrawElements"}));
    EXPECT_EQ(GlRecorder::calls().back().args, (std::vector<double>{GL_TRIANGLES, 6, GL_UNSIGNED_SHORT, 0}));

    drawable.indicesChanged = true;
    drawable.elementCount = 3;
    GlRecorder::start();
    renderer.render();
    EXPECT_FALSE(drawable.indicesChanged);
    ASSERT_EQ(GlRecorder::names(drawCalls),
              (std::vector<std::string>{"glBindBuffer", "glBufferData", "glDrawElements"}));
    EXPECT_EQ(GlRecorder::callsNamed("glBufferData")[0].args[1], 6);

    GlRecorder::start();
    renderer.render();
    EXPECT_EQ(GlRecorder::count("glBufferData"), 0);
}

TEST_F(RendererTest, EveryUniformTypeReachesTheProgramAndUnknownTypesUploadNothing) {
    vi::ShaderProgram program(kAllTypesVertex, kPlainFragment);
    vi::Drawable drawable;
    vi::Renderer renderer(program, drawable);
    ASSERT_TRUE(renderer.uniforms.empty());

    const float m2[4] = {1, 2, 3, 4};
    const float m3[9] = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    const float m4[16] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16};
    const int i1 = 7, i2[2] = {8, 9}, i3[3] = {10, 11, 12}, i4[4] = {13, 14, 15, 16};
    const float f1 = 0.5f, f2[2] = {1.5f, 2.5f}, f3[3] = {3.5f, 4.5f, 5.5f};
    const float f4[8] = {1, 2, 3, 4, 5, 6, 7, 8};
    const float unknown = 42.0f;
    renderer.addUniform("uM2", m2, vi::Uniform::Matrix2, 1);
    renderer.addUniform("uM3", m3, vi::Uniform::Matrix3, 1);
    renderer.addUniform("uM4", m4, vi::Uniform::Matrix4, 1);
    renderer.addUniform("uI1", &i1, vi::Uniform::Int, 1);
    renderer.addUniform("uI2", i2, vi::Uniform::Int2, 1);
    renderer.addUniform("uI3", i3, vi::Uniform::Int3, 1);
    renderer.addUniform("uI4", i4, vi::Uniform::Int4, 1);
    renderer.addUniform("uF1", &f1, vi::Uniform::Float, 1);
    renderer.addUniform("uF2", f2, vi::Uniform::Float2, 1);
    renderer.addUniform("uF3", f3, vi::Uniform::Float3, 1);
    renderer.addUniform("uF4", f4, vi::Uniform::Float4, 2);
    EXPECT_EQ(renderer.addUniform("uUnknownType", &unknown, vi::Uniform::UniformType(11), 1), 11);

    GlRecording recording;
    renderer.render();
    GlRecorder::stop();
    EXPECT_EQ(GlRecorder::names(kUploads), kUploads);

    const GLuint p = program.program;
    EXPECT_EQ(uniformFloats(p, "uM3", 9), floatsOf(m3, 9));
    EXPECT_EQ(uniformInts(p, "uI3", 3), (std::vector<int>{10, 11, 12}));
    EXPECT_EQ(uniformFloats(p, "uF2", 2), floatsOf(f2, 2));
    EXPECT_EQ(uniformFloats(p, "uF4[1]", 4), floatsOf(f4 + 4, 4));
    EXPECT_EQ(uniformFloats(p, "uUnknownType", 1), std::vector<float>{0.0f});
}

TEST_F(RendererTest, DerivedMatricesTakeTheCentredAffineShortcutAndMatchGlmWhereItHolds) {
    vi::ShaderProgram program(kStandardVertex, kFragmentWithOpacity);
    vi::Drawable drawable;
    vi::Renderer renderer(program, drawable);
    auto derive = [&](const glm::mat4& projection, const glm::mat4& view, const glm::mat4& model) {
        vi::Drawable::mProjectionMatrix = projection;
        vi::Drawable::mViewMatrix = view;
        drawable.modelMatrix = model;
        renderer.render();
    };
    const glm::mat4 view = glm::lookAt(glm::vec3(-2, 3, 6), glm::vec3(0, 1, 0), glm::vec3(0, 1, 0));
    const glm::mat4 model = skewedModel();

    // A centred perspective and affine transforms: exactly the full products.
    const glm::mat4 perspective = glm::perspective(1.1f, 0.6f, 0.1f, 50.0f);
    derive(perspective, view, model);
    expectMatrixNear(drawable.normalMatrix, glm::transpose(glm::inverse(glm::mat3(model))));
    expectMatrixNear(drawable.modelViewMatrix, view * model);
    expectMatrixNear(drawable.modelViewProjectionMatrix, perspective * view * model, 1e-4f);

    // An off-centre frustum: only elements 0, 5, 10, 11, 12, 13, 14 and 15 count.
    const glm::mat4 frustum = glm::frustum(-1.0f, 3.0f, -2.0f, 1.0f, 1.0f, 10.0f);
    glm::mat4 centred(0.0f);
    for (int index : {0, 5, 10, 11, 12, 13, 14, 15}) centred[index / 4][index % 4] = frustum[index / 4][index % 4];
    derive(frustum, view, model);
    ASSERT_GT(largestDifference(centred * view * model, frustum * view * model), 0.1f);
    expectMatrixNear(drawable.modelViewProjectionMatrix, centred * view * model, 1e-4f);

    // Bottom rows of the view and the model are never read.
    glm::mat4 oddView = view;
    glm::mat4 oddModel = model;
    oddView[0][3] = 0.3f;
    oddView[3][3] = 2.0f;
    oddModel[1][3] = -0.4f;
    oddModel[2][3] = 0.7f;
    derive(glm::mat4(1.0f), oddView, oddModel);
    ASSERT_GT(largestDifference(view * model, oddView * oddModel), 0.1f);
    expectMatrixNear(drawable.modelViewMatrix, view * model);
    expectMatrixNear(drawable.modelViewProjectionMatrix, view * model);
}

TEST_F(RendererTest, DestroyingOneRendererKeepsTheOthersInOrderAndReleasesOnlyItsBuffers) {
    vi::ShaderProgram program(kTwoAttributesVertex, kPlainFragment);
    const unsigned short indices[3] = {0, 1, 2};
    const float positions[6] = {};
    vi::Drawable drawable;
    drawable.indices = indices;
    drawable.elementCount = 3;
    drawable.vertexCount = 3;
    const std::vector<vi::Renderer*> before = vi::Renderer::mAllRenderers;
    auto* first = new vi::Renderer(program, drawable);
    auto* second = new vi::Renderer(program, drawable);
    auto* third = new vi::Renderer(program, drawable);
    second->addAttribute("aPosition", positions, 2, true);
    const GLuint indexBuffer = second->indexBuffer;
    const GLuint attributeBuffer = second->attributes[0]->buffer;

    GlRecording recording;
    delete second;
    GlRecorder::stop();
    std::vector<vi::Renderer*> expected = before;
    expected.push_back(first);
    expected.push_back(third);
    EXPECT_EQ(vi::Renderer::mAllRenderers, expected);
    EXPECT_EQ(GlRecorder::calls()[0].args[1], indexBuffer);
    EXPECT_EQ(GlRecorder::calls()[1].args[1], attributeBuffer);

    delete first;
    delete third;
    EXPECT_EQ(vi::Renderer::mAllRenderers, before);
}

TEST_F(RendererTest, DepthTestWithoutLessOrGreaterIsEqualAndDisablingKeepsTheFunction) {
    GLint value = -1;
    vi::Renderer::setDepthTest(true, false, true);
    glGetIntegerv(GL_DEPTH_FUNC, &value);
    EXPECT_EQ(value, GL_EQUAL);
    EXPECT_TRUE(glIsEnabled(GL_DEPTH_TEST));
    vi::Renderer::setDepthTest(true, false, false);
    vi::Renderer::setDepthTest(false, true, true);
    EXPECT_FALSE(glIsEnabled(GL_DEPTH_TEST));
    glGetIntegerv(GL_DEPTH_FUNC, &value);
    EXPECT_EQ(value, GL_GREATER);
}
