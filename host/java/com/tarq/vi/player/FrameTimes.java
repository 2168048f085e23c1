package com.tarq.vi.player;

import java.util.ArrayDeque;
import java.util.Arrays;
import java.util.Locale;

/**
 * How long frames take: over the last second for the live window's title,
 * and, when the environment asks for it (VI_BENCH_FRAMES, set by
 * scripts/bench), the median of every frame, printed at the end as
 * "frame-time MILLISECONDS" for the bench to compare the hosts.
 */
final class FrameTimes {
    private static final long SECOND = 1_000_000_000L;

    /** Each frame of the last second: when it ended and how long it took, in nanoseconds. */
    private final ArrayDeque<long[]> recent = new ArrayDeque<>();
    private final boolean keepAll = System.getenv("VI_BENCH_FRAMES") != null;
    private long[] all = new long[256];
    private int count;

    void add(long nanoseconds) {
        long now = System.nanoTime();
        recent.addLast(new long[] {now, nanoseconds});
        while (recent.peekFirst()[0] < now - SECOND) recent.removeFirst();
        if (keepAll) {
            if (count == all.length) all = Arrays.copyOf(all, 2 * count);
            all[count++] = nanoseconds;
        }
    }

    int count() {
        return count;
    }

    /** "12.3 ms mean, 20.1 worst, 58 fps" over the last second. */
    String summary() {
        long now = System.nanoTime();
        while (!recent.isEmpty() && recent.peekFirst()[0] < now - SECOND) recent.removeFirst();
        if (recent.isEmpty()) return "no frames";
        long sum = 0;
        long worst = 0;
        for (long[] frame : recent) {
            sum += frame[1];
            worst = Math.max(worst, frame[1]);
        }
        return String.format(Locale.ROOT, "%.1f ms mean, %.1f worst, %d fps", sum / 1e6 / recent.size(), worst / 1e6,
            recent.size());
    }

    /** Prints the median frame time when the bench asked for it. */
    void reportForBench() {
        if (!keepAll || count == 0) return;
        long[] sorted = Arrays.copyOf(all, count);
        Arrays.sort(sorted);
        System.out.printf(Locale.ROOT, "frame-time %.4f%n", sorted[count / 2] / 1e6);
    }
}
