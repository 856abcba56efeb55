// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package android.graphics;

/** Stand-in for Android's numbers of image formats, for desktops. */
public class ImageFormat {
    public static final int UNKNOWN = 0;
    public static final int NV21 = 17;
    /** Three planes, 4:2:0, with strides. */
    public static final int YUV_420_888 = 35;
    public static final int JPEG = 256;
}
