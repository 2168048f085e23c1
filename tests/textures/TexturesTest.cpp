// Textures, cube maps, render targets and tone curves on a real context:
// what each upload sends to GL and when, what recycling and a lost context
// leave, what a target builds and deletes, that every pass leaves the binding,
// viewport and matrices as it found them, and the curve tables. free is
// wrapped, so the buffers freed show in the log.
#include <gtest/gtest.h>

#include <glm/gtc/matrix_transform.hpp>

#include <algorithm>
#include <cstring>
#include <new>

#include "Application/Application.h"
#include "GlRecorder.h"
#include "Painters.h"
#include "Render/Curves.h"
#include "Render/RenderableTexture.h"
#include "Render/TextureCube.h"

using vi::RenderableTexture;
using vitest::GlCall;
using vitest::address;
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

constexpr std::uint32_t kRed = 0xFF0000FF, kGreen = 0x00FF00FF;


// Argument `index` of every recorded call of `name` (negative: from the end).
Args argumentOf(const std::string& name, int index) {
    Args values;
    for (const GlCall& call : GlRecorder::callsNamed(name))
        values.push_back(call.args[std::size_t(index < 0 ? int(call.args.size()) + index : index)]);
    return values;
}

// The binding as GL and the statics see it: framebuffer and viewport, then
// the static framebuffer, position and size.
std::vector<int> bindingNow() {
    std::vector<int> binding(5);
    glGetIntegerv(GL_FRAMEBUFFER_BINDING, &binding[0]);
    glGetIntegerv(GL_VIEWPORT, &binding[1]);
    const glm::ivec2 p = RenderableTexture::mCurrentFrameBufferPosition, s = RenderableTexture::mCurrentFrameBufferSize;
    binding.insert(binding.end(), {int(RenderableTexture::mCurrentFrameBuffer), p.x, p.y, s.x, s.y});
    return binding;
}

std::vector<int> bindingOf(GLuint frameBuffer, int width, int height) {
    return {int(frameBuffer), 0, 0, width, height, int(frameBuffer), 0, 0, width, height};
}

Words readTarget(RenderableTexture& target) {
    std::vector<std::uint8_t> bytes(std::size_t(target.mWidth) * target.mHeight * 4);
    target.readBuffer(bytes.data());
    return vitest::words(bytes);
}

class TexturesTest : public testing::Test {
protected:
    // What an effect does before its first pass: it stores the window's
    // viewport. The bound framebuffer is the window's from the start.
    void SetUp() override {
        RenderableTexture::mCurrentFrameBufferSize = glm::ivec2(64, 64);
        glViewport(0, 0, 64, 64);
    }

    void TearDown() override {
        vi::Drawable::mViewMatrix = vi::Drawable::mProjectionMatrix = glm::mat4(1.0f);
    }

    vitest::GlContext mContext{64, 256};
};

