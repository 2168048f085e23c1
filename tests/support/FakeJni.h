#pragma once

// A JNIEnv without a Java VM, for calling the runtime's exported JNI entry
// points from C++ as the host's Java side would: a function table that fills
// only what those entry points call (strings, int arrays, object arrays),
// over plain C++ objects. Every other slot is null, so a JNI call the runtime
// is not expected to make crashes at once.
//
// Like a JVM it hands out copies: UTF chars are new[]ed copies that
// ReleaseStringUTFChars deletes, int array elements a copy that
// ReleaseIntArrayElements writes back (mode 0 or JNI_COMMIT) and deletes (0
// or JNI_ABORT). Copies are made with new[], never malloc, so that a test
// binary that wraps free sees only the runtime's own frees. It counts what was
// handed out and not given back, and notes misuse. Objects live until reset(),
// as local references live until the native method returns.

#include <jni.h>

#include <memory>
#include <string>
#include <vector>

#define VI_NATIVE(method) Java_com_tarq_android_visualeffect_common_Native_##method

// The runtime's entry points of com.tarq.android.visualeffect.common.Native.
extern "C" {
jobjectArray VI_NATIVE(prehandleStart)(JNIEnv*, jobject, jstring, jint, jint);
jint VI_NATIVE(prehandleInitEffect)(JNIEnv*, jobject);
jint VI_NATIVE(prehandleRestart)(JNIEnv*, jobject);
jint VI_NATIVE(prehandleStop)(JNIEnv*, jobject);
jint VI_NATIVE(prehandlePause)(JNIEnv*, jobject);
void VI_NATIVE(prehandleRecycleTextures)(JNIEnv*, jobject);
jint VI_NATIVE(prehandleDraw)(JNIEnv*, jobject);
void VI_NATIVE(prehandleTouch)(JNIEnv*, jobject, jint, jint, jint);
jint VI_NATIVE(prehandleMenuPressed)(JNIEnv*, jobject);
jint VI_NATIVE(prehandleVolumeUpPressed)(JNIEnv*, jobject);
jint VI_NATIVE(prehandleVolumeDownPressed)(JNIEnv*, jobject);
jint VI_NATIVE(prehandleParam)(JNIEnv*, jobject, jint, jint);
jint VI_NATIVE(prehandleClearEffect)(JNIEnv*, jobject);
jint VI_NATIVE(prehandleAffordance)(JNIEnv*, jobject);
jint VI_NATIVE(prehandleUnlock)(JNIEnv*, jobject);
jint VI_NATIVE(prehandleSetOrientation)(JNIEnv*, jobject, jint);
void VI_NATIVE(loadModel)(JNIEnv*, jobject, jstring);
void VI_NATIVE(loadTexture)(JNIEnv*, jclass, jstring, jintArray, jint, jint);
}

namespace vitest {

class FakeJni {
public:
    FakeJni();
    ~FakeJni();

    FakeJni(const FakeJni&) = delete;
    FakeJni& operator=(const FakeJni&) = delete;

    JNIEnv* env() { return &mEnv; }
    jobject thiz() { return reinterpret_cast<jobject>(&mThis); }

    // Java-side values, alive until reset().
    jstring string(const std::string& text);
    jintArray intArray(const std::vector<jint>& values);
    // The elements of a String[] made by NewObjectArray, or false if `array` is not one.
    bool stringArrayValues(jobjectArray array, std::vector<std::string>& values) const;

    // Handed out and not given back.
    int outstandingUtfChars() const { return int(mUtfChars.size()); }
    int outstandingElements() const { return int(mElements.size()); }
    // Forgets outstanding UTF chars without deleting them, as a JVM whose
    // caller never releases them would: a leak checker then sees them.
    void forgetOutstandingUtfChars() { mUtfChars.clear(); }
    // A release of something not handed out, and the like.
    const std::vector<std::string>& misuses() const { return mMisuses; }
    // Called with the JNI function's name as each call begins.
    void setObserver(void (*observer)(const char* function)) { mObserver = observer; }

    // Ends the "native call": local references die.
    void reset();

    struct Object;

private:
    static FakeJni& self(JNIEnv* env, const char* function);
    static const char* getStringUtfChars(JNIEnv* env, jstring string, jboolean* isCopy);
    static void releaseStringUtfChars(JNIEnv* env, jstring string, const char* chars);
    static jint* getIntArrayElements(JNIEnv* env, jintArray array, jboolean* isCopy);
    static void releaseIntArrayElements(JNIEnv* env, jintArray array, jint* elements, jint mode);
    static jclass findClass(JNIEnv* env, const char* name);
    static jstring newStringUtf(JNIEnv* env, const char* chars);
    static jobjectArray newObjectArray(JNIEnv* env, jsize length, jclass elementClass, jobject initial);
    static void setObjectArrayElement(JNIEnv* env, jobjectArray array, jsize index, jobject value);

    Object* make(int kind);
    Object* object(void* handle, int kind) const;

    JNINativeInterface_ mTable;
    JNIEnv mEnv;
    int mThis;
    void (*mObserver)(const char* function);
    std::vector<std::unique_ptr<Object>> mObjects;
    struct Lease {
        const void* pointer;
        Object* owner;
    };
    std::vector<Lease> mUtfChars;
    std::vector<Lease> mElements;
    std::vector<std::string> mMisuses;
};

}  // namespace vitest
