// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package android.graphics;

import java.nio.Buffer;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;

/**
 * Stand-in for Android's bitmap, for desktops: pixels in memory that native code can lock.
 *
 * <p>Native code reads the fields {@code width}, {@code height}, {@code rowBytes} and {@code nativeFormat} and calls
 * {@link #lockPixels} and {@link #unlockPixels} by name.
 */
public final class Bitmap {
    /** The pixel formats that the stand-in knows, with Android's native numbers. */
    public enum Config {
        /** 16 bits a pixel: red in the high five, green in the middle six, blue in the low five. */
        RGB_565(4, 2),
        /** Four bytes a pixel: red, green, blue, alpha. */
        ARGB_8888(1, 4);

        final int nativeFormat;
        final int bytesPerPixel;

        Config(int nativeFormat, int bytesPerPixel) {
            this.nativeFormat = nativeFormat;
            this.bytesPerPixel = bytesPerPixel;
        }
    }

    private final Config config;
    private final int width;
    private final int height;
    private final int rowBytes;
    private final int nativeFormat;
    private boolean mutable = true;
    private ByteBuffer pixels; // null once recycled
    private int locks;

    private Bitmap(int width, int height, Config config, int rowBytes) {
        if (width <= 0 || height <= 0) {
            throw new IllegalArgumentException("width and height must be > 0");
        }
        if (rowBytes < width * config.bytesPerPixel) {
            throw new IllegalArgumentException("a row of " + rowBytes + " bytes does not hold " + width + " pixels");
        }
        this.config = config;
        this.width = width;
        this.height = height;
        this.rowBytes = rowBytes;
        this.nativeFormat = config.nativeFormat;
        this.pixels = ByteBuffer.allocateDirect(rowBytes * height).order(ByteOrder.nativeOrder());
    }

    /** Creates a transparent (or black, without alpha) bitmap with tight rows. */
    public static Bitmap createBitmap(int width, int height, Config config) {
        return new Bitmap(width, height, config, width * config.bytesPerPixel);
    }

    /** Creates an immutable bitmap of 0xAARRGGBB values. */
    public static Bitmap createBitmap(int[] colors, int width, int height, Config config) {
        Bitmap bitmap = createBitmap(width, height, config);
        bitmap.setPixels(colors, 0, width, 0, 0, width, height);
        bitmap.mutable = false;
        return bitmap;
    }

    /**
     * Creates a bitmap whose rows lie {@code rowBytes} apart, as a device's graphics memory may have them. Android
     * has no such method: there the system chooses.
     */
    public static Bitmap createBitmap(int width, int height, Config config, int rowBytes) {
        return new Bitmap(width, height, config, rowBytes);
    }

    public int getWidth() {
        return width;
    }

    public int getHeight() {
        return height;
    }

    /** Copies the pixels to a bitmap of its own, here of the same configuration only. */
    public Bitmap copy(Config newConfig, boolean isMutable) {
        if (newConfig != config) {
            throw new IllegalArgumentException("the stand-in copies to the same configuration only");
        }
        Bitmap copy = new Bitmap(width, height, config, rowBytes);
        copyPixelsToBuffer(copy.pixels);
        copy.pixels.clear();
        copy.mutable = isMutable;
        return copy;
    }

    /** Whether pixels can be set; as on Android also true once there are none. */
    public boolean isMutable() {
        return mutable || pixels == null;
    }

    /** Bytes from one row to the next. */
    public int getRowBytes() {
        return rowBytes;
    }

    public Config getConfig() {
        return config;
    }

    /** Bytes of all rows. */
    public int getByteCount() {
        return rowBytes * height;
    }

    /**
     * Sets one pixel from a 0xAARRGGBB value. Colours are kept multiplied by alpha; a 16-bit bitmap keeps the high bits
     * of each, and no alpha.
     */
    public void setPixel(int x, int y, int color) {
        checkAlive();
        checkMutable();
        set(offset(x, y), color);
    }

    /** Reads one pixel as a 0xAARRGGBB value, colours divided by alpha again. */
    public int getPixel(int x, int y) {
        checkAlive();
        return get(offset(x, y));
    }

    /** Sets a rectangle from 0xAARRGGBB values, whose rows lie {@code stride} apart from {@code offset} on. */
    public void setPixels(int[] colors, int offset, int stride, int x, int y, int w, int h) {
        checkAlive();
        checkMutable();
        if (w == 0 || h == 0) {
            return;
        }
        checkPixels(colors.length, offset, stride, x, y, w, h);
        for (int row = 0; row < h; row++) {
            for (int column = 0; column < w; column++) {
                set(offset(x + column, y + row), colors[offset + row * stride + column]);
            }
        }
    }

    /** Reads a rectangle as 0xAARRGGBB values, whose rows lie {@code stride} apart from {@code offset} on. */
    public void getPixels(int[] colors, int offset, int stride, int x, int y, int w, int h) {
        checkAlive();
        if (w == 0 || h == 0) {
            return;
        }
        checkPixels(colors.length, offset, stride, x, y, w, h);
        for (int row = 0; row < h; row++) {
            for (int column = 0; column < w; column++) {
                colors[offset + row * stride + column] = get(offset(x + column, y + row));
            }
        }
    }

