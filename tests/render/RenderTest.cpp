// Geometry (no GL), shader programs and renderers on a real context: the
// build sequence and the two fatal exits the host tells apart, what renderers
// bind by name and upload at each draw, and the matrices they derive.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <unistd.h>

#include <glm/gtc/matrix_transform.hpp>

#include <cstdio>

#include "GlRecorder.h"
#include "Painters.h"
#include "Render/GeometryRectangle.h"
#include "Tools/FatalReport.h"

using vitest::GlCall;
using vitest::address;
using vitest::GlRecorder;
using Args = std::vector<double>;
using Names = std::vector<std::string>;
using Points = std::vector<glm::vec3>;

namespace {

const char* const kVertex =
    "attribute vec4 aPosition;\nattribute vec2 aOffset;\nvarying vec2 vValue;\n"
    "void main() { vValue = aPosition.xy; gl_Position = aPosition + vec4(aOffset, 0.0, 0.0); }\n";
const char* const kFragment =
    "precision mediump float;\nvarying vec2 vValue;\nvoid main() { gl_FragColor = vec4(vValue, 0.0, 1.0); }\n";


std::vector<float> uniformFloats(GLuint program, const char* name, int n) {
    std::vector<float> values(16, -99.0f);
    glGetUniformfv(program, glGetUniformLocation(program, name), values.data());
    return std::vector<float>(values.begin(), values.begin() + n);
}

// A death test's child: builds a program with `fragment` and, at its exit,
// prints the fatal report, the calls made (shaders marked by kind) and how
// many bytes reached standard output.
void buildProgramAndWatchTheExit(const char* fragment) {
    static std::FILE* output = std::tmpfile();
    vitest::GlContext gl(8, 8);
    std::fflush(stdout);
    dup2(fileno(output), STDOUT_FILENO);
    std::atexit([] {
        std::string line = *vi::FatalReport::msLastReport + "\ncalls:";
        double vertex = -1;
        for (const GlCall& call : GlRecorder::calls()) {
            line += ' ' + call.name;
            if (call.name == "glCreateShader" && call.args[0] == GL_VERTEX_SHADER) vertex = call.args[1];
            if (call.name == "glCreateShader" || call.name == "glDeleteShader")
                line += call.args[call.name == "glCreateShader"] == vertex ? "(vertex)" : "(fragment)";
        }
        std::fflush(stdout);
        std::fprintf(stderr, "%s\nstdout bytes: %ld\n", line.c_str(), std::ftell(output));
    });
    GlRecorder::start();
    vi::ShaderProgram program(kVertex, fragment);
}

// The driver's info log between quotes, the location block, then the calls.
std::string report(const std::string& infoLog, const std::string& function, int line, const std::string& calls) {
    return "^\"" + infoLog + "\"\nIn file : \"/[^\"]*/Render/ShaderProgram\\.cpp\"\nIn function : \"" + function +
           "\"\nIn line : " + std::to_string(line) + "\ncalls: " + calls + "\nstdout bytes: 0\n$";
}

class RenderTest : public testing::Test {
protected:
    void TearDown() override {
        vi::Drawable::mProjectionMatrix = vi::Drawable::mViewMatrix = glm::mat4(1.0f);
    }

    vitest::GlContext mGl{16, 16};
};

}  // namespace

