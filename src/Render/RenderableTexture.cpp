#include "Render/RenderableTexture.h"

#include "Render/Drawable.h"
#include "Render/NamedValues.h"
#include "Render/RenderTargetFrame.h"
#include "Render/Renderer.h"

namespace vi {

GLuint RenderableTexture::mCurrentFrameBuffer = 0;
glm::ivec2 RenderableTexture::mCurrentFrameBufferPosition(0, 0);
glm::ivec2 RenderableTexture::mCurrentFrameBufferSize(0, 0);

namespace {

// The framebuffer and viewport the framework last bound, as the statics hold them.
struct Binding {
    GLuint frameBuffer;
    glm::ivec2 position;
    glm::ivec2 size;
};

Binding currentBinding() {
    return Binding{RenderableTexture::mCurrentFrameBuffer, RenderableTexture::mCurrentFrameBufferPosition,
                   RenderableTexture::mCurrentFrameBufferSize};
}

Binding targetBinding(const RenderableTexture& target) {
    return Binding{target.mFrameBuffer, glm::ivec2(target.mPosition[0], target.mPosition[1]),
                   glm::ivec2(target.mWidth, target.mHeight)};
}

// Binding a target and restoring a saved state are the same steps: the
// statics first, then GL, so that the statics always describe what is bound.
void applyBinding(const Binding& binding) {
    RenderableTexture::mCurrentFrameBuffer = binding.frameBuffer;
    RenderableTexture::mCurrentFrameBufferPosition = binding.position;
    RenderableTexture::mCurrentFrameBufferSize = binding.size;
    glBindFramebuffer(GL_FRAMEBUFFER, binding.frameBuffer);
    glViewport(binding.position.x, binding.position.y, binding.size.x, binding.size.y);
}

}  // namespace

RenderableTexture::RenderableTexture(std::vector<Renderer*>& renderers, unsigned int x, unsigned int y,
                                     unsigned int width, unsigned int height, bool isStatic, bool isRepeat,
                                     bool isMirrored, bool isLinear, bool hasDepth)
    : RenderableTexture(x, y, width, height, isStatic, isRepeat, isMirrored, isLinear, hasDepth) {
    mRenderers = &renderers;
}

RenderableTexture::RenderableTexture(unsigned int x, unsigned int y, unsigned int width, unsigned int height,
                                     bool isStatic, bool isRepeat, bool isMirrored, bool isLinear, bool hasDepth)
    : Texture(nullptr, width, height, isStatic, isRepeat, isMirrored, isLinear, TextureArgument::kNotCompressed,
              TextureArgument::kRgba, TextureArgument::kBytes),
      mTargetViewMatrix(1.0f),
      mTargetProjectionMatrix(1.0f),
      mPosition{x, y},
      mFrameBuffer(0),
      mColorBuffer(0),
      mDepthBuffer(0),
      mHasDepth(hasDepth),
      mRenderers(nullptr),
      mAnchor{0, 0, 0, 0, 0} {
    mKind = kRenderTargetTexture;
}

RenderableTexture::~RenderableTexture() {
    // The statics are left alone: they describe what is bound, not this target.
    if (mFrameBuffer != 0) {
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glBindRenderbuffer(GL_RENDERBUFFER, 0);
        glDeleteFramebuffers(1, &mFrameBuffer);
        glDeleteRenderbuffers(1, &mColorBuffer);
        if (mHasDepth) glDeleteRenderbuffers(1, &mDepthBuffer);
    }
}

void RenderableTexture::update() {
    glBindTexture(GL_TEXTURE_2D, mId);
    // The pack alignment on purpose, as for every texture.
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    // The buffer is null: this only (re)specifies the storage.
    if (mIsSubImageUse && mIsUploaded) {
        glTexSubImage2D(GL_TEXTURE_2D, 0, 0, 0, mWidth, mHeight, GL_RGBA, GL_UNSIGNED_BYTE, mBuffer);
        return;
    }
    glTexImage2D(GL_TEXTURE_2D, 0, GL_RGBA, mWidth, mHeight, 0, GL_RGBA, GL_UNSIGNED_BYTE, mBuffer);
    mIsUploaded = true;
}

void RenderableTexture::allocate() {
    // No glIsTexture probe: a lost context is noticed through contextChanged().
    if (mId != 0) return;

    Texture::allocate();
    // A static target got its storage from Texture::allocate(); a dynamic one
    // would otherwise have none before its first pass.
    if (!mIsStatic) update();

    glGenRenderbuffers(1, &mColorBuffer);
    glBindRenderbuffer(GL_RENDERBUFFER, mColorBuffer);
    glRenderbufferStorage(GL_RENDERBUFFER, GL_RGBA4, mWidth, mHeight);
    glBindRenderbuffer(GL_RENDERBUFFER, 0);

    glGenFramebuffers(1, &mFrameBuffer);
    glBindFramebuffer(GL_FRAMEBUFFER, mFrameBuffer);

    // Kept as it always was: the renderbuffer is attached and at once replaced
    // by the texture, which is the colour target in effect; the RGBA4
    // renderbuffer stays allocated but detached.
    glFramebufferRenderbuffer(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_RENDERBUFFER, mColorBuffer);
    glFramebufferTexture2D(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, mId, 0);

    if (mHasDepth) {
        glGenRenderbuffers(1, &mDepthBuffer);
        glBindRenderbuffer(GL_RENDERBUFFER, mDepthBuffer);
        glRenderbufferStorage(GL_RENDERBUFFER, GL_DEPTH_COMPONENT16, mWidth, mHeight);
        glBindRenderbuffer(GL_RENDERBUFFER, 0);
        glFramebufferRenderbuffer(GL_FRAMEBUFFER, GL_DEPTH_ATTACHMENT, GL_RENDERBUFFER, mDepthBuffer);
    }

    // Completeness is never acted upon; the query is kept, its answer dropped.
    glCheckFramebufferStatus(GL_FRAMEBUFFER);

    // Back to the window without touching the statics: no pass is running.
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
}

void RenderableTexture::contextChanged() {
    Texture::contextChanged();
    // The renderbuffer names are simply overwritten by the next allocate().
    mFrameBuffer = 0;
}

void RenderableTexture::bind(unsigned int location, unsigned int unit) {
    // Never uploads: a target's contents come from rendering.
    glActiveTexture(GL_TEXTURE0 + unit);
    glBindTexture(GL_TEXTURE_2D, mId);
    glUniform1i(location, unit);
}

void RenderableTexture::renderFrame() {
    if (mRenderers == nullptr || mRenderers->empty()) return;

    const glm::mat4 savedView = Drawable::mViewMatrix;
    const glm::mat4 savedProjection = Drawable::mProjectionMatrix;
    Drawable::mViewMatrix = mTargetViewMatrix;
    Drawable::mProjectionMatrix = mTargetProjectionMatrix;

    // Saved in locals, not in mAnchor, so that passes nest.
    const Binding saved = currentBinding();
    applyBinding(targetBinding(*this));

    // Depth is cleared too, even without a depth buffer.
    glClearColor(0.0f, 0.0f, 0.0f, 1.0f);
    glClear(GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT);

    // Each render() first brings its own dynamic targets up to date, each of
    // those passes restoring this target's binding when it ends.
    for (Renderer* renderer : *mRenderers) renderer->render();

    applyBinding(saved);
    Drawable::mViewMatrix = savedView;
    Drawable::mProjectionMatrix = savedProjection;
}

void RenderableTexture::renderFrame(Renderer* renderer, bool clear, const glm::vec4& colour) {
    allocate();
    enableAnchor();
    if (clear) {
        glClearColor(colour.r, colour.g, colour.b, colour.a);
        glClear(GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT);
    }
    // The caller's view and projection apply: the matrices are not replaced.
    renderer->render();
    disableAnchor();
}

void RenderableTexture::clear(const glm::vec4& colour) {
    allocate();
    enableAnchor();
    glClearColor(colour.r, colour.g, colour.b, colour.a);
    glClear(GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT);
    disableAnchor();
}

void RenderableTexture::readBuffer(unsigned char* pixels) {
    allocate();
    const Binding saved = currentBinding();
    applyBinding(targetBinding(*this));
    // The unpack alignment on purpose, crossed with the uploads' pack
    // alignment: the read runs with the pack alignment update() left at 1.
    glPixelStorei(GL_UNPACK_ALIGNMENT, 1);
    glReadPixels(mPosition[0], mPosition[1], mWidth, mHeight, GL_RGBA, GL_UNSIGNED_BYTE, pixels);
    applyBinding(saved);
}

void RenderableTexture::writeBuffer(const unsigned char* pixels) {
    allocate();
    // No framebuffer is bound, and mIsUploaded stays as it is.
    glBindTexture(GL_TEXTURE_2D, mId);
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    glTexSubImage2D(GL_TEXTURE_2D, 0, 0, 0, mWidth, mHeight, GL_RGBA, GL_UNSIGNED_BYTE, pixels);
}

// One save slot per target, kept so on purpose: enabling twice without a
// disable in between saves this target's own binding over the one before, and
// a clear() or renderFrame(renderer, ...) inside an anchor (both anchor
// themselves) does the same, so the outer binding is lost. Unlike the nesting
// renderFrame(), an anchor does not nest.
void RenderableTexture::enableAnchor() {
    mAnchor[kAnchorFrameBuffer] = int(mCurrentFrameBuffer);
    mAnchor[kAnchorX] = mCurrentFrameBufferPosition.x;
    mAnchor[kAnchorY] = mCurrentFrameBufferPosition.y;
    mAnchor[kAnchorWidth] = mCurrentFrameBufferSize.x;
    mAnchor[kAnchorHeight] = mCurrentFrameBufferSize.y;
    applyBinding(targetBinding(*this));
}

void RenderableTexture::disableAnchor() {
    applyBinding(Binding{GLuint(mAnchor[kAnchorFrameBuffer]), glm::ivec2(mAnchor[kAnchorX], mAnchor[kAnchorY]),
                         glm::ivec2(mAnchor[kAnchorWidth], mAnchor[kAnchorHeight])});
}

glm::ivec2& RenderableTexture::getViewportSize() { return mCurrentFrameBufferSize; }

void renderTargetFrame(Texture& target) { static_cast<RenderableTexture&>(target).renderFrame(); }

}  // namespace vi
