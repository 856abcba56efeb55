// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import android.graphics.Rect;
import com.vantrel.faceapi.BrightnessMetric;
import com.vantrel.faceapi.FaceLibrary;
import com.vantrel.faceapi.model.FaceInfo;
import java.util.function.ToDoubleFunction;

/** How bright a frame and the faces in it are, as it is, darkened and brightened. */
final class Lighting {
    /** So many pixels' sums are held by the library's 32 bits, however bright they are. */
    private static final int MOST_PIXELS = 1 << 23;

    private final int width;
    private final int height;

    Lighting(int width, int height) {
        this.width = width;
        this.height = height;
    }

    /** Prints a table: the lightness (0 to 255) of RGBA pixels, and the average luma (0 to 1) of the NV21 frame. */
    void print(byte[] rgba, byte[] nv21, FaceInfo[] faces) {
        byte[] dark = rgba.clone();
        byte[] bright = rgba.clone();
        for (int i = 0; i < rgba.length; i++) {
            if (i % 4 != 3) {
                int value = rgba[i] & 0xFF;
                dark[i] = (byte) (value / 2);
                bright[i] = (byte) (255 - (255 - value) / 2);
            }
        }
        System.out.printf("%-10s %10s %10s %10s %10s%n", "brightness", "lightness", "darkened", "brightened", "luma");
        printRow("frame", rgba, dark, bright, nv21, new Rect(0, 0, width, height));
        for (int i = 0; i < faces.length; i++) {
            Rect r = faces[i].faceRect;
            Rect inside = new Rect(
                    Math.max(r.left, 0), Math.max(r.top, 0), Math.min(r.right, width), Math.min(r.bottom, height));
            printRow("face " + (i + 1), rgba, dark, bright, nv21, inside);
        }
    }

    private void printRow(String name, byte[] rgba, byte[] dark, byte[] bright, byte[] nv21, Rect r) {
        double luma = mean(r, band -> luma(nv21, band));
        System.out.printf("%-10s %10d %10d %10d %10.3f%n", name, lightness(rgba, r), lightness(dark, r),
                lightness(bright, r), luma);
    }

    private long lightness(byte[] rgba, Rect r) {
        return Math.round(mean(r, band -> FaceLibrary.faceBrightEvaluate(rgba, BrightnessMetric.LIGHTNESS_RGBA, width,
                4 * width, height, height, band.left, band.top, band.width(), band.height())));
    }

    /**
     * The luma of an NV21 frame is its first width * height bytes: an image of one byte a pixel. The rectangle is cut
     * out of it first, for far to the right of a wide image fewer rows would be averaged.
     */
    private float luma(byte[] nv21, Rect r) {
        int columns = r.width();
        int rows = r.height();
        byte[] cut = new byte[columns * rows];
        for (int y = 0; y < rows; y++) {
            System.arraycopy(nv21, (r.top + y) * width + r.left, cut, y * columns, columns);
        }
        return FaceLibrary.averageBrightness(cut, columns, rows, 0, 0, columns, rows);
    }

    /** The mean of what rates a rectangle, taken band by band where the library's sums would not hold the whole. */
    private static double mean(Rect r, ToDoubleFunction<Rect> rating) {
        int rows = MOST_PIXELS / r.width();
        double sum = 0;
        for (int top = r.top; top < r.bottom; top += rows) {
            Rect band = new Rect(r.left, top, r.right, Math.min(top + rows, r.bottom));
            sum += rating.applyAsDouble(band) * band.height();
        }
        return sum / r.height();
    }
}
