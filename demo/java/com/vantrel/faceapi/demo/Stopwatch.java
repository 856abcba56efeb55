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

    void print() {
        System.out.printf("%-28s %9s%n", "stage", "ms");
        for (Map.Entry<String, Long> stage : stages.entrySet()) {
            System.out.printf("%-28s %9.2f%n", stage.getKey(), stage.getValue() / 1e6);
        }
    }
}
