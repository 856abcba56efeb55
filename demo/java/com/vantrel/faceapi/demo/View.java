// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import android.graphics.Rect;

/**
 * What a camera sees of a flat picture: the picture's point in the middle of the frame, how much a pixel of the picture
 * is magnified, and how far the camera is rolled. Every step is plain double arithmetic, so the frames are the same on
 * every machine.
 */
final class View {
    private final double centreX;
    private final double centreY;
    private final double zoom;
    private final double cos;
    private final double sin;
    /** The size of the frame in pixels. */
    final int width;
    final int height;

    /**
     * @param centreX the picture's point in the middle of the frame, in pixels
     * @param zoom pixels of the frame for one pixel of the picture
     * @param roll radians by which the camera is turned clockwise
     * @param width width of the frame in pixels
     */
    View(double centreX, double centreY, double zoom, double roll, int width, int height) {
        this.centreX = centreX;
        this.centreY = centreY;
        this.zoom = zoom;
        this.cos = StrictMath.cos(roll);
        this.sin = StrictMath.sin(roll);
        this.width = width;
        this.height = height;
    }

    /** The picture pixel by pixel, in the top left of a frame that is at least as large. */
    static View pixelByPixel(int width, int height) {
        return new View(width / 2.0, height / 2.0, 1, 0, width, height);
    }

    /** The view that shows the whole picture, as large as it fits and centred. */
    static View whole(Picture picture, int width, int height) {
        double zoom = Math.min((double) width / picture.width, (double) height / picture.height);
        return new View(picture.width / 2.0, picture.height / 2.0, zoom, 0, width, height);
    }

    /** The picture's x of the frame's point (x, y). */
    double pictureX(double x, double y) {
        return centreX + ((x - width / 2.0) * cos + (y - height / 2.0) * sin) / zoom;
    }

    /** The picture's y of the frame's point (x, y). */
    double pictureY(double x, double y) {
        return centreY + ((y - height / 2.0) * cos - (x - width / 2.0) * sin) / zoom;
    }

    /** The frame's x of the picture's point (x, y). */
    double frameX(double x, double y) {
        return width / 2.0 + ((x - centreX) * cos - (y - centreY) * sin) * zoom;
    }

    /** The frame's y of the picture's point (x, y). */
    double frameY(double x, double y) {
        return height / 2.0 + ((y - centreY) * cos + (x - centreX) * sin) * zoom;
    }

    double zoom() {
        return zoom;
    }

    /** A rectangle of the frame in the picture's coordinates: the smallest upright one that holds it. */
    Rect toPicture(Rect r) {
        double[] xs = new double[4];
        double[] ys = new double[4];
        for (int corner = 0; corner < 4; corner++) {
            int x = corner % 2 == 0 ? r.left : r.right;
            int y = corner / 2 == 0 ? r.top : r.bottom;
            xs[corner] = pictureX(x, y);
            ys[corner] = pictureY(x, y);
        }
        java.util.Arrays.sort(xs);
        java.util.Arrays.sort(ys);
        return new Rect((int) Math.round(xs[0]), (int) Math.round(ys[0]), (int) Math.round(xs[3]),
                (int) Math.round(ys[3]));
    }

    /** Renders the frame as packed RGBA: bilinear samples of the picture, black where the camera looks past it. */
    byte[] render(Picture picture) {
        // A picture much larger than the frame is averaged down first: bilinear samples alone would skip pixels.
        int factor = Math.max(1, (int) Math.floor(1 / zoom));
        Picture source = factor == 1 ? picture : picture.reduced(factor);
        byte[] rgba = new byte[width * height * 4];
        for (int y = 0, at = 0; y < height; y++) {
            for (int x = 0; x < width; x++, at += 4) {
                int rgb = sample(source, pictureX(x + 0.5, y + 0.5) / factor, pictureY(x + 0.5, y + 0.5) / factor);
                rgba[at] = (byte) (rgb >> 16);
                rgba[at + 1] = (byte) (rgb >> 8);
                rgba[at + 2] = (byte) rgb;
                rgba[at + 3] = (byte) 255;
            }
        }
        return rgba;
    }

    private static int sample(Picture picture, double x, double y) {
        if (x < 0 || x >= picture.width || y < 0 || y >= picture.height) {
            return 0;
        }
        // Pixel centres lie at halves. Weights are in 256ths, which is all that eight bits can show.
        int fx = (int) Math.floor((x - 0.5) * 256);
        int fy = (int) Math.floor((y - 0.5) * 256);
        int x0 = Math.max(fx >> 8, 0);
        int y0 = Math.max(fy >> 8, 0);
        int x1 = Math.min((fx >> 8) + 1, picture.width - 1);
        int y1 = Math.min((fy >> 8) + 1, picture.height - 1);
        int wx = fx & 0xFF;
        int wy = fy & 0xFF;
        int out = 0;
        for (int shift = 0; shift <= 16; shift += 8) {
            int top = channel(picture, x0, y0, shift) * (256 - wx) + channel(picture, x1, y0, shift) * wx;
            int bottom = channel(picture, x0, y1, shift) * (256 - wx) + channel(picture, x1, y1, shift) * wx;
            out |= (top * (256 - wy) + bottom * wy + 0x8000) >> 16 << shift;
        }
        return out;
    }

    private static int channel(Picture picture, int x, int y, int shift) {
        return picture.pixel(x, y) >> shift & 0xFF;
    }
}
