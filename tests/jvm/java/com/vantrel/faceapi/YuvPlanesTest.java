// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertThrows;

import android.media.Image;
import com.vantrel.faceapi.YuvPlanes.Plane;
import java.nio.ByteBuffer;
import org.junit.Test;
import org.junit.function.ThrowingRunnable;

/** Which planes are taken, and what is said of those that are not. */
public final class YuvPlanesTest {
    private static ByteBuffer bytes(int size) {
        return ByteBuffer.allocateDirect(size);
    }

    private static void refuses(String message, ThrowingRunnable call) {
        assertEquals(message, assertThrows(IllegalArgumentException.class, call).getMessage());
    }

    private static void isNull(String name, ThrowingRunnable call) {
        assertEquals(name + " is null", assertThrows(NullPointerException.class, call).getMessage());
    }

    /** An image as a camera's reader hands it out. */
    static final class CameraImage extends Image {
        private final int format;
        private final int width;
        private final int height;
        private final Plane[] planes;
        private boolean closed;

        CameraImage(int format, int width, int height, Plane... planes) {
            this.format = format;
            this.width = width;
            this.height = height;
            this.planes = planes;
        }

        private <T> T open(T value) {
            if (closed) {
                throw new IllegalStateException("Image is already closed");
            }
            return value;
        }

        @Override
        public int getFormat() {
            return open(format);
        }

        @Override
        public int getWidth() {
            return open(width);
        }

        @Override
        public int getHeight() {
            return open(height);
        }

        @Override
        public long getTimestamp() {
            return open(0L);
        }

        @Override
        public Plane[] getPlanes() {
            return open(planes);
        }

        @Override
        public void close() {
            closed = true;
        }
    }

    static Image.Plane imagePlane(ByteBuffer buffer, int rowStride, int pixelStride) {
        return new Image.Plane() {
            @Override
            public int getRowStride() {
                return rowStride;
            }

            @Override
            public int getPixelStride() {
                return pixelStride;
            }

            @Override
            public ByteBuffer getBuffer() {
                return buffer;
            }
        };
    }

    /** The planes of YUV_420_888, as many bytes as they need and no more. */
    private static CameraImage image(int format) {
        return new CameraImage(format, 6, 4, imagePlane(bytes(8 * 3 + 6), 8, 1), imagePlane(bytes(7 + 5), 7, 2),
                imagePlane(bytes(4 + 3), 4, 1));
    }

    @Test
    public void anImageIsTakenAsItIs() {
        CameraImage image = image(35);
        YuvPlanes planes = YuvPlanes.of(image);
        planes.checkSet();
        assertEquals(6, planes.width());
        assertEquals(4, planes.height());
        assertSame(image.planes[0].getBuffer(), planes.yMemory());
        assertSame(image.planes[1].getBuffer(), planes.uMemory());
        assertSame(image.planes[2].getBuffer(), planes.vMemory());
        int[] expected = new int[PlaneConversion.NUMBERS];
        PlaneConversion.describe(expected, 6, 4, image.planes[0].getBuffer(), 8, image.planes[1].getBuffer(), 7, 2,
                image.planes[2].getBuffer(), 4, 1);
        assertArrayEquals(expected, planes.described());
    }

    @Test
    public void imagesThatDoNotFitAreRefused() {
        refuses("image's format must be YUV_420_888 (35), not 256", () -> YuvPlanes.of(image(256)));
        refuses("image's number of planes must be 3, not 1",
                () -> YuvPlanes.of(new CameraImage(35, 6, 4, imagePlane(bytes(24), 6, 1))));
        assertThrows(NullPointerException.class, () -> YuvPlanes.of(null));
        CameraImage closed = image(35);
        closed.close();
        assertThrows(IllegalStateException.class, () -> YuvPlanes.of(closed));
    }

    @Test
    public void buffersAndStridesAreTakenAsTheyAre() {
        ByteBuffer y = ByteBuffer.wrap(new byte[10 + 8 * 3 + 6]);
        y.position(10);
        ByteBuffer u = bytes(4 * 1 + 3);
        ByteBuffer v = bytes(9 * 1 + 5);
        YuvPlanes planes = YuvPlanes.of(6, 4, new Plane(y, 8, 1), new Plane(u, 4, 1), new Plane(v, 9, 2));
        planes.checkSet();
        assertSame(y.array(), planes.yMemory());
        assertSame(u, planes.uMemory());
        assertSame(v, planes.vMemory());
        assertEquals(10, y.position());
        int[] expected = new int[PlaneConversion.NUMBERS];
        PlaneConversion.describe(expected, 6, 4, y, 8, u, 4, 1, v, 9, 2);
        assertArrayEquals(expected, planes.described());
    }

