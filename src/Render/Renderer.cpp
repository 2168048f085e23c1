#include "Render/Renderer.h"

#include <algorithm>

#include "Render/RenderableTexture.h"
#include "Render/Texture.h"

namespace vi {

std::vector<Renderer*> Renderer::mAllRenderers;
EGLContext Renderer::mEglContext = EGL_NO_CONTEXT;

namespace {

constexpr GLuint kNoBuffer = 0xFFFFFFFF;
constexpr unsigned int kRenderTargetKind = 1;

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

// transpose(inverse(A)) for the upper-left 3x3 A of `model`, as the cofactor
// matrix of A over its determinant; a singular A is not guarded against.
void deriveNormalMatrix(const glm::mat4& model, glm::mat3& normal) {
    // a(r, c): row r, column c (GLM indexes columns first)
    const float a00 = model[0][0], a01 = model[1][0], a02 = model[2][0];
    const float a10 = model[0][1], a11 = model[1][1], a12 = model[2][1];
    const float a20 = model[0][2], a21 = model[1][2], a22 = model[2][2];

    const float c00 = a11 * a22 - a12 * a21;
    const float c01 = a12 * a20 - a10 * a22;
    const float c02 = a10 * a21 - a11 * a20;
    const float c10 = a02 * a21 - a01 * a22;
    const float c11 = a00 * a22 - a02 * a20;
    const float c12 = a01 * a20 - a00 * a21;
    const float c20 = a01 * a12 - a02 * a11;
    const float c21 = a02 * a10 - a00 * a12;
    const float c22 = a00 * a11 - a01 * a10;

    const float inverseDeterminant = 1.0f / (a00 * c00 + a01 * c01 + a02 * c02);

    normal[0][0] = c00 * inverseDeterminant;
    normal[1][0] = c01 * inverseDeterminant;
    normal[2][0] = c02 * inverseDeterminant;
    normal[0][1] = c10 * inverseDeterminant;
    normal[1][1] = c11 * inverseDeterminant;
    normal[2][1] = c12 * inverseDeterminant;
    normal[0][2] = c20 * inverseDeterminant;
    normal[1][2] = c21 * inverseDeterminant;
    normal[2][2] = c22 * inverseDeterminant;
}

// view x model for affine transforms: the bottom rows of both are taken as
// (0, 0, 0, 1) and never read.
void deriveModelView(const glm::mat4& view, const glm::mat4& model, glm::mat4& modelView) {
    for (int column = 0; column < 4; ++column) {
        for (int row = 0; row < 3; ++row) {
            float sum = view[0][row] * model[column][0] + view[1][row] * model[column][1] +
                        view[2][row] * model[column][2];
            if (column == 3) sum += view[3][row];
            modelView[column][row] = sum;
        }
        modelView[column][3] = column == 3 ? 1.0f : 0.0f;
    }
}

// projection x model-view for a centred projection: only the diagonal, the
// third row's w term and the last column of the projection are read; its
// other elements (an off-centre frustum's skew among them) count as zero.
void deriveModelViewProjection(const glm::mat4& projection, const glm::mat4& modelView, glm::mat4& result) {
    const float p0 = projection[0][0];
    const float p5 = projection[1][1];
    const float p10 = projection[2][2];
    const float p11 = projection[2][3];
    const float p12 = projection[3][0];
    const float p13 = projection[3][1];
    const float p14 = projection[3][2];
    const float p15 = projection[3][3];
    for (int column = 0; column < 4; ++column) {
        const glm::vec4& v = modelView[column];
        result[column][0] = p0 * v[0] + p12 * v[3];
        result[column][1] = p5 * v[1] + p13 * v[3];
        result[column][2] = p10 * v[2] + p14 * v[3];
        result[column][3] = p11 * v[2] + p15 * v[3];
    }
}

void uploadUniform(const Uniform& uniform) {
    const GLint location = uniform.location;
    const GLsizei count = GLsizei(uniform.count);
    const GLfloat* floats = static_cast<const GLfloat*>(uniform.data);
    const GLint* ints = static_cast<const GLint*>(uniform.data);
    // Out-of-range types upload nothing.
    switch (uniform.type) {
        case Uniform::Matrix2:
            glUniformMatrix2fv(location, count, GL_FALSE, floats);
            break;
        case Uniform::Matrix3:
            glUniformMatrix3fv(location, count, GL_FALSE, floats);
            break;
        case Uniform::Matrix4:
            glUniformMatrix4fv(location, count, GL_FALSE, floats);
            break;
        case Uniform::Int:
            glUniform1iv(location, count, ints);
            break;
        case Uniform::Int2:
            glUniform2iv(location, count, ints);
            break;
        case Uniform::Int3:
            glUniform3iv(location, count, ints);
            break;
        case Uniform::Int4:
            glUniform4iv(location, count, ints);
            break;
        case Uniform::Float:
            glUniform1fv(location, count, floats);
            break;
        case Uniform::Float2:
            glUniform2fv(location, count, floats);
            break;
        case Uniform::Float3:
            glUniform3fv(location, count, floats);
            break;
        case Uniform::Float4:
            glUniform4fv(location, count, floats);
            break;
    }
}

}  // namespace

Renderer::Renderer(ShaderProgram& programToUse, Drawable& drawableToDraw)
    : program(&programToUse), indexBuffer(kNoBuffer), drawable(&drawableToDraw) {
    if (drawable->indices) {
        glGenBuffers(1, &indexBuffer);
        glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, indexBuffer);
        glBufferData(GL_ELEMENT_ARRAY_BUFFER, indexBytes(*drawable), drawable->indices, GL_STATIC_DRAW);
    }

