// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertTrue;
import static org.junit.Assert.fail;

import java.nio.ByteBuffer;
import java.util.Random;
import org.junit.Test;

/** Camera planes of every shape against a byte-by-byte copy. */
public final class CameraFrameTest {
    /** Where U and V lie in memory. */
    private enum Layout { SEPARATE, V_FIRST, U_FIRST }

    private static final class Planes {
        ByteBuffer y;
        ByteBuffer u;
        ByteBuffer v;
        int yStride;
        int chromaStride;
        int pixelStride;
    }

    private final Random random = new Random(7);

    private ByteBuffer buffer(int bytes, boolean direct) {
        byte[] content = new byte[bytes];
        random.nextBytes(content);
        ByteBuffer buffer = direct ? ByteBuffer.allocateDirect(bytes) : ByteBuffer.allocate(bytes);
        buffer.put(content);
        buffer.rewind();
        return buffer;
    }

    /** A view from {@code start} on of {@code length} bytes, keeping its position there. */
    private static ByteBuffer window(ByteBuffer whole, int start, int length) {
        ByteBuffer view = whole.duplicate();
        view.limit(start + length);
        view.position(start);
        return view;
    }

    private Planes planes(
            int width, int height, int padding, int pixelStride, Layout layout, boolean direct, int position) {
        Planes planes = new Planes();
        int rows = height / 2;
        planes.pixelStride = pixelStride;
        planes.yStride = width + padding;
        planes.y = window(buffer(position + planes.yStride * height, direct), position,
                planes.yStride * (height - 1) + width);
        int row = (width / 2 - 1) * pixelStride + 1;
        planes.chromaStride = row + (pixelStride == 2 && layout != Layout.SEPARATE ? 1 : 0) + padding;
        int plane = planes.chromaStride * (rows - 1) + row; // the last row ends with its last sample
        if (layout == Layout.SEPARATE) {
            planes.u = window(buffer(position + plane, direct), position, plane);
            planes.v = window(buffer(position + plane, direct), position, plane);
        } else {
            ByteBuffer pairs = buffer(position + plane + 1, direct);
            ByteBuffer first = window(pairs, position, plane);
            ByteBuffer second = window(pairs, position + 1, plane);
            planes.u = layout == Layout.U_FIRST ? first : second;
            planes.v = layout == Layout.U_FIRST ? second : first;
        }
        return planes;
    }

    private static byte[] expected(Planes planes, int width, int height, boolean vFirst) {
        byte[] frame = new byte[width * height * 3 / 2];
        for (int r = 0; r < height; r++) {
            for (int x = 0; x < width; x++) {
                frame[r * width + x] = planes.y.get(planes.y.position() + r * planes.yStride + x);
            }
        }
        for (int r = 0; r < height / 2; r++) {
            for (int k = 0; k < width / 2; k++) {
                int at = r * planes.chromaStride + k * planes.pixelStride;
                byte u = planes.u.get(planes.u.position() + at);
                byte v = planes.v.get(planes.v.position() + at);
                int pair = width * height + r * width + 2 * k;
                frame[pair] = vFirst ? v : u;
                frame[pair + 1] = vFirst ? u : v;
            }
        }
        return frame;
    }

    private static void fill(CameraFrame frame, Planes p, int width, int height, int rotation) {
        frame.fill(width, height, p.y, p.yStride, p.u, p.chromaStride, p.pixelStride, p.v, p.chromaStride,
                p.pixelStride, rotation);
    }

    @Test
    public void everyShapeGivesTheSameFrameAsAByteByByteCopy() {
        for (PixelFormat format : new PixelFormat[] {PixelFormat.NV21, PixelFormat.NV12}) {
            CameraFrame frame = new CameraFrame(format);
            assertSame(format, frame.format());
            everyShape(frame);
            assertSame(format, frame.format());
        }
    }

    private void everyShape(CameraFrame frame) {
        int[][] sizes = {{2, 2}, {4, 2}, {2, 6}, {6, 4}, {34, 10}, {64, 48}};
        for (int[] size : sizes) {
            int width = size[0];
            int height = size[1];
            for (int padding : new int[] {0, 1, 3, 16}) {
                for (int pixelStride : new int[] {1, 2, 3}) {
                    for (Layout layout : Layout.values()) {
                        if (pixelStride != 2 && layout != Layout.SEPARATE) {
                            continue;
                        }
                        for (int position : new int[] {0, 1, 5}) {
                            for (boolean direct : new boolean[] {false, true}) {
                                check(frame, width, height, padding, pixelStride, layout, position, direct);
                            }
                        }
                    }
                }
            }
        }
    }

