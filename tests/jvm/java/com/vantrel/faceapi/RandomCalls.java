// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.math.BigInteger;
import java.nio.ByteBuffer;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Collections;
import java.util.List;
import java.util.Map;
import java.util.Random;
import java.util.TreeMap;
import java.util.concurrent.Callable;

/**
 * Random calls of the checked classes: valid, at a boundary, absurd. What is valid is decided here a second time, in
 * numbers without a limit: a valid call must give what a reference gives, any other one the documented exception and
 * nothing written. {@link AnyCalls} calls all public methods, with anything, in between.
 *
 * <p>Runs over the agent that puts fences around what native code borrows. Arguments: how many calls, the seed, and how
 * many threads share them. Prints how often each operation gave a result; ends with status 0 when all was right.
 */
public final class RandomCalls {
    /** What a call must come to. */
    private enum Expected { RESULT, REFUSAL, FAILURE, RESULT_OR_FAILURE }

    private static final int MOST = Integer.MAX_VALUE;
    private static final int[] ABSURD = {
        0, -1, -2, 3, 46341, 65535, 65536, 1 << 30, (1 << 30) - 2, MOST, MOST - 1, MOST - 2, Integer.MIN_VALUE, -65536,
        37836, 8192, 8193, 8194,
    };
    private static final int FENCED_BYTES = 8192;
    /** Calls from which on every operation must have had a result. */
    private static final int ENOUGH = 2000;

    static {
        System.loadLibrary("jvm_fenced_arrays");
    }

    final Random random;
    /** Per operation: calls, and how many of them gave a result. */
    final Map<String, int[]> counts = new TreeMap<>();
    private final List<ByteBuffer> fenced = new ArrayList<>();
    private final AnyCalls any;
    private String operation = "";
    private Object[] arguments = {};

    private FaceDetector detector = new FaceDetector();
    private FaceTracker tracker = new FaceTracker();
    private final FaceVerifier verifier = new FaceVerifier();
    private final byte[] feature;

    static native ByteBuffer fencedBuffer(int bytes, boolean atEnd);

    static native long loans();

    static native long openLoans();

    RandomCalls(Random random) throws Exception {
        this.random = random;
        for (int i = 0; i < 4; i++) {
            fenced.add(fencedBuffer(FENCED_BYTES, i > 0));
        }
        any = new AnyCalls(this);
        byte[] content = new byte[64 * 64];
        random.nextBytes(content);
        feature = verifier.extract(content, PixelFormat.GRAY, 64, 64, 64, face(new Rect(8, 8, 56, 56), 0));
    }

    public static void main(String[] args) throws Exception {
        int calls = Integer.parseInt(args[0]);
        long seed = Long.parseLong(args[1]);
        int threads = Integer.parseInt(args[2]);
        FaceLibrary.setDebug(false);
        List<RandomCalls> callers = new ArrayList<>();
        List<Thread> running = new ArrayList<>();
        List<Throwable> failures = Collections.synchronizedList(new ArrayList<Throwable>());
        for (int i = 0; i < threads; i++) {
            RandomCalls caller = new RandomCalls(new Random(seed + i));
            callers.add(caller);
            Thread thread = new Thread(() -> {
                try {
                    caller.run(calls / threads);
                } catch (Throwable e) {
                    failures.add(e);
                }
            });
            running.add(thread);
            thread.start();
        }
        for (Thread thread : running) {
            thread.join();
        }
        Map<String, int[]> counts = new TreeMap<>();
        for (RandomCalls caller : callers) {
            caller.counts.forEach((name, count) -> {
                int[] sum = counts.computeIfAbsent(name, key -> new int[2]);
                sum[0] += count[0];
                sum[1] += count[1];
            });
        }
        System.out.printf("%10s %10s  seed %d%n", "calls", "results", seed);
        counts.forEach((name, count) -> System.out.printf("%10d %10d  %s%n", count[0], count[1], name));
        System.out.printf("%d arrays between fences, %d not given back%n", loans(), openLoans());
        for (Throwable failure : failures) {
            failure.printStackTrace(System.out);
        }
        boolean right = failures.isEmpty() && openLoans() == 0 && loans() > calls / 10;
        if (calls >= ENOUGH) {
            right &= AnyCalls.allWereCalled(counts);
            for (String name : callers.get(0).operations().keySet()) {
                if (!counts.containsKey(name) || counts.get(name)[1] == 0) {
                    System.out.println("never a result of " + name);
                    right = false;
                }
            }
        }
        System.exit(right ? 0 : 1);
    }

    private interface Operation {
        void run() throws Exception;
    }

    /** The operations with their references; those that take the engine long come seldom. */
    private Map<String, Operation> operations() {
        Map<String, Operation> all = new TreeMap<>();
        all.put("convert", this::convert);
        all.put("crop", this::crop);
        all.put("evenLength", this::evenLength);
        all.put("rotate", this::rotate);
        all.put("brightness", this::brightness);
        all.put("lightness", this::lightness);
        all.put("pixels", this::pixels);
        all.put("toPixels", this::toPixels);
        all.put("of", this::frameOf);
        all.put("fill", this::fill);
        all.put("sizes", this::sizes);
        all.put("profile", this::profile);
        all.put("detect", this::detect);
        all.put("track", this::track);
        all.put("threshold", this::threshold);
        all.put("settings", this::settings);
        all.put("compare", this::compare);
        all.put("extract", this::extract);
        all.put("create", this::create);
        return all;
    }

    void run(int calls) throws Exception {
        Map<String, Operation> all = operations();
        List<String> names = new ArrayList<>(all.keySet());
        for (int i = 0; i < calls; i++) {
            try {
                if (random.nextInt(4) == 0) {
                    operation = "any";
                    arguments = new Object[0];
                    any.call();
                    continue;
                }
                String name = names.get(random.nextInt(names.size()));
                boolean slow = name.equals("extract") || name.equals("create");
                if (!slow || random.nextInt(100) == 0 || !counts.containsKey(name) || counts.get(name)[1] == 0) {
                    operation = name;
                    all.get(name).run();
                }
            } catch (Throwable e) {
                throw new AssertionError("call " + i + ", " + operation + text(arguments), e);
            }
        }
    }

