// Editable meshes and the drawable record: no GL context needed.
#include <gtest/gtest.h>

#include <glm/gtc/matrix_transform.hpp>

#include <string>
#include <vector>

#include "Render/GL.h"
#include "Render/Geometry.h"
#include "Render/GeometryRectangle.h"

namespace {

void expectNear(const glm::vec3& actual, const glm::vec3& expected, float tolerance = 1e-5f) {
    EXPECT_NEAR(actual.x, expected.x, tolerance);
    EXPECT_NEAR(actual.y, expected.y, tolerance);
    EXPECT_NEAR(actual.z, expected.z, tolerance);
}

// Records which virtual slots the base class goes through.
class SlotLog : public vi::Geometry {
public:
    void construct() override {
        log += "construct ";
        Geometry::construct();
    }
    void update() override { log += "update "; }
    void clear() override {
        log += "clear ";
        Geometry::clear();
    }
    std::string log;
};

}  // namespace

TEST(Geometry, RotationMatchesGlmAboutAnyAxisAndLeavesNormals) {
    const std::vector<glm::vec3> points = {{1, 0, 0}, {0, 2, 0}, {0.5f, -1, 3}, {-2, 4, -1.5f}};
    const std::vector<glm::vec3> axes = {{0, 0, 1}, {1, 0, 0}, {0, -3, 0}, {1, 2, 3}, {-0.2f, 5, 0.7f}};
    const float angle = 0.7f;
    for (const glm::vec3& axis : axes) {
        vi::Geometry geometry;
        geometry.positions = points;
        geometry.normals = {{0, 0, 1}, {0, 1, 0}, {1, 0, 0}, {0.6f, 0.8f, 0}};
        geometry.rotate(angle, axis);
        const glm::mat4 rotation = glm::rotate(glm::mat4(1.0f), angle, glm::normalize(axis));
        for (size_t i = 0; i < points.size(); ++i)
            expectNear(geometry.positions[i], glm::vec3(rotation * glm::vec4(points[i], 1.0f)));
        EXPECT_EQ(geometry.normals[3], glm::vec3(0.6f, 0.8f, 0));
        EXPECT_EQ(geometry.normals[0], glm::vec3(0, 0, 1));
    }
}

TEST(GeometryRectangle, BuildsAStripQuadInPlaneZeroWithTopRowOnTheUpperEdge) {
    vi::GeometryRectangle rectangle;
    rectangle.construct({1, 2, 5}, {3, 4});
    EXPECT_EQ(rectangle.mode, unsigned(GL_TRIANGLE_STRIP));
    EXPECT_EQ(rectangle.positions, (std::vector<glm::vec3>{{1, 2, 0}, {1, 6, 0}, {4, 2, 0}, {4, 6, 0}}));
    EXPECT_EQ(rectangle.normals, (std::vector<glm::vec3>(4, glm::vec3(0, 0, 1))));
    EXPECT_EQ(rectangle.texCoords, (std::vector<glm::vec2>{{0, 1}, {0, 0}, {1, 1}, {1, 0}}));
    EXPECT_EQ(rectangle.indices, (std::vector<unsigned short>{0, 1, 2, 3}));
    EXPECT_EQ(rectangle.getBorder(), glm::vec4(1, 4, 2, 6));
}

TEST(GeometryRectangle, UpdateMovesCornersAndResetsNormalsOnly) {
    vi::GeometryRectangle rectangle;
    rectangle.construct({0, 0, 0}, {1, 1});
    rectangle.normals[2] = {1, 0, 0};
    rectangle.texCoords[0] = {0.5f, 0.5f};
    rectangle.update({-1, -2, 9}, {2, 0.5f});
    EXPECT_EQ(rectangle.positions, (std::vector<glm::vec3>{{-1, -2, 0}, {-1, -1.5f, 0}, {1, -2, 0}, {1, -1.5f, 0}}));
    EXPECT_EQ(rectangle.normals[2], glm::vec3(0, 0, 1));
    EXPECT_EQ(rectangle.texCoords[0], glm::vec2(0.5f, 0.5f));
    EXPECT_EQ(rectangle.getBorder(), glm::vec4(-1, 1, -2, -1.5f));
}

TEST(Geometry, EmptyGeometryStaysEmptyAndInStripMode) {
    vi::Geometry geometry{vi::Geometry::DoNotConstruct()};
    EXPECT_EQ(geometry.mode, unsigned(GL_TRIANGLE_STRIP));
    geometry.normals = {{0, 0, 1}};
    geometry.translate({1, 1, 1});
    geometry.rotate(1.0f, {0, 0, 0});  // a zero axis is harmless with no positions
    geometry.scale({0, 0, 0});
    EXPECT_TRUE(geometry.positions.empty());
    EXPECT_EQ(geometry.normals, (std::vector<glm::vec3>{{0, 0, 1}}));
}

TEST(Geometry, ReconstructClearsThenConstructsThroughTheVirtualSlots) {
    SlotLog geometry;
    EXPECT_EQ(geometry.log, "");  // the constructor does not construct
    geometry.positions = {{1, 1, 1}};
    geometry.reconstruct();
    EXPECT_EQ(geometry.log, "clear construct update ");
    EXPECT_TRUE(geometry.positions.empty());
}

TEST(GeometryRectangle, ConstructLeavesExactlyFourEntriesAndRebuildsIdentically) {
    vi::GeometryRectangle rectangle;
    rectangle.positions.assign(6, glm::vec3(7));
    rectangle.normals.assign(6, glm::vec3(7));
    rectangle.texCoords.assign(6, glm::vec2(7));
    rectangle.indices.assign(6, 7);
    rectangle.construct({0.5f, 0.25f, 0}, {2, 3});
    EXPECT_EQ(rectangle.normals.size() + rectangle.texCoords.size() + rectangle.indices.size(), 12u);
    const vi::GeometryRectangle first = rectangle;

    rectangle.translate({3, 3, 3});
    rectangle.clear();
    EXPECT_TRUE(rectangle.positions.empty() && rectangle.indices.empty());
    rectangle.construct();
    EXPECT_EQ(rectangle.positions, first.positions);
    EXPECT_EQ(rectangle.texCoords, first.texCoords);

    rectangle.translate({3, 3, 3});
    rectangle.reconstruct();
    EXPECT_EQ(rectangle.positions, first.positions);
}
