// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import com.vantrel.faceapi.model.FaceInfo;
import java.util.List;
import org.jetbrains.annotations.NotNull;
import org.jetbrains.annotations.Nullable;

/**
 * Finds faces in single images.
 *
 * <pre>{@code
 * try (FaceDetector detector = new FaceDetector()) {
 *     for (FaceInfo face : detector.detect(frame)) {
 *         System.out.println(face.faceRect + " " + face.score);
 *     }
 * }
 * }</pre>
 *
 * <p>One object may be used from several threads: its calls wait for one another, and closing waits for the call in
 * progress. Every call on a closed object throws {@link IllegalStateException}. An object that is forgotten without
 * being closed is reclaimed some time after the garbage collector noticed.
 */
public final class FaceDetector extends FaceFinder {
    /**
     * Creates a detector with the engine's built-in model.
     *
     * @throws FaceEngineException when the engine cannot create it
     */
    public FaceDetector() {
        this(null, 0);
    }

    /**
     * Creates a detector.
     *
     * @param modelPath the model file; null for the engine's built-in model
     * @param config 0 for the engine's defaults, a configuration of the engine's, or with the open engine the size of
     *     the smallest faces that are to be found, in pixels, from 20 on
     * @throws FaceEngineException when the engine cannot create it
     */
    public FaceDetector(@Nullable String modelPath, int config) {
        this(modelPath, config, EngineProfile.OPEN);
    }

    /**
     * Creates a detector of an engine that has numbers of its own.
     *
     * @param modelPath the model file; null for the engine's built-in model
     * @param config 0 for the engine's defaults, a configuration of the engine's, or with the open engine the size of
     *     the smallest faces that are to be found, in pixels, from 20 on
     * @param profile the engine's numbers
     * @throws NullPointerException when the profile is null
     * @throws FaceEngineException when the engine cannot create it
     */
    public FaceDetector(@Nullable String modelPath, int config, @NotNull EngineProfile profile) {
        super("face detector", "face detection", Check.notNull("profile", profile),
                FaceLibrary.kyFaceCreateDetector(modelPath, config), FaceLibrary::kyFaceDestroyDetector);
    }

    /**
     * Finds the faces of a camera frame.
     *
     * @param frame the frame; its rotation says how it is turned
     * @return the faces, in the frame's own coordinates; empty when there is none; not modifiable
     * @throws NullPointerException when the frame is null
     * @throws IllegalArgumentException when the engine does not take the frame's format or rotation
     * @throws FaceEngineException when the engine fails
     * @throws IllegalStateException when this detector is closed or the frame was never filled
     */
    public @NotNull List<FaceInfo> detect(@NotNull CameraFrame frame) {
        return find(frame);
    }

    /**
     * Finds the faces of a bitmap, whose pixels are copied once.
     *
     * @param bitmap the bitmap, ARGB_8888, which no other thread may write or recycle meanwhile
     * @param rotationDegrees by how much the bitmap must be turned clockwise to be upright: 0, 90, 180 or 270
     * @return the faces, in the bitmap's own coordinates; empty when there is none; not modifiable
     * @throws NullPointerException when the bitmap is null
     * @throws IllegalArgumentException when the bitmap is recycled, of another configuration or too large for an array,
     *     or the rotation does not fit
     * @throws FaceEngineException when the engine fails
     * @throws IllegalStateException when this detector is closed
     */
    public @NotNull List<FaceInfo> detect(@NotNull Bitmap bitmap, int rotationDegrees) {
        return find(bitmap, rotationDegrees);
    }

    /**
     * Finds the faces of an image.
     *
     * @param image the pixels
     * @param format their layout
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param rotationDegrees by how much the image must be turned clockwise to be upright: 0, 90, 180 or 270
     * @return the faces, in the image's own coordinates; empty when there is none; not modifiable
     * @throws NullPointerException when the image or the format is null
     * @throws IllegalArgumentException when a size, the stride, the rotation or the array's length does not fit, or
     *     the engine does not take the format or the rotation
     * @throws FaceEngineException when the engine fails
     * @throws IllegalStateException when this detector is closed
     */
    public @NotNull List<FaceInfo> detect(
            byte @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride,
            int rotationDegrees) {
        return find(image, format, width, height, stride, rotationDegrees);
    }

    /**
     * Finds the faces of an image whose bytes are held in ints, such as {@code Bitmap.getPixels} gives: on a
     * little-endian machine those are {@link PixelFormat#BGRA}.
     *
     * @param image the pixels
     * @param format their layout as bytes
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param rotationDegrees by how much the image must be turned clockwise to be upright: 0, 90, 180 or 270
     * @return the faces, in the image's own coordinates; empty when there is none; not modifiable
     * @throws NullPointerException when the image or the format is null
     * @throws IllegalArgumentException when a size, the stride, the rotation or the array's length does not fit, or
     *     the engine does not take the format or the rotation
     * @throws FaceEngineException when the engine fails
     * @throws IllegalStateException when this detector is closed
     */
    public @NotNull List<FaceInfo> detect(
            int @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride,
            int rotationDegrees) {
        return find(image, format, width, height, stride, rotationDegrees);
    }

    /**
     * Returns the detection threshold.
     *
     * @return the score that a face must reach
     * @throws FaceEngineException when the engine fails
     * @throws IllegalStateException when this detector is closed
     */
    public float threshold() {
        synchronized (handle) {
            float threshold = FaceLibrary.getDetectThreshold(handle.value(), status);
            checkStatus("reading the threshold");
            return threshold;
        }
    }

    /**
     * Sets the detection threshold.
     *
     * @param threshold the score that a face must reach, above 0
     * @throws IllegalArgumentException when the threshold is 0, negative or not a number
     * @throws FaceEngineException when the engine refuses it
     * @throws IllegalStateException when this detector is closed
     */
    public void setThreshold(float threshold) {
        if (!(threshold > 0)) {
            throw new IllegalArgumentException("threshold must be above 0, not " + threshold);
        }
        synchronized (handle) {
            FaceLibrary.setDetectThreshold(handle.value(), threshold, status);
            checkStatus("setting the threshold");
        }
    }

    @Override
    FaceInfo[] findInBytes(long engineHandle, byte[] image, int format, int width, int height, int stride,
            int orientation) {
        return FaceLibrary.kyFaceDetectBytes(engineHandle, image, format, width, height, stride, orientation, status);
    }

    @Override
    FaceInfo[] findInInts(long engineHandle, int[] image, int format, int width, int height, int stride,
            int orientation) {
        return FaceLibrary.kyFaceDetectInts(engineHandle, image, format, width, height, stride, orientation, status);
    }
}
