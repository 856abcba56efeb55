// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertNotEquals;
import static org.junit.Assert.assertNotSame;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.util.Arrays;
import java.util.List;
import java.util.Random;
import org.junit.Test;

/** Where points, rectangles and faces land, against pictures of numbered pixels that are cut, turned and mirrored. */
public final class FrameTransformTest {
    private static final int[] ROTATIONS = {0, 90, 180, 270};

    /** A picture whose every pixel has a number of its own, so that it is found again wherever it goes. */
    private static int[][] numbered(int width, int height) {
        int[][] pixels = new int[height][width];
        for (int y = 0; y < height; y++) {
            for (int x = 0; x < width; x++) {
                pixels[y][x] = y * width + x;
            }
        }
        return pixels;
    }

    private static int[][] cut(int[][] pixels, int left, int top, int right, int bottom) {
        int[][] out = new int[bottom - top][];
        for (int y = top; y < bottom; y++) {
            out[y - top] = Arrays.copyOfRange(pixels[y], left, right);
        }
        return out;
    }

    /** A quarter turn clockwise: the first column, read upwards, is the first row. */
    private static int[][] quarter(int[][] pixels) {
        int[][] out = new int[pixels[0].length][pixels.length];
        for (int y = 0; y < out.length; y++) {
            for (int x = 0; x < out[0].length; x++) {
                out[y][x] = pixels[pixels.length - 1 - x][y];
            }
        }
        return out;
    }

    private static int[][] mirror(int[][] pixels) {
        int[][] out = new int[pixels.length][pixels[0].length];
        for (int y = 0; y < out.length; y++) {
            for (int x = 0; x < out[0].length; x++) {
                out[y][x] = pixels[y][pixels[0].length - 1 - x];
            }
        }
        return out;
    }

    static int[][] shown(int width, int height, Rect even, int rotation, boolean mirrored) {
        int[][] pixels = cut(numbered(width, height), even.left, even.top, even.right, even.bottom);
        for (int turn = 0; turn < rotation; turn += 90) {
            pixels = quarter(pixels);
        }
        return mirrored ? mirror(pixels) : pixels;
    }

    /** A crop with its edges moved outwards to even positions, by steps of one. */
    static Rect even(Rect crop, int width, int height) {
        Rect out = new Rect(crop);
        out.left -= out.left % 2;
        out.top -= out.top % 2;
        while (out.right % 2 != 0 && out.right < width) {
            out.right++;
        }
        while (out.bottom % 2 != 0 && out.bottom < height) {
            out.bottom++;
        }
        return out;
    }

    @Test
    public void everyPixelLandsWhereThePictureHasIt() {
        for (int width = 1; width <= 6; width++) {
            for (int height = 1; height <= 6; height++) {
                for (int rotation : ROTATIONS) {
                    FrameTransform whole = FrameTransform.of(width, height, rotation);
                    checkPixels(whole, width, height, new Rect(0, 0, width, height));
                    checkPixels(whole.mirrored(true), width, height, new Rect(0, 0, width, height));
                    for (int left = 0; left < width; left++) {
                        for (int right = left + 1; right <= width; right++) {
                            for (int top = 0; top < height; top++) {
                                for (int bottom = top + 1; bottom <= height; bottom++) {
                                    Rect crop = new Rect(left, top, right, bottom);
                                    checkPixels(whole.crop(crop), width, height, crop);
                                    checkPixels(whole.mirrored(true).crop(crop), width, height, crop);
                                }
                            }
                        }
                    }
                }
            }
        }
    }

