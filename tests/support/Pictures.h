#pragma once

// Pixels as the tests read them back: 0xRRGGBBAA words.

#include <GLES2/gl2.h>

#include <cstdint>
#include <cstdlib>
#include <vector>

#include "GlContext.h"

namespace vitest {

// RGBA bytes as one 0xRRGGBBAA value, the form readPixel() returns.
inline std::uint32_t rgba(const std::uint8_t* p) {
    return (std::uint32_t(p[0]) << 24) | (std::uint32_t(p[1]) << 16) | (std::uint32_t(p[2]) << 8) | p[3];
}

// The current framebuffer's rectangle as 0xRRGGBBAA words, bottom row first.
inline std::vector<std::uint32_t> readWords(int x, int y, int width, int height) {
    const std::vector<std::uint8_t> bytes = readPixels(x, y, width, height);
    std::vector<std::uint32_t> words;
    for (std::size_t i = 0; i < bytes.size(); i += 4) words.push_back(rgba(&bytes[i]));
    return words;
}

// Every channel of two 0xRRGGBBAA words within `tolerance` of the other's.
inline bool near(std::uint32_t a, std::uint32_t b, int tolerance) {
    for (int shift = 0; shift < 32; shift += 8)
        if (std::abs(int(a >> shift & 0xFF) - int(b >> shift & 0xFF)) > tolerance) return false;
    return true;
}

}  // namespace vitest
