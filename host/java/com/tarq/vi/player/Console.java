package com.tarq.vi.player;

import java.io.BufferedReader;
import java.io.IOException;
import java.io.InputStreamReader;
import java.nio.charset.StandardCharsets;
import java.util.List;
import java.util.concurrent.ConcurrentLinkedQueue;

/**
 * Host events typed on standard input while the window runs, one a line, as
 * in a timeline without the time ("keycode 1000", "param 1 100"). A daemon
 * thread reads the lines; the render thread takes them with next().
 */
final class Console {
    private final ConcurrentLinkedQueue<String> lines = new ConcurrentLinkedQueue<>();
    private int number;

    private final Runnable onEnd;

    /** onEnd runs on the reading thread once standard input has ended. */
    Console(Runnable onEnd) {
        this.onEnd = onEnd;
        Thread reader = new Thread(this::read, "vi-live console");
        reader.setDaemon(true);
        reader.start();
    }

    /** The next event typed, or null; a line that is not an event is reported on standard error and skipped. */
    Timeline.Event next() {
        String line;
        while ((line = lines.poll()) != null) {
            ++number;
            if (line.strip().isEmpty() || line.strip().startsWith("#")) continue;
            try {
                return Timeline.parse("stdin", List.of("0 " + line)).events().get(0);
            } catch (TimelineException e) {
                System.err.println("vi-live: " + e.getMessage().replace("stdin:1:", "stdin:" + number + ":"));
            }
        }
        return null;
    }

    private void read() {
        try (BufferedReader reader = new BufferedReader(new InputStreamReader(System.in, StandardCharsets.UTF_8))) {
            for (String line = reader.readLine(); line != null; line = reader.readLine()) lines.add(line);
        } catch (IOException e) {
            // No console: the window's keys still work.
        }
        onEnd.run();
    }
}
