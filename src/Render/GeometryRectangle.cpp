#include "Render/GeometryRectangle.h"

namespace vi {

namespace {
constexpr unsigned int kCorners = 4;
const glm::vec2 kTexCoords[kCorners] = {{0.0f, 1.0f}, {0.0f, 0.0f}, {1.0f, 1.0f}, {1.0f, 0.0f}};
const unsigned short kIndices[kCorners] = {0, 1, 2, 3};
}  // namespace

GeometryRectangle::GeometryRectangle() : Geometry(), position(0.0f), size(0.0f) {}

void GeometryRectangle::construct(const glm::vec3& newPosition, const glm::vec2& newSize) {
    position = newPosition;
    size = newSize;
    construct();
}

void GeometryRectangle::update(const glm::vec3& newPosition, const glm::vec2& newSize) {
    position = newPosition;
    size = newSize;
    update();
}

void GeometryRectangle::construct() {
    positions.resize(kCorners, glm::vec3(0.0f));
    normals.resize(kCorners, glm::vec3(0.0f));
    texCoords.resize(kCorners);
    indices.resize(kCorners);
    for (unsigned int i = 0; i < kCorners; ++i) {
        texCoords[i] = kTexCoords[i];
        indices[i] = kIndices[i];
    }
    Geometry::construct();
}

void GeometryRectangle::update() {
    // Before construct() there are no corners to rewrite.
    if (positions.size() >= kCorners) {
        const float x = position.x;
        const float y = position.y;
        const float w = size.x;
        const float h = size.y;
        // The z of `position` is not used on purpose: the quad lies in z = 0.
        positions[0] = glm::vec3(x, y, 0.0f);
        positions[1] = glm::vec3(x, y + h, 0.0f);
        positions[2] = glm::vec3(x + w, y, 0.0f);
        positions[3] = glm::vec3(x + w, y + h, 0.0f);
    }
    for (glm::vec3& normal : normals) normal = glm::vec3(0.0f, 0.0f, 1.0f);
}

glm::vec4 GeometryRectangle::getBorder() const {
    return glm::vec4(position.x, position.x + size.x, position.y, position.y + size.y);
}

}  // namespace vi
