// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import android.graphics.Rect;
import com.vantrel.faceapi.ColorConversion;
import com.vantrel.faceapi.EngineValues;
import com.vantrel.faceapi.FaceLibrary;
import com.vantrel.faceapi.model.FaceInfo;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import java.nio.file.Files;
import java.security.MessageDigest;
import java.security.NoSuchAlgorithmException;

/**
 * A photograph goes in as an NV21 camera frame, the faces in it come out: {@code Demo <picture> <output folder>
 * [<landmark model> [<degrees to turn the picture clockwise by>]]}. With a landmark model faces have points, a pose and
 * a distance of their eyes.
 *
 * <p>The frame is as large as the picture, up to the engine's limit; NV21 wants even sides, so a black column or row
 * may join it. It is written also when nothing is found in it, and results of an earlier run are removed.
 *
 * <p>Exit status: 0 when a face was found, 1 when none was, 2 when the arguments or the picture cannot be used, 3 when
 * the engine or the output fails.
 */
public final class Demo {
    /** The size of the moving scene's frames. */
    private static final int SCENE_WIDTH = 640;
    private static final int SCENE_HEIGHT = 480;

    private static final String[] RESULTS = {"faces.png", "face.png", "turned.png", "track.png"};

    private Demo() {}

    public static void main(String[] args) {
        System.exit(run(args));
    }

    private static int run(String[] args) {
        if (args.length < 2 || args.length > 4) {
            return stop(2, "Give a picture, a folder for the results and, as wanted, a landmark model and degrees.");
        }
        if (args.length == 4 && !args[3].matches("0|90|180|270")) {
            return stop(2, "A picture is turned by 90, 180 or 270 degrees, not by " + args[3] + ".");
        }
        int degrees = args.length == 4 ? Integer.parseInt(args[3]) : 0;
        File picture = new File(args[0]);
        File folder = new File(args[1]);
        try {
            prepare(folder);
            return detect(picture, degrees, folder, args.length > 2 ? args[2] : null);
        } catch (UnusablePicture unusable) {
            return stop(2, unusable.getMessage());
        } catch (IOException failed) {
            return stop(3, "The results cannot be written to " + folder + ": " + failed.getMessage() + ".");
        } catch (OutOfMemoryError large) {
            return stop(2, "The picture " + picture + " is too large for this virtual machine's memory.");
        }
    }

    /** Makes the folder, and empties it of what an earlier run left. */
    private static void prepare(File folder) throws IOException {
        if (folder.exists() && !folder.isDirectory()) {
            throw new IOException("it is no folder");
        }
        Files.createDirectories(folder.toPath());
        for (String name : RESULTS) {
            Files.deleteIfExists(new File(folder, name).toPath());
        }
    }

    private static int stop(int status, String sentence) {
        System.err.println(sentence);
        return status;
    }

    /** What the frame shows: the picture itself, or as much smaller as the engine wants it. */
    private static View viewOf(Picture picture) {
        int limit = EngineValues.MAX_FRAME_SIDE;
        double zoom = Math.min(1, (double) limit / Math.max(picture.width, picture.height));
        int width = Math.min((int) Math.ceil(picture.width * zoom) + 1 & ~1, limit);
        int height = Math.min((int) Math.ceil(picture.height * zoom) + 1 & ~1, limit);
        return zoom == 1 ? View.pixelByPixel(width, height) : View.whole(picture, width, height);
    }

