// Programs on a real context: the build sequence, destruction, and the two
// fatal exits.
#include <gtest/gtest.h>
#include <gmock/gmock.h>

#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "FatalReportCapture.h"
#include "GlContext.h"
#include "GlRecorder.h"
#include "Render/ShaderProgram.h"

using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;

namespace {

const char* const kVertex =
    "attribute vec4 aPosition;\n"
    "varying vec2 vValue;\n"
    "void main() { vValue = aPosition.xy; gl_Position = aPosition; }\n";
const char* const kFragment =
    "precision mediump float;\n"
    "varying vec2 vValue;\n"
    "void main() { gl_FragColor = vec4(vValue, 0.0, 1.0); }\n";
const char* const kFragmentSyntaxError =
    "precision mediump float;\n"
    "void main() { gl_FragColor = vec4(1.0) }\n";
// Compiles on its own, but its input does not match the vertex output.
const char* const kFragmentMismatchedVarying =
    "precision mediump float;\n"
    "varying vec3 vValue;\n"
    "void main() { gl_FragColor = vec4(vValue, 1.0); }\n";

GLint programParameter(GLuint program, GLenum name) {
    GLint value = -1;
    glGetProgramiv(program, name, &value);
    return value;
}

// Exit handler of a death test's child: the shader calls made, then how many
// bytes reached standard output.
std::FILE* gStdoutCapture = nullptr;
GLuint gVertexShader = 0;

void printShaderCallsAndStdout() {
    std::string line = "\ncalls:";
    for (const vitest::GlCall& call : GlRecorder::calls()) {
        line += ' ' + call.name;
        if (call.name == "glCreateShader") {
            if (gVertexShader == 0 && call.args[0] == GL_VERTEX_SHADER) gVertexShader = GLuint(call.args[1]);
            line += call.args[0] == GL_VERTEX_SHADER ? "(vertex)" : "(fragment)";
        }
        if (call.name == "glDeleteShader") line += GLuint(call.args[0]) == gVertexShader ? "(vertex)" : "(fragment)";
    }
    std::fflush(stdout);
    std::fprintf(stderr, "%s\nstdout bytes: %ld\n", line.c_str(), std::ftell(gStdoutCapture));
}

// In the child: record the shader calls, send standard output to a file we
// can measure, and print the report and the calls at exit.
void watchTheExit() {
    std::fflush(stdout);
    gStdoutCapture = std::tmpfile();
    dup2(fileno(gStdoutCapture), STDOUT_FILENO);
    std::atexit(printShaderCallsAndStdout);
    vitest::printFatalReportAtExit();
    GlRecorder::start();
}

void buildProgramAndWatchTheExit(const char* vertex, const char* fragment) {
    GlContext gl(8, 8);
    watchTheExit();
    vi::ShaderProgram program(vertex, fragment);
}

// The detail is the driver's info log between quotes, then the location block.
std::string reportPattern(const std::string& infoLog, const std::string& function, int line) {
    const std::string file = "In file : \"/[^\"]*/Render/ShaderProgram\\.cpp\"\n";
    return "^\"" + infoLog + "\"\n" + file + "In function : \"" + function + "\"\n" +
           "In line : " + std::to_string(line) + "\ncalls: ";
}

class ShaderProgramDeath : public ::testing::Test {
protected:
    // A fresh process for each child: a forked copy of a process with a live
    // GL driver is not safe to use.
    void SetUp() override { GTEST_FLAG_SET(death_test_style, "threadsafe"); }
};

}  // namespace

