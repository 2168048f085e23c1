// The context check and its repairs on renderers and textures made by the
// tests themselves, with the GL calls recorded: what is probed on an intact
// frame, what is forgotten, and in which order everything is made again.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "Application/ContextRecovery.h"
#include "GlContext.h"
#include "GlRecorder.h"
#include "Render/Drawable.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"

using vitest::GlCall;
using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;

namespace {

constexpr GLuint kNoBuffer = 0xFFFFFFFF;

const char* const kTintVertex =
    "attribute vec2 aPosition;\n"
    "attribute vec3 aColour;\n"
    "uniform vec2 uShift;\n"
    "varying vec3 vColour;\n"
    "void main() { vColour = aColour; gl_Position = vec4(aPosition + uShift, 0.0, 1.0); }\n";
const char* const kTintFragment =
    "precision mediump float;\n"
    "uniform float uTint;\n"
    "varying vec3 vColour;\n"
    "void main() { gl_FragColor = vec4(vColour * uTint, 1.0); }\n";
const char* const kPlainVertex =
    "attribute vec2 aPosition;\n"
    "void main() { gl_Position = vec4(aPosition, 0.0, 1.0); }\n";
const char* const kPlainFragment =
    "precision mediump float;\n"
    "void main() { gl_FragColor = vec4(1.0); }\n";

const float kPositions[] = {0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 1.0f, 1.0f, 1.0f};
const float kColours[] = {1.0f, 0.0f, 0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 0.0f, 1.0f, 1.0f, 1.0f, 1.0f};
const unsigned short kIndices[] = {0, 1, 2, 2, 1, 3};
const float kShift[] = {0.25f, 0.5f};
const float kTint = 0.5f;
unsigned char gPixels[16] = {};

// Names of the calls, each with the attribute or uniform name it asked for.
std::vector<std::string> trace(const std::vector<std::string>& filter) {
    std::vector<std::string> result;
    for (const GlCall& call : GlRecorder::calls()) {
        bool wanted = false;
        for (const std::string& name : filter) wanted = wanted || call.name == name;
        if (wanted) result.push_back(call.text.empty() ? call.name : call.name + " " + call.text);
    }
    return result;
}

// Renderers and textures as a scene would have them: `tinted` and `shared`
// share one program, `plain` has its own and no index array.
class Registries : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE(vi::Renderer::mAllRenderers.empty()) << "a previous test left renderers";
        ASSERT_TRUE(vi::Texture::mAllTextures.empty()) << "a previous test left textures";
        context.reset(new GlContext(16, 16));
        // Nothing registered yet: this only makes the current context the remembered one.
        vi::ContextRecovery::invalidate();
    }

    void TearDown() override {
        context->makeCurrent();
        for (vi::Renderer* renderer : renderers) delete renderer;
        for (vi::ShaderProgram* program : programs) delete program;
        for (vi::Texture* texture : textures) delete texture;
        context.reset();
    }

    vi::Drawable& makeDrawable(bool indexed) {
        drawables.emplace_back(new vi::Drawable);
        vi::Drawable& drawable = *drawables.back();
        drawable.mode = GL_TRIANGLES;
        drawable.vertexCount = 4;
        drawable.elementCount = indexed ? 6 : 4;
        drawable.indices = indexed ? kIndices : nullptr;
        return drawable;
    }

    vi::ShaderProgram* makeProgram(const char* vertex, const char* fragment) {
        programs.push_back(new vi::ShaderProgram(vertex, fragment));
        return programs.back();
    }

    vi::Renderer* makeTintRenderer(vi::ShaderProgram& program) {
        renderers.push_back(new vi::Renderer(program, makeDrawable(true)));
        vi::Renderer* renderer = renderers.back();
        EXPECT_EQ(0, renderer->addAttribute("aPosition", kPositions, 2, true));
        EXPECT_EQ(1, renderer->addAttribute("aColour", kColours, 3, false));
        EXPECT_EQ(0, renderer->addUniform("uShift", kShift, vi::Uniform::Float2, 1));
        EXPECT_EQ(1, renderer->addUniform("uTint", &kTint, vi::Uniform::Float, 1));
        return renderer;
    }

    void makeScene() {
        tintProgram = makeProgram(kTintVertex, kTintFragment);
        tinted = makeTintRenderer(*tintProgram);
        shared = makeTintRenderer(*tintProgram);
        renderers.push_back(new vi::Renderer(*makeProgram(kPlainVertex, kPlainFragment), makeDrawable(false)));
        plain = renderers.back();
        EXPECT_EQ(0, plain->addAttribute("aPosition", kPositions, 2, true));
        unallocated = makeTexture();
        firstNamed = makeTexture();
        firstNamed->allocate();
        secondNamed = makeTexture();
        secondNamed->allocate();
    }

    vi::Texture* makeTexture() {
        textures.push_back(new vi::Texture(gPixels, 2, 2, true, false, false, false, false, 4, false));
        return textures.back();
    }

    std::unique_ptr<GlContext> context;
    std::vector<std::unique_ptr<vi::Drawable>> drawables;
    std::vector<vi::ShaderProgram*> programs;
    std::vector<vi::Renderer*> renderers;
    std::vector<vi::Texture*> textures;
    vi::ShaderProgram* tintProgram = nullptr;
    vi::Renderer* tinted = nullptr;
    vi::Renderer* shared = nullptr;
    vi::Renderer* plain = nullptr;
    vi::Texture* unallocated = nullptr;
    vi::Texture* firstNamed = nullptr;
    vi::Texture* secondNamed = nullptr;
};

