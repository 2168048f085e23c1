#pragma once

// An editable mesh that owns growable arrays. translate, rotate and scale move
// positions only: normals, texture coordinates and indices are left as they
// are, on purpose, even after a rotation. No GL.

#include <vector>

#include <glm/glm.hpp>

#include "Tools/Export.h"

namespace vi {

class VI_EXPORT Geometry {
public:
    // Documents at the call site that the constructor does not call construct().
    struct DoNotConstruct {};

    Geometry();
    explicit Geometry(DoNotConstruct);
    virtual ~Geometry();

    virtual void construct();
    virtual void reconstruct();
    virtual void update();
    virtual void clear();

    void init();
    void translate(const glm::vec3& offset);
    void rotate(float angle, const glm::vec3& axis);
    void scale(glm::vec3 factors);

    std::vector<glm::vec3> positions;
    std::vector<glm::vec3> normals;
    std::vector<glm::vec2> texCoords;
    std::vector<unsigned short> indices;
    unsigned int mode;
};

}  // namespace vi
