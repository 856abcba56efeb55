// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.PointF;
import com.vantrel.faceapi.model.FaceInfo;
import org.jetbrains.annotations.NotNull;
import org.jetbrains.annotations.Nullable;

/**
 * Tells whether two faces are one person's: extracts features and compares them.
 *
 * <p>A feature is a byte array that can be stored and sent as it is. Threads, closing and forgetting are as with
 * {@link FaceDetector}.
 */
public final class FaceVerifier implements AutoCloseable {
    /** The most landmark points that a face may have. */
    public static final int MAX_POINTS = 256;

    /**
     * The recommended threshold of the open engine: faces at least as alike are taken for one person's. What that means
     * depends on the model: with a descriptor's {@code docs/verification.md} has the rates of error, without a model it
     * tells a face in another frame from something else and says next to nothing about persons.
     */
    public static final float RECOMMENDED_THRESHOLD = EngineValues.VERIFY_THRESHOLD;

    /** What the status holds where native code did not write it. */
    private static final int NOT_WRITTEN = FaceEngineException.UNKNOWN_CODE;

    private final EngineProfile profile;
    private final EngineHandle handle;
    private final int[] status = new int[1];

    /**
     * Creates a verifier with the engine's built-in model.
     *
     * @throws FaceEngineException when the engine cannot create it
     */
    public FaceVerifier() {
        this(null);
    }

    /**
     * Creates a verifier.
     *
     * @param modelPath the model file; null for the engine's built-in model
     * @throws FaceEngineException when the engine cannot create it
     */
    public FaceVerifier(@Nullable String modelPath) {
        this(modelPath, EngineProfile.OPEN);
    }

    /**
     * Creates a verifier of an engine that has numbers of its own.
     *
     * @param modelPath the model file; null for the engine's built-in model
     * @param profile the engine's numbers; of its orientations none is used
     * @throws NullPointerException when the profile is null
     * @throws FaceEngineException when the engine cannot create it
     */
    public FaceVerifier(@Nullable String modelPath, @NotNull EngineProfile profile) {
        this.profile = Check.notNull("profile", profile);
        handle = EngineHandle.own(this, "face verifier", FaceLibrary.kyFaceCreateVerify(modelPath),
                FaceLibrary::kyFaceDestroyVerify);
    }

    /**
     * Returns the model's version. Features of different versions cannot be compared.
     *
     * @return the engine's number of the version
     * @throws IllegalStateException when this verifier is closed
     */
    public int version() {
        synchronized (handle) {
            return FaceLibrary.kyFaceGetVerifyVersion(handle.value());
        }
    }

    /**
     * Returns the length of a feature.
     *
     * @return bytes before serialization
     * @throws IllegalStateException when this verifier is closed
     */
    public int featureLength() {
        synchronized (handle) {
            return FaceLibrary.kyFaceGetVerifyLength(handle.value());
        }
    }

    /**
     * Extracts the feature of a face in a camera frame. The engine takes the frame as upright, whatever its rotation
     * says: turn it first when its faces lie on their side.
     *
     * @param frame the frame
     * @param face the face, in the frame's coordinates, with a rectangle and at most {@link #MAX_POINTS} points. The
     *     rectangle lies inside the frame: the engine refuses one whose middle does not
     * @return the feature
     * @throws NullPointerException when the frame, the face, its rectangle, its points or one of them is null
     * @throws IllegalArgumentException when the face has too many points, or the engine does not take the frame's
     *     format
     * @throws FaceEngineException when the engine cannot extract a feature
     * @throws IllegalStateException when this verifier is closed or the frame was never filled
     */
    public byte @NotNull [] extract(@NotNull CameraFrame frame, @NotNull FaceInfo face) {
        Check.notNull("frame", frame);
        check(face);
        synchronized (handle) {
            long engineHandle = handle.value();
            synchronized (frame.lock) {
                frame.checkFilled();
                status[0] = NOT_WRITTEN;
                int format = profile.formatValue(frame.format());
                return extracted(FaceLibrary.kyFaceGetFeatureBytes(engineHandle, frame.data(), format, frame.width(),
                        frame.height(), frame.width(), face, status));
            }
        }
    }

