#include "Render/LightRenderer.h"

namespace vi {

ShaderProgram* LightRenderer::msShaderProgram = nullptr;
unsigned int LightRenderer::msUseCount = 0;

namespace {

// Light and eye directions come from the model matrix alone (world space),
// although the variable is called mvPosition.
const char* const kVertexSource =
    "precision mediump float;\n"
    "attribute vec3 aPosition;\n"
    "attribute vec3 aNormal;\n"
    "attribute vec2 aTextureCoord;\n"
    "uniform mat4 uModelViewProjectionMatrix;\n"
    "uniform mat4 uModelMatrix;\n"
    "uniform mat3 uNormalMatrix;\n"
    "uniform vec3 uLightPosition;\n"
    "uniform vec3 uEyePosition;\n"
    "varying vec3 vNormal;\n"
    "varying vec2 vTextureCoord;\n"
    "varying vec3 vLightDirection;\n"
    "varying vec3 vEyeDirection;\n"
    "void main()\n"
    "{\n"
    "    vNormal = normalize(uNormalMatrix * aNormal);\n"
    "    vTextureCoord = aTextureCoord;\n"
    "    vec4 position = vec4(aPosition, 1.0);\n"
    "    vec3 mvPosition = (uModelMatrix * position).xyz;\n"
    "    vLightDirection = normalize(uLightPosition - mvPosition);\n"
    "    vEyeDirection = normalize(uEyePosition - mvPosition);\n"
    "    gl_Position = uModelViewProjectionMatrix * position;\n"
    "}\n";

// Specular light is added uncoloured; opacity scales the texture's alpha. The
// text is kept exactly as it has always been, including the two declarations
// on one line and the two blanks after "specular =".
const char* const kFragmentSource =
    "precision mediump float;\n"
    "uniform sampler2D uTexture;\n"
    "uniform float uOpacity;uniform float uAmbient;\n"
    "uniform float uDiffuse;\n"
    "uniform float uSpecular;\n"
    "uniform float uShininess;\n"
    "varying vec3 vNormal;\n"
    "varying vec2 vTextureCoord;\n"
    "varying vec3 vLightDirection;\n"
    "varying vec3 vEyeDirection;\n"
    "void main()\n"
    "{\n"
    "    vec4 color = texture2D(uTexture, vTextureCoord);\n"
    "    float diffuse = uDiffuse * max(0.0, dot(vLightDirection, vNormal));\n"
    "    vec3 reflected = normalize(-reflect(vLightDirection, vNormal));\n"
    "    float specular =  uSpecular * pow((max(0.0, dot(reflected, vEyeDirection))), uShininess);\n"
    "    gl_FragColor = vec4(color.rgb * (uAmbient + diffuse) + specular, color.a * uOpacity);\n"
    "}\n";

}  // namespace

ShaderProgram* LightRenderer::getShaderProgram() {
    // Counted on every call, also from outside: such a caller keeps the program alive.
    return ShaderProgram::acquireShared(msShaderProgram, msUseCount, kVertexSource, kFragmentSource);
}

LightRenderer::LightRenderer(Drawable& drawable) : Renderer(*getShaderProgram(), drawable) {
    addAttribute("aPosition", drawable.positions, 3, drawable.positionsStatic);
    addAttribute("aNormal", drawable.normals, 3, drawable.normalsStatic);
    addAttribute("aTextureCoord", drawable.texCoords, 2, drawable.texCoordsStatic);
    addTexture("uTexture", drawable.texture);
}

LightRenderer::~LightRenderer() { ShaderProgram::releaseShared(msShaderProgram, msUseCount); }

}  // namespace vi