TEST_F(Registries, IntactFrameAsksOnlyTheFirstProgramAndTheFirstNamedTexture) {
    // With nothing registered a changed context is only remembered.
    context->makeSecondCurrent();
    {
        GlRecording recording;
        vi::ContextRecovery::recoverIfLost();
        EXPECT_EQ(std::vector<std::string>{"eglGetCurrentContext"}, GlRecorder::names());
        EXPECT_EQ(context->secondContext(), vi::Renderer::mEglContext);
    }
    context->makeCurrent();
    vi::ContextRecovery::recoverIfLost();

    // Textures that never had a GL name pass the probe without a query.
    makeTexture();
    {
        GlRecording recording;
        vi::ContextRecovery::recoverIfLost();
        EXPECT_EQ(std::vector<std::string>{"eglGetCurrentContext"}, GlRecorder::names());
    }

    makeScene();
    GlRecording recording;
    vi::ContextRecovery::recoverIfLost();
    vi::ContextRecovery::recoverIfLost();
    const std::vector<std::string> probe = {"eglGetCurrentContext", "glIsProgram", "glIsTexture"};
    std::vector<std::string> expected = probe;
    expected.insert(expected.end(), probe.begin(), probe.end());
    EXPECT_EQ(expected, GlRecorder::names());
    EXPECT_EQ(double(tintProgram->program), GlRecorder::callsNamed("glIsProgram")[0].args[0]);
    EXPECT_EQ(double(firstNamed->mId), GlRecorder::callsNamed("glIsTexture")[0].args[0]);
}

TEST_F(Registries, ProbesNoticeObjectsGoneUnderTheSameContextHandle) {
    makeScene();
    // A later texture deleted goes unnoticed: only the first one with a name is asked.
    const GLuint later = secondNamed->mId;
    glDeleteTextures(1, &later);
    {
        GlRecording recording;
        vi::ContextRecovery::recoverIfLost();
        EXPECT_EQ(0, GlRecorder::count("glCreateProgram"));
        EXPECT_EQ(later, secondNamed->mId);
    }

    // The first named texture deleted is noticed, and everything is made again.
    glDeleteTextures(1, &firstNamed->mId);
    {
        GlRecording recording;
        vi::ContextRecovery::recoverIfLost();
        EXPECT_EQ(2, GlRecorder::count("glCreateProgram"));
        EXPECT_EQ(3, GlRecorder::count("glGenTextures"));
    }
    EXPECT_EQ(GLboolean(GL_TRUE), glIsTexture(firstNamed->mId));

    // So is the first renderer's program.
    glDeleteProgram(tintProgram->program);
    {
        GlRecording recording;
        vi::ContextRecovery::recoverIfLost();
        EXPECT_EQ(2, GlRecorder::count("glCreateProgram"));
    }
    EXPECT_EQ(GLboolean(GL_TRUE), glIsProgram(tintProgram->program));
}

