#pragma once

// GLSL ES sources shared by the figures.

namespace vibench {

// A textured quad moved by its own offset: the renderers of the frame and recovery figures.
extern const char* const kQuadVertex;
extern const char* const kQuadFragment;
// A lit, textured mesh that uses every standard uniform plus two of its own
// ("uTint", "uTime") and one sampler ("uTexture"): the render figure.
extern const char* const kMeshVertex;
extern const char* const kMeshFragment;

}  // namespace vibench
