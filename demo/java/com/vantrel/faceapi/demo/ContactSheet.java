// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import java.awt.Graphics2D;
import java.awt.RenderingHints;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;

/** Small pictures side by side in one. */
final class ContactSheet {
    private final int columns;
    private final int cellWidth;
    private final int cellHeight;
    private final BufferedImage sheet;
    private int count;

    ContactSheet(int columns, int cells, int cellWidth, int cellHeight) {
        int rows = (cells + columns - 1) / columns;
        this.columns = columns;
        this.cellWidth = cellWidth;
        this.cellHeight = cellHeight;
        this.sheet = new BufferedImage(columns * cellWidth, rows * cellHeight, BufferedImage.TYPE_INT_RGB);
    }

    /** Adds a picture, shrunk so that it fits into its cell. */
    void add(BufferedImage image) {
        double scale = Math.min((double) cellWidth / image.getWidth(), (double) cellHeight / image.getHeight());
        int w = (int) Math.round(image.getWidth() * scale);
        int h = (int) Math.round(image.getHeight() * scale);
        int x = count % columns * cellWidth + (cellWidth - w) / 2;
        int y = count / columns * cellHeight + (cellHeight - h) / 2;
        Graphics2D g = sheet.createGraphics();
        g.setRenderingHint(RenderingHints.KEY_INTERPOLATION, RenderingHints.VALUE_INTERPOLATION_BILINEAR);
        g.drawImage(image, x, y, w, h, null);
        g.dispose();
        count++;
    }

    void write(File file) throws IOException {
        Drawing.writePng(sheet, file);
    }
}
