// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertNotEquals;
import static org.junit.Assert.assertNotSame;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.graphics.Bitmap;
import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.lang.management.ManagementFactory;
import java.nio.ByteBuffer;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Random;
import org.junit.Test;
import org.junit.function.ThrowingRunnable;

/** From a camera's planes to what is shown: every pixel where the transform says, and no memory taken for a frame. */
public final class CameraToScreenTest {
    private static final int[] ROTATIONS = {0, 90, 180, 270};

    private final Random random = new Random(21);

    /** A random picture, packed, and its planes with padded rows and the pixel stride of most phones. */
    private final class Camera {
        final int width;
        final int height;
        final byte[] nv21;
        final ByteBuffer y;
        final ByteBuffer vu;
        final ByteBuffer u;
        final int stride;
        final YuvPlanes planes = new YuvPlanes();

        Camera(int width, int height) {
            this(width, height, new byte[width * height * 3 / 2]);
            random.nextBytes(nv21);
            refill();
        }

        Camera(int width, int height, byte[] nv21) {
            this.width = width;
            this.height = height;
            this.nv21 = nv21;
            stride = width + 6;
            y = ByteBuffer.allocateDirect(stride * (height - 1) + width);
            vu = ByteBuffer.allocateDirect(stride * (height / 2 - 1) + width);
            ByteBuffer behind = vu.duplicate();
            behind.position(1);
            u = behind.slice();
            set();
            refill();
        }

        void set() {
            planes.set(width, height, y, stride, 1, u, stride, 2, vu, stride, 2);
        }

        void refill() {
            for (int row = 0; row < height; row++) {
                for (int x = 0; x < width; x++) {
                    y.put(row * stride + x, nv21[row * width + x]);
                    if (row < height / 2) {
                        vu.put(row * stride + x, nv21[width * height + row * width + x]);
                    }
                }
            }
        }

        CameraFrame frame(int rotation) {
            return CameraFrame.of(nv21, PixelFormat.NV21, width, height, rotation);
        }
    }

    /** Every pixel, known by its colour, is where the transform maps its point to. */
    @Test
    public void everyPixelLandsWhereItsPointIsMappedTo() {
        for (int[] size : new int[][] {{2, 2}, {4, 6}, {6, 4}, {38, 22}}) {
            Camera camera = new Camera(size[0], size[1]);
            List<Rect> crops = new ArrayList<>();
            if (size[0] > 6) {
                crops.add(new Rect(0, 0, size[0], size[1]));
                crops.add(new Rect(3, 4, 37, 21));
                crops.add(new Rect(35, 19, 36, 20));
            } else {
                for (int left = 0; left < size[0]; left++) {
                    for (int top = 0; top < size[1]; top++) {
                        for (int right = left + 1; right <= size[0]; right++) {
                            for (int bottom = top + 1; bottom <= size[1]; bottom++) {
                                crops.add(new Rect(left, top, right, bottom));
                            }
                        }
                    }
                }
            }
            for (int rotation : ROTATIONS) {
                for (Rect crop : crops) {
                    checkTransform(camera, FrameTransform.of(size[0], size[1], rotation).crop(crop));
                    checkTransform(camera, FrameTransform.of(size[0], size[1], rotation).crop(crop).mirrored(true));
                }
            }
        }
    }

    private static void checkTransform(Camera camera, FrameTransform transform) {
        String what = transform.toString();
        byte[] rgba = Images.toPixels(camera.planes, transform, PixelFormat.RGBA, null);
        byte[] whole = ColorReference.toPixels(camera.nv21, camera.width, camera.height, ColorReference.Chroma.VU,
                ColorReference.Layout.RGBA);
        Rect crop = transform.cropRect(null);
        int width = transform.resultWidth();
        assertEquals(what, 4 * width * transform.resultHeight(), rgba.length);
        int[] argb = new int[width * transform.resultHeight()];
        PointF point = new PointF();
        for (int y = crop.top; y < crop.bottom; y++) {
            for (int x = crop.left; x < crop.right; x++) {
                point.set(x, y);
                PointF at = transform.map(point, null);
                int to = (int) at.y * width + (int) at.x;
                int from = y * camera.width + x;
                for (int channel = 0; channel < 4; channel++) {
                    assertEquals(what, whole[4 * from + channel], rgba[4 * to + channel]);
                }
                argb[to] = 0xFF000000 | (rgba[4 * to] & 0xFF) << 16 | (rgba[4 * to + 1] & 0xFF) << 8
                        | (rgba[4 * to + 2] & 0xFF);
            }
        }
        CameraFrame frame = camera.frame(0);
        assertArrayEquals(what, rgba, Images.toPixels(frame, transform, PixelFormat.RGBA, null));
        assertArrayEquals(what, argb, argb(Images.toBitmap(camera.planes, transform, null)));
        assertArrayEquals(what, argb, argb(Images.toBitmap(frame, transform, null)));
        // A view scales what it shows; the pixels are the same.
        assertArrayEquals(what, rgba, Images.toPixels(frame, transform.fit(7, 9), PixelFormat.RGBA, null));
    }

