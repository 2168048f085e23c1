package com.tarq.vi.player;

import static org.junit.jupiter.api.Assertions.assertEquals;

import java.util.List;
import org.junit.jupiter.api.Test;

/**
 * The JVM's own uses of SIGSEGV go on once the crash handler watches this
 * thread, as the render thread: null checks in compiled code, Java stack
 * overflows, and collections. Run with the signal chaining library preloaded,
 * as the launchers do, and without it, when the handler must stay out.
 */
class JvmSignalsTest {
    private static final int[] ONE = {1};

    private static int deeper(int depth) {
        return depth < 0 ? 0 : deeper(depth + 1) + 1;
    }

    private static int first(int[] array) {
        return array[0];
    }

    @Test
    void theJvmKeepsItsSignalsOnTheWatchedThread() throws Exception {
        Session.loadLibraries("the test");
        Desktop.explainFatalExits("vi-test");
        int nulls = 0;
        int overflows = 0;
        long sum = 0;
        for (int i = 0; i < 3_000_000; ++i) {
            try {
                sum += first(i % 1000 == 999 ? null : ONE);
            } catch (NullPointerException e) {
                ++nulls;
            }
            if (i % 500_000 == 0) System.gc();
        }
        for (int i = 0; i < 50; ++i) {
            try {
                deeper(0);
            } catch (StackOverflowError e) {
                ++overflows;
            }
        }
        assertEquals(List.of(3000, 50, 2_997_000L), List.of(nulls, overflows, sum));
    }
}
