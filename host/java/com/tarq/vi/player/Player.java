package com.tarq.vi.player;

import com.tarq.android.visualeffect.common.Native;
import java.awt.image.BufferedImage;
import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.Comparator;
import java.util.List;
import java.util.Locale;
import java.util.Map;
import java.util.stream.Stream;

/**
 * The desktop host: plays an effect plug-in through the runtime's JNI host
 * interface, making the calls a phone's host makes in the order it makes
 * them, and writes what it draws. Started by the vi-player launcher, which
 * gives the libraries' paths as system properties.
 */
public final class Player {
    /** Marks a folder as the player's, so that a later render may replace it. */
    private static final String MARK = ".vi-player";
    /** The fixed clock starts at a plausible date; only differences matter to effects. */
    static final long FIXED_CLOCK_START = 1_700_000_000L * 1_000_000_000L;

    private final Options options;
    private final Session session;
    private final Native host;
    /** With --compare, what the frames are held against; else null. */
    private final References references;
    /** Held while writing into the partial folder, and by the shutdown hook that removes it. */
    private final Object partialLock = new Object();
    /** Set by the shutdown hook (Ctrl-C, SIGTERM) once it has removed the partial folder. */
    private boolean abandoned;

    private Player(Options options) {
        this.options = options;
        references = options.compare == null ? null
            : new References(options.compare, options.out, options.tolerance, options.allowedPixels);
        session = new Session("vi-player", options.width, options.height);
        host = session.host;
    }

    public static void main(String[] args) {
        int status;
        try {
            Options options = Options.parse(args);
            if (options.help) {
                System.out.println(Options.USAGE);
            } else {
                new Player(options).run();
            }
            status = 0;
        } catch (Options.UsageException e) {
            System.err.println("vi-player: error: " + e.getMessage());
            System.err.println(Options.USAGE);
            status = 2;
        } catch (Failure | TimelineException e) {
            System.err.println("vi-player: error: " + e.getMessage());
            status = 1;
        } catch (IOException e) {
            System.err.println("vi-player: error: " + e.getMessage());
            status = 1;
        } catch (IllegalStateException | UnsatisfiedLinkError e) {
            // The headless surface or a library of the player's own: no use going on.
            System.err.println("vi-player: error: " + e.getMessage());
            status = 1;
        }
        System.exit(status);
    }

    private void run() throws Failure, TimelineException, IOException {
        Path plugin = options.plugin.toAbsolutePath();
        if (!Files.isRegularFile(plugin)) throw new Failure("plug-in not found: " + options.plugin);
        Timeline timeline = options.timeline == null ? Timeline.empty() : readTimeline(options.timeline);
        for (Map.Entry<String, Path> image : options.images.entrySet()) {
            session.addImage(image.getKey(), image.getValue(), "--image " + image.getKey());
        }
        for (Timeline.Event event : timeline.events()) {
            if (event.kind().equals("image")) {
                session.addLaterImage(event.arguments().get(0), imagePath(event), options.timeline + ":" + event.line());
            }
        }
        Path out = options.out.toAbsolutePath().normalize();
        if (Files.exists(out) && !Files.exists(out.resolve(MARK))) {
            throw new Failure("output folder " + options.out + " exists and was not written by the player;"
                + " remove it or choose another with --out");
        }
        if (references != null) {
            if (out.equals(options.compare.toAbsolutePath().normalize())) {
                throw new Failure("--out and --compare name the same folder " + options.out
                    + "; the references would be replaced by the render");
            }
            references.checkFolder(options.update);
        }

        double duration = duration(timeline);
        int frames = Math.max(1, (int) Math.round(duration * options.fps));
        Path partial = out.resolveSibling("." + out.getFileName() + ".partial-" + ProcessHandle.current().pid());
        // The hook and the crash handler first, so that no signal finds the folder without them;
        // every write into the folder, its making included, goes through write().
        Runtime.getRuntime().addShutdownHook(new Thread(() -> abandon(partial)));
        Session.loadLibraries("vi-player");
        Desktop.explainFatalExits("vi-player");
        Misspellings.watch("vi-player");
        Desktop.removeOnFatalExit(partial.toString());
        try {
            Pictures pictures = write(() -> {
                Files.createDirectories(partial);
                Files.createFile(partial.resolve(MARK));
                return new Pictures(partial, options.width, options.height, options.fps, frames, options.sheetFrames);
            });
            try (pictures) {
                play(plugin, timeline, frames, pictures);
                write(() -> {
                    pictures.finish();
                    replace(out, partial);
                    return null;
                });
            }
        } finally {
            synchronized (partialLock) {
                deleteTree(partial);
            }
        }
        System.out.printf(Locale.ROOT, "frames:        %s (%s .. %s, %d frames at %d fps%s)%n", out,
            Pictures.frameName(0), Pictures.frameName(frames - 1), frames, options.fps,
            options.fixedStep ? ", fixed step" : "");
        System.out.println("contact sheet: " + out.resolve(Pictures.SHEET));
        System.out.println("preview:       " + out.resolve(Pictures.PREVIEW));
        if (references != null) reportComparison(out, frames);
    }

    /** After the render is in place: the references updated, or each frame that fails named. */
    private void reportComparison(Path out, int frames) throws Failure, IOException {
        if (options.update) {
            System.out.println("references:    " + references.update(out, frames));
            return;
        }
        references.checkForExtras(frames);
        if (references.failures().isEmpty()) {
            System.out.println("compared:      " + frames + " frames with " + options.compare + ", all within the tolerance");
            return;
        }
        for (String failure : references.failures()) System.err.println("vi-player: error: " + failure);
        throw new Failure(references.failureSummary());
    }

