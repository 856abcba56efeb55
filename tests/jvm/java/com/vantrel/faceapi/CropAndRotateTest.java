// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;

import java.util.Arrays;
import java.util.Random;
import org.junit.Test;

public class CropAndRotateTest {
    private static final int GUARD = 64;

    private final Random random = new Random(6);

    private byte[] randomBytes(int length) {
        byte[] bytes = new byte[length];
        random.nextBytes(bytes);
        return bytes;
    }

    private byte[] rotate(byte[] src, int width, int height, int degree, int[] size) {
        byte[] before = src.clone();
        byte[] dst = randomBytes(src.length + GUARD);
        byte[] guard = Arrays.copyOfRange(dst, src.length, dst.length);
        int[] outSize = {-1, -1, 77};
        FaceLibrary.rotateBGR(src, width, height, dst, degree, outSize);
        assertArrayEquals(new int[] {size[0], size[1], 77}, outSize);
        assertArrayEquals("the source changed", before, src);
        assertArrayEquals("written past the end", guard, Arrays.copyOfRange(dst, src.length, dst.length));
        return Arrays.copyOf(dst, src.length);
    }

    /** The pixel at row r, column c of the turned image, as an index into the source. */
    private static int source(int degree, int width, int height, int r, int c) {
        switch (degree) {
            case 90:
                return (height - 1 - c) * width + r;
            case 180:
                return (height - 1 - r) * width + width - 1 - c;
            default:
                return c * width + width - 1 - r;
        }
    }

    @Test
    public void rotationsMoveEveryPixel() {
        int[][] sizes = {{1, 1}, {1, 7}, {7, 1}, {2, 3}, {16, 16}, {17, 15}, {33, 20}, {64, 64}, {65, 65}, {130, 67}};
        for (int[] size : sizes) {
            int w = size[0];
            int h = size[1];
            byte[] src = randomBytes(w * h * 3);
            for (int degree : new int[] {90, 180, 270}) {
                int[] turned = degree == 180 ? new int[] {w, h} : new int[] {h, w};
                byte[] expected = new byte[src.length];
                for (int i = 0; i < w * h; i++) {
                    System.arraycopy(src, 3 * source(degree, w, h, i / turned[0], i % turned[0]), expected, 3 * i, 3);
                }
                assertArrayEquals(degree + " degrees of " + w + " x " + h, expected, rotate(src, w, h, degree, turned));
            }
        }
    }

    @Test
    public void aQuarterAndThreeQuartersAreNothing() {
        byte[] src = randomBytes(90 * 70 * 3);
        byte[] quarter = rotate(src, 90, 70, 90, new int[] {70, 90});
        assertArrayEquals(src, rotate(quarter, 70, 90, 270, new int[] {90, 70}));
    }

    @Test
    public void otherAnglesAreRefused() {
        byte[] src = randomBytes(5 * 4 * 3);
        for (int degree : new int[] {0, 45, 89, 91, 360, -90, 450}) {
            byte[] dst = randomBytes(src.length);
            byte[] before = dst.clone();
            int[] size = new int[2];
            FaceLibrary.rotateBGR(src, 5, 4, dst, degree, size);
            assertArrayEquals(degree + " degrees", before, dst);
            assertArrayEquals(new int[] {5, 4}, size);
        }
    }

    private byte[] crop(byte[] nv21, int width, int height, int x, int y, int w, int h) {
        byte[] before = nv21.clone();
        byte[] out = randomBytes(w * h * 4 + GUARD);
        byte[] guard = Arrays.copyOfRange(out, w * h * 4, out.length);
        FaceLibrary.cropNv21Data(nv21, width, height, x, y, w, h, out);
        assertArrayEquals("the frame changed", before, nv21);
        assertArrayEquals("written past the end", guard, Arrays.copyOfRange(out, w * h * 4, out.length));
        return Arrays.copyOf(out, w * h * 4);
    }

    /** Cuts the rectangle out of both planes as bytes, and converts what was cut. */
    private static byte[] reference(byte[] nv21, int width, int height, int x, int y, int w, int h) {
        byte[] cut = new byte[w * h * 3 / 2];
        for (int row = 0; row < h; row++) {
            System.arraycopy(nv21, (y + row) * width + x, cut, row * w, w);
        }
        for (int row = 0; row < h / 2; row++) {
            System.arraycopy(nv21, (height + y / 2 + row) * width + x, cut, (h + row) * w, w);
        }
        return ColorReference.toPixels(cut, w, h, ColorReference.Chroma.VU, ColorReference.Layout.RGBA);
    }

    @Test
    public void cropsAreWhatTheFrameShowsThere() {
        int width = 96;
        int height = 64;
        byte[] nv21 = randomBytes(width * height * 3 / 2);
        int[][] rectangles = {
            {0, 0, 96, 64}, {0, 0, 2, 2}, {94, 62, 2, 2}, {10, 8, 40, 30}, {20, 0, 70, 2}, {0, 20, 2, 44},
            {11, 8, 40, 30}, // an odd x exchanges U and V
            {10, 9, 40, 30}, // an odd y pairs rows with their neighbours' chroma
        };
        for (int[] r : rectangles) {
            assertArrayEquals(Arrays.toString(r), reference(nv21, width, height, r[0], r[1], r[2], r[3]),
                    crop(nv21, width, height, r[0], r[1], r[2], r[3]));
        }
    }

    @Test
    public void theWholeFrameIsItsConversion() {
        byte[] nv21 = randomBytes(640 * 480 * 3 / 2);
        byte[] converted = new byte[640 * 480 * 4];
        FaceLibrary.convertColorSpace(nv21, 640, 480, converted, ColorConversion.NV21_TO_RGBA);
        assertArrayEquals(converted, crop(nv21, 640, 480, 0, 0, 640, 480));
    }

    @Test
    public void oddSizesAreRefused() {
        byte[] nv21 = randomBytes(32 * 32 * 3 / 2);
        for (int[] size : new int[][] {{7, 8}, {8, 7}, {7, 7}}) {
            byte[] out = randomBytes(8 * 8 * 4);
            byte[] before = out.clone();
            FaceLibrary.cropNv21Data(nv21, 32, 32, 4, 4, size[0], size[1], out);
            assertArrayEquals(Arrays.toString(size), before, out);
        }
    }
}
