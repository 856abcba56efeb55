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

    /** What native code leaves in the status where the engine failed before it was written. */
    private static final int NOT_WRITTEN = FaceEngineException.UNKNOWN_CODE;

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
     * @param face the face, in the frame's coordinates, with a rectangle and at most {@link #MAX_POINTS} points
     * @return the feature
     * @throws IllegalArgumentException when the face is incomplete
     * @throws FaceEngineException when the engine cannot extract a feature
     * @throws IllegalStateException when this verifier is closed or the frame was never filled
     */
    public byte @NotNull [] extract(@NotNull CameraFrame frame, @NotNull FaceInfo face) {
        Check.notNull("frame", frame);
        check(face);
        synchronized (handle) {
            long engineHandle = handle.value();
            synchronized (frame) {
                frame.checkFilled();
                status[0] = NOT_WRITTEN;
                return extracted(FaceLibrary.kyFaceGetFeatureBytes(engineHandle, frame.data(),
                        frame.format().engineValue(), frame.width(), frame.height(), frame.width(), face, status));
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
     * @param face the face, in the image's coordinates, with a rectangle and at most {@link #MAX_POINTS} points
     * @return the feature
     * @throws IllegalArgumentException when a size, the stride or the array's length does not fit, or the face is
     *     incomplete
     * @throws FaceEngineException when the engine cannot extract a feature
     * @throws IllegalStateException when this verifier is closed
     */
    public byte @NotNull [] extract(
            byte @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride,
            @NotNull FaceInfo face) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, 1);
        check(face);
        synchronized (handle) {
            long engineHandle = handle.value();
            status[0] = NOT_WRITTEN;
            return extracted(FaceLibrary.kyFaceGetFeatureBytes(
                    engineHandle, image, format.engineValue(), width, height, stride, face, status));
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
     * @param face the face, in the image's coordinates, with a rectangle and at most {@link #MAX_POINTS} points
     * @return the feature
     * @throws IllegalArgumentException when a size, the stride or the array's length does not fit, or the face is
     *     incomplete
     * @throws FaceEngineException when the engine cannot extract a feature
     * @throws IllegalStateException when this verifier is closed
     */
    public byte @NotNull [] extract(
            int @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride,
            @NotNull FaceInfo face) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, Integer.BYTES);
        check(face);
        synchronized (handle) {
            long engineHandle = handle.value();
            status[0] = NOT_WRITTEN;
            return extracted(FaceLibrary.kyFaceGetFeatureInts(
                    engineHandle, image, format.engineValue(), width, height, stride, face, status));
        }
    }

    /**
     * Compares two features.
     *
     * @param feature1 a feature of this verifier's version
     * @param feature2 the other
     * @return their similarity; the larger, the more alike
     * @throws IllegalArgumentException when an array is no feature by its form
     * @throws FaceEngineException when the engine cannot read or compare them
     * @throws IllegalStateException when this verifier is closed
     */
    public float compare(byte @NotNull [] feature1, byte @NotNull [] feature2) {
        check("feature1", feature1);
        check("feature2", feature2);
        synchronized (handle) {
            long engineHandle = handle.value();
            status[0] = NOT_WRITTEN;
            float score = FaceLibrary.kyFaceCompareFeature(engineHandle, feature1, feature2, status);
            if (status[0] != 0) {
                throw new FaceEngineException("comparing features", status[0]);
            }
            return score;
        }
    }

    /** Frees the engine's object; further calls on this one fail. Closing twice does nothing. */
    @Override
    public void close() {
        handle.destroy();
    }

    private byte[] extracted(byte[] feature) {
        if (feature == null) {
            throw new FaceEngineException("extracting a feature", status[0]);
        }
        return feature;
    }

    private static void check(FaceInfo face) {
        Check.notNull("face", face);
        Check.notNull("face.faceRect", face.faceRect);
        Check.notNull("face.facePoints", face.facePoints);
        Check.range("face.facePoints.length", face.facePoints.length, 0, MAX_POINTS);
        for (PointF point : face.facePoints) {
            Check.notNull("a point of face.facePoints", point);
        }
    }

    /** The engine reads a feature up to its terminating zero: without one it would read on. */
    private static void check(String name, byte[] feature) {
        Check.notNull(name, feature);
        Check.length(name, feature.length, 1, "bytes");
        Check.that(feature[feature.length - 1] == 0, name + "'s last byte", "0", feature[feature.length - 1]);
    }
}