    private static void checkPixels(FrameTransform transform, int width, int height, Rect crop) {
        String what = transform.toString();
        Rect even = even(crop, width, height);
        assertEquals(what, even, transform.cropRect(null));
        int[][] shown = shown(width, height, even, transform.rotationDegrees(), transform.isMirrored());
        assertEquals(what, shown[0].length, transform.resultWidth());
        assertEquals(what, shown.length, transform.resultHeight());
        for (int y = 0; y < shown.length; y++) {
            for (int x = 0; x < shown[0].length; x++) {
                int fromX = shown[y][x] % width;
                int fromY = shown[y][x] / width;
                PointF inFrame = new PointF(fromX, fromY);
                PointF inPicture = new PointF(x, y);
                assertEquals(what, inPicture, transform.map(inFrame, null));
                assertEquals(what, inFrame, transform.unmap(inPicture, null));
                Rect pixelInFrame = new Rect(fromX, fromY, fromX + 1, fromY + 1);
                Rect pixelInPicture = new Rect(x, y, x + 1, y + 1);
                assertEquals(what, pixelInPicture, transform.map(pixelInFrame, null));
                assertEquals(what, pixelInFrame, transform.unmap(pixelInPicture, null));
            }
        }
    }

    /** A rectangle of several pixels is the smallest around those of its corners. */
    @Test
    public void rectanglesKeepTheirPixels() {
        Random random = new Random(11);
        for (int round = 0; round < 2000; round++) {
            int width = 1 + random.nextInt(40);
            int height = 1 + random.nextInt(40);
            FrameTransform transform = FrameTransform.of(width, height, ROTATIONS[random.nextInt(4)])
                    .mirrored(random.nextBoolean()).crop(randomRect(random, width, height));
            // Beyond the frame too: faces at its edge reach out of it.
            Rect rect = new Rect(random.nextInt(width) - 9, random.nextInt(height) - 9, 0, 0);
            rect.right = rect.left + 1 + random.nextInt(20);
            rect.bottom = rect.top + 1 + random.nextInt(20);
            Rect first = transform.map(new Rect(rect.left, rect.top, rect.left + 1, rect.top + 1), null);
            Rect last = transform.map(new Rect(rect.right - 1, rect.bottom - 1, rect.right, rect.bottom), null);
            Rect expected = new Rect(Math.min(first.left, last.left), Math.min(first.top, last.top),
                    Math.max(first.right, last.right), Math.max(first.bottom, last.bottom));
            Rect mapped = transform.map(rect, null);
            assertEquals(transform + " of " + rect, expected, mapped);
            assertEquals(transform + " of " + rect, rect, transform.unmap(mapped, null));
        }
    }

    private static Rect randomRect(Random random, int width, int height) {
        int left = random.nextInt(width);
        int top = random.nextInt(height);
        return new Rect(left, top, left + 1 + random.nextInt(width - left), top + 1 + random.nextInt(height - top));
    }

