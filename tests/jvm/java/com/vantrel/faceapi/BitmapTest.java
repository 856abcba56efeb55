// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;

import android.graphics.Bitmap;
import java.nio.ByteBuffer;
import java.util.Arrays;
import java.util.Random;
import org.junit.Test;

public class BitmapTest {
    private static final byte UNTOUCHED = 0x5A;

    private final Random random = new Random(77);

    private Bitmap randomBitmap(int width, int height, int rowBytes) {
        Bitmap bitmap = Bitmap.createBitmap(width, height, Bitmap.Config.ARGB_8888, rowBytes);
        // Any bytes, also colours that are larger than their alpha; the padding stays zero.
        byte[] bytes = new byte[rowBytes * height];
        for (int i = 0; i < 4 * width * height; i++) {
            bytes[i / (4 * width) * rowBytes + i % (4 * width)] = (byte) random.nextInt();
        }
        bitmap.copyPixelsFromBuffer(ByteBuffer.wrap(bytes));
        return bitmap;
    }

    /** The bytes of a pixel, from red to alpha, as they lie in memory. */
    private static byte[] pixel(Bitmap bitmap, int x, int y) {
        ByteBuffer bytes = ByteBuffer.allocate(bitmap.getByteCount());
        bitmap.copyPixelsToBuffer(bytes);
        int at = y * bitmap.getRowBytes() + 4 * x;
        return Arrays.copyOfRange(bytes.array(), at, at + 4);
    }

    private static byte[] untouched(int length) {
        byte[] out = new byte[length];
        Arrays.fill(out, UNTOUCHED);
        return out;
    }

    @Test
    public void bgraPixels() {
        for (int width = 1; width <= 40; width++) {
            Bitmap bitmap = randomBitmap(width, 3, 4 * width);
            byte[] expected = untouched(4 * width * 3 + 16);
            for (int i = 0; i < width * 3; i++) {
                byte[] rgba = pixel(bitmap, i % width, i / width);
                expected[4 * i] = rgba[2];
                expected[4 * i + 1] = rgba[1];
                expected[4 * i + 2] = rgba[0];
                expected[4 * i + 3] = rgba[3];
            }
            byte[] out = untouched(expected.length);
            FaceLibrary.getBGRADataFromBitmap(bitmap, out);
            assertArrayEquals("width " + width, expected, out);
            assertEquals(0, bitmap.getLockCount());
        }
    }

    @Test
    public void bgrPixels() {
        for (int width = 1; width <= 40; width++) {
            Bitmap bitmap = randomBitmap(width, 3, 4 * width);
            byte[] expected = untouched(3 * width * 3 + 16);
            for (int i = 0; i < width * 3; i++) {
                byte[] rgba = pixel(bitmap, i % width, i / width);
                expected[3 * i] = rgba[2];
                expected[3 * i + 1] = rgba[1];
                expected[3 * i + 2] = rgba[0];
            }
            byte[] out = untouched(expected.length);
            FaceLibrary.getBGRDataFromBitmap(bitmap, out);
            assertArrayEquals("width " + width, expected, out);
            assertEquals(0, bitmap.getLockCount());
        }
    }

    @Test
    public void aRowStrideIsNotHonoured() {
        int width = 10;
        int height = 6;
        int rowBytes = 4 * width + 8; // two pixels more
        Bitmap bitmap = randomBitmap(width, height, rowBytes);
        byte[] out = untouched(4 * width * height);
        FaceLibrary.getBGRADataFromBitmap(bitmap, out);
        for (int i = 0; i < width * height; i++) {
            int x = i % (width + 2);
            byte[] rgba = x < width ? pixel(bitmap, x, i / (width + 2)) : new byte[4]; // the padding is zero
            assertEquals("pixel " + i, rgba[2], out[4 * i]);
            assertEquals("pixel " + i, rgba[0], out[4 * i + 2]);
        }
    }

    @Test
    public void otherFormatsAreRefused() {
        Bitmap bitmap = Bitmap.createBitmap(4, 4, Bitmap.Config.RGB_565);
        byte[] out = untouched(64);
        FaceLibrary.getBGRADataFromBitmap(bitmap, out);
        FaceLibrary.getBGRDataFromBitmap(bitmap, out);
        assertArrayEquals(untouched(64), out);
        assertEquals(0, bitmap.getLockCount());
    }

    @Test
    public void nullBitmapsAreAllowed() {
        byte[] out = untouched(64);
        FaceLibrary.getBGRADataFromBitmap(null, out);
        FaceLibrary.getBGRDataFromBitmap(null, out);
        assertArrayEquals(untouched(64), out);
    }

    @Test
    public void aRecycledBitmapGivesNothing() {
        Bitmap bitmap = randomBitmap(4, 4, 16);
        bitmap.recycle();
        byte[] out = untouched(64);
        FaceLibrary.getBGRADataFromBitmap(bitmap, out);
        FaceLibrary.getBGRDataFromBitmap(bitmap, out);
        assertArrayEquals(untouched(64), out);
    }
}
