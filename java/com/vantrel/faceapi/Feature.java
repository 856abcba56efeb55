// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.Arrays;
import java.util.zip.CRC32;
import org.jetbrains.annotations.NotNull;

/**
 * A feature of the open engine, decoded once and compared many times.
 *
 * <p>{@link FaceVerifier#compare(byte[], byte[])} reads both features from their text each time. Who looks for one face
 * among many decodes them when they are loaded:
 *
 * <pre>{@code
 * Feature wanted = Feature.decode(verifier.extract(frame, face));
 * for (Feature known : album) {
 *     if (wanted.similarityTo(known) >= FaceVerifier.RECOMMENDED_THRESHOLD) {
 *         draw(face);
 *     }
 * }
 * }</pre>
 *
 * <p>Comparing takes no verifier and calls no native code, and gives what the engine gives. Features do not change and
 * may be shared by threads. What another engine extracts is no feature here: compare its arrays.
 */
public final class Feature {
    private static final String DIGITS = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

    private static final int MARK = 3;
    private static final int TAG_AT = MARK;
    private static final int COUNT_AT = TAG_AT + 4;
    private static final int NUMBERS_AT = COUNT_AT + 2;
    private static final int CHECKSUM = 4;

    /** Similarity of patterns: how far they agree where it is 0 and where it is a half. */
    private static final double UNRELATED = 0.4;

    private static final double BORDERLINE = 0.66;

    private final int version;
    private final int tag;
    /** The numbers of a descriptor; null for patterns. */
    private final float[] numbers;
    /** The histograms of patterns, and the sum of their squares; null for descriptors. */
    private final byte[] patterns;

    private final long square;

    private Feature(int version, int tag, float[] numbers, byte[] patterns) {
        this.version = version;
        this.tag = tag;
        this.numbers = numbers;
        this.patterns = patterns;
        square = patterns == null ? 0 : product(patterns, patterns);
    }

    /**
     * Decodes a feature.
     *
     * @param feature a feature as {@link FaceVerifier} extracts it, with or without its terminating zero
     * @return what it says
     * @throws NullPointerException when the array is null
     * @throws IllegalArgumentException when it is not exactly a feature of the open engine, by its form, its version
     *     and its checksum
     */
    public static @NotNull Feature decode(byte @NotNull [] feature) {
        byte[] bytes = bytesOf(Check.notNull("feature", feature));
        if (bytes.length < MARK + CHECKSUM || bytes[0] != 'K' || bytes[1] != 'Y') {
            throw refusal("a feature of the open engine");
        }
        int version = bytes[2];
        boolean described = version == EngineValues.DESCRIPTOR_VERSION;
        if (!described && version != EngineValues.VERIFY_VERSION) {
            throw refusal("of a version that is known");
        }
        if (bytes.length != (described ? EngineValues.DESCRIPTOR_LENGTH : EngineValues.FEATURE_LENGTH)) {
            throw refusal("as long as its version's are");
        }
        ByteBuffer buffer = ByteBuffer.wrap(bytes).order(ByteOrder.LITTLE_ENDIAN);
        CRC32 checksum = new CRC32();
        checksum.update(bytes, 0, bytes.length - CHECKSUM);
        if (buffer.getInt(bytes.length - CHECKSUM) != (int) checksum.getValue()) {
            throw refusal("whole: its checksum differs");
        }
        if (!described) {
            return new Feature(version, 0, null, Arrays.copyOfRange(bytes, MARK, bytes.length - CHECKSUM));
        }
        if (buffer.getShort(COUNT_AT) != EngineValues.DESCRIPTOR_NUMBERS) {
            throw refusal("of " + EngineValues.DESCRIPTOR_NUMBERS + " numbers");
        }
        float[] numbers = new float[EngineValues.DESCRIPTOR_NUMBERS];
        for (int i = 0; i < numbers.length; i++) {
            numbers[i] = buffer.getFloat(NUMBERS_AT + Float.BYTES * i);
            if (Float.isNaN(numbers[i]) || Float.isInfinite(numbers[i])) {
                throw refusal("of numbers alone");
            }
        }
        return new Feature(version, buffer.getInt(TAG_AT), numbers, null);
    }

    /**
     * Returns the version of the verifier that extracted this feature.
     *
     * @return {@link EngineValues#VERIFY_VERSION} or {@link EngineValues#DESCRIPTOR_VERSION}
     */
    public int version() {
        return version;
    }

    /**
     * Tells whether this feature and another are of one version and, if they are descriptors, of one model.
     *
     * @param other the other feature
     * @return whether they compare
     * @throws NullPointerException when the other is null
     */
    public boolean comparesWith(@NotNull Feature other) {
        Check.notNull("other", other);
        return version == other.version && tag == other.tag;
    }

    /**
     * Compares this feature with another.
     *
     * @param other the other feature
     * @return their similarity, from 0 to 1; the larger, the more alike
     * @throws NullPointerException when the other is null
     * @throws IllegalArgumentException when the two do not compare
     */
    public float similarityTo(@NotNull Feature other) {
        if (!comparesWith(other)) {
            throw Check.refusal("other", "a feature of the same version and model", "one of version " + other.version);
        }
        return numbers == null ? byPatterns(other) : byDistance(other);
    }

    private float byDistance(Feature other) {
        double squares = 0;
        for (int i = 0; i < numbers.length; i++) {
            double difference = (double) numbers[i] - other.numbers[i];
            squares += difference * difference;
        }
        double far = 2 * (double) EngineValues.DESCRIPTOR_THRESHOLD_DISTANCE;
        return (float) Math.max(1 - Math.sqrt(squares) / far, 0);
    }

    private float byPatterns(Feature other) {
        if (square == 0 || other.square == 0) {
            return 0;
        }
        double agreement = product(patterns, other.patterns) / Math.sqrt((double) square * other.square);
        double similarity = agreement < BORDERLINE
                ? 0.5 * (agreement - UNRELATED) / (BORDERLINE - UNRELATED)
                : 0.5 + 0.5 * (agreement - BORDERLINE) / (1 - BORDERLINE);
        return (float) Math.min(Math.max(similarity, 0), 1);
    }

    /** Reads base64, as far as features have it: no padding, and a zero at the end or none. */
    private static byte[] bytesOf(byte[] text) {
        int length = text.length > 0 && text[text.length - 1] == 0 ? text.length - 1 : text.length;
        if (length % 4 != 0) {
            throw refusal("groups of four characters");
        }
        byte[] bytes = new byte[length / 4 * 3];
        for (int i = 0; i < length; i += 4) {
            int bits = 0;
            for (int k = 0; k < 4; k++) {
                int digit = DIGITS.indexOf(text[i + k]);
                if (digit < 0) {
                    throw refusal("base64");
                }
                bits = bits << 6 | digit;
            }
            int at = i / 4 * 3;
            bytes[at] = (byte) (bits >> 16);
            bytes[at + 1] = (byte) (bits >> 8);
            bytes[at + 2] = (byte) bits;
        }
        return bytes;
    }

    private static long product(byte[] a, byte[] b) {
        long sum = 0;
        for (int i = 0; i < a.length; i++) {
            sum += (a[i] & 0xFF) * (b[i] & 0xFF);
        }
        return sum;
    }

    private static IllegalArgumentException refusal(String expected) {
        return new IllegalArgumentException("feature must be " + expected);
    }
}
