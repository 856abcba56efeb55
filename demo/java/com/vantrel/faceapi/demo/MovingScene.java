package com.vantrel.faceapi.demo;

import android.graphics.Rect;
import com.vantrel.faceapi.ColorConversion;
import com.vantrel.faceapi.EngineValues;
import com.vantrel.faceapi.FaceLibrary;
import com.vantrel.faceapi.model.FaceInfo;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import java.util.Set;
import java.util.TreeSet;

/**
 * A camera that pans, zooms and rolls over a picture: its frames are tracked one by one, and the features of the tracked
 * face are compared.
 */
final class MovingScene {
    private static final int FRAMES = 30;
    private static final int DETECT_INTERVAL = 10;
    private static final int COLUMNS = 6;
    private static final int SHRINK = 3;

    private final Picture picture;
    private final double faceX;
    private final double faceY;
    private final int width;
    private final int height;
    private final Stopwatch time = new Stopwatch();
    private final ContactSheet sheet;

    /** What the features are taken from: two frames, and the tracked face in each. */
    private byte[] firstFrame;
    private FaceInfo firstFace;
    private byte[] otherFrame;
    private FaceInfo otherFace;
    private int otherNumber;

    private int visible;
    private int tracked;
    private final Set<Integer> identities = new TreeSet<>();

    /**
     * @param face the face to be kept in view, in the picture's coordinates
     * @param width width of the frames in pixels
     */
    MovingScene(Picture picture, Rect face, int width, int height) {
        this.picture = picture;
        this.faceX = (face.left + face.right) / 2.0;
        this.faceY = (face.top + face.bottom) / 2.0;
        this.width = width;
        this.height = height;
        this.sheet = new ContactSheet(COLUMNS, FRAMES, width / SHRINK, height / SHRINK);
    }

    /**
     * Where the camera is at frame {@code number}: it starts with the whole picture, moves half the way to the face while
     * it zooms in, returns, and rolls a little to either side.
     */
    private View view(int number) {
        double t = (double) number / (FRAMES - 1);
        double near = StrictMath.sin(Math.PI * t);
        double roll = Math.toRadians(6) * StrictMath.sin(2 * Math.PI * t);
        double zoom = View.whole(picture, width, height).zoom() * (1 + 0.25 * near);
        double x = picture.width / 2.0 + (faceX - picture.width / 2.0) * near / 2;
        double y = picture.height / 2.0 + (faceY - picture.height / 2.0) * near / 2;
        return new View(x, y, zoom, roll, width, height);
    }

    /** Runs the scene, prints what came of it, and writes the contact sheet. Returns false when the engine fails. */
    boolean run(File output) throws IOException {
        FaceLibrary.setDebug(false);
        long tracker = FaceLibrary.kyFaceCreateTracker(null, 0, EngineValues.CONFIG_DEFAULT);
        if (tracker == 0) {
            return false;
        }
        try {
            if (FaceLibrary.kyFaceTrackSetDetectInterval(tracker, DETECT_INTERVAL) != EngineValues.SUCCESS) {
                return false;
            }
            for (int number = 0; number < FRAMES; number++) {
                if (!track(tracker, number)) {
                    return false;
                }
            }
        } finally {
            FaceLibrary.kyFaceDestroyTracker(tracker);
        }
        sheet.write(output);
        System.out.printf("moving scene: %d frames, the face is in view in %d and tracked in %d, as %s %s%n", FRAMES,
                visible, tracked, identities.size() == 1 ? "identity" : "identities",
                identities.toString().replaceAll("[\\[\\]]", ""));
        System.out.println("drawn in " + output);
        System.out.println();
        time.printPerFrame(FRAMES);
        System.out.println();
        return tracked == 0 || compareFeatures();
    }

