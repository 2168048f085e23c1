#include "FakeJni.h"

#include <algorithm>
#include <cstring>

namespace vitest {

FakeJni::FakeJni() {
    std::memset(&mTable, 0, sizeof(mTable));
    mTable.reserved0 = this;
    mTable.GetStringUTFChars = [](JNIEnv* env, jstring string, jboolean* isCopy) -> const char* {
        return self(env).lend<char>(self(env).mUtfChars, string, &Object::text, isCopy);
    };
    mTable.ReleaseStringUTFChars = [](JNIEnv* env, jstring string, const char* chars) {
        if (self(env).giveBack(self(env).mUtfChars, chars, string, "ReleaseStringUTFChars")) delete[] chars;
    };
    mTable.GetIntArrayElements = [](JNIEnv* env, jintArray array, jboolean* isCopy) {
        return self(env).lend<jint>(self(env).mElements, array, &Object::ints, isCopy);
    };
    // Every mode as 0, the one the runtime uses: written back and released.
    mTable.ReleaseIntArrayElements = [](JNIEnv* env, jintArray array, jint* elements, jint) {
        if (!self(env).giveBack(self(env).mElements, elements, array, "ReleaseIntArrayElements")) return;
        std::copy(elements, elements + self(env).find(array)->ints.size(), self(env).find(array)->ints.begin());
        delete[] elements;
    };
    mTable.FindClass = [](JNIEnv* env, const char* name) { return reinterpret_cast<jclass>(self(env).make(name, {})); };
    mTable.NewStringUTF = [](JNIEnv* env, const char* chars) { return self(env).string(chars); };
    mTable.NewObjectArray = [](JNIEnv* env, jsize length, jclass type, jobject initial) {
        Object* array = self(env).make(self(env).find(type)->text, {});
        array->objects.assign(std::size_t(length), self(env).find(initial));
        return reinterpret_cast<jobjectArray>(array);
    };
    mTable.SetObjectArrayElement = [](JNIEnv* env, jobjectArray array, jsize index, jobject value) {
        self(env).find(array)->objects.at(std::size_t(index)) = self(env).find(value);
    };
    mEnv.functions = &mTable;
}

// A copy of the object's items (one more, zeroed: a string's terminator, and
// never an empty lease), noted as handed out.
template <typename T, typename Items>
T* FakeJni::lend(Leases& leases, const void* handle, Items Object::*items, jboolean* isCopy) {
    const Items& from = find(handle)->*items;
    T* copy = new T[from.size() + 1]();
    std::copy(from.begin(), from.end(), copy);
    if (isCopy) *isCopy = JNI_TRUE;
    return leases[copy] = find(handle), copy;
}

bool FakeJni::giveBack(Leases& leases, const void* copy, const void* owner, const char* what) {
    auto held = leases.find(copy);
    if (held == leases.end() || held->second != owner)
        return mMisuses.push_back(std::string(what) + " of something not handed out for that object"), false;
    leases.erase(held);
    return true;
}

bool FakeJni::stringArrayValues(jobjectArray array, std::vector<std::string>& values) const {
    Object* found = find(array);
    if (!found || found->text != "java/lang/String") return false;
    values.clear();
    for (Object* element : found->objects) values.push_back(element ? element->text : "(null)");
    return std::count(found->objects.begin(), found->objects.end(), nullptr) == 0;
}

// Objects with elements still handed out stay, so that a late release finds
// its owner; only the handles die, as local references do.
void FakeJni::reset() {
    auto leased = [this](const std::unique_ptr<Object>& owned) {
        return std::any_of(mElements.begin(), mElements.end(), [&](const auto& l) { return l.second == owned.get(); });
    };
    mObjects.erase(std::stable_partition(mObjects.begin(), mObjects.end(), leased), mObjects.end());
}

}  // namespace vitest
