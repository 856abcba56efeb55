// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import android.graphics.PointF;
import com.vantrel.faceapi.model.FaceInfo;
import java.util.Arrays;

/**
 * Cuts a face out of a picture: a square in any position, brought to one size. The part of the picture around it is
 * converted by native code; this class resamples that, which is little work for the size of a face. It keeps its arrays
 * for the next face. For one thread at a time.
 */
final class FaceCutter {
    /** Where the eyes are put, and how far from one another, as parts of the square's side. */
    static final double EYES_Y = 0.36;
    static final double EYE_DISTANCE = 0.36;

    /** The square's side without eyes, as a multiple of the rectangle's longer side. */
    static final double MARGIN = 1.25;

    /** How far the distance of the eyes that were found among the points may be from the face's own. */
    private static final double EYES_TOLERANCE = 0.1;

    private static final int BLACK = 0xFF000000;

    private int[] region = {};
    private int[] out = {};

    // The square, in the frame's edges: where it is held, at which place of its own, and its x axis, as long as a pixel
    // of the result.
    private double holdX;
    private double holdY;
    private double ownX;
    private double ownY;
    private double axisX;
    private double axisY;

    Bitmap cut(Object y, Object u, Object v, int[] picture, int width, int height, int rotationDegrees, FaceInfo face,
            int size, Bitmap reuse) {
        Check.notNull("face", face);
        Check.rotation("rotationDegrees", rotationDegrees);
        Check.positive("size", size);
        int pixels = Check.packedBytes(PixelFormat.RGBA, size, size) / Integer.BYTES;
        place(face, rotationDegrees, size);
        Bitmap bitmap = TransformPass.bitmap(reuse, size, size);
        out = out.length < pixels ? new int[pixels] : out;
        fill(y, u, v, picture, width, height, size);
        bitmap.setPixels(out, 0, size, 0, 0, size, size);
        return bitmap;
    }

    /** Lays the square over the face. */
    private void place(FaceInfo face, int rotationDegrees, int size) {
        double side;
        double angle;
        if (placeByEyes(face.facePoints, face.eyeDist)) {
            side = Math.hypot(axisX, axisY) / EYE_DISTANCE;
            angle = Math.atan2(axisY, axisX);
            ownY = EYES_Y * size;
        } else {
            Check.notNull("face.faceRect", face.faceRect);
            double w = (double) face.faceRect.right - face.faceRect.left;
            double h = (double) face.faceRect.bottom - face.faceRect.top;
            if (!(w > 0 && h > 0)) {
                throw new IllegalArgumentException("face.faceRect must not be empty");
            }
            side = MARGIN * Math.max(w, h);
            // The upright picture's x axis lies in the frame as the frame is turned, the other way round; the head
            // leans from there.
            angle = Math.toRadians((Float.isNaN(face.roll) ? 0 : face.roll) - rotationDegrees);
            holdX = face.faceRect.left + w / 2;
            holdY = face.faceRect.top + h / 2;
            ownY = size / 2.0;
        }
        ownX = size / 2.0;
        axisX = Math.cos(angle) * side / size;
        axisY = Math.sin(angle) * side / size;
    }

    /** Finds the eyes among the points: their middle, and from one to the other. False when there are none. */
    private boolean placeByEyes(PointF[] points, float eyeDistance) {
        // 68 points in the usual order; or five, of which those of the eye on the viewer's right come first.
        int count = points == null ? 0 : points.length;
        int each = count == 68 ? 6 : 2;
        int left = count == 68 ? 36 : 2;
        int right = count == 68 ? 42 : 0;
        if (count != 68 && count != 5) {
            return false;
        }
        double leftX = 0;
        double leftY = 0;
        double rightX = 0;
        double rightY = 0;
        for (int i = 0; i < each; i++) {
            PointF l = points[left + i];
            PointF r = points[right + i];
            if (l == null || r == null) {
                return false;
            }
            leftX += l.x / (double) each;
            leftY += l.y / (double) each;
            rightX += r.x / (double) each;
            rightY += r.y / (double) each;
        }
        axisX = rightX - leftX;
        axisY = rightY - leftY;
        // A point is a pixel's middle.
        holdX = (leftX + rightX) / 2 + 0.5;
        holdY = (leftY + rightY) / 2 + 0.5;
        // Where points mean something else, the distance that the engine gives does not fit.
        return eyeDistance > 0 && Math.abs(Math.hypot(axisX, axisY) / eyeDistance - 1) <= EYES_TOLERANCE;
    }

    private double frameX(double x, double y) {
        return holdX + (x - ownX) * axisX - (y - ownY) * axisY;
    }

    private double frameY(double x, double y) {
        return holdY + (x - ownX) * axisY + (y - ownY) * axisX;
    }

