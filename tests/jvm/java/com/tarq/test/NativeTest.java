package com.tarq.test;

import static org.junit.jupiter.api.Assertions.*;

import com.tarq.android.visualeffect.common.Native;
import org.junit.jupiter.api.Test;

/**
 * What only a real JVM shows of the host's entry points, called through the
 * host's own Native class: string arrays of modified-UTF-8 names, ints through
 * the draw call, null from a failed start, the factory kept for the same
 * path, and the host's pixel array changed in place.
 */
class NativeTest {
    static {
        // The runtime first, so that the test plug-in binds to the one runtime Native talks to.
        System.load(System.getProperty("vi.runtime"));
        System.load(System.getProperty("vi.testscene"));
        TestScene.makeContextCurrent();
    }

    private static final String PLUGIN = System.getProperty("vi.testscene");
    private final Native host = new Native();


    @Test
    void aHostStartsDrawsRestartsFailsToStartAndLoadsImages() {
        TestScene.configure(new String[] {"sky", "glass", "fl\u00fcgel"}, Integer.MIN_VALUE);
        assertArrayEquals(new String[] {"sky", "glass", "fl\u00fcgel"}, host.prehandleStart(PLUGIN, 64, 64));
        host.prehandleInitEffect();
        assertEquals(Integer.MIN_VALUE, host.prehandleDraw());

        // The same path again keeps the factory found first: looked up again, it would undo this.
        TestScene.useSecondFactory();
        TestScene.configure(new String[0], Integer.MIN_VALUE);
        assertArrayEquals(new String[0], host.prehandleStart(PLUGIN, 300, 400));
        // A library without a factory and one that is not there: null, the running scene stopped.
        assertNull(host.prehandleStart(System.getProperty("vi.nofactory"), 64, 64));
        TestScene.loaderError();  // read and cleared: what comes next is the failed open's
        assertNull(host.prehandleStart(PLUGIN + ".not-there.so", 64, 64));
        String error = TestScene.loaderError();
        assertTrue(error != null && error.contains(".so.not-there.so"), error);
        assertEquals(0, host.prehandleDraw(), "no scene draws");
        // Another path (the first one again) is looked up afresh.
        host.prehandleStart(PLUGIN, 64, 64);
        // Made (C, or S by the second factory) at a size, initialised, drawn, destroyed.
        assertEquals("C64,64IFDS300,400DC64,64", TestScene.taken());

        // The host's pixels, ARGB ints, are swapped to RGBA bytes in its own array: a block of four, then two.
        int[] pixels = {0xFF112233, 0x80AABBCC, 0x01020304, 0x7F8E9DAC, 0x00FFEEDD, 0x10203040};
        Native.loadTexture("load.example", pixels, 6, 1);
        assertArrayEquals(new int[] {0xFF332211, 0x80CCBBAA, 0x01040302, 0x7FAC9D8E, 0x00DDEEFF, 0x10403020}, pixels);
        Native.loadTexture("load.example", null, 6, 1);  // no pixels: nothing to swap, nothing to crash on
    }
}

/** The recording scene of the test plug-in (tests/scenes): its settings and what it saw. */
final class TestScene {
    /** A new scene's names, and what its frames return. */
    static native void configure(String[] names, int drawResult);
    /** Puts the plug-in's second factory into the runtime's factory pointer. */
    static native void useSecondFactory();
    /** What the scenes saw since the last call, as the C++ tests read it (tests/scenes/TestSceneRecord.h). */
    static native String taken();
    /** A headless GL context current on this thread, as the host's render thread has one. */
    static native void makeContextCurrent();
    /** The dynamic loader's pending error, or null; reading it clears it. */
    static native String loaderError();
}
