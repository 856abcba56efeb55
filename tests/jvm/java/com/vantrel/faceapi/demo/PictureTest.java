// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;
import static org.junit.Assert.fail;

import java.awt.Point;
import java.awt.image.BufferedImage;
import java.awt.image.Raster;
import java.awt.image.WritableRaster;
import java.io.ByteArrayOutputStream;
import java.io.File;
import java.io.IOException;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.util.Arrays;
import javax.imageio.IIOImage;
import javax.imageio.ImageIO;
import javax.imageio.ImageWriter;
import javax.imageio.stream.ImageOutputStream;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/** Pictures are read upright and in the colours that they mean, or refused with a sentence. */
public class PictureTest {
    private static final int[] GRAYS = {0, 1, 84, 128, 200, 255};

    @Rule public final TemporaryFolder folder = new TemporaryFolder();

    private Picture read(byte[] bytes) throws IOException, UnusablePicture {
        File file = folder.newFile();
        Files.write(file.toPath(), bytes);
        return Picture.read(file);
    }

    private static byte[] encoded(BufferedImage image, String format) throws IOException {
        ByteArrayOutputStream out = new ByteArrayOutputStream();
        assertTrue(format, ImageIO.write(image, format, out));
        return out.toByteArray();
    }

    private static void assertGrays(Picture picture) {
        assertEquals(GRAYS.length, picture.width);
        for (int x = 0; x < GRAYS.length; x++) {
            assertEquals("gray " + GRAYS[x], GRAYS[x] * 0x010101, picture.pixel(x, 0) & 0xFFFFFF);
        }
    }

    /** A gray is the same gray as an RGB pixel of three such values. */
    @Test
    public void graysOfAnyDepth() throws IOException, UnusablePicture {
        BufferedImage rgb = new BufferedImage(GRAYS.length, 1, BufferedImage.TYPE_INT_RGB);
        BufferedImage bytes = new BufferedImage(GRAYS.length, 1, BufferedImage.TYPE_BYTE_GRAY);
        BufferedImage shorts = new BufferedImage(GRAYS.length, 1, BufferedImage.TYPE_USHORT_GRAY);
        for (int x = 0; x < GRAYS.length; x++) {
            rgb.setRGB(x, 0, GRAYS[x] * 0x010101);
            bytes.getRaster().setSample(x, 0, 0, GRAYS[x]);
            shorts.getRaster().setSample(x, 0, 0, GRAYS[x] * 257);
        }
        for (BufferedImage image : Arrays.asList(rgb, bytes, shorts)) {
            assertGrays(read(encoded(image, "png")));
        }
        assertGrays(read(encoded(bytes, "bmp")));
    }

    /** A JPEG file of four channels, the same in every pixel. */
    private static byte[] inks(int... channels) throws IOException {
        WritableRaster raster = Raster.createInterleavedRaster(0, 16, 16, 4, new Point(0, 0));
        for (int i = 0; i < 256; i++) {
            raster.setPixel(i % 16, i / 16, channels);
        }
        ImageWriter writer = ImageIO.getImageWritersByFormatName("jpeg").next();
        ByteArrayOutputStream out = new ByteArrayOutputStream();
        try (ImageOutputStream stream = ImageIO.createImageOutputStream(out)) {
            writer.setOutput(stream);
            writer.write(null, new IIOImage(raster, null, null), null);
        }
        writer.dispose();
        return withoutAdobe(out.toByteArray());
    }

    /** A JPEG file without the segment that Java's writer gives a file of four channels. */
    private static byte[] withoutAdobe(byte[] jpeg) {
        ByteBuffer bytes = ByteBuffer.wrap(jpeg);
        for (int at = 2; jpeg[at + 1] != (byte) 0xDA;) {
            int end = at + 2 + (bytes.getShort(at + 2) & 0xFFFF);
            if (jpeg[at + 1] == (byte) 0xEE) {
                return ByteBuffer.allocate(jpeg.length - (end - at)).put(jpeg, 0, at).put(jpeg, end, jpeg.length - end)
                        .array();
            }
            at = end;
        }
        return jpeg;
    }

    /** A JPEG file with a segment before all others. */
    private static byte[] with(int marker, byte[] content, byte[] jpeg) {
        ByteBuffer out = ByteBuffer.allocate(jpeg.length + content.length + 4);
        out.put(jpeg, 0, 2).put((byte) 0xFF).put((byte) marker).putShort((short) (content.length + 2)).put(content);
        return out.put(jpeg, 2, jpeg.length - 2).array();
    }

