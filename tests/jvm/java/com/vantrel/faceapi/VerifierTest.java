// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertNotEquals;
import static org.junit.Assert.assertNotNull;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertTrue;

import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.io.IOException;
import java.util.Arrays;
import java.util.Base64;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

public class VerifierTest {
    /** What no engine answers: a status array that still holds it was not written. */
    private static final int UNTOUCHED = 0x5A5A5A5A;

    private final Portrait portrait = Portrait.read();
    private final int[] status = {UNTOUCHED};
    private long verifier;

    @Before
    public void create() {
        verifier = FaceLibrary.kyFaceCreateVerify(null);
        assertNotEquals(0, verifier);
    }

    @After
    public void destroy() {
        FaceLibrary.kyFaceDestroyVerify(verifier);
    }

    private static FaceInfo at(int left, int top, int right, int bottom) {
        FaceInfo face = new FaceInfo();
        face.faceRect = new Rect(left, top, right, bottom);
        face.facePoints = new PointF[0];
        return face;
    }

    private static FaceInfo portraitsFace() {
        Rect r = Portrait.FACE;
        return at(r.left, r.top, r.right, r.bottom);
    }

    private byte[] feature(Portrait picture, FaceInfo face) {
        return FaceLibrary.kyFaceGetFeatureBytes(
                verifier, picture.nv21(), EngineValues.PIXEL_NV21, Portrait.WIDTH, Portrait.HEIGHT, Portrait.WIDTH,
                face, status);
    }

    private float compare(byte[] a, byte[] b) {
        status[0] = UNTOUCHED;
        return FaceLibrary.kyFaceCompareFeature(verifier, a, b, status);
    }

    @Test
    public void aFeatureIsTextOfTheModelsLength() {
        byte[] feature = feature(portrait, portraitsFace());
        assertNotNull(feature);
        assertEquals(EngineValues.SUCCESS, status[0]);
        int length = FaceLibrary.kyFaceGetVerifyLength(verifier);
        assertTrue(length > 0);
        assertTrue(FaceLibrary.kyFaceGetVerifyVersion(verifier) > 0);
        assertEquals((length + 2) / 3 * 4 + 1, feature.length);
        assertEquals("the terminating zero", 0, feature[feature.length - 1]);
        byte[] text = Arrays.copyOf(feature, feature.length - 1);
        assertEquals("base64 of the feature", length, Base64.getDecoder().decode(text).length);
    }

    @Test
    public void featuresSurviveTheWayThroughJava() {
        byte[] feature = feature(portrait, portraitsFace());
        byte[] kept = feature.clone();
        assertEquals(1, compare(kept, feature), 1e-6);
        assertEquals(EngineValues.SUCCESS, status[0]);
        assertArrayEquals("reading a feature changed it", kept, feature);
        assertNotEquals(0, FaceLibrary.kyFaceDeserialize(kept));
        assertArrayEquals(kept, feature(portrait, portraitsFace()));
    }

    /** The JVM's checks complain of references that were not announced. */
    @Test
    public void facesOfManyPointsAreRead() {
        for (int count : new int[] {1, 13, 14, 16, 17, 28, 30, 31, 256, 300}) {
            FaceInfo face = portraitsFace();
            face.facePoints = new PointF[count];
            Arrays.setAll(face.facePoints, i -> new PointF(Portrait.FACE.left + i % 50, Portrait.FACE.top + i / 50));
            assertNotNull(feature(portrait, face));
        }
    }

    @Test
    public void theSameFaceIsMoreAlikeThanAnotherPatch() {
        byte[] face = feature(portrait, portraitsFace());
        Rect r = Portrait.FACE;
        byte[] moved = feature(portrait.moved(9, 4), at(r.left + 9, r.top + 4, r.right + 9, r.bottom + 4));
        byte[] patch = feature(portrait, at(169, 100, 255, 186));
        float same = compare(face, moved);
        float different = compare(face, patch);
        assertTrue(same + " and " + different, same > different + 0.05f && same <= 1 && different >= 0);
        assertEquals("comparing has no direction", different, compare(patch, face), 1e-6);
    }

    @Test
    public void intPixelsAreTakenAsBytes() {
        byte[] fromInts = FaceLibrary.kyFaceGetFeatureInts(
                verifier, portrait.argb(), EngineValues.PIXEL_BGRA, Portrait.WIDTH, Portrait.HEIGHT,
                4 * Portrait.WIDTH, portraitsFace(), status);
        assertNotNull(fromInts);
        assertTrue(compare(fromInts, feature(portrait, portraitsFace())) > 0.9f);
    }

