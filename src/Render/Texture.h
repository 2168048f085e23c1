#pragma once

// A GL 2D texture over client-side pixels it does not copy. Construction makes
// no GL call; the GL object is made lazily by allocate() on the GL thread.
// A static texture uploads once at allocation, a dynamic one on every bind.
// Frees its buffer (with free) only once marked deletable; leaves the GL name
// alone when marked shared. Every live texture is in mAllTextures, in
// construction order, so that a lost context can be repaired.

#include <vector>

#include <glm/glm.hpp>

#include "Render/GL.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT Texture {
public:
    // channels: 1 (alpha), 3 (RGB) or 4 (RGBA).
    Texture(void* data, unsigned int width, unsigned int height, bool isStatic, bool isRepeat, bool isMirrored,
            bool isLinear, bool isCompressed, unsigned int channels, bool isFloat);
    virtual ~Texture();
    virtual void* getBuffer();
    virtual void update();
    virtual void allocate();
    virtual void contextChanged();
    virtual void bind(unsigned int location, unsigned int unit);

    Texture(const Texture&) = delete;
    Texture& operator=(const Texture&) = delete;

    void setDeletable(bool isDeletable);

    // New pixels of another size in place, uploaded at once (what the host's
    // image loading does for a name already filed): the old buffer is freed
    // when deletable, the new one is owned alike; the object, its GL name and
    // its registry entry stay, so renderers bound to it draw the new pixels.
    void replacePixels(void* buffer, unsigned int width, unsigned int height);

    unsigned int mKind;  // a TextureKind (Render/NamedValues.h)
    GLuint mId;
    void* mBuffer;
    unsigned int mWidth;
    unsigned int mHeight;
    bool mIsUploaded;
    bool mIsStatic;
    bool mIsRepeat;
    bool mIsMirrored;
    bool mIsLinear;
    bool mIsCompressed;
    bool mIsDeletable;
    bool mIsShared;
    glm::vec2 mSize;
    glm::vec2 mTexelSize;
    GLenum mTarget;
    GLenum mInternalFormat;
    GLenum mFormat;
    GLenum mPixelType;

    static std::vector<Texture*> mAllTextures;
    static bool mIsSubImageUse;
};

}  // namespace vi
