// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package androidx.camera.core;

import java.util.concurrent.Executor;

/** As much of CameraX's analysis as the documents' examples use. */
public final class ImageAnalysis {
    /** As CameraX's. */
    public interface Analyzer {
        void analyze(ImageProxy image);
    }

    private ImageAnalysis() {}

    public void setAnalyzer(Executor executor, Analyzer analyzer) {
        throw new UnsupportedOperationException();
    }

    public void clearAnalyzer() {
        throw new UnsupportedOperationException();
    }
}
