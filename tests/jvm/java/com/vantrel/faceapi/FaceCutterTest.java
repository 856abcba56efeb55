// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.graphics.Bitmap;
import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.nio.ByteBuffer;
import java.util.Random;
import org.junit.Test;

/**
 * Faces cut out of a picture whose luma grows evenly to the right and downwards: wherever a pixel of the result comes
 * from, its brightness tells.
 */
public final class FaceCutterTest {
    private static final int WIDTH = 260;
    private static final int HEIGHT = 200;
    private static final double ACROSS = 0.5;
    private static final double DOWN = 0.4;
    private static final double DARKEST = 20;

    private static CameraFrame frame(int rotation) {
        byte[] nv21 = new byte[WIDTH * HEIGHT * 3 / 2];
        java.util.Arrays.fill(nv21, (byte) 128);
        for (int y = 0; y < HEIGHT; y++) {
            for (int x = 0; x < WIDTH; x++) {
                nv21[y * WIDTH + x] = (byte) Math.round(luma(x + 0.5, y + 0.5));
            }
        }
        return CameraFrame.of(nv21, PixelFormat.NV21, WIDTH, HEIGHT, rotation);
    }

    private static double luma(double x, double y) {
        return DARKEST + ACROSS * x + DOWN * y;
    }

    private static YuvPlanes planes(CameraFrame frame) {
        ByteBuffer y = ByteBuffer.wrap(frame.data());
        y.position(WIDTH * HEIGHT);
        ByteBuffer v = y.slice();
        y.position(WIDTH * HEIGHT + 1);
        ByteBuffer u = y.slice();
        y.rewind();
        YuvPlanes planes = new YuvPlanes();
        planes.set(WIDTH, HEIGHT, y, WIDTH, 1, u, WIDTH, 2, v, WIDTH, 2);
        return planes;
    }

    /** Where a pixel of the result comes from in the frame, as an edge's position. */
    private interface Source {
        double[] of(double x, double y);
    }

    /** Compares every pixel; near the frame's edge, {@code blur} pixels to either side, only the inside of bounds. */
    private static void check(String what, Bitmap face, int size, Source source, double blur) {
        assertEquals(what, size, face.getWidth());
        assertEquals(what, size, face.getHeight());
        for (int y = 0; y < size; y++) {
            for (int x = 0; x < size; x++) {
                double[] at = source.of(x + 0.5, y + 0.5);
                double margin = Math.min(Math.min(at[0], WIDTH - at[0]), Math.min(at[1], HEIGHT - at[1]));
                int color = face.getPixel(x, y);
                String where = what + " at " + x + ", " + y + " from " + at[0] + ", " + at[1];
                assertEquals(where, 255, color >>> 24);
                assertTrue(where, (color >> 16 & 0xFF) == (color >> 8 & 0xFF) && (color & 0xFF) == (color >> 8 & 0xFF));
                if (margin >= blur) {
                    assertEquals(where, luma(at[0], at[1]), color & 0xFF, 1.6);
                } else if (margin <= -1e-6) {
                    assertEquals(where, 0, color & 0xFF);
                }
            }
        }
    }

    private static FaceInfo face(Rect rect, PointF... points) {
        FaceInfo face = new FaceInfo();
        face.faceRect = rect;
        face.facePoints = points;
        return face;
    }

    /** A face with eyes there, among points that mean nothing here. */
    private static FaceInfo withEyes(int count, double leftX, double leftY, double rightX, double rightY) {
        PointF[] points = new PointF[count];
        for (int i = 0; i < count; i++) {
            points[i] = new PointF(-1000 - i, 5000 + i);
        }
        int each = count == 68 ? 6 : 2;
        for (int i = 0; i < each; i++) {
            // About the eye's middle, and on the whole in it.
            double dx = 3 * Math.cos(2 * Math.PI * i / each);
            double dy = 3 * Math.sin(2 * Math.PI * i / each);
            points[(count == 68 ? 36 : 2) + i] = new PointF((float) (leftX + dx), (float) (leftY + dy));
            points[(count == 68 ? 42 : 0) + i] = new PointF((float) (rightX + dx), (float) (rightY + dy));
        }
        FaceInfo face = face(new Rect(0, 0, 1, 1), points);
        face.eyeDist = (float) Math.hypot(rightX - leftX, rightY - leftY);
        return face;
    }

