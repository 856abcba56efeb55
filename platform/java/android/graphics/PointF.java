// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package android.graphics;

/** Stand-in for Android's point, for desktops: two float coordinates. */
public class PointF {
    public float x;
    public float y;

    public PointF() {}

    public PointF(float x, float y) {
        this.x = x;
        this.y = y;
    }

    public final void set(float newX, float newY) {
        x = newX;
        y = newY;
    }

    public final void set(PointF p) {
        x = p.x;
        y = p.y;
    }

    public final void offset(float dx, float dy) {
        x += dx;
        y += dy;
    }

    @Override
    public boolean equals(Object other) {
        if (this == other) {
            return true;
        }
        if (other == null || getClass() != other.getClass()) {
            return false;
        }
        PointF p = (PointF) other;
        return Float.compare(x, p.x) == 0 && Float.compare(y, p.y) == 0;
    }

    @Override
    public int hashCode() {
        return bits(x) * 31 + bits(y);
    }

    /** Both zeros hash alike, though they are not equal. */
    private static int bits(float value) {
        return value == 0 ? 0 : Float.floatToIntBits(value);
    }

    @Override
    public String toString() {
        return "PointF(" + x + ", " + y + ")";
    }
}