    static String text(Object[] arguments) {
        StringBuilder text = new StringBuilder("(");
        for (Object argument : arguments) {
            text.append(text.length() > 1 ? ", " : "");
            if (argument instanceof byte[]) {
                text.append("byte[").append(((byte[]) argument).length).append(']');
            } else if (argument instanceof int[]) {
                text.append("int[").append(((int[]) argument).length).append(']');
            } else if (argument instanceof CameraFrame) {
                CameraFrame frame = (CameraFrame) argument;
                text.append(frame.format() + " " + frame.width() + "x" + frame.height());
            } else {
                text.append(argument);
            }
        }
        return text.append(')').toString();
    }

    // ---- a call and what it comes to ------------------------------------------------------------------------------

    void count(String name, boolean result) {
        int[] count = counts.computeIfAbsent(name, key -> new int[2]);
        count[0]++;
        count[1] += result ? 1 : 0;
    }

    /** Notes the arguments, for the message of a failure. */
    private void with(Object... newArguments) {
        arguments = newArguments;
    }

    /** The result of a call; null when it was refused as expected. */
    private <T> T attempt(Expected expected, Callable<T> call) throws Exception {
        T result;
        try {
            result = call.call();
        } catch (RuntimeException e) {
            documented(e);
            boolean failed = e instanceof FaceEngineException;
            if (failed ? expected == Expected.RESULT || expected == Expected.REFUSAL : expected != Expected.REFUSAL) {
                throw new AssertionError("expected a " + expected, e);
            }
            count(operation, false);
            return null;
        }
        check("taken, expected a " + expected,
                expected == Expected.RESULT || expected == Expected.RESULT_OR_FAILURE);
        count(operation, true);
        return result;
    }

    private void attempt(Expected expected, Runnable call) throws Exception {
        attempt(expected, () -> {
            call.run();
            return "";
        });
    }

    /** An exception that the documentation knows, thrown by a check and not by chance. */
    static void documented(RuntimeException e) {
        boolean known = e instanceof NullPointerException || e instanceof IllegalArgumentException
                || e instanceof IllegalStateException || e instanceof FaceEngineException;
        check("an exception that no documentation knows: " + e, known);
        check("an exception without a message", e.getMessage() != null);
        // The JVM's own messages begin so.
        check("a null that nobody checked: " + e, !e.getMessage().startsWith("Cannot "));
        StackTraceElement thrower = e.getStackTrace()[0];
        check("thrown by " + thrower, thrower.getClassName().startsWith("com.vantrel.faceapi."));
    }

    static void check(String what, boolean holds) {
        if (!holds) {
            throw new AssertionError(what);
        }
    }

    private static Expected when(boolean valid) {
        return valid ? Expected.RESULT : Expected.REFUSAL;
    }

    // ---- arguments ------------------------------------------------------------------------------------------------

    boolean rarely() {
        return random.nextInt(24) == 0;
    }

    <T> T oneOf(T[] all) {
        return all[random.nextInt(all.length)];
    }

    int absurd() {
        return random.nextInt(4) == 0 ? random.nextInt() : ABSURD[random.nextInt(ABSURD.length)];
    }

    private int side() {
        if (rarely()) {
            return absurd();
        }
        return rarely() ? 1 + random.nextInt(45) : 2 + 2 * random.nextInt(22);
    }

    private PixelFormat format() {
        return rarely() ? null : oneOf(PixelFormat.values());
    }

    private int rotation() {
        return rarely() ? absurd() : 90 * random.nextInt(4);
    }

    byte[] content(int length) {
        byte[] bytes = new byte[length];
        if (rarely()) {
            Arrays.fill(bytes, (byte) (random.nextBoolean() ? 255 : random.nextInt(256)));
        } else {
            random.nextBytes(bytes);
        }
        return bytes;
    }

    /** An array for an image that takes so many bytes; sometimes another. */
    private byte[] image(long bytes) {
        if (rarely()) {
            return null;
        }
        return content(lengthNear(bytes));
    }

    private int lengthNear(long length) {
        if (length < 0 || length > 1 << 20) {
            return random.nextInt(64);
        }
        switch (random.nextInt(40)) {
            case 0: return (int) Math.max(0, length - 1);
            case 1: return (int) length + 1;
            case 2: return 0;
            default: return (int) length;
        }
    }

    private byte[] reuse(long bytes) {
        return random.nextBoolean() ? null : image(bytes);
    }

    private static int bytesPerPixel(PixelFormat format) {
        switch (format) {
            case BGR: case RGB: return 3;
            case BGRA: case RGBA: return 4;
            default: return 1;
        }
    }

    private static boolean isFrame(PixelFormat format) {
        return format == PixelFormat.NV21 || format == PixelFormat.NV12;
    }

    private static boolean isSize(PixelFormat format, int width, int height) {
        return format != null && width > 0 && height > 0
                && (!isFrame(format) || (width % 2 == 0 && height % 2 == 0));
    }

    private static BigInteger product(long a, long b) {
        return BigInteger.valueOf(a).multiply(BigInteger.valueOf(b));
    }

    /** Bytes of a packed image, or -1 when there is no array for it. */
    private static long packedBytes(PixelFormat format, int width, int height) {
        if (!isSize(format, width, height)) {
            return -1;
        }
        BigInteger bytes = product(width, height);
        bytes = isFrame(format) ? bytes.multiply(BigInteger.valueOf(3)).shiftRight(1)
                : bytes.multiply(BigInteger.valueOf(bytesPerPixel(format)));
        return bytes.bitLength() < 32 ? bytes.longValue() : -1;
    }

    /** Bytes of an image with a stride, which may be any number; -1 when there is no such image. */
    private static BigInteger stridedBytes(PixelFormat format, int width, int height, int stride) {
        if (!isSize(format, width, height)) {
            return BigInteger.ONE.negate();
        }
        long row = (long) width * bytesPerPixel(format);
        long rows = isFrame(format) ? (long) height * 3 / 2 : height;
        return stride < row ? BigInteger.ONE.negate() : product(rows - 1, stride).add(BigInteger.valueOf(row));
    }

