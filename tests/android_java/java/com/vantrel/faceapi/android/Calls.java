// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.android;

import android.graphics.Bitmap;
import android.graphics.ImageFormat;
import android.graphics.PointF;
import android.graphics.Rect;
import android.media.Image;
import java.nio.ByteBuffer;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Random;

/**
 * Random calls of the classes that the desktop stand-ins stand for, each with what came of it: a value, or the class of
 * what was thrown. The same on the stand-ins and on the real classes, or they differ.
 */
public final class Calls {
    private static final int ROUNDS = 4000;

    private final Random random = new Random(5);
    private final List<String> journal = new ArrayList<>();

    /** Whether blue comes first in a bitmap's memory: not so on Android, but so where its graphics run on a desktop. */
    private final boolean blueFirst;

    private Calls() {
        Bitmap red = Bitmap.createBitmap(1, 1, Bitmap.Config.ARGB_8888);
        red.setPixel(0, 0, 0xFFFF0000);
        ByteBuffer bytes = ByteBuffer.allocate(4);
        red.copyPixelsToBuffer(bytes);
        blueFirst = bytes.get(2) != 0;
    }

    /** A bitmap's bytes as Android has them, or bytes of Android's as the bitmap has them. */
    private byte[] inOrder(byte[] bytes, int from, int to) {
        for (int at = from; blueFirst && at + 4 <= to; at += 4) {
            byte first = bytes[at];
            bytes[at] = bytes[at + 2];
            bytes[at + 2] = first;
        }
        return bytes;
    }

    /** What can be called and may throw. */
    private interface Call {
        Object result();
    }

    /** The journal; the same with every run. */
    static List<String> journal() {
        Calls calls = new Calls();
        calls.constants();
        for (int round = 0; round < ROUNDS; round++) {
            calls.rectangles();
            calls.points();
            calls.images();
            if (round % 8 == 0) {
                calls.bitmaps();
            }
        }
        calls.everyColour();
        return calls.journal;
    }

    public static void main(String[] arguments) {
        for (String line : journal()) {
            System.out.println(line);
        }
    }

    private void note(String what, Call call) {
        Object result;
        try {
            result = call.result();
        } catch (RuntimeException thrown) {
            result = thrown.getClass().getName();
        }
        journal.add(what + " = " + result);
    }

    private void constants() {
        note("formats", () -> ImageFormat.UNKNOWN + " " + ImageFormat.NV21 + " " + ImageFormat.YUV_420_888 + " "
                + ImageFormat.JPEG);
        for (Bitmap.Config config : new Bitmap.Config[] {Bitmap.Config.RGB_565, Bitmap.Config.ARGB_8888}) {
            note("configuration", config::name);
        }
    }

    /** Mostly small, sometimes extreme. */
    private int number() {
        int[] extremes = {0, Integer.MAX_VALUE, Integer.MIN_VALUE, 1 << 30};
        return random.nextInt(20) == 0 ? extremes[random.nextInt(extremes.length)] : random.nextInt(21) - 8;
    }

    private Rect rectangle() {
        return new Rect(number(), number(), number(), number());
    }

    private void rectangles() {
        Rect r = random.nextInt(50) == 0 ? new Rect() : rectangle();
        Rect other = random.nextInt(4) == 0 ? new Rect(r) : rectangle();
        int x = number();
        int y = number();
        String what = r + " " + other + " " + x + " " + y + " ";
        note(what + "sizes", () -> r.width() + " " + r.height() + " " + r.centerX() + " " + r.centerY());
        note(what + "isEmpty", r::isEmpty);
        note(what + "hashCode", r::hashCode);
        note(what + "equals", () -> r.equals(other) + " " + r.equals(null) + " " + r.equals(new Object()));
        note(what + "contains", () -> r.contains(x, y) + " " + r.contains(other));
        note(what + "copy", () -> new Rect(r).equals(r) + " " + new Rect((Rect) null));
        Rect changed = new Rect(r);
        note(what + "intersect", () -> changed.intersect(other) + " " + changed);
        note(what + "intersect edges", () -> changed.intersect(x, y, other.right, other.bottom) + " " + changed);
        changed.offset(x, y);
        note(what + "offset", changed::toString);
        changed.set(other);
        note(what + "set", changed::toString);
        changed.setEmpty();
        note(what + "setEmpty", changed::toString);
    }

    private float coordinate() {
        float[] special = {0f, -0f, Float.NaN, Float.POSITIVE_INFINITY, Float.MIN_VALUE, -Float.MAX_VALUE};
        return random.nextInt(6) == 0 ? special[random.nextInt(special.length)] : random.nextInt(40) / 4f - 5;
    }

