#include "Helpers/DrawableArrays.h"

namespace vi {

const char* const DrawableArrays::kPosition = "aPosition";
const char* const DrawableArrays::kNormal = "aNormal";
const char* const DrawableArrays::kTextureCoord = "aTextureCoord";

namespace {

template <typename Vector>
const float* firstFloat(const std::vector<Vector>& values) {
    return values.empty() ? nullptr : &values[0].x;
}

constexpr unsigned int kPositionComponents = 3;
constexpr unsigned int kNormalComponents = 3;
constexpr unsigned int kTextureCoordComponents = 2;

// Normals or texture coordinates the geometry has and the shaders do not
// read are no mistake, so they are not offered: the desktop hosts warn about
// a name the program lacks. Positions every program reads, so a program
// without kPosition is warned about.
void bindIfUsed(Renderer& renderer, const char* name, const float* data, unsigned int components, bool isStatic) {
    if (data && glGetAttribLocation(renderer.program->program, name) != -1)
        renderer.addAttribute(name, data, components, isStatic);
}

}  // namespace

void DrawableArrays::pointAt(Drawable& drawable, const Geometry& geometry, bool positionsMove) {
    drawable.mode = geometry.mode;
    drawable.vertexCount = unsigned(geometry.positions.size());
    drawable.indices = geometry.indices.empty() ? nullptr : geometry.indices.data();
    drawable.elementCount = unsigned(geometry.indices.empty() ? geometry.positions.size() : geometry.indices.size());
    drawable.positions = firstFloat(geometry.positions);
    drawable.normals = firstFloat(geometry.normals);
    drawable.texCoords = firstFloat(geometry.texCoords);
    drawable.positionsStatic = !positionsMove;
    drawable.normalsStatic = true;
    drawable.texCoordsStatic = true;
}

void DrawableArrays::bind(Renderer& renderer) {
    const Drawable& drawable = *renderer.drawable;
    if (drawable.positions)
        renderer.addAttribute(kPosition, drawable.positions, kPositionComponents, drawable.positionsStatic);
    bindIfUsed(renderer, kNormal, drawable.normals, kNormalComponents, drawable.normalsStatic);
    bindIfUsed(renderer, kTextureCoord, drawable.texCoords, kTextureCoordComponents, drawable.texCoordsStatic);
}

}  // namespace vi
