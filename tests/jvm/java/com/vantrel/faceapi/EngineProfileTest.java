// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static com.vantrel.faceapi.CameraFrameTest.refused;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;
import static org.junit.Assert.fail;

import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.lang.reflect.Field;
import org.junit.BeforeClass;
import org.junit.Test;

/** An engine's numbers: what the open engine is given, and what another one would be. */
public final class EngineProfileTest {
    private static final CameraFrame FRAME =
            CameraFrame.of(new byte[64 * 48 * 3 / 2], PixelFormat.NV21, 64, 48, 90);

    @BeforeClass
    public static void quiet() {
        FaceLibrary.setDebug(false);
    }

    @Test
    public void theOpenEnginesNumbersAreItsValues() throws Exception {
        for (PixelFormat format : PixelFormat.values()) {
            Field value = EngineValues.class.getField("PIXEL_" + format);
            assertEquals(value.getInt(null), EngineProfile.OPEN.formatValue(format));
        }
        for (int degrees = 0; degrees < 360; degrees += 90) {
            Field value = EngineValues.class.getField("ORIENTATION_" + degrees);
            assertEquals(value.getInt(null), EngineProfile.OPEN.orientationValue(degrees));
        }
        int named = 0;
        for (Field field : EngineValues.class.getFields()) {
            if (field.getName().startsWith("ERROR_")) {
                int code = field.getInt(null);
                assertEquals(field.getName() + " (code " + code + ")", EngineProfile.OPEN.describe(code));
                named++;
            }
        }
        assertTrue(named >= 15);
        assertEquals("code 4711", EngineProfile.OPEN.describe(4711));
    }

    @Test
    public void whatIsNotGivenIsRefused() {
        EngineProfile.Builder builder = new EngineProfile.Builder().format(PixelFormat.NV21, 17).orientation(270, -3);
        EngineProfile profile = builder.build();
        builder.format(PixelFormat.NV21, 18).orientation(0, 0).format(PixelFormat.GRAY, 1);
        assertEquals(17, profile.formatValue(PixelFormat.NV21));
        assertEquals(-3, profile.orientationValue(270));
        refused("format must be one that the engine takes, not GRAY", () -> profile.formatValue(PixelFormat.GRAY));
        refused("rotationDegrees must be one", () -> profile.orientationValue(0));
        refused("rotationDegrees must be 0, 90", () -> profile.orientationValue(1));
        refused("rotationDegrees must be 0, 90", () -> builder.orientation(360, 1));
        try {
            builder.format(null, 1);
            fail("a null format was taken");
        } catch (NullPointerException right) {
            assertEquals("format is null", right.getMessage());
        }
        try {
            new FaceTracker(null, 0, null);
            fail("a null profile was taken");
        } catch (NullPointerException right) {
            assertEquals("profile is null", right.getMessage());
        }
    }

    /** The profile's numbers reach the engine: the open engine refuses those that are not its own, by their kind. */
    @Test
    public void detectorTrackerAndVerifierSpeakTheProfile() {
        EngineProfile strange = new EngineProfile.Builder().format(PixelFormat.NV21, EngineValues.PIXEL_NV21)
                .format(PixelFormat.RGBA, 99).orientation(90, 4).orientation(0, EngineValues.ORIENTATION_0)
                .code(EngineValues.ERROR_ORIENTATION, "E_TURNED").build();
        try (FaceDetector detector = new FaceDetector(null, 0, strange);
                FaceTracker tracker = new FaceTracker(null, 0, strange);
                FaceVerifier verifier = new FaceVerifier(null, strange)) {
            failing("face detection failed: E_TURNED (code -6)", () -> detector.detect(FRAME));
            failing("face tracking failed: E_TURNED (code -6)", () -> tracker.track(FRAME));
            failing("face detection failed: code -3", () ->
                    detector.detect(new byte[256], PixelFormat.RGBA, 8, 8, 32, 0));
            failing("face tracking failed: code -3", () ->
                    tracker.track(new int[64], PixelFormat.RGBA, 8, 8, 32, 0));
            FaceInfo face = new FaceInfo();
            face.faceRect = new Rect(8, 8, 40, 40);
            face.facePoints = new PointF[0];
            failing("extracting a feature failed", () ->
                    verifier.extract(new int[64 * 48], PixelFormat.RGBA, 64, 48, 256, face));
            assertTrue(verifier.extract(FRAME, face).length > 0);
            refused("format", () -> detector.detect(new byte[64], PixelFormat.GRAY, 8, 8, 8, 0));
            refused("format", () -> tracker.track(new byte[64], PixelFormat.GRAY, 8, 8, 8, 0));
            refused("format", () -> verifier.extract(new byte[64], PixelFormat.GRAY, 8, 8, 8, face));
            refused("rotationDegrees", () -> detector.detect(new byte[96], PixelFormat.NV21, 8, 8, 8, 180));
            assertTrue(detector.detect(new byte[96], PixelFormat.NV21, 8, 8, 8, 0).isEmpty());
        }
    }

    private static void failing(String message, Runnable call) {
        try {
            call.run();
        } catch (FaceEngineException right) {
            assertEquals(message, right.getMessage());
            return;
        }
        fail("the engine took it");
    }
}
