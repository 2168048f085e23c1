// Recycling drops the client-side pixels of textures already uploaded once;
// only deletable buffers are freed. Freed memory is seen through the
// allocator's count of mapped blocks: each buffer is large enough to be one.
#include <malloc.h>

#include <cstdlib>
#include <memory>

#include <gtest/gtest.h>

#include "Application/Application.h"
#include "Render/Texture.h"

namespace {

const std::size_t kBufferSize = 4 << 20;

std::size_t mappedBytes() { return mallinfo2().hblkhd; }

std::unique_ptr<vi::Texture> textureOver(void* pixels, bool isStatic, bool isDeletable) {
    std::unique_ptr<vi::Texture> texture(
        new vi::Texture(pixels, 1024, 1024, isStatic, false, false, true, false, 4, false));
    texture->setDeletable(isDeletable);
    return texture;
}

}  // namespace

TEST(RecycleTextures, FreesDeletableStaticPixelsDropsBorrowedOnesAndKeepsDynamicOnes) {
    const std::size_t mappedAtStart = mappedBytes();
    void* owned = std::malloc(kBufferSize);
    const std::size_t mappedPerBuffer = mappedBytes() - mappedAtStart;
    void* borrowed = std::malloc(kBufferSize);
    void* dynamic = std::malloc(kBufferSize);
    if (mappedPerBuffer < kBufferSize) {
        std::free(owned);
        std::free(borrowed);
        std::free(dynamic);
        GTEST_SKIP() << "this allocator does not report mapped blocks";
    }
    std::unique_ptr<vi::Texture> ownedTexture = textureOver(owned, true, true);
    std::unique_ptr<vi::Texture> borrowedTexture = textureOver(borrowed, true, false);
    std::unique_ptr<vi::Texture> dynamicTexture = textureOver(dynamic, false, false);

    const std::size_t mappedBefore = mappedBytes();
    vi::Application::handleRecycleTextures();
    EXPECT_EQ(ownedTexture->mBuffer, nullptr);
    EXPECT_EQ(borrowedTexture->mBuffer, nullptr);
    EXPECT_EQ(dynamicTexture->mBuffer, dynamic);
    EXPECT_EQ(mappedBytes(), mappedBefore - mappedPerBuffer) << "only the deletable buffer is freed";

    vi::Application::handleRecycleTextures();
    EXPECT_EQ(mappedBytes(), mappedBefore - mappedPerBuffer) << "a second call frees nothing";
    EXPECT_EQ(dynamicTexture->mBuffer, dynamic);

    ownedTexture.reset();
    borrowedTexture.reset();
    dynamicTexture.reset();
    std::free(borrowed);
    std::free(dynamic);
}
