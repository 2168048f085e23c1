package com.tarq.vi.player;

/**
 * What a phone gives its host and a desktop does not: a headless GL surface
 * current on the calling thread, the current surface's pixels, any key code, the plug-in's asset directory,
 * the window rectangle, why a plug-in does not load or a file is not a model, the preloaded clock, the
 * message when the effect ends the process, and the names it binds that its programs do not have.
 * Every method must be called on the thread that opened the surface.
 */
final class Desktop {
    private Desktop() {}

    static native void open(int width, int height);

    /** A new surface of the size, with the same GL context current. */
    static native void resize(int width, int height);

    /** Destroys the GL context and makes a new one current, as when the phone's host replaces it. */
    static native void loseContext();

    /** The current surface's pixels (this one's or the live window's) as opaque ARGB, top row first. */
    static native void readPixels(int[] argb, int width, int height);

    /** A key code straight to the runtime's key handler, as a phone's host has no entry for. */
    static native void sendKey(int code);

    static native void setAssetDirectory(String directory);

    /**
     * From now on, when the effect ends the process through the runtime's
     * fatal report (exit 88, 67, 71 or 45), an exit handler that never calls
     * back into Java tells it on standard error, as "PROGRAM: error: ...".
     * So does a crash (SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT), when the
     * JDK's signal chaining library is preloaded: the status is then 128 + the signal's number.
     */
    static native void explainFatalExits(String program);

    /**
     * From now on each name the effect binds (an attribute, a uniform, a
     * sampler) that its program does not have goes to Misspellings.unbound,
     * once per program and name.
     */
    static native void tellUnboundNames();

    /**
     * The plug-in the runtime is about to open: when the process crashes in
     * it, the message names the effect's function and source line (see
     * explainFatalExits). Its names are told again (see tellUnboundNames).
     */
    static native void watchEffect(String path);

    /**
     * Around each write into a path removeOnFatalExit named: the crash
     * handler waits for a write under way before it removes the path, and a
     * write that would begin after that waits for the process to end.
     */
    static native void beginWrite();

    static native void endWrite();

    /** A file or folder the exit handler removes if the effect ends the process. */
    static native void removeOnFatalExit(String path);

    static native void setWindowRectangle(int left, int top, int width, int height);

    /** Why the plug-in at path cannot be started (the loader's message or the missing factory), or null. */
    static native String whyNotLoadable(String path);

    /** What is wrong with the file at path as a model file (as vi-modelconv --check says it), or null. */
    static native String whyNotModel(String path);

    /** Sets the runtime's realtime clock; false when the fixed clock is not preloaded. */
    static native boolean setClock(long nanoseconds);
}
