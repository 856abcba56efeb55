// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;

/**
 * One pass over a picture's planes as a transform says, into a bitmap or an array. Planes are given as native code
 * takes them, see {@link PlaneConversion}; of a packed frame all three are its array.
 */
final class TransformPass {
    private TransformPass() {}

    static Bitmap toBitmap(Object y, Object u, Object v, int[] picture, FrameTransform transform, Bitmap reuse) {
        Bitmap out = bitmap(reuse, transform.resultWidth(), transform.resultHeight());
        PlaneConversion.convert(y, u, v, picture, transform.cropLeft(), transform.cropTop(), transform.cropWidth(),
                transform.cropHeight(), transform.rotationDegrees(), transform.isMirrored(), out);
        return out;
    }

    static byte[] toPixels(Object y, Object u, Object v, int[] picture, FrameTransform transform, PixelFormat format,
            byte[] reuse) {
        Check.notNull("format", format);
        int width = transform.resultWidth();
        byte[] out = Check.output(reuse, Check.packedBytes(format, width, transform.resultHeight()), null);
        toBytes(y, u, v, picture, transform, format, out, (int) format.rowBytes(width));
        return out;
    }

    static void toBytes(Object y, Object u, Object v, int[] picture, FrameTransform transform, PixelFormat format,
            byte[] out, int stride) {
        PlaneConversion.check(PlaneConversion.toBytes(y, u, v, picture, transform.cropLeft(), transform.cropTop(),
                transform.cropWidth(), transform.cropHeight(), transform.rotationDegrees(), transform.isMirrored(),
                layoutOf(format), out, 0, stride));
    }

    static int layoutOf(PixelFormat format) {
        switch (format) {
            case RGBA:
                return PlaneConversion.RGBA;
            case BGRA:
                return PlaneConversion.BGRA;
            case RGB:
                return PlaneConversion.RGB;
            case BGR:
                return PlaneConversion.BGR;
            case NV21:
                return PlaneConversion.NV21;
            case NV12:
                return PlaneConversion.NV12;
            default:
                return PlaneConversion.GRAY;
        }
    }

    /** {@code reuse} when it takes pixels of exactly this size, a new bitmap when it is null. */
    static Bitmap bitmap(Bitmap reuse, int width, int height) {
        if (reuse == null) {
            return Bitmap.createBitmap(width, height, Bitmap.Config.ARGB_8888);
        }
        BitmapBytes.checkPixels("reuse", reuse);
        if (!reuse.isMutable()) {
            throw new IllegalArgumentException("reuse is immutable");
        }
        if (reuse.getWidth() != width || reuse.getHeight() != height) {
            throw Check.refusal("reuse", width + " x " + height, reuse.getWidth() + " x " + reuse.getHeight());
        }
        return reuse;
    }
}
