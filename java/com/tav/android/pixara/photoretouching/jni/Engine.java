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
    // Whole-picture methods (in, out, width, height) work on a packed RGB copy
    // and write the result with each pixel's alpha from the input; partial
    // methods (in, mask, out, width, height, rect) write the effect's pixel
    // where the mask byte is 1 inside the rectangle and the untouched input
    // pixel elsewhere (the effect everywhere for an empty rectangle). They
    // return SUCCESS, ERR_NULL, ERR_ALLOC or ERR_EFFECT; on a failure the
    // output is left as passed. The caller owns every array.

    /** Cartoon: dark outlines around flattened tones (5 x 5 outline window). */
    public static native int applyCartoonize(int[] in, int[] out, int width, int height);

    /** Cartoon of the selected pixels. */
    public static native int applyCartoonizePartial(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);

    /** Magic pen: glowing colour outlines on black (gradient strength of each channel). */
    public static native int applyMagicPen(int[] in, int[] out, int width, int height);

    /** Magic pen of the selected pixels. */
    public static native int applyMagicPenPartial(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);

    /** Oil paint: darkened edges and a 3 x 3 mode filter. */
    public static native int applyOilpaint(int[] in, int[] out, int width, int height);

    /** Oil paint of the selected pixels. */
    public static native int applyOilpaintPartial(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);

    /**
     * Posterize: six levels a channel with a little extra contrast. Can be
     * stopped from another thread with {@link #cancelEffect()} (ERR_EFFECT).
     */
    public static native int applyPosterize(int[] in, int[] out, int width, int height);

    /** Posterize of the selected pixels. */
    public static native int applyPosterizePartial(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);

    /** Pencil sketch in grey: medium stroke darkness over a 7 x 7 dodge blur. */
    public static native int applySketch(int[] in, int[] out, int width, int height);

    /** Pencil sketch of the selected pixels. */
    public static native int applySketchPartial(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);

    /**
     * Pencil sketch on a paper texture: {@code texture} is a picture of the
     * same size whose blue channel (lowest byte) is the paper's brightness.
     * A null or short texture gives ERR_NULL.
     */
    public static native int applySketchTexture(int[] in, int[] texture, int[] out, int width, int height);

    /** Sketch on texture of the selected pixels (note the argument order: texture before out, mask after). */
    public static native int applySketchTexturePartial(int[] in, int[] texture, int[] out, byte[] mask, int width, int height, Rect rect);

    /** Colour halftone: cyan, magenta and yellow dot screens printed over the picture (only darkens). */
    public static native int applyHalftone(int[] in, int[] out, int width, int height);

    /** Colour halftone of the selected pixels. */
    public static native int applyHalftonePartial(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);

    // The following work on the caller's pixels directly.

    /**
     * Kaleidoscope: the centre of the picture mirrored eight ways into a
     * square at the top, on opaque white. Returns SUCCESS (ERR_NULL for
     * refused arguments).
     */
    public static native int applyKaleidoscope(int[] in, int[] out, int width, int height);

    /**
     * Reflection: the rows from {@code reflectionHeight} down show the rows
     * above mirrored and fading. Needs reflectionHeight &lt; height &lt;=
     * 2 * reflectionHeight, otherwise the output is left as passed. Returns
     * SUCCESS (ERR_NULL for refused arguments).
     */
    public static native int applyReflection(int[] in, int[] out, int width, int height, int reflectionHeight);

    /**
     * Brightness of the tonal half touched at (touchX, touchY): a bright
     * touch (mean of the 5 x 5 window 128 or more) lifts the bright pixels
     * by 5 * level, otherwise the dark ones; a touch within 2 pixels of a
     * border counts as dark. The output is opaque. Returns the effect
     * library's code: 0 success, 3 touch outside the picture; ERR_NULL for
     * refused arguments.
     */
    public static native int applyRegionBasedBrightness(int[] in, int[] out, int width, int height, int touchX, int touchY, int level);

    /** Contrast of the touched tonal half; channels never cross mid-grey. Codes as above. */
    public static native int applyRegionBasedContrast(int[] in, int[] out, int width, int height, int touchX, int touchY, int level);

    /** Exposure of the touched tonal half, level -7..7 (1 outside). Codes as above. */
    public static native int applyRegionBasedExposure(int[] in, int[] out, int width, int height, int touchX, int touchY, int level);

    /** Vintage: a warm, faded film look; alpha kept. Refused arguments leave the output untouched. */
    public static native void applyVintage(int[] in, int[] out, int width, int height);

    /** Percentage done of the effect running on another thread (posterize, sepia, sketch blur). */
    public static native int getEffectProgress();

    /** Asks the effect running on another thread to stop; ignored when none runs. */
    public static native void cancelEffect();

    // (end of effects of the effect library)

    // ---- filters: texture overlays, tone curves, shader-style looks ----

    // (end of filters)

    // ---- geometry: rotate, flip, straighten, crop, mirror, twirl, sphericity ----

    // (end of geometry)

    // ---- blur and depth of field: selective blur, tilt-shift, miniature ----

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
