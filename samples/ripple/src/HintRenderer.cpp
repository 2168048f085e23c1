#include "HintRenderer.h"

#include "Helpers/DrawableArrays.h"
#include "Render/Uniform.h"

namespace vi {

const char* HintRenderer::vertexSource() {
    return "attribute vec3 aPosition;\n"
           "attribute vec2 aTextureCoord;\n"
           "varying vec2 vLocal;\n"
           "void main()\n"
           "{\n"
           "    vLocal = 2.0 * aTextureCoord - 1.0;\n"
           "    gl_Position = vec4(aPosition.xy, 0.0, 1.0);\n"
           "}\n";
}

const char* HintRenderer::fragmentSource() {
    return "precision mediump float;\n"
           "uniform float uPhase;\n"
           "uniform float uAlpha;\n"
           "uniform vec3 uColour;\n"
           "varying vec2 vLocal;\n"
           "void main()\n"
           "{\n"
           "    float r = length(vLocal);\n"
           "    float progress = fract(uPhase);\n"
           // The ring grows from the centre to the quad's edge and thins as it fades.
           "    float radius = 0.18 + 0.78 * progress;\n"
           "    float width = 0.07 * (1.0 - 0.6 * progress);\n"
           "    float ring = exp(-(r - radius) * (r - radius) / (width * width)) * (1.0 - progress);\n"
           "    float glow = exp(-r * r / 0.03) * (0.55 + 0.45 * cos(6.2831853 * progress));\n"
           "    float a = clamp(ring * 0.9 + glow * 0.6, 0.0, 1.0) * uAlpha * (1.0 - smoothstep(0.92, 1.0, r));\n"
           "    gl_FragColor = vec4(uColour, a);\n"
           "}\n";
}

HintRenderer::HintRenderer(ShaderProgram& program, Drawable& quad, const Inputs& inputs)
    : Renderer(program, quad) {
    DrawableArrays::bind(*this);
    addUniform("uPhase", inputs.phase, Uniform::Float, 1);
    addUniform("uAlpha", inputs.alpha, Uniform::Float, 1);
    addUniform("uColour", inputs.colour, Uniform::Float3, 1);
}

}  // namespace vi
