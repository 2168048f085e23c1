#pragma once

// The images the host hands in: Java ints in packed ARGB (alpha in the top
// byte, blue in the low byte). A texture wants RGBA bytes in memory order,
// which on the little-endian targets served is each int with its red and blue
// bytes exchanged. The conversion is done in one pass that writes both the
// host's own array (left swapped, as the host expects) and the texture's
// buffer. Owns nothing; any thread.

#include <cstddef>

namespace vi {

class HostImage {
public:
    // Exchanges the red and blue bytes of each of `count` pixels in
    // `hostPixels`, in place, and copies the result, count * 4 bytes, to
    // `textureBytes`. Neither pointer needs any alignment; the two must not overlap.
    static void toTextureBytes(void* hostPixels, void* textureBytes, std::size_t count);

    // The two forms toTextureBytes chooses from, for tests that compare them.
    static void toTextureBytesPortable(void* hostPixels, void* textureBytes, std::size_t count);
    // The byte-shuffle form; call it only when hasShuffle().
    static void toTextureBytesShuffled(void* hostPixels, void* textureBytes, std::size_t count);
    // Whether this CPU runs the byte-shuffle form.
    static bool hasShuffle();
    // "SSSE3", "NEON" or "none".
    static const char* shuffleName();

    HostImage() = delete;
};

}  // namespace vi
