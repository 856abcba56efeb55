// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

/** The lightness of a pixel, written once more from its formulas. */
final class LightnessReference {
    private static final int[] LINEAR = new int[256];
    private static final int[] CUBE_ROOT = new int[2041];

    static {
        for (int i = 0; i < LINEAR.length; i++) {
            double v = i / 255.0;
            double linear = v <= 0.04045 ? v / 12.92 : Math.pow((v + 0.055) / 1.055, 2.4);
            LINEAR[i] = (int) Math.floor(2040 * linear + 0.5);
        }
        for (int i = 0; i < CUBE_ROOT.length; i++) {
            double y = i / 2040.0;
            CUBE_ROOT[i] = (int) Math.floor(32768 * (y < 0.008856 ? 7.787 * y + 16.0 / 116 : Math.cbrt(y)) + 0.5);
        }
    }

    private LightnessReference() {}

    static int of(int red, int green, int blue) {
        int y = (LINEAR[green] * 2929 + LINEAR[blue] * 296 + LINEAR[red] * 871 + 2048) >> 12;
        return (CUBE_ROOT[y] * 296 - 1320550) >> 15;
    }

    /** The rounded mean over a rectangle. */
    static int mean(byte[] image, boolean rgba, int stride, int x, int y, int w, int h) {
        long sum = 0;
        for (int row = y; row < y + h; row++) {
            for (int column = x; column < x + w; column++) {
                int at = row * stride + column * 4;
                int first = image[at] & 0xFF;
                int third = image[at + 2] & 0xFF;
                sum += of(rgba ? first : third, image[at + 1] & 0xFF, rgba ? third : first);
            }
        }
        long area = (long) w * h;
        return (int) ((sum + area / 2) / area);
    }
}
