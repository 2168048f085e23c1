#include "Render/Drawable.h"

namespace vi {

glm::mat4 Drawable::mProjectionMatrix(1.0f);
glm::mat4 Drawable::mViewMatrix(1.0f);
glm::mat4 Drawable::mIdentityMatrix(1.0f);

Drawable::Drawable()
    : mode(0),
      texture(nullptr),
      userWords{0, 0, 0},
      indices(nullptr),
      elementCount(0),
      vertexCount(0),
      userTag(0),
      positions(nullptr),
      normals(nullptr),
      texCoords(nullptr),
      modelMatrix(mIdentityMatrix),
      normalMatrix(0.0f),
      modelViewProjectionMatrix(0.0f),
      modelViewMatrix(0.0f),
      opacity(1.0f),
      positionsStatic(false),
      normalsStatic(false),
      texCoordsStatic(false),
      indicesChanged(false) {}

}  // namespace vi
