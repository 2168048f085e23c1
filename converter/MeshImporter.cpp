#include "MeshImporter.h"

#include <cmath>
#include <new>

#include <assimp/Importer.hpp>
#include <assimp/postprocess.h>
#include <assimp/scene.h>

namespace vi {

namespace {

glm::mat4 toGlm(const aiMatrix4x4& m) {
    // assimp stores rows, GLM columns.
    return glm::mat4(m.a1, m.b1, m.c1, m.d1, m.a2, m.b2, m.c2, m.d2, m.a3, m.b3, m.c3, m.d3, m.a4, m.b4, m.c4,
                     m.d4);
}

std::string meshLabel(const aiMesh* mesh, unsigned int index) {
    std::string label = "mesh " + std::to_string(index);
    if (mesh->mName.length > 0) label += " '" + std::string(mesh->mName.C_Str()) + "'";
    return label;
}

class Joiner {
public:
    Joiner(const aiScene* scene, MeshData& mesh, std::vector<MeshImporter::MissingUv>& missingUv)
        : mScene(scene), mMesh(mesh), mMissingUv(missingUv) {}

    void visit(const aiNode* node, const glm::mat4& parent) {
        glm::mat4 transform = parent * toGlm(node->mTransformation);
        for (unsigned int i = 0; i < node->mNumMeshes; ++i) append(node->mMeshes[i], transform);
        for (unsigned int i = 0; i < node->mNumChildren; ++i) visit(node->mChildren[i], transform);
    }

    void append(unsigned int meshIndex, const glm::mat4& transform) {
        const aiMesh* source = mScene->mMeshes[meshIndex];
        // Points and lines were split off by SortByPType and removed.
        if ((source->mPrimitiveTypes & aiPrimitiveType_TRIANGLE) == 0) return;
        const std::size_t base = mMesh.positions.size();
        const glm::mat3 normalTransform = glm::transpose(glm::inverse(glm::mat3(transform)));
        // A mirroring transform turns the faces inside out; swapping two
        // corners keeps them facing out so back-face culling still works.
        const bool mirrored = glm::determinant(glm::mat3(transform)) < 0.0f;
        for (unsigned int v = 0; v < source->mNumVertices; ++v) {
            const aiVector3D& p = source->mVertices[v];
            mMesh.positions.push_back(glm::vec3(transform * glm::vec4(p.x, p.y, p.z, 1.0f)));
            glm::vec3 n(0.0f);
            if (source->mNormals) n = normalTransform * glm::vec3(source->mNormals[v].x, source->mNormals[v].y,
                                                                  source->mNormals[v].z);
            float length = glm::length(n);
            // Degenerate faces leave zero or undefined normals; a unit vector
            // keeps the shader's normalize() defined.
            mMesh.normals.push_back(std::isfinite(length) && length > 0.0f ? n / length : glm::vec3(0, 0, 1));
            glm::vec2 uv(0.0f);
            if (source->HasTextureCoords(0)) uv = glm::vec2(source->mTextureCoords[0][v].x,
                                                            source->mTextureCoords[0][v].y);
            mMesh.texCoords.push_back(uv);
        }
        if (!source->HasTextureCoords(0) && source->mNumVertices > 0)
            mMissingUv.push_back({meshLabel(source, meshIndex), base, source->mNumVertices});
        for (unsigned int f = 0; f < source->mNumFaces; ++f) {
            const aiFace& face = source->mFaces[f];
            if (face.mNumIndices != 3) continue;
            mMesh.indices.push_back(std::uint32_t(base + face.mIndices[0]));
            mMesh.indices.push_back(std::uint32_t(base + face.mIndices[mirrored ? 2 : 1]));
            mMesh.indices.push_back(std::uint32_t(base + face.mIndices[mirrored ? 1 : 2]));
        }
    }

private:
    const aiScene* mScene;
    MeshData& mMesh;
    std::vector<MeshImporter::MissingUv>& mMissingUv;
};

}  // namespace

bool MeshImporter::import(const std::string& path, const Options& options, MeshData& mesh,
                          std::vector<MissingUv>& missingUv, std::string& error) {
    Assimp::Importer importer;
    importer.SetPropertyInteger(AI_CONFIG_PP_SBP_REMOVE, aiPrimitiveType_POINT | aiPrimitiveType_LINE);
    importer.SetPropertyFloat(AI_CONFIG_PP_GSN_MAX_SMOOTHING_ANGLE, options.creaseAngleDegrees);
    unsigned int steps = aiProcess_Triangulate | aiProcess_SortByPType | aiProcess_JoinIdenticalVertices |
                         aiProcess_ValidateDataStructure;
    steps |= options.flatNormals ? aiProcess_GenNormals : aiProcess_GenSmoothNormals;
    const aiScene* scene = importer.ReadFile(path, steps);
    // The importer reports a failed allocation as its error text; the
    // caller tells a refusal under the memory ceiling from a broken file.
    if (!scene && std::string(importer.GetErrorString()) == std::bad_alloc().what()) throw std::bad_alloc();
    if (!scene) {
        error = "cannot read '" + path + "': " + importer.GetErrorString();
        return false;
    }
    mesh = MeshData();
    missingUv.clear();
    Joiner joiner(scene, mesh, missingUv);
    if (scene->mRootNode) joiner.visit(scene->mRootNode, glm::mat4(1.0f));
    if (mesh.indices.empty()) {
        error = "'" + path + "' holds no triangles";
        return false;
    }
    return true;
}

}  // namespace vi
