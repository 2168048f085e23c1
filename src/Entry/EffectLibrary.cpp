#include "Entry/EffectLibrary.h"

#include <dlfcn.h>

#include <cstring>

#include "Application/ApplicationVar.h"

namespace vi {

namespace {

// Immediate binding, local symbols. The device's loader takes mode 0 as
// exactly that; glibc refuses 0 and needs it spelt out.
#if defined(__ANDROID__)
const int kEffectOpenMode = 0;
#else
const int kEffectOpenMode = RTLD_NOW | RTLD_LOCAL;
#endif

}  // namespace

std::string EffectLibrary::mPath;
void* EffectLibrary::mHandle = nullptr;

bool EffectLibrary::load(const char* path) {
    if (!mPath.empty()) {
        const std::size_t length = std::strlen(path);
        if (length == mPath.size() && std::memcmp(path, mPath.data(), length) == 0) {
            // Same plug-in: neither opened nor looked up again, so
            // gCreateScene keeps whatever value it has.
            if (mHandle) return true;
        } else {
            mHandle = nullptr;
        }
    } else if (mHandle) {
        // Only after a successful load of an empty path. This asymmetry with
        // the comparison above is kept as it is.
        return true;
    }

    mPath = path;
    mHandle = dlopen(path, kEffectOpenMode);
    if (!mHandle) return false;
    // A missing factory leaves the handle remembered: the same path given
    // again skips the lookup and starts with a null factory.
    gCreateScene = reinterpret_cast<CreateSceneFunction>(dlsym(mHandle, "createScene"));
    return gCreateScene != nullptr;
}

}  // namespace vi
