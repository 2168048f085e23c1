// A ready scene across lost contexts, driven through the handlers: a frame
// after the host replaced, destroyed or dropped the context, or after the
// driver lost objects under the same context handle, re-creates every
// program, buffer and texture before the scene draws, and looks exactly like
// the frame before.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <vector>

#include "Application/Application.h"
#include "Application/ApplicationVar.h"
#include "GlContext.h"
#include "GlRecorder.h"
#include "Painters.h"
#include "Pictures.h"
#include "Render/Background.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"

using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;
using Frame = std::vector<std::uint32_t>;

extern "C" void __real_free(void* p);
extern "C" void __wrap_free(void* p) {
    if (p) GlRecorder::record("free", {double(reinterpret_cast<std::uintptr_t>(p))});
    __real_free(p);
}

namespace {

constexpr int kSize = 64;

// RGBA bytes of the three textures: every texel a distinct colour.
std::vector<std::uint8_t> gTexels[3] = {
    {0xD0, 0x20, 0x10, 0xFF, 0x20, 0xC0, 0x30, 0xFF, 0x30, 0x40, 0xB0, 0xFF, 0xE0, 0xE0, 0xE0, 0xFF},
    {0xF0, 0xF0, 0x00, 0xFF, 0x00, 0xF0, 0xF0, 0xFF, 0xF0, 0x00, 0xF0, 0xFF, 0x40, 0x20, 0x00, 0xFF},
    {0x80, 0x80, 0x00, 0xFF, 0x00, 0x80, 0x80, 0xFF, 0x80, 0x00, 0x80, 0xFF, 0x10, 0xA0, 0xFF, 0xFF}};

// As an effect makes one: a background over a static texture whose malloc'ed
// pixels the runtime may free, then two indexed quads drawn by two renderers
// that share one program, the first sampling a static texture over the
// scene's own pixels, the second a dynamic one (uploaded at every bind).
// Nearest filtering: a frame is exact, and a texture lost on the way shows.
class ReadyScene : public vi::Scene {
public:
    explicit ReadyScene(const int* size) : vi::Scene(size) {}
    ~ReadyScene() override {
        for (vi::Renderer* renderer : quads) delete renderer;
        delete program;
        delete background;
        for (vi::Texture* texture : textures) delete texture;
    }

    void initEffect() override {
        void* backgroundPixels = std::malloc(16);
        std::memcpy(backgroundPixels, gTexels[0].data(), 16);
        for (int i = 0; i < 3; ++i)
            textures[i] = new vi::Texture(i ? gTexels[i].data() : backgroundPixels, 2, 2, i < 2, false, false, false,
                                          false, 4, false);
        textures[0]->setDeletable(true);
        background = new vi::Background(*textures[0]);
        program = new vi::ShaderProgram(
            "attribute vec2 aPosition;\nuniform vec2 uOffset;\nvarying vec2 vTexCoord;\n"
            "void main() { vTexCoord = aPosition * 2.0; gl_Position = vec4(aPosition + uOffset, 0.0, 1.0); }\n",
            vitest::textureFragmentShader());
        static const float kCorners[] = {0.0f, 0.0f, 0.5f, 0.0f, 0.0f, 0.5f, 0.5f, 0.5f};
        static const unsigned short kIndices[] = {0, 1, 2, 2, 1, 3};
        static const float kOffsets[2][2] = {{-0.5f, -0.5f}, {0.0f, 0.0f}};
        for (int i = 0; i < 2; ++i) {
            quad.mode = GL_TRIANGLES;
            quad.indices = kIndices;
            quad.elementCount = 6;
            quad.vertexCount = 4;
            quads[i] = new vi::Renderer(*program, quad);
            EXPECT_EQ(0, quads[i]->addAttribute("aPosition", kCorners, 2, true));
            EXPECT_EQ(0, quads[i]->addUniform("uOffset", kOffsets[i], vi::Uniform::Float2, 1));
            quads[i]->addTexture("uTexture", textures[i + 1]);
        }
    }
    int draw() override {
        glClearColor(0.0f, 0.0f, 0.0f, 1.0f);
        glClear(GL_COLOR_BUFFER_BIT);
        background->renderFrame();
        quads[0]->render();
        quads[1]->render();
        return 7;
    }

