#include "Render/Background.h"

#include "Render/GL.h"
#include "Render/Renderer.h"

namespace vi {

Background::Background(Texture& texture)
    : corners{glm::vec2(-1.0f, 1.0f), glm::vec2(1.0f, 1.0f), glm::vec2(-1.0f, -1.0f), glm::vec2(1.0f, -1.0f)},
      renderer(nullptr) {
    // Every field is set, so nothing depends on what Drawable() left there:
    // the derived matrices start at zero until the renderer's first draw.
    drawable.mode = GL_TRIANGLE_STRIP;
    drawable.texture = &texture;
    drawable.userWords[0] = 0;
    drawable.userWords[1] = 0;
    drawable.userWords[2] = 0;
    drawable.indices = nullptr;
    drawable.elementCount = 4;
    drawable.vertexCount = 4;
    drawable.userTag = 3;
    drawable.positions = &corners[0].x;
    drawable.normals = nullptr;
    drawable.texCoords = nullptr;
    drawable.modelMatrix = Drawable::mIdentityMatrix;
    drawable.normalMatrix = glm::mat3(0.0f);
    drawable.modelViewProjectionMatrix = glm::mat4(0.0f);
    drawable.modelViewMatrix = glm::mat4(0.0f);
    drawable.opacity = 1.0f;
    drawable.positionsStatic = true;
    drawable.normalsStatic = false;
    drawable.texCoordsStatic = false;
    drawable.indicesChanged = false;

    renderer = new BackgroundRenderer(drawable);
}

Background::~Background() {
    if (renderer) delete renderer;
}

// Draws with whatever depth, blending and culling state the caller left.
void Background::renderFrame() { renderer->render(); }

Renderer* Background::getRenderer() { return renderer; }

}  // namespace vi
