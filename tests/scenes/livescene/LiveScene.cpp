// The live window's test effect: the whole frame in one colour chosen at
// build time (LIVE_SCENE_COLOUR, 0xRRGGBB) and a white square wherever the
// finger has been. It keeps no GL object: what the window's tests look at is
// the window's own handling of input, turns, lost contexts and reloads. A
// green square in the lower left corner says the image "wallpaper" is there.
#include <GLES2/gl2.h>

#include <vector>

#include "Application/Scene.h"

namespace {

class LiveScene : public vi::Scene {
public:
    // It asks for a picture, so that the window's warnings about images can be seen.
    LiveScene(const int* size, const vi::TexturesMap* textures) : vi::Scene(size), mTextures(textures) {
        mNames = {"wallpaper"};
    }
    void touchDown(const glm::vec2& position) override { mTouches.push_back(position); }
    void touchMove(const glm::vec2& position) override { mTouches.push_back(position); }

    int draw() override {
        glClearColor(float(LIVE_SCENE_COLOUR >> 16) / 255.0f, float((LIVE_SCENE_COLOUR >> 8) & 0xFF) / 255.0f,
                     float(LIVE_SCENE_COLOUR & 0xFF) / 255.0f, 1.0f);
        glClear(GL_COLOR_BUFFER_BIT);
        glEnable(GL_SCISSOR_TEST);
        glClearColor(1.0f, 1.0f, 1.0f, 1.0f);
        for (const glm::vec2& touch : mTouches) {
            glScissor(int(touch.x * mSize.x) - 6, int(touch.y * mSize.y) - 6, 12, 12);
            glClear(GL_COLOR_BUFFER_BIT);
        }
        if (mTextures->count("wallpaper") != 0) {
            glClearColor(0.0f, 1.0f, 0.0f, 1.0f);
            glScissor(0, 0, 16, 16);
            glClear(GL_COLOR_BUFFER_BIT);
        }
        glDisable(GL_SCISSOR_TEST);
        return 0;
    }

    const vi::TexturesMap* mTextures;
    std::vector<glm::vec2> mTouches;
};

}  // namespace

extern "C" __attribute__((visibility("default"))) vi::Scene* createScene(int* size, vi::ModelsMap*,
                                                                           vi::TexturesMap* textures) {
    return new LiveScene(size, textures);
}
