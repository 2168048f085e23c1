// Natives of com.tarq.vi.player.Desktop: what a phone gives its host and a
// desktop does not. A headless EGL surface kept current on the calling thread
// (the player's render thread), the current surface's pixels, any key code,
// the plug-in's asset directory, the window rectangle, why a plug-in does not
// load or a file is not a model, the preloaded clock, the message when the effect ends the process
// or crashes, and the names it binds that its programs do not have.
// The live window uses all but the surface.
#include <EGL/egl.h>
#include <EGL/eglext.h>
#include <GLES2/gl2.h>
#include <dlfcn.h>
#include <jni.h>

#include <cstdint>
#include <string>
#include <vector>

#include "Application/Application.h"
#include "CrashPlace.h"
#include "CrashReport.h"
#include "FatalExit.h"
#include "ModelFile.h"
#include "Tools/DirectoryAssetManager.h"
#include "Tools/File.h"
#include "UnboundNameWarnings.h"

#define DESKTOP_NATIVE(method) Java_com_tarq_vi_player_Desktop_##method

namespace {

struct Surface {
    EGLDisplay display = EGL_NO_DISPLAY;
    EGLConfig config = nullptr;
    EGLContext context = EGL_NO_CONTEXT;
    EGLSurface surface = EGL_NO_SURFACE;
    int width = 0;
    int height = 0;
};

Surface gSurface;

// Throws an IllegalStateException naming what failed; returns false so that
// callers can leave at once.
bool fail(JNIEnv* env, const std::string& what) {
    char code[16];
    snprintf(code, sizeof(code), "0x%04x", eglGetError());
    env->ThrowNew(env->FindClass("java/lang/IllegalStateException"), (what + " failed (EGL " + code + ")").c_str());
    return false;
}

bool makeContext(JNIEnv* env) {
    const EGLint attributes[] = {EGL_CONTEXT_CLIENT_VERSION, 2, EGL_NONE};
    gSurface.context = eglCreateContext(gSurface.display, gSurface.config, EGL_NO_CONTEXT, attributes);
    return gSurface.context != EGL_NO_CONTEXT || fail(env, "eglCreateContext");
}

// A new pbuffer of the size, made current with the context; the old one goes.
bool makeSurface(JNIEnv* env, int width, int height) {
    const EGLint attributes[] = {EGL_WIDTH, width, EGL_HEIGHT, height, EGL_NONE};
    EGLSurface surface = eglCreatePbufferSurface(gSurface.display, gSurface.config, attributes);
    if (surface == EGL_NO_SURFACE) return fail(env, "eglCreatePbufferSurface");
    if (!eglMakeCurrent(gSurface.display, surface, surface, gSurface.context)) return fail(env, "eglMakeCurrent");
    if (gSurface.surface != EGL_NO_SURFACE) eglDestroySurface(gSurface.display, gSurface.surface);
    gSurface.surface = surface;
    gSurface.width = width;
    gSurface.height = height;
    glViewport(0, 0, width, height);
    return true;
}

}  // namespace

