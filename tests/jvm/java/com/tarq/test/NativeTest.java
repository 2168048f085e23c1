package com.tarq.test;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNotNull;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.tarq.android.visualeffect.common.Native;
import java.io.File;
import java.util.List;
import org.junit.jupiter.api.BeforeAll;
import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.Test;

/**
 * What only a real JVM shows of the host's entry points: string arrays with
 * modified-UTF-8 names, null from a failed start, the library without a
 * factory, ints through the draw call and the host's pixel array mutated in place.
 */
class NativeTest {
    private static String plugin;
    private static String pluginWithoutFactory;
    private static String missingPlugin;

    private final Native host = new Native();

    @BeforeAll
    static void loadLibrariesAndMakeAContextCurrent() {
        TestHost.load();
        plugin = TestHost.property("vi.testscene");
        pluginWithoutFactory = TestHost.property("vi.nofactory");
        missingPlugin = new File(new File(plugin).getParentFile(), "libvi_not_there.so").getPath();
        TestHost.makeContextCurrent(64, 64);
    }

    @BeforeEach
    void noSceneAndAFreshRecord() {
        host.prehandleStop();
        TestScene.reset();
    }

    /** Starts the plug-in with its factory looked up afresh (a failed load forgets the open library). */
    private String[] freshStart(int width, int height) {
        assertNull(host.prehandleStart(missingPlugin, width, height));
        String[] names = host.prehandleStart(plugin, width, height);
        assertNotNull(names);
        return names;
    }

    @Test
    void namesComeBackAsAStringArrayAndAnEmptyListAsAnEmptyArray() {
        TestScene.setNames(new String[] {"sky", "glass", "fl\u00fcgel"});
        assertArrayEquals(new String[] {"sky", "glass", "fl\u00fcgel"}, freshStart(540, 960));

        TestScene.setNames(new String[0]);
        String[] none = host.prehandleStart(plugin, 540, 960);
        assertNotNull(none);
        assertEquals(0, none.length);
    }

    @Test
    void missingLibraryGivesNullAfterStoppingTheSceneAndLeavesTheLoaderError() {
        freshStart(540, 960);
        host.prehandleInitEffect();
        TestHost.loaderError();
        assertNull(host.prehandleStart(missingPlugin, 540, 960));
        String error = TestHost.loaderError();
        assertNotNull(error);
        assertTrue(error.contains("libvi_not_there.so"), error);
        assertFalse(TestHost.hasScene());
        assertEquals(1, TestScene.count(TestScene.DESTROYED));
        assertEquals(0, host.prehandleDraw());
    }

    @Test
    void samePathKeepsTheFactoryAndALibraryWithoutOneGivesNullThenAnotherPathIsLookedUpAfresh() {
        freshStart(540, 960);
        // Were the same library looked up again, the first factory would create the scene.
        TestScene.useSecondFactory();
        assertNotNull(host.prehandleStart(plugin, 300, 400));
        assertNull(host.prehandleStart(pluginWithoutFactory, 540, 960));
        assertFalse(TestHost.hasScene());
        assertNotNull(host.prehandleStart(plugin, 540, 960));

        List<TestScene.Event> created = TestScene.eventsOf(TestScene.CREATED);
        assertEquals(3, created.size());
        assertEquals(1, created.get(0).factory);
        assertEquals(2, created.get(1).factory);
        assertEquals(300, created.get(1).a);
        assertEquals(400, created.get(1).b);
        assertEquals(1, created.get(2).factory);
    }

    @Test
    void drawReturnsTheSceneResultUnchangedAndDrawsInTheHostContext() {
        freshStart(64, 64);
        host.prehandleInitEffect();
        TestScene.setClearColour(true, 0.0f, 1.0f, 0.0f, 1.0f);
        for (int result : new int[] {1, 0, -7, Integer.MIN_VALUE, Integer.MAX_VALUE}) {
            TestScene.setDrawResult(result);
            assertEquals(result, host.prehandleDraw());
        }
        assertEquals(0x00FF00FF, TestHost.readPixel(5, 5));
    }

    @Test
    void loadingATextureLeavesTheHostArraySwappedInPlace() {
        int[] pixels = {0xFF112233, 0x80AABBCC};
        Native.loadTexture("load.example", pixels, 2, 1);
        assertArrayEquals(new int[] {0xFF332211, 0x80CCBBAA}, pixels);
        Native.loadTexture("load.example", null, 2, 1);
    }
}
