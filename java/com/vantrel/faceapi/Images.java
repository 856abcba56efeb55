// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import org.jetbrains.annotations.NotNull;
import org.jetbrains.annotations.Nullable;

/**
 * Conversions, crop, rotation and brightness of images in arrays, with every size checked before native code sees it.
 *
 * <p>An output array may be handed in to be reused; it must have exactly the result's size. Images are packed: no
 * padding between rows. All methods may be called from any thread, on arrays that no other thread writes meanwhile.
 * Nothing is written to Android's log, whatever {@link FaceLibrary#setDebug} says.
 */
public final class Images {
    /** What {@link Images#convert} converts between. A 4:2:0 image has an even width and height. */
    public enum Conversion {
        /** NV21 to BGRA, alpha 255. */
        NV21_TO_BGRA(PixelFormat.NV21, PixelFormat.BGRA),
        /** NV21 to RGBA, alpha 255. */
        NV21_TO_RGBA(PixelFormat.NV21, PixelFormat.RGBA),
        /** NV21 to BGR. */
        NV21_TO_BGR(PixelFormat.NV21, PixelFormat.BGR),
        /** NV12 to BGRA, alpha 255. */
        NV12_TO_BGRA(PixelFormat.NV12, PixelFormat.BGRA),
        /** NV12 to RGBA, alpha 255. */
        NV12_TO_RGBA(PixelFormat.NV12, PixelFormat.RGBA),
        /** NV12 to BGR. */
        NV12_TO_BGR(PixelFormat.NV12, PixelFormat.BGR),
        /** RGBA to NV21. */
        RGBA_TO_NV21(PixelFormat.RGBA, PixelFormat.NV21),
        /** RGBA to NV12. */
        RGBA_TO_NV12(PixelFormat.RGBA, PixelFormat.NV12),
        /** BGRA to RGBA, alpha kept. */
        BGRA_TO_RGBA(PixelFormat.BGRA, PixelFormat.RGBA),
        /** RGBA to BGRA, alpha kept. */
        RGBA_TO_BGRA(PixelFormat.RGBA, PixelFormat.BGRA);

        private final PixelFormat source;
        private final PixelFormat result;

        Conversion(PixelFormat source, PixelFormat result) {
            this.source = source;
            this.result = result;
        }

        /**
         * Returns what is converted.
         *
         * @return the source's layout
         */
        public @NotNull PixelFormat source() {
            return source;
        }

        /**
         * Returns what comes of it.
         *
         * @return the result's layout
         */
        public @NotNull PixelFormat result() {
            return result;
        }
    }

    private Images() {}

    /**
     * Converts an image.
     *
     * <p>The colours of a 4:2:0 image are those of full-range YUV with a matrix of this library's own, near to
     * BT.601's. With Y from 0 to 255 and U and V less 128:
     *
     * <pre>
     * R = (64 Y        + 86 V + 32) &gt;&gt; 6            Y = (38 R + 74 G + 16 B + 64) &gt;&gt; 7
     * G = (64 Y - 24 U - 44 V + 32) &gt;&gt; 6            U = (-22 R - 43 G + 65 B + 64) &gt;&gt; 7
     * B = (64 Y + 110 U       + 32) &gt;&gt; 6            V = (67 R - 55 G - 12 B + 64) &gt;&gt; 7
     * </pre>
     *
     * <p>clamped to 0 to 255. Towards pixels each pair of U and V serves 2 x 2 pixels as it is; towards frames it is
     * that of their upper left pixel.
     *
     * @param src the source, of exactly the size that its layout takes
     * @param width width in pixels
     * @param height height in pixels
     * @param conversion what to convert
     * @param reuse the array to write, or null for a new one; not {@code src}
     * @return the result
     * @throws NullPointerException when the source or the conversion is null
     * @throws IllegalArgumentException when a size does not fit
     */
    public static byte @NotNull [] convert(
            byte @NotNull [] src, int width, int height, @NotNull Conversion conversion, byte @Nullable [] reuse) {
        Check.notNull("conversion", conversion);
        Check.packedImage("src", src, conversion.source, width, height);
        byte[] out = Check.output(reuse, Check.packedBytes(conversion.result, width, height), src);
        if (conversion.source.isSemiPlanar()) {
            frameToPixels(src, conversion.source, width, height, 0, 0, width, height, conversion.result, out);
        } else {
            PixelConversion.check(PixelConversion.convert(src, width, height, out, pixelConversion(conversion)));
        }
        return out;
    }