TEST(Geometry, RotationMatchesGlmAboutAnyAxisAndARectangleMovesOnlyItsCorners) {
    const Points points = {{1, 0, 0}, {0, 2, 0}, {0.5f, -1, 3}, {-2, 4, -1.5f}};
    for (const glm::vec3& axis : Points{{0, 0, 1}, {1, 0, 0}, {0, -3, 0}, {1, 2, 3}, {-0.2f, 5, 0.7f}}) {
        vi::Geometry geometry;
        geometry.positions = geometry.normals = points;
        geometry.rotate(0.7f, axis);
        const glm::mat4 rotation = glm::rotate(glm::mat4(1.0f), 0.7f, glm::normalize(axis));
        for (std::size_t i = 0; i < points.size(); ++i)
            for (int c = 0; c < 3; ++c)
                EXPECT_NEAR(geometry.positions[i][c], (rotation * glm::vec4(points[i], 1.0f))[c], 1e-5f) << axis.y;
        EXPECT_EQ(geometry.normals, points);
        geometry.reconstruct();  // a plain geometry reconstructs to nothing
        EXPECT_TRUE(geometry.positions.empty() && geometry.normals.empty());
    }
    vi::GeometryRectangle rectangle;
    rectangle.positions.assign(6, glm::vec3(7));  // construction leaves exactly four of each
    rectangle.construct({1, 2, 5}, {3, 4});
    EXPECT_EQ(rectangle.positions, (Points{{1, 2, 0}, {1, 6, 0}, {4, 2, 0}, {4, 6, 0}}));
    EXPECT_EQ(rectangle.texCoords, (std::vector<glm::vec2>{{0, 1}, {0, 0}, {1, 1}, {1, 0}}));
    EXPECT_EQ(rectangle.indices, (std::vector<unsigned short>{0, 1, 2, 3}));
    rectangle.normals[2] = {1, 0, 0};
    rectangle.texCoords[0] = {0.5f, 0.5f};
    rectangle.update({-1, -2, 9}, {2, 0.5f});
    const Points moved = {{-1, -2, 0}, {-1, -1.5f, 0}, {1, -2, 0}, {1, -1.5f, 0}};
    EXPECT_EQ(rectangle.positions, moved);
    EXPECT_EQ(rectangle.normals, Points(4, glm::vec3(0, 0, 1)));
    EXPECT_EQ(rectangle.texCoords[0], glm::vec2(0.5f, 0.5f));
    EXPECT_EQ(rectangle.getBorder(), glm::vec4(-1, 1, -2, -1.5f));
    rectangle.translate({3, 3, 3});
    rectangle.reconstruct();
    EXPECT_EQ(rectangle.positions, moved);
}

TEST_F(RenderTest, ProgramCompilesVertexFirstKeepsNoShaderAndUnbindsItselfBeforeDeletion) {
    vitest::GlRecording recording;
    auto* program = new vi::ShaderProgram(kVertex, kFragment);
    program->init();  // the name is still valid: nothing is built
    const std::vector<GlCall> c = GlRecorder::calls();
    ASSERT_EQ(GlRecorder::names(), (Names{"glCreateShader", "glShaderSource", "glCompileShader", "glGetShaderiv",
                                          "glCreateShader", "glShaderSource", "glCompileShader", "glGetShaderiv",
                                          "glCreateProgram", "glAttachShader", "glAttachShader", "glLinkProgram",
                                          "glDetachShader", "glDetachShader", "glDeleteShader", "glDeleteShader",
                                          "glGetProgramiv", "glIsProgram"}));
    const double name = program->program, vertex = c[0].args[1], fragment = c[4].args[1];
    EXPECT_EQ(Args({c[0].args[0], c[9].args[1], c[10].args[1], c[12].args[1], c[14].args[0], c[15].args[0]}),
              (Args{GL_VERTEX_SHADER, vertex, fragment, vertex, vertex, fragment}));
    EXPECT_EQ(c[5].text, kFragment);
    glUseProgram(program->program);
    delete program;
    EXPECT_FALSE(glIsProgram(GLuint(name)));  // a program still in use would live on
}

// A fresh process for each child: a forked copy of a live GL driver is not
// safe. A compile error keeps the vertex shader, compiled first, and deletes
// only the failing one; a link error deletes both shaders, then the program.
TEST(ShaderProgramDeath, FragmentSyntaxErrorExits88AndShadersThatDoNotLinkExit67) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(buildProgramAndWatchTheExit("precision mediump float;\nvoid main() { gl_FragColor = vec4(1.0) }\n"),
                testing::ExitedWithCode(88),
                testing::MatchesRegex(report("0:2\\([0-9]+\\): error: .+", "compileShader", 88,
                                             "glCreateShader\\(vertex\\) glShaderSource glCompileShader glGetShaderiv "
                                             "glCreateShader\\(fragment\\) glShaderSource glCompileShader "
                                             "glGetShaderiv glGetShaderInfoLog glDeleteShader\\(fragment\\)")));
    EXPECT_EXIT(buildProgramAndWatchTheExit("precision mediump float;\nvarying vec3 vValue;\n"
                                            "void main() { gl_FragColor = vec4(vValue, 1.0); }\n"),
                testing::ExitedWithCode(67),
                testing::MatchesRegex(report(".*vValue.+", "init", 67,
                                             ".* glLinkProgram glDetachShader glDetachShader "
                                             "glDeleteShader\\(vertex\\) glDeleteShader\\(fragment\\) "
                                             "glGetProgramiv glGetProgramInfoLog glDeleteProgram")));
}

