// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertNotEquals;
import static org.junit.Assert.assertNotNull;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertTrue;

import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

public class DetectorTest {
    /** What no engine answers: a status array that still holds it was not written. */
    private static final int UNTOUCHED = 0x5A5A5A5A;

    private final Portrait portrait = Portrait.read();
    private final int[] status = {UNTOUCHED, UNTOUCHED};
    private long detector;

    @Before
    public void create() {
        detector = FaceLibrary.kyFaceCreateDetector(null, EngineValues.CONFIG_LARGE_FACES);
        assertNotEquals(0, detector);
    }

    @After
    public void destroy() {
        FaceLibrary.kyFaceDestroyDetector(detector);
    }

    private FaceInfo[] detect(Portrait picture, byte[] pixels, int format, int stride, int orientation) {
        status[0] = UNTOUCHED;
        FaceInfo[] faces = FaceLibrary.kyFaceDetectBytes(
                detector, pixels, format, picture.width(), picture.height(), stride, orientation, status);
        assertEquals(UNTOUCHED, status[1]);
        return faces;
    }

    private FaceInfo[] detectNv21(byte[] nv21) {
        return detect(portrait, nv21, EngineValues.PIXEL_NV21, Portrait.WIDTH, EngineValues.ORIENTATION_0);
    }

    @Test
    public void findsThePortraitInAnNv21Frame() {
        byte[] nv21 = portrait.nv21();
        byte[] before = nv21.clone();
        FaceInfo face = Portrait.assertFound(detectNv21(nv21), Portrait.FACE);
        assertEquals(EngineValues.SUCCESS, status[0]);
        assertTrue(face.score > EngineValues.DEFAULT_THRESHOLD && face.score <= 1);
        assertNotNull(face.facePoints);
        assertEquals("no model, no landmarks", 0, face.facePoints.length);
        assertEquals(0, face.eyeDist, 0);
        assertArrayEquals("the frame changed", before, nv21);
    }

    @Test
    public void everyPixelFormatFindsTheSameFace() {
        Rect expected = Portrait.assertFound(detectNv21(portrait.nv21()), Portrait.FACE).faceRect;
        int w = Portrait.WIDTH;
        byte[] nv12 = portrait.frame(ColorReference.Chroma.UV);
        byte[][] images = {
            portrait.pixels(2, 1, 0, 3, 3 * w), portrait.pixels(0, 1, 2, 3, 3 * w),
            portrait.pixels(2, 1, 0, 4, 4 * w), portrait.pixels(0, 1, 2, 4, 4 * w), nv12, nv12
        };
        int[] formats = {
            EngineValues.PIXEL_BGR, EngineValues.PIXEL_RGB, EngineValues.PIXEL_BGRA, EngineValues.PIXEL_RGBA,
            EngineValues.PIXEL_NV12, EngineValues.PIXEL_GRAY
        };
        int[] strides = {3 * w, 3 * w, 4 * w, 4 * w, w, w};
        for (int i = 0; i < formats.length; i++) {
            FaceInfo[] faces = detect(portrait, images[i], formats[i], strides[i], EngineValues.ORIENTATION_0);
            assertEquals("format " + formats[i], EngineValues.SUCCESS, status[0]);
            Portrait.assertFound(faces, Portrait.FACE);
            assertTrue("format " + formats[i], Portrait.overlap(expected, faces[0].faceRect) > 0.9);
        }
    }

    @Test
    public void intPixelsAreTakenAsBytes() {
        int[] argb = portrait.argb();
        int[] before = argb.clone();
        FaceInfo[] faces = FaceLibrary.kyFaceDetectInts(
                detector, argb, EngineValues.PIXEL_BGRA, Portrait.WIDTH, Portrait.HEIGHT, 4 * Portrait.WIDTH,
                EngineValues.ORIENTATION_0, status);
        assertEquals(EngineValues.SUCCESS, status[0]);
        Portrait.assertFound(faces, Portrait.FACE);
        assertArrayEquals("the pixels changed", before, argb);
    }

    @Test
    public void rowsMayLieFurtherApart() {
        int stride = 3 * Portrait.WIDTH + 13;
        byte[] padded = portrait.pixels(0, 1, 2, 3, stride);
        Portrait.assertFound(detect(portrait, padded, EngineValues.PIXEL_RGB, stride, EngineValues.ORIENTATION_0),
                Portrait.FACE);
    }

    @Test
    public void aFaceOnItsSideIsFoundInTheFramesOwnCoordinates() {
        Portrait side = portrait.onItsSide();
        FaceInfo[] faces = detect(
                side, side.nv21(), EngineValues.PIXEL_NV21, side.width(), EngineValues.ORIENTATION_90);
        assertEquals(EngineValues.SUCCESS, status[0]);
        Rect f = Portrait.FACE;
        Portrait.assertFound(faces, new Rect(f.top, Portrait.WIDTH - f.right, f.bottom, Portrait.WIDTH - f.left));
    }

