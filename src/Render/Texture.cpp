#include "Render/Texture.h"

#include <strings.h>

#include <algorithm>
#include <cstdlib>

#include "Render/NamedValues.h"

namespace vi {

std::vector<Texture*> Texture::mAllTextures;
bool Texture::mIsSubImageUse = true;

namespace {

// Channel counts outside 1, 3 and 4 are not offered. Rather than hand GL an
// unset format, such a texture is treated as alpha only: one byte per texel
// is the least any caller's buffer can hold, so an upload never reads past it.
GLenum formatForChannels(unsigned int channels) {
    switch (channels) {
        case 1:
            return GL_ALPHA;
        case 3:
            return GL_RGB;
        case 4:
            return GL_RGBA;
        default:
            return GL_ALPHA;
    }
}

// Mali drivers mishandle repeated sub-image updates, so there every re-upload
// respecifies the whole image. Decided once per process, the first time a
// texture is allocated (the renderer string is known only with a context);
// thread-safe one-time initialisation.
bool driverAllowsSubImageUploads() {
    static const bool isNotMali =
        strncasecmp("Mali", reinterpret_cast<const char*>(glGetString(GL_RENDERER)), 4) != 0;
    return isNotMali;
}

}  // namespace

Texture::Texture(void* data, unsigned int width, unsigned int height, bool isStatic, bool isRepeat, bool isMirrored,
                 bool isLinear, bool isCompressed, unsigned int channels, bool isFloat)
    : mKind(kPlainTexture),
      mId(0),
      mBuffer(data),
      mWidth(width),
      mHeight(height),
      mIsUploaded(false),
      mIsStatic(isStatic),
      mIsRepeat(isRepeat),
      mIsMirrored(isMirrored),
      mIsLinear(isLinear),
      mIsCompressed(isCompressed),
      mIsDeletable(false),
      mIsShared(false),
      mSize(float(width), float(height)),
      mTexelSize(1.0f / float(width), 1.0f / float(height)),
      mTarget(GL_TEXTURE_2D),
      mInternalFormat(formatForChannels(channels)),
      mFormat(formatForChannels(channels)),
      mPixelType(isFloat ? GL_FLOAT : GL_UNSIGNED_BYTE) {
    mAllTextures.push_back(this);
}

Texture::~Texture() {
    // A shared name belongs to whoever handed it in.
    if (mId != 0 && !mIsShared) {
        glBindTexture(mTarget, 0);
        glDeleteTextures(1, &mId);
        mId = 0;
    }
    if (mIsDeletable) free(mBuffer);
    auto entry = std::find(mAllTextures.begin(), mAllTextures.end(), this);
    if (entry != mAllTextures.end()) mAllTextures.erase(entry);
}

void* Texture::getBuffer() { return mBuffer; }

void Texture::update() {
    glBindTexture(mTarget, mId);
    // The pack alignment, not the unpack one, kept so on purpose: uploads run
    // with the unpack alignment the context already has (4 unless changed), so
    // rows of RGB or alpha pixels whose length is not a multiple of 4 must be
    // padded by whoever hands them in.
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    if (mIsCompressed) {
        // ETC1 is always specified in full; it never takes the sub-image path.
        glCompressedTexImage2D(mTarget, 0, GL_ETC1_RGB8_OES, mWidth, mHeight, 0, (mWidth * mHeight) >> 1, mBuffer);
        return;
    }
    if (mIsSubImageUse && mIsUploaded) {
        glTexSubImage2D(mTarget, 0, 0, 0, mWidth, mHeight, mFormat, mPixelType, mBuffer);
        return;
    }
    glTexImage2D(mTarget, 0, mInternalFormat, mWidth, mHeight, 0, mFormat, mPixelType, mBuffer);
    mIsUploaded = true;
}

void Texture::allocate() {
    if (mId != 0 && glIsTexture(mId) == GL_TRUE) return;

    const bool subImageUploads = driverAllowsSubImageUploads();
    const GLint filter = mIsLinear ? GL_LINEAR : GL_NEAREST;
    const GLint wrap = mIsRepeat ? (mIsMirrored ? GL_MIRRORED_REPEAT : GL_REPEAT) : GL_CLAMP_TO_EDGE;
    mIsSubImageUse = subImageUploads;

    glGenTextures(1, &mId);
    if (mIsStatic) {
        update();
    } else {
        // A dynamic texture's pixels follow at its first bind.
        glBindTexture(mTarget, mId);
    }
    glTexParameteri(mTarget, GL_TEXTURE_MAG_FILTER, filter);
    glTexParameteri(mTarget, GL_TEXTURE_MIN_FILTER, filter);
    glTexParameteri(mTarget, GL_TEXTURE_WRAP_T, wrap);
    glTexParameteri(mTarget, GL_TEXTURE_WRAP_S, wrap);
}

void Texture::contextChanged() {
    // The old name died with its context: forget it, delete nothing.
    mId = 0;
    mIsUploaded = false;
}

void Texture::bind(unsigned int location, unsigned int unit) {
    glActiveTexture(GL_TEXTURE0 + unit);
    if (mIsStatic) {
        glBindTexture(mTarget, mId);
    } else {
        update();
    }
    glUniform1i(location, unit);
}

void Texture::setDeletable(bool isDeletable) { mIsDeletable = isDeletable; }

void Texture::replacePixels(void* buffer, unsigned int width, unsigned int height) {
    if (mIsDeletable) free(mBuffer);
    mBuffer = buffer;
    mWidth = width;
    mHeight = height;
    // Cleared so that the upload below defines the GL storage at the new size.
    mIsUploaded = false;
    mSize = glm::vec2(float(width), float(height));
    mTexelSize = glm::vec2(1.0f / float(width), 1.0f / float(height));
    update();
    // A texture not yet allocated has no GL name: the upload above went to the
    // default texture and defined nothing of its own. Its first allocate() must
    // then define the storage in full, not re-upload into storage it lacks.
    if (mId == 0) mIsUploaded = false;
}

}  // namespace vi
