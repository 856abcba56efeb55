// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package android.graphics;

/** Stand-in for Android's rectangle, for desktops: four integer edges. */
public final class Rect {
    public int left;
    public int top;
    public int right;
    public int bottom;

    public Rect() {}

    public Rect(int left, int top, int right, int bottom) {
        set(left, top, right, bottom);
    }

    /** A copy; of null an empty rectangle. */
    public Rect(Rect r) {
        if (r != null) {
            set(r);
        }
    }

    public void set(int newLeft, int newTop, int newRight, int newBottom) {
        left = newLeft;
        top = newTop;
        right = newRight;
        bottom = newBottom;
    }

    public void set(Rect r) {
        set(r.left, r.top, r.right, r.bottom);
    }

    public void setEmpty() {
        set(0, 0, 0, 0);
    }

    public boolean isEmpty() {
        return left >= right || top >= bottom;
    }

    public int width() {
        return right - left;
    }

    public int height() {
        return bottom - top;
    }

    public int centerX() {
        return left + right >> 1;
    }

    public int centerY() {
        return top + bottom >> 1;
    }

    public void offset(int dx, int dy) {
        set(left + dx, top + dy, right + dx, bottom + dy);
    }

    public boolean contains(int x, int y) {
        return !isEmpty() && x >= left && x < right && y >= top && y < bottom;
    }

    public boolean contains(Rect r) {
        return !isEmpty() && left <= r.left && top <= r.top && right >= r.right && bottom >= r.bottom;
    }

    /** Shrinks this rectangle to what it shares with another; when that is nothing it stays as it is. */
    public boolean intersect(int otherLeft, int otherTop, int otherRight, int otherBottom) {
        if (left >= otherRight || otherLeft >= right || top >= otherBottom || otherTop >= bottom) {
            return false;
        }
        set(Math.max(left, otherLeft), Math.max(top, otherTop), Math.min(right, otherRight),
                Math.min(bottom, otherBottom));
        return true;
    }

    public boolean intersect(Rect r) {
        return intersect(r.left, r.top, r.right, r.bottom);
    }

    @Override
    public boolean equals(Object other) {
        if (!(other instanceof Rect)) {
            return false;
        }
        Rect r = (Rect) other;
        return left == r.left && top == r.top && right == r.right && bottom == r.bottom;
    }

    @Override
    public int hashCode() {
        return ((left * 31 + top) * 31 + right) * 31 + bottom;
    }

    @Override
    public String toString() {
        return "Rect(" + left + ", " + top + " - " + right + ", " + bottom + ")";
    }
}