TEST_F(RenderTest, StandardUniformsAndSamplersAreBoundByNameAndReadAtEachDraw) {
    vi::ShaderProgram program(
        "attribute vec3 aPosition;\nuniform mat3 uNormalMatrix;\nvarying vec3 vNormal;\n"
        "uniform mat4 uModelMatrix, uViewMatrix, uProjectionMatrix, uModelViewProjectionMatrix;\nvoid main() {\n"
        "  vNormal = uNormalMatrix * aPosition;\n  gl_Position = uModelViewProjectionMatrix * vec4(aPosition, 1.0)\n"
        "    + uProjectionMatrix * uViewMatrix * uModelMatrix * vec4(vNormal, 0.0);\n}\n",
        "precision mediump float;\nuniform float uOpacity;\nuniform sampler2D uFirst, uSecond;\nvarying vec3 vNormal;\n"
        "uniform vec2 uFirstSize, uFirstTexelSize, uSecondTexelSize;\nvoid main() {\n"
        "  gl_FragColor = vec4(vNormal, uOpacity) + texture2D(uFirst, uFirstSize * uFirstTexelSize)\n"
        "    + texture2D(uSecond, uSecondTexelSize);\n}\n");
    vi::Drawable drawable;
    vi::Renderer renderer(program, drawable);
    std::uint8_t pixels[64 * 4] = {};
    vi::Texture first(pixels, 4, 2, true, false, false, false, false, 4, false);
    vi::Texture second(pixels, 2, 8, false, false, false, false, false, 4, false);
    // Names the program lacks and null textures leave no trace.
    EXPECT_EQ(std::vector<int>({renderer.addUniform("uMissing", pixels, vi::Uniform::Float, 1),
                                renderer.addAttribute("aMissing", pixels, 1, true), renderer.addTexture("uFirst", nullptr),
                                renderer.addTexture("uMissing", &first), renderer.addTexture("uFirst", &first),
                                renderer.addTexture("uSecond", &second)}),
              (std::vector<int>{-1, -1, -1, -1, 0, 1}));
    EXPECT_EQ(renderer.uniforms.size(), 6u + 3u);  // the program has no uSecondSize

    vi::Drawable::mViewMatrix = glm::lookAt(glm::vec3(1, 2, 5), glm::vec3(0), glm::vec3(0, 1, 0));
    drawable.modelMatrix = glm::translate(glm::mat4(1.0f), glm::vec3(0.5f, 2, 3));
    drawable.opacity = 0.25f;
    renderer.render();
    const GLuint p = program.program;
    const float* view = &vi::Drawable::mViewMatrix[0][0];
    EXPECT_EQ(uniformFloats(p, "uViewMatrix", 16), std::vector<float>(view, view + 16));
    // Every standard uniform is found by name: one missed stays zero.
    EXPECT_EQ(Args({uniformFloats(p, "uModelMatrix", 16)[12], uniformFloats(p, "uNormalMatrix", 9)[8],
                    uniformFloats(p, "uProjectionMatrix", 16)[15], uniformFloats(p, "uOpacity", 1)[0],
                    uniformFloats(p, "uModelViewProjectionMatrix", 16)[14], uniformFloats(p, "uFirstTexelSize", 2)[1],
                    uniformFloats(p, "uSecondTexelSize", 2)[1]}),
              (Args{0.5, drawable.normalMatrix[2][2], 1, 0.25, drawable.modelViewProjectionMatrix[3][2], 0.5, 0.125}));
    EXPECT_EQ(uniformFloats(p, "uFirstSize", 2), (std::vector<float>{4, 2}));
    // Samplers take the units in the order they were added.
    EXPECT_EQ(Args({uniformFloats(p, "uFirst", 1)[0], uniformFloats(p, "uSecond", 1)[0]}), (Args{0, 1}));
}

