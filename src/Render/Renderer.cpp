#include "Render/Renderer.h"

#include <algorithm>
#include <iterator>

#include "Render/NamedValues.h"
#include "Render/RenderTargetFrame.h"
#include "Render/Texture.h"
#include "Render/UnboundNames.h"

namespace vi {

std::vector<Renderer*> Renderer::mAllRenderers;
EGLContext Renderer::mEglContext = EGL_NO_CONTEXT;

namespace {

// The uniforms every renderer binds by itself when its program has them, and
// the companions of each sampler it binds: name + kSize, name + kTexelSize.
const char* const kModelMatrix = "uModelMatrix";
const char* const kViewMatrix = "uViewMatrix";
const char* const kNormalMatrix = "uNormalMatrix";
const char* const kProjectionMatrix = "uProjectionMatrix";
const char* const kModelViewProjectionMatrix = "uModelViewProjectionMatrix";
const char* const kOpacity = "uOpacity";
const char* const kBoundByItself[] = {kModelMatrix,      kViewMatrix, kNormalMatrix,
                                      kProjectionMatrix, kModelViewProjectionMatrix, kOpacity};
const char* const kSize = "Size";
const char* const kTexelSize = "TexelSize";

bool isBoundByItself(const std::string& name) {
    return std::find(std::begin(kBoundByItself), std::end(kBoundByItself), name) != std::end(kBoundByItself);
}

// ---- Platform difference: who hears of a name the program does not have ----
// The phone drops the binding silently. A desktop host may listen and tell the
// author, who has most likely misspelt the name.
#if defined(__ANDROID__)
enum class Unbound { Attribute, Uniform, Sampler };
void tellUnbound(const ShaderProgram&, Unbound, const std::string&) {}
#else
using Unbound = UnboundNames::Kind;
void tellUnbound(const ShaderProgram& program, Unbound kind, const std::string& name) {
    UnboundNames::tell(program, kind, name);
}
#endif
// ---------------------------------------------------------------------------

GLsizeiptr attributeBytes(const Attribute& attribute) {
    return GLsizeiptr(*attribute.vertexCount) * attribute.components * sizeof(float);
}

GLsizeiptr indexBytes(const Drawable& drawable) {
    return GLsizeiptr(drawable.elementCount) * sizeof(unsigned short);
}

void deleteAttribute(Attribute* attribute) {
    if (attribute->buffer != kNoBuffer) glDeleteBuffers(1, &attribute->buffer);
    delete attribute;
}

// What construction and a lost context's re-creation both do for a drawable
// with indices.
void createIndexBuffer(GLuint& indexBuffer, const Drawable& drawable) {
    glGenBuffers(1, &indexBuffer);
    glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, indexBuffer);
    glBufferData(GL_ELEMENT_ARRAY_BUFFER, indexBytes(drawable), drawable.indices, GL_STATIC_DRAW);
}

// The attribute's location in `program`; -1 when the program does not use it.
bool locate(Attribute& attribute, GLuint program) {
    attribute.location = glGetAttribLocation(program, attribute.name.c_str());
    return attribute.location != -1;
}

// The vertex count is read through the pointer now, so a count the drawable
// changed since is honoured. The array is enabled here, once.
void createAttributeBuffer(Attribute& attribute) {
    glGenBuffers(1, &attribute.buffer);
    glBindBuffer(GL_ARRAY_BUFFER, attribute.buffer);
    glBufferData(GL_ARRAY_BUFFER, attributeBytes(attribute), attribute.data,
                 attribute.isStatic ? GL_STATIC_DRAW : GL_STREAM_DRAW);
    glEnableVertexAttribArray(attribute.location);
    glVertexAttribPointer(attribute.location, attribute.components, GL_FLOAT, GL_FALSE, 0, 0);
}

// A uniform record when the program has the name; -1 and nothing kept when not.
int appendUniform(Renderer& renderer, const std::string& name, const void* data, Uniform::UniformType type,
                  unsigned int count) {
    const GLint location = glGetUniformLocation(renderer.program->program, name.c_str());
    if (location == -1) return -1;
    renderer.uniforms.push_back(new Uniform{name, location, data, type, count});
    return int(renderer.uniforms.size()) - 1;
}

}  // namespace

Renderer::Renderer(ShaderProgram& programToUse, Drawable& drawableToDraw)
    : program(&programToUse), indexBuffer(kNoBuffer), drawable(&drawableToDraw) {
    if (drawable->indices) createIndexBuffer(indexBuffer, *drawable);

    // Bound when the program uses them; the derived ones are refreshed by render().
    appendUniform(*this, kModelMatrix, &drawable->modelMatrix[0][0], Uniform::Matrix4, 1);
    appendUniform(*this, kViewMatrix, &Drawable::mViewMatrix[0][0], Uniform::Matrix4, 1);
    appendUniform(*this, kNormalMatrix, &drawable->normalMatrix[0][0], Uniform::Matrix3, 1);
    appendUniform(*this, kProjectionMatrix, &Drawable::mProjectionMatrix[0][0], Uniform::Matrix4, 1);
    appendUniform(*this, kModelViewProjectionMatrix, &drawable->modelViewProjectionMatrix[0][0], Uniform::Matrix4, 1);
    appendUniform(*this, kOpacity, &drawable->opacity, Uniform::Float, 1);

    mAllRenderers.push_back(this);
}

Renderer::~Renderer() {
    if (indexBuffer != kNoBuffer) glDeleteBuffers(1, &indexBuffer);
    for (Attribute* attribute : attributes) deleteAttribute(attribute);
    for (Uniform* uniform : uniforms) delete uniform;
    auto entry = std::find(mAllRenderers.begin(), mAllRenderers.end(), this);
    if (entry != mAllRenderers.end()) mAllRenderers.erase(entry);
}

