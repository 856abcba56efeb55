package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;

import android.graphics.Bitmap;
import java.util.Arrays;
import java.util.Random;
import org.junit.Test;

public class BitmapTest {
    private static final byte UNTOUCHED = 0x5A;

    private final Random random = new Random(77);

    private Bitmap randomBitmap(int width, int height, int rowBytes) {
        Bitmap bitmap = Bitmap.createBitmap(width, height, Bitmap.Config.ARGB_8888, rowBytes);
        for (int y = 0; y < height; y++) {
            for (int x = 0; x < width; x++) {
                bitmap.setPixel(x, y, random.nextInt());
            }
        }
        return bitmap;
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
                int argb = bitmap.getPixel(i % width, i / width);
                expected[4 * i] = (byte) argb;
                expected[4 * i + 1] = (byte) (argb >> 8);
                expected[4 * i + 2] = (byte) (argb >> 16);
                expected[4 * i + 3] = (byte) (argb >> 24);
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
                int argb = bitmap.getPixel(i % width, i / width);
                expected[3 * i] = (byte) argb;
                expected[3 * i + 1] = (byte) (argb >> 8);
                expected[3 * i + 2] = (byte) (argb >> 16);
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
            int argb = x < width ? bitmap.getPixel(x, i / (width + 2)) : 0; // the padding is zero
            assertEquals("pixel " + i, (byte) argb, out[4 * i]);
            assertEquals("pixel " + i, (byte) (argb >> 16), out[4 * i + 2]);
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
