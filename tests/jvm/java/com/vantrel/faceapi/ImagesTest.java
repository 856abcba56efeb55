// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static com.vantrel.faceapi.CameraFrameTest.refused;
import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertTrue;
import static org.junit.Assert.fail;

import android.graphics.Bitmap;
import java.util.Arrays;
import java.util.Random;
import org.junit.BeforeClass;
import org.junit.Test;

/** The checked image operations: the same pixels as the native methods, and no way past an array's end. */
public final class ImagesTest {
    private static final int WIDTH = 20;
    private static final int HEIGHT = 12;

    private static byte[] random(int bytes) {
        byte[] content = new byte[bytes];
        new Random(bytes).nextBytes(content);
        return content;
    }

    @BeforeClass
    public static void quiet() {
        FaceLibrary.setDebug(false);
    }

    @Test
    public void conversionsAreThoseOfTheNativeMethod() {
        for (Images.Conversion conversion : Images.Conversion.values()) {
            if (codeOf(conversion) == NO_CODE) {
                continue;
            }
            byte[] src = random((int) packed(conversion.source()));
            byte[] want = new byte[(int) packed(conversion.result())];
            FaceLibrary.convertColorSpace(src, WIDTH, HEIGHT, want, codeOf(conversion));
            byte[] reuse = new byte[want.length];
            byte[] got = Images.convert(src, WIDTH, HEIGHT, conversion, reuse);
            assertSame(reuse, got);
            assertArrayEquals(conversion.name(), want, got);
            assertArrayEquals(conversion.name(), want, Images.convert(src, WIDTH, HEIGHT, conversion, null));
        }
    }

    @Test
    public void bothFrameLayoutsGiveEveryPixelLayout() {
        for (int width = 2; width <= 70; width += 2) {
            byte[] frame = random(width * 6 * 3 / 2);
            for (Images.Conversion conversion : Images.Conversion.values()) {
                if (!conversion.source().isSemiPlanar()) {
                    continue;
                }
                byte[] want = ColorReference.toPixels(frame, width, 6,
                        conversion.source() == PixelFormat.NV21 ? ColorReference.Chroma.VU : ColorReference.Chroma.UV,
                        ColorReference.Layout.valueOf(conversion.result().name()));
                assertArrayEquals(conversion + " " + width, want, Images.convert(frame, width, 6, conversion, null));
            }
        }
        int conversions = 0;
        for (PixelFormat frame : new PixelFormat[] {PixelFormat.NV21, PixelFormat.NV12}) {
            for (PixelFormat pixels : new PixelFormat[] {PixelFormat.RGBA, PixelFormat.BGRA, PixelFormat.BGR}) {
                Images.Conversion conversion = Images.Conversion.valueOf(frame + "_TO_" + pixels);
                assertSame(frame, conversion.source());
                assertSame(pixels, conversion.result());
                conversions++;
            }
        }
        assertEquals(6, conversions);
    }

    private static long packed(PixelFormat format) {
        return format.imageBytes(WIDTH, HEIGHT, (int) format.rowBytes(WIDTH));
    }

    private static final int NO_CODE = -1;

    private static int codeOf(Images.Conversion conversion) {
        switch (conversion) {
            case NV21_TO_BGRA: return 1;
            case NV21_TO_RGBA: return 2;
            case RGBA_TO_NV21: return 3;
            case NV12_TO_BGRA: return 5;
            case RGBA_TO_NV12: return 20;
            case NV21_TO_BGR: return 1001;
            case BGRA_TO_RGBA: return 14;
            case RGBA_TO_BGRA: return 14;
            default: return NO_CODE;
        }
    }