    /** Sets all pixels to a 0xAARRGGBB value. */
    public void eraseColor(int color) {
        checkAlive();
        checkMutable();
        for (int y = 0; y < height; y++) {
            for (int x = 0; x < width; x++) {
                set(offset(x, y), color);
            }
        }
    }

    /** Copies all rows, as they lie in memory, to the buffer's position and moves that behind them. */
    public void copyPixelsToBuffer(Buffer dst) {
        checkAlive();
        ByteBuffer to = bytes(dst);
        pixels.clear();
        to.put(pixels);
    }

    /** Takes all rows, as they lie in memory, from the buffer's position and moves that behind them. */
    public void copyPixelsFromBuffer(Buffer src) {
        checkAlive();
        ByteBuffer from = bytes(src);
        ByteBuffer rows = from.duplicate();
        rows.limit(rows.position() + pixels.capacity());
        pixels.clear();
        pixels.put(rows);
        from.position(rows.limit());
    }

    private ByteBuffer bytes(Buffer buffer) {
        if (!(buffer instanceof ByteBuffer)) {
            throw new RuntimeException("the stand-in copies from and to byte buffers only");
        }
        if (buffer.remaining() < pixels.capacity()) {
            throw new RuntimeException("the buffer is not large enough for the pixels");
        }
        return (ByteBuffer) buffer;
    }

    /** Gives the pixels up; the bitmap cannot be used afterwards. */
    public synchronized void recycle() {
        if (locks > 0) {
            throw new IllegalStateException("the pixels are locked");
        }
        pixels = null;
    }

    public synchronized boolean isRecycled() {
        return pixels == null;
    }

    /** How many locks native code holds. Android does not tell; tests want to know. */
    public synchronized int getLockCount() {
        return locks;
    }

    /** Called by native code. */
    private synchronized ByteBuffer lockPixels() {
        if (pixels != null) {
            locks++;
        }
        return pixels;
    }

    /** Called by native code. */
    private synchronized void unlockPixels() {
        if (locks == 0) {
            throw new IllegalStateException("the pixels are not locked");
        }
        locks--;
    }

    private void set(int at, int color) {
        int alpha = color >>> 24;
        int red = times(color >> 16 & 0xFF, alpha);
        int green = times(color >> 8 & 0xFF, alpha);
        int blue = times(color & 0xFF, alpha);
        if (config == Config.RGB_565) {
            pixels.putShort(at, (short) (red >> 3 << 11 | green >> 2 << 5 | blue >> 3));
        } else {
            pixels.put(at, (byte) red);
            pixels.put(at + 1, (byte) green);
            pixels.put(at + 2, (byte) blue);
            pixels.put(at + 3, (byte) alpha);
        }
    }

    private int get(int at) {
        if (config == Config.RGB_565) {
            int word = pixels.getShort(at);
            int red = word >> 11 & 0x1F;
            int green = word >> 5 & 0x3F;
            int blue = word & 0x1F;
            return 0xFF000000 | (red << 3 | red >> 2) << 16 | (green << 2 | green >> 4) << 8 | (blue << 3 | blue >> 2);
        }
        int alpha = pixels.get(at + 3) & 0xFF;
        return alpha << 24 | over(pixels.get(at) & 0xFF, alpha) << 16 | over(pixels.get(at + 1) & 0xFF, alpha) << 8
                | over(pixels.get(at + 2) & 0xFF, alpha);
    }

    private static int times(int color, int alpha) {
        return (color * alpha + 127) / 255;
    }

    /** As Android's graphics divide: in floats, by a reciprocal, rounded to the nearest, halves to the even one. */
    private static int over(int color, int alpha) {
        if (alpha == 0) {
            return 0;
        }
        float scale = 1 / (alpha * (1 / 255f));
        return (int) Math.rint(Math.min(color * (1 / 255f) * scale, 1f) * 255f);
    }

    private void checkAlive() {
        if (pixels == null) {
            throw new IllegalStateException("the bitmap is recycled");
        }
    }

    private void checkMutable() {
        if (!mutable) {
            throw new IllegalStateException("the bitmap is immutable");
        }
    }

    private void checkPixels(int length, int offset, int stride, int x, int y, int w, int h) {
        if (x < 0 || y < 0 || w < 0 || h < 0 || x + w > width || y + h > height || Math.abs(stride) < w) {
            throw new IllegalArgumentException("(" + x + ", " + y + "), " + w + " x " + h + " by " + stride
                    + " does not fit " + width + " x " + height);
        }
        int last = offset + (h - 1) * stride;
        if (offset < 0 || offset + w > length || last < 0 || last + w > length) {
            throw new ArrayIndexOutOfBoundsException(last);
        }
    }

    private int offset(int x, int y) {
        if (x < 0 || x >= width || y < 0 || y >= height) {
            throw new IllegalArgumentException("(" + x + ", " + y + ") is outside " + width + " x " + height);
        }
        return y * rowBytes + x * config.bytesPerPixel;
    }
}
