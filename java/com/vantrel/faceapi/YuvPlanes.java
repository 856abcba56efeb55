// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.ImageFormat;
import android.media.Image;
import java.nio.ByteBuffer;
import org.jetbrains.annotations.NotNull;
import org.jetbrains.annotations.Nullable;

/**
 * A picture of format YUV_420_888 where it is: the three planes that Camera2 and CameraX deliver, with their strides.
 * Nothing is copied. The planes must stay as they are, and the image they belong to open, for as long as this object is
 * used.
 *
 * <pre>{@code
 * YuvPlanes planes = new YuvPlanes();
 * // for every image:
 * planes.set(image);
 * bitmap = Images.toBitmap(planes, transform, bitmap);
 * }</pre>
 *
 * <p>A plane begins at its buffer's position. Its last row may end with its last sample, however long the row stride
 * is. Buffers are direct, as a camera's are, or backed by an array that they show; positions and limits stay as they
 * are.
 *
 * <p>One object can be set again for every image, which allocates nothing. It is not for several threads at once.
 */
public final class YuvPlanes {
    /** A plane: a buffer, how far apart its rows lie in it, and how far apart the samples of a row. */
    public static final class Plane {
        private final ByteBuffer buffer;
        private final int rowStride;
        private final int pixelStride;

        /**
         * Creates a plane.
         *
         * @param buffer the buffer, whose position is where the first sample is
         * @param rowStride bytes from one row to the next
         * @param pixelStride bytes from one sample to the next: 1 or 2, of luma 1
         * @throws NullPointerException when the buffer is null
         */
        public Plane(@NotNull ByteBuffer buffer, int rowStride, int pixelStride) {
            this.buffer = Check.notNull("buffer", buffer);
            this.rowStride = rowStride;
            this.pixelStride = pixelStride;
        }
    }

    private int width;
    private int height;
    private @Nullable ByteBuffer y;
    private @Nullable ByteBuffer u;
    private @Nullable ByteBuffer v;
    private int yRowStride;
    private int uRowStride;
    private int uPixelStride;
    private int vRowStride;
    private int vPixelStride;

    /** The planes as native code is told of them. */
    private final int[] numbers = new int[PlaneConversion.NUMBERS];

    /** Cuts faces out of these planes, with arrays that stay for the next face. */
    private final FaceCutter cutter = new FaceCutter();

    /** Creates an object without planes, which must be set before use. */
    public YuvPlanes() {}

    /**
     * Takes the planes of an image.
     *
     * @param image an open image of format YUV_420_888; its crop rectangle is not looked at
     * @return the planes
     * @throws NullPointerException when the image is null
     * @throws IllegalArgumentException when the image is of another format or its planes do not fit its size
     * @throws IllegalStateException when the image is closed
     */
    public static @NotNull YuvPlanes of(@NotNull Image image) {
        YuvPlanes planes = new YuvPlanes();
        planes.set(image);
        return planes;
    }

    /**
     * Takes planes.
     *
     * @param width width of the picture in pixels, even
     * @param height height of the picture in pixels, even
     * @param y luma
     * @param u the first chroma plane of YUV_420_888, blue difference
     * @param v the second chroma plane of YUV_420_888, red difference
     * @return the planes
     * @throws NullPointerException when a plane is null
     * @throws IllegalArgumentException when the planes do not fit the size
     */
    public static @NotNull YuvPlanes of(
            int width, int height, @NotNull Plane y, @NotNull Plane u, @NotNull Plane v) {
        YuvPlanes planes = new YuvPlanes();
        planes.set(width, height, y, u, v);
        return planes;
    }

    /**
     * Takes the planes of another image instead.
     *
     * @param image an open image of format YUV_420_888; its crop rectangle is not looked at
     * @throws NullPointerException when the image is null
     * @throws IllegalArgumentException when the image is of another format or its planes do not fit its size; this
     *     object is as it was then
     * @throws IllegalStateException when the image is closed
     */
    public void set(@NotNull Image image) {
        Check.notNull("image", image);
        int format = image.getFormat();
        Check.that(format == ImageFormat.YUV_420_888, "image's format", "YUV_420_888 (" + ImageFormat.YUV_420_888 + ")",
                format);
        Image.Plane[] planes = image.getPlanes();
        Check.that(planes.length == 3, "image's number of planes", "3", planes.length);
        Image.Plane luma = planes[0];
        Image.Plane blue = planes[1];
        Image.Plane red = planes[2];
        set(image.getWidth(), image.getHeight(), luma.getBuffer(), luma.getRowStride(), luma.getPixelStride(),
                blue.getBuffer(), blue.getRowStride(), blue.getPixelStride(), red.getBuffer(), red.getRowStride(),
                red.getPixelStride());
    }