    private static boolean holds(int length, BigInteger bytes) {
        return bytes.signum() >= 0 && BigInteger.valueOf(length).compareTo(bytes) >= 0;
    }

    private static boolean isInside(int x, int y, int w, int h, int width, int height) {
        return w > 0 && h > 0 && x >= 0 && y >= 0 && (long) x + w <= width && (long) y + h <= height;
    }

    /** A part of a side: inside, or sometimes anything. */
    private int[] part(int side) {
        if (rarely() || side < 1) {
            return new int[] {random.nextBoolean() ? absurd() : 0, random.nextBoolean() ? absurd() : side};
        }
        int start = random.nextInt(side);
        return new int[] {start, 1 + random.nextInt(side - start) + (rarely() ? 1 : 0)};
    }

    CameraFrame frame() {
        if (rarely()) {
            return random.nextBoolean() ? null : new CameraFrame();
        }
        int width = 2 + 2 * random.nextInt(24);
        int height = 2 + 2 * random.nextInt(12);
        PixelFormat format = random.nextBoolean() ? PixelFormat.NV21 : PixelFormat.NV12;
        return CameraFrame.of(content(width * height * 3 / 2), format, width, height, 90 * random.nextInt(4));
    }

    private static boolean isFilled(CameraFrame frame) {
        return frame != null && frame.width() > 0;
    }

    private static ColorReference.Chroma chroma(PixelFormat format) {
        return format == PixelFormat.NV21 ? ColorReference.Chroma.VU : ColorReference.Chroma.UV;
    }

    private static byte[] copyOf(byte[] bytes) {
        return bytes == null ? null : bytes.clone();
    }

    // ---- images ---------------------------------------------------------------------------------------------------

    /** Whether an output array can be the one that is written; when it cannot, it must stay as it is. */
    private static boolean fits(byte[] reuse, long bytes, byte[] src) {
        return reuse == null || (reuse.length == bytes && reuse != src);
    }

    private void sameOrUntouched(byte[] want, byte[] got, byte[] reuse, byte[] before) {
        if (got == null) {
            check("written, and refused", Arrays.equals(before, reuse));
            return;
        }
        check("another array", reuse == null || reuse == got);
        check("another result", Arrays.equals(want, got));
    }

    private void convert() throws Exception {
        Images.Conversion conversion = rarely() ? null : oneOf(Images.Conversion.values());
        int width = side();
        int height = side();
        PixelFormat from = conversion == null ? null : conversion.source();
        PixelFormat to = conversion == null ? null : conversion.result();
        long bytes = packedBytes(from, width, height);
        long resultBytes = packedBytes(to, width, height);
        byte[] src = image(bytes);
        byte[] reuse = rarely() ? src : reuse(resultBytes);
        with(src, width, height, conversion, reuse);
        boolean valid = src != null && bytes == src.length && resultBytes > 0 && fits(reuse, resultBytes, src);
        byte[] before = copyOf(reuse);
        byte[] got = attempt(when(valid), () -> Images.convert(src, width, height, conversion, reuse));
        byte[] want = null;
        if (got != null && isFrame(from)) {
            want = ColorReference.toPixels(src, width, height, chroma(from), ColorReference.Layout.valueOf(to.name()));
        } else if (got != null && isFrame(to)) {
            want = ColorReference.toFrame(src, width, height, ColorReference.Layout.RGBA, chroma(to));
        } else if (got != null) {
            want = src.clone();
            for (int i = 0; i < want.length; i += 4) {
                want[i] = src[i + 2];
                want[i + 2] = src[i];
            }
        }
        sameOrUntouched(want, got, reuse, before);
    }

    private void crop() throws Exception {
        CameraFrame frame = frame();
        boolean filled = isFilled(frame);
        int[] columns = part(filled ? frame.width() : 4);
        int[] rows = part(filled ? frame.height() : 4);
        int x = columns[0];
        int w = columns[1];
        int y = rows[0];
        int h = rows[1];
        boolean inside = filled && isInside(x, y, w, h, frame.width(), frame.height());
        int left = inside ? x - x % 2 : 0;
        int top = inside ? y - y % 2 : 0;
        int evenW = inside ? (x + w + 1) / 2 * 2 - left : 2;
        int evenH = inside ? (y + h + 1) / 2 * 2 - top : 2;
        byte[] reuse = rarely() && filled ? frame.data() : reuse(evenW * evenH * 4);
        with(frame, x, y, w, h, reuse);
        boolean valid = inside && fits(reuse, evenW * evenH * 4, frame.data());
        byte[] before = copyOf(reuse);
        byte[] got = attempt(when(valid), () -> Images.crop(frame, x, y, w, h, reuse));
        byte[] want = null;
        if (got != null) {
            byte[] whole = ColorReference.toPixels(frame.data(), frame.width(), frame.height(),
                    chroma(frame.format()), ColorReference.Layout.RGBA);
            want = new byte[evenW * evenH * 4];
            for (int row = 0; row < evenH; row++) {
                System.arraycopy(whole, ((top + row) * frame.width() + left) * 4, want, row * evenW * 4, evenW * 4);
            }
        }
        sameOrUntouched(want, got, reuse, before);
    }

    private void evenLength() throws Exception {
        int start = side();
        int length = side();
        with(start, length);
        long end = ((long) start + length + 1) / 2 * 2;
        boolean valid = start >= 0 && length > 0 && end <= MOST;
        Integer got = attempt(when(valid), () -> Images.evenLength(start, length));
        check("another result", got == null || got == end - start / 2 * 2);
    }

    private void rotate() throws Exception {
        boolean three = random.nextBoolean(); // the method without a format
        PixelFormat format = three ? PixelFormat.BGR : format();
        int width = side();
        int height = side();
        int degrees = rotation();
        long bytes = packedBytes(format, width, height);
        byte[] src = image(bytes);
        byte[] reuse = rarely() ? src : reuse(bytes);
        with(src, format, width, height, degrees, reuse);
        boolean valid = src != null && src.length == bytes && !isFrame(format)
                && (degrees == 90 || degrees == 180 || degrees == 270) && fits(reuse, bytes, src);
        byte[] before = copyOf(reuse);
        byte[] got = attempt(when(valid), () -> three ? Images.rotate(src, width, height, degrees, reuse)
                : Images.rotate(src, format, width, height, degrees, reuse));
        byte[] want = got == null ? null
                : turned(src, bytesPerPixel(format), width, 0, 0, width, height, degrees, false);
        sameOrUntouched(want, got, reuse, before);
    }

