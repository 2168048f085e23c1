// On a GPU whose renderer string starts with "Mali" (in any letter case)
// every re-upload specifies the whole image again. The renderer string is
// faked before anything runs: the runtime reads it once per process.
#include <gtest/gtest.h>

#include "GlRecorder.h"
#include "Painters.h"

using vitest::GlRecorder;

[[maybe_unused]] const bool gRendererIsFaked = GlRecorder::setRendererOverride("mali-T880");

TEST(MaliUpload, EveryReuploadIsAFullImage) {
    vitest::GlContext context(8, 8);
    std::uint8_t pixels[4] = {10, 20, 30, 255};
    vi::Texture texture(pixels, 1, 1, false, false, false, false, false, 4, false);
    texture.allocate();
    texture.update();
    vitest::GlRecording recording;
    texture.update();
    EXPECT_EQ(GlRecorder::names(), (std::vector<std::string>{"glBindTexture", "glPixelStorei", "glTexImage2D"}));
    EXPECT_EQ(GlRecorder::calls()[2].args, (std::vector<double>{GL_TEXTURE_2D, 0, GL_RGBA, 1, 1, 0, GL_RGBA,
                                                                 GL_UNSIGNED_BYTE, double(std::uintptr_t(pixels))}));
}
