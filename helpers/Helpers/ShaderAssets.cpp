#include "Helpers/ShaderAssets.h"

#include "Tools/File.h"

namespace vi {

const char* const ShaderAssets::kVertexSuffix = ".vert";
const char* const ShaderAssets::kFragmentSuffix = ".frag";

std::string ShaderAssets::read(const std::string& assetName) {
    // The file's bytes only: no terminating zero.
    const File file(assetName, true);
    return std::string(file.mData.begin(), file.mData.end());
}

std::unique_ptr<ShaderProgram> ShaderAssets::load(const std::string& name) {
    const std::string vertexSource = read(name + kVertexSuffix);
    const std::string fragmentSource = read(name + kFragmentSuffix);
    return std::make_unique<ShaderProgram>(vertexSource, fragmentSource);
}

}  // namespace vi