    @Test
    public void planesThatDoNotFitAreRefused() {
        Plane y = new Plane(bytes(24), 6, 1);
        Plane u = new Plane(bytes(6), 3, 1);
        Plane v = new Plane(bytes(6), 3, 1);
        YuvPlanes.of(6, 4, y, u, v);
        refuses("width must be even and above 0, not 5", () -> YuvPlanes.of(5, 4, y, u, v));
        refuses("width must be even and above 0, not 0", () -> YuvPlanes.of(0, 4, y, u, v));
        refuses("height must be even and above 0, not -4", () -> YuvPlanes.of(6, -4, y, u, v));
        refuses("y's pixel stride must be 1, not 2", () -> YuvPlanes.of(6, 4, new Plane(bytes(99), 16, 2), u, v));
        refuses("y's row stride must be at least 6 (a row of 6 samples), not 5",
                () -> YuvPlanes.of(6, 4, new Plane(bytes(99), 5, 1), u, v));
        refuses("y must have at least 24 bytes from its position on, not 23",
                () -> YuvPlanes.of(6, 4, new Plane(bytes(23), 6, 1), u, v));
        refuses("u's pixel stride must be 1 or 2, not 3", () -> YuvPlanes.of(6, 4, y, new Plane(bytes(99), 9, 3), v));
        refuses("u's pixel stride must be 1 or 2, not 0", () -> YuvPlanes.of(6, 4, y, new Plane(bytes(99), 9, 0), v));
        refuses("u's row stride must be at least 5 (a row of 3 samples), not 4",
                () -> YuvPlanes.of(6, 4, y, new Plane(bytes(99), 4, 2), v));
        refuses("v's row stride must be at least 3 (a row of 3 samples), not -8",
                () -> YuvPlanes.of(6, 4, y, u, new Plane(bytes(99), -8, 1)));
        ByteBuffer late = bytes(6);
        late.position(1);
        refuses("v must have at least 6 bytes from its position on, not 5",
                () -> YuvPlanes.of(6, 4, y, u, new Plane(late, 3, 1)));
        refuses("u must be a direct buffer or show its array",
                () -> YuvPlanes.of(6, 4, y, new Plane(ByteBuffer.allocate(6).asReadOnlyBuffer(), 3, 1), v));
        YuvPlanes.of(6, 4, y, new Plane(bytes(6).asReadOnlyBuffer(), 3, 1), v);
        assertThrows(NullPointerException.class, () -> new Plane(null, 3, 1));
        isNull("y", () -> YuvPlanes.of(6, 4, null, u, v));
        isNull("u", () -> YuvPlanes.of(6, 4, y, null, v));
        isNull("v", () -> YuvPlanes.of(6, 4, y, u, null));
        ByteBuffer whole = bytes(99);
        isNull("y", () -> new YuvPlanes().set(6, 4, null, 6, 1, whole, 3, 1, whole, 3, 1));
        isNull("u", () -> new YuvPlanes().set(6, 4, whole, 6, 1, null, 3, 1, whole, 3, 1));
        isNull("v", () -> new YuvPlanes().set(6, 4, whole, 6, 1, whole, 3, 1, null, 3, 1));
    }

    /** The bytes that a large picture needs are counted without overflow. */
    @Test
    public void sizesBeyondTheIntsAreRefused() {
        Plane small = new Plane(bytes(6), Integer.MAX_VALUE, 1);
        refuses("y must have at least 4611686011984936961 bytes from its position on, not 6",
                () -> YuvPlanes.of(Integer.MAX_VALUE - 1, Integer.MAX_VALUE - 1, small, small, small));
    }

    @Test
    public void planesThatChangeAreNoticed() {
        String[] names = {"y", "u", "v"};
        ByteBuffer[] buffers = {bytes(24), bytes(6), bytes(6)};
        YuvPlanes planes = YuvPlanes.of(
                6, 4, new Plane(buffers[0], 6, 1), new Plane(buffers[1], 3, 1), new Plane(buffers[2], 3, 1));
        for (int i = 0; i < names.length; i++) {
            int whole = buffers[i].limit();
            String complaint = names[i] + " must have at least " + whole + " bytes from its position on, not "
                    + (whole - 1);
            buffers[i].position(1);
            refuses(complaint, planes::checkSet);
            buffers[i].position(0);
            planes.checkSet();
            buffers[i].limit(whole - 1);
            refuses(complaint, planes::checkSet);
            buffers[i].limit(whole);
            planes.checkSet();
        }
    }

    @Test
    public void oneObjectServesManyImages() {
        YuvPlanes planes = new YuvPlanes();
        assertEquals(0, planes.width());
        assertEquals(0, planes.height());
        assertThrows(IllegalStateException.class, planes::checkSet);
        planes.set(image(35));
        assertEquals(6, planes.width());
        ByteBuffer y = bytes(4);
        planes.set(2, 2, y, 2, 1, bytes(1), 1, 1, bytes(1), 1, 1);
        assertEquals(2, planes.width());
        assertSame(y, planes.yMemory());
        // What is refused changes nothing.
        assertThrows(IllegalArgumentException.class,
                () -> planes.set(4, 2, bytes(8), 4, 1, bytes(2), 2, 1, bytes(1), 2, 1));
        assertEquals(2, planes.width());
        assertSame(y, planes.yMemory());
    }
}