    private static int[] argb(Bitmap bitmap) {
        int width = bitmap.getWidth();
        int[] out = new int[width * bitmap.getHeight()];
        bitmap.getPixels(out, 0, width, 0, 0, width, bitmap.getHeight());
        return out;
    }

    @Test
    public void everyLayoutIsMade() {
        Camera camera = new Camera(20, 12);
        FrameTransform transform = FrameTransform.of(20, 12, 90).mirrored(true).crop(new Rect(2, 4, 14, 12));
        byte[] rgba = Images.toPixels(camera.planes, transform, PixelFormat.RGBA, null);
        byte[] gray = Images.toPixels(camera.planes, transform, PixelFormat.GRAY, null);
        int[][] orders = {{2, 1, 0}, {0, 1, 2}, {2, 1, 0, 3}};
        PixelFormat[] formats = {PixelFormat.BGR, PixelFormat.RGB, PixelFormat.BGRA};
        for (int i = 0; i < formats.length; i++) {
            byte[] pixels = Images.toPixels(camera.planes, transform, formats[i], null);
            int size = orders[i].length;
            assertEquals(12 * 8 * size, pixels.length);
            for (int at = 0; at < 12 * 8; at++) {
                for (int channel = 0; channel < size; channel++) {
                    assertEquals(rgba[at * 4 + orders[i][channel]], pixels[at * size + channel]);
                }
            }
        }
        byte[] nv21 = Images.toPixels(camera.planes, transform, PixelFormat.NV21, null);
        byte[] nv12 = Images.toPixels(camera.planes, transform, PixelFormat.NV12, null);
        assertArrayEquals(gray, Arrays.copyOf(nv21, 12 * 8));
        assertArrayEquals(rgba, ColorReference.toPixels(
                nv21, 8, 12, ColorReference.Chroma.VU, ColorReference.Layout.RGBA));
        assertArrayEquals(rgba, ColorReference.toPixels(
                nv12, 8, 12, ColorReference.Chroma.UV, ColorReference.Layout.RGBA));
    }

    @Test
    public void framesAreFilledFromPlanes() {
        Camera camera = new Camera(22, 10);
        CameraFrame nv21 = new CameraFrame();
        nv21.fill(camera.planes, 270);
        assertArrayEquals(camera.nv21, nv21.data());
        assertEquals(22, nv21.width());
        assertEquals(10, nv21.height());
        assertEquals(270, nv21.rotationDegrees());
        byte[] array = nv21.data();
        nv21.fill(camera.planes, 0);
        assertSame(array, nv21.data());

        CameraFrame nv12 = new CameraFrame(PixelFormat.NV12);
        nv12.fill(camera.planes, 0);
        assertArrayEquals(ColorReference.toPixels(camera.nv21, 22, 10, ColorReference.Chroma.VU,
                ColorReference.Layout.BGR), ColorReference.toPixels(nv12.data(), 22, 10, ColorReference.Chroma.UV,
                ColorReference.Layout.BGR));

        assertThrows(NullPointerException.class, () -> nv21.fill(null, 0));
        refuses("rotationDegrees must be 0, 90, 180 or 270, not 1", () -> nv21.fill(camera.planes, 1));
        assertThrows(IllegalStateException.class, () -> nv21.fill(new YuvPlanes(), 0));
        // A frame is not filled from itself.
        ByteBuffer own = ByteBuffer.wrap(nv21.data());
        own.position(220);
        ByteBuffer ownV = own.slice();
        own.position(221);
        ByteBuffer ownU = own.slice();
        own.rewind();
        YuvPlanes inside = new YuvPlanes();
        inside.set(22, 10, own, 22, 1, ownU, 22, 2, ownV, 22, 2);
        byte[] before = nv21.data().clone();
        refuses("the output must not be the source", () -> nv21.fill(inside, 0));
        assertArrayEquals(before, nv21.data());
    }