    private void points() {
        PointF p = random.nextInt(50) == 0 ? new PointF() : new PointF(coordinate(), coordinate());
        PointF other = random.nextInt(3) == 0 ? new PointF(p.x, p.y) : new PointF(coordinate(), coordinate());
        String what = p + " " + other + " ";
        note(what + "hashCode", p::hashCode);
        note(what + "equals", () -> p.equals(other) + " " + p.equals(p) + " " + p.equals(null) + " " + p.equals("p")
                + " " + p.equals(new PointF(p.x, p.y) { }));
        PointF changed = new PointF();
        changed.set(p);
        note(what + "set", changed::toString);
        changed.offset(other.x, 1);
        note(what + "offset", changed::toString);
        changed.set(other.y, p.x);
        note(what + "set both", changed::toString);
    }

    /** An image of which only size and crop matter. */
    public static final class Sized extends Image {
        private final int width;
        private final int height;

        Sized(int width, int height) {
            this.width = width;
            this.height = height;
            valid();
        }

        /** The real class asks whether the image is open yet; its makers say so in a field of theirs. */
        private void valid() {
            try {
                Image.class.getDeclaredField("mIsImageValid").setBoolean(this, true);
            } catch (NoSuchFieldException none) {
                // The stand-in's makers answer for themselves.
            } catch (IllegalAccessException impossible) {
                throw new IllegalStateException(impossible);
            }
        }

        @Override
        public int getFormat() {
            return ImageFormat.YUV_420_888;
        }

        @Override
        public int getWidth() {
            return width;
        }

        @Override
        public int getHeight() {
            return height;
        }

        @Override
        public long getTimestamp() {
            return 0;
        }

        /** The real class has it, out of apps' sight. */
        public int getTransform() {
            return 0;
        }

        /** The real class has it, out of apps' sight. */
        public int getScalingMode() {
            return 0;
        }

        @Override
        public Plane[] getPlanes() {
            return new Plane[0];
        }

        @Override
        public void close() {}
    }

    private void images() {
        Sized image = new Sized(1 + random.nextInt(20), 1 + random.nextInt(20));
        String what = image.getWidth() + " x " + image.getHeight() + " image, ";
        note(what + "crop", image::getCropRect);
        Rect crop = random.nextInt(5) == 0 ? null : rectangle();
        note(what + "crop to " + crop, () -> {
            image.setCropRect(crop);
            Rect got = image.getCropRect();
            if (crop != null) {
                crop.offset(1, 1); // the image has a copy
            }
            got.setEmpty(); // and gives copies
            return image.getCropRect();
        });
        image.setCropRect(null);
        note(what + "all", image::getCropRect);
    }

    private void bitmaps() {
        int width = random.nextInt(8) == 0 ? random.nextInt(3) - 2 : 1 + random.nextInt(9);
        int height = random.nextInt(8) == 0 ? random.nextInt(3) - 2 : 1 + random.nextInt(9);
        // Of 16 bits a pixel, bitmaps are told apart and refused, and not drawn to.
        boolean small = random.nextInt(8) == 0;
        Bitmap.Config config = small ? Bitmap.Config.RGB_565 : Bitmap.Config.ARGB_8888;
        Bitmap[] made = new Bitmap[1];
        note(width + " x " + height + " " + config, () -> {
            made[0] = Bitmap.createBitmap(width, height, config);
            return made[0].getWidth() + " " + made[0].getHeight() + " " + made[0].getConfig();
        });
        if (made[0] == null) {
            return;
        }
        describe("new", made[0]);
        if (small) {
            return;
        }
        use(made[0], width, height);
        int[] colors = colors(width * height);
        note("immutable", () -> {
            made[0] = Bitmap.createBitmap(colors, width, height, config);
            return made[0].getPixel(width - 1, height - 1);
        });
        describe("immutable", made[0]);
        use(made[0], width, height);
        Bitmap copy = made[0].copy(config, random.nextBoolean());
        describe("copy", copy);
        use(copy, width, height);
        copy.recycle();
        describe("recycled", copy);
        note("recycled getPixel", () -> copy.getPixel(0, 0));
        note("recycled setPixel", () -> {
            copy.setPixel(0, 0, 1);
            return null;
        });
        note("recycled getPixels", () -> {
            copy.getPixels(new int[width * height], 0, width, 0, 0, width, height);
            return null;
        });
        copy.recycle();
        note("recycled twice", copy::isRecycled);
        note("the other", () -> pixels(made[0]));
    }

    private void describe(String what, Bitmap bitmap) {
        note(what, () -> bitmap.isMutable() + " " + bitmap.isRecycled() + " " + bitmap.getConfig() + " "
                + bitmap.getWidth() + " " + bitmap.getHeight());
        if (!bitmap.isRecycled() && bitmap.getConfig() == Bitmap.Config.ARGB_8888) {
            // Of two bytes a pixel rows may be padded.
            note(what + " bytes", () -> bitmap.getRowBytes() + " " + bitmap.getByteCount());
        }
    }

