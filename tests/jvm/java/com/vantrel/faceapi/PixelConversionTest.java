// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static com.vantrel.faceapi.CameraFrameTest.refused;
import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;
import static org.junit.Assert.fail;

import android.graphics.Bitmap;
import java.util.Arrays;
import java.util.Random;
import org.junit.Test;

/** The native operations on pixels by themselves: what they refuse when nobody checked, and every width. */
public final class PixelConversionTest {
    private static final int MOST = Integer.MAX_VALUE;

    private final Random random = new Random(11);

    private byte[] random(int bytes) {
        byte[] content = new byte[bytes];
        random.nextBytes(content);
        return content;
    }

    private static void refusedSizes(long status) {
        assertTrue(String.valueOf(status), status < 0);
        try {
            PixelConversion.check(status);
            fail("no failure");
        } catch (IllegalStateException right) {
            assertTrue(right.getMessage().startsWith("sizes"));
        }
    }

    @Test
    public void everyWidthIsTurnedAndSwapped() {
        for (int width = 1; width <= 70; width++) {
            for (int height : new int[] {1, 2, 3, 17, 33}) {
                byte[] swapped = new byte[width * height * 4];
                byte[] src = random(swapped.length);
                assertEquals(PixelConversion.SUCCESS, PixelConversion.convert(
                        src, width, height, swapped, PixelConversion.SWAP_RED_AND_BLUE));
                for (int i = 0; i < src.length; i++) {
                    assertEquals(src[i], swapped[i % 4 == 3 || i % 2 == 1 ? i : i ^ 2]);
                }
                for (int size : new int[] {3, 4}) {
                    for (int degrees : new int[] {90, 180, 270}) {
                        turned(random(width * height * size), width, height, size, degrees);
                    }
                }
            }
        }
    }

    private static void turned(byte[] src, int width, int height, int size, int degrees) {
        byte[] got = new byte[src.length];
        assertEquals(PixelConversion.SUCCESS, PixelConversion.rotate(src, width, height, size, degrees, got));
        byte[] want = new byte[src.length];
        int newWidth = degrees == 180 ? width : height;
        for (int y = 0; y < height; y++) {
            for (int x = 0; x < width; x++) {
                int toX = degrees == 90 ? height - 1 - y : degrees == 180 ? width - 1 - x : y;
                int toY = degrees == 90 ? x : degrees == 180 ? height - 1 - y : width - 1 - x;
                System.arraycopy(src, (y * width + x) * size, want, (toY * newWidth + toX) * size, size);
            }
        }
        assertArrayEquals(width + "x" + height + " of " + size + " by " + degrees, want, got);
    }

    @Test
    public void framesAreThoseOfTheFormulas() {
        for (int width = 2; width <= 70; width += 2) {
            byte[] src = random(width * 4 * 4);
            for (ColorReference.Chroma chroma : ColorReference.Chroma.values()) {
                byte[] got = new byte[width * 4 * 3 / 2];
                assertEquals(PixelConversion.SUCCESS, PixelConversion.convert(src, width, 4, got,
                        chroma == ColorReference.Chroma.VU
                                ? PixelConversion.RGBA_TO_NV21 : PixelConversion.RGBA_TO_NV12));
                assertArrayEquals(ColorReference.toFrame(src, width, 4, ColorReference.Layout.RGBA, chroma), got);
            }
        }
    }

    @Test
    public void sumsAreThoseOfTheRectangle() {
        int width = 67;
        int height = 5;
        int stride = width * 4 + 3;
        byte[] image = random(stride * (height - 1) + width * 4); // the last row ends with its last pixel
        for (int x = 0; x < width; x += 5) {
            for (int w = 1; w <= width - x; w++) {
                long bytes = 0;
                for (int row = 1; row < height; row++) {
                    for (int column = x; column < x + w; column++) {
                        bytes += image[row * stride + column] & 0xFF;
                    }
                }
                assertEquals(bytes, PixelConversion.sumBytes(image, stride, x, 1, w, height - 1));
                long lightness = 0;
                for (int column = x; column < x + w; column++) {
                    lightness += FaceLibrary.faceBrightEvaluate(image, BrightnessMetric.LIGHTNESS_BGRA, width, stride,
                            height, height, column, height - 1, 1, 1);
                }
                assertEquals(lightness, PixelConversion.sumLightness(image, stride, false, x, height - 1, w, 1));
            }
        }
    }

