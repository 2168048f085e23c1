#pragma once

// What every effect writes to draw a Geometry: a drawable pointed at the
// geometry's arrays, and a renderer bound to those arrays under the names the
// framework's own shaders use. The drawable only points: the geometry keeps
// the arrays and must outlive every renderer of the drawable, and anything
// that resizes them (construct, reconstruct, clear) calls pointAt again.
// No GL in pointAt; bind makes the renderer's buffers (GL thread).

#include "Render/Drawable.h"
#include "Render/Geometry.h"
#include "Render/Renderer.h"

namespace vi {

class DrawableArrays {
public:
    // The attribute names bind() uses: vec3 positions, vec3 normals, vec2
    // texture coordinates, as in the lit renderer's shaders.
    static const char* const kPosition;
    static const char* const kNormal;
    static const char* const kTextureCoord;

    // The geometry's mode, counts and arrays. An array the geometry leaves
    // empty is null (no indices: its vertices are drawn in order). Positions
    // are uploaded once unless `positionsMove` (the effect moves the geometry
    // after this: update, translate, rotate, scale).
    static void pointAt(Drawable& drawable, const Geometry& geometry, bool positionsMove = false);

    // Adds the drawable's non-null arrays to the renderer as kPosition,
    // kNormal and kTextureCoord: the positions always, the other two when
    // the program uses them (a lookup each, now).
    static void bind(Renderer& renderer);
};

}  // namespace vi
