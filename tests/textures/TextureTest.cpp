// 2D and cube textures on a real context: what each upload sends to GL and
// when, the parameters, ETC1 data and cube faces, what recycling and a lost
// context leave, and destruction. free is wrapped, so buffers freed show in the log.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "Application/Application.h"
#include "GlContext.h"
#include "GlRecorder.h"
#include "Painters.h"
#include "Render/Texture.h"
#include "Render/TextureCube.h"

using vitest::GlCall;
using vitest::GlRecorder;
using vitest::GlRecording;
using Args = std::vector<double>;
using Names = std::vector<std::string>;
using Words = std::vector<std::uint32_t>;

extern "C" void __real_free(void* p);
extern "C" void __wrap_free(void* p) {
    if (p) GlRecorder::record("free", {double(reinterpret_cast<std::uintptr_t>(p))});
    __real_free(p);
}

namespace {

const Names kUploads = {"glTexImage2D", "glTexSubImage2D", "glCompressedTexImage2D"};

double address(const void* p) { return double(reinterpret_cast<std::uintptr_t>(p)); }

Args lastArguments(const std::string& name, std::size_t count) {
    Args values;
    for (const GlCall& call : GlRecorder::callsNamed(name)) values.push_back(call.args[call.args.size() - count]);
    return values;
}

// One ETC1 block in individual mode: the left 2x4 half in colour `left`, the
// right half in `right` (4-bit components), table 0 and every pixel index 0,
// so that each texel is its half's colour plus 2.
void putEtc1Block(std::uint8_t* block, const int left[3], const int right[3]) {
    for (int c = 0; c < 3; ++c) block[c] = std::uint8_t(left[c] << 4 | right[c]);
    std::memset(block + 3, 0, 5);
}
std::uint32_t etc1Texel(const int colour[3]) {
    std::uint32_t texel = 0xFF;
    for (int c = 0; c < 3; ++c) texel |= std::uint32_t(std::min(255, colour[c] * 17 + 2)) << (24 - 8 * c);
    return texel;
}

class TextureTest : public testing::Test {
protected:
    void TearDown() override { GlRecorder::stop(); }

