package com.tarq.vi.player;

import com.tarq.android.visualeffect.common.Native;
import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.StandardCopyOption;
import java.time.Instant;
import java.time.LocalTime;
import java.time.ZoneId;
import java.time.format.DateTimeFormatter;
import java.time.temporal.ChronoUnit;
import java.util.Locale;
import java.util.Map;
import java.util.Optional;
import java.util.Set;
import javax.imageio.ImageIO;

/**
 * The live host: an effect plug-in in a window, in real time, the mouse as
 * the finger and keys for the host's events, through the same JNI calls a
 * phone's host makes. A new build of the plug-in (or a change in its assets)
 * restarts the effect from a fresh copy, in the same window. Started by the
 * vi-live launcher, which names the libraries and preloads the clock library
 * (the host keeps the effect's clock, so that a pause stops it). The process
 * the launcher starts supervises (LiveSupervisor); the window runs in its
 * child, and in the next one should an effect end that process.
 */
public final class Live implements Session.Surface {
    static final String USAGE = String.join("\n",
        "usage: vi-live [options] PLUGIN.so",
        "Plays an effect plug-in in a window through the runtime's JNI host interface: the",
        "mouse is the finger, keys send the host's events, and a new build of the plug-in",
        "replaces the running one; after a build that ends the process, the window comes",
        "back and waits for the next. Lines typed on standard input are host events as in",
        "a timeline, without the time: \"keycode 1000\", \"param 1 100\", \"image NAME FILE\".",
        "",
        "  --image NAME=FILE    hand the runtime FILE (PNG or JPEG) under NAME; repeatable",
        "  --assets DIR         the plug-in's asset directory (default: assets/ beside the plug-in)",
        "  --size WxH           window size in pixels (default 540x960)",
        "  --fixed-step         every frame advances the effect's clock by exactly 1/60 s",
        "  --help               this text",
        "",
        "Keys:");
    static final Set<String> OPTIONS = Set.of("--image", "--assets", "--size", "--fixed-step", "--help");

    private static final long FRAME_NANOS = 1_000_000_000L / 60;
    private static final DateTimeFormatter CLOCK = DateTimeFormatter.ofPattern("HH:mm:ss");
    /** How long a window process that has lost its supervisor gives its render thread to end. */
    private static final long ORPHAN_MILLIS = 2000;
    /** How long a window that replaces one waits for the display to take it. */
    private static final long DISPLAY_BACK_NANOS = 3_000_000_000L;

    private final Options options;
    /** The folder shared with the supervising process: the state, and the plug-in's copies. */
    private final Path folder;
    /** The wall clock's nanoseconds less the monotonic clock's, read before the effect's clock is set. */
    private final long wallClockOffset = ChronoUnit.NANOS.between(Instant.EPOCH, Instant.now()) - System.nanoTime();
    private LiveState state;
    private final Session session;
    private final Native host;
    private final FrameTimes frameTimes = new FrameTimes();
    private final int[] event = new int[3];
    private final String name;
    private PluginWatch watch;
    private Console console;
    private AssetModels models;
    /** The copy of the plug-in the effect runs from; null while no effect runs. */
    private Path running;
    /** When the build last started was written, on the wall clock; 0 once its first frame is told. */
    private long reloadWrittenNanos;
    private final boolean benchReloads = System.getenv("VI_BENCH_RELOADS") != null;
    /** The frames a bench run draws before it ends; -1 outside a bench run. */
    private final int benchFrames = Optional.ofNullable(System.getenv("VI_BENCH_FRAMES")).map(Integer::parseInt)
        .orElse(-1);
    private String lastReload = "started";
    /** The effect's clock, from the start; stands still while paused. */
    private long effectNanos;
    private boolean paused;
    private boolean step;
    private boolean redraw;
    private boolean screenshot;
    private volatile boolean quit;
    private volatile boolean supervisorLost;

    private Live(Options options, Path folder) {
        this.options = options;
        this.folder = folder;
        session = new Session("vi-live", options.width, options.height);
        host = session.host;
        name = options.plugin.getFileName().toString();
    }

