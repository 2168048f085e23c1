// Projection and placement corner cases, in process.

#include <cmath>

#include <gtest/gtest.h>

#include "ConverterTool.h"
#include "UvProjection.h"

using vi::ConverterOptions;
using vi::UvProjection;

namespace {

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