    private void brightness() throws Exception {
        CameraFrame frame = frame();
        boolean filled = isFilled(frame);
        int[] columns = part(filled ? frame.width() : 4);
        int[] rows = part(filled ? frame.height() : 4);
        with(frame, columns[0], rows[0], columns[1], rows[1]);
        boolean valid = filled
                && isInside(columns[0], rows[0], columns[1], rows[1], frame.width(), frame.height());
        Float got = attempt(when(valid), () ->
                Images.brightness(frame, columns[0], rows[0], columns[1], rows[1]));
        if (got != null) {
            long sum = 0;
            for (int y = rows[0]; y < rows[0] + rows[1]; y++) {
                for (int x = columns[0]; x < columns[0] + columns[1]; x++) {
                    sum += frame.data()[y * frame.width() + x] & 0xFF;
                }
            }
            check("another result", got == (float) sum / (float) (255L * columns[1] * rows[1]));
        }
    }

    private void lightness() throws Exception {
        PixelFormat format = random.nextInt(8) == 0 ? format()
                : random.nextBoolean() ? PixelFormat.RGBA : PixelFormat.BGRA;
        int width = side();
        int height = side();
        int stride = stride(format, width);
        BigInteger bytes = stridedBytes(format, width, height, stride);
        byte[] image = image(bytes.longValue());
        int[] columns = part(width);
        int[] rows = part(height);
        with(image, format, width, height, stride, columns[0], rows[0], columns[1], rows[1]);
        boolean valid = image != null && (format == PixelFormat.RGBA || format == PixelFormat.BGRA)
                && holds(image.length, bytes) && isInside(columns[0], rows[0], columns[1], rows[1], width, height);
        Integer got = attempt(when(valid), () -> Images.lightness(
                image, format, width, height, stride, columns[0], rows[0], columns[1], rows[1]));
        check("another result", got == null || got == LightnessReference.mean(
                image, format == PixelFormat.RGBA, stride, columns[0], rows[0], columns[1], rows[1]));
    }

    private int stride(PixelFormat format, int width) {
        if (rarely()) {
            return absurd();
        }
        long row = width * (long) (format == null ? 1 : bytesPerPixel(format));
        return (int) row + (random.nextBoolean() ? 0 : random.nextInt(20)) - (rarely() ? 1 : 0);
    }

    private void pixels() throws Exception {
        int width = 1 + random.nextInt(20);
        int height = 1 + random.nextInt(10);
        Bitmap.Config config = rarely() ? Bitmap.Config.RGB_565 : Bitmap.Config.ARGB_8888;
        Bitmap bitmap = rarely() ? null
                : Bitmap.createBitmap(width, height, config, width * 4 + 4 * random.nextInt(4));
        PixelFormat format = random.nextInt(8) == 0 ? format()
                : random.nextBoolean() ? PixelFormat.BGRA : PixelFormat.BGR;
        int size = format == PixelFormat.BGRA ? 4 : 3;
        byte[] want = new byte[width * height * size];
        if (bitmap != null && config == Bitmap.Config.ARGB_8888) {
            for (int i = 0; i < width * height; i++) {
                bitmap.setPixel(i % width, i / width, random.nextInt());
            }
            byte[] rgba = new byte[bitmap.getRowBytes() * height];
            bitmap.copyPixelsToBuffer(ByteBuffer.wrap(rgba));
            for (int i = 0; i < want.length; i++) {
                int c = i % size;
                int at = i / size / width * bitmap.getRowBytes() + i / size % width * 4;
                want[i] = rgba[at + (c == 3 ? 3 : 2 - c)];
            }
        }
        boolean recycled = bitmap != null && rarely();
        if (recycled) {
            bitmap.recycle();
        }
        byte[] reuse = reuse(want.length);
        with(bitmap, recycled, format, reuse);
        boolean valid = bitmap != null && !recycled && config == Bitmap.Config.ARGB_8888
                && (format == PixelFormat.BGRA || format == PixelFormat.BGR) && fits(reuse, want.length, null);
        byte[] before = copyOf(reuse);
        byte[] got = attempt(when(valid), () -> Images.pixels(bitmap, format, reuse));
        sameOrUntouched(want, got, reuse, before);
        check("the bitmap stayed locked", bitmap == null || bitmap.getLockCount() == 0);
    }

    /** A frame, or its bytes as planes, as a transform shows it. */
    private void toPixels() throws Exception {
        CameraFrame frame = frame();
        boolean filled = isFilled(frame);
        int width = filled ? frame.width() : 8;
        int height = filled ? frame.height() : 6;
        int degrees = 90 * random.nextInt(4);
        boolean mirrored = random.nextBoolean();
        boolean other = rarely();
        FrameTransform transform =
                FrameTransform.of(other ? width + 2 : width, height, degrees).mirrored(mirrored);
        int[] columns = {0, width};
        int[] rows = {0, height};
        if (random.nextBoolean()) {
            columns[0] = random.nextInt(width);
            columns[1] = columns[0] + 1 + random.nextInt(width - columns[0]);
            rows[0] = random.nextInt(height);
            rows[1] = rows[0] + 1 + random.nextInt(height - rows[0]);
            transform = transform.crop(new Rect(columns[0], rows[0], columns[1], rows[1]));
        }
        int left = columns[0] / 2 * 2;
        int top = rows[0] / 2 * 2;
        int w = (columns[1] + 1) / 2 * 2 - left;
        int h = (rows[1] + 1) / 2 * 2 - top;
        PixelFormat format = format();
        long bytes = packedBytes(format, w, h);
        byte[] reuse = rarely() && filled ? frame.data() : reuse(bytes);
        with(frame, transform, format, reuse);
        boolean valid = filled && !other && bytes > 0 && fits(reuse, bytes, frame.data());
        byte[] before = copyOf(reuse);
        FrameTransform shown = transform;
        boolean asPlanes = filled && random.nextBoolean();
        byte[] got = attempt(when(valid), () -> asPlanes ? Images.toPixels(planesOf(frame), shown, format, reuse)
                : Images.toPixels(frame, shown, format, reuse));
        sameOrUntouched(got == null ? null : shown(frame, left, top, w, h, degrees, mirrored, format), got, reuse,
                before);
    }