TEST_F(TexturesTest, StaticTextureUploadsOnceAtAllocationADynamicOneInFullAtFirstBindThenBySubImage) {
    // Rows of RGB texels padded to 4 bytes: uploads keep the context's unpack alignment.
    std::uint8_t rgb[8] = {10, 20, 30, 0, 200, 150, 100, 0};
    std::vector<std::uint8_t> live = {255, 0, 0, 255, 0, 255, 0, 255};
    vi::Texture still(rgb, 1, 2, true, true, true, false, false, 3, false);
    vi::Texture dynamic(live.data(), 2, 1, false, false, true, true, false, 4, false);
    GlRecording recording;
    still.allocate();
    still.allocate();
    dynamic.allocate();
    EXPECT_EQ(GlRecorder::names({"glGenTextures", "glTexImage2D", "glTexSubImage2D"}),
              (Names{"glGenTextures", "glTexImage2D", "glGenTextures"}));
    EXPECT_EQ(GlRecorder::callsNamed("glPixelStorei")[0].args, (Args{GL_PACK_ALIGNMENT, 1}));
    EXPECT_EQ(argumentOf("glTexParameteri", 1), (Args{GL_TEXTURE_MAG_FILTER, GL_TEXTURE_MIN_FILTER,
                                                      GL_TEXTURE_WRAP_T, GL_TEXTURE_WRAP_S, GL_TEXTURE_MAG_FILTER,
                                                      GL_TEXTURE_MIN_FILTER, GL_TEXTURE_WRAP_T, GL_TEXTURE_WRAP_S}));
    // Mirroring counts only for repeating textures.
    EXPECT_EQ(argumentOf("glTexParameteri", 2), (Args{GL_NEAREST, GL_NEAREST, GL_MIRRORED_REPEAT, GL_MIRRORED_REPEAT,
                                                      GL_LINEAR, GL_LINEAR, GL_CLAMP_TO_EDGE, GL_CLAMP_TO_EDGE}));
    EXPECT_EQ(vitest::TexturePainter(&still).draw(1, 2), (Words{0x0A141EFF, 0xC89664FF}));

    vitest::TexturePainter painter(&dynamic);
    GlRecorder::start();
    EXPECT_EQ(painter.draw(2, 1), (Words{kRed, kGreen}));
    live = {0, 0, 255, 255, 255, 255, 255, 255};
    EXPECT_EQ(painter.draw(2, 1), (Words{0x0000FFFF, 0xFFFFFFFF}));
    ASSERT_EQ(GlRecorder::names({"glTexImage2D", "glTexSubImage2D"}), (Names{"glTexImage2D", "glTexSubImage2D"}));
    EXPECT_EQ(GlRecorder::callsNamed("glTexSubImage2D")[0].args,
              (Args{GL_TEXTURE_2D, 0, 0, 0, 2, 1, GL_RGBA, GL_UNSIGNED_BYTE, address(live.data())}));
    EXPECT_EQ(vitest::TexturePainter(&still).draw(1, 2), (Words{0x0A141EFF, 0xC89664FF}));  // its name untouched
}

TEST_F(TexturesTest, CubeUploadsItsSixFacesInOrderAndReadsARepointedFaceAgainAndEtc1GoesUpInFullAtEveryBind) {
    std::uint8_t bytes[6][32] = {};
    void* faces[6];
    unsigned int sizes[6] = {2, 2, 2, 2, 2, 2}, etc1Sizes[6] = {4, 4, 4, 4, 4, 4};
    for (int f = 0; f < 6; ++f) faces[f] = bytes[f];
    vi::TextureCube cube(faces, sizes, sizes, true, false, false, false, false);
    vi::TextureCube compressed(faces, etc1Sizes, etc1Sizes, true, false, false, false, true);
    vi::Texture etc1(bytes[0], 8, 8, false, false, false, false, true, 4, false);  // dynamic, half a byte a texel
    GlRecording recording;
    cube.allocate();
    compressed.allocate();  // ETC1 faces of one block each go up in full, with border 0
    vitest::TexturePainter painter(&etc1);
    painter.draw(8, 8);
    painter.draw(8, 8);
    // A plug-in animating a face points it at new pixels: the next upload reads them.
    std::uint8_t red[16] = {255, 0, 0, 255};
    cube.mFaces[0] = red;
    cube.update();
    ASSERT_EQ(GlRecorder::names({"glTexImage2D", "glCompressedTexImage2D", "glTexSubImage2D"}).size(), 20u);
    for (std::size_t draw : {6u, 7u})
        EXPECT_EQ(GlRecorder::callsNamed("glCompressedTexImage2D")[draw].args,
                  (Args{GL_TEXTURE_2D, 0, GL_ETC1_RGB8_OES, 8, 8, 0, 32, address(bytes[0])}));
    for (int f = 0; f < 6; ++f) {
        const double face = GL_TEXTURE_CUBE_MAP_POSITIVE_X + f;
        EXPECT_EQ(GlRecorder::callsNamed("glTexImage2D")[std::size_t(f)].args,
                  (Args{face, 0, GL_RGBA, 2, 2, 0, GL_RGBA, GL_UNSIGNED_BYTE, address(faces[f])}));
        EXPECT_EQ(GlRecorder::callsNamed("glCompressedTexImage2D")[std::size_t(f)].args,
                  (Args{face, 0, GL_ETC1_RGB8_OES, 4, 4, 0, 8, address(faces[f])}));
        EXPECT_EQ(GlRecorder::callsNamed("glTexSubImage2D")[std::size_t(f)].args,
                  (Args{face, 0, 0, 0, 2, 2, GL_RGBA, GL_UNSIGNED_BYTE, address(f == 0 ? red : faces[f])}));
    }
}