    private static int pixelConversion(Conversion conversion) {
        switch (conversion.result) {
            case NV21: return PixelConversion.RGBA_TO_NV21;
            case NV12: return PixelConversion.RGBA_TO_NV12;
            default: return PixelConversion.SWAP_RED_AND_BLUE;
        }
    }

    /** What native code is told of a frame; one array a thread, so that none is made per call. */
    private static final ThreadLocal<int[]> PICTURE = new ThreadLocal<int[]>() {
        @Override
        protected int[] initialValue() {
            return new int[PlaneConversion.NUMBERS];
        }
    };

    /** A rectangle of a packed frame as packed pixels; all sizes were checked. */
    private static void frameToPixels(
            byte[] frame, PixelFormat format, int width, int height, int x, int y, int w, int h, PixelFormat result,
            byte[] out) {
        int[] picture = PICTURE.get();
        PlaneConversion.describe(picture, width, height, frame.length, format == PixelFormat.NV21);
        PlaneConversion.check(PlaneConversion.toBytes(frame, frame, frame, picture, x, y, w, h, 0, false,
                TransformPass.layoutOf(result), out, 0, (int) result.rowBytes(evenLength(x, w))));
    }

    /**
     * Cuts a rectangle out of a camera frame and converts it to RGBA. The rectangle is made even, as 4:2:0 needs it:
     * its left and top edge move to the even position before, its right and bottom edge to the one behind.
     *
     * @param frame the frame, NV21 or NV12
     * @param x left edge in pixels, in the frame
     * @param y top edge
     * @param w width in pixels, to within the frame
     * @param h height
     * @param reuse the array to write, of {@code evenWidth * evenHeight * 4} bytes, or null for a new one
     * @return the pixels; see {@link #evenLength} for their width and height
     * @throws NullPointerException when the frame is null
     * @throws IllegalArgumentException when the rectangle is not inside the frame or a size does not fit
     * @throws IllegalStateException when the frame was never filled
     */
    public static byte @NotNull [] crop(
            @NotNull CameraFrame frame, int x, int y, int w, int h, byte @Nullable [] reuse) {
        Check.notNull("frame", frame);
        synchronized (frame.lock) {
            frame.checkFilled();
            Check.rectangle(x, y, w, h, frame.width(), frame.height());
            int evenW = evenLength(x, w);
            int evenH = evenLength(y, h);
            byte[] out = Check.output(reuse, Check.packedBytes(PixelFormat.RGBA, evenW, evenH), frame.data());
            frameToPixels(frame.data(), frame.format(), frame.width(), frame.height(), x, y, w, h, PixelFormat.RGBA,
                    out);
            return out;
        }
    }

    /**
     * Cuts a rectangle out of a camera frame; see {@link #crop(CameraFrame, int, int, int, int, byte[])}.
     *
     * @param frame the frame
     * @param rect the rectangle, within the frame
     * @param reuse the array to write, of {@code evenWidth * evenHeight * 4} bytes, or null for a new one
     * @return the pixels, RGBA
     * @throws NullPointerException when the frame or the rectangle is null
     * @throws IllegalArgumentException when the rectangle is empty or not inside the frame, or a size does not fit
     * @throws IllegalStateException when the frame was never filled
     */
    public static byte @NotNull [] crop(@NotNull CameraFrame frame, @NotNull Rect rect, byte @Nullable [] reuse) {
        Check.edges("rect", rect);
        return crop(frame, rect.left, rect.top, rect.right - rect.left, rect.bottom - rect.top, reuse);
    }

