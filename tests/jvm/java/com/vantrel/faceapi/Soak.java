// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import com.vantrel.faceapi.model.FaceInfo;
import java.io.IOException;
import java.lang.management.ManagementFactory;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Paths;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Random;
import java.util.concurrent.BrokenBarrierException;
import java.util.concurrent.CyclicBarrier;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import javax.management.JMException;
import javax.management.ObjectName;

/**
 * Calls the library for a long time from eight threads: the given number of times each, all threads together, track,
 * convertColorSpace and faceBrightEvaluate, on small frames.
 *
 * <p>Every result must be that of the same thread's first calls. A first slice of the calls compiles what is to be
 * compiled; after it and each of ten more the process's resident memory, the JVM's count of JNI global
 * references and, over the counting engine, what the engine has not got back are printed. Resident memory and global
 * references must end within {@link #ALLOWED_KIB} and {@link #ALLOWED_REFERENCES} of what they were, and the engine
 * have got back everything. Ends with status 0 when all that holds.
 */
public final class Soak {
    private static final int THREADS = 8;
    private static final int SLICES = 10;
    /** What the calls may add for other reasons (compiled code, the collector's own tables, threads' arenas). */
    private static final long ALLOWED_KIB = 6 * 1024;
    /** Global references that the JVM may hold for its own threads when they are counted. */
    private static final long ALLOWED_REFERENCES = 8;

    private static final int WIDTH = 32;
    private static final int HEIGHT = 16;
    private static final int[] CODES = {
        ColorConversion.NV21_TO_BGRA, ColorConversion.NV21_TO_RGBA, ColorConversion.RGBA_TO_NV21,
        ColorConversion.NV12_TO_BGRA, ColorConversion.BGRA_TO_RGBA, ColorConversion.RGBA_TO_NV12,
        ColorConversion.NV21_TO_BGR,
    };
    private static final int[] METRICS = {
        BrightnessMetric.LIGHTNESS_RGBA, BrightnessMetric.LIGHTNESS_BGRA, BrightnessMetric.LUMA_YUV,
        BrightnessMetric.GRAY_BGRA, BrightnessMetric.GRAY_RGBA,
    };

    private final CyclicBarrier barrier = new CyclicBarrier(THREADS + 1);
    private final boolean counting;
    private volatile Throwable failure;

    private Soak(boolean counting) {
        this.counting = counting;
    }

    /** Arguments: the number of calls, and "counting" or "open" for the engine that is there. */
    public static void main(String[] args) throws Exception {
        long calls = Long.parseLong(args[0]);
        FaceLibrary.setDebug(false);
        long rounds = (calls + THREADS * SLICES - 1) / (THREADS * SLICES);
        System.exit(new Soak(args[1].equals("counting")).run(rounds) ? 0 : 1);
    }

    private boolean run(long roundsInASlice) throws Exception {
        for (int i = 0; i < THREADS; i++) {
            Caller caller = new Caller(i);
            Thread thread = new Thread(() -> callAll(caller, roundsInASlice));
            thread.setDaemon(true);
            thread.start();
        }
        System.out.printf("%12s %12s %12s %12s%n", "calls each", "memory KiB", "global refs", "engine's");
        State last = new State(); // measuring, too, has a first time
        State first = null;
        for (int slice = 0; slice <= SLICES; slice++) {
            barrier.await(); // a slice is done
            last = new State();
            first = first == null ? last : first;
            System.out.printf("%12d %12d %12d %12d%n", slice * roundsInASlice * THREADS, last.residentKib,
                    last.globalReferences, last.notGivenBack);
            if (failure != null) {
                failure.printStackTrace(System.out);
                return false;
            }
            barrier.await(); // the next one begins
        }
        System.out.printf("resident memory changed by %d KiB%n", last.residentKib - first.residentKib);
        return last.residentKib - first.residentKib <= ALLOWED_KIB
                && last.globalReferences - first.globalReferences <= ALLOWED_REFERENCES && last.notGivenBack == 0;
    }

