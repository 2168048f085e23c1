package com.tarq.vi.player;

import com.tarq.android.visualeffect.common.Native;
import java.awt.image.BufferedImage;
import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.Comparator;
import java.util.HashMap;
import java.util.List;
import java.util.Locale;
import java.util.Map;
import java.util.stream.Stream;
import javax.imageio.ImageIO;

/**
 * The desktop host: plays an effect plug-in through the runtime's JNI host
 * interface, making the calls a phone's host makes in the order it makes
 * them, and writes what it draws. Started by the vi-player launcher, which
 * gives the libraries' paths as system properties.
 */
public final class Player {
    /** A failure the player reports as it is, with status 1. */
    static final class Failure extends Exception {
        private static final long serialVersionUID = 1L;

        Failure(String message) {
            super(message);
        }
    }

    /** Marks a folder as the player's, so that a later render may replace it. */
    private static final String MARK = ".vi-player";
    /** The fixed clock starts at a plausible date; only differences matter to effects. */
    private static final long FIXED_CLOCK_START = 1_700_000_000L * 1_000_000_000L;

    private final Options options;
    private final Native host = new Native();
    private final Map<Path, Image> decoded = new HashMap<>();
    private int width;
    private int height;
    private int[] pixels;

    /** A decoded picture as the host hands it in: ARGB ints, row after row. */
    private record Image(int[] argb, int width, int height) {}

