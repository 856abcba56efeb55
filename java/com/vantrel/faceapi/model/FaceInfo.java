// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.model;

import android.graphics.PointF;
import android.graphics.Rect;

/**
 * One face, as detection and tracking find it and as feature extraction takes it.
 *
 * <p>Native code creates objects of this class through the no-argument constructor and reads and writes the fields by
 * name: renaming or shrinking it away breaks the library. Coordinates are pixels of the image that was given.
 */
public class FaceInfo {
    /** The face's rectangle. Never null in a result; feature extraction reads null as (0, 0, 0, 0). */
    public Rect faceRect;

    /**
     * The landmark points; an empty array when the engine gives none, never null in a result, and at most 256. Feature
     * extraction reads the first 256 points and ignores any further ones, reads null as no points, and a null point as
     * (0, 0).
     */
    public PointF[] facePoints;

    /** Detection confidence; the larger, the surer. */
    public float score;

    /** Head turn to the side, in degrees. */
    public float yaw;

    /** Head nod, in degrees. */
    public float pitch;

    /** Head tilt in the image plane, in degrees. */
    public float roll;

    /** Distance between the eyes, in pixels. */
    public float eyeDist;

    /** The identity that a tracker gave the face. */
    public int id;

    /** Creates a face without rectangle and points; native code fills in everything. */
    public FaceInfo() {}
}
