package com.vantrel.faceapi;

import java.nio.ByteBuffer;
import org.jetbrains.annotations.NotNull;
import org.jetbrains.annotations.Nullable;

/**
 * A camera frame as the library takes it: luma rows, then chroma pairs, packed in one array.
 *
 * <p>Keep one object and refill it for every frame: once its array has the size, filling allocates nothing.
 *
 * <pre>{@code
 * CameraFrame frame = new CameraFrame();
 * // for every image of format YUV_420_888, from Camera2 or CameraX:
 * frame.fill(width, height, y, yRowStride, u, uRowStride, uPixelStride, v, vRowStride, vPixelStride, rotation);
 * }</pre>
 *
 * <p>Filling and reading are not for several threads at once; the other classes of this package hold the frame's
 * monitor while native code reads it.
 */
public final class CameraFrame {
    private static final byte[] NOTHING = {};

    private byte[] data = NOTHING;
    private PixelFormat format = PixelFormat.NV21;
    private int width;
    private int height;
    private int rotationDegrees;

    /** A row of the first and of the second chroma plane, as they are in memory. */
    private byte[] firstRow = NOTHING;
    private byte[] secondRow = NOTHING;

    /** Creates a frame without content, which must be filled before use. */
    public CameraFrame() {}

    /**
     * Creates a frame over an array that already is a packed frame. The array is not copied.
     *
     * @param data {@code width * height * 3 / 2} bytes
     * @param format {@link PixelFormat#NV21} or {@link PixelFormat#NV12}
     * @param width width in pixels, even
     * @param height height in pixels, even
     * @param rotationDegrees by how much the frame must be turned clockwise to be upright: 0, 90, 180 or 270
     * @return the frame
     * @throws IllegalArgumentException when anything does not fit
     */
    public static @NotNull CameraFrame of(
            byte @NotNull [] data, @NotNull PixelFormat format, int width, int height, int rotationDegrees) {
        Check.notNull("data", data);
        Check.notNull("format", format);
        if (!format.isSemiPlanar()) {
            throw new IllegalArgumentException("format must be NV21 or NV12, not " + format);
        }
        int bytes = Check.packedBytes(format, width, height);
        Check.that(data.length == bytes, "data.length", "exactly " + bytes, data.length);
        Check.rotation("rotationDegrees", rotationDegrees);
        CameraFrame frame = new CameraFrame();
        frame.set(data, format, width, height, rotationDegrees);
        return frame;
    }

    /**
     * Fills a new frame from the planes of a YUV_420_888 image; see {@link #fill}.
     *
     * @param width width in pixels, even
     * @param height height in pixels, even
     * @param y the luma plane
     * @param yRowStride bytes from one luma row to the next
     * @param u the U plane
     * @param uRowStride bytes from one U row to the next
     * @param uPixelStride bytes from one U sample to the next
     * @param v the V plane
     * @param vRowStride bytes from one V row to the next
     * @param vPixelStride bytes from one V sample to the next
     * @param rotationDegrees by how much the frame must be turned clockwise to be upright: 0, 90, 180 or 270
     * @param reuse an array to fill, of exactly {@code width * height * 3 / 2} bytes, or null for a new one
     * @return the frame
     * @throws IllegalArgumentException when anything does not fit
     */
    public static @NotNull CameraFrame fromPlanes(
            int width, int height, @NotNull ByteBuffer y, int yRowStride, @NotNull ByteBuffer u, int uRowStride,
            int uPixelStride, @NotNull ByteBuffer v, int vRowStride, int vPixelStride, int rotationDegrees,
            byte @Nullable [] reuse) {
        CameraFrame frame = new CameraFrame();
        frame.data = Check.output("reuse", reuse, Check.packedBytes(PixelFormat.NV21, width, height));
        frame.fill(width, height, y, yRowStride, u, uRowStride, uPixelStride, v, vRowStride, vPixelStride,
                rotationDegrees);
        return frame;
    }

