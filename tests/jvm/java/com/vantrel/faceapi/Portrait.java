// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.awt.Graphics2D;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import javax.imageio.ImageIO;

/**
 * The demo's portrait, cut down to the part around the face: 256 x 192 pixels, so that finding the face is quick. The
 * face's box is {@link #FACE}.
 */
final class Portrait {
    static final int WIDTH = 256;
    static final int HEIGHT = 192;
    /** A tight box around the face. */
    static final Rect FACE = new Rect(83, 53, 170, 140);

    private static final int LEFT = 96;
    private static final int TOP = 30;

    private final BufferedImage image;

    private Portrait(BufferedImage image) {
        this.image = image;
    }

    static Portrait read() {
        try {
            BufferedImage whole = ImageIO.read(new File(System.getProperty("kyface.source"), "demo/portrait.png"));
            return new Portrait(whole.getSubimage(LEFT, TOP, WIDTH, HEIGHT));
        } catch (IOException e) {
            throw new AssertionError(e);
        }
    }

    /** Turned counter-clockwise by a quarter: the frame of a camera that has to be turned clockwise by 90 degrees. */
    Portrait onItsSide() {
        BufferedImage turned = new BufferedImage(HEIGHT, WIDTH, BufferedImage.TYPE_INT_RGB);
        for (int y = 0; y < WIDTH; y++) {
            for (int x = 0; x < HEIGHT; x++) {
                turned.setRGB(x, y, image.getRGB(WIDTH - 1 - y, x));
            }
        }
        return new Portrait(turned);
    }

    /** The same picture, moved to the right and down; what is uncovered is black. */
    Portrait moved(int dx, int dy) {
        BufferedImage moved = new BufferedImage(width(), height(), BufferedImage.TYPE_INT_RGB);
        Graphics2D g = moved.createGraphics();
        g.drawImage(image, dx, dy, null);
        g.dispose();
        return new Portrait(moved);
    }

    /** A plain area of the same size, without a face. */
    static Portrait blank() {
        BufferedImage gray = new BufferedImage(WIDTH, HEIGHT, BufferedImage.TYPE_INT_RGB);
        Graphics2D g = gray.createGraphics();
        g.setColor(java.awt.Color.GRAY);
        g.fillRect(0, 0, WIDTH, HEIGHT);
        g.dispose();
        return new Portrait(gray);
    }

    int width() {
        return image.getWidth();
    }

    int height() {
        return image.getHeight();
    }

    /**
     * The pixels with the given bytes of red, green and blue, {@code size} bytes a pixel, rows {@code stride} bytes
     * apart. Bytes that no pixel uses are 77.
     */
    byte[] pixels(int red, int green, int blue, int size, int stride) {
        byte[] out = new byte[stride * height()];
        java.util.Arrays.fill(out, (byte) 77);
        for (int y = 0; y < height(); y++) {
            for (int x = 0; x < width(); x++) {
                int rgb = image.getRGB(x, y);
                int at = y * stride + x * size;
                out[at + red] = (byte) (rgb >> 16);
                out[at + green] = (byte) (rgb >> 8);
                out[at + blue] = (byte) rgb;
            }
        }
        return out;
    }

    byte[] rgba() {
        return pixels(0, 1, 2, 4, 4 * width());
    }

    /** 0xAARRGGBB pixels. */
    int[] argb() {
        return image.getRGB(0, 0, width(), height(), null, 0, width());
    }

    byte[] frame(ColorReference.Chroma chroma) {
        return ColorReference.toFrame(rgba(), width(), height(), ColorReference.Layout.RGBA, chroma);
    }

    byte[] nv21() {
        return frame(ColorReference.Chroma.VU);
    }

    /** The area that two rectangles share, as a part of the area that they cover together. */
    static double overlap(Rect a, Rect b) {
        long w = Math.min(a.right, b.right) - Math.max(a.left, b.left);
        long h = Math.min(a.bottom, b.bottom) - Math.max(a.top, b.top);
        long shared = w > 0 && h > 0 ? w * h : 0;
        return (double) shared / ((long) a.width() * a.height() + (long) b.width() * b.height() - shared);
    }

    /** Fails unless exactly one face was found, where the portrait's is. */
    static FaceInfo assertFound(FaceInfo[] faces, Rect where) {
        if (faces == null || faces.length != 1) {
            throw new AssertionError("found " + (faces == null ? 0 : faces.length) + " faces");
        }
        if (overlap(faces[0].faceRect, where) < 0.5) {
            throw new AssertionError("found " + faces[0].faceRect + " instead of " + where);
        }
        return faces[0];
    }
}
