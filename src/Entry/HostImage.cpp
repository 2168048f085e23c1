#include "Entry/HostImage.h"

#include <cstdint>
#include <cstring>

// The one place the byte-shuffle form is chosen. Each pixel's bytes 0 and 2
// (blue and red of the host's int) trade places, 16 bytes at a time:
// - x86-64: SSSE3 pshufb. Compiled in either way; when the build does not
//   already assume SSSE3 the CPU is asked once at run time.
// - Arm with NEON: tbl on AArch64 (one instruction), vrev32 and a rotate by
//   one byte on 32-bit Arm.
// - Elsewhere: no shuffle, the portable loop does everything.
#if defined(__x86_64__) || defined(__i386__)
#include <tmmintrin.h>
#define VI_SHUFFLE_SSSE3 1
#define VI_SHUFFLE_TARGET __attribute__((target("ssse3")))
#elif defined(__ARM_NEON) || defined(__ARM_NEON__)
#include <arm_neon.h>
#define VI_SHUFFLE_NEON 1
#define VI_SHUFFLE_TARGET
#else
#define VI_SHUFFLE_TARGET
#endif

namespace vi {

namespace {

constexpr std::size_t kPixelsPerBlock = 4;  // one 16-byte vector

// (v & 0xFF00FF00) | ((v >> 16) & 0xFF) | ((v & 0xFF) << 16): red and blue
// exchanged, alpha and green kept. memcpy keeps any alignment legal; the
// compiler makes plain loads and stores of it.
void swapTail(unsigned char* host, unsigned char* texture, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        std::uint32_t v;
        std::memcpy(&v, host + i * 4, 4);
        v = (v & 0xFF00FF00u) | ((v >> 16) & 0xFFu) | ((v & 0xFFu) << 16);
        std::memcpy(host + i * 4, &v, 4);
        std::memcpy(texture + i * 4, &v, 4);
    }
}

#if defined(VI_SHUFFLE_SSSE3)

VI_SHUFFLE_TARGET std::size_t swapBlocks(unsigned char* host, unsigned char* texture, std::size_t count) {
    const __m128i order = _mm_setr_epi8(2, 1, 0, 3, 6, 5, 4, 7, 10, 9, 8, 11, 14, 13, 12, 15);
    const std::size_t blocks = count / kPixelsPerBlock;
    for (std::size_t b = 0; b < blocks; ++b) {
        __m128i* hostBlock = reinterpret_cast<__m128i*>(host + b * 16);
        const __m128i swapped = _mm_shuffle_epi8(_mm_loadu_si128(hostBlock), order);
        _mm_storeu_si128(hostBlock, swapped);
        _mm_storeu_si128(reinterpret_cast<__m128i*>(texture + b * 16), swapped);
    }
    return blocks * kPixelsPerBlock;
}

bool cpuHasShuffle() {
#if defined(__SSSE3__)
    return true;
#else
    static const bool hasSsse3 = [] {
        __builtin_cpu_init();
        return __builtin_cpu_supports("ssse3") != 0;
    }();
    return hasSsse3;
#endif
}

const char* const kShuffleName = "SSSE3";

#elif defined(VI_SHUFFLE_NEON)

std::size_t swapBlocks(unsigned char* host, unsigned char* texture, std::size_t count) {
#if defined(__aarch64__)
    static const std::uint8_t kOrder[16] = {2, 1, 0, 3, 6, 5, 4, 7, 10, 9, 8, 11, 14, 13, 12, 15};
    const uint8x16_t order = vld1q_u8(kOrder);
#endif
    const std::size_t blocks = count / kPixelsPerBlock;
    for (std::size_t b = 0; b < blocks; ++b) {
        const uint8x16_t pixels = vld1q_u8(host + b * 16);
#if defined(__aarch64__)
        const uint8x16_t swapped = vqtbl1q_u8(pixels, order);
#else
        // Bytes 0 1 2 3 reversed to 3 2 1 0, then the word rotated right by
        // one byte: 2 1 0 3.
        const uint32x4_t reversed = vreinterpretq_u32_u8(vrev32q_u8(pixels));
        const uint8x16_t swapped = vreinterpretq_u8_u32(vsriq_n_u32(vshlq_n_u32(reversed, 24), reversed, 8));
#endif
        vst1q_u8(host + b * 16, swapped);
        vst1q_u8(texture + b * 16, swapped);
    }
    return blocks * kPixelsPerBlock;
}

bool cpuHasShuffle() { return true; }

const char* const kShuffleName = "NEON";

#else

std::size_t swapBlocks(unsigned char*, unsigned char*, std::size_t) { return 0; }

bool cpuHasShuffle() { return false; }

const char* const kShuffleName = "none";

#endif

}  // namespace

void HostImage::toTextureBytes(void* hostPixels, void* textureBytes, std::size_t count) {
    if (cpuHasShuffle())
        toTextureBytesShuffled(hostPixels, textureBytes, count);
    else
        toTextureBytesPortable(hostPixels, textureBytes, count);
}

void HostImage::toTextureBytesPortable(void* hostPixels, void* textureBytes, std::size_t count) {
    swapTail(static_cast<unsigned char*>(hostPixels), static_cast<unsigned char*>(textureBytes), count);
}

// Whole vectors first, then the last pixels (fewer than four) one by one.
void HostImage::toTextureBytesShuffled(void* hostPixels, void* textureBytes, std::size_t count) {
    unsigned char* host = static_cast<unsigned char*>(hostPixels);
    unsigned char* texture = static_cast<unsigned char*>(textureBytes);
    const std::size_t done = swapBlocks(host, texture, count);
    swapTail(host + done * 4, texture + done * 4, count - done);
}

bool HostImage::hasShuffle() { return cpuHasShuffle(); }

const char* HostImage::shuffleName() { return kShuffleName; }

}  // namespace vi
