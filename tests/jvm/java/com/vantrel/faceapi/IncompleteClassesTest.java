// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.io.ByteArrayOutputStream;
import java.io.DataOutputStream;
import java.io.File;
import java.io.IOException;
import java.io.InputStream;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.Arrays;
import java.util.Collections;
import java.util.jar.JarEntry;
import java.util.jar.JarFile;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/**
 * The library in a JVM where a class, or the name of a field, is gone, as after a shrinker that was not
 * told what to keep. It loads and says what is missing; whatever makes and reads no {@code FaceInfo} works as ever.
 */
public class IncompleteClassesTest {
    private static final String RECT = "android/graphics/Rect";
    private static final String POINT = "android/graphics/PointF";
    private static final String FACE = "com/vantrel/faceapi/model/FaceInfo";

    @Rule public final TemporaryFolder folder = new TemporaryFolder();

    /** What becomes of a class on its way into the class path; null leaves it out. */
    private interface Change {
        byte[] apply(byte[] bytes) throws IOException;
    }

    /** This test's class path with one of the classes changed. */
    private String classPathWith(String className, Change change) throws IOException {
        File root = folder.newFolder();
        StringBuilder classPath = new StringBuilder(root.getPath());
        for (String path : System.getProperty("java.class.path").split(File.pathSeparator)) {
            try (JarFile jar = new JarFile(path)) {
                if (jar.getEntry(className + ".class") == null) {
                    classPath.append(File.pathSeparator).append(path);
                    continue;
                }
                for (JarEntry entry : Collections.list(jar.entries())) {
                    byte[] bytes = read(jar.getInputStream(entry));
                    if (entry.getName().equals(className + ".class")) {
                        bytes = change.apply(bytes);
                    }
                    if (bytes != null && !entry.isDirectory()) {
                        Path file = root.toPath().resolve(entry.getName());
                        Files.createDirectories(file.getParent());
                        Files.write(file, bytes);
                    }
                }
            }
        }
        return classPath.toString();
    }

    private static byte[] read(InputStream in) throws IOException {
        ByteArrayOutputStream out = new ByteArrayOutputStream();
        byte[] buffer = new byte[4096];
        for (int n = in.read(buffer); n >= 0; n = in.read(buffer)) {
            out.write(buffer, 0, n);
        }
        return out.toByteArray();
    }

    /** A name as the constant pool of a class file holds it. */
    private static byte[] constant(String name) throws IOException {
        ByteArrayOutputStream bytes = new ByteArrayOutputStream();
        DataOutputStream out = new DataOutputStream(bytes);
        out.writeByte(1); // UTF-8 text
        out.writeUTF(name);
        return bytes.toByteArray();
    }

    /** Gives a field another name of the same length, for the class itself too. */
    private static byte[] rename(byte[] classFile, String field) throws IOException {
        String text = new String(classFile, StandardCharsets.ISO_8859_1);
        String old = new String(constant(field), StandardCharsets.ISO_8859_1);
        int at = text.indexOf(old);
        assertTrue(field, at >= 0);
        byte[] renamed = classFile.clone();
        Arrays.fill(renamed, at + 3, at + old.length(), (byte) '_');
        return renamed;
    }

    private void assertLoads(String classPath, String message) throws IOException, InterruptedException {
        Child child = Child.run(classPath, Collections.<String>emptyList(), Calls.class);
        assertEquals(child.output + child.errors, 0, child.exitStatus);
        assertEquals(Arrays.asList("E/FaceAPI: " + message, "I/FaceAPI: nv2RGB "), child.errors);
        assertEquals("all is well\n", child.output);
    }

    @Test
    public void withoutAClass() throws IOException, InterruptedException {
        for (String name : Arrays.asList(RECT, POINT, FACE)) {
            assertLoads(classPathWith(name, bytes -> null), "Can't find " + name);
        }
    }

    @Test
    public void withoutAField() throws IOException, InterruptedException {
        assertLoads(classPathWith(RECT, bytes -> rename(bytes, "bottom")), "Can't find " + RECT + ".bottom");
        assertLoads(classPathWith(POINT, bytes -> rename(bytes, "y")), "Can't find " + POINT + ".y");
        assertLoads(classPathWith(FACE, bytes -> rename(bytes, "facePoints")),
                "Can't find " + FACE + ".facePoints");
    }

    /** Calls that make no face. */
    static final class Calls {
        public static void main(String[] args) {
            FaceLibrary.setDebug(false);
            byte[] frame = new byte[4 * 4 * 3 / 2];
            Arrays.fill(frame, 0, 16, (byte) 255);
            Arrays.fill(frame, 16, frame.length, (byte) 128);
            byte[] rgba = new byte[4 * 4 * 4];
            FaceLibrary.convertColorSpace(frame, 4, 4, rgba, ColorConversion.NV21_TO_RGBA);
            byte[] white = new byte[rgba.length];
            Arrays.fill(white, (byte) 255);
            check(Arrays.equals(white, rgba));
            check(FaceLibrary.faceBrightEvaluate(rgba, BrightnessMetric.GRAY_RGBA, 4, 16, 4, 4, 0, 0, 4, 4) == 255);

            long detector = FaceLibrary.kyFaceCreateDetector(null, 0);
            long tracker = FaceLibrary.kyFaceCreateTracker(null, 0, 0);
            check(detector != 0 && tracker != 0);
            int[] status = {-1, -1};
            byte[] empty = new byte[16]; // of faces: the engine counts them by the first byte
            check(FaceLibrary.kyFaceDetectBytes(detector, empty, 0, 4, 4, 4, 0, status) == null && status[0] == 0);
            status[0] = -1;
            check(FaceLibrary.kyFaceTrackBytes(tracker, empty, 0, 4, 4, 4, 0, status) == null && status[0] == 0);
            byte[] text = {'Q', 'U', 'J', 'D', 0};
            long verifier = FaceLibrary.kyFaceCreateVerify(null);
            check(FaceLibrary.kyFaceCompareFeature(verifier, text, text, status) == 1);
            System.out.println("all is well");
        }

        private static void check(boolean holds) {
            if (!holds) {
                throw new AssertionError();
            }
        }
    }
}
