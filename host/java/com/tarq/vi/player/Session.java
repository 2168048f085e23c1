package com.tarq.vi.player;

import com.tarq.android.visualeffect.common.Native;
import java.awt.image.BufferedImage;
import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.HashMap;
import java.util.LinkedHashMap;
import java.util.List;
import java.util.Map;
import javax.imageio.ImageIO;

/**
 * The calls a phone's host makes around one effect, shared by the desktop
 * hosts: the start with the images the scene asks for, a turn, keys and
 * images, and the frame read back. Owns the host's Native object and the
 * decoded pictures; the GL surface is the caller's, which resizes it when
 * asked. Every method must be called on the thread whose GL context is current.
 */
final class Session {
    /** A decoded picture as the host hands it in: ARGB ints, row after row. */
    record Image(int[] argb, int width, int height) {}

    /** The host's GL surface as the events need it: turned, and its context lost. */
    interface Surface {
        void resize(int width, int height);

        void loseContext();
    }

    /** The player's headless surface. */
    static final Surface HEADLESS = new Surface() {
        @Override
        public void resize(int width, int height) {
            Desktop.resize(width, height);
        }

        @Override
        public void loseContext() {
            Desktop.loseContext();
        }
    };

    /** The runtime's developer key that re-enters its own lock: the caller would wait for ever. */
    static final int BLOCKING_KEY = 'C';
    /** The runtime's developer key that runs its randomised self-test, restarting the effect many times. */
    static final int SELF_TEST_KEY = 'T';

    final Native host = new Native();
    private final String program;
    private final int startWidth;
    private final int startHeight;
    private final Map<Path, Image> decoded = new HashMap<>();
    private final Map<String, Image> images = new LinkedHashMap<>();
    // Every image name given, at start or by the timeline, with where it was given.
    private final Map<String, String> givenAt = new LinkedHashMap<>();
    private int width;
    private int height;
    private int orientation;

    Session(String program, int width, int height) {
        this.program = program;
        startWidth = width;
        startHeight = height;
        this.width = width;
        this.height = height;
    }

    int width() {
        return width;
    }

    int height() {
        return height;
    }

    int orientation() {
        return orientation;
    }

    /** Loads the runtime and the desktop helper the launcher names. */
    static void loadLibraries(String launcher, String... more) throws Failure {
        String runtime = System.getProperty("vi.runtime");
        String desktop = System.getProperty("vi.desktop");
        if (runtime == null || desktop == null) {
            throw new Failure("the runtime's and the host's libraries are not named; start it with " + launcher);
        }
        System.load(runtime);
        System.load(desktop);
        for (String property : more) {
            String library = System.getProperty(property);
            if (library == null) throw new Failure(property + " is not named; start it with " + launcher);
            System.load(library);
        }
    }

    /** The asset directory given, or assets/ beside the plug-in when there is one; null when neither. */
    static Path assetDirectory(Path plugin, Path given) throws Failure {
        Path assets = given != null ? given : plugin.resolveSibling("assets");
        if (Files.isDirectory(assets)) return assets.toAbsolutePath();
        if (given != null) throw new Failure("asset directory not found: " + given);
        return null;
    }

    /** An image handed in at every start, decoded now so that a bad file stops the host first. */
    void addImage(String name, Path file, String where) throws IOException {
        images.put(name, decode(file, where));
        givenAt.putIfAbsent(name, where);
    }

    /** An image a timeline event hands in later, at the place given; decoded now. */
    void addLaterImage(String name, Path file, String where) throws IOException {
        decode(file, where);
        givenAt.putIfAbsent(name, where);
    }

    /**
     * As the phone's host starts an effect: the library and the window, the
     * images the scene asks for (and the others given), its orientation, then
     * initialisation. A name asked for and not given, or given and not asked
     * for, is warned about. Returns false when the runtime refuses the library.
     */
    boolean start(String library) {
        Desktop.watchEffect(library);
        String[] names = host.prehandleStart(library, width, height);
        if (names == null) return false;
        Misspellings.images(List.of(names), givenAt);
        for (String name : names) {
            Image image = images.get(name);
            if (image != null) loadTexture(name, image);
        }
        for (Map.Entry<String, Image> image : images.entrySet()) {
            if (!List.of(names).contains(image.getKey())) loadTexture(image.getKey(), image.getValue());
        }
        if (orientation != 0) host.prehandleSetOrientation(orientation);
        host.prehandleInitEffect();
        return true;
    }

    /**
     * Orientation 0 is the starting shape, any other the other way round: the
     * surface turns when the shape changes, the window follows, and the scene
     * is initialised anew for it.
     */
    void rotate(int orientation, Surface surface) {
        if (turn(orientation)) {
            surface.resize(width, height);
            Desktop.setWindowRectangle(0, 0, width, height);
        }
        host.prehandleSetOrientation(orientation);
        host.prehandleInitEffect();
    }

    /** The orientation and the shape it gives, before any surface or effect; true when the shape changed. */
    boolean turn(int orientation) {
        this.orientation = orientation;
        boolean portraitStart = startWidth <= startHeight;
        boolean portrait = orientation == 0 ? portraitStart : !portraitStart;
        int longer = Math.max(startWidth, startHeight);
        int shorter = Math.min(startWidth, startHeight);
        int w = portrait ? shorter : longer;
        int h = portrait ? longer : shorter;
        boolean changed = w != width || h != height;
        width = w;
        height = h;
        return changed;
    }

    /**
     * One host event of a timeline (host/README.md lists them) as the phone's
     * host makes it; "end" is the caller's. Images are relative to imageBase.
     */
    void apply(Timeline.Event event, Surface surface, Path imageBase) throws IOException {
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
            case "keycode" -> key(event.integer(0));
            case "orientation" -> rotate(event.integer(0), surface);
            case "param" -> host.prehandleParam(event.integer(0), event.integer(1));
            case "affordance" -> host.prehandleAffordance();
            case "unlock" -> host.prehandleUnlock();
            case "clear" -> host.prehandleClearEffect();
            case "restart" -> host.prehandleRestart();
            case "recycle" -> host.prehandleRecycleTextures();
            case "lose-context" -> surface.loseContext();
            case "image" -> loadTexture(event.arguments().get(0), decode(imagePath(event, imageBase), ""));
            default -> { }  // "end"
        }
    }

    static Path imagePath(Timeline.Event event, Path base) {
        Path file = Path.of(event.arguments().get(1));
        return file.isAbsolute() || base == null ? file : base.resolve(file);
    }

    /** A key code for the scene. The blocking developer key is the caller's to refuse. */
    void key(int code) {
        if (code == SELF_TEST_KEY) {
            System.err.println(program + ": key 84 runs the runtime's randomised self-test;"
                + " the effect restarts many times and may be left turned");
        }
        Desktop.sendKey(code);
    }

    /** The runtime exchanges red and blue in the array it is given, so it gets a copy. */
    static void loadTexture(String name, Image image) {
        Native.loadTexture(name, image.argb().clone(), image.width(), image.height());
    }

    /** The frame on the surface now, opaque. */
    BufferedImage readFrame() {
        int[] pixels = new int[width * height];
        Desktop.readPixels(pixels, width, height);
        BufferedImage image = new BufferedImage(width, height, BufferedImage.TYPE_INT_RGB);
        image.setRGB(0, 0, width, height, pixels, 0, width);
        return image;
    }

    /** Decodes a picture file once, however often it is handed in. */
    Image decode(Path file, String where) throws IOException {
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
}