    @Test
    public void conversionsRefuseWhatDoesNotFit() {
        byte[] frame = random(WIDTH * HEIGHT * 3 / 2);
        Images.Conversion c = Images.Conversion.NV21_TO_RGBA;
        refused("width", () -> Images.convert(frame, WIDTH - 1, HEIGHT, c, null));
        refused("height", () -> Images.convert(frame, WIDTH, HEIGHT + 1, c, null));
        refused("width", () -> Images.convert(frame, -WIDTH, -HEIGHT, c, null));
        refused("width x height", () -> Images.convert(frame, 65536, 65536, c, null));
        refused("src.length", () -> Images.convert(frame, WIDTH, HEIGHT + 2, c, null));
        refused("reuse.length", () -> Images.convert(frame, WIDTH, HEIGHT, c, new byte[WIDTH * HEIGHT * 4 - 1]));
        byte[] pixels = random(WIDTH * HEIGHT * 4);
        refused("reuse must not", () ->
                Images.convert(pixels, WIDTH, HEIGHT, Images.Conversion.BGRA_TO_RGBA, pixels));
        try {
            Images.convert(null, WIDTH, HEIGHT, c, null);
            fail("a null source was taken");
        } catch (NullPointerException right) {
            assertEquals("src is null", right.getMessage());
        }
    }

    /** Sizes whose product is 0, negative or small once it no longer fits. */
    @Test
    public void sizesThatNothingHoldsAreRefused() {
        int most = Integer.MAX_VALUE;
        refused("width x height", () ->
                Images.convert(new byte[4], most, most, Images.Conversion.BGRA_TO_RGBA, null));
        refused("width x height", () ->
                Images.convert(new byte[16], most - 1, most - 1, Images.Conversion.RGBA_TO_NV12, null));
        refused("width x height", () -> Images.rotate(new byte[3], most, most, 90, null));
        for (int width : new int[] {2, 4, 1 << 15, 1 << 16, 1 << 30, most - 1}) {
            for (int height : new int[] {2, 4, 1 << 15, 1 << 16, 1 << 30, most - 1}) {
                for (Images.Conversion conversion : Images.Conversion.values()) {
                    refusedSize(() -> Images.convert(new byte[4], width, height, conversion, null));
                    refusedSize(() -> Images.convert(new byte[0], width, height, conversion, null));
                }
                refusedSize(() -> Images.rotate(new byte[3], width, height, 90, null));
                refusedSize(() -> CameraFrame.of(new byte[0], PixelFormat.NV21, width, height, 0));
            }
        }
        byte[] pixels = new byte[64];
        refused("image", () ->
                Images.lightness(pixels, PixelFormat.RGBA, (1 << 29) - 1, most, most, 0, 0, 1, 1));
        refused("stride", () ->
                Images.lightness(pixels, PixelFormat.RGBA, most, most, most, 0, 0, 1, 1));
        for (PixelFormat format : PixelFormat.values()) {
            long bytes = format.imageBytes(1 << 28, most - 1, most);
            assertTrue(format.name(), bytes > most);
            refused("width", () -> format.rowBytes(0));
            refused("width", () -> format.imageBytes(-2, 2, 2));
            refused("height", () -> format.imageBytes(2, most + 1, 8));
            refused("stride", () -> format.imageBytes(2, 2, 1));
        }
    }

    private static void refusedSize(Runnable call) {
        try {
            call.run();
        } catch (IllegalArgumentException right) {
            assertTrue(right.getMessage(), right.getMessage().matches("(width x height|src.length|data.length) .*"));
            return;
        }
        fail("taken");
    }

    @Test
    public void evenLengthsAreThoseOfAnInt() {
        int most = Integer.MAX_VALUE;
        assertEquals(most - 1, Images.evenLength(0, most - 1));
        assertEquals(most - 1, Images.evenLength(1, most - 2));
        assertEquals(2, Images.evenLength(most - 3, 2));
        refused("start + length", () -> Images.evenLength(most, most));
        refused("start + length", () -> Images.evenLength(0, most));
        refused("start", () -> Images.evenLength(-1, 2));
        refused("length", () -> Images.evenLength(0, 0));
    }

