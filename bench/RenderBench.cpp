// The render figure: vi::Renderer::render() of a typical indexed drawable
// (three attributes, one of them dynamic; the standard uniforms plus two of
// its own; one texture) against the same GL calls, in the same order, with the
// derived matrices computed by hand with GLM.
#include <benchmark/benchmark.h>

#include <functional>
#include <vector>

#include <glm/glm.hpp>
#include <glm/gtc/matrix_transform.hpp>

#include "BenchContext.h"
#include "BenchShaders.h"
#include "PairedTimes.h"
#include "Render/Drawable.h"
#include "Render/GL.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"
#include "Render/Uniform.h"

namespace {

const int kGridSide = 9;  // vertices per side: 81 vertices, 128 triangles
const int kWarmUpDraws = 200;
// Draws between two glFinish calls, as a frame would have between two swaps:
// without it the driver's queue grows and every draw costs more than the last.
const int kDrawsPerFrame = 16;

// A flat grid facing the viewer, with normals and texture coordinates.
struct Mesh {
    std::vector<float> positions;
    std::vector<float> normals;
    std::vector<float> texCoords;
    std::vector<unsigned short> indices;

    Mesh() {
        for (int y = 0; y < kGridSide; ++y) {
            for (int x = 0; x < kGridSide; ++x) {
                const float u = float(x) / float(kGridSide - 1);
                const float v = float(y) / float(kGridSide - 1);
                positions.insert(positions.end(), {u - 0.5f, v - 0.5f, 0.0f});
                normals.insert(normals.end(), {0.0f, 0.0f, 1.0f});
                texCoords.insert(texCoords.end(), {u, v});
            }
        }
        for (int y = 0; y + 1 < kGridSide; ++y) {
            for (int x = 0; x + 1 < kGridSide; ++x) {
                const unsigned short corner = (unsigned short)(y * kGridSide + x);
                const unsigned short up = (unsigned short)(corner + kGridSide);
                indices.insert(indices.end(), {corner, (unsigned short)(corner + 1), up, up,
                                               (unsigned short)(corner + 1), (unsigned short)(up + 1)});
            }
        }
    }
};

// The driver compiles a program's machine code at its first draws and the
// first frames fill its caches: neither belongs to the steady state measured.
template <typename Draw>
void warmUp(Draw draw) {
    for (int i = 0; i < kWarmUpDraws; ++i) draw();
    glFinish();
}

// What both sides draw with: one program, the mesh, the camera, the values
// of the two own uniforms and a 64 x 64 texture, in the main context.
class RenderSetup {
public:
    RenderSetup()
        : mProgram(vibench::kMeshVertex, vibench::kMeshFragment),
          mPixels(64 * 64, 0xFF80C0FFu),
          mTexture(mPixels.data(), 64, 64, true, true, false, true, false, 4, false),
          mTint(1.0f, 0.9f, 0.8f, 1.0f),
          mTime(0.25f) {
        mDrawable.mode = GL_TRIANGLES;
        mDrawable.indices = mMesh.indices.data();
        mDrawable.elementCount = unsigned(mMesh.indices.size());
        mDrawable.vertexCount = unsigned(kGridSide * kGridSide);
        mDrawable.positions = mMesh.positions.data();
        mDrawable.normals = mMesh.normals.data();
        mDrawable.texCoords = mMesh.texCoords.data();
        mDrawable.modelMatrix = glm::rotate(glm::translate(glm::mat4(1.0f), glm::vec3(0.1f, -0.1f, 0.0f)), 0.3f,
                                            glm::vec3(0.2f, 1.0f, 0.1f));
        vi::Drawable::mProjectionMatrix = glm::perspective(0.8f, 1.0f, 0.5f, 20.0f);
        vi::Drawable::mViewMatrix = glm::lookAt(glm::vec3(0.0f, 0.0f, 2.0f), glm::vec3(0.0f), glm::vec3(0, 1, 0));
        glViewport(0, 0, 64, 64);
        // The figure is about the calls, not the driver's rasteriser, which
        // would drown them: both sides cull every triangle after the vertex
        // stage, so the calls, the vertex work and the draw setup remain.
        glEnable(GL_CULL_FACE);
        glCullFace(GL_FRONT_AND_BACK);
    }
    ~RenderSetup() {
        glDisable(GL_CULL_FACE);
        vi::Drawable::mProjectionMatrix = glm::mat4(1.0f);
        vi::Drawable::mViewMatrix = glm::mat4(1.0f);
    }

