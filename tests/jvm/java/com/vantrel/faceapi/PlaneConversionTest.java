// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;
import static org.junit.Assert.fail;

import android.graphics.Bitmap;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.Arrays;
import java.util.Random;
import org.junit.Test;

/** Planes and results in every kind of Java's memory; what native code makes of the pixels has tests of its own. */
public final class PlaneConversionTest {
    private static final int WIDTH = 10;
    private static final int HEIGHT = 6;
    private static final int PADDING = 3;
    private static final int OVERLAP = 8;
    private static final int OUTPUT = 7;
    private static final int MEMORY = 16;
    private static final int NO_PIXELS = 17;
    private static final int NOT_RGBA = 18;
    private static final int SMALL = 19;

    private final Random random = new Random(11);
    private final int[] numbers = new int[PlaneConversion.NUMBERS];
    private ByteBuffer y;
    private ByteBuffer u;
    private ByteBuffer v;

    private byte[] bytes(int length) {
        byte[] bytes = new byte[length];
        random.nextBytes(bytes);
        return bytes;
    }

    private static ByteBuffer direct(byte[] bytes) {
        ByteBuffer buffer = ByteBuffer.allocateDirect(bytes.length);
        buffer.put(bytes);
        buffer.rewind();
        return buffer;
    }

    private static ByteBuffer window(ByteBuffer whole, int from, int to) {
        ByteBuffer view = whole.duplicate();
        view.limit(to);
        view.position(from);
        return view;
    }

    /** Planes of their own, each from {@code before} on in a longer buffer and with nothing behind the last sample. */
    private void setPlanes(boolean yIsDirect, boolean uIsDirect, boolean vIsDirect, int before) {
        int lumaBytes = (WIDTH + PADDING) * (HEIGHT - 1) + WIDTH;
        int chromaBytes = (WIDTH / 2 + PADDING) * (HEIGHT / 2 - 1) + WIDTH / 2;
        y = plane(lumaBytes, yIsDirect, before);
        u = plane(chromaBytes, uIsDirect, before);
        v = plane(chromaBytes, vIsDirect, before);
        PlaneConversion.describe(numbers, WIDTH, HEIGHT, y, WIDTH + PADDING, u, WIDTH / 2 + PADDING, 1, v,
                WIDTH / 2 + PADDING, 1);
    }

    private ByteBuffer plane(int length, boolean isDirect, int before) {
        byte[] content = bytes(before + length + 2);
        // The slice's array begins before it.
        ByteBuffer whole = isDirect ? direct(content) : window(ByteBuffer.wrap(content), 1, content.length).slice();
        int from = isDirect ? before : before - 1;
        return window(whole, from, from + length);
    }

    /** The picture as NV21, sample by sample. */
    private byte[] packed() {
        byte[] frame = new byte[WIDTH * HEIGHT * 3 / 2];
        for (int row = 0; row < HEIGHT; row++) {
            for (int column = 0; column < WIDTH; column++) {
                frame[row * WIDTH + column] = y.get(y.position() + row * (WIDTH + PADDING) + column);
            }
        }
        for (int row = 0; row < HEIGHT / 2; row++) {
            for (int column = 0; column < WIDTH / 2; column++) {
                int at = row * (WIDTH / 2 + PADDING) + column;
                int pair = WIDTH * HEIGHT + row * WIDTH + 2 * column;
                frame[pair] = v.get(v.position() + at);
                frame[pair + 1] = u.get(u.position() + at);
            }
        }
        return frame;
    }

    private byte[] upright(int conversion, int bytesPerPixel) {
        byte[] pixels = new byte[WIDTH * HEIGHT * bytesPerPixel];
        FaceLibrary.convertColorSpace(packed(), WIDTH, HEIGHT, pixels, conversion);
        return pixels;
    }

    private Object memory(ByteBuffer plane) {
        return PlaneConversion.memory(plane);
    }

    private int toBytes(byte[] out, int layout, int from, int stride) {
        return PlaneConversion.toBytes(memory(y), memory(u), memory(v), numbers, 0, 0, WIDTH, HEIGHT, 0, false, layout,
                out, from, stride);
    }

