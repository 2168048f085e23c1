#include "Render/Geometry.h"

#include <cmath>

#include "Render/GL.h"

namespace vi {

Geometry::Geometry() : mode(GL_TRIANGLE_STRIP) {}

Geometry::Geometry(DoNotConstruct) : mode(GL_TRIANGLE_STRIP) {}

Geometry::~Geometry() {}

void Geometry::construct() { update(); }

void Geometry::reconstruct() {
    clear();
    construct();
}

void Geometry::update() {}

void Geometry::clear() {
    positions.clear();
    normals.clear();
    texCoords.clear();
    indices.clear();
}

void Geometry::init() { mode = GL_TRIANGLE_STRIP; }

void Geometry::translate(const glm::vec3& offset) {
    for (glm::vec3& position : positions) position += offset;
}

void Geometry::rotate(float angle, const glm::vec3& axis) {
    if (positions.empty()) return;
    const float c = std::cos(angle);
    const float s = std::sin(angle);
    const float t = 1.0f - c;
    for (glm::vec3& p : positions) {
        // No guard against a zero axis: the caller gives a direction.
        const float length = std::sqrt(axis.x * axis.x + axis.y * axis.y + axis.z * axis.z);
        const float x = axis.x / length;
        const float y = axis.y / length;
        const float z = axis.z / length;
        const glm::vec3 q = p;
        p.x = (t * x * x + c) * q.x + (t * x * y - s * z) * q.y + (t * x * z + s * y) * q.z;
        p.y = (t * x * y + s * z) * q.x + (t * y * y + c) * q.y + (t * y * z - s * x) * q.z;
        p.z = (t * x * z - s * y) * q.x + (t * y * z + s * x) * q.y + (t * z * z + c) * q.z;
    }
}

void Geometry::scale(glm::vec3 factors) {
    for (glm::vec3& position : positions) position *= factors;
}

}  // namespace vi