    Mesh mMesh;
    vi::Drawable mDrawable;
    vi::ShaderProgram mProgram;
    std::vector<unsigned int> mPixels;
    vi::Texture mTexture;
    glm::vec4 mTint;
    float mTime;
};

// The renderer's work by hand: its buffers, locations and draw, with the
// derived matrices from GLM's general operations.
class HandRenderer {
public:
    explicit HandRenderer(RenderSetup& setup) : mSetup(setup), mProgram(setup.mProgram.program) {
        const Mesh& mesh = setup.mMesh;
        mPositionBuffer = makeBuffer(mesh.positions, GL_STATIC_DRAW);
        mNormalBuffer = makeBuffer(mesh.normals, GL_STATIC_DRAW);
        mTexCoordBuffer = makeBuffer(mesh.texCoords, GL_STREAM_DRAW);
        glGenBuffers(1, &mIndexBuffer);
        glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, mIndexBuffer);
        glBufferData(GL_ELEMENT_ARRAY_BUFFER, GLsizeiptr(mesh.indices.size() * 2), mesh.indices.data(),
                     GL_STATIC_DRAW);
        mPosition = glGetAttribLocation(mProgram, "aPosition");
        mNormal = glGetAttribLocation(mProgram, "aNormal");
        mTexCoord = glGetAttribLocation(mProgram, "aTexCoord");
        enable(mPositionBuffer, mPosition, 3);
        enable(mNormalBuffer, mNormal, 3);
        enable(mTexCoordBuffer, mTexCoord, 2);
        mModel = glGetUniformLocation(mProgram, "uModelMatrix");
        mView = glGetUniformLocation(mProgram, "uViewMatrix");
        mNormalMatrix = glGetUniformLocation(mProgram, "uNormalMatrix");
        mProjection = glGetUniformLocation(mProgram, "uProjectionMatrix");
        mModelViewProjection = glGetUniformLocation(mProgram, "uModelViewProjectionMatrix");
        mOpacity = glGetUniformLocation(mProgram, "uOpacity");
        mTint = glGetUniformLocation(mProgram, "uTint");
        mTime = glGetUniformLocation(mProgram, "uTime");
        mSampler = glGetUniformLocation(mProgram, "uTexture");
        setup.mTexture.allocate();
    }
    ~HandRenderer() {
        const GLuint buffers[] = {mPositionBuffer, mNormalBuffer, mTexCoordBuffer, mIndexBuffer};
        glDeleteBuffers(4, buffers);
    }

    void render() {
        vi::Drawable& drawable = mSetup.mDrawable;
        const glm::mat4& model = drawable.modelMatrix;
        drawable.normalMatrix = glm::transpose(glm::inverse(glm::mat3(model)));
        drawable.modelViewMatrix = vi::Drawable::mViewMatrix * model;
        drawable.modelViewProjectionMatrix = vi::Drawable::mProjectionMatrix * drawable.modelViewMatrix;

        glUseProgram(mProgram);
        glBindBuffer(GL_ARRAY_BUFFER, mPositionBuffer);
        glVertexAttribPointer(mPosition, 3, GL_FLOAT, GL_FALSE, 0, 0);
        glBindBuffer(GL_ARRAY_BUFFER, mNormalBuffer);
        glVertexAttribPointer(mNormal, 3, GL_FLOAT, GL_FALSE, 0, 0);
        glBindBuffer(GL_ARRAY_BUFFER, mTexCoordBuffer);
        glBufferData(GL_ARRAY_BUFFER, GLsizeiptr(drawable.vertexCount * 2 * sizeof(float)), drawable.texCoords,
                     GL_STREAM_DRAW);
        glVertexAttribPointer(mTexCoord, 2, GL_FLOAT, GL_FALSE, 0, 0);

        glUniformMatrix4fv(mModel, 1, GL_FALSE, &model[0][0]);
        glUniformMatrix4fv(mView, 1, GL_FALSE, &vi::Drawable::mViewMatrix[0][0]);
        glUniformMatrix3fv(mNormalMatrix, 1, GL_FALSE, &drawable.normalMatrix[0][0]);
        glUniformMatrix4fv(mProjection, 1, GL_FALSE, &vi::Drawable::mProjectionMatrix[0][0]);
        glUniformMatrix4fv(mModelViewProjection, 1, GL_FALSE, &drawable.modelViewProjectionMatrix[0][0]);
        glUniform1fv(mOpacity, 1, &drawable.opacity);
        glUniform4fv(mTint, 1, &mSetup.mTint[0]);
        glUniform1fv(mTime, 1, &mSetup.mTime);

        glActiveTexture(GL_TEXTURE0);
        glBindTexture(GL_TEXTURE_2D, mSetup.mTexture.mId);
        glUniform1i(mSampler, 0);

        glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, mIndexBuffer);
        glDrawElements(drawable.mode, GLsizei(drawable.elementCount), GL_UNSIGNED_SHORT, 0);
    }

