// A minimal effect for the live window's tests: a background of one colour,
// chosen at build time (LIVE_SCENE_COLOUR, 0xRRGGBB), drawn through the
// runtime's own texture and background so that a lost context has something
// to rebuild, with a white square painted wherever a finger has been.
#include <GLES2/gl2.h>

#include <cstdlib>
#include <vector>

#include "Application/Scene.h"
#include "Render/Background.h"
#include "Render/Texture.h"

namespace {

const int kSquareHalf = 6;  // pixels

class LiveScene : public vi::Scene {
public:
    explicit LiveScene(const int* size) : vi::Scene(size) {}
    ~LiveScene() override {
        delete mBackground;
        delete mTexture;
    }

    void initEffect() override { makeBackground(); }
    void initEffectAlternate() override { makeBackground(); }
    void clearEffect() override { mTouches.clear(); }
    void touchDown(const glm::vec2& position) override { mTouches.push_back(position); }
    void touchMove(const glm::vec2& position) override { mTouches.push_back(position); }

    int draw() override {
        GLint viewport[4];
        glGetIntegerv(GL_VIEWPORT, viewport);
        glDisable(GL_SCISSOR_TEST);
        mBackground->renderFrame();
        glEnable(GL_SCISSOR_TEST);
        glClearColor(1.0f, 1.0f, 1.0f, 1.0f);
        for (const glm::vec2& touch : mTouches) {
            const int x = int(touch.x * float(viewport[2]));
            const int y = int(touch.y * float(viewport[3]));
            glScissor(x - kSquareHalf, y - kSquareHalf, 2 * kSquareHalf, 2 * kSquareHalf);
            glClear(GL_COLOR_BUFFER_BIT);
        }
        glDisable(GL_SCISSOR_TEST);
        return 0;
    }

private:
    void makeBackground() {
        if (!mTexture) {
            // One texel, owned by the texture (malloc, deletable), kept for a lost context.
            unsigned char* texel = static_cast<unsigned char*>(std::malloc(4));
            texel[0] = (LIVE_SCENE_COLOUR >> 16) & 0xFF;
            texel[1] = (LIVE_SCENE_COLOUR >> 8) & 0xFF;
            texel[2] = LIVE_SCENE_COLOUR & 0xFF;
            texel[3] = 0xFF;
            mTexture = new vi::Texture(texel, 1, 1, true, false, false, false, false, 4, false);
            mTexture->setDeletable(true);
            mTexture->allocate();
            mBackground = new vi::Background(*mTexture);
        }
    }

    vi::Texture* mTexture = nullptr;
    vi::Background* mBackground = nullptr;
    std::vector<glm::vec2> mTouches;
};

}  // namespace

extern "C" __attribute__((visibility("default"))) vi::Scene* createScene(int* size, vi::ModelsMap*, vi::TexturesMap*) {
    return new LiveScene(size);
}