    @Test
    public void cropsAreMadeEven() {
        for (PixelFormat format : new PixelFormat[] {PixelFormat.NV21, PixelFormat.NV12}) {
            cropsAreMadeEven(CameraFrame.of(random(WIDTH * HEIGHT * 3 / 2), format, WIDTH, HEIGHT, 0));
        }
        CameraFrame frame = CameraFrame.of(random(WIDTH * HEIGHT * 3 / 2), PixelFormat.NV21, WIDTH, HEIGHT, 0);
        refused("x", () -> Images.crop(frame, -1, 0, 2, 2, null));
        refused("x", () -> Images.crop(frame, WIDTH - 1, 0, 2, 2, null));
        refused("y", () -> Images.crop(frame, 0, HEIGHT, 2, 2, null));
        refused("w", () -> Images.crop(frame, 0, 0, 0, 2, null));
        refused("h", () -> Images.crop(frame, 0, 0, 2, -2, null));
        refused("x", () -> Images.crop(frame, 2, 0, Integer.MAX_VALUE, 2, null));
        refused("reuse.length", () -> Images.crop(frame, 0, 0, 2, 2, new byte[3]));
        CameraFrame small = CameraFrame.of(random(96), PixelFormat.NV21, 16, 4, 0);
        refused("reuse must not", () -> Images.crop(small, 0, 0, 12, 2, small.data()));
    }

    private static void cropsAreMadeEven(CameraFrame frame) {
        byte[] whole = ColorReference.toPixels(frame.data(), WIDTH, HEIGHT,
                frame.format() == PixelFormat.NV21 ? ColorReference.Chroma.VU : ColorReference.Chroma.UV,
                ColorReference.Layout.RGBA);
        for (int x = 0; x < WIDTH; x += 3) {
            for (int y = 0; y < HEIGHT; y += 3) {
                for (int w = 1; w <= WIDTH - x; w += 2) {
                    int h = HEIGHT - y;
                    int left = x / 2 * 2;
                    int top = y / 2 * 2;
                    int evenW = (x + w + 1) / 2 * 2 - left;
                    int evenH = (y + h + 1) / 2 * 2 - top;
                    assertEquals(evenW, Images.evenLength(x, w));
                    assertEquals(evenH, Images.evenLength(y, h));
                    byte[] want = new byte[evenW * evenH * 4];
                    for (int r = 0; r < evenH; r++) {
                        System.arraycopy(whole, ((top + r) * WIDTH + left) * 4, want, r * evenW * 4, evenW * 4);
                    }
                    assertArrayEquals(want, Images.crop(frame, x, y, w, h, null));
                }
            }
        }
    }

    @Test
    public void rotationsTurnEveryPixel() {
        byte[] src = random(WIDTH * HEIGHT * 3);
        byte[] right = Images.rotate(src, WIDTH, HEIGHT, 90, null);
        byte[] back = Images.rotate(right, HEIGHT, WIDTH, 270, new byte[src.length]);
        assertArrayEquals(src, back);
        byte[] around = Images.rotate(src, WIDTH, HEIGHT, 180, null);
        for (int i = 0; i < WIDTH * HEIGHT; i++) {
            for (int c = 0; c < 3; c++) {
                assertEquals(src[i * 3 + c], around[(WIDTH * HEIGHT - 1 - i) * 3 + c]);
            }
        }
        // Destination row 0 is the first column from the bottom up.
        for (int c = 0; c < HEIGHT; c++) {
            assertEquals(src[(HEIGHT - 1 - c) * WIDTH * 3], right[c * 3]);
        }
        refused("degrees", () -> Images.rotate(src, WIDTH, HEIGHT, 45, null));
        refused("degrees", () -> Images.rotate(src, WIDTH, HEIGHT, 0, null));
        refused("src.length", () -> Images.rotate(src, WIDTH, HEIGHT + 1, 90, null));
        refused("reuse.length", () -> Images.rotate(src, WIDTH, HEIGHT, 90, new byte[1]));
        refused("reuse must not", () -> Images.rotate(src, WIDTH, HEIGHT, 90, src));
    }

    @Test
    public void brightnessIsTheMeanOfTheRectangle() {
        byte[] data = random(WIDTH * HEIGHT * 3 / 2);
        CameraFrame frame = CameraFrame.of(data, PixelFormat.NV12, WIDTH, HEIGHT, 0);
        for (int x = 0; x < WIDTH; x += 3) {
            for (int y = 0; y < HEIGHT; y += 2) {
                int w = WIDTH - x;
                int h = HEIGHT - y;
                int sum = 0;
                for (int r = y; r < y + h; r++) {
                    for (int c = x; c < x + w; c++) {
                        sum += data[r * WIDTH + c] & 0xFF;
                    }
                }
                assertEquals((float) sum / (float) (w * h * 255), Images.brightness(frame, x, y, w, h), 0);
            }
        }
        refused("y", () -> Images.brightness(frame, 0, 4, 2, HEIGHT - 3));
        refused("x", () -> Images.brightness(frame, WIDTH, 0, 1, 1));
    }

