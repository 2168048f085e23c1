// 2D and cube textures on a real context: what each upload sends to GL and
// when, the alignments, the parameters, ETC1 data and cube faces.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "GlContext.h"
#include "GlRecorder.h"
#include "HeapWatch.h"
#include "Render/Texture.h"
#include "Render/TextureCube.h"
#include "Pictures.h"

using vitest::GlCall;
using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;
using vitest::HeapWatch;
using vitest::kBigBuffer;
using vitest::SamplerProbe;

namespace {

const std::vector<std::string> kUploads = {"glTexImage2D", "glTexSubImage2D", "glCompressedTexImage2D"};

double address(const void* p) { return double(reinterpret_cast<std::uintptr_t>(p)); }

// One ETC1 block in individual mode, not flipped: the left 2x4 half in
// colour 1, the right half in colour 2 (4-bit components), table 0 and every
// pixel index 0, i.e. each texel is its half's colour plus 2.
void putEtc1Block(std::uint8_t* block, const int left[3], const int right[3]) {
    block[0] = std::uint8_t(left[0] << 4 | right[0]);
    block[1] = std::uint8_t(left[1] << 4 | right[1]);
    block[2] = std::uint8_t(left[2] << 4 | right[2]);
    std::memset(block + 3, 0, 5);
}
std::uint32_t etc1Texel(const int colour[3]) {
    auto channel = [](int c) { return std::uint32_t(std::min(255, c * 17 + 2)); };
    return channel(colour[0]) << 24 | channel(colour[1]) << 16 | channel(colour[2]) << 8 | 0xFF;
}

class TextureTest : public ::testing::Test {
protected:
    void TearDown() override { GlRecorder::stop(); }

