#pragma once

// A uniform bound by name to the caller's memory, read at every draw: an
// effect changes a value by writing its own variable.

#include <string>

#include "Render/GL.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT Uniform {
public:
    // The value is part of the interface; 11 and above upload nothing.
    enum UniformType {
        Matrix2 = 0,
        Matrix3 = 1,
        Matrix4 = 2,
        Int = 3,
        Int2 = 4,
        Int3 = 5,
        Int4 = 6,
        Float = 7,
        Float2 = 8,
        Float3 = 9,
        Float4 = 10,
    };

    // Hands the value at `data` to the current program, by type; transpose is
    // always GL_FALSE.
    void upload() const;

    std::string name;
    GLint location;
    const void* data;
    UniformType type;
    unsigned int count;
};

}  // namespace vi