    private static YuvPlanes planesOf(CameraFrame frame) {
        int luma = frame.width() * frame.height();
        ByteBuffer y = ByteBuffer.wrap(frame.data());
        ByteBuffer first = ByteBuffer.wrap(frame.data(), luma, luma / 2 - 1);
        ByteBuffer second = ByteBuffer.wrap(frame.data(), luma + 1, luma / 2 - 1);
        boolean vFirst = frame.format() == PixelFormat.NV21;
        YuvPlanes planes = new YuvPlanes();
        planes.set(frame.width(), frame.height(), new YuvPlanes.Plane(y, frame.width(), 1),
                new YuvPlanes.Plane(vFirst ? second : first, frame.width(), 2),
                new YuvPlanes.Plane(vFirst ? first : second, frame.width(), 2));
        return planes;
    }

    private static byte[] shown(CameraFrame frame, int left, int top, int w, int h, int degrees, boolean mirrored,
            PixelFormat format) {
        int width = frame.width();
        int height = frame.height();
        byte[] luma = Arrays.copyOf(frame.data(), width * height);
        byte[] y = turned(luma, 1, width, left, top, w, h, degrees, mirrored);
        if (format == PixelFormat.GRAY) {
            return y;
        }
        if (isFrame(format)) {
            byte[] pairs = Arrays.copyOfRange(frame.data(), luma.length, frame.data().length);
            if (frame.format() != format) {
                for (int i = 0; i < pairs.length; i += 2) {
                    byte swapped = pairs[i];
                    pairs[i] = pairs[i + 1];
                    pairs[i + 1] = swapped;
                }
            }
            byte[] chroma = turned(pairs, 2, width / 2, left / 2, top / 2, w / 2, h / 2, degrees, mirrored);
            byte[] all = Arrays.copyOf(y, y.length + chroma.length);
            System.arraycopy(chroma, 0, all, y.length, chroma.length);
            return all;
        }
        boolean red = format == PixelFormat.RGB;
        byte[] pixels = ColorReference.toPixels(frame.data(), width, height, chroma(frame.format()),
                ColorReference.Layout.valueOf(red ? "BGR" : format.name()));
        for (int i = 0; red && i < pixels.length; i += 3) {
            byte swapped = pixels[i];
            pixels[i] = pixels[i + 2];
            pixels[i + 2] = swapped;
        }
        return turned(pixels, bytesPerPixel(format), width, left, top, w, h, degrees, mirrored);
    }

    /** A rectangle of an image, pixel by pixel to where it is shown. */
    private static byte[] turned(byte[] image, int size, int width, int left, int top, int w, int h, int degrees,
            boolean mirrored) {
        int newWidth = degrees % 180 == 0 ? w : h;
        byte[] out = new byte[w * h * size];
        for (int y = 0; y < h; y++) {
            for (int x = 0; x < w; x++) {
                int toX = degrees == 0 ? x : degrees == 90 ? h - 1 - y : degrees == 180 ? w - 1 - x : y;
                int toY = degrees == 0 ? y : degrees == 90 ? x : degrees == 180 ? h - 1 - y : w - 1 - x;
                toX = mirrored ? newWidth - 1 - toX : toX;
                System.arraycopy(image, ((top + y) * width + left + x) * size, out, (toY * newWidth + toX) * size,
                        size);
            }
        }
        return out;
    }

    // ---- frames ---------------------------------------------------------------------------------------------------

    private void frameOf() throws Exception {
        PixelFormat format = random.nextInt(8) == 0 ? format()
                : random.nextBoolean() ? PixelFormat.NV21 : PixelFormat.NV12;
        int width = side();
        int height = side();
        int degrees = rotation();
        long bytes = packedBytes(format, width, height);
        byte[] data = image(bytes);
        with(data, format, width, height, degrees);
        boolean valid = format != null && isFrame(format) && data != null && data.length == bytes
                && isRotation(degrees);
        CameraFrame got = attempt(when(valid), () -> CameraFrame.of(data, format, width, height, degrees));
        check("another frame", got == null || (got.data() == data && got.format() == format && got.width() == width
                && got.height() == height && got.rotationDegrees() == degrees));
    }

    private static boolean isRotation(int degrees) {
        return degrees == 0 || degrees == 90 || degrees == 180 || degrees == 270;
    }

    /** A plane with what it says of itself. */
    private static final class Plane {
        ByteBuffer buffer;
        int rowStride;
        int pixelStride;

        boolean holds(int columns, int rows) {
            long row = (columns - 1L) * pixelStride + 1;
            BigInteger bytes = product(rows - 1L, rowStride).add(BigInteger.valueOf(row));
            return buffer != null && pixelStride > 0 && rowStride >= row
                    && RandomCalls.holds(buffer.remaining(), bytes);
        }

        byte at(int column, int row) {
            return buffer.get(buffer.position() + row * rowStride + column * pixelStride);
        }
    }

    /** A buffer of so many bytes: in an array, somewhere in one, behind a read-only view, or before a fence. */
    ByteBuffer buffer(int bytes) {
        ByteBuffer buffer;
        if (random.nextBoolean() && bytes <= FENCED_BYTES) {
            ByteBuffer whole = oneOf(fenced.toArray(new ByteBuffer[0])).duplicate();
            whole.position(whole == fenced.get(0) ? 0 : FENCED_BYTES - bytes);
            whole.limit(whole.position() + bytes);
            buffer = random.nextBoolean() ? whole.slice() : whole;
        } else {
            int before = random.nextInt(5);
            buffer = ByteBuffer.wrap(content(before + bytes + random.nextInt(3)));
            buffer.limit(before + bytes);
            buffer.position(before);
            buffer = random.nextBoolean() ? buffer.slice() : buffer;
        }
        return random.nextInt(8) == 0 ? buffer.asReadOnlyBuffer() : buffer;
    }

