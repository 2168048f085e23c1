#pragma once

// An axis-aligned quad in the plane z = 0, drawn as a triangle strip of
// vertices 0..3; texture row t = 0 lands on the upper edge.

#include <glm/glm.hpp>

#include "Render/Geometry.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT GeometryRectangle : public Geometry {
public:
    GeometryRectangle();

    void construct(const glm::vec3& position, const glm::vec2& size);
    void update(const glm::vec3& position, const glm::vec2& size);
    void construct() override;
    void update() override;

    // (left x, right x, bottom y, top y)
    glm::vec4 getBorder() const;

    glm::vec3 position;
    glm::vec2 size;
};

}  // namespace vi
