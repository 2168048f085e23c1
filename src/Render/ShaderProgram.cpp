#include "Render/ShaderProgram.h"

#include <cstdlib>

#include "Tools/FatalReport.h"

namespace vi {

namespace {

// The exit statuses name the failure sites; the host tells a broken shader
// from a broken link by the status alone.
constexpr int kCompileFailureLine = 88;
constexpr int kLinkFailureLine = 67;

constexpr GLsizei kInfoLogSize = 4096;

// Quotes the driver's info log, adds where it happened and ends the process.
// The text is not printed: it stays in memory for a debugger.
[[noreturn]] void failWithInfoLog(const char* infoLog, int line, const char* function) {
    std::string report;
    report.reserve(8192);
    report += '"';
    report += infoLog;
    report += "\"\n";
    FatalReport::compose(report, line, function, __FILE__);
    std::exit(line);
}

}  // namespace

ShaderProgram::ShaderProgram(const std::string& vertexText, const std::string& fragmentText)
    : vertexSource(vertexText), fragmentSource(fragmentText), program(0) {
    init();
}

ShaderProgram::~ShaderProgram() {
    if (program != 0) {
        // Never leave the current program binding naming a deleted program.
        glUseProgram(0);
        glDeleteProgram(program);
    }
}

void ShaderProgram::init() {
    // A name the current context still knows needs no rebuild; after a lost
    // context the old name is unknown and the program is built afresh.
    if (program != 0 && glIsProgram(program)) return;

    GLuint vertexShader = compileShader(true, vertexSource);
    GLuint fragmentShader = compileShader(false, fragmentSource);

    program = glCreateProgram();
    glAttachShader(program, vertexShader);
    glAttachShader(program, fragmentShader);
    glLinkProgram(program);

    // The program keeps no shader objects, linked or not.
    glDetachShader(program, vertexShader);
    glDetachShader(program, fragmentShader);
    glDeleteShader(vertexShader);
    glDeleteShader(fragmentShader);

    // Only exactly GL_TRUE counts as linked (a compile status is accepted when non-zero).
    GLint status = 0;
    glGetProgramiv(program, GL_LINK_STATUS, &status);
    if (status == GL_TRUE) return;

    char infoLog[kInfoLogSize];
    infoLog[0] = '\0';
    glGetProgramInfoLog(program, kInfoLogSize, NULL, infoLog);
    // The stale name stays in `program`: the process ends here anyway.
    glDeleteProgram(program);
    failWithInfoLog(infoLog, kLinkFailureLine, __func__);
}

GLuint ShaderProgram::compileShader(bool isVertex, const std::string& source) const {
    GLuint shader = glCreateShader(isVertex ? GL_VERTEX_SHADER : GL_FRAGMENT_SHADER);
    const GLchar* text = source.c_str();
    glShaderSource(shader, 1, &text, NULL);
    glCompileShader(shader);

    GLint status = 0;
    glGetShaderiv(shader, GL_COMPILE_STATUS, &status);
    if (status != 0) return shader;

    char infoLog[kInfoLogSize];
    infoLog[0] = '\0';
    glGetShaderInfoLog(shader, kInfoLogSize, NULL, infoLog);
    glDeleteShader(shader);
    failWithInfoLog(infoLog, kCompileFailureLine, __func__);
}

ShaderProgram* ShaderProgram::acquireShared(ShaderProgram*& program, unsigned int& useCount,
                                           const char* vertexSource, const char* fragmentSource) {
    ++useCount;
    if (!program) program = new ShaderProgram(vertexSource, fragmentSource);
    return program;
}

void ShaderProgram::releaseShared(ShaderProgram*& program, unsigned int& useCount) {
    if (!program) return;
    --useCount;
    if (useCount == 0) {
        delete program;
        program = nullptr;
    }
}

}  // namespace vi
