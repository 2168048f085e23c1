// The render figure: vi::Renderer::render() of a typical indexed drawable
// (three attributes, one of them dynamic; the standard uniforms plus two of
// its own; one texture) against the same GL calls, in the same order, with the
// derived matrices computed by hand with GLM.
#include "Bench.h"

namespace {

const int kBatch = 4;  // frames per pass of each side
const int kWarmUpFrames = 12;
// Draws between two glFinish calls, as a frame would have between two swaps:
// without it the driver's queue grows and every draw costs more than the last.
const int kDrawsPerFrame = 16;

// A cube: its corners, their directions as normals, texture coordinates, and
// twelve triangles.
const float kCorners[] = {-1, -1, -1, 1, -1, -1, -1, 1, -1, 1, 1, -1, -1, -1, 1, 1, -1, 1, -1, 1, 1, 1, 1, 1};
const float kTexCoords[] = {0, 0, 1, 0, 0, 1, 1, 1, 1, 1, 0, 1, 1, 0, 0, 0};
const unsigned short kIndices[] = {0, 2, 1, 1, 2, 3, 4, 5, 6, 5, 7, 6, 0, 1, 4, 1, 5, 4,
                                   2, 6, 3, 3, 6, 7, 0, 4, 2, 2, 4, 6, 1, 3, 5, 3, 7, 5};

struct Attribute { const char* name; const float* data; GLsizeiptr bytes; int components; bool isStatic; };
const Attribute kAttributes[] = {{"aPosition", kCorners, sizeof(kCorners), 3, true},
                                 {"aNormal", kCorners, sizeof(kCorners), 3, true},
                                 {"aTexCoord", kTexCoords, sizeof(kTexCoords), 2, false}};

// Small weights keep every uniform active without changing the picture much;
// a multiplication by zero would let the compiler drop the uniform.
const char* const kVertex =
    "attribute vec3 aPosition, aNormal;\n"
    "attribute vec2 aTexCoord;\n"
    "uniform mat4 uModelMatrix, uViewMatrix, uProjectionMatrix, uModelViewProjectionMatrix;\n"
    "uniform mat3 uNormalMatrix;\n"
    "uniform float uTime;\n"
    "varying vec2 vTexCoord;\n"
    "varying vec4 vShade;\n"
    "void main() {\n"
    "    float depth = (uProjectionMatrix * uViewMatrix * uModelMatrix * vec4(aPosition, 1.0)).w;\n"
    "    vShade = vec4(uNormalMatrix * aNormal * 0.1 + 0.9, 1.0 - depth * 0.01);\n"
    "    vTexCoord = aTexCoord + vec2(uTime * 0.01, 0.0);\n"
    "    gl_Position = uModelViewProjectionMatrix * vec4(aPosition, 1.0);\n"
    "}\n";
const char* const kFragment =
    "precision mediump float;\n"
    "uniform sampler2D uTexture;\n"
    "uniform float uOpacity;\n"
    "uniform vec4 uTint;\n"
    "varying vec2 vTexCoord;\n"
    "varying vec4 vShade;\n"
    "void main() { gl_FragColor = texture2D(uTexture, vTexCoord) * uTint * vShade * uOpacity; }\n";

// The uniforms in the order the renderer uploads them: the standard ones, then its own.
enum { Model, View, NormalMatrix, Projection, ModelViewProjection, Opacity, Tint, Time, Sampler, UniformCount };
const char* const kUniformNames[] = {"uModelMatrix", "uViewMatrix", "uNormalMatrix", "uProjectionMatrix",
                                     "uModelViewProjectionMatrix", "uOpacity", "uTint", "uTime", "uTexture"};

// What both sides draw with, in the main context: the program, the cube (the
// camera and the model matrix left as they are: the matrix work costs the
// same for any values), the two own uniforms' values and a 64 x 64 texture;
// and the hand renderer's buffers and locations.
struct RenderSetup {
    RenderSetup() : program(kVertex, kFragment), texture(pixels, 64, 64, true, true, false, true, false, 4, false) {
        drawable.mode = GL_TRIANGLES;
        drawable.indices = kIndices;
        drawable.elementCount = sizeof(kIndices) / sizeof(kIndices[0]);
        drawable.vertexCount = 8;
        drawable.positions = drawable.normals = kCorners;
        drawable.texCoords = kTexCoords;
        // The figure is about the calls, not the driver's rasteriser, which
        // would drown them: both sides cull every triangle after the vertex
        // stage, so the calls, the vertex work and the draw setup remain.
        glEnable(GL_CULL_FACE);
        glCullFace(GL_FRONT_AND_BACK);

        glGenBuffers(4, buffers);
        for (int i = 0; i < 3; ++i) {
            locations[i] = GLuint(glGetAttribLocation(program.program, kAttributes[i].name));
            glBindBuffer(GL_ARRAY_BUFFER, buffers[i]);
            glBufferData(GL_ARRAY_BUFFER, kAttributes[i].bytes, kAttributes[i].data, GL_STATIC_DRAW);
            glEnableVertexAttribArray(locations[i]);
        }
        glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, buffers[3]);
        glBufferData(GL_ELEMENT_ARRAY_BUFFER, sizeof(kIndices), kIndices, GL_STATIC_DRAW);
        for (int i = 0; i < UniformCount; ++i) uniforms[i] = glGetUniformLocation(program.program, kUniformNames[i]);
        texture.allocate();
    }
    ~RenderSetup() {
        glDeleteBuffers(4, buffers);
        glDisable(GL_CULL_FACE);
    }

