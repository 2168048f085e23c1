// The conversion of the host's ARGB ints into a texture's RGBA bytes: the
// worked example, and the byte-shuffle form against the portable one on
// lengths that leave a tail and on pointers of every alignment.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <vector>

#include "Entry/HostImage.h"

using vi::HostImage;

namespace {

using Convert = void (*)(void*, void*, std::size_t);

struct Form {
    const char* name;
    Convert convert;
};

std::vector<Form> forms() {
    std::vector<Form> result = {{"chosen", &HostImage::toTextureBytes},
                                {"portable", &HostImage::toTextureBytesPortable}};
    if (HostImage::hasShuffle()) result.push_back({HostImage::shuffleName(), &HostImage::toTextureBytesShuffled});
    return result;
}

TEST(HostImage, TwoPixelExampleGivesRgbaBytesAndLeavesTheHostArraySwapped) {
    for (const Form& form : forms()) {
        std::uint32_t host[2] = {0xFF112233u, 0x80AABBCCu};
        unsigned char bytes[8] = {};
        form.convert(host, bytes, 2);
        EXPECT_EQ((std::vector<unsigned char>{0x11, 0x22, 0x33, 0xFF, 0xAA, 0xBB, 0xCC, 0x80}),
                  std::vector<unsigned char>(bytes, bytes + 8))
            << form.name;
        EXPECT_EQ(0xFF332211u, host[0]) << form.name;
        EXPECT_EQ(0x80CCBBAAu, host[1]) << form.name;
    }
}

// Every form on every length and every misalignment of both pointers: the
// result matches the per-int formula, and nothing outside the n pixels moves.
TEST(HostImage, FormsAgreeOnOddLengthsAndUnalignedPointers) {
    const unsigned char kGuard = 0x5A;
    for (std::size_t count : {1u, 3u, 5u, 17u, 1001u}) {
        std::vector<std::uint32_t> original(count);
        for (std::size_t i = 0; i < count; ++i) original[i] = std::uint32_t(0x9E3779B9u * (i + 1)) ^ 0x01020304u;
        std::vector<unsigned char> expected(count * 4);
        for (std::size_t i = 0; i < count; ++i) {
            const std::uint32_t v = original[i];
            const std::uint32_t swapped = (v & 0xFF00FF00u) | ((v >> 16) & 0xFFu) | ((v & 0xFFu) << 16);
            std::memcpy(&expected[i * 4], &swapped, 4);
        }
        for (const Form& form : forms()) {
            for (std::size_t hostOffset = 0; hostOffset < 4; ++hostOffset) {
                for (std::size_t textureOffset = 0; textureOffset < 4; ++textureOffset) {
                    std::vector<unsigned char> host(count * 4 + 8, kGuard);
                    std::vector<unsigned char> texture(count * 4 + 8, kGuard);
                    std::memcpy(&host[hostOffset], original.data(), count * 4);
                    form.convert(&host[hostOffset], &texture[textureOffset], count);

                    const std::vector<unsigned char> hostResult(host.begin() + hostOffset,
                                                                host.begin() + hostOffset + count * 4);
                    const std::vector<unsigned char> textureResult(texture.begin() + textureOffset,
                                                                   texture.begin() + textureOffset + count * 4);
                    ASSERT_EQ(expected, hostResult) << form.name << " " << count << " " << hostOffset;
                    ASSERT_EQ(expected, textureResult) << form.name << " " << count << " " << textureOffset;
                    for (std::size_t i = 0; i < hostOffset; ++i) ASSERT_EQ(kGuard, host[i]);
                    for (std::size_t i = hostOffset + count * 4; i < host.size(); ++i) ASSERT_EQ(kGuard, host[i]);
                    for (std::size_t i = 0; i < textureOffset; ++i) ASSERT_EQ(kGuard, texture[i]);
                    for (std::size_t i = textureOffset + count * 4; i < texture.size(); ++i)
                        ASSERT_EQ(kGuard, texture[i]);
                }
            }
        }
    }
}

}  // namespace
