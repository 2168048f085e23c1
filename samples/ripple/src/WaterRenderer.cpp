#include "WaterRenderer.h"

#include "Helpers/DrawableArrays.h"
#include "Render/Texture.h"
#include "Render/Uniform.h"

namespace vi {

// The fragment shader declares its ripple arrays with this length.
static_assert(RippleField::kSlots == 12, "uRipples and uAmplitudes hold 12 entries");

const char* WaterRenderer::vertexSource() {
    // The background that shows the target puts a texture's first row at the
    // top, while what is drawn into a target starts at its bottom row: the
    // water is drawn upside down so that it arrives the right way up.
    return "attribute vec3 aPosition;\n"
           "varying vec2 vScreen;\n"
           "void main()\n"
           "{\n"
           "    vScreen = 0.5 * aPosition.xy + 0.5;\n"
           "    gl_Position = vec4(aPosition.x, -aPosition.y, 0.0, 1.0);\n"
           "}\n";
}

const char* WaterRenderer::fragmentSource() {
    return "#ifdef GL_FRAGMENT_PRECISION_HIGH\n"
           "precision highp float;\n"
           "#else\n"
           "precision mediump float;\n"
           "#endif\n"
           "uniform sampler2D uWallpaper;\n"
           "uniform sampler2D uGradeFrom;\n"
           "uniform sampler2D uGradeTo;\n"
           "uniform vec4 uWallpaperTransform;\n"
           "uniform vec2 uScreenScale;\n"
           "uniform vec3 uRipples[12];\n"
           "uniform float uAmplitudes[12];\n"
           "uniform float uGradeBlend;\n"
           "uniform float uGradeStrength;\n"
           "uniform vec4 uShadow;\n"
           "varying vec2 vScreen;\n"
           // Waves run outwards at kSpeed (shorter screen sides per second),
           // as a packet a few wavelengths wide that widens and fades with age.
           "const float kSpeed = 0.30;\n"
           "const float kWaveNumber = 80.0;\n"
           "const float kRefraction = 0.0005;\n"
           "const vec2 kLight = vec2(-0.55, 0.83);\n"
           "vec3 grade(sampler2D curves, vec3 c)\n"
           "{\n"
           // Level v of the 1 x 256 table lies at the centre of texel row v.
           "    vec3 t = c * (255.0 / 256.0) + 0.5 / 256.0;\n"
           "    return vec3(texture2D(curves, vec2(0.5, t.r)).r,\n"
           "                texture2D(curves, vec2(0.5, t.g)).g,\n"
           "                texture2D(curves, vec2(0.5, t.b)).b);\n"
           "}\n"
           "void main()\n"
           "{\n"
           "    vec2 p = vScreen * uScreenScale;\n"
           "    vec2 slope = vec2(0.0);\n"
           "    for (int i = 0; i < 12; ++i) {\n"
           "        float amplitude = uAmplitudes[i];\n"
           "        if (amplitude > 0.0) {\n"
           "            float age = uRipples[i].z;\n"
           "            vec2 d = p - uRipples[i].xy * uScreenScale;\n"
           "            float dist = length(d);\n"
           "            float x = dist - age * kSpeed;\n"
           "            float width = 0.035 + 0.05 * age;\n"
           "            float envelope = amplitude * exp(-x * x / (width * width) - 0.6 * age)\n"
           "                             / (1.0 + 3.0 * age * kSpeed);\n"
           "            float phase = kWaveNumber * x;\n"
           "            float dh = envelope * (kWaveNumber * cos(phase) - 2.0 * x / (width * width) * sin(phase));\n"
           "            slope += d / max(dist, 0.001) * dh;\n"
           "        }\n"
           "    }\n"
           "    vec2 screen = vScreen - slope * kRefraction / uScreenScale;\n"
           "    vec2 uv = screen * uWallpaperTransform.xy + uWallpaperTransform.zw;\n"
           "    vec3 colour = texture2D(uWallpaper, uv).rgb;\n"
           // Light on the tilted surface: brighter where it faces the light.
           "    float facing = dot(slope, kLight) * 0.008;\n"
           "    colour += facing * 0.5 + pow(max(facing, 0.0), 2.0) * 3.0;\n"
           "    colour = clamp(colour, 0.0, 1.0);\n"
           // The soft shadow of what floats above, on the water it looks through.
           "    vec2 s = (screen - uShadow.xy) * uScreenScale / uShadow.z * vec2(1.0, 2.2);\n"
           "    colour *= 1.0 - uShadow.w * exp(-dot(s, s) * 1.6);\n"
           "    vec3 graded = mix(grade(uGradeFrom, colour), grade(uGradeTo, colour), uGradeBlend);\n"
           "    colour = mix(colour, graded, uGradeStrength);\n"
           "    vec2 edge = vScreen - 0.5;\n"
           "    colour *= 1.0 - 0.35 * dot(edge, edge);\n"
           "    gl_FragColor = vec4(colour, 1.0);\n"
           "}\n";
}

glm::vec4 WaterRenderer::coverTransform(const glm::vec2& textureSize, const glm::vec2& screenSize) {
    glm::vec2 scale(1.0f);
    float textureAspect = textureSize.x / glm::max(textureSize.y, 1.0f);
    float screenAspect = screenSize.x / glm::max(screenSize.y, 1.0f);
    if (textureAspect > screenAspect)
        scale.x = screenAspect / textureAspect;  // wider picture: crop its sides
    else
        scale.y = textureAspect / screenAspect;  // taller picture: crop top and bottom
    // s = (x - 0.5) * sx + 0.5; t = 1 - ((y - 0.5) * sy + 0.5), the first row on top.
    return glm::vec4(scale.x, -scale.y, 0.5f - 0.5f * scale.x, 0.5f + 0.5f * scale.y);
}

WaterRenderer::WaterRenderer(ShaderProgram& program, Drawable& quad, Texture* wallpaper, Texture* gradeFrom,
                             Texture* gradeTo, const Inputs& inputs)
    : Renderer(program, quad) {
    DrawableArrays::bind(*this);
    addTexture("uWallpaper", wallpaper);
    addTexture("uGradeFrom", gradeFrom);
    addTexture("uGradeTo", gradeTo);
    addUniform("uWallpaperTransform", inputs.wallpaperTransform, Uniform::Float4, 1);
    addUniform("uScreenScale", inputs.screenScale, Uniform::Float2, 1);
    addUniform("uRipples", inputs.ripples, Uniform::Float3, RippleField::kSlots);
    addUniform("uAmplitudes", inputs.amplitudes, Uniform::Float, RippleField::kSlots);
    addUniform("uGradeBlend", inputs.gradeBlend, Uniform::Float, 1);
    addUniform("uGradeStrength", inputs.gradeStrength, Uniform::Float, 1);
    addUniform("uShadow", inputs.shadow, Uniform::Float4, 1);
}

}  // namespace vi
