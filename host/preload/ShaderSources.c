/* The shader sources on their way to the driver, preloaded into the desktop
 * hosts' JVM.
 *
 * A shader that does not compile ends the process through the runtime's fatal
 * report, which holds the driver's log but not the source, and the runtime
 * has deleted the shader by then. Preloaded, these definitions come first in
 * the process's lookup order, so the runtime's (and any plug-in's) calls
 * reach them unchanged and go on to the driver. The host's exit handler asks
 * for the source of the shader compiled last: the one that failed. The
 * library links the GL library itself, so that the driver's functions are
 * found next in the lookup order. */
#define _GNU_SOURCE
#include <GLES2/gl2.h>
#include <dlfcn.h>
#include <stdlib.h>
#include <string.h>

/* Shaders are made on the GL thread only, so a single slot of each needs no lock. */
static GLuint gCreated;
static GLenum gCreatedType;
static GLuint gSourced;
static char* gSource;
static GLuint gCompiled;

#define VI_PRELOADED __attribute__((visibility("default")))

static void* driver(const char* name) {
    return dlsym(RTLD_NEXT, name);
}

/* A part's length as the driver reads it: a negative or absent length means up to the NUL. */
static size_t partLength(const GLchar* const* strings, const GLint* lengths, GLsizei i) {
    return lengths && lengths[i] >= 0 ? (size_t)lengths[i] : strlen(strings[i]);
}

VI_PRELOADED GLuint glCreateShader(GLenum type) {
    static GLuint (*real)(GLenum);
    if (!real) real = (GLuint (*)(GLenum))driver("glCreateShader");
    gCreated = real(type);
    gCreatedType = type;
    return gCreated;
}

VI_PRELOADED void glShaderSource(GLuint shader, GLsizei count, const GLchar* const* strings, const GLint* lengths) {
    static void (*real)(GLuint, GLsizei, const GLchar* const*, const GLint*);
    if (!real) real = (void (*)(GLuint, GLsizei, const GLchar* const*, const GLint*))driver("glShaderSource");
    /* The parts joined as the driver joins them. */
    size_t total = 0;
    for (GLsizei i = 0; i < count; ++i) total += partLength(strings, lengths, i);
    char* source = malloc(total + 1);
    if (source) {
        size_t at = 0;
        for (GLsizei i = 0; i < count; ++i) {
            size_t length = partLength(strings, lengths, i);
            memcpy(source + at, strings[i], length);
            at += length;
        }
        source[total] = '\0';
    }
    free(gSource);
    gSource = source;
    gSourced = shader;
    real(shader, count, strings, lengths);
}

VI_PRELOADED void glCompileShader(GLuint shader) {
    static void (*real)(GLuint);
    if (!real) real = (void (*)(GLuint))driver("glCompileShader");
    gCompiled = shader;
    real(shader);
}

/* The source of the shader compiled last and its type (GL_VERTEX_SHADER or
 * GL_FRAGMENT_SHADER, 0 when unknown); null when it was not seen. */
VI_PRELOADED const char* vi_shader_sources_last(GLenum* type) {
    *type = gCompiled == gCreated ? gCreatedType : 0;
    return gCompiled != 0 && gCompiled == gSourced ? gSource : NULL;
}
