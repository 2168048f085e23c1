package com.tarq.vi.player;

import static java.nio.charset.StandardCharsets.UTF_8;
import static org.junit.jupiter.api.Assertions.*;

import java.awt.Color;
import java.awt.image.BufferedImage;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.List;
import java.util.stream.Stream;
import javax.imageio.ImageIO;
import org.junit.jupiter.api.BeforeAll;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

/**
 * The player's compare mode as an author meets it, on three small frames of
 * the sample effect: references made by --update, then changed by hand as a
 * real change of the effect would change them.
 */
class CompareModeTest {
    private static Path scratch, references;
    private static int runs;

    @BeforeAll
    static void makeReferences() throws Exception {
        scratch = Files.createTempDirectory(Files.createDirectories(Path.of(System.getProperty("vi.scratch"))), "run-");
        references = scratch.resolve("references");
        String made = player(references, "--update");
        assertTrue(made.contains("references:    wrote 3 into " + references) && made.endsWith("status 0"), made);
    }

    /** Frame 1's reference has its pixel (5, 7) changed in red by `change`; frame 2's is as named. */
    @ParameterizedTest
    @CsvSource(delimiter = '|', value = {
        "9 | kept    |                  | 1 | frame-00001.png differs from its reference in 1 pixel, by up to 9: ",
        "8 | kept    |                  | 0 | compared:      3 frames with ",
        "9 | kept    | --tolerance 9    | 0 | compared:      3 frames with ",
        "9 | kept    | --allow-pixels 1 | 0 | compared:      3 frames with ",
        "0 | missing |                  | 1 | frame-00002.png has no reference in ",
        "0 | tiny    |                  | 1 | frame-00002.png is 36x64, its reference 2x2",
        "0 | text    |                  | 1 | frame-00002.png cannot be read as a PNG image"})
    void changedReferencesFailWithTheirFrameNamed(int change, String frame2, String options, int status, String message)
        throws Exception {
        Path changed = copyOfReferences();
        BufferedImage reference = changeOnePixel(changed.resolve("frame-00001.png"), change);
        Path second = changed.resolve("frame-00002.png");
        switch (frame2) {
            case "missing" -> Files.delete(second);
            case "tiny" -> ImageIO.write(new BufferedImage(2, 2, BufferedImage.TYPE_INT_RGB), "png", second.toFile());
            case "text" -> Files.writeString(second, "not a picture");
            default -> { }
        }
        String[] extra = options == null ? new String[0] : options.split(" ");
        String result = player(changed, extra);
        assertTrue(result.contains(message) && result.endsWith("status " + status), result);
        Path out = changed.resolveSibling("out");
        assertTrue(Files.exists(out.resolve("frame-00002.png")), "the render is kept, pass or fail");
        List<String> diffs = diffPictures(out);
        if (change <= 8 || status == 0) {
            assertEquals(List.of(), diffs);
            return;
        }
        // The one pixel in magenta on the reference, elsewhere at a quarter of its brightness.
        assertEquals(List.of("diff-00001.png"), diffs);
        BufferedImage diff = ImageIO.read(out.resolve("diff-00001.png").toFile());
        for (int y = 0; y < 64; ++y) {
            for (int x = 0; x < 36; ++x) {
                Color was = new Color(reference.getRGB(x, y));
                Color dimmed = new Color(was.getRed() / 4, was.getGreen() / 4, was.getBlue() / 4);
                int expected = x == 5 && y == 7 ? 0xFF00FF : dimmed.getRGB() & 0xFFFFFF;
                assertEquals(expected, diff.getRGB(x, y) & 0xFFFFFF, "at " + x + ", " + y);
            }
        }
    }

    @Test
    void anUpdateMakesTheRenderTheReferenceAgain() throws Exception {
        Path changed = copyOfReferences();
        changeOnePixel(changed.resolve("frame-00001.png"), 40);
        Files.delete(changed.resolve("frame-00002.png"));
        Files.copy(changed.resolve("frame-00000.png"), changed.resolve("frame-00003.png"));
        String failed = player(changed);
        assertTrue(failed.contains("by up to 40") && failed.contains("frame-00002.png has no reference")
            && failed.contains("frame-00003.png is the reference of a frame this render did not make (it made 3)")
            && failed.contains("the frames and diff pictures are in")
            && failed.endsWith("status 1"), failed);
        String updated = player(changed, "--update");
        assertTrue(updated.contains("wrote 3 into " + changed + ", removed 1 of frames this render did not make")
            && updated.endsWith("status 0"), updated);
        try (Stream<Path> files = Files.list(changed)) {
            assertEquals(List.of("frame-00000.png", "frame-00001.png", "frame-00002.png"),
                files.map(file -> file.getFileName().toString()).sorted().toList());
        }
        String passed = player(changed);
        assertTrue(passed.contains("compared:      3 frames") && passed.endsWith("status 0"), passed);
    }

    /** A fresh copy of the references, in a folder of its own beside which the render goes. */
    private static Path copyOfReferences() throws Exception {
        Path copy = Files.createDirectories(scratch.resolve("case-" + ++runs).resolve("references"));
        try (Stream<Path> files = Files.list(references)) {
            for (Path file : files.toList()) Files.copy(file, copy.resolve(file.getFileName()));
        }
        return copy;
    }

    /** Red at (5, 7) moved by `change`, away from the end of its range; returns the picture as it was. */
    private static BufferedImage changeOnePixel(Path file, int change) throws Exception {
        BufferedImage picture = ImageIO.read(file.toFile());
        BufferedImage before = ImageIO.read(file.toFile());
        int rgb = picture.getRGB(5, 7);
        int red = rgb >> 16 & 255;
        int moved = red + change <= 255 ? red + change : red - change;
        picture.setRGB(5, 7, rgb & 0xFF00FFFF | moved << 16);
        ImageIO.write(picture, "png", file.toFile());
        return before;
    }

    private static List<String> diffPictures(Path out) throws Exception {
        try (Stream<Path> files = Files.list(out)) {
            return files.map(file -> file.getFileName().toString()).filter(name -> name.startsWith("diff-")).toList();
        }
    }

    /** The player on three frames of the sample at 36 x 64, into out/ beside the references: its output, then "status N". */
    private static String player(Path references, String... options) throws Exception {
        List<String> command = new ArrayList<>(List.of(System.getProperty("vi.player"), "--quiet", "--size", "36x64",
            "--fps", "10", "--duration", "0.3", "--out", references.resolveSibling("out").toString(),
            "--compare", references.toString()));
        command.addAll(List.of(options));
        command.add(System.getProperty("vi.plugin"));
        Process process = new ProcessBuilder(command).redirectErrorStream(true).start();
        return new String(process.getInputStream().readAllBytes(), UTF_8) + "status " + process.waitFor();
    }
}
