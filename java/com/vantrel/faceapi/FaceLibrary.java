// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import com.vantrel.faceapi.model.FaceInfo;

/**
 * The native library: face detection, tracking and verification by the face engine, and conversions, crop, rotation
 * and brightness of camera frames and bitmaps.
 *
 * <p><b>Arguments are trusted.</b> Sizes, strides and array lengths must agree: native code does not compare them with
 * the arrays, and writes where they say. A handle must be one that the matching create method returned and that has
 * not been destroyed. Null is allowed only where a method says so.
 *
 * <p><b>Images</b> are packed or strided pixels in a {@code byte[]}, or 32-bit pixels in an {@code int[]}, whose
 * memory is taken as bytes. Pixel formats, orientations and configuration flags are values of the engine and reach it
 * unchanged. {@code stride} is always the distance between two rows in bytes.
 *
 * <p><b>Failures.</b> The engine answers with a result code, 0 for success; it is stored as it is in element 0 of the
 * {@code status} array. A null or 0 result with an untouched status array means that an argument was refused before
 * the engine was asked, so set the element to something of your own before the call.
 *
 * <p><b>Shrinking.</b> When the library is loaded it looks up {@code Rect}, {@code PointF} and {@link FaceInfo}, their
 * fields and their no-argument constructors by name. Where one is missing the library loads all the same and logs
 * "Can't find" with its name. Whatever neither returns nor takes a {@link FaceInfo} works then; a call that finds a
 * face, or reads one, ends the process.
 *
 * <p><b>Threads.</b> Calls run on the calling thread. Two threads must not use one handle at the same time. The image
 * and brightness methods keep no state and may run concurrently on arrays of their own.
 *
 * <p><b>Logging</b> goes to Android's log under the tag "FaceAPI"; {@link #setDebug} switches most of it off.
 */
public final class FaceLibrary {
    static {
        NativeLibrary.load();
    }

    private FaceLibrary() {}

    /**
     * Switches the messages of this class's methods on or off, those about errors included. They are on at first. What
     * the library says while it is loaded, and the notes of start and end of {@link #convertColorSpace}, of the two
     * methods over bitmaps and of {@link #rotateBGR}, are not affected; {@link Images} does the same without notes.
     *
     * @param debug true for on
     */
    public static native void setDebug(boolean debug);

    // ---- detector -------------------------------------------------------------------------------------------------

    /**
     * Creates a detector for single images.
     *
     * @param modelPath the model file; null for the engine's built-in model
     * @param config engine flags
     * @return the handle, to be given to {@link #kyFaceDestroyDetector}; 0 when the engine fails
     */
    public static native long kyFaceCreateDetector(String modelPath, int config);

    /**
     * Destroys a detector.
     *
     * @param handle the detector; 0 does nothing
     */
    public static native void kyFaceDestroyDetector(long handle);

    /**
     * Reads the detection threshold.
     *
     * @param handle a detector
     * @param status at least one element; receives the engine's result code; not null
     * @return the threshold; 0 when the engine fails
     */
    public static native float getDetectThreshold(long handle, int[] status);

    /**
     * Sets the detection threshold: faces with a lower score are not reported.
     *
     * @param handle a detector
     * @param threshold above 0; for 0 or less nothing happens and {@code status} stays as it is
     * @param status at least one element; receives the engine's result code; not null
     */
    public static native void setDetectThreshold(long handle, float threshold, int[] status);

    /**
     * Finds the faces of an image.
     *
     * @param handle a detector; 0 finds nothing
     * @param image the pixels; null finds nothing
     * @param pixelFormat the engine's number for the pixels' layout
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param orientation the engine's number for how the image is turned
     * @param status at least one element; receives the engine's result code, unless {@code handle} is 0 or
     *     {@code image} null; null finds nothing
     * @return the faces; null when there is none, when an argument is refused and when the engine fails
     */
    public static native FaceInfo[] kyFaceDetectBytes(
            long handle, byte[] image, int pixelFormat, int width, int height, int stride, int orientation,
            int[] status);

    /**
     * Finds the faces of an image of 32-bit pixels.
     *
     * @param handle a detector; 0 finds nothing
     * @param image the pixels; null finds nothing
     * @param pixelFormat the engine's number for the pixels' layout
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param orientation the engine's number for how the image is turned
     * @param status as of {@link #kyFaceDetectBytes}
     * @return as of {@link #kyFaceDetectBytes}
     */
    public static native FaceInfo[] kyFaceDetectInts(
            long handle, int[] image, int pixelFormat, int width, int height, int stride, int orientation,
            int[] status);

    /**
     * Lets the engine show information about its algorithm and model.
     *
     * @return the engine's result
     */
    public static native int kyFaceShowInsideModel();

    // ---- tracker --------------------------------------------------------------------------------------------------

    /**
     * Creates a tracker for successive frames.
     *
     * @param modelPath the model file; null for the engine's built-in model
     * @param reserved ignored
     * @param config engine flags
     * @return the handle, to be given to {@link #kyFaceDestroyTracker}; 0 when the engine fails
     */
    public static native long kyFaceCreateTracker(String modelPath, int reserved, int config);

