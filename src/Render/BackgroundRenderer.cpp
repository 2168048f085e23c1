#include "Render/BackgroundRenderer.h"

namespace vi {

ShaderProgram* BackgroundRenderer::msShaderProgram = nullptr;
unsigned int BackgroundRenderer::msUseCount = 0;

namespace {

// The texture's first row (t = 0) lands at the top of the viewport.
const char* const kVertexSource =
    "precision mediump float;\n"
    "attribute vec2 aPosition;\n"
    "varying vec2 vTextureCoord;\n"
    "void main()\n"
    "{\n"
    "    vec2 tex = 0.5 * aPosition + 0.5;\n"
    "    tex.y = 1.0 - tex.y;\n"
    "    vTextureCoord = tex;\n"
    "    gl_Position = vec4(aPosition, 0.0, 1.0);\n"
    "}\n";

// "uOpacity" is declared but unused on purpose, so the driver drops it and a
// background ignores its drawable's opacity. The two declarations share a line
// as they always have; the text is kept exactly.
const char* const kFragmentSource =
    "precision mediump float;\n"
    "uniform sampler2D uTexture;\n"
    "uniform float uOpacity;varying vec2 vTextureCoord;\n"
    "void main()\n"
    "{\n"
    "    vec4 color = texture2D(uTexture, vTextureCoord);\n"
    "    gl_FragColor = vec4(color);\n"
    "}\n";

}  // namespace

ShaderProgram* BackgroundRenderer::getShaderProgram() {
    // Counted on every call, also from outside: such a caller keeps the program alive.
    return ShaderProgram::acquireShared(msShaderProgram, msUseCount, kVertexSource, kFragmentSource);
}

BackgroundRenderer::BackgroundRenderer(Drawable& drawable) : Renderer(*getShaderProgram(), drawable) {
    addAttribute("aPosition", drawable.positions, 2, drawable.positionsStatic);
    addTexture("uTexture", drawable.texture);
}

BackgroundRenderer::~BackgroundRenderer() { ShaderProgram::releaseShared(msShaderProgram, msUseCount); }

}  // namespace vi