    /** Fitting shows all and touches two edges of the view; filling leaves none of it free; both are centred. */
    @Test
    public void viewsAreFitOrFilled() {
        Random random = new Random(12);
        for (int round = 0; round < 5000; round++) {
            int width = 1 + random.nextInt(300);
            int height = 1 + random.nextInt(300);
            int viewWidth = 1 + random.nextInt(1000);
            int viewHeight = 1 + random.nextInt(1000);
            boolean fit = random.nextBoolean();
            FrameTransform picture = FrameTransform.of(width, height, ROTATIONS[random.nextInt(4)])
                    .mirrored(random.nextBoolean()).crop(randomRect(random, width, height));
            FrameTransform view = fit ? picture.fit(viewWidth, viewHeight) : picture.fill(viewWidth, viewHeight);
            String what = view.toString();
            assertEquals(what, picture.resultWidth(), view.resultWidth());
            assertEquals(what, picture.resultHeight(), view.resultHeight());

            double across = (double) viewWidth / view.resultWidth();
            double down = (double) viewHeight / view.resultHeight();
            double zoom = fit == across < down ? across : down;
            assertEquals(what, zoom, view.scale(), zoom * 1e-6);

            // A position of the picture, from its middle, is one of the view, from the view's middle, enlarged.
            PointF point = new PointF(random.nextFloat() * width, random.nextFloat() * height);
            PointF inPicture = picture.map(point, null);
            double x = viewWidth / 2.0 + (inPicture.x + 0.5 - view.resultWidth() / 2.0) * zoom - 0.5;
            double y = viewHeight / 2.0 + (inPicture.y + 0.5 - view.resultHeight() / 2.0) * zoom - 0.5;
            PointF inView = view.map(point, null);
            double near = 1e-3 * Math.max(1, zoom);
            assertEquals(what, x, inView.x, near);
            assertEquals(what, y, inView.y, near);
            PointF back = view.unmap(inView, null);
            assertEquals(what, point.x, back.x, 2e-3 * Math.max(1, 1 / zoom));
            assertEquals(what, point.y, back.y, 2e-3 * Math.max(1, 1 / zoom));

            Rect all = view.map(view.cropRect(null), null);
            double barX = (viewWidth - zoom * view.resultWidth()) / 2;
            double barY = (viewHeight - zoom * view.resultHeight()) / 2;
            assertEquals(what, barX, all.left, 0.5001);
            assertEquals(what, barY, all.top, 0.5001);
            assertEquals(what, viewWidth - barX, all.right, 0.5001);
            assertEquals(what, viewHeight - barY, all.bottom, 0.5001);
            assertTrue(what, fit ? barX > -1e-9 && barY > -1e-9 : barX < 1e-9 && barY < 1e-9);
        }
    }

    @Test
    public void aRectangleOfTheViewBecomesOneOfTheFrame() {
        // Half the size, turned: the view's upper left quarter is the frame's lower left one.
        FrameTransform view = FrameTransform.of(640, 480, 90).fit(240, 320);
        assertEquals(new Rect(0, 240, 320, 480), view.unmap(new Rect(0, 0, 120, 160), null));
        assertEquals(new Rect(0, 0, 120, 160), view.map(new Rect(0, 240, 320, 480), null));
        // To the nearest edge: 101 / 2 is 50.5, which is rounded up, and 99 / 2 is 49.5.
        assertEquals(new Rect(50, 0, 51, 1), FrameTransform.of(640, 480, 0).fit(320, 240)
                .map(new Rect(99, 0, 101, 1), null));
    }

    private static FaceInfo face() {
        FaceInfo face = new FaceInfo();
        face.faceRect = new Rect(10, 20, 30, 50);
        face.facePoints = new PointF[] {new PointF(12.25f, 25), new PointF(25, 26)};
        face.score = 0.75f;
        face.yaw = 12;
        face.pitch = -5;
        face.roll = 3;
        face.eyeDist = 14;
        face.id = 6;
        return face;
    }

    private static void assertSameFace(FaceInfo expected, FaceInfo face) {
        assertEquals(expected.faceRect, face.faceRect);
        assertArrayEquals(expected.facePoints, face.facePoints);
        assertArrayEquals(new float[] {expected.score, expected.yaw, expected.pitch, expected.roll, expected.eyeDist},
                new float[] {face.score, face.yaw, face.pitch, face.roll, face.eyeDist}, 1e-6f);
        assertEquals(expected.id, face.id);
    }

    @Test
    public void aFaceMapsAsAWhole() {
        // Upright 480 x 640, mirrored, doubled: a position x, y of the frame goes to 2 y, 2 x.
        FrameTransform view = FrameTransform.of(640, 480, 90).mirrored(true).fill(960, 1280);
        FaceInfo expected = face();
        expected.faceRect = new Rect(40, 20, 100, 60);
        expected.facePoints = new PointF[] {new PointF(50.5f, 25), new PointF(52.5f, 50.5f)};
        expected.yaw = -12;
        expected.roll = -3;
        expected.eyeDist = 28;
        FaceInfo face = face();
        FaceInfo shown = view.map(face, null);
        assertSameFace(expected, shown);
        assertSameFace(face(), face);
        assertSameFace(face(), view.unmap(shown, null));

        FaceInfo turned = FrameTransform.of(640, 480, 90).map(face, null);
        assertEquals("angles are those in the upright picture already", 3, turned.roll, 0);
        assertEquals(12, turned.yaw, 0);
        assertEquals(new Rect(430, 10, 460, 30), turned.faceRect);

        List<FaceInfo> all = view.map(Arrays.asList(face, face()));
        assertEquals(2, all.size());
        assertSameFace(expected, all.get(0));
        assertSameFace(expected, all.get(1));
    }

