// Natives of com.tarq.test.TestHost: what a Java test needs besides the host's
// own entry points. A headless GL context made current on the calling Java
// thread (as the host's render thread has one), the runtime's key handler for
// the codes no host entry produces, the random generator, the window globals,
// the loader's pending error and a pixel of the current framebuffer.
#include <dlfcn.h>
#include <jni.h>
#include <stdlib.h>

#include <memory>

#include "Application/Application.h"
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

JNIEXPORT void JNICALL TESTHOST_NATIVE(releaseContext)(JNIEnv*, jclass) { vitest::GlContext::releaseCurrent(); }

JNIEXPORT jint JNICALL TESTHOST_NATIVE(readPixel)(JNIEnv*, jclass, jint x, jint y) {
    return jint(vitest::readPixel(x, y));
}

JNIEXPORT void JNICALL TESTHOST_NATIVE(pressKey)(JNIEnv*, jclass, jint key) {
    vi::Application::handleKey(static_cast<unsigned int>(key));
}

JNIEXPORT void JNICALL TESTHOST_NATIVE(seedRandom)(JNIEnv*, jclass, jlong seed) { srand48(long(seed)); }

JNIEXPORT jlong JNICALL TESTHOST_NATIVE(nextRandom)(JNIEnv*, jclass) { return jlong(lrand48()); }

// left, top, width, height
JNIEXPORT jintArray JNICALL TESTHOST_NATIVE(windowRectangle)(JNIEnv* env, jclass) {
    const jint values[] = {vi::ApplicationVar::msWindowLeft, vi::ApplicationVar::msWindowTop,
                           vi::ApplicationVar::msWindowWidth, vi::ApplicationVar::msWindowHeight};
    jintArray array = env->NewIntArray(4);
    env->SetIntArrayRegion(array, 0, 4, values);
    return array;
}

JNIEXPORT jboolean JNICALL TESTHOST_NATIVE(hasScene)(JNIEnv*, jclass) { return vi::gpScene != nullptr; }

// The loader's pending error, or null; reading it clears it.
JNIEXPORT jstring JNICALL TESTHOST_NATIVE(loaderError)(JNIEnv* env, jclass) {
    const char* error = dlerror();
    return error ? env->NewStringUTF(error) : nullptr;
}

}  // extern "C"
