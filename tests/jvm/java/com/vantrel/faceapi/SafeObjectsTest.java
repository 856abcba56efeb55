// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static com.vantrel.faceapi.CameraFrameTest.refused;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertNotEquals;
import static org.junit.Assert.assertTrue;
import static org.junit.Assert.fail;

import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.lang.reflect.Field;
import java.util.ArrayList;
import java.util.List;
import java.util.concurrent.Callable;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.ExecutionException;
import java.util.concurrent.ExecutorService;
import java.util.concurrent.Executors;
import java.util.concurrent.Future;
import java.util.concurrent.TimeUnit;
import java.util.concurrent.atomic.AtomicReference;
import org.junit.BeforeClass;
import org.junit.Test;

/** Detector, tracker and verifier as objects: closed, forgotten, misused, from one thread and from eight. */
public final class SafeObjectsTest {
    private static final CameraFrame BLANK =
            CameraFrame.of(new byte[96 * 64 * 3 / 2], PixelFormat.NV21, 96, 64, 90);

    @BeforeClass
    public static void quiet() {
        FaceLibrary.setDebug(false);
    }

    private static void closed(Callable<?> call) throws Exception {
        try {
            call.call();
        } catch (IllegalStateException right) {
            assertTrue(right.getMessage(), right.getMessage().endsWith(" is closed"));
            return;
        }
        fail("a closed object worked");
    }

    @Test
    public void noFaceIsAnEmptyList() {
        try (FaceDetector detector = new FaceDetector(); FaceTracker tracker = new FaceTracker()) {
            assertTrue(detector.detect(BLANK).isEmpty());
            assertTrue(tracker.track(BLANK).isEmpty());
            assertTrue(detector.detect(new int[96 * 64], PixelFormat.BGRA, 96, 64, 96 * 4, 0).isEmpty());
            assertTrue(tracker.track(new byte[96 * 64], PixelFormat.GRAY, 96, 64, 96, 0).isEmpty());
        }
    }

    @Test
    public void closedObjectsRefuseEveryCall() throws Exception {
        FaceDetector detector = new FaceDetector();
        detector.close();
        detector.close();
        closed(() -> detector.detect(BLANK));
        closed(() -> detector.detect(new byte[64], PixelFormat.GRAY, 8, 8, 8, 0));
        closed(() -> detector.detect(new int[64], PixelFormat.RGBA, 8, 8, 32, 0));
        closed(detector::threshold);
        closed(() -> {
            detector.setThreshold(0.5f);
            return null;
        });

        FaceTracker tracker = new FaceTracker();
        tracker.close();
        closed(() -> tracker.track(BLANK));
        closed(() -> {
            tracker.reset();
            return null;
        });
        closed(() -> {
            tracker.setFaceLimit(1);
            return null;
        });
        closed(() -> {
            tracker.setDetectInterval(1);
            return null;
        });
        closed(() -> {
            tracker.setAlignmentThreshold(1);
            return null;
        });

        FaceVerifier verifier = new FaceVerifier();
        verifier.close();
        closed(verifier::version);
        closed(verifier::featureLength);
        closed(() -> verifier.extract(BLANK, face()));
        closed(() -> verifier.compare(new byte[1], new byte[1]));
    }

    private static FaceInfo face() {
        FaceInfo face = new FaceInfo();
        face.faceRect = new Rect(10, 10, 60, 60);
        face.facePoints = new PointF[0];
        return face;
    }