    private void callAll(Caller caller, long rounds) {
        try {
            for (int slice = 0; slice <= SLICES; slice++) {
                try {
                    for (long i = 0; i < rounds && failure == null; i++) {
                        caller.round(i);
                    }
                } catch (Throwable e) {
                    failure = e;
                }
                barrier.await();
                barrier.await();
            }
        } catch (InterruptedException | BrokenBarrierException e) {
            failure = e;
        }
    }

    /** What must not change. */
    private final class State {
        final long residentKib;
        final long globalReferences;
        final int notGivenBack;

        State() throws IOException, JMException {
            System.gc();
            byte[] text = Files.readAllBytes(Paths.get("/proc/self/status"));
            residentKib = number("VmRSS:\\s*(\\d+) kB", new String(text, StandardCharsets.UTF_8));
            Object threads = ManagementFactory.getPlatformMBeanServer().invoke(
                    new ObjectName("com.sun.management:type=DiagnosticCommand"), "threadPrint",
                    new Object[] {new String[0]}, new String[] {String[].class.getName()});
            globalReferences = number("JNI global refs: (\\d+)", threads.toString());
            notGivenBack = counting ? FaceLibrary.kyFaceShowInsideModel() : 0;
        }

        private long number(String pattern, String text) {
            Matcher matcher = Pattern.compile(pattern).matcher(text);
            if (!matcher.find()) {
                throw new AssertionError("no " + pattern + " in " + text);
            }
            return Long.parseLong(matcher.group(1));
        }
    }

    /** One thread's arrays and handle, and the results of its first calls. */
    private static final class Caller {
        private final byte[] frame = new byte[WIDTH * HEIGHT * 4];
        private final byte[] out = new byte[WIDTH * HEIGHT * 4];
        private final int[] status = {-1};
        private final long tracker;
        private final String faces;
        private final List<byte[]> converted = new ArrayList<>();
        private final int[] brightness = new int[METRICS.length];

        Caller(int seed) {
            new Random(seed).nextBytes(frame);
            frame[0] = (byte) (1 + seed % 3); // faces, and points of each, where the counting engine finds them
            frame[1] = (byte) (5 * seed);
            frame[2] = 0; // and where it tells the truth
            tracker = FaceLibrary.kyFaceCreateTracker(null, 0, 0);
            check("tracker", tracker != 0);
            faces = track();
            for (int code : CODES) {
                converted.add(convert(code).clone());
            }
            for (int i = 0; i < METRICS.length; i++) {
                brightness[i] = evaluate(METRICS[i]);
            }
        }

        void round(long i) {
            check("faces", faces.equals(track()));
            int conversion = (int) (i % CODES.length);
            check("pixels", Arrays.equals(converted.get(conversion), convert(CODES[conversion])));
            int metric = (int) (i % METRICS.length);
            check("brightness", brightness[metric] == evaluate(METRICS[metric]));
        }

        private String track() {
            status[0] = -1;
            FaceInfo[] found = FaceLibrary.kyFaceTrackBytes(
                    tracker, frame, EngineValues.PIXEL_NV21, WIDTH, HEIGHT, WIDTH, EngineValues.ORIENTATION_0, status);
            check("status", status[0] == EngineValues.SUCCESS);
            StringBuilder text = new StringBuilder();
            for (FaceInfo face : found == null ? new FaceInfo[0] : found) {
                text.append(face.id).append(face.faceRect.left).append(' ').append(face.facePoints.length);
            }
            return text.toString();
        }

        private byte[] convert(int code) {
            Arrays.fill(out, (byte) 0x5A);
            FaceLibrary.convertColorSpace(frame, WIDTH, HEIGHT, out, code);
            return out;
        }

        private int evaluate(int metric) {
            int bytes = metric == BrightnessMetric.LUMA_YUV ? 3 : 4;
            return FaceLibrary.faceBrightEvaluate(
                    frame, metric, WIDTH, WIDTH * bytes, HEIGHT, HEIGHT, 1, 1, WIDTH - 2, HEIGHT - 2);
        }

        private static void check(String what, boolean holds) {
            if (!holds) {
                throw new AssertionError(what + " changed");
            }
        }
    }
}
