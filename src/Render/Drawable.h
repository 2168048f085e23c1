#pragma once

// The plain record a renderer draws: pointers to vertex arrays that its owner
// keeps alive, counts, the primitive mode, the per-object matrices and opacity,
// and flags saying which arrays change. Not polymorphic; field order is part of
// the plug-in interface.

#include <glm/glm.hpp>

#include "Tools/Export.h"

namespace vi {

class Texture;

class VI_EXPORT Drawable {
public:
    // Every field zero, except the model matrix (identity) and opacity (1).
    Drawable();

    // The normal, model-view and model-view-projection matrices from the model
    // matrix and the shared view and projection; what a renderer does before
    // each draw.
    void deriveMatrices();

    unsigned int mode;
    Texture* texture;
    unsigned int userWords[3];  // zero in every drawable the framework fills; free for effects
    const unsigned short* indices;
    unsigned int elementCount;
    unsigned int vertexCount;
    unsigned int userTag;  // the background stores 3 here; not read by the framework
    const float* positions;
    const float* normals;
    const float* texCoords;
    glm::mat4 modelMatrix;
    glm::mat3 normalMatrix;
    glm::mat4 modelViewProjectionMatrix;
    glm::mat4 modelViewMatrix;
    float opacity;
    bool positionsStatic;
    bool normalsStatic;
    bool texCoordsStatic;
    bool indicesChanged;

    static glm::mat4 mProjectionMatrix;
    static glm::mat4 mViewMatrix;
    static glm::mat4 mIdentityMatrix;
};

}  // namespace vi