    private int[] colors(int count) {
        int[] colors = new int[count];
        for (int i = 0; i < count; i++) {
            colors[i] = random.nextInt();
        }
        return colors;
    }

    private String pixels(Bitmap bitmap) {
        int width = bitmap.getWidth();
        int[] colors = new int[width * bitmap.getHeight()];
        bitmap.getPixels(colors, 0, width, 0, 0, width, bitmap.getHeight());
        ByteBuffer bytes = ByteBuffer.allocate(bitmap.getByteCount() + 3);
        bitmap.copyPixelsToBuffer(bytes);
        byte[] ordered = inOrder(bytes.array(), 0, bitmap.getByteCount());
        return Arrays.toString(colors) + " " + Arrays.toString(ordered) + " " + bytes.position();
    }

    private void use(Bitmap bitmap, int width, int height) {
        for (int i = 0; i < 3; i++) {
            int x = random.nextInt(width + 2) - 1;
            int y = random.nextInt(height + 2) - 1;
            int color = random.nextInt();
            note("setPixel " + x + " " + y + " " + color, () -> {
                bitmap.setPixel(x, y, color);
                return bitmap.getPixel(x, y);
            });
            note("getPixel " + x + " " + y, () -> bitmap.getPixel(x, y));
        }
        note("after setPixel", () -> pixels(bitmap));

        int x = random.nextInt(width + 2) - 1;
        int y = random.nextInt(height + 2) - 1;
        int w = random.nextInt(width + 2);
        int h = random.nextInt(height + 2);
        int offset = random.nextInt(4) - 1;
        int stride = random.nextInt(6) == 0 ? random.nextInt(5) - 6 : w + random.nextInt(3) - 1;
        int[] colors = colors(random.nextInt(4) == 0 ? random.nextInt(20) : width * height * 2 + 20);
        String what = offset + " " + stride + " " + x + " " + y + " " + w + " " + h + " of " + colors.length;
        note("setPixels " + what, () -> {
            bitmap.setPixels(colors, offset, stride, x, y, w, h);
            return pixels(bitmap);
        });
        note("getPixels " + what, () -> {
            int[] out = new int[colors.length];
            bitmap.getPixels(out, offset, stride, x, y, w, h);
            return Arrays.toString(out);
        });

        int missing = random.nextInt(3) == 0 ? 1 : 0;
        note("copyPixelsToBuffer " + missing, () -> {
            ByteBuffer bytes = ByteBuffer.allocate(bitmap.getByteCount() - missing + 5);
            bytes.position(5);
            bitmap.copyPixelsToBuffer(bytes);
            return Arrays.toString(inOrder(bytes.array(), 5, bytes.capacity())) + " " + bytes.position();
        });
        byte[] opaque = new byte[4 * width * height + 2];
        random.nextBytes(opaque);
        for (int i = 0; i < width * height; i++) {
            opaque[2 + 4 * i + 3] = (byte) 255;
        }
        inOrder(opaque, 2, opaque.length);
        if (bitmap.isMutable()) { // which copyPixelsFromBuffer does not ask everywhere
            note("copyPixelsFromBuffer " + missing, () -> {
                ByteBuffer bytes = ByteBuffer.wrap(opaque, 2, opaque.length - 2 - missing);
                bitmap.copyPixelsFromBuffer(bytes);
                return pixels(bitmap) + " " + bytes.position();
            });
        }
        int color = random.nextInt() | 0xFF000000;
        note("eraseColor " + color, () -> {
            bitmap.eraseColor(color);
            return pixels(bitmap);
        });
    }

    /** How colours are multiplied by alpha and divided again. */
    private void everyColour() {
        Bitmap bitmap = Bitmap.createBitmap(256, 256, Bitmap.Config.ARGB_8888);
        int[] colors = new int[256 * 256];
        for (int alpha = 0; alpha < 256; alpha++) {
            for (int value = 0; value < 256; value++) {
                colors[alpha * 256 + value] = alpha << 24 | value << 16 | (255 - value) << 8 | value / 2;
            }
        }
        bitmap.setPixels(colors, 0, 256, 0, 0, 256, 256);
        ByteBuffer bytes = ByteBuffer.allocate(256 * 256 * 4);
        bitmap.copyPixelsToBuffer(bytes);
        inOrder(bytes.array(), 0, bytes.capacity());
        for (int alpha = 0; alpha < 256; alpha++) {
            int row = alpha;
            note("bytes of alpha " + alpha,
                    () -> Arrays.toString(Arrays.copyOfRange(bytes.array(), row * 1024, row * 1024 + 1024)));
            note("colours of alpha " + alpha, () -> {
                int[] back = new int[256];
                bitmap.getPixels(back, 0, 256, 0, row, 256, 1);
                return Arrays.toString(back);
            });
        }
    }
}
