#pragma once

// What the background and lighting tests draw with and read back: a texture
// over pixels the test keeps, and pixel colours as comparable channels.

#include <cstdint>
#include <cstdlib>
#include <ostream>
#include <vector>

#include "GlContext.h"
#include "Render/Texture.h"

namespace vitest {

struct Rgba {
    int r, g, b, a;
    bool operator==(const Rgba& o) const { return r == o.r && g == o.g && b == o.b && a == o.a; }
    // Every channel within `tolerance` of the other's.
    bool near(const Rgba& o, int tolerance) const {
        return std::abs(r - o.r) <= tolerance && std::abs(g - o.g) <= tolerance && std::abs(b - o.b) <= tolerance &&
               std::abs(a - o.a) <= tolerance;
    }
};

inline std::ostream& operator<<(std::ostream& out, const Rgba& c) {
    return out << "(" << c.r << ", " << c.g << ", " << c.b << ", " << c.a << ")";
}

inline Rgba pixelAt(int x, int y) {
    std::vector<std::uint8_t> p = readPixels(x, y, 1, 1);
    return Rgba{p[0], p[1], p[2], p[3]};
}

// A static, clamped, nearest-filtered RGBA texture over rows of texels given
// first row first. The pixels live as long as the texture.
class PixelTexture {
public:
    PixelTexture(unsigned int width, unsigned int height, const std::vector<Rgba>& texels)
        : mPixels(toBytes(texels)), mTexture(mPixels.data(), width, height, true, false, false, false, false, 4, false) {}

    vi::Texture& texture() { return mTexture; }

private:
    static std::vector<std::uint8_t> toBytes(const std::vector<Rgba>& texels) {
        std::vector<std::uint8_t> bytes(texels.size() * 4);
        for (std::size_t i = 0; i < texels.size(); ++i) {
            bytes[4 * i] = std::uint8_t(texels[i].r);
            bytes[4 * i + 1] = std::uint8_t(texels[i].g);
            bytes[4 * i + 2] = std::uint8_t(texels[i].b);
            bytes[4 * i + 3] = std::uint8_t(texels[i].a);
        }
        return bytes;
    }

    std::vector<std::uint8_t> mPixels;
    vi::Texture mTexture;
};

}  // namespace vitest