    private Player(Options options) {
        this.options = options;
        width = options.width;
        height = options.height;
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
            System.err.println("vi-player: " + e.getMessage());
            System.err.println(Options.USAGE);
            status = 2;
        } catch (Failure | TimelineException e) {
            System.err.println("vi-player: " + e.getMessage());
            status = 1;
        } catch (IOException e) {
            System.err.println("vi-player: " + e.getMessage());
            status = 1;
        } catch (IllegalStateException | UnsatisfiedLinkError e) {
            // The headless surface or a library of the player's own: no use going on.
            System.err.println("vi-player: " + e.getMessage());
            status = 1;
        }
        System.exit(status);
    }

    private void run() throws Failure, TimelineException, IOException {
        Path plugin = options.plugin.toAbsolutePath();
        if (!Files.isRegularFile(plugin)) throw new Failure("plug-in not found: " + options.plugin);
        Timeline timeline = options.timeline == null ? Timeline.empty() : readTimeline(options.timeline);
        Map<String, Image> images = new HashMap<>();
        for (Map.Entry<String, Path> image : options.images.entrySet()) {
            images.put(image.getKey(), decode(image.getValue(), "--image " + image.getKey()));
        }
        for (Timeline.Event event : timeline.events()) {
            if (event.kind().equals("image")) {
                decode(imagePath(event), options.timeline + ":" + event.line());
            }
        }
        Path out = options.out.toAbsolutePath().normalize();
        if (Files.exists(out) && !Files.exists(out.resolve(MARK))) {
            throw new Failure("output folder " + options.out + " exists and was not written by the player;"
                + " remove it or choose another with --out");
        }

        double duration = duration(timeline);
        int frames = Math.max(1, (int) Math.round(duration * options.fps));
        Path partial = out.resolveSibling("." + out.getFileName() + ".partial-" + ProcessHandle.current().pid());
        Files.createDirectories(partial);
        try {
            Files.createFile(partial.resolve(MARK));
            try (Pictures pictures = new Pictures(partial, width, height, options.fps, frames, options.sheetFrames)) {
                play(plugin, timeline, images, frames, pictures);
                pictures.finish();
            }
            replace(out, partial);
        } finally {
            deleteTree(partial);
        }
        System.out.printf(Locale.ROOT, "frames:        %s (%s .. %s, %d frames at %d fps%s)%n", out,
            Pictures.frameName(0), Pictures.frameName(frames - 1), frames, options.fps,
            options.fixedStep ? ", fixed step" : "");
        System.out.println("contact sheet: " + out.resolve(Pictures.SHEET));
        System.out.println("preview:       " + out.resolve(Pictures.PREVIEW));
    }

    private void play(Path plugin, Timeline timeline, Map<String, Image> images, int frames, Pictures pictures)
            throws Failure, IOException {
        String runtime = System.getProperty("vi.runtime");
        String desktop = System.getProperty("vi.desktop");
        if (runtime == null || desktop == null) {
            throw new Failure("the runtime's and the player's libraries are not named; start the player with vi-player");
        }
        System.load(runtime);
        System.load(desktop);
        Desktop.open(width, height);
        pixels = new int[width * height];
        if (options.fixedStep && !Desktop.setClock(FIXED_CLOCK_START)) {
            throw new Failure("--fixed-step needs the player's clock library preloaded; start it with vi-player");
        }
        Path assets = options.assets != null ? options.assets : plugin.resolveSibling("assets");
        if (Files.isDirectory(assets)) {
            Desktop.setAssetDirectory(assets.toAbsolutePath().toString());
        } else if (options.assets != null) {
            throw new Failure("asset directory not found: " + options.assets);
        }

        // As the phone's host: start with the library and the window, hand in
        // the images the scene asks for, initialise, then frames.
        String[] names = host.prehandleStart(plugin.toString(), width, height);
        if (names == null) {
            String reason = Desktop.whyNotLoadable(plugin.toString());
            throw new Failure("cannot start the effect in " + options.plugin + ": "
                + (reason != null ? reason : "the runtime refused it"));
        }
        for (String name : names) {
            Image image = images.get(name);
            if (image != null) {
                loadTexture(name, image);
            } else if (!options.quiet) {
                System.err.println("vi-player: the effect asks for an image \"" + name
                    + "\"; none given (--image " + name + "=FILE), it shows its own");
            }
        }
        for (Map.Entry<String, Image> image : images.entrySet()) {
            if (!List.of(names).contains(image.getKey())) loadTexture(image.getKey(), image.getValue());
        }
        host.prehandleInitEffect();

        List<Timeline.Event> events = timeline.events();
        int next = 0;
        long started = System.nanoTime();
        Progress progress = new Progress(frames, options.quiet);
        for (int frame = 0; frame < frames; ++frame) {
            double seconds = frame / (double) options.fps;
            if (options.fixedStep) {
                Desktop.setClock(FIXED_CLOCK_START + frame * 1_000_000_000L / options.fps);
            } else {
                pace(started, seconds);
            }
            while (next < events.size() && events.get(next).time() <= seconds + 1e-9) {
                apply(events.get(next++));
            }
            host.prehandleDraw();
            Desktop.readPixels(pixels);
            BufferedImage image = new BufferedImage(width, height, BufferedImage.TYPE_INT_RGB);
            image.setRGB(0, 0, width, height, pixels, 0, width);
            pictures.add(frame, seconds, image);
            progress.frameDone(frame);
        }
        host.prehandleStop();
    }

    private void apply(Timeline.Event event) throws IOException {
        switch (event.kind()) {
            case "touch" -> {
                String phase = event.arguments().get(0);
                int action = phase.equals("down") ? 0 : phase.equals("up") ? 1 : 2;
                host.prehandleTouch(event.integer(1), event.integer(2), action);
            }
            case "key" -> {
                switch (event.arguments().get(0)) {
                    case "menu" -> host.prehandleMenuPressed();
                    case "up" -> host.prehandleVolumeUpPressed();
                    default -> host.prehandleVolumeDownPressed();
                }
            }
            case "orientation" -> rotate(event.integer(0));
            case "param" -> host.prehandleParam(event.integer(0), event.integer(1));
            case "affordance" -> host.prehandleAffordance();
            case "unlock" -> host.prehandleUnlock();
            case "clear" -> host.prehandleClearEffect();
            case "restart" -> host.prehandleRestart();
            case "recycle" -> host.prehandleRecycleTextures();
            case "lose-context" -> Desktop.loseContext();
            case "image" -> loadTexture(event.arguments().get(0), decode(imagePath(event), ""));
            default -> { }  // "end": the loop stops at its time
        }
    }

    /** Orientation 0 is the starting shape, 1 the other way round; the scene is initialised anew for it. */
    private void rotate(int orientation) {
        boolean portraitStart = options.width <= options.height;
        boolean portrait = orientation == 0 ? portraitStart : !portraitStart;
        int longer = Math.max(options.width, options.height);
        int shorter = Math.min(options.width, options.height);
        int w = portrait ? shorter : longer;
        int h = portrait ? longer : shorter;
        if (w != width || h != height) {
            width = w;
            height = h;
            Desktop.resize(width, height);
            pixels = new int[width * height];
            Desktop.setWindowRectangle(0, 0, width, height);
        }
        host.prehandleSetOrientation(orientation);
        host.prehandleInitEffect();
    }

    /** The runtime exchanges red and blue in the array it is given, so it gets a copy. */
    private static void loadTexture(String name, Image image) {
        Native.loadTexture(name, image.argb().clone(), image.width(), image.height());
    }

    /** Decodes a picture file once, however often it is handed in. */
    private Image decode(Path file, String where) throws IOException {
        Image known = decoded.get(file);
        if (known != null) return known;
        String prefix = where.isEmpty() ? "" : where + ": ";
        BufferedImage picture;
        try {
            picture = ImageIO.read(file.toFile());
        } catch (IOException e) {
            throw new IOException(prefix + "cannot read image " + file + ": " + e.getMessage(), e);
        }
        if (picture == null) throw new IOException(prefix + "cannot read image " + file + ": not a PNG or JPEG image");
        int w = picture.getWidth();
        int h = picture.getHeight();
        Image result = new Image(picture.getRGB(0, 0, w, h, null, 0, w), w, h);
        decoded.put(file, result);
        return result;
    }

    private Path imagePath(Timeline.Event event) {
        Path file = Path.of(event.arguments().get(1));
        Path base = options.timeline.toAbsolutePath().getParent();
        return file.isAbsolute() || base == null ? file : base.resolve(file);
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
