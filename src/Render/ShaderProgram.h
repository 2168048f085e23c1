#pragma once

// One GL program built from two source texts. Keeps both texts for its whole
// life so that init() can build the program again in a new context (a program
// whose name is still valid is left alone). A compile failure exits with
// status 88, a link failure with 67. GL thread only.

#include <string>

#include "Render/GL.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT ShaderProgram {
public:
    ShaderProgram(const std::string& vertexSource, const std::string& fragmentSource);
    ~ShaderProgram();

    ShaderProgram(const ShaderProgram&) = delete;
    ShaderProgram& operator=(const ShaderProgram&) = delete;

    void init();
    GLuint compileShader(bool isVertex, const std::string& source) const;

    std::string vertexSource;
    std::string fragmentSource;
    GLuint program;
};

}  // namespace vi
