// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.util.Arrays;
import java.util.Random;
import org.junit.Test;

public class BrightnessTest {
    private static final int WIDTH = 61;
    private static final int HEIGHT = 17;

    private final Random random = new Random(4);

    private byte[] randomBytes(int length) {
        byte[] bytes = new byte[length];
        random.nextBytes(bytes);
        return bytes;
    }

    /** The value that a metric averages, of the pixel at {@code at}. */
    private interface PixelValue {
        int of(byte[] image, int at);
    }

    private static int weighted(byte[] image, int red, int green, int blue) {
        return 77 * (image[blue] & 0xFF) + 150 * (image[green] & 0xFF) + 29 * (image[red] & 0xFF) + 128 >> 8;
    }

    private static int roundedMean(byte[] image, int stride, int size, int x, int y, int w, int h, PixelValue value) {
        int x0 = Math.max(x, 0);
        int y0 = Math.max(y, 0);
        int x1 = Math.min(x + w, WIDTH);
        int y1 = Math.min(y + h, HEIGHT);
        int sum = 0;
        for (int row = y0; row < y1; row++) {
            for (int column = x0; column < x1; column++) {
                sum += value.of(image, row * stride + column * size);
            }
        }
        int n = (x1 - x0) * (y1 - y0);
        return n == 0 ? 0 : (sum + n / 2) / n;
    }

    private void assertMeans(int format, int size, PixelValue value) {
        int stride = WIDTH * size + 5;
        byte[] image = randomBytes(stride * HEIGHT);
        byte[] before = image.clone();
        int[][] rectangles = {
            {0, 0, WIDTH, HEIGHT}, {3, 2, 40, 10}, {-5, -4, 20, 9}, {50, 12, 100, 100}, {-10, -10, 200, 200},
            {60, 16, 1, 1}, {7, 3, 33, 1}, {0, 5, 64, 2}
        };
        for (int[] r : rectangles) {
            assertEquals("format " + format + ", " + Arrays.toString(r),
                    roundedMean(image, stride, size, r[0], r[1], r[2], r[3], value),
                    FaceLibrary.faceBrightEvaluate(
                            image, format, WIDTH, stride, HEIGHT, HEIGHT, r[0], r[1], r[2], r[3]));
        }
        assertArrayEquals("the image changed", before, image);
    }

    @Test
    public void lumaIsTheFirstByte() {
        assertMeans(BrightnessMetric.LUMA_YUV, 3, (image, at) -> image[at] & 0xFF);
    }

    @Test
    public void blueWeighsMoreThanRedInBothLayouts() {
        assertMeans(BrightnessMetric.GRAY_BGRA, 4, (image, at) -> weighted(image, at + 2, at + 1, at));
        assertMeans(BrightnessMetric.GRAY_RGBA, 4, (image, at) -> weighted(image, at, at + 1, at + 2));
    }

    /** L* of CIE Lab, scaled to 0..255, in double precision. */
    private static double lightness(int red, int green, int blue) {
        double y = 0.2126 * linear(red) + 0.7152 * linear(green) + 0.0722 * linear(blue);
        double f = y < 0.008856 ? 7.787 * y + 16.0 / 116 : Math.cbrt(y);
        return (116 * f - 16) * 255 / 100;
    }

    private static double linear(int value) {
        double v = value / 255.0;
        return v <= 0.04045 ? v / 12.92 : Math.pow((v + 0.055) / 1.055, 2.4);
    }

    @Test
    public void lightnessIsThatOfLab() {
        byte[] image = new byte[4];
        for (int i = 0; i < 2000; i++) {
            random.nextBytes(image);
            double expected = lightness(image[0] & 0xFF, image[1] & 0xFF, image[2] & 0xFF);
            // Tables of 12 bits are behind it, coarse for what is nearly black.
            double tolerance = expected < 20 ? 4 : 1.5;
            assertEquals(Arrays.toString(image), expected, FaceLibrary.faceBrightEvaluate(
                    image, BrightnessMetric.LIGHTNESS_RGBA, 1, 4, 1, 1, 0, 0, 1, 1), tolerance);
            byte[] bgra = {image[2], image[1], image[0], image[3]};
            assertEquals(Arrays.toString(image), expected, FaceLibrary.faceBrightEvaluate(
                    bgra, BrightnessMetric.LIGHTNESS_BGRA, 1, 4, 1, 1, 0, 0, 1, 1), tolerance);
        }
    }