    private int toBitmap(Bitmap out, int degrees) {
        try {
            PlaneConversion.convert(
                    memory(y), memory(u), memory(v), numbers, 0, 0, WIDTH, HEIGHT, degrees, false, out);
            return PlaneConversion.SUCCESS;
        } catch (IllegalArgumentException refused) {
            for (int status : new int[] {MEMORY, NO_PIXELS, NOT_RGBA, SMALL}) {
                try {
                    PlaneConversion.check(status);
                } catch (IllegalArgumentException expected) {
                    if (expected.getMessage().equals(refused.getMessage())) {
                        return status;
                    }
                }
            }
            throw refused;
        }
    }

    @Test
    public void planesInEveryKindOfMemoryGiveTheSamePixels() {
        for (int kinds = 0; kinds < 8; kinds++) {
            for (int before : new int[] {1, 4}) {
                setPlanes((kinds & 1) != 0, (kinds & 2) != 0, (kinds & 4) != 0, before);
                byte[] pixels = new byte[WIDTH * HEIGHT * 4];
                assertEquals(PlaneConversion.SUCCESS, toBytes(pixels, PlaneConversion.RGBA, 0, WIDTH * 4));
                assertArrayEquals(upright(ColorConversion.NV21_TO_RGBA, 4), pixels);
                byte[] frame = new byte[WIDTH * HEIGHT * 3 / 2];
                assertEquals(PlaneConversion.SUCCESS, toBytes(frame, PlaneConversion.NV21, 0, WIDTH));
                assertArrayEquals(packed(), frame);
            }
        }
    }

    @Test
    public void pairsInOneArrayAreOnePlane() {
        for (boolean direct : new boolean[] {false, true}) {
            setPlanes(true, true, true, 1);
            byte[] frame = packed();
            ByteBuffer whole = direct ? direct(frame) : ByteBuffer.wrap(frame);
            int luma = WIDTH * HEIGHT;
            y = window(whole, 0, luma);
            v = window(whole, luma, frame.length - 1);
            u = window(whole, luma + 1, frame.length);
            PlaneConversion.describe(numbers, WIDTH, HEIGHT, y, WIDTH, u, WIDTH, 2, v, WIDTH, 2);
            byte[] out = new byte[frame.length];
            assertEquals(PlaneConversion.SUCCESS, toBytes(out, PlaneConversion.NV21, 0, WIDTH));
            assertArrayEquals(frame, out);
        }
    }

    @Test
    public void packedFramesAreReadWhereTheyAre() {
        setPlanes(true, true, true, 1);
        byte[] nv21 = packed();
        byte[] want = upright(ColorConversion.NV21_TO_RGBA, 4);
        byte[] out = new byte[want.length];
        PlaneConversion.describe(numbers, WIDTH, HEIGHT, nv21.length, true);
        assertEquals(PlaneConversion.SUCCESS, PlaneConversion.toBytes(nv21, nv21, nv21, numbers, 0, 0, WIDTH, HEIGHT, 0,
                false, PlaneConversion.RGBA, out, 0, WIDTH * 4));
        assertArrayEquals(want, out);

        byte[] nv12 = nv21.clone();
        for (int pair = WIDTH * HEIGHT; pair < nv12.length; pair += 2) {
            nv12[pair] = nv21[pair + 1];
            nv12[pair + 1] = nv21[pair];
        }
        PlaneConversion.describe(numbers, WIDTH, HEIGHT, nv12.length, false);
        Arrays.fill(out, (byte) 0);
        assertEquals(PlaneConversion.SUCCESS, PlaneConversion.toBytes(nv12, nv12, nv12, numbers, 0, 0, WIDTH, HEIGHT, 0,
                false, PlaneConversion.RGBA, out, 0, WIDTH * 4));
        assertArrayEquals(want, out);
        assertEquals(OVERLAP, PlaneConversion.toBytes(nv12, nv12, nv12, numbers, 0, 0, WIDTH, HEIGHT, 0, false,
                PlaneConversion.GRAY, nv12, 0, WIDTH));
    }

