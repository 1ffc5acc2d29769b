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

    // Region methods take (in, mask, out, width, height, levels..., rect) like
    // the tone adjustments: the output receives a copy of the input in which
    // the selected pixels of the rectangle, or the whole picture for an empty
    // rectangle, are changed. Whole-picture methods take (in, out, width,
    // height, ...). The caller owns every array.

    /**
     * Rotates the hue by {@code level * 18} degrees (level 0 copies the input;
     * 10 gives the opposite hue, 20 a full turn). Greys stay grey.
     */
    public static native void controlHue(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /** Hue on the 0..100 scale (50 unchanged, about 3.6 degrees a step, 0 and 100 near the opposite hue). */
    public static native void controlHueRange100(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);

    /**
     * Red, green and blue balance, each 0..20 (10 neutral). A channel's own
     * level moves it by 6 a step and moves the other two by -3 a step, so the
     * picture's brightness is kept: red 20 adds 60 to red and takes 30 from
     * green and blue.
     */
    public static native void adjustRGB(int[] in, byte[] mask, int[] out, int width, int height, int red, int green, int blue, Rect rect);

    /** Red, green and blue balance on the 0..100 scale (50 neutral, full push also 60). */
    public static native void adjustRGBRange100(int[] in, byte[] mask, int[] out, int width, int height, int red, int green, int blue, Rect rect);

    /** Keeps reds (and their orange neighbours) in colour and turns every other pixel into its grey. */
    public static native void applyPointColorRed(int[] in, int[] out, int width, int height);

    /** Keeps greens in colour and turns every other pixel into its grey. */
    public static native void applyPointColorGreen(int[] in, int[] out, int width, int height);

    /** Keeps blues in colour and turns every other pixel into its grey. */
    public static native void applyPointColorBlue(int[] in, int[] out, int width, int height);

    /** Keeps yellows and oranges in colour and turns every other pixel into its grey. */
    public static native void applyPointColorYellow(int[] in, int[] out, int width, int height);

    /**
     * Automatic tone correction of the whole picture: the luminance histogram
     * is flattened into a tone curve and every pixel is scaled to follow it,
     * keeping its hue. Pictures above 2,000,000 pixels get one global
     * brightness or contrast step instead. Uses the settings of
     * {@link #setAutoAdjust}. Returns SUCCESS, ERR_NULL, or ERR_ALLOC (a work
     * buffer could not be allocated; the output is untouched). {@code in} and
     * {@code out} may be the same array.
     */
    public static native int applyAutoAdjust(int[] in, int[] out, int width, int height);

    /**
     * Sets the automatic adjustment's settings; each value outside its range
     * is ignored and the previous one kept. threshold 0..127 (default 70): the
     * percentage of bright pixels from which a picture counts as bright;
     * cutoff 0..100 (default 100): the tone curve's height in percent;
     * weight1 and weight2 300..8196 (defaults 1000 and 5120): the flattening
     * weights of other and of bright pictures. The settings are kept for the
     * life of the library.
     */
    public static native void setAutoAdjust(int threshold, int cutoff, int weight1, int weight2);

    /** The automatic adjustment's bright-picture threshold (percent). */
    public static native int getAutoAdjustThreshold();

    /** The automatic adjustment's tone curve height (percent). */
    public static native int getAutoAdjustCutoff();

    /** The automatic adjustment's flattening weight for pictures that are not bright. */
    public static native int getAutoAdjustWeight1();

    /** The automatic adjustment's flattening weight for bright pictures. */
    public static native int getAutoAdjustWeight2();

    // Brushes change the full-size image in place, one call per touch. Their
    // arguments come in one order: (image, [preview,] cx, cy, radius,
    // strength or cell shift, width, height[, previewWidth, previewHeight]).
    // The brush covers the pixels strictly closer than radius to (cx, cy).
    // A preview is a smaller copy of the image with the same aspect ratio;
    // the preview forms also redraw the part of it under the brush. The
    // status-returning brush methods give SUCCESS, or ERR_NULL for a null or
    // too short array or a size that is not positive (nothing is changed).

    /** Lightens under the brush by up to {@code strength} at the centre, nothing at the rim; never darkens. */
    public static native int rubLighten(int[] image, int cx, int cy, int radius, int strength, int width, int height);

    /** Darkens under the brush by up to {@code strength}, falling off linearly with the distance. */
    public static native int rubDarken(int[] image, int cx, int cy, int radius, int strength, int width, int height);

    /** {@link #rubLighten} that also redraws the preview under the brush. */
    public static native int rubLightenPreview(int[] image, int[] preview, int cx, int cy, int radius, int strength, int width, int height, int previewWidth, int previewHeight);

    /**
     * Darkens under the brush with the lighten brush's softer falloff (in the
     * squared distance) and redraws the preview; never lightens.
     */
    public static native int rubDarkenPreview(int[] image, int[] preview, int cx, int cy, int radius, int strength, int width, int height, int previewWidth, int previewHeight);

    /**
     * Pixelizes the whole picture in square cells of {@code 2^shift} pixels,
     * each taking its top-left pixel (shift 0 copies).
     */
    public static native void applyPixelize(int[] in, int[] out, int width, int height, int shift);

    /**
     * Pixelizes, in place, the cells of {@code 2^shift} pixels within
     * {@code radius >> shift} cells (diamond distance) of the cell under
     * (cx, cy).
     */
    public static native void rubPixelize(int[] image, int cx, int cy, int radius, int shift, int width, int height);

    /** {@link #rubPixelize} that also redraws the preview. */
    public static native void rubPixelizePreview(int[] image, int[] preview, int cx, int cy, int radius, int shift, int width, int height, int previewWidth, int previewHeight);

    /**
     * Starts a colour splash: the library keeps a copy of the colour picture
     * and the picture turns grey in place. A second call replaces the kept
     * copy. End the session with {@link #finishSplash}. Returns SUCCESS or
     * ERR_NULL.
     */
    public static native int initSplash(int[] image, int width, int height);

    /** Writes the splash grey, (R + 2G + B) / 4, of {@code in} to {@code out}. Returns SUCCESS or ERR_NULL. */
    public static native int setGrayInSplash(int[] in, int[] out, int width, int height);

    /**
     * Brings the kept colour back under the brush. Does nothing before
     * {@link #initSplash} or for a picture of another size. Returns SUCCESS
     * or ERR_NULL.
     */
    public static native int drawSplash(int[] image, int cx, int cy, int radius, int width, int height);

    /** {@link #drawSplash} that also redraws the preview. */
    public static native int drawSplashPreview(int[] image, int[] preview, int cx, int cy, int radius, int width, int height, int previewWidth, int previewHeight);

    /** Restores the whole kept colour picture (nothing without a session of this size). Returns SUCCESS or ERR_NULL. */
    public static native int recoverSplash(int[] image, int width, int height);

    /** Ends the colour splash session and frees the kept copy. */
    public static native void finishSplash();

    /**
     * Inverts the colour of the selected pixels (every pixel for an empty
     * rectangle). The mask must not be null, even for an empty rectangle.
     */
    public static native void applyInvert(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);

    /**
     * Tints a band along the picture's edges towards the hue {@code level * 18}
     * degrees (0..20), strongest at the border; only where the picture is
     * brighter than the tint. size 0..100: the band's width in percent of half
     * the longer side. A size above 100 does nothing.
     */
    public static native void controlEdgeLens(int[] in, int[] out, int width, int height, int level, int size);

    /** As {@link #controlEdgeLens} for a band down from the top; size in percent of the height. */
    public static native void controlTopLens(int[] in, int[] out, int width, int height, int level, int size);

    // (end of colour tools)

    // ---- effects of the effect library: painterly, halftone, kaleidoscope, reflection, region, vintage ----

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
