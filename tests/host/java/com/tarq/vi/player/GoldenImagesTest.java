package com.tarq.vi.player;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotNull;

import java.awt.image.BufferedImage;
import java.io.IOException;
import java.nio.file.Path;
import java.util.Arrays;
import javax.imageio.ImageIO;
import javax.imageio.ImageReader;
import javax.imageio.stream.ImageInputStream;
import org.junit.jupiter.api.Test;
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
    private final Path renders = Path.of(System.getProperty("vi.renders"));

    /** Pixels more than 8 apart in a channel, or -1 for pictures of different sizes. */
    static int differing(BufferedImage a, BufferedImage b) {
        if (a.getWidth() != b.getWidth() || a.getHeight() != b.getHeight()) return -1;
        int count = 0;
        for (int y = 0; y < a.getHeight(); ++y) {
            for (int x = 0; x < a.getWidth(); ++x) {
                int p = a.getRGB(x, y), q = b.getRGB(x, y);
                if (Math.abs((p >> 16 & 255) - (q >> 16 & 255)) > 8 || Math.abs((p >> 8 & 255) - (q >> 8 & 255)) > 8
                    || Math.abs((p & 255) - (q & 255)) > 8) ++count;
            }
        }
        return count;
    }

    /** The same picture: at most 0.2 % of the pixels beyond the tolerance (edges moved by a pixel). */
    static boolean matches(BufferedImage picture, BufferedImage golden) {
        int differing = differing(picture, golden);
        return differing >= 0 && differing <= 0.002 * golden.getWidth() * golden.getHeight();
    }

    static BufferedImage read(Path file) throws IOException {
        BufferedImage image = ImageIO.read(file.toFile());
        assertNotNull(image, "not a picture: " + file);
        return image;
    }

    @ParameterizedTest
    @CsvSource({"run, 3, frame, true", "run, 7, frame, true", "run, 11, frame, true", "no-touch, 11, frame, false",
        "other-grade, 11, frame, false", "no-gem, 11, frame, false", "unlock, 12, unlock, true", "unlock, 23, unlock, true",
        "unlock, 27, unlock, true"})
    void framesMatchTheirGoldensAndRealChangesDoNot(String run, int number, String golden, boolean same) throws IOException {
        String frame = String.format("frame-%05d.png", number);
        BufferedImage picture = read(renders.resolve(run).resolve(frame));
        BufferedImage expected = read(this.golden.resolve(frame.replace("frame", golden)));
        assertEquals(same, matches(picture, expected), run + " " + frame + ": " + differing(picture, expected) + " differ");
    }

    @Test
    void fixedStepRendersRepeatBitForBit() throws IOException {
        // "other-grade" changes its grade at 0.6 s: until then it is the run made by another process.
        for (int frame = 0; frame <= 5; ++frame) {
            BufferedImage a = read(renders.resolve("run").resolve(String.format("frame-%05d.png", frame)));
            BufferedImage b = read(renders.resolve("other-grade").resolve(String.format("frame-%05d.png", frame)));
            assertArrayEquals(a.getRGB(0, 0, 180, 320, null, 0, 180), b.getRGB(0, 0, 180, 320, null, 0, 180), "" + frame);
        }
    }

    @Test
    void theRenderHasEveryFrameASheetOfEightAndAHalfSizePreview() throws IOException {
        // 1.2 s at 10 frames a second: frames 0 to 11. The sheet: 4 x 2 cells of a third of 180 x 320, 4 pixels apart.
        Path run = renders.resolve("run");
        assertEquals(12, Arrays.stream(run.toFile().list()).filter(name -> name.matches("frame-\\d{5}\\.png")).count());
        BufferedImage sheet = read(run.resolve(Pictures.SHEET));
        assertEquals(4 * 64 + 4, sheet.getWidth());
        assertEquals(2 * 111 + 4, sheet.getHeight());
        ImageReader reader = ImageIO.getImageReadersByFormatName("gif").next();
        try (ImageInputStream stream = ImageIO.createImageInputStream(run.resolve(Pictures.PREVIEW).toFile())) {
            reader.setInput(stream);
            assertEquals(12, reader.getNumImages(true));
            assertEquals(90, reader.getWidth(0));
            assertEquals(160, reader.getHeight(0));
        }
    }
}