    /**
     * Fills this frame from the planes of a YUV_420_888 image, as Camera2 and CameraX deliver them.
     *
     * <p>A plane begins at its buffer's position. The last row may end with its last sample, however long the row
     * stride is. Positions are as before afterwards. Planes whose U and V alternate in memory, which is what most
     * cameras deliver, are copied a row at a time and give NV21 or NV12 as they were; any others give NV21.
     *
     * @param newWidth width in pixels, even
     * @param newHeight height in pixels, even
     * @param y the luma plane, its samples side by side
     * @param yRowStride bytes from one luma row to the next
     * @param u the U plane
     * @param uRowStride bytes from one U row to the next
     * @param uPixelStride bytes from one U sample to the next
     * @param v the V plane
     * @param vRowStride bytes from one V row to the next
     * @param vPixelStride bytes from one V sample to the next
     * @param newRotationDegrees by how much the frame must be turned clockwise to be upright: 0, 90, 180 or 270
     * @throws IllegalArgumentException when anything does not fit; the frame is as it was then
     */
    public synchronized void fill(
            int newWidth, int newHeight, @NotNull ByteBuffer y, int yRowStride, @NotNull ByteBuffer u, int uRowStride,
            int uPixelStride, @NotNull ByteBuffer v, int vRowStride, int vPixelStride, int newRotationDegrees) {
        int bytes = Check.packedBytes(PixelFormat.NV21, newWidth, newHeight);
        int pairs = newWidth / 2;
        int chromaRows = newHeight / 2;
        checkPlane("y", y, newHeight, newWidth, yRowStride, 1);
        checkPlane("u", u, chromaRows, pairs, uRowStride, uPixelStride);
        checkPlane("v", v, chromaRows, pairs, vRowStride, vPixelStride);
        Check.rotation("rotationDegrees", newRotationDegrees);

        byte[] out = data.length == bytes ? data : new byte[bytes];
        copyRows(y, yRowStride, newHeight, newWidth, out, 0, newWidth);

        int chroma = newWidth * newHeight;
        PixelFormat newFormat = PixelFormat.NV21;
        boolean sameShape = uPixelStride == 2 && vPixelStride == 2 && uRowStride == vRowStride;
        int reach = (chromaRows - 1) * uRowStride + newWidth - 1;
        if (sameShape && isOneBehind(v, u, reach)) {
            copyPairs(v, u, uRowStride, chromaRows, newWidth, out, chroma);
        } else if (sameShape && isOneBehind(u, v, reach)) {
            copyPairs(u, v, uRowStride, chromaRows, newWidth, out, chroma);
            newFormat = PixelFormat.NV12;
        } else {
            interleave(v, vRowStride, vPixelStride, u, uRowStride, uPixelStride, chromaRows, pairs, out, chroma);
        }
        set(out, newFormat, newWidth, newHeight, newRotationDegrees);
    }

    /**
     * Returns the frame's bytes: not a copy, and refilled by the next {@link #fill} of the same size.
     *
     * @return the array; empty when the frame was never filled
     */
    public synchronized byte @NotNull [] data() {
        return data;
    }

    /**
     * Returns the order of the chroma pairs.
     *
     * @return {@link PixelFormat#NV21} or {@link PixelFormat#NV12}
     */
    public synchronized @NotNull PixelFormat format() {
        return format;
    }

    /**
     * Returns the width.
     *
     * @return pixels; 0 when the frame was never filled
     */
    public synchronized int width() {
        return width;
    }

    /**
     * Returns the height.
     *
     * @return pixels; 0 when the frame was never filled
     */
    public synchronized int height() {
        return height;
    }

    /**
     * Returns how the frame is turned.
     *
     * @return by how many degrees it must be turned clockwise to be upright
     */
    public synchronized int rotationDegrees() {
        return rotationDegrees;
    }

