#pragma once

// Texture coordinates for vertices that have none, projected from their
// positions relative to the bounding box of the whole model:
//  - Spherical: longitude and latitude around the box centre;
//    s = 0.5 + atan2(z, x) / 2 pi, t = 0.5 + asin(y / r) / pi (t = 1 at the top).
//  - Planar: the two longest box axes mapped to 0..1 (s along the longest).

#include <cstddef>
#include <string>

#include <glm/glm.hpp>

#include "MeshData.h"

namespace vi {

class UvProjection {
public:
    enum Mode {
        Spherical,
        Planar,
    };

    static bool parseMode(const std::string& text, Mode& mode);
    static const char* name(Mode mode);

    UvProjection(Mode mode, const glm::vec3& boundsMin, const glm::vec3& boundsMax);

    glm::vec2 project(const glm::vec3& position) const;

    // Fills texCoords[first, first + count) from the matching positions.
    void apply(MeshData& mesh, std::size_t first, std::size_t count) const;

private:
    Mode mMode;
    glm::vec3 mCentre;
    glm::vec3 mMin;
    glm::vec3 mExtent;
    int mAxisS;  // planar: longest axis
    int mAxisT;  // planar: second longest axis
};

}  // namespace vi
