package com.tarq.vi.player;

/**
 * The live host's window and its GL ES 2 context (SDL2 over EGL), made and
 * used on one thread, which makes every call into the runtime. Events come
 * one at a time as records of three ints: the kind, then its numbers.
 */
final class Window {
    private Window() {}

    static final int NONE = 0;
    static final int QUIT = 1;
    /** A left-button press, drag or release at window pixels (x, y). */
    static final int TOUCH_DOWN = 2;
    static final int TOUCH_MOVE = 3;
    static final int TOUCH_UP = 4;
    /** A key pressed: its SDL key code (ASCII for letters and digits). */
    static final int KEY = 5;
    /** The window's pixels were lost and must be drawn again. */
    static final int EXPOSED = 6;

    /** The x of a window the window manager places. */
    static final int ANYWHERE = Integer.MIN_VALUE;

    /**
     * Opens the window at (x, y) with a GL ES 2 context current; IllegalStateException
     * with SDL's reason when it cannot.
     */
    static native void open(String title, int x, int y, int width, int height);

    static native void close();

    static native void resize(int width, int height);

    /** The drawable's size: size[0] width, size[1] height. */
    static native void size(int[] size);

    /** Where the window is on the screen: position[0] x, position[1] y. */
    static native void position(int[] position);

    /** Fills the window with a dark grey, for a window without an effect; swap() shows it. */
    static native void clear();

    /** Destroys the GL context and makes a new one current, as a phone does when it replaces it. */
    static native void loseContext();

    static native void swap();

    static native void setTitle(String title);

    /** The next event into event[0..2] without waiting; its kind, NONE when there is none. */
    static native int nextEvent(int[] event);
}
