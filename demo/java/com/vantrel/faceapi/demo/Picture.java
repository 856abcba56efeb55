// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import javax.imageio.ImageIO;

/** A picture in memory: 0xRRGGBB pixels, row by row. */
final class Picture {
    final int width;
    final int height;
    private final int[] pixels;

    private Picture(int width, int height, int[] pixels) {
        this.width = width;
        this.height = height;
        this.pixels = pixels;
    }

    static Picture read(File file) throws UnusablePicture {
        if (!file.isFile()) {
            throw new UnusablePicture("There is no file " + file + ".");
        }
        BufferedImage image;
        try {
            image = ImageIO.read(file);
        } catch (IOException | RuntimeException damaged) { // readers throw either, depending on where a file is broken
            throw new UnusablePicture("The picture " + file + " is damaged or cannot be read.");
        }
        if (image == null) {
            throw new UnusablePicture("The file " + file + " is no picture (PNG, JPEG, GIF and BMP are known).");
        }
        int width = image.getWidth();
        int height = image.getHeight();
        return new Picture(width, height, image.getRGB(0, 0, width, height, null, 0, width));
    }

    int pixel(int x, int y) {
        return pixels[y * width + x];
    }

    /** The pixels as 0xAARRGGBB, alpha being anything; not a copy. */
    int[] argb() {
        return pixels;
    }

    /** The picture with every {@code factor x factor} block averaged to one pixel; what is left at the edges goes. */
    Picture reduced(int factor) {
        int w = width / factor;
        int h = height / factor;
        int area = factor * factor;
        int[] out = new int[w * h];
        for (int y = 0; y < h; y++) {
            for (int x = 0; x < w; x++) {
                long r = area / 2;
                long g = r;
                long b = r;
                for (int i = 0; i < area; i++) {
                    int rgb = pixel(x * factor + i % factor, y * factor + i / factor);
                    r += rgb >> 16 & 0xFF;
                    g += rgb >> 8 & 0xFF;
                    b += rgb & 0xFF;
                }
                out[y * w + x] = (int) (r / area) << 16 | (int) (g / area) << 8 | (int) (b / area);
            }
        }
        return new Picture(w, h, out);
    }
}
