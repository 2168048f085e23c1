package com.tarq.test;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNotNull;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.List;
import org.junit.jupiter.api.Test;

/** prehandleStart: loading the plug-in, its factory, the names and the window. */
class NativeStartTest extends HostTestBase {
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
    void samePathTwiceKeepsTheOpenLibraryYetMakesAFreshScene() {
        freshStart(540, 960);
        // Were the library opened and looked up again, the factory would be
        // createScene once more.
        TestScene.useSecondFactory();
        assertNotNull(host.prehandleStart(plugin, 300, 400));
        List<TestScene.Event> events = TestScene.events();
        assertEquals(List.of(TestScene.CREATED, TestScene.DESTROYED, TestScene.CREATED), TestScene.kinds());
        assertEquals(1, events.get(0).factory);
        assertEquals(1, events.get(1).scene);
        assertEquals(2, events.get(2).scene);
        assertEquals(2, events.get(2).factory);
        assertEquals(300, events.get(2).a);
        assertEquals(400, events.get(2).b);
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
    void libraryWithoutFactoryGivesNullAndAnotherPathIsLookedUpAfresh() {
        freshStart(540, 960);
        TestScene.useSecondFactory();
        assertNull(host.prehandleStart(pluginWithoutFactory, 540, 960));
        assertFalse(TestHost.hasScene());
        assertEquals(1, TestScene.count(TestScene.DESTROYED));

        assertNotNull(host.prehandleStart(plugin, 540, 960));
        List<TestScene.Event> created = TestScene.eventsOf(TestScene.CREATED);
        assertEquals(2, created.size());
        assertEquals(1, created.get(1).factory);
    }

    @Test
    void windowIsPutAtTheOriginAndClampedToAtLeastOnePixel() {
        freshStart(720, 1280);
        assertArrayEquals(new int[] {0, 0, 720, 1280}, TestHost.windowRectangle());
        TestScene.clearEvents();

        freshStart(0, -5);
        TestScene.Event created = TestScene.eventsOf(TestScene.CREATED).get(0);
        assertEquals(1, created.a);
        assertEquals(1, created.b);
        assertEquals(1.0f, created.sizeX);
        assertEquals(1.0f, created.sizeY);
        assertArrayEquals(new int[] {0, 0, 1, 1}, TestHost.windowRectangle());
    }
}
