package com.tarq.vi.player;

import java.awt.image.BufferedImage;

/**
 * How a frame differs from its reference, channel by channel (alpha aside):
 * the pixels where some channel is more than the tolerance apart, and the
 * largest difference anywhere. Its picture shows where: the reference dimmed,
 * those pixels marked on it; it is made only when asked, as most frames pass.
 * The two pictures must be of one size.
 */
final class FrameDifference {
    /** A differing pixel: magenta, which no dimmed pixel can be. */
    private static final int MARK = 0xFF00FF;

    private final int width;
    private final int height;
    private final int[] actual;
    private final int[] expected;
    private final int tolerance;
    private final int differing;
    private final int largest;

    private FrameDifference(BufferedImage frame, BufferedImage reference, int tolerance) {
        width = reference.getWidth();
        height = reference.getHeight();
        actual = frame.getRGB(0, 0, width, height, null, 0, width);
        expected = reference.getRGB(0, 0, width, height, null, 0, width);
        this.tolerance = tolerance;
        int beyond = 0;
        int most = 0;
        for (int i = 0; i < expected.length; ++i) {
            int pixel = most(i);
            most = Math.max(most, pixel);
            if (pixel > tolerance) ++beyond;
        }
        differing = beyond;
        largest = most;
    }

    static FrameDifference of(BufferedImage frame, BufferedImage reference, int tolerance) {
        return new FrameDifference(frame, reference, tolerance);
    }

    int differing() {
        return differing;
    }

    int largest() {
        return largest;
    }

    BufferedImage picture() {
        int[] marked = new int[expected.length];
        for (int i = 0; i < expected.length; ++i) marked[i] = most(i) > tolerance ? MARK : dimmed(expected[i]);
        BufferedImage picture = new BufferedImage(width, height, BufferedImage.TYPE_INT_RGB);
        picture.setRGB(0, 0, width, height, marked, 0, width);
        return picture;
    }

    /** The largest difference of pixel `i`'s three channels. */
    private int most(int i) {
        int most = 0;
        for (int shift = 0; shift <= 16; shift += 8) {
            most = Math.max(most, Math.abs((actual[i] >> shift & 255) - (expected[i] >> shift & 255)));
        }
        return most;
    }

    /** A quarter of the brightness: the scene still recognisable, every channel at most 63. */
    private static int dimmed(int rgb) {
        return rgb >> 2 & 0x3F3F3F;
    }
}
