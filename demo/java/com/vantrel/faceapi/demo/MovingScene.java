// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import android.graphics.Bitmap;
import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.CameraFrame;
import com.vantrel.faceapi.EngineValues;
import com.vantrel.faceapi.FaceEngineException;
import com.vantrel.faceapi.FaceLibrary;
import com.vantrel.faceapi.FaceTracker;
import com.vantrel.faceapi.FaceVerifier;
import com.vantrel.faceapi.FrameTransform;
import com.vantrel.faceapi.Images;
import com.vantrel.faceapi.YuvPlanes;
import com.vantrel.faceapi.model.FaceInfo;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import java.util.List;
import java.util.Set;
import java.util.TreeSet;

/**
 * A phone's front camera that pans, zooms and rolls over a picture. Its frames, which lie on their side, are tracked one
 * by one and shown as a phone shows them, upright and mirrored, with the faces where they are then; and the features of
 * the tracked face are compared.
 */
final class MovingScene {
    private static final int FRAMES = 30;
    private static final int DETECT_INTERVAL = 10;
    private static final int COLUMNS = 6;
    private static final int SHRINK = 3;
    /** What the face is wide in the frames at least: smaller ones would be for another tracker. */
    private static final int LEAST_FACE_WIDTH = 80;

    private final Picture picture;
    private final String landmarks; // a model, or null
    private final double faceX;
    private final double faceY;
    private final double farZoom;
    private final double farX;
    private final double farY;
    private final int width;
    private final int height;
    private final Stopwatch time = new Stopwatch();
    private final ContactSheet sheet;

    /** What the features are taken from: two frames, upright, and the tracked face in each. */
    private CameraFrame firstFrame;
    private FaceInfo firstFace;
    private CameraFrame otherFrame;
    private FaceInfo otherFace;
    private int otherNumber;

    private final CameraFrame frame = new CameraFrame();
    private Bitmap shown;

    private int visible;
    private int tracked;
    private final Set<Integer> identities = new TreeSet<>();

    /**
     * @param face the face to be kept in view, in the picture's coordinates
     * @param width width of the frames in pixels
     */
    MovingScene(Picture picture, Rect face, int width, int height, String landmarks) {
        this.landmarks = landmarks;
        this.picture = picture;
        this.faceX = (face.left + face.right) / 2.0;
        this.faceY = (face.top + face.bottom) / 2.0;
        this.width = width;
        this.height = height;
        this.farZoom = Math.max(View.whole(picture, width, height).zoom(), (double) LEAST_FACE_WIDTH / face.width());
        this.farX = middle(picture.width, faceX, width / farZoom);
        this.farY = middle(picture.height, faceY, height / farZoom);
        this.sheet = new ContactSheet(COLUMNS, FRAMES, width / SHRINK, height / SHRINK);
    }

    /** The middle of a view of {@code extent} that is as near to the middle of the picture as shows the face. */
    private static double middle(int size, double face, double extent) {
        double reach = extent / 4;
        return Math.min(Math.max(size / 2.0, face - reach), face + reach);
    }

    /**
     * Where the camera is at frame {@code number}: it starts with the whole picture, or with as much as leaves the face
     * large enough, moves half the way to the face while it zooms in, returns, and rolls a little to either side.
     */
    private View view(int number) {
        double t = (double) number / (FRAMES - 1);
        double near = StrictMath.sin(Math.PI * t);
        double roll = Math.toRadians(6) * StrictMath.sin(2 * Math.PI * t);
        double zoom = farZoom * (1 + 0.25 * near);
        double x = farX + (faceX - farX) * near / 2;
        double y = farY + (faceY - farY) * near / 2;
        return new View(x, y, zoom, roll, width, height);
    }