    GlContext mContext{64, 64};
};

TEST_F(TextureTest, StaticAllocationUploadsOnceThenSetsParametersInOrder) {
    std::vector<std::uint8_t> pixels(2 * 2 * 4, 0x7F);
    vi::Texture texture(pixels.data(), 2, 2, true, false, false, false, false, 4, false);
    GlRecording recording;
    texture.allocate();
    GlRecorder::stop();

    const std::vector<std::string> expected = {"glGenTextures",   "glBindTexture",   "glPixelStorei",
                                               "glTexImage2D",    "glTexParameteri", "glTexParameteri",
                                               "glTexParameteri", "glTexParameteri"};
    ASSERT_EQ(GlRecorder::names({"glIsTexture", "glGenTextures", "glBindTexture", "glPixelStorei",
                                 "glTexImage2D", "glTexParameteri"}),
              expected);
    const GlCall pack = GlRecorder::callsNamed("glPixelStorei")[0];
    EXPECT_EQ(pack.args, (std::vector<double>{GL_PACK_ALIGNMENT, 1}));
    std::vector<double> parameterNames;
    for (const GlCall& call : GlRecorder::callsNamed("glTexParameteri")) parameterNames.push_back(call.args[1]);
    EXPECT_EQ(parameterNames, (std::vector<double>{GL_TEXTURE_MAG_FILTER, GL_TEXTURE_MIN_FILTER, GL_TEXTURE_WRAP_T,
                                                   GL_TEXTURE_WRAP_S}));
    EXPECT_TRUE(vi::Texture::mIsSubImageUse);  // llvmpipe is not a Mali GPU
}

TEST_F(TextureTest, UploadsSetPackAlignmentAndKeepTheContextsUnpackAlignment) {
    // A 1 x 2 RGB image with rows padded to 4 bytes: only an upload that runs
    // with the default unpack alignment of 4 finds the second row.
    std::uint8_t pixels[8] = {10, 20, 30, 0, 200, 150, 100, 0};
    vi::Texture texture(pixels, 1, 2, true, false, false, false, false, 3, false);
    glPixelStorei(GL_PACK_ALIGNMENT, 4);
    texture.allocate();

    GLint pack = 0, unpack = 0;
    glGetIntegerv(GL_PACK_ALIGNMENT, &pack);
    glGetIntegerv(GL_UNPACK_ALIGNMENT, &unpack);
    EXPECT_EQ(pack, 1);
    EXPECT_EQ(unpack, 4);
    SamplerProbe probe(SamplerProbe::Flat);
    EXPECT_EQ(probe.draw(texture, 1, 2), (std::vector<std::uint32_t>{0x0A141EFF, 0xC89664FF}));
}

TEST_F(TextureTest, WrapAndFilterFollowTheFlags) {
    struct Case {
        bool isRepeat, isMirrored, isLinear;
        GLint wrap, filter;
    };
    const Case cases[] = {
        {true, false, true, GL_REPEAT, GL_LINEAR},
        {true, true, false, GL_MIRRORED_REPEAT, GL_NEAREST},
        {false, false, true, GL_CLAMP_TO_EDGE, GL_LINEAR},
        // Mirroring is consulted only for repeating textures.
        {false, true, false, GL_CLAMP_TO_EDGE, GL_NEAREST},
    };
    std::uint8_t pixels[4] = {1, 2, 3, 4};
    for (const Case& c : cases) {
        SCOPED_TRACE(testing::Message() << "repeat " << c.isRepeat << " mirrored " << c.isMirrored << " linear "
                                        << c.isLinear);
        vi::Texture texture(pixels, 1, 1, false, c.isRepeat, c.isMirrored, c.isLinear, false, 4, false);
        GlRecording recording;
        texture.allocate();
        GlRecorder::stop();
        std::vector<double> values;
        for (const GlCall& call : GlRecorder::callsNamed("glTexParameteri")) values.push_back(call.args[2]);
        EXPECT_EQ(values, (std::vector<double>{double(c.filter), double(c.filter), double(c.wrap), double(c.wrap)}));
    }
}

TEST_F(TextureTest, DynamicTextureUploadsInFullAtFirstBindThenBySubImage) {
    std::vector<std::uint8_t> pixels = {255, 0, 0, 255, 0, 255, 0, 255};
    vi::Texture texture(pixels.data(), 2, 1, false, false, false, false, false, 4, false);
    SamplerProbe probe(SamplerProbe::Flat);

    GlRecording recording;
    texture.allocate();
    EXPECT_EQ(GlRecorder::names(kUploads), std::vector<std::string>{});
    EXPECT_FALSE(texture.mIsUploaded);

    GlRecorder::clear();
    texture.bind(3, 2);
    EXPECT_EQ(GlRecorder::names(),
              (std::vector<std::string>{"glActiveTexture", "glBindTexture", "glPixelStorei", "glTexImage2D",
                                        "glUniform1i"}));
    EXPECT_EQ(GlRecorder::callsNamed("glUniform1i")[0].args, (std::vector<double>{3, 2}));

    GlRecorder::clear();
    EXPECT_EQ(probe.draw(texture, 2, 1), (std::vector<std::uint32_t>{0xFF0000FF, 0x00FF00FF}));
    pixels = {0, 0, 255, 255, 255, 255, 255, 255};
    EXPECT_EQ(probe.draw(texture, 2, 1), (std::vector<std::uint32_t>{0x0000FFFF, 0xFFFFFFFF}));
    EXPECT_EQ(GlRecorder::names(kUploads), (std::vector<std::string>{"glTexSubImage2D", "glTexSubImage2D"}));
    EXPECT_EQ(GlRecorder::callsNamed("glTexSubImage2D")[0].args,
              (std::vector<double>{GL_TEXTURE_2D, 0, 0, 0, 2, 1, GL_RGBA, GL_UNSIGNED_BYTE, address(pixels.data())}));
}

TEST_F(TextureTest, Etc1UploadsInFullWithHalfAByteATexelAndDecodes) {
    // Four blocks in raster order, each with two colours.
    const int colours[4][2][3] = {{{15, 0, 0}, {0, 15, 0}},
                                  {{0, 0, 15}, {8, 8, 8}},
                                  {{15, 15, 0}, {0, 15, 15}},
                                  {{3, 6, 9}, {12, 10, 1}}};
    std::uint8_t data[32];
    for (int block = 0; block < 4; ++block) putEtc1Block(data + 8 * block, colours[block][0], colours[block][1]);
    vi::Texture texture(data, 8, 8, false, false, false, false, true, 4, false);
    SamplerProbe probe(SamplerProbe::Flat);

    GlRecording recording;
    texture.allocate();
    const std::vector<std::uint32_t> first = probe.draw(texture, 8, 8);
    probe.draw(texture, 8, 8);
    GlRecorder::stop();

    const std::vector<GlCall> uploads = GlRecorder::callsNamed("glCompressedTexImage2D");
    ASSERT_EQ(uploads.size(), 2u);
    for (const GlCall& upload : uploads)
        EXPECT_EQ(upload.args, (std::vector<double>{GL_TEXTURE_2D, 0, GL_ETC1_RGB8_OES, 8, 8, 0, 32, address(data)}));

    for (int y = 0; y < 8; ++y)
        for (int x = 0; x < 8; ++x) {
            const int block = (y / 4) * 2 + x / 4;
            EXPECT_EQ(first[std::size_t(y * 8 + x)], etc1Texel(colours[block][(x % 4) < 2 ? 0 : 1]))
                << "texel " << x << ", " << y;
        }
}

// Square faces of 2 x 2 texels (cube faces must be square), a left and a
// right colour on each, different on every face.
struct CubeFaces {
    std::uint32_t colours[6][2];
    std::vector<std::uint8_t> bytes[6];
    void* faces[6];
    unsigned int sizes[6] = {2, 2, 2, 2, 2, 2};

