// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

/**
 * The open engine's pixel formats, orientations, configurations and result codes. {@link FaceLibrary} hands them
 * through as they are; an app that brings another engine uses that engine's values.
 */
public final class EngineValues {
    /** Gray, one byte a pixel. */
    public static final int PIXEL_GRAY = 0;
    /** Three bytes a pixel, blue first. */
    public static final int PIXEL_BGR = 1;
    /** Three bytes a pixel, red first. */
    public static final int PIXEL_RGB = 2;
    /** Four bytes a pixel, blue first; alpha is ignored. As a little-endian {@code int}: 0xAARRGGBB. */
    public static final int PIXEL_BGRA = 3;
    /** Four bytes a pixel, red first; alpha is ignored. As a little-endian {@code int}: 0xAABBGGRR. */
    public static final int PIXEL_RGBA = 4;
    /** {@code height} rows of luma, then {@code height / 2} rows of V, U pairs; width and height are even. */
    public static final int PIXEL_NV21 = 5;
    /** {@code height} rows of luma, then {@code height / 2} rows of U, V pairs; width and height are even. */
    public static final int PIXEL_NV12 = 6;

    /** Faces are upright in the frame as it is. */
    public static final int ORIENTATION_0 = 0;
    /** Faces are upright once the frame is turned clockwise by 90 degrees, as on most phones held upright. */
    public static final int ORIENTATION_90 = 90;
    /** Faces are upright once the frame is turned by 180 degrees. */
    public static final int ORIENTATION_180 = 180;
    /** Faces are upright once the frame is turned clockwise by 270 degrees. */
    public static final int ORIENTATION_270 = 270;

    // Or the size of the smallest faces that are to be found, in pixels of the frame, from MIN_SMALLEST_FACE to
    // MAX_SMALLEST_FACE: half the size takes four times the work.
    /** A detector finds faces from {@link #DEFAULT_SMALLEST_FACE} on, a tracker as {@link #TRACKED_PIXELS} allows. */
    public static final int CONFIG_DEFAULT = 0;
    /** Looks for faces of 80 pixels and more. */
    public static final int CONFIG_LARGE_FACES = 1;
    /** Looks for faces of 40 pixels and more, for four times the work. */
    public static final int CONFIG_SMALL_FACES = 2;
    /** The smallest size of the smallest faces that a configuration may ask for, in pixels. */
    public static final int MIN_SMALLEST_FACE = 20;
    /** The largest size of the smallest faces that a configuration may ask for, in pixels. */
    public static final int MAX_SMALLEST_FACE = 8192;

    /** The smallest faces that a detector finds with {@link #CONFIG_DEFAULT}, in pixels, whatever the frame's size. */
    public static final int DEFAULT_SMALLEST_FACE = 36;
    /**
     * The most pixels of the picture that a tracker searches with {@link #CONFIG_DEFAULT}; frames are reduced or
     * enlarged to it. Its smallest faces have 80 pixels in frames of 640 x 480, 139 in those of 1280 x 720 and 208 in
     * those of 1920 x 1080.
     */
    public static final int TRACKED_PIXELS = 307200;
    /** The longest side of a frame, in pixels. */
    public static final int MAX_FRAME_SIDE = 8192;

    /** The detection threshold of a new detector; a face counts when its score, 0 to 1, exceeds the threshold. */
    public static final float DEFAULT_THRESHOLD = 0.55f;
    /** The lowest detection threshold. */
    public static final float MIN_THRESHOLD = 0.01f;
    /** The highest detection threshold; nothing passes it. */
    public static final float MAX_THRESHOLD = 1.0f;

    /** From one frame that a tracker searches for faces to the next, in frames; between them it follows faces. */
    public static final int DEFAULT_DETECT_INTERVAL = 10;
    /** The shortest detection interval: every frame is searched. */
    public static final int MIN_DETECT_INTERVAL = 1;
    /** The longest detection interval. */
    public static final int MAX_DETECT_INTERVAL = 1000;
    /** How many searches in a row may miss a face that a tracker follows before it is given up. */
    public static final int FORGIVEN_MISSES = 4;