    private void check(CameraFrame frame, int width, int height, int padding, int pixelStride, Layout layout,
            int position, boolean direct) {
        Planes planes = planes(width, height, padding, pixelStride, layout, direct, position);
        fill(frame, planes, width, height, 90);
        String what = width + "x" + height + "+" + padding + ", pixel stride " + pixelStride + ", " + layout
                + ", position " + position + (direct ? ", direct" : ", heap");
        boolean vFirst = frame.format() == PixelFormat.NV21;
        assertArrayEquals(what, expected(planes, width, height, vFirst), frame.data());
        assertEquals(what, position, planes.y.position());
        assertEquals(what, layout == Layout.V_FIRST ? position + 1 : position, planes.u.position());
        assertEquals(what, layout == Layout.U_FIRST ? position + 1 : position, planes.v.position());
        assertEquals(90, frame.rotationDegrees());
    }

    @Test
    public void planesThatAlternateButDifferAreNotTakenForOne() {
        Planes planes = planes(16, 8, 4, 2, Layout.V_FIRST, false, 0);
        // A copy of the U plane with one sample changed: the pairs in V's memory are no longer the frame's.
        ByteBuffer other = ByteBuffer.allocate(planes.u.remaining());
        other.put(planes.u.duplicate());
        other.put(other.capacity() - 1, (byte) (other.get(other.capacity() - 1) + 1));
        other.put(2, (byte) (other.get(2) ^ 0x55));
        other.rewind();
        planes.u = other;
        CameraFrame frame = new CameraFrame();
        fill(frame, planes, 16, 8, 0);
        assertEquals(PixelFormat.NV21, frame.format());
        assertArrayEquals(expected(planes, 16, 8, true), frame.data());
    }

    @Test
    public void whatChromaHoldsDecidesNothing() {
        for (PixelFormat format : new PixelFormat[] {PixelFormat.NV21, PixelFormat.NV12}) {
            for (Layout layout : Layout.values()) {
                for (boolean direct : new boolean[] {false, true}) {
                    Planes p = planes(16, 8, 4, 2, layout, direct, 3);
                    for (ByteBuffer chroma : new ByteBuffer[] {p.u, p.v}) {
                        for (int i = chroma.position(); i < chroma.limit(); i++) {
                            chroma.put(i, (byte) 77);
                        }
                    }
                    CameraFrame frame = new CameraFrame(format);
                    fill(frame, p, 16, 8, 0);
                    assertSame(format, frame.format());
                    assertArrayEquals(expected(p, 16, 8, format == PixelFormat.NV21), frame.data());
                }
            }
            ByteBuffer one = buffer(64, true); // U and V are one buffer: gray
            ByteBuffer y = buffer(16 * 8, true);
            CameraFrame frame = new CameraFrame(format);
            frame.fill(16, 8, y, 16, one, 16, 2, one, 16, 2, 0);
            for (int i = 0; i < 32; i++) {
                assertEquals(one.get(i / 8 * 16 + i % 8 * 2), frame.data()[16 * 8 + 2 * i]);
                assertEquals(one.get(i / 8 * 16 + i % 8 * 2), frame.data()[16 * 8 + 2 * i + 1]);
            }
        }
        refused("format", () -> new CameraFrame(PixelFormat.GRAY));
    }

    @Test
    public void sizesAreCheckedBeforeAnythingIsMade() {
        ByteBuffer few = ByteBuffer.allocate(16);
        refused("y must", () ->
                CameraFrame.fromPlanes(37836, 37836, few, 37836, few, 18918, 1, few, 18918, 1, 0, null));
        int most = Integer.MAX_VALUE - 1;
        refused("width x height", () ->
                CameraFrame.fromPlanes(most, most, few, most, few, most / 2, 1, few, most / 2, 1, 0, null));
        refused("width x height", () -> CameraFrame.of(new byte[6], PixelFormat.NV21, most, most, 0));
        refused("reuse.length", () -> CameraFrame.fromPlanes(2, 2, few, 2, few, 1, 1, few, 1, 1, 0, new byte[7]));
    }

    /** Planes in the very array that is to be filled: refused, or read before it is written. */
    @Test
    public void theArrayThatIsFilledIsNoPlane() {
        byte[] memory = new byte[16 * 8 * 3];
        random.nextBytes(memory);
        byte[] before = memory.clone();
        ByteBuffer far = buffer(16 * 8, false);
        ByteBuffer mine = ByteBuffer.wrap(memory);
        Runnable[] fills = {
            () -> CameraFrame.fromPlanes(16, 16, mine, 16, far, 8, 1, far, 8, 1, 0, memory),
            () -> CameraFrame.fromPlanes(16, 16, mine.slice(), 16, far, 8, 1, far, 8, 1, 0, memory),
            () -> CameraFrame.of(memory, PixelFormat.NV12, 16, 16, 0)
                    .fill(16, 16, mine, 16, mine, 8, 1, mine, 8, 1, 0),
        };
        for (Runnable fill : fills) {
            refused("y must not lie", fill);
            assertArrayEquals(before, memory);
        }
        ByteBuffer wide = buffer(16 * 16, true);
        refused("u must not lie", () ->
                CameraFrame.fromPlanes(16, 16, wide, 16, mine, 8, 1, far, 8, 1, 0, memory));
        refused("v must not lie", () ->
                CameraFrame.fromPlanes(16, 16, wide, 16, far, 8, 1, mine, 8, 1, 0, memory));
        assertArrayEquals(before, memory);

        // A view that does not say that it is one of the array.
        Planes p = new Planes();
        p.y = window(ByteBuffer.wrap(before), 100, 256);
        p.u = window(ByteBuffer.wrap(before), 9, 64);
        p.v = window(ByteBuffer.wrap(before), 300, 64);
        p.yStride = 16;
        p.chromaStride = 8;
        p.pixelStride = 1;
        byte[] want = expected(p, 16, 16, true);
        ByteBuffer hidden = mine.asReadOnlyBuffer();
        CameraFrame frame = CameraFrame.fromPlanes(16, 16, window(hidden, 100, 256), 16, window(hidden, 9, 64), 8, 1,
                window(hidden, 300, 64), 8, 1, 0, memory);
        assertSame(memory, frame.data());
        assertArrayEquals(want, memory);
    }

