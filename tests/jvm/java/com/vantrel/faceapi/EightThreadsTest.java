// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.lang.reflect.Method;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Collections;
import java.util.List;
import java.util.Random;
import java.util.concurrent.Callable;
import java.util.concurrent.ExecutorService;
import java.util.concurrent.Executors;
import java.util.concurrent.Future;
import org.junit.Test;
import org.junit.runner.JUnitCore;
import org.junit.runner.Request;
import org.junit.runner.Result;
import org.junit.runner.notification.Failure;

/** The tests of the classes above the native methods, misuse above all, by eight threads at once. */
public final class EightThreadsTest {
    private static final int THREADS = 8;
    private static final Class<?>[] CLASSES = {
        SafeObjectsTest.class, ImagesTest.class, CameraFrameTest.class, CameraToScreenTest.class};
    /** These count or time what other threads would disturb, or take long without saying more here. */
    private static final List<String> ALONE = Arrays.asList("forgottenObjectsAreReclaimed",
            "closingWaitsForCallsOfOtherThreads", "everyPixelLandsWhereItsPointIsMappedTo",
            "framesThatTurnOneAnotherDoNotBlock", "lightnessOfManyPixels", "brightnessOfManyPixels");

    private static List<Request> requests() {
        List<Request> requests = new ArrayList<>();
        for (Class<?> tests : CLASSES) {
            for (Method method : tests.getMethods()) {
                if (method.isAnnotationPresent(Test.class) && !ALONE.contains(method.getName())) {
                    requests.add(Request.method(tests, method.getName()));
                }
            }
        }
        return requests;
    }

    /** Runs them all in an order of its own; returns how many that were. */
    private static int runAll(int seed) {
        List<Request> requests = requests();
        Collections.shuffle(requests, new Random(seed));
        int run = 0;
        for (Request request : requests) {
            Result result = new JUnitCore().run(request);
            for (Failure failure : result.getFailures()) {
                throw new AssertionError(failure.getTestHeader(), failure.getException());
            }
            run += result.getRunCount();
        }
        return run;
    }

    @Test
    public void everyCaseHoldsBesideSevenOthers() throws Exception {
        int cases = requests().size();
        assertTrue(cases > CLASSES.length);
        ExecutorService threads = Executors.newFixedThreadPool(THREADS);
        List<Callable<Integer>> all = new ArrayList<>();
        for (int i = 0; i < THREADS; i++) {
            int seed = i;
            all.add(() -> runAll(seed));
        }
        for (Future<Integer> each : threads.invokeAll(all)) {
            assertEquals(cases, (int) each.get());
        }
        threads.shutdown();
    }
}
