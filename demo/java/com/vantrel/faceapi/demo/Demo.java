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
 * [landmark model]}. With a landmark model faces have points, a pose and a distance of their eyes.
 *
 * <p>Exit status: 0 when a face was found, 1 when none was, 2 when the arguments or the picture cannot be used, 3 when
 * the engine or the output fails.
 */
public final class Demo {
    private static final int WIDTH = 640;
    private static final int HEIGHT = 480;

    private Demo() {}

    public static void main(String[] args) {
        System.exit(run(args));
    }

    private static int run(String[] args) {
        if (args.length != 2 && args.length != 3) {
            return stop(2, "Give a picture, a folder for the results and, if there is one, a landmark model.");
        }
        File picture = new File(args[0]);
        File folder = new File(args[1]);
        try {
            Files.createDirectories(folder.toPath());
            return detect(picture, folder, args.length > 2 ? args[2] : null);
        } catch (UnusablePicture unusable) {
            return stop(2, unusable.getMessage());
        } catch (IOException failed) {
            return stop(3, "The results cannot be written to " + folder + ": " + failed.getMessage() + ".");
        }
    }

    private static int stop(int status, String sentence) {
        System.err.println(sentence);
        return status;
    }

    private static int detect(File file, File folder, String landmarks) throws UnusablePicture, IOException {
        Stopwatch time = new Stopwatch();
        Picture picture = Picture.read(file);
        time.stage("read the picture");
        View view = View.whole(picture, WIDTH, HEIGHT);
        byte[] rgba = view.render(picture);
        time.stage("lay it into the frame");

        FaceLibrary.setDebug(false);
        long detector = FaceLibrary.kyFaceCreateDetector(landmarks, EngineValues.CONFIG_DEFAULT);
        time.stage("create the detector");
        if (detector == 0) {
            return stop(3, "The engine could not create a detector.");
        }
        byte[] nv21 = new byte[WIDTH * HEIGHT * 3 / 2];
        FaceLibrary.convertColorSpace(rgba, WIDTH, HEIGHT, nv21, ColorConversion.RGBA_TO_NV21);
        time.stage("RGBA to NV21");
        int[] status = {Integer.MIN_VALUE};
        FaceInfo[] faces = FaceLibrary.kyFaceDetectBytes(
                detector, nv21, EngineValues.PIXEL_NV21, WIDTH, HEIGHT, WIDTH, EngineValues.ORIENTATION_0, status);
        time.stage("detect on NV21");
        FaceLibrary.kyFaceDestroyDetector(detector);
        if (status[0] != EngineValues.SUCCESS) {
            return stop(3, "The engine failed with status " + status[0] + ".");
        }
        if (faces == null) {
            return stop(1, "There is no face in " + file + ".");
        }

        byte[] shown = new byte[WIDTH * HEIGHT * 4];
        time.skip();
        FaceLibrary.convertColorSpace(nv21, WIDTH, HEIGHT, shown, ColorConversion.NV21_TO_RGBA);
        time.stage("NV21 to RGBA");
        BufferedImage image = Drawing.fromRgba(shown, WIDTH, HEIGHT);
        Drawing.faces(image, faces);
        File output = new File(folder, "faces.png");
        Drawing.writePng(image, output);
        time.stage("draw and write");

        System.out.printf("%s, %d x %d, as an NV21 frame of %d x %d%n", file.getName(), picture.width, picture.height,
                WIDTH, HEIGHT);
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
        new Lighting(WIDTH, HEIGHT).print(shown, nv21, faces);
        System.out.println();

        Turning turning = new Turning(nv21, WIDTH, HEIGHT);
        File crop = new File(folder, "face.png");
        turning.writeCrop(faces[0].faceRect, crop);
        File turned = new File(folder, "turned.png");
        turning.writeRotations(turned);
        System.out.println("cut out of the frame in " + crop + ", the frame turned by right angles in " + turned);
        System.out.println();

        MovingScene scene = new MovingScene(picture, view.toPicture(faces[0].faceRect), WIDTH, HEIGHT, landmarks);
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
