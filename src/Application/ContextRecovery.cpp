#include "Application/ContextRecovery.h"

#include "Render/GL.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"

namespace vi {

namespace {

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

// Each owner forgets its own names; no GL call, since every name belongs to
// a context that is gone (or not current). Renderers first, then textures.
void invalidateFor(EGLContext context) {
    Renderer::mEglContext = context;
    for (Renderer* renderer : Renderer::mAllRenderers) renderer->forgetGlObjects();
    for (Texture* texture : Texture::mAllTextures) texture->contextChanged();
}

}  // namespace

bool ContextRecovery::isLost() { return isLostIn(eglGetCurrentContext()); }

void ContextRecovery::invalidate() { invalidateFor(eglGetCurrentContext()); }

void ContextRecovery::recreate() {
    // Without a current context nothing can be made; the next frame in a real
    // context finds the mismatch and comes back here.
    if (Renderer::mEglContext == EGL_NO_CONTEXT) return;
    for (Renderer* renderer : Renderer::mAllRenderers) renderer->recreateGlObjects();
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
