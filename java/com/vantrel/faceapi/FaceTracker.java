// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import com.vantrel.faceapi.model.FaceInfo;
import java.util.List;
import org.jetbrains.annotations.NotNull;
import org.jetbrains.annotations.Nullable;

/**
 * Follows faces through successive frames: a face keeps its {@link FaceInfo#id} from frame to frame.
 *
 * <p>Threads, closing and forgetting are as with {@link FaceDetector}; frames must be given in their order.
 */
public final class FaceTracker extends FaceFinder {
    /**
     * Creates a tracker with the engine's built-in model.
     *
     * @throws FaceEngineException when the engine cannot create it
     */
    public FaceTracker() {
        this(null, 0);
    }

    /**
     * Creates a tracker.
     *
     * @param modelPath the model file; null for the engine's built-in model
     * @param config 0 for the engine's defaults, a configuration of the engine's, or with the open engine the size of
     *     the smallest faces that are to be found, in pixels, from 20 on
     * @throws FaceEngineException when the engine cannot create it
     */
    public FaceTracker(@Nullable String modelPath, int config) {
        this(modelPath, config, EngineProfile.OPEN);
    }

    /**
     * Creates a tracker of an engine that has numbers of its own.
     *
     * @param modelPath the model file; null for the engine's built-in model
     * @param config 0 for the engine's defaults, a configuration of the engine's, or with the open engine the size of
     *     the smallest faces that are to be found, in pixels, from 20 on
     * @param profile the engine's numbers
     * @throws NullPointerException when the profile is null
     * @throws FaceEngineException when the engine cannot create it
     */
    public FaceTracker(@Nullable String modelPath, int config, @NotNull EngineProfile profile) {
        super("face tracker", "face tracking", Check.notNull("profile", profile),
                FaceLibrary.kyFaceCreateTracker(modelPath, 0, config), FaceLibrary::kyFaceDestroyTracker);
    }

    /**
     * Follows the faces into the next camera frame.
     *
     * @param frame the frame; its rotation says how it is turned
     * @return the faces, in the frame's own coordinates; empty when there is none; not modifiable
     * @throws NullPointerException when the frame is null
     * @throws IllegalArgumentException when the engine does not take the frame's format or rotation
     * @throws FaceEngineException when the engine fails
     * @throws IllegalStateException when this tracker is closed or the frame was never filled
     */
    public @NotNull List<FaceInfo> track(@NotNull CameraFrame frame) {
        return find(frame);
    }

    /**
     * Follows the faces into the next frame, which is a bitmap, whose pixels are copied once.
     *
     * @param bitmap the bitmap, ARGB_8888, which no other thread may write or recycle meanwhile
     * @param rotationDegrees by how much the bitmap must be turned clockwise to be upright: 0, 90, 180 or 270
     * @return the faces, in the bitmap's own coordinates; empty when there is none; not modifiable
     * @throws NullPointerException when the bitmap is null
     * @throws IllegalArgumentException when the bitmap is recycled, of another configuration or too large for an array,
     *     or the rotation does not fit
     * @throws FaceEngineException when the engine fails
     * @throws IllegalStateException when this tracker is closed
     */
    public @NotNull List<FaceInfo> track(@NotNull Bitmap bitmap, int rotationDegrees) {
        return find(bitmap, rotationDegrees);
    }

    /**
     * Follows the faces into the next frame.
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
     * @throws IllegalStateException when this tracker is closed
     */
    public @NotNull List<FaceInfo> track(
            byte @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride,
            int rotationDegrees) {
        return find(image, format, width, height, stride, rotationDegrees);
    }

    /**
     * Follows the faces into the next frame, whose bytes are held in ints.
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
     * @throws IllegalStateException when this tracker is closed
     */
    public @NotNull List<FaceInfo> track(
            int @NotNull [] image, @NotNull PixelFormat format, int width, int height, int stride,
            int rotationDegrees) {
        return find(image, format, width, height, stride, rotationDegrees);
    }

    /**
     * Forgets all faces: those of the next frame are new ones.
     *
     * @throws IllegalStateException when this tracker is closed
     */
    public void reset() {
        synchronized (handle) {
            FaceLibrary.kyFaceResetTracker(handle.value());
        }
    }

    /**
     * Limits how many faces are looked for.
     *
     * @param limit the largest number of faces, in the engine's range
     * @throws FaceEngineException when the engine refuses it
     * @throws IllegalStateException when this tracker is closed
     */
    public void setFaceLimit(int limit) {
        synchronized (handle) {
            status[0] = FaceLibrary.kyFaceTrackSetDetectFaceCntLimit(handle.value(), limit);
            checkStatus("setting the face limit");
        }
    }

    /**
     * Sets how often new faces are looked for.
     *
     * @param frames frames from one look to the next, in the engine's range
     * @throws FaceEngineException when the engine refuses it
     * @throws IllegalStateException when this tracker is closed
     */
    public void setDetectInterval(int frames) {
        synchronized (handle) {
            status[0] = FaceLibrary.kyFaceTrackSetDetectInterval(handle.value(), frames);
            checkStatus("setting the detect interval");
        }
    }

    /**
     * Sets how well a face must fit to be followed on.
     *
     * @param threshold the engine's measure of fit, in the engine's range
     * @throws FaceEngineException when the engine refuses it
     * @throws IllegalStateException when this tracker is closed
     */
    public void setAlignmentThreshold(int threshold) {
        synchronized (handle) {
            status[0] = FaceLibrary.kyFaceTrackSetAlignmentThreshold(handle.value(), threshold);
            checkStatus("setting the alignment threshold");
        }
    }

    @Override
    FaceInfo[] findInBytes(long engineHandle, byte[] image, int format, int width, int height, int stride,
            int orientation) {
        return FaceLibrary.kyFaceTrackBytes(engineHandle, image, format, width, height, stride, orientation, status);
    }

    @Override
    FaceInfo[] findInInts(long engineHandle, int[] image, int format, int width, int height, int stride,
            int orientation) {
        return FaceLibrary.kyFaceTrackInts(engineHandle, image, format, width, height, stride, orientation, status);
    }
}
