// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import java.lang.annotation.Native;

/**
 * The conversions of {@link FaceLibrary#convertColorSpace}.
 *
 * <p>A 4:2:0 frame is {@code width * height} bytes of luma followed by {@code width * height / 2} bytes of chroma
 * pairs, one pair for each 2 x 2 pixels: V before U in NV21, U before V in NV12. Its width and height must be even;
 * otherwise nothing is converted. Pixels are packed bytes in the order that the name says; an alpha byte that a
 * conversion makes is 255.
 */
public final class ColorConversion {
    /** NV21 frame to BGRA, {@code width * height * 4} bytes. */
    @Native
    public static final int NV21_TO_BGRA = 1;
    /** NV21 frame to RGBA, {@code width * height * 4} bytes. */
    @Native
    public static final int NV21_TO_RGBA = 2;
    /** RGBA to NV21 frame, {@code width * height * 3 / 2} bytes. */
    @Native
    public static final int RGBA_TO_NV21 = 3;
    /** NV12 frame to BGRA, {@code width * height * 4} bytes. */
    @Native
    public static final int NV12_TO_BGRA = 5;
    /** BGRA to RGBA (or back: red and blue change places), {@code width * height * 4} bytes. */
    @Native
    public static final int BGRA_TO_RGBA = 14;
    /** RGBA to NV12 frame, {@code width * height * 3 / 2} bytes. */
    @Native
    public static final int RGBA_TO_NV12 = 20;
    /** The same as {@link #BGRA_TO_RGBA}. */
    @Native
    public static final int BGRA_TO_RGBA_ALIAS = 101;
    /** NV21 frame to BGR, {@code width * height * 3} bytes. */
    @Native
    public static final int NV21_TO_BGR = 1001;

    private ColorConversion() {}
}
