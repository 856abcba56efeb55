// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import com.vantrel.faceapi.Images;
import com.vantrel.faceapi.PixelFormat;
import com.vantrel.faceapi.YuvPlanes;
import java.nio.ByteBuffer;

/**
 * The front camera of a phone that is held upright: what it sees lies on its side in the frames that it delivers, as
 * three planes whose rows are padded and whose chroma samples alternate in memory.
 */
final class PhoneCamera {
    /** By how much a frame must be turned clockwise to be upright, as of most front cameras. */
    static final int ROTATION = 270;

    private static final int PADDING = 64;

    /** The size of the delivered frames. */
    final int width;
    final int height;

    private final int stride;
    private final ByteBuffer y;
    private final ByteBuffer u;
    private final ByteBuffer v;
    private final YuvPlanes planes = new YuvPlanes();
    private byte[] turned;
    private byte[] nv21;

    /**
     * @param uprightWidth width in pixels of what the camera sees, upright
     */
    PhoneCamera(int uprightWidth, int uprightHeight) {
        width = uprightHeight;
        height = uprightWidth;
        stride = width + PADDING;
        y = ByteBuffer.allocateDirect(stride * height);
        ByteBuffer pairs = ByteBuffer.allocateDirect(stride * height / 2);
        v = pairs.duplicate();
        pairs.position(1);
        u = pairs.slice();
    }

    /** Delivers what the camera sees, upright and not mirrored; the planes are those of every frame. */
    YuvPlanes deliver(byte[] rgba) {
        turned = Images.rotate(rgba, PixelFormat.RGBA, height, width, 360 - ROTATION, turned);
        nv21 = Images.convert(turned, width, height, Images.Conversion.RGBA_TO_NV21, nv21);
        for (int row = 0; row < height; row++) {
            y.position(row * stride);
            y.put(nv21, row * width, width);
        }
        y.rewind();
        for (int row = 0; row < height / 2; row++) {
            v.position(row * stride);
            v.put(nv21, (height + row) * width, width);
        }
        v.rewind();
        planes.set(width, height, y, stride, 1, u, stride, 2, v, stride, 2);
        return planes;
    }
}
