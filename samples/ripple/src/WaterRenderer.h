#pragma once

// Draws the water: the wallpaper, fitted to cover the screen, seen through a
// surface disturbed by the ripples of a RippleField, graded through two tone
// curve tables (the previous grade and the current one, cross-faded), with
// light glinting on the wave fronts. Drawn into the scene's render target as
// one full-screen quad; every value it needs is bound by name to the scene's
// own variables and read at every draw. The program is the scene's.

#include <glm/glm.hpp>

#include "Render/Renderer.h"
#include "RippleField.h"

namespace vi {

class Texture;

class WaterRenderer : public Renderer {
public:
    // The scene's variables the shader reads.
    struct Inputs {
        const glm::vec3* ripples;             // RippleField::kSlots (x, y, age)
        const float* amplitudes;              // RippleField::kSlots
        const glm::vec4* wallpaperTransform;  // texture coordinate = screen * xy + zw
        const glm::vec2* screenScale;         // screen to round units: shorter side = 1
        const float* gradeBlend;              // 0: previous grade, 1: current grade
        const float* gradeStrength;           // 0: ungraded, 1: fully graded
        const glm::vec4* shadow;              // centre (screen), radius (round units), darkness
    };

    WaterRenderer(ShaderProgram& program, Drawable& quad, Texture* wallpaper, Texture* gradeFrom, Texture* gradeTo,
                  const Inputs& inputs);

    static const char* vertexSource();
    static const char* fragmentSource();

    // Where the wallpaper's texture coordinates come from so that a picture
    // of `textureSize` covers a screen of `screenSize` without distortion,
    // cropped evenly; the picture's first row is the top of the screen.
    static glm::vec4 coverTransform(const glm::vec2& textureSize, const glm::vec2& screenSize);
};

}  // namespace vi
