// Programs on a real context: the build sequence, rebuilding after a lost
// context, destruction, and the two fatal exits the host tells apart.
#include <gtest/gtest.h>

#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "FatalReportCapture.h"
#include "GlContext.h"
#include "GlRecorder.h"
#include "Render/ShaderProgram.h"

using vitest::GlRecorder;

namespace {

const char* const kVertex =
    "attribute vec4 aPosition;\n"
    "varying vec2 vValue;\n"
    "void main() { vValue = aPosition.xy; gl_Position = aPosition; }\n";
const char* const kFragment =
    "precision mediump float;\n"
    "varying vec2 vValue;\n"
    "void main() { gl_FragColor = vec4(vValue, 0.0, 1.0); }\n";

using Args = std::vector<double>;

// Exit handler of a death test's child: the calls made (shaders marked by
// kind), then how many bytes reached standard output.
std::FILE* gStdoutCapture = nullptr;

void printCallsAndStdout() {
    std::string line = "\ncalls:";
    double vertexShader = -1;
    for (const vitest::GlCall& call : GlRecorder::calls()) {
        line += ' ' + call.name;
        if (call.name == "glCreateShader" && call.args[0] == GL_VERTEX_SHADER) vertexShader = call.args[1];
        if (call.name == "glCreateShader" || call.name == "glDeleteShader")
            line += call.args[call.name == "glCreateShader"] == vertexShader ? "(vertex)" : "(fragment)";
    }
    std::fflush(stdout);
    std::fprintf(stderr, "%s\nstdout bytes: %ld\n", line.c_str(), std::ftell(gStdoutCapture));
}

void buildProgramAndWatchTheExit(const char* fragment) {
    vitest::GlContext gl(8, 8);
    std::fflush(stdout);
    gStdoutCapture = std::tmpfile();
    dup2(fileno(gStdoutCapture), STDOUT_FILENO);
    std::atexit(printCallsAndStdout);
    vitest::printFatalReportAtExit();
    GlRecorder::start();
    vi::ShaderProgram program(kVertex, fragment);
}

// The driver's info log between quotes, the location block, then the calls.
std::string report(const std::string& infoLog, const std::string& function, int line, const std::string& calls) {
    return "^\"" + infoLog + "\"\nIn file : \"/[^\"]*/Render/ShaderProgram\\.cpp\"\nIn function : \"" + function +
           "\"\nIn line : " + std::to_string(line) + "\ncalls: " + calls + "\nstdout bytes: 0\n$";
}

}  // namespace

TEST(ShaderProgram, BuildsBothShadersLinksKeepsNoShaderAndUnbindsBeforeDeletion) {
    vitest::GlContext gl(8, 8);
    vitest::GlRecording recording;
    auto* program = new vi::ShaderProgram(kVertex, kFragment);
    const double name = program->program;
    ASSERT_EQ(GlRecorder::names(),
              (std::vector<std::string>{"glCreateShader", "glShaderSource", "glCompileShader", "glGetShaderiv",
                                        "glCreateShader", "glShaderSource", "glCompileShader", "glGetShaderiv",
                                        "glCreateProgram", "glAttachShader", "glAttachShader", "glLinkProgram",
                                        "glDetachShader", "glDetachShader", "glDeleteShader", "glDeleteShader",
                                        "glGetProgramiv"}));
    const std::vector<vitest::GlCall> c = GlRecorder::calls();
    const double vertex = c[0].args[1], fragment = c[4].args[1];
    EXPECT_EQ(c[0].args[0], GL_VERTEX_SHADER);
    EXPECT_EQ(c[5].text, kFragment);
    for (int i : {9, 12}) EXPECT_EQ(c[i].args, (Args{name, vertex}));
    for (int i : {10, 13}) EXPECT_EQ(c[i].args, (Args{name, fragment}));
    EXPECT_EQ(c[14].args[0], vertex);
    GLint linked = 0;
    glGetProgramiv(program->program, GL_LINK_STATUS, &linked);
    EXPECT_EQ(linked, GL_TRUE);

    glUseProgram(program->program);
    GlRecorder::start();
    delete program;
    ASSERT_EQ(GlRecorder::names(), (std::vector<std::string>{"glUseProgram", "glDeleteProgram"}));
    EXPECT_EQ(GlRecorder::calls()[0].args[0], 0);
    EXPECT_EQ(GlRecorder::calls()[1].args[0], name);
}

TEST(ShaderProgram, InitRebuildsOnlyAfterTheContextWasReplaced) {
    vitest::GlContext gl(8, 8);
    vi::ShaderProgram program(kVertex, kFragment);
    vitest::GlRecording recording;
    program.init();
    EXPECT_EQ(GlRecorder::names(), std::vector<std::string>{"glIsProgram"});

    gl.recreate();
    GlRecorder::start();
    program.init();
    ASSERT_EQ(GlRecorder::count("glCreateProgram"), 1);
    EXPECT_EQ(program.program, GlRecorder::callsNamed("glCreateProgram")[0].args[0]);
    EXPECT_TRUE(glIsProgram(program.program));
}

// A fresh process for each child: a forked copy of a process with a live GL
// driver is not safe to use. Nothing reaches standard output.
TEST(ShaderProgramDeath, FragmentSyntaxErrorExits88AfterTheVertexShaderCompiled) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    // The vertex shader is compiled and kept; only the failing shader is deleted.
    EXPECT_EXIT(buildProgramAndWatchTheExit("precision mediump float;\nvoid main() { gl_FragColor = vec4(1.0) }\n"),
                testing::ExitedWithCode(88),
                testing::MatchesRegex(report("0:2\\([0-9]+\\): error: .+", "compileShader", 88,
                                             "glCreateShader\\(vertex\\) glShaderSource glCompileShader glGetShaderiv "
                                             "glCreateShader\\(fragment\\) glShaderSource glCompileShader "
                                             "glGetShaderiv glGetShaderInfoLog glDeleteShader\\(fragment\\)")));
}

TEST(ShaderProgramDeath, ShadersThatCompileButDoNotLinkExit67) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    // The fragment input does not match the vertex output.
    EXPECT_EXIT(buildProgramAndWatchTheExit("precision mediump float;\nvarying vec3 vValue;\n"
                                            "void main() { gl_FragColor = vec4(vValue, 1.0); }\n"),
                testing::ExitedWithCode(67),
                testing::MatchesRegex(report(".*vValue.+", "init", 67,
                                             ".* glLinkProgram glDetachShader glDetachShader "
                                             "glDeleteShader\\(vertex\\) glDeleteShader\\(fragment\\) "
                                             "glGetProgramiv glGetProgramInfoLog glDeleteProgram")));
}
