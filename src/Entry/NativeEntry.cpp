// The host's JNI entry points of com.tarq.android.visualeffect.common.Native.
// All but prehandleStart are thin forwarders to the static handlers; none
// attaches threads, caches the JNIEnv or keeps a reference to the Java object.
// Forwarders with an int result return 0 where the handler has none.
// loadTexture lives with the host's texture loading.
#include <jni.h>

#include <dlfcn.h>
#include <string>
#include <vector>

#include "Application/Application.h"
#include "Entry/EffectLibrary.h"

#define VI_NATIVE(method) Java_com_tarq_android_visualeffect_common_Native_##method

namespace {

// The names as a Java String[]: every slot first holds one shared empty
// string, then each is set in ascending order. An empty list gives a
// zero-length array, never null. Local references are left to the JVM.
jobjectArray toStringArray(JNIEnv* env, const std::vector<std::string>& names) {
    jclass stringClass = env->FindClass("java/lang/String");
    jobjectArray array = env->NewObjectArray(jsize(names.size()), stringClass, env->NewStringUTF(""));
    for (std::size_t i = 0; i < names.size(); ++i)
        env->SetObjectArrayElement(array, jsize(i), env->NewStringUTF(names[i].c_str()));
    return array;
}

}  // namespace

extern "C" {

JNIEXPORT jobjectArray JNICALL VI_NATIVE(prehandleStart)(JNIEnv* env, jobject, jstring libraryPath, jint width,
                                                         jint height) {
    vi::Application::handleStop();
    // Cleared before the open, so that a host asking dlerror() after a null
    // result reads this start's failure. The flip side, kept: a successful
    // start with a path already open leaves nothing there, and any error an
    // earlier call left behind is gone.
    dlerror();
    const char* path = env->GetStringUTFChars(libraryPath, nullptr);
    // On failure the UTF chars are deliberately not released; no scene is made.
    if (!vi::EffectLibrary::load(path)) return nullptr;
    env->ReleaseStringUTFChars(libraryPath, path);

    std::vector<std::string> names;
    vi::Application::handleStart(0, 0, width, height, names);
    return toStringArray(env, names);
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleInitEffect)(JNIEnv*, jobject) {
    vi::Application::handleInitEffect();
    return 0;
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleRestart)(JNIEnv*, jobject) {
    vi::Application::handleRestart();
    return 0;
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleStop)(JNIEnv*, jobject) {
    vi::Application::handleStop();
    return 0;
}

// Pausing destroys the scene exactly as stopping does: one body, two names.
JNIEXPORT jint JNICALL VI_NATIVE(prehandlePause)(JNIEnv*, jobject)
    __attribute__((alias("Java_com_tarq_android_visualeffect_common_Native_prehandleStop")));

JNIEXPORT void JNICALL VI_NATIVE(prehandleRecycleTextures)(JNIEnv*, jobject) {
    vi::Application::handleRecycleTextures();
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleDraw)(JNIEnv*, jobject) { return vi::Application::handleDraw(); }

// Any action other than 0 (down), 1 (up) and 2 (move) is ignored.
JNIEXPORT void JNICALL VI_NATIVE(prehandleTouch)(JNIEnv*, jobject, jint x, jint y, jint action) {
    switch (action) {
    case 0:
        vi::Application::handleMouseDown(x, y);
        break;
    case 1:
        vi::Application::handleMouseUp(x, y);
        break;
    case 2:
        vi::Application::handleMouseMove(x, y);
        break;
    default:
        break;
    }
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleMenuPressed)(JNIEnv*, jobject) {
    vi::Application::handleKey(0);
    return 0;
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleVolumeUpPressed)(JNIEnv*, jobject) {
    vi::Application::handleKey(1);
    return 0;
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleVolumeDownPressed)(JNIEnv*, jobject) {
    vi::Application::handleKey(2);
    return 0;
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleParam)(JNIEnv*, jobject, jint a, jint b) {
    vi::Application::handleParam(a, b);
    return 0;
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleClearEffect)(JNIEnv*, jobject) {
    vi::Application::handleClearEffect();
    return 0;
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleAffordance)(JNIEnv*, jobject) {
    vi::Application::handleAffordance();
    return 0;
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleUnlock)(JNIEnv*, jobject) {
    vi::Application::handleUnlock();
    return 0;
}

JNIEXPORT jint JNICALL VI_NATIVE(prehandleSetOrientation)(JNIEnv*, jobject, jint orientation) {
    vi::Application::handleSetOrientation(static_cast<vi::Orientation::OrientationEnum>(orientation));
    return 0;
}

// Kept for the host's interface; models come from the plug-in's own assets.
JNIEXPORT void JNICALL VI_NATIVE(loadModel)(JNIEnv*, jobject, jstring) {}

}  // extern "C"
