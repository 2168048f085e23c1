#pragma once

// How the scene reaches its assets. The host stores an asset manager in
// vi::File::getAssetManager() before the scene is initialised (on the phone
// from its Java side; the desktop player makes one with
// vi::DirectoryAssetManager::create(dir)). When the slot is still empty on the
// desktop, the scene falls back to the "assets" directory beside its own
// library file. A missing asset is reported as absent rather than loaded,
// since loading a missing asset ends the process.

#include <string>

namespace vi {

class AssetAccess {
public:
    // True once the slot holds a manager (the host's, or the fallback).
    static bool ensureManager();
    static bool exists(const std::string& name);
    // The fallback directory: "assets" beside the library holding this code.
    static std::string libraryAssetDirectory();
};

}  // namespace vi
