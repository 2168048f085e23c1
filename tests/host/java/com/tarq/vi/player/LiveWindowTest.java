package com.tarq.vi.player;

import static java.nio.charset.StandardCharsets.UTF_8;
import static org.junit.jupiter.api.Assertions.*;

import java.awt.image.BufferedImage;
import java.nio.file.Files;
import java.nio.file.NoSuchFileException;
import java.nio.file.Path;
import java.nio.file.StandardCopyOption;
import java.util.ArrayList;
import java.util.List;
import java.util.concurrent.Callable;
import java.util.concurrent.TimeUnit;
import java.util.regex.Pattern;
import java.util.stream.Stream;
import javax.imageio.ImageIO;
import org.junit.jupiter.api.Test;

/**
 * The live window on a virtual display (run under xvfb-run), driven by real
 * input through XTest (xdotool) and read back through its own screenshot key,
 * in one session as an author keeps it open: the test effect paints white
 * where the finger goes over its colour, and is rebuilt while the window runs,
 * also with builds that end its process. The window is found by its class,
 * whichever process has opened it. Before it, the ways the window ends at once:
 * no display, a bad option, a crash; after it, the ways it is ended from outside.
 */
class LiveWindowTest {
    private static final int BLUE = 0x2050E0, ORANGE = 0xF08020, WHITE = 0xFFFFFF, GREEN = 0x00FF00;
    private static final String[] FIND_WINDOW = {"xdotool", "search", "--classname", "^vi-live$"};
    private Path scratch, plugin, log;  // log: the window's output and errors
    private Process live;
    private int shots;

