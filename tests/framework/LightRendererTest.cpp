// The lit renderer on a real context: ambient, diffuse and specular light and
// opacity read back from a textured face, and its bindings and shared program.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include <glm/gtc/matrix_transform.hpp>

#include "AssetFiles.h"
#include "GlContext.h"
#include "Pictures.h"
#include "GlRecorder.h"
#include "Render/LightRenderer.h"
#include "Render/ModelObject.h"

using vitest::pixelAt;
using vitest::PixelTexture;
using vitest::Rgba;

namespace {

const Rgba kTexel{200, 100, 50, 255};
const Rgba kClearBlue{0, 0, 255, 255};

// A face filling the viewport, facing +z, in one colour; the lighting
// variables are the test's own and are read at every draw.
class LitFace : public testing::Test {
protected:
    LitFace() {
        face.mode = GL_TRIANGLE_STRIP;
        face.texture = &texel.texture();
        face.positions = positions;
        face.normals = normals;
        face.texCoords = texCoords;
        face.vertexCount = 4;
        face.elementCount = 4;
        face.positionsStatic = true;
        face.normalsStatic = true;
        face.texCoordsStatic = true;
    }

    // The colour at the centre of the viewport after one draw.
    Rgba drawCentre(vi::Renderer& renderer) {
        glClearColor(0.0f, 0.0f, 1.0f, 1.0f);
        glClear(GL_COLOR_BUFFER_BIT);
        renderer.render();
        return pixelAt(32, 32);
    }

    vitest::GlContext gl{64, 64};
    PixelTexture texel{1, 1, {kTexel}};
    const float positions[12] = {-1, -1, 0, 1, -1, 0, -1, 1, 0, 1, 1, 0};
    const float normals[12] = {0, 0, 1, 0, 0, 1, 0, 0, 1, 0, 0, 1};
    const float texCoords[8] = {0, 0, 1, 0, 0, 1, 1, 1};
    vi::Drawable face;

    // Far away, so that the directions interpolated from the corners (which the
    // fragment shader does not normalise again) are straight up at the centre.
    glm::vec3 light{0.0f, 0.0f, 100.0f};
    glm::vec3 eye{0.0f, 0.0f, 100.0f};
    float ambient = 0.0f;
    float diffuse = 0.0f;
    float specular = 0.0f;
    float shininess = 1.0f;
};

}  // namespace

TEST_F(LitFace, AmbientAloneGivesTheTextureColourTimesTheFactorAndOpacityHalvesAlpha) {
    // Only "uAmbient" is bound; eye and light stay at the origin. The face is
    // moved half a unit away from them so that the specular base at the centre
    // is positive: pow(0, 0) is undefined in GLSL and the exponent is 0 here.
    face.modelMatrix = glm::translate(glm::mat4(1.0f), glm::vec3(0.0f, 0.0f, -0.5f));
    vi::LightRenderer renderer(face);
    ASSERT_GE(renderer.addUniform("uAmbient", &ambient, vi::Uniform::Float, 1), 0);

    ambient = 0.5f;
    Rgba half = drawCentre(renderer);
    EXPECT_TRUE(half.near(Rgba{100, 50, 25, 255}, 2)) << half;
    ambient = 1.0f;
    Rgba full = drawCentre(renderer);
    EXPECT_TRUE(full.near(kTexel, 2)) << full;
    face.opacity = 0.5f;
    Rgba halfOpaque = drawCentre(renderer);
    EXPECT_TRUE(halfOpaque.near(Rgba{200, 100, 50, 128}, 1)) << halfOpaque;
}

TEST_F(LitFace, LightInFrontOfTheFaceLightsItAndLightBehindDoesNot) {
    vi::LightRenderer renderer(face);
    renderer.addUniform("uLightPosition", &light, vi::Uniform::Float3, 1);
    renderer.addUniform("uDiffuse", &diffuse, vi::Uniform::Float, 1);
    renderer.addUniform("uShininess", &shininess, vi::Uniform::Float, 1);
    diffuse = 1.0f;

    light = glm::vec3(0.0f, 0.0f, 100.0f);
    Rgba front = drawCentre(renderer);
    light = glm::vec3(0.0f, 0.0f, -100.0f);
    Rgba behind = drawCentre(renderer);

    EXPECT_TRUE(front.near(kTexel, 2)) << front;
    EXPECT_EQ(behind, (Rgba{0, 0, 0, 255}));
}

