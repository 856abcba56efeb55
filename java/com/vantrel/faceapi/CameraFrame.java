// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import java.nio.ByteBuffer;
import java.util.concurrent.atomic.AtomicLong;
import org.jetbrains.annotations.NotNull;
import org.jetbrains.annotations.Nullable;

/**
 * A camera frame as the library takes it: luma rows, then chroma pairs, packed in one array.
 *
 * <p>Keep one object and refill it for every frame: once its array has the size, filling allocates nothing.
 *
 * <pre>{@code
 * YuvPlanes planes = new YuvPlanes();
 * CameraFrame frame = new CameraFrame();
 * // for every image of format YUV_420_888, from Camera2 or CameraX:
 * planes.set(image);
 * frame.fill(planes, rotation);
 * }</pre>
 *
 * <p>A frame keeps its chroma order for life: NV21 unless it was made for NV12, however the planes that fill it lie in
 * memory.
 *
 * <p>Any thread may use a frame: its methods, and those of this package that read it, wait for one another. They do so
 * on a lock of the frame's own, so that holding the frame's monitor is neither needed nor of any effect. What an
 * app writes to {@link #data()} itself is its own to order.
 */
public final class CameraFrame {
    private static final byte[] NOTHING = {};

    private static final AtomicLong MADE = new AtomicLong();

    /**
     * Held while the frame is read or filled. Who needs an {@link EngineHandle} too takes the handle first; who needs
     * two frames takes first the one that was made first.
     */
    final Object lock = new Object();

    private final long number = MADE.getAndIncrement();

    private final PixelFormat format;
    private byte[] data = NOTHING;
    private int width;
    private int height;
    private int rotationDegrees;

    /** The planes, or this frame, as native code is told of them. */
    private final int[] numbers = new int[PlaneConversion.NUMBERS];

    /** Cuts faces out of this frame, with arrays that stay for the next face. */
    private final FaceCutter cutter = new FaceCutter();

    /** Creates an NV21 frame without content, which must be filled before use. */
    public CameraFrame() {
        this(PixelFormat.NV21);
    }

    /**
     * Creates a frame without content, which must be filled before use.
     *
     * @param format what filling gives: {@link PixelFormat#NV21} or {@link PixelFormat#NV12}
     * @throws NullPointerException when the format is null
     * @throws IllegalArgumentException when the format is another
     */
    public CameraFrame(@NotNull PixelFormat format) {
        Check.frameFormat("format", format);
        this.format = format;
    }

    /**
     * Creates a frame over an array that already is a packed frame. The array is not copied.
     *
     * @param data {@code width * height * 3 / 2} bytes
     * @param format {@link PixelFormat#NV21} or {@link PixelFormat#NV12}
     * @param width width in pixels, even
     * @param height height in pixels, even
     * @param rotationDegrees by how much the frame must be turned clockwise to be upright: 0, 90, 180 or 270
     * @return the frame
     * @throws NullPointerException when the data or the format is null
     * @throws IllegalArgumentException when anything does not fit
     */
    public static @NotNull CameraFrame of(
            byte @NotNull [] data, @NotNull PixelFormat format, int width, int height, int rotationDegrees) {
        CameraFrame frame = new CameraFrame(format);
        Check.packedImage("data", data, format, width, height);
        Check.rotation("rotationDegrees", rotationDegrees);
        frame.set(data, width, height, rotationDegrees);
        return frame;
    }

    /**
     * Fills a new NV21 frame from the planes of a YUV_420_888 image; see {@link #fill}.
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
     * @throws NullPointerException when a plane is null
     * @throws IllegalArgumentException when anything does not fit, or {@code reuse} is the memory of a plane
     */
    public static @NotNull CameraFrame fromPlanes(
            int width, int height, @NotNull ByteBuffer y, int yRowStride, @NotNull ByteBuffer u, int uRowStride,
            int uPixelStride, @NotNull ByteBuffer v, int vRowStride, int vPixelStride, int rotationDegrees,
            byte @Nullable [] reuse) {
        CameraFrame frame = new CameraFrame();
        if (reuse != null) {
            Check.packedImage("reuse", reuse, PixelFormat.NV21, width, height);
            frame.data = reuse;
        }
        frame.fill(width, height, y, yRowStride, u, uRowStride, uPixelStride, v, vRowStride, vPixelStride,
                rotationDegrees);
        return frame;
    }

