// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.PointF;
import android.graphics.Rect;
import com.vantrel.faceapi.model.FaceInfo;
import java.util.ArrayList;
import java.util.List;
import org.jetbrains.annotations.NotNull;
import org.jetbrains.annotations.Nullable;

/**
 * The way from a camera's frame to what is shown of it: a rectangle of the frame is cut out, turned upright, mirrored
 * where the camera faces the user, and, for a view, scaled to fit into it or to fill it. The transform tells the size
 * of what comes of that, and maps points, rectangles and faces from the frame to what is shown ({@code map}) and back
 * ({@code unmap}).
 *
 * <pre>{@code
 * FrameTransform shown = FrameTransform.of(width, height, rotationDegrees)
 *         .mirrored(isFrontCamera)
 *         .fill(preview.getWidth(), preview.getHeight());
 * // for every face found in the frame:
 * Rect onScreen = shown.map(face.faceRect, null);
 * }</pre>
 *
 * <p>The order of the steps is fixed, whatever the order of the calls: crop, rotation, mirroring, scale. A rectangle
 * has edges: (0, 0, 1, 1) is the first pixel. A point is a pixel's middle, as it is in {@link FaceInfo#facePoints}:
 * (0, 0) is the middle of the first pixel. So a pixel's rectangle and its point land on one and the same pixel.
 *
 * <p>Transforms are immutable, and equal when they do the same. They are made when the size of the frames or of the
 * view changes, not for every frame; mapping allocates nothing where an object to be reused is given.
 */
public final class FrameTransform {
    private enum Scale { NONE, FIT, FILL }

    private final int frameWidth;
    private final int frameHeight;
    private final int left;
    private final int top;
    private final int right;
    private final int bottom;
    private final int rotationDegrees;
    private final boolean mirrored;
    private final Scale scale;
    private final int viewWidth;
    private final int viewHeight;

    /** Shown pixels for one of the frame. */
    private final double zoom;

    // Positions as edges have them: shownX = xByX * x + xByY * y + x0, shownY = yByX * x + yByY * y + y0. In each row
    // one of the two factors is 0 and the other the zoom, with either sign.
    private final double xByX;
    private final double xByY;
    private final double x0;
    private final double yByX;
    private final double yByY;
    private final double y0;

    private FrameTransform(int frameWidth, int frameHeight, int left, int top, int right, int bottom,
            int rotationDegrees, boolean mirrored, Scale scale, int viewWidth, int viewHeight) {
        this.frameWidth = frameWidth;
        this.frameHeight = frameHeight;
        this.left = left;
        this.top = top;
        this.right = right;
        this.bottom = bottom;
        this.rotationDegrees = rotationDegrees;
        this.mirrored = mirrored;
        this.scale = scale;
        this.viewWidth = viewWidth;
        this.viewHeight = viewHeight;

        double width = resultWidth();
        double height = resultHeight();
        double across = viewWidth / width;
        double down = viewHeight / height;
        zoom = scale == Scale.NONE ? 1 : scale == Scale.FIT ? Math.min(across, down) : Math.max(across, down);
        double marginX = scale == Scale.NONE ? 0 : (viewWidth - zoom * width) / 2;
        double marginY = scale == Scale.NONE ? 0 : (viewHeight - zoom * height) / 2;

        // The shown picture's axes in the frame: which way x and y grow there, and which frame edge they start from.
        boolean swapped = isSideways();
        boolean xReversed = rotationDegrees == 90 || rotationDegrees == 180;
        if (mirrored) {
            xReversed = !xReversed;
        }
        boolean yReversed = rotationDegrees == 180 || rotationDegrees == 270;
        double x = xReversed ? -zoom : zoom;
        double y = yReversed ? -zoom : zoom;
        xByX = swapped ? 0 : x;
        xByY = swapped ? x : 0;
        yByX = swapped ? y : 0;
        yByY = swapped ? 0 : y;
        int xStart = swapped ? (xReversed ? bottom : top) : (xReversed ? right : left);
        int yStart = swapped ? (yReversed ? right : left) : (yReversed ? bottom : top);
        x0 = marginX - x * xStart;
        y0 = marginY - y * yStart;
    }

    /**
     * Creates the transform that turns a whole frame upright.
     *
     * @param frameWidth width of the frame in pixels
     * @param frameHeight height of the frame in pixels
     * @param rotationDegrees by how much the frame must be turned clockwise to be upright: 0, 90, 180 or 270
     * @return the transform, neither mirrored nor scaled
     * @throws IllegalArgumentException when a size is not above 0 or the rotation does not fit
     */
    public static @NotNull FrameTransform of(int frameWidth, int frameHeight, int rotationDegrees) {
        Check.positive("frameWidth", frameWidth);
        Check.positive("frameHeight", frameHeight);
        Check.rotation("rotationDegrees", rotationDegrees);
        return new FrameTransform(frameWidth, frameHeight, 0, 0, frameWidth, frameHeight, rotationDegrees, false,
                Scale.NONE, frameWidth, frameHeight);
    }

