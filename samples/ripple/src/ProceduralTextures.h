#pragma once

// The pictures the scene makes itself: a night-water gradient with soft
// lights, shown when the host gave no "wallpaper", and the gem's jewel
// colours. Both are static RGBA textures over pixels allocated with malloc
// and handed to the texture (deletable), so the texture frees them and a lost
// context is repaired from them.

namespace vi {

class Texture;

class ProceduralTextures {
public:
    static Texture* createFallbackWallpaper(unsigned int width, unsigned int height);
    static Texture* createGemColours(unsigned int width, unsigned int height);
};

}  // namespace vi