    vitest::GlContext mContext{64, 64};
};

TEST_F(TextureTest, StaticTextureUploadsOnceAtAllocationWithItsFlagsAsParameters) {
    struct Row {
        bool isRepeat, isMirrored, isLinear;
        GLint wrap, filter;
    };
    // Mirroring is consulted only for repeating textures.
    for (const Row& row : {Row{true, false, true, GL_REPEAT, GL_LINEAR}, Row{true, true, false, GL_MIRRORED_REPEAT,
                           GL_NEAREST}, Row{false, true, true, GL_CLAMP_TO_EDGE, GL_LINEAR}}) {
        SCOPED_TRACE(testing::Message() << "wrap " << row.wrap);
        std::uint8_t pixels[4] = {1, 2, 3, 4};
        vi::Texture texture(pixels, 1, 1, true, row.isRepeat, row.isMirrored, row.isLinear, false, 4, false);
        GlRecording recording;
        texture.allocate();
        texture.allocate();
        EXPECT_EQ(GlRecorder::names({"glGenTextures", "glBindTexture", "glPixelStorei", "glTexImage2D",
                                     "glTexParameteri"}),
                  (Names{"glGenTextures", "glBindTexture", "glPixelStorei", "glTexImage2D", "glTexParameteri",
                         "glTexParameteri", "glTexParameteri", "glTexParameteri"}));
        EXPECT_EQ(GlRecorder::callsNamed("glPixelStorei")[0].args, (Args{GL_PACK_ALIGNMENT, 1}));
        EXPECT_EQ(lastArguments("glTexParameteri", 2),
                  (Args{GL_TEXTURE_MAG_FILTER, GL_TEXTURE_MIN_FILTER, GL_TEXTURE_WRAP_T, GL_TEXTURE_WRAP_S}));
        EXPECT_EQ(lastArguments("glTexParameteri", 1), (Args{double(row.filter), double(row.filter),
                                                            double(row.wrap), double(row.wrap)}));
    }
    // Rows of 1 x 2 RGB texels padded to 4 bytes: the upload runs with the
    // context's unpack alignment of 4, which it leaves alone.
    std::uint8_t rgb[8] = {10, 20, 30, 0, 200, 150, 100, 0};
    vi::Texture texture(rgb, 1, 2, true, false, false, false, false, 3, false);
    vitest::TexturePainter painter(&texture);
    EXPECT_EQ(painter.draw(1, 2), (Words{0x0A141EFF, 0xC89664FF}));
    GLint unpack = 0;
    glGetIntegerv(GL_UNPACK_ALIGNMENT, &unpack);
    EXPECT_EQ(unpack, 4);
}

TEST_F(TextureTest, DynamicTextureUploadsInFullAtFirstBindThenBySubImage) {
    std::vector<std::uint8_t> pixels = {255, 0, 0, 255, 0, 255, 0, 255};
    vi::Texture texture(pixels.data(), 2, 1, false, false, false, false, false, 4, false);
    GlRecording recording;
    texture.allocate();
    EXPECT_EQ(GlRecorder::names(kUploads), Names{});
    GlRecorder::start();
    texture.bind(3, 2);
    EXPECT_EQ(GlRecorder::names(), (Names{"glActiveTexture", "glBindTexture", "glPixelStorei", "glTexImage2D",
                                          "glUniform1i"}));
    EXPECT_EQ(GlRecorder::calls()[1].args, (Args{GL_TEXTURE_2D, double(texture.mId)}));
    EXPECT_EQ(GlRecorder::calls()[4].args, (Args{3, 2}));

    vitest::TexturePainter painter(&texture);
    GlRecorder::start();
    EXPECT_EQ(painter.draw(2, 1), (Words{0xFF0000FF, 0x00FF00FF}));
    pixels = {0, 0, 255, 255, 255, 255, 255, 255};
    EXPECT_EQ(painter.draw(2, 1), (Words{0x0000FFFF, 0xFFFFFFFF}));
    EXPECT_EQ(GlRecorder::names(kUploads), (Names{"glTexSubImage2D", "glTexSubImage2D"}));
    EXPECT_EQ(GlRecorder::callsNamed("glTexSubImage2D")[0].args,
              (Args{GL_TEXTURE_2D, 0, 0, 0, 2, 1, GL_RGBA, GL_UNSIGNED_BYTE, address(pixels.data())}));
}

TEST_F(TextureTest, Etc1UploadsInFullAtEveryBindWithHalfAByteATexelAndDecodes) {
    const int colours[4][2][3] = {{{15, 0, 0}, {0, 15, 0}}, {{0, 0, 15}, {8, 8, 8}},
                                  {{13, 15, 0}, {0, 15, 13}}, {{3, 6, 9}, {12, 10, 1}}};
    std::uint8_t data[32];
    for (int block = 0; block < 4; ++block) putEtc1Block(data + 8 * block, colours[block][0], colours[block][1]);
    vi::Texture texture(data, 8, 8, false, false, false, false, true, 4, false);
    GlRecording recording;
    vitest::TexturePainter painter(&texture);
    const Words first = painter.draw(8, 8);
    painter.draw(8, 8);
    const std::vector<GlCall> uploads = GlRecorder::callsNamed("glCompressedTexImage2D");
    ASSERT_EQ(uploads.size(), 2u);
    for (const GlCall& upload : uploads)
        EXPECT_EQ(upload.args, (Args{GL_TEXTURE_2D, 0, GL_ETC1_RGB8_OES, 8, 8, 0, 32, address(data)}));
    for (int y = 0; y < 8; ++y)
        for (int x = 0; x < 8; ++x)
            EXPECT_EQ(first[std::size_t(y * 8 + x)], etc1Texel(colours[(y / 4) * 2 + x / 4][x % 4 < 2 ? 0 : 1]))
                << x << ", " << y;
}

TEST_F(TextureTest, CubeUploadsItsSixFacesInOrderAndSamplesThemAndARepointedFaceShows) {
    // 2 x 2 faces, a left and a right colour on each, different on every face.
    std::vector<std::uint8_t> bytes[6];
    void* faces[6];
    unsigned int sizes[6] = {2, 2, 2, 2, 2, 2};
    for (int f = 0; f < 6; ++f) {
        for (int texel = 0; texel < 4; ++texel)
            bytes[f].insert(bytes[f].end(), {std::uint8_t(0x20 * (f + 1)), std::uint8_t(0x40 * (texel % 2) + 0x10),
                                             std::uint8_t(0xF0 - 0x20 * f), 0xFF});
        faces[f] = bytes[f].data();
    }
    vi::TextureCube cube(faces, sizes, sizes, true, false, false, false, false);
    GlRecording recording;
    cube.allocate();
    const std::vector<GlCall> images = GlRecorder::callsNamed("glTexImage2D");
    ASSERT_EQ(images.size(), 6u);
    for (int f = 0; f < 6; ++f)
        EXPECT_EQ(images[std::size_t(f)].args, (Args{double(GL_TEXTURE_CUBE_MAP_POSITIVE_X + f), 0, GL_RGBA, 2, 2, 0,
                                                     GL_RGBA, GL_UNSIGNED_BYTE, address(faces[f])}));
    // Aimed at the left half of each face.
    vitest::CubePainter painter(&cube);
    const float directions[6][3] = {{1, 0, 0.5f}, {-1, 0, -0.5f}, {-0.5f, 1, 0}, {-0.5f, -1, 0}, {-0.5f, 0, 1},
                                    {0.5f, 0, -1}};
    for (int f = 0; f < 6; ++f)
        EXPECT_EQ(painter.look(directions[f][0], directions[f][1], directions[f][2]), vitest::rgba(bytes[f].data()));

    // A plug-in animating a face points it at new pixels: the next upload reads them.
    std::vector<std::uint8_t> red = {255, 0, 0, 255, 255, 0, 0, 255, 255, 0, 0, 255, 255, 0, 0, 255};
    cube.mFaces[0] = red.data();
    cube.update();
    EXPECT_EQ(painter.look(1, 0, 0.5f), 0xFF0000FFu);

    // ETC1 faces: 4 x 4 texels in one block each, every face in full.
    std::vector<std::uint8_t> blocks(6 * 8, 0x44);
    void* etc1[6];
    unsigned int etc1Sizes[6] = {4, 4, 4, 4, 4, 4};
    for (int f = 0; f < 6; ++f) etc1[f] = &blocks[std::size_t(8 * f)];
    vi::TextureCube compressed(etc1, etc1Sizes, etc1Sizes, true, false, false, false, true);
    GlRecorder::start();
    compressed.allocate();
    const std::vector<GlCall> uploads = GlRecorder::callsNamed("glCompressedTexImage2D");
    ASSERT_EQ(uploads.size(), 6u);
    for (int f = 0; f < 6; ++f)
        EXPECT_EQ(uploads[std::size_t(f)].args, (Args{double(GL_TEXTURE_CUBE_MAP_POSITIVE_X + f), 0,
                                                      GL_ETC1_RGB8_OES, 4, 4, 0, 8, address(etc1[f])}));
    EXPECT_EQ(glGetError(), GLenum(GL_NO_ERROR));
}

TEST_F(TextureTest, RecyclingDropsStaticPixelsAndALostContextRecreatesThemEmpty) {
    void* owned = std::malloc(4);
    std::uint8_t lent[4] = {1, 2, 3, 4}, live[4] = {5, 6, 7, 8};
    vi::Texture deletable(owned, 1, 1, true, false, false, false, false, 4, false);
    deletable.setDeletable(true);
    vi::Texture borrowed(lent, 1, 1, true, false, false, false, false, 4, false);
    vi::Texture dynamic(live, 1, 1, false, false, false, false, false, 4, false);
    // Cube faces are read at every upload: recycling keeps them, for a lost context.
    void* faces[6];
    unsigned int sizes[6] = {1, 1, 1, 1, 1, 1};
    for (void*& face : faces) face = std::calloc(1, 4);
    auto* cube = new vi::TextureCube(faces, sizes, sizes, true, false, false, false, false);
    cube->setDeletable(true);
    for (vi::Texture* texture : std::vector<vi::Texture*>{&deletable, &borrowed, &dynamic, cube}) texture->allocate();

    GlRecording recording;
    vi::Application::handleRecycleTextures();
    vi::Application::handleRecycleTextures();
    EXPECT_EQ(lastArguments("free", 1), Args{address(owned)});  // once, and only the texture's own
    EXPECT_EQ(deletable.mBuffer, nullptr);
    EXPECT_EQ(borrowed.mBuffer, nullptr);
    EXPECT_EQ(dynamic.mBuffer, static_cast<void*>(live));

    mContext.recreate();
    for (vi::Texture* texture : std::vector<vi::Texture*>{&deletable, &dynamic, cube}) texture->contextChanged();
    GlRecorder::start();
    deletable.allocate();
    cube->allocate();
    Args expected = {0};
    for (void* face : faces) expected.push_back(address(face));
    EXPECT_EQ(lastArguments("glTexImage2D", 1), expected);
    GlRecorder::start();
    delete cube;
    EXPECT_EQ(lastArguments("free", 1), Args(expected.begin() + 1, expected.end()));
}

TEST_F(TextureTest, DestructionDeletesTheNameUnlessSharedUnbindsAndLeavesTheRegistryInOrder) {
    std::uint8_t pixels[4] = {};
    const std::size_t base = vi::Texture::mAllTextures.size();
    auto* own = new vi::Texture(pixels, 1, 1, true, false, false, false, false, 4, false);
    auto* shared = new vi::Texture(pixels, 1, 1, true, false, false, false, false, 4, false);
    auto* other = new vi::Texture(pixels, 1, 1, true, false, false, false, false, 4, false);
    for (vi::Texture* texture : {other, own, shared}) texture->allocate();
    shared->mIsShared = true;
    GLuint sharedId = shared->mId;
    const double ownId = own->mId;
    vi::Texture::mAllTextures.push_back(own);  // filed twice: the later entry stays

    GlRecording recording;
    delete own;
    EXPECT_EQ(GlRecorder::names(), (Names{"glBindTexture", "glDeleteTextures"}));
    EXPECT_EQ(GlRecorder::calls()[1].args, (Args{1, ownId}));
    GLint bound = -1;  // not another live texture (name 1 is the first one's)
    glGetIntegerv(GL_TEXTURE_BINDING_2D, &bound);
    EXPECT_EQ(bound, 0);
    EXPECT_EQ(std::vector<vi::Texture*>(vi::Texture::mAllTextures.begin() + long(base), vi::Texture::mAllTextures.end()),
              (std::vector<vi::Texture*>{shared, other, own}));
    vi::Texture::mAllTextures.pop_back();

    GlRecorder::start();
    delete shared;
    EXPECT_EQ(GlRecorder::names(), Names{});
    EXPECT_EQ(glIsTexture(sharedId), GL_TRUE);
    glDeleteTextures(1, &sharedId);
    delete other;
    EXPECT_EQ(vi::Texture::mAllTextures.size(), base);
}

}  // namespace
