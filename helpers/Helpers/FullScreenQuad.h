#pragma once

// A quad over the whole window: a rectangle from (-1, -1) to (1, 1) in clip
// space and a drawable pointed at it (see DrawableArrays), for a renderer
// whose vertex shader passes aPosition through. The texture's top row lands on
// the window's top edge. Owns its arrays; not copyable, since the drawable
// points into them. No GL.

#include "Render/Drawable.h"
#include "Render/GeometryRectangle.h"

namespace vi {

class FullScreenQuad {
public:
    FullScreenQuad();

    FullScreenQuad(const FullScreenQuad&) = delete;
    FullScreenQuad& operator=(const FullScreenQuad&) = delete;

    Drawable& drawable() { return mDrawable; }

private:
    GeometryRectangle mRectangle;
    Drawable mDrawable;
};

}  // namespace vi