    @Test
    public void bitmapsThatAreNotAsTheyWereAreRefused() {
        Bitmap bitmap = Bitmap.createBitmap(4, 3, Bitmap.Config.ARGB_8888);
        byte[] out = random(64);
        byte[] before = out.clone();
        refused("bitmap must not be changed", () -> PixelConversion.check(PixelConversion.read(bitmap, 3, 4, 4, out)));
        refused("bitmap must not be changed", () -> PixelConversion.check(PixelConversion.read(bitmap, 4, 2, 3, out)));
        Bitmap other = Bitmap.createBitmap(4, 3, Bitmap.Config.RGB_565);
        refused("bitmap must not be changed", () -> PixelConversion.check(PixelConversion.read(other, 4, 3, 4, out)));
        refusedSizes(PixelConversion.read(bitmap, 4, 3, 2, out));
        refusedSizes(PixelConversion.read(bitmap, 4, 3, 4, new byte[47]));
        refusedSizes(PixelConversion.read(bitmap, MOST, MOST, 4, out));
        refusedSizes(PixelConversion.read(null, 4, 3, 4, out));
        assertEquals(0, bitmap.getLockCount());
        bitmap.recycle(); // between the look at it and the call
        refused("bitmap is recycled", () -> PixelConversion.check(PixelConversion.read(bitmap, 4, 3, 4, out)));
        assertArrayEquals(before, out);
    }

    @Test
    public void sizesThatArraysDoNotHoldAreRefused() {
        byte[] small = new byte[48];
        byte[] out = new byte[48];
        int[][] sizes = {{0, 1}, {-4, -3}, {MOST, MOST}, {1 << 16, 1 << 16}, {1 << 30, 4}, {4, 1 << 30}, {13, 1},
            {-1, MOST}, {Integer.MIN_VALUE, Integer.MIN_VALUE}};
        for (int[] size : sizes) {
            for (int conversion = 0; conversion <= 2; conversion++) {
                refusedSizes(PixelConversion.convert(small, size[0], size[1], out, conversion));
            }
            refusedSizes(PixelConversion.rotate(small, size[0] * 2, size[1], 3, 90, out));
            refusedSizes(PixelConversion.rotate(small, size[0], size[1], 4, 180, out));
        }
        refusedSizes(PixelConversion.convert(small, 3, 4, out, PixelConversion.RGBA_TO_NV21));
        refusedSizes(PixelConversion.convert(small, 4, 3, out, PixelConversion.RGBA_TO_NV12));
        refusedSizes(PixelConversion.convert(null, 4, 3, out, 0));
        refusedSizes(PixelConversion.convert(small, 4, 3, null, 0));
        refusedSizes(PixelConversion.convert(small, 4, 3, new byte[47], 0));
        refusedSizes(PixelConversion.rotate(small, 4, 3, 2, 90, out));
        refusedSizes(PixelConversion.rotate(small, 4, 3, 5, 90, out));
        refusedSizes(PixelConversion.rotate(small, 4, 3, 3, 45, out));
        assertArrayEquals(new byte[48], out);
        int[][] rectangles = {{0, 1, 1, 1}, {48, -1, 1, 1}, {48, 0, -1, 1}, {48, 0, 0, 0}, {48, 1, 0, 48},
            {24, 0, 1, 25}, {MOST, 0, MOST, 1}, {MOST, MOST, MOST, MOST}, {1, MOST, 1, 1}};
        for (int[] r : rectangles) {
            for (int height : new int[] {1, 2, MOST}) {
                refusedSizes(PixelConversion.sumBytes(small, r[0], r[1], r[2], r[3], height));
                refusedSizes(PixelConversion.sumLightness(small, r[0], true, r[1], r[2], r[3], height));
            }
        }
        refusedSizes(PixelConversion.sumBytes(null, 1, 0, 0, 1, 1));
        Arrays.fill(small, (byte) 1);
        assertEquals(48, PixelConversion.sumBytes(small, 48, 0, 0, 48, 1));
    }
}
