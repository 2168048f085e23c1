// The Java face of the test scene: natives of com.tarq.test.TestScene, found
// by the JVM because the Java test loads this plug-in with System.load before
// the runtime opens it (both then share one copy).
#include <jni.h>

#include <string>
#include <vector>

#include "Application/ApplicationVar.h"
#include "TestSceneRecord.h"

extern "C" vi::Scene* createSecondScene(int* size, vi::ModelsMap* models, vi::TexturesMap* textures);

#define TESTSCENE_NATIVE(method) Java_com_tarq_test_TestScene_##method

extern "C" {

JNIEXPORT void JNICALL TESTSCENE_NATIVE(reset)(JNIEnv*, jclass) { testSceneReset(); }

JNIEXPORT void JNICALL TESTSCENE_NATIVE(setNames)(JNIEnv* env, jclass, jobjectArray names) {
    std::vector<std::string> copies;
    for (jsize i = 0; i < env->GetArrayLength(names); ++i) {
        jstring name = static_cast<jstring>(env->GetObjectArrayElement(names, i));
        const char* chars = env->GetStringUTFChars(name, nullptr);
        copies.push_back(chars);
        env->ReleaseStringUTFChars(name, chars);
        env->DeleteLocalRef(name);
    }
    std::vector<const char*> pointers;
    for (const std::string& copy : copies) pointers.push_back(copy.c_str());
    testSceneSetNames(pointers.data(), int(pointers.size()));
}

JNIEXPORT void JNICALL TESTSCENE_NATIVE(setDrawResult)(JNIEnv*, jclass, jint result) {
    testSceneSetDrawResult(result);
}

JNIEXPORT void JNICALL TESTSCENE_NATIVE(setClearColour)(JNIEnv*, jclass, jboolean enabled, jfloat red, jfloat green,
                                                         jfloat blue, jfloat alpha) {
    testSceneSetClearColour(enabled, red, green, blue, alpha);
}

// Makes the runtime's next start use createSecondScene, as long as it does not
// look the factory up again.
JNIEXPORT void JNICALL TESTSCENE_NATIVE(useSecondFactory)(JNIEnv*, jclass) { vi::gCreateScene = createSecondScene; }

JNIEXPORT jint JNICALL TESTSCENE_NATIVE(eventCount)(JNIEnv*, jclass) { return testSceneEventCount(); }

JNIEXPORT jint JNICALL TESTSCENE_NATIVE(count)(JNIEnv*, jclass, jint kind) { return testSceneCount(kind); }

// kind, scene, factory, a, b
JNIEXPORT jintArray JNICALL TESTSCENE_NATIVE(eventInts)(JNIEnv* env, jclass, jint index) {
    const TestSceneEvent e = testSceneEventAt(index);
    const jint values[] = {e.kind, e.scene, e.factory, e.a, e.b};
    jintArray array = env->NewIntArray(5);
    env->SetIntArrayRegion(array, 0, 5, values);
    return array;
}

}  // extern "C"