    @Test
    public void anAngleOfZeroKeepsItsSign() {
        FaceInfo face = face();
        face.roll = 0;
        face.yaw = 0;
        FaceInfo mirrored = FrameTransform.of(64, 48, 0).mirrored(true).map(face, null);
        assertEquals(0, Float.floatToRawIntBits(mirrored.roll));
        assertEquals(0, Float.floatToRawIntBits(mirrored.yaw));
    }

    @Test
    public void whatIsMissingInAFaceStaysMissing() {
        FrameTransform transform = FrameTransform.of(640, 480, 180);
        FaceInfo empty = transform.map(new FaceInfo(), face());
        assertNull(empty.faceRect);
        assertNull(empty.facePoints);
        FaceInfo gap = new FaceInfo();
        gap.facePoints = new PointF[] {null, new PointF(1, 2)};
        FaceInfo mapped = transform.map(gap, face());
        assertNull(mapped.facePoints[0]);
        assertEquals(new PointF(638, 477), mapped.facePoints[1]);
    }

    @Test
    public void objectsAreUsedAgain() {
        FrameTransform transform = FrameTransform.of(640, 480, 270).mirrored(true);
        FaceInfo face = face();
        FaceInfo expected = transform.map(face, null);
        assertNotSame(face.faceRect, expected.faceRect);
        FaceInfo reuse = face();
        Rect rect = reuse.faceRect;
        PointF[] points = reuse.facePoints;
        PointF second = points[1];
        assertSame(reuse, transform.map(face, reuse));
        assertSame(rect, reuse.faceRect);
        assertSame(points, reuse.facePoints);
        assertSame(second, reuse.facePoints[1]);
        assertSameFace(expected, reuse);

        // In place, and with another number of points.
        transform.map(face, face);
        assertSameFace(expected, face);
        FaceInfo more = face();
        more.facePoints = new PointF[3];
        transform.map(face(), more);
        assertSameFace(expected, more);

        Rect r = new Rect(1, 2, 3, 4);
        assertSame(r, transform.map(r, r));
        PointF p = new PointF(1, 2);
        assertSame(p, transform.map(p, p));
        assertSame(r, transform.cropRect(r));
        assertEquals(new Rect(0, 0, 640, 480), r);
    }

    @Test
    public void stepsAreTakenInOneOrderWhateverTheOrderOfTheCalls() {
        Rect crop = new Rect(3, 5, 101, 78);
        FrameTransform one = FrameTransform.of(320, 240, 90).crop(crop).mirrored(true).fit(500, 400);
        FrameTransform other = FrameTransform.of(320, 240, 90).fit(500, 400).mirrored(true).crop(crop);
        assertEquals(one, other);
        assertEquals(one.hashCode(), other.hashCode());
        assertEquals(one.toString(), other.toString());
        PointF point = new PointF(40, 50);
        assertEquals(one.map(point, null), other.map(point, null));
        assertEquals("(2, 4)-(102, 78) of 320 x 240, turned by 90, mirrored, fit into 500 x 400", one.toString());

        FrameTransform[] different = {
            FrameTransform.of(320, 240, 0), FrameTransform.of(322, 240, 0), FrameTransform.of(320, 242, 0),
            FrameTransform.of(320, 240, 90), FrameTransform.of(320, 240, 0).mirrored(true),
            FrameTransform.of(320, 240, 0).crop(new Rect(2, 0, 320, 240)),
            FrameTransform.of(320, 240, 0).crop(new Rect(0, 2, 320, 240)),
            FrameTransform.of(320, 240, 0).crop(new Rect(0, 0, 318, 240)),
            FrameTransform.of(320, 240, 0).crop(new Rect(0, 0, 320, 238)),
            FrameTransform.of(320, 240, 0).fit(320, 240), FrameTransform.of(320, 240, 0).fill(320, 240),
            FrameTransform.of(320, 240, 0).fill(320, 241), FrameTransform.of(320, 240, 0).fill(321, 240)};
        for (int i = 0; i < different.length; i++) {
            for (int j = 0; j < different.length; j++) {
                assertEquals(i == j, different[i].equals(different[j]));
            }
        }
        assertFalse(one.equals("transform"));
        assertNotEquals(one, null);
    }

