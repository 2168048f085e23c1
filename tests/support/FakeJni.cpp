#include "FakeJni.h"

#include <algorithm>
#include <cstring>

namespace vitest {

FakeJni::FakeJni() {
    std::memset(&mTable, 0, sizeof(mTable));
    mTable.reserved0 = this;
    mTable.GetStringUTFChars = [](JNIEnv* env, jstring string, jboolean* isCopy) -> const char* {
        Object* owner = self(env).find(string);
        if (!owner) return self(env).mMisuses.push_back("GetStringUTFChars of no string"), nullptr;
        char* copy = new char[owner->text.size() + 1];
        std::memcpy(copy, owner->text.c_str(), owner->text.size() + 1);
        if (isCopy) *isCopy = JNI_TRUE;
        return self(env).mUtfChars[copy] = owner, copy;
    };
    mTable.ReleaseStringUTFChars = [](JNIEnv* env, jstring string, const char* chars) {
        if (self(env).giveBack(self(env).mUtfChars, chars, string, "ReleaseStringUTFChars")) delete[] chars;
    };
    mTable.GetIntArrayElements = [](JNIEnv* env, jintArray array, jboolean* isCopy) -> jint* {
        Object* owner = self(env).find(array);
        if (!owner) return self(env).mMisuses.push_back("GetIntArrayElements of no int array"), nullptr;
        jint* copy = new jint[owner->ints.size() + 1];  // never empty: each lease is a distinct pointer
        std::copy(owner->ints.begin(), owner->ints.end(), copy);
        if (isCopy) *isCopy = JNI_TRUE;
        return self(env).mElements[copy] = owner, copy;
    };
    // Mode 0 writes back and releases, JNI_COMMIT only writes back, JNI_ABORT only releases.
    mTable.ReleaseIntArrayElements = [](JNIEnv* env, jintArray array, jint* elements, jint mode) {
        FakeJni& jni = self(env);
        auto held = jni.mElements.find(elements);
        if (held != jni.mElements.end() && held->second == static_cast<void*>(array) && mode != JNI_ABORT)
            std::copy(elements, elements + held->second->ints.size(), held->second->ints.begin());
        if (mode != JNI_COMMIT && jni.giveBack(jni.mElements, elements, array, "ReleaseIntArrayElements"))
            delete[] elements;
    };
    mTable.FindClass = [](JNIEnv* env, const char* name) { return reinterpret_cast<jclass>(self(env).make(name)); };
    mTable.NewStringUTF = [](JNIEnv* env, const char* chars) { return self(env).string(chars); };
    mTable.NewObjectArray = [](JNIEnv* env, jsize length, jclass type, jobject initial) -> jobjectArray {
        Object* found = self(env).find(type);
        if (!found || length < 0) return self(env).mMisuses.push_back("NewObjectArray of no class"), nullptr;
        Object* array = self(env).make(found->text);
        array->objects.assign(std::size_t(length), self(env).find(initial));
        return reinterpret_cast<jobjectArray>(array);
    };
    mTable.SetObjectArrayElement = [](JNIEnv* env, jobjectArray array, jsize index, jobject value) {
        Object* found = self(env).find(array);
        if (!found || index < 0 || std::size_t(index) >= found->objects.size())
            return self(env).mMisuses.push_back("SetObjectArrayElement outside the array");
        found->objects[std::size_t(index)] = self(env).find(value);
    };
    mEnv.functions = &mTable;
}

FakeJni::~FakeJni() {
    for (const auto& lease : mUtfChars) delete[] static_cast<const char*>(lease.first);
    for (const auto& lease : mElements) delete[] static_cast<const jint*>(lease.first);
}

FakeJni::Object* FakeJni::make(const std::string& text) {
    mObjects.emplace_back(new Object{text, {}, {}});
    return mObjects.back().get();
}

FakeJni::Object* FakeJni::find(const void* handle) const {
    for (const std::unique_ptr<Object>& owned : mObjects)
        if (owned.get() == handle) return owned.get();
    return nullptr;
}

bool FakeJni::giveBack(std::map<const void*, Object*>& leases, const void* copy, const void* owner, const char* what) {
    auto held = leases.find(copy);
    if (held == leases.end() || held->second != owner)
        return mMisuses.push_back(std::string(what) + " of something not handed out for that object"), false;
    leases.erase(held);
    return true;
}

jstring FakeJni::string(const std::string& text) { return reinterpret_cast<jstring>(make(text)); }

jintArray FakeJni::intArray(const std::vector<jint>& values) {
    Object* array = make("");
    array->ints = values;
    return reinterpret_cast<jintArray>(array);
}

bool FakeJni::stringArrayValues(jobjectArray array, std::vector<std::string>& values) const {
    Object* found = find(array);
    if (!found || found->text != "java/lang/String") return false;
    values.clear();
    for (Object* element : found->objects)
        if (element) values.push_back(element->text);
    return values.size() == found->objects.size();
}

// Objects with elements still handed out stay, so that a late release finds
// its owner; only the handles die, as local references do.
void FakeJni::reset() {
    mObjects.erase(std::remove_if(mObjects.begin(), mObjects.end(),
                                  [this](const std::unique_ptr<Object>& owned) {
                                      return std::none_of(mElements.begin(), mElements.end(),
                                                          [&](const auto& l) { return l.second == owned.get(); });
                                  }),
                   mObjects.end());
}

}  // namespace vitest
