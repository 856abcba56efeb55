// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.Arrays;
import java.util.Base64;
import java.util.zip.CRC32;
import org.junit.Test;

/** Decoded features: what the engine says of their texts, and nothing else. */
public class FeatureTest {
    private final Portrait portrait = Portrait.read();

    private byte[] extract(FaceVerifier verifier, Rect rect) {
        FaceInfo face = new FaceInfo();
        face.faceRect = rect;
        face.facePoints = new PointF[0];
        return verifier.extract(
                portrait.nv21(), PixelFormat.NV21, Portrait.WIDTH, Portrait.HEIGHT, Portrait.WIDTH, face);
    }

    /** The text of a descriptor with these numbers. */
    private static byte[] descriptor(int tag, float... numbers) {
        ByteBuffer bytes = ByteBuffer.allocate(EngineValues.DESCRIPTOR_LENGTH).order(ByteOrder.LITTLE_ENDIAN);
        bytes.put(new byte[] {'K', 'Y', 2}).putInt(tag).putShort((short) 128);
        for (float number : Arrays.copyOf(numbers, 128)) {
            bytes.putFloat(number);
        }
        return sealed(bytes.array());
    }

    private static byte[] sealed(byte[] bytes) {
        CRC32 checksum = new CRC32();
        checksum.update(bytes, 0, bytes.length - 4);
        ByteBuffer.wrap(bytes).order(ByteOrder.LITTLE_ENDIAN).putInt(bytes.length - 4, (int) checksum.getValue());
        byte[] text = Base64.getEncoder().encode(bytes);
        return Arrays.copyOf(text, text.length + 1);
    }

    private static void assertRefused(byte[] feature) {
        assertThrows(IllegalArgumentException.class, () -> Feature.decode(feature));
    }

    @Test
    public void decodedPatternsCompareAsTheEngineCompares() {
        try (FaceVerifier verifier = new FaceVerifier()) {
            Rect r = Portrait.FACE;
            byte[][] texts = {
                extract(verifier, r),
                extract(verifier, new Rect(r.left + 5, r.top + 3, r.right + 5, r.bottom + 3)),
                extract(verifier, new Rect(169, 100, 255, 186)),
                extract(verifier, new Rect(20, 20, 60, 60)),
            };
            for (byte[] a : texts) {
                Feature feature = Feature.decode(a);
                assertEquals(EngineValues.VERIFY_VERSION, feature.version());
                for (byte[] b : texts) {
                    assertEquals(verifier.compare(a, b), feature.similarityTo(Feature.decode(b)), 0);
                }
            }
        }
    }

    @Test
    public void descriptorsCompareByTheirDistance() {
        Feature origin = Feature.decode(descriptor(7));
        for (double distance : new double[] {0, 0.3, 0.6, 0.9, 1.2, 5}) {
            float[] numbers = new float[128];
            numbers[11] = (float) (0.6 * distance);
            numbers[127] = (float) (-0.8 * distance);
            Feature other = Feature.decode(descriptor(7, numbers));
            assertEquals(EngineValues.DESCRIPTOR_VERSION, other.version());
            assertEquals(Math.max(0, 1 - distance / 1.2), origin.similarityTo(other), 1e-6);
            assertEquals(origin.similarityTo(other), other.similarityTo(origin), 0);
        }
    }

    @Test
    public void kindsNeverCompare() {
        try (FaceVerifier verifier = new FaceVerifier()) {
            Feature patterns = Feature.decode(extract(verifier, Portrait.FACE));
            Feature described = Feature.decode(descriptor(7));
            Feature otherModel = Feature.decode(descriptor(8));
            assertTrue(described.comparesWith(Feature.decode(descriptor(7, 1, 2))));
            for (Feature[] pair : new Feature[][] {{patterns, described}, {described, otherModel}}) {
                assertFalse(pair[0].comparesWith(pair[1]));
                assertThrows(IllegalArgumentException.class, () -> pair[0].similarityTo(pair[1]));
                assertThrows(IllegalArgumentException.class, () -> pair[1].similarityTo(pair[0]));
            }
            assertThrows(FaceEngineException.class, () -> verifier.compare(descriptor(7), descriptor(7)));
        }
    }

    @Test
    public void onlyWholeFeaturesAreDecoded() {
        byte[] text = descriptor(7, 0.1f, 0.2f);
        Feature.decode(text);
        Feature.decode(Arrays.copyOf(text, text.length - 1));
        assertThrows(NullPointerException.class, () -> Feature.decode(null));
        assertRefused(new byte[0]);
        assertRefused(new byte[1]);
        for (int length = 1; length < text.length - 1; length++) {
            assertRefused(Arrays.copyOf(text, length));
        }
        for (int i = 0; i < text.length - 1; i++) {
            for (byte other : new byte[] {'A', '/', '=', '-', 0, -1}) {
                byte[] changed = text.clone();
                if (changed[i] != other) {
                    changed[i] = other;
                    assertRefused(changed);
                }
            }
        }
        assertRefused(Arrays.copyOf(text, text.length + 4));
        byte[] bytes = Base64.getDecoder().decode(Arrays.copyOf(text, text.length - 1));
        for (int version : new int[] {0, 1, 3, 127, -1}) {
            byte[] changed = bytes.clone();
            changed[2] = (byte) version;
            assertRefused(sealed(changed));
        }
        byte[] otherCount = bytes.clone();
        otherCount[7] = 127;
        assertRefused(sealed(otherCount));
        for (float bad : new float[] {Float.NaN, Float.POSITIVE_INFINITY, Float.NEGATIVE_INFINITY}) {
            assertRefused(descriptor(7, 0, bad));
        }
    }
}