    private void fill(Object y, Object u, Object v, int[] picture, int width, int height, int size) {
        double x0 = Double.POSITIVE_INFINITY;
        double y0 = x0;
        double x1 = Double.NEGATIVE_INFINITY;
        double y1 = x1;
        for (int corner = 0; corner < 4; corner++) {
            double cornerX = (corner & 1) * size;
            double cornerY = (corner >> 1) * size;
            x0 = Math.min(x0, frameX(cornerX, cornerY));
            x1 = Math.max(x1, frameX(cornerX, cornerY));
            y0 = Math.min(y0, frameY(cornerX, cornerY));
            y1 = Math.max(y1, frameY(cornerX, cornerY));
        }
        // A large face is averaged down first: interpolation alone would skip pixels.
        int factor = (int) Math.max(1, Math.min(Math.floor(Math.hypot(axisX, axisY)), Math.max(width, height)));
        // One mean more to all sides, for what is interpolated, and even edges.
        int left = (int) Math.max(0, Math.floor(x0) - factor) & ~1;
        int top = (int) Math.max(0, Math.floor(y0) - factor) & ~1;
        int right = (int) Math.min(width, Math.ceil(x1) + factor + 1) & ~1;
        int bottom = (int) Math.min(height, Math.ceil(y1) + factor + 1) & ~1;
        if (left >= right || top >= bottom) {
            Arrays.fill(out, 0, size * size, BLACK);
            return;
        }
        int w = right - left;
        int h = bottom - top;
        // A part of a picture that fits an array fits one as well.
        region = region.length < w * h ? new int[w * h] : region;
        PlaneConversion.check(PlaneConversion.toInts(
                y, u, v, picture, left, top, w, h, 0, false, PlaneConversion.BGRA, region, 0, w));

        int reducedW = (w + factor - 1) / factor;
        int reducedH = (h + factor - 1) / factor;
        if (factor > 1) {
            reduce(w, h, factor);
        }
        for (int row = 0, at = 0; row < size; row++) {
            for (int column = 0; column < size; column++) {
                double inFrameX = frameX(column + 0.5, row + 0.5);
                double inFrameY = frameY(column + 0.5, row + 0.5);
                boolean inside = inFrameX >= 0 && inFrameX < width && inFrameY >= 0 && inFrameY < height;
                out[at++] = inside ? sample((inFrameX - left) / factor, (inFrameY - top) / factor, reducedW, reducedH)
                        : BLACK;
            }
        }
    }

    /** Averages squares of {@code factor} pixels, less at the ends, in place: a mean lies before what it is made of. */
    private void reduce(int w, int h, int factor) {
        int to = 0;
        for (int top = 0; top < h; top += factor) {
            int bottom = Math.min(top + factor, h);
            for (int left = 0; left < w; left += factor) {
                int right = Math.min(left + factor, w);
                long red = 0;
                long green = 0;
                long blue = 0;
                for (int y = top; y < bottom; y++) {
                    for (int at = y * w + left; at < y * w + right; at++) {
                        int pixel = region[at];
                        red += pixel >> 16 & 0xFF;
                        green += pixel >> 8 & 0xFF;
                        blue += pixel & 0xFF;
                    }
                }
                int count = (bottom - top) * (right - left);
                region[to++] = BLACK | mean(red, count) << 16 | mean(green, count) << 8 | mean(blue, count);
            }
        }
    }

    private static int mean(long sum, int count) {
        return (int) ((sum + count / 2) / count);
    }

    /** The colour at a position of the region, between the middles of four pixels, in 256ths. */
    private int sample(double x, double y, int w, int h) {
        int fx = (int) Math.floor((x - 0.5) * 256);
        int fy = (int) Math.floor((y - 0.5) * 256);
        int left = clamp(fx >> 8, w);
        int right = clamp((fx >> 8) + 1, w);
        int top = clamp(fy >> 8, h) * w;
        int bottom = clamp((fy >> 8) + 1, h) * w;
        int wx = fx & 0xFF;
        int wy = fy & 0xFF;
        int a = region[top + left];
        int b = region[top + right];
        int c = region[bottom + left];
        int d = region[bottom + right];
        int pixel = BLACK;
        for (int shift = 0; shift <= 16; shift += 8) {
            int upper = (a >> shift & 0xFF) * (256 - wx) + (b >> shift & 0xFF) * wx;
            int lower = (c >> shift & 0xFF) * (256 - wx) + (d >> shift & 0xFF) * wx;
            pixel |= (upper * (256 - wy) + lower * wy + 0x8000) >> 16 << shift;
        }
        return pixel;
    }

    private static int clamp(int at, int length) {
        return Math.max(0, Math.min(at, length - 1));
    }
}