    // The renderer's work by hand, with the derived matrices from GLM's
    // general operations.
    void renderByHand() {
        const glm::mat4& model = drawable.modelMatrix;
        drawable.normalMatrix = glm::transpose(glm::inverse(glm::mat3(model)));
        drawable.modelViewMatrix = vi::Drawable::mViewMatrix * model;
        drawable.modelViewProjectionMatrix = vi::Drawable::mProjectionMatrix * drawable.modelViewMatrix;

        glUseProgram(program.program);
        for (int i = 0; i < 3; ++i) {
            glBindBuffer(GL_ARRAY_BUFFER, buffers[i]);
            if (!kAttributes[i].isStatic)
                glBufferData(GL_ARRAY_BUFFER, kAttributes[i].bytes, kAttributes[i].data, GL_STREAM_DRAW);
            glVertexAttribPointer(locations[i], kAttributes[i].components, GL_FLOAT, GL_FALSE, 0, 0);
        }

        glUniformMatrix4fv(uniforms[Model], 1, GL_FALSE, &model[0][0]);
        glUniformMatrix4fv(uniforms[View], 1, GL_FALSE, &vi::Drawable::mViewMatrix[0][0]);
        glUniformMatrix3fv(uniforms[NormalMatrix], 1, GL_FALSE, &drawable.normalMatrix[0][0]);
        glUniformMatrix4fv(uniforms[Projection], 1, GL_FALSE, &vi::Drawable::mProjectionMatrix[0][0]);
        glUniformMatrix4fv(uniforms[ModelViewProjection], 1, GL_FALSE, &drawable.modelViewProjectionMatrix[0][0]);
        glUniform1fv(uniforms[Opacity], 1, &drawable.opacity);
        glUniform4fv(uniforms[Tint], 1, &tint[0]);
        glUniform1fv(uniforms[Time], 1, &time);

        glActiveTexture(GL_TEXTURE0);
        glBindTexture(GL_TEXTURE_2D, texture.mId);
        glUniform1i(uniforms[Sampler], 0);

        glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, buffers[3]);
        glDrawElements(drawable.mode, GLsizei(drawable.elementCount), GL_UNSIGNED_SHORT, 0);
    }

    unsigned int pixels[64 * 64] = {};
    vi::Drawable drawable;
    vi::ShaderProgram program;
    vi::Texture texture;
    glm::vec4 tint{1.0f, 0.9f, 0.8f, 1.0f};
    float time = 0.25f;
    GLuint buffers[4];  // the three attributes', then the indices'
    GLuint locations[3];
    GLint uniforms[UniformCount];
};

void render(benchmark::State& state) {
    vibench::mainContext();
    RenderSetup setup;
    vi::Renderer renderer(setup.program, setup.drawable);
    for (const Attribute& attribute : kAttributes)
        renderer.addAttribute(attribute.name, attribute.data, unsigned(attribute.components), attribute.isStatic);
    renderer.addUniform("uTint", &setup.tint, vi::Uniform::Float4, 1);
    renderer.addUniform("uTime", &setup.time, vi::Uniform::Float, 1);
    renderer.addTexture("uTexture", &setup.texture);
    if (renderer.attributes.size() != 3 || renderer.uniforms.size() != 8 || renderer.textures.size() != 1)
        vibench::benchFail("render: the renderer did not bind every input");
    auto measured = [&] {
        for (int i = 0; i < kDrawsPerFrame; ++i) renderer.render();
        glFinish();
    };
    auto baseline = [&] {
        for (int i = 0; i < kDrawsPerFrame; ++i) setup.renderByHand();
        glFinish();
    };
    // The driver compiles a program's machine code at its first draws and the
    // first frames fill its caches: neither belongs to the steady state measured.
    vibench::timeOf(kWarmUpFrames, measured);
    vibench::timeOf(kWarmUpFrames, baseline);
    vibench::PairedTimes times(state);
    for (auto _ : state) times.passBatches(kBatch, measured, baseline);
    times.finish();
    glFinish();
}

}  // namespace

BENCHMARK(render)->Name("render")->UseManualTime();
