// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertNotNull;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.fail;

import com.vantrel.faceapi.model.FaceInfo;
import org.junit.Before;
import org.junit.Test;

/** An engine that claims more than there can be: the JVM refuses the arrays, and all goes on. */
public class StrangeEngineTest {
    private static final byte THE_MOST = 1;
    private static final byte THE_LEAST = 2;

    private final int[] status = {-77};
    private int out;

    @Before
    public void countWhatIsOut() {
        FaceLibrary.setDebug(false);
        out = FaceLibrary.kyFaceShowInsideModel();
    }

    /** An image with one face and a feature of one byte, of which the engine says something else. */
    private static byte[] image(byte lie) {
        return new byte[] {1, 1, lie, 0};
    }

    private FaceInfo[] detect(byte[] image) {
        return FaceLibrary.kyFaceDetectBytes(1, image, 0, 2, 2, 2, 0, status);
    }

    private byte[] feature(byte[] image) {
        return FaceLibrary.kyFaceGetFeatureBytes(1, image, 0, 2, 2, 2, new FaceInfo(), status);
    }

    @Test
    public void moreFacesThanAnArrayHolds() {
        try {
            detect(image(THE_MOST));
            fail("there is no such array");
        } catch (OutOfMemoryError expected) {
            assertEquals(0, status[0]);
        }
        assertEquals("the engine got its faces back", out, FaceLibrary.kyFaceShowInsideModel());
        assertEquals(1, detect(image((byte) 0)).length);
    }

    @Test
    public void fewerThanNone() {
        assertNull(detect(image(THE_LEAST)));
        assertEquals(0, status[0]);
        assertEquals("the engine got its faces back", out, FaceLibrary.kyFaceShowInsideModel());
    }

    @Test
    public void featuresLongerThanAnyText() {
        for (byte lie : new byte[] {THE_MOST, THE_LEAST}) {
            try {
                feature(image(lie));
                fail("there is no such array");
            } catch (NegativeArraySizeException expected) {
                assertEquals(0, status[0]);
            }
        }
        assertEquals("the features stay with the engine", out + 2, FaceLibrary.kyFaceShowInsideModel());
        assertNotNull(feature(image((byte) 0)));
    }
}
