package com.tarq.test;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNotEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.tarq.android.visualeffect.common.Native;
import org.junit.jupiter.api.Test;

/** Images the host hands in through Native.loadTexture, filed by name for the scene. */
class LoadTextureTest extends HostTestBase {
    private static final int GL_RGBA = 0x1908;
    private static final int GL_UNSIGNED_BYTE = 0x1401;

    private static byte[] bytes(int... values) {
        byte[] result = new byte[values.length];
        for (int i = 0; i < values.length; ++i) result[i] = (byte) values[i];
        return result;
    }

    @Test
    void firstLoadFilesAnRgbaTextureAndLeavesTheHostArraySwapped() {
        readyScene(64, 64);
        int[] pixels = {0xFF112233, 0x80AABBCC};
        Native.loadTexture("load.example", pixels, 2, 1);

        assertArrayEquals(new int[] {0xFF332211, 0x80CCBBAA}, pixels);
        assertEquals(HostTextureProbe.FILED, HostTextureProbe.entryState("load.example"));
        assertArrayEquals(bytes(0x11, 0x22, 0x33, 0xFF, 0xAA, 0xBB, 0xCC, 0x80),
                HostTextureProbe.bufferBytes("load.example"));
        int[] state = HostTextureProbe.state("load.example");
        assertEquals(2, state[HostTextureProbe.WIDTH]);
        assertEquals(1, state[HostTextureProbe.HEIGHT]);
        assertEquals(1, state[HostTextureProbe.DELETABLE]);
        assertEquals(0, state[HostTextureProbe.UPLOADED]);
        assertEquals(0, state[HostTextureProbe.GL_NAME], "the load itself makes no GL texture");
        assertEquals(1, state[HostTextureProbe.STATIC]);
        assertEquals(1, state[HostTextureProbe.REPEAT]);
        assertEquals(0, state[HostTextureProbe.MIRRORED]);
        assertEquals(1, state[HostTextureProbe.LINEAR]);
        assertEquals(0, state[HostTextureProbe.COMPRESSED]);
        assertEquals(GL_RGBA, state[HostTextureProbe.INTERNAL_FORMAT]);
        assertEquals(GL_RGBA, state[HostTextureProbe.FORMAT]);
        assertEquals(GL_UNSIGNED_BYTE, state[HostTextureProbe.PIXEL_TYPE]);
        assertTrue(HostTextureProbe.isRegistered(HostTextureProbe.entryAddress("load.example")));
        assertEquals(0, TestScene.count(TestScene.TEXTURE_UPDATED), "a first load is no update");
    }

    @Test
    void secondLoadAtAnotherSizeReplacesThePixelsOfTheSameTexture() {
        readyScene(64, 64);
        Native.loadTexture("load.replaced", new int[] {0xFF000000, 0xFFFFFFFF}, 2, 1);
        HostTextureProbe.allocate("load.replaced");
        long texture = HostTextureProbe.entryAddress("load.replaced");
        int glName = HostTextureProbe.state("load.replaced")[HostTextureProbe.GL_NAME];
        long firstBuffer = HostTextureProbe.adoptLargeBuffer("load.replaced");
        assertTrue(HostTextureProbe.isLargeBufferMapped(firstBuffer));
        assertEquals(0, TestScene.count(TestScene.TEXTURE_UPDATED));

        int[] pixels = {0xFF010203, 0xFF040506, 0xFF070809, 0xFF0A0B0C, 0xFF0D0E0F, 0x80102030};
        Native.loadTexture("load.replaced", pixels, 3, 2);

        assertEquals(texture, HostTextureProbe.entryAddress("load.replaced"));
        assertTrue(HostTextureProbe.isRegistered(texture));
        assertFalse(HostTextureProbe.isLargeBufferMapped(firstBuffer), "the first buffer is freed");
        int[] state = HostTextureProbe.state("load.replaced");
        assertEquals(3, state[HostTextureProbe.WIDTH]);
        assertEquals(2, state[HostTextureProbe.HEIGHT]);
        assertEquals(1, state[HostTextureProbe.DELETABLE]);
        assertEquals(1, state[HostTextureProbe.UPLOADED]);
        assertEquals(glName, state[HostTextureProbe.GL_NAME]);
        assertArrayEquals(new float[] {3.0f, 2.0f, 1.0f / 3.0f, 0.5f}, HostTextureProbe.sizes("load.replaced"));
        byte[] expected = bytes(0x01, 0x02, 0x03, 0xFF, 0x04, 0x05, 0x06, 0xFF, 0x07, 0x08, 0x09, 0xFF,
                0x0A, 0x0B, 0x0C, 0xFF, 0x0D, 0x0E, 0x0F, 0xFF, 0x10, 0x20, 0x30, 0x80);
        assertArrayEquals(expected, HostTextureProbe.bufferBytes("load.replaced"));
        assertArrayEquals(expected, HostTextureProbe.readTexture("load.replaced"), "uploaded at 3 x 2 at once");
        assertEquals(1, TestScene.count(TestScene.TEXTURE_UPDATED));
    }

    @Test
    void unloadingANeverLoadedNameFilesANullEntryThatALaterLoadFills() {
        assertEquals(HostTextureProbe.ABSENT, HostTextureProbe.entryState("load.later"));
        Native.loadTexture("load.later", null, 4, 4);
        assertEquals(HostTextureProbe.NULL_ENTRY, HostTextureProbe.entryState("load.later"));

        Native.loadTexture("load.later", new int[] {0x7F123456}, 1, 1);
        assertEquals(HostTextureProbe.FILED, HostTextureProbe.entryState("load.later"));
        assertArrayEquals(bytes(0x12, 0x34, 0x56, 0x7F), HostTextureProbe.bufferBytes("load.later"));
        assertTrue(HostTextureProbe.isRegistered(HostTextureProbe.entryAddress("load.later")));
    }

    @Test
    void unloadingALoadedNameDeletesTheTextureAndKeepsTheStaleEntry() {
        Native.loadTexture("load.unloaded", new int[] {1, 2, 3, 4}, 2, 2);
        long texture = HostTextureProbe.entryAddress("load.unloaded");
        assertNotEquals(0L, texture);
        assertTrue(HostTextureProbe.isRegistered(texture));

        Native.loadTexture("load.unloaded", null, 2, 2);
        assertFalse(HostTextureProbe.isRegistered(texture), "the texture is deleted");
        assertEquals(HostTextureProbe.FILED, HostTextureProbe.entryState("load.unloaded"));
        assertEquals(texture, HostTextureProbe.entryAddress("load.unloaded"), "the entry keeps the old pointer");
    }

    @Test
    void zeroWidthGivesATextureOfThatSizeWithAnEmptyBuffer() {
        Native.loadTexture("load.empty", new int[0], 0, 5);
        int[] state = HostTextureProbe.state("load.empty");
        assertEquals(0, state[HostTextureProbe.WIDTH]);
        assertEquals(5, state[HostTextureProbe.HEIGHT]);
        assertEquals(0, HostTextureProbe.bufferBytes("load.empty").length);
        float[] sizes = HostTextureProbe.sizes("load.empty");
        assertEquals(0.0f, sizes[0]);
        assertEquals(5.0f, sizes[1]);
        assertEquals(Float.POSITIVE_INFINITY, sizes[2]);
    }
}
