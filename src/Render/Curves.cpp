#include "Render/Curves.h"

#include <cstring>

#include "Render/NamedValues.h"
#include "Render/Texture.h"

namespace vi {

namespace {

constexpr int kBytesPerTexel = 4;

// Catmull-Rom with tension 0.5 from b (t = 0) to c (t = 1), in single
// precision and in exactly this grouping, so that truncation lands on the
// same bytes everywhere.
float segmentValue(float a, float b, float c, float d, float t) {
    return (2.0f * b + ((c - a) + ((2.0f * a - d + 4.0f * c - 5.0f * b) + t * (3.0f * b - a - 3.0f * c + d)) * t) * t) *
           0.5f;
}

// Clamped and truncated, not rounded; a NaN stores 0.
unsigned char toByte(float value) {
    if (value > 255.0f) return 255;
    if (value > 0.0f) return static_cast<unsigned char>(value);
    return 0;
}

}  // namespace

Curves::Curves(const glm::vec2* red, int redCount, const glm::vec2* green, int greenCount, const glm::vec2* blue,
               int blueCount)
    : mTexture(nullptr) {
    // Texels outside the points' range and every fourth byte are never
    // written; a zero table makes them the same on every device.
    std::memset(mTable, 0, sizeof(mTable));
    calculateCatmullRomPoints(red, redCount, green, greenCount, blue, blueCount);
}

Curves::~Curves() { delete mTexture; }

void Curves::calculateCatmullRomPoints(const glm::vec2* red, int redCount, const glm::vec2* green, int greenCount,
                                       const glm::vec2* blue, int blueCount) {
    const glm::vec2* lists[3] = {red, green, blue};
    const int counts[3] = {redCount, greenCount, blueCount};

    for (int channel = 0; channel < 3; ++channel) {
        const glm::vec2* points = lists[channel];
        // Each segment uses only its own two end points, deliberately, not the
        // neighbours in the list: it meets both ends and never overshoots.
        // Consecutive segments share the texel at the joint; the later one
        // rewrites it with its own start value.
        for (int i = 1; i < counts[channel]; ++i) {
            const glm::vec2 from = points[i - 1];
            const glm::vec2 to = points[i];
            const int start = int(from.x);
            const int end = int(to.x + 1.0f);
            if (start >= end) continue;

            const int texels = end - start;
            mTable[start * kBytesPerTexel + channel] = toByte(from.y);
            if (texels > 1) {
                const float step = 1.0f / float(kBytesPerTexel * (texels - 1));
                for (int k = 1; k < texels; ++k) {
                    const float t = float(kBytesPerTexel * k) * step;
                    const float value = segmentValue(from.y, from.y, to.y, to.y, t);
                    mTable[(start + k) * kBytesPerTexel + channel] = toByte(value);
                }
            }
        }
    }

    // One texel wide, one row per input level. Dynamic, so that the table is
    // uploaded at every bind and later edits show; not deletable, the table is
    // this object's own. An earlier texture is not deleted here.
    using namespace TextureArgument;
    mTexture = new Texture(mTable, 1, 256, kEveryBind, kRepeat, kNotMirrored, kLinear, kNotCompressed, kRgba, kBytes);
}

void Curves::calculateCatmullRomPoint(int start, int end, glm::vec2 p0, glm::vec2 p1, glm::vec2 p2, glm::vec2 p3,
                                      CHANNELS channel) {
    if (start >= end) return;
    const int span = end - start;
    // A span of one texel divides by zero; callers pass at least two.
    const float step = 1.0f / float(span - kBytesPerTexel);
    for (int j = 0; j < span; j += kBytesPerTexel) {
        const float t = float(j) * step;
        mTable[start + j + channel] = toByte(segmentValue(p0.y, p1.y, p2.y, p3.y, t));
    }
}

Texture* Curves::getTexture() { return mTexture; }

}  // namespace vi
