// Editable meshes: no GL context needed.
#include <gtest/gtest.h>

#include <glm/gtc/matrix_transform.hpp>

#include <vector>

#include "Render/GL.h"
#include "Render/Geometry.h"
#include "Render/GeometryRectangle.h"

using Points = std::vector<glm::vec3>;

TEST(Geometry, RotationMatchesGlmAboutAnyAxisAndLeavesNormals) {
    const Points points = {{1, 0, 0}, {0, 2, 0}, {0.5f, -1, 3}, {-2, 4, -1.5f}};
    for (const glm::vec3& axis : Points{{0, 0, 1}, {1, 0, 0}, {0, -3, 0}, {1, 2, 3}, {-0.2f, 5, 0.7f}}) {
        SCOPED_TRACE(testing::Message() << "axis " << axis.x << " " << axis.y << " " << axis.z);
        vi::Geometry geometry;
        geometry.positions = points;
        geometry.normals = points;
        geometry.rotate(0.7f, axis);
        const glm::mat4 rotation = glm::rotate(glm::mat4(1.0f), 0.7f, glm::normalize(axis));
        for (std::size_t i = 0; i < points.size(); ++i)
            for (int c = 0; c < 3; ++c)
                EXPECT_NEAR(geometry.positions[i][c], (rotation * glm::vec4(points[i], 1.0f))[c], 1e-5f);
        EXPECT_EQ(geometry.normals, points);
    }
}

TEST(Geometry, ReconstructEmptiesEveryArrayOfAPlainGeometry) {
    vi::Geometry geometry;
    geometry.positions = geometry.normals = {{1, 1, 1}};
    geometry.texCoords = {{1, 1}};
    geometry.indices = {0};
    geometry.reconstruct();
    EXPECT_TRUE(geometry.positions.empty() && geometry.normals.empty() && geometry.texCoords.empty() &&
                geometry.indices.empty());
}

TEST(GeometryRectangle, BuildsAStripQuadInPlaneZeroAndUpdateMovesOnlyItsCorners) {
    vi::GeometryRectangle rectangle;
    rectangle.positions.assign(6, glm::vec3(7));  // construction leaves exactly four of each
    rectangle.texCoords.assign(6, glm::vec2(7));
    rectangle.construct({1, 2, 5}, {3, 4});
    EXPECT_EQ(rectangle.mode, unsigned(GL_TRIANGLE_STRIP));
    EXPECT_EQ(rectangle.positions, (Points{{1, 2, 0}, {1, 6, 0}, {4, 2, 0}, {4, 6, 0}}));
    EXPECT_EQ(rectangle.normals, Points(4, glm::vec3(0, 0, 1)));
    EXPECT_EQ(rectangle.texCoords, (std::vector<glm::vec2>{{0, 1}, {0, 0}, {1, 1}, {1, 0}}));
    EXPECT_EQ(rectangle.indices, (std::vector<unsigned short>{0, 1, 2, 3}));
    EXPECT_EQ(rectangle.getBorder(), glm::vec4(1, 4, 2, 6));

    rectangle.normals[2] = {1, 0, 0};
    rectangle.texCoords[0] = {0.5f, 0.5f};
    rectangle.update({-1, -2, 9}, {2, 0.5f});
    const Points moved = {{-1, -2, 0}, {-1, -1.5f, 0}, {1, -2, 0}, {1, -1.5f, 0}};
    EXPECT_EQ(rectangle.positions, moved);
    EXPECT_EQ(rectangle.normals[2], glm::vec3(0, 0, 1));
    EXPECT_EQ(rectangle.texCoords[0], glm::vec2(0.5f, 0.5f));
    EXPECT_EQ(rectangle.getBorder(), glm::vec4(-1, 1, -2, -1.5f));

    rectangle.translate({3, 3, 3});
    rectangle.reconstruct();
    EXPECT_EQ(rectangle.positions, moved);
    EXPECT_EQ(rectangle.texCoords[0], glm::vec2(0, 1));
}
