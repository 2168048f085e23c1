package com.tarq.vi.player;

import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.attribute.BasicFileAttributes;
import java.time.Instant;
import java.time.temporal.ChronoUnit;
import java.util.Objects;
import java.util.stream.Stream;

/**
 * Watches the plug-in file and its asset folder for a new build, and copies
 * the plug-in to a fresh path for each load: the runtime never opens a path
 * it has loaded again, and a build must not rewrite the library the effect
 * runs from. Each copy lives in a folder of its own, inside the window's
 * folder, only until the runtime has opened it (discard()): a mapped library
 * needs no file.
 */
final class PluginWatch {
    /** A change counts once the files have stayed as they are this long. */
    private static final long SETTLE_NANOS = 300_000_000L;
    private static final long LOOK_EVERY_NANOS = 100_000_000L;

    private final Path plugin;
    private final Path assets;
    private final Path folder;
    private int copied;
    private String loaded;
    private String seen;
    private long seenSince;
    private long lastLook;

    /** Copies go into folder; `loaded` is the files as last loaded, null for as they are now. */
    PluginWatch(Path plugin, Path assets, Path folder, String loaded) {
        this.plugin = plugin;
        this.assets = assets;
        this.folder = folder;
        this.loaded = loaded != null ? loaded : signature();
        seen = this.loaded;
    }

    /** The files as last loaded (or found at the start), to compare a later look with. */
    String loaded() {
        return loaded;
    }

    /** When the plug-in was last written, in nanoseconds of the wall clock; 0 when it is not there. */
    long written() {
        try {
            return ChronoUnit.NANOS.between(Instant.EPOCH, Files.getLastModifiedTime(plugin).toInstant());
        } catch (IOException e) {
            return 0;
        }
    }

    /**
     * A copy of the plug-in as it is now, at a path never used before; removed
     * by the exit handler too, should the effect end the process while starting.
     */
    Path copy() throws IOException {
        Path copy = Files.createTempDirectory(folder, "copy-").resolve(++copied + "-" + plugin.getFileName());
        Desktop.removeOnFatalExit(copy.getParent().toString());
        try {
            Files.copy(plugin, copy);
        } catch (IOException e) {
            discard(copy);
            throw e;
        }
        return copy;
    }

    /** Removes a copy and its folder, once the runtime has opened it or refused it. */
    static void discard(Path copy) {
        try {
            Files.deleteIfExists(copy);
            Files.deleteIfExists(copy.getParent());
        } catch (IOException e) {
            System.err.println("vi-live: cannot remove the plug-in's copy " + copy + ": " + e.getMessage());
        }
    }

    /** True once the files differ from those last loaded and have settled; looks at most ten times a second. */
    boolean changedAndSettled(long now) {
        if (now - lastLook < LOOK_EVERY_NANOS) return false;
        lastLook = now;
        String current = signature();
        if (!current.equals(seen)) {
            seen = current;
            seenSince = now;
            return false;
        }
        return !current.equals(loaded) && !current.isEmpty() && now - seenSince >= SETTLE_NANOS;
    }

    /** The files as they are now count as loaded, whether the load worked or not: a broken build waits for the next. */
    void markLoaded() {
        loaded = signature();
        seen = loaded;
    }

    /** The plug-in's size and time and every asset's; empty while the plug-in is missing (a build under way). */
    private String signature() {
        StringBuilder text = new StringBuilder();
        try {
            text.append(stamp(plugin));
            if (assets != null) {
                try (Stream<Path> paths = Files.walk(assets)) {
                    for (Path path : paths.sorted().toList()) text.append('|').append(path).append(stamp(path));
                }
            }
        } catch (IOException e) {
            return "";
        }
        return text.toString();
    }

    private static String stamp(Path path) throws IOException {
        BasicFileAttributes attributes = Files.readAttributes(path, BasicFileAttributes.class);
        return attributes.size() + "@" + Objects.toString(attributes.lastModifiedTime().toInstant());
    }
}