extern "C" {

JNIEXPORT void JNICALL DESKTOP_NATIVE(open)(JNIEnv* env, jclass, jint width, jint height) {
    auto getPlatformDisplay =
        reinterpret_cast<PFNEGLGETPLATFORMDISPLAYEXTPROC>(eglGetProcAddress("eglGetPlatformDisplayEXT"));
    if (!getPlatformDisplay) {
        fail(env, "eglGetPlatformDisplayEXT");
        return;
    }
    gSurface.display = getPlatformDisplay(EGL_PLATFORM_SURFACELESS_MESA, EGL_DEFAULT_DISPLAY, nullptr);
    if (gSurface.display == EGL_NO_DISPLAY || !eglInitialize(gSurface.display, nullptr, nullptr)) {
        fail(env, "eglInitialize of a headless display");
        return;
    }
    eglBindAPI(EGL_OPENGL_ES_API);
    // Depth and stencil as a phone's window has them: effects may use both.
    const EGLint attributes[] = {EGL_SURFACE_TYPE, EGL_PBUFFER_BIT, EGL_RENDERABLE_TYPE, EGL_OPENGL_ES2_BIT,
                                 EGL_RED_SIZE, 8, EGL_GREEN_SIZE, 8, EGL_BLUE_SIZE, 8, EGL_ALPHA_SIZE, 8,
                                 EGL_DEPTH_SIZE, 16, EGL_STENCIL_SIZE, 8, EGL_NONE};
    EGLint count = 0;
    if (!eglChooseConfig(gSurface.display, attributes, &gSurface.config, 1, &count) || count < 1) {
        fail(env, "eglChooseConfig");
        return;
    }
    if (makeContext(env)) makeSurface(env, width, height);
}

JNIEXPORT void JNICALL DESKTOP_NATIVE(resize)(JNIEnv* env, jclass, jint width, jint height) {
    makeSurface(env, width, height);
}

// As when the phone's host replaces its GL context: everything made in the
// old one is gone, and a new one is current on the same surface.
JNIEXPORT void JNICALL DESKTOP_NATIVE(loseContext)(JNIEnv* env, jclass) {
    eglMakeCurrent(gSurface.display, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT);
    eglDestroyContext(gSurface.display, gSurface.context);
    if (!makeContext(env)) return;
    if (!eglMakeCurrent(gSurface.display, gSurface.surface, gSurface.surface, gSurface.context)) {
        fail(env, "eglMakeCurrent");
        return;
    }
    glViewport(0, 0, gSurface.width, gSurface.height);
}

// The current surface (the pbuffer or the live window) as ARGB ints, top row
// first (GL reads bottom row first).
JNIEXPORT void JNICALL DESKTOP_NATIVE(readPixels)(JNIEnv* env, jclass, jintArray argb, jint width, jint height) {
    std::vector<uint8_t> rgba(size_t(width) * size_t(height) * 4);
    glPixelStorei(GL_PACK_ALIGNMENT, 4);
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
    glReadPixels(0, 0, width, height, GL_RGBA, GL_UNSIGNED_BYTE, rgba.data());
    std::vector<jint> pixels(size_t(width) * size_t(height));
    for (int y = 0; y < height; ++y) {
        const uint8_t* row = &rgba[size_t(height - 1 - y) * size_t(width) * 4];
        jint* out = &pixels[size_t(y) * size_t(width)];
        for (int x = 0; x < width; ++x) {
            const uint8_t* p = row + 4 * x;
            // Opaque: the lock screen shows the picture, whatever alpha the effect left.
            out[x] = jint(0xFF000000u | (uint32_t(p[0]) << 16) | (uint32_t(p[1]) << 8) | p[2]);
        }
    }
    env->SetIntArrayRegion(argb, 0, jsize(pixels.size()), pixels.data());
}

// The runtime's key handler takes any code; the phone's host interface passes
// only the menu and volume keys, so developer keys come this way.
JNIEXPORT void JNICALL DESKTOP_NATIVE(sendKey)(JNIEnv*, jclass, jint code) {
    vi::Application::handleKey(static_cast<unsigned int>(code));
}

JNIEXPORT void JNICALL DESKTOP_NATIVE(setAssetDirectory)(JNIEnv* env, jclass, jstring directory) {
    const char* chars = env->GetStringUTFChars(directory, nullptr);
    vi::File::getAssetManager() = vi::DirectoryAssetManager::create(chars);
    FatalExit::setAssetDirectory(chars);
    env->ReleaseStringUTFChars(directory, chars);
}

JNIEXPORT void JNICALL DESKTOP_NATIVE(explainFatalExits)(JNIEnv* env, jclass, jstring program) {
    const char* chars = env->GetStringUTFChars(program, nullptr);
    FatalExit::watch(chars);
    CrashReport::watch(chars);
    env->ReleaseStringUTFChars(program, chars);
}

JNIEXPORT void JNICALL DESKTOP_NATIVE(tellUnboundNames)(JNIEnv* env, jclass) { UnboundNameWarnings::listen(env); }

JNIEXPORT void JNICALL DESKTOP_NATIVE(watchEffect)(JNIEnv* env, jclass, jstring path) {
    const char* chars = env->GetStringUTFChars(path, nullptr);
    CrashPlace::watchEffect(chars);
    UnboundNameWarnings::forget();
    env->ReleaseStringUTFChars(path, chars);
}

JNIEXPORT void JNICALL DESKTOP_NATIVE(beginWrite)(JNIEnv*, jclass) { CrashReport::beginWrite(); }

JNIEXPORT void JNICALL DESKTOP_NATIVE(endWrite)(JNIEnv*, jclass) { CrashReport::endWrite(); }

JNIEXPORT void JNICALL DESKTOP_NATIVE(removeOnFatalExit)(JNIEnv* env, jclass, jstring path) {
    const char* chars = env->GetStringUTFChars(path, nullptr);
    FatalExit::removeOnFatalExit(chars);
    env->ReleaseStringUTFChars(path, chars);
}

JNIEXPORT void JNICALL DESKTOP_NATIVE(setWindowRectangle)(JNIEnv*, jclass, jint left, jint top, jint width,
                                                          jint height) {
    vi::Application::handleWindowRectangle(left, top, width, height);
}

// Why the runtime could not start the plug-in at path: the loader's message,
// or the missing factory; null when the library opens and has one.
JNIEXPORT jstring JNICALL DESKTOP_NATIVE(whyNotLoadable)(JNIEnv* env, jclass, jstring path) {
    const char* chars = env->GetStringUTFChars(path, nullptr);
    void* library = dlopen(chars, RTLD_NOW | RTLD_LOCAL);
    env->ReleaseStringUTFChars(path, chars);
    if (!library) {
        const char* error = dlerror();
        return env->NewStringUTF(error ? error : "the library cannot be opened");
    }
    const bool hasFactory = dlsym(library, "createScene") != nullptr;
    dlclose(library);
    return hasFactory ? nullptr : env->NewStringUTF("the library has no \"createScene\"");
}

// What is wrong with the file at path as a model file, or null: the
// converter's own check, so that both say the same.
JNIEXPORT jstring JNICALL DESKTOP_NATIVE(whyNotModel)(JNIEnv* env, jclass, jstring path) {
    const char* chars = env->GetStringUTFChars(path, nullptr);
    vi::ModelFile::Info info;
    std::string error;
    const bool valid = vi::ModelFile::check(chars, info, error) == vi::ModelFile::Valid;
    env->ReleaseStringUTFChars(path, chars);
    return valid ? nullptr : env->NewStringUTF(error.c_str());
}

// Sets the preloaded clock; false when the player runs without it.
JNIEXPORT jboolean JNICALL DESKTOP_NATIVE(setClock)(JNIEnv*, jclass, jlong nanoseconds) {
    using SetClock = void (*)(int64_t);
    static SetClock setClock = reinterpret_cast<SetClock>(dlsym(RTLD_DEFAULT, "vi_fixed_clock_set"));
    if (!setClock) return JNI_FALSE;
    setClock(int64_t(nanoseconds));
    return JNI_TRUE;
}

}  // extern "C"