    /**
     * Destroys a tracker.
     *
     * @param handle the tracker; 0 does nothing
     */
    public static native void kyFaceDestroyTracker(long handle);

    /**
     * Follows the faces into the next frame: a face keeps its {@link FaceInfo#id} from frame to frame.
     *
     * @param handle a tracker; 0 finds nothing
     * @param image the pixels; null finds nothing
     * @param pixelFormat the engine's number for the pixels' layout
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param orientation the engine's number for how the image is turned
     * @param status as of {@link #kyFaceDetectBytes}
     * @return as of {@link #kyFaceDetectBytes}
     */
    public static native FaceInfo[] kyFaceTrackBytes(
            long handle, byte[] image, int pixelFormat, int width, int height, int stride, int orientation,
            int[] status);

    /**
     * Follows the faces into the next frame, given as 32-bit pixels.
     *
     * @param handle a tracker; 0 finds nothing
     * @param image the pixels; null finds nothing
     * @param pixelFormat the engine's number for the pixels' layout
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param orientation the engine's number for how the image is turned
     * @param status as of {@link #kyFaceDetectBytes}
     * @return as of {@link #kyFaceDetectBytes}
     */
    public static native FaceInfo[] kyFaceTrackInts(
            long handle, int[] image, int pixelFormat, int width, int height, int stride, int orientation,
            int[] status);

    /**
     * Forgets all faces that a tracker follows.
     *
     * @param handle a tracker
     */
    public static native void kyFaceResetTracker(long handle);

    /**
     * Limits how many faces a tracker looks for.
     *
     * @param handle a tracker
     * @param limit the largest number of faces
     * @return the engine's result code, 0 for success
     */
    public static native int kyFaceTrackSetDetectFaceCntLimit(long handle, int limit);

    /**
     * Sets how often a tracker looks for new faces, in frames.
     *
     * @param handle a tracker
     * @param interval frames from one look to the next
     * @return the engine's result code, 0 for success
     */
    public static native int kyFaceTrackSetDetectInterval(long handle, int interval);

    /**
     * Sets how well a face must fit to be followed on.
     *
     * @param handle a tracker
     * @param threshold the engine's measure of fit
     * @return the engine's result code, 0 for success
     */
    public static native int kyFaceTrackSetAlignmentThreshold(long handle, int threshold);

    // ---- verifier -------------------------------------------------------------------------------------------------

    /**
     * Creates a verifier, which tells whether two faces are one person's.
     *
     * @param modelPath the model file; null for the engine's built-in model
     * @return the handle, to be given to {@link #kyFaceDestroyVerify}; 0 when the engine fails
     */
    public static native long kyFaceCreateVerify(String modelPath);

    /**
     * Destroys a verifier.
     *
     * @param handle the verifier; 0 does nothing
     */
    public static native void kyFaceDestroyVerify(long handle);

    /**
     * Returns the version of a verifier's model. Features of different versions cannot be compared.
     *
     * @param handle a verifier
     * @return the engine's number of the version
     */
    public static native int kyFaceGetVerifyVersion(long handle);

    /**
     * Returns the length of a verifier's features.
     *
     * @param handle a verifier
     * @return bytes before serialization
     */
    public static native int kyFaceGetVerifyLength(long handle);

    /**
     * Extracts the feature of a face. The image is taken upright: there is no orientation.
     *
     * @param handle a verifier; 0 gives null
     * @param image the pixels; null gives null
     * @param pixelFormat the engine's number for the pixels' layout
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param face the face in the image's coordinates; its first 256 points are read, and null parts of it as zeros
     *     (see {@link FaceInfo}); null gives null
     * @param status at least one element; set to 0 on success and left as it is on any failure; null gives null
     * @return the serialized feature, {@code (n + 2) / 3 * 4 + 1} bytes for a feature of {@code n}: text with a
     *     terminating zero, to be kept and compared as it is; null on any failure
     */
    public static native byte[] kyFaceGetFeatureBytes(
            long handle, byte[] image, int pixelFormat, int width, int height, int stride, FaceInfo face,
            int[] status);

    /**
     * Extracts the feature of a face in an image of 32-bit pixels. The image is taken upright.
     *
     * @param handle a verifier; 0 gives null
     * @param image the pixels; null gives null
     * @param pixelFormat the engine's number for the pixels' layout
     * @param width image width in pixels
     * @param height image height in pixels
     * @param stride bytes from one row to the next
     * @param face as of {@link #kyFaceGetFeatureBytes}
     * @param status as of {@link #kyFaceGetFeatureBytes}
     * @return as of {@link #kyFaceGetFeatureBytes}
     */
    public static native byte[] kyFaceGetFeatureInts(
            long handle, int[] image, int pixelFormat, int width, int height, int stride, FaceInfo face,
            int[] status);

