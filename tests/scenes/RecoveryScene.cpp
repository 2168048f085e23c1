#include "RecoveryScene.h"

#include <cstdlib>
#include <cstring>

#include "Application/ApplicationVar.h"
#include "Painters.h"
#include "Render/GL.h"

namespace recoverytest {

const std::vector<std::uint32_t> kBackgroundTexels = {0xD02010FF, 0x20C030FF, 0x3040B0FF, 0xE0E0E0FF};
const std::vector<std::uint32_t> kCheckerTexels = {0xF0F000FF, 0x00F0F0FF, 0xF000F0FF, 0x402000FF};
const std::vector<std::uint32_t> kDynamicTexels = {0x808000FF, 0x008080FF, 0x800080FF, 0x10A0FFFF};

namespace {

const char* const kQuadVertex =
    "attribute vec2 aPosition;\n"
    "attribute vec2 aTexCoord;\n"
    "uniform vec2 uOffset;\n"
    "varying vec2 vTexCoord;\n"
    "void main() {\n"
    "  vTexCoord = aTexCoord;\n"
    "  gl_Position = vec4(aPosition + uOffset, 0.0, 1.0);\n"
    "}\n";

// A half-window square from (0, 0) to (0.5, 0.5) in clip space, moved by uOffset.
const float kQuadPositions[] = {0.0f, 0.0f, 0.5f, 0.0f, 0.0f, 0.5f, 0.5f, 0.5f};
const float kQuadTexCoords[] = {0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 1.0f, 1.0f, 1.0f};
const unsigned short kQuadIndices[] = {0, 1, 2, 2, 1, 3};

std::vector<std::uint8_t> bytesOf(const std::vector<std::uint32_t>& texels) {
    std::vector<std::uint8_t> bytes;
    for (std::uint32_t texel : texels)
        for (int shift = 24; shift >= 0; shift -= 8) bytes.push_back(std::uint8_t(texel >> shift));
    return bytes;
}

}  // namespace

RecoveryScene::RecoveryScene(const int* size)
    : vi::Scene(size), mCheckerPixels(bytesOf(kCheckerTexels)), mDynamicPixels(bytesOf(kDynamicTexels)) {}

RecoveryScene::~RecoveryScene() {
    for (vi::Renderer* renderer : quadRenderers) delete renderer;
    delete quadProgram;
    delete background;
    delete backgroundTexture;
    delete checkerTexture;
    delete dynamicTexture;
}

void RecoveryScene::initEffect() {
    const std::vector<std::uint8_t> backgroundBytes = bytesOf(kBackgroundTexels);
    void* backgroundPixels = std::malloc(backgroundBytes.size());
    std::memcpy(backgroundPixels, backgroundBytes.data(), backgroundBytes.size());
    backgroundTexture = new vi::Texture(backgroundPixels, 2, 2, true, false, false, false, false, 4, false);
    backgroundTexture->setDeletable(true);
    checkerTexture = new vi::Texture(mCheckerPixels.data(), 2, 2, true, false, false, false, false, 4, false);
    dynamicTexture = new vi::Texture(mDynamicPixels.data(), 2, 2, false, false, false, false, false, 4, false);

    background = new vi::Background(*backgroundTexture);

    quadProgram = new vi::ShaderProgram(kQuadVertex, vitest::textureFragmentShader());
    vi::Texture* samplers[2] = {checkerTexture, dynamicTexture};
    for (int i = 0; i < 2; ++i) {
        vi::Drawable& quad = quads[i];
        quad.mode = GL_TRIANGLES;
        quad.indices = kQuadIndices;
        quad.elementCount = 6;
        quad.vertexCount = 4;
        quad.positions = kQuadPositions;
        quad.texCoords = kQuadTexCoords;
        quadRenderers[i] = new vi::Renderer(*quadProgram, quad);
        quadRenderers[i]->addAttribute("aPosition", kQuadPositions, 2, true);
        quadRenderers[i]->addAttribute("aTexCoord", kQuadTexCoords, 2, false);
        quadRenderers[i]->addUniform("uOffset", mOffsets[i], vi::Uniform::Float2, 1);
        quadRenderers[i]->addTexture("uTexture", samplers[i]);
    }
}

int RecoveryScene::draw() {
    ++draws;
    glClearColor(0.0f, 0.0f, 0.0f, 1.0f);
    glClear(GL_COLOR_BUFFER_BIT);
    background->renderFrame();
    quadRenderers[0]->render();
    quadRenderers[1]->render();
    return kDrawResult;
}

vi::Scene* RecoveryScene::create(int* size, vi::ModelsMap*, vi::TexturesMap*) { return new RecoveryScene(size); }

RecoveryScene& RecoveryScene::current() { return *static_cast<RecoveryScene*>(vi::gpScene); }

}  // namespace recoverytest