void Renderer::setDrawable(Drawable& newDrawable) { drawable = &newDrawable; }

// No GL call: the names died with their context (or none is current).
void Renderer::forgetGlObjects() {
    program->program = 0;
    indexBuffer = kNoBuffer;
    for (Attribute* attribute : attributes) attribute->buffer = kNoBuffer;
}

// As construction and the add operations made them, from the records. Renderers
// often share a program: init() on one already rebuilt for an earlier renderer
// finds its name valid and returns at once. An attribute the relinked program
// no longer has keeps location -1 and no buffer; the renderer draws without it.
void Renderer::recreateGlObjects() {
    program->init();
    if (drawable->indices) createIndexBuffer(indexBuffer, *drawable);
    for (Attribute* attribute : attributes)
        if (locate(*attribute, program->program)) createAttributeBuffer(*attribute);
    for (Uniform* uniform : uniforms)
        uniform->location = glGetUniformLocation(program->program, uniform->name.c_str());
}

int Renderer::addAttribute(const std::string& name, const void* data, unsigned int components, bool isStatic) {
    Attribute* attribute = new Attribute{name, kNoBuffer, -1, data, &drawable->vertexCount, components, isStatic};
    if (!locate(*attribute, program->program)) {
        deleteAttribute(attribute);
        tellUnbound(*program, Unbound::Attribute, name);
        return -1;
    }
    createAttributeBuffer(*attribute);
    attributes.push_back(attribute);
    return int(attributes.size()) - 1;
}

int Renderer::addUniform(const std::string& name, const void* data, Uniform::UniformType type, unsigned int count) {
    const int index = appendUniform(*this, name, data, type, count);
    if (index == -1 && !isBoundByItself(name)) tellUnbound(*program, Unbound::Uniform, name);
    return index;
}

int Renderer::addTexture(const std::string& name, Texture* texture) {
    if (!texture) return -1;
    const GLint location = glGetUniformLocation(program->program, name.c_str());
    if (location == -1) {
        tellUnbound(*program, Unbound::Sampler, name);
        return -1;
    }

    texture->allocate();
    textures.emplace_back(texture, location);
    if (texture->mKind == kRenderTargetTexture) renderTargets.push_back(texture);
    const int unit = int(textures.size()) - 1;

    appendUniform(*this, name + kSize, &texture->mSize[0], Uniform::Float2, 1);
    appendUniform(*this, name + kTexelSize, &texture->mTexelSize[0], Uniform::Float2, 1);
    return unit;
}

void Renderer::render() {
    // Dynamic targets sampled here are drawn again first; static ones keep
    // what they were rendered with.
    for (Texture* target : renderTargets)
        if (!target->mIsStatic) renderTargetFrame(*target);

    drawable->deriveMatrices();

    glUseProgram(program->program);

    // The arrays were enabled once by addAttribute.
    for (Attribute* attribute : attributes) {
        glBindBuffer(GL_ARRAY_BUFFER, attribute->buffer);
        if (!attribute->isStatic)
            glBufferData(GL_ARRAY_BUFFER, attributeBytes(*attribute), attribute->data, GL_STREAM_DRAW);
        glVertexAttribPointer(attribute->location, attribute->components, GL_FLOAT, GL_FALSE, 0, 0);
    }

    for (Uniform* uniform : uniforms) uniform->upload();

    for (unsigned int unit = 0; unit < textures.size(); ++unit)
        textures[unit].first->bind(textures[unit].second, unit);

    if (indexBuffer == kNoBuffer) {
        glDrawArrays(drawable->mode, 0, drawable->elementCount);
        return;
    }
    glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, indexBuffer);
    if (drawable->indicesChanged) {
        glBufferData(GL_ELEMENT_ARRAY_BUFFER, indexBytes(*drawable), drawable->indices, GL_STATIC_DRAW);
        drawable->indicesChanged = false;
    }
    glDrawElements(drawable->mode, drawable->elementCount, GL_UNSIGNED_SHORT, 0);
}

void Renderer::setCullFace(bool enable, bool back) {
    if (!enable) {
        glDisable(GL_CULL_FACE);
        return;
    }
    glEnable(GL_CULL_FACE);
    glCullFace(back ? GL_BACK : GL_FRONT);
}

void Renderer::setDepthTest(bool enable, bool less, bool equal) {
    if (!enable) {
        glDisable(GL_DEPTH_TEST);
        return;
    }
    glEnable(GL_DEPTH_TEST);
    // An equal test wins over the less/greater choice.
    glDepthFunc(equal ? GL_EQUAL : (less ? GL_LESS : GL_GREATER));
}

void Renderer::setBlending(bool enable) {
    if (!enable) {
        glDisable(GL_BLEND);
        return;
    }
    glEnable(GL_BLEND);
    glBlendFunc(GL_SRC_ALPHA, GL_ONE_MINUS_SRC_ALPHA);
}

void Renderer::setDepthMask(bool enable) { glDepthMask(enable ? GL_TRUE : GL_FALSE); }

void Renderer::setColorMask(bool red, bool green, bool blue, bool alpha) {
    glColorMask(red ? GL_TRUE : GL_FALSE, green ? GL_TRUE : GL_FALSE, blue ? GL_TRUE : GL_FALSE,
                alpha ? GL_TRUE : GL_FALSE);
}

void Renderer::clearDepth() { glClear(GL_DEPTH_BUFFER_BIT); }

// Kept as an empty operation: point sprites need no switch in ES 2.0.
void Renderer::setSprite(bool) {}

}  // namespace vi