    @Test
    public void resultsGoWhereTheyAreSentAndNowhereElse() {
        setPlanes(true, false, true, 2);
        byte[] pixels = upright(ColorConversion.NV21_TO_BGRA, 4);
        int stride = WIDTH + 2;
        int from = 5;
        int length = from + stride * (HEIGHT - 1) + WIDTH;

        int[] ints = new int[length];
        Arrays.fill(ints, 77);
        int[] wantInts = ints.clone();
        byte[] strided = new byte[4 * length];
        Arrays.fill(strided, (byte) 77);
        byte[] want = strided.clone();
        ByteBuffer pixelWords = ByteBuffer.wrap(pixels).order(ByteOrder.nativeOrder());
        for (int row = 0; row < HEIGHT; row++) {
            for (int column = 0; column < WIDTH; column++) {
                wantInts[from + row * stride + column] = pixelWords.getInt(4 * (row * WIDTH + column));
            }
            System.arraycopy(pixels, 4 * WIDTH * row, want, 4 * (from + row * stride), 4 * WIDTH);
        }
        assertEquals(PlaneConversion.SUCCESS, PlaneConversion.toInts(memory(y), memory(u), memory(v), numbers, 0, 0,
                WIDTH, HEIGHT, 0, false, PlaneConversion.BGRA, ints, from, stride));
        assertArrayEquals(wantInts, ints);

        assertEquals(PlaneConversion.SUCCESS, toBytes(strided, PlaneConversion.BGRA, 4 * from, 4 * stride));
        assertArrayEquals(want, strided);

        byte[] filling = new byte[want.length + 3];
        Arrays.fill(filling, (byte) 77);
        ByteBuffer buffer = direct(filling);
        assertEquals(PlaneConversion.SUCCESS, PlaneConversion.toBuffer(memory(y), memory(u), memory(v), numbers, 0, 0,
                WIDTH, HEIGHT, 0, false, PlaneConversion.BGRA, buffer, 4 * from, want.length, 4 * stride));
        byte[] content = new byte[filling.length];
        buffer.get(content);
        assertArrayEquals(Arrays.copyOf(want, want.length), Arrays.copyOf(content, want.length));
        assertArrayEquals(new byte[] {77, 77, 77}, Arrays.copyOfRange(content, want.length, content.length));
    }

    @Test
    public void aPartIsTurnedAndMirrored() {
        setPlanes(true, true, true, 1);
        byte[] frame = packed();
        // Columns 2 to 7 and rows 2 to 5, turned by 90 degrees and mirrored: columns become rows, in their order.
        byte[] gray = new byte[24];
        assertEquals(PlaneConversion.SUCCESS, PlaneConversion.toBytes(memory(y), memory(u), memory(v), numbers, 3, 3,
                4, 2, 90, true, PlaneConversion.GRAY, gray, 0, 4));
        for (int row = 0; row < 6; row++) {
            for (int column = 0; column < 4; column++) {
                assertEquals(frame[(2 + column) * WIDTH + 2 + row], gray[row * 4 + column]);
            }
        }
    }

    private static byte[] pixelsOf(Bitmap bitmap) {
        byte[] pixels = new byte[bitmap.getRowBytes() * bitmap.getHeight()];
        bitmap.copyPixelsToBuffer(ByteBuffer.wrap(pixels));
        return pixels;
    }

    @Test
    public void bitmapsAreWrittenWithTheirStride() {
        setPlanes(true, false, false, 1);
        byte[] want = upright(ColorConversion.NV21_TO_RGBA, 4);
        for (int rowBytes : new int[] {4 * WIDTH, 4 * WIDTH + 8, 4 * (WIDTH + 1) + 8}) {
            for (int[] more : new int[][] {{0, 0}, {1, 2}}) {
                if (rowBytes < 4 * (WIDTH + more[0])) {
                    continue;
                }
                Bitmap bitmap = Bitmap.createBitmap(
                        WIDTH + more[0], HEIGHT + more[1], Bitmap.Config.ARGB_8888, rowBytes);
                byte[] expected = new byte[rowBytes * (HEIGHT + more[1])];
                for (int row = 0; row < HEIGHT; row++) {
                    System.arraycopy(want, row * 4 * WIDTH, expected, row * rowBytes, 4 * WIDTH);
                }
                assertEquals(PlaneConversion.SUCCESS, toBitmap(bitmap, 0));
                assertArrayEquals(expected, pixelsOf(bitmap));
                assertEquals(0, bitmap.getLockCount());
            }
        }
    }

