// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertNotNull;
import static org.junit.Assert.assertTrue;

import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Paths;
import org.junit.Test;

/**
 * Many calls leave references and memory as they were. Runs over an engine that costs nothing and counts what it has
 * handed out, in a JVM whose heap neither grows nor shrinks.
 */
public class LeakTest {
    private static final int CALLS = 100_000;
    /** Calls from one native frame: the checks count all references at each step, which many would make slow. */
    private static final int CALLS_IN_ONE_FRAME = 2_000;
    /** What the calls may add for other reasons (compiled code, the collector's own tables). */
    private static final long ALLOWED_KIB = 6 * 1024;

    private static final byte FACES = 2;
    private static final byte POINTS = 5;
    private static final byte[] IMAGE = {FACES, POINTS, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0};

    static {
        System.loadLibrary("jvm_one_frame");
    }

    private final int[] status = new int[1];

    private static native int trackInOneFrame(long handle, byte[] image, int[] status, int calls);

    private static long residentKib() throws IOException {
        System.gc();
        byte[] text = Files.readAllBytes(Paths.get("/proc/self/status"));
        for (String line : new String(text, StandardCharsets.UTF_8).split("\n")) {
            if (line.startsWith("VmRSS:")) {
                return Long.parseLong(line.replaceAll("\\D", ""));
            }
        }
        throw new AssertionError("this system does not tell the resident memory");
    }

    /** Runs {@code call} until everything is compiled, and then a hundred thousand times with an eye on the memory. */
    private static void assertLeavesNothing(Runnable call) throws IOException {
        for (int i = 0; i < CALLS / 5; i++) {
            call.run();
        }
        assertEquals("the engine got back what it handed out", 0, FaceLibrary.kyFaceShowInsideModel());
        long before = residentKib();
        for (int i = 0; i < CALLS; i++) {
            call.run();
        }
        long grown = residentKib() - before;
        assertTrue("the process grew by " + grown + " KiB", grown < ALLOWED_KIB);
        assertEquals("the engine got back what it handed out", 0, FaceLibrary.kyFaceShowInsideModel());
    }

    @Test
    public void trackCalls() throws IOException {
        FaceLibrary.setDebug(false);
        long tracker = FaceLibrary.kyFaceCreateTracker(null, 0, 0);
        assertLeavesNothing(() -> {
            FaceInfo[] faces = FaceLibrary.kyFaceTrackBytes(tracker, IMAGE, 0, 4, 4, 4, 0, status);
            assertEquals(FACES, faces.length);
            assertEquals(POINTS, faces[FACES - 1].facePoints.length);
        });
    }

    @Test
    public void trackCallsInOneFrame() {
        long tracker = FaceLibrary.kyFaceCreateTracker(null, 0, 0);
        assertEquals(FACES * CALLS_IN_ONE_FRAME, trackInOneFrame(tracker, IMAGE, status, CALLS_IN_ONE_FRAME));
    }

    @Test
    public void featureCalls() throws IOException {
        FaceLibrary.setDebug(false);
        long verifier = FaceLibrary.kyFaceCreateVerify(null);
        FaceInfo face = new FaceInfo();
        face.faceRect = new Rect();
        face.facePoints = new PointF[] {new PointF(1, 2)};
        assertLeavesNothing(() -> {
            byte[] feature = FaceLibrary.kyFaceGetFeatureBytes(verifier, IMAGE, 0, 4, 4, 4, face, status);
            assertNotNull(feature);
            assertEquals(1, FaceLibrary.kyFaceCompareFeature(verifier, feature, feature, status), 0);
        });
    }
}
