// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.bench;

import com.vantrel.faceapi.CameraFrame;
import java.lang.management.ManagementFactory;
import java.lang.management.ThreadMXBean;
import java.nio.ByteBuffer;
import java.util.Arrays;
import java.util.Locale;
import java.util.Random;

/**
 * Milliseconds that packing a camera's planes into a frame takes: {@link CameraFrame#fill}, and the loop over all
 * samples that is its obvious alternative. Prints a line for each layout: its name and the two medians of interleaved
 * runs, separated by tabs.
 */
public final class PlanesBenchmark {
    /** The thread's own time: what else the machine does is not in it. */
    private static final ThreadMXBean TIME = ManagementFactory.getThreadMXBean();

    private static final int WARM_UPS = 200;
    private static final int RUNS = 301;

    private PlanesBenchmark() {}

    /** A camera's image: what it delivers of one. */
    private static final class Planes {
        final int width;
        final int height;
        final ByteBuffer y;
        final ByteBuffer u;
        final ByteBuffer v;
        final int yRowStride;
        final int chromaRowStride;
        final int chromaPixelStride;

        /** Chroma pairs, V first, in one buffer that U and V are views of; or two planes of their own. */
        Planes(int width, int height, int padding, boolean pairs) {
            this.width = width;
            this.height = height;
            yRowStride = width + padding;
            chromaPixelStride = pairs ? 2 : 1;
            chromaRowStride = pairs ? width + padding : width / 2 + padding;
            Random random = new Random(1);
            y = filled(yRowStride * height, random);
            ByteBuffer chroma = filled(chromaRowStride * height / 2, random);
            v = pairs ? view(chroma, 0) : chroma;
            u = pairs ? view(chroma, 1) : filled(chromaRowStride * height / 2, random);
        }

        private static ByteBuffer filled(int size, Random random) {
            byte[] bytes = new byte[size];
            random.nextBytes(bytes);
            ByteBuffer buffer = ByteBuffer.allocateDirect(size);
            buffer.put(bytes);
            buffer.flip();
            return buffer;
        }

        /** One plane of pairs ends where the other has its last sample. */
        private static ByteBuffer view(ByteBuffer pairs, int from) {
            ByteBuffer all = pairs.duplicate();
            all.position(from);
            all.limit(pairs.limit() - 1 + from);
            return all.slice();
        }

        void fill(CameraFrame frame) {
            frame.fill(width, height, y, yRowStride, u, chromaRowStride, chromaPixelStride, v, chromaRowStride,
                    chromaPixelStride, 0);
        }

        void copySampleBySample(byte[] out) {
            int at = 0;
            for (int row = 0; row < height; row++) {
                for (int column = 0; column < width; column++) {
                    out[at++] = y.get(row * yRowStride + column);
                }
            }
            for (int row = 0; row < height / 2; row++) {
                for (int column = 0; column < width / 2; column++) {
                    int from = row * chromaRowStride + column * chromaPixelStride;
                    out[at++] = v.get(from);
                    out[at++] = u.get(from);
                }
            }
        }
    }

    /** Prints the figures for frames of the width and height given. */
    public static void main(String[] arguments) {
        int width = Integer.parseInt(arguments[0]);
        int height = Integer.parseInt(arguments[1]);
        measure("chroma pairs, no padding", new Planes(width, height, 0, true));
        measure("chroma pairs, rows padded", new Planes(width, height, 64, true));
        measure("chroma planes, no padding", new Planes(width, height, 0, false));
        measure("chroma planes, rows padded", new Planes(width, height, 64, false));
    }

    private static void measure(String name, Planes planes) {
        CameraFrame frame = new CameraFrame();
        byte[] simple = new byte[planes.width * planes.height * 3 / 2];
        double[] filling = new double[RUNS];
        double[] copying = new double[RUNS];
        for (int run = -WARM_UPS; run < RUNS; run++) {
            long start = TIME.getCurrentThreadCpuTime();
            planes.fill(frame);
            long middle = TIME.getCurrentThreadCpuTime();
            planes.copySampleBySample(simple);
            long end = TIME.getCurrentThreadCpuTime();
            if (run >= 0) {
                filling[run] = (middle - start) * 1e-6;
                copying[run] = (end - middle) * 1e-6;
            }
        }
        if (!Arrays.equals(frame.data(), simple)) {
            throw new AssertionError(name + ": the two ways differ");
        }
        System.out.printf(Locale.ROOT, "%s\t%.3f\t%.3f%n", name, median(filling), median(copying));
    }

    private static double median(double[] values) {
        Arrays.sort(values);
        return values[values.length / 2];
    }
}
