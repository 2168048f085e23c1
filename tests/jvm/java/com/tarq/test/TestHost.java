package com.tarq.test;

/**
 * Loads the runtime, the recording plug-in and this test helper (paths in the
 * system properties vi.runtime, vi.testscene and vi.testhost), in that order,
 * so that the plug-in and the helper bind to the one runtime the host's Native
 * class talks to. Offers what a test needs besides the host's entry points.
 */
public final class TestHost {
    private static boolean loaded;

    private TestHost() {}

    public static synchronized void load() {
        if (loaded) return;
        System.load(property("vi.runtime"));
        System.load(property("vi.testscene"));
        System.load(property("vi.testhost"));
        loaded = true;
    }

    public static String property(String name) {
        String value = System.getProperty(name);
        if (value == null) throw new IllegalStateException("system property " + name + " is not set");
        return value;
    }

    static {
        load();
    }

    /** A headless GL context, made once, current on the calling thread. */
    public static native void makeContextCurrent(int width, int height);
    /** One pixel of the current framebuffer as 0xRRGGBBAA. */
    public static native int readPixel(int x, int y);
    public static native boolean hasScene();
    /** The dynamic loader's pending error, or null; reading it clears it. */
    public static native String loaderError();
}
