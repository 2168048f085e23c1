#pragma once

// Reads a mesh file through assimp (OBJ, glTF, PLY, STL, ...) and joins every
// mesh instance of the node tree into one triangle mesh: node transforms are
// applied to positions and (inverse-transposed) to normals, polygons are
// triangulated, points and lines are dropped, and missing normals are computed
// (smooth across edges flatter than the crease angle, or flat per face).
// Vertices without texture coordinates are reported, not invented: the caller
// decides whether to project them.

#include <cstddef>
#include <string>
#include <vector>

#include "MeshData.h"

namespace vi {

class MeshImporter {
public:
    struct Options {
        bool flatNormals = false;
        float creaseAngleDegrees = 66.0f;
    };

    // A run of joined vertices that came from one source mesh without
    // texture coordinates (their texCoords are zero).
    struct MissingUv {
        std::string meshName;
        std::size_t first;
        std::size_t count;
    };

    static bool import(const std::string& path, const Options& options, MeshData& mesh,
                       std::vector<MissingUv>& missingUv, std::string& error);
};

}  // namespace vi
