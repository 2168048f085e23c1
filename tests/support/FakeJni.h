#pragma once

// A JNIEnv without a Java VM, for calling the runtime's JNI entry points from
// C++ as the host's Java side would. Only what those entry points call is
// filled in (strings, int arrays, String arrays); every other slot is null,
// so an unexpected JNI call crashes at once. Like a JVM it hands out copies
// (made with new[], never malloc, so that a binary wrapping free sees only the
// runtime's frees), writes int elements back on release with mode 0 or
// JNI_COMMIT, counts what was handed out and not given back, and notes misuse.
// Objects live until reset(), as local references live until the native
// method returns.

#include <jni.h>

#include <map>
#include <memory>
#include <string>
#include <vector>

#define VI_NATIVE(method) Java_com_tarq_android_visualeffect_common_Native_##method

// The runtime's entry points of com.tarq.android.visualeffect.common.Native;
// most take no argument and answer an int.
#define VI_NATIVE_PLAIN(method) jint VI_NATIVE(method)(JNIEnv*, jobject);
extern "C" {
VI_NATIVE_PLAIN(prehandleInitEffect) VI_NATIVE_PLAIN(prehandleRestart) VI_NATIVE_PLAIN(prehandleStop)
VI_NATIVE_PLAIN(prehandlePause) VI_NATIVE_PLAIN(prehandleDraw) VI_NATIVE_PLAIN(prehandleMenuPressed)
VI_NATIVE_PLAIN(prehandleVolumeUpPressed) VI_NATIVE_PLAIN(prehandleVolumeDownPressed)
VI_NATIVE_PLAIN(prehandleClearEffect) VI_NATIVE_PLAIN(prehandleAffordance) VI_NATIVE_PLAIN(prehandleUnlock)
jobjectArray VI_NATIVE(prehandleStart)(JNIEnv*, jobject, jstring, jint, jint);
void VI_NATIVE(prehandleRecycleTextures)(JNIEnv*, jobject), VI_NATIVE(loadModel)(JNIEnv*, jobject, jstring);
void VI_NATIVE(prehandleTouch)(JNIEnv*, jobject, jint, jint, jint);
jint VI_NATIVE(prehandleParam)(JNIEnv*, jobject, jint, jint);
jint VI_NATIVE(prehandleSetOrientation)(JNIEnv*, jobject, jint);
void VI_NATIVE(loadTexture)(JNIEnv*, jclass, jstring, jintArray, jint, jint);
}

namespace vitest {

class FakeJni {
public:
    FakeJni();
    ~FakeJni() {
        for (const auto& lease : mUtfChars) delete[] static_cast<const char*>(lease.first);
        for (const auto& lease : mElements) delete[] static_cast<const jint*>(lease.first);
    }
    FakeJni(const FakeJni&) = delete;
    FakeJni& operator=(const FakeJni&) = delete;

    JNIEnv* env() { return &mEnv; }
    jobject thiz() { return reinterpret_cast<jobject>(this); }
    // Java-side values, alive until reset().
    jstring string(const std::string& text) { return reinterpret_cast<jstring>(make(text, {})); }
    jintArray intArray(const std::vector<jint>& values) { return reinterpret_cast<jintArray>(make("", values)); }
    // The elements of a String[] the runtime made, or false if `array` is not one.
    bool stringArrayValues(jobjectArray array, std::vector<std::string>& values) const;

    // Handed out and not given back.
    int outstandingUtfChars() const { return int(mUtfChars.size()); }
    int outstandingElements() const { return int(mElements.size()); }
    // Forgets outstanding UTF chars without deleting them, as a JVM whose
    // caller never releases them would: a leak checker then sees them.
    void forgetOutstandingUtfChars() { mUtfChars.clear(); }
    // Releases of something not handed out, and the like.
    const std::vector<std::string>& misuses() const { return mMisuses; }
    // Ends the "native call": local references die.
    void reset();

private:
    struct Object {
        std::string text;              // a string; a class's or an object array's element class name
        std::vector<jint> ints;        // an int array
        std::vector<Object*> objects;  // an object array
    };
    using Leases = std::map<const void*, Object*>;  // copies handed out, and whose

    static FakeJni& self(JNIEnv* env) { return *static_cast<FakeJni*>(env->functions->reserved0); }
    Object* make(const std::string& text, const std::vector<jint>& ints) {
        mObjects.emplace_back(new Object{text, ints, {}});
        return mObjects.back().get();
    }
    // Any handle not made here is null: a JNI call on it then crashes at once.
    Object* find(const void* handle) const {
        for (const std::unique_ptr<Object>& owned : mObjects)
            if (owned.get() == handle) return owned.get();
        return nullptr;
    }
    template <typename T, typename Items>
    T* lend(Leases& leases, const void* handle, Items Object::*items, jboolean* isCopy);
    bool giveBack(Leases& leases, const void* copy, const void* owner, const char* what);

    JNINativeInterface_ mTable;
    JNIEnv mEnv;
    std::vector<std::unique_ptr<Object>> mObjects;
    Leases mUtfChars, mElements;
    std::vector<std::string> mMisuses;
};

}  // namespace vitest
