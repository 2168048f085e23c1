#pragma once

// Draws a textured mesh with per-pixel ambient, diffuse and specular light from
// one point light. The effect binds the lighting uniforms to its own variables
// ("uLightPosition", "uEyePosition", "uAmbient", "uDiffuse", "uSpecular",
// "uShininess"); an unbound one stays 0. The program is shared by every lit
// renderer under a use count, as the background's is.

#include "Render/Renderer.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT LightRenderer : public Renderer {
public:
    explicit LightRenderer(Drawable& drawable);
    ~LightRenderer() override;

    static ShaderProgram* getShaderProgram();

    static ShaderProgram* msShaderProgram;
    static unsigned int msUseCount;
};

}  // namespace vi