    CubeFaces() {
        for (int f = 0; f < 6; ++f) {
            for (int t = 0; t < 2; ++t)
                colours[f][t] = std::uint32_t(0x20 * (f + 1)) << 24 | std::uint32_t(0x40 * t + 0x10) << 16 |
                                std::uint32_t(0xF0 - 0x20 * f) << 8 | 0xFF;
            for (int texel = 0; texel < 4; ++texel)
                for (int shift = 24; shift >= 0; shift -= 8)
                    bytes[f].push_back(std::uint8_t(colours[f][texel % 2] >> shift));
            faces[f] = bytes[f].data();
        }
    }
};

TEST_F(TextureTest, CubeUploadsItsSixFacesInOrderAsRgbaBytesAndSamplesThem) {
    CubeFaces cube;
    vi::TextureCube texture(cube.faces, cube.sizes, cube.sizes, true, false, false, false, false);

    GlRecording recording;
    texture.allocate();
    GlRecorder::stop();
    const std::vector<GlCall> images = GlRecorder::callsNamed("glTexImage2D");
    ASSERT_EQ(images.size(), 6u);
    for (int f = 0; f < 6; ++f)
        EXPECT_EQ(images[std::size_t(f)].args,
                  (std::vector<double>{double(GL_TEXTURE_CUBE_MAP_POSITIVE_X + f), 0, GL_RGBA, 2, 2, 0, GL_RGBA,
                                       GL_UNSIGNED_BYTE, address(cube.faces[f])}));

    // Aimed at the left half of each face (s < 0.5), then at the right of +X.
    SamplerProbe probe(SamplerProbe::Cube);
    EXPECT_EQ(probe.look(texture, 1.0f, 0.0f, 0.5f), cube.colours[0][0]);    // +X: s from -z
    EXPECT_EQ(probe.look(texture, -1.0f, 0.0f, -0.5f), cube.colours[1][0]);  // -X: s from +z
    EXPECT_EQ(probe.look(texture, -0.5f, 1.0f, 0.0f), cube.colours[2][0]);   // +Y: s from +x
    EXPECT_EQ(probe.look(texture, -0.5f, -1.0f, 0.0f), cube.colours[3][0]);  // -Y: s from +x
    EXPECT_EQ(probe.look(texture, -0.5f, 0.0f, 1.0f), cube.colours[4][0]);   // +Z: s from +x
    EXPECT_EQ(probe.look(texture, 0.5f, 0.0f, -1.0f), cube.colours[5][0]);   // -Z: s from -x

    // A plug-in animating a face points it at new pixels: the next upload reads them.
    std::vector<std::uint8_t> red(16, 0);
    for (std::size_t texel = 0; texel < 4; ++texel) red[texel * 4] = red[texel * 4 + 3] = 0xFF;
    texture.mFaces[0] = red.data();
    texture.update();
    EXPECT_EQ(probe.look(texture, 1.0f, 0.0f, 0.5f), 0xFF0000FFu);
    EXPECT_EQ(probe.look(texture, -1.0f, 0.0f, -0.5f), cube.colours[1][0]);
}

TEST_F(TextureTest, DestructionDeletesTheNameUnlessShared) {
    std::uint8_t pixels[4] = {};
    auto* own = new vi::Texture(pixels, 1, 1, true, false, false, false, false, 4, false);
    auto* shared = new vi::Texture(pixels, 1, 1, true, false, false, false, false, 4, false);
    own->allocate();
    shared->allocate();
    shared->mIsShared = true;
    const GLuint ownId = own->mId;
    GLuint sharedId = shared->mId;

    GlRecording recording;
    delete own;
    EXPECT_EQ(GlRecorder::names(), (std::vector<std::string>{"glBindTexture", "glDeleteTextures"}));
    EXPECT_EQ(GlRecorder::callsNamed("glDeleteTextures")[0].args, (std::vector<double>{1, double(ownId)}));
    EXPECT_EQ(glIsTexture(ownId), GL_FALSE);

    GlRecorder::clear();
    delete shared;
    EXPECT_TRUE(GlRecorder::names().empty());
    EXPECT_EQ(glIsTexture(sharedId), GL_TRUE);
    glDeleteTextures(1, &sharedId);
}

TEST_F(TextureTest, OnlyADeletableTextureFreesItsBuffer) {
    void* owned = vitest::bigBuffer(1);
    auto* deletable = new vi::Texture(owned, 1024, 1024, true, false, false, false, false, 4, false);
    deletable->setDeletable(true);
    HeapWatch afterOwned;
    delete deletable;
    EXPECT_TRUE(afterOwned.gaveBack(kBigBuffer));

    void* lent = vitest::bigBuffer(2);
    auto* borrower = new vi::Texture(lent, 1024, 1024, true, false, false, false, false, 4, false);
    HeapWatch afterLent;
    delete borrower;
    EXPECT_TRUE(afterLent.keptAll(kBigBuffer));
    EXPECT_EQ(static_cast<unsigned char*>(lent)[kBigBuffer - 1], 2);
    std::free(lent);
}

TEST_F(TextureTest, DestructionRemovesTheFirstRegistryEntryOnlyAndKeepsTheOrder) {
    const std::size_t base = vi::Texture::mAllTextures.size();
    auto* a = new vi::Texture(nullptr, 1, 1, true, false, false, false, false, 4, false);
    auto* b = new vi::Texture(nullptr, 1, 1, true, false, false, false, false, 4, false);
    auto* c = new vi::Texture(nullptr, 1, 256, true, false, false, false, false, 4, false);
    EXPECT_EQ(c->mTexelSize, glm::vec2(1.0f, 0.00390625f));
    ASSERT_EQ(vi::Texture::mAllTextures.size(), base + 3);
    // A texture filed twice leaves its later entry behind.
    vi::Texture::mAllTextures.push_back(b);

    delete b;
    std::vector<vi::Texture*> tail(vi::Texture::mAllTextures.begin() + long(base), vi::Texture::mAllTextures.end());
    EXPECT_EQ(tail, (std::vector<vi::Texture*>{a, c, b}));

    vi::Texture::mAllTextures.pop_back();
    delete a;
    delete c;
    EXPECT_EQ(vi::Texture::mAllTextures.size(), base);
}

}  // namespace