    /** Runs the scene, prints what came of it, and writes the contact sheet. Returns false when the engine fails. */
    boolean run(File output) throws IOException {
        FaceLibrary.setDebug(false);
        try {
            PhoneCamera camera = new PhoneCamera(width, height);
            try (FaceTracker tracker = new FaceTracker(landmarks, EngineValues.CONFIG_DEFAULT)) {
                tracker.setDetectInterval(DETECT_INTERVAL);
                for (int number = 0; number < FRAMES; number++) {
                    track(camera, tracker, number);
                }
            }
            sheet.write(output);
            System.out.printf("moving scene: %d frames, the face is in view in %d and tracked in %d, as %s %s%n", FRAMES,
                    visible, tracked, identities.size() == 1 ? "identity" : "identities",
                    identities.toString().replaceAll("[\\[\\]]", ""));
            System.out.printf("frames of %d x %d, turned by %d and mirrored to be shown as %d x %d, drawn in %s%n%n",
                    camera.width, camera.height, PhoneCamera.ROTATION, width, height, output);
            time.printPerFrame(FRAMES);
            System.out.println();
            if (tracked > 0) {
                compareFeatures();
            }
            return true;
        } catch (FaceEngineException failed) {
            System.err.println(failed.getMessage());
            return false;
        }
    }

    private void track(PhoneCamera camera, FaceTracker tracker, int number) {
        View view = view(number);
        time.skip();
        byte[] rgba = view.render(picture);
        time.stage("render the scene");
        YuvPlanes planes = camera.deliver(rgba);
        time.stage("deliver the planes");
        frame.fill(planes, PhoneCamera.ROTATION);
        time.stage("planes to frame");
        List<FaceInfo> faces = tracker.track(frame);
        time.stage("track on the frame");
        FrameTransform transform =
                FrameTransform.of(camera.width, camera.height, PhoneCamera.ROTATION).mirrored(true);
        shown = Images.toBitmap(planes, transform, shown);
        time.stage("planes to upright bitmap");

        BufferedImage image = Drawing.fromBitmap(shown);
        List<FaceInfo> shownFaces = transform.map(faces);
        Drawing.faces(image, shownFaces.toArray(new FaceInfo[0]));
        sheet.add(image);
        time.stage("draw");
        remember(view, transform, shownFaces, number);
    }

    /** Notes the face that this scene follows, if it is in view: the one that is drawn over its middle. */
    private void remember(View view, FrameTransform transform, List<FaceInfo> shownFaces, int number) {
        // Seen in a mirror.
        double x = width - view.frameX(faceX, faceY);
        double y = view.frameY(faceX, faceY);
        if (x < 0 || x >= width || y < 0 || y >= height) {
            return;
        }
        visible++;
        for (FaceInfo face : shownFaces) {
            Rect r = face.faceRect;
            if (r.left <= x && x < r.right && r.top <= y && y < r.bottom) {
                tracked++;
                identities.add(face.id);
                // The verifier wants faces upright, and as they are: not mirrored.
                FaceInfo upright = transform.mirrored(false).map(transform.unmap(face, null), null);
                if (firstFace == null) {
                    firstFrame = frame.upright(null);
                    firstFace = upright;
                } else if (number <= FRAMES / 2) {
                    otherFrame = frame.upright(otherFrame);
                    otherFace = upright;
                    otherNumber = number + 1;
                }
            }
        }
    }

    /** The face's feature against itself, the same face half a scene later, and a patch that is no face. */
    private void compareFeatures() {
        try (FaceVerifier verifier = new FaceVerifier()) {
            byte[] first = verifier.extract(firstFrame, firstFace);
            byte[] patch = verifier.extract(firstFrame, patchBeside(firstFace));
            byte[] other = otherFace == null ? first : verifier.extract(otherFrame, otherFace);
            float same = verifier.compare(first, other);
            float none = verifier.compare(first, patch);
            System.out.printf("%-44s %10s%n", "the face compared with", "similarity");
            System.out.printf("%-44s %10.3f%n", "itself", verifier.compare(first, first));
            System.out.printf("%-44s %10.3f%n", "the same face in frame " + otherNumber, same);
            System.out.printf("%-44s %10.3f%n", "a patch that is no face", none);
            System.out.printf("%-44s %10.3f%n", "margin between the last two", same - none);
        }
    }

    /** A square as large as the face, centred in the quarter of the frame opposite to it. */
    private FaceInfo patchBeside(FaceInfo face) {
        Rect r = face.faceRect;
        int side = Math.min(r.width(), Math.min(width, height) / 2);
        int x = r.left + r.right < width ? width * 3 / 4 : width / 4;
        int y = r.top + r.bottom < height ? height * 3 / 4 : height / 4;
        FaceInfo patch = new FaceInfo();
        patch.faceRect = new Rect(x - side / 2, y - side / 2, x - side / 2 + side, y - side / 2 + side);
        patch.facePoints = new PointF[0];
        return patch;
    }
}