    /**
     * Returns the length of a side of a rectangle once {@link #crop} has made it even.
     *
     * @param start where the side starts, not negative
     * @param length its length, above 0
     * @return the even length, that of {@code length} or up to two more
     * @throws IllegalArgumentException when one is out of its range, or the even end beyond that of an int
     */
    public static int evenLength(int start, int length) {
        Check.range("start", start, 0, Integer.MAX_VALUE);
        Check.positive("length", length);
        Check.range("start + length", (long) start + length, 1, Integer.MAX_VALUE - 1);
        return (start & 1) + length + ((start + length) & 1);
    }

    /**
     * Rotates a BGR or RGB image clockwise.
     *
     * @param src the source, {@code width * height * 3} bytes
     * @param width width in pixels
     * @param height height in pixels
     * @param degrees 90, 180 or 270
     * @param reuse the array to write, or null for a new one; not {@code src}
     * @return the result; with 90 and 270 its width is {@code height} and its height {@code width}
     * @throws NullPointerException when the source is null
     * @throws IllegalArgumentException when a size or the angle does not fit
     */
    public static byte @NotNull [] rotate(
            byte @NotNull [] src, int width, int height, int degrees, byte @Nullable [] reuse) {
        return rotate(src, PixelFormat.BGR, width, height, degrees, reuse);
    }

    /**
     * Rotates an image of any packed layout clockwise. A camera frame is turned by {@link CameraFrame#upright}.
     *
     * @param src the source, of exactly the size that its layout takes
     * @param format its layout: gray, three or four bytes a pixel
     * @param width width in pixels
     * @param height height in pixels
     * @param degrees 90, 180 or 270
     * @param reuse the array to write, or null for a new one; not {@code src}
     * @return the result; with 90 and 270 its width is {@code height} and its height {@code width}
     * @throws NullPointerException when the source or the format is null
     * @throws IllegalArgumentException when a size, the format or the angle does not fit
     */
    public static byte @NotNull [] rotate(
            byte @NotNull [] src, @NotNull PixelFormat format, int width, int height, int degrees,
            byte @Nullable [] reuse) {
        Check.packedImage("src", src, Check.notNull("format", format), width, height);
        if (format.isSemiPlanar()) {
            throw Check.refusal("format", "gray or of three or four bytes a pixel", format);
        }
        if (degrees != 90 && degrees != 180 && degrees != 270) {
            throw Check.refusal("degrees", "90, 180 or 270", degrees);
        }
        byte[] out = Check.output(reuse, src.length, src);
        PixelConversion.check(PixelConversion.rotate(src, width, height, format.bytesPerPixel(), degrees, out));
        return out;
    }

    /**
     * Averages the luma of a rectangle of a camera frame.
     *
     * @param frame the frame
     * @param x left edge in pixels
     * @param y top edge
     * @param w width in pixels, to within the frame
     * @param h height
     * @return 0 (black) to 1 (white), of frames of any size
     * @throws NullPointerException when the frame is null
     * @throws IllegalArgumentException when the rectangle is not inside the frame
     * @throws IllegalStateException when the frame was never filled
     */
    public static float brightness(@NotNull CameraFrame frame, int x, int y, int w, int h) {
        Check.notNull("frame", frame);
        synchronized (frame.lock) {
            frame.checkFilled();
            Check.rectangle(x, y, w, h, frame.width(), frame.height());
            long sum = PixelConversion.check(PixelConversion.sumBytes(frame.data(), frame.width(), x, y, w, h));
            return (float) sum / (float) ((long) w * h * 255);
        }
    }