    void checkFilled() {
        if (width == 0) {
            throw new IllegalStateException("the frame was never filled");
        }
    }

    private void set(byte[] newData, PixelFormat newFormat, int newWidth, int newHeight, int newRotationDegrees) {
        data = newData;
        format = newFormat;
        width = newWidth;
        height = newHeight;
        rotationDegrees = newRotationDegrees;
    }

    private static void checkPlane(
            String name, ByteBuffer plane, int rows, int samples, int rowStride, int pixelStride) {
        Check.notNull(name, plane);
        Check.positive(name + "PixelStride", pixelStride);
        long row = (samples - 1L) * pixelStride + 1;
        Check.that(rowStride >= row, name + "RowStride", "at least " + row, rowStride);
        Check.length(name, plane.remaining(), (rows - 1L) * rowStride + row, "bytes from its position on");
    }

    /**
     * Whether, over {@code reach} bytes, the second plane is the first one byte further on: two views of the same
     * pairs. It is the content that counts, since that is what a copy of the first plane would have to contain.
     */
    private static boolean isOneBehind(ByteBuffer first, ByteBuffer second, int reach) {
        int firstPosition = first.position();
        int firstLimit = first.limit();
        int secondPosition = second.position();
        int secondLimit = second.limit();
        try {
            first.position(firstPosition + 1);
            first.limit(firstPosition + reach);
            second.limit(secondPosition + reach - 1);
            return first.equals(second);
        } finally {
            first.limit(firstLimit);
            first.position(firstPosition);
            second.limit(secondLimit);
            second.position(secondPosition);
        }
    }

    /** Copies rows of pairs that begin with {@code first}; the very last byte is only in {@code second}. */
    private static void copyPairs(
            ByteBuffer first, ByteBuffer second, int rowStride, int rows, int rowBytes, byte[] out, int offset) {
        copyRows(first, rowStride, rows - 1, rowBytes, out, offset, rowBytes);
        int last = (rows - 1) * rowStride;
        int end = offset + rows * rowBytes;
        copy(first, last, out, end - rowBytes, rowBytes - 1);
        out[end - 1] = second.get(second.position() + last + rowBytes - 2);
    }

    private static void copyRows(
            ByteBuffer plane, int rowStride, int rows, int rowBytes, byte[] out, int offset, int outStride) {
        if (rowStride == rowBytes && outStride == rowBytes) {
            copy(plane, 0, out, offset, rows * rowBytes);
            return;
        }
        for (int row = 0; row < rows; row++) {
            copy(plane, row * rowStride, out, offset + row * outStride, rowBytes);
        }
    }

    /** A bulk read at an offset from the buffer's position, which stays where it is. */
    private static void copy(ByteBuffer plane, int from, byte[] out, int offset, int length) {
        int position = plane.position();
        try {
            plane.position(position + from);
            plane.get(out, offset, length);
        } finally {
            plane.position(position);
        }
    }

    private void interleave(
            ByteBuffer first, int firstRowStride, int firstPixelStride, ByteBuffer second, int secondRowStride,
            int secondPixelStride, int rows, int pairs, byte[] out, int offset) {
        int firstBytes = (pairs - 1) * firstPixelStride + 1;
        int secondBytes = (pairs - 1) * secondPixelStride + 1;
        firstRow = firstRow.length < firstBytes ? new byte[firstBytes] : firstRow;
        secondRow = secondRow.length < secondBytes ? new byte[secondBytes] : secondRow;
        int to = offset;
        for (int row = 0; row < rows; row++) {
            copy(first, row * firstRowStride, firstRow, 0, firstBytes);
            copy(second, row * secondRowStride, secondRow, 0, secondBytes);
            for (int pair = 0; pair < pairs; pair++) {
                out[to++] = firstRow[pair * firstPixelStride];
                out[to++] = secondRow[pair * secondPixelStride];
            }
        }
    }
}