    /**
     * Returns this transform for a part of the frame. Colour of a camera's frame is shared by squares of two by two
     * pixels, so the rectangle is made even: its left and top edge move to the even position before, its right and
     * bottom edge to the one behind, or to the frame's edge.
     *
     * @param crop the rectangle in the frame; of an earlier crop nothing remains
     * @return the transform of that part
     * @throws NullPointerException when the rectangle is null
     * @throws IllegalArgumentException when the rectangle is empty or not inside the frame
     */
    public @NotNull FrameTransform crop(@NotNull Rect crop) {
        Check.notNull("crop", crop);
        Check.range("crop.left", crop.left, 0, frameWidth - 1L);
        Check.range("crop.top", crop.top, 0, frameHeight - 1L);
        Check.range("crop.right", crop.right, crop.left + 1L, frameWidth);
        Check.range("crop.bottom", crop.bottom, crop.top + 1L, frameHeight);
        return new FrameTransform(frameWidth, frameHeight, crop.left & ~1, crop.top & ~1,
                evenBehind(crop.right, frameWidth), evenBehind(crop.bottom, frameHeight), rotationDegrees, mirrored,
                scale, viewWidth, viewHeight);
    }

    private static int evenBehind(int edge, int last) {
        return edge == last ? last : edge + (edge & 1);
    }

    /**
     * Returns this transform with or without mirroring: left and right of the upright picture change places, as users
     * expect of a camera that faces them.
     *
     * @param isMirrored whether to mirror
     * @return the transform
     */
    public @NotNull FrameTransform mirrored(boolean isMirrored) {
        return new FrameTransform(frameWidth, frameHeight, left, top, right, bottom, rotationDegrees, isMirrored, scale,
                viewWidth, viewHeight);
    }

    /**
     * Returns this transform into a view that shows the whole picture, as large as it fits and centred, with bars at
     * two sides where the shapes differ.
     *
     * @param width width of the view in pixels
     * @param height height of the view in pixels
     * @return the transform; of an earlier view nothing remains
     * @throws IllegalArgumentException when a size is not above 0
     */
    public @NotNull FrameTransform fit(int width, int height) {
        return into(Scale.FIT, width, height);
    }

    /**
     * Returns this transform into a view that is filled by the picture, which is centred and reaches beyond two sides
     * where the shapes differ.
     *
     * @param width width of the view in pixels
     * @param height height of the view in pixels
     * @return the transform; of an earlier view nothing remains
     * @throws IllegalArgumentException when a size is not above 0
     */
    public @NotNull FrameTransform fill(int width, int height) {
        return into(Scale.FILL, width, height);
    }

    private FrameTransform into(Scale newScale, int width, int height) {
        Check.positive("width", width);
        Check.positive("height", height);
        return new FrameTransform(frameWidth, frameHeight, left, top, right, bottom, rotationDegrees, mirrored,
                newScale, width, height);
    }

    /**
     * Returns the frame's width.
     *
     * @return pixels
     */
    public int frameWidth() {
        return frameWidth;
    }

    /**
     * Returns the frame's height.
     *
     * @return pixels
     */
    public int frameHeight() {
        return frameHeight;
    }

    /**
     * Returns the part of the frame that is shown.
     *
     * @param reuse the rectangle to fill, or null for a new one
     * @return the rectangle in the frame, with even edges or those of the frame
     */
    public @NotNull Rect cropRect(@Nullable Rect reuse) {
        Rect out = reuse == null ? new Rect() : reuse;
        out.set(left, top, right, bottom);
        return out;
    }

    /**
     * Returns how the frame is turned.
     *
     * @return degrees clockwise: 0, 90, 180 or 270
     */
    public int rotationDegrees() {
        return rotationDegrees;
    }

    /**
     * Returns whether left and right of the upright picture change places.
     *
     * @return true when the picture is mirrored
     */
    public boolean isMirrored() {
        return mirrored;
    }

    /**
     * Returns the width of the upright picture, before it is scaled to a view.
     *
     * @return pixels
     */
    public int resultWidth() {
        return isSideways() ? bottom - top : right - left;
    }

    /**
     * Returns the height of the upright picture, before it is scaled to a view.
     *
     * @return pixels
     */
    public int resultHeight() {
        return isSideways() ? right - left : bottom - top;
    }