    /**
     * Fills this frame from planes as Camera2 and CameraX deliver them, in one pass.
     *
     * @param planes the planes, which no other thread may write meanwhile
     * @param newRotationDegrees by how much the frame must be turned clockwise to be upright: 0, 90, 180 or 270
     * @throws NullPointerException when the planes are null
     * @throws IllegalArgumentException when the rotation does not fit, the planes no longer fit their size, or the
     *     frame's array is the memory of a plane; the frame is as it was then
     * @throws IllegalStateException when no planes were set
     */
    public void fill(@NotNull YuvPlanes planes, int newRotationDegrees) {
        Check.notNull("planes", planes);
        Check.rotation("rotationDegrees", newRotationDegrees);
        int[] picture = planes.described();
        int newWidth = planes.width();
        int newHeight = planes.height();
        synchronized (lock) {
            byte[] out = arrayFor(newWidth, newHeight);
            pack(planes.yMemory(), planes.uMemory(), planes.vMemory(), picture, newWidth, newHeight, 0, format, out);
            set(out, newWidth, newHeight, newRotationDegrees);
        }
    }

    /**
     * Returns this frame turned upright: the same picture, to be turned by 0. What was found in the one is where
     * {@link FrameTransform#map} says in the other.
     *
     * @param reuse the frame to fill, which keeps its own order of chroma, or null for a new one like this; not this
     * @return the upright frame
     * @throws IllegalArgumentException when {@code reuse} is this frame, or a frame over the same array; it is as it
     *     was then
     * @throws IllegalStateException when the frame was never filled
     */
    public @NotNull CameraFrame upright(@Nullable CameraFrame reuse) {
        if (reuse == this) {
            throw new IllegalArgumentException("reuse must not be the frame itself");
        }
        CameraFrame out = reuse == null ? new CameraFrame(format) : reuse;
        synchronized (number < out.number ? lock : out.lock) {
            synchronized (number < out.number ? out.lock : lock) {
                int[] picture = described();
                boolean sideways = rotationDegrees == 90 || rotationDegrees == 270;
                int newWidth = sideways ? height : width;
                int newHeight = sideways ? width : height;
                byte[] array = out.arrayFor(newWidth, newHeight);
                pack(data, data, data, picture, width, height, rotationDegrees, out.format, array);
                out.set(array, newWidth, newHeight, 0);
            }
        }
        return out;
    }

    private byte[] arrayFor(int newWidth, int newHeight) {
        int bytes = Check.packedBytes(format, newWidth, newHeight);
        return data.length == bytes ? data : new byte[bytes];
    }

    /** Packs a whole picture of {@code width} x {@code height}, turned. */
    private static void pack(Object y, Object u, Object v, int[] picture, int width, int height, int degrees,
            PixelFormat format, byte[] out) {
        PlaneConversion.check(PlaneConversion.toBytes(y, u, v, picture, 0, 0, width, height, degrees, false,
                TransformPass.layoutOf(format), out, 0, degrees == 90 || degrees == 270 ? height : width));
    }

    /** This frame as native code takes it, to be given to it with the array as each plane's memory. Under the lock. */
    int[] described() {
        checkFilled();
        PlaneConversion.describe(numbers, width, height, data.length, format == PixelFormat.NV21);
        return numbers;
    }

    FaceCutter cutter() {
        return cutter;
    }

