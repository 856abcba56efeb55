package com.vantrel.faceapi;

/** Argument checks whose messages name the argument, what is expected and what was given. */
final class Check {
    private Check() {}

    static <T> T notNull(String name, T value) {
        if (value == null) {
            throw new NullPointerException(name + " is null");
        }
        return value;
    }

    static void that(boolean holds, String name, String expected, long given) {
        if (!holds) {
            throw new IllegalArgumentException(name + " must be " + expected + ", not " + given);
        }
    }

    static void positive(String name, int value) {
        that(value > 0, name, "above 0", value);
    }

    static void range(String name, long value, long lowest, long highest) {
        if (value < lowest || value > highest) {
            that(false, name, "from " + lowest + " to " + highest, value);
        }
    }

    static void evenAndPositive(String name, int value) {
        that(value > 0 && value % 2 == 0, name, "even and above 0", value);
    }

    /** An array of at least {@code needed} elements, for what is described. */
    static void length(String name, int length, long needed, String unit) {
        if (length < needed) {
            throw new IllegalArgumentException(
                    name + " must have at least " + needed + " " + unit + ", not " + length);
        }
    }

    static void rotation(String name, int degrees) {
        that(degrees == 0 || degrees == 90 || degrees == 180 || degrees == 270, name, "0, 90, 180 or 270", degrees);
    }

    /** Width and height of an image of a format; returns its packed size in bytes. */
    static int packedBytes(PixelFormat format, int width, int height) {
        size(format, width, height);
        long bytes = format.isSemiPlanar() ? (long) width * height * 3 / 2 : format.rowBytes(width) * height;
        if (bytes > Integer.MAX_VALUE) {
            throw new IllegalArgumentException(
                    "width x height must fit an array, not be " + width + " x " + height + " as " + format);
        }
        return (int) bytes;
    }

    /** An image in an array: sizes, stride and the array's length, of which one element is {@code unit} bytes. */
    static void image(PixelFormat format, int width, int height, int stride, int length, int unit) {
        notNull("format", format);
        size(format, width, height);
        that(stride >= format.rowBytes(width), "stride", "at least " + format.rowBytes(width) + " (a row of " + width
                + " pixels as " + format + ")", stride);
        long bytes = format.imageBytes(width, height, stride);
        length("image", length, (bytes + unit - 1) / unit, unit == 1 ? "bytes" : "ints");
    }

    private static void size(PixelFormat format, int width, int height) {
        if (format.isSemiPlanar()) {
            evenAndPositive("width", width);
            evenAndPositive("height", height);
        } else {
            positive("width", width);
            positive("height", height);
        }
    }

    /** A rectangle inside an image. */
    static void rectangle(int x, int y, int w, int h, int width, int height) {
        positive("w", w);
        positive("h", h);
        range("x", x, 0, (long) width - w);
        range("y", y, 0, (long) height - h);
    }

    /** {@code reuse} when it has the exact length, a new array when it is null. */
    static byte[] output(String name, byte[] reuse, int bytes) {
        if (reuse == null) {
            return new byte[bytes];
        }
        that(reuse.length == bytes, name + ".length", "exactly " + bytes, reuse.length);
        return reuse;
    }
}