TEST_F(Registries, RecreationFollowsRegistryOrderRendererByRendererThenTextures) {
    makeScene();
    context->makeSecondCurrent();
    GlRecording recording;
    vi::ContextRecovery::recoverIfLost();

    const std::vector<std::string> tintCalls = {
        "glGetAttribLocation aPosition", "glGenBuffers", "glBindBuffer", "glBufferData",
        "glEnableVertexAttribArray", "glVertexAttribPointer",
        "glGetAttribLocation aColour", "glGenBuffers", "glBindBuffer", "glBufferData",
        "glEnableVertexAttribArray", "glVertexAttribPointer",
        "glGetUniformLocation uShift", "glGetUniformLocation uTint"};
    std::vector<std::string> expected = {"glCreateProgram", "glGenBuffers", "glBindBuffer", "glBufferData"};
    expected.insert(expected.end(), tintCalls.begin(), tintCalls.end());
    // The shared program is already rebuilt: init() only finds it valid.
    expected.insert(expected.end(), {"glIsProgram", "glGenBuffers", "glBindBuffer", "glBufferData"});
    expected.insert(expected.end(), tintCalls.begin(), tintCalls.end());
    expected.insert(expected.end(), {"glCreateProgram", "glGetAttribLocation aPosition", "glGenBuffers",
                                     "glBindBuffer", "glBufferData", "glEnableVertexAttribArray",
                                     "glVertexAttribPointer"});
    expected.insert(expected.end(), {"glGenTextures", "glGenTextures", "glGenTextures"});
    EXPECT_EQ(expected, trace({"glCreateProgram", "glIsProgram", "glGenBuffers", "glBindBuffer", "glBufferData",
                               "glGetAttribLocation", "glEnableVertexAttribArray", "glVertexAttribPointer",
                               "glGetUniformLocation", "glGenTextures"}));

    EXPECT_EQ(tintProgram->program, shared->program->program);
    for (vi::Uniform* uniform : shared->uniforms)
        EXPECT_EQ(glGetUniformLocation(tintProgram->program, uniform->name.c_str()), uniform->location);
    EXPECT_EQ(kNoBuffer, plain->indexBuffer);
}

TEST_F(Registries, HostLoadingCheckComparesContextHandlesOnly) {
    makeScene();
    glDeleteProgram(tintProgram->program);
    const GLuint stale = tintProgram->program;
    {
        GlRecording recording;
        vi::ContextRecovery::recoverIfContextChanged();
        EXPECT_EQ(std::vector<std::string>{"eglGetCurrentContext"}, GlRecorder::names());
    }
    EXPECT_EQ(stale, tintProgram->program);

    context->makeSecondCurrent();
    {
        GlRecording recording;
        vi::ContextRecovery::recoverIfContextChanged();
        EXPECT_EQ(2, GlRecorder::count("glCreateProgram"));
        EXPECT_EQ(3, GlRecorder::count("glGenTextures"));
        // No probe: the only query is the shared program's own check in init().
        EXPECT_EQ(1, GlRecorder::count("glIsProgram"));
        EXPECT_EQ(0, GlRecorder::count("glIsTexture"));
    }
    EXPECT_EQ(context->secondContext(), vi::Renderer::mEglContext);
}

}  // namespace
