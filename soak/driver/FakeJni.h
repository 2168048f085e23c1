#pragma once

// A JNIEnv without a Java VM: a function table that implements only what the
// runtime's entry points call (strings, int arrays, object arrays), over
// plain C++ objects, so that a C++ driver can call the exported JNI functions
// exactly as the host's Java side would. Every other slot of the table is
// null: a call the runtime is not expected to make crashes at once.
//
// Like a JVM it hands out copies: UTF chars are malloc'ed copies that
// ReleaseStringUTFChars frees, and int array elements are a copy that
// ReleaseIntArrayElements writes back (mode 0 or JNI_COMMIT) and frees (0 or
// JNI_ABORT). It counts what was handed out and not yet given back.
// References are never freed before the env's reset(), as local references
// live until the native method returns.

#include <jni.h>

#include <memory>
#include <string>
#include <vector>

namespace visoak {

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
    std::vector<jint> intArrayValues(jintArray array) const;
    // The elements of a String[] made by NewObjectArray, or false if `array`
    // is not one.
    bool stringArrayValues(jobjectArray array, std::vector<std::string>& values) const;

    // Outstanding UTF chars and array elements: handed out, not released.
    int outstandingUtfChars() const { return int(mUtfChars.size()); }
    int outstandingElements() const { return int(mElements.size()); }
    // Frees outstanding UTF chars without a release, as a leak would never be,
    // so that a run with a leak checker reports only what it should.
    void dropOutstandingUtfChars();
    // Forgets outstanding UTF chars without freeing them, as a JVM whose
    // caller never releases them would: the leak checker then sees them.
    void forgetOutstandingUtfChars() { mUtfChars.clear(); }
    // Faults of use: a release of something not handed out, and so on.
    const std::vector<std::string>& misuses() const { return mMisuses; }
    void clearMisuses() { mMisuses.clear(); }

    // Ends the "native call": local references die.
    void reset();

    struct Object;

private:
    static FakeJni& self(JNIEnv* env);
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
    std::vector<std::unique_ptr<Object>> mObjects;
    struct Lease {
        const void* pointer;
        Object* owner;
    };
    std::vector<Lease> mUtfChars;
    std::vector<Lease> mElements;
    std::vector<std::string> mMisuses;
};

}  // namespace visoak