    @Test
    public void bitmapsThatCannotTakeTheResultStayAsTheyAre() {
        setPlanes(true, true, true, 1);
        for (Bitmap small : new Bitmap[] {
            Bitmap.createBitmap(WIDTH - 1, HEIGHT, Bitmap.Config.ARGB_8888),
            Bitmap.createBitmap(WIDTH, HEIGHT - 1, Bitmap.Config.ARGB_8888),
        }) {
            assertEquals(SMALL, toBitmap(small, 0));
            assertArrayEquals(new byte[small.getRowBytes() * small.getHeight()], pixelsOf(small));
            assertEquals(0, small.getLockCount());
        }
        // It would hold the picture, but not the turned one.
        assertEquals(SMALL, toBitmap(Bitmap.createBitmap(WIDTH, HEIGHT, Bitmap.Config.ARGB_8888), 90));

        Bitmap other = Bitmap.createBitmap(WIDTH, HEIGHT, Bitmap.Config.RGB_565);
        assertEquals(NOT_RGBA, toBitmap(other, 0));
        assertArrayEquals(new byte[other.getRowBytes() * HEIGHT], pixelsOf(other));

        Bitmap recycled = Bitmap.createBitmap(WIDTH, HEIGHT, Bitmap.Config.ARGB_8888);
        recycled.recycle();
        assertEquals(NO_PIXELS, toBitmap(recycled, 0));

        Bitmap immutable = Bitmap.createBitmap(WIDTH, HEIGHT, Bitmap.Config.ARGB_8888).copy(
                Bitmap.Config.ARGB_8888, false);
        try {
            toBitmap(immutable, 0);
            fail("written");
        } catch (IllegalArgumentException expected) {
            assertEquals("bitmap is immutable", expected.getMessage());
        }
        assertArrayEquals(new byte[immutable.getRowBytes() * HEIGHT], pixelsOf(immutable));
    }

    @Test
    public void numbersThatDoNotFitTheMemoryAreRefused() {
        for (boolean direct : new boolean[] {false, true}) {
            for (int plane = 0; plane < 3; plane++) {
                int at = 2 + 4 * plane;
                int[][] wrong = {{-1, 5}, {6, 5}, {0, Integer.MAX_VALUE}, {Integer.MIN_VALUE, Integer.MIN_VALUE}};
                for (int[] range : wrong) {
                    setPlanes(direct, direct, direct, 1);
                    numbers[at] = range[0];
                    numbers[at + 1] = range[1];
                    expectRefusal(MEMORY);
                }
                // One byte more than the memory has, and one less than the picture takes.
                setPlanes(direct, direct, direct, 1);
                ByteBuffer buffer = plane == 0 ? y : plane == 1 ? u : v;
                numbers[at + 1] = (direct ? buffer.capacity() : buffer.array().length) + 1;
                expectRefusal(MEMORY);
                setPlanes(direct, direct, direct, 1);
                numbers[at + 1]--;
                expectRefusal(plane == 0 ? 2 : 3);
            }
        }
    }

    private void expectRefusal(int status) {
        byte[] out = new byte[WIDTH * HEIGHT * 4];
        assertEquals(status, toBytes(out, PlaneConversion.RGBA, 0, WIDTH * 4));
        assertArrayEquals(new byte[out.length], out);
        try {
            PlaneConversion.check(status);
            fail("not thrown");
        } catch (IllegalArgumentException expected) {
            assertTrue(expected.getMessage().length() > 10);
        }
    }

