#pragma once

// A shader program from two of the effect's assets, NAME.vert and NAME.frag,
// read whole through the asset manager the host stored in
// File::getAssetManager(). As with any asset, one that cannot be opened ends
// the process (status 71), and a shader that does not compile or link ends it
// too (88, 67); the desktop hosts name the asset or show the failing line.
// GL thread.

#include <memory>
#include <string>

#include "Render/ShaderProgram.h"

namespace vi {

class ShaderAssets {
public:
    static const char* const kVertexSuffix;
    static const char* const kFragmentSuffix;

    static std::unique_ptr<ShaderProgram> load(const std::string& name);

    // One asset's text.
    static std::string read(const std::string& assetName);
};

}  // namespace vi
