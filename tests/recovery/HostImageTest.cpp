// The conversion of the host's ARGB ints into a texture's RGBA bytes: the
// worked example, the byte-shuffle form each CPU must take, and that form
// against the portable one on every tail, full screens and pointers of every
// alignment.
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

// The form each CPU the runtime ships for must take: a build that falls
// back to the portable loop (NEON or SSSE3 not compiled in) fails here.
TEST(HostImage, TakesTheByteShuffleOfThisCpu) {
#if defined(__aarch64__)
    EXPECT_STREQ(HostImage::shuffleName(), "NEON");
    EXPECT_TRUE(HostImage::hasShuffle());
#elif defined(__x86_64__)
    EXPECT_STREQ(HostImage::shuffleName(), "SSSE3");
    EXPECT_EQ(HostImage::hasShuffle(), __builtin_cpu_supports("ssse3") != 0);
#else
    GTEST_SKIP() << "no byte shuffle is expected on this CPU";
#endif
}

// Every form on widths 1 to 67 (every tail, several whole vectors) with both
// pointers at every misalignment, and on a full 1080 x 1920 screen aligned
// and not: the result matches the per-int formula, and nothing outside the n
// pixels moves.
TEST(HostImage, FormsAgreeOnEveryWidthAndUnalignedPointers) {
    const unsigned char kGuard = 0x5A;
    auto check = [&](const Form& form, std::size_t count, std::size_t hostOffset, std::size_t textureOffset) {
        std::vector<std::uint32_t> original(count);
        for (std::size_t i = 0; i < count; ++i) original[i] = std::uint32_t(0x9E3779B9u * (i + 1)) ^ 0x01020304u;
        std::vector<unsigned char> expected(count * 4);
        for (std::size_t i = 0; i < count; ++i) {
            const std::uint32_t v = original[i];
            const std::uint32_t swapped = (v & 0xFF00FF00u) | ((v >> 16) & 0xFFu) | ((v & 0xFFu) << 16);
            std::memcpy(&expected[i * 4], &swapped, 4);
        }
        std::vector<unsigned char> host(count * 4 + 8, kGuard);
        std::vector<unsigned char> texture(count * 4 + 8, kGuard);
        std::memcpy(&host[hostOffset], original.data(), count * 4);
        form.convert(&host[hostOffset], &texture[textureOffset], count);

        SCOPED_TRACE(::testing::Message() << form.name << " width " << count << " offsets " << hostOffset << " "
                                          << textureOffset);
        ASSERT_EQ(0, std::memcmp(expected.data(), &host[hostOffset], count * 4));
        ASSERT_EQ(0, std::memcmp(expected.data(), &texture[textureOffset], count * 4));
        for (std::size_t i = 0; i < 8; ++i) {
            const std::size_t hostGuard = i < hostOffset ? i : count * 4 + i;
            const std::size_t textureGuard = i < textureOffset ? i : count * 4 + i;
            ASSERT_EQ(kGuard, host[hostGuard]) << hostGuard;
            ASSERT_EQ(kGuard, texture[textureGuard]) << textureGuard;
        }
    };
    for (const Form& form : forms()) {
        for (std::size_t count = 1; count <= 67; ++count)
            for (std::size_t hostOffset = 0; hostOffset < 4; ++hostOffset)
                for (std::size_t textureOffset = 0; textureOffset < 4; ++textureOffset) {
                    check(form, count, hostOffset, textureOffset);
                    if (HasFatalFailure()) return;  // the first case that differs is enough
                }
        check(form, 1080 * 1920, 0, 0);
        check(form, 1080 * 1920, 1, 3);
    }
}

}  // namespace
