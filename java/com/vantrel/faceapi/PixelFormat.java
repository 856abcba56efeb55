package com.vantrel.faceapi;

import org.jetbrains.annotations.NotNull;

/** How the pixels of an image are laid out, with the face engine's number for it. */
public final class PixelFormat {
    /** Gray, one byte a pixel. */
    public static final PixelFormat GRAY = packed("GRAY", EngineValues.PIXEL_GRAY, 1);
    /** Three bytes a pixel, blue first. */
    public static final PixelFormat BGR = packed("BGR", EngineValues.PIXEL_BGR, 3);
    /** Three bytes a pixel, red first. */
    public static final PixelFormat RGB = packed("RGB", EngineValues.PIXEL_RGB, 3);
    /** Four bytes a pixel, blue first, alpha last. */
    public static final PixelFormat BGRA = packed("BGRA", EngineValues.PIXEL_BGRA, 4);
    /** Four bytes a pixel, red first, alpha last. */
    public static final PixelFormat RGBA = packed("RGBA", EngineValues.PIXEL_RGBA, 4);
    /** Luma rows, then half as many rows of V, U pairs; even width and height. */
    public static final PixelFormat NV21 = semiPlanar("NV21", EngineValues.PIXEL_NV21);
    /** Luma rows, then half as many rows of U, V pairs; even width and height. */
    public static final PixelFormat NV12 = semiPlanar("NV12", EngineValues.PIXEL_NV12);

    private final String name;
    private final int engineValue;
    private final int bytesPerPixel;
    private final boolean semiPlanar;

    private PixelFormat(String name, int engineValue, int bytesPerPixel, boolean semiPlanar) {
        this.name = name;
        this.engineValue = engineValue;
        this.bytesPerPixel = bytesPerPixel;
        this.semiPlanar = semiPlanar;
    }

    private static PixelFormat packed(String name, int engineValue, int bytesPerPixel) {
        return new PixelFormat(name, engineValue, bytesPerPixel, false);
    }

    private static PixelFormat semiPlanar(String name, int engineValue) {
        return new PixelFormat(name, engineValue, 1, true);
    }

    /**
     * Returns the same layout under another number, for an engine that counts its formats differently.
     *
     * @param value the engine's number for this layout
     * @return the format with that number
     */
    public @NotNull PixelFormat withEngineValue(int value) {
        return new PixelFormat(name, value, bytesPerPixel, semiPlanar);
    }

    /**
     * Returns the engine's number for this format.
     *
     * @return the number that native calls are given
     */
    public int engineValue() {
        return engineValue;
    }

    /**
     * Returns the bytes of a row without padding.
     *
     * @param width image width in pixels
     * @return bytes from the first to behind the last pixel of a row
     */
    public long rowBytes(int width) {
        return (long) width * bytesPerPixel;
    }

    /**
     * Returns the bytes that an image takes, the padding behind its last row not counted.
     *
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @return bytes from the first to behind the last pixel
     */
    public long imageBytes(int width, int height, int stride) {
        long rows = semiPlanar ? height + (long) height / 2 : height;
        return (rows - 1) * stride + rowBytes(width);
    }

    boolean isSemiPlanar() {
        return semiPlanar;
    }

    int bytesPerPixel() {
        return bytesPerPixel;
    }

    /** Whether both describe the same layout, whatever the engine's numbers. */
    boolean isLayoutOf(PixelFormat other) {
        return name.equals(other.name);
    }

    @Override
    public String toString() {
        return name;
    }
}
