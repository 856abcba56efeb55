// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

/**
 * The conversions between 4:2:0 frames and pixels, written once more from their formulas, one pixel at a time. U and V
 * are stored with 128 added; {@code >>} rounds towards minus infinity.
 */
final class ColorReference {
    private ColorReference() {}

    /** Byte positions of red, green and blue in a pixel, and the pixel's size; the byte left over is alpha. */
    enum Layout {
        RGBA(0, 1, 2, 4),
        BGRA(2, 1, 0, 4),
        BGR(2, 1, 0, 3);

        final int red;
        final int green;
        final int blue;
        final int size;

        Layout(int red, int green, int blue, int size) {
            this.red = red;
            this.green = green;
            this.blue = blue;
            this.size = size;
        }
    }

    /** The chroma order of a frame. */
    enum Chroma {
        VU, // NV21
        UV // NV12
    }

    static byte[] toPixels(byte[] frame, int width, int height, Chroma chroma, Layout layout) {
        byte[] out = new byte[width * height * layout.size];
        for (int y = 0; y < height; y++) {
            for (int x = 0; x < width; x++) {
                int luma = frame[y * width + x] & 0xFF;
                int pair = width * height + y / 2 * width + x / 2 * 2;
                int first = (frame[pair] & 0xFF) - 128;
                int second = (frame[pair + 1] & 0xFF) - 128;
                int u = chroma == Chroma.UV ? first : second;
                int v = chroma == Chroma.UV ? second : first;
                int at = (y * width + x) * layout.size;
                if (layout.size == 4) {
                    out[at + 3] = (byte) 255;
                }
                out[at + layout.blue] = clamp(64 * luma + 110 * u + 32 >> 6);
                out[at + layout.green] = clamp(64 * luma - 24 * u - 44 * v + 32 >> 6);
                out[at + layout.red] = clamp(64 * luma + 86 * v + 32 >> 6);
            }
        }
        return out;
    }

    static byte[] toFrame(byte[] pixels, int width, int height, Layout layout, Chroma chroma) {
        byte[] out = new byte[width * height * 3 / 2];
        for (int y = 0; y < height; y++) {
            for (int x = 0; x < width; x++) {
                int at = (y * width + x) * layout.size;
                int r = pixels[at + layout.red] & 0xFF;
                int g = pixels[at + layout.green] & 0xFF;
                int b = pixels[at + layout.blue] & 0xFF;
                out[y * width + x] = (byte) (16 * b + 74 * g + 38 * r + 64 >> 7);
                if (x % 2 == 0 && y % 2 == 0) { // the top left pixel of a 2 x 2 block gives the block's chroma
                    byte u = clamp((65 * b - 43 * g - 22 * r + 64 >> 7) + 128);
                    byte v = clamp((-12 * b - 55 * g + 67 * r + 64 >> 7) + 128);
                    int pair = width * height + y / 2 * width + x;
                    out[pair] = chroma == Chroma.UV ? u : v;
                    out[pair + 1] = chroma == Chroma.UV ? v : u;
                }
            }
        }
        return out;
    }

    private static byte clamp(int value) {
        return (byte) Math.max(0, Math.min(255, value));
    }
}
