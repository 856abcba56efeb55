// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package android.media;

import android.graphics.Rect;
import java.nio.ByteBuffer;

/**
 * Stand-in for a camera's image, for desktops. Android alone makes such images; here a test or a demo does, by
 * extending this class.
 */
public abstract class Image implements AutoCloseable {
    /** One plane: a buffer and its strides. */
    public abstract static class Plane {
        protected Plane() {}

        /** Bytes from one row to the next. */
        public abstract int getRowStride();

        /** Bytes from one sample to the next. */
        public abstract int getPixelStride();

        /** The plane's samples: the same buffer with every call. */
        public abstract ByteBuffer getBuffer();
    }

    private Rect cropRect; // null for all of the image

    protected Image() {}

    /** One of the numbers in {@code ImageFormat}. */
    public abstract int getFormat();

    public abstract int getWidth();

    public abstract int getHeight();

    /** Nanoseconds, since a moment that depends on the camera. */
    public abstract long getTimestamp();

    public abstract Plane[] getPlanes();

    /** Gives the image back to the camera; afterwards every other method fails. */
    @Override
    public abstract void close();

    /** A copy of the rectangle that holds what is worth seeing. */
    public Rect getCropRect() {
        return cropRect == null ? new Rect(0, 0, getWidth(), getHeight()) : new Rect(cropRect);
    }

    /** Sets the rectangle to the part of {@code rect} that is in the image; to all of the image with null. */
    public void setCropRect(Rect rect) {
        if (rect == null) {
            cropRect = null;
            return;
        }
        Rect inside = new Rect(rect);
        if (!inside.intersect(0, 0, getWidth(), getHeight())) {
            inside.setEmpty();
        }
        cropRect = inside;
    }
}
