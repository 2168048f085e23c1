package com.tarq.vi.player;

import java.awt.image.BufferedImage;

/** When two renders of the same frame count as the same picture: the golden images' tolerance. */
final class PictureTolerance {
    private PictureTolerance() {}

    /** Per channel, 0 to 255. */
    static final int TOLERANCE = 8;
    /** Share of pixels allowed beyond the tolerance (edges that move by a pixel). */
    private static final double OUTLIERS = 0.002;

    /** Pixels beyond the tolerance, or -1 for pictures of different sizes. */
    static int beyondTolerance(BufferedImage a, BufferedImage b) {
        if (a.getWidth() != b.getWidth() || a.getHeight() != b.getHeight()) return -1;
        int count = 0;
        for (int y = 0; y < a.getHeight(); ++y) {
            for (int x = 0; x < a.getWidth(); ++x) {
                int p = a.getRGB(x, y);
                int q = b.getRGB(x, y);
                for (int shift = 0; shift < 24; shift += 8) {
                    if (Math.abs(((p >> shift) & 0xFF) - ((q >> shift) & 0xFF)) > TOLERANCE) {
                        ++count;
                        break;
                    }
                }
            }
        }
        return count;
    }

    static boolean matches(BufferedImage picture, BufferedImage golden) {
        int beyond = beyondTolerance(picture, golden);
        return beyond >= 0 && beyond <= OUTLIERS * golden.getWidth() * golden.getHeight();
    }
}