    private void play(Path plugin, Timeline timeline, int frames, Pictures pictures) throws Failure, IOException {
        Desktop.open(options.width, options.height);
        if (options.fixedStep && !Desktop.setClock(FIXED_CLOCK_START)) {
            throw new Failure("--fixed-step needs the player's clock library preloaded; start it with vi-player");
        }
        Path assets = Session.assetDirectory(plugin, options.assets);
        if (assets != null) Desktop.setAssetDirectory(assets.toString());
        new AssetModels("vi-player", assets).check();

        // As the phone's host: start with the library and the window, hand in
        // the images the scene asks for, initialise, then frames.
        if (!session.start(plugin.toString())) {
            String reason = Desktop.whyNotLoadable(plugin.toString());
            throw new Failure("cannot start the effect in " + options.plugin + ": "
                + (reason != null ? reason : "the runtime refused it"));
        }

        List<Timeline.Event> events = timeline.events();
        int next = 0;
        long started = System.nanoTime();
        FrameTimes frameTimes = new FrameTimes();
        Progress progress = new Progress(frames, options.quiet);
        for (int frame = 0; frame < frames; ++frame) {
            double seconds = frame / (double) options.fps;
            if (options.fixedStep) {
                Desktop.setClock(FIXED_CLOCK_START + frame * 1_000_000_000L / options.fps);
            } else {
                pace(started, seconds);
            }
            while (next < events.size() && events.get(next).time() <= seconds + 1e-9) {
                session.apply(events.get(next++), Session.HEADLESS, options.timeline.toAbsolutePath().getParent());
            }
            long drawn = System.nanoTime();
            host.prehandleDraw();
            BufferedImage image = session.readFrame();
            frameTimes.add(System.nanoTime() - drawn);
            int written = frame;
            BufferedImage diff = references == null || options.update ? null : references.compare(frame, image);
            write(() -> {
                pictures.add(written, seconds, image);
                if (diff != null) pictures.addDiff(written, diff);
                return null;
            });
            progress.frameDone(frame);
        }
        host.prehandleStop();
        frameTimes.reportForBench();
    }

    private Path imagePath(Timeline.Event event) {
        return Session.imagePath(event, options.timeline.toAbsolutePath().getParent());
    }

    private static Timeline readTimeline(Path file) throws Failure, TimelineException {
        try {
            return Timeline.read(file);
        } catch (IOException e) {
            throw new Failure("cannot read timeline " + file + ": " + e.getMessage());
        }
    }

    private double duration(Timeline timeline) {
        if (options.duration > 0) return options.duration;
        if (timeline.end() >= 0) return timeline.end();
        return timeline.events().isEmpty() ? 5 : timeline.lastTime() + 1;
    }

    /** Real time: waits until the frame's moment, as a phone's display would. */
    private static void pace(long started, double seconds) {
        long wait = started + (long) (seconds * 1e9) - System.nanoTime();
        if (wait <= 0) return;
        try {
            Thread.sleep(wait / 1_000_000, (int) (wait % 1_000_000));
        } catch (InterruptedException e) {
            Thread.currentThread().interrupt();
        }
    }

    /** Ctrl-C or SIGTERM: the partial folder goes, and nothing is written after. */
    private void abandon(Path partial) {
        synchronized (partialLock) {
            abandoned = true;
            try {
                deleteTree(partial);
            } catch (IOException e) {
                System.err.println("vi-player: cannot remove " + partial + ": " + e.getMessage());
            }
        }
    }

    /** A write into the partial folder, and what it makes. */
    private interface Write<T> {
        T run() throws IOException;
    }

    /**
     * Every write into the partial folder: under the hook's lock, and never
     * while the crash handler removes the folder (it waits for a write under
     * way, and a write that would begin after it waits for the process to end).
     */
    private <T> T write(Write<T> write) throws IOException {
        synchronized (partialLock) {
            stopIfAbandoned();
            Desktop.beginWrite();
            try {
                return write.run();
            } finally {
                Desktop.endWrite();
            }
        }
    }

    /**
     * Called holding the lock before each write. Once the hook has run, the
     * JVM halts as soon as the hooks are done: this thread waits for that
     * rather than write into a folder that is gone or report it as a failure.
     */
    private void stopIfAbandoned() {
        while (abandoned) {
            try {
                partialLock.wait();
            } catch (InterruptedException e) {
                Thread.currentThread().interrupt();
                return;
            }
        }
    }

    /** Puts the finished folder in place of the old one (a render of the player's own). */
    private static void replace(Path out, Path partial) throws IOException {
        Path old = out.resolveSibling("." + out.getFileName() + ".old-" + ProcessHandle.current().pid());
        boolean hadOld = Files.exists(out);
        if (hadOld) Files.move(out, old);
        Files.move(partial, out);
        if (hadOld) deleteTree(old);
    }

    private static void deleteTree(Path root) throws IOException {
        if (!Files.exists(root)) return;
        try (Stream<Path> paths = Files.walk(root)) {
            for (Path path : paths.sorted(Comparator.reverseOrder()).toList()) Files.delete(path);
        }
    }

    /** Frames done, on one terminal line, or every tenth of the way when not on a terminal. */
    private static final class Progress {
        private final int total;
        private final boolean quiet;
        private final boolean terminal = System.console() != null;
        private int lastTenth = -1;

        Progress(int total, boolean quiet) {
            this.total = total;
            this.quiet = quiet;
        }

        void frameDone(int frame) {
            if (quiet) return;
            int done = frame + 1;
            if (terminal) {
                System.err.printf("\rframe %d/%d", done, total);
                if (done == total) System.err.println();
            } else if (done * 10 / total > lastTenth) {
                lastTenth = done * 10 / total;
                System.err.printf("rendered %d/%d frames%n", done, total);
            }
        }
    }
}