    /**
     * Fills this frame from the planes of a YUV_420_888 image, as Camera2 and CameraX deliver them.
     *
     * <p>A plane begins at its buffer's position. The last row may end with its last sample, however long the row
     * stride is. Positions are not moved. Planes in direct buffers, as cameras give them, are read where they are;
     * those in arrays too, unless the buffer is read-only: such a plane is copied first.
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
     * @throws NullPointerException when a plane is null; the frame is as it was then
     * @throws IllegalArgumentException when anything does not fit, or the frame's array is the memory of a plane; the
     *     frame is as it was then
     */
    public void fill(
            int newWidth, int newHeight, @NotNull ByteBuffer y, int yRowStride, @NotNull ByteBuffer u, int uRowStride,
            int uPixelStride, @NotNull ByteBuffer v, int vRowStride, int vPixelStride, int newRotationDegrees) {
        int bytes = Check.packedBytes(format, newWidth, newHeight);
        int pairs = newWidth / 2;
        int chromaRows = newHeight / 2;
        Check.plane("y", y, newHeight, newWidth, yRowStride, 1);
        Check.plane("u", u, chromaRows, pairs, uRowStride, uPixelStride);
        Check.plane("v", v, chromaRows, pairs, vRowStride, vPixelStride);
        Check.rotation("rotationDegrees", newRotationDegrees);
        synchronized (lock) {
            byte[] out = data.length == bytes ? data : new byte[bytes];
            ByteBuffer luma = readable("y", y, out);
            ByteBuffer cb = readable("u", u, out);
            ByteBuffer cr = readable("v", v, out);
            PlaneConversion.describe(numbers, newWidth, newHeight, luma, yRowStride, cb, uRowStride, uPixelStride, cr,
                    vRowStride, vPixelStride);
            pack(PlaneConversion.memory(luma), PlaneConversion.memory(cb), PlaneConversion.memory(cr), numbers,
                    newWidth, newHeight, 0, format, out);
            set(out, newWidth, newHeight, newRotationDegrees);
        }
    }

    /**
     * Returns the frame's bytes: not a copy, and refilled by the next {@link #fill} of the same size.
     *
     * @return the array; empty when the frame was never filled
     */
    public byte @NotNull [] data() {
        synchronized (lock) {
            return data;
        }
    }

    /**
     * Returns the order of the chroma pairs.
     *
     * @return {@link PixelFormat#NV21} or {@link PixelFormat#NV12}
     */
    public @NotNull PixelFormat format() {
        return format;
    }

    /**
     * Returns the width.
     *
     * @return pixels; 0 when the frame was never filled
     */
    public int width() {
        synchronized (lock) {
            return width;
        }
    }

    /**
     * Returns the height.
     *
     * @return pixels; 0 when the frame was never filled
     */
    public int height() {
        synchronized (lock) {
            return height;
        }
    }

    /**
     * Returns how the frame is turned.
     *
     * @return by how many degrees it must be turned clockwise to be upright
     */
    public int rotationDegrees() {
        synchronized (lock) {
            return rotationDegrees;
        }
    }

    void checkFilled() {
        if (width == 0) {
            throw new IllegalStateException("the frame was never filled");
        }
    }

    private void set(byte[] newData, int newWidth, int newHeight, int newRotationDegrees) {
        data = newData;
        width = newWidth;
        height = newHeight;
        rotationDegrees = newRotationDegrees;
    }

    /**
     * The plane, which must not change while {@code out} is written: one that says it lies there is refused, and one
     * that does not say where it lies, as read-only views of arrays, is copied.
     */
    private static ByteBuffer readable(String name, ByteBuffer plane, byte[] out) {
        if (!PlaneConversion.isReadable(plane)) {
            byte[] copy = new byte[plane.remaining()];
            plane.duplicate().get(copy);
            return ByteBuffer.wrap(copy);
        }
        if (!plane.isDirect() && plane.array() == out) {
            throw new IllegalArgumentException(name + " must not lie in the array that is filled");
        }
        return plane;
    }
}