    @Test
    void oneSessionAsAnAuthorKeepsTheWindowOpen() throws Exception {
        scratch = Files.createTempDirectory(Files.createDirectories(Path.of(System.getProperty("vi.scratch"))), "run-");
        plugin = scratch.resolve("libscene.so");
        log = scratch.resolve("log.txt");
        Files.copy(Path.of(System.getProperty("vi.blue")), plugin);
        // Without a display, status 1 and a hint; for a bad option, status 2.
        String viLive = System.getProperty("vi.live");
        String noDisplay = run("env", "-u", "DISPLAY", "-u", "WAYLAND_DISPLAY", viLive, plugin.toString());
        assertTrue(noDisplay.contains("run it under xvfb-run") && noDisplay.endsWith("status 1"), noDisplay);
        String badOption = run(viLive, "--fps", "30", plugin.toString());
        assertTrue(badOption.contains("unknown option --fps") && badOption.endsWith("status 2"), badOption);
        // A crash in the effect, run from a copy that is gone: the signal's status and the effect's own line.
        String crash = run(viLive, mistake("nullwrite").toString());
        assertTrue(crash.contains("vi-live: error: the effect crashed: SIGSEGV") && crash.contains("draw")
            && crash.contains("Mistake.cpp:") && crash.endsWith("status 139"), crash);

        // A misspelt image: a warning with the nearest name, once for the whole session, reloads and all.
        live = new ProcessBuilder(viLive, "--size", "180x320", "--image", "wallpapr=" + System.getProperty("vi.picture"),
            plugin.toString()).directory(scratch.toFile()).redirectOutput(log.toFile()).redirectErrorStream(true).start();
        awaitText("vi-live: playing");
        String misspelt = "vi-live: warning: the image 'wallpapr' is handed in but the effect never asks for it;"
            + " did you mean 'wallpaper'?";
        awaitText(misspelt);
        String window = findWindow();
        run("xdotool", "mousemove", "--window", window, "90", "300");
        BufferedImage before = shot();
        assertEquals(BLUE, before.getRGB(90, 160) & WHITE, "the effect's colour");

        // A drag paints along its path and changes nothing farther than 8 pixels from it.
        StringBuilder drag = new StringBuilder("mousemove --window " + window + " 40 100 mousedown 1");
        for (int x = 44; x <= 140; x += 4) drag.append(" mousemove --window ").append(window).append(" " + x + " 100");
        run(("xdotool " + drag + " mouseup 1").split(" "));
        BufferedImage painted = shot();
        for (int y = 0; y < 320; ++y) {
            for (int x = 0; x < 180; ++x) {
                if (y == 100 && x >= 40 && x <= 140) assertEquals(WHITE, painted.getRGB(x, y) & WHITE, "x " + x);
                if (Math.abs(y - 100) > 8 || x < 32 || x > 148) assertEquals(before.getRGB(x, y), painted.getRGB(x, y));
            }
        }

        // The orientation key turns the frame, drawn all over, and back.
        run("xdotool", "key", "o");
        BufferedImage w = shot();
        assertEquals(List.of(320, 180, BLUE), List.of(w.getWidth(), w.getHeight(), w.getRGB(300, 170) & WHITE));
        run("xdotool", "key", "o");
        assertTrue(matches(shot(), painted), "turned back");

        // After a lost context the frame is the one before, within the golden tolerance.
        run("xdotool", "key", "l");
        assertTrue(matches(shot(), painted), "after a lost context");
        awaitText("GL context lost and replaced");

        // A rebuild in another colour replaces the running effect in the same window; builds
        // that do not load leave it running and say why.
        rebuild(Path.of(System.getProperty("vi.orange")), "vi-live: reloaded");
        assertEquals(ORANGE, shot().getRGB(90, 160) & WHITE);
        assertEquals(window + "\nstatus 0", run(FIND_WINDOW), "the same window");
        assertEquals(List.of(1, 2), leftBehind(live).stream().map(Path::getNameCount).toList(),
            "the running effect's copy is gone once loaded: only its folder and the window's state");
        rebuild(Path.of(System.getProperty("vi.nofactory")),
            "the running effect stays: the library has no \"createScene\"");
        rebuild(Files.writeString(scratch.resolve("garbage.so"), "x".repeat(4096)), "invalid ELF header");
        rebuild(Path.of(System.getProperty("vi.missingsymbol")), "undefined symbol: absentFromEveryLibrary");
        poll(() -> run("xdotool", "getwindowname", window).contains("reload failed") ? "" : null);

        // Key code 67 would freeze the window for good: refused, and the window goes on.
        live.outputWriter().append("keycode 67\n").flush();
        awaitText("key code 67 is refused");
        assertEquals(ORANGE, shot().getRGB(90, 160) & WHITE);

        // Builds that end the process, by each of the runtime's exits and by crashes: the window is back where
        // it was, turned as it was, says why in its title, and waits; the good build again brings the effect
        // back, with the image typed in.
        live.outputWriter().append("image wallpaper " + System.getProperty("vi.picture") + "\n").flush();
        poll(() -> (shot().getRGB(4, 316) & WHITE) == GREEN ? "" : null);
        run("xdotool", "windowmove", window, "130", "70");
        run("xdotool", "key", "o");
        String placed = poll(() -> geometry().contains("Position: 130,70") ? geometry() : null);
        assertTrue(placed.contains("Geometry: 320x180"), placed);
        String[][] endings = {{"shader", "the fragment shader does not compile (the effect ended with status 88)"},
            {"link", "the shader program does not link (the effect ended with status 67)"},
            {"ghost", "it has no asset folder (the effect ended with status 71)"},
            {"file", "could not open a file (the effect ended with status 45)"},
            {"abort", "the effect crashed: SIGABRT"}, {"nullwrite", "the effect crashed: SIGSEGV"}};
        for (String[] ending : endings) {
            rebuild(mistake(ending[0]), ending[1]);
            poll(() -> run("xdotool", "getwindowname", findWindow()).contains(ending[1]) ? "" : null);
            assertEquals(placed, geometry(), "the window back in its place after " + ending[0]);
        }
        Files.copy(Path.of(System.getProperty("vi.blue")), plugin, StandardCopyOption.REPLACE_EXISTING);
        // Orange, the two that started and crashed at their first frame, then blue.
        poll(() -> Files.readString(log).split("vi-live: reloaded", -1).length == 5 ? "" : null);
        BufferedImage back = shot();
        assertEquals(List.of(320, 180, BLUE, GREEN), List.of(back.getWidth(), back.getHeight(),
            back.getRGB(300, 170) & WHITE, back.getRGB(4, 176) & WHITE), "the effect back, turned, with its image");
        assertEquals(placed, geometry());

        assertEquals(1, Files.readString(log).split(Pattern.quote(misspelt), -1).length - 1, "warned once");
        run("xdotool", "key", "q");
        assertTrue(live.waitFor(20, TimeUnit.SECONDS), "q did not close the window");
        assertEquals(0, live.exitValue(), Files.readString(log));
        assertEquals(List.of(), leftBehind(live));
    }

