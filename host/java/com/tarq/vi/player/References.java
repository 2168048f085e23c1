package com.tarq.vi.player;

import java.awt.image.BufferedImage;
import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.StandardCopyOption;
import java.util.ArrayList;
import java.util.List;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import java.util.stream.Stream;
import javax.imageio.ImageIO;

/**
 * A render held against reference pictures (--compare DIR): each frame
 * against the picture of its name in DIR, within a tolerance per channel and
 * a count of pixels allowed beyond it. A frame that fails is kept as one line
 * for the end of the render, and one that differs gets a diff picture to
 * write beside it. With --update the render's frames become the references.
 */
final class References {
    private static final Pattern FRAME = Pattern.compile("frame-(\\d{5})\\.png");

    private final Path folder;
    private final Path out;
    private final int tolerance;
    private final int allowedPixels;
    private final List<String> failures = new ArrayList<>();
    private int diffPictures;

    /** `folder` and `out` as the author gave them, for the messages. */
    References(Path folder, Path out, int tolerance, int allowedPixels) {
        this.folder = folder;
        this.out = out;
        this.tolerance = tolerance;
        this.allowedPixels = allowedPixels;
    }

    /** Before anything is rendered: a folder to compare with, or, for an update, one that can be made. */
    void checkFolder(boolean update) throws Failure {
        if (Files.isDirectory(folder)) return;
        if (Files.exists(folder)) throw new Failure("the reference folder " + folder + " is a file, not a folder");
        if (update) return;
        throw new Failure("the reference folder " + folder + " does not exist\n"
            + "  to make it from this render: --compare " + folder + " --update");
    }

    /** Frame `index` against its reference; the diff picture to write beside it when they differ, else null. */
    BufferedImage compare(int index, BufferedImage frame) {
        String name = Pictures.frameName(index);
        Path file = folder.resolve(name);
        if (!Files.exists(file)) {
            failures.add(name + " has no reference in " + folder);
            return null;
        }
        BufferedImage reference;
        try {
            reference = ImageIO.read(file.toFile());
        } catch (IOException e) {
            reference = null;
        }
        if (reference == null) {
            failures.add("the reference " + file + " cannot be read as a PNG image");
            return null;
        }
        if (reference.getWidth() != frame.getWidth() || reference.getHeight() != frame.getHeight()) {
            failures.add(name + " is " + frame.getWidth() + "x" + frame.getHeight() + ", its reference "
                + reference.getWidth() + "x" + reference.getHeight());
            return null;
        }
        FrameDifference difference = FrameDifference.of(frame, reference, tolerance);
        if (difference.differing() <= allowedPixels) return null;
        ++diffPictures;
        failures.add(name + " differs from its reference in " + count(difference.differing(), "pixel") + ", by up to "
            + difference.largest() + ": " + out.resolve(Pictures.diffName(index)));
        return difference.picture();
    }

    /** After the render: references of frames it did not make, as when a timeline was shortened. */
    void checkForExtras(int frames) throws IOException {
        for (Path file : referenceFiles()) {
            if (index(file) >= frames) {
                failures.add(folder.resolve(file.getFileName()) + " is the reference of a frame this render did not make"
                    + " (it made " + frames + ")");
            }
        }
    }

    List<String> failures() {
        return failures;
    }

    /** The closing error when a frame failed, after the lines that say which. */
    String failureSummary() {
        return "the render does not match its references in " + folder + " (" + count(failures.size(), "frame")
            + "; tolerance " + tolerance + " a channel, " + count(allowedPixels, "pixel") + " allowed)\n"
            + "  the frames" + (diffPictures > 0 ? " and diff pictures" : "") + " are in " + out
            + "; to make this render the reference, add --update";
    }

    /**
     * The frames written into `written` (the finished output folder) become
     * the references, each replaced whole; references of frames this render
     * did not make go. Returns what was done, for the author.
     */
    String update(Path written, int frames) throws IOException {
        Files.createDirectories(folder);
        for (int index = 0; index < frames; ++index) {
            String name = Pictures.frameName(index);
            Path copy = folder.resolve("." + name + ".new");
            Files.copy(written.resolve(name), copy, StandardCopyOption.REPLACE_EXISTING);
            Files.move(copy, folder.resolve(name), StandardCopyOption.REPLACE_EXISTING, StandardCopyOption.ATOMIC_MOVE);
        }
        int removed = 0;
        for (Path file : referenceFiles()) {
            if (index(file) >= frames) {
                Files.delete(file);
                ++removed;
            }
        }
        return "wrote " + frames + " into " + folder
            + (removed > 0 ? ", removed " + removed + " of frames this render did not make" : "");
    }

    private static String count(int n, String thing) {
        return n + " " + thing + (n == 1 ? "" : "s");
    }

    private List<Path> referenceFiles() throws IOException {
        try (Stream<Path> files = Files.list(folder)) {
            return files.filter(file -> FRAME.matcher(file.getFileName().toString()).matches()).sorted().toList();
        }
    }

    /** The frame index in a reference's name. */
    private static int index(Path file) {
        Matcher matcher = FRAME.matcher(file.getFileName().toString());
        matcher.matches();
        return Integer.parseInt(matcher.group(1));
    }
}
