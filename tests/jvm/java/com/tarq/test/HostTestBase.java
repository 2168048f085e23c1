package com.tarq.test;

import static org.junit.jupiter.api.Assertions.assertNotNull;
import static org.junit.jupiter.api.Assertions.assertNull;

import com.tarq.android.visualeffect.common.Native;
import java.io.File;
import org.junit.jupiter.api.BeforeAll;
import org.junit.jupiter.api.BeforeEach;

/**
 * What every JVM test starts from: the libraries loaded, a GL context current
 * on the test thread (as on the host's render thread), no scene, a fresh record.
 */
abstract class HostTestBase {
    protected static String plugin;
    protected static String pluginWithoutFactory;
    protected static String missingPlugin;

    protected final Native host = new Native();

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

    /**
     * Starts the test plug-in with its factory looked up afresh: a failed load
     * of another path first makes the runtime forget the library it has open.
     */
    protected String[] freshStart(int width, int height) {
        assertNull(host.prehandleStart(missingPlugin, width, height));
        String[] names = host.prehandleStart(plugin, width, height);
        assertNotNull(names);
        return names;
    }

    /** A ready scene in a width x height window, with the record cleared. */
    protected void readyScene(int width, int height) {
        freshStart(width, height);
        host.prehandleInitEffect();
        TestScene.clearEvents();
    }
}