    @Test
    public void imagesThatDoNotFitAreRefused() {
        try (FaceDetector detector = new FaceDetector(); FaceVerifier verifier = new FaceVerifier()) {
            byte[] gray = new byte[64];
            refused("width", () -> detector.detect(gray, PixelFormat.GRAY, 0, 8, 8, 0));
            refused("height", () -> detector.detect(gray, PixelFormat.GRAY, 8, -1, 8, 0));
            refused("stride", () -> detector.detect(gray, PixelFormat.GRAY, 8, 8, 7, 0));
            refused("image", () -> detector.detect(gray, PixelFormat.GRAY, 8, 8, 9, 0));
            refused("image", () -> detector.detect(gray, PixelFormat.GRAY, 8, 9, 8, 0));
            refused("image", () -> detector.detect(gray, PixelFormat.GRAY, 8, 8, Integer.MAX_VALUE, 0));
            refused("rotationDegrees", () -> detector.detect(gray, PixelFormat.GRAY, 8, 8, 8, 1));
            refused("width", () -> detector.detect(gray, PixelFormat.NV21, 7, 8, 8, 0));
            refused("image", () -> detector.detect(gray, PixelFormat.NV21, 8, 8, 8, 0));
            refused("image", () -> detector.detect(new int[63], PixelFormat.RGBA, 8, 8, 32, 0));
            refused("threshold", () -> detector.setThreshold(0));
            refused("threshold", () -> detector.setThreshold(Float.NaN));
            refused("image", () -> verifier.extract(gray, PixelFormat.GRAY, 8, 9, 8, face()));
        }
    }

    @Test
    public void incompleteFacesAndFeaturesAreRefused() {
        try (FaceVerifier verifier = new FaceVerifier()) {
            FaceInfo crowded = face();
            crowded.facePoints = new PointF[257];
            java.util.Arrays.fill(crowded.facePoints, new PointF());
            refused("face.facePoints.length", () -> verifier.extract(BLANK, crowded));
            FaceInfo[] holes = {new FaceInfo(), face(), face()};
            holes[1].facePoints = null;
            holes[2].facePoints = new PointF[1];
            for (FaceInfo hole : holes) {
                try {
                    verifier.extract(BLANK, hole);
                    fail("an incomplete face was taken");
                } catch (NullPointerException right) {
                    assertTrue(right.getMessage().contains("face"));
                }
            }
            refused("feature1", () -> verifier.compare(new byte[0], new byte[1]));
            refused("feature2", () -> verifier.compare(new byte[1], new byte[] {1}));
            try {
                verifier.compare(new byte[] {'x', 0}, new byte[] {0});
                fail("a text that is no feature was compared");
            } catch (FaceEngineException right) {
                assertNotEquals(0, right.code());
            }
        }
    }

    @Test
    public void engineFailuresCarryTheirCode() {
        try (FaceDetector detector = new FaceDetector()) {
            try {
                detector.setThreshold(1000);
                fail("the engine took a threshold of 1000");
            } catch (FaceEngineException right) {
                assertEquals(EngineValues.ERROR_RANGE, right.code());
                assertEquals("setting the threshold failed: ERROR_RANGE (code -8)", right.getMessage());
            }
        }
        EngineProfile wrong = new EngineProfile.Builder().format(PixelFormat.GRAY, 99).orientation(0, 0).build();
        try (FaceDetector detector = new FaceDetector(null, 0, wrong)) {
            detector.detect(new byte[64], PixelFormat.GRAY, 8, 8, 8, 0);
            fail("the engine took pixel format 99");
        } catch (FaceEngineException right) {
            assertEquals(EngineValues.ERROR_PIXEL_FORMAT, right.code());
            assertEquals("face detection failed: code " + right.code(), right.getMessage());
        }
        try {
            new FaceDetector("/there is no such model", 0);
            fail("a detector came of nothing");
        } catch (FaceEngineException right) {
            assertEquals(FaceEngineException.UNKNOWN_CODE, right.code());
        }
    }

    @Test
    public void unfilledFramesAreRefused() {
        try (FaceDetector detector = new FaceDetector()) {
            detector.detect(new CameraFrame());
            fail("a frame without content was taken");
        } catch (IllegalStateException right) {
            assertEquals("the frame was never filled", right.getMessage());
        }
    }

