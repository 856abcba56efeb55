// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package androidx.camera.core;

import android.graphics.Rect;
import java.nio.ByteBuffer;

/** As much of CameraX's image as the documents' examples use. */
public interface ImageProxy extends AutoCloseable {
    /** As CameraX's. */
    interface PlaneProxy {
        int getRowStride();

        int getPixelStride();

        ByteBuffer getBuffer();
    }

    @Override
    void close();

    Rect getCropRect();

    int getWidth();

    int getHeight();

    PlaneProxy[] getPlanes();

    ImageInfo getImageInfo();
}
