#include "BenchContext.h"

#include <cstdio>
#include <cstdlib>

#include <GLES2/gl2.h>

#include "BenchShaders.h"

namespace vibench {

vitest::GlContext& mainContext() {
    static vitest::GlContext context(64, 64);
    static bool compiled = false;
    context.makeCurrent();
    // The driver builds its shader compiler's built-in library when a context
    // first compiles, and drops it when no context that compiled is left. One
    // program compiled here and kept keeps it for the whole run, so that the
    // recovery figures, which destroy their contexts, do not pay for it anew
    // in each pass.
    if (!compiled) {
        compiled = true;
        const GLuint shader = glCreateShader(GL_VERTEX_SHADER);
        const char* source = kQuadVertex;
        glShaderSource(shader, 1, &source, nullptr);
        glCompileShader(shader);
    }
    return context;
}

vitest::GlContext& recoveryContext() {
    static vitest::GlContext context(64, 64);
    context.makeCurrent();
    return context;
}

void benchFail(const char* what) {
    std::fprintf(stderr, "bench: %s\n", what);
    std::exit(2);
}

}  // namespace vibench
