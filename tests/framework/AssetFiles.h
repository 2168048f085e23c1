#pragma once

// What the file, model and lighting tests set up: a scratch directory that
// serves as the asset directory and the external-storage directory, and model
// files in the runtime's binary format.

#include <cstdint>
#include <vector>

#include <glm/glm.hpp>

#include "Scratch.h"
#include "Tools/DirectoryAssetManager.h"
#include "Tools/File.h"

namespace vitest {

// A scratch directory installed as the process's asset manager (and as the
// external-storage directory) for the lifetime of the object.
class AssetDirectory : public ScratchDirectory {
public:
    AssetDirectory() : mManager(vi::DirectoryAssetManager::create(path())) {
        vi::File::getAssetManager() = mManager;
        vi::File::setExternalStorageDirectory(path() + "/");
    }
    ~AssetDirectory() {
        vi::File::getAssetManager() = nullptr;
        vi::File::setExternalStorageDirectory("/sdcard/");
        vi::DirectoryAssetManager::destroy(mManager);
    }

private:
    AAssetManager* mManager;
};

// The bytes of a model file: V, I, positions, normals, texture coordinates, indices.
inline std::vector<char> modelFile(const std::vector<glm::vec3>& positions, const std::vector<glm::vec3>& normals,
                                   const std::vector<glm::vec2>& texCoords,
                                   const std::vector<std::uint16_t>& indices) {
    std::vector<char> bytes;
    auto append = [&bytes](const void* data, std::size_t size) {
        const char* p = static_cast<const char*>(data);
        bytes.insert(bytes.end(), p, p + size);
    };
    std::uint32_t header[2] = {std::uint32_t(positions.size()), std::uint32_t(indices.size())};
    append(header, sizeof(header));
    append(positions.data(), positions.size() * sizeof(glm::vec3));
    append(normals.data(), normals.size() * sizeof(glm::vec3));
    append(texCoords.data(), texCoords.size() * sizeof(glm::vec2));
    append(indices.data(), indices.size() * sizeof(std::uint16_t));
    return bytes;
}

}  // namespace vitest
