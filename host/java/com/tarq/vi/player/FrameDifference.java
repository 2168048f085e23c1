package com.tarq.vi.player;

import java.awt.image.BufferedImage;

/**
 * How a frame differs from its reference, channel by channel (alpha aside):
 * the pixels where some channel is more than the tolerance apart, and the
 * largest difference anywhere. Its picture shows where: the reference dimmed,
 * those pixels marked on it. The two pictures must be of one size.
 */
record FrameDifference(int differing, int largest, BufferedImage picture) {
    /** A differing pixel: magenta, which no dimmed pixel can be. */
    private static final int MARK = 0xFF00FF;

    static FrameDifference of(BufferedImage frame, BufferedImage reference, int tolerance) {
        int width = reference.getWidth();
        int height = reference.getHeight();
        int[] actual = frame.getRGB(0, 0, width, height, null, 0, width);
        int[] expected = reference.getRGB(0, 0, width, height, null, 0, width);
        int[] marked = new int[expected.length];
        int differing = 0;
        int largest = 0;
        for (int i = 0; i < expected.length; ++i) {
            int most = 0;
            for (int shift = 0; shift <= 16; shift += 8) {
                most = Math.max(most, Math.abs((actual[i] >> shift & 255) - (expected[i] >> shift & 255)));
            }
            largest = Math.max(largest, most);
            if (most > tolerance) ++differing;
            marked[i] = most > tolerance ? MARK : dimmed(expected[i]);
        }
        BufferedImage picture = new BufferedImage(width, height, BufferedImage.TYPE_INT_RGB);
        picture.setRGB(0, 0, width, height, marked, 0, width);
        return new FrameDifference(differing, largest, picture);
    }

    /** A quarter of the brightness: the scene still recognisable, every channel at most 63. */
    private static int dimmed(int rgb) {
        return rgb >> 2 & 0x3F3F3F;
    }
}
