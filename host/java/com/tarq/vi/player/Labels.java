package com.tarq.vi.player;

import java.awt.image.BufferedImage;

/**
 * Frame times on the contact sheet, drawn with a built-in 3 x 5 pixel font, so
 * that the player needs no installed fonts on a headless machine.
 */
final class Labels {
    private Labels() {}

    private static final String GLYPHS = "0123456789.s";
    // Rows of three bits each, top row first.
    private static final int[][] BITMAPS = {
        {7, 5, 5, 5, 7}, {2, 6, 2, 2, 7}, {7, 1, 7, 4, 7}, {7, 1, 7, 1, 7}, {5, 5, 7, 1, 1},
        {7, 4, 7, 1, 7}, {7, 4, 7, 5, 7}, {7, 1, 1, 1, 1}, {7, 5, 7, 5, 7}, {7, 5, 7, 1, 7},
        {0, 0, 0, 0, 2}, {0, 3, 6, 1, 6}};
    private static final int SCALE = 2;

    /** Draws text in white on a dark plate whose bottom-left corner is (left, bottom). */
    static void draw(BufferedImage image, String text, int left, int bottom) {
        int advance = 4 * SCALE;
        int plateWidth = text.length() * advance + 2 * SCALE;
        int plateHeight = 7 * SCALE;
        fill(image, left, bottom - plateHeight, plateWidth, plateHeight, 0x202024);
        int x = left + SCALE;
        int top = bottom - plateHeight + SCALE;
        for (char c : text.toCharArray()) {
            int glyph = GLYPHS.indexOf(c);
            if (glyph >= 0) {
                for (int row = 0; row < 5; ++row) {
                    for (int column = 0; column < 3; ++column) {
                        if ((BITMAPS[glyph][row] & (4 >> column)) != 0) {
                            fill(image, x + column * SCALE, top + row * SCALE, SCALE, SCALE, 0xFFFFFF);
                        }
                    }
                }
            }
            x += advance;
        }
    }

    private static void fill(BufferedImage image, int x, int y, int width, int height, int rgb) {
        for (int j = Math.max(0, y); j < Math.min(image.getHeight(), y + height); ++j) {
            for (int i = Math.max(0, x); i < Math.min(image.getWidth(), x + width); ++i) {
                image.setRGB(i, j, rgb);
            }
        }
    }
}
