// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;

import android.graphics.Bitmap;
import java.io.IOException;
import java.nio.ByteBuffer;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import org.junit.Test;

/** What is written to the log, with the debug switch on, off, and as it is at first. */
public class LoggingTest {
    private static final List<String> DETECTOR = Arrays.asList(
            "E/FaceAPI: FaceCreateDetector create handle fail : " + EngineValues.ERROR_MODEL_FILE,
            "D/FaceAPI: ky_face_detect_get_threshold threshold: 0.550000",
            "D/FaceAPI: ky_face_detect_set_threshold threshold: 0.750000",
            "D/FaceAPI: detect input image is null",
            "D/FaceAPI: detect input image is null",
            "D/FaceAPI: ky_face_destroy_detector",
            "E/FaceAPI: kyFaceDetect detect handle is null",
            "E/FaceAPI: kyFaceDestroyDetector destroy detect handle is null");

    private static final List<String> BITMAP = Arrays.asList(
            "E/FaceAPI: getBGRADataFromBitmap image is null ",
            "E/FaceAPI: getBGRADataFromBitmap image is null ",
            "E/FaceAPI: getBGRADataFromBitmap image is not  RGBA_8888",
            "E/FaceAPI: getBGRADataFromBitmap image is not  RGBA_8888");

    private static final List<String> BRIGHTNESS = Arrays.asList(
            "E/FaceAPI: IMAGE IS NULL",
            "V/FaceAPI: width:4,width_stride:16,height:3,height_stride:7,rect_x:1,rect_y:0,rect_w:2,rect_h:3",
            "V/FaceAPI: width:4,width_stride:16,height:3,height_stride:7,rect_x:-1,rect_y:-2,rect_w:-3,rect_h:-4",
            "W/FaceAPI: averageBrightness native area is not in image frame imageFrame : 4x3,area[x,y,w,h] : 5,0,1,2");

    /** The switch does not reach these. */
    private static final List<String> CONVERSIONS = Arrays.asList(
            "I/FaceAPI: nv2BGR start",
            "I/FaceAPI: nv2BGR end",
            "I/FaceAPI: nv2RGB ",
            "I/FaceAPI: RGB2nv ",
            "I/FaceAPI: nv2BGR start",
            "I/FaceAPI: nv2BGR end",
            "I/FaceAPI: RGB2nv ",
            "I/FaceAPI: nv212BGR start",
            "I/FaceAPI: nv212BGR end",
            "I/FaceAPI: BGR2RGB start",
            "I/FaceAPI: BGR2RGB end",
            "I/FaceAPI: BGR2RGB start",
            "I/FaceAPI: BGR2RGB end",
            "I/FaceAPI: BGR2RGB start",
            "I/FaceAPI: BGR2RGB end",
            "I/FaceAPI: BGRA2RGB start",
            "I/FaceAPI: BGRA2RGB end",
            "D/FaceAPI: rotateBGR degree: 270",
            "D/FaceAPI: rotateBGR degree: 45");

    private static List<String> all(List<List<String>> parts) {
        List<String> lines = new ArrayList<>();
        for (List<String> part : parts) {
            lines.addAll(part);
        }
        return lines;
    }

    private static void assertLogs(String debug, List<List<String>> expected)
            throws IOException, InterruptedException {
        Child child = Child.run(Calls.class, debug);
        assertEquals(child.output, 0, child.exitStatus);
        assertFalse(child.output, child.output.contains("in native method"));
        assertEquals(all(expected), child.errors);
    }

    @Test
    public void everythingAtFirst() throws IOException, InterruptedException {
        assertLogs("untouched", Arrays.asList(DETECTOR, BITMAP, BRIGHTNESS, CONVERSIONS));
    }

    @Test
    public void everythingWhenOn() throws IOException, InterruptedException {
        assertLogs("on", Arrays.asList(DETECTOR, BITMAP, BRIGHTNESS, CONVERSIONS));
    }

    @Test
    public void conversionsAloneWhenOff() throws IOException, InterruptedException {
        assertLogs("off", Arrays.asList(CONVERSIONS));
    }

    @Test
    public void theCheckedImageOperationsSayNothing() throws IOException, InterruptedException {
        Child child = Child.run(CheckedCalls.class);
        assertEquals(child.output, 0, child.exitStatus);
        assertEquals(Arrays.asList(), child.errors);
    }

