#pragma once

// A cube map of six faces, uploaded as RGBA bytes (or ETC1) in the order
// +X, -X, +Y, -Y, +Z, -Z, each from its own pointer in mFaces; mBuffer stays
// null. When deletable, frees each face buffer once with free. Texture
// recycling leaves the faces alone, so a lost context re-creates the cube
// from them.

#include <vector>

#include "Render/Texture.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT TextureCube : public Texture {
public:
    // faces, widths and heights: six entries each, in the order above.
    TextureCube(void* const faces[6], const unsigned int widths[6], const unsigned int heights[6], bool isStatic,
                bool isRepeat, bool isMirrored, bool isLinear, bool isCompressed);
    ~TextureCube() override;
    void update() override;

    std::vector<void*> mFaces;
    std::vector<unsigned int> mFaceWidths;
    std::vector<unsigned int> mFaceHeights;
};

}  // namespace vi
