package com.tarq.vi.player;

import java.io.IOException;
import java.io.Reader;
import java.io.Writer;
import java.nio.file.Files;
import java.nio.file.NoSuchFileException;
import java.nio.file.Path;
import java.nio.file.StandardCopyOption;
import java.util.LinkedHashMap;
import java.util.Map;
import java.util.Properties;
import java.util.Set;
import java.util.TreeSet;

/**
 * What the live window hands to the window process after it, should an effect
 * end its process: where the window is and which way it is turned, the images
 * given, the build that was running, and whether the window has shown a frame.
 * The window process writes it (whole, by a rename) before each start of a
 * build and whenever it changes; the supervising process reads it once that
 * process has ended, adds why it ended, and starts the next with it.
 */
final class LiveState {
    private static final String FILE = "window.properties";

    int x = Window.ANYWHERE;
    int y = Window.ANYWHERE;
    int orientation;
    /** Every image given, by --image or typed, in the order given; handed in at each start. */
    final Map<String, Path> images = new LinkedHashMap<>();
    /** Image names already warned about: a name is warned about once a session, over every process. */
    final Set<String> warnedImages = new TreeSet<>();
    /** The plug-in's files as they were when the last build was started ("" before any). */
    String build = "";
    /** A frame of an effect has been shown in this session. */
    boolean shown;
    /** The window process that last started a build. */
    long effectPid;
    /** Why the last window process ended, set by the supervising process; null when it did not end so. */
    String ended;
    /** What was last written, so that a state written again unchanged is not. */
    private Properties written;

    /** The state in folder, or null when no window process has written one. */
    static LiveState read(Path folder) throws IOException {
        Properties values = new Properties();
        try (Reader reader = Files.newBufferedReader(folder.resolve(FILE))) {
            values.load(reader);
        } catch (NoSuchFileException e) {
            return null;
        }
        LiveState state = new LiveState();
        state.x = Integer.parseInt(values.getProperty("x"));
        state.y = Integer.parseInt(values.getProperty("y"));
        state.orientation = Integer.parseInt(values.getProperty("orientation"));
        state.build = values.getProperty("build");
        state.shown = Boolean.parseBoolean(values.getProperty("shown"));
        state.effectPid = Long.parseLong(values.getProperty("effectPid"));
        state.ended = values.getProperty("ended");
        for (int i = 0; values.containsKey("image." + i); ++i) {
            state.images.put(values.getProperty("image." + i), Path.of(values.getProperty("imageFile." + i)));
        }
        for (int i = 0; values.containsKey("warned." + i); ++i) state.warnedImages.add(values.getProperty("warned." + i));
        return state;
    }

    /**
     * Replaces the state in folder as a whole, when it has changed: a process
     * that ends while writing leaves the one before.
     */
    void write(Path folder) throws IOException {
        Properties values = new Properties();
        values.setProperty("x", "" + x);
        values.setProperty("y", "" + y);
        values.setProperty("orientation", "" + orientation);
        values.setProperty("build", build);
        values.setProperty("shown", "" + shown);
        values.setProperty("effectPid", "" + effectPid);
        if (ended != null) values.setProperty("ended", ended);
        int i = 0;
        for (Map.Entry<String, Path> image : images.entrySet()) {
            values.setProperty("image." + i, image.getKey());
            values.setProperty("imageFile." + i++, image.getValue().toString());
        }
        i = 0;
        for (String name : warnedImages) values.setProperty("warned." + i++, name);
        if (values.equals(written)) return;
        Path partial = folder.resolve(FILE + ".partial");
        try (Writer writer = Files.newBufferedWriter(partial)) {
            values.store(writer, null);
        }
        Files.move(partial, folder.resolve(FILE), StandardCopyOption.ATOMIC_MOVE, StandardCopyOption.REPLACE_EXISTING);
        written = values;
    }
}
