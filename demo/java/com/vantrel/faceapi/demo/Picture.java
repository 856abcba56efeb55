// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import java.awt.color.ColorSpace;
import java.awt.image.BufferedImage;
import java.awt.image.ColorModel;
import java.awt.image.IndexColorModel;
import java.awt.image.Raster;
import java.io.ByteArrayInputStream;
import java.io.File;
import java.io.IOException;
import java.nio.file.Files;
import java.util.Iterator;
import javax.imageio.ImageIO;
import javax.imageio.ImageReader;
import javax.imageio.stream.ImageInputStream;

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

    /** Reads a file, as upright as it says that it is. */
    static Picture read(File file) throws UnusablePicture {
        if (file.isDirectory()) {
            throw new UnusablePicture("The path " + file + " is a folder, not a picture.");
        }
        if (!file.isFile()) {
            throw new UnusablePicture("There is no file " + file + ".");
        }
        UnusablePicture damaged = new UnusablePicture("The picture " + file + " is damaged or cannot be read.");
        try {
            byte[] bytes = Files.readAllBytes(file.toPath());
            JpegHeader header = JpegHeader.of(bytes);
            if (header != null && !header.complete) { // the reader would show what is missing as gray
                throw damaged;
            }
            Picture picture = decode(bytes, header);
            if (picture == null) {
                throw new UnusablePicture("The file " + file + " is no picture (PNG, JPEG, GIF and BMP are known).");
            }
            return header == null ? picture : picture.oriented(header.orientation);
        } catch (IOException | RuntimeException failed) { // readers throw either, depending on where a file is broken
            throw damaged;
        } catch (OutOfMemoryError large) {
            throw new UnusablePicture("The picture " + file + " is too large for this virtual machine's memory.");
        }
    }

    /** The picture in a file's bytes, null if they are none. */
    private static Picture decode(byte[] bytes, JpegHeader header) throws IOException {
        try (ImageInputStream in = ImageIO.createImageInputStream(new ByteArrayInputStream(bytes))) {
            Iterator<ImageReader> readers = ImageIO.getImageReaders(in);
            if (!readers.hasNext()) {
                return null;
            }
            ImageReader reader = readers.next();
            try {
                reader.setInput(in, true, true);
                // Java reads four channels in ways of its own, or not at all.
                return header != null && header.channels == 4
                        ? ofInks(reader.readRaster(0, null), header.adobeTransform)
                        : of(reader.read(0));
            } finally {
                reader.dispose();
            }
        }
    }

    /**
     * The pixels of an image, by its colour space. Grays are those of sRGB, as the formats mean them: Java takes them for
     * linear light, in which they would come out too bright.
     */
    private static Picture of(BufferedImage image) {
        int width = image.getWidth();
        int height = image.getHeight();
        ColorModel model = image.getColorModel();
        int space = model.getColorSpace().getType();
        if (model instanceof IndexColorModel || space != ColorSpace.TYPE_GRAY && space != ColorSpace.TYPE_CMYK) {
            return new Picture(width, height, image.getRGB(0, 0, width, height, null, 0, width));
        }
        int[] pixels = new int[width * height];
        Object element = null;
        float[] parts = null;
        for (int i = 0; i < pixels.length; i++) {
            element = image.getRaster().getDataElements(i % width, i / width, element);
            parts = model.getNormalizedComponents(element, parts, 0);
            pixels[i] = space == ColorSpace.TYPE_GRAY
                    ? rgb(parts[0], parts[0], parts[0])
                    : rgb((1 - parts[0]) * (1 - parts[3]), (1 - parts[1]) * (1 - parts[3]),
                            (1 - parts[2]) * (1 - parts[3]));
        }
        return new Picture(width, height, pixels);
    }

    /**
     * The pixels of four channels of a JPEG file: cyan, magenta, yellow and black. In files with Adobe's segment all of
     * them are inverted, and the first three may be luma and chroma.
     */
    private static Picture ofInks(Raster raster, int adobeTransform) {
        int[] pixels = new int[raster.getWidth() * raster.getHeight()];
        float[] inks = new float[4];
        for (int i = 0; i < pixels.length; i++) {
            raster.getPixel(i % raster.getWidth(), i / raster.getWidth(), inks);
            if (adobeTransform == 2) { // the luma and chroma of JFIF
                float luma = inks[0];
                float cb = inks[1] - 128;
                float cr = inks[2] - 128;
                inks[0] = Math.min(Math.max(luma + 1.402f * cr, 0), 255);
                inks[1] = Math.min(Math.max(luma - 0.344136f * cb - 0.714136f * cr, 0), 255);
                inks[2] = Math.min(Math.max(luma + 1.772f * cb, 0), 255);
            }
            for (int ink = 0; ink < 4; ink++) { // as how much of the light it leaves
                inks[ink] = (adobeTransform < 0 ? 255 - inks[ink] : inks[ink]) / 255;
            }
            pixels[i] = rgb(inks[0] * inks[3], inks[1] * inks[3], inks[2] * inks[3]);
        }
        return new Picture(raster.getWidth(), raster.getHeight(), pixels);
    }

    private static int rgb(float red, float green, float blue) {
        return Math.round(red * 255) << 16 | Math.round(green * 255) << 8 | Math.round(blue * 255);
    }

    /** The picture turned and mirrored as an Exif orientation asks, from 1 (as it is) to 8. */
    private Picture oriented(int orientation) {
        switch (orientation) {
            case 2:
                return mirrored();
            case 3:
                return rotated(180);
            case 4:
                return rotated(180).mirrored();
            case 5:
                return rotated(90).mirrored();
            case 6:
                return rotated(90);
            case 7:
                return rotated(270).mirrored();
            case 8:
                return rotated(270);
            default:
                return this;
        }
    }

    /** The picture with left and right exchanged. */
    private Picture mirrored() {
        int[] out = new int[pixels.length];
        for (int y = 0, at = 0; y < height; y++) {
            for (int x = 0; x < width; x++, at++) {
                out[at] = pixel(width - 1 - x, y);
            }
        }
        return new Picture(width, height, out);
    }

    /** The picture turned clockwise by a multiple of 90 degrees. */
    Picture rotated(int degrees) {
        Picture turned = this;
        for (int quarters = degrees / 90; quarters > 0; quarters--) {
            turned = turned.turned();
        }
        return turned;
    }

    private Picture turned() {
        int[] out = new int[pixels.length];
        for (int y = 0, at = 0; y < width; y++) {
            for (int x = 0; x < height; x++, at++) {
                out[at] = pixel(y, height - 1 - x);
            }
        }
        return new Picture(height, width, out);
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
