// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Rect;
import java.nio.ByteBuffer;

/**
 * Argument checks, whose messages name the argument, what is expected and what was given; and every product of sizes
 * in this package.
 *
 * <p>Native code is called with sizes that came through here and with no others. A product is formed of factors that
 * were checked before, in 64 bits that hold it. Messages are made for failures only: checks of what is right allocate
 * nothing.
 */
final class Check {
    private Check() {}

    static <T> T notNull(String name, T value) {
        if (value == null) {
            throw new NullPointerException(name + " is null");
        }
        return value;
    }

    /** What is thrown for an argument that is not as expected. */
    static IllegalArgumentException refusal(String name, String expected, Object given) {
        return new IllegalArgumentException(name + " must be " + expected + ", not " + given);
    }

    static void that(boolean holds, String name, String expected, long given) {
        if (!holds) {
            throw refusal(name, expected, given);
        }
    }

    static void positive(String name, int value) {
        if (value <= 0) {
            throw refusal(name, "above 0", value);
        }
    }

    static void range(String name, long value, long lowest, long highest) {
        if (value < lowest || value > highest) {
            throw refusal(name, "from " + lowest + " to " + highest, value);
        }
    }

    static void rotation(String name, int degrees) {
        if (degrees != 0 && degrees != 90 && degrees != 180 && degrees != 270) {
            throw refusal(name, "0, 90, 180 or 270", degrees);
        }
    }

    /** One of the two layouts of camera frames. */
    static void frameFormat(String name, PixelFormat format) {
        if (!notNull(name, format).isSemiPlanar()) {
            throw refusal(name, "NV21 or NV12", format);
        }
    }

    /** A width or height of an image of a format. */
    static void side(String name, PixelFormat format, int length) {
        if (length <= 0 || (format.isSemiPlanar() && length % 2 != 0)) {
            throw refusal(name, format.isSemiPlanar() ? "even and above 0" : "above 0", length);
        }
    }

    static void evenAndPositive(String name, int value) {
        side(name, PixelFormat.NV21, value);
    }

    /** An array or buffer of at least {@code needed} elements, of which one is {@code unit}. */
    static void length(String name, int length, long needed, String unit) {
        if (length < needed) {
            throw new IllegalArgumentException(
                    name + " must have at least " + needed + " " + unit + ", not " + length);
        }
    }

    /** Width and height of an image of a format; returns its packed size in bytes. */
    static int packedBytes(PixelFormat format, int width, int height) {
        side("width", format, width);
        side("height", format, height);
        long pixels = (long) width * height;
        // Compared before the pixels' bytes multiply it.
        if (pixels <= Integer.MAX_VALUE) {
            long bytes = format.isSemiPlanar() ? pixels + pixels / 2 : pixels * format.bytesPerPixel();
            if (bytes <= Integer.MAX_VALUE) {
                return (int) bytes;
            }
        }
        throw new IllegalArgumentException(
                "width x height must fit an array, not be " + width + " x " + height + " as " + format);
    }

    /** Width, height and stride of an image of a format; returns its bytes to behind the last pixel. */
    static long imageBytes(PixelFormat format, int width, int height, int stride) {
        side("width", format, width);
        side("height", format, height);
        long row = format.rowBytes(width);
        if (stride < row) {
            throw refusal("stride", "at least " + row + " (a row of " + width + " pixels as " + format + ")", stride);
        }
        long rows = format.isSemiPlanar() ? height + (long) height / 2 : height;
        return (rows - 1) * stride + row;
    }

    /** An array that is exactly a packed image. */
    static void packedImage(String name, byte[] image, PixelFormat format, int width, int height) {
        exactly(name, notNull(name, image), packedBytes(format, width, height));
    }

    /** An image in an array, of which one element is {@code unit} bytes. */
    static void image(PixelFormat format, int width, int height, int stride, int length, int unit) {
        long bytes = imageBytes(notNull("format", format), width, height, stride);
        length("image", length, (bytes + unit - 1) / unit, unit == 1 ? "bytes" : "ints");
    }

    /** A plane: samples at a distance in rows at a distance, from a buffer's position on. */
    static void plane(String name, ByteBuffer plane, int rows, int samples, int rowStride, int pixelStride) {
        notNull(name, plane);
        if (pixelStride <= 0) {
            throw refusal(name + "PixelStride", "above 0", pixelStride);
        }
        long row = (samples - 1L) * pixelStride + 1;
        if (rowStride < row) {
            throw refusal(name + "RowStride", "at least " + row, rowStride);
        }
        length(name, plane.remaining(), (rows - 1L) * rowStride + row, "bytes from its position on");
    }

    /** A rectangle inside an image. */
    static void rectangle(int x, int y, int w, int h, int width, int height) {
        positive("w", w);
        positive("h", h);
        range("x", x, 0, (long) width - w);
        range("y", y, 0, (long) height - h);
    }

    /** A rectangle that is not empty and begins at no negative position, so that its sides are ints. */
    static void edges(String name, Rect rect) {
        notNull(name, rect);
        if (rect.left < 0 || rect.top < 0 || rect.left >= rect.right || rect.top >= rect.bottom) {
            throw refusal(name, "neither empty nor begin at a negative position", rect);
        }
    }

    /** {@code reuse} when it has the exact length and is not {@code src}, a new array when it is null. */
    static byte[] output(byte[] reuse, int bytes, byte[] src) {
        if (reuse == null) {
            return new byte[bytes];
        }
        exactly("reuse", reuse, bytes);
        if (reuse == src) {
            throw new IllegalArgumentException("reuse must not be the source");
        }
        return reuse;
    }

    private static void exactly(String name, byte[] array, int bytes) {
        if (array.length != bytes) {
            throw refusal(name + ".length", "exactly " + bytes, array.length);
        }
    }
}
