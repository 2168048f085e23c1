// On a GPU whose renderer string starts with "Mali" (in any letter case)
// every re-upload specifies the whole image again. The renderer string is
// faked before anything runs: the runtime reads it once per process.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "GlContext.h"
#include "GlRecorder.h"
#include "Render/Texture.h"
#include "Render/TextureCube.h"
#include "Pictures.h"

using vitest::GlRecorder;
using vitest::GlRecording;

namespace {

const bool gRendererIsFaked = (GlRecorder::setRendererOverride("mali-T880"), true);

const std::vector<std::string> kUploads = {"glTexImage2D", "glTexSubImage2D"};

TEST(MaliUpload, RendererIsProbedOnceAndEveryReuploadIsAFullImage) {
    ASSERT_TRUE(gRendererIsFaked);
    vitest::GlContext context(8, 8);
    std::vector<std::uint8_t> pixels = {10, 20, 30, 255};
    vi::Texture texture(pixels.data(), 1, 1, false, false, false, false, false, 4, false);
    vi::Texture second(nullptr, 1, 1, true, false, false, false, false, 4, false);
    vitest::SamplerProbe probe(vitest::SamplerProbe::Flat);

    GlRecording recording;
    texture.allocate();
    second.allocate();
    EXPECT_EQ(GlRecorder::count("glGetString"), 1);
    EXPECT_FALSE(vi::Texture::mIsSubImageUse);
    GlRecorder::clear();
    EXPECT_EQ(probe.draw(texture, 1, 1)[0], 0x0A141EFFu);
    pixels = {40, 50, 60, 255};
    EXPECT_EQ(probe.draw(texture, 1, 1)[0], 0x28323CFFu);
    GlRecorder::stop();
    EXPECT_EQ(GlRecorder::names(kUploads), (std::vector<std::string>{"glTexImage2D", "glTexImage2D"}));
}

TEST(MaliUpload, CubeReuploadsEveryFaceInFull) {
    vitest::GlContext context(8, 8);
    std::uint8_t texel[4] = {1, 2, 3, 4};
    void* faces[6] = {texel, texel, texel, texel, texel, texel};
    unsigned int sizes[6] = {1, 1, 1, 1, 1, 1};
    vi::TextureCube cube(faces, sizes, sizes, false, false, false, false, false);
    cube.allocate();
    GlRecording recording;
    cube.bind(0, 0);
    cube.bind(0, 0);
    GlRecorder::stop();
    EXPECT_EQ(GlRecorder::count("glTexImage2D"), 12);
    EXPECT_EQ(GlRecorder::count("glTexSubImage2D"), 0);
}

}  // namespace
