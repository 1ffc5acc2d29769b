package com.tav.android.pixara.photoretouching.jni;

/**
 * The native image-processing engine, {@code libglimmerEngine}.
 *
 * <h2>Pictures, masks, rectangles</h2>
 * A picture is an {@code int[]} of {@code width * height} pixels, 0xAARRGGBB,
 * rows top to bottom. Every operation keeps each pixel's alpha from its
 * input. A mask is a {@code byte[]} of {@code width * height} bytes; only a
 * byte equal to 1 selects its pixel. A {@link Rect} is inclusive; an empty one
 * ({@code right < left} or {@code top > bottom}) means the whole picture and
 * the mask is then not read. A rectangle reaching outside the picture is
 * clipped to it. The caller owns every array; results are written into the
 * output array it passes.
 *
 * <h2>Result codes</h2>
 * {@link #SUCCESS} 40960, {@link #ERR_ALLOC} 40961 (a working buffer could not
 * be allocated; the output is untouched), {@link #ERR_NULL} 40962 (a null or
 * too short array, a size that is not positive or too large, or a rectangle
 * wholly outside the picture; nothing is written), {@link #ERR_EFFECT} 40971
 * (the effect library failed; the output is untouched). Methods declared
 * {@code void} report nothing: refused arguments leave the output untouched
 * and log one line.
 *
 * <h2>Threads and state</h2>
 * Every method runs on the caller's thread and returns when the work is
 * done. The library keeps some state between calls (saved mask and object);
 * callers must not run two methods that share state at once.
 */
public final class Engine {
    public static final int SUCCESS = 40960;
    public static final int ERR_ALLOC = 40961;
    public static final int ERR_NULL = 40962;
    public static final int ERR_EFFECT = 40971;

    static {
        System.loadLibrary("glimmerEngine");
    }

    private Engine() {
    }

    // ---- tone adjustments -------------------------------------------------
    // Region methods: (in, mask, out, width, height, level, rect). The output
    // receives a copy of the input in which the selected pixels of the
    // rectangle are adjusted, or the whole picture for an empty rectangle.

