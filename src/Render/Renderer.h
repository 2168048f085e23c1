#pragma once

// Draws one drawable with one program. Owns its attribute and uniform records
// and its GL buffers; points at (does not own) the program, the drawable and
// the textures. Every live renderer is in mAllRenderers, in construction order,
// so that a lost context can be repaired: the records keep everything needed
// to rebuild buffers and locations. GL thread only.

#include <utility>
#include <vector>

#include "Render/Attribute.h"
#include "Render/Drawable.h"
#include "Render/GL.h"
#include "Render/ShaderProgram.h"
#include "Render/Uniform.h"
#include "Tools/Export.h"

namespace vi {

class Texture;

class VI_EXPORT Renderer {
public:
    Renderer(ShaderProgram& program, Drawable& drawable);
    virtual ~Renderer();
    virtual void setDrawable(Drawable& drawable);

    Renderer(const Renderer&) = delete;
    Renderer& operator=(const Renderer&) = delete;

    // Each returns the new binding's index, or -1 when the program does not
    // use the name (the binding is then dropped).
    int addAttribute(const std::string& name, const void* data, unsigned int components, bool isStatic);
    int addUniform(const std::string& name, const void* data, Uniform::UniformType type, unsigned int count);
    int addTexture(const std::string& name, Texture* texture);

    // Brings dynamic render targets up to date, derives the matrices, uploads
    // and draws. Not virtual.
    void render();

    // A lost context, in two steps run over every renderer in registry order:
    // forget every GL name, then (once a context is current) rebuild the
    // program, buffers and locations exactly as construction and the add
    // operations made them.
    void forgetGlObjects();
    void recreateGlObjects();

    // Fixed-function state of the current context; they touch no renderer.
    static void setCullFace(bool enable, bool back);
    static void setDepthTest(bool enable, bool less, bool equal);
    static void setBlending(bool enable);
    static void setDepthMask(bool enable);
    static void setColorMask(bool red, bool green, bool blue, bool alpha);
    static void clearDepth();
    static void setSprite(bool enable);

    ShaderProgram* program;
    GLuint indexBuffer;  // kNoBuffer (Render/NamedValues.h): none
    std::vector<Attribute*> attributes;
    std::vector<Uniform*> uniforms;
    std::vector<std::pair<Texture*, GLint>> textures;  // index = texture unit
    std::vector<Texture*> renderTargets;
    Drawable* drawable;

    static std::vector<Renderer*> mAllRenderers;
    static EGLContext mEglContext;
};

}  // namespace vi
