#pragma once

// A scene as an effect makes one, for driving the handlers from C++: in
// initEffect a full-window background over a 2x2 static texture, then two
// indexed quads drawn by two renderers that share one program, the first
// sampling a static checker texture, the second a dynamic one (re-uploaded at
// every bind). Every texel is a distinct colour and filtering is nearest, so a
// frame is exact and a texture lost on the way shows. The destructor deletes
// all it made.

#include <cstdint>
#include <vector>

#include "Application/Scene.h"
#include "Render/Background.h"
#include "Render/Drawable.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"

namespace recoverytest {

// RGBA bytes of the textures' texels, as 0xRRGGBBAA for comparing with read-back pixels.
extern const std::vector<std::uint32_t> kBackgroundTexels;
extern const std::vector<std::uint32_t> kCheckerTexels;
extern const std::vector<std::uint32_t> kDynamicTexels;

class RecoveryScene : public vi::Scene {
public:
    explicit RecoveryScene(const int* size);
    ~RecoveryScene() override;

    void initEffect() override;
    int draw() override;

    // The factory the tests put into vi::gCreateScene.
    static vi::Scene* create(int* size, vi::ModelsMap* models, vi::TexturesMap* textures);
    // vi::gpScene as this class (the tests make no other scene).
    static RecoveryScene& current();

    static constexpr int kDrawResult = 7;

    vi::Texture* backgroundTexture = nullptr;  // malloc'ed pixels, deletable
    vi::Texture* checkerTexture = nullptr;     // pixels owned by the scene
    vi::Texture* dynamicTexture = nullptr;     // pixels owned by the scene, re-uploaded at every bind
    vi::Background* background = nullptr;
    vi::ShaderProgram* quadProgram = nullptr;
    vi::Drawable quads[2];
    vi::Renderer* quadRenderers[2] = {nullptr, nullptr};
    int draws = 0;

private:
    std::vector<std::uint8_t> mCheckerPixels;
    std::vector<std::uint8_t> mDynamicPixels;
    float mOffsets[2][2] = {{-0.5f, -0.5f}, {0.0f, 0.0f}};
};

}  // namespace recoverytest
