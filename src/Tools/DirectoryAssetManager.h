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
};

}  // namespace vi

#endif
