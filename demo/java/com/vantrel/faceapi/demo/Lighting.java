// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import android.graphics.Rect;
import com.vantrel.faceapi.BrightnessMetric;
import com.vantrel.faceapi.FaceLibrary;
import com.vantrel.faceapi.model.FaceInfo;

/** How bright a frame and the faces in it are, as it is, darkened and brightened. */
final class Lighting {
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
            printRow("face " + (i + 1), rgba, dark, bright, nv21, faces[i].faceRect);
        }
    }

    private void printRow(String name, byte[] rgba, byte[] dark, byte[] bright, byte[] nv21, Rect r) {
        // The luma of an NV21 frame is its first width * height bytes: an image of one byte a pixel.
        float luma = FaceLibrary.averageBrightness(nv21, width, height, r.left, r.top, r.width(), r.height());
        System.out.printf("%-10s %10d %10d %10d %10.3f%n", name, lightness(rgba, r), lightness(dark, r),
                lightness(bright, r), luma);
    }

    private int lightness(byte[] rgba, Rect r) {
        return FaceLibrary.faceBrightEvaluate(rgba, BrightnessMetric.LIGHTNESS_RGBA, width, 4 * width, height, height,
                r.left, r.top, r.width(), r.height());
    }
}