    @Test
    public void withoutFaceStatusOrVerifierThereIsNoFeature() {
        int w = Portrait.WIDTH;
        int h = Portrait.HEIGHT;
        byte[] nv21 = portrait.nv21();
        assertNull(feature(portrait, null));
        assertNull(FaceLibrary.kyFaceGetFeatureBytes(
                verifier, nv21, EngineValues.PIXEL_NV21, w, h, w, portraitsFace(), null));
        assertNull(FaceLibrary.kyFaceGetFeatureBytes(
                0, nv21, EngineValues.PIXEL_NV21, w, h, w, portraitsFace(), status));
        assertEquals(UNTOUCHED, status[0]);
    }

    @Test
    public void anExtractionThatFailsLeavesTheStatus() {
        assertNull(feature(portrait, at(-500, -500, -400, -400)));
        assertNull(FaceLibrary.kyFaceGetFeatureBytes(
                verifier, portrait.nv21(), 99, Portrait.WIDTH, Portrait.HEIGHT, Portrait.WIDTH, portraitsFace(),
                status));
        assertEquals(UNTOUCHED, status[0]);
    }

    @Test
    public void nullPartsOfAFaceAreReadAsZeros() {
        FaceInfo zeros = portraitsFace();
        zeros.facePoints = new PointF[] {new PointF(3, 4), new PointF(), new PointF(5, 6)};
        FaceInfo face = portraitsFace();
        face.facePoints = new PointF[] {new PointF(3, 4), null, new PointF(5, 6)};
        assertArrayEquals(feature(portrait, zeros), feature(portrait, face));
        face.facePoints = null;
        assertArrayEquals(feature(portrait, portraitsFace()), feature(portrait, face));
        face.faceRect = null;
        status[0] = UNTOUCHED;
        assertNull("an empty rectangle has no feature", feature(portrait, face));
        assertEquals(UNTOUCHED, status[0]);
    }

    /** In a JVM of its own: its checks complain of as many references as there are points. */
    @Test
    public void pointsBeyond256AreNotRead() throws IOException, InterruptedException {
        Child child = Child.run(ManyPoints.class);
        assertEquals(child.output + child.errors, 0, child.exitStatus);
        assertTrue(child.output, child.output.endsWith("the same feature\n"));
    }

    static final class ManyPoints {
        public static void main(String[] args) {
            VerifierTest test = new VerifierTest();
            test.create();
            PointF[] points = new PointF[1000];
            for (int i = 0; i < points.length; i++) {
                points[i] = new PointF(Portrait.FACE.left + i % 16, Portrait.FACE.top + i / 16 % 16);
            }
            FaceInfo face = portraitsFace();
            face.facePoints = Arrays.copyOf(points, 256);
            byte[] feature = test.feature(test.portrait, face);
            face.facePoints = points;
            if (feature != null && Arrays.equals(feature, test.feature(test.portrait, face))) {
                System.out.println("the same feature");
            }
        }
    }

    @Test
    public void aNullFeatureIsLikeNothing() {
        byte[] feature = feature(portrait, portraitsFace());
        assertEquals(0, compare(feature, null), 0);
        assertEquals(UNTOUCHED, status[0]);
        assertEquals(0, compare(null, feature), 0);
        assertEquals(UNTOUCHED, status[0]);
    }

    @Test
    public void damagedFeaturesAreRefused() {
        byte[] feature = feature(portrait, portraitsFace());
        byte[] cut = Arrays.copyOf(feature, feature.length / 2);
        cut[cut.length - 1] = 0;
        byte[] foreign = feature.clone();
        foreign[5] = '*';
        byte[] longer = Arrays.copyOf(feature, feature.length + 4);
        Arrays.fill(longer, feature.length - 1, longer.length - 1, (byte) 'A');
        for (byte[] damaged : new byte[][] {cut, foreign, longer, {0}}) {
            assertEquals(0, FaceLibrary.kyFaceDeserialize(damaged));
            compare(feature, damaged);
            assertEquals(EngineValues.ERROR_FEATURE, status[0]);
        }
    }

    @Test
    public void aZeroHandleIsAllowedToBeDestroyed() {
        FaceLibrary.kyFaceDestroyVerify(0);
    }
}