    static ReadyScene& current() { return *static_cast<ReadyScene*>(vi::gpScene); }

    vi::Texture* textures[3] = {};
    vi::Background* background = nullptr;
    vi::ShaderProgram* program = nullptr;
    vi::Drawable quad;
    vi::Renderer* quads[2] = {};
};

Frame drawFrame() {
    EXPECT_EQ(7, vi::Application::handleDraw());
    return vitest::readWords(0, 0, kSize, kSize);
}

bool allProgramsValid() {
    for (vi::Renderer* renderer : vi::Renderer::mAllRenderers)
        if (glIsProgram(renderer->program->program) != GL_TRUE) return false;
    return true;
}

class Recovery : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE(vi::Renderer::mAllRenderers.empty() && vi::Texture::mAllTextures.empty()) << "left by a test";
        context.reset(new GlContext(kSize, kSize));
        vi::gCreateScene = [](int* size, vi::ModelsMap*, vi::TexturesMap*) -> vi::Scene* { return new ReadyScene(size); };
        vi::Application::handleStart(0, 0, kSize, kSize);
        vi::Application::handleInitEffect();
        reference = drawFrame();
        // Every texel of the three textures is on screen.
        for (const std::vector<std::uint8_t>& texels : gTexels)
            for (int i = 0; i < 16; i += 4)
                EXPECT_NE(std::count(reference.begin(), reference.end(), vitest::rgba(&texels[i])), 0) << i;
    }
    void TearDown() override {
        context->makeCurrent();
        vi::Application::handleStop();
        context.reset();
    }

    std::unique_ptr<GlContext> context;
    Frame reference;
};

TEST_F(Recovery, FrameStaysTheSameThroughManyContextsAndFramesWithoutOne) {
    for (int round = 0; round < 16; ++round) {
        SCOPED_TRACE(round);
        switch (round % 4) {
        case 0: context->makeSecondCurrent(); break;
        case 1: context->recreate(); break;
        case 2:
            // Without a context the frame only forgets every name; nothing can be made.
            GlContext::releaseCurrent();
            vi::Application::handleDraw();
            for (vi::Renderer* renderer : vi::Renderer::mAllRenderers) EXPECT_EQ(0u, renderer->program->program);
            for (vi::Texture* texture : vi::Texture::mAllTextures) EXPECT_EQ(0u, texture->mId);
            context->makeCurrent();
            break;
        case 3: context->makeCurrent(); break;
        }
        ASSERT_EQ(reference, drawFrame());
        ASSERT_TRUE(allProgramsValid());
    }
}

// The order is the behaviour: every renderer forgets, every texture forgets,
// then the renderers are made again in registry order (a shared program once),
// then the textures, all before the scene's first call; no probe is asked
// once the context is known to have changed.
TEST_F(Recovery, ChangedContextRebuildsRenderersInOrderThenTexturesBeforeTheScene) {
    context->makeSecondCurrent();
    {
        GlRecording recording;
        EXPECT_EQ(reference, drawFrame());
        const std::vector<std::string> made = GlRecorder::names(
            {"glCreateProgram", "glIsProgram", "glGenBuffers", "glGetUniformLocation", "glGenTextures", "glIsTexture", "glClear"});
        EXPECT_EQ(made, (std::vector<std::string>{
                            "glCreateProgram", "glGenBuffers",                                  // the background
                            "glCreateProgram", "glGenBuffers", "glGenBuffers", "glGetUniformLocation",  // first quad
                            "glIsProgram", "glGenBuffers", "glGenBuffers", "glGetUniformLocation",      // second quad
                            "glGenTextures", "glGenTextures", "glGenTextures", "glClear"}));
    }
    EXPECT_EQ(context->secondContext(), vi::Renderer::mEglContext);
    GlRecording recording;
    EXPECT_EQ(reference, drawFrame());
    EXPECT_EQ(0, GlRecorder::count("glCreateProgram") + GlRecorder::count("glGenTextures")) << "once is enough";
}