    /**
     * Takes other planes instead.
     *
     * @param newWidth width of the picture in pixels, even
     * @param newHeight height of the picture in pixels, even
     * @param newY luma
     * @param newU the first chroma plane of YUV_420_888, blue difference
     * @param newV the second chroma plane of YUV_420_888, red difference
     * @throws NullPointerException when a plane is null
     * @throws IllegalArgumentException when the planes do not fit the size; this object is as it was then
     */
    public void set(int newWidth, int newHeight, @NotNull Plane newY, @NotNull Plane newU, @NotNull Plane newV) {
        Check.notNull("y", newY);
        Check.notNull("u", newU);
        Check.notNull("v", newV);
        set(newWidth, newHeight, newY.buffer, newY.rowStride, newY.pixelStride, newU.buffer, newU.rowStride,
                newU.pixelStride, newV.buffer, newV.rowStride, newV.pixelStride);
    }

    /**
     * Takes other planes instead, as CameraX has them, without an object for each.
     *
     * @param newWidth width of the picture in pixels, even
     * @param newHeight height of the picture in pixels, even
     * @param newY the luma plane
     * @param newYRowStride bytes from one luma row to the next
     * @param newYPixelStride bytes from one luma sample to the next: 1
     * @param newU the first chroma plane of YUV_420_888, blue difference
     * @param newURowStride bytes from one row of it to the next
     * @param newUPixelStride bytes from one sample of it to the next: 1 or 2
     * @param newV the second chroma plane of YUV_420_888, red difference
     * @param newVRowStride bytes from one row of it to the next
     * @param newVPixelStride bytes from one sample of it to the next: 1 or 2
     * @throws NullPointerException when a buffer is null
     * @throws IllegalArgumentException when the planes do not fit the size; this object is as it was then
     */
    public void set(
            int newWidth, int newHeight, @NotNull ByteBuffer newY, int newYRowStride, int newYPixelStride,
            @NotNull ByteBuffer newU, int newURowStride, int newUPixelStride, @NotNull ByteBuffer newV,
            int newVRowStride, int newVPixelStride) {
        Check.evenAndPositive("width", newWidth);
        Check.evenAndPositive("height", newHeight);
        Check.that(newYPixelStride == 1, "y's pixel stride", "1", newYPixelStride);
        checkPlane("y", newY, newHeight, newWidth, newYRowStride, newYPixelStride);
        checkPlane("u", newU, newHeight / 2, newWidth / 2, newURowStride, newUPixelStride);
        checkPlane("v", newV, newHeight / 2, newWidth / 2, newVRowStride, newVPixelStride);
        width = newWidth;
        height = newHeight;
        y = newY;
        u = newU;
        v = newV;
        yRowStride = newYRowStride;
        uRowStride = newURowStride;
        uPixelStride = newUPixelStride;
        vRowStride = newVRowStride;
        vPixelStride = newVPixelStride;
    }

    private static void checkPlane(
            String name, ByteBuffer plane, int rows, int samples, int rowStride, int pixelStride) {
        Check.notNull(name, plane);
        if (pixelStride != 1 && pixelStride != 2) {
            Check.that(false, name + "'s pixel stride", "1 or 2", pixelStride);
        }
        long row = (samples - 1L) * pixelStride + 1;
        if (rowStride < row) {
            Check.that(false, name + "'s row stride", "at least " + row + " (a row of " + samples + " samples)",
                    rowStride);
        }
        Check.length(name, plane.remaining(), (rows - 1L) * rowStride + row, "bytes from its position on");
        if (!PlaneConversion.isReadable(plane)) {
            throw new IllegalArgumentException(name + " must be a direct buffer or show its array");
        }
    }

    /**
     * Returns the width of the picture.
     *
     * @return pixels; 0 when no planes were set
     */
    public int width() {
        return width;
    }

    /**
     * Returns the height of the picture.
     *
     * @return pixels; 0 when no planes were set
     */
    public int height() {
        return height;
    }

    /** Fails when no planes were set, or when positions or limits have changed since in a way that does not fit. */
    void checkSet() {
        if (width == 0) {
            throw new IllegalStateException("the planes were never set");
        }
        checkPlane("y", y, height, width, yRowStride, 1);
        checkPlane("u", u, height / 2, width / 2, uRowStride, uPixelStride);
        checkPlane("v", v, height / 2, width / 2, vRowStride, vPixelStride);
    }

    /** The planes as native code takes them, to be given to it with each one's memory; checked now. */
    int[] described() {
        checkSet();
        PlaneConversion.describe(
                numbers, width, height, y, yRowStride, u, uRowStride, uPixelStride, v, vRowStride, vPixelStride);
        return numbers;
    }

    Object yMemory() {
        return PlaneConversion.memory(y);
    }

    Object uMemory() {
        return PlaneConversion.memory(u);
    }

    Object vMemory() {
        return PlaneConversion.memory(v);
    }

    FaceCutter cutter() {
        return cutter;
    }
}
