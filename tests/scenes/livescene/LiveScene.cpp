// The live window's test effect: a background of one colour chosen at build
// time (LIVE_SCENE_COLOUR, 0xRRGGBB), drawn through the runtime's texture and
// background so that a lost context has something to rebuild, and a white
// square wherever the finger has been.
#include <GLES2/gl2.h>

#include <cstdlib>
#include <cstring>
#include <memory>
#include <vector>

#include "Application/Scene.h"
#include "Render/Background.h"
#include "Render/Texture.h"

namespace {

class LiveScene : public vi::Scene {
public:
    explicit LiveScene(const int* size) : vi::Scene(size) {}
    void initEffect() override {
        if (mBackground) return;
        const unsigned char colour[4] = {LIVE_SCENE_COLOUR >> 16, (LIVE_SCENE_COLOUR >> 8) & 0xFF,
                                         LIVE_SCENE_COLOUR & 0xFF, 0xFF};
        void* texel = std::memcpy(std::malloc(4), colour, 4);  // the texture's, kept for a lost context
        mTexture.reset(new vi::Texture(texel, 1, 1, true, false, false, false, false, 4, false));
        mTexture->setDeletable(true);
        mTexture->allocate();
        mBackground.reset(new vi::Background(*mTexture));
    }
    void touchDown(const glm::vec2& position) override { mTouches.push_back(position); }
    void touchMove(const glm::vec2& position) override { mTouches.push_back(position); }

    int draw() override {
        GLint viewport[4];
        glGetIntegerv(GL_VIEWPORT, viewport);
        mBackground->renderFrame();
        glEnable(GL_SCISSOR_TEST);
        glClearColor(1.0f, 1.0f, 1.0f, 1.0f);
        for (const glm::vec2& touch : mTouches) {
            glScissor(int(touch.x * float(viewport[2])) - 6, int(touch.y * float(viewport[3])) - 6, 12, 12);
            glClear(GL_COLOR_BUFFER_BIT);
        }
        glDisable(GL_SCISSOR_TEST);
        return 0;
    }

private:
    std::unique_ptr<vi::Texture> mTexture;
    std::unique_ptr<vi::Background> mBackground;  // destroyed first
    std::vector<glm::vec2> mTouches;
};

}  // namespace

extern "C" __attribute__((visibility("default"))) vi::Scene* createScene(int* size, vi::ModelsMap*, vi::TexturesMap*) {
    return new LiveScene(size);
}