    private Plane plane(int columns, int rows, int pixelStride) {
        Plane plane = new Plane();
        plane.pixelStride = rarely() ? absurd() : pixelStride;
        long row = (columns - 1L) * plane.pixelStride + 1;
        plane.rowStride = rarely() ? absurd() : (int) row + (random.nextBoolean() ? 0 : random.nextInt(9));
        long bytes = (rows - 1L) * plane.rowStride + row;
        plane.buffer = rarely() ? null : buffer(Math.min(lengthNear(bytes), FENCED_BYTES));
        return plane;
    }

    private void fill() throws Exception {
        int width = side();
        int height = side();
        int columns = Math.max(1, width / 2);
        int rows = Math.max(1, height / 2);
        Plane y = plane(Math.max(1, width), Math.max(1, height), 1);
        y.pixelStride = 1;
        Plane u = plane(columns, rows, 1 + random.nextInt(3));
        Plane v = plane(columns, rows, 1 + random.nextInt(3));
        if (random.nextBoolean() && (long) columns * rows < 1000) {
            interleave(u, v, columns, rows);
        }
        if (rarely()) {
            u = v; // one buffer as both
        }
        int degrees = rotation();
        PixelFormat format = random.nextBoolean() ? PixelFormat.NV21 : PixelFormat.NV12;
        CameraFrame frame = frameToFill(format, width, height);
        if (rarely() && frame.width() > 0) {
            y.buffer = ByteBuffer.wrap(frame.data());
        }
        long bytes = packedBytes(format, width, height);
        with(width, height, y.buffer, y.rowStride, u.buffer, u.rowStride, u.pixelStride, v.buffer, v.rowStride,
                v.pixelStride, degrees, format, frame);
        boolean ownMemory = y.buffer != null && y.buffer.hasArray() && y.buffer.array() == frame.data();
        boolean valid = bytes > 0 && y.holds(width, height) && u.holds(width / 2, height / 2)
                && v.holds(width / 2, height / 2) && isRotation(degrees)
                && !(ownMemory && frame.data().length == bytes);
        byte[] want = valid ? packed(width, height, y, u, v, format == PixelFormat.NV21) : null;
        int[] positions = positions(y, u, v);
        byte[] data = frame.data();
        byte[] before = data.clone();
        Plane cb = u;
        if (format == PixelFormat.NV21 && random.nextBoolean()) {
            boolean reused = frame.width() > 0;
            byte[] reuse = reused ? data : null;
            boolean fitting = valid && (!reused || data.length == bytes);
            CameraFrame got = attempt(when(fitting), () -> CameraFrame.fromPlanes(width, height, y.buffer, y.rowStride,
                    cb.buffer, cb.rowStride, cb.pixelStride, v.buffer, v.rowStride, v.pixelStride, degrees, reuse));
            sameOrUntouched(want, got == null ? null : got.data(), reuse, reuse == null ? null : before);
        } else {
            String done = attempt(when(valid), () -> {
                frame.fill(width, height, y.buffer, y.rowStride, cb.buffer, cb.rowStride, cb.pixelStride, v.buffer,
                        v.rowStride, v.pixelStride, degrees);
                return "";
            });
            check("the order changed", frame.format() == format);
            check("another array", data.length != bytes || frame.data() == data);
            check("another frame", Arrays.equals(done == null ? before : want, frame.data()));
            check("another size", done == null
                    || (frame.width() == width && frame.height() == height && frame.rotationDegrees() == degrees));
        }
        check("positions moved", Arrays.equals(positions, positions(y, u, v)));
    }

    /** Both in one buffer, one byte apart. */
    private void interleave(Plane u, Plane v, int columns, int rows) {
        int stride = columns * 2 + random.nextInt(5);
        int bytes = (rows - 1) * stride + columns * 2 - 1;
        ByteBuffer pairs = buffer(bytes + 1);
        ByteBuffer first = pairs.duplicate();
        first.limit(first.limit() - 1);
        ByteBuffer second = pairs.duplicate();
        second.position(second.position() + 1);
        boolean uFirst = random.nextBoolean();
        u.buffer = uFirst ? first : second;
        v.buffer = uFirst ? second : first;
        u.rowStride = stride;
        v.rowStride = stride;
        u.pixelStride = 2;
        v.pixelStride = 2;
    }

    private CameraFrame frameToFill(PixelFormat format, int width, int height) {
        long bytes = packedBytes(format, width, height);
        if (random.nextBoolean() || bytes < 0 || bytes > 1 << 16) {
            return rarely() ? CameraFrame.of(content(6), format, 2, 2, 0) : new CameraFrame(format);
        }
        return CameraFrame.of(content((int) bytes), format, width, height, 0);
    }

    private static byte[] packed(int width, int height, Plane y, Plane u, Plane v, boolean vFirst) {
        byte[] out = new byte[width * height * 3 / 2];
        for (int i = 0; i < width * height; i++) {
            out[i] = y.at(i % width, i / width);
        }
        for (int i = 0; i < width * height / 4; i++) {
            int column = i % (width / 2);
            int row = i / (width / 2);
            out[width * height + 2 * i] = (vFirst ? v : u).at(column, row);
            out[width * height + 2 * i + 1] = (vFirst ? u : v).at(column, row);
        }
        return out;
    }

    private static int[] positions(Plane... planes) {
        int[] positions = new int[planes.length * 2];
        for (int i = 0; i < planes.length; i++) {
            if (planes[i].buffer != null) {
                positions[2 * i] = planes[i].buffer.position();
                positions[2 * i + 1] = planes[i].buffer.limit();
            }
        }
        return positions;
    }

