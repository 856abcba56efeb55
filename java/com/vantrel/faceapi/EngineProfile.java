// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import java.util.Arrays;
import java.util.HashMap;
import java.util.Map;
import org.jetbrains.annotations.NotNull;

/**
 * A face engine's numbers: what it calls pixel formats and orientations, and the names of its result codes.
 *
 * <p>An app that brings an engine of its own makes one profile and hands it to {@link FaceDetector},
 * {@link FaceTracker} and {@link FaceVerifier} when it creates them. Everything else speaks of layouts and degrees.
 *
 * <pre>{@code
 * EngineProfile profile = new EngineProfile.Builder()
 *         .format(PixelFormat.NV21, 3)
 *         .format(PixelFormat.RGBA, 6)
 *         .orientation(0, 1).orientation(90, 2).orientation(180, 4).orientation(270, 8)
 *         .code(-7, "E_NO_LICENCE")
 *         .build();
 * }</pre>
 *
 * <p>Profiles do not change and may be shared by threads.
 */
public final class EngineProfile {
    /** The numbers of the open engine, those of {@link EngineValues}. */
    public static final EngineProfile OPEN = new Builder()
            .format(PixelFormat.GRAY, EngineValues.PIXEL_GRAY)
            .format(PixelFormat.BGR, EngineValues.PIXEL_BGR)
            .format(PixelFormat.RGB, EngineValues.PIXEL_RGB)
            .format(PixelFormat.BGRA, EngineValues.PIXEL_BGRA)
            .format(PixelFormat.RGBA, EngineValues.PIXEL_RGBA)
            .format(PixelFormat.NV21, EngineValues.PIXEL_NV21)
            .format(PixelFormat.NV12, EngineValues.PIXEL_NV12)
            .orientation(0, EngineValues.ORIENTATION_0)
            .orientation(90, EngineValues.ORIENTATION_90)
            .orientation(180, EngineValues.ORIENTATION_180)
            .orientation(270, EngineValues.ORIENTATION_270)
            .code(EngineValues.ERROR_NULL_POINTER, "ERROR_NULL_POINTER")
            .code(EngineValues.ERROR_HANDLE, "ERROR_HANDLE")
            .code(EngineValues.ERROR_PIXEL_FORMAT, "ERROR_PIXEL_FORMAT")
            .code(EngineValues.ERROR_SIZE, "ERROR_SIZE")
            .code(EngineValues.ERROR_STRIDE, "ERROR_STRIDE")
            .code(EngineValues.ERROR_ORIENTATION, "ERROR_ORIENTATION")
            .code(EngineValues.ERROR_CONFIG, "ERROR_CONFIG")
            .code(EngineValues.ERROR_RANGE, "ERROR_RANGE")
            .code(EngineValues.ERROR_MODEL_FILE, "ERROR_MODEL_FILE")
            .code(EngineValues.ERROR_MODEL, "ERROR_MODEL")
            .code(EngineValues.ERROR_LANDMARK_MODEL, "ERROR_LANDMARK_MODEL")
            .code(EngineValues.ERROR_FACE, "ERROR_FACE")
            .code(EngineValues.ERROR_FEATURE, "ERROR_FEATURE")
            .code(EngineValues.ERROR_MEMORY, "ERROR_MEMORY")
            .code(EngineValues.ERROR_INTERNAL, "ERROR_INTERNAL")
            .code(EngineValues.ERROR_EYES, "ERROR_EYES")
            .code(EngineValues.ERROR_FEATURE_KIND, "ERROR_FEATURE_KIND")
            .build();

    /** By ordinal and by quarter turn; null where the engine has no number. */
    private final Integer[] formats;
    private final Integer[] orientations;
    private final Map<Integer, String> codes;

    private EngineProfile(Builder builder) {
        formats = builder.formats.clone();
        orientations = builder.orientations.clone();
        codes = new HashMap<>(builder.codes);
    }

    /**
     * Returns the engine's number for a pixel format.
     *
     * @param format the format
     * @return the number
     * @throws NullPointerException when the format is null
     * @throws IllegalArgumentException when the engine does not take the format
     */
    public int formatValue(@NotNull PixelFormat format) {
        Integer value = formats[Check.notNull("format", format).ordinal()];
        if (value == null) {
            throw Check.refusal("format", "one that the engine takes", format);
        }
        return value;
    }

    /**
     * Returns the engine's number for an orientation.
     *
     * @param rotationDegrees by how much an image must be turned clockwise to be upright: 0, 90, 180 or 270
     * @return the number
     * @throws IllegalArgumentException when the angle is another, or the engine does not take it
     */
    public int orientationValue(int rotationDegrees) {
        Check.rotation("rotationDegrees", rotationDegrees);
        Integer value = orientations[rotationDegrees / 90];
        if (value == null) {
            throw Check.refusal("rotationDegrees", "one that the engine takes", rotationDegrees);
        }
        return value;
    }

    /** What a result code is called, with its number. */
    String describe(int code) {
        String name = codes.get(code);
        return name == null ? "code " + code : name + " (code " + code + ")";
    }

    /** Collects an engine's numbers. A format or orientation that is not given is one that the engine does not take. */
    public static final class Builder {
        private final Integer[] formats = new Integer[PixelFormat.values().length];
        private final Integer[] orientations = new Integer[4];
        private final Map<Integer, String> codes = new HashMap<>();

        /** Creates a builder of a profile without any numbers. */
        public Builder() {}

        /**
         * Sets the number of a pixel format.
         *
         * @param format the format
         * @param value the engine's number for it
         * @return this builder
         * @throws NullPointerException when the format is null
         */
        public @NotNull Builder format(@NotNull PixelFormat format, int value) {
            formats[Check.notNull("format", format).ordinal()] = value;
            return this;
        }

        /**
         * Sets the number of an orientation.
         *
         * @param rotationDegrees by how much an image must be turned clockwise to be upright: 0, 90, 180 or 270
         * @param value the engine's number for it
         * @return this builder
         * @throws IllegalArgumentException when the angle is another
         */
        public @NotNull Builder orientation(int rotationDegrees, int value) {
            Check.rotation("rotationDegrees", rotationDegrees);
            orientations[rotationDegrees / 90] = value;
            return this;
        }

        /**
         * Names a result code, for the messages of {@link FaceEngineException}.
         *
         * @param code the engine's result code
         * @param name what it is called
         * @return this builder
         * @throws NullPointerException when the name is null
         */
        public @NotNull Builder code(int code, @NotNull String name) {
            codes.put(code, Check.notNull("name", name));
            return this;
        }

        /**
         * Makes the profile.
         *
         * @return a profile of the numbers given so far
         */
        public @NotNull EngineProfile build() {
            return new EngineProfile(this);
        }
    }

    @Override
    public String toString() {
        return "formats " + Arrays.toString(formats) + ", orientations " + Arrays.toString(orientations);
    }
}
