// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import java.util.LinkedHashMap;
import java.util.Map;

/** Times the stages of a job: each stage lasts from the one before, and repeated stages add up. */
final class Stopwatch {
    private final Map<String, Long> stages = new LinkedHashMap<>();
    private long last = System.nanoTime();

    void stage(String name) {
        long now = System.nanoTime();
        stages.merge(name, now - last, Long::sum);
        last = now;
    }

    /** Starts the next stage now: what happened since the last one is nobody's. */
    void skip() {
        last = System.nanoTime();
    }

    void printPerFrame(int frames) {
        System.out.printf("%-28s %9s %9s%n", "stage", "ms/frame", "frames/s");
        for (Map.Entry<String, Long> stage : stages.entrySet()) {
            double seconds = stage.getValue() / 1e9;
            System.out.printf("%-28s %9.2f %9.1f%n", stage.getKey(), seconds / frames * 1e3, frames / seconds);
        }
    }

    void print() {
        System.out.printf("%-28s %9s%n", "stage", "ms");
        for (Map.Entry<String, Long> stage : stages.entrySet()) {
            System.out.printf("%-28s %9.2f%n", stage.getKey(), stage.getValue() / 1e6);
        }
    }
}