TEST_F(TexturesTest, RecyclingDropsStaticPixelsALostContextRecreatesThemEmptyAndDestructionUnbinds) {
    const std::size_t registered = vi::Texture::mAllTextures.size();
    void* owned = std::malloc(4);
    std::uint8_t lent[4] = {1, 2, 3, 4}, live[4] = {5, 6, 7, 8};
    auto* borrowed = new vi::Texture(lent, 1, 1, true, false, false, false, false, 4, false);
    auto* deletable = new vi::Texture(owned, 1, 1, true, false, false, false, false, 4, false);
    deletable->setDeletable(true);
    vi::Texture dynamic(live, 1, 1, false, false, false, false, false, 4, false);
    // Cube faces are read at every upload: recycling keeps them, for a lost context.
    void* faces[6];
    unsigned int sizes[6] = {1, 1, 1, 1, 1, 1};
    for (void*& face : faces) face = std::calloc(1, 4);
    auto* cube = new vi::TextureCube(faces, sizes, sizes, true, false, false, false, false);
    cube->setDeletable(true);
    const std::vector<vi::Texture*> lost = {borrowed, deletable, cube};
    for (vi::Texture* texture : lost) texture->allocate();
    GlRecording recording;
    vi::Application::handleRecycleTextures();
    vi::Application::handleRecycleTextures();
    EXPECT_EQ(argumentOf("free", 0), Args{address(owned)});  // once, and only the texture's own
    EXPECT_EQ(std::vector<void*>({deletable->mBuffer, borrowed->mBuffer, dynamic.mBuffer}),
              (std::vector<void*>{nullptr, nullptr, live}));

    mContext.recreate();
    GlRecorder::start();
    for (vi::Texture* texture : lost) {
        texture->contextChanged();
        texture->allocate();
    }
    Args expected = {0, 0};
    for (void* face : faces) expected.push_back(address(face));
    EXPECT_EQ(argumentOf("glTexImage2D", -1), expected);

    // Destruction unbinds (binding name 0: the borrowed one is name 1) and
    // deletes the name, unless it is shared.
    const Args names = {double(deletable->mId), double(cube->mId)};
    borrowed->mIsShared = true;
    GlRecorder::start();
    for (vi::Texture* texture : lost) delete texture;
    EXPECT_EQ(argumentOf("glBindTexture", 1), (Args{0, 0}));
    EXPECT_EQ(argumentOf("glDeleteTextures", 1), names);
    EXPECT_EQ(argumentOf("free", 0), Args(expected.begin() + 2, expected.end()));
    EXPECT_TRUE(glIsTexture(1));
    EXPECT_EQ(vi::Texture::mAllTextures.size(), registered + 1);
}

