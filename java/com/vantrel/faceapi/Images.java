package com.vantrel.faceapi;

import android.graphics.Bitmap;
import java.nio.ByteBuffer;
import org.jetbrains.annotations.NotNull;
import org.jetbrains.annotations.Nullable;

/**
 * Conversions, crop, rotation and brightness of images in arrays, with every size checked before native code sees it.
 *
 * <p>An output array may be handed in to be reused; it must have exactly the result's size. Images are packed: no
 * padding between rows. All methods may be called from any thread, on arrays that no other thread writes meanwhile.
 */
public final class Images {
    /** What {@link Images#convert} converts between. A 4:2:0 image has an even width and height. */
    public enum Conversion {
        /** NV21 to BGRA, alpha 255. */
        NV21_TO_BGRA(ColorConversion.NV21_TO_BGRA, PixelFormat.NV21, PixelFormat.BGRA),
        /** NV21 to RGBA, alpha 255. */
        NV21_TO_RGBA(ColorConversion.NV21_TO_RGBA, PixelFormat.NV21, PixelFormat.RGBA),
        /** NV21 to BGR. */
        NV21_TO_BGR(ColorConversion.NV21_TO_BGR, PixelFormat.NV21, PixelFormat.BGR),
        /** NV12 to BGRA, alpha 255. */
        NV12_TO_BGRA(ColorConversion.NV12_TO_BGRA, PixelFormat.NV12, PixelFormat.BGRA),
        /** RGBA to NV21. */
        RGBA_TO_NV21(ColorConversion.RGBA_TO_NV21, PixelFormat.RGBA, PixelFormat.NV21),
        /** RGBA to NV12. */
        RGBA_TO_NV12(ColorConversion.RGBA_TO_NV12, PixelFormat.RGBA, PixelFormat.NV12),
        /** BGRA to RGBA, alpha kept. */
        BGRA_TO_RGBA(ColorConversion.BGRA_TO_RGBA, PixelFormat.BGRA, PixelFormat.RGBA),
        /** RGBA to BGRA, alpha kept. */
        RGBA_TO_BGRA(ColorConversion.BGRA_TO_RGBA, PixelFormat.RGBA, PixelFormat.BGRA);

        private final int code;
        private final PixelFormat source;
        private final PixelFormat result;