    @Test
    public void whatDoesNotFitIsRefused() {
        refuses("frameWidth must be above 0, not 0", () -> FrameTransform.of(0, 480, 0));
        refuses("frameHeight must be above 0, not -1", () -> FrameTransform.of(640, -1, 0));
        refuses("rotationDegrees must be 0, 90, 180 or 270, not 45", () -> FrameTransform.of(640, 480, 45));
        FrameTransform transform = FrameTransform.of(640, 480, 0);
        refuses("crop.left must be from 0 to 639, not -1", () -> transform.crop(new Rect(-1, 0, 10, 10)));
        refuses("crop.top must be from 0 to 479, not 480", () -> transform.crop(new Rect(0, 480, 10, 481)));
        refuses("crop.right must be from 6 to 640, not 5", () -> transform.crop(new Rect(5, 0, 5, 10)));
        refuses("crop.right must be from 6 to 640, not 641", () -> transform.crop(new Rect(5, 0, 641, 10)));
        refuses("crop.bottom must be from 1 to 480, not 481", () -> transform.crop(new Rect(5, 0, 6, 481)));
        refuses("width must be above 0, not 0", () -> transform.fit(0, 10));
        refuses("height must be above 0, not 0", () -> transform.fill(10, 0));
        assertThrows(NullPointerException.class, () -> transform.crop(null));
        assertThrows(NullPointerException.class, () -> transform.map((Rect) null, null));
        assertThrows(NullPointerException.class, () -> transform.unmap((Rect) null, null));
        assertThrows(NullPointerException.class, () -> transform.map((PointF) null, null));
        assertThrows(NullPointerException.class, () -> transform.unmap((PointF) null, null));
        assertThrows(NullPointerException.class, () -> transform.map((FaceInfo) null, null));
        assertThrows(NullPointerException.class, () -> transform.unmap((FaceInfo) null, null));
        assertThrows(NullPointerException.class, () -> transform.map((List<FaceInfo>) null));
    }

    private static void refuses(String message, org.junit.function.ThrowingRunnable call) {
        assertEquals(message, assertThrows(IllegalArgumentException.class, call).getMessage());
    }

    /** The largest numbers end as the largest numbers, and the largest frame's edges do not overflow. */
    @Test
    public void extremesStayExtremes() {
        int max = Integer.MAX_VALUE;
        FrameTransform largest = FrameTransform.of(max, max, 180);
        assertEquals(new Rect(0, 0, max, max), largest.map(new Rect(0, 0, max, max), null));
        assertEquals(new Rect(max - 1, max - 2, max, max), largest.map(new Rect(0, 0, 1, 2), null));
        assertEquals(new Rect(0, 0, max, max), largest.crop(new Rect(1, 1, max, max)).cropRect(null));
        Rect far = largest.map(new Rect(Integer.MIN_VALUE, Integer.MIN_VALUE, 0, 0), null);
        assertEquals(new Rect(max, max, max, max), far);
        assertEquals(new Rect(max, max, max, max),
                FrameTransform.of(1, 1, 0).fit(max, max).map(new Rect(1, 1, 2, 2), null));
    }
}