    public static void main(String[] args) {
        String folder = System.getenv(LiveSupervisor.FOLDER_VARIABLE);
        int status;
        try {
            if (folder == null) System.exit(LiveSupervisor.run());
            Options options = Options.parse(args, OPTIONS);
            if (options.help) {
                System.out.print(USAGE + "\n" + LiveKeys.table());
            } else {
                new Live(options, Path.of(folder)).run();
            }
            status = 0;
        } catch (Options.UsageException e) {
            System.err.println("vi-live: " + e.getMessage());
            System.err.print(USAGE + "\n" + LiveKeys.table());
            status = 2;
        } catch (Failure | IOException | IllegalStateException | UnsatisfiedLinkError e) {
            System.err.println("vi-live: " + e.getMessage());
            status = 1;
        }
        System.exit(status);
    }

    private void run() throws Failure, IOException {
        Path plugin = options.plugin.toAbsolutePath();
        if (!Files.isRegularFile(plugin)) throw new Failure("plug-in not found: " + options.plugin);
        state = LiveState.read(folder);
        boolean resumed = state != null;
        if (!resumed) {
            state = new LiveState();
            for (Map.Entry<String, Path> image : options.images.entrySet()) {
                state.images.put(image.getKey(), image.getValue().toAbsolutePath());
            }
        }
        for (Map.Entry<String, Path> image : state.images.entrySet()) {
            String name = image.getKey();
            session.addImage(name, image.getValue(), options.images.containsKey(name) ? "--image " + name : "stdin");
        }
        Misspellings.warnedBefore(state.warnedImages);
        Path assets = Session.assetDirectory(plugin, options.assets);
        Session.loadLibraries("vi-live", "vi.window");
        Desktop.explainFatalExits("vi-live");
        Misspellings.watch("vi-live");
        if (!Desktop.setClock(Player.FIXED_CLOCK_START)) {
            throw new Failure("the clock library is not preloaded; start it with vi-live");
        }
        session.turn(state.orientation);
        // Reading standard input from now on: should the supervisor be lost while the window opens
        // or the first build starts, this process still ends.
        console = new Console(this::loseSupervisor);
        openWindow(resumed);
        try {
            if (assets != null) Desktop.setAssetDirectory(assets.toString());
            models = new AssetModels("vi-live", assets);
            models.check();
            watch = new PluginWatch(plugin, assets, folder, resumed ? state.build : null);
            if (resumed) {
                lastReload = "ended " + wallClock() + ": " + state.ended + " | waiting for the next build";
                state.ended = null;
                redraw = true;
                System.err.println("vi-live: the window waits for the next build of " + options.plugin);
            } else {
                startFirst();
            }
            loop();
            if (running != null) host.prehandleStop();
        } finally {
            Window.close();
            if (supervisorLost) LiveSupervisor.removeFolder(folder);
        }
        frameTimes.reportForBench();
    }

    private void startFirst() throws Failure, IOException {
        Path copy = watch.copy();
        try {
            if (!start(copy)) {
                String reason = Desktop.whyNotLoadable(copy.toString());
                throw new Failure("cannot start the effect in " + options.plugin + ": "
                    + (reason != null ? reason : "the runtime refused it"));
            }
        } finally {
            PluginWatch.discard(copy);
        }
        System.out.printf("vi-live: playing %s in a %dx%d window; h for the keys%n", options.plugin,
            session.width(), session.height());
        System.out.flush();
    }

    /**
     * Starts the effect from a copy, the state written first: should the
     * effect end this process, the next window opens as this one is now.
     */
    private boolean start(Path copy) {
        state.build = watch.loaded();
        state.effectPid = ProcessHandle.current().pid();
        saveState();
        if (!session.start(copy.toString())) return false;
        running = copy;
        return true;
    }

    /** The window's state as it is now, for the next window process. */
    private void saveState() {
        int[] position = new int[2];
        Window.position(position);
        state.x = position[0];
        state.y = position[1];
        state.orientation = session.orientation();
        state.warnedImages.addAll(Misspellings.warnedImages());
        try {
            state.write(folder);
        } catch (IOException e) {
            System.err.println("vi-live: cannot keep the window's state in " + folder + ": " + e.getMessage());
        }
    }

    /**
     * Standard input has ended: the supervising process is gone, and so is this
     * one, its folder removed by the render thread once it stops writing there.
     */
    private void loseSupervisor() {
        supervisorLost = true;
        quit = true;
        try {
            Thread.sleep(ORPHAN_MILLIS);
        } catch (InterruptedException e) {
            Thread.currentThread().interrupt();
        }
        // Still here: the render thread is held in the effect.
        LiveSupervisor.removeFolder(folder);
        Runtime.getRuntime().halt(1);
    }

    private String wallClock() {
        return LocalTime.ofInstant(Instant.EPOCH.plusNanos(wallClockOffset + System.nanoTime()), ZoneId.systemDefault())
            .format(CLOCK);
    }