TEST_F(TexturesTest, TargetAttachesItsTextureOverTheRenderbufferAndDeletesWhatItMadeOnce) {
    auto* target = new RenderableTexture(0, 0, 16, 8, false, true, false, true, true);
    EXPECT_EQ(target->mFormat, GLenum(GL_RGBA));
    GlRecording recording;
    target->allocate();
    target->allocate();
    // Made once: the renderbuffers' creation is pinned by their arguments below.
    EXPECT_EQ(GlRecorder::names({"glTexImage2D", "glBindFramebuffer", "glFramebufferRenderbuffer",
                                 "glFramebufferTexture2D", "glCheckFramebufferStatus"}),
              (Names{"glTexImage2D", "glBindFramebuffer", "glFramebufferRenderbuffer", "glFramebufferTexture2D",
                     "glFramebufferRenderbuffer", "glCheckFramebufferStatus", "glBindFramebuffer"}));
    EXPECT_EQ(argumentOf("glRenderbufferStorage", 1), (Args{GL_RGBA4, GL_DEPTH_COMPONENT16}));
    // Its storage sets the pack alignment, as every texture's does, on purpose.
    EXPECT_EQ(argumentOf("glPixelStorei", 0), Args{GL_PACK_ALIGNMENT});
    EXPECT_EQ(argumentOf("glGenRenderbuffers", 0), (Args{1, 1}));  // one name each
    EXPECT_EQ(argumentOf("glBindRenderbuffer", 1),
              (Args{double(target->mColorBuffer), 0, double(target->mDepthBuffer), 0}));
    EXPECT_EQ(bindingNow(), bindingOf(0, 64, 64));

    const Args names = {double(target->mFrameBuffer), double(target->mColorBuffer), double(target->mDepthBuffer)};
    GlRecorder::start();
    delete target;
    EXPECT_EQ(argumentOf("glBindRenderbuffer", 1), Args{0});
    Args deleted = argumentOf("glDeleteFramebuffers", 1);
    for (double name : argumentOf("glDeleteRenderbuffers", 1)) deleted.push_back(name);
    EXPECT_EQ(deleted, names);

    // After a lost context its old names may be another object's: a target
    // destroyed before it was made again deletes nothing. A pass of a target
    // without renderers draws nothing.
    target = new RenderableTexture(0, 0, 4, 4, false, false, false, false, true);
    target->allocate();
    mContext.recreate();
    target->contextChanged();
    GlRecorder::start();
    target->renderFrame();
    delete target;
    EXPECT_EQ(GlRecorder::names(), Names{});
}

// The inner target, dynamic, draws a red quad through its own projection,
// halved; the outer one, static, mixes it (sampled on the second unit) with
// blue on the first.
TEST_F(TexturesTest, NestedDynamicTargetIsDrawnFirstInEveryOuterPassAStaticOneOnlyOnRequest) {
    vitest::ColourPainter innerPainter(glm::vec4(1, 0, 0, 1));
    std::vector<vi::Renderer*> innerRenderers = {&innerPainter.renderer};
    RenderableTexture inner(innerRenderers, 0, 0, 8, 8, false, false, false, false, false);
    inner.mTargetProjectionMatrix = glm::scale(glm::mat4(1.0f), glm::vec3(0.5f, 0.5f, 1.0f));
    std::uint8_t blue[4] = {0, 0, 255, 255};
    vi::Texture plain(blue, 1, 1, true, false, false, false, false, 4, false);
    vitest::QuadPainter mixed("precision mediump float;\nuniform sampler2D uPlain;\nuniform sampler2D uTarget;\n"
                              "varying vec2 vUv;\nvoid main() {\n"
                              "  gl_FragColor = mix(texture2D(uPlain, vUv), texture2D(uTarget, vUv), 0.5);\n}\n");
    mixed.renderer.addTexture("uPlain", &plain);
    mixed.renderer.addTexture("uTarget", &inner);
    std::vector<vi::Renderer*> outerRenderers = {&mixed.renderer};
    RenderableTexture outer(outerRenderers, 0, 0, 32, 32, true, false, false, false, true);
    outer.allocate();
    const glm::mat4 view = glm::translate(glm::mat4(1.0f), glm::vec3(0.0f, 0.3f, 0.0f)), projection = view * view;
    vi::Drawable::mViewMatrix = view;
    vi::Drawable::mProjectionMatrix = projection;
    GlRecording recording;
    outer.renderFrame();
    ASSERT_EQ(GlRecorder::names({"glBindFramebuffer", "glClear", "glDrawArrays"}),
              (Names{"glBindFramebuffer", "glClear", "glBindFramebuffer", "glClear", "glDrawArrays",
                     "glBindFramebuffer", "glDrawArrays", "glBindFramebuffer"}));
    EXPECT_EQ(argumentOf("glBindFramebuffer", 1),
              (Args{double(outer.mFrameBuffer), double(inner.mFrameBuffer), double(outer.mFrameBuffer), 0}));
    EXPECT_EQ(argumentOf("glViewport", 2), (Args{32, 8, 32, 64}));
    EXPECT_EQ(argumentOf("glClear", 0)[0], double(GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT));
    EXPECT_EQ(bindingNow(), bindingOf(0, 64, 64));
    EXPECT_TRUE(vi::Drawable::mViewMatrix == view && vi::Drawable::mProjectionMatrix == projection);
    // The outer quad filled the outer viewport with the inner picture, which
    // a static target keeps until asked to draw again.
    innerPainter.colour = glm::vec4(0, 1, 0, 1);
    vi::Drawable::mViewMatrix = vi::Drawable::mProjectionMatrix = glm::mat4(1.0f);
    vitest::TexturePainter show(&outer);
    const Words pixels = show.draw(32, 32);
    EXPECT_TRUE(vitest::near(pixels[0], 0x000080FF, 1) && vitest::near(pixels[31 * 32 + 31], 0x000080FF, 1));
    EXPECT_TRUE(vitest::near(pixels[16 * 32 + 16], 0x800080FF, 1)) << std::hex << pixels[16 * 32 + 16];
    outer.renderFrame();
    EXPECT_TRUE(vitest::near(show.draw(32, 32)[16 * 32 + 16], 0x008080FF, 1));
}

