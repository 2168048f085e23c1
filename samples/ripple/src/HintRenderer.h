#pragma once

// The affordance hint: rings that swell out of a point near the bottom of the
// screen and fade, one pulse after another, over a soft glow. Drawn blended
// over the water on a small quad (a GeometryRectangle in clip space, placed
// by the scene for its layout). The program is the scene's.

#include <glm/glm.hpp>

#include "Render/Renderer.h"

namespace vi {

class HintRenderer : public Renderer {
public:
    struct Inputs {
        const float* phase;       // pulses so far: the fraction is the pulse's progress
        const float* alpha;       // overall visibility, 0..1
        const glm::vec3* colour;
    };

    HintRenderer(ShaderProgram& program, Drawable& quad, const Inputs& inputs);

    static const char* vertexSource();
    static const char* fragmentSource();
};

}  // namespace vi
