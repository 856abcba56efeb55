// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import android.graphics.Bitmap;
import android.graphics.PointF;
import com.vantrel.faceapi.model.FaceInfo;
import java.awt.BasicStroke;
import java.awt.Color;
import java.awt.Graphics2D;
import java.awt.RenderingHints;
import java.awt.geom.Ellipse2D;
import java.awt.geom.Line2D;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import javax.imageio.ImageIO;

/** Draws what was found into pictures and writes them. */
final class Drawing {
    private Drawing() {}

    /** A picture of packed RGBA pixels; alpha is taken as opaque. */
    static BufferedImage fromRgba(byte[] rgba, int width, int height) {
        BufferedImage image = new BufferedImage(width, height, BufferedImage.TYPE_INT_RGB);
        int[] row = new int[width];
        for (int y = 0, at = 0; y < height; y++) {
            for (int x = 0; x < width; x++, at += 4) {
                row[x] = (rgba[at] & 0xFF) << 16 | (rgba[at + 1] & 0xFF) << 8 | (rgba[at + 2] & 0xFF);
            }
            image.getRaster().setDataElements(0, y, width, 1, row);
        }
        return image;
    }

    /** A picture of a bitmap; alpha is taken as opaque. */
    static BufferedImage fromBitmap(Bitmap bitmap) {
        int width = bitmap.getWidth();
        int height = bitmap.getHeight();
        int[] colors = new int[width * height];
        bitmap.getPixels(colors, 0, width, 0, 0, width, height);
        BufferedImage image = new BufferedImage(width, height, BufferedImage.TYPE_INT_RGB);
        image.getRaster().setDataElements(0, 0, width, height, colors);
        return image;
    }

    /**
     * Draws the rectangle and the landmarks of each face in the colour of its identity, and from the tip of its nose an
     * arrow to where it looks.
     */
    static void faces(BufferedImage image, FaceInfo[] faces) {
        Graphics2D g = image.createGraphics();
        g.setRenderingHint(RenderingHints.KEY_ANTIALIASING, RenderingHints.VALUE_ANTIALIAS_ON);
        for (FaceInfo face : faces) {
            outline(g, face, new Color(0, 0, 0, 160), 5);
            outline(g, face, colorOf(face.id), 2.5f);
            float size = Math.max(1.6f, face.faceRect.width() / 40f);
            for (PointF point : face.facePoints) {
                g.fill(new Ellipse2D.Float(point.x - size / 2, point.y - size / 2, size, size));
            }
            if (face.facePoints.length > NOSE) {
                arrow(g, face);
            }
        }
        g.dispose();
    }

    /** Green for 0, which all faces of a picture have; neighbours differ most in hue when it moves by the golden section. */
    private static Color colorOf(int id) {
        float[] green = Color.RGBtoHSB(80, 255, 120, null);
        return Color.getHSBColor(green[0] + 0.618f * id, green[1], green[2]);
    }

    /** The tip of the nose among 68 points. */
    private static final int NOSE = 30;

    /** As long as the eyes are apart when the face looks to a side; a face that looks straight ahead has none. */
    private static void arrow(Graphics2D g, FaceInfo face) {
        PointF nose = face.facePoints[NOSE];
        double x = nose.x + face.eyeDist * StrictMath.sin(Math.toRadians(face.yaw));
        double y = nose.y + face.eyeDist * StrictMath.sin(Math.toRadians(face.pitch));
        g.setColor(new Color(255, 220, 60));
        g.setStroke(new BasicStroke(2.5f, BasicStroke.CAP_ROUND, BasicStroke.JOIN_ROUND));
        g.draw(new Line2D.Double(nose.x, nose.y, x, y));
        g.fill(new Ellipse2D.Double(x - 3, y - 3, 6, 6));
    }

    private static void outline(Graphics2D g, FaceInfo face, Color color, float thickness) {
        g.setColor(color);
        g.setStroke(new BasicStroke(thickness, BasicStroke.CAP_ROUND, BasicStroke.JOIN_ROUND));
        g.drawRect(face.faceRect.left, face.faceRect.top, face.faceRect.width(), face.faceRect.height());
    }

    static void writePng(BufferedImage image, File file) throws IOException {
        if (!ImageIO.write(image, "png", file)) {
            throw new IOException("this Java has no PNG writer");
        }
    }
}
