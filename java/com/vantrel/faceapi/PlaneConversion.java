// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import java.nio.ByteBuffer;

/**
 * The native conversions of a camera's planes: a rectangle of them, turned and mirrored, in one pass.
 *
 * <p>A plane is a direct buffer, or an array. What describes a picture is kept in an {@code int[]} of {@link #NUMBERS}
 * elements, which {@link #describe} fills; nothing is allocated. The native methods check what they are given and
 * answer with a status, for which {@link #check} throws; with any but {@link #SUCCESS} nothing was written. They read
 * from the planes' first to behind their last samples, wherever the rectangle is.
 *
 * <p>An odd left or top edge moves to the even position before, an odd right or bottom edge to the one behind, see
 * {@link Images#evenLength}. The picture is turned clockwise first, then mirrored left to right; by 90 and 270 degrees
 * width and height of the result change places.
 */
final class PlaneConversion {
    /** How many numbers describe a picture. */
    static final int NUMBERS = 15;

    /** Layouts of a result. */
    static final int RGBA = 0;
    static final int BGRA = 1;
    static final int RGB = 2;
    static final int BGR = 3;
    static final int NV21 = 4;
    static final int NV12 = 5;
    static final int GRAY = 6;

    static final int SUCCESS = 0;

    private static final int PICTURE = 1;
    private static final int LUMA = 2;
    private static final int CHROMA = 3;
    private static final int RECTANGLE = 4;
    private static final int ORIENTATION = 5;
    private static final int LAYOUT = 6;
    private static final int TARGET = 7;
    private static final int OVERLAP = 8;
    private static final int MEMORY = 16;
    private static final int NOT_LOCKED = 17;
    private static final int NOT_RGBA = 18;
    private static final int SMALL = 19;

    private static final int PLANES = 2;
    private static final int PLANE_NUMBERS = 4;
    private static final int DIRECT = PLANES + 3 * PLANE_NUMBERS;

    static {
        NativeLibrary.load();
    }

    private PlaneConversion() {}

    /**
     * Describes a picture whose planes begin at their buffers' positions and end at their limits, to be given to the
     * native methods with each buffer's {@link #memory}.
     *
     * @param numbers receives the description
     */
    static void describe(
            int[] numbers, int width, int height, ByteBuffer y, int yRowStride, ByteBuffer u, int uRowStride,
            int uPixelStride, ByteBuffer v, int vRowStride, int vPixelStride) {
        numbers[0] = width;
        numbers[1] = height;
        numbers[DIRECT] = 0;
        describePlane(numbers, 0, y, yRowStride, 1);
        describePlane(numbers, 1, u, uRowStride, uPixelStride);
        describePlane(numbers, 2, v, vRowStride, vPixelStride);
    }

    /**
     * Describes an NV21 or NV12 picture in an array, which is the memory of all three planes.
     *
     * @param numbers receives the description
     * @param bytes how long the array is; of a packed picture {@code width * height * 3 / 2}
     * @param vFirst true for NV21
     */
    static void describe(int[] numbers, int width, int height, int bytes, boolean vFirst) {
        numbers[0] = width;
        numbers[1] = height;
        numbers[DIRECT] = 0;
        int chroma = width * height;
        setPlane(numbers, 0, 0, bytes, width, 1);
        setPlane(numbers, 1, vFirst ? chroma + 1 : chroma, bytes, width, 2);
        setPlane(numbers, 2, vFirst ? chroma : chroma + 1, bytes, width, 2);
    }

    private static void describePlane(int[] numbers, int index, ByteBuffer plane, int rowStride, int pixelStride) {
        boolean direct = plane.isDirect();
        int before = direct ? 0 : plane.arrayOffset();
        setPlane(numbers, index, before + plane.position(), before + plane.limit(), rowStride, pixelStride);
        if (direct) {
            numbers[DIRECT] |= 1 << index;
        }
    }

