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

    public boolean isMutable() {
        return mutable;
    }

    /** Bytes from one row to the next. */
    public int getRowBytes() {
        return rowBytes;
    }

    public Config getConfig() {
        return config;
    }

    /** Sets one pixel from a 0xAARRGGBB value; a 16-bit bitmap keeps the high bits and no alpha. */
    public void setPixel(int x, int y, int color) {
        int at = offset(x, y);
        if (config == Config.RGB_565) {
            pixels.putShort(at, (short) ((color >> 8 & 0xF800) | (color >> 5 & 0x07E0) | (color >> 3 & 0x001F)));
        } else {
            pixels.put(at, (byte) (color >> 16));
            pixels.put(at + 1, (byte) (color >> 8));
            pixels.put(at + 2, (byte) color);
            pixels.put(at + 3, (byte) (color >> 24));
        }
    }

    /** Reads one pixel as a 0xAARRGGBB value. */
    public int getPixel(int x, int y) {
        int at = offset(x, y);
        if (config == Config.RGB_565) {
            int word = pixels.getShort(at);
            int red = word >> 11 & 0x1F;
            int green = word >> 5 & 0x3F;
            int blue = word & 0x1F;
            return 0xFF000000 | (red << 3 | red >> 2) << 16 | (green << 2 | green >> 4) << 8 | (blue << 3 | blue >> 2);
        }
        return (pixels.get(at + 3) & 0xFF) << 24 | (pixels.get(at) & 0xFF) << 16 | (pixels.get(at + 1) & 0xFF) << 8
                | (pixels.get(at + 2) & 0xFF);
    }

    /** Copies all rows, as they lie in memory, to the buffer's position and moves that behind them. */
    public void copyPixelsToBuffer(Buffer dst) {
        if (pixels == null) {
            throw new IllegalStateException("the bitmap is recycled");
        }
        if (!(dst instanceof ByteBuffer)) {
            throw new RuntimeException("the stand-in copies to byte buffers only");
        }
        if (dst.remaining() < pixels.capacity()) {
            throw new RuntimeException("the buffer is not large enough for the pixels");
        }
        ByteBuffer all = pixels.duplicate();
        all.clear();
        ((ByteBuffer) dst).put(all);
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

    private int offset(int x, int y) {
        if (x < 0 || x >= width || y < 0 || y >= height) {
            throw new IllegalArgumentException("(" + x + ", " + y + ") is outside " + width + " x " + height);
        }
        if (pixels == null) {
            throw new IllegalStateException("the bitmap is recycled");
        }
        return y * rowBytes + x * config.bytesPerPixel;
    }
}