    /** Brightness 0..20 (10 neutral): the luma moves by (level - 10) * 10; on the whole picture every channel does. */
    public static native void controlBrightness(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Brightness 0..100 (50 neutral): offset (level - 50) * 2. */
    public static native void controlBrightnessRange100(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Contrast 0..20 (10 neutral); a channel never crosses mid-grey 128. */
    public static native void controlContrast(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Contrast 0..100 (50 neutral). */
    public static native void controlContrastRange100(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Saturation 0..20 (10 neutral, 0 grey, 20 twice the colour). */
    public static native void controlSaturation(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Saturation 0..100 (50 neutral). */
    public static native void controlSaturationRange100(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Colour temperature 0..20 (10 neutral; lower is bluer, higher warmer). */
    public static native void controlTemperature(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Colour temperature 0..100 (50 neutral). */
    public static native void controlTemperatureRange100(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Exposure 0 and up (10 neutral): channels are multiplied by level / 10. A negative level does nothing. */
    public static native void controlExposure(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Faded colour 0..100 (0 neutral): a warm, flat film look. A level above 100 does nothing. */
    public static native void controlFadedColour(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Greyscale 0..20: grey at gain 1 + (level - 10) * 0.061. */
    public static native void controlGreyscale(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    // ---- effects ---------------------------------------------------------

    /** Sepia tone of the whole picture. Returns SUCCESS, ERR_NULL, ERR_ALLOC or ERR_EFFECT. */
    public static native int applySepia(int[] in, int[] out, int width, int height);

    /**
     * Sepia tone of the selected pixels: the output gets the sepia pixel where
     * the mask byte is 1 and the untouched input pixel elsewhere (everywhere
     * sepia for an empty rectangle).
     */
    public static native int applySepiaPartial(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);

    // ---- colour tools: hue, RGB balance, point colour, automatic adjustment, brushes, splash, lens tints ----

    // (end of colour tools)

    // ---- effects of the effect library: painterly, halftone, kaleidoscope, reflection, region, vintage ----

    // (end of effects of the effect library)

    // ---- filters: texture overlays, tone curves, shader-style looks ----

    // (end of filters)

    // ---- geometry: rotate, flip, straighten, crop, mirror, twirl, sphericity ----

    // (end of geometry)

    // ---- blur and depth of field: selective blur, tilt-shift, miniature ----
    // Both tools blur a copy of the picture reduced by a power of two (halved
    // above 420 pixels on the longer side, down to a sixteenth above 3250) and
    // bring it back with bilinear interpolation. Blur masks: a byte of 1 marks
    // a pixel to blur (background), any other value keeps it sharp (subject).
    // The library keeps one set of reduced buffers for both tools: initBlur
    // and initTiltShift fill it (initTiltShift first releases a blur state),
    // the previews use it, destroyBlur / destroyTiltShift free it. A preview
    // without a kept state writes nothing; destroying twice is harmless. The
    // apply methods never use the kept buffers. The caller owns every array.

    /**
     * Starts a selective-blur session: keeps the reduced picture and mask for
     * {@link #runBlurinPreview}. Arguments: picture (width * height), mask
     * (width * height; may be null only for an empty rectangle), size, rectangle.
     * An empty rectangle blurs the whole picture: the mask, when given, is left
     * all 0. Returns SUCCESS, ERR_NULL (null or short array, bad size, rectangle
     * outside; nothing kept or written) or ERR_ALLOC (no state kept).
     */
    public static native int initBlur(int[] in, byte[] mask, int width, int height, Rect rect);

    /**
     * Preview of the selective blur at level 0..7 (0 none, 7 strongest; higher
     * levels as 8) from the state of {@link #initBlur}: out (width * height)
     * receives the blurred pixels where the mask is 1 and the input elsewhere
     * (everywhere blurred when the session was started with an empty
     * rectangle). in, mask and out must all hold width * height elements, the
     * preview's own size. Writes nothing without a session.
     */
    public static native void runBlurinPreview(int[] in, byte[] mask, int[] out, int width, int height, int level);

    /**
     * The full selective blur at level 0..7, independent of any session:
     * blurred pixels where the mask is 1, the input pixel elsewhere. An empty
     * rectangle blurs every pixel (the mask may then be null; when given it is
     * left all 0). After a session started with an empty rectangle (even once
     * destroyed) the full-size mask is not consulted until the next
     * {@link #initBlur} with a rectangle: unselected pixels are then kept
     * sharp only through the reduced mask, so they may take some blur near the
     * selection's edge.
     */
    public static native void applyBlur(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Frees the selective-blur state. */
    public static native void destroyBlur();

    /**
     * Starts a tilt-shift session with the picture (width * height, only
     * read): keeps its reduced copy for {@link #makeTiltShift}. Releases a
     * selective-blur state.
     */
    public static native void initTiltShift(int[] in, int width, int height);

    /**
     * Tilt-shift preview from the kept state: rows within halfBand of row
     * center stay sharp, the rest blends into the blur over half the distance
     * to the farther edge. in and out hold width * height elements (the
     * preview's own size). Writes nothing without a session.
     */
    public static native void makeTiltShift(int[] in, int[] out, int width, int height, int center, int halfBand);

    /** The full tilt-shift (as {@link #makeTiltShift}), independent of any session. */
    public static native void applyTiltShift(int[] in, int[] out, int width, int height, int center, int halfBand);

    /** Miniature look: saturation 16 (of 0..20), then tilt-shift around the middle row, half band height / 8. */
    public static native void applyMiniature(int[] in, int[] out, int width, int height);

    /** Frees the tilt-shift state. */
    public static native void destroyTiltShift();

    /**
     * Out-focus blur of the whole picture at level 0..7 (radius 3, 7, 15, 31,
     * 41, 49, 55, 63 pixels; higher levels as 7, negative as 0). Returns
     * SUCCESS, ERR_NULL or ERR_EFFECT.
     */
    public static native int applyOutfocusBlur(int[] in, int[] out, int width, int height, int level);

    // (end of blur and depth of field)

    // ---- object tools: eraser, copy and paste ----

    // (end of object tools)

    // ---- portrait retouching and red-eye ----

    // (end of portrait retouching and red-eye)

    // ---- backlight correction ----

    // (end of backlight correction)

    // ---- saved regions ----------------------------------------------------

    /** Saves the rectangle of the mask (row length width), replacing the saved mask. Returns 0. */
    public static native int storeMask(byte[] mask, int width, int height, Rect rect);

    /** Saves the rectangle of the picture, replacing the saved object. Returns 0. */
    public static native int storeObject(int[] image, int width, int height, Rect rect);

    /** Copies the saved mask back into the rectangle; -1 when none is saved. */
    public static native int recoverMask(byte[] mask, int width, int height, Rect rect);

    /** Copies the saved object back into the rectangle; -1 when none is saved. */
    public static native int recoverObject(int[] image, int width, int height, Rect rect);

    /** Frees the saved mask. */
    public static native void deleteStoredMask();

    /** Frees the saved object. */
    public static native void deleteStoredObject();

    /** The effect library's version text. */
    public static native String LibVersion();
}
