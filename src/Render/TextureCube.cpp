#include "Render/TextureCube.h"

#include <cstdlib>

#include "Render/NamedValues.h"

namespace vi {

namespace {

constexpr int kFaceCount = 6;

// In the order of mFaces: +X, -X, +Y, -Y, +Z, -Z.
constexpr GLenum kFaceTargets[kFaceCount] = {
    GL_TEXTURE_CUBE_MAP_POSITIVE_X, GL_TEXTURE_CUBE_MAP_NEGATIVE_X, GL_TEXTURE_CUBE_MAP_POSITIVE_Y,
    GL_TEXTURE_CUBE_MAP_NEGATIVE_Y, GL_TEXTURE_CUBE_MAP_POSITIVE_Z, GL_TEXTURE_CUBE_MAP_NEGATIVE_Z,
};

}  // namespace

// mBuffer stays null: every face, face 0 included, is read through mFaces, so
// that a plug-in re-pointing a face sees its new pixels at the next upload.
// Texture recycling only drops mBuffer, so it never frees a face that a later
// upload would read.
TextureCube::TextureCube(void* const faces[6], const unsigned int widths[6], const unsigned int heights[6],
                         bool isStatic, bool isRepeat, bool isMirrored, bool isLinear, bool isCompressed)
    : Texture(nullptr, widths[0], heights[0], isStatic, isRepeat, isMirrored, isLinear, isCompressed,
              TextureArgument::kRgba, TextureArgument::kBytes),
      mFaces(faces, faces + kFaceCount),
      mFaceWidths(widths, widths + kFaceCount),
      mFaceHeights(heights, heights + kFaceCount) {
    mTarget = GL_TEXTURE_CUBE_MAP;
}

// The six faces are freed here, once each; the texture destructor then finds
// mBuffer null.
TextureCube::~TextureCube() {
    if (mIsDeletable) {
        for (void* face : mFaces) free(face);
    }
}

void TextureCube::update() {
    glBindTexture(mTarget, mId);
    // The pack alignment on purpose, as for every texture.
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    if (mIsCompressed) {
        for (int face = 0; face < kFaceCount; ++face) {
            const unsigned int width = mFaceWidths[face];
            const unsigned int height = mFaceHeights[face];
            glCompressedTexImage2D(kFaceTargets[face], 0, GL_ETC1_RGB8_OES, width, height, 0, (width * height) >> 1,
                                   mFaces[face]);
        }
        return;
    }
    if (mIsSubImageUse && mIsUploaded) {
        for (int face = 0; face < kFaceCount; ++face)
            glTexSubImage2D(kFaceTargets[face], 0, 0, 0, mFaceWidths[face], mFaceHeights[face], GL_RGBA,
                            GL_UNSIGNED_BYTE, mFaces[face]);
        return;
    }
    for (int face = 0; face < kFaceCount; ++face)
        glTexImage2D(kFaceTargets[face], 0, GL_RGBA, mFaceWidths[face], mFaceHeights[face], 0, GL_RGBA,
                     GL_UNSIGNED_BYTE, mFaces[face]);
    mIsUploaded = true;
}

}  // namespace vi
