#pragma once

// Pixels as the tests read them back (0xRRGGBBAA words), and quads over the
// whole viewport drawn by the runtime's own renderer: painted in one colour
// (read from the painter's variable at every draw, so a test changes it
// between frames), or from a texture (one texel per pixel when the viewport
// has the texture's size).

#include <cstdint>
#include <cstdlib>
#include <vector>

#include "GlContext.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"

namespace vitest {

// RGBA bytes as 0xRRGGBBAA words.
inline std::vector<std::uint32_t> words(const std::vector<std::uint8_t>& bytes) {
    std::vector<std::uint32_t> result;
    for (std::size_t i = 0; i < bytes.size(); i += 4)
        result.push_back(std::uint32_t(bytes[i]) << 24 | std::uint32_t(bytes[i + 1]) << 16 |
                         std::uint32_t(bytes[i + 2]) << 8 | bytes[i + 3]);
    return result;
}

// The current framebuffer's rectangle as words, bottom row first, and one pixel.
inline std::vector<std::uint32_t> readWords(int x, int y, int width, int height) {
    return words(readPixels(x, y, width, height));
}
inline std::uint32_t readPixel(int x, int y) { return readWords(x, y, 1, 1)[0]; }

// Every channel of two 0xRRGGBBAA words within `tolerance` of the other's.
inline bool near(std::uint32_t a, std::uint32_t b, int tolerance) {
    for (int shift = 0; shift < 32; shift += 8)
        if (std::abs(int(a >> shift & 0xFF) - int(b >> shift & 0xFF)) > tolerance) return false;
    return true;
}

inline const char* quadVertexShader() {
    return "attribute vec2 aPosition;\n"
           "uniform mat4 uModelViewProjectionMatrix;\n"
           "varying vec2 vUv;\n"
           "void main() {\n"
           "  vUv = aPosition * 0.5 + 0.5;\n"
           "  gl_Position = uModelViewProjectionMatrix * vec4(aPosition, 0.0, 1.0);\n"
           "}\n";
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
struct QuadPainter {
    explicit QuadPainter(const char* fragmentShader)
        : program(quadVertexShader(), fragmentShader), renderer(program, quad) {
        renderer.addAttribute("aPosition", quad.positions, 2, true);
    }

    // Draws into the window's width x height corner and returns those pixels, bottom row first.
    std::vector<std::uint32_t> draw(int width, int height) {
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glViewport(0, 0, width, height);
        renderer.render();
        return readWords(0, 0, width, height);
    }

    vi::ShaderProgram program;
    Quad quad;
    vi::Renderer renderer;
};

struct ColourPainter : QuadPainter {
    explicit ColourPainter(const glm::vec4& colour)
        : QuadPainter("precision mediump float;\n"
                      "uniform vec4 uColour;\n"
                      "void main() { gl_FragColor = uColour; }\n"),
          colour(colour) {
        renderer.addUniform("uColour", &this->colour[0], vi::Uniform::Float4, 1);
    }

    glm::vec4 colour;
};

// Binds `source` through the renderer, as an effect would (which allocates it).
struct TexturePainter : QuadPainter {
    explicit TexturePainter(vi::Texture* source)
        : QuadPainter("precision mediump float;\n"
                      "uniform sampler2D uSource;\n"
                      "varying vec2 vUv;\n"
                      "void main() { gl_FragColor = texture2D(uSource, vUv); }\n") {
        renderer.addTexture("uSource", source);
    }
};

}  // namespace vitest
