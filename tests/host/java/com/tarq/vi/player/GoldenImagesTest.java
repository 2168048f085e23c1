package com.tarq.vi.player;

import static org.junit.jupiter.api.Assertions.*;

import java.awt.image.BufferedImage;
import java.nio.file.Path;
import java.util.stream.IntStream;
import javax.imageio.ImageIO;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

/**
 * The sample effect rendered in fixed steps (RenderGoldens.sh, run before this
 * test) against stored pictures. The tolerance absorbs a rasteriser update;
 * the controls show that it still sees the ripples gone, another grade or the gem missing.
 * After an unlock the gem has faded; a clear brings it back; landscape moves it right.
 */
class GoldenImagesTest {
    private final Path golden = Path.of(System.getProperty("vi.golden"));

    /** Pixels more than 8 apart in a channel, or -1 for pictures of different sizes. */
    static int differing(BufferedImage a, BufferedImage b) {
        if (a.getWidth() != b.getWidth() || a.getHeight() != b.getHeight()) return -1;
        int[] p = a.getRGB(0, 0, a.getWidth(), a.getHeight(), null, 0, a.getWidth());
        int[] q = b.getRGB(0, 0, b.getWidth(), b.getHeight(), null, 0, b.getWidth());
        return (int) IntStream.range(0, p.length).filter(i -> IntStream.of(0, 8, 16)
            .anyMatch(shift -> Math.abs((p[i] >> shift & 255) - (q[i] >> shift & 255)) > 8)).count();
    }

    /** The same picture: at most 0.2 % of the pixels beyond the tolerance (edges moved by a pixel). */
    static boolean matches(BufferedImage picture, BufferedImage golden) {
        int differing = differing(picture, golden);
        return differing >= 0 && differing <= 0.002 * golden.getWidth() * golden.getHeight();
    }

    @ParameterizedTest
    @CsvSource({"run, 3, frame, true", "run, 7, frame, true", "run, 11, frame, true", "no-touch, 11, frame, false",
        "other-grade, 11, frame, false", "no-gem, 11, frame, false", "unlock, 12, unlock, true",
        "unlock, 23, unlock, true", "unlock, 27, unlock, true"})
    void framesMatchTheirGoldensAndRealChangesDoNot(String run, int n, String golden, boolean same) throws Exception {
        String frame = String.format("frame-%05d.png", n);
        BufferedImage picture = ImageIO.read(Path.of(System.getProperty("vi.renders"), run, frame).toFile());
        BufferedImage expected = ImageIO.read(this.golden.resolve(frame.replace("frame", golden)).toFile());
        assertEquals(same, matches(picture, expected), run + frame + ": " + differing(picture, expected));
    }
}
