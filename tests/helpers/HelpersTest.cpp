// The helpers an effect draws with: a shader pair read from the assets, a
// full-screen quad the right way up with every array bound, and geometries of
// any shape drawn through a drawable pointed at them, moving or not.
#include <gtest/gtest.h>

#include <stdlib.h>

#include <filesystem>
#include <fstream>

#include "Helpers/DrawableArrays.h"
#include "Helpers/FullScreenQuad.h"
#include "Helpers/ShaderAssets.h"
#include "Painters.h"
#include "Tools/DirectoryAssetManager.h"
#include "Tools/File.h"

namespace {

// Colour = (texture coordinates, the normal's z); an array left unbound reads as 0.
const char* const kVertex = "attribute vec3 aPosition;\nattribute vec3 aNormal;\nattribute vec2 aTextureCoord;\n"
                            "varying vec3 vColour;\nvoid main() { vColour = vec3(aTextureCoord, aNormal.z);\n"
                            "gl_Position = vec4(aPosition, 1.0); }\n";
const char* const kCoordinates = "precision mediump float;\nvarying vec3 vColour;\n"
                                 "void main() { gl_FragColor = vec4(vColour, 1.0); }";  // no last newline
constexpr std::uint32_t kBlack = 0x000000FF, kClear = 0x0000FFFF;  // no texture coordinates: (0, 0)

class Helpers : public testing::Test {
protected:
    Helpers() : assets(mkdtemp(folder)) {
        vi::File::getAssetManager() = vi::DirectoryAssetManager::create(assets);
        std::ofstream(assets / "quad.vert") << kVertex;
        std::ofstream(assets / "quad.frag") << kCoordinates;
    }
    ~Helpers() override {
        vi::DirectoryAssetManager::destroy(vi::File::getAssetManager());
        vi::File::getAssetManager() = nullptr;
        std::filesystem::remove_all(assets);
    }
    std::uint32_t drawAndRead(vi::Renderer& renderer, int x, int y) {
        glClearColor(0.0f, 0.0f, 1.0f, 1.0f);  // kClear
        glClear(GL_COLOR_BUFFER_BIT);
        renderer.render();
        return vitest::readPixel(x, y);
    }

    char folder[24] = "/tmp/vi-helpers-XXXXXX";
    std::filesystem::path assets;
    vitest::GlContext gl{64, 64};
};

TEST_F(Helpers, AFullScreenQuadFromTheAssetsShadersCoversTheWindowWithTheTopRowAtTheTop) {
    vi::FullScreenQuad quad;
    std::unique_ptr<vi::ShaderProgram> program = vi::ShaderAssets::load("quad");
    vi::Renderer renderer(*program, quad.drawable());
    vi::DrawableArrays::bind(renderer);
    std::vector<bool> uploadedOnce;  // positions, normals, texture coordinates
    for (const vi::Attribute* attribute : renderer.attributes) uploadedOnce.push_back(attribute->isStatic);
    EXPECT_EQ(uploadedOnce, std::vector<bool>(3, true));
    drawAndRead(renderer, 0, 0);
    // t = 0 on the top row (y = 63); every normal (0, 0, 1).
    for (auto [x, y, colour] : {std::tuple{0, 63, 0x0000FFFFu}, {63, 63, 0xFF00FFFFu}, {0, 0, 0x00FFFFFFu},
                                {63, 0, 0xFFFFFFFFu}})
        EXPECT_TRUE(vitest::near(vitest::readPixel(x, y), colour, 8)) << "at " << x << ", " << y;
}

TEST_F(Helpers, AGeometryWithoutIndicesOrCoordinatesIsDrawnWhereItsPositionsAreUploadedOnlyWhenTheyMove) {
    // Whether the positions move | the left and right halves after the geometry moved right.
    for (auto [positionsMove, left, right] :
         {std::tuple{true, kClear, kBlack}, {false, kBlack, kClear}}) {
        vi::Geometry leftHalf;  // two triangles, drawn in order
        leftHalf.positions = {{-1, -1, 0}, {0, -1, 0}, {-1, 1, 0}, {-1, 1, 0}, {0, -1, 0}, {0, 1, 0}};
        leftHalf.mode = GL_TRIANGLES;
        vi::Drawable drawable;
        vi::DrawableArrays::pointAt(drawable, leftHalf, positionsMove);
        std::unique_ptr<vi::ShaderProgram> program = vi::ShaderAssets::load("quad");
        vi::Renderer renderer(*program, drawable);
        vi::DrawableArrays::bind(renderer);
        EXPECT_EQ(renderer.attributes.size(), 1u);  // positions only: the others are null here
        EXPECT_EQ(std::vector<std::uint32_t>({drawAndRead(renderer, 16, 32), vitest::readPixel(48, 32)}),
                  (std::vector<std::uint32_t>{kBlack, kClear}));
        leftHalf.translate(glm::vec3(1, 0, 0));
        EXPECT_EQ(std::vector<std::uint32_t>({drawAndRead(renderer, 16, 32), vitest::readPixel(48, 32)}),
                  (std::vector<std::uint32_t>{left, right})) << "positions move: " << positionsMove;
    }
}

}  // namespace
