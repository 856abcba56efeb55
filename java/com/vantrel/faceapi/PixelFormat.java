// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

/** How the pixels of an image are laid out in memory. What an engine calls a layout is {@link EngineProfile}'s. */
public enum PixelFormat {
    /** Gray, one byte a pixel. */
    GRAY(1, false),
    /** Three bytes a pixel, blue first. */
    BGR(3, false),
    /** Three bytes a pixel, red first. */
    RGB(3, false),
    /** Four bytes a pixel, blue first, alpha last. */
    BGRA(4, false),
    /** Four bytes a pixel, red first, alpha last. */
    RGBA(4, false),
    /** Luma rows, then half as many rows of V, U pairs; even width and height. */
    NV21(1, true),
    /** Luma rows, then half as many rows of U, V pairs; even width and height. */
    NV12(1, true);

    private final int bytesPerPixel;
    private final boolean semiPlanar;

    PixelFormat(int bytesPerPixel, boolean semiPlanar) {
        this.bytesPerPixel = bytesPerPixel;
        this.semiPlanar = semiPlanar;
    }

    /**
     * Returns the bytes of a row without padding.
     *
     * @param width image width in pixels
     * @return bytes from the first to behind the last pixel of a row
     * @throws IllegalArgumentException when the width is below 1, or odd where it must be even
     */
    public long rowBytes(int width) {
        Check.side("width", this, width);
        return (long) width * bytesPerPixel;
    }

    /**
     * Returns the bytes that an image takes, the padding behind its last row not counted.
     *
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @return bytes from the first to behind the last pixel
     * @throws IllegalArgumentException when a side is below 1, or odd where it must be even, or the stride is shorter
     *     than a row
     */
    public long imageBytes(int width, int height, int stride) {
        return Check.imageBytes(this, width, height, stride);
    }

    /** Whether this is one of the two 4:2:0 layouts of camera frames. */
    boolean isSemiPlanar() {
        return semiPlanar;
    }

    /** Bytes of a pixel; of a pixel's luma in the 4:2:0 layouts. */
    int bytesPerPixel() {
        return bytesPerPixel;
    }
}