    private static byte[] adobe(int transform) {
        return ByteBuffer.allocate(12).put("Adobe".getBytes(StandardCharsets.US_ASCII)).put(11, (byte) transform).array();
    }

    private static void assertColour(int red, int green, int blue, Picture picture) {
        int rgb = picture.pixel(8, 8);
        assertEquals("red", red, rgb >> 16 & 0xFF, 3);
        assertEquals("green", green, rgb >> 8 & 0xFF, 3);
        assertEquals("blue", blue, rgb & 0xFF, 3);
    }

    @Test
    public void cyanMagentaYellowAndBlack() throws IOException, UnusablePicture {
        // Ink as it is: a little cyan, much magenta, no yellow, a quarter of black.
        assertColour(191 * 205 / 255, 191 * 55 / 255, 191, read(inks(50, 200, 0, 64)));
        assertColour(85, 85, 85, read(inks(0, 0, 0, 170)));
        // Inverted, as with Adobe's segment.
        assertColour(191 * 205 / 255, 191 * 55 / 255, 191, read(with(0xEE, adobe(0), inks(205, 55, 255, 191))));
        // And as luma and chroma: of red 200, green 100, blue 50.
        int luma = Math.round(0.299f * 200 + 0.587f * 100 + 0.114f * 50);
        int cb = Math.round(128 - 0.168736f * 200 - 0.331264f * 100 + 0.5f * 50);
        int cr = Math.round(128 + 0.5f * 200 - 0.418688f * 100 - 0.081312f * 50);
        assertColour(200 * 128 / 255, 100 * 128 / 255, 50 * 128 / 255,
                read(with(0xEE, adobe(2), inks(luma, cb, cr, 128))));
    }

    /** Exif with one tag, in either byte order. */
    private static byte[] exif(int orientation, ByteOrder order) {
        ByteBuffer out = ByteBuffer.allocate(6 + 8 + 2 + 12 + 4).order(order);
        out.put("Exif\0\0".getBytes(StandardCharsets.US_ASCII));
        out.put((order == ByteOrder.LITTLE_ENDIAN ? "II" : "MM").getBytes(StandardCharsets.US_ASCII));
        out.putShort((short) 42).putInt(8).putShort((short) 1);
        out.putShort((short) 0x0112).putShort((short) 3).putInt(1).putShort((short) orientation);
        return out.array();
    }

    /** The corners of a picture that is shown upright: red, green, blue, white, from the top left clockwise. */
    private static String corners(Picture picture) {
        StringBuilder text = new StringBuilder();
        int right = picture.width - 4;
        int bottom = picture.height - 4;
        for (int[] at : new int[][] {{4, 4}, {right, 4}, {right, bottom}, {4, bottom}}) {
            int rgb = picture.pixel(at[0], at[1]);
            boolean red = (rgb >> 16 & 0xFF) > 128;
            boolean green = (rgb >> 8 & 0xFF) > 128;
            text.append(red && green ? 'W' : red ? 'R' : green ? 'G' : 'B');
        }
        return text.toString();
    }

    @Test
    public void everyOrientation() throws IOException, UnusablePicture {
        BufferedImage image = new BufferedImage(48, 32, BufferedImage.TYPE_INT_RGB);
        for (int y = 0; y < 32; y++) {
            for (int x = 0; x < 48; x++) {
                image.setRGB(x, y, y < 16 ? x < 24 ? 0xFF0000 : 0x00FF00 : x < 24 ? 0xFFFFFF : 0x0000FF);
            }
        }
        byte[] jpeg = encoded(image, "jpeg");
        // Where the stored picture's first row and column are shown: top and left, top and right, bottom and right,
        // bottom and left, left and top, right and top, right and bottom, left and bottom.
        String[] shown = {"RGBW", "GRWB", "BWRG", "WBGR", "RWBG", "WRGB", "BGRW", "GBWR"};
        for (int orientation = 1; orientation <= 8; orientation++) {
            for (ByteOrder order : new ByteOrder[] {ByteOrder.LITTLE_ENDIAN, ByteOrder.BIG_ENDIAN}) {
                Picture picture = read(with(0xE1, exif(orientation, order), jpeg));
                assertEquals("orientation " + orientation, shown[orientation - 1], corners(picture));
                assertEquals(orientation < 5 ? 48 : 32, picture.width);
            }
        }
        for (int none : new int[] {0, 9, 0xFFFF}) {
            assertEquals("RGBW", corners(read(with(0xE1, exif(none, ByteOrder.BIG_ENDIAN), jpeg))));
        }
        assertEquals("RGBW", corners(read(jpeg)));
        byte[] exif = exif(6, ByteOrder.BIG_ENDIAN);
        for (int length = 0; length < exif.length - 4; length++) {
            String found = corners(read(with(0xE1, Arrays.copyOf(exif, length), jpeg)));
            assertTrue(length + " bytes of Exif", found.equals("RGBW") || found.equals("WRGB"));
        }
    }

