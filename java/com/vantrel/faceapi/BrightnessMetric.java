// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import java.lang.annotation.Native;

/** The metrics of {@link FaceLibrary#faceBrightEvaluate}: what the pixels are, and what is averaged. */
public final class BrightnessMetric {
    /** Mean lightness (L* of CIE Lab) of RGBA pixels. */
    @Native
    public static final int LIGHTNESS_RGBA = 0;
    /** Mean lightness (L* of CIE Lab) of BGRA pixels. */
    @Native
    public static final int LIGHTNESS_BGRA = 1;
    /** Mean luma, the first byte, of packed 3-byte YUV pixels. */
    @Native
    public static final int LUMA_YUV = 3;
    /** Mean gray of BGRA pixels. */
    @Native
    public static final int GRAY_BGRA = 4;
    /** Mean gray of RGBA pixels. */
    @Native
    public static final int GRAY_RGBA = 5;

    private BrightnessMetric() {}
}
