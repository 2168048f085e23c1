// Model files used in place: where a filled drawable points into the buffer,
// which flags it gets and what it keeps.
#include <gtest/gtest.h>

#include <GLES2/gl2.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "Render/Drawable.h"
#include "Render/ModelObject.h"
#include "AssetFiles.h"

using vitest::AssetDirectory;
using vitest::modelFile;

namespace {

const std::vector<glm::vec3> kQuadPositions = {{-1, -1, 0}, {1, -1, 0}, {-1, 1, 0}, {1, 1, 0}};
const std::vector<glm::vec3> kQuadNormals = {{0, 0, 1}, {0, 0.6f, 0.8f}, {0, 0, 1}, {0, 0, 1}};
const std::vector<glm::vec2> kQuadTexCoords = {{0, 0}, {1, 0}, {0, 1}, {1, 1}};
const std::vector<std::uint16_t> kQuadIndices = {0, 1, 2, 2, 1, 3};

}  // namespace

TEST(ModelObject, UnindexedFileFillsAPlainListAndKeepsTheCallersFields) {
    AssetDirectory assets;
    assets.write("triangle.bin", modelFile({{0, 0, 0}, {1, 0, 0}, {0, 1, 0}}, {{0, 0, 1}, {0, 0.6f, 0.8f}, {0, 0, 1}},
                                           {{0, 0}, {1, 0}, {0, 1}}, {}));
    vi::ModelObject model("triangle");
    const char* buffer = model.getBuffer();
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(buffer) % 4, 0u);

    vi::Drawable drawable;
    drawable.indices = reinterpret_cast<const unsigned short*>(buffer);
    drawable.opacity = 0.25f;
    drawable.positionsStatic = true;
    drawable.texCoordsStatic = false;

    EXPECT_TRUE(model.fillDrawable(drawable));

    EXPECT_EQ(drawable.mode, unsigned(GL_TRIANGLES));
    EXPECT_EQ(drawable.vertexCount, 3u);
    EXPECT_EQ(drawable.elementCount, 3u);
    EXPECT_EQ(drawable.indices, nullptr);
    EXPECT_EQ(reinterpret_cast<const char*>(drawable.positions), buffer + 8);
    EXPECT_EQ(reinterpret_cast<const char*>(drawable.normals), buffer + 8 + 36);
    EXPECT_EQ(reinterpret_cast<const char*>(drawable.texCoords), buffer + 8 + 72);
    EXPECT_EQ(drawable.normals[4], 0.6f);
    // Positions and normals go up again at every draw, texture coordinates once.
    EXPECT_FALSE(drawable.positionsStatic);
    EXPECT_FALSE(drawable.normalsStatic);
    EXPECT_TRUE(drawable.texCoordsStatic);
    EXPECT_EQ(drawable.opacity, 0.25f);
}

TEST(ModelObject, NameCubeOpensCubeBinWithFourVerticesAndIndicesAtByte136) {
    AssetDirectory assets;
    assets.write("cube", "not this one");
    assets.write("cube.bin", modelFile(kQuadPositions, kQuadNormals, kQuadTexCoords, kQuadIndices));
    vi::ModelObject model("cube");
    vi::Drawable drawable;

    model.fillDrawable(drawable);

    EXPECT_EQ(reinterpret_cast<const char*>(drawable.indices), model.getBuffer() + 136);
    EXPECT_EQ(drawable.elementCount, 6u);
    EXPECT_EQ(drawable.vertexCount, 4u);
    EXPECT_EQ(std::vector<std::uint16_t>(drawable.indices, drawable.indices + 6), kQuadIndices);
}

TEST(ModelObject, ScaleDoublesPositionsInPlaceAndLeavesEverythingElse) {
    AssetDirectory assets;
    std::vector<char> bytes = modelFile(kQuadPositions, kQuadNormals, kQuadTexCoords, kQuadIndices);
    assets.write("quad.bin", bytes);
    vi::ModelObject model("quad");
    vi::Drawable drawable;
    model.fillDrawable(drawable);

    model.scale(2.0f);

    // The drawable filled before sees the change: it points into the same buffer.
    for (unsigned int i = 0; i < 12; ++i) EXPECT_EQ(drawable.positions[i], 2.0f * (&kQuadPositions[0].x)[i]) << i;
    std::vector<char> after(model.getBuffer(), model.getBuffer() + model.getLength());
    ASSERT_EQ(after.size(), bytes.size());
    EXPECT_TRUE(std::equal(after.begin(), after.begin() + 8, bytes.begin()));
    EXPECT_TRUE(std::equal(after.begin() + 56, after.end(), bytes.begin() + 56));
}
