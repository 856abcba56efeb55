// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import android.graphics.Rect;
import com.vantrel.faceapi.ColorConversion;
import com.vantrel.faceapi.FaceLibrary;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;

/** Pieces of a frame: a face cut out, and the whole frame turned by right angles. */
final class Turning {
    private final byte[] nv21;
    private final int width;
    private final int height;

    Turning(byte[] nv21, int width, int height) {
        this.nv21 = nv21;
        this.width = width;
        this.height = height;
    }

    /** Writes what the rectangle shows, grown to even coordinates: chroma is shared by pairs of columns and rows. */
    void writeCrop(Rect r, File file) throws IOException {
        int x = Math.max(r.left, 0) & ~1;
        int y = Math.max(r.top, 0) & ~1;
        int w = Math.min(r.right + 1 & ~1, width) - x;
        int h = Math.min(r.bottom + 1 & ~1, height) - y;
        byte[] rgba = new byte[w * h * 4];
        FaceLibrary.cropNv21Data(nv21, width, height, x, y, w, h, rgba);
        Drawing.writePng(Drawing.fromRgba(rgba, w, h), file);
    }

    /** Writes the frame turned clockwise by 90, 180 and 270 degrees, side by side. */
    void writeRotations(File file) throws IOException {
        byte[] bgr = new byte[width * height * 3];
        FaceLibrary.convertColorSpace(nv21, width, height, bgr, ColorConversion.NV21_TO_BGR);
        int side = Math.max(width, height) / 2;
        ContactSheet sheet = new ContactSheet(3, 3, side, side);
        for (int degree = 90; degree <= 270; degree += 90) {
            byte[] turned = new byte[bgr.length];
            int[] size = new int[2];
            FaceLibrary.rotateBGR(bgr, width, height, turned, degree, size);
            sheet.add(fromBgr(turned, size[0], size[1]));
        }
        sheet.write(file);
    }

    private static BufferedImage fromBgr(byte[] bgr, int width, int height) {
        BufferedImage image = new BufferedImage(width, height, BufferedImage.TYPE_3BYTE_BGR);
        image.getRaster().setDataElements(0, 0, width, height, bgrToRgb(bgr));
        return image;
    }

    /** A raster takes a pixel's channels in the order red, green, blue, however it stores them. */
    private static byte[] bgrToRgb(byte[] bgr) {
        byte[] rgb = bgr.clone();
        for (int i = 0; i < rgb.length; i += 3) {
            rgb[i] = bgr[i + 2];
            rgb[i + 2] = bgr[i];
        }
        return rgb;
    }
}
