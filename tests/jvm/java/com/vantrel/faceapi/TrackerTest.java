// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertNotEquals;
import static org.junit.Assert.assertNull;

import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

public class TrackerTest {
    /** What no engine answers: a status array that still holds it was not written. */
    private static final int UNTOUCHED = 0x5A5A5A5A;

    private final Portrait portrait = Portrait.read();
    private final int[] status = {UNTOUCHED};
    private long tracker;

    @Before
    public void create() {
        tracker = FaceLibrary.kyFaceCreateTracker(null, 4711, EngineValues.CONFIG_LARGE_FACES);
        assertNotEquals(0, tracker);
    }

    @After
    public void destroy() {
        FaceLibrary.kyFaceDestroyTracker(tracker);
    }

    private FaceInfo[] track(byte[] nv21) {
        status[0] = UNTOUCHED;
        FaceInfo[] faces = FaceLibrary.kyFaceTrackBytes(
                tracker, nv21, EngineValues.PIXEL_NV21, Portrait.WIDTH, Portrait.HEIGHT, Portrait.WIDTH,
                EngineValues.ORIENTATION_0, status);
        assertEquals(EngineValues.SUCCESS, status[0]);
        return faces;
    }

    @Test
    public void aFaceKeepsItsIdentityWhileItMoves() {
        assertEquals(EngineValues.SUCCESS, FaceLibrary.kyFaceTrackSetDetectInterval(tracker, 3));
        int id = 0;
        for (int step = 0; step < 6; step++) {
            FaceInfo face = Portrait.assertFound(track(portrait.moved(4 * step, 2 * step).nv21()),
                    new Rect(Portrait.FACE.left + 4 * step, Portrait.FACE.top + 2 * step,
                            Portrait.FACE.right + 4 * step, Portrait.FACE.bottom + 2 * step));
            if (step == 0) {
                id = face.id;
            }
            assertEquals("step " + step, id, face.id);
        }
    }

    @Test
    public void intPixelsAreTakenAsBytes() {
        FaceInfo[] faces = FaceLibrary.kyFaceTrackInts(
                tracker, portrait.argb(), EngineValues.PIXEL_BGRA, Portrait.WIDTH, Portrait.HEIGHT,
                4 * Portrait.WIDTH, EngineValues.ORIENTATION_0, status);
        assertEquals(EngineValues.SUCCESS, status[0]);
        Portrait.assertFound(faces, Portrait.FACE);
    }

    @Test
    public void aResetForgetsTheFaces() {
        FaceInfo before = Portrait.assertFound(track(portrait.nv21()), Portrait.FACE);
        assertEquals(before.id, Portrait.assertFound(track(portrait.nv21()), Portrait.FACE).id);
        FaceLibrary.kyFaceResetTracker(tracker);
        FaceInfo after = Portrait.assertFound(track(portrait.nv21()), Portrait.FACE);
        assertNotEquals("a face after a reset is a new one", before.id, after.id);
    }

    @Test
    public void noFaceIsNull() {
        assertNull(track(Portrait.blank().nv21()));
    }

    @Test
    public void aZeroHandleFindsNothing() {
        status[0] = UNTOUCHED;
        assertNull(FaceLibrary.kyFaceTrackBytes(0, portrait.nv21(), EngineValues.PIXEL_NV21, Portrait.WIDTH,
                Portrait.HEIGHT, Portrait.WIDTH, EngineValues.ORIENTATION_0, status));
        assertNull(FaceLibrary.kyFaceTrackInts(0, portrait.argb(), EngineValues.PIXEL_BGRA, Portrait.WIDTH,
                Portrait.HEIGHT, 4 * Portrait.WIDTH, EngineValues.ORIENTATION_0, status));
        assertEquals(UNTOUCHED, status[0]);
        FaceLibrary.kyFaceDestroyTracker(0);
        FaceLibrary.kyFaceResetTracker(0);
    }

    @Test
    public void nullArraysFindNothing() {
        status[0] = UNTOUCHED;
        int w = Portrait.WIDTH;
        int h = Portrait.HEIGHT;
        assertNull(FaceLibrary.kyFaceTrackBytes(tracker, null, EngineValues.PIXEL_NV21, w, h, w, 0, status));
        assertNull(FaceLibrary.kyFaceTrackInts(tracker, null, EngineValues.PIXEL_BGRA, w, h, 4 * w, 0, status));
        assertEquals(UNTOUCHED, status[0]);
        assertNull(FaceLibrary.kyFaceTrackBytes(tracker, portrait.nv21(), EngineValues.PIXEL_NV21, w, h, w, 0, null));
    }

    @Test
    public void settersPassTheEnginesAnswerOn() {
        assertEquals(EngineValues.SUCCESS, FaceLibrary.kyFaceTrackSetDetectFaceCntLimit(tracker, 1));
        assertEquals(EngineValues.ERROR_RANGE, FaceLibrary.kyFaceTrackSetDetectFaceCntLimit(
                tracker, EngineValues.MAX_FACE_LIMIT + 1));
        assertEquals(EngineValues.ERROR_RANGE, FaceLibrary.kyFaceTrackSetDetectInterval(
                tracker, EngineValues.MIN_DETECT_INTERVAL - 1));
        assertEquals(EngineValues.ERROR_RANGE, FaceLibrary.kyFaceTrackSetAlignmentThreshold(
                tracker, EngineValues.MAX_ALIGNMENT_THRESHOLD + 1));
        assertEquals(EngineValues.ERROR_HANDLE, FaceLibrary.kyFaceTrackSetDetectFaceCntLimit(0, 1));
        assertEquals(EngineValues.ERROR_HANDLE, FaceLibrary.kyFaceTrackSetDetectInterval(0, 1));
        assertEquals(EngineValues.ERROR_HANDLE, FaceLibrary.kyFaceTrackSetAlignmentThreshold(0, 1));
    }

    @Test
    public void aModelThatIsNotThereGivesNoTracker() {
        assertEquals(0, FaceLibrary.kyFaceCreateTracker("/nowhere/at/all.dat", 0, EngineValues.CONFIG_DEFAULT));
    }
}
