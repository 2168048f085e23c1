#pragma once

// Desktop only. On the phone the asset manager comes from the host's Java side;
// on Linux the runtime provides AAssetManager_open, AAsset_getLength,
// AAsset_read and AAsset_close over a directory, so that a plug-in's asset code
// is the same on both platforms. Not compiled for Android.

#if !defined(__ANDROID__)

#include <string>

#include <android/asset_manager.h>

#include "Tools/Export.h"

namespace vi {

class VI_EXPORT DirectoryAssetManager {
public:
    // Makes an asset manager whose asset "a/b.bin" is the file directory + "/a/b.bin".
    // The manager lives until destroy(); it is never freed by the runtime.
    static AAssetManager* create(const std::string& directory);
    static void destroy(AAssetManager* manager);

    // What the asset name finds in the directory. A phone's package holds
    // nothing but its assets, so a name never reaches beyond the folder here
    // either: an absolute name, "../x" or a symbolic link pointing out is no
    // asset. The desktop hosts ask this to say why an asset was not found.
    enum class Lookup { Found, Missing, Outside, NotAFile };
    // On Found, `path` is the file's real path (no symbolic links left).
    static Lookup find(const std::string& directory, const char* name, std::string& path);
};

}  // namespace vi

#endif
