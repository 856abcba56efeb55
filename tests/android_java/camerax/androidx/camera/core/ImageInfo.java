// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package androidx.camera.core;

/** As much of CameraX's description of an image as the documents' examples use. */
public interface ImageInfo {
    int getRotationDegrees();
}
