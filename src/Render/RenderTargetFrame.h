#pragma once

// What a renderer needs of the render targets it samples: draw one again
// before it is sampled. Declared apart from RenderableTexture, which itself
// draws with renderers, so that the renderer does not depend on it.

#include "Tools/Export.h"

namespace vi {

class Texture;

// `target` must be a render target (mKind kRenderTargetTexture): its
// RenderableTexture::renderFrame().
VI_HIDDEN void renderTargetFrame(Texture& target);

}  // namespace vi
