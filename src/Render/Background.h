#pragma once

// One texture over the whole viewport, as a screen-aligned quad with no
// matrices applied; the texture's first row at the top, stretched whatever its
// aspect. Owns its renderer; sets no GL state of its own.

#include <glm/glm.hpp>

#include "Render/BackgroundRenderer.h"
#include "Render/Drawable.h"
#include "Tools/Export.h"

namespace vi {

class Texture;
class Renderer;

class VI_EXPORT Background {
public:
    explicit Background(Texture& texture);
    ~Background();

    Background(const Background&) = delete;
    Background& operator=(const Background&) = delete;

    void renderFrame();
    Renderer* getRenderer();

    glm::vec2 corners[4];  // clip space: top left, top right, bottom left, bottom right
    BackgroundRenderer* renderer;
    Drawable drawable;
};

}  // namespace vi
