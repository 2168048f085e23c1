// Texture recycling on real textures: static textures give up their
// client-side pixels (freed only when they own them), dynamic ones keep them.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "Application/Application.h"
#include "GlContext.h"
#include "GlRecorder.h"
#include "HeapWatch.h"
#include "Render/Texture.h"
#include "Render/TextureCube.h"

using vitest::GlContext;
using vitest::GlRecorder;
using vitest::GlRecording;
using vitest::HeapWatch;
using vitest::bigBuffer;
using vitest::kBigBuffer;

namespace {

class RecycleTest : public ::testing::Test {
protected:
    GlContext mContext{16, 16};
};

TEST_F(RecycleTest, StaticTexturesDropTheirBuffersAndFreeOnlyTheirOwnDynamicOnesKeepThem) {
    void* owned = bigBuffer(1);
    void* lent = bigBuffer(2);
    vi::Texture deletable(owned, 1024, 1024, true, false, false, false, false, 4, false);
    deletable.setDeletable(true);
    vi::Texture borrowed(lent, 1024, 1024, true, false, false, false, false, 4, false);
    std::uint8_t live[4] = {1, 2, 3, 4};
    vi::Texture dynamic(live, 1, 1, false, false, false, false, false, 4, false);
    deletable.allocate();
    borrowed.allocate();
    dynamic.allocate();

    HeapWatch first;
    vi::Application::handleRecycleTextures();
    EXPECT_EQ(deletable.mBuffer, nullptr);
    EXPECT_EQ(borrowed.mBuffer, nullptr);
    EXPECT_EQ(dynamic.mBuffer, static_cast<void*>(live));
    // Only the owned buffer went back to the heap; the lent one is intact.
    EXPECT_TRUE(first.gaveBack(kBigBuffer));
    EXPECT_TRUE(first.keptAll(2 * kBigBuffer));
    EXPECT_EQ(static_cast<unsigned char*>(lent)[kBigBuffer - 1], 2);

    HeapWatch second;
    vi::Application::handleRecycleTextures();
    EXPECT_EQ(deletable.mBuffer, nullptr);
    EXPECT_TRUE(second.keptAll(kBigBuffer));
    std::free(lent);
}

// Recycling only drops mBuffer, which a cube leaves null: its faces stay for a
// lost context and are freed once by the destructor (ASan sees a double free
// or a read of a freed face; LeakSanitizer a face never freed).
TEST_F(RecycleTest, CubeFacesSurviveRecyclingAndALossAndAreFreedOnce) {
    void* faces[6];
    unsigned int sizes[6] = {1, 1, 1, 1, 1, 1};
    for (void*& face : faces) face = std::calloc(1, 4);
    auto* cube = new vi::TextureCube(faces, sizes, sizes, true, false, false, false, false);
    cube->setDeletable(true);
    cube->allocate();
    vi::Application::handleRecycleTextures();

    mContext.recreate();
    cube->contextChanged();
    GlRecording recording;
    cube->allocate();
    GlRecorder::stop();
    const std::vector<vitest::GlCall> images = GlRecorder::callsNamed("glTexImage2D");
    ASSERT_EQ(images.size(), 6u);
    for (std::size_t face = 0; face < 6; ++face)
        EXPECT_EQ(images[face].args.back(), double(reinterpret_cast<std::uintptr_t>(faces[face])));
    delete cube;
}

TEST_F(RecycleTest, RecycledStaticTextureIsRecreatedWithoutPixels) {
    std::vector<std::uint8_t> pixels(4, 7);
    vi::Texture texture(pixels.data(), 1, 1, true, false, false, false, false, 4, false);
    texture.allocate();
    vi::Application::handleRecycleTextures();

    mContext.recreate();
    texture.contextChanged();
    GlRecording recording;
    texture.allocate();
    GlRecorder::stop();
    const std::vector<vitest::GlCall> images = GlRecorder::callsNamed("glTexImage2D");
    ASSERT_EQ(images.size(), 1u);
    EXPECT_EQ(images[0].args.back(), 0.0);
}

}  // namespace
