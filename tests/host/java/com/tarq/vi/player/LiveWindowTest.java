package com.tarq.vi.player;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.awt.image.BufferedImage;
import java.io.IOException;
import java.io.OutputStream;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.StandardCopyOption;
import java.util.ArrayList;
import java.util.List;
import java.util.concurrent.TimeUnit;
import javax.imageio.ImageIO;
import org.junit.jupiter.api.AfterAll;
import org.junit.jupiter.api.BeforeAll;
import org.junit.jupiter.api.MethodOrderer;
import org.junit.jupiter.api.Order;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.TestInstance;
import org.junit.jupiter.api.TestMethodOrder;

/**
 * The live window on a virtual display (run under xvfb-run), driven by real
 * input through XTest (xdotool) and read back through the window's own
 * screenshot key. One window for the whole class, as an author keeps it open:
 * the test effect paints white where the finger goes over its background
 * colour, and is rebuilt in another colour while the window runs.
 */
@TestInstance(TestInstance.Lifecycle.PER_CLASS)
@TestMethodOrder(MethodOrderer.OrderAnnotation.class)
class LiveWindowTest {
    private static final Path LIVE = Path.of(System.getProperty("vi.live"));
    private static final Path BLUE = Path.of(System.getProperty("vi.blue"));
    private static final Path ORANGE = Path.of(System.getProperty("vi.orange"));
    private static final Path NO_FACTORY = Path.of(System.getProperty("vi.nofactory"));
    private static final Path MISSING_SYMBOL = Path.of(System.getProperty("vi.missingsymbol"));
    private static final Path SCRATCH = Path.of(System.getProperty("vi.scratch"));
    private static final int BLUE_RGB = 0x2050E0;
    private static final int ORANGE_RGB = 0xF08020;
    private static final int WHITE_RGB = 0xFFFFFF;
    private static final long DEADLINE_MS = 20_000;

    private final Path plugin = SCRATCH.resolve("libscene.so");
    private final Path out = SCRATCH.resolve("out.txt");
    private final Path err = SCRATCH.resolve("err.txt");
    private Process live;
    private OutputStream console;
    private String window;
    private int shots;

    @BeforeAll
    void openTheWindow() throws Exception {
        deleteTree(SCRATCH);
        Files.createDirectories(SCRATCH);
        Files.copy(BLUE, plugin);
        live = new ProcessBuilder(LIVE.toString(), "--size", "180x320", plugin.toString()).directory(SCRATCH.toFile())
            .redirectOutput(out.toFile()).redirectError(err.toFile()).start();
        console = live.getOutputStream();
        awaitText(out, "vi-live: playing");
        window = poll("the live window", () -> {
            String found = run("xdotool", "search", "--pid", "" + live.pid()).strip();
            return found.isEmpty() ? null : found.lines().findFirst().get();
        });
        xdotool("mousemove", "--window", window, "90", "300");
        assertEquals(BLUE_RGB, shot().getRGB(90, 160) & 0xFFFFFF, "the effect's colour");
    }

    @AfterAll
    void quitKeyEndsWithStatusZero() throws Exception {
        xdotool("key", "q");
        assertTrue(live.waitFor(DEADLINE_MS, TimeUnit.MILLISECONDS), "the window did not close");
        assertEquals(0, live.exitValue(), Files.readString(err));
    }

    @Test
    @Order(1)
    void aDragPaintsAlongItsPathAndNowhereElse() throws Exception {
        BufferedImage before = shot();
        List<String> drag = new ArrayList<>(List.of("mousemove", "--window", window, "40", "100", "mousedown", "1"));
        for (int x = 44; x <= 140; x += 4) drag.addAll(List.of("mousemove", "--window", window, "" + x, "100"));
        drag.addAll(List.of("mouseup", "1"));
        xdotool(drag.toArray(String[]::new));
        BufferedImage after = shot();
        for (int x = 40; x <= 140; x += 2) assertEquals(WHITE_RGB, after.getRGB(x, 100) & 0xFFFFFF, "x " + x);
        for (int y = 0; y < after.getHeight(); ++y) {
            for (int x = 0; x < after.getWidth(); ++x) {
                boolean nearPath = Math.abs(y - 100) <= 8 && x >= 32 && x <= 148;
                if (!nearPath) assertEquals(before.getRGB(x, y), after.getRGB(x, y), "changed at " + x + ", " + y);
            }
        }
    }

    @Test
    @Order(2)
    void theOrientationKeyTurnsTheFrameAndBack() throws Exception {
        xdotool("key", "o");
        BufferedImage turned = shot();
        assertEquals(320, turned.getWidth());
        assertEquals(180, turned.getHeight());
        assertEquals(BLUE_RGB, turned.getRGB(300, 170) & 0xFFFFFF, "drawn over the whole landscape frame");
        xdotool("key", "o");
        assertEquals(180, shot().getWidth());
    }

    @Test
    @Order(3)
    void framesAfterALostContextMatchThoseBefore() throws Exception {
        BufferedImage before = shot();
        xdotool("key", "l");
        BufferedImage after = shot();
        assertTrue(Files.readString(out).contains("GL context lost and replaced"));
        assertTrue(PictureTolerance.matches(after, before), PictureTolerance.beyondTolerance(after, before)
            + " pixels differ after the lost context");
        assertEquals(WHITE_RGB, after.getRGB(90, 100) & 0xFFFFFF, "the painted path is still there");
    }