    /**
     * Averages the luma of a rectangle of a camera frame.
     *
     * @param frame the frame
     * @param rect the rectangle, within the frame
     * @return 0 (black) to 1 (white)
     * @throws NullPointerException when the frame or the rectangle is null
     * @throws IllegalArgumentException when the rectangle is empty or not inside the frame
     * @throws IllegalStateException when the frame was never filled
     */
    public static float brightness(@NotNull CameraFrame frame, @NotNull Rect rect) {
        Check.edges("rect", rect);
        return brightness(frame, rect.left, rect.top, rect.right - rect.left, rect.bottom - rect.top);
    }

    /**
     * Averages the lightness, L* of CIE Lab, of a rectangle of an RGBA or BGRA image.
     *
     * @param image the pixels
     * @param format {@link PixelFormat#RGBA} or {@link PixelFormat#BGRA}
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param rect the rectangle, within the image
     * @return 0 (black) to 255 (white)
     * @throws NullPointerException when the image, the format or the rectangle is null
     * @throws IllegalArgumentException when a size, the rectangle or the format does not fit
     */
    public static int lightness(
            byte @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride,
            @NotNull Rect rect) {
        Check.edges("rect", rect);
        return lightness(image, format, width, height, stride, rect.left, rect.top, rect.right - rect.left,
                rect.bottom - rect.top);
    }