TEST(ShaderProgram, BuildsBothShadersThenLinksAndKeepsNoShaderObjects) {
    GlContext gl(8, 8);
    GlRecording recording;
    vi::ShaderProgram program(kVertex, kFragment);
    GlRecorder::stop();

    EXPECT_EQ(programParameter(program.program, GL_LINK_STATUS), GL_TRUE);
    EXPECT_EQ(programParameter(program.program, GL_ATTACHED_SHADERS), 0);

    // No validity probe: there was no name to probe.
    ASSERT_EQ(GlRecorder::names(),
              (std::vector<std::string>{"glCreateShader", "glShaderSource", "glCompileShader", "glGetShaderiv",
                                        "glCreateShader", "glShaderSource", "glCompileShader", "glGetShaderiv",
                                        "glCreateProgram", "glAttachShader", "glAttachShader", "glLinkProgram",
                                        "glDetachShader", "glDetachShader", "glDeleteShader", "glDeleteShader",
                                        "glGetProgramiv"}));
    const std::vector<vitest::GlCall> c = GlRecorder::calls();
    const double vertexShader = c[0].args[1], fragmentShader = c[4].args[1];
    EXPECT_EQ(c[0].args[0], GL_VERTEX_SHADER);
    EXPECT_EQ(c[5].text, kFragment);
    // Attach, detach and delete: vertex first each time.
    for (int i : {9, 12}) EXPECT_EQ(c[i].args, (std::vector<double>{double(program.program), vertexShader}));
    for (int i : {10, 13}) EXPECT_EQ(c[i].args, (std::vector<double>{double(program.program), fragmentShader}));
    EXPECT_EQ(c[14].args[0], vertexShader);
}

TEST(ShaderProgram, DestructionUnbindsTheCurrentProgramBeforeDeletingIt) {
    GlContext gl(8, 8);
    auto* program = new vi::ShaderProgram(kVertex, kFragment);
    const GLuint name = program->program;
    glUseProgram(name);
    GlRecording recording;
    delete program;
    GlRecorder::stop();
    const std::vector<vitest::GlCall> calls = GlRecorder::calls();
    ASSERT_EQ(GlRecorder::names(), (std::vector<std::string>{"glUseProgram", "glDeleteProgram"}));
    EXPECT_EQ(calls[0].args[0], 0);
    EXPECT_EQ(calls[1].args[0], name);
    EXPECT_FALSE(glIsProgram(name));
}

TEST_F(ShaderProgramDeath, FragmentSyntaxErrorExits88AfterTheVertexShaderCompiled) {
    // The vertex shader is compiled and kept; only the failing shader is deleted.
    EXPECT_EXIT(buildProgramAndWatchTheExit(kVertex, kFragmentSyntaxError), ::testing::ExitedWithCode(88),
                ::testing::MatchesRegex(reportPattern("0:2\\([0-9]+\\): error: .+", "compileShader", 88) +
                                        "glCreateShader\\(vertex\\) glShaderSource glCompileShader glGetShaderiv "
                                        "glCreateShader\\(fragment\\) glShaderSource glCompileShader glGetShaderiv "
                                        "glGetShaderInfoLog glDeleteShader\\(fragment\\)\n"
                                        "stdout bytes: 0\n$"));
}

TEST_F(ShaderProgramDeath, ShadersThatCompileButDoNotLinkExit67) {
    EXPECT_EXIT(buildProgramAndWatchTheExit(kVertex, kFragmentMismatchedVarying), ::testing::ExitedWithCode(67),
                ::testing::MatchesRegex(reportPattern(".*vValue.+", "init", 67) +
                                        ".* glLinkProgram glDetachShader glDetachShader glDeleteShader\\(vertex\\) "
                                        "glDeleteShader\\(fragment\\) glGetProgramiv glGetProgramInfoLog "
                                        "glDeleteProgram\n"
                                        "stdout bytes: 0\n$"));
}

TEST(ShaderProgram, InitInTheSameContextBuildsNothing) {
    GlContext gl(8, 8);
    vi::ShaderProgram program(kVertex, kFragment);
    const GLuint name = program.program;
    GlRecording recording;
    program.init();
    program.init();
    EXPECT_EQ(GlRecorder::names(), (std::vector<std::string>{"glIsProgram", "glIsProgram"}));
    EXPECT_EQ(program.program, name);
}

TEST(ShaderProgram, InitAfterTheContextWasReplacedBuildsAndStoresANewProgram) {
    GlContext gl(8, 8);
    vi::ShaderProgram program(kVertex, kFragment);
    gl.recreate();
    ASSERT_FALSE(glIsProgram(program.program));

    GlRecording recording;
    program.init();
    GlRecorder::stop();
    ASSERT_EQ(GlRecorder::count("glCreateProgram"), 1);
    EXPECT_EQ(program.program, GlRecorder::callsNamed("glCreateProgram")[0].args[0]);
    EXPECT_EQ(programParameter(program.program, GL_LINK_STATUS), GL_TRUE);
}
