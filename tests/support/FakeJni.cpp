#include "FakeJni.h"

#include <algorithm>
#include <cstring>

namespace vitest {

namespace {

enum Kind { kString, kIntArray, kObjectArray, kClass };

}  // namespace

struct FakeJni::Object {
    int kind;
    std::string text;              // kString; kClass: the class name
    std::vector<jint> ints;        // kIntArray
    std::vector<Object*> objects;  // kObjectArray
    std::string elementClass;      // kObjectArray
};

FakeJni::FakeJni() : mThis(0), mObserver(nullptr) {
    std::memset(&mTable, 0, sizeof(mTable));
    // The table is reached through env->functions; the slots not filled stay null.
    mTable.reserved0 = this;
    mTable.GetStringUTFChars = getStringUtfChars;
    mTable.ReleaseStringUTFChars = releaseStringUtfChars;
    mTable.GetIntArrayElements = getIntArrayElements;
    mTable.ReleaseIntArrayElements = releaseIntArrayElements;
    mTable.FindClass = findClass;
    mTable.NewStringUTF = newStringUtf;
    mTable.NewObjectArray = newObjectArray;
    mTable.SetObjectArrayElement = setObjectArrayElement;
    mEnv.functions = &mTable;
}

FakeJni::~FakeJni() {
    for (const Lease& lease : mUtfChars) delete[] static_cast<const char*>(lease.pointer);
    for (const Lease& lease : mElements) delete[] static_cast<const jint*>(lease.pointer);
}

FakeJni& FakeJni::self(JNIEnv* env, const char* function) {
    FakeJni& jni = *static_cast<FakeJni*>(env->functions->reserved0);
    if (jni.mObserver) jni.mObserver(function);
    return jni;
}

FakeJni::Object* FakeJni::make(int kind) {
    mObjects.emplace_back(new Object());
    mObjects.back()->kind = kind;
    return mObjects.back().get();
}

FakeJni::Object* FakeJni::object(void* handle, int kind) const {
    for (const std::unique_ptr<Object>& owned : mObjects)
        if (owned.get() == handle && owned->kind == kind) return owned.get();
    return nullptr;
}

jstring FakeJni::string(const std::string& text) {
    Object* object = make(kString);
    object->text = text;
    return reinterpret_cast<jstring>(object);
}

jintArray FakeJni::intArray(const std::vector<jint>& values) {
    Object* object = make(kIntArray);
    object->ints = values;
    return reinterpret_cast<jintArray>(object);
}

bool FakeJni::stringArrayValues(jobjectArray array, std::vector<std::string>& values) const {
    Object* found = object(array, kObjectArray);
    if (!found || found->elementClass != "java/lang/String") return false;
    values.clear();
    for (Object* element : found->objects) {
        if (!element || element->kind != kString) return false;
        values.push_back(element->text);
    }
    return true;
}

void FakeJni::reset() {
    // Objects with elements still handed out stay, so that a late release
    // finds its owner; only the handles die, as local references do.
    mObjects.erase(std::remove_if(mObjects.begin(), mObjects.end(),
                                  [this](const std::unique_ptr<Object>& owned) {
                                      for (const Lease& lease : mElements)
                                          if (lease.owner == owned.get()) return false;
                                      return true;
                                  }),
                   mObjects.end());
}

const char* FakeJni::getStringUtfChars(JNIEnv* env, jstring string, jboolean* isCopy) {
    FakeJni& jni = self(env, "GetStringUTFChars");
    Object* found = jni.object(string, kString);
    if (!found) {
        jni.mMisuses.push_back("GetStringUTFChars of something not a string");
        return nullptr;
    }
    char* chars = new char[found->text.size() + 1];
    std::memcpy(chars, found->text.c_str(), found->text.size() + 1);
    jni.mUtfChars.push_back(Lease{chars, found});
    if (isCopy) *isCopy = JNI_TRUE;
    return chars;
}

void FakeJni::releaseStringUtfChars(JNIEnv* env, jstring string, const char* chars) {
    FakeJni& jni = self(env, "ReleaseStringUTFChars");
    auto lease = std::find_if(jni.mUtfChars.begin(), jni.mUtfChars.end(),
                              [chars](const Lease& l) { return l.pointer == chars; });
    if (lease == jni.mUtfChars.end() || lease->owner != jni.object(string, kString)) {
        jni.mMisuses.push_back("ReleaseStringUTFChars of chars not handed out for that string");
        return;
    }
    delete[] chars;
    jni.mUtfChars.erase(lease);
}

jint* FakeJni::getIntArrayElements(JNIEnv* env, jintArray array, jboolean* isCopy) {
    FakeJni& jni = self(env, "GetIntArrayElements");
    Object* found = jni.object(array, kIntArray);
    if (!found) {
        jni.mMisuses.push_back("GetIntArrayElements of something not an int array");
        return nullptr;
    }
    // At least one element, so that an empty array still gives a distinct lease.
    jint* elements = new jint[std::max<std::size_t>(found->ints.size(), 1)];
    std::copy(found->ints.begin(), found->ints.end(), elements);
    jni.mElements.push_back(Lease{elements, found});
    if (isCopy) *isCopy = JNI_TRUE;
    return elements;
}

void FakeJni::releaseIntArrayElements(JNIEnv* env, jintArray array, jint* elements, jint mode) {
    FakeJni& jni = self(env, "ReleaseIntArrayElements");
    auto lease = std::find_if(jni.mElements.begin(), jni.mElements.end(),
                              [elements](const Lease& l) { return l.pointer == elements; });
    if (lease == jni.mElements.end() || lease->owner != jni.object(array, kIntArray)) {
        jni.mMisuses.push_back("ReleaseIntArrayElements of elements not handed out for that array");
        return;
    }
    Object* owner = lease->owner;
    if (mode == 0 || mode == JNI_COMMIT) std::copy(elements, elements + owner->ints.size(), owner->ints.begin());
    if (mode == 0 || mode == JNI_ABORT) {
        delete[] elements;
        jni.mElements.erase(lease);
    }
}

jclass FakeJni::findClass(JNIEnv* env, const char* name) {
    Object* object = self(env, "FindClass").make(kClass);
    object->text = name;
    return reinterpret_cast<jclass>(object);
}

jstring FakeJni::newStringUtf(JNIEnv* env, const char* chars) { return self(env, "NewStringUTF").string(chars); }

jobjectArray FakeJni::newObjectArray(JNIEnv* env, jsize length, jclass elementClass, jobject initial) {
    FakeJni& jni = self(env, "NewObjectArray");
    Object* type = jni.object(elementClass, kClass);
    if (!type || length < 0) {
        jni.mMisuses.push_back("NewObjectArray without a class or with a negative length");
        return nullptr;
    }
    Object* array = jni.make(kObjectArray);
    array->elementClass = type->text;
    array->objects.assign(std::size_t(length), static_cast<Object*>(static_cast<void*>(initial)));
    return reinterpret_cast<jobjectArray>(array);
}

void FakeJni::setObjectArrayElement(JNIEnv* env, jobjectArray array, jsize index, jobject value) {
    FakeJni& jni = self(env, "SetObjectArrayElement");
    Object* found = jni.object(array, kObjectArray);
    if (!found || index < 0 || std::size_t(index) >= found->objects.size()) {
        jni.mMisuses.push_back("SetObjectArrayElement outside the array");
        return;
    }
    found->objects[std::size_t(index)] = static_cast<Object*>(static_cast<void*>(value));
}

}  // namespace vitest
