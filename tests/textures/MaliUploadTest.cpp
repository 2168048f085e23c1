// On a GPU whose renderer string starts with "Mali" (in any letter case)
// every re-upload specifies the whole image again. The renderer string is
// faked before anything runs: the runtime reads it once per process.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "GlContext.h"
#include "GlRecorder.h"
#include "Painters.h"
#include "Render/Texture.h"
#include "Render/TextureCube.h"

using vitest::GlRecorder;

namespace {

const bool gRendererIsFaked = (GlRecorder::setRendererOverride("mali-T880"), true);

TEST(MaliUpload, RendererIsProbedOnceAndEveryReuploadOfA2dOrCubeTextureIsAFullImage) {
    ASSERT_TRUE(gRendererIsFaked);
    vitest::GlContext context(8, 8);
    std::vector<std::uint8_t> pixels = {10, 20, 30, 255};
    vi::Texture texture(pixels.data(), 1, 1, false, false, false, false, false, 4, false);
    vi::Texture second(nullptr, 1, 1, true, false, false, false, false, 4, false);
    vitest::GlRecording recording;
    texture.allocate();
    second.allocate();
    EXPECT_EQ(GlRecorder::count("glGetString"), 1);
    EXPECT_FALSE(vi::Texture::mIsSubImageUse);

    vitest::TexturePainter painter(&texture);
    GlRecorder::start();
    EXPECT_EQ(painter.draw(1, 1)[0], 0x0A141EFFu);
    pixels = {40, 50, 60, 255};
    EXPECT_EQ(painter.draw(1, 1)[0], 0x28323CFFu);
    EXPECT_EQ(GlRecorder::names({"glTexImage2D", "glTexSubImage2D"}),
              (std::vector<std::string>{"glTexImage2D", "glTexImage2D"}));

    void* faces[6] = {pixels.data(), pixels.data(), pixels.data(), pixels.data(), pixels.data(), pixels.data()};
    unsigned int sizes[6] = {1, 1, 1, 1, 1, 1};
    vi::TextureCube cube(faces, sizes, sizes, false, false, false, false, false);
    cube.allocate();
    GlRecorder::start();
    cube.bind(0, 0);
    cube.bind(0, 0);
    EXPECT_EQ(GlRecorder::count("glTexImage2D"), 12);
    EXPECT_EQ(GlRecorder::count("glTexSubImage2D"), 0);
}

}  // namespace
