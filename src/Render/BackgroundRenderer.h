#pragma once

// The renderer of vi::Background: a built-in program shared by every
// background renderer under a use count; made on first use, deleted when the
// count returns to 0. A call of getShaderProgram() from outside raises the
// count with no matching decrement, so the program then outlives them all.

#include "Render/Renderer.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT BackgroundRenderer : public Renderer {
public:
    explicit BackgroundRenderer(Drawable& drawable);
    ~BackgroundRenderer() override;

    static ShaderProgram* getShaderProgram();

    static ShaderProgram* msShaderProgram;
    static unsigned int msUseCount;
};

}  // namespace vi
