// Natives of com.tarq.test.HostTextureProbe: a test-only look into the
// textures the host's texture loading files, for the JVM tests of it. Reads
// the shared map and the texture registry of the runtime it is linked to (the
// one the host's Native class talks to) and never dereferences an entry that
// may be stale unless asked for a live one.
#include <jni.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include "Application/ApplicationVar.h"
#include "Render/GL.h"
#include "Render/Texture.h"

#define PROBE_NATIVE(method) Java_com_tarq_test_HostTextureProbe_##method

namespace {

// Larger than the allocator's largest mmap threshold, so it is a mapping of
// its own and freeing it unmaps it.
constexpr std::size_t kLargeBufferBytes = std::size_t(64) << 20;

std::string nameOf(JNIEnv* env, jstring name) {
    const char* chars = env->GetStringUTFChars(name, nullptr);
    std::string result(chars);
    env->ReleaseStringUTFChars(name, chars);
    return result;
}

// The entry's pointer, or null when the name is absent; never files the name.
vi::Texture* entry(JNIEnv* env, jstring name) {
    const auto found = vi::ApplicationVar::msTexturesMap.find(nameOf(env, name));
    return found == vi::ApplicationVar::msTexturesMap.end() ? nullptr : found->second;
}

jbyteArray byteArray(JNIEnv* env, const void* bytes, std::size_t size) {
    jbyteArray array = env->NewByteArray(jsize(size));
    if (size) env->SetByteArrayRegion(array, 0, jsize(size), static_cast<const jbyte*>(bytes));
    return array;
}

}  // namespace

extern "C" {

// 0: absent, 1: filed with a null pointer, 2: filed with a pointer.
JNIEXPORT jint JNICALL PROBE_NATIVE(entryState)(JNIEnv* env, jclass, jstring name) {
    const auto found = vi::ApplicationVar::msTexturesMap.find(nameOf(env, name));
    if (found == vi::ApplicationVar::msTexturesMap.end()) return 0;
    return found->second ? 2 : 1;
}

JNIEXPORT jlong JNICALL PROBE_NATIVE(entryAddress)(JNIEnv* env, jclass, jstring name) {
    return jlong(reinterpret_cast<std::uintptr_t>(entry(env, name)));
}

JNIEXPORT jboolean JNICALL PROBE_NATIVE(isRegistered)(JNIEnv*, jclass, jlong address) {
    const std::vector<vi::Texture*>& all = vi::Texture::mAllTextures;
    return std::any_of(all.begin(), all.end(), [address](vi::Texture* texture) {
        return jlong(reinterpret_cast<std::uintptr_t>(texture)) == address;
    });
}

// The rest take a name filed with a live texture.

// width, height, deletable, uploaded, GL name, static, repeat, mirrored,
// linear, compressed, internal format, format, pixel type, kind
JNIEXPORT jintArray JNICALL PROBE_NATIVE(state)(JNIEnv* env, jclass, jstring name) {
    const vi::Texture& t = *entry(env, name);
    const jint values[] = {jint(t.mWidth), jint(t.mHeight), t.mIsDeletable, t.mIsUploaded, jint(t.mId),
                           t.mIsStatic, t.mIsRepeat, t.mIsMirrored, t.mIsLinear, t.mIsCompressed,
                           jint(t.mInternalFormat), jint(t.mFormat), jint(t.mPixelType), jint(t.mKind)};
    const jsize count = jsize(sizeof(values) / sizeof(values[0]));
    jintArray array = env->NewIntArray(count);
    env->SetIntArrayRegion(array, 0, count, values);
    return array;
}

// size x, size y, texel size x, texel size y
JNIEXPORT jfloatArray JNICALL PROBE_NATIVE(sizes)(JNIEnv* env, jclass, jstring name) {
    const vi::Texture& t = *entry(env, name);
    const jfloat values[] = {t.mSize.x, t.mSize.y, t.mTexelSize.x, t.mTexelSize.y};
    jfloatArray array = env->NewFloatArray(4);
    env->SetFloatArrayRegion(array, 0, 4, values);
    return array;
}

// The client-side buffer, width x height x 4 bytes.
JNIEXPORT jbyteArray JNICALL PROBE_NATIVE(bufferBytes)(JNIEnv* env, jclass, jstring name) {
    const vi::Texture& t = *entry(env, name);
    return byteArray(env, t.mBuffer, std::size_t(t.mWidth) * t.mHeight * 4);
}

// What the scene does before it binds a texture the host loaded.
JNIEXPORT void JNICALL PROBE_NATIVE(allocate)(JNIEnv* env, jclass, jstring name) { entry(env, name)->allocate(); }

// Gives the texture a large buffer of its own in place of the one it holds, so
// that whether a replacement frees it can be seen from outside.
JNIEXPORT jlong JNICALL PROBE_NATIVE(adoptLargeBuffer)(JNIEnv* env, jclass, jstring name) {
    vi::Texture& t = *entry(env, name);
    if (t.mIsDeletable) std::free(t.mBuffer);
    t.mBuffer = std::malloc(kLargeBufferBytes);
    return jlong(reinterpret_cast<std::uintptr_t>(t.mBuffer));
}

// Whether the pages of a buffer from adoptLargeBuffer are still mapped.
JNIEXPORT jboolean JNICALL PROBE_NATIVE(isLargeBufferMapped)(JNIEnv*, jclass, jlong address) {
    const std::uintptr_t page = std::uintptr_t(sysconf(_SC_PAGESIZE));
    void* start = reinterpret_cast<void*>(std::uintptr_t(address) & ~(page - 1));
    return !(msync(start, page, MS_ASYNC) == -1 && errno == ENOMEM);
}

// The GL texture's pixels, width x height RGBA bytes, read back through a framebuffer.
JNIEXPORT jbyteArray JNICALL PROBE_NATIVE(readTexture)(JNIEnv* env, jclass, jstring name) {
    const vi::Texture& t = *entry(env, name);
    std::vector<unsigned char> pixels(std::size_t(t.mWidth) * t.mHeight * 4);
    GLuint framebuffer = 0;
    glGenFramebuffers(1, &framebuffer);
    glBindFramebuffer(GL_FRAMEBUFFER, framebuffer);
    glFramebufferTexture2D(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, t.mId, 0);
    const bool complete = glCheckFramebufferStatus(GL_FRAMEBUFFER) == GL_FRAMEBUFFER_COMPLETE;
    if (complete) {
        glPixelStorei(GL_PACK_ALIGNMENT, 1);
        glReadPixels(0, 0, GLsizei(t.mWidth), GLsizei(t.mHeight), GL_RGBA, GL_UNSIGNED_BYTE, pixels.data());
    }
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
    glDeleteFramebuffers(1, &framebuffer);
    return complete ? byteArray(env, pixels.data(), pixels.size()) : nullptr;
}

}  // extern "C"
