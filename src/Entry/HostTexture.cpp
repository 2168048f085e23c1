// The host's texture loading: images handed in as Java int pixels, filed by
// name in the shared textures map for the scene to find. Takes no lock, on
// purpose: the host calls it on its render thread and never while another
// thread is inside a handler. Runs the context check first because the
// replace path uploads through GL at once.
#include <jni.h>

#include <cstdlib>
#include <string>

#include "Application/ApplicationVar.h"
#include "Application/ContextRecovery.h"
#include "Application/Scene.h"
#include "Entry/HostImage.h"
#include "Render/NamedValues.h"
#include "Render/Texture.h"

namespace {

// A host image as a texture: uploaded once, plain repeat, linear, RGBA bytes.
// No GL work: the context recovery or the scene allocates it before first use.
void fileNewTexture(const std::string& name, void* buffer, unsigned int width, unsigned int height) {
    using namespace vi::TextureArgument;
    vi::ApplicationVar::msTexturesMap[name] = new vi::Texture(buffer, width, height, kUploadOnce, kRepeat,
                                                              kNotMirrored, kLinear, kNotCompressed, kRgba, kBytes);
    vi::ApplicationVar::msTexturesMap[name]->setDeletable(true);
}

// The deletable flag stays as it was; only this path tells the scene.
void replaceAndTellTheScene(vi::Texture& texture, void* buffer, unsigned int width, unsigned int height) {
    texture.replacePixels(buffer, width, height);
    if (vi::gpScene) vi::gpScene->textureUpdated();
}

// The entry is neither erased nor reset: it keeps the pointer to the deleted
// texture, on purpose. A later load of the same name would take that stale
// pointer for a filed texture and replace the pixels of freed memory, so the
// host unloads a name only when it will load it no more.
void unload(const std::string& name) {
    vi::Texture* texture = vi::ApplicationVar::msTexturesMap[name];
    if (texture) delete texture;
}

}  // namespace

extern "C" JNIEXPORT void JNICALL Java_com_tarq_android_visualeffect_common_Native_loadTexture(
    JNIEnv* env, jclass, jstring name, jintArray pixels, jint width, jint height) {
    vi::ContextRecovery::recoverIfContextChanged();
    const char* chars = env->GetStringUTFChars(name, nullptr);
    const std::string key(chars);

    if (!pixels) {
        unload(key);
    } else {
        // Nothing is checked: not malloc, not the array's length against the size.
        const unsigned int w = static_cast<unsigned int>(width);
        const unsigned int h = static_cast<unsigned int>(height);
        const unsigned int count = w * h;
        void* buffer = std::malloc(std::size_t(count) * 4);
        jint* elements = env->GetIntArrayElements(pixels, nullptr);
        // The host's own array is converted too: released with mode 0 below,
        // it is left with red and blue exchanged, as the host expects.
        vi::HostImage::toTextureBytes(elements, buffer, count);

        vi::Texture* filed = vi::ApplicationVar::msTexturesMap[key];
        if (!filed)
            fileNewTexture(key, buffer, w, h);
        else
            replaceAndTellTheScene(*filed, buffer, w, h);
        env->ReleaseIntArrayElements(pixels, elements, 0);
    }

    env->ReleaseStringUTFChars(name, chars);
}
