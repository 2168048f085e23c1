#include "FakeJni.h"

#include <cstring>

namespace vitest {

FakeJni::FakeJni() {
    std::memset(&mTable, 0, sizeof(mTable));
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
    mTable.ReleaseIntArrayElements = [](JNIEnv* env, jintArray, jint* elements, jint) {
        self(env).mLeases.erase(elements);
    };
    mTable.FindClass = [](JNIEnv* env, const char* name) { return reinterpret_cast<jclass>(self(env).make(name, {})); };
    mTable.NewStringUTF = [](JNIEnv* env, const char* chars) { return self(env).string(chars); };
    // An object array keeps nothing: no test reads its elements.
    mTable.NewObjectArray = [](JNIEnv* env, jsize, jclass, jobject) {
        return reinterpret_cast<jobjectArray>(self(env).make("", {}));
    };
    mTable.SetObjectArrayElement = [](JNIEnv*, jobjectArray, jsize, jobject) {};
    mEnv.functions = &mTable;
}

void* FakeJni::lend(const void* bytes, std::size_t size) {
    std::unique_ptr<std::string> copy(new std::string(static_cast<const char*>(bytes), size));
    copy->push_back('\0');
    void* address = &(*copy)[0];
    mLeases[address] = std::move(copy);
    return address;
}

}  // namespace vitest
