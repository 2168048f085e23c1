// The model file's encoding and checks, in process: what --info must refuse
// before the runtime reads past an end, atomic writes, and a projection corner case.

#include <cmath>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ConverterFixture.h"
#include "ModelFile.h"
#include "UvProjection.h"

using testing::HasSubstr;
using vi::MeshData;
using vi::ModelFile;
using vi::UvProjection;

namespace {

MeshData quad() {
    MeshData mesh;
    mesh.positions = {{0, 0, 0}, {1, 0, 0}, {1, 1, 0}, {0, 1, -2}};
    mesh.normals = {{0, 0, 1}, {0, 0, 1}, {0, 0, 1}, {0, 0, 1}};
    mesh.texCoords = {{0, 0}, {1, 0}, {1, 1}, {0, 1}};
    mesh.indices = {0, 1, 2, 0, 2, 3};
    return mesh;
}

void putU16(std::vector<std::uint8_t>& bytes, std::size_t offset, std::uint16_t value) {
    bytes[offset] = std::uint8_t(value);
    bytes[offset + 1] = std::uint8_t(value >> 8);
}

TEST(ModelFile, WithoutIndicesEveryThreeVerticesAreATriangle) {
    MeshData mesh = quad();
    mesh.positions.resize(3);
    mesh.normals.resize(3);
    mesh.texCoords.resize(3);
    mesh.indices.clear();
    ModelFile::Info info;
    std::string error;
    ASSERT_TRUE(ModelFile::inspect(ModelFile::encode(mesh), info, error)) << error;
    EXPECT_EQ(info.triangleCount(), 1u);
}

TEST(ModelFile, InspectRejectsAnIndexPastTheLastVertex) {
    std::vector<std::uint8_t> bytes = ModelFile::encode(quad());
    putU16(bytes, 136 + 2 * 5, 4);
    ModelFile::Info info;
    std::string error;
    EXPECT_FALSE(ModelFile::inspect(bytes, info, error));
    EXPECT_THAT(error, HasSubstr("index 5 is 4"));
}

TEST(ModelFile, HugeCountsInAShortFileAreTruncationNotOverflow) {
    std::vector<std::uint8_t> bytes = {0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 1, 2, 3};
    ModelFile::Info info;
    std::string error;
    EXPECT_FALSE(ModelFile::inspect(bytes, info, error));
    EXPECT_THAT(error, HasSubstr("truncated"));
    EXPECT_EQ(info.expectedSize, 8u + 32u * 0xFFFFFFFFull + 2u * 0xFFFFFFFFull);
}

TEST(ModelFile, AtomicWriteReplacesAnExistingFileAndLeavesNoTemporary) {
    vitest::ScratchDirectory scratch;
    scratch.write("model.bin", "previous contents");
    std::string error;
    std::vector<std::uint8_t> bytes = ModelFile::encode(quad());
    ASSERT_TRUE(ModelFile::writeAtomically(scratch.pathOf("model.bin"), bytes, error)) << error;
    EXPECT_EQ(scratch.read<std::uint8_t>("model.bin"), bytes);
    EXPECT_THAT(scratch.entries(), testing::ElementsAre("model.bin"));
}

TEST(UvProjection, PlanarOfAFlatAxisIsNotADivisionByZero) {
    UvProjection projection(UvProjection::Planar, glm::vec3(0, 0, 0), glm::vec3(2, 0, 0));
    glm::vec2 uv = projection.project(glm::vec3(1, 0, 0));
    EXPECT_FLOAT_EQ(uv.x, 0.5f);
    EXPECT_TRUE(std::isfinite(uv.y));
}

}  // namespace