    private void sizes() throws Exception {
        PixelFormat format = oneOf(PixelFormat.values());
        int width = side();
        int height = side();
        int stride = stride(format, width);
        with(format, width, height, stride);
        BigInteger bytes = stridedBytes(format, width, height, stride);
        Long got = attempt(when(bytes.signum() > 0), () -> format.imageBytes(width, height, stride));
        check("another result", got == null || bytes.equals(BigInteger.valueOf(got)));
        Long row = attempt(when(isSize(format, width, 2)), () -> format.rowBytes(width));
        check("another result", row == null || row == (long) width * bytesPerPixel(format));
    }

    private void profile() throws Exception {
        PixelFormat format = format();
        int degrees = rotation();
        int number = random.nextInt();
        with(format, degrees, number);
        EngineProfile.Builder builder = new EngineProfile.Builder();
        attempt(when(format != null), () -> builder.format(format, number));
        attempt(when(isRotation(degrees)), () -> builder.orientation(degrees, ~number));
        EngineProfile profile = builder.code(number, "E").build();
        PixelFormat asked = format();
        Integer value = attempt(when(asked != null && asked == format), () -> profile.formatValue(asked));
        check("another number", value == null || value == number);
        int turned = rotation();
        value = attempt(when(isRotation(turned) && turned == degrees), () -> profile.orientationValue(turned));
        check("another number", value == null || value == ~number);
    }

    // ---- the engine -----------------------------------------------------------------------------------------------

    private static Expected byEngine(boolean valid, int width, int height) {
        return !valid ? Expected.REFUSAL
                : Math.max(width, height) > EngineValues.MAX_FRAME_SIDE ? Expected.FAILURE : Expected.RESULT;
    }

    private void sensible(List<FaceInfo> faces, int width, int height) {
        for (FaceInfo face : faces) {
            Rect r = face.faceRect;
            check("a face outside: " + r.left + " " + r.top + " " + r.right + " " + r.bottom,
                    r.left >= 0 && r.top >= 0 && r.left < r.right && r.top < r.bottom && r.right <= width
                            && r.bottom <= height);
        }
    }

    private static String text(List<FaceInfo> faces) {
        StringBuilder text = new StringBuilder();
        for (FaceInfo face : faces) {
            Rect r = face.faceRect;
            text.append(r.left).append(' ').append(r.top).append(' ').append(r.right).append(' ').append(r.bottom)
                    .append(' ').append(face.score).append(' ').append(face.facePoints.length).append('\n');
        }
        return text.toString();
    }

    private void detect() throws Exception {
        if (random.nextBoolean()) {
            CameraFrame frame = frame();
            with(frame);
            boolean filled = isFilled(frame);
            List<FaceInfo> faces = attempt(when(filled), () -> detector.detect(frame));
            if (faces != null) {
                sensible(faces, frame.width(), frame.height());
                check("other faces in the same bytes", text(faces).equals(text(detector.detect(
                        frame.data(), frame.format(), frame.width(), frame.height(), frame.width(),
                        frame.rotationDegrees()))));
            }
            return;
        }
        PixelFormat format = format();
        int width = side();
        int height = side();
        int stride = stride(format, width);
        int degrees = rotation();
        BigInteger bytes = stridedBytes(format, width, height, stride);
        byte[] image = image(bytes.longValue());
        with(image, format, width, height, stride, degrees);
        boolean valid = image != null && holds(image.length, bytes) && isRotation(degrees);
        List<FaceInfo> faces = attempt(byEngine(valid, width, height), () ->
                detector.detect(image, format, width, height, stride, degrees));
        if (faces != null) {
            sensible(faces, width, height);
        }
        detectInts(image == null ? new byte[0] : image, format, width, height, stride, degrees, faces);
    }

    private void detectInts(byte[] image, PixelFormat format, int width, int height, int stride, int degrees,
            List<FaceInfo> inBytes) throws Exception {
        int[] ints = new int[(image.length + 3) / 4 - (rarely() && image.length > 0 ? 1 : 0)];
        for (int i = 0; i < image.length && i / 4 < ints.length; i++) {
            ints[i / 4] |= (image[i] & 0xFF) << 8 * (i % 4);
        }
        BigInteger bytes = stridedBytes(format, width, height, stride);
        boolean valid = bytes.signum() > 0 && isRotation(degrees)
                && BigInteger.valueOf(ints.length * 4L).compareTo(bytes) >= 0;
        List<FaceInfo> faces = attempt(byEngine(valid, width, height), () ->
                detector.detect(ints, format, width, height, stride, degrees));
        check("other faces in ints", faces == null || inBytes == null || text(inBytes).equals(text(faces)));
    }

    private void track() throws Exception {
        if (random.nextBoolean()) {
            CameraFrame frame = frame();
            with(frame);
            List<FaceInfo> faces = attempt(when(isFilled(frame)), () -> tracker.track(frame));
            if (faces != null) {
                sensible(faces, frame.width(), frame.height());
            }
            return;
        }
        PixelFormat format = format();
        int width = side();
        int height = side();
        int stride = stride(format, width);
        int degrees = rotation();
        BigInteger bytes = stridedBytes(format, width, height, stride);
        int[] ints = random.nextBoolean() ? new int[lengthNear(bytes.longValue() / 4 + 1)] : null;
        byte[] image = ints == null ? image(bytes.longValue()) : null;
        with(image, ints, format, width, height, stride, degrees);
        BigInteger there = BigInteger.valueOf(ints != null ? ints.length * 4L : image != null ? image.length : -1);
        boolean valid = bytes.signum() > 0 && there.compareTo(bytes) >= 0 && isRotation(degrees);
        List<FaceInfo> faces = attempt(byEngine(valid, width, height), () -> ints != null
                ? tracker.track(ints, format, width, height, stride, degrees)
                : tracker.track(image, format, width, height, stride, degrees));
        if (faces != null) {
            sensible(faces, width, height);
        }
    }

