// Natives of com.tarq.vi.player.Window: the live host's window and its GL ES 2
// context, through SDL2 (EGL underneath, on X11 or Wayland). Owns one window
// and one context, both made and used on the calling thread, the live host's
// render thread, which makes every call into the runtime. Events come back to
// Java as small int records, one at a time.
#include <GLES2/gl2.h>
#include <SDL.h>
#include <jni.h>

#include <cstdint>
#include <cstdlib>
#include <string>

#define WINDOW_NATIVE(method) Java_com_tarq_vi_player_Window_##method

namespace {

// What nextEvent hands back in event[0]; the Java side has the same numbers.
enum EventKind {
    kNone = 0,
    kQuit = 1,
    kTouchDown = 2,  // event[1], event[2]: window pixels
    kTouchMove = 3,
    kTouchUp = 4,
    kKey = 5,  // event[1]: the SDL key code (ASCII for letters and digits)
    kExposed = 6,
};

// The x of a window placed by the window manager; the Java side has the same number.
const jint kAnywhere = INT32_MIN;

SDL_Window* gWindow = nullptr;
SDL_GLContext gContext = nullptr;
bool gFingerDown = false;

void fail(JNIEnv* env, const std::string& what) {
    env->ThrowNew(env->FindClass("java/lang/IllegalStateException"), (what + ": " + SDL_GetError()).c_str());
}

bool makeContext(JNIEnv* env) {
    gContext = SDL_GL_CreateContext(gWindow);
    if (!gContext) {
        fail(env, "cannot make a GL ES 2 context");
        return false;
    }
    // Paced by the host, not by the display: a missed vertical blank must not
    // halve the frame rate, and a virtual display has none.
    SDL_GL_SetSwapInterval(0);
    return true;
}

void setViewport() {
    int width = 0;
    int height = 0;
    SDL_GL_GetDrawableSize(gWindow, &width, &height);
    glViewport(0, 0, width, height);
}

}  // namespace