TEST_F(RenderTest, DynamicArraysAndChangedIndicesGoUpAtTheDrawStaticOnesOnceAndDestructionFreesThem) {
    vi::ShaderProgram program(kVertex, kFragment);
    const unsigned short indices[6] = {0, 1, 2, 2, 1, 3};
    const float positions[16] = {}, offsets[8] = {};
    vi::Drawable drawable;
    drawable.mode = GL_TRIANGLES;
    drawable.vertexCount = 4;
    drawable.elementCount = 6;
    drawable.indices = indices;
    vitest::GlRecording recording;
    auto* renderer = new vi::Renderer(program, drawable);
    renderer->addAttribute("aPosition", positions, 4, true);
    renderer->addAttribute("aOffset", offsets, 2, false);
    const std::vector<GlCall> made = GlRecorder::callsNamed("glBufferData");
    EXPECT_EQ(made[0].args, (Args{GL_ELEMENT_ARRAY_BUFFER, 12, address(indices), GL_STATIC_DRAW}));
    EXPECT_EQ(made[1].args, (Args{GL_ARRAY_BUFFER, 64, address(positions), GL_STATIC_DRAW}));
    EXPECT_EQ(made[2].args, (Args{GL_ARRAY_BUFFER, 32, address(offsets), GL_STREAM_DRAW}));
    EXPECT_EQ(GlRecorder::count("glVertexAttribPointer"), 2) << "each array is pointed at as it is made";
    GlRecorder::start();
    renderer->render();
    EXPECT_EQ(GlRecorder::names(), (Names{"glUseProgram", "glBindBuffer", "glVertexAttribPointer", "glBindBuffer",
                                          "glBufferData", "glVertexAttribPointer", "glBindBuffer", "glDrawElements"}));
    EXPECT_EQ(GlRecorder::calls()[3].args[1], renderer->attributes[1]->buffer);
    EXPECT_EQ(GlRecorder::calls()[7].args, (Args{GL_TRIANGLES, 6, GL_UNSIGNED_SHORT, 0}));
    // Counts are read at draw time; indices go up again only when marked changed.
    drawable.vertexCount = drawable.elementCount = 3;
    drawable.indicesChanged = true;
    GlRecorder::start();
    renderer->render();
    EXPECT_FALSE(drawable.indicesChanged);
    const std::vector<GlCall> uploads = GlRecorder::callsNamed("glBufferData");
    ASSERT_EQ(uploads.size(), 2u);
    EXPECT_EQ(uploads[0].args[1], 24);
    EXPECT_EQ(uploads[1].args, (Args{GL_ELEMENT_ARRAY_BUFFER, 6, address(indices), GL_STATIC_DRAW}));
    const GLuint own[] = {renderer->indexBuffer, renderer->attributes[0]->buffer, renderer->attributes[1]->buffer};
    delete renderer;
    for (GLuint buffer : own) EXPECT_FALSE(glIsBuffer(buffer)) << buffer;
}

