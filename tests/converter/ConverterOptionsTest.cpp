// The command line and the projections, in process.

#include <cmath>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ConverterOptions.h"
#include "ConverterTool.h"
#include "UvProjection.h"

using testing::HasSubstr;
using vi::ConverterOptions;
using vi::UvProjection;

namespace {

TEST(ConverterOptions, ConversionNeedsTwoFilesAndKeepsTheirOrder) {
    ConverterOptions options;
    std::string error;
    ASSERT_TRUE(options.parse({"--flip-v", "in.obj", "--center", "out.bin"}, error)) << error;
    EXPECT_EQ(options.action, ConverterOptions::Convert);
    EXPECT_EQ(options.input, "in.obj");
    EXPECT_EQ(options.output, "out.bin");
    EXPECT_TRUE(options.flipV);
    EXPECT_TRUE(options.centre);
    EXPECT_FALSE(options.generateUv);
}

TEST(ConverterOptions, GenerateUvDefaultsToSpherical) {
    ConverterOptions options;
    std::string error;
    ASSERT_TRUE(options.parse({"--generate-uv", "a", "b"}, error));
    EXPECT_TRUE(options.generateUv);
    EXPECT_EQ(options.uvMode, UvProjection::Spherical);
    ConverterOptions planar;
    ASSERT_TRUE(planar.parse({"--generate-uv=planar", "a", "b"}, error));
    EXPECT_EQ(planar.uvMode, UvProjection::Planar);
}

TEST(ConverterOptions, RejectsValuesThatMakeNoModel) {
    std::string error;
    EXPECT_FALSE(ConverterOptions().parse({"--fit", "-1", "a", "b"}, error));
    EXPECT_THAT(error, HasSubstr("--fit"));
    EXPECT_FALSE(ConverterOptions().parse({"--scale", "0", "a", "b"}, error));
    EXPECT_FALSE(ConverterOptions().parse({"--scale", "2x", "a", "b"}, error));
    EXPECT_FALSE(ConverterOptions().parse({"--crease-angle", "181", "a", "b"}, error));
    EXPECT_FALSE(ConverterOptions().parse({"a", "b", "--fit"}, error));
    EXPECT_THAT(error, HasSubstr("needs a value"));
}

TEST(ConverterOptions, InfoTakesExactlyOneFile) {
    std::string error;
    ConverterOptions options;
    ASSERT_TRUE(options.parse({"--info", "m.bin"}, error));
    EXPECT_EQ(options.action, ConverterOptions::Info);
    EXPECT_EQ(options.input, "m.bin");
    EXPECT_FALSE(ConverterOptions().parse({"--info", "a.bin", "b.bin"}, error));
}

TEST(UvProjection, SphericalPutsTheTopAtOneAndTheBottomAtZero) {
    UvProjection projection(UvProjection::Spherical, glm::vec3(-1), glm::vec3(1));
    EXPECT_FLOAT_EQ(projection.project(glm::vec3(0, 1, 0)).y, 1.0f);
    EXPECT_FLOAT_EQ(projection.project(glm::vec3(0, -1, 0)).y, 0.0f);
    EXPECT_FLOAT_EQ(projection.project(glm::vec3(1, 0, 0)).x, 0.5f);
    EXPECT_FLOAT_EQ(projection.project(glm::vec3(0, 0, 1)).x, 0.75f);
}

TEST(UvProjection, SphericalIsTakenAroundTheBoxCentre) {
    UvProjection projection(UvProjection::Spherical, glm::vec3(9, 9, 9), glm::vec3(11, 11, 11));
    EXPECT_FLOAT_EQ(projection.project(glm::vec3(10, 11, 10)).y, 1.0f);
    // The centre itself has no direction: the middle of the texture.
    EXPECT_EQ(projection.project(glm::vec3(10, 10, 10)), glm::vec2(0.5f, 0.5f));
}

TEST(UvProjection, PlanarChoosesTheLongestAxisForS) {
    UvProjection projection(UvProjection::Planar, glm::vec3(0, 0, 0), glm::vec3(1, 8, 4));
    // y (8) is the longest, z (4) the second.
    EXPECT_EQ(projection.project(glm::vec3(0.5f, 2, 1)), glm::vec2(0.25f, 0.25f));
}

TEST(UvProjection, PlanarOfAFlatAxisIsNotADivisionByZero) {
    UvProjection projection(UvProjection::Planar, glm::vec3(0, 0, 0), glm::vec3(2, 0, 0));
    glm::vec2 uv = projection.project(glm::vec3(1, 0, 0));
    EXPECT_FLOAT_EQ(uv.x, 0.5f);
    EXPECT_TRUE(std::isfinite(uv.y));
}

TEST(ConverterTool, NegativeScaleKeepsTrianglesFacingOut) {
    vi::MeshData mesh;
    mesh.positions = {{0, 0, 0}, {1, 0, 0}, {0, 1, 0}};
    mesh.normals = {{0, 0, 1}, {0, 0, 1}, {0, 0, 1}};
    mesh.texCoords = {{0, 0}, {1, 0}, {0, 1}};
    mesh.indices = {0, 1, 2};
    ConverterOptions options;
    options.scale = -1.0f;
    vi::ConverterTool::placeModel(options, mesh);
    glm::vec3 a = mesh.positions[mesh.indices[0]], b = mesh.positions[mesh.indices[1]],
              c = mesh.positions[mesh.indices[2]];
    EXPECT_GT(glm::dot(glm::cross(b - a, c - a), mesh.normals[0]), 0.0f);
}

}  // namespace