    // Bound when the program uses them; the derived ones are refreshed by render().
    addUniform("uModelMatrix", &drawable->modelMatrix[0][0], Uniform::Matrix4, 1);
    addUniform("uViewMatrix", &Drawable::mViewMatrix[0][0], Uniform::Matrix4, 1);
    addUniform("uNormalMatrix", &drawable->normalMatrix[0][0], Uniform::Matrix3, 1);
    addUniform("uProjectionMatrix", &Drawable::mProjectionMatrix[0][0], Uniform::Matrix4, 1);
    addUniform("uModelViewProjectionMatrix", &drawable->modelViewProjectionMatrix[0][0], Uniform::Matrix4, 1);
    addUniform("uOpacity", &drawable->opacity, Uniform::Float, 1);

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

int Renderer::addAttribute(const std::string& name, const void* data, unsigned int components, bool isStatic) {
    Attribute* attribute = new Attribute{name, kNoBuffer, -1, data, &drawable->vertexCount, components, isStatic};
    attribute->location = glGetAttribLocation(program->program, name.c_str());
    if (attribute->location == -1) {
        deleteAttribute(attribute);
        return -1;
    }

    glGenBuffers(1, &attribute->buffer);
    glBindBuffer(GL_ARRAY_BUFFER, attribute->buffer);
    glBufferData(GL_ARRAY_BUFFER, attributeBytes(*attribute), data, isStatic ? GL_STATIC_DRAW : GL_STREAM_DRAW);
    glEnableVertexAttribArray(attribute->location);
    glVertexAttribPointer(attribute->location, components, GL_FLOAT, GL_FALSE, 0, 0);

    attributes.push_back(attribute);
    return int(attributes.size()) - 1;
}

int Renderer::addUniform(const std::string& name, const void* data, Uniform::UniformType type, unsigned int count) {
    Uniform* uniform = new Uniform{name, -1, data, type, count};
    uniform->location = glGetUniformLocation(program->program, name.c_str());
    if (uniform->location == -1) {
        delete uniform;
        return -1;
    }
    uniforms.push_back(uniform);
    return int(uniforms.size()) - 1;
}

int Renderer::addTexture(const std::string& name, Texture* texture) {
    if (!texture) return -1;
    const GLint location = glGetUniformLocation(program->program, name.c_str());
    if (location == -1) return -1;

    texture->allocate();
    textures.emplace_back(texture, location);
    if (texture->mKind == kRenderTargetKind) renderTargets.push_back(texture);
    const int unit = int(textures.size()) - 1;

    addUniform(name + "Size", &texture->mSize[0], Uniform::Float2, 1);
    addUniform(name + "TexelSize", &texture->mTexelSize[0], Uniform::Float2, 1);
    return unit;
}

void Renderer::render() {
    // Dynamic targets sampled here are drawn again first; static ones keep
    // what they were rendered with.
    for (Texture* target : renderTargets)
        if (!target->mIsStatic) static_cast<RenderableTexture*>(target)->renderFrame();

    deriveNormalMatrix(drawable->modelMatrix, drawable->normalMatrix);
    deriveModelView(Drawable::mViewMatrix, drawable->modelMatrix, drawable->modelViewMatrix);
    deriveModelViewProjection(Drawable::mProjectionMatrix, drawable->modelViewMatrix,
                              drawable->modelViewProjectionMatrix);

    glUseProgram(program->program);

    // The arrays were enabled once by addAttribute.
    for (Attribute* attribute : attributes) {
        glBindBuffer(GL_ARRAY_BUFFER, attribute->buffer);
        if (!attribute->isStatic)
            glBufferData(GL_ARRAY_BUFFER, attributeBytes(*attribute), attribute->data, GL_STREAM_DRAW);
        glVertexAttribPointer(attribute->location, attribute->components, GL_FLOAT, GL_FALSE, 0, 0);
    }

    for (Uniform* uniform : uniforms) uploadUniform(*uniform);

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
