// The recording scene. Every operation notes itself; an atomic flag notices
// a call that begins while another one is still inside a scene. Its Java
// face, the natives of com.tarq.test.TestScene, is found by the JVM because
// the Java test loads this plug-in with System.load before the runtime opens
// it (both then share one copy); with it, what the Java test needs of a host
// besides the entry points: a GL context and the loader's pending error.
#include <EGL/egl.h>
#include <dlfcn.h>
#include <GLES2/gl2.h>
#include <jni.h>

#include <atomic>
#include <memory>
#include <thread>

#include "Application/AnimationManager.h"
#include "Application/ApplicationVar.h"
#include "GlContext.h"
#include "Render/Background.h"
#include "Render/Texture.h"
#include "TestSceneRecord.h"

TestSceneState gTestScene;

std::string TestSceneState::taken() {
    std::string seen;
    for (const TestSceneEvent& e : events) {
        seen += e.factory == 2 && e.kind == 'C' ? 'S' : char(e.kind);
        if (e.kind == 'C' || e.kind == 'p' || e.kind == 'k')
            seen += std::to_string(e.a) + (e.kind == 'k' ? "" : "," + std::to_string(e.b));
        if (e.kind == 'd' || e.kind == 'u' || e.kind == 'm')
            seen += "(" + std::to_string(e.x) + "," + std::to_string(e.y) + ")";
    }
    events.clear();
    overlaps = 0;
    return seen;
}

namespace {

std::atomic<int> gInside(0);

class RecordingScene : public vi::Scene {
public:
    RecordingScene(const int* size, vi::TexturesMap* textures, int factory)
        : vi::Scene(size), mFactory(factory), mTextures(textures) {
        mNames = gTestScene.names;
        note('C', size[0], size[1]);
    }
    ~RecordingScene() override { note('D'); }

    void clearEffect() override { note('c'); }
    void affordance() override { note('a'); }
    void unlock() override { note('l'); }
    void textureUpdated() override { note('t'); }
    void initEffect() override { note('I'); }
    void initEffectAlternate() override { note('A'); }
    void touchDown(const glm::vec2& at) override { note('d', 0, 0, at.x, at.y); }
    void touchUp(const glm::vec2& at) override { note('u', 0, 0, at.x, at.y); }
    void touchMove(const glm::vec2& at) override { note('m', 0, 0, at.x, at.y); }
    void keyPressed(unsigned int key) override { note('k', int(key)); }
    void param(int a, int b) override { note('p', a, b); }
    int draw() override {
        note('F');
        if (gTestScene.picture) {
            glClearColor(0.0f, 0.0f, 0.0f, 1.0f);
            glClear(GL_COLOR_BUFFER_BIT);
        }
        // The picture is made in the first frame with a context and the image
        // filed, so that its GL names come from a frame the runtime checked
        // the context for; left out while the image has no client pixels
        // (recycled, it may come back from a lost context undefined).
        auto filed = mNames.empty() ? mTextures->end() : mTextures->find(mNames[0]);
        if (gTestScene.picture && !mPicture && filed != mTextures->end() && filed->second && eglGetCurrentContext())
            mPicture.reset(new vi::Background(*filed->second));
        if (gTestScene.picture && mPicture && mPicture->drawable.texture->mBuffer) mPicture->renderFrame();
        return gTestScene.drawResult;
    }

private:
    // Gives up the processor once inside, so that a call let in without the
    // lock finds the flag set.
    void note(char kind, int a = 0, int b = 0, float x = 0.0f, float y = 0.0f) {
        if (gInside.exchange(1)) ++gTestScene.overlaps;
        std::this_thread::yield();
        gTestScene.events.push_back({kind, mFactory, a, b, int(mOrientation), x, y, vi::AnimationManager::mNow});
        gInside.store(0);
    }

    int mFactory;
    vi::TexturesMap* mTextures;
    std::unique_ptr<vi::Background> mPicture;
};

}  // namespace

extern "C" {

JNIEXPORT vi::Scene* createScene(int* size, vi::ModelsMap*, vi::TexturesMap* textures) {
    return new RecordingScene(size, textures, 1);
}
// Not looked up by the runtime: a test puts it into vi::gCreateScene to tell
// which factory made a scene.
JNIEXPORT vi::Scene* createSecondScene(int* size, vi::ModelsMap*, vi::TexturesMap* textures) {
    return new RecordingScene(size, textures, 2);
}

#define TESTSCENE_NATIVE(method) Java_com_tarq_test_TestScene_##method

JNIEXPORT void JNICALL TESTSCENE_NATIVE(configure)(JNIEnv* env, jclass, jobjectArray names, jint drawResult) {
    gTestScene.drawResult = drawResult;
    gTestScene.names.clear();
    for (jsize i = 0; i < env->GetArrayLength(names); ++i) {
        jstring name = static_cast<jstring>(env->GetObjectArrayElement(names, i));
        const char* chars = env->GetStringUTFChars(name, nullptr);
        gTestScene.names.push_back(chars);
        env->ReleaseStringUTFChars(name, chars);
    }
}

// Makes the runtime's next start use createSecondScene, as long as it does not
// look the factory up again.
JNIEXPORT void JNICALL TESTSCENE_NATIVE(useSecondFactory)(JNIEnv*, jclass) { vi::gCreateScene = createSecondScene; }

JNIEXPORT jstring JNICALL TESTSCENE_NATIVE(taken)(JNIEnv* env, jclass) {
    return env->NewStringUTF(gTestScene.taken().c_str());
}

// A headless GL context current on the calling thread, as the host's render thread has one.
JNIEXPORT void JNICALL TESTSCENE_NATIVE(makeContextCurrent)(JNIEnv*, jclass) {
    static vitest::GlContext* context = new vitest::GlContext(64, 64);
    context->makeCurrent();
}

JNIEXPORT jstring JNICALL TESTSCENE_NATIVE(loaderError)(JNIEnv* env, jclass) {
    const char* error = dlerror();
    return error ? env->NewStringUTF(error) : nullptr;
}

}  // extern "C"
