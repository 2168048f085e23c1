// The helpers an effect draws with: a shader pair read from the assets, a
// full-screen quad the right way up, and geometries of any shape drawn
// through a drawable pointed at them, moving or not.
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

const char* const kVertex = "attribute vec3 aPosition;\nattribute vec2 aTextureCoord;\nvarying vec2 vCoord;\n"
                            "void main() { vCoord = aTextureCoord; gl_Position = vec4(aPosition, 1.0); }\n";
const char* const kCoordinates = "precision mediump float;\nvarying vec2 vCoord;\n"
                                 "void main() { gl_FragColor = vec4(vCoord, 0.0, 1.0); }";  // no last newline
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
    drawAndRead(renderer, 0, 0);
    // Colour = texture coordinates: t = 0 on the top row (y = 63).
    for (auto [x, y, colour] : {std::tuple{0, 63, 0x000000FFu}, {63, 63, 0xFF0000FFu}, {0, 0, 0x00FF00FFu},
                                {63, 0, 0xFFFF00FFu}})
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
        EXPECT_EQ(renderer.attributes.size(), 1u);  // positions only: the program's aTextureCoord is null here
        EXPECT_EQ(std::vector<std::uint32_t>({drawAndRead(renderer, 16, 32), vitest::readPixel(48, 32)}),
                  (std::vector<std::uint32_t>{kBlack, kClear}));
        leftHalf.translate(glm::vec3(1, 0, 0));
        EXPECT_EQ(std::vector<std::uint32_t>({drawAndRead(renderer, 16, 32), vitest::readPixel(48, 32)}),
                  (std::vector<std::uint32_t>{left, right})) << "positions move: " << positionsMove;
    }
}

TEST_F(Helpers, AShaderPairWithAMissingHalfEndsTheProcessAsAnyMissingAssetDoes) {
    std::filesystem::remove(assets / "quad.frag");
    EXPECT_EXIT(vi::ShaderAssets::load("quad"), testing::ExitedWithCode(71), "");
}

}  // namespace