    /**
     * The window, where the last one was. A window that replaces one tries for
     * a while: a virtual display regenerates when its last client has gone,
     * and refuses a new one meanwhile.
     */
    private void openWindow(boolean replacing) throws Failure {
        long end = System.nanoTime() + (replacing ? DISPLAY_BACK_NANOS : 0);
        for (;;) {
            try {
                Window.open("vi-live: " + name, state.x, state.y, session.width(), session.height());
                return;
            } catch (IllegalStateException e) {
                if (System.nanoTime() >= end) {
                    throw new Failure(e.getMessage()
                        + "; without a display, run it under xvfb-run (xvfb-run -a scripts/live)");
                }
            }
            try {
                Thread.sleep(50);
            } catch (InterruptedException e) {
                Thread.currentThread().interrupt();
            }
        }
    }

    /** One frame a sixtieth of a second: events, a settled build, the frame, the title. */
    private void loop() throws IOException {
        long last = System.nanoTime();
        long next = last;
        long titled = 0;
        while (!quit) {
            long now = System.nanoTime();
            if (!paused) effectNanos += options.fixedStep ? FRAME_NANOS : now - last;
            last = now;
            Desktop.setClock(Player.FIXED_CLOCK_START + effectNanos);
            for (int kind = Window.nextEvent(event); kind != Window.NONE; kind = Window.nextEvent(event)) {
                windowEvent(kind);
            }
            for (Timeline.Event typed = console.next(); typed != null; typed = console.next()) typed(typed);
            if (watch.changedAndSettled(now)) reload();
            if (step) effectNanos += FRAME_NANOS;
            Desktop.setClock(Player.FIXED_CLOCK_START + effectNanos);
            if (running == null) {
                showNothing();
            } else if (!paused || step || redraw || screenshot) {
                frame();
            }
            if (now - titled >= 1_000_000_000L) {
                titled = now;
                Window.setTitle(title());
                saveState();
            }
            if (benchFrames >= 0) {
                quit |= frameTimes.count() >= benchFrames;
            } else {
                next = pace(next);
            }
        }
    }

    private void frame() throws IOException {
        long started = System.nanoTime();
        host.prehandleDraw();
        if (screenshot) saveScreenshot();
        Window.swap();
        frameTimes.add(System.nanoTime() - started);
        step = redraw = screenshot = false;
        // A bench run measures, and ends when its frames are done: it never waits for a build.
        if (!state.shown && benchFrames < 0) {
            state.shown = true;
            saveState();
        }
        if (reloadWrittenNanos != 0 && benchReloads) {
            System.out.printf(Locale.ROOT, "reload-ms %.1f%n", (wallClockOffset + System.nanoTime()
                - reloadWrittenNanos) / 1e6);
            System.out.flush();
        }
        reloadWrittenNanos = 0;
    }

    /** No effect runs: the window is drawn dark when it needs drawing, and a screenshot shows that. */
    private void showNothing() throws IOException {
        if (!redraw && !screenshot) return;
        Window.clear();
        if (screenshot) saveScreenshot();
        Window.swap();
        redraw = screenshot = false;
    }

    /** A host event typed on standard input; an image is handed in again at each start. */
    private void typed(Timeline.Event typed) {
        if (typed.kind().equals("end")) quit = true;
        try {
            if (typed.kind().equals("image")) {
                String name = typed.arguments().get(0);
                Path file = Session.imagePath(typed, Path.of("")).toAbsolutePath();
                session.addImage(name, file, "stdin");
                state.images.remove(name);
                state.images.put(name, file);
            }
            if (running != null) {
                session.apply(typed, this, Path.of(""));
            } else if (!typed.kind().equals("image") && !typed.kind().equals("end")) {
                System.err.println("vi-live: no effect runs; '" + typed.kind() + "' is dropped, and the window waits"
                    + " for the next build");
            }
        } catch (IOException e) {
            System.err.println("vi-live: stdin: " + e.getMessage());
        }
    }

    private void windowEvent(int kind) throws IOException {
        if (running == null && kind != Window.QUIT && kind != Window.KEY && kind != Window.EXPOSED) return;
        switch (kind) {
            case Window.QUIT -> quit = true;
            case Window.TOUCH_DOWN -> host.prehandleTouch(event[1], event[2], 0);
            case Window.TOUCH_MOVE -> host.prehandleTouch(event[1], event[2], 2);
            case Window.TOUCH_UP -> host.prehandleTouch(event[1], event[2], 1);
            case Window.KEY -> key(LiveKeys.of(event[1]));
            case Window.EXPOSED -> redraw = true;
            default -> { }
        }
    }