    /** Beyond what the native metrics' 32 bits hold. */
    @Test
    public void brightnessOfManyPixels() {
        int width = 4096;
        int height = 2160;
        byte[] data = new byte[width * height * 3 / 2];
        Arrays.fill(data, (byte) 128);
        CameraFrame frame = CameraFrame.of(data, PixelFormat.NV21, width, height, 0);
        assertEquals(128 / 255.0, Images.brightness(frame, 0, 0, width, height), 1e-7);
        Arrays.fill(data, 0, width * height, (byte) 255);
        assertEquals(1, Images.brightness(frame, 0, 0, width, height), 0);
        new Random(5).nextBytes(data);
        long sum = 0;
        for (int i = 0; i < width * height; i++) {
            sum += data[i] & 0xFF;
        }
        assertEquals(sum / (255.0 * width * height), Images.brightness(frame, 0, 0, width, height), 1e-7);
    }

    @Test
    public void lightnessOfManyPixels() {
        int width = 6000;
        int height = 3000;
        byte[] pixels = new byte[width * height * 4];
        for (int value : new int[] {255, 128}) {
            Arrays.fill(pixels, (byte) value);
            int want = Images.lightness(pixels, PixelFormat.RGBA, width, height, width * 4, 0, 0, 1, 1);
            assertEquals(value == 255 ? 255 : 137, want);
            assertEquals(want,
                    Images.lightness(pixels, PixelFormat.RGBA, width, height, width * 4, 0, 0, width, height));
            int all = width * height;
            assertEquals(want, Images.lightness(pixels, PixelFormat.BGRA, all, 1, all * 4, 0, 0, all, 1));
        }
        // Rows of black above: the mean is rounded once, over all of them.
        int gray = 137;
        for (int black : new int[] {1, 7, 1499, 1500, 2999}) {
            Arrays.fill(pixels, 0, black * width * 4, (byte) 0);
            long sum = (long) gray * (height - black) * width;
            long area = (long) width * height;
            assertEquals((sum + area / 2) / area,
                    Images.lightness(pixels, PixelFormat.BGRA, width, height, width * 4, 0, 0, width, height));
        }
    }

    @Test
    public void lightnessIsThatOfTheNativeMetric() {
        byte[] pixels = random(WIDTH * HEIGHT * 4);
        for (int x = 0; x < WIDTH; x += 3) {
            for (int y = 0; y < HEIGHT; y += 2) {
                for (int w = 1; w <= WIDTH - x; w += 2) {
                    int h = HEIGHT - y;
                    assertEquals(FaceLibrary.faceBrightEvaluate(pixels, BrightnessMetric.LIGHTNESS_RGBA, WIDTH,
                            WIDTH * 4, HEIGHT, HEIGHT, x, y, w, h),
                            Images.lightness(pixels, PixelFormat.RGBA, WIDTH, HEIGHT, WIDTH * 4, x, y, w, h));
                    assertEquals(FaceLibrary.faceBrightEvaluate(pixels, BrightnessMetric.LIGHTNESS_BGRA, WIDTH,
                            WIDTH * 4, HEIGHT, HEIGHT, x, y, w, h),
                            Images.lightness(pixels, PixelFormat.BGRA, WIDTH, HEIGHT, WIDTH * 4, x, y, w, h));
                }
            }
        }
    }

    @Test
    public void lightnessIsMeasuredInsideTheImage() {
        byte[] pixels = new byte[WIDTH * HEIGHT * 4];
        assertEquals(0, Images.lightness(pixels, PixelFormat.RGBA, WIDTH, HEIGHT, WIDTH * 4, 0, 0, WIDTH, HEIGHT));
        Arrays.fill(pixels, (byte) 255);
        assertEquals(255, Images.lightness(pixels, PixelFormat.BGRA, WIDTH, HEIGHT, WIDTH * 4, 3, 2, 5, 7));
        refused("stride", () -> Images.lightness(pixels, PixelFormat.RGBA, WIDTH, HEIGHT, WIDTH, 0, 0, 1, 1));
        refused("image", () ->
                Images.lightness(pixels, PixelFormat.RGBA, WIDTH, HEIGHT + 1, WIDTH * 4, 0, 0, 1, 1));
        refused("format", () -> Images.lightness(pixels, PixelFormat.BGR, WIDTH, HEIGHT, WIDTH * 4, 0, 0, 1, 1));
        refused("w", () -> Images.lightness(pixels, PixelFormat.RGBA, WIDTH, HEIGHT, WIDTH * 4, 0, 0, 0, 1));
    }

