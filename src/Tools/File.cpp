#include "Tools/File.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "Tools/FatalReport.h"

namespace vi {

namespace {

// Written once by the plug-in (from its own JNI code) before any asset is read.
AAssetManager* gpAssetManager = nullptr;

// The exit statuses name the failure sites; the host's tooling knows them by
// number, so they stay fixed whatever the layout of this file.
const int kFileOpenFailedLine = 45;
const int kAssetOpenFailedLine = 71;

// Composes the report of an unreadable file and ends the process. The text is
// not printed: the exit status alone tells which site failed.
[[noreturn]] void exitWithInvalidFileName(const std::string& name, int line, const char* function) {
    std::string report;
    report.reserve(8192);
    report += "\"";
    report += "Invalid file name: \"" + name + "\"";
    report += "\"\n";
    FatalReport::compose(report, line, function, __FILE__);
    std::exit(line);
}

}  // namespace

// ---- Platform difference: the external-storage directory ------------------
// On the phone flush() writes under "/sdcard/". A desktop has no such
// directory, so there the host and the tests may point it elsewhere.
#if defined(__ANDROID__)
namespace {
std::string externalStorageDirectory() { return "/sdcard/"; }
}  // namespace
#else
namespace {
// A function-local static, so that a file flushed from another library's
// static initialiser still finds the default.
std::string& externalStorageDirectorySlot() {
    static std::string directory = "/sdcard/";
    return directory;
}
std::string externalStorageDirectory() { return externalStorageDirectorySlot(); }
}  // namespace

void File::setExternalStorageDirectory(const std::string& directory) { externalStorageDirectorySlot() = directory; }
#endif
// ---------------------------------------------------------------------------

File::File() {}

File::File(const std::string& name, bool isAsset) {
    if (isAsset) {
        load(name);
        return;
    }
    FILE* file = std::fopen(name.c_str(), "rb");
    if (!file) exitWithInvalidFileName(name, kFileOpenFailedLine, "File");
    std::fseek(file, 0, SEEK_END);
    long length = std::ftell(file);
    std::fseek(file, 0, SEEK_SET);
    // ftell fails only on streams that cannot seek; such a file reads as empty.
    if (length < 0) length = 0;
    mData.resize(static_cast<size_t>(length));
    // A short read keeps the zeros of the resize; it is not reported.
    std::fread(mData.data(), 1, mData.size(), file);
    std::fclose(file);
}

void File::load(const std::string& name) {
    AAsset* asset = AAssetManager_open(getAssetManager(), name.c_str(), AASSET_MODE_UNKNOWN);
    if (!asset) exitWithInvalidFileName(name, kAssetOpenFailedLine, "load");
    // Replaces, never appends: the size becomes exactly the asset's length.
    mData.resize(static_cast<size_t>(AAsset_getLength(asset)));
    AAsset_read(asset, mData.data(), mData.size());
    AAsset_close(asset);
}

void File::write(const void* data, unsigned int size) {
    if (size == 0) return;
    size_t oldSize = mData.size();
    mData.resize(oldSize + size);
    std::memcpy(mData.data() + oldSize, data, size);
}

void File::flush(const std::string& name, bool) {
    std::string path = externalStorageDirectory() + name;
    FILE* file = std::fopen(path.c_str(), "wb");
    // There is no error path for the caller; an unopenable path writes nothing.
    if (file) {
        std::fwrite(mData.data(), 1, mData.size(), file);
        std::fclose(file);
    }
    // Emptied in every case, capacity kept, so the object can collect the next file.
    mData.clear();
}

unsigned int File::getLength() const { return static_cast<unsigned int>(mData.size()); }

char* File::getBuffer() { return mData.data(); }

AAssetManager*& File::getAssetManager() { return gpAssetManager; }

}  // namespace vi