    private static void setPlane(int[] numbers, int index, int from, int to, int rowStride, int pixelStride) {
        int at = PLANES + index * PLANE_NUMBERS;
        numbers[at] = from;
        numbers[at + 1] = to;
        numbers[at + 2] = rowStride;
        numbers[at + 3] = pixelStride;
    }

    /** What native code reads a buffer's bytes in: itself when it is direct, else its array. */
    static Object memory(ByteBuffer plane) {
        return plane.isDirect() ? plane : plane.array();
    }

    /** Whether native code can read a buffer: one that is neither direct nor shows its array must be copied. */
    static boolean isReadable(ByteBuffer plane) {
        return plane.isDirect() || plane.hasArray();
    }

    /** Throws for any status but {@link #SUCCESS}. */
    static void check(int status) {
        switch (status) {
            case SUCCESS:
                return;
            case PICTURE:
                throw new IllegalArgumentException("width and height must be even and above 0");
            case LUMA:
                throw new IllegalArgumentException("the luma plane does not hold the picture");
            case CHROMA:
                throw new IllegalArgumentException("the chroma planes do not hold the picture");
            case RECTANGLE:
                throw new IllegalArgumentException("the rectangle must be inside the picture");
            case ORIENTATION:
                throw new IllegalArgumentException("degrees must be 0, 90, 180 or 270");
            case LAYOUT:
                throw new IllegalArgumentException("there is no such layout");
            case TARGET:
                throw new IllegalArgumentException("the output does not hold the result");
            case OVERLAP:
                throw new IllegalArgumentException("the output must not be the source");
            case MEMORY:
                throw new IllegalArgumentException("a buffer or array is not as long as it is said to be");
            case NOT_LOCKED:
                throw new IllegalArgumentException("bitmap has no pixels: it is recycled");
            case NOT_RGBA:
                throw new IllegalArgumentException("bitmap must be ARGB_8888");
            case SMALL:
                throw new IllegalArgumentException("bitmap is smaller than the result");
            default:
                throw new IllegalStateException("the conversion failed with status " + status);
        }
    }

    /**
     * Converts into an ARGB_8888 bitmap, from its left upper corner on.
     *
     * @throws IllegalArgumentException when the bitmap is recycled, immutable, of another configuration or smaller
     *     than the result, or anything else does not fit; nothing was written then
     */
    static void convert(
            Object y, Object u, Object v, int[] picture, int left, int top, int width, int height, int degrees,
            boolean mirrored, Bitmap out) {
        if (out.isRecycled()) {
            check(NOT_LOCKED);
        }
        if (!out.isMutable()) {
            throw new IllegalArgumentException("bitmap is immutable");
        }
        check(toBitmap(y, u, v, picture, left, top, width, height, degrees, mirrored, out));
    }

    /** Converts into an array from element {@code from} on; {@code stride} is bytes from one row to the next. */
    static native int toBytes(
            Object y, Object u, Object v, int[] picture, int left, int top, int width, int height, int degrees,
            boolean mirrored, int layout, byte[] out, int from, int stride);

    /**
     * Converts into the memory of an {@code int[]}; {@code from} and {@code stride} count ints. On Android, where the
     * lowest byte comes first, {@link #BGRA} makes the ints of {@code Bitmap.getPixels}: 0xAARRGGBB.
     */
    static native int toInts(
            Object y, Object u, Object v, int[] picture, int left, int top, int width, int height, int degrees,
            boolean mirrored, int layout, int[] out, int from, int stride);

    /** Converts into a direct buffer's bytes from {@code from} on and before {@code to}. */
    static native int toBuffer(
            Object y, Object u, Object v, int[] picture, int left, int top, int width, int height, int degrees,
            boolean mirrored, int layout, ByteBuffer out, int from, int to, int stride);

    /** Converts into a bitmap; whether it is immutable is not looked at, see {@link #convert}. */
    private static native int toBitmap(
            Object y, Object u, Object v, int[] picture, int left, int top, int width, int height, int degrees,
            boolean mirrored, Bitmap out);
}