// A driver may hand a new context the handle of a lost one: the first
// renderer's program and the first texture with a name are asked on every
// frame (and nothing else), and either one gone means everything is made again.
TEST_F(Recovery, ObjectsGoneUnderTheSameContextHandleAreNoticed) {
    {
        GlRecording recording;
        EXPECT_EQ(reference, drawFrame());
        EXPECT_EQ(0, GlRecorder::count("glCreateProgram") + GlRecorder::count("glGenTextures"));
        ASSERT_EQ(1u, GlRecorder::callsNamed("glIsProgram").size());
        ASSERT_EQ(1u, GlRecorder::callsNamed("glIsTexture").size());
        EXPECT_EQ(vi::Renderer::mAllRenderers.front()->program->program, GlRecorder::callsNamed("glIsProgram")[0].args[0]);
        EXPECT_EQ(vi::Texture::mAllTextures.front()->mId, GlRecorder::callsNamed("glIsTexture")[0].args[0]);
    }
    for (int gone = 0; gone < 2; ++gone) {
        SCOPED_TRACE(gone ? "texture" : "program");
        if (gone) glDeleteTextures(1, &vi::Texture::mAllTextures.front()->mId);
        else glDeleteProgram(vi::Renderer::mAllRenderers.front()->program->program);
        GlRecording recording;
        EXPECT_EQ(reference, drawFrame());
        EXPECT_EQ(3, GlRecorder::count("glGenTextures"));
        EXPECT_TRUE(allProgramsValid());
    }
}

// Recycling drops the static textures' pixels (freeing only the ones the
// runtime may free); after a loss they come back as storage of undefined
// contents, and the dynamic texture, which kept its pixels, still shows them.
TEST_F(Recovery, RecycledStaticTexturesComeBackAfterALoss) {
    ReadyScene& scene = ReadyScene::current();
    const double freeable = double(reinterpret_cast<std::uintptr_t>(scene.textures[0]->mBuffer));
    {
        GlRecording recording;
        vi::Application::handleRecycleTextures();
        ASSERT_EQ(1u, GlRecorder::callsNamed("free").size());
        EXPECT_EQ(freeable, GlRecorder::callsNamed("free")[0].args[0]);
    }
    EXPECT_TRUE(scene.textures[0]->mBuffer == nullptr && scene.textures[1]->mBuffer == nullptr);
    context->makeSecondCurrent();
    GlRecording recording;
    const Frame frame = drawFrame();
    int nullUploads = 0;
    for (const vitest::GlCall& call : GlRecorder::callsNamed("glTexImage2D")) nullUploads += call.args.back() == 0.0;
    EXPECT_EQ(2, nullUploads);
    for (int i = 0; i < 16; i += 4)
        EXPECT_NE(std::count(frame.begin(), frame.end(), vitest::rgba(&gTexels[2][i])), 0) << i;
}

// A renderer that outlives its scene, as one an effect keeps across restarts:
// a start in a new context only forgets its names, the initialisation leaves
// them alone, and the first ready frame makes them again.
TEST_F(Recovery, LossNoticedByAStartIsRepairedByTheFirstReadyFrame) {
    vi::ShaderProgram survivorProgram(ReadyScene::current().program->vertexSource,
                                      ReadyScene::current().program->fragmentSource);
    vi::Drawable survivorDrawable;
    vi::Renderer survivor(survivorProgram, survivorDrawable);
    context->makeSecondCurrent();
    vi::Application::handleStart(0, 0, kSize, kSize);
    EXPECT_EQ(0, vi::Application::handleDraw());
    vi::Application::handleInitEffect();
    EXPECT_EQ(0u, survivorProgram.program);
    EXPECT_EQ(reference, drawFrame());
    EXPECT_EQ(GLboolean(GL_TRUE), glIsProgram(survivorProgram.program));
    vi::Application::handleStop();
}

}  // namespace