    private boolean track(long tracker, int number) {
        View view = view(number);
        time.skip();
        byte[] rgba = view.render(picture);
        time.stage("render the scene");
        byte[] nv21 = new byte[width * height * 3 / 2];
        FaceLibrary.convertColorSpace(rgba, width, height, nv21, ColorConversion.RGBA_TO_NV21);
        time.stage("RGBA to NV21");
        int[] status = {Integer.MIN_VALUE};
        FaceInfo[] faces = FaceLibrary.kyFaceTrackBytes(
                tracker, nv21, EngineValues.PIXEL_NV21, width, height, width, EngineValues.ORIENTATION_0, status);
        time.stage("track on NV21");
        if (status[0] != EngineValues.SUCCESS) {
            return false;
        }
        byte[] shown = new byte[width * height * 4];
        FaceLibrary.convertColorSpace(nv21, width, height, shown, ColorConversion.NV21_TO_RGBA);
        time.stage("NV21 to RGBA");

        BufferedImage image = Drawing.fromRgba(shown, width, height);
        if (faces != null) {
            Drawing.faces(image, faces);
            for (FaceInfo face : faces) {
                Drawing.identity(image, face);
            }
        }
        sheet.add(image);
        time.stage("draw");
        remember(view, nv21, faces, number);
        return true;
    }

    /** Notes the face that this scene follows, if it is in view: the one whose rectangle holds its middle. */
    private void remember(View view, byte[] nv21, FaceInfo[] faces, int number) {
        double x = view.frameX(faceX, faceY);
        double y = view.frameY(faceX, faceY);
        if (x < 0 || x >= width || y < 0 || y >= height) {
            return;
        }
        visible++;
        if (faces == null) {
            return;
        }
        for (FaceInfo face : faces) {
            Rect r = face.faceRect;
            if (r.left <= x && x < r.right && r.top <= y && y < r.bottom) {
                tracked++;
                identities.add(face.id);
                if (firstFace == null) {
                    firstFrame = nv21;
                    firstFace = face;
                } else if (number <= FRAMES / 2) {
                    otherFrame = nv21;
                    otherFace = face;
                    otherNumber = number + 1;
                }
            }
        }
    }

    /** The face's feature against itself, the same face half a scene later, and a patch that is no face. */
    private boolean compareFeatures() {
        long verifier = FaceLibrary.kyFaceCreateVerify(null);
        if (verifier == 0) {
            return false;
        }
        try {
            byte[] first = feature(verifier, firstFrame, firstFace);
            byte[] patch = feature(verifier, firstFrame, patchBeside(firstFace));
            byte[] other = otherFace == null ? first : feature(verifier, otherFrame, otherFace);
            if (first == null || patch == null || other == null) {
                return false;
            }
            float[] scores = new float[3];
            byte[][] features = {first, other, patch};
            for (int i = 0; i < 3; i++) {
                int[] status = {Integer.MIN_VALUE};
                scores[i] = FaceLibrary.kyFaceCompareFeature(verifier, first, features[i], status);
                if (status[0] != EngineValues.SUCCESS) {
                    return false;
                }
            }
            System.out.printf("%-44s %10s%n", "the face compared with", "similarity");
            System.out.printf("%-44s %10.3f%n", "itself", scores[0]);
            System.out.printf("%-44s %10.3f%n", "the same face in frame " + otherNumber, scores[1]);
            System.out.printf("%-44s %10.3f%n", "a patch that is no face", scores[2]);
            System.out.printf("%-44s %10.3f%n", "margin between the last two", scores[1] - scores[2]);
            return true;
        } finally {
            FaceLibrary.kyFaceDestroyVerify(verifier);
        }
    }

    private byte[] feature(long verifier, byte[] nv21, FaceInfo face) {
        int[] status = {Integer.MIN_VALUE};
        return FaceLibrary.kyFaceGetFeatureBytes(
                verifier, nv21, EngineValues.PIXEL_NV21, width, height, width, face, status);
    }

    /** A square as large as the face, centred in the quarter of the frame opposite to it. */
    private FaceInfo patchBeside(FaceInfo face) {
        Rect r = face.faceRect;
        int side = Math.min(r.width(), Math.min(width, height) / 2);
        int x = r.left + r.right < width ? width * 3 / 4 : width / 4;
        int y = r.top + r.bottom < height ? height * 3 / 4 : height / 4;
        FaceInfo patch = new FaceInfo();
        patch.faceRect = new Rect(x - side / 2, y - side / 2, x - side / 2 + side, y - side / 2 + side);
        patch.facePoints = new android.graphics.PointF[0];
        return patch;
    }
}
