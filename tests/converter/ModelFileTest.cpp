// The model file's encoding and checks, in process: what the runtime reads
// from a file, and what --info must refuse before the runtime reads past an end.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ConverterFixture.h"
#include "ModelFile.h"

using testing::HasSubstr;
using vi::MeshData;
using vi::ModelFile;

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

TEST(ModelFile, FourVerticesAndSixIndicesPutTheIndicesAtByte136) {
    std::vector<std::uint8_t> bytes = ModelFile::encode(quad());
    ASSERT_EQ(bytes.size(), 148u);
    EXPECT_EQ(ModelFile::indicesOffset(4), 136u);
    const std::uint8_t indices[12] = {0, 0, 1, 0, 2, 0, 0, 0, 2, 0, 3, 0};
    EXPECT_TRUE(std::equal(indices, indices + 12, bytes.begin() + 136));
}

TEST(ModelFile, DecodedArraysEqualTheMesh) {
    MeshData mesh = quad();
    vitest::DecodedModel decoded;
    ASSERT_TRUE(vitest::decode(ModelFile::encode(mesh), decoded));
    for (std::size_t v = 0; v < 4; ++v) {
        EXPECT_EQ(decoded.positions[v], mesh.positions[v]);
        EXPECT_EQ(decoded.normals[v], mesh.normals[v]);
        EXPECT_EQ(decoded.texCoords[v], mesh.texCoords[v]);
    }
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
    vitest::ConverterScratch scratch;
    scratch.write("model.bin", "previous contents");
    std::string error;
    std::vector<std::uint8_t> bytes = ModelFile::encode(quad());
    ASSERT_TRUE(ModelFile::writeAtomically(scratch.pathOf("model.bin"), bytes, error)) << error;
    EXPECT_EQ(scratch.read("model.bin"), bytes);
    EXPECT_THAT(scratch.entries(), testing::ElementsAre("model.bin"));
}

}  // namespace