    @Test
    public void nullsAndOutputsThatAreTooShortAreRefused() {
        setPlanes(false, true, false, 1);
        byte[] out = new byte[WIDTH * HEIGHT * 4];
        int[] ints = new int[WIDTH * HEIGHT];
        Object[] planes = {memory(y), memory(u), memory(v)};
        for (int missing = 0; missing < 3; missing++) {
            Object[] some = planes.clone();
            some[missing] = null;
            assertEquals(MEMORY, PlaneConversion.toBytes(some[0], some[1], some[2], numbers, 0, 0, WIDTH, HEIGHT, 0,
                    false, PlaneConversion.RGBA, out, 0, WIDTH * 4));
        }
        for (int[] bad : new int[][] {null, new int[PlaneConversion.NUMBERS - 1]}) {
            assertEquals(MEMORY, PlaneConversion.toBytes(planes[0], planes[1], planes[2], bad, 0, 0, WIDTH, HEIGHT, 0,
                    false, PlaneConversion.RGBA, out, 0, WIDTH * 4));
        }
        assertEquals(MEMORY, toBytes(null, PlaneConversion.RGBA, 0, WIDTH * 4));
        assertEquals(MEMORY, toBytes(out, PlaneConversion.RGBA, -1, WIDTH * 4));
        assertEquals(MEMORY, toBytes(out, PlaneConversion.RGBA, out.length + 1, WIDTH * 4));
        assertEquals(OUTPUT, toBytes(out, PlaneConversion.RGBA, 1, WIDTH * 4));
        assertEquals(OUTPUT, toBytes(out, PlaneConversion.RGBA, 0, WIDTH * 4 - 1));
        assertEquals(OUTPUT, toBytes(out, PlaneConversion.RGBA, 0, Integer.MIN_VALUE));
        assertEquals(OUTPUT, PlaneConversion.toInts(planes[0], planes[1], planes[2], numbers, 0, 0, WIDTH, HEIGHT, 0,
                false, PlaneConversion.RGBA, ints, 1, WIDTH));
        assertArrayEquals(new byte[out.length], out);
        assertArrayEquals(new int[ints.length], ints);

        ByteBuffer buffer = ByteBuffer.allocateDirect(out.length);
        int[][] ranges = {{-1, 100}, {0, out.length + 1}, {100, 99}};
        for (int[] range : ranges) {
            assertEquals(MEMORY, PlaneConversion.toBuffer(planes[0], planes[1], planes[2], numbers, 0, 0, WIDTH,
                    HEIGHT, 0, false, PlaneConversion.RGBA, buffer, range[0], range[1], WIDTH * 4));
        }
        assertEquals(OUTPUT, PlaneConversion.toBuffer(planes[0], planes[1], planes[2], numbers, 0, 0, WIDTH, HEIGHT, 0,
                false, PlaneConversion.RGBA, buffer, 0, out.length - 1, WIDTH * 4));
        assertEquals(MEMORY, PlaneConversion.toBuffer(planes[0], planes[1], planes[2], numbers, 0, 0, WIDTH, HEIGHT, 0,
                false, PlaneConversion.RGBA, null, 0, out.length, WIDTH * 4));
        for (int at = 0; at < out.length; at++) {
            assertEquals(0, buffer.get(at));
        }
    }

    @Test
    public void everyStatusButSuccessIsThrown() {
        PlaneConversion.check(PlaneConversion.SUCCESS);
        for (int status = 1; status < 25; status++) {
            try {
                PlaneConversion.check(status);
                fail("status " + status);
            } catch (IllegalArgumentException | IllegalStateException expected) {
                assertTrue(expected.getMessage().length() > 10);
            }
        }
    }

    @Test
    public void readOnlyArraysMustBeCopied() {
        assertTrue(PlaneConversion.isReadable(ByteBuffer.allocate(1)));
        assertTrue(PlaneConversion.isReadable(ByteBuffer.allocateDirect(1).asReadOnlyBuffer()));
        assertTrue(!PlaneConversion.isReadable(ByteBuffer.allocate(1).asReadOnlyBuffer()));
    }
}
