// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;

/**
 * What a JPEG file says about itself before its picture: by Exif 2.3 how the camera was held, and by Adobe's technical
 * note 5116 how four channels are to be read. Java's readers pass over both.
 */
final class JpegHeader {
    private static final int START_OF_SCAN = 0xDA;
    private static final int END_OF_IMAGE = 0xD9;
    private static final int APP1 = 0xE1;
    private static final int APP14 = 0xEE;
    private static final int ORIENTATION_TAG = 0x0112;

    /** Of Exif, 1 to 8; 1 is upright. */
    int orientation = 1;
    /** Of Adobe's segment: 0 for channels as they are, 2 for luma, chroma and black; -1 without the segment. */
    int adobeTransform = -1;
    /** How many channels the picture has; 0 when the file does not come to say so. */
    int channels;
    /** Whether the picture's data reach their end. */
    boolean complete;

    private JpegHeader() {}

    /** Reads the segments of a file; null when it is no JPEG file. */
    static JpegHeader of(byte[] file) {
        if (file.length < 4 || (file[0] & 0xFF) != 0xFF || (file[1] & 0xFF) != 0xD8) {
            return null;
        }
        JpegHeader header = new JpegHeader();
        ByteBuffer bytes = ByteBuffer.wrap(file);
        int at = 2;
        while (at + 4 <= file.length && (file[at] & 0xFF) == 0xFF) {
            int marker = file[at + 1] & 0xFF;
            int length = bytes.getShort(at + 2) & 0xFFFF;
            int end = at + 2 + length;
            if (marker == START_OF_SCAN) {
                header.complete = endsAfter(file, at);
                break;
            }
            if (marker == 0xFF) { // a filler
                at++;
                continue;
            }
            if (length < 2 || end > file.length) {
                break;
            }
            ByteBuffer content = ByteBuffer.wrap(file, at + 4, length - 2).slice();
            if (marker == APP1 && startsWith(content, "Exif\0\0")) {
                header.orientation = orientation(content);
            } else if (marker == APP14 && startsWith(content, "Adobe") && content.limit() >= 12) {
                header.adobeTransform = content.get(11) & 0xFF;
            }
            if (isFrame(marker) && content.limit() >= 6) {
                header.channels = content.get(5) & 0xFF;
            }
            at = end;
        }
        return header;
    }

    /** Whether a segment describes the picture: the markers SOF0 to SOF15, between which lie DHT, JPG and DAC. */
    private static boolean isFrame(int marker) {
        return marker >= 0xC0 && marker <= 0xCF && marker != 0xC4 && marker != 0xC8 && marker != 0xCC;
    }

    /** In a scan's data the byte FF stands before 00 or a marker, so that the end marker means the end. */
    private static boolean endsAfter(byte[] file, int at) {
        for (int i = at; i + 1 < file.length; i++) {
            if ((file[i] & 0xFF) == 0xFF && (file[i + 1] & 0xFF) == END_OF_IMAGE) {
                return true;
            }
        }
        return false;
    }

    private static boolean startsWith(ByteBuffer content, String text) {
        if (content.limit() < text.length()) {
            return false;
        }
        for (int i = 0; i < text.length(); i++) {
            if (content.get(i) != text.charAt(i)) {
                return false;
            }
        }
        return true;
    }

    /** The orientation in the first directory of Exif's TIFF structure; 1 when there is none that can be. */
    private static int orientation(ByteBuffer exif) {
        exif.position(6);
        ByteBuffer tiff = exif.slice();
        if (tiff.limit() < 8) {
            return 1;
        }
        tiff.order(tiff.get(0) == 'I' ? ByteOrder.LITTLE_ENDIAN : ByteOrder.BIG_ENDIAN);
        int directory = tiff.getInt(4);
        if (directory < 8 || directory > tiff.limit() - 2) {
            return 1;
        }
        int entries = tiff.getShort(directory) & 0xFFFF;
        for (int i = 0; i < entries; i++) {
            int entry = directory + 2 + 12 * i;
            if (entry + 12 > tiff.limit()) {
                return 1;
            }
            if ((tiff.getShort(entry) & 0xFFFF) == ORIENTATION_TAG) {
                int value = tiff.getShort(entry + 8) & 0xFFFF;
                return value >= 1 && value <= 8 ? value : 1;
            }
        }
        return 1;
    }
}