    @Test
    public void framesAreTurnedUpright() {
        Camera camera = new Camera(14, 6);
        for (int rotation : ROTATIONS) {
            CameraFrame frame = camera.frame(rotation);
            FrameTransform transform = FrameTransform.of(14, 6, rotation);
            CameraFrame upright = frame.upright(null);
            assertEquals(transform.resultWidth(), upright.width());
            assertEquals(transform.resultHeight(), upright.height());
            assertEquals(0, upright.rotationDegrees());
            byte[] expected = Images.toPixels(camera.planes, transform, PixelFormat.NV21, null);
            assertArrayEquals(expected, upright.data());

            byte[] array = upright.data();
            assertSame(upright, frame.upright(upright));
            assertSame(array, upright.data());
            // An older frame takes the result of a younger one as well, and in its own order of chroma.
            CameraFrame nv12 = new CameraFrame(PixelFormat.NV12);
            assertSame(nv12, camera.frame(rotation).upright(nv12));
            assertArrayEquals(Images.toPixels(camera.planes, transform, PixelFormat.NV12, null), nv12.data());
        }
        CameraFrame frame = camera.frame(180);
        refuses("reuse must not be the frame itself", () -> frame.upright(frame));
        byte[] before = frame.data().clone();
        refuses("the output must not be the source", () -> frame.upright(camera.frame(0)));
        assertArrayEquals(before, frame.data());
        assertThrows(IllegalStateException.class, () -> new CameraFrame().upright(null));
    }

    @Test(timeout = 60000)
    public void framesThatTurnOneAnotherDoNotBlock() throws InterruptedException {
        CameraFrame one = CameraFrame.of(new byte[96], PixelFormat.NV21, 8, 8, 180);
        CameraFrame other = CameraFrame.of(new byte[96], PixelFormat.NV21, 8, 8, 180);
        Thread thread = new Thread(() -> {
            for (int i = 0; i < 20000; i++) {
                one.upright(other);
            }
        });
        thread.start();
        for (int i = 0; i < 20000; i++) {
            other.upright(one);
        }
        thread.join();
        assertEquals(8, one.width());
    }

    @Test
    public void outputsAreUsedAgain() {
        Camera camera = new Camera(16, 8);
        FrameTransform transform = FrameTransform.of(16, 8, 90);
        Bitmap bitmap = Images.toBitmap(camera.planes, transform, null);
        assertEquals(8, bitmap.getWidth());
        assertEquals(16, bitmap.getHeight());
        assertTrue(bitmap.isMutable());
        Bitmap wide = Bitmap.createBitmap(8, 16, Bitmap.Config.ARGB_8888, 8 * 4 + 20);
        assertSame(wide, Images.toBitmap(camera.planes, transform, wide));
        assertArrayEquals(argb(bitmap), argb(wide));
        byte[] pixels = new byte[8 * 16];
        assertSame(pixels, Images.toPixels(camera.planes, transform, PixelFormat.GRAY, pixels));
    }

    @Test
    public void whatDoesNotFitIsRefusedAndNothingWritten() {
        Camera camera = new Camera(16, 8);
        CameraFrame frame = camera.frame(0);
        FrameTransform transform = FrameTransform.of(16, 8, 90);
        String other = "transform must be made for a frame of 16 x 8, not of 8 x 16";
        refuses(other, () -> Images.toBitmap(camera.planes, FrameTransform.of(8, 16, 0), null));
        refuses(other, () -> Images.toBitmap(frame, FrameTransform.of(8, 16, 0), null));
        refuses(other, () -> Images.toPixels(camera.planes, FrameTransform.of(8, 16, 0), PixelFormat.RGB, null));
        refuses(other, () -> Images.toPixels(frame, FrameTransform.of(8, 16, 0), PixelFormat.RGB, null));
        refuses("reuse.length must be exactly 384, not 383",
                () -> Images.toPixels(frame, transform, PixelFormat.RGB, new byte[383]));
        byte[] before = camera.nv21.clone();
        refuses("the output must not be the source",
                () -> Images.toPixels(frame, transform, PixelFormat.NV21, frame.data()));
        assertArrayEquals(before, camera.nv21);

        Bitmap turned = Bitmap.createBitmap(16, 8, Bitmap.Config.ARGB_8888);
        refuses("reuse must be 8 x 16, not 16 x 8", () -> Images.toBitmap(camera.planes, transform, turned));
        assertArrayEquals(new int[16 * 8], argb(turned));
        Bitmap large = Bitmap.createBitmap(9, 16, Bitmap.Config.ARGB_8888);
        refuses("reuse must be 8 x 16, not 9 x 16", () -> Images.toBitmap(frame, transform, large));
        refuses("reuse must be ARGB_8888, not RGB_565",
                () -> Images.toBitmap(frame, transform, Bitmap.createBitmap(8, 16, Bitmap.Config.RGB_565)));
        Bitmap recycled = Bitmap.createBitmap(8, 16, Bitmap.Config.ARGB_8888);
        recycled.recycle();
        refuses("reuse is recycled", () -> Images.toBitmap(frame, transform, recycled));
        Bitmap immutable = Bitmap.createBitmap(new int[8 * 16], 8, 16, Bitmap.Config.ARGB_8888);
        refuses("reuse is immutable", () -> Images.toBitmap(frame, transform, immutable));
        assertArrayEquals(new int[8 * 16], argb(immutable));

        camera.y.limit(camera.y.limit() - 1);
        assertThrows(IllegalArgumentException.class, () -> Images.toBitmap(camera.planes, transform, null));
        assertThrows(IllegalStateException.class, () -> Images.toBitmap(new YuvPlanes(), transform, null));
        assertThrows(IllegalStateException.class, () -> Images.toBitmap(new CameraFrame(), transform, null));
        assertThrows(NullPointerException.class, () -> Images.toBitmap((YuvPlanes) null, transform, null));
        assertThrows(NullPointerException.class, () -> Images.toBitmap((CameraFrame) null, transform, null));
        assertThrows(NullPointerException.class, () -> Images.toBitmap(frame, null, null));
        assertThrows(NullPointerException.class, () -> Images.toPixels(frame, transform, null, null));
    }

