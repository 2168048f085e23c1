// Natives of com.tarq.test.TestHost: what a Java test needs besides the host's
// own entry points. A headless GL context made current on the calling Java
// thread (as the host's render thread has one), whether there is a scene, the
// loader's pending error and a pixel of the current framebuffer.
#include <dlfcn.h>
#include <jni.h>

#include <memory>

#include "Application/ApplicationVar.h"
#include "GlContext.h"

#define TESTHOST_NATIVE(method) Java_com_tarq_test_TestHost_##method

namespace {
std::unique_ptr<vitest::GlContext> gContext;
}

extern "C" {

JNIEXPORT void JNICALL TESTHOST_NATIVE(makeContextCurrent)(JNIEnv*, jclass, jint width, jint height) {
    if (!gContext) gContext.reset(new vitest::GlContext(width, height));
    gContext->makeCurrent();
}

JNIEXPORT jint JNICALL TESTHOST_NATIVE(readPixel)(JNIEnv*, jclass, jint x, jint y) {
    return jint(vitest::readPixel(x, y));
}

JNIEXPORT jboolean JNICALL TESTHOST_NATIVE(hasScene)(JNIEnv*, jclass) { return vi::gpScene != nullptr; }

// The loader's pending error, or null; reading it clears it.
JNIEXPORT jstring JNICALL TESTHOST_NATIVE(loaderError)(JNIEnv* env, jclass) {
    const char* error = dlerror();
    return error ? env->NewStringUTF(error) : nullptr;
}

}  // extern "C"