        Conversion(int code, PixelFormat source, PixelFormat result) {
            this.code = code;
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
     * @param src the source, of exactly the size that its layout takes
     * @param width width in pixels
     * @param height height in pixels
     * @param conversion what to convert
     * @param reuse the array to write, or null for a new one; not {@code src}
     * @return the result
     * @throws IllegalArgumentException when a size does not fit
     */
    public static byte @NotNull [] convert(
            byte @NotNull [] src, int width, int height, @NotNull Conversion conversion, byte @Nullable [] reuse) {
        Check.notNull("conversion", conversion);
        Check.packedImage("src", src, conversion.source, width, height);
        byte[] out = Check.output(reuse, Check.packedBytes(conversion.result, width, height), src);
        FaceLibrary.convertColorSpace(src, width, height, out, conversion.code);
        return out;
    }

    /**
     * Cuts a rectangle out of a camera frame and converts it to RGBA. The rectangle is made even, as 4:2:0 needs it:
     * its left and top edge move to the even position before, its right and bottom edge to the one behind.
     *
     * @param frame the frame, NV21
     * @param x left edge in pixels, in the frame
     * @param y top edge
     * @param w width in pixels, to within the frame
     * @param h height
     * @param reuse the array to write, of {@code evenWidth * evenHeight * 4} bytes, or null for a new one
     * @return the pixels; see {@link #evenLength} for their width and height
     * @throws IllegalArgumentException when the rectangle is not inside the frame or a size does not fit
     * @throws IllegalStateException when the frame was never filled
     */
    public static byte @NotNull [] crop(
            @NotNull CameraFrame frame, int x, int y, int w, int h, byte @Nullable [] reuse) {
        Check.notNull("frame", frame);
        synchronized (frame.lock) {
            frame.checkFilled();
            if (frame.format() != PixelFormat.NV21) {
                throw new IllegalArgumentException("frame must be NV21, not " + frame.format());
            }
            Check.rectangle(x, y, w, h, frame.width(), frame.height());
            int evenW = evenLength(x, w);
            int evenH = evenLength(y, h);
            byte[] out = Check.output(reuse, Check.packedBytes(PixelFormat.RGBA, evenW, evenH), frame.data());
            FaceLibrary.cropNv21Data(
                    frame.data(), frame.width(), frame.height(), x & ~1, y & ~1, evenW, evenH, out);
            return out;
        }
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
     * @throws IllegalArgumentException when a size or the angle does not fit
     */
    public static byte @NotNull [] rotate(
            byte @NotNull [] src, int width, int height, int degrees, byte @Nullable [] reuse) {
        Check.packedImage("src", src, PixelFormat.BGR, width, height);
        if (degrees != 90 && degrees != 180 && degrees != 270) {
            throw Check.refusal("degrees", "90, 180 or 270", degrees);
        }
        byte[] out = Check.output(reuse, src.length, src);
        FaceLibrary.rotateBGR(src, width, height, out, degrees, OUT_SIZE.get());
        return out;
    }

    /** Where native code writes a size that is known already; one array a thread, so that none is made per call. */
    private static final ThreadLocal<int[]> OUT_SIZE = new ThreadLocal<int[]>() {
        @Override
        protected int[] initialValue() {
            return new int[2];
        }
    };

    /**
     * Averages the luma of a rectangle of a camera frame.
     *
     * @param frame the frame
     * @param x left edge in pixels
     * @param y top edge
     * @param w width in pixels, to within the frame
     * @param h height
     * @return 0 (black) to 1 (white)
     * @throws IllegalArgumentException when the rectangle is not inside the frame
     * @throws IllegalStateException when the frame was never filled
     */
    public static float brightness(@NotNull CameraFrame frame, int x, int y, int w, int h) {
        Check.notNull("frame", frame);
        synchronized (frame.lock) {
            frame.checkFilled();
            Check.rectangle(x, y, w, h, frame.width(), frame.height());
            // The native method clips the height by x + h. Given a height that holds both, it clips nothing here.
            int height = Math.max(frame.height(), x + h);
            return FaceLibrary.averageBrightness(frame.data(), frame.width(), height, x, y, w, h);
        }
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
     * @return 0 (black) to 255 (white)
     * @throws IllegalArgumentException when a size, the rectangle or the format does not fit
     */
    public static int lightness(
            byte @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride, int x, int y,
            int w, int h) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, 1);
        Check.rectangle(x, y, w, h, width, height);
        boolean rgba = format == PixelFormat.RGBA;
        if (!rgba && format != PixelFormat.BGRA) {
            throw new IllegalArgumentException("format must be RGBA or BGRA, not " + format);
        }
        return FaceLibrary.faceBrightEvaluate(image,
                rgba ? BrightnessMetric.LIGHTNESS_RGBA : BrightnessMetric.LIGHTNESS_BGRA, width, stride, height, height,
                x, y, w, h);
    }

    /**
     * Copies the pixels of an ARGB_8888 bitmap, whatever its row stride, as BGRA or BGR.
     *
     * @param bitmap the bitmap
     * @param format {@link PixelFormat#BGRA} or {@link PixelFormat#BGR}
     * @param reuse the array to write, or null for a new one
     * @return the pixels
     * @throws IllegalArgumentException when the bitmap is recycled or of another configuration, or a size or the
     *     format does not fit
     */
    public static byte @NotNull [] pixels(
            @NotNull Bitmap bitmap, @NotNull PixelFormat format, byte @Nullable [] reuse) {
        Check.notNull("bitmap", bitmap);
        Check.notNull("format", format);
        boolean bgra = format == PixelFormat.BGRA;
        if (!bgra && format != PixelFormat.BGR) {
            throw new IllegalArgumentException("format must be BGRA or BGR, not " + format);
        }
        if (bitmap.isRecycled()) {
            throw new IllegalArgumentException("bitmap is recycled");
        }
        if (bitmap.getConfig() != Bitmap.Config.ARGB_8888) {
            throw new IllegalArgumentException("bitmap must be ARGB_8888, not " + bitmap.getConfig());
        }
        int width = bitmap.getWidth();
        int height = bitmap.getHeight();
        int rowBytes = Check.packedBytes(PixelFormat.RGBA, width, 1);
        byte[] out = Check.output(reuse, Check.packedBytes(format, width, height), null);
        if (bitmap.getRowBytes() != rowBytes) {
            // The native methods take rows as packed; this one is not, so its rows are moved together first.
            stridedPixels(bitmap, bgra ? 4 : 3, out);
        } else if (bgra) {
            FaceLibrary.getBGRADataFromBitmap(bitmap, out);
        } else {
            FaceLibrary.getBGRDataFromBitmap(bitmap, out);
        }
        return out;
    }

    private static void stridedPixels(Bitmap bitmap, int bytesPerPixel, byte[] out) {
        int stride = bitmap.getRowBytes();
        byte[] rgba = new byte[Math.multiplyExact(stride, bitmap.getHeight())];
        bitmap.copyPixelsToBuffer(ByteBuffer.wrap(rgba));
        int to = 0;
        for (int row = 0; row < bitmap.getHeight(); row++) {
            int from = row * stride;
            for (int end = from + bitmap.getWidth() * 4; from < end; from += 4) {
                out[to] = rgba[from + 2];
                out[to + 1] = rgba[from + 1];
                out[to + 2] = rgba[from];
                if (bytesPerPixel == 4) {
                    out[to + 3] = rgba[from + 3];
                }
                to += bytesPerPixel;
            }
        }
    }
}
