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

    @Override
    public boolean equals(Object other) {
        if (!(other instanceof PointF)) {
            return false;
        }
        PointF p = (PointF) other;
        return Float.compare(x, p.x) == 0 && Float.compare(y, p.y) == 0;
    }

    @Override
    public int hashCode() {
        return Float.floatToIntBits(x) * 31 + Float.floatToIntBits(y);
    }

    @Override
    public String toString() {
        return "PointF(" + x + ", " + y + ")";
    }
}
