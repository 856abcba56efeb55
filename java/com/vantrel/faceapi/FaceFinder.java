package com.vantrel.faceapi;

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

    private final String call;

    FaceFinder(String kind, String call, long handle, EngineHandle.Destroyer destroyer) {
        this.handle = EngineHandle.own(this, kind, handle, destroyer);
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
            // Nobody refills the frame while native code reads it.
            synchronized (frame) {
                frame.checkFilled();
                return listOf(findInBytes(engineHandle, frame.data(), frame.format().engineValue(), frame.width(),
                        frame.height(), frame.width(), frame.rotationDegrees()));
            }
        }
    }

    final List<FaceInfo> find(
            byte[] image, PixelFormat format, int width, int height, int stride, int rotationDegrees) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, 1);
        Check.rotation("rotationDegrees", rotationDegrees);
        synchronized (handle) {
            return listOf(findInBytes(
                    handle.value(), image, format.engineValue(), width, height, stride, rotationDegrees));
        }
    }

    final List<FaceInfo> find(
            int[] image, PixelFormat format, int width, int height, int stride, int rotationDegrees) {
        Check.notNull("image", image);
        Check.image(format, width, height, stride, image.length, Integer.BYTES);
        Check.rotation("rotationDegrees", rotationDegrees);
        synchronized (handle) {
            return listOf(findInInts(
                    handle.value(), image, format.engineValue(), width, height, stride, rotationDegrees));
        }
    }

    private List<FaceInfo> listOf(FaceInfo[] faces) {
        checkStatus(call);
        return faces == null ? Collections.<FaceInfo>emptyList() : Collections.unmodifiableList(Arrays.asList(faces));
    }

    /** Fails when the last native call left a code other than success. The caller holds the handle's monitor. */
    final void checkStatus(@NotNull String what) {
        if (status[0] != 0) {
            throw new FaceEngineException(what, status[0]);
        }
    }

    /** Frees the engine's object; further calls on this one fail. Closing twice does nothing. */
    @Override
    public final void close() {
        handle.destroy();
    }
}
