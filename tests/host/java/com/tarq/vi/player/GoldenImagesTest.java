package com.tarq.vi.player;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.awt.image.BufferedImage;
import java.io.IOException;
import java.nio.file.Path;
import javax.imageio.ImageIO;
import javax.imageio.ImageReader;
import javax.imageio.metadata.IIOMetadataNode;
import javax.imageio.stream.ImageInputStream;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.ValueSource;

/**
 * The sample effect rendered in fixed steps (RenderGoldens.sh, run before
 * this test) against stored pictures. The tolerance absorbs a rasteriser
 * update; the controls show that it still sees ripples gone, another grade
 * or the gem missing.
 */
class GoldenImagesTest {
    private static final Path GOLDEN = Path.of(System.getProperty("vi.golden"));
    private static final Path RENDERS = Path.of(System.getProperty("vi.renders"));

    private static BufferedImage read(Path file) throws IOException {
        BufferedImage image = ImageIO.read(file.toFile());
        assertTrue(image != null, "not a picture: " + file);
        return image;
    }

    private static BufferedImage rendered(String run, String frame) throws IOException {
        return read(RENDERS.resolve(run).resolve(frame));
    }

    @ParameterizedTest
    @ValueSource(strings = {"frame-00003.png", "frame-00007.png", "frame-00011.png"})
    void chosenFramesMatchTheirGoldens(String frame) throws IOException {
        BufferedImage golden = read(GOLDEN.resolve(frame));
        BufferedImage picture = rendered("run", frame);
        assertTrue(PictureTolerance.matches(picture, golden), frame + ": "
            + PictureTolerance.beyondTolerance(picture, golden)
            + " pixels differ by more than " + PictureTolerance.TOLERANCE);
    }

    @ParameterizedTest
    @ValueSource(strings = {"no-touch", "other-grade", "no-gem"})
    void aRealChangeDoesNotMatch(String control) throws IOException {
        BufferedImage golden = read(GOLDEN.resolve("frame-00011.png"));
        assertFalse(PictureTolerance.matches(rendered(control, "frame-00011.png"), golden),
            control + " passed for the golden");
    }

    @ParameterizedTest
    @ValueSource(strings = {"frame-00000.png", "frame-00003.png", "frame-00005.png"})
    void fixedStepRendersRepeatBitForBit(String frame) throws IOException {
        // "other-grade" changes its grade at 0.6 s: until then it is the same
        // render as "run", made by another process, and must be the same to the bit.
        BufferedImage a = rendered("run", frame);
        BufferedImage b = rendered("other-grade", frame);
        assertEquals(a.getWidth(), b.getWidth());
        assertArrayEquals(a.getRGB(0, 0, a.getWidth(), a.getHeight(), null, 0, a.getWidth()),
            b.getRGB(0, 0, b.getWidth(), b.getHeight(), null, 0, b.getWidth()), frame);
    }

    @Test
    void theRenderHasEveryFrameASheetOfEightAndALoopingPreview() throws IOException {
        // 1.2 s at 10 frames a second: frames 0 to 11, all of them in the preview.
        Path run = RENDERS.resolve("run");
        assertTrue(run.resolve("frame-00011.png").toFile().isFile());
        assertFalse(run.resolve("frame-00012.png").toFile().exists());
        BufferedImage sheet = read(run.resolve(Pictures.SHEET));
        // 4 x 2 cells of a third of 180 x 320, 4 pixels apart and around.
        assertEquals(4 * (60 + 4) + 4, sheet.getWidth());
        assertEquals(2 * (107 + 4) + 4, sheet.getHeight());

        ImageReader reader = ImageIO.getImageReadersByFormatName("gif").next();
        try (ImageInputStream stream = ImageIO.createImageInputStream(run.resolve(Pictures.PREVIEW).toFile())) {
            reader.setInput(stream);
            assertEquals(12, reader.getNumImages(true));
            assertEquals(90, reader.getWidth(0));
            assertEquals(160, reader.getHeight(0));
            assertEquals(1, loopExtensions(reader, 0));
            assertEquals(0, loopExtensions(reader, 1));
        } finally {
            reader.dispose();
        }
    }

    /** The looping extensions (repeat for ever) in the metadata of one GIF frame. */
    private static int loopExtensions(ImageReader reader, int index) throws IOException {
        IIOMetadataNode root = (IIOMetadataNode) reader.getImageMetadata(index).getAsTree("javax_imageio_gif_image_1.0");
        int count = 0;
        var extensions = root.getElementsByTagName("ApplicationExtension");
        for (int i = 0; i < extensions.getLength(); ++i) {
            IIOMetadataNode extension = (IIOMetadataNode) extensions.item(i);
            byte[] data = (byte[]) extension.getUserObject();
            if (extension.getAttribute("applicationID").equals("NETSCAPE") && data.length == 3 && data[0] == 1
                && data[1] == 0 && data[2] == 0) {
                ++count;
            }
        }
        return count;
    }
}
