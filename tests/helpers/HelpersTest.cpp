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

using vitest::readPixel;

namespace {

const char* const kVertex = "attribute vec3 aPosition;\nattribute vec2 aTextureCoord;\nvarying vec2 vCoord;\n"
                            "void main() { vCoord = aTextureCoord; gl_Position = vec4(aPosition, 1.0); }\n";
const char* const kCoordinates = "precision mediump float;\nvarying vec2 vCoord;\n"
                                 "void main() { gl_FragColor = vec4(vCoord, 0.0, 1.0); }";  // no last newline
const char* const kWhite = "precision mediump float;\nvoid main() { gl_FragColor = vec4(1.0); }\n";

class Helpers : public testing::Test {
protected:
    Helpers() : assets(mkdtemp(folder)) {
        vi::File::getAssetManager() = vi::DirectoryAssetManager::create(assets);
        for (auto [name, text] : {std::pair{"quad.vert", kVertex}, {"quad.frag", kCoordinates},
                                  {"white.vert", kVertex}, {"white.frag", kWhite}})
            std::ofstream(assets / name) << text;
    }
    ~Helpers() override {
        vi::DirectoryAssetManager::destroy(vi::File::getAssetManager());
        vi::File::getAssetManager() = nullptr;
        std::filesystem::remove_all(assets);
    }
    std::uint32_t drawAndRead(vi::Renderer& renderer, int x, int y) {
        glClearColor(0.0f, 0.0f, 1.0f, 1.0f);
        glClear(GL_COLOR_BUFFER_BIT);
        renderer.render();
        return readPixel(x, y);
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
    // Colour = texture coordinates: t = 0 on the top row.
    EXPECT_TRUE(vitest::near(drawAndRead(renderer, 0, 63), 0x000000FF, 8));
    EXPECT_TRUE(vitest::near(readPixel(63, 63), 0xFF0000FF, 8));
    EXPECT_TRUE(vitest::near(readPixel(0, 0), 0x00FF00FF, 8));
    EXPECT_TRUE(vitest::near(readPixel(63, 0), 0xFFFF00FF, 8));
}

TEST_F(Helpers, AGeometryWithoutIndicesOrCoordinatesIsDrawnWhereItsPositionsAreUploadedOnlyWhenTheyMove) {
    struct Row {
        bool positionsMove;
        std::uint32_t leftAfterTheMove, rightAfterTheMove;
    };
    for (const Row& row : {Row{true, 0x0000FFFF, 0xFFFFFFFF}, Row{false, 0xFFFFFFFF, 0x0000FFFF}}) {
        vi::Geometry leftHalf;  // two triangles, drawn in order
        leftHalf.positions = {{-1, -1, 0}, {0, -1, 0}, {-1, 1, 0}, {-1, 1, 0}, {0, -1, 0}, {0, 1, 0}};
        leftHalf.mode = GL_TRIANGLES;
        vi::Drawable drawable;
        vi::DrawableArrays::pointAt(drawable, leftHalf, row.positionsMove);
        std::unique_ptr<vi::ShaderProgram> program = vi::ShaderAssets::load("white");
        vi::Renderer renderer(*program, drawable);
        vi::DrawableArrays::bind(renderer);
        EXPECT_EQ(renderer.attributes.size(), 1u);  // positions only: the others are null
        EXPECT_EQ(std::vector<std::uint32_t>({drawAndRead(renderer, 16, 32), readPixel(48, 32)}),
                  (std::vector<std::uint32_t>{0xFFFFFFFF, 0x0000FFFF}));
        leftHalf.translate(glm::vec3(1, 0, 0));
        EXPECT_EQ(std::vector<std::uint32_t>({drawAndRead(renderer, 16, 32), readPixel(48, 32)}),
                  (std::vector<std::uint32_t>{row.leftAfterTheMove, row.rightAfterTheMove}))
            << "positions move: " << row.positionsMove;
    }
}

TEST_F(Helpers, AShaderPairWithAMissingHalfEndsTheProcessAsAnyMissingAssetDoes) {
    std::filesystem::remove(assets / "quad.frag");
    EXPECT_EXIT(vi::ShaderAssets::load("quad"), testing::ExitedWithCode(71), "");
}

}  // namespace
