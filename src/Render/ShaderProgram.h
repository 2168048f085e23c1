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

    // For renderer classes whose instances share one program kept in their own
    // statics: every acquire counts a user (and builds the program for the
    // first), every release gives one back and deletes the program at zero.
    static ShaderProgram* acquireShared(ShaderProgram*& program, unsigned int& useCount, const char* vertexSource,
                                        const char* fragmentSource);
    static void releaseShared(ShaderProgram*& program, unsigned int& useCount);

    std::string vertexSource;
    std::string fragmentSource;
    GLuint program;
};

}  // namespace vi
