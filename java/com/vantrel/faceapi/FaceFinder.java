// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import com.vantrel.faceapi.model.FaceInfo;
import java.util.Arrays;
import java.util.Collections;
import java.util.List;
import org.jetbrains.annotations.NotNull;

/** What detector and tracker share: the images that they look at, and what comes of it. */
abstract class FaceFinder implements AutoCloseable {
    final EngineHandle handle;

    /** The status array of native calls; used under the handle's monitor. */
    final int[] status = new int[1];

    private final EngineProfile profile;
    private final String call;

    /** The pixels of the bitmap that is looked at; used under the handle's monitor. */
    private final BitmapBytes bitmapBytes = new BitmapBytes();

    FaceFinder(String kind, String call, EngineProfile profile, long handle, EngineHandle.Destroyer destroyer) {
        this.handle = EngineHandle.own(this, kind, handle, destroyer);
        this.profile = profile;
        this.call = call;
    }

    abstract FaceInfo[] findInBytes(
            long engineHandle, byte[] image, int format, int width, int height, int stride, int orientation);

    abstract FaceInfo[] findInInts(
            long engineHandle, int[] image, int format, int width, int height, int stride, int orientation);

    final List<FaceInfo> find(CameraFrame frame) {
        Check.notNull("frame", frame);
        synchronized (handle) {
            long engineHandle = handle.value();
            synchronized (frame.lock) {
                frame.checkFilled();
                return listOf(findInBytes(engineHandle, frame.data(), profile.formatValue(frame.format()),
                        frame.width(), frame.height(), frame.width(),
                        profile.orientationValue(frame.rotationDegrees())));
            }
        }
    }

    final List<FaceInfo> find(
            byte[] image, PixelFormat format, int width, int height, int stride, int rotationDegrees) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, 1);
        int formatValue = profile.formatValue(format);
        int orientation = profile.orientationValue(rotationDegrees);
        synchronized (handle) {
            return listOf(findInBytes(handle.value(), image, formatValue, width, height, stride, orientation));
        }
    }

    final List<FaceInfo> find(
            int[] image, PixelFormat format, int width, int height, int stride, int rotationDegrees) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, Integer.BYTES);
        int formatValue = profile.formatValue(format);
        int orientation = profile.orientationValue(rotationDegrees);
        synchronized (handle) {
            return listOf(findInInts(handle.value(), image, formatValue, width, height, stride, orientation));
        }
    }

    final List<FaceInfo> find(Bitmap bitmap, int rotationDegrees) {
        BitmapBytes.checkPixels("bitmap", bitmap);
        int formatValue = profile.formatValue(PixelFormat.RGBA);
        int orientation = profile.orientationValue(rotationDegrees);
        int width = bitmap.getWidth();
        int height = bitmap.getHeight();
        int stride = bitmap.getRowBytes();
        synchronized (handle) {
            long engineHandle = handle.value();
            byte[] pixels = bitmapBytes.read(bitmap);
            // Another thread may have given the bitmap another size since.
            Check.image(PixelFormat.RGBA, width, height, stride, pixels.length, 1);
            return listOf(findInBytes(engineHandle, pixels, formatValue, width, height, stride, orientation));
        }
    }

    private List<FaceInfo> listOf(FaceInfo[] faces) {
        checkStatus(call);
        return faces == null ? Collections.<FaceInfo>emptyList() : Collections.unmodifiableList(Arrays.asList(faces));
    }

    /** Fails when the last native call left a code other than success. The caller holds the handle's monitor. */
    final void checkStatus(@NotNull String what) {
        if (status[0] != 0) {
            throw new FaceEngineException(what, profile, status[0]);
        }
    }

    /** Frees the engine's object; further calls on this one fail. Closing twice does nothing. */
    @Override
    public final void close() {
        handle.destroy();
    }
}
