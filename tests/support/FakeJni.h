#pragma once

// A JNIEnv without a Java VM, for calling the runtime's JNI entry points from
// C++ as the host's Java side would. Only what those entry points call is
// filled in (strings, int arrays, String arrays made empty); every other slot is null,
// so an unexpected JNI call crashes at once. Like a JVM it hands out copies
// of string chars and array elements and counts those not given back.
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
void VI_NATIVE(prehandleRecycleTextures)(JNIEnv*, jobject);
void VI_NATIVE(prehandleTouch)(JNIEnv*, jobject, jint, jint, jint);
jint VI_NATIVE(prehandleParam)(JNIEnv*, jobject, jint, jint);
jint VI_NATIVE(prehandleSetOrientation)(JNIEnv*, jobject, jint);
void VI_NATIVE(loadTexture)(JNIEnv*, jclass, jstring, jintArray, jint, jint);
}

namespace vitest {

class FakeJni {
public:
    FakeJni() {
        mTable.reserved0 = this;
        mTable.GetStringUTFChars = [](JNIEnv* env, jstring string, jboolean*) {
            const std::string& text = self(env).mObjects.at(string)->text;
            return static_cast<const char*>(self(env).lend(text.data(), text.size()));
        };
        mTable.ReleaseStringUTFChars = [](JNIEnv* env, jstring, const char* chars) { self(env).mLeases.erase(chars); };
        mTable.GetIntArrayElements = [](JNIEnv* env, jintArray array, jboolean*) {
            const std::vector<jint>& ints = self(env).mObjects.at(array)->ints;
            return static_cast<jint*>(self(env).lend(ints.data(), ints.size() * sizeof(jint)));
        };
        mTable.ReleaseIntArrayElements = [](JNIEnv* env, jintArray, jint* p, jint) { self(env).mLeases.erase(p); };
        mTable.FindClass = [](JNIEnv* env, const char* name) { return jclass(self(env).string(name)); };
        mTable.NewStringUTF = [](JNIEnv* env, const char* chars) { return self(env).string(chars); };
        // An object array keeps nothing: no test reads its elements.
        mTable.NewObjectArray = [](JNIEnv* env, jsize, jclass, jobject) { return jobjectArray(self(env).string("")); };
        mTable.SetObjectArrayElement = [](JNIEnv*, jobjectArray, jsize, jobject) {};
        mEnv.functions = &mTable;
    }

    JNIEnv* env() { return &mEnv; }
    // Java-side values, alive until reset().
    jstring string(const std::string& text) { return reinterpret_cast<jstring>(make(text, {})); }
    jintArray intArray(const std::vector<jint>& values) { return reinterpret_cast<jintArray>(make("", values)); }
    // String chars and array elements handed out and not given back.
    int outstanding() const { return int(mLeases.size()); }
    // Ends the "native call": local references die.
    void reset() { mObjects.clear(); }

private:
    struct Object {
        std::string text;        // a string, or a class's name
        std::vector<jint> ints;  // an int array
    };

    static FakeJni& self(JNIEnv* env) { return *static_cast<FakeJni*>(env->functions->reserved0); }
    Object* make(const std::string& text, const std::vector<jint>& ints) {
        Object* object = new Object{text, ints};
        mObjects[object].reset(object);
        return object;
    }
    // A copy of `size` bytes with a zero after them (a string's terminator),
    // noted as handed out.
    void* lend(const void* bytes, std::size_t size) {
        std::unique_ptr<std::string> copy(new std::string(static_cast<const char*>(bytes), size));
        void* address = &(*copy)[0];
        mLeases[address] = std::move(copy);
        return address;
    }

    JNINativeInterface_ mTable = {};  // every slot not filled in null
    JNIEnv mEnv;
    std::map<const void*, std::unique_ptr<Object>> mObjects;  // by handle: a handle not made here throws at once
    std::map<const void*, std::unique_ptr<std::string>> mLeases;  // by the address handed out
};

}  // namespace vitest
