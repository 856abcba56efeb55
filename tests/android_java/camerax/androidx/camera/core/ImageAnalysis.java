package androidx.camera.core;

/** As much of CameraX's analysis as the documents' examples use. */
public final class ImageAnalysis {
    /** As CameraX's. */
    public interface Analyzer {
        void analyze(ImageProxy image);
    }

    private ImageAnalysis() {}
}
