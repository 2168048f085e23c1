// The desktop stand-in for the phone's asset manager: the four asset functions
// that the runtime and plug-ins call, over the files of one directory. They
// are exported with C linkage under the NDK's own names, so a plug-in's asset
// code links against this library exactly as it links against the system's
// on the phone. Assets are read-only files; nothing is cached.

#if !defined(__ANDROID__)

#include "Tools/DirectoryAssetManager.h"

#include <sys/stat.h>

#include <cstdio>
#include <string>

struct AAssetManager {
    std::string directory;
};

struct AAsset {
    FILE* file;
    off_t length;
};

extern "C" {

VI_EXPORT AAsset* AAssetManager_open(AAssetManager* mgr, const char* filename, int /*mode*/) {
    if (!mgr || !filename) return nullptr;
    std::string path = mgr->directory + "/" + filename;
    FILE* file = std::fopen(path.c_str(), "rb");
    if (!file) return nullptr;
    // fopen accepts a directory on Linux; an asset is always a regular file.
    struct stat status;
    if (fstat(fileno(file), &status) != 0 || !S_ISREG(status.st_mode)) {
        std::fclose(file);
        return nullptr;
    }
    return new AAsset{file, status.st_size};
}

VI_EXPORT off_t AAsset_getLength(AAsset* asset) { return asset->length; }

VI_EXPORT int AAsset_read(AAsset* asset, void* buf, size_t count) {
    size_t read = std::fread(buf, 1, count, asset->file);
    if (read == 0 && std::ferror(asset->file)) return -1;
    return static_cast<int>(read);
}

VI_EXPORT void AAsset_close(AAsset* asset) {
    std::fclose(asset->file);
    delete asset;
}

}  // extern "C"

namespace vi {

AAssetManager* DirectoryAssetManager::create(const std::string& directory) { return new AAssetManager{directory}; }

void DirectoryAssetManager::destroy(AAssetManager* manager) { delete manager; }

}  // namespace vi

#endif
