// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static com.vantrel.faceapi.ColorReference.Chroma.UV;
import static com.vantrel.faceapi.ColorReference.Chroma.VU;
import static com.vantrel.faceapi.ColorReference.Layout.BGR;
import static com.vantrel.faceapi.ColorReference.Layout.BGRA;
import static com.vantrel.faceapi.ColorReference.Layout.RGBA;
import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.util.Arrays;
import java.util.Random;
import org.junit.Test;

public class ConvertColorSpaceTest {
    /** What lies behind the result's end; a conversion that writes too far changes it. */
    private static final int GUARD = 64;

    private final Random random = new Random(20240611);

    private interface Reference {
        byte[] convert(byte[] src, int width, int height);
    }

    private byte[] randomBytes(int length) {
        byte[] bytes = new byte[length];
        random.nextBytes(bytes);
        return bytes;
    }

    /** Converts, checks the guard, and returns the result without it. */
    private byte[] convert(byte[] src, int width, int height, int length, int code) {
        byte[] before = src.clone();
        byte[] dst = randomBytes(length + GUARD);
        byte[] guard = Arrays.copyOfRange(dst, length, dst.length);
        FaceLibrary.convertColorSpace(src, width, height, dst, code);
        assertArrayEquals("the source changed", before, src);
        assertArrayEquals("written past the end", guard, Arrays.copyOfRange(dst, length, dst.length));
        return Arrays.copyOf(dst, length);
    }

    private void assertConverts(int code, int sourceBytesPer2Pixels, Reference reference) {
        int[][] sizes = {{640, 480}, {322, 6}, {2, 480}};
        for (int width = 2; width <= 70; width += 2) {
            assertConverts(code, sourceBytesPer2Pixels, reference, width, 2);
            assertConverts(code, sourceBytesPer2Pixels, reference, width, 4);
        }
        for (int[] size : sizes) {
            assertConverts(code, sourceBytesPer2Pixels, reference, size[0], size[1]);
        }
    }

    private void assertConverts(int code, int sourceBytesPer2Pixels, Reference reference, int width, int height) {
        byte[] src = randomBytes(width * height * sourceBytesPer2Pixels / 2);
        byte[] expected = reference.convert(src, width, height);
        assertArrayEquals("code " + code + ", " + width + " x " + height, expected,
                convert(src, width, height, expected.length, code));
    }

    @Test
    public void nv21ToBgra() {
        assertConverts(ColorConversion.NV21_TO_BGRA, 3, (src, w, h) -> ColorReference.toPixels(src, w, h, VU, BGRA));
    }

    @Test
    public void nv21ToRgba() {
        assertConverts(ColorConversion.NV21_TO_RGBA, 3, (src, w, h) -> ColorReference.toPixels(src, w, h, VU, RGBA));
    }

    @Test
    public void rgbaToNv21() {
        assertConverts(ColorConversion.RGBA_TO_NV21, 8, (src, w, h) -> ColorReference.toFrame(src, w, h, RGBA, VU));
    }

    @Test
    public void nv12ToBgra() {
        assertConverts(ColorConversion.NV12_TO_BGRA, 3, (src, w, h) -> ColorReference.toPixels(src, w, h, UV, BGRA));
    }

    @Test
    public void rgbaToNv12() {
        assertConverts(ColorConversion.RGBA_TO_NV12, 8, (src, w, h) -> ColorReference.toFrame(src, w, h, RGBA, UV));
    }

    @Test
    public void nv21ToBgr() {
        assertConverts(ColorConversion.NV21_TO_BGR, 3, (src, w, h) -> ColorReference.toPixels(src, w, h, VU, BGR));
    }

    @Test
    public void redAndBlueChangePlaces() {
        for (int code : new int[] {ColorConversion.BGRA_TO_RGBA, ColorConversion.BGRA_TO_RGBA_ALIAS}) {
            for (int width = 1; width <= 70; width++) { // pixels of their own need no even size
                byte[] src = randomBytes(width * 3 * 4);
                byte[] expected = src.clone();
                for (int i = 0; i < src.length; i += 4) {
                    expected[i] = src[i + 2];
                    expected[i + 2] = src[i];
                }
                assertArrayEquals("code " + code + ", width " + width, expected,
                        convert(src, width, 3, src.length, code));
            }
        }
    }