    /**
     * Returns by how much the upright picture is enlarged for the view.
     *
     * @return pixels of the view for one of the frame; 1 without a view
     */
    public float scale() {
        return (float) zoom;
    }

    /**
     * Maps a rectangle of the frame to what is shown; to a view, to the nearest edges of pixels.
     *
     * @param rect the rectangle, which may reach beyond the part that is shown
     * @param reuse the rectangle to fill, which may be {@code rect} itself, or null for a new one
     * @return the rectangle in the upright picture, or in the view when there is one
     * @throws NullPointerException when the rectangle is null
     */
    public @NotNull Rect map(@NotNull Rect rect, @Nullable Rect reuse) {
        Check.notNull("rect", rect);
        double xa = shownX(rect.left, rect.top);
        double xb = shownX(rect.right, rect.bottom);
        double ya = shownY(rect.left, rect.top);
        double yb = shownY(rect.right, rect.bottom);
        return ordered(xa, ya, xb, yb, reuse);
    }

    /**
     * Maps a rectangle of what is shown to the frame; from a view, to the nearest edges of pixels.
     *
     * @param rect the rectangle in the upright picture, or in the view when there is one
     * @param reuse the rectangle to fill, which may be {@code rect} itself, or null for a new one
     * @return the rectangle in the frame
     * @throws NullPointerException when the rectangle is null
     */
    public @NotNull Rect unmap(@NotNull Rect rect, @Nullable Rect reuse) {
        Check.notNull("rect", rect);
        double xa = frameX(rect.left, rect.top);
        double xb = frameX(rect.right, rect.bottom);
        double ya = frameY(rect.left, rect.top);
        double yb = frameY(rect.right, rect.bottom);
        return ordered(xa, ya, xb, yb, reuse);
    }

    /**
     * Maps a point of the frame to what is shown.
     *
     * @param point the point, which may lie beyond the part that is shown
     * @param reuse the point to fill, which may be {@code point} itself, or null for a new one
     * @return the point in the upright picture, or in the view when there is one
     * @throws NullPointerException when the point is null
     */
    public @NotNull PointF map(@NotNull PointF point, @Nullable PointF reuse) {
        Check.notNull("point", point);
        double x = point.x + 0.5;
        double y = point.y + 0.5;
        return at(shownX(x, y) - 0.5, shownY(x, y) - 0.5, reuse);
    }

    /**
     * Maps a point of what is shown, such as one that was touched, to the frame.
     *
     * @param point the point in the upright picture, or in the view when there is one
     * @param reuse the point to fill, which may be {@code point} itself, or null for a new one
     * @return the point in the frame
     * @throws NullPointerException when the point is null
     */
    public @NotNull PointF unmap(@NotNull PointF point, @Nullable PointF reuse) {
        Check.notNull("point", point);
        double x = point.x + 0.5;
        double y = point.y + 0.5;
        return at(frameX(x, y) - 0.5, frameY(x, y) - 0.5, reuse);
    }

    /**
     * Maps a face that was found in the frame, with this transform's rotation, to what is shown: its rectangle, its
     * points, the distance of its eyes, and where it is mirrored the signs of yaw and roll. The angles of a face are
     * those in the upright picture already. The points keep their order: each remains the same part of the face.
     *
     * @param face the face in the frame; a rectangle, points or a point that is null stays null
     * @param reuse the face to fill, which may be {@code face} itself, or null for a new one; its rectangle and its
     *     points are used again as far as they are there and as many
     * @return the face in the upright picture, or in the view when there is one
     * @throws NullPointerException when the face is null
     */
    public @NotNull FaceInfo map(@NotNull FaceInfo face, @Nullable FaceInfo reuse) {
        return moved(face, reuse, true);
    }

    /**
     * Maps a face from what is shown to the frame: undoes {@link #map(FaceInfo, FaceInfo)}.
     *
     * @param face the face in the upright picture, or in the view when there is one
     * @param reuse the face to fill, which may be {@code face} itself, or null for a new one; its rectangle and its
     *     points are used again as far as they are there and as many
     * @return the face in the frame
     * @throws NullPointerException when the face is null
     */
    public @NotNull FaceInfo unmap(@NotNull FaceInfo face, @Nullable FaceInfo reuse) {
        return moved(face, reuse, false);
    }

    /**
     * Maps all faces that were found in a frame to what is shown; see {@link #map(FaceInfo, FaceInfo)}.
     *
     * @param faces the faces in the frame, as a detector or a tracker returns them
     * @return new faces in the same order
     * @throws NullPointerException when the list or a face is null
     */
    public @NotNull List<FaceInfo> map(@NotNull List<FaceInfo> faces) {
        Check.notNull("faces", faces);
        List<FaceInfo> out = new ArrayList<>(faces.size());
        for (int i = 0; i < faces.size(); i++) {
            out.add(map(faces.get(i), null));
        }
        return out;
    }

