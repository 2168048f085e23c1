#pragma once

// The runtime's exported JNI entry points, as the host's Java class reaches
// them; the soak calls them directly with its own JNIEnv.

#include <jni.h>

#define VI_SOAK_NATIVE(method) Java_com_tarq_android_visualeffect_common_Native_##method

extern "C" {
jobjectArray VI_SOAK_NATIVE(prehandleStart)(JNIEnv*, jobject, jstring, jint, jint);
jint VI_SOAK_NATIVE(prehandleInitEffect)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandleRestart)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandleStop)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandlePause)(JNIEnv*, jobject);
void VI_SOAK_NATIVE(prehandleRecycleTextures)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandleDraw)(JNIEnv*, jobject);
void VI_SOAK_NATIVE(prehandleTouch)(JNIEnv*, jobject, jint, jint, jint);
jint VI_SOAK_NATIVE(prehandleMenuPressed)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandleVolumeUpPressed)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandleVolumeDownPressed)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandleParam)(JNIEnv*, jobject, jint, jint);
jint VI_SOAK_NATIVE(prehandleClearEffect)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandleAffordance)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandleUnlock)(JNIEnv*, jobject);
jint VI_SOAK_NATIVE(prehandleSetOrientation)(JNIEnv*, jobject, jint);
void VI_SOAK_NATIVE(loadModel)(JNIEnv*, jobject, jstring);
void VI_SOAK_NATIVE(loadTexture)(JNIEnv*, jclass, jstring, jintArray, jint, jint);
}
