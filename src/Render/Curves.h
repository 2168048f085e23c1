#pragma once

// Three tone curves (red, green, blue) through Catmull-Rom segments, kept as a
// 256-entry RGBA table and exposed as a 1 x 256 dynamic texture over that
// table, so a shader remaps each channel with one fetch and later edits of the
// table show at the next bind. Owns the texture; the table is its own.

#include <glm/glm.hpp>

#include "Tools/Export.h"

namespace vi {

class Texture;

class VI_EXPORT Curves {
public:
    enum CHANNELS {
        RED = 0,
        GREEN = 1,
        BLUE = 2,
    };

    Curves(const glm::vec2* red, int redCount, const glm::vec2* green, int greenCount, const glm::vec2* blue,
           int blueCount);
    ~Curves();

    Curves(const Curves&) = delete;
    Curves& operator=(const Curves&) = delete;

    void calculateCatmullRomPoints(const glm::vec2* red, int redCount, const glm::vec2* green, int greenCount,
                                   const glm::vec2* blue, int blueCount);
    void calculateCatmullRomPoint(int start, int end, glm::vec2 p0, glm::vec2 p1, glm::vec2 p2, glm::vec2 p3,
                                  CHANNELS channel);
    Texture* getTexture();

    Texture* mTexture;
    unsigned char mTable[1024];
};

}  // namespace vi