    private FaceInfo moved(FaceInfo face, FaceInfo reuse, boolean toShown) {
        Check.notNull("face", face);
        FaceInfo out = reuse == null ? new FaceInfo() : reuse;
        if (face.faceRect == null) {
            out.faceRect = null;
        } else {
            out.faceRect = toShown ? map(face.faceRect, out.faceRect) : unmap(face.faceRect, out.faceRect);
        }
        if (face.facePoints == null) {
            out.facePoints = null;
        } else {
            int count = face.facePoints.length;
            if (out.facePoints == null || out.facePoints.length != count) {
                out.facePoints = new PointF[count];
            }
            for (int i = 0; i < count; i++) {
                PointF point = face.facePoints[i];
                PointF used = out.facePoints[i];
                out.facePoints[i] = point == null ? null : toShown ? map(point, used) : unmap(point, used);
            }
        }
        out.score = face.score;
        out.id = face.id;
        out.pitch = face.pitch;
        // Subtracted, so that an angle of 0 does not become one of -0.
        out.yaw = mirrored ? 0 - face.yaw : face.yaw;
        out.roll = mirrored ? 0 - face.roll : face.roll;
        out.eyeDist = (float) (toShown ? face.eyeDist * zoom : face.eyeDist / zoom);
        return out;
    }

    /** Fails when a frame is not of the size that this transform was made for. */
    void checkFrame(int width, int height) {
        if (width != frameWidth || height != frameHeight) {
            throw new IllegalArgumentException("transform must be made for a frame of " + width + " x " + height
                    + ", not of " + frameWidth + " x " + frameHeight);
        }
    }

    int cropLeft() {
        return left;
    }

    int cropTop() {
        return top;
    }

    int cropWidth() {
        return right - left;
    }

    int cropHeight() {
        return bottom - top;
    }

    private boolean isSideways() {
        return rotationDegrees == 90 || rotationDegrees == 270;
    }

    private double shownX(double x, double y) {
        return xByX * x + xByY * y + x0;
    }

    private double shownY(double x, double y) {
        return yByX * x + yByY * y + y0;
    }

    private double frameX(double x, double y) {
        return xByX == 0 ? (y - y0) / yByX : (x - x0) / xByX;
    }

    private double frameY(double x, double y) {
        return xByX == 0 ? (x - x0) / xByY : (y - y0) / yByY;
    }

    private static Rect ordered(double xa, double ya, double xb, double yb, Rect reuse) {
        Rect out = reuse == null ? new Rect() : reuse;
        out.set(nearest(Math.min(xa, xb)), nearest(Math.min(ya, yb)), nearest(Math.max(xa, xb)),
                nearest(Math.max(ya, yb)));
        return out;
    }

    /** The nearest int; what is beyond the ints becomes the last of them. */
    private static int nearest(double position) {
        return (int) Math.max(Integer.MIN_VALUE, Math.min(Integer.MAX_VALUE, Math.round(position)));
    }

    private static PointF at(double x, double y, PointF reuse) {
        PointF out = reuse == null ? new PointF() : reuse;
        out.set((float) x, (float) y);
        return out;
    }

    @Override
    public boolean equals(Object other) {
        if (!(other instanceof FrameTransform)) {
            return false;
        }
        FrameTransform t = (FrameTransform) other;
        return frameWidth == t.frameWidth && frameHeight == t.frameHeight && left == t.left && top == t.top
                && right == t.right && bottom == t.bottom && rotationDegrees == t.rotationDegrees
                && mirrored == t.mirrored && scale == t.scale && viewWidth == t.viewWidth
                && viewHeight == t.viewHeight;
    }

    @Override
    public int hashCode() {
        int hash = frameWidth * 31 + frameHeight;
        hash = ((hash * 31 + left) * 31 + top) * 31 + right;
        hash = (hash * 31 + bottom) * 31 + rotationDegrees + (mirrored ? 1 : 0);
        return ((hash * 31 + scale.ordinal()) * 31 + viewWidth) * 31 + viewHeight;
    }

    @Override
    public String toString() {
        return "(" + left + ", " + top + ")-(" + right + ", " + bottom + ") of " + frameWidth + " x " + frameHeight
                + ", turned by " + rotationDegrees + (mirrored ? ", mirrored" : "")
                + (scale == Scale.NONE ? "" : (scale == Scale.FIT ? ", fit into " : ", filling ") + viewWidth + " x "
                        + viewHeight);
    }
}