    private void key(LiveKeys key) throws IOException {
        if (key == null) return;
        if (running == null && key != LiveKeys.QUIT && key != LiveKeys.HELP && key != LiveKeys.SCREENSHOT
            && key != LiveKeys.RELOAD) {
            System.err.println("vi-live: no effect runs; the window waits for the next build");
            return;
        }
        switch (key) {
            case AFFORDANCE -> host.prehandleAffordance();
            case UNLOCK -> host.prehandleUnlock();
            case CLEAR -> host.prehandleClearEffect();
            case MENU -> host.prehandleMenuPressed();
            case VOLUME_UP -> host.prehandleVolumeUpPressed();
            case VOLUME_DOWN -> host.prehandleVolumeDownPressed();
            case ORIENTATION -> session.rotate(session.orientation() == 0 ? 1 : 0, this);
            case LOSE_CONTEXT -> loseContext();
            case RESTART -> host.prehandleRestart();
            case PAUSE -> paused = !paused;
            case STEP -> step = paused;
            case SCREENSHOT -> screenshot = true;
            case RELOAD -> reload();
            case HELP -> System.err.print(LiveKeys.table());
            case QUIT -> quit = true;
        }
    }

    /**
     * Checks the plug-in as it is now, then restarts the effect from a fresh
     * copy with the same window, orientation and images; a build that does
     * not load leaves the running effect, or the window waiting.
     */
    private void reload() {
        watch.markLoaded();
        models.check();
        Path copy;
        String reason;
        try {
            copy = watch.copy();
            reason = Desktop.whyNotLoadable(copy.toString());
        } catch (IOException e) {
            copy = null;
            reason = "cannot copy it: " + e.getMessage();
        }
        Path before = running;
        boolean started = copy != null && reason == null && start(copy);
        if (copy != null) PluginWatch.discard(copy);
        if (started) {
            reloadWrittenNanos = watch.written();
            lastReload = "reloaded " + wallClock();
            System.out.println("vi-live: reloaded " + options.plugin);
            System.out.flush();
        } else {
            if (reason == null) {
                reason = "the runtime refused it";
                // The running copy is gone from the disk, but the loader still holds it under its path.
                if (before != null) session.start(before.toString());
            }
            lastReload = "reload failed " + wallClock() + ": " + reason;
            System.err.println("vi-live: the new build of " + options.plugin + " does not load, "
                + (before != null ? "the running effect stays: " : "the window waits for the next: ") + reason);
        }
        Window.setTitle(title());
    }

    private String title() {
        String frames = running == null ? "" : frameTimes.summary() + (paused ? " | paused" : "") + " | ";
        return "vi-live: " + name + " | " + frames + lastReload
            + " | " + LiveKeys.line();
    }

    /** The frame just drawn, before it is shown, into the next free live-NNN.png of the current folder. */
    private void saveScreenshot() throws IOException {
        Path file;
        int number = 0;
        do {
            file = Path.of(String.format("live-%03d.png", ++number));
        } while (Files.exists(file));
        Path partial = Path.of("." + file + ".partial");
        ImageIO.write(session.readFrame(), "png", partial.toFile());
        Files.move(partial, file, StandardCopyOption.ATOMIC_MOVE);
        System.out.println("vi-live: screenshot " + file.toAbsolutePath());
        System.out.flush();
    }

    /** Waits for the next sixtieth of a second; a late frame moves the schedule rather than rushing the next. */
    private static long pace(long next) {
        next += FRAME_NANOS;
        long wait = next - System.nanoTime();
        if (wait <= 0) return System.nanoTime();
        try {
            Thread.sleep(wait / 1_000_000, (int) (wait % 1_000_000));
        } catch (InterruptedException e) {
            Thread.currentThread().interrupt();
        }
        return next;
    }

    @Override
    public void resize(int width, int height) {
        Window.resize(width, height);
        int[] size = new int[2];
        Window.size(size);
        if (size[0] != width || size[1] != height) {
            System.err.printf("vi-live: the window is %dx%d, not the %dx%d asked for%n", size[0], size[1], width,
                height);
        }
    }

    @Override
    public void loseContext() {
        Window.loseContext();
        System.out.println("vi-live: GL context lost and replaced");
        System.out.flush();
    }
}