    private void threshold() throws Exception {
        Float[] thresholds = {0.5f, 0.6f, 0.01f, 1f, 0f, -1f, Float.NaN, 2f, 1e-9f, Float.MAX_VALUE,
            Float.POSITIVE_INFINITY, Float.NEGATIVE_INFINITY, random.nextFloat()};
        float threshold = oneOf(thresholds);
        with(threshold);
        boolean inRange = threshold >= EngineValues.MIN_THRESHOLD && threshold <= EngineValues.MAX_THRESHOLD;
        float before = detector.threshold();
        attempt(!(threshold > 0) ? Expected.REFUSAL : inRange ? Expected.RESULT : Expected.FAILURE,
                () -> detector.setThreshold(threshold));
        check("another threshold", detector.threshold() == (inRange ? threshold : before));
        detector.setThreshold(EngineValues.DEFAULT_THRESHOLD);
    }

    private void settings() throws Exception {
        int value = rarely() ? absurd() : random.nextInt(1200) - 5;
        with(value);
        attempt(inRange(value, EngineValues.MIN_FACE_LIMIT, EngineValues.MAX_FACE_LIMIT),
                () -> tracker.setFaceLimit(value));
        attempt(inRange(value, EngineValues.MIN_DETECT_INTERVAL, EngineValues.MAX_DETECT_INTERVAL),
                () -> tracker.setDetectInterval(value));
        attempt(inRange(value, EngineValues.MIN_ALIGNMENT_THRESHOLD, EngineValues.MAX_ALIGNMENT_THRESHOLD),
                () -> tracker.setAlignmentThreshold(value));
        tracker.reset();
        check("another version", verifier.version() == EngineValues.VERIFY_VERSION);
        check("another length", verifier.featureLength() == EngineValues.FEATURE_LENGTH);
    }

    private static Expected inRange(int value, int lowest, int highest) {
        return value >= lowest && value <= highest ? Expected.RESULT : Expected.FAILURE;
    }

    private void compare() throws Exception {
        byte[] first = feature();
        byte[] second = feature();
        with(first, second);
        boolean texts = isText(first) && isText(second);
        boolean features = first == feature && second == feature;
        Float got = attempt(!texts ? Expected.REFUSAL : features ? Expected.RESULT : Expected.FAILURE,
                () -> verifier.compare(first, second));
        check("a face unlike itself", got == null || Math.abs(got - 1) < 1e-4);
    }

    private static boolean isText(byte[] bytes) {
        return bytes != null && bytes.length > 0 && bytes[bytes.length - 1] == 0;
    }

    /** The feature, decoded. */
    Feature decodedFeature() {
        return Feature.decode(feature);
    }

    /** The feature, or what is none. */
    private byte[] feature() {
        if (random.nextInt(3) != 0) {
            return feature;
        }
        byte[] other = content(random.nextInt(100));
        if (random.nextBoolean() && other.length > 0) {
            other[other.length - 1] = 0;
        }
        if (rarely()) {
            other = Arrays.copyOf(feature, feature.length - 1 - random.nextInt(5)); // cut off
        }
        return rarely() ? null : other;
    }

    FaceInfo face(Rect rect, int points) {
        FaceInfo face = new FaceInfo();
        face.faceRect = rect;
        face.facePoints = new PointF[points];
        for (int i = 0; i < points; i++) {
            face.facePoints[i] = new PointF(random.nextInt(48), random.nextInt(48));
        }
        return face;
    }

    FaceInfo anyFace() {
        Rect rect = rarely() ? null : random.nextInt(4) == 0 ? new Rect(absurd(), absurd(), absurd(), absurd())
                : new Rect(random.nextInt(20), random.nextInt(20), 10 + random.nextInt(40), 10 + random.nextInt(40));
        FaceInfo face = face(rect, random.nextInt(8) == 0 ? random.nextInt(300) : random.nextInt(6));
        if (rarely() && face.facePoints.length > 0) {
            face.facePoints[random.nextInt(face.facePoints.length)] =
                    random.nextBoolean() ? null : new PointF(Float.NaN, Float.POSITIVE_INFINITY);
        }
        if (rarely()) {
            face.facePoints = null;
        }
        return face;
    }

    private void extract() throws Exception {
        FaceInfo face = anyFace();
        CameraFrame frame = frame();
        with(frame, face);
        boolean valid = isFilled(frame) && face.faceRect != null && face.facePoints != null
                && face.facePoints.length <= FaceVerifier.MAX_POINTS && !Arrays.asList(face.facePoints).contains(null);
        Rect r = face.faceRect;
        boolean possible = valid && r.left < r.right && r.top < r.bottom;
        byte[] got = attempt(!valid ? Expected.REFUSAL
                : possible ? Expected.RESULT_OR_FAILURE : Expected.FAILURE, () -> verifier.extract(frame, face));
        if (got != null) {
            check("another length", got.length == EngineValues.FEATURE_TEXT_LENGTH && isText(got));
            byte[] again = verifier.extract(
                    frame.data(), frame.format(), frame.width(), frame.height(), frame.width(), face);
            check("another feature of the same face", Arrays.equals(got, again));
        }
    }

    private void create() throws Exception {
        String path = oneOf(new String[] {null, null, "", "/there/is/no/model", "\u0000", "\uD800"});
        int config = oneOf(new Integer[] {0, 1, 2, 3, -1, MOST});
        EngineProfile profile = rarely() ? null : EngineProfile.OPEN;
        with(path, config, profile);
        boolean there = path == null && config >= 0 && config <= 2;
        Expected expected = profile == null ? Expected.REFUSAL : there ? Expected.RESULT : Expected.FAILURE;
        FaceDetector newDetector = attempt(expected, () -> new FaceDetector(path, config, profile));
        if (newDetector != null) {
            detector.close();
            detector.close();
            FaceDetector closed = detector;
            detector = newDetector;
            attempt(Expected.REFUSAL, () -> closed.detect(new byte[1], PixelFormat.GRAY, 1, 1, 1, 0));
            attempt(Expected.REFUSAL, closed::threshold);
        }
        FaceTracker newTracker = attempt(expected, () -> new FaceTracker(path, config, profile));
        if (newTracker != null) {
            tracker.close();
            FaceTracker closed = tracker;
            tracker = newTracker;
            attempt(Expected.REFUSAL, closed::reset);
        }
        attempt(profile == null ? Expected.REFUSAL : path == null ? Expected.RESULT : Expected.FAILURE, () -> {
            new FaceVerifier(path, profile).close();
        });
    }
}