    private static void refuses(String message, ThrowingRunnable call) {
        assertEquals(message, assertThrows(IllegalArgumentException.class, call).getMessage());
    }

    @Test
    public void rectanglesServeWhereFourNumbersDo() {
        Camera camera = new Camera(20, 12);
        CameraFrame frame = camera.frame(0);
        Rect rect = new Rect(3, 2, 11, 9);
        assertArrayEquals(Images.crop(frame, 3, 2, 8, 7, null), Images.crop(frame, rect, null));
        assertEquals(Images.brightness(frame, 3, 2, 8, 7), Images.brightness(frame, rect), 0);
        byte[] rgba = Images.toPixels(frame, FrameTransform.of(20, 12, 0), PixelFormat.RGBA, null);
        assertEquals(Images.lightness(rgba, PixelFormat.RGBA, 20, 12, 80, 3, 2, 8, 7),
                Images.lightness(rgba, PixelFormat.RGBA, 20, 12, 80, rect));
        refuses("rect must be neither empty nor begin at a negative position, not Rect(3, 2 - 3, 9)",
                () -> Images.crop(frame, new Rect(3, 2, 3, 9), null));
        refuses("rect must be neither empty nor begin at a negative position, not Rect(-2147483648, 2 - 2147483647, 9)",
                () -> Images.brightness(frame, new Rect(Integer.MIN_VALUE, 2, Integer.MAX_VALUE, 9)));
        assertThrows(IllegalArgumentException.class, () -> Images.brightness(frame, new Rect(0, 0, 21, 12)));
        assertThrows(NullPointerException.class, () -> Images.crop(frame, null, null));
    }

    /** The same faces from a frame, from a bitmap of it, and mapped from the one to the other. */
    @Test
    public void facesOfABitmapAreThoseOfTheFrame() {
        Portrait portrait = Portrait.read().onItsSide();
        int width = portrait.width();
        int height = portrait.height();
        CameraFrame frame = CameraFrame.of(portrait.nv21(), PixelFormat.NV21, width, height, 90);
        FrameTransform transform = FrameTransform.of(width, height, 90);
        try (FaceDetector detector = new FaceDetector()) {
            List<FaceInfo> inFrame = detector.detect(frame);
            assertEquals(1, inFrame.size());
            Bitmap upright = Images.toBitmap(frame, transform, null);
            List<FaceInfo> inBitmap = detector.detect(upright, 0);
            assertEquals(1, inBitmap.size());
            Rect mapped = transform.map(inFrame.get(0).faceRect, null);
            // Luma of the frame, and luma made of its colours, differ a little, and with them the score.
            assertTrue(mapped + " " + inBitmap.get(0).faceRect,
                    Portrait.overlap(mapped, inBitmap.get(0).faceRect) > 0.9);
            List<FaceInfo> inUpright = detector.detect(frame.upright(null));
            assertEquals(mapped, inUpright.get(0).faceRect);

            Bitmap sideways = Images.toBitmap(frame, FrameTransform.of(width, height, 0), null);
            assertEquals(inBitmap.get(0).faceRect, transform.map(detector.detect(sideways, 90).get(0).faceRect, null));
            Bitmap padded = Bitmap.createBitmap(width, height, Bitmap.Config.ARGB_8888, width * 4 + 36);
            Images.toBitmap(frame, FrameTransform.of(width, height, 0), padded);
            assertEquals(inBitmap.get(0).faceRect, transform.map(detector.detect(padded, 90).get(0).faceRect, null));
            try (FaceTracker tracker = new FaceTracker()) {
                assertEquals(inBitmap.get(0).faceRect, tracker.track(upright, 0).get(0).faceRect);
            }

            refuses("bitmap must be ARGB_8888, not RGB_565",
                    () -> detector.detect(Bitmap.createBitmap(8, 8, Bitmap.Config.RGB_565), 0));
            refuses("rotationDegrees must be 0, 90, 180 or 270, not 30", () -> detector.detect(upright, 30));
            upright.recycle();
            refuses("bitmap is recycled", () -> detector.detect(upright, 0));
            assertThrows(NullPointerException.class, () -> detector.detect((Bitmap) null, 0));
        }
    }