    @Test
    public void framesSurviveTheWayThroughPixels() {
        int width = 128;
        int height = 96;
        // Colours within the range that a frame can hold come back as they were, up to rounding; chroma is one value
        // for each block of four pixels, which the frame's own chroma is.
        byte[] frame = new byte[width * height * 3 / 2];
        for (int i = 0; i < frame.length; i++) {
            frame[i] = (byte) (i < width * height ? 96 + random.nextInt(64) : 118 + random.nextInt(20));
        }
        byte[] rgba = convert(frame, width, height, width * height * 4, ColorConversion.NV21_TO_RGBA);
        byte[] back = convert(rgba, width, height, frame.length, ColorConversion.RGBA_TO_NV21);
        for (int i = 0; i < frame.length; i++) {
            assertEquals("byte " + i, frame[i] & 0xFF, back[i] & 0xFF, 2);
        }
        byte[] nv12 = convert(rgba, width, height, frame.length, ColorConversion.RGBA_TO_NV12);
        for (int i = width * height; i < frame.length; i += 2) {
            assertEquals(back[i], nv12[i + 1]);
            assertEquals(back[i + 1], nv12[i]);
        }
        byte[] bgra = convert(frame, width, height, rgba.length, ColorConversion.NV21_TO_BGRA);
        byte[] bgr = convert(frame, width, height, width * height * 3, ColorConversion.NV21_TO_BGR);
        for (int i = 0; i < width * height; i++) {
            assertEquals(rgba[4 * i], bgra[4 * i + 2]);
            assertEquals(rgba[4 * i + 1], bgra[4 * i + 1]);
            assertEquals(rgba[4 * i + 2], bgra[4 * i]);
            assertEquals((byte) 255, bgra[4 * i + 3]);
            assertArrayEquals(Arrays.copyOfRange(bgra, 4 * i, 4 * i + 3), Arrays.copyOfRange(bgr, 3 * i, 3 * i + 3));
        }
    }

    @Test
    public void grayStaysGray() {
        for (int level = 0; level < 256; level++) {
            byte[] rgba = new byte[2 * 2 * 4];
            for (int i = 0; i < rgba.length; i++) {
                rgba[i] = (byte) (i % 4 == 3 ? 255 : level);
            }
            byte[] frame = convert(rgba, 2, 2, 6, ColorConversion.RGBA_TO_NV21);
            byte gray = (byte) level;
            assertArrayEquals(new byte[] {gray, gray, gray, gray, (byte) 128, (byte) 128}, frame);
            assertArrayEquals(rgba, convert(frame, 2, 2, rgba.length, ColorConversion.NV21_TO_RGBA));
        }
    }

    private void assertNothingWritten(byte[] src, int width, int height, int length, int code) {
        byte[] dst = randomBytes(length);
        byte[] before = dst.clone();
        FaceLibrary.convertColorSpace(src, width, height, dst, code);
        assertArrayEquals("code " + code + ", " + width + " x " + height, before, dst);
    }

    @Test
    public void oddSizesAreRefused() {
        int[] codes = {
            ColorConversion.NV21_TO_BGRA, ColorConversion.NV21_TO_RGBA, ColorConversion.RGBA_TO_NV21,
            ColorConversion.NV12_TO_BGRA, ColorConversion.RGBA_TO_NV12, ColorConversion.NV21_TO_BGR
        };
        int[][] sizes = {{15, 16}, {16, 15}, {15, 15}, {1, 2}, {2, 1}, {17, 2}};
        for (int code : codes) {
            for (int[] size : sizes) {
                assertNothingWritten(randomBytes(16 * 16 * 4), size[0], size[1], 16 * 16 * 4, code);
            }
        }
    }

    @Test
    public void otherCodesDoNothing() {
        byte[] src = randomBytes(16 * 16 * 4);
        for (int code : new int[] {0, 4, 6, 13, 15, 21, 100, 102, 1000, 1002, -1, Integer.MIN_VALUE,
            Integer.MAX_VALUE}) {
            assertNothingWritten(src, 16, 16, src.length, code);
        }
    }

    @Test
    public void nullArraysAreAllowed() {
        byte[] bytes = randomBytes(16 * 16 * 4);
        byte[] before = bytes.clone();
        FaceLibrary.convertColorSpace(null, 16, 16, bytes, ColorConversion.NV21_TO_RGBA);
        FaceLibrary.convertColorSpace(bytes, 16, 16, null, ColorConversion.NV21_TO_RGBA);
        FaceLibrary.convertColorSpace(null, 16, 16, null, ColorConversion.NV21_TO_RGBA);
        assertArrayEquals(before, bytes);
    }

    @Test
    public void threadsMayConvertAtTheSameTime() throws InterruptedException {
        byte[] frame = randomBytes(640 * 480 * 3 / 2);
        byte[] expected = ColorReference.toPixels(frame, 640, 480, VU, RGBA);
        boolean[] right = new boolean[4];
        Thread[] threads = new Thread[right.length];
        for (int t = 0; t < threads.length; t++) {
            int mine = t;
            threads[t] = new Thread(() -> {
                boolean all = true;
                for (int i = 0; i < 8; i++) {
                    byte[] rgba = new byte[expected.length];
                    FaceLibrary.convertColorSpace(frame, 640, 480, rgba, ColorConversion.NV21_TO_RGBA);
                    all &= Arrays.equals(expected, rgba);
                }
                right[mine] = all;
            });
            threads[t].start();
        }
        for (int t = 0; t < threads.length; t++) {
            threads[t].join();
            assertTrue("thread " + t, right[t]);
        }
    }
}
