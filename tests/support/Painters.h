#pragma once

// Renderers the render-target tests draw with: a full-viewport quad painted
// in one colour (read from the painter's own variable at every draw, so a
// test changes it between frames), or painted from a sampled texture.

#include <glm/glm.hpp>

#include "Render/Drawable.h"
#include "Render/GL.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Uniform.h"

namespace vitest {

inline const char* quadVertexShader() {
    return "attribute vec2 aPosition;\n"
           "uniform mat4 uModelViewProjectionMatrix;\n"
           "varying vec2 vUv;\n"
           "void main() {\n"
           "  vUv = aPosition * 0.5 + 0.5;\n"
           "  gl_Position = uModelViewProjectionMatrix * vec4(aPosition, 0.0, 1.0);\n"
           "}\n";
}

// Samples uTexture at vTexCoord: the fragment half of the tests' textured quads.
inline const char* textureFragmentShader() {
    return "precision mediump float;\n"
           "uniform sampler2D uTexture;\n"
           "varying vec2 vTexCoord;\n"
           "void main() { gl_FragColor = texture2D(uTexture, vTexCoord); }\n";
}

// The quad over the whole viewport, as a drawable.
struct Quad : vi::Drawable {
    Quad() {
        static const float corners[] = {-1, -1, 1, -1, -1, 1, 1, 1};
        mode = GL_TRIANGLE_STRIP;
        vertexCount = 4;
        elementCount = 4;
        positions = corners;
    }
};

// A renderer of the quad with the given fragment shader.
class QuadPainter {
public:
    explicit QuadPainter(const char* fragmentShader)
        : mProgram(quadVertexShader(), fragmentShader), mRenderer(mProgram, mQuad) {
        mRenderer.addAttribute("aPosition", mQuad.positions, 2, true);
    }

    vi::Renderer* renderer() { return &mRenderer; }

protected:
    vi::ShaderProgram mProgram;
    Quad mQuad;
    vi::Renderer mRenderer;
};

class ColourPainter : public QuadPainter {
public:
    explicit ColourPainter(const glm::vec4& colour)
        : QuadPainter("precision mediump float;\n"
                      "uniform vec4 uColour;\n"
                      "void main() { gl_FragColor = uColour; }\n"),
          colour(colour) {
        mRenderer.addUniform("uColour", &this->colour[0], vi::Uniform::Float4, 1);
    }

    glm::vec4 colour;
};

class TexturePainter : public QuadPainter {
public:
    explicit TexturePainter(vi::Texture* source)
        : QuadPainter("precision mediump float;\n"
                      "uniform sampler2D uSource;\n"
                      "varying vec2 vUv;\n"
                      "void main() { gl_FragColor = texture2D(uSource, vUv); }\n") {
        mRenderer.addTexture("uSource", source);
    }
};

}  // namespace vitest