    @Test
    public void blackWhiteAndBlue() {
        byte[] black = new byte[4 * 4];
        byte[] white = new byte[4 * 4];
        byte[] blue = new byte[4 * 4];
        for (int i = 0; i < 16; i++) {
            black[i] = (byte) (i % 4 == 3 ? 255 : 0);
            white[i] = (byte) 255;
            blue[i] = (byte) (i % 4 == 0 || i % 4 == 3 ? 255 : 0);
        }
        for (int format : new int[] {BrightnessMetric.LIGHTNESS_BGRA, BrightnessMetric.GRAY_BGRA}) {
            assertEquals(0, FaceLibrary.faceBrightEvaluate(black, format, 2, 8, 2, 2, 0, 0, 2, 2));
            assertEquals(255, FaceLibrary.faceBrightEvaluate(white, format, 2, 8, 2, 2, 0, 0, 2, 2));
        }
        assertEquals(77, FaceLibrary.faceBrightEvaluate(blue, BrightnessMetric.GRAY_BGRA, 2, 8, 2, 2, 0, 0, 2, 2));
    }

    @Test
    public void whatCannotBeRated() {
        byte[] image = randomBytes(WIDTH * HEIGHT * 4);
        for (int format : new int[] {2, 6, -1, Integer.MIN_VALUE, Integer.MAX_VALUE}) {
            assertEquals(-1, FaceLibrary.faceBrightEvaluate(
                    image, format, WIDTH, 4 * WIDTH, HEIGHT, HEIGHT, 0, 0, WIDTH, HEIGHT));
        }
        for (int format : new int[] {0, 1, 2, 3, 4, 5}) {
            assertEquals(-1, FaceLibrary.faceBrightEvaluate(
                    null, format, WIDTH, 4 * WIDTH, HEIGHT, HEIGHT, 0, 0, WIDTH, HEIGHT));
        }
        for (int format : new int[] {0, 1, 3, 4, 5}) {
            assertEquals(255, FaceLibrary.faceBrightEvaluate(
                    image, format, WIDTH, 4 * WIDTH, HEIGHT, HEIGHT, 0, 0, 0, HEIGHT));
            assertEquals(255, FaceLibrary.faceBrightEvaluate(
                    image, format, WIDTH, 0, HEIGHT, HEIGHT, 0, 0, WIDTH, HEIGHT));
            assertEquals(0, FaceLibrary.faceBrightEvaluate(
                    image, format, WIDTH, 4 * WIDTH, HEIGHT, HEIGHT, WIDTH, 0, 5, 5));
        }
    }

    @Test
    public void averageOfARectangle() {
        byte[] gray = randomBytes(WIDTH * HEIGHT);
        int[][] rectangles = {{0, 0, WIDTH, HEIGHT}, {3, 2, 40, 10}, {-5, -4, 20, 9}, {50, 2, 100, 5}, {7, 3, 33, 1}};
        for (int[] r : rectangles) {
            int x0 = Math.max(r[0], 0);
            int y0 = Math.max(r[1], 0);
            int w = Math.min(r[2], WIDTH - x0);
            int h = x0 + r[3] > HEIGHT ? HEIGHT - y0 : r[3];
            int sum = 0;
            for (int y = y0; y < y0 + h; y++) {
                for (int x = x0; x < x0 + w; x++) {
                    sum += gray[y * WIDTH + x] & 0xFF;
                }
            }
            assertEquals(Arrays.toString(r), (float) sum / (float) (w * h * 255),
                    FaceLibrary.averageBrightness(gray, WIDTH, HEIGHT, r[0], r[1], r[2], r[3]), 0);
        }
    }

    @Test
    public void averageOfWhiteIsOne() {
        byte[] white = new byte[16];
        Arrays.fill(white, (byte) 255);
        assertEquals(1, FaceLibrary.averageBrightness(white, 4, 4, 0, 0, 4, 4), 0);
        assertEquals("clipped", 1, FaceLibrary.averageBrightness(white, 4, 4, 0, 0, 10, 10), 0);
    }

    @Test
    public void anAverageOfNothing() {
        byte[] gray = randomBytes(16);
        assertEquals(0, FaceLibrary.averageBrightness(gray, 4, 4, 5, 0, 1, 1), 0);
        assertEquals(0, FaceLibrary.averageBrightness(gray, 4, 4, 0, 5, 1, 1), 0);
        assertEquals(0, FaceLibrary.averageBrightness(gray, 4, 4, 0, 0, 0, 1), 0);
        assertEquals(0, FaceLibrary.averageBrightness(gray, 4, 4, 0, 0, 1, -1), 0);
        assertTrue(Float.isNaN(FaceLibrary.averageBrightness(gray, 4, 4, 4, 0, 1, 1)));
    }
}