    /**
     * Extracts the feature of a face in an upright image.
     *
     * @param image the pixels
     * @param format their layout
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param face the face, in the image's coordinates, with a rectangle and at most {@link #MAX_POINTS} points. The
     *     rectangle lies inside the image: the engine refuses one whose middle does not
     * @return the feature
     * @throws NullPointerException when the image, the format, the face, its rectangle, its points or one of them is
     *     null
     * @throws IllegalArgumentException when a size, the stride or the array's length does not fit, the face has too
     *     many points, or the engine does not take the format
     * @throws FaceEngineException when the engine cannot extract a feature
     * @throws IllegalStateException when this verifier is closed
     */
    public byte @NotNull [] extract(
            byte @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride,
            @NotNull FaceInfo face) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, 1);
        check(face);
        int formatValue = profile.formatValue(format);
        synchronized (handle) {
            long engineHandle = handle.value();
            status[0] = NOT_WRITTEN;
            return extracted(FaceLibrary.kyFaceGetFeatureBytes(
                    engineHandle, image, formatValue, width, height, stride, face, status));
        }
    }

    /**
     * Extracts the feature of a face in an upright image whose bytes are held in ints.
     *
     * @param image the pixels
     * @param format their layout as bytes
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param face the face, in the image's coordinates, with a rectangle and at most {@link #MAX_POINTS} points. The
     *     rectangle lies inside the image: the engine refuses one whose middle does not
     * @return the feature
     * @throws NullPointerException when the image, the format, the face, its rectangle, its points or one of them is
     *     null
     * @throws IllegalArgumentException when a size, the stride or the array's length does not fit, the face has too
     *     many points, or the engine does not take the format
     * @throws FaceEngineException when the engine cannot extract a feature
     * @throws IllegalStateException when this verifier is closed
     */
    public byte @NotNull [] extract(
            int @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride,
            @NotNull FaceInfo face) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, Integer.BYTES);
        check(face);
        int formatValue = profile.formatValue(format);
        synchronized (handle) {
            long engineHandle = handle.value();
            status[0] = NOT_WRITTEN;
            return extracted(FaceLibrary.kyFaceGetFeatureInts(
                    engineHandle, image, formatValue, width, height, stride, face, status));
        }
    }

    /**
     * Compares two features. Who compares one with many decodes each once, as a {@link Feature}.
     *
     * @param feature1 a feature of this verifier's version; copied first, so that other threads may write it
     * @param feature2 the other; copied too
     * @return their similarity; the larger, the more alike
     * @throws NullPointerException when a feature is null
     * @throws IllegalArgumentException when an array is no feature by its form
     * @throws FaceEngineException when the engine cannot read or compare them
     * @throws IllegalStateException when this verifier is closed
     */
    public float compare(byte @NotNull [] feature1, byte @NotNull [] feature2) {
        byte[] text1 = checkedCopy("feature1", feature1);
        byte[] text2 = checkedCopy("feature2", feature2);
        synchronized (handle) {
            long engineHandle = handle.value();
            status[0] = NOT_WRITTEN;
            float score = FaceLibrary.kyFaceCompareFeature(engineHandle, text1, text2, status);
            if (status[0] != 0) {
                throw new FaceEngineException("comparing features", profile, status[0]);
            }
            return score;
        }
    }

    /** Frees the engine's object; further calls on this one fail. Closing twice does nothing. */
    @Override
    public void close() {
        handle.destroy();
    }

    private static byte[] extracted(byte[] feature) {
        if (feature == null) {
            throw new FaceEngineException("extracting a feature");
        }
        return feature;
    }

    private static void check(FaceInfo face) {
        Check.notNull("face", face);
        Check.notNull("face.faceRect", face.faceRect);
        PointF[] points = Check.notNull("face.facePoints", face.facePoints);
        Check.range("face.facePoints.length", points.length, 0, MAX_POINTS);
        for (PointF point : points) {
            Check.notNull("a point of face.facePoints", point);
        }
    }

    /**
     * The engine reads a feature up to its terminating zero: without one it would read on. What it is given is what was
     * checked, whoever writes the caller's array meanwhile.
     */
    private static byte[] checkedCopy(String name, byte[] feature) {
        byte[] copy = Check.notNull(name, feature).clone();
        if (copy.length == 0) {
            throw Check.refusal(name + ".length", "above 0", 0);
        }
        byte last = copy[copy.length - 1];
        if (last != 0) {
            throw Check.refusal(name + "'s last byte", "0", last);
        }
        return copy;
    }
}
