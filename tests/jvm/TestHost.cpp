// What NativeTest needs besides the host's entry points: a headless GL
// context current on the calling Java thread (as the host's render thread has
// one) and the loader's pending error.
#include <dlfcn.h>
#include <jni.h>

#include "GlContext.h"

extern "C" {

JNIEXPORT void JNICALL Java_com_tarq_test_NativeTest_makeContextCurrent(JNIEnv*, jclass) {
    static vitest::GlContext* context = new vitest::GlContext(64, 64);
    context->makeCurrent();
}

JNIEXPORT jstring JNICALL Java_com_tarq_test_NativeTest_loaderError(JNIEnv* env, jclass) {
    const char* error = dlerror();
    return error ? env->NewStringUTF(error) : nullptr;
}

}  // extern "C"