TEST_F(TexturesTest, WrittenPixelsReadBackFromTheTargetsPositionAndAClearInsideAnAnchorFillsOnlyItsTarget) {
    std::vector<std::uint8_t> pattern(8 * 8 * 4), back(pattern.size());
    for (std::size_t i = 0; i < pattern.size(); ++i) pattern[i] = std::uint8_t(i * 7 + 3);
    RenderableTexture origin(0, 0, 8, 8, false, false, false, false, false);
    RenderableTexture offset(2, 3, 8, 8, false, false, false, false, false);
    origin.allocate();
    GlRecording recording;
    origin.writeBuffer(pattern.data());
    origin.readBuffer(back.data());
    EXPECT_EQ(back, pattern);
    EXPECT_EQ(argumentOf("glPixelStorei", 0), (Args{GL_PACK_ALIGNMENT, GL_UNPACK_ALIGNMENT}));
    EXPECT_EQ(argumentOf("glPixelStorei", 1), (Args{1, 1}));
    offset.writeBuffer(pattern.data());
    GlRecorder::start();
    offset.readBuffer(back.data());
    // Row r, column c of what was read is texel (2 + c, 3 + r) of the target.
    const Words read = vitest::words(back), written = vitest::words(pattern);
    for (int r = 0; r < 5; ++r)
        for (int c = 0; c < 6; ++c) ASSERT_EQ(read[r * 8 + c], written[(3 + r) * 8 + 2 + c]) << r << ", " << c;
    EXPECT_EQ(bindingNow(), bindingOf(0, 64, 64));

    // A clear inside an anchor fills only its target; anchors restore what they found.
    RenderableTexture b(0, 0, 4, 4, false, false, false, false, false);
    origin.enableAnchor();
    glClearColor(1, 0, 0, 1);
    glClear(GL_COLOR_BUFFER_BIT);
    b.clear(glm::vec4(0, 1, 0, 1));
    EXPECT_EQ(bindingNow(), bindingOf(origin.mFrameBuffer, 8, 8));
    b.enableAnchor();
    EXPECT_EQ(RenderableTexture::getViewportSize(), glm::ivec2(4, 4));
    b.disableAnchor();
    origin.disableAnchor();
    EXPECT_EQ(bindingNow(), bindingOf(0, 64, 64));
    EXPECT_EQ(readTarget(origin), Words(64, kRed));
    EXPECT_EQ(readTarget(b), Words(16, kGreen));
}

