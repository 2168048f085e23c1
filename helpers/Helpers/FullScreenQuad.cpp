#include "Helpers/FullScreenQuad.h"

#include "Helpers/DrawableArrays.h"

namespace vi {

namespace {

// Clip space: the window runs from -1 to 1 on both axes.
const glm::vec3 kLowerLeft(-1.0f, -1.0f, 0.0f);
const glm::vec2 kSize(2.0f, 2.0f);

}  // namespace

FullScreenQuad::FullScreenQuad() {
    mRectangle.construct(kLowerLeft, kSize);
    DrawableArrays::pointAt(mDrawable, mRectangle);
}

}  // namespace vi