extern "C" {

// At (x, y) on the screen, or where the window manager likes when x is kAnywhere.
JNIEXPORT void JNICALL WINDOW_NATIVE(open)(JNIEnv* env, jclass, jstring title, jint x, jint y, jint width,
                                           jint height) {
    // EGL on X11 too, so that the context is the kind the runtime checks with eglGetCurrentContext.
    SDL_SetHint(SDL_HINT_VIDEO_X11_FORCE_EGL, "1");
    // The window's class is the tool's, not the JVM's ("java"): window managers group and name it by that,
    // and a script finds it by that whichever process opened it.
    SDL_SetHint(SDL_HINT_APP_NAME, "vi-live");
    setenv("SDL_VIDEO_X11_WMCLASS", "vi-live", 0);
    // An X display and no Wayland one: X11 only, so that a display that refuses the window for a moment
    // (a virtual one regenerating) does not send SDL to Wayland, whose library prints its own complaint.
    if (std::getenv("DISPLAY") && !std::getenv("WAYLAND_DISPLAY")) SDL_SetHint(SDL_HINT_VIDEODRIVER, "x11");
    if (SDL_Init(SDL_INIT_VIDEO) != 0) {
        fail(env, "no display to open a window on");
        return;
    }
    // Without a display SDL falls back to drivers that draw nowhere; an author would see nothing.
    const std::string driver = SDL_GetCurrentVideoDriver();
    if (driver == "offscreen" || driver == "dummy") {
        SDL_Quit();
        env->ThrowNew(env->FindClass("java/lang/IllegalStateException"),
                      "no display to open a window on (neither DISPLAY nor WAYLAND_DISPLAY leads to one)");
        return;
    }
    SDL_GL_SetAttribute(SDL_GL_CONTEXT_PROFILE_MASK, SDL_GL_CONTEXT_PROFILE_ES);
    SDL_GL_SetAttribute(SDL_GL_CONTEXT_MAJOR_VERSION, 2);
    SDL_GL_SetAttribute(SDL_GL_CONTEXT_MINOR_VERSION, 0);
    SDL_GL_SetAttribute(SDL_GL_RED_SIZE, 8);
    SDL_GL_SetAttribute(SDL_GL_GREEN_SIZE, 8);
    SDL_GL_SetAttribute(SDL_GL_BLUE_SIZE, 8);
    // Depth and stencil as a phone's window has them: effects may use both.
    SDL_GL_SetAttribute(SDL_GL_DEPTH_SIZE, 16);
    SDL_GL_SetAttribute(SDL_GL_STENCIL_SIZE, 8);
    SDL_GL_SetAttribute(SDL_GL_DOUBLEBUFFER, 1);
    const char* chars = env->GetStringUTFChars(title, nullptr);
    const bool anywhere = x == kAnywhere;
    gWindow = SDL_CreateWindow(chars, anywhere ? SDL_WINDOWPOS_UNDEFINED : x, anywhere ? SDL_WINDOWPOS_UNDEFINED : y,
                               width, height, SDL_WINDOW_OPENGL | SDL_WINDOW_SHOWN);
    env->ReleaseStringUTFChars(title, chars);
    if (!gWindow) {
        fail(env, "cannot open a GL ES 2 window");
        return;
    }
    // A window manager may put its frame, not the window, at the place asked for at creation; moved once
    // shown, with its borders known, the window itself is where position() read it, and stays put.
    if (!anywhere) SDL_SetWindowPosition(gWindow, x, y);
    if (makeContext(env)) setViewport();
}

JNIEXPORT void JNICALL WINDOW_NATIVE(close)(JNIEnv*, jclass) {
    if (gContext) SDL_GL_DeleteContext(gContext);
    if (gWindow) SDL_DestroyWindow(gWindow);
    gContext = nullptr;
    gWindow = nullptr;
    SDL_Quit();
}

// The window turned: a window manager may refuse or delay the new size, so
// the caller reads back what it got.
JNIEXPORT void JNICALL WINDOW_NATIVE(resize)(JNIEnv*, jclass, jint width, jint height) {
    SDL_SetWindowSize(gWindow, width, height);
    setViewport();
}

// The drawable's size now: size[0] width, size[1] height.
JNIEXPORT void JNICALL WINDOW_NATIVE(size)(JNIEnv* env, jclass, jintArray size) {
    jint values[2] = {0, 0};
    SDL_GL_GetDrawableSize(gWindow, &values[0], &values[1]);
    env->SetIntArrayRegion(size, 0, 2, values);
}

// Where the window is on the screen: position[0] x, position[1] y.
JNIEXPORT void JNICALL WINDOW_NATIVE(position)(JNIEnv* env, jclass, jintArray position) {
    jint values[2] = {0, 0};
    SDL_GetWindowPosition(gWindow, &values[0], &values[1]);
    env->SetIntArrayRegion(position, 0, 2, values);
}

// A window with no effect in it: dark grey, so that it does not pass for a frame of the effect.
JNIEXPORT void JNICALL WINDOW_NATIVE(clear)(JNIEnv*, jclass) {
    glClearColor(0.12f, 0.12f, 0.12f, 1.0f);
    glClear(GL_COLOR_BUFFER_BIT);
}

// As a phone does when it replaces its GL context: the old one is destroyed
// with everything made in it, and a new one is current on the same window.
JNIEXPORT void JNICALL WINDOW_NATIVE(loseContext)(JNIEnv* env, jclass) {
    SDL_GL_MakeCurrent(gWindow, nullptr);
    SDL_GL_DeleteContext(gContext);
    gContext = nullptr;
    if (!makeContext(env)) return;
    if (SDL_GL_MakeCurrent(gWindow, gContext) != 0) {
        fail(env, "cannot make the new GL context current");
        return;
    }
    setViewport();
}

JNIEXPORT void JNICALL WINDOW_NATIVE(swap)(JNIEnv*, jclass) { SDL_GL_SwapWindow(gWindow); }

JNIEXPORT void JNICALL WINDOW_NATIVE(setTitle)(JNIEnv* env, jclass, jstring title) {
    const char* chars = env->GetStringUTFChars(title, nullptr);
    SDL_SetWindowTitle(gWindow, chars);
    env->ReleaseStringUTFChars(title, chars);
}

// The next event the host acts on, without waiting: the left button is the
// finger (a drag is a move only while it is down); kNone when the queue is empty.
JNIEXPORT jint JNICALL WINDOW_NATIVE(nextEvent)(JNIEnv* env, jclass, jintArray out) {
    SDL_Event event;
    while (SDL_PollEvent(&event)) {
        jint record[3] = {kNone, 0, 0};
        switch (event.type) {
            case SDL_QUIT:
                record[0] = kQuit;
                break;
            case SDL_MOUSEBUTTONDOWN:
            case SDL_MOUSEBUTTONUP:
                if (event.button.button != SDL_BUTTON_LEFT) continue;
                gFingerDown = event.type == SDL_MOUSEBUTTONDOWN;
                record[0] = gFingerDown ? kTouchDown : kTouchUp;
                record[1] = event.button.x;
                record[2] = event.button.y;
                break;
            case SDL_MOUSEMOTION:
                if (!gFingerDown) continue;
                record[0] = kTouchMove;
                record[1] = event.motion.x;
                record[2] = event.motion.y;
                break;
            case SDL_KEYDOWN:
                record[0] = kKey;
                record[1] = event.key.keysym.sym;
                break;
            case SDL_WINDOWEVENT:
                if (event.window.event != SDL_WINDOWEVENT_EXPOSED) continue;
                record[0] = kExposed;
                break;
            default:
                continue;
        }
        env->SetIntArrayRegion(out, 0, 3, record);
        return record[0];
    }
    return kNone;
}

}  // extern "C"