TEST_F(LitFace, SpecularLightIsAddedUncoloured) {
    vi::LightRenderer renderer(face);
    renderer.addUniform("uLightPosition", &light, vi::Uniform::Float3, 1);
    renderer.addUniform("uEyePosition", &eye, vi::Uniform::Float3, 1);
    renderer.addUniform("uAmbient", &ambient, vi::Uniform::Float, 1);
    renderer.addUniform("uSpecular", &specular, vi::Uniform::Float, 1);
    renderer.addUniform("uShininess", &shininess, vi::Uniform::Float, 1);
    ambient = 0.5f;

    Rgba unlit = drawCentre(renderer);
    specular = 0.4f;
    Rgba lit = drawCentre(renderer);

    // Light and eye straight above the centre: the reflection meets the eye,
    // so each channel gains the same 0.4.
    EXPECT_NEAR(lit.r - unlit.r, 102, 3);
    EXPECT_NEAR(lit.g - unlit.g, 102, 3);
    EXPECT_NEAR(lit.b - unlit.b, 102, 3);
    EXPECT_TRUE(unlit.near(Rgba{100, 50, 25, 255}, 2)) << unlit;
}

TEST_F(LitFace, RenderersShareOneProgramAndBindTheirArraysInOrder) {
    vitest::GlRecording recording;
    auto first = std::make_unique<vi::LightRenderer>(face);
    auto second = std::make_unique<vi::LightRenderer>(face);
    ASSERT_NE(vi::LightRenderer::msShaderProgram, nullptr);
    EXPECT_EQ(first->program, second->program);
    EXPECT_EQ(vi::LightRenderer::msUseCount, 2u);
    // Compiled once; the fragment text keeps its shared line and the two blanks after "specular =".
    std::vector<vitest::GlCall> sources = vitest::GlRecorder::callsNamed("glShaderSource");
    ASSERT_EQ(sources.size(), 2u);
    EXPECT_NE(sources[1].text.find("\nuniform float uOpacity;uniform float uAmbient;\n"), std::string::npos);
    EXPECT_NE(sources[1].text.find("\n    float specular =  uSpecular * pow("), std::string::npos);

    std::vector<std::string> attributes;
    for (vi::Attribute* a : first->attributes) attributes.push_back(a->name);
    EXPECT_EQ(attributes, (std::vector<std::string>{"aPosition", "aNormal", "aTextureCoord"}));
    ASSERT_EQ(first->textures.size(), 1u);
    EXPECT_EQ(first->textures[0].first, &texel.texture());

    GLuint shared = first->program->program;
    first.reset();
    EXPECT_TRUE(glIsProgram(shared));
    second.reset();
    EXPECT_EQ(vi::LightRenderer::msShaderProgram, nullptr);
    EXPECT_FALSE(glIsProgram(shared));
}

TEST_F(LitFace, ModelFromAFileShowsWhereItsVerticesPlaceIt) {
    vitest::AssetDirectory assets;
    // The right half of the viewport, as two indexed triangles.
    assets.write("half.bin",
                 vitest::modelFile({{0, -1, 0}, {1, -1, 0}, {0, 1, 0}, {1, 1, 0}},
                                   {{0, 0, 1}, {0, 0, 1}, {0, 0, 1}, {0, 0, 1}}, {{0, 0}, {1, 0}, {0, 1}, {1, 1}},
                                   {0, 1, 2, 2, 1, 3}));
    vi::ModelObject model("half");
    vi::Drawable drawable;
    drawable.texture = &texel.texture();
    model.fillDrawable(drawable);
    vi::LightRenderer renderer(drawable);
    renderer.addUniform("uAmbient", &ambient, vi::Uniform::Float, 1);
    renderer.addUniform("uShininess", &shininess, vi::Uniform::Float, 1);
    ambient = 1.0f;

    drawCentre(renderer);
    EXPECT_TRUE(pixelAt(48, 32).near(kTexel, 2)) << pixelAt(48, 32);
    EXPECT_TRUE(pixelAt(62, 62).near(kTexel, 2)) << pixelAt(62, 62);
    EXPECT_EQ(pixelAt(16, 32), kClearBlue);

}