    private static int detect(File file, int degrees, File folder, String landmarks)
            throws UnusablePicture, IOException {
        Stopwatch time = new Stopwatch();
        Picture picture = Picture.read(file).rotated(degrees);
        time.stage("read the picture");
        View view = viewOf(picture);
        final int width = view.width;
        final int height = view.height;
        byte[] rgba = view.render(picture);
        time.stage("lay it into the frame");

        FaceLibrary.setDebug(false);
        long detector = FaceLibrary.kyFaceCreateDetector(landmarks, EngineValues.CONFIG_DEFAULT);
        time.stage("create the detector");
        if (detector == 0) {
            return stop(3, "The engine could not create a detector.");
        }
        byte[] nv21 = new byte[width * height * 3 / 2];
        FaceLibrary.convertColorSpace(rgba, width, height, nv21, ColorConversion.RGBA_TO_NV21);
        time.stage("RGBA to NV21");
        int[] status = {Integer.MIN_VALUE};
        FaceInfo[] faces = FaceLibrary.kyFaceDetectBytes(
                detector, nv21, EngineValues.PIXEL_NV21, width, height, width, EngineValues.ORIENTATION_0, status);
        time.stage("detect on NV21");
        FaceLibrary.kyFaceDestroyDetector(detector);
        if (status[0] != EngineValues.SUCCESS) {
            return stop(3, "The engine failed with status " + status[0] + ".");
        }

        byte[] shown = new byte[width * height * 4];
        time.skip();
        FaceLibrary.convertColorSpace(nv21, width, height, shown, ColorConversion.NV21_TO_RGBA);
        time.stage("NV21 to RGBA");
        BufferedImage image = Drawing.fromRgba(shown, width, height);
        File output = new File(folder, RESULTS[0]);
        if (faces != null) {
            Drawing.faces(image, faces);
        }
        Drawing.writePng(image, output);
        if (faces == null) {
            return stop(1, "There is no face in " + file + "; what was searched is in " + output + ".");
        }
        time.stage("draw and write");

        System.out.printf("%s, %d x %d, as an NV21 frame of %d x %d%n", file.getName(), picture.width, picture.height,
                width, height);
        System.out.println("frame sha-256 " + sha256(nv21));
        System.out.printf("status %d, %d face%s, drawn in %s%n%n", status[0], faces.length, faces.length == 1 ? "" : "s",
                output);
        System.out.printf("%-4s  %-24s  %-24s  %8s  %9s  %6s  %6s  %6s  %9s%n", "face", "in the frame", "in the picture",
                "score", "landmarks", "yaw", "pitch", "roll", "eyes, px");
        for (int i = 0; i < faces.length; i++) {
            FaceInfo face = faces[i];
            System.out.printf("%-4d  %-24s  %-24s  %8.3f  %9d  %6.1f  %6.1f  %6.1f  %9.1f%n", i + 1, text(face.faceRect),
                    text(view.toPicture(face.faceRect)), face.score, face.facePoints.length, face.yaw, face.pitch,
                    face.roll, face.eyeDist);
        }
        System.out.println();
        time.print();
        System.out.println();
        new Lighting(width, height).print(shown, nv21, faces);
        System.out.println();

        Turning turning = new Turning(nv21, width, height);
        File crop = new File(folder, "face.png");
        turning.writeCrop(faces[0].faceRect, crop);
        File turned = new File(folder, "turned.png");
        turning.writeRotations(turned);
        System.out.println("cut out of the frame in " + crop + ", the frame turned by right angles in " + turned);
        System.out.println();

        MovingScene scene = new MovingScene(
                picture, view.toPicture(faces[0].faceRect), SCENE_WIDTH, SCENE_HEIGHT, landmarks);
        return scene.run(new File(folder, "track.png")) ? 0 : stop(3, "The engine failed while it tracked.");
    }

    private static String text(Rect r) {
        return "(" + r.left + ", " + r.top + ")-(" + r.right + ", " + r.bottom + ")";
    }

    private static String sha256(byte[] bytes) {
        try {
            StringBuilder text = new StringBuilder();
            for (byte b : MessageDigest.getInstance("SHA-256").digest(bytes)) {
                text.append(String.format("%02x", b));
            }
            return text.toString();
        } catch (NoSuchAlgorithmException impossible) { // every Java has it
            throw new IllegalStateException(impossible);
        }
    }
}