    /** Two threads on one frame, of which one holds the frame's monitor all the while. */
    @Test
    public void aFramesMonitorLocksNothing() throws Exception {
        CameraFrame frame = CameraFrame.of(new byte[96 * 64 * 3 / 2], PixelFormat.NV21, 96, 64, 0);
        ExecutorService threads = Executors.newFixedThreadPool(2);
        try (FaceDetector detector = new FaceDetector(); FaceVerifier verifier = new FaceVerifier()) {
            CountDownLatch held = new CountDownLatch(1);
            Future<?> holder = threads.submit(() -> {
                synchronized (frame) {
                    held.countDown();
                    for (int i = 0; i < 8; i++) {
                        detector.detect(frame);
                        Images.brightness(frame, 0, 0, 96, 64);
                    }
                }
            });
            Future<?> other = threads.submit(() -> {
                held.await();
                for (int i = 0; i < 8; i++) {
                    detector.detect(frame);
                    frame.data();
                    try {
                        verifier.extract(frame, new FaceInfo());
                        fail("a face without a rectangle was taken");
                    } catch (NullPointerException right) {
                        assertTrue(right.getMessage().startsWith("face.faceRect"));
                    }
                }
                return null;
            });
            holder.get(300, TimeUnit.SECONDS);
            other.get(300, TimeUnit.SECONDS);
        } finally {
            threads.shutdownNow();
        }
    }

    /** A second writer takes a feature's end away while comparing waits for the verifier. */
    @Test
    public void aFeatureIsCheckedAsItIsCompared() throws Exception {
        byte[] feature = {'x', 0};
        ExecutorService threads = Executors.newFixedThreadPool(1);
        try (FaceVerifier verifier = new FaceVerifier()) {
            Field field = FaceVerifier.class.getDeclaredField("handle");
            field.setAccessible(true);
            Future<?> comparing;
            synchronized (field.get(verifier)) {
                AtomicReference<Thread> thread = new AtomicReference<>();
                comparing = threads.submit(() -> {
                    thread.set(Thread.currentThread());
                    return verifier.compare(feature, new byte[] {0});
                });
                while (thread.get() == null || thread.get().getState() != Thread.State.BLOCKED) {
                    Thread.sleep(1);
                }
                feature[1] = 'x'; // the engine would read past the array now
            }
            comparing.get();
            fail("a text that is no feature was compared");
        } catch (ExecutionException right) {
            assertEquals(FaceEngineException.class, right.getCause().getClass());
        } finally {
            threads.shutdownNow();
        }
    }

    @Test
    public void forgottenObjectsAreReclaimed() throws InterruptedException {
        int before = EngineHandle.liveCount();
        for (int i = 0; i < 20; i++) {
            new FaceVerifier();
        }
        for (int attempt = 0; attempt < 200 && EngineHandle.liveCount() > before; attempt++) {
            System.gc();
            Thread.sleep(20);
        }
        assertTrue(EngineHandle.liveCount() <= before);
    }

    @Test
    public void closingWaitsForCallsOfOtherThreads() throws Exception {
        ExecutorService threads = Executors.newFixedThreadPool(8);
        try {
            for (int round = 0; round < 10; round++) {
                FaceDetector detector = new FaceDetector();
                CountDownLatch start = new CountDownLatch(1);
                List<Future<Boolean>> results = new ArrayList<>();
                for (int i = 0; i < 8; i++) {
                    boolean closes = i == 7;
                    results.add(threads.submit(() -> {
                        start.await();
                        if (closes) {
                            detector.close();
                            return false;
                        }
                        try {
                            for (int call = 0; call < 50; call++) {
                                assertTrue(detector.detect(BLANK).isEmpty());
                            }
                            return false;
                        } catch (IllegalStateException closedMeanwhile) {
                            return true;
                        }
                    }));
                }
                start.countDown();
                for (Future<Boolean> result : results) {
                    result.get();
                }
                closed(() -> detector.detect(BLANK));
            }
        } catch (ExecutionException failed) {
            throw new AssertionError(failed.getCause());
        } finally {
            threads.shutdownNow();
        }
        assertFalse(Thread.interrupted());
    }
}
