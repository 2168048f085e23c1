// The desktop stand-in for the phone's asset manager: the four asset functions
// that the runtime and plug-ins call, over the files of one directory. They
// are exported with C linkage under the NDK's own names, so a plug-in's asset
// code links against this library exactly as it links against the system's
// on the phone. Assets are read-only files; nothing is cached.

#if !defined(__ANDROID__)

#include "Tools/DirectoryAssetManager.h"

#include <sys/stat.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
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
    std::string path;
    if (vi::DirectoryAssetManager::find(mgr->directory, filename, path) != vi::DirectoryAssetManager::Lookup::Found) {
        return nullptr;
    }
    FILE* file = std::fopen(path.c_str(), "rb");
    if (!file) return nullptr;
    // The file may have been replaced since it was found: still a regular file?
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

namespace {

// The real path of a file, or empty when it does not exist.
std::string realPath(const std::string& path) {
    char* real = realpath(path.c_str(), nullptr);
    if (!real) return std::string();
    std::string result = real;
    std::free(real);
    return result;
}

// True when the name's ".." steps climb above the folder, whether or not the file exists.
bool climbsOut(const char* name) {
    int depth = 0;
    for (const char* part = name; *part; part += (*part == '/')) {
        const char* end = std::strchr(part, '/');
        const std::size_t length = end ? std::size_t(end - part) : std::strlen(part);
        if (length == 2 && part[0] == '.' && part[1] == '.') {
            if (--depth < 0) return true;
        } else if (length > 0 && !(length == 1 && part[0] == '.')) {
            ++depth;
        }
        part += length;
    }
    return false;
}

}  // namespace

DirectoryAssetManager::Lookup DirectoryAssetManager::find(const std::string& directory, const char* name,
                                                          std::string& path) {
    if (name[0] == '/' || climbsOut(name)) return Lookup::Outside;
    const std::string root = realPath(directory);
    path = realPath(directory + "/" + name);
    if (root.empty() || path.empty()) return Lookup::Missing;
    // Resolved, the file must lie below the folder: "../x" and links pointing out do not.
    const std::string below = root == "/" ? root : root + "/";
    if (path.compare(0, below.size(), below) != 0) return Lookup::Outside;
    // fopen accepts a directory on Linux; an asset is always a regular file.
    struct stat status;
    if (stat(path.c_str(), &status) != 0 || !S_ISREG(status.st_mode)) return Lookup::NotAFile;
    return Lookup::Found;
}

}  // namespace vi

#endif
