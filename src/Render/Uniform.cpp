#include "Render/Uniform.h"

namespace vi {

void Uniform::upload() const {
    const GLfloat* floats = static_cast<const GLfloat*>(data);
    const GLint* ints = static_cast<const GLint*>(data);
    const GLsizei n = GLsizei(count);
    // Out-of-range types upload nothing.
    switch (type) {
        case Uniform::Matrix2:
            glUniformMatrix2fv(location, n, GL_FALSE, floats);
            break;
        case Uniform::Matrix3:
            glUniformMatrix3fv(location, n, GL_FALSE, floats);
            break;
        case Uniform::Matrix4:
            glUniformMatrix4fv(location, n, GL_FALSE, floats);
            break;
        case Uniform::Int:
            glUniform1iv(location, n, ints);
            break;
        case Uniform::Int2:
            glUniform2iv(location, n, ints);
            break;
        case Uniform::Int3:
            glUniform3iv(location, n, ints);
            break;
        case Uniform::Int4:
            glUniform4iv(location, n, ints);
            break;
        case Uniform::Float:
            glUniform1fv(location, n, floats);
            break;
        case Uniform::Float2:
            glUniform2fv(location, n, floats);
            break;
        case Uniform::Float3:
            glUniform3fv(location, n, floats);
            break;
        case Uniform::Float4:
            glUniform4fv(location, n, floats);
            break;
    }
}

}  // namespace vi
