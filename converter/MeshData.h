#pragma once

// One joined triangle mesh as the model file stores it: separate arrays of
// positions, normals and texture coordinates (one entry per vertex) and
// 32-bit triangle indices, narrowed to 16 bits only when the file is written.

#include <cstdint>
#include <vector>

#include <glm/glm.hpp>

namespace vi {

struct MeshData {
    std::vector<glm::vec3> positions;
    std::vector<glm::vec3> normals;
    std::vector<glm::vec2> texCoords;
    std::vector<std::uint32_t> indices;  // three per triangle

    // 16-bit indices address vertices 0 to 65535.
    static constexpr std::size_t kMaxVertices = 65536;
};

}  // namespace vi
