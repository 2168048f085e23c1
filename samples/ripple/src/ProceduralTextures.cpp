#include "ProceduralTextures.h"

#include <cmath>
#include <cstdlib>

#include <glm/glm.hpp>

#include "Render/Texture.h"

namespace vi {

namespace {

unsigned char toByte(float value) { return (unsigned char)(glm::clamp(value, 0.0f, 1.0f) * 255.0f + 0.5f); }

// Small integer hash for a fixed, grain-like dither (keeps the gradient free of bands).
float hashNoise(unsigned int x, unsigned int y) {
    unsigned int h = x * 374761393u + y * 668265263u;
    h = (h ^ (h >> 13)) * 1274126177u;
    return float((h ^ (h >> 16)) & 0xFFFFu) / 65535.0f;
}

Texture* wrap(unsigned char* pixels, unsigned int width, unsigned int height, bool isRepeat) {
    Texture* texture = new Texture(pixels, width, height, true, isRepeat, false, true, false, 4, false);
    texture->setDeletable(true);
    return texture;
}

struct Light {
    glm::vec2 centre;  // texture space: x right, y down, 0..1
    float radius;      // in units of the width
    glm::vec3 colour;
};

}  // namespace

Texture* ProceduralTextures::createFallbackWallpaper(unsigned int width, unsigned int height) {
    unsigned char* pixels = static_cast<unsigned char*>(std::malloc(std::size_t(width) * height * 4));
    if (!pixels) return nullptr;
    const glm::vec3 top(0.020f, 0.035f, 0.120f), middle(0.030f, 0.150f, 0.300f), bottom(0.010f, 0.280f, 0.330f);
    const Light lights[] = {
        {{0.20f, 0.26f}, 0.15f, {1.00f, 0.60f, 0.22f}}, {{0.76f, 0.17f}, 0.09f, {0.40f, 0.80f, 1.00f}},
        {{0.64f, 0.44f}, 0.21f, {0.30f, 0.62f, 1.00f}}, {{0.30f, 0.66f}, 0.11f, {1.00f, 0.78f, 0.40f}},
        {{0.84f, 0.76f}, 0.17f, {0.30f, 1.00f, 0.78f}}, {{0.12f, 0.88f}, 0.08f, {1.00f, 0.40f, 0.60f}},
        {{0.52f, 0.08f}, 0.06f, {1.00f, 0.86f, 0.55f}}, {{0.46f, 0.84f}, 0.07f, {0.60f, 0.50f, 1.00f}},
        {{0.90f, 0.36f}, 0.06f, {1.00f, 0.50f, 0.70f}}, {{0.08f, 0.50f}, 0.07f, {0.40f, 0.90f, 1.00f}},
        {{0.62f, 0.94f}, 0.05f, {1.00f, 0.70f, 0.30f}}, {{0.40f, 0.36f}, 0.04f, {0.90f, 0.95f, 1.00f}},
    };
    const float aspect = float(height) / float(width);
    for (unsigned int y = 0; y < height; ++y) {
        const float v = (float(y) + 0.5f) / float(height);  // 0 at the top row
        glm::vec3 base = v < 0.55f ? glm::mix(top, middle, v / 0.55f) : glm::mix(middle, bottom, (v - 0.55f) / 0.45f);
        for (unsigned int x = 0; x < width; ++x) {
            const float u = (float(x) + 0.5f) / float(width);
            glm::vec3 colour = base;
            // A slanted band of light falling through the water.
            float band = std::exp(-std::pow((u + 0.45f * v - 0.80f) / 0.15f, 2.0f));
            colour += glm::vec3(0.08f, 0.14f, 0.17f) * band * (1.0f - v);
            // Out-of-focus lights with a brighter rim, as a lens shows them,
            // tinting the water under them.
            for (const Light& light : lights) {
                glm::vec2 d((u - light.centre.x), (v - light.centre.y) * aspect);
                float r = glm::length(d) / light.radius;
                if (r < 1.2f) {
                    float disc = 1.0f - glm::smoothstep(0.88f, 1.0f, r);
                    float rim = std::exp(-(r - 0.94f) * (r - 0.94f) / 0.003f);
                    colour = glm::mix(colour, light.colour * 0.9f, 0.48f * disc);
                    colour = 1.0f - (1.0f - colour) * (1.0f - light.colour * 0.20f * rim);
                }
            }
            float grain = (hashNoise(x, y) - 0.5f) / 255.0f * 1.5f;
            unsigned char* p = pixels + (std::size_t(y) * width + x) * 4;
            p[0] = toByte(colour.r + grain);
            p[1] = toByte(colour.g + grain);
            p[2] = toByte(colour.b + grain);
            p[3] = 255;
        }
    }
    return wrap(pixels, width, height, false);
}

Texture* ProceduralTextures::createGemColours(unsigned int width, unsigned int height) {
    unsigned char* pixels = static_cast<unsigned char*>(std::malloc(std::size_t(width) * height * 4));
    if (!pixels) return nullptr;
    // s runs around the gem, t from the culet (0) to the table (1).
    const glm::vec3 sapphire(0.10f, 0.26f, 0.85f), violet(0.42f, 0.20f, 0.86f), aqua(0.12f, 0.66f, 0.90f);
    for (unsigned int y = 0; y < height; ++y) {
        const float t = (float(y) + 0.5f) / float(height);
        for (unsigned int x = 0; x < width; ++x) {
            const float s = (float(x) + 0.5f) / float(width);
            float angle = 6.2831853f * s;
            float a = 0.5f + 0.5f * std::cos(angle * 2.0f);
            float b = 0.5f + 0.5f * std::cos(angle * 3.0f + 1.3f);
            glm::vec3 colour = glm::mix(glm::mix(sapphire, violet, a), aqua, b * 0.55f);
            // Deeper towards the culet, lighter under the table, like light inside a stone.
            colour *= 0.85f + 0.35f * t;
            colour += glm::vec3(0.22f, 0.28f, 0.34f) * std::pow(t, 6.0f);
            unsigned char* p = pixels + (std::size_t(y) * width + x) * 4;
            p[0] = toByte(colour.r);
            p[1] = toByte(colour.g);
            p[2] = toByte(colour.b);
            p[3] = 255;
        }
    }
    return wrap(pixels, width, height, true);
}

}  // namespace vi
