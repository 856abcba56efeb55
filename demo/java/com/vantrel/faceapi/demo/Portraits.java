// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.EngineValues;
import com.vantrel.faceapi.FaceDetector;
import com.vantrel.faceapi.FaceEngineException;
import com.vantrel.faceapi.FaceVerifier;
import com.vantrel.faceapi.Feature;
import com.vantrel.faceapi.PixelFormat;
import com.vantrel.faceapi.model.FaceInfo;
import java.io.Closeable;

/** The largest face of pictures, and its features. */
final class Portraits implements Closeable {
    private final FaceDetector detector;
    final FaceVerifier verifier;

    /** A picture with its largest face, which has landmarks. */
    static final class Portrait {
        final Picture picture;
        final FaceInfo face;

        private Portrait(Picture picture, FaceInfo face) {
            this.picture = picture;
            this.face = face;
        }

        /** The portrait with every {@code factor x factor} block averaged to one pixel. */
        Portrait reduced(int factor) {
            FaceInfo small = new FaceInfo();
            Rect r = face.faceRect;
            small.faceRect = new Rect(r.left / factor, r.top / factor, r.right / factor, r.bottom / factor);
            small.facePoints = new PointF[face.facePoints.length];
            for (int i = 0; i < small.facePoints.length; i++) {
                PointF p = face.facePoints[i];
                small.facePoints[i] = new PointF((p.x + 0.5f) / factor - 0.5f, (p.y + 0.5f) / factor - 0.5f);
            }
            small.eyeDist = face.eyeDist / factor;
            return new Portrait(picture.reduced(factor), small);
        }
    }

    /**
     * @param landmarks the landmark model
     * @param model the verifier's model; null for the built-in one
     */
    Portraits(String landmarks, String model) {
        detector = new FaceDetector(landmarks, EngineValues.CONFIG_SMALL_FACES);
        verifier = new FaceVerifier(model);
    }

    /** The largest face of a picture; null when there is none. */
    Portrait find(Picture picture) {
        FaceInfo largest = null;
        for (FaceInfo face : detector.detect(
                picture.argb(), PixelFormat.BGRA, picture.width, picture.height, 4 * picture.width, 0)) {
            if (largest == null || face.faceRect.width() > largest.faceRect.width()) {
                largest = face;
            }
        }
        return largest == null ? null : new Portrait(picture, largest);
    }

    /** The feature of a face; null when it is too small. */
    Feature feature(Portrait portrait) {
        Picture picture = portrait.picture;
        try {
            return Feature.decode(verifier.extract(
                    picture.argb(), PixelFormat.BGRA, picture.width, picture.height, 4 * picture.width, portrait.face));
        } catch (FaceEngineException refused) {
            return null;
        }
    }

    @Override
    public void close() {
        detector.close();
        verifier.close();
    }
}
