#pragma once

// Pictures on the real context, as the tests draw and read them back: pixels
// as 0xRRGGBBAA words or as comparable channels, a texture over pixels the
// test keeps, uniform values as the program holds them, and a program of the
// tests' own that draws a texture over the whole viewport (2D: one texel per
// pixel when the viewport has the texture's size; cube: the colour seen in one
// direction), bound with the texture's own bind(), as a renderer would.

#include <GLES2/gl2.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <ostream>
#include <vector>

#include "GlContext.h"
#include "Render/Texture.h"

namespace vitest {

// RGBA bytes as one 0xRRGGBBAA value, the form readPixel() returns.
inline std::uint32_t rgba(const std::uint8_t* p) {
    return (std::uint32_t(p[0]) << 24) | (std::uint32_t(p[1]) << 16) | (std::uint32_t(p[2]) << 8) | p[3];
}

// The current framebuffer's rectangle as 0xRRGGBBAA words, bottom row first.
inline std::vector<std::uint32_t> readWords(int x, int y, int width, int height) {
    const std::vector<std::uint8_t> bytes = readPixels(x, y, width, height);
    std::vector<std::uint32_t> words;
    for (std::size_t i = 0; i < bytes.size(); i += 4) words.push_back(rgba(&bytes[i]));
    return words;
}

// The first n floats of a uniform as the program holds it.
inline std::vector<float> uniformFloats(GLuint program, const char* name, int n) {
    std::vector<float> values(16, -99.0f);
    glGetUniformfv(program, glGetUniformLocation(program, name), values.data());
    values.resize(std::size_t(n));
    return values;
}


struct Rgba {
    int r, g, b, a;
    bool operator==(const Rgba& o) const { return r == o.r && g == o.g && b == o.b && a == o.a; }
    // Every channel within `tolerance` of the other's.
    bool near(const Rgba& o, int tolerance) const {
        return std::abs(r - o.r) <= tolerance && std::abs(g - o.g) <= tolerance && std::abs(b - o.b) <= tolerance &&
               std::abs(a - o.a) <= tolerance;
    }
};

inline std::ostream& operator<<(std::ostream& out, const Rgba& c) {
    return out << "(" << c.r << ", " << c.g << ", " << c.b << ", " << c.a << ")";
}

inline Rgba pixelAt(int x, int y) {
    std::vector<std::uint8_t> p = readPixels(x, y, 1, 1);
    return Rgba{p[0], p[1], p[2], p[3]};
}

// A static, clamped, nearest-filtered RGBA texture over rows of texels given
// first row first. The pixels live as long as the texture.
class PixelTexture {
public:
    PixelTexture(unsigned int width, unsigned int height, const std::vector<Rgba>& texels)
        : mPixels(toBytes(texels)), mTexture(mPixels.data(), width, height, true, false, false, false, false, 4, false) {}

    vi::Texture& texture() { return mTexture; }

private:
    static std::vector<std::uint8_t> toBytes(const std::vector<Rgba>& texels) {
        std::vector<std::uint8_t> bytes(texels.size() * 4);
        for (std::size_t i = 0; i < texels.size(); ++i) {
            bytes[4 * i] = std::uint8_t(texels[i].r);
            bytes[4 * i + 1] = std::uint8_t(texels[i].g);
            bytes[4 * i + 2] = std::uint8_t(texels[i].b);
            bytes[4 * i + 3] = std::uint8_t(texels[i].a);
        }
        return bytes;
    }

    std::vector<std::uint8_t> mPixels;
    vi::Texture mTexture;
};


class SamplerProbe {
public:
    enum Kind { Flat, Cube };

    explicit SamplerProbe(Kind kind) {
        const char* vertex =
            "attribute vec2 aCorner;\n"
            "varying vec2 vUv;\n"
            "void main() { vUv = aCorner * 0.5 + 0.5; gl_Position = vec4(aCorner, 0.0, 1.0); }\n";
        const char* flat =
            "precision mediump float;\n"
            "uniform sampler2D uTexture;\n"
            "varying vec2 vUv;\n"
            "void main() { gl_FragColor = texture2D(uTexture, vUv); }\n";
        const char* cube =
            "precision mediump float;\n"
            "uniform samplerCube uTexture;\n"
            "uniform vec3 uDirection;\n"
            "varying vec2 vUv;\n"
            "void main() { gl_FragColor = textureCube(uTexture, uDirection); }\n";
        mProgram = glCreateProgram();
        attach(GL_VERTEX_SHADER, vertex);
        attach(GL_FRAGMENT_SHADER, kind == Flat ? flat : cube);
        glBindAttribLocation(mProgram, 0, "aCorner");
        glLinkProgram(mProgram);
        GLint linked = 0;
        glGetProgramiv(mProgram, GL_LINK_STATUS, &linked);
        if (!linked) {
            std::fprintf(stderr, "probe program does not link\n");
            std::abort();
        }
        mSampler = glGetUniformLocation(mProgram, "uTexture");
        mDirection = glGetUniformLocation(mProgram, "uDirection");
    }

    ~SamplerProbe() { glDeleteProgram(mProgram); }

    SamplerProbe(const SamplerProbe&) = delete;
    SamplerProbe& operator=(const SamplerProbe&) = delete;

    // Draws `texture` (bound through its bind() on `unit`) over a width x
    // height viewport at the origin of the window, and returns those pixels
    // as 0xRRGGBBAA, bottom row first.
    std::vector<std::uint32_t> draw(vi::Texture& texture, int width, int height, unsigned int unit = 0) {
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glViewport(0, 0, width, height);
        glUseProgram(mProgram);
        texture.bind(unsigned(mSampler), unit);
        drawQuad();
        return readWords(0, 0, width, height);
    }

    // The colour a cube texture shows in direction (x, y, z).
    std::uint32_t look(vi::Texture& cube, float x, float y, float z) {
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glViewport(0, 0, 1, 1);
        glUseProgram(mProgram);
        glUniform3f(mDirection, x, y, z);
        cube.bind(unsigned(mSampler), 0);
        drawQuad();
        return readPixel(0, 0);
    }

private:
    void attach(GLenum type, const char* source) {
        GLuint shader = glCreateShader(type);
        glShaderSource(shader, 1, &source, nullptr);
        glCompileShader(shader);
        glAttachShader(mProgram, shader);
        glDeleteShader(shader);
    }

    void drawQuad() {
        static const float corners[] = {-1, -1, 1, -1, -1, 1, 1, 1};
        glBindBuffer(GL_ARRAY_BUFFER, 0);
        glEnableVertexAttribArray(0);
        glVertexAttribPointer(0, 2, GL_FLOAT, GL_FALSE, 0, corners);
        glDrawArrays(GL_TRIANGLE_STRIP, 0, 4);
    }

    GLuint mProgram = 0;
    GLint mSampler = -1;
    GLint mDirection = -1;
};

}  // namespace vitest
