#pragma once

// A whole file as a byte vector: read completely from the application's assets
// or from the file system, or collected with write() and saved under the
// external-storage directory with flush(). A file that cannot be opened for
// reading ends the process (status 45 for a path, 71 for an asset).
// No GL, no locks; one thread at a time per object.

#include <string>
#include <vector>

#include <android/asset_manager.h>

#include "Tools/Export.h"

namespace vi {

class VI_EXPORT File {
public:
    File();
    File(const std::string& name, bool isAsset);

    void load(const std::string& name);
    void write(const void* data, unsigned int size);
    void flush(const std::string& name, bool);
    unsigned int getLength() const;
    char* getBuffer();

    // The plug-in stores its asset manager here before loading any asset.
    static AAssetManager*& getAssetManager();

#if !defined(__ANDROID__)
    // Desktop only: where flush() writes instead of "/sdcard/" (a trailing
    // separator is expected, as in the default). Tests and the desktop host
    // point it at a directory of their own.
    static void setExternalStorageDirectory(const std::string& directory);
#endif

    std::vector<char> mData;
};

}  // namespace vi
