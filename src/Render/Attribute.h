#pragma once

// A vertex attribute of a renderer: the caller's float array, uploaded to a
// buffer of the renderer's own. The vertex count is read through a pointer to
// the drawable's field, so a later change of the count is seen.

#include <string>

#include "Render/GL.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT Attribute {
public:
    std::string name;
    GLuint buffer;  // kNoBuffer (Render/NamedValues.h) while none
    GLint location;
    const void* data;
    const unsigned int* vertexCount;
    unsigned int components;
    bool isStatic;
};

}  // namespace vi
