// Tone curves: the table the segments write (worked values, shared joints,
// untouched bytes, the same bytes on every CPU) and the texture over it.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <new>
#include <vector>

#include "GlContext.h"
#include "Painters.h"
#include "Render/Curves.h"
#include "Render/Texture.h"

using glm::vec2;

namespace {

int texel(const vi::Curves& curves, int x, int channel) { return curves.mTable[4 * x + channel]; }

TEST(CurvesTable, SegmentsGiveTheWorkedValuesMeetTheirEndsAndShareJoints) {
    const vec2 diagonal[] = {{0, 0}, {255, 255}};
    const vec2 bend[] = {{0, 0}, {128, 200}, {255, 40}};
    const vec2 steps[] = {{10, 30}, {11, 90}, {20, 90}, {21, 250}};  // two-texel segments, one at the end
    vi::Curves curves(diagonal, 2, bend, 3, steps, 4);
    struct Row {
        int channel, x, value;
    };
    // Midway through the bend's first segment, t = 64/128 gives 200 * 0.5 exactly.
    for (const Row& row : {Row{0, 0, 0}, Row{0, 1, 0}, Row{0, 64, 52}, Row{0, 128, 128}, Row{0, 192, 203},
                           Row{0, 254, 254}, Row{0, 255, 255}, Row{1, 64, 100}, Row{1, 128, 200}, Row{1, 255, 40},
                           Row{2, 9, 0}, Row{2, 10, 30}, Row{2, 11, 90}, Row{2, 20, 90}, Row{2, 21, 250},
                           Row{2, 22, 0}})
        EXPECT_EQ(texel(curves, row.x, row.channel), row.value) << "channel " << row.channel << " texel " << row.x;
    for (int x = 1; x < 256; ++x) EXPECT_GE(texel(curves, x, 0), texel(curves, x - 1, 0)) << x;
}

TEST(CurvesTable, ShortListsAndOtherBytesAreLeftAloneAndAnEarlierTextureIsKept) {
    const vec2 ramp[] = {{0, 255}, {255, 255}};
    // The table is zeroed before the first computation, whatever the storage held.
    alignas(vi::Curves) unsigned char storage[sizeof(vi::Curves)];
    std::memset(storage, 0xAB, sizeof(storage));
    vi::Curves* curves = new (storage) vi::Curves(ramp, 2, nullptr, 0, ramp, 1);
    for (int x = 0; x < 256; ++x)
        ASSERT_EQ(std::vector<int>({texel(*curves, x, 0), texel(*curves, x, 1), texel(*curves, x, 2),
                                    texel(*curves, x, 3)}),
                  (std::vector<int>{255, 0, 0, 0})) << x;

    vi::Texture* first = curves->getTexture();
    const vec2 single[] = {{128, 0}};
    const vec2 blue[] = {{0, 9}, {3, 9}};
    curves->calculateCatmullRomPoints(single, 1, nullptr, 0, blue, 2);
    EXPECT_NE(curves->getTexture(), first);
    EXPECT_EQ(texel(*curves, 200, 0), 255);
    EXPECT_EQ(texel(*curves, 3, 2), 9);
    EXPECT_EQ(texel(*curves, 4, 2), 0);
    delete first;
    curves->~Curves();
}

// A few thousand random segments through both segment forms, hashed over
// every table byte. The digest is the x86-64 build's; the arm64 build
// (scripts/test-arm64) must give the same bytes. Inputs are made with integer
// arithmetic and exact divisions only, so that the test's own compilation
// (contraction allowed) cannot change them.
TEST(CurvesTable, RandomSegmentsGiveTheSameBytesOnEveryCpu) {
    std::uint64_t lcg = 20240611;
    auto next = [&lcg](std::uint32_t range) {
        lcg = lcg * 6364136223846793005ull + 1442695040888963407ull;
        return std::uint32_t(lcg >> 33) % range;
    };
    std::uint64_t digest = 14695981039346656037ull;  // FNV-1a
    int segments = 0;
    for (int curve = 0; curve < 600; ++curve) {
        std::vector<vec2> points[3];
        for (std::vector<vec2>& channel : points) {
            std::vector<int> xs(2 + next(5));
            for (int& x : xs) x = int(next(2048));
            std::sort(xs.begin(), xs.end());
            // x in [0, 256) in eighths, y in [-25, 287) in eighths: clamps included.
            for (int x : xs) channel.push_back(vec2(float(x) / 8.0f, float(int(next(2496)) - 200) / 8.0f));
            segments += int(xs.size()) - 1;
        }
        vi::Curves curves(points[0].data(), int(points[0].size()), points[1].data(), int(points[1].size()),
                          points[2].data(), int(points[2].size()));
        const int start = 4 * int(next(250));
        const int end = start + 8 + 4 * int(next(std::uint32_t(255 - start / 4 - 1)));
        vec2 p[4];  // drawn one by one: the order of a call's arguments is not fixed
        for (vec2& point : p) point = vec2(0.0f, float(int(next(2496)) - 200) / 8.0f);
        curves.calculateCatmullRomPoint(start, end, p[0], p[1], p[2], p[3], vi::Curves::CHANNELS(next(3)));
        ++segments;
        for (unsigned char byte : curves.mTable) digest = (digest ^ byte) * 1099511628211ull;
    }
    EXPECT_EQ(segments, 6029);  // the same curves were drawn
    EXPECT_EQ(digest, 0x769bbaf6fb9729f6u) << std::hex << digest;
}

TEST(CurvesTexture, IsADynamicOneByTwoHundredFiftySixTextureThatSamplesToTheTable) {
    vitest::GlContext context(4, 256);
    const vec2 red[] = {{0, 0}, {255, 255}};
    const vec2 green[] = {{0, 255}, {100, 30}, {255, 180}};
    const vec2 blue[] = {{20, 60}, {200, 250}};
    vi::Curves curves(red, 2, green, 3, blue, 2);
    EXPECT_EQ(curves.getTexture()->mBuffer, static_cast<void*>(curves.mTable));
    EXPECT_FALSE(curves.getTexture()->mIsDeletable);
    vitest::TexturePainter painter(curves.getTexture());
    std::vector<std::uint32_t> sampled = painter.draw(1, 256);
    for (int x = 0; x < 256; ++x) ASSERT_EQ(sampled[std::size_t(x)], vitest::rgba(&curves.mTable[4 * x])) << x;
    curves.mTable[4 * 77 + 3] = 0x5A;
    EXPECT_EQ(painter.draw(1, 256)[77] & 0xFF, 0x5Au);
}

}  // namespace
