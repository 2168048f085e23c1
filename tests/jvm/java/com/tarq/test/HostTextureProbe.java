package com.tarq.test;

/**
 * A test-only look into the runtime's textures map and texture registry, for
 * checking what Native.loadTexture filed (natives in the library named by the
 * system property vi.hosttextureprobe, linked to the same runtime). Every
 * method but entryState, entryAddress and isRegistered needs a name filed with
 * a live texture.
 */
public final class HostTextureProbe {
    public static final int ABSENT = 0;
    public static final int NULL_ENTRY = 1;
    public static final int FILED = 2;

    /** Indices into state(). */
    public static final int WIDTH = 0, HEIGHT = 1, DELETABLE = 2, UPLOADED = 3, GL_NAME = 4, STATIC = 5,
            REPEAT = 6, MIRRORED = 7, LINEAR = 8, COMPRESSED = 9, INTERNAL_FORMAT = 10, FORMAT = 11,
            PIXEL_TYPE = 12, KIND = 13;

    static {
        TestHost.load();
        System.load(TestHost.property("vi.hosttextureprobe"));
    }

    private HostTextureProbe() {}

    /** ABSENT, NULL_ENTRY or FILED; never files the name. */
    public static native int entryState(String name);
    /** The filed pointer (0 when absent or null); never dereferenced. */
    public static native long entryAddress(String name);
    /** Whether a texture at this address is in the runtime's texture registry. */
    public static native boolean isRegistered(long address);

    public static native int[] state(String name);
    /** size x, size y, texel size x, texel size y */
    public static native float[] sizes(String name);
    /** The client-side buffer: width x height x 4 bytes. */
    public static native byte[] bufferBytes(String name);
    /** Makes the GL texture, as a scene does before binding it. */
    public static native void allocate(String name);
    /** Swaps the texture's buffer for a large one of its own mapping; returns its address. */
    public static native long adoptLargeBuffer(String name);
    public static native boolean isLargeBufferMapped(long address);
    /** The GL texture's pixels as RGBA bytes, read through a framebuffer; null if it cannot be attached. */
    public static native byte[] readTexture(String name);
}