    /** What a call that uses its outputs again takes of the heap, in bytes; the fewest of some tries. */
    private static long allocatedBy(Runnable call) {
        com.sun.management.ThreadMXBean threads =
                (com.sun.management.ThreadMXBean) ManagementFactory.getThreadMXBean();
        long id = Thread.currentThread().getId();
        long fewest = Long.MAX_VALUE;
        for (int i = 0; i < 20; i++) {
            long before = threads.getThreadAllocatedBytes(id);
            call.run();
            fewest = Math.min(fewest, threads.getThreadAllocatedBytes(id) - before);
        }
        return fewest;
    }

    /** The count sees an allocation, and it sees none in a frame's way to the screen. */
    @Test
    public void aFrameAllocatesNothing() {
        byte[][] kept = new byte[1][];
        assertNotEquals(0, allocatedBy(() -> kept[0] = new byte[1]));
        assertEquals(0, allocatedBy(() -> { }));

        Camera camera = new Camera(64, 48);
        YuvPlanesTest.CameraImage image = new YuvPlanesTest.CameraImage(35, 64, 48,
                YuvPlanesTest.imagePlane(camera.y, camera.stride, 1),
                YuvPlanesTest.imagePlane(camera.u, camera.stride, 2),
                YuvPlanesTest.imagePlane(camera.vu, camera.stride, 2));
        YuvPlanes planes = camera.planes;
        assertEquals(0, allocatedBy(() -> planes.set(image)));
        assertEquals(0, allocatedBy(camera::set));

        CameraFrame frame = new CameraFrame();
        assertEquals(0, allocatedBy(() -> frame.fill(planes, 90)));
        assertEquals(0, allocatedBy(() -> frame.fill(64, 48, camera.y, camera.stride, camera.u, camera.stride, 2,
                camera.vu, camera.stride, 2, 90)));
        CameraFrame upright = new CameraFrame();
        assertEquals(0, allocatedBy(() -> frame.upright(upright)));

        FrameTransform transform = FrameTransform.of(64, 48, 90).mirrored(true).crop(new Rect(4, 2, 60, 48));
        Bitmap bitmap = Images.toBitmap(planes, transform, null);
        assertEquals(0, allocatedBy(() -> Images.toBitmap(planes, transform, bitmap)));
        assertEquals(0, allocatedBy(() -> Images.toBitmap(frame, transform, bitmap)));
        byte[] pixels = Images.toPixels(planes, transform, PixelFormat.BGR, null);
        assertEquals(0, allocatedBy(() -> Images.toPixels(planes, transform, PixelFormat.BGR, pixels)));
        assertEquals(0, allocatedBy(() -> Images.toPixels(frame, transform, PixelFormat.BGR, pixels)));

        FaceInfo face = new FaceInfo();
        face.faceRect = new Rect(10, 12, 40, 44);
        face.facePoints = new PointF[] {new PointF(1, 2), new PointF(3, 4)};
        FaceInfo shown = transform.map(face, null);
        assertEquals(0, allocatedBy(() -> transform.map(face, shown)));
        Bitmap cut = Images.face(planes, 90, face, 24, null);
        assertEquals(0, allocatedBy(() -> Images.face(planes, 90, face, 24, cut)));
        assertEquals(0, allocatedBy(() -> Images.face(frame, face, 24, cut)));
        assertNotSame(bitmap, cut);
    }
}