int texel(const vi::Curves& curves, int x, int channel) { return curves.mTable[4 * x + channel]; }

TEST(CurvesTable, SegmentsGiveTheWorkedValuesMeetTheirEndsShareJointsAndLeaveOtherBytesAlone) {
    const glm::vec2 diagonal[] = {{0, 0}, {255, 255}}, bend[] = {{0, 0}, {128, 200}, {255, 40}}, single[] = {{9, 9}};
    const glm::vec2 steps[] = {{10, 30}, {11, 90}, {20, 90}, {21, 250}};  // two-texel segments, one at the end
    // The table is zeroed first, whatever the storage held.
    alignas(vi::Curves) unsigned char storage[sizeof(vi::Curves)];
    std::memset(storage, 0xAB, sizeof(storage));
    vi::Curves& curves = *new (storage) vi::Curves(diagonal, 2, bend, 3, steps, 4);
    // Midway through the bend's first segment, t = 64/128 gives 200 * 0.5 exactly.
    const int rows[][3] = {{0, 0, 0}, {0, 1, 0}, {0, 64, 52}, {0, 128, 128}, {0, 192, 203}, {0, 254, 254},
                           {0, 255, 255}, {1, 64, 100}, {1, 128, 200}, {1, 255, 40}, {2, 9, 0}, {2, 10, 30},
                           {2, 11, 90}, {2, 20, 90}, {2, 21, 250}, {2, 22, 0}, {3, 128, 0}};
    for (const auto& row : rows) EXPECT_EQ(texel(curves, row[1], row[0]), row[2]) << row[0] << " " << row[1];
    for (int x = 1; x < 256; ++x) EXPECT_GE(texel(curves, x, 0), texel(curves, x - 1, 0)) << x;

    // A later computation with one point for red and none for green keeps
    // both channels; the texture made earlier is the caller's to delete.
    vi::Texture* first = curves.getTexture();
    curves.calculateCatmullRomPoints(single, 1, nullptr, 0, diagonal, 0);
    EXPECT_NE(curves.getTexture(), first);
    EXPECT_EQ(std::vector<int>({texel(curves, 64, 0), texel(curves, 64, 1), texel(curves, 21, 2)}),
              (std::vector<int>{52, 100, 250}));
    delete first;
    curves.~Curves();
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
        std::vector<glm::vec2> points[3];
        for (std::vector<glm::vec2>& channel : points) {
            std::vector<int> xs(2 + next(5));
            for (int& x : xs) x = int(next(2048));
            std::sort(xs.begin(), xs.end());
            // x in [0, 256) in eighths, y in [-25, 287) in eighths: clamps included.
            for (int x : xs) channel.push_back(glm::vec2(float(x) / 8.0f, float(int(next(2496)) - 200) / 8.0f));
            segments += int(xs.size()) - 1;
        }
        vi::Curves curves(points[0].data(), int(points[0].size()), points[1].data(), int(points[1].size()),
                          points[2].data(), int(points[2].size()));
        const int start = 4 * int(next(250));
        const int end = start + 8 + 4 * int(next(std::uint32_t(255 - start / 4 - 1)));
        glm::vec2 p[4];  // drawn one by one: the order of a call's arguments is not fixed
        for (glm::vec2& point : p) point = glm::vec2(0.0f, float(int(next(2496)) - 200) / 8.0f);
        curves.calculateCatmullRomPoint(start, end, p[0], p[1], p[2], p[3], vi::Curves::CHANNELS(next(3)));
        ++segments;
        for (unsigned char byte : curves.mTable) digest = (digest ^ byte) * 1099511628211ull;
    }
    EXPECT_EQ(segments, 6029);  // the same curves were drawn
    EXPECT_EQ(digest, 0x769bbaf6fb9729f6u) << std::hex << digest;
}

}  // namespace
