#include "Application/ContextRecovery.h"

#include "Render/Attribute.h"
#include "Render/Drawable.h"
#include "Render/GL.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"
#include "Render/Uniform.h"

namespace vi {

namespace {

constexpr GLuint kNoBuffer = 0xFFFFFFFF;

// Only the first renderer's program and the first texture that has a GL name
// are probed: the other objects were made in the same context and are assumed
// to share their fate. Keeps an intact frame at two GL queries at most.
bool programProbePasses() {
    if (Renderer::mAllRenderers.empty()) return true;
    // Exactly GL_TRUE: any other answer counts as a lost program.
    return glIsProgram(Renderer::mAllRenderers.front()->program->program) == GL_TRUE;
}

bool textureProbePasses() {
    for (Texture* texture : Texture::mAllTextures) {
        // Never allocated: nothing to lose, look further.
        if (texture->mId == 0) continue;
        return glIsTexture(texture->mId) != GL_FALSE;
    }
    return true;
}

// The probes run even when the handle is the same: a driver may hand a new
// context the handle of a destroyed one.
bool isLostIn(EGLContext context) {
    if (context != Renderer::mEglContext) return true;
    return !programProbePasses() || !textureProbePasses();
}

// No GL call: every name belongs to a context that is gone (or not current).
void invalidateFor(EGLContext context) {
    Renderer::mEglContext = context;
    for (Renderer* renderer : Renderer::mAllRenderers) {
        renderer->program->program = 0;
        renderer->indexBuffer = kNoBuffer;
        for (Attribute* attribute : renderer->attributes) attribute->buffer = kNoBuffer;
    }
    for (Texture* texture : Texture::mAllTextures) texture->contextChanged();
}

void recreateIndexBuffer(Renderer& renderer) {
    const Drawable& drawable = *renderer.drawable;
    if (!drawable.indices) return;
    glGenBuffers(1, &renderer.indexBuffer);
    glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, renderer.indexBuffer);
    glBufferData(GL_ELEMENT_ARRAY_BUFFER, GLsizeiptr(drawable.elementCount) * sizeof(unsigned short),
                 drawable.indices, GL_STATIC_DRAW);
}

// An attribute the relinked program no longer has keeps location -1 and no
// buffer; the renderer then draws without it. The vertex count is read through
// the pointer now, so a count the drawable changed since is honoured.
void recreateAttribute(GLuint program, Attribute& attribute) {
    attribute.location = glGetAttribLocation(program, attribute.name.c_str());
    if (attribute.location == -1) return;
    glGenBuffers(1, &attribute.buffer);
    glBindBuffer(GL_ARRAY_BUFFER, attribute.buffer);
    glBufferData(GL_ARRAY_BUFFER, GLsizeiptr(*attribute.vertexCount) * attribute.components * sizeof(float),
                 attribute.data, attribute.isStatic ? GL_STATIC_DRAW : GL_STREAM_DRAW);
    glEnableVertexAttribArray(GLuint(attribute.location));
    glVertexAttribPointer(GLuint(attribute.location), GLint(attribute.components), GL_FLOAT, GL_FALSE, 0, nullptr);
}

// Renderers often share a program: init() on one already rebuilt for an
// earlier renderer finds its name valid and returns at once.
void recreateRenderer(Renderer& renderer) {
    renderer.program->init();
    const GLuint program = renderer.program->program;
    recreateIndexBuffer(renderer);
    for (Attribute* attribute : renderer.attributes) recreateAttribute(program, *attribute);
    for (Uniform* uniform : renderer.uniforms)
        uniform->location = glGetUniformLocation(program, uniform->name.c_str());
}

}  // namespace

bool ContextRecovery::isLost() { return isLostIn(eglGetCurrentContext()); }

void ContextRecovery::invalidate() { invalidateFor(eglGetCurrentContext()); }

void ContextRecovery::recreate() {
    // Without a current context nothing can be made; the next frame in a real
    // context finds the mismatch and comes back here.
    if (Renderer::mEglContext == EGL_NO_CONTEXT) return;
    for (Renderer* renderer : Renderer::mAllRenderers) recreateRenderer(*renderer);
    for (Texture* texture : Texture::mAllTextures) texture->allocate();
}

// Start and stop only forget the names: the next ready frame rebuilds them in
// whatever context is current then.
void ContextRecovery::invalidateIfLost() {
    const EGLContext context = eglGetCurrentContext();
    if (isLostIn(context)) invalidateFor(context);
}

void ContextRecovery::recoverIfLost() {
    const EGLContext context = eglGetCurrentContext();
    if (!isLostIn(context)) return;
    invalidateFor(context);
    recreate();
}

// The host's texture loading compares handles only: with the same handle
// nothing happens, whatever state the objects are in.
void ContextRecovery::recoverIfContextChanged() {
    const EGLContext context = eglGetCurrentContext();
    if (context == Renderer::mEglContext) return;
    invalidateFor(context);
    recreate();
}

}  // namespace vi