    /** The eyes are level, at 36 % of the height and 36 % of the width apart: that decides about every pixel. */
    @Test
    public void eyesDecideWhereAFaceIsCutOut() {
        Random random = new Random(31);
        for (int round = 0; round < 60; round++) {
            int size = 8 + random.nextInt(60);
            double length = size * 0.36 * (0.3 + 4 * random.nextDouble());
            double angle = 2 * Math.PI * random.nextDouble();
            double middleX = WIDTH * random.nextDouble();
            double middleY = HEIGHT * random.nextDouble();
            double dx = Math.cos(angle) * length / 2;
            double dy = Math.sin(angle) * length / 2;
            FaceInfo face = withEyes(
                    round % 2 == 0 ? 68 : 5, middleX - dx, middleY - dy, middleX + dx, middleY + dy);
            // The similarity that takes the two places of the eyes to the eyes, z -> a z + b, in complex numbers.
            double apart = 0.36 * size;
            double ax = 2 * dx / apart;
            double ay = 2 * dy / apart;
            double placeX = 0.32 * size;
            double placeY = 0.36 * size;
            Source source = (x, y) -> new double[] {
                middleX - dx + 0.5 + (x - placeX) * ax - (y - placeY) * ay,
                middleY - dy + 0.5 + (x - placeX) * ay + (y - placeY) * ax};
            CameraFrame frame = frame(90 * (round % 4));
            String what = "round " + round + ", size " + size + ", eyes " + length + " apart";
            double blur = 1 + Math.hypot(ax, ay) * 1.5;
            check(what, Images.face(frame, face, size, null), size, source, blur);
            check(what, Images.face(planes(frame), 0, face, size, null), size, source, blur);
        }
    }

    /** Without eyes: the longer side and a quarter, about the middle, upright, and leaning by the roll. */
    @Test
    public void theRectangleDecidesWhereThereAreNoEyes() {
        Random random = new Random(32);
        for (int round = 0; round < 80; round++) {
            int size = 8 + random.nextInt(60);
            int rotation = 90 * random.nextInt(4);
            int left = random.nextInt(WIDTH) - 20;
            int top = random.nextInt(HEIGHT) - 20;
            FaceInfo face = face(new Rect(left, top, left + 2 + random.nextInt(120), top + 2 + random.nextInt(120)));
            face.roll = round % 3 == 0 ? 0 : random.nextInt(91) - 45;
            FrameTransform transform = FrameTransform.of(WIDTH, HEIGHT, rotation);
            Rect upright = transform.map(face.faceRect, null);
            double side = 1.25 * Math.max(upright.width(), upright.height());
            double cos = Math.cos(Math.toRadians(face.roll)) * side / size;
            double sin = Math.sin(Math.toRadians(face.roll)) * side / size;
            Source source = (x, y) -> {
                double dx = x - size / 2.0;
                double dy = y - size / 2.0;
                PointF point = new PointF((float) ((upright.left + upright.right) / 2.0 + dx * cos - dy * sin - 0.5),
                        (float) ((upright.top + upright.bottom) / 2.0 + dx * sin + dy * cos - 0.5));
                transform.unmap(point, point);
                return new double[] {point.x + 0.5, point.y + 0.5};
            };
            String what = "round " + round + ", size " + size + ", turned by " + rotation + ", roll " + face.roll;
            CameraFrame frame = frame(rotation);
            double blur = 1 + side / size * 1.5;
            check(what, Images.face(frame, face, size, null), size, source, blur);
            check(what, Images.face(planes(frame), rotation, face, size, null), size, source, blur);
        }
    }

    /** Points that are no eyes do not decide: of another count, missing, in one place, or not as far apart as said. */
    @Test
    public void pointsThatAreNoEyesDoNotDecide() {
        CameraFrame frame = frame(0);
        FaceInfo plain = face(new Rect(40, 40, 90, 100));
        int expected = Images.face(frame, plain, 16, null).getPixel(14, 14);
        FaceInfo eyes = withEyes(5, 50, 60, 80, 60);
        eyes.faceRect = plain.faceRect;
        assertTrue(expected != Images.face(frame, eyes, 16, null).getPixel(14, 14));

        eyes.eyeDist = 40;
        assertEquals(expected, Images.face(frame, eyes, 16, null).getPixel(14, 14));
        eyes.eyeDist = 0;
        assertEquals(expected, Images.face(frame, eyes, 16, null).getPixel(14, 14));
        eyes.eyeDist = Float.NaN;
        assertEquals(expected, Images.face(frame, eyes, 16, null).getPixel(14, 14));
        eyes.eyeDist = 30;
        eyes.facePoints[2] = null;
        assertEquals(expected, Images.face(frame, eyes, 16, null).getPixel(14, 14));
        eyes.facePoints = null;
        assertEquals(expected, Images.face(frame, eyes, 16, null).getPixel(14, 14));
        FaceInfo six = withEyes(68, 50, 60, 80, 60);
        six.faceRect = plain.faceRect;
        six.facePoints = java.util.Arrays.copyOf(six.facePoints, 67);
        assertEquals(expected, Images.face(frame, six, 16, null).getPixel(14, 14));
    }

