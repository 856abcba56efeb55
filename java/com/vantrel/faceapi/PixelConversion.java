// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;

/**
 * What {@link Images} does natively to pixels in arrays and bitmaps: as the methods of {@link FaceLibrary}, but that
 * these compare what they are given with the sizes, hold sums of any size, and write nothing to the log.
 *
 * <p>All answer {@link #SUCCESS} or a sum, which is not negative, or a status for which {@link #check} throws.
 */
final class PixelConversion {
    /** RGBA to BGRA, or back. */
    static final int SWAP_RED_AND_BLUE = 0;
    /** RGBA to NV21. */
    static final int RGBA_TO_NV21 = 1;
    /** RGBA to NV12. */
    static final int RGBA_TO_NV12 = 2;

    static final int SUCCESS = 0;

    private static final int NO_PIXELS = -2;
    private static final int CHANGED = -3;

    static {
        NativeLibrary.load();
    }

    private PixelConversion() {}

    /** Throws for a status that is a failure; returns any other. */
    static long check(long status) {
        if (status >= SUCCESS) {
            return status;
        }
        if (status == NO_PIXELS) {
            throw new IllegalArgumentException("bitmap is recycled");
        }
        if (status == CHANGED) {
            throw new IllegalArgumentException("bitmap must not be changed meanwhile");
        }
        throw new IllegalStateException("sizes were not checked: status " + status);
    }

    /** Converts packed RGBA (or BGRA) pixels; the arrays are two. */
    static native int convert(byte[] src, int width, int height, byte[] dst, int conversion);

    /** Turns packed pixels of 1, 3 or 4 bytes clockwise by 90, 180 or 270 degrees; the arrays are two. */
    static native int rotate(byte[] src, int width, int height, int bytesPerPixel, int degrees, byte[] dst);

    /** Reads an ARGB_8888 bitmap of the given sizes, whatever its row stride, as BGR or, with 4 bytes, BGRA. */
    static native int read(Bitmap bitmap, int width, int height, int bytesPerPixel, byte[] dst);

    /** Adds up the bytes of a rectangle; {@code stride} is bytes from one row to the next. */
    static native long sumBytes(byte[] image, int stride, int x, int y, int w, int h);

    /** Adds up the lightness, 0 to 255 each, of a rectangle of RGBA or, without {@code rgba}, BGRA pixels. */
    static native long sumLightness(byte[] image, int stride, boolean rgba, int x, int y, int w, int h);
}
