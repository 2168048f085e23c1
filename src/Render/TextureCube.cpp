#include "Render/TextureCube.h"

#include <cstdlib>

namespace vi {

namespace {

constexpr int kFaceCount = 6;

// In the order of mFaces: +X, -X, +Y, -Y, +Z, -Z.
constexpr GLenum kFaceTargets[kFaceCount] = {
    GL_TEXTURE_CUBE_MAP_POSITIVE_X, GL_TEXTURE_CUBE_MAP_NEGATIVE_X, GL_TEXTURE_CUBE_MAP_POSITIVE_Y,
    GL_TEXTURE_CUBE_MAP_NEGATIVE_Y, GL_TEXTURE_CUBE_MAP_POSITIVE_Z, GL_TEXTURE_CUBE_MAP_NEGATIVE_Z,
};

}  // namespace

TextureCube::TextureCube(void* const faces[6], const unsigned int widths[6], const unsigned int heights[6],
                         bool isStatic, bool isRepeat, bool isMirrored, bool isLinear, bool isCompressed)
    : Texture(faces[0], widths[0], heights[0], isStatic, isRepeat, isMirrored, isLinear, isCompressed, 4, false),
      mFaces(faces, faces + kFaceCount),
      mFaceWidths(widths, widths + kFaceCount),
      mFaceHeights(heights, heights + kFaceCount) {
    mTarget = GL_TEXTURE_CUBE_MAP;
}

TextureCube::~TextureCube() {
    if (mIsDeletable) {
        // Face 0 is also mBuffer, which the texture destructor frees; texture
        // recycling may already have freed it through that pointer.
        for (int face = 1; face < kFaceCount; ++face) free(mFaces[face]);
    }
}

void TextureCube::update() {
    glBindTexture(mTarget, mId);
    // The pack alignment on purpose, as for every texture.
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    // Face 0 is read through mBuffer, which is mFaces[0] unless texture
    // recycling released it (then null, and the face is re-created undefined,
    // as for any recycled texture, instead of reading freed memory).
    void* pixels[kFaceCount] = {mBuffer, mFaces[1], mFaces[2], mFaces[3], mFaces[4], mFaces[5]};
    if (mIsCompressed) {
        for (int face = 0; face < kFaceCount; ++face) {
            const unsigned int width = mFaceWidths[face];
            const unsigned int height = mFaceHeights[face];
            glCompressedTexImage2D(kFaceTargets[face], 0, GL_ETC1_RGB8_OES, width, height, 0, (width * height) >> 1,
                                   pixels[face]);
        }
        return;
    }
    if (mIsSubImageUse && mIsUploaded) {
        for (int face = 0; face < kFaceCount; ++face)
            glTexSubImage2D(kFaceTargets[face], 0, 0, 0, mFaceWidths[face], mFaceHeights[face], GL_RGBA,
                            GL_UNSIGNED_BYTE, pixels[face]);
        return;
    }
    for (int face = 0; face < kFaceCount; ++face)
        glTexImage2D(kFaceTargets[face], 0, GL_RGBA, mFaceWidths[face], mFaceHeights[face], 0, GL_RGBA,
                     GL_UNSIGNED_BYTE, pixels[face]);
    mIsUploaded = true;
}

}  // namespace vi