    /** What lies around the square is a quarter of the outermost pixels, which are half as large as the frame's. */
    @Test
    public void outermostPixelsAreInterpolated() {
        int first = 35;
        int last = first + 49;
        byte[] nv21 = new byte[WIDTH * HEIGHT * 3 / 2];
        java.util.Arrays.fill(nv21, (byte) 128);
        for (int y = 0; y < HEIGHT; y++) {
            for (int x = 0; x < WIDTH; x++) {
                boolean inside = x >= first && x <= last && y >= first && y <= last;
                nv21[y * WIDTH + x] = (byte) (inside ? 20 : 220);
            }
        }
        CameraFrame frame = CameraFrame.of(nv21, PixelFormat.NV21, WIDTH, HEIGHT, 0);
        Bitmap out = Images.face(frame, face(new Rect(40, 40, 80, 80)), 100, null);
        for (int i = 1; i < 99; i++) {
            for (int[] at : new int[][] {{0, i}, {99, i}, {i, 0}, {i, 99}}) {
                assertEquals(at[0] + ", " + at[1], 20 + 200 / 4, out.getPixel(at[0], at[1]) & 0xFF, 1);
            }
            assertEquals(20, out.getPixel(i, i) & 0xFF, 1);
        }
    }

    @Test
    public void whatLiesBeyondThePictureIsBlack() {
        Bitmap out = Images.face(frame(0), face(new Rect(1000, 1000, 1100, 1100)), 12, null);
        Bitmap huge = Images.face(frame(90),
                face(new Rect(Integer.MIN_VALUE, Integer.MIN_VALUE, Integer.MAX_VALUE, Integer.MAX_VALUE)), 12, out);
        assertSame(out, huge);
        Rect corner = new Rect(Integer.MAX_VALUE - 9, -900, Integer.MAX_VALUE, -800);
        Bitmap far = Images.face(frame(0), face(corner), 12, out);
        for (int i = 0; i < 144; i++) {
            assertEquals(0xFF000000, far.getPixel(i % 12, i / 12));
        }
    }

    @Test
    public void whatDoesNotFitIsRefused() {
        CameraFrame frame = frame(0);
        FaceInfo face = face(new Rect(40, 40, 90, 100));
        Bitmap out = Bitmap.createBitmap(20, 20, Bitmap.Config.ARGB_8888);
        assertRefused("size must be above 0, not 0", () -> Images.face(frame, face, 0, null));
        assertRefused("reuse must be 24 x 24, not 20 x 20", () -> Images.face(frame, face, 24, out));
        assertRefused("rotationDegrees must be 0, 90, 180 or 270, not 5",
                () -> Images.face(planes(frame), 5, face, 24, null));
        assertRefused("face.faceRect must not be empty",
                () -> Images.face(frame, face(new Rect(40, 40, 40, 100)), 20, out));
        assertEquals(0, out.getPixel(10, 10));
        assertThrows(IllegalArgumentException.class, () -> Images.face(frame, face, Integer.MAX_VALUE, null));
        assertThrows(NullPointerException.class, () -> Images.face(frame, face(null), 20, out));
        assertThrows(NullPointerException.class, () -> Images.face(frame, null, 20, out));
        assertThrows(NullPointerException.class, () -> Images.face((CameraFrame) null, face, 20, out));
        assertThrows(NullPointerException.class, () -> Images.face(null, 0, face, 20, out));
        assertThrows(IllegalStateException.class, () -> Images.face(new CameraFrame(), face, 20, out));
        assertThrows(IllegalStateException.class, () -> Images.face(new YuvPlanes(), 0, face, 20, out));
    }

    private static void assertRefused(String message, org.junit.function.ThrowingRunnable call) {
        assertEquals(message, assertThrows(IllegalArgumentException.class, call).getMessage());
    }
}
