package com.tav.android.pixara.photoretouching.jni;

/**
 * An inclusive pixel rectangle as the engine reads it: the int fields
 * {@code left}, {@code right}, {@code top} and {@code bottom} (Android's
 * {@code android.graphics.Rect} has the same fields and may be passed instead).
 * A rectangle with {@code right < left} or {@code top > bottom} is empty; to
 * the region methods an empty rectangle means the whole picture.
 */
public final class Rect {
    public int left;
    public int top;
    public int right;
    public int bottom;

    public Rect() {
        this(0, 0, -1, -1);
    }

    public Rect(int left, int top, int right, int bottom) {
        this.left = left;
        this.top = top;
        this.right = right;
        this.bottom = bottom;
    }

    /** The empty rectangle: region methods then work on the whole picture. */
    public static Rect whole() {
        return new Rect();
    }

    @Override
    public String toString() {
        return "Rect(" + left + ", " + top + " - " + right + ", " + bottom + ")";
    }
}