    /**
     * Averages the lightness, L* of CIE Lab, of a rectangle of an RGBA or BGRA image.
     *
     * @param image the pixels
     * @param format {@link PixelFormat#RGBA} or {@link PixelFormat#BGRA}
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param x left edge of the rectangle in pixels
     * @param y top edge
     * @param w width in pixels, to within the image
     * @param h height
     * @return 0 (black) to 255 (white), the rounded mean, of images of any size
     * @throws NullPointerException when the image or the format is null
     * @throws IllegalArgumentException when a size, the rectangle or the format does not fit
     */
    public static int lightness(
            byte @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride, int x, int y,
            int w, int h) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, 1);
        Check.rectangle(x, y, w, h, width, height);
        if (format != PixelFormat.RGBA && format != PixelFormat.BGRA) {
            throw Check.refusal("format", "RGBA or BGRA", format);
        }
        boolean rgba = format == PixelFormat.RGBA;
        long sum = PixelConversion.check(PixelConversion.sumLightness(image, stride, rgba, x, y, w, h));
        long area = (long) w * h;
        return (int) ((sum + area / 2) / area);
    }

    /**
     * Copies the pixels of an ARGB_8888 bitmap, whatever its row stride, as BGRA or BGR.
     *
     * @param bitmap the bitmap
     * @param format {@link PixelFormat#BGRA} or {@link PixelFormat#BGR}
     * @param reuse the array to write, or null for a new one
     * @return the pixels
     * @throws NullPointerException when the bitmap or the format is null
     * @throws IllegalArgumentException when the bitmap is recycled, before or meanwhile, or of another configuration,
     *     or a size or the format does not fit; nothing was written then
     */
    public static byte @NotNull [] pixels(
            @NotNull Bitmap bitmap, @NotNull PixelFormat format, byte @Nullable [] reuse) {
        Check.notNull("bitmap", bitmap);
        Check.notNull("format", format);
        if (format != PixelFormat.BGRA && format != PixelFormat.BGR) {
            throw Check.refusal("format", "BGRA or BGR", format);
        }
        if (bitmap.isRecycled()) {
            throw new IllegalArgumentException("bitmap is recycled");
        }
        if (bitmap.getConfig() != Bitmap.Config.ARGB_8888) {
            throw Check.refusal("bitmap", "ARGB_8888", bitmap.getConfig());
        }
        int width = bitmap.getWidth();
        int height = bitmap.getHeight();
        byte[] out = Check.output(reuse, Check.packedBytes(format, width, height), null);
        PixelConversion.check(PixelConversion.read(bitmap, width, height, format.bytesPerPixel(), out));
        return out;
    }

    /**
     * Makes a bitmap of a camera's planes in one pass: the part, turned and mirrored as the transform says, opaque.
     *
     * @param planes the planes, of the size of the transform's frame; no other thread may write them meanwhile
     * @param transform what becomes of them; a view that it has is not looked at, since views scale what they show
     * @param reuse the bitmap to write, ARGB_8888 and mutable, of exactly {@link FrameTransform#resultWidth} x
     *     {@link FrameTransform#resultHeight} pixels, or null for a new one
     * @return the bitmap
     * @throws NullPointerException when the planes or the transform is null
     * @throws IllegalArgumentException when the transform is made for another size, the planes no longer fit theirs, or
     *     the bitmap does not fit; nothing is written then
     * @throws IllegalStateException when no planes were set
     */
    public static @NotNull Bitmap toBitmap(
            @NotNull YuvPlanes planes, @NotNull FrameTransform transform, @Nullable Bitmap reuse) {
        int[] picture = described(planes, transform);
        return TransformPass.toBitmap(
                planes.yMemory(), planes.uMemory(), planes.vMemory(), picture, transform, reuse);
    }

    /**
     * Makes a bitmap of a camera frame in one pass: the part, turned and mirrored as the transform says, opaque.
     *
     * @param frame the frame, of the size of the transform's; the transform's rotation counts, not the frame's
     * @param transform what becomes of it; a view that it has is not looked at, since views scale what they show
     * @param reuse the bitmap to write, ARGB_8888 and mutable, of exactly {@link FrameTransform#resultWidth} x
     *     {@link FrameTransform#resultHeight} pixels, or null for a new one
     * @return the bitmap
     * @throws NullPointerException when the frame or the transform is null
     * @throws IllegalArgumentException when the transform is made for another size or the bitmap does not fit; nothing
     *     is written then
     * @throws IllegalStateException when the frame was never filled
     */
    public static @NotNull Bitmap toBitmap(
            @NotNull CameraFrame frame, @NotNull FrameTransform transform, @Nullable Bitmap reuse) {
        Check.notNull("frame", frame);
        synchronized (frame.lock) {
            int[] picture = described(frame, transform);
            byte[] data = frame.data();
            return TransformPass.toBitmap(data, data, data, picture, transform, reuse);
        }
    }

    /**
     * Makes packed pixels of a camera's planes in one pass: the part, turned and mirrored as the transform says.
     *
     * @param planes the planes, of the size of the transform's frame; no other thread may write them meanwhile
     * @param transform what becomes of them; a view that it has is not looked at
     * @param format the result's layout, any; alpha is 255
     * @param reuse the array to write, of exactly the result's size, or null for a new one; not the memory of a plane
     * @return {@link FrameTransform#resultWidth} x {@link FrameTransform#resultHeight} pixels
     * @throws NullPointerException when the planes, the transform or the format is null
     * @throws IllegalArgumentException when the transform is made for another size, the planes no longer fit theirs, or
     *     the array does not fit; nothing is written then
     * @throws IllegalStateException when no planes were set
     */
    public static byte @NotNull [] toPixels(
            @NotNull YuvPlanes planes, @NotNull FrameTransform transform, @NotNull PixelFormat format,
            byte @Nullable [] reuse) {
        int[] picture = described(planes, transform);
        return TransformPass.toPixels(
                planes.yMemory(), planes.uMemory(), planes.vMemory(), picture, transform, format, reuse);
    }

    /**
     * Makes packed pixels of a camera frame in one pass: the part, turned and mirrored as the transform says.
     *
     * @param frame the frame, of the size of the transform's; the transform's rotation counts, not the frame's
     * @param transform what becomes of it; a view that it has is not looked at
     * @param format the result's layout, any; alpha is 255
     * @param reuse the array to write, of exactly the result's size, or null for a new one; not the frame's own
     * @return {@link FrameTransform#resultWidth} x {@link FrameTransform#resultHeight} pixels
     * @throws NullPointerException when the frame, the transform or the format is null
     * @throws IllegalArgumentException when the transform is made for another size or the array does not fit; nothing
     *     is written then
     * @throws IllegalStateException when the frame was never filled
     */
    public static byte @NotNull [] toPixels(
            @NotNull CameraFrame frame, @NotNull FrameTransform transform, @NotNull PixelFormat format,
            byte @Nullable [] reuse) {
        Check.notNull("frame", frame);
        synchronized (frame.lock) {
            int[] picture = described(frame, transform);
            byte[] data = frame.data();
            return TransformPass.toPixels(data, data, data, picture, transform, format, reuse);
        }
    }

    private static int[] described(YuvPlanes planes, FrameTransform transform) {
        Check.notNull("planes", planes);
        Check.notNull("transform", transform);
        int[] picture = planes.described();
        transform.checkFrame(planes.width(), planes.height());
        return picture;
    }

    private static int[] described(CameraFrame frame, FrameTransform transform) {
        Check.notNull("transform", transform);
        int[] picture = frame.described();
        transform.checkFrame(frame.width(), frame.height());
        return picture;
    }

    /**
     * Cuts a face out of a camera's planes: a square around it, upright and brought to one size, to be shown or to be
     * compared with others.
     *
     * <p>Where the face has eyes (68 points in the usual order, or five, and their distance), they lie level, at 36 %
     * of the height, 36 % of the width apart and centred. Otherwise the square is the rectangle's longer side and a
     * quarter more, about its middle, turned as the frame is and by the face's roll. What lies beyond the picture is
     * black. Nothing is mirrored.
     *
     * @param planes the planes; no other thread may write them meanwhile
     * @param rotationDegrees by how much the planes must be turned clockwise to be upright: 0, 90, 180 or 270
     * @param face the face, in the coordinates of the planes as they are
     * @param size width and height of the result in pixels
     * @param reuse the bitmap to write, ARGB_8888 and mutable, of exactly {@code size} x {@code size} pixels, or null
     *     for a new one
     * @return the face
     * @throws NullPointerException when the planes or the face is null, or a face without eyes has no rectangle
     * @throws IllegalArgumentException when the rotation, the size or the bitmap does not fit, the planes no longer fit
     *     their size, or the rectangle of a face without eyes is empty; nothing is written then
     * @throws IllegalStateException when no planes were set
     */
    public static @NotNull Bitmap face(
            @NotNull YuvPlanes planes, int rotationDegrees, @NotNull FaceInfo face, int size, @Nullable Bitmap reuse) {
        Check.notNull("planes", planes);
        int[] picture = planes.described();
        return planes.cutter().cut(planes.yMemory(), planes.uMemory(), planes.vMemory(), picture, planes.width(),
                planes.height(), rotationDegrees, face, size, reuse);
    }

    /**
     * Cuts a face out of a camera frame: a square around it, upright and brought to one size; see
     * {@link #face(YuvPlanes, int, FaceInfo, int, Bitmap)}.
     *
     * @param frame the frame; its rotation says how it is turned
     * @param face the face, in the frame's coordinates
     * @param size width and height of the result in pixels
     * @param reuse the bitmap to write, ARGB_8888 and mutable, of exactly {@code size} x {@code size} pixels, or null
     *     for a new one
     * @return the face
     * @throws NullPointerException when the frame or the face is null, or a face without eyes has no rectangle
     * @throws IllegalArgumentException when the size or the bitmap does not fit, or the rectangle of a face without
     *     eyes is empty; nothing is written then
     * @throws IllegalStateException when the frame was never filled
     */
    public static @NotNull Bitmap face(
            @NotNull CameraFrame frame, @NotNull FaceInfo face, int size, @Nullable Bitmap reuse) {
        Check.notNull("frame", frame);
        synchronized (frame.lock) {
            int[] picture = frame.described();
            byte[] data = frame.data();
            return frame.cutter().cut(data, data, data, picture, frame.width(), frame.height(), frame.rotationDegrees(),
                    face, size, reuse);
        }
    }
}