    @Test
    @Order(4)
    void aRebuiltPluginReplacesTheRunningOneInTheSameWindow() throws Exception {
        rebuild(ORANGE);
        awaitText(out, "vi-live: reloaded");
        assertEquals(ORANGE_RGB, shot().getRGB(90, 160) & 0xFFFFFF);
        assertEquals(window, run("xdotool", "search", "--pid", "" + live.pid()).strip(), "the same window");
    }

    @Test
    @Order(5)
    void aBuildThatDoesNotLoadLeavesTheRunningEffectAndSaysWhy() throws Exception {
        rebuild(NO_FACTORY);
        awaitText(err, "does not load, the running effect stays: the library has no \"createScene\"");
        Files.writeString(SCRATCH.resolve("garbage.so"), "not a library\n".repeat(100));
        rebuild(SCRATCH.resolve("garbage.so"));
        awaitText(err, "invalid ELF header");
        rebuild(MISSING_SYMBOL);
        awaitText(err, "undefined symbol: absentFromEveryLibrary");
        assertEquals(ORANGE_RGB, shot().getRGB(90, 160) & 0xFFFFFF);
        await("the failure in the title", () -> run("xdotool", "getwindowname", window).contains("reload failed"));
    }

    @Test
    @Order(6)
    void theBlockingDeveloperKeyIsRefusedAndTheWindowGoesOn() throws Exception {
        console.write("keycode 67\n".getBytes(StandardCharsets.UTF_8));
        console.flush();
        awaitText(err, "key code 67 is refused");
        assertEquals(ORANGE_RGB, shot().getRGB(90, 160) & 0xFFFFFF);
    }

    @Test
    @Order(7)
    void noDisplayAndBadOptionsAreToldApart() throws Exception {
        ProcessBuilder headless = new ProcessBuilder(LIVE.toString(), BLUE.toString()).redirectErrorStream(true);
        headless.environment().remove("DISPLAY");
        headless.environment().remove("WAYLAND_DISPLAY");
        Process noDisplay = headless.start();
        String message = new String(noDisplay.getInputStream().readAllBytes(), StandardCharsets.UTF_8);
        assertEquals(1, noDisplay.waitFor(), message);
        assertTrue(message.contains("run it under xvfb-run"), message);
        Process badOption =
            new ProcessBuilder(LIVE.toString(), "--fps", "30", BLUE.toString()).redirectErrorStream(true).start();
        message = new String(badOption.getInputStream().readAllBytes(), StandardCharsets.UTF_8);
        assertEquals(2, badOption.waitFor(), message);
        assertTrue(message.contains("unknown option --fps"), message);
    }

    /** A new build lands as a linker writes it: the file rewritten in place. */
    private void rebuild(Path library) throws IOException {
        Files.copy(library, plugin, StandardCopyOption.REPLACE_EXISTING);
    }

    /** Presses the screenshot key and reads the picture once it is there. */
    private BufferedImage shot() throws Exception {
        Path file = SCRATCH.resolve(String.format("live-%03d.png", ++shots));
        xdotool("key", "p");
        await(file.toString(), () -> Files.exists(file));
        BufferedImage image = ImageIO.read(file.toFile());
        assertTrue(image != null, "not a picture: " + file);
        return image;
    }

    private void awaitText(Path file, String text) throws Exception {
        await("\"" + text + "\" in " + file, () -> Files.exists(file) && Files.readString(file).contains(text));
    }

    private interface Check {
        boolean holds() throws Exception;
    }

    private interface Probe<T> {
        T get() throws Exception;
    }

    private void await(String what, Check check) throws Exception {
        poll(what, () -> check.holds() ? Boolean.TRUE : null);
    }

    /** Polls until the probe gives a value, or fails with what it waited for at the deadline. */
    private <T> T poll(String what, Probe<T> probe) throws Exception {
        long deadline = System.currentTimeMillis() + DEADLINE_MS;
        while (System.currentTimeMillis() < deadline) {
            T value = probe.get();
            if (value != null) return value;
            assertTrue(live.isAlive(), "the window closed while waiting for " + what + ": " + Files.readString(err));
            Thread.sleep(20);  // between looks only; the deadline decides
        }
        throw new AssertionError("no " + what + " within " + DEADLINE_MS + " ms; stderr: " + Files.readString(err));
    }

    private void xdotool(String... args) throws Exception {
        List<String> command = new ArrayList<>(List.of("xdotool"));
        command.addAll(List.of(args));
        run(command.toArray(String[]::new));
    }

    private static String run(String... command) throws Exception {
        Process process = new ProcessBuilder(command).redirectErrorStream(true).start();
        String output = new String(process.getInputStream().readAllBytes(), StandardCharsets.UTF_8);
        process.waitFor();
        return output;
    }

    private static void deleteTree(Path root) throws IOException {
        if (!Files.exists(root)) return;
        try (var paths = Files.walk(root)) {
            for (Path path : paths.sorted(java.util.Comparator.reverseOrder()).toList()) Files.delete(path);
        }
    }
}
