#include "FakeJni.h"

#include <algorithm>
#include <cstring>

namespace vitest {

namespace {

enum Kind { kString, kIntArray, kObjectArray, kClass };

}  // namespace

struct FakeJni::Object {
    int kind;
    std::string text;              // kString; kClass and kObjectArray: the (element) class name
    std::vector<jint> ints;        // kIntArray
    std::vector<Object*> objects;  // kObjectArray
};

FakeJni::FakeJni() {
    std::memset(&mTable, 0, sizeof(mTable));
    mTable.reserved0 = this;
    mTable.GetStringUTFChars = [](JNIEnv* env, jstring string, jboolean* isCopy) -> const char* {
        FakeJni& jni = self(env);
        Object* owner = jni.find(string, kString);
        if (isCopy) *isCopy = JNI_TRUE;
        return owner ? jni.lease(jni.mUtfChars, owner, owner->text.c_str(), owner->text.size() + 1, "")
                     : jni.lease<char>(jni.mUtfChars, nullptr, nullptr, 0, "GetStringUTFChars of no string");
    };
    mTable.ReleaseStringUTFChars = [](JNIEnv* env, jstring string, const char* chars) {
        FakeJni& jni = self(env);
        if (jni.giveBack(jni.mUtfChars, chars, jni.find(string, kString), "ReleaseStringUTFChars")) delete[] chars;
    };
    mTable.GetIntArrayElements = [](JNIEnv* env, jintArray array, jboolean* isCopy) -> jint* {
        FakeJni& jni = self(env);
        Object* owner = jni.find(array, kIntArray);
        if (isCopy) *isCopy = JNI_TRUE;
        return owner ? jni.lease(jni.mElements, owner, owner->ints.data(), owner->ints.size(), "")
                     : jni.lease<jint>(jni.mElements, nullptr, nullptr, 0, "GetIntArrayElements of no int array");
    };
    mTable.ReleaseIntArrayElements = [](JNIEnv* env, jintArray array, jint* elements, jint mode) {
        FakeJni& jni = self(env);
        Object* owner = jni.find(array, kIntArray);
        auto held = std::find_if(jni.mElements.begin(), jni.mElements.end(),
                                 [&](const Lease& l) { return l.pointer == elements && l.owner == owner; });
        if (held != jni.mElements.end() && mode != JNI_ABORT)
            std::copy(elements, elements + owner->ints.size(), owner->ints.begin());
        if (mode != JNI_COMMIT && jni.giveBack(jni.mElements, elements, owner, "ReleaseIntArrayElements"))
            delete[] elements;
    };
    mTable.FindClass = [](JNIEnv* env, const char* name) { return reinterpret_cast<jclass>(self(env).make(kClass, name)); };
    mTable.NewStringUTF = [](JNIEnv* env, const char* chars) { return self(env).string(chars); };
    mTable.NewObjectArray = [](JNIEnv* env, jsize length, jclass type, jobject initial) -> jobjectArray {
        FakeJni& jni = self(env);
        Object* found = jni.find(type, kClass);
        if (!found || length < 0) {
            jni.mMisuses.push_back("NewObjectArray without a class or with a negative length");
            return nullptr;
        }
        Object* array = jni.make(kObjectArray, found->text);
        array->objects.assign(std::size_t(length), jni.find(initial, kString));
        return reinterpret_cast<jobjectArray>(array);
    };
    mTable.SetObjectArrayElement = [](JNIEnv* env, jobjectArray array, jsize index, jobject value) {
        FakeJni& jni = self(env);
        Object* found = jni.find(array, kObjectArray);
        if (!found || index < 0 || std::size_t(index) >= found->objects.size())
            jni.mMisuses.push_back("SetObjectArrayElement outside the array");
        else
            found->objects[std::size_t(index)] = jni.find(value, kString);
    };
    mEnv.functions = &mTable;
}

FakeJni::~FakeJni() {
    for (const Lease& lease : mUtfChars) delete[] static_cast<const char*>(lease.pointer);
    for (const Lease& lease : mElements) delete[] static_cast<const jint*>(lease.pointer);
}

FakeJni::Object* FakeJni::make(int kind, const std::string& text) {
    mObjects.emplace_back(new Object{kind, text, {}, {}});
    return mObjects.back().get();
}

FakeJni::Object* FakeJni::find(const void* handle, int kind) const {
    for (const std::unique_ptr<Object>& owned : mObjects)
        if (owned.get() == handle && owned->kind == kind) return owned.get();
    return nullptr;
}

jstring FakeJni::string(const std::string& text) { return reinterpret_cast<jstring>(make(kString, text)); }

jintArray FakeJni::intArray(const std::vector<jint>& values) {
    Object* array = make(kIntArray);
    array->ints = values;
    return reinterpret_cast<jintArray>(array);
}

bool FakeJni::stringArrayValues(jobjectArray array, std::vector<std::string>& values) const {
    Object* found = find(array, kObjectArray);
    if (!found || found->text != "java/lang/String") return false;
    values.clear();
    for (Object* element : found->objects) {
        if (!element) return false;
        values.push_back(element->text);
    }
    return true;
}

// A copy of `count` items (at least one, so that an empty array still gets a
// distinct lease); without an owner, a misuse and null.
template <typename T>
T* FakeJni::lease(std::vector<Lease>& leases, Object* owner, const T* from, std::size_t count, const char* what) {
    if (!owner) {
        mMisuses.push_back(what);
        return nullptr;
    }
    T* copy = new T[std::max<std::size_t>(count, 1)];
    std::copy(from, from + count, copy);
    leases.push_back(Lease{copy, owner});
    return copy;
}

bool FakeJni::giveBack(std::vector<Lease>& leases, const void* pointer, Object* owner, const char* what) {
    auto held = std::find_if(leases.begin(), leases.end(),
                             [&](const Lease& l) { return l.pointer == pointer && l.owner == owner; });
    if (held == leases.end()) {
        mMisuses.push_back(std::string(what) + " of something not handed out for that object");
        return false;
    }
    leases.erase(held);
    return true;
}

// Objects with elements still handed out stay, so that a late release finds
// its owner; only the handles die, as local references do.
void FakeJni::reset() {
    mObjects.erase(std::remove_if(mObjects.begin(), mObjects.end(),
                                  [this](const std::unique_ptr<Object>& owned) {
                                      return std::none_of(mElements.begin(), mElements.end(),
                                                          [&](const Lease& l) { return l.owner == owned.get(); });
                                  }),
                   mObjects.end());
}

}  // namespace vitest