    @Test
    public void imagesOfAnyPixelSizeAreTurned() {
        Random random = new Random(8);
        PixelFormat[] formats = {
            PixelFormat.GRAY, PixelFormat.BGR, PixelFormat.RGB, PixelFormat.BGRA, PixelFormat.RGBA};
        for (PixelFormat format : formats) {
            int size = format.bytesPerPixel();
            for (int width = 1; width <= 35; width++) {
                int height = 1 + random.nextInt(35);
                byte[] src = new byte[width * height * size];
                random.nextBytes(src);
                for (int degrees = 90; degrees <= 270; degrees += 90) {
                    byte[] expected = new byte[src.length];
                    int outWidth = degrees == 180 ? width : height;
                    for (int y = 0; y < height; y++) {
                        for (int x = 0; x < width; x++) {
                            int toX = degrees == 90 ? height - 1 - y : degrees == 180 ? width - 1 - x : y;
                            int toY = degrees == 90 ? x : degrees == 180 ? height - 1 - y : width - 1 - x;
                            System.arraycopy(
                                    src, (y * width + x) * size, expected, (toY * outWidth + toX) * size, size);
                        }
                    }
                    byte[] out = new byte[src.length];
                    assertSame(out, Images.rotate(src, format, width, height, degrees, out));
                    assertArrayEquals(format + " " + width + " x " + height + " by " + degrees, expected, out);
                    assertArrayEquals(expected, Images.rotate(src, format, width, height, degrees, null));
                }
            }
        }
        byte[] src = new byte[24];
        refused("src.length", () -> Images.rotate(src, PixelFormat.RGBA, 3, 3, 90, null));
        refused("degrees", () -> Images.rotate(src, PixelFormat.RGBA, 3, 2, 0, null));
        refused("format", () -> Images.rotate(src, PixelFormat.NV21, 4, 4, 90, null));
        refused("reuse", () -> Images.rotate(src, PixelFormat.RGBA, 3, 2, 90, src));
        refused("reuse.length", () -> Images.rotate(src, PixelFormat.RGBA, 3, 2, 90, new byte[23]));
    }

    @Test
    public void bitmapsOfAnyStrideGiveTheSamePixels() {
        for (int padding : new int[] {0, 4, 12}) {
            Bitmap bitmap = Bitmap.createBitmap(7, 5, Bitmap.Config.ARGB_8888, 7 * 4 + padding);
            byte[] bgra = new byte[7 * 5 * 4];
            byte[] bgr = new byte[7 * 5 * 3];
            Random random = new Random(3);
            for (int i = 0; i < 35; i++) {
                int color = random.nextInt() | 0xFF000000; // an alpha of less would scale the colours
                bitmap.setPixel(i % 7, i / 7, color);
                for (int c = 0; c < 4; c++) {
                    bgra[i * 4 + c] = (byte) (color >> (8 * c));
                    if (c < 3) {
                        bgr[i * 3 + c] = (byte) (color >> (8 * c));
                    }
                }
            }
            assertArrayEquals(bgra, Images.pixels(bitmap, PixelFormat.BGRA, null));
            assertArrayEquals(bgr, Images.pixels(bitmap, PixelFormat.BGR, new byte[bgr.length]));
            refused("reuse.length", () -> Images.pixels(bitmap, PixelFormat.BGR, bgra));
            refused("format", () -> Images.pixels(bitmap, PixelFormat.RGBA, null));
            bitmap.recycle();
            refused("bitmap is recycled", () -> Images.pixels(bitmap, PixelFormat.BGRA, null));
        }
        refused("bitmap must", () -> Images.pixels(
                Bitmap.createBitmap(2, 2, Bitmap.Config.RGB_565), PixelFormat.BGRA, null));
    }
}
