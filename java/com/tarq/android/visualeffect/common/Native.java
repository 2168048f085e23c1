package com.tarq.android.visualeffect.common;

/**
 * The host's door into the native runtime. Every call is expected on the
 * thread that owns the GL context. The instance methods forward to the
 * runtime's handlers; loadTexture is static.
 */
public class Native {
    /** Stops any running effect, opens the plug-in at libraryPath (once per path)
     *  and starts a scene of width x height. Returns the names of the images the
     *  scene asks for, or null when the plug-in cannot be opened or has no
     *  "createScene". */
    public native String[] prehandleStart(String libraryPath, int width, int height);

    public native int prehandleInitEffect();

    public native int prehandleRestart();

    public native int prehandleStop();

    /** The same as prehandleStop: pausing destroys the scene. */
    public native int prehandlePause();

    public native void prehandleRecycleTextures();

    /** Draws one frame; the scene's result, or 0 when no scene is ready. */
    public native int prehandleDraw();

    /** action 0 down, 1 up, 2 move; any other value is ignored. */
    public native void prehandleTouch(int x, int y, int action);

    public native int prehandleMenuPressed();

    public native int prehandleVolumeUpPressed();

    public native int prehandleVolumeDownPressed();

    public native int prehandleParam(int a, int b);

    public native int prehandleClearEffect();

    public native int prehandleAffordance();

    public native int prehandleUnlock();

    public native int prehandleSetOrientation(int orientation);

    /** Kept for the host's interface; does nothing. */
    public native void loadModel(String name);

    /** Files (or replaces) the image `name` from ARGB pixels, width x height,
     *  row after row; null pixels unload the name. The array is left with red
     *  and blue exchanged. */
    public static native void loadTexture(String name, int[] pixels, int width, int height);
}