TEST_F(RenderTest, EveryUniformTypeReachesTheProgramAnUnknownTypeUploadsNothingAndDepthEqualWins) {
    const char* types[12] = {"mat2", "mat3", "mat4", "int", "ivec2", "ivec3", "ivec4", "float", "vec2", "vec3", "vec4",
                             "float"};
    const int sizes[12] = {4, 9, 16, 1, 2, 3, 4, 1, 2, 3, 4, 1};
    std::string source = "attribute vec2 aPosition;\n", sum = "0.0";
    for (int t = 0; t < 12; ++t) {
        source += std::string("uniform ") + types[t] + " u" + std::to_string(t) + ";\n";
        sum += " + float(u" + std::to_string(t) + (t < 3 ? "[0][0])" : t % 4 == 3 ? ")" : "[0])");
    }
    vi::ShaderProgram program(source + "void main() { gl_Position = vec4(aPosition, " + sum + ", 1.0); }\n",
                              "precision mediump float;\nvoid main() { gl_FragColor = vec4(1.0); }\n");
    vi::Drawable drawable;
    vi::Renderer renderer(program, drawable);
    const float f[16] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16};
    const int i[4] = {7, 8, 9, 10};
    for (int t = 0; t < 12; ++t)
        EXPECT_EQ(renderer.addUniform("u" + std::to_string(t), t >= 3 && t <= 6 ? static_cast<const void*>(i) : f,
                                      vi::Uniform::UniformType(t), 1), t);
    renderer.render();
    // Each type through its own call: a wrong one leaves the uniform at zero.
    for (int t = 0; t < 12; ++t) {
        SCOPED_TRACE(types[t]);
        std::vector<float> expected(f, f + sizes[t]);
        if (t >= 3 && t <= 6) expected.assign(i, i + sizes[t]);
        if (t == 11) expected = {0};  // not a type: never uploaded
        EXPECT_EQ(uniformFloats(program.program, ("u" + std::to_string(t)).c_str(), sizes[t]), expected);
    }

    GLint function = -1;
    vi::Renderer::setDepthTest(true, false, true);
    vi::Renderer::setDepthTest(false, true, false);  // disabling keeps the function
    glGetIntegerv(GL_DEPTH_FUNC, &function);
    EXPECT_EQ(function, GL_EQUAL);
    EXPECT_FALSE(glIsEnabled(GL_DEPTH_TEST));
}

TEST_F(RenderTest, DerivedMatricesTakeTheCentredAffineShortcutAndMatchGlmWhereItHolds) {
    auto expectNear = [](const glm::mat4& actual, const glm::mat4& expected, float tolerance) {
        for (int e = 0; e < 16; ++e) EXPECT_NEAR(actual[e / 4][e % 4], expected[e / 4][e % 4], tolerance) << e;
    };
    vi::Drawable drawable;
    const glm::mat4 view = glm::lookAt(glm::vec3(-2, 3, 6), glm::vec3(0, 1, 0), glm::vec3(0, 1, 0));
    const glm::mat4 moved = glm::translate(glm::mat4(1.0f), glm::vec3(0.5f, -1.0f, -3.0f));
    // Turned, unevenly scaled and moved: the normal matrix is not the rotation.
    const glm::mat4 model = glm::scale(glm::rotate(moved, 0.6f, glm::vec3(1, 2, 0.5f)), glm::vec3(2, 0.5f, 1.5f));
    drawable.modelMatrix = model;
    vi::Drawable::mViewMatrix = view;
    vi::Drawable::mProjectionMatrix = glm::perspective(1.1f, 0.6f, 0.1f, 50.0f);
    drawable.deriveMatrices();
    expectNear(glm::mat4(drawable.normalMatrix), glm::mat4(glm::transpose(glm::inverse(glm::mat3(model)))), 1e-5f);
    expectNear(drawable.modelViewMatrix, view * model, 1e-5f);
    expectNear(drawable.modelViewProjectionMatrix, vi::Drawable::mProjectionMatrix * view * model, 1e-4f);
    // An off-centre frustum: only elements 0, 5, 10, 11, 12, 13, 14 and 15
    // count. The bottom rows of the view and the model are never read.
    const glm::mat4 frustum = glm::frustum(-1.0f, 3.0f, -2.0f, 1.0f, 1.0f, 10.0f);
    glm::mat4 centred(0.0f);
    for (int e : {0, 5, 10, 11, 12, 13, 14, 15}) centred[e / 4][e % 4] = frustum[e / 4][e % 4];
    vi::Drawable::mProjectionMatrix = frustum;
    vi::Drawable::mViewMatrix[0][3] = 0.3f;
    vi::Drawable::mViewMatrix[3][3] = 2.0f;
    drawable.modelMatrix[1][3] = -0.4f;
    drawable.deriveMatrices();
    expectNear(drawable.modelViewProjectionMatrix, centred * view * model, 1e-4f);
}