    /**
     * However vi-live or its window process is ended from outside, neither
     * process nor their files stay; only the unexpected end is reported.
     */
    @Test
    void endedFromOutsideLeavesNothing() throws Exception {
        scratch = Files.createTempDirectory(Files.createDirectories(Path.of(System.getProperty("vi.scratch"))), "end-");
        // Whom the signal is sent to, the signal, vi-live's status and the error it gives, if any.
        String[][] rows = {{"vi-live", "TERM", "143", ""}, {"vi-live", "KILL", "137", ""},
            {"window", "KILL", "137", "vi-live: error: the window's process was ended by signal 9"}};
        for (String[] row : rows) {
            log = scratch.resolve(row[0] + "-" + row[1] + ".txt");
            live = new ProcessBuilder(System.getProperty("vi.live"), System.getProperty("vi.blue"))
                .redirectOutput(log.toFile()).redirectErrorStream(true).start();
            awaitText("vi-live: playing");
            List<ProcessHandle> window = live.descendants().toList();
            assertEquals(1, window.size());
            run("kill", "-" + row[1], "" + (row[0].equals("window") ? window.get(0).pid() : live.pid()));
            assertEquals(Integer.parseInt(row[2]), live.waitFor(), String.join(" ", row));
            for (long end = System.currentTimeMillis() + 20_000; running(window.get(0)); Thread.sleep(20)) {
                assertTrue(System.currentTimeMillis() < end, "the window process outlives " + String.join(" ", row));
            }
            List<String> errors = Files.readAllLines(log).stream().filter(l -> l.startsWith("vi-live: error:")).toList();
            assertEquals(row[3].isEmpty() ? List.of() : List.of(row[3]), errors, String.join(" ", row));
            assertEquals(List.of(), leftBehind(live), String.join(" ", row));
            assertTrue(run(FIND_WINDOW).endsWith("status 1"), String.join(" ", row));
        }
    }

    private static Path mistake(String name) {
        return Path.of(System.getProperty("vi.mistakes"), "libvi_mistake_" + name + ".so");
    }

    /** A process that has not ended; one ended but not yet reaped by whoever adopted it has. */
    private static boolean running(ProcessHandle process) throws Exception {
        Path stat = Path.of("/proc/" + process.pid() + "/stat");
        try {
            String fields = Files.readString(stat);
            return !fields.substring(fields.lastIndexOf(')') + 2).startsWith("Z");
        } catch (NoSuchFileException e) {
            return false;
        }
    }

    /** The window's folders in the temporary folder, and what they hold. */
    private static List<Path> leftBehind(Process live) throws Exception {
        Path temporary = Path.of(System.getProperty("java.io.tmpdir"));
        String prefix = "vi-live-" + live.pid() + "-";
        List<Path> found = new ArrayList<>();
        try (Stream<Path> folders = Files.list(temporary)) {
            for (Path folder : folders.filter(p -> p.getFileName().toString().startsWith(prefix)).toList()) {
                try (Stream<Path> inside = Files.walk(folder)) {
                    inside.map(temporary::relativize).forEach(found::add);
                }
            }
        }
        return found;
    }

    private String findWindow() throws Exception {
        return poll(() -> run(FIND_WINDOW).lines().findFirst().filter(id -> !id.startsWith("status")).orElse(null));
    }

    /** Where the window is and its size, whichever window it is. */
    private String geometry() throws Exception {
        return run("xdotool", "getwindowgeometry", findWindow()).replaceFirst("Window \\d+", "");
    }

    /** A new build lands as a linker writes it, the file rewritten in place; the window tells what it made of it. */
    private void rebuild(Path library, String text) throws Exception {
        Files.copy(library, plugin, StandardCopyOption.REPLACE_EXISTING);
        awaitText(text);
    }

    /** The same picture, as the golden frames judge it: at most 0.2 % of the pixels more than 8 apart in a channel. */
    private static boolean matches(BufferedImage picture, BufferedImage before) {
        return picture.getWidth() == before.getWidth() && picture.getHeight() == before.getHeight()
            && FrameDifference.of(picture, before, 8).differing() <= 0.002 * before.getWidth() * before.getHeight();
    }

    /** Presses the screenshot key and reads the picture once it is there. */
    private BufferedImage shot() throws Exception {
        Path file = scratch.resolve(String.format("live-%03d.png", ++shots));
        run("xdotool", "key", "p");
        poll(() -> Files.exists(file) ? file : null);
        return ImageIO.read(file.toFile());
    }

    private void awaitText(String text) throws Exception {
        poll(() -> Files.exists(log) && Files.readString(log).contains(text) ? text : null);
    }

    /** Polls until the probe gives a value; fails at the deadline, or when the window closes. */
    private <T> T poll(Callable<T> probe) throws Exception {
        for (long end = System.currentTimeMillis() + 20_000; System.currentTimeMillis() < end; Thread.sleep(20)) {
            T value = probe.call();
            if (value != null) return value;
            assertTrue(live.isAlive(), "the window closed: " + Files.readString(log));
        }
        throw new AssertionError("nothing within 20 s; the window said: " + Files.readString(log));
    }

    /** Runs a command to its end: its output, then "status N". */
    private static String run(String... command) throws Exception {
        Process process = new ProcessBuilder(command).redirectErrorStream(true).start();
        return new String(process.getInputStream().readAllBytes(), UTF_8) + "status " + process.waitFor();
    }
}
