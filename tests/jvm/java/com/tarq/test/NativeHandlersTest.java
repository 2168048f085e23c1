package com.tarq.test;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.List;
import org.junit.jupiter.api.Test;

/** The host's calls on a started scene: frames, touches, keys, events, orientation, stop. */
class NativeHandlersTest extends HostTestBase {
    private static final float EPSILON = 1e-6f;

    @Test
    void touchesAreNormalisedWithYUpAndOtherActionsIgnored() {
        readyScene(540, 960);
        host.prehandleTouch(0, 0, 0);
        host.prehandleTouch(540, 960, 1);
        host.prehandleTouch(-54, 1056, 2);
        host.prehandleTouch(10, 10, 3);
        host.prehandleTouch(10, 10, -1);
        List<TestScene.Event> events = TestScene.events();
        assertEquals(List.of(TestScene.TOUCH_DOWN, TestScene.TOUCH_UP, TestScene.TOUCH_MOVE), TestScene.kinds());
        assertEquals(0.0f, events.get(0).x);
        assertEquals(1.0f, events.get(0).y);
        assertEquals(1.0f, events.get(1).x);
        assertEquals(0.0f, events.get(1).y);
        assertEquals(-0.1f, events.get(2).x, EPSILON);
        assertEquals(-0.1f, events.get(2).y, EPSILON);
    }

    @Test
    void switchingOrientationSetsAspectAndScaleFromTheSceneSize() {
        float[][] cases = {{540, 960, 0.5625f, 1.0f, 1.7777778f}, {960, 540, 1.7777778f, 1.7777778f, 1.0f}};
        for (float[] c : cases) {
            readyScene((int) c[0], (int) c[1]);
            host.prehandleSetOrientation(1);
            host.prehandleInitEffect();
            TestScene.Event init = TestScene.events().get(0);
            assertEquals(TestScene.INIT_EFFECT_ALTERNATE, init.kind);
            assertEquals(1, init.orientation);
            assertEquals(c[2], init.aspect, EPSILON);
            assertEquals(c[3], init.scaleX, EPSILON);
            assertEquals(c[4], init.scaleY, EPSILON);
        }
    }

    @Test
    void eventsAreDroppedWhileTheSceneIsNotReady() {
        TestScene.setDrawResult(5);
        freshStart(540, 960);
        TestScene.clearEvents();
        sendEveryEvent();
        assertEquals(0, TestScene.eventCount());

        host.prehandleInitEffect();
        host.prehandleSetOrientation(1);
        TestScene.clearEvents();
        sendEveryEvent();
        assertEquals(0, TestScene.eventCount());

        host.prehandleSetOrientation(0);
        assertEquals(5, host.prehandleDraw());
    }

    private void sendEveryEvent() {
        assertEquals(0, host.prehandleDraw());
        host.prehandleTouch(1, 1, 0);
        host.prehandleTouch(1, 1, 1);
        host.prehandleTouch(1, 1, 2);
        host.prehandleMenuPressed();
        host.prehandleVolumeUpPressed();
        host.prehandleVolumeDownPressed();
        host.prehandleParam(1, 2);
        host.prehandleClearEffect();
        host.prehandleAffordance();
        host.prehandleUnlock();
    }

    @Test
    void drawReturnsTheSceneResultUnchangedAndDrawsInTheHostContext() {
        readyScene(64, 64);
        TestScene.setClearColour(true, 0.0f, 1.0f, 0.0f, 1.0f);
        for (int result : new int[] {1, 0, -7, Integer.MIN_VALUE, Integer.MAX_VALUE}) {
            TestScene.setDrawResult(result);
            assertEquals(result, host.prehandleDraw());
        }
        assertEquals(0x00FF00FF, TestHost.readPixel(5, 5));
        assertEquals(5, TestScene.count(TestScene.DRAW));
    }

    @Test
    void restartMakesAFreshSceneInitialisedForItsOwnOrientation() {
        readyScene(540, 960);
        TestScene.setInitialOrientation(1);
        host.prehandleRestart();
        assertEquals(List.of(TestScene.DESTROYED, TestScene.CREATED, TestScene.INIT_EFFECT_ALTERNATE),
                TestScene.kinds());
        assertEquals(2, TestScene.events().get(2).scene);
        TestScene.setDrawResult(3);
        assertEquals(3, host.prehandleDraw());
    }

    @Test
    void stopAndPauseBothDestroyTheScene() {
        for (int i = 0; i < 2; ++i) {
            readyScene(540, 960);
            if (i == 0) host.prehandleStop(); else host.prehandlePause();
            assertEquals(List.of(TestScene.DESTROYED), TestScene.kinds());
            assertFalse(TestHost.hasScene());
            assertEquals(0, host.prehandleDraw());
            host.prehandleInitEffect();
            assertEquals(1, TestScene.eventCount());
        }
    }

    @Test
    void keysReachKeyPressedUnchangedAndTheLettersAAndUDoOneThingEach() {
        readyScene(540, 960);
        host.prehandleMenuPressed();
        host.prehandleVolumeUpPressed();
        host.prehandleVolumeDownPressed();
        TestHost.pressKey(3);
        TestHost.pressKey(1000);
        List<TestScene.Event> keys = TestScene.events();
        assertEquals(5, keys.size());
        int[] expected = {0, 1, 2, 3, 1000};
        for (int i = 0; i < expected.length; ++i) {
            assertEquals(TestScene.KEY_PRESSED, keys.get(i).kind);
            assertEquals(expected[i], keys.get(i).a);
        }
        TestScene.clearEvents();
        TestHost.pressKey(65);
        assertEquals(List.of(TestScene.AFFORDANCE), TestScene.kinds());
        TestScene.clearEvents();
        TestHost.pressKey(85);
        assertEquals(List.of(TestScene.UNLOCK), TestScene.kinds());
    }

    @Test
    void hostEventsReachAReadySceneWithTheirValues() {
        readyScene(540, 960);
        host.prehandleClearEffect();
        host.prehandleAffordance();
        host.prehandleUnlock();
        host.prehandleParam(-3, 77);
        assertEquals(List.of(TestScene.CLEAR_EFFECT, TestScene.CLEAR_EFFECT, TestScene.AFFORDANCE, TestScene.UNLOCK,
                        TestScene.PARAM), TestScene.kinds());
        TestScene.Event param = TestScene.events().get(4);
        assertEquals(-3, param.a);
        assertEquals(77, param.b);
    }

    @Test
    void nothingHappensAndNoRandomNumberIsDrawnBeforeTheSceneIsReady() {
        TestHost.seedRandom(4242);
        long first = TestHost.nextRandom();
        for (int state = 0; state < 2; ++state) {
            if (state == 1) freshStart(540, 960);
            TestScene.clearEvents();
            TestHost.seedRandom(4242);
            for (int key : new int[] {84, 67, 65, 85, 0, 7}) TestHost.pressKey(key);
            assertEquals(first, TestHost.nextRandom());
            assertEquals(0, TestScene.eventCount());
        }
        assertTrue(TestHost.hasScene());
    }
}