    /**
     * Compares two serialized features.
     *
     * @param handle a verifier
     * @param feature1 a feature with its terminating zero; null gives 0 and leaves {@code status} as it is
     * @param feature2 the other
     * @param status at least one element; receives the engine's result code; not null
     * @return the similarity. It is meaningless unless {@code status[0]} is 0: read that first
     */
    public static native float kyFaceCompareFeature(long handle, byte[] feature1, byte[] feature2, int[] status);

    /**
     * Reads a serialized feature into the engine. No method gives the result back: each call keeps some memory for as
     * long as the engine lives.
     *
     * @param feature a feature with its terminating zero; not null
     * @return the engine's feature pointer; 0 when it refuses the text
     */
    public static native long kyFaceDeserialize(byte[] feature);

    // ---- images ---------------------------------------------------------------------------------------------------

    /**
     * Converts between the layouts of camera frames and pixels.
     *
     * @param src the source; null does nothing
     * @param width image width in pixels
     * @param height image height in pixels
     * @param dst receives the result, of the size that {@link ColorConversion} gives; null does nothing
     * @param code a value of {@link ColorConversion}; any other does nothing
     */
    public static native void convertColorSpace(byte[] src, int width, int height, byte[] dst, int code);

    /**
     * Copies a bitmap's pixels as BGRA. Rows are taken as {@code 4 * width} bytes apart: a bitmap with a larger row
     * stride gives a sheared copy.
     *
     * @param bitmap an ARGB_8888 bitmap; null and any other format do nothing
     * @param out receives {@code width * height * 4} bytes
     */
    public static native void getBGRADataFromBitmap(Bitmap bitmap, byte[] out);

    /**
     * Copies a bitmap's pixels as packed BGR; otherwise as {@link #getBGRADataFromBitmap}.
     *
     * @param bitmap an ARGB_8888 bitmap; null and any other format do nothing
     * @param out receives {@code width * height * 3} bytes
     */
    public static native void getBGRDataFromBitmap(Bitmap bitmap, byte[] out);

    /**
     * Cuts a rectangle out of an NV21 frame and converts it to RGBA.
     *
     * <p>Give even values only. An odd {@code x} makes U and V trade places, an odd {@code y} pairs rows with their
     * neighbours' chroma, and with an odd {@code w} or {@code h} nothing is written.
     *
     * @param nv21 the frame, {@code imageWidth * imageHeight * 3 / 2} bytes; not null
     * @param imageWidth width of the frame in pixels
     * @param imageHeight height of the frame in pixels
     * @param x left edge of the rectangle in pixels
     * @param y top edge
     * @param w width of the rectangle, inside the frame
     * @param h height of the rectangle, inside the frame
     * @param out receives {@code w * h * 4} bytes; not null
     */
    public static native void cropNv21Data(
            byte[] nv21, int imageWidth, int imageHeight, int x, int y, int w, int h, byte[] out);

    /**
     * Rotates an image of packed 3-byte pixels clockwise.
     *
     * @param src {@code width * height * 3} bytes; not null
     * @param width image width in pixels
     * @param height image height in pixels
     * @param dst receives the same number of bytes; not null
     * @param degree 90, 180 or 270; with any other {@code dst} stays as it is and {@code outSize} receives
     *     {@code width} and {@code height}
     * @param outSize at least two elements; receives the result's width and height; not null
     */
    public static native void rotateBGR(byte[] src, int width, int height, byte[] dst, int degree, int[] outSize);

    // ---- brightness -----------------------------------------------------------------------------------------------

    /**
     * Rates how bright a rectangle of an image is. The rectangle is clipped to the image.
     *
     * @param image the pixels; null gives -1
     * @param format a value of {@link BrightnessMetric}; any other gives -1
     * @param width image width in pixels
     * @param widthStride bytes from one row to the next
     * @param height image height in pixels
     * @param heightStride ignored
     * @param rectX left edge of the rectangle in pixels
     * @param rectY top edge
     * @param rectW width of the rectangle
     * @param rectH height of the rectangle
     * @return 0 (dark) to 255 (bright), 0 when the rectangle lies outside; 255 also when the rectangle has no area or
     *     {@code widthStride} is below 1; -1 as said above
     */
    public static native int faceBrightEvaluate(
            byte[] image, int format, int width, int widthStride, int height, int heightStride, int rectX, int rectY,
            int rectW, int rectH);

    /**
     * Averages a rectangle of an image of one byte a pixel, such as the luma of a camera frame.
     *
     * <p>The rectangle is clipped at the left, the top and the right. At the bottom it is clipped when
     * {@code max(x, 0) + h} exceeds {@code height}: keep {@code y + h} within the image yourself.
     *
     * @param gray {@code width * height} bytes, rows packed; not null
     * @param width image width in pixels
     * @param height image height in pixels
     * @param x left edge of the rectangle in pixels
     * @param y top edge
     * @param w width of the rectangle
     * @param h height of the rectangle
     * @return 0 (black) to 1 (white); 0 when {@code w} or {@code h} is below 1 or the rectangle begins beyond the
     *     image; NaN when clipping leaves no pixel
     */
    public static native float averageBrightness(byte[] gray, int width, int height, int x, int y, int w, int h);
}