    /** The most faces that a new tracker knows at a time; the best are kept. */
    public static final int DEFAULT_FACE_LIMIT = 8;
    /** The lowest limit of faces. */
    public static final int MIN_FACE_LIMIT = 1;
    /** The highest limit of faces. */
    public static final int MAX_FACE_LIMIT = 32;

    /** How well a face must fit to be followed, in percent; a face below is reported again once a search finds it. */
    public static final int DEFAULT_ALIGNMENT_THRESHOLD = 40;
    /** The lowest alignment threshold: a face is followed wherever it seems to go. */
    public static final int MIN_ALIGNMENT_THRESHOLD = 0;
    /** The highest alignment threshold. */
    public static final int MAX_ALIGNMENT_THRESHOLD = 100;

    /** The version of a verifier by local binary patterns: one without a model, or with landmarks alone. */
    public static final int VERIFY_VERSION = 1;
    /** Bytes of its features. */
    public static final int FEATURE_LENGTH = 3783;
    /** Bytes of its serialized features, with the terminating zero. */
    public static final int FEATURE_TEXT_LENGTH = 5045;
    /** The version of a verifier with a descriptor's model. */
    public static final int DESCRIPTOR_VERSION = 2;
    /** The numbers of a descriptor. */
    public static final int DESCRIPTOR_NUMBERS = 128;
    /** Bytes of its features. */
    public static final int DESCRIPTOR_LENGTH = 525;
    /** Bytes of its serialized features, with the terminating zero. */
    public static final int DESCRIPTOR_TEXT_LENGTH = 701;
    /** The distance between two descriptors whose similarity is {@link #VERIFY_THRESHOLD}. */
    public static final float DESCRIPTOR_THRESHOLD_DISTANCE = 0.6f;
    /** The recommended threshold: more alike are taken for the same, less alike for others. */
    public static final float VERIFY_THRESHOLD = 0.5f;
    /** The smallest face that patterns are taken of, in pixels: its longer side, or twice the distance of its eyes. */
    public static final int SMALLEST_VERIFIED_FACE = 16;
    /** The smallest distance of the eyes that a descriptor is taken at, in pixels. */
    public static final int SMALLEST_EYE_DISTANCE = 12;

    /** What follows the name of a model file in the name of the landmark model beside it. */
    public static final String LANDMARKS_SUFFIX = ".landmarks";

    /** The call succeeded. */
    public static final int SUCCESS = 0;
    /** A pointer that must not be null is. */
    public static final int ERROR_NULL_POINTER = -1;
    /** The handle is 0, destroyed, or of another kind. */
    public static final int ERROR_HANDLE = -2;
    /** The pixel format is none of those above. */
    public static final int ERROR_PIXEL_FORMAT = -3;
    /** A side is below 1 or above {@link #MAX_FRAME_SIDE}, or odd in a 4:2:0 format. */
    public static final int ERROR_SIZE = -4;
    /** The stride is shorter than a row. */
    public static final int ERROR_STRIDE = -5;
    /** The orientation is none of those above. */
    public static final int ERROR_ORIENTATION = -6;
    /** The configuration is none of those above, and no size of a smallest face. */
    public static final int ERROR_CONFIG = -7;
    /** A setting is outside its range. */
    public static final int ERROR_RANGE = -8;
    /** The model file cannot be opened. */
    public static final int ERROR_MODEL_FILE = -9;
    /** The model file holds no model that fits. */
    public static final int ERROR_MODEL = -10;
    /** The file beside the model is no landmark model that fits. */
    public static final int ERROR_LANDMARK_MODEL = -11;
    /** The face cannot belong to the frame, or is too small. */
    public static final int ERROR_FACE = -12;
    /** The feature is null, released, or no feature. */
    public static final int ERROR_FEATURE = -13;
    /** There is not enough memory. */
    public static final int ERROR_MEMORY = -14;
    /** Anything else. */
    public static final int ERROR_INTERNAL = -15;
    /** Nothing tells where the face's eyes are. */
    public static final int ERROR_EYES = -16;
    /** The feature is another verifier's. */
    public static final int ERROR_FEATURE_KIND = -17;

    private EngineValues() {}
}