    @Test
    public void noFaceIsNull() {
        Portrait blank = Portrait.blank();
        assertNull(detect(blank, blank.nv21(), EngineValues.PIXEL_NV21, Portrait.WIDTH, EngineValues.ORIENTATION_0));
        assertEquals(EngineValues.SUCCESS, status[0]);
    }

    @Test
    public void aZeroHandleFindsNothing() {
        FaceInfo[] faces = FaceLibrary.kyFaceDetectBytes(
                0, portrait.nv21(), EngineValues.PIXEL_NV21, Portrait.WIDTH, Portrait.HEIGHT, Portrait.WIDTH,
                EngineValues.ORIENTATION_0, status);
        assertNull(faces);
        assertEquals(UNTOUCHED, status[0]);
        FaceLibrary.kyFaceDestroyDetector(0);
    }

    @Test
    public void nullArraysFindNothing() {
        int w = Portrait.WIDTH;
        int h = Portrait.HEIGHT;
        assertNull(FaceLibrary.kyFaceDetectBytes(detector, null, EngineValues.PIXEL_NV21, w, h, w, 0, status));
        assertNull(FaceLibrary.kyFaceDetectInts(detector, null, EngineValues.PIXEL_BGRA, w, h, 4 * w, 0, status));
        assertEquals(UNTOUCHED, status[0]);
        assertNull(FaceLibrary.kyFaceDetectBytes(
                detector, portrait.nv21(), EngineValues.PIXEL_NV21, w, h, w, 0, null));
    }

    @Test
    public void theEnginesFailureComesBackAsItIs() {
        byte[] nv21 = portrait.nv21();
        assertNull(detect(portrait, nv21, 99, Portrait.WIDTH, EngineValues.ORIENTATION_0));
        assertEquals(EngineValues.ERROR_PIXEL_FORMAT, status[0]);
        assertNull(detect(portrait, nv21, EngineValues.PIXEL_NV21, Portrait.WIDTH - 1, EngineValues.ORIENTATION_0));
        assertEquals(EngineValues.ERROR_STRIDE, status[0]);
        assertNull(detect(portrait, nv21, EngineValues.PIXEL_NV21, Portrait.WIDTH, 45));
        assertEquals(EngineValues.ERROR_ORIENTATION, status[0]);
    }

    @Test
    public void theThresholdDecides() {
        assertEquals(EngineValues.DEFAULT_THRESHOLD, FaceLibrary.getDetectThreshold(detector, status), 0);
        assertEquals(EngineValues.SUCCESS, status[0]);

        status[0] = UNTOUCHED;
        FaceLibrary.setDetectThreshold(detector, EngineValues.MAX_THRESHOLD, status);
        assertEquals(EngineValues.SUCCESS, status[0]);
        assertEquals(EngineValues.MAX_THRESHOLD, FaceLibrary.getDetectThreshold(detector, status), 0);
        assertNull("nothing passes the highest threshold", detectNv21(portrait.nv21()));
        assertEquals(EngineValues.SUCCESS, status[0]);

        FaceLibrary.setDetectThreshold(detector, 1.5f, status);
        assertEquals(EngineValues.ERROR_RANGE, status[0]);
        FaceLibrary.setDetectThreshold(detector, Float.NaN, status);
        assertEquals(EngineValues.ERROR_RANGE, status[0]);
        assertEquals(EngineValues.MAX_THRESHOLD, FaceLibrary.getDetectThreshold(detector, status), 0);
    }

    @Test
    public void aThresholdOfZeroOrLessIsNotSet() {
        for (float threshold : new float[] {0, -0f, -0.5f, Float.NEGATIVE_INFINITY}) {
            status[0] = UNTOUCHED;
            FaceLibrary.setDetectThreshold(detector, threshold, status);
            assertEquals(UNTOUCHED, status[0]);
        }
        assertEquals(EngineValues.DEFAULT_THRESHOLD, FaceLibrary.getDetectThreshold(detector, status), 0);
    }

    @Test
    public void aModelThatIsNotThereGivesNoDetector() {
        assertEquals(0, FaceLibrary.kyFaceCreateDetector("/nowhere/at/all.dat", EngineValues.CONFIG_DEFAULT));
        String notAModel = System.getProperty("kyface.source") + "/demo/portrait.png";
        assertEquals(0, FaceLibrary.kyFaceCreateDetector(notAModel, EngineValues.CONFIG_DEFAULT));
        assertEquals(0, FaceLibrary.kyFaceCreateDetector(null, 12345));
    }

    @Test
    public void theEngineShowsItsModel() {
        assertEquals(EngineValues.SUCCESS, FaceLibrary.kyFaceShowInsideModel());
    }

    @Test
    public void manyDetectionsLeaveNoReferences() {
        // The JVM's checks complain when a native method leaves more local references than it announced.
        byte[] nv21 = portrait.nv21();
        FaceInfo first = Portrait.assertFound(detectNv21(nv21), Portrait.FACE);
        for (int i = 0; i < 3; i++) {
            assertEquals(first.faceRect, Portrait.assertFound(detectNv21(nv21), Portrait.FACE).faceRect);
        }
    }
}