    @Test
    public void rotations() throws IOException, UnusablePicture {
        BufferedImage image = new BufferedImage(3, 2, BufferedImage.TYPE_INT_RGB);
        for (int i = 0; i < 6; i++) {
            image.setRGB(i % 3, i / 3, i + 1);
        }
        Picture picture = read(encoded(image, "png"));
        assertEquals("1 2 3/4 5 6/", pixels(picture.rotated(0)));
        assertEquals("4 1/5 2/6 3/", pixels(picture.rotated(90)));
        assertEquals("6 5 4/3 2 1/", pixels(picture.rotated(180)));
        assertEquals("3 6/2 5/1 4/", pixels(picture.rotated(270)));
    }

    private static String pixels(Picture picture) {
        StringBuilder text = new StringBuilder();
        for (int i = 0; i < picture.width * picture.height; i++) {
            int x = i % picture.width;
            text.append(picture.pixel(x, i / picture.width) & 0xFFFFFF).append(x == picture.width - 1 ? '/' : ' ');
        }
        return text.toString();
    }

    @Test
    public void jpegFilesThatEndEarly() throws IOException, UnusablePicture {
        BufferedImage image = new BufferedImage(200, 200, BufferedImage.TYPE_INT_RGB);
        for (int i = 0; i < 40000; i++) {
            image.setRGB(i % 200, i / 200, i * 0x9E3779B1);
        }
        byte[] jpeg = encoded(image, "jpeg");
        for (int length = 2; length < jpeg.length; length += length < 700 ? 1 : 499) {
            assertDamaged(Arrays.copyOf(jpeg, length));
        }
        assertEquals(200, read(jpeg).width);
        // A preview that Exif holds has an end of its own.
        byte[] preview = ByteBuffer.allocate(8).put("Exif\0\0".getBytes(StandardCharsets.US_ASCII)).put((byte) 0xFF)
                .put((byte) 0xD9).array();
        assertDamaged(Arrays.copyOf(with(0xE1, preview, jpeg), jpeg.length / 2));
    }

    private void assertDamaged(byte[] bytes) throws IOException {
        try {
            read(bytes);
            fail(bytes.length + " bytes are read");
        } catch (UnusablePicture expected) {
            assertTrue(expected.getMessage(), expected.getMessage().endsWith(" is damaged or cannot be read."));
        }
    }

    @Test
    public void aFolder() {
        try {
            Picture.read(folder.getRoot());
            fail("a folder is read");
        } catch (UnusablePicture expected) {
            assertEquals("The path " + folder.getRoot() + " is a folder, not a picture.", expected.getMessage());
        }
    }

    /** The native tests take the portrait as a portable pixmap: its pixels, after a header of three lines. */
    @Test
    public void theNativeTestsPortraitIsTheDemos() throws IOException {
        File source = new File(System.getProperty("kyface.source"));
        byte[] pixmap = Files.readAllBytes(new File(source, "tests/support/portrait.ppm").toPath());
        byte[] header = "P6\n512 512\n255\n".getBytes(StandardCharsets.US_ASCII);
        assertArrayEquals(header, Arrays.copyOf(pixmap, header.length));

        Raster portrait = ImageIO.read(new File(source, "demo/portrait.png")).getRaster();
        int[] samples = portrait.getPixels(0, 0, 512, 512, (int[]) null);
        assertEquals(header.length + samples.length, pixmap.length);
        for (int i = 0; i < samples.length; i++) {
            assertEquals("sample " + i, samples[i], pixmap[header.length + i] & 0xFF);
        }
    }
}
