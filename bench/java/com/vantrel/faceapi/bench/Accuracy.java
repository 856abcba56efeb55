// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.bench;

import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.FaceDetector;
import com.vantrel.faceapi.PixelFormat;
import com.vantrel.faceapi.model.FaceInfo;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import java.nio.file.Files;
import java.util.ArrayList;
import java.util.LinkedHashMap;
import java.util.List;
import java.util.Map;
import javax.imageio.ImageIO;
import javax.xml.parsers.DocumentBuilderFactory;
import org.w3c.dom.Element;
import org.w3c.dom.NodeList;

/**
 * How many faces of annotated photographs a detector finds, and how far its landmarks are off:
 * {@code Accuracy <landmark model> <smallest face> <threshold> <annotations>...}. Annotations are a list of rectangles
 * beside a folder of pictures, {@code faces.txt=folder}, or a data set of dlib's, {@code faces.xml}.
 */
public final class Accuracy {
    /** A face that is there. */
    private static final class Truth {
        final Rect rect;
        final boolean asked; // or it does not matter whether it is found
        final float[][] points = new float[68][];

        Truth(int left, int top, int right, int bottom, boolean asked) {
            rect = new Rect();
            rect.left = left;
            rect.top = top;
            rect.right = right;
            rect.bottom = bottom;
            this.asked = asked;
        }
    }

    /** From this overlap on, intersection over union, a rectangle shows a face. */
    private static final double SAME = 0.5;
    private static final int SMALLEST_ASKED = 36;

    private int asked;
    private int found;
    private int wrong;
    private double error;
    private int measured;

    private Accuracy() {}

    public static void main(String[] args) throws Exception {
        Accuracy all = new Accuracy();
        System.out.printf("%-36s %6s %6s %6s%n", "picture", "faces", "found", "wrong");
        try (FaceDetector detector = new FaceDetector(args[0].isEmpty() ? null : args[0], Integer.parseInt(args[1]))) {
            if (!args[2].isEmpty()) {
                detector.setThreshold(Float.parseFloat(args[2]));
            }
            for (int i = 3; i < args.length; i++) {
                for (Map.Entry<File, List<Truth>> picture : read(args[i]).entrySet()) {
                    all.look(detector, picture.getKey(), picture.getValue());
                }
            }
        }
        System.out.printf("%nrecall %.3f (%d of %d), precision %.3f (%d of %d)%n", (double) all.found / all.asked,
                all.found, all.asked, (double) all.found / (all.found + all.wrong), all.found, all.found + all.wrong);
        if (all.measured > 0) {
            System.out.printf("landmarks of %d faces: off by %.2f %% of the distance of the outer eye corners%n",
                    all.measured, 100 * all.error / all.measured);
        }
    }

    private void look(FaceDetector detector, File file, List<Truth> truths) throws IOException {
        BufferedImage image = ImageIO.read(file);
        int width = image.getWidth();
        int height = image.getHeight();
        byte[] rgb = new byte[width * height * 3];
        for (int y = 0, at = 0; y < height; y++) {
            for (int x = 0; x < width; x++) {
                int pixel = image.getRGB(x, y);
                rgb[at++] = (byte) (pixel >> 16);
                rgb[at++] = (byte) (pixel >> 8);
                rgb[at++] = (byte) pixel;
            }
        }
        List<FaceInfo> faces = new ArrayList<>(detector.detect(rgb, PixelFormat.RGB, width, height, 3 * width, 0));
        int askedHere = 0;
        int foundHere = 0;
        for (Truth truth : truths) {
            FaceInfo match = null;
            for (FaceInfo face : faces) {
                double overlap = overlap(face.faceRect, truth.rect);
                if (overlap >= SAME && (match == null || overlap > overlap(match.faceRect, truth.rect))) {
                    match = face;
                }
            }
            faces.remove(match);
            boolean counts = truth.asked
                    && Math.max(truth.rect.width(), truth.rect.height()) >= SMALLEST_ASKED;
            askedHere += counts ? 1 : 0;
            foundHere += counts && match != null ? 1 : 0;
            if (match != null) {
                measure(match, truth);
            }
        }
        System.out.printf("%-36s %6d %6d %6d%n", file.getName(), askedHere, foundHere, faces.size());
        asked += askedHere;
        found += foundHere;
        wrong += faces.size();
    }

    private void measure(FaceInfo face, Truth truth) {
        if (face.facePoints.length != truth.points.length) {
            return;
        }
        double sum = 0;
        for (int i = 0; i < truth.points.length; i++) {
            if (truth.points[i] == null) {
                return;
            }
            PointF p = face.facePoints[i];
            sum += Math.hypot(p.x - truth.points[i][0], p.y - truth.points[i][1]);
        }
        float[] right = truth.points[36];
        float[] left = truth.points[45];
        error += sum / truth.points.length / Math.hypot(left[0] - right[0], left[1] - right[1]);
        measured++;
    }

    private static double overlap(Rect a, Rect b) {
        double width = Math.min(a.right, b.right) - Math.max(a.left, b.left);
        double height = Math.min(a.bottom, b.bottom) - Math.max(a.top, b.top);
        if (width <= 0 || height <= 0) {
            return 0;
        }
        double both = width * height;
        return both / ((double) a.width() * a.height() + (double) b.width() * b.height() - both);
    }

    private static Map<File, List<Truth>> read(String annotations) throws Exception {
        Map<File, List<Truth>> pictures = new LinkedHashMap<>();
        int folder = annotations.indexOf('=');
        if (folder >= 0) {
            for (String line : Files.readAllLines(new File(annotations.substring(0, folder)).toPath())) {
                if (!line.isEmpty() && !line.startsWith("#")) {
                    String[] words = line.split(" ", 6);
                    pictures.computeIfAbsent(new File(annotations.substring(folder + 1), words[0]),
                            key -> new ArrayList<>()).add(new Truth(Integer.parseInt(words[1]),
                            Integer.parseInt(words[2]), Integer.parseInt(words[3]), Integer.parseInt(words[4]),
                            words.length == 5));
                }
            }
            return pictures;
        }
        File file = new File(annotations);
        NodeList images = DocumentBuilderFactory.newInstance().newDocumentBuilder().parse(file)
                .getElementsByTagName("image");
        for (int i = 0; i < images.getLength(); i++) {
            Element image = (Element) images.item(i);
            List<Truth> truths = new ArrayList<>();
            NodeList boxes = image.getElementsByTagName("box");
            for (int b = 0; b < boxes.getLength(); b++) {
                Element box = (Element) boxes.item(b);
                int left = number(box, "left");
                int top = number(box, "top");
                Truth truth = new Truth(left, top, left + number(box, "width"), top + number(box, "height"), true);
                NodeList parts = box.getElementsByTagName("part");
                for (int p = 0; p < parts.getLength(); p++) {
                    Element part = (Element) parts.item(p);
                    truth.points[number(part, "name")] = new float[] {number(part, "x"), number(part, "y")};
                }
                truths.add(truth);
            }
            pictures.put(new File(file.getParentFile(), image.getAttribute("file")), truths);
        }
        return pictures;
    }

    private static int number(Element element, String attribute) {
        return Integer.parseInt(element.getAttribute(attribute));
    }
}