    @Test
    public void theArrayIsReused() {
        CameraFrame frame = new CameraFrame();
        fill(frame, planes(32, 16, 0, 2, Layout.V_FIRST, true, 0), 32, 16, 0);
        byte[] first = frame.data();
        fill(frame, planes(32, 16, 8, 1, Layout.SEPARATE, true, 0), 32, 16, 0);
        assertSame(first, frame.data());

        byte[] mine = new byte[32 * 16 * 3 / 2];
        Planes p = planes(32, 16, 8, 1, Layout.SEPARATE, false, 0);
        CameraFrame second = CameraFrame.fromPlanes(32, 16, p.y, p.yStride, p.u, p.chromaStride, 1, p.v,
                p.chromaStride, 1, 270, mine);
        assertSame(mine, second.data());
        assertEquals(32, second.width());
        assertEquals(16, second.height());
    }

    @Test
    public void whatDoesNotFitIsRefusedByNameAndChangesNothing() {
        CameraFrame frame = new CameraFrame();
        Planes good = planes(16, 8, 0, 1, Layout.SEPARATE, false, 0);
        fill(frame, good, 16, 8, 0);
        byte[] before = frame.data().clone();
        Planes p = planes(16, 8, 0, 1, Layout.SEPARATE, false, 0);
        refused("width", () -> fill(frame, p, 15, 8, 0));
        refused("width", () -> fill(frame, p, 0, 8, 0));
        refused("height", () -> fill(frame, p, 16, -8, 0));
        refused("height", () -> fill(frame, p, 16, 7, 0));
        refused("width x height", () -> fill(frame, p, 65534, 65534, 0));
        refused("rotationDegrees", () -> fill(frame, p, 16, 8, 45));
        refused("yRowStride", () -> frame.fill(16, 8, p.y, 15, p.u, 8, 1, p.v, 8, 1, 0));
        refused("uRowStride", () -> frame.fill(16, 8, p.y, 16, p.u, 7, 1, p.v, 8, 1, 0));
        refused("vRowStride", () -> frame.fill(16, 8, p.y, 16, p.u, 8, 1, p.v, -8, 1, 0));
        refused("uPixelStride", () -> frame.fill(16, 8, p.y, 16, p.u, 8, 0, p.v, 8, 1, 0));
        refused("vPixelStride", () -> frame.fill(16, 8, p.y, 16, p.u, 8, 1, p.v, 8, -1, 0));
        refused("y must", () -> frame.fill(16, 8, p.y, 17, p.u, 8, 1, p.v, 8, 1, 0));
        refused("u must", () -> frame.fill(16, 8, p.y, 16, p.u, Integer.MAX_VALUE, 1, p.v, 8, 1, 0));
        refused("v must", () -> frame.fill(16, 8, p.y, 16, p.u, 8, 1, p.v, 15, 2, 0));
        try {
            frame.fill(16, 8, p.y, 16, p.u, 8, 1, null, 8, 1, 0);
            fail("a null plane was taken");
        } catch (NullPointerException right) {
            assertEquals("v is null", right.getMessage());
        }
        assertArrayEquals(before, frame.data());
    }

    @Test
    public void aPackedFrameIsTakenAsItIs() {
        byte[] data = new byte[8 * 4 * 3 / 2];
        CameraFrame frame = CameraFrame.of(data, PixelFormat.NV12, 8, 4, 180);
        assertSame(data, frame.data());
        assertSame(PixelFormat.NV12, frame.format());
        refused("format", () -> CameraFrame.of(data, PixelFormat.RGBA, 8, 4, 0));
        refused("data.length", () -> CameraFrame.of(data, PixelFormat.NV21, 8, 6, 0));
        refused("rotationDegrees", () -> CameraFrame.of(data, PixelFormat.NV21, 8, 4, -90));
    }

    static void refused(String argument, Runnable call) {
        try {
            call.run();
        } catch (IllegalArgumentException right) {
            assertTrue(right.getMessage() + " should begin with " + argument, right.getMessage().startsWith(argument));
            return;
        }
        fail("taken, with a bad " + argument);
    }
}