    /** Everything that the checked classes do to images, with the switch as it is at first. */
    static final class CheckedCalls {
        public static void main(String[] args) {
            for (Images.Conversion conversion : Images.Conversion.values()) {
                PixelFormat source = conversion.source();
                int bytes = (int) source.imageBytes(16, 16, (int) source.rowBytes(16));
                Images.convert(new byte[bytes], 16, 16, conversion, null);
            }
            for (PixelFormat format : new PixelFormat[] {PixelFormat.NV21, PixelFormat.NV12}) {
                CameraFrame frame = new CameraFrame(format);
                ByteBuffer plane = ByteBuffer.allocate(256);
                frame.fill(16, 16, plane, 16, plane, 8, 1, plane, 8, 1, 0);
                Images.crop(frame, 1, 1, 3, 3, null);
                Images.brightness(frame, 0, 0, 16, 16);
            }
            for (int degrees : new int[] {90, 180, 270}) {
                Images.rotate(new byte[16 * 3], 4, 4, degrees, null);
            }
            Images.lightness(new byte[64], PixelFormat.RGBA, 4, 4, 16, 0, 0, 4, 4);
            Bitmap bitmap = Bitmap.createBitmap(4, 4, Bitmap.Config.ARGB_8888);
            Images.pixels(bitmap, PixelFormat.BGRA, null);
            Images.pixels(bitmap, PixelFormat.BGR, null);
        }
    }

    /** Makes the calls whose messages are expected above. */
    static final class Calls {
        public static void main(String[] args) {
            if (args[0].equals("on")) {
                FaceLibrary.setDebug(false);
                FaceLibrary.setDebug(true);
            } else if (args[0].equals("off")) {
                FaceLibrary.setDebug(false);
            }
            detector();
            byte[] bytes = new byte[16 * 16 * 4];
            bitmap(bytes);
            brightness(bytes);
            for (int code : new int[] {1, 2, 3, 5, 20, 1001, 14, 101}) {
                FaceLibrary.convertColorSpace(bytes, 16, 16, new byte[bytes.length], code);
            }
            rgbaBitmap(bytes);
            FaceLibrary.rotateBGR(bytes, 4, 4, new byte[bytes.length], 270, new int[2]);
            FaceLibrary.rotateBGR(bytes, 4, 4, new byte[bytes.length], 45, new int[2]);
            FaceLibrary.cropNv21Data(bytes, 4, 4, 0, 0, 4, 4, new byte[bytes.length]); // says nothing
        }

        private static void detector() {
            int[] status = new int[1];
            FaceLibrary.kyFaceCreateDetector("/nowhere/at/all.dat", 0);
            long detector = FaceLibrary.kyFaceCreateDetector(null, 0);
            FaceLibrary.getDetectThreshold(detector, status);
            FaceLibrary.setDetectThreshold(detector, 0.75f, status);
            FaceLibrary.setDetectThreshold(detector, 0, status); // says nothing
            FaceLibrary.kyFaceDetectBytes(detector, null, 0, 4, 4, 4, 0, status);
            FaceLibrary.kyFaceDetectInts(detector, null, 0, 4, 4, 4, 0, status);
            FaceLibrary.kyFaceDetectBytes(detector, new byte[16], 0, 4, 4, 4, 0, null); // says nothing
            FaceLibrary.kyFaceDestroyDetector(detector);
            FaceLibrary.kyFaceDetectBytes(0, new byte[16], 0, 4, 4, 4, 0, status);
            FaceLibrary.kyFaceDestroyDetector(0);
        }

        private static void bitmap(byte[] bytes) {
            FaceLibrary.getBGRADataFromBitmap(null, bytes);
            FaceLibrary.getBGRDataFromBitmap(null, bytes);
            Bitmap bitmap = Bitmap.createBitmap(4, 4, Bitmap.Config.RGB_565);
            FaceLibrary.getBGRADataFromBitmap(bitmap, bytes);
            FaceLibrary.getBGRDataFromBitmap(bitmap, bytes);
        }

        private static void rgbaBitmap(byte[] bytes) {
            Bitmap bitmap = Bitmap.createBitmap(4, 4, Bitmap.Config.ARGB_8888);
            FaceLibrary.getBGRADataFromBitmap(bitmap, bytes);
            FaceLibrary.getBGRDataFromBitmap(bitmap, bytes);
        }

        private static void brightness(byte[] bytes) {
            FaceLibrary.faceBrightEvaluate(null, 0, 4, 16, 3, 7, 1, 0, 2, 3);
            FaceLibrary.faceBrightEvaluate(bytes, 0, 4, 16, 3, 7, 1, 0, 2, 3);
            FaceLibrary.faceBrightEvaluate(bytes, 2, 4, 16, 3, 7, -1, -2, -3, -4); // no metric, the line all the same
            FaceLibrary.averageBrightness(bytes, 4, 3, 0, 0, 4, 3); // says nothing
            FaceLibrary.averageBrightness(bytes, 4, 3, 5, 0, 1, 2);
        }
    }
}
