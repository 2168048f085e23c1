#pragma once

// A texture that is also a framebuffer: renderers draw into it and it is then
// sampled like any other texture (the colour attachment is the texture itself,
// so no copy). Owns its framebuffer and renderbuffers; points at the caller's
// renderer list. Rebuilt after a lost context, contents undefined until drawn
// again. The statics record the framebuffer currently bound and its viewport,
// so every pass restores exactly what it found; the effect stores the window's
// viewport there before the first pass. GL thread only.

#include <vector>

#include <glm/glm.hpp>

#include "Render/GL.h"
#include "Render/NamedValues.h"
#include "Render/Texture.h"
#include "Tools/Export.h"

namespace vi {

class Renderer;

class VI_EXPORT RenderableTexture : public Texture {
public:
    RenderableTexture(std::vector<Renderer*>& renderers, unsigned int x, unsigned int y, unsigned int width,
                      unsigned int height, bool isStatic, bool isRepeat, bool isMirrored, bool isLinear, bool hasDepth);
    RenderableTexture(unsigned int x, unsigned int y, unsigned int width, unsigned int height, bool isStatic,
                      bool isRepeat, bool isMirrored, bool isLinear, bool hasDepth);
    ~RenderableTexture() override;
    void update() override;
    void allocate() override;
    void contextChanged() override;
    void bind(unsigned int location, unsigned int unit) override;

    void renderFrame();
    void renderFrame(Renderer* renderer, bool clear, const glm::vec4& colour);
    void clear(const glm::vec4& colour);
    void readBuffer(unsigned char* pixels);
    void writeBuffer(const unsigned char* pixels);
    void enableAnchor();
    void disableAnchor();
    static glm::ivec2& getViewportSize();

    glm::mat4 mTargetViewMatrix;
    glm::mat4 mTargetProjectionMatrix;
    unsigned int mPosition[2];
    GLuint mFrameBuffer;
    GLuint mColorBuffer;
    GLuint mDepthBuffer;
    bool mHasDepth;
    std::vector<Renderer*>* mRenderers;
    int mAnchor[kAnchorSlotCount];  // the binding enableAnchor() saved, by AnchorSlot

    static GLuint mCurrentFrameBuffer;
    static glm::ivec2 mCurrentFrameBufferPosition;
    static glm::ivec2 mCurrentFrameBufferSize;
};

}  // namespace vi
