#include "AssetAccess.h"

#include <dlfcn.h>

#include <android/asset_manager.h>

#include "Tools/File.h"
#if !defined(__ANDROID__)
#include "Tools/DirectoryAssetManager.h"
#endif

namespace vi {

std::string AssetAccess::libraryAssetDirectory() {
    Dl_info info;
    if (dladdr(reinterpret_cast<void*>(&AssetAccess::libraryAssetDirectory), &info) == 0 || !info.dli_fname)
        return std::string();
    std::string path = info.dli_fname;
    std::string::size_type slash = path.rfind('/');
    return (slash == std::string::npos ? std::string(".") : path.substr(0, slash)) + "/assets";
}

bool AssetAccess::ensureManager() {
    AAssetManager*& slot = File::getAssetManager();
#if !defined(__ANDROID__)
    // Made once and kept for the life of the process, like the host's own.
    if (!slot) {
        std::string directory = libraryAssetDirectory();
        if (!directory.empty()) slot = DirectoryAssetManager::create(directory);
    }
#endif
    return slot != nullptr;
}

bool AssetAccess::exists(const std::string& name) {
    if (!ensureManager()) return false;
    AAsset* asset = AAssetManager_open(File::getAssetManager(), name.c_str(), AASSET_MODE_UNKNOWN);
    if (!asset) return false;
    AAsset_close(asset);
    return true;
}

}  // namespace vi