private:
    static GLuint makeBuffer(const std::vector<float>& data, GLenum usage) {
        GLuint buffer = 0;
        glGenBuffers(1, &buffer);
        glBindBuffer(GL_ARRAY_BUFFER, buffer);
        glBufferData(GL_ARRAY_BUFFER, GLsizeiptr(data.size() * sizeof(float)), data.data(), usage);
        return buffer;
    }
    static void enable(GLuint buffer, GLint location, int components) {
        glBindBuffer(GL_ARRAY_BUFFER, buffer);
        glEnableVertexAttribArray(GLuint(location));
        glVertexAttribPointer(GLuint(location), components, GL_FLOAT, GL_FALSE, 0, 0);
    }

    RenderSetup& mSetup;
    GLuint mProgram;
    GLuint mPositionBuffer, mNormalBuffer, mTexCoordBuffer, mIndexBuffer;
    GLint mPosition, mNormal, mTexCoord;
    GLint mModel, mView, mNormalMatrix, mProjection, mModelViewProjection, mOpacity, mTint, mTime, mSampler;
};

// Draws per batch of each side.
const int kBatch = 64;

// A side's draws, with a glFinish every kDrawsPerFrame of them.
template <typename Draw>
class Frames {
public:
    explicit Frames(Draw draw) : mDraw(draw), mDraws(0) {}
    void operator()() {
        mDraw();
        if (++mDraws == kDrawsPerFrame) {
            glFinish();
            mDraws = 0;
        }
    }

private:
    Draw mDraw;
    int mDraws;
};

void render(benchmark::State& state) {
    vibench::mainContext();
    RenderSetup setup;
    vi::Renderer renderer(setup.mProgram, setup.mDrawable);
    if (renderer.addAttribute("aPosition", setup.mMesh.positions.data(), 3, true) < 0 ||
        renderer.addAttribute("aNormal", setup.mMesh.normals.data(), 3, true) < 0 ||
        renderer.addAttribute("aTexCoord", setup.mMesh.texCoords.data(), 2, false) < 0 ||
        renderer.addUniform("uTint", &setup.mTint, vi::Uniform::Float4, 1) < 0 ||
        renderer.addUniform("uTime", &setup.mTime, vi::Uniform::Float, 1) < 0 ||
        renderer.addTexture("uTexture", &setup.mTexture) < 0 || renderer.uniforms.size() != 8)
        vibench::benchFail("render: the renderer did not bind every input");
    HandRenderer byHand(setup);
    Frames measured([&] { renderer.render(); });
    Frames baseline([&] { byHand.render(); });
    warmUp([&] {
        measured();
        baseline();
    });
    vibench::PairedTimes times(state);
    for (auto _ : state) times.pass(kBatch, std::ref(measured), std::ref(baseline));
    times.finish();
    glFinish();
}

}  // namespace

BENCHMARK(render)->Name("render")->UseManualTime();
