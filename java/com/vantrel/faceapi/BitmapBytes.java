// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import java.nio.ByteBuffer;

/**
 * A bitmap's pixels, RGBA, in an array that is used again: rows as far apart as they are in the bitmap. For one thread
 * at a time.
 */
final class BitmapBytes {
    private byte[] bytes = {};
    private ByteBuffer buffer = ByteBuffer.wrap(bytes);

    /** Fails for a bitmap whose pixels are not there, or not four bytes each. */
    static void checkPixels(String name, Bitmap bitmap) {
        Check.notNull(name, bitmap);
        if (bitmap.isRecycled()) {
            throw new IllegalArgumentException(name + " is recycled");
        }
        if (bitmap.getConfig() != Bitmap.Config.ARGB_8888) {
            throw Check.refusal(name, "ARGB_8888", bitmap.getConfig());
        }
    }

    /**
     * Copies the pixels. The array has at least {@code bitmap.getRowBytes() * bitmap.getHeight()} bytes, and is written
     * again by the next call.
     */
    byte[] read(Bitmap bitmap) {
        long needed = (long) bitmap.getRowBytes() * bitmap.getHeight();
        if (needed > Integer.MAX_VALUE) {
            throw new IllegalArgumentException("bitmap must fit an array, not have " + needed + " bytes");
        }
        if (bytes.length < needed) {
            bytes = new byte[(int) needed];
            buffer = ByteBuffer.wrap(bytes);
        }
        buffer.clear();
        bitmap.copyPixelsToBuffer(buffer);
        return bytes;
    }
}
