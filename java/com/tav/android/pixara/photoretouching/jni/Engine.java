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

    /**
     * Percentage done, 0..100, of the effect running on another thread
     * (posterize, sepia, sketch blur); a read that races the start of the next
     * effect reports at most 100.
     */
    public static native int getEffectProgress();

    /** Asks the effect running on another thread to stop; ignored when none runs. */
    public static native void cancelEffect();

    // (end of effects of the effect library)

    // ---- filters: texture overlays, tone curves, shader-style looks ----
    // Whole-picture methods take (in, out, [textures...], width, height) and
    // write every output pixel. Partial methods take (in, mask, out,
    // [textures...], width, height, rect): the filter is worked out for the
    // whole picture and copied into the output only where the mask byte is 1
    // inside the rectangle, or everywhere for an empty rectangle. Every other
    // output pixel keeps what the output held, so pass an output that already
    // holds the current picture (a copy of in). Textures are pictures of the
    // picture's size, never scaled. Alpha comes from the input. No status:
    // refused arguments (null or short arrays, bad sizes, a rectangle wholly
    // outside) leave the output untouched and log one line. The caller owns
    // every array; none is kept after the call.

    // Texture overlays: a prepared look, then the texture screened over it.
    // A screen texture is mostly black with light where it should glow.

    /** Dawn cast: warm, slightly dark look, screened with {@code screen}, then overlaid with {@code overlay} (overlay weight = its alpha). */
    public static native void applyDawnCast(int[] in, int[] out, int[] overlay, int[] screen, int width, int height);

    /** Dawn cast of the selected pixels. */
    public static native void applyDawnCastPartial(int[] in, byte[] mask, int[] out, int[] overlay, int[] screen,
            int width, int height, Rect rect);

    /** Light streak: more contrast, a little darker and less saturated, the streak texture screened over. */
    public static native void applyLightStreak(int[] in, int[] out, int[] texture, int width, int height);

    /** Light streak of the selected pixels. */
    public static native void applyLightStreakPartial(int[] in, byte[] mask, int[] out, int[] texture, int width,
            int height, Rect rect);

    /** Stardust: slightly warm, contrasty look with the star texture screened over. */
    public static native void applyStardust(int[] in, int[] out, int[] texture, int width, int height);

    /** Stardust of the selected pixels. */
    public static native void applyStardustPartial(int[] in, byte[] mask, int[] out, int[] texture, int width,
            int height, Rect rect);

    /** Sunburst: brighter and contrasty, with the sun texture screened over. */
    public static native void applySunburst(int[] in, int[] out, int[] texture, int width, int height);

    /** Sunburst of the selected pixels. */
    public static native void applySunburstPartial(int[] in, byte[] mask, int[] out, int[] texture, int width,
            int height, Rect rect);

    /** Light flare: bright, saturated look with the flare texture screened over. */
    public static native void applyLightFlare(int[] in, int[] out, int[] texture, int width, int height);

    /** Light flare of the selected pixels. */
    public static native void applyLightFlarePartial(int[] in, byte[] mask, int[] out, int[] texture, int width,
            int height, Rect rect);

    /** Old photo on paper: a brownish tone mixed three parts to one with the paper texture, softer contrast. */
    public static native void applyOldPhotoTexture(int[] in, int[] out, int[] texture, int width, int height);

    /** Old photo on paper of the selected pixels. */
    public static native void applyOldPhotoTexturePartial(int[] in, byte[] mask, int[] out, int[] texture,
            int width, int height, Rect rect);

    // Tone-curve looks.

    /** Retro: faded, lightly desaturated colours with a touch of contrast. */
    public static native void applyRetro(int[] in, int[] out, int width, int height);

    /** Retro of the selected pixels. */
    public static native void applyRetroPartial(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);

    /** Yellow glow: faded, warm and bright with a yellow-green cast. */
    public static native void applyYellowglow(int[] in, int[] out, int width, int height);

    /** Yellow glow of the selected pixels. */
    public static native void applyYellowglowPartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Nostalgia: bright, faded and warm. */
    public static native void applyNostalgia(int[] in, int[] out, int width, int height);

    /** Nostalgia of the selected pixels. */
    public static native void applyNostalgiaPartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Blue wash: cool, less saturated, a little brighter. */
    public static native void applyBluewash(int[] in, int[] out, int width, int height);

    /** Blue wash of the selected pixels. */
    public static native void applyBluewashPartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Sunshine: warm, golden and contrasty. */
    public static native void applySunshine(int[] in, int[] out, int width, int height);

    /** Sunshine of the selected pixels. */
    public static native void applySunshinePartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** The effect library's vintage look ({@link #applyVintage}) on the selected pixels. */
    public static native void applyVintagePartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Old photo: a faded sepia print (luma squeezed into 20..224, toned brown in the mid-tones). */
    public static native void applyOldPhoto(int[] in, int[] out, int width, int height);

    /** Old photo of the selected pixels. */
    public static native void applyOldPhotoPartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Down-light: light from above, from about 1.16 times brighter on the top row to about half on the bottom row. */
    public static native void applyDownlight(int[] in, int[] out, int width, int height);

    /** Down-light of the selected pixels. */
    public static native void applyDownlightPartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Soft glow: highlights bloom softly (a blur of the bright parts screened over the picture). */
    public static native void applySoftglow(int[] in, int[] out, int width, int height);

    /** Soft glow of the selected pixels. */
    public static native void applySoftglowPartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Pop art: a poster in four flat inks (deep blue, magenta, orange, yellow) by brightness. */
    public static native void applyPopArt(int[] in, int[] out, int width, int height);

    /** Sharpen along rows: each pixel is pushed away from the mean of its left and right neighbours. */
    public static native void applySharpen(int[] in, int[] out, int width, int height);

    /**
     * Sharpen of the pixels whose mask byte is 1, anywhere in the picture (a
     * non-empty rectangle does not bound it); the others are copied from in.
     * With an empty rectangle every pixel is sharpened and the caller's mask
     * is rewritten: it is left all 0 (it must then hold width * height bytes
     * when given; a null mask is allowed).
     */
    public static native void applySharpenPartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);
    // Shader-style effects. Texture members take their textures right after
    // the output, in the order given; the textures of the partial forms come
    // in the same order after the output. For rugged, oil pastel and
    // impressionist, in and out must be different arrays (they read
    // neighbouring pixels).

    /** Turquoise: the picture compressed to 70 % of its range over a blue-green floor (black becomes (19, 29, 51)). */
    public static native void applyTurquoise(int[] in, int[] out, int width, int height);

    /** Turquoise of the selected pixels. */
    public static native void applyTurquoisePartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Rainbow: a diagonal rainbow laid over the picture, sparing deep shadows. */
    public static native void applyRainbow(int[] in, int[] out, int width, int height);

    /** Rainbow of the selected pixels. */
    public static native void applyRainbowPartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Gothic noir: hard, cold black and white with a heavy dark frame; strong reds stay as crimson. */
    public static native void applyGothicNoir(int[] in, int[] out, int width, int height);

    /** Gothic noir of the selected pixels. */
    public static native void applyGothicNoirPartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /** Vignette: soft round darkening towards the corners (to 0.3 in the corners). */
    public static native void applyVignette(int[] in, int[] out, int width, int height);

    /** Vignette of the selected pixels. */
    public static native void applyVignettePartial(int[] in, byte[] mask, int[] out, int width, int height,
            Rect rect);

    /**
     * Rugged: gritty, weathered sandstone look (local contrast, muted warm
     * colour). {@code grain}: a neutral grain picture around mid-grey, overlaid
     * at half strength.
     */
    public static native void applyRugged(int[] in, int[] out, int[] grain, int width, int height);

    /** Rugged of the selected pixels. */
    public static native void applyRuggedPartial(int[] in, byte[] mask, int[] out, int[] grain, int width,
            int height, Rect rect);

    /**
     * Oil pastel: waxy, softly banded colours on paper. {@code grain}: a
     * neutral grain picture; where its brightness is below about half the
     * paper shows through.
     */
    public static native void applyOilPastel(int[] in, int[] out, int[] grain, int width, int height);

    /** Oil pastel of the selected pixels. */
    public static native void applyOilPastelPartial(int[] in, byte[] mask, int[] out, int[] grain, int width,
            int height, Rect rect);

    /** Noir note: soft, warm-toned black-and-white film print; {@code grain} (around mid-grey) is its film grain. */
    public static native void applyNoirNote(int[] in, int[] out, int[] grain, int width, int height);

    /** Noir note of the selected pixels. */
    public static native void applyNoirNotePartial(int[] in, byte[] mask, int[] out, int[] grain, int width,
            int height, Rect rect);

    /**
     * Impressionist: dabs of bright, posterised paint on canvas.
     * {@code strokes}: its red moves each sample across and its blue moves it
     * down, by up to about 1 % of the shorter side (mid-grey: no move);
     * {@code canvas}: its brightness shades the paint (canvas weave).
     */
    public static native void applyImpressionist(int[] in, int[] out, int[] strokes, int[] canvas, int width,
            int height);

    /** Impressionist of the selected pixels. */
    public static native void applyImpressionistPartial(int[] in, byte[] mask, int[] out, int[] strokes,
            int[] canvas, int width, int height, Rect rect);

    /**
     * Stucchevole: a sugary candy-pastel postcard. {@code glow} is screened
     * over (mostly black, light where it glows), {@code paper} shades it,
     * {@code sparkle} (mostly black) is added as glitter.
     */
    public static native void applyStucchevole(int[] in, int[] out, int[] glow, int[] paper, int[] sparkle,
            int width, int height);

    /** Stucchevole of the selected pixels. */
    public static native void applyStucchevolePartial(int[] in, byte[] mask, int[] out, int[] glow, int[] paper,
            int[] sparkle, int width, int height, Rect rect);

    // (end of filters)

    // ---- geometry: rotate, flip, straighten, crop, mirror, twirl, sphericity ----

    // Pictures are changed whole, alpha included. Angles are whole degrees,
    // taken through the engine's fixed angle (90 degrees is a little past an
    // exact quarter turn); a positive angle turns the picture clockwise on
    // screen in runRotateN and the straighten methods.

    /** Mirror: reflect across a horizontal line at row {@code pos}; the height changes. */
    public static final int MIRROR_AXIS_UP_DOWN = 0xE001;
    /** Mirror: reflect across a vertical line at column {@code pos}; the width changes. */
    public static final int MIRROR_AXIS_LEFT_RIGHT = 0xE002;
    /** With {@link #MIRROR_AXIS_LEFT_RIGHT}: keep columns 0..pos and reflect them to the right. */
    public static final int MIRROR_KEEP_LEFT = 0xE003;
    /** With {@link #MIRROR_AXIS_LEFT_RIGHT}: keep columns pos..width-1 and reflect them to the left. */
    public static final int MIRROR_KEEP_RIGHT = 0xE004;
    /** With {@link #MIRROR_AXIS_UP_DOWN}: keep rows 0..pos and reflect them downward. */
    public static final int MIRROR_KEEP_TOP = 0xE005;
    /** With {@link #MIRROR_AXIS_UP_DOWN}: keep rows pos..height-1 and reflect them upward. */
    public static final int MIRROR_KEEP_BOTTOM = 0xE006;

    /**
     * Flips and turns {@code pixels} (width * height, changed in place): the
     * horizontal flip, then the vertical one, then the rotation code: 0 none,
     * 1 quarter turn clockwise, 2 half turn, 3 quarter turn counter-clockwise
     * (after 1 and 3 the picture is {@code height} wide and {@code width}
     * tall), 4 flips only; code 4 without a flip leaves an all-zero picture.
     * Returns SUCCESS, ERR_NULL (null or short array, bad size, code outside
     * 0..4: the picture is untouched) or ERR_ALLOC.
     */
    public static native int runRotateFlip(int[] pixels, int width, int height, int rotation, boolean flipHorizontal,
            boolean flipVertical);

    /**
     * Turns the rectangle of {@code src} (srcWidth x srcHeight, with its mask
     * {@code srcMask} of the same size) by {@code angle} degrees about its
     * centre into {@code dst} and {@code dstMask} (dstWidth x dstHeight, owned
     * and sized by the caller, usually {@link #getRotateWidth} x
     * {@link #getRotateHeight} of the rectangle). The rectangle's width over
     * {@code divisorX} (height over {@code divisorY}) is the number of source
     * pixels an output pixel steps: pass the rectangle's own size for a 1:1
     * turn, the output size to fit the rectangle to the output. Output pixels
     * and mask bytes whose source lies outside the picture keep their
     * contents. The rectangle is clipped to the picture. Returns SUCCESS,
     * ERR_NULL (null or short array, bad size, a divisor of 0, an empty
     * rectangle or one outside the picture) or ERR_ALLOC.
     */
    public static native int runRotateN(int[] src, byte[] srcMask, int[] dst, byte[] dstMask, int srcWidth,
            int srcHeight, int dstWidth, int dstHeight, int angle, Rect rect, int divisorX, int divisorY);

    /** Width of the bounding box of a width x height picture turned by {@code angle} degrees. */
    public static native int getRotateWidth(int width, int height, int angle);

    /** Height of the bounding box of a width x height picture turned by {@code angle} degrees. */
    public static native int getRotateHeight(int width, int height, int angle);

    /**
     * Straighten: {@code in} turned by {@code angle} degrees and scaled about
     * its centre into {@code out} of the same size; a scale below 1 zooms in
     * (choose one that hides the corners). Output pixels whose source lies
     * outside the picture are not written.
     */
    public static native void runStraighten(int[] in, int[] out, int width, int height, int angle, float scale);

    /**
     * Straighten preview while dragging: {@code in} (srcWidth x srcHeight)
     * turned by {@code angle} and shown {@code scale} times as large, centred
     * in the canvas {@code out} (dstWidth x dstHeight), which is cleared to 0
     * first. Only the turned picture's box is drawn; its vertical extent is
     * that of the unscaled picture.
     */
    public static native void runStraightenOnMove(int[] in, int srcWidth, int srcHeight, int[] out, int dstWidth,
            int dstHeight, int angle, float scale);

    /**
     * Straighten when the finger is lifted: the canvas {@code out}
     * (dstWidth x dstHeight) is cleared to 0 and only its centred
     * srcWidth x srcHeight area is drawn, {@code in} turned by {@code angle}
     * and sampled {@code scale} source pixels an output pixel.
     */
    public static native void runStraightenOnUp(int[] in, int srcWidth, int srcHeight, int[] out, int dstWidth,
            int dstHeight, int angle, float scale);

    /**
     * Crops {@code pixels} (width * height) to the rectangle (inclusive,
     * clipped to the picture): the cropped rows are packed at the start of the
     * array with row length right - left + 1, the rest is set to 0. An empty
     * rectangle leaves an all-zero picture. Returns SUCCESS, ERR_NULL (null or
     * short array, bad size, rectangle outside the picture) or ERR_ALLOC.
     */
    public static native int runCrop(int[] pixels, int width, int height, Rect rect);

    /** Width of the mirrored picture: 2 * (pos + 1) keeping the left, 2 * (width - pos) keeping the right, else width. */
    public static native int getMirrorOutwidth(int width, int pos, int mode, int axis);

    /** Height of the mirrored picture: 2 * (pos + 1) keeping the top, 2 * (height - pos) keeping the bottom, else height. */
    public static native int getMirrorOutheight(int height, int pos, int mode, int axis);

    /**
     * Mirror: keeps one side of the line at {@code pos} and reflects it onto
     * the other into {@code out}, which must hold
     * {@link #getMirrorOutwidth} x {@link #getMirrorOutheight} pixels (a
     * picture of that size). A line outside the picture copies it unchanged.
     * Returns SUCCESS, or ERR_NULL for a null or short array, a bad size, an
     * unknown axis or a mode of the other axis.
     */
    public static native int runMirror(int[] in, int[] out, int width, int height, int pos, int mode, int axis);

    /**
     * Twirl: {@code out} receives a copy of {@code in}, then the pixels of the
     * rectangle inside the circle are turned by an angle fading from
     * {@code angle} degrees (-360..360) at the centre to none at the rim,
     * colours interpolated, alpha kept. {@code half} computes every second
     * row and column for a fast preview. Returns SUCCESS; ERR_NULL for a bad
     * array, size or rectangle, a centre outside the picture, a radius below
     * 1 or an angle out of range (output untouched). Angle 0 only copies, and
     * returns a value that is not a result code (treat any result after angle
     * 0 as success).
     */
    public static native int runTwirl(int[] in, int[] out, int width, int height, int centerX, int centerY,
            int radius, int angle, Rect rect, boolean half);

    /**
     * Sphericity: {@code out} receives a copy of {@code in}, then the circle
     * (worked on about 1.4 times the given radius) is bulged (strength 1..100)
     * or pinched (-100..-1) over the rectangle. {@code half} as for twirl.
     * Returns SUCCESS, or ERR_NULL as for twirl (strength outside -100..100).
     */
    public static native int runSphericity(int[] in, int[] out, int width, int height, int centerX, int centerY,
            int radius, int strength, Rect rect, boolean half);


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
    //
    // Sampling on unusual shapes. The reduction samples a row with the
    // height's step and the rows with the width's step; the two are equal on
    // ordinary pictures but not where the short side is only a few times the
    // reduction factor (4000 x 40 samples its rows 20 pixels apart for a
    // 16-pixel reduction), so such pictures come back slightly stretched.
    // The reduced picture is read back with an 11-bit index, so a side above
    // 32767 pixels wraps onto the start of the reduced picture. Both are kept
    // as the blur has always computed them. A thin strip whose short side the
    // reduction would empty (below 2, 4, 8 or 16 pixels) is reduced less, with
    // each side's own step and a full index, and keeps its place at any length.
    // In tilt-shift, the sharp band's weight is 2^20 / D truncated times 256
    // (D half the distance from the band to the farther edge), so on pictures
    // of more than about 100,000 rows the band itself takes some blur.

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
     * Out-focus blur of the whole picture at level 0..7 (a Gaussian-looking
     * blur of radius 3, 7, 15, 31, 41, 49, 55, 63 pixels, sigma about a third
     * of it; higher levels as 7, negative as 0). Returns SUCCESS, ERR_NULL or
     * ERR_EFFECT.
     */
    public static native int applyOutfocusBlur(int[] in, int[] out, int width, int height, int level);

    // (end of blur and depth of field)

    // ---- object tools: eraser, copy and paste ----

    /** Eraser status: idle or finished. */
    public static final int ERASER_IDLE = 53249;
    /** Eraser status: paused by {@link #stopEraser}. */
    public static final int ERASER_PAUSED = 53250;
    /** Eraser status: running. */
    public static final int ERASER_RUNNING = 53251;
    /** Eraser control refused: the eraser is idle. */
    public static final int ERR_ERASER_IDLE = 40965;
    /** Restart refused: the eraser runs and is not paused. */
    public static final int ERR_ERASER_NOT_PAUSED = 40966;
    /** A run is already going on ({@link #runEraser}), or the run ended on {@link #exitEraser}. */
    public static final int ERR_ERASER_BUSY = 40967;

    /**
     * Removes the object under the mask: the pixels of {@code image} whose mask
     * byte is 1 inside {@code rect} (the whole picture for an empty rectangle)
     * are filled, patch by patch from the outside in, with patches of the
     * surrounding picture. The image is changed in place and keeps each
     * pixel's alpha; the mask is only read. Runs on the calling thread for as
     * long as the fill takes; every 4 rounds the partly filled picture is
     * committed to {@code image}, so another thread may show the progress.
     * While it runs, another thread may call {@link #stopEraser},
     * {@link #reStartEraser}, {@link #exitEraser} and {@link #getEraserStatus}.
     * The rectangle is first widened to even left and top and odd right and
     * bottom bounds (within the picture), so selected pixels one row or column
     * outside the caller's rectangle may be filled too.
     *
     * @return SUCCESS when done, ERR_ERASER_BUSY when a run is already going on
     *     (nothing touched) or when {@link #exitEraser} ended this run early (the
     *     image holds what was filled so far), ERR_ALLOC, or ERR_NULL for
     *     refused arguments
     */
    public static native int runEraser(int[] image, byte[] mask, int width, int height, Rect rect);

    /**
     * Overwrites the eraser status word (ERASER_IDLE, ERASER_PAUSED,
     * ERASER_RUNNING). A run going on marks its own status again at its next
     * round (a paused run on every turn of its wait), so an overwrite never
     * leaves a running or paused eraser beyond the reach of
     * {@link #reStartEraser} and {@link #exitEraser}.
     */
    public static native void setEraserStatus(int status);

    /** The eraser status word: ERASER_IDLE, ERASER_RUNNING or ERASER_PAUSED. */
    public static native int getEraserStatus();

    /** Pauses the running eraser at its next round: SUCCESS, or ERR_ERASER_IDLE. */
    public static native int stopEraser();

    /** Resumes a paused eraser: SUCCESS, ERR_ERASER_IDLE, or ERR_ERASER_NOT_PAUSED. */
    public static native int reStartEraser();

    /** Ends the running eraser at its next round (it returns ERR_ERASER_BUSY): SUCCESS, or ERR_ERASER_IDLE. */
    public static native int exitEraser();

    /**
     * Closes notches in an object mask (1 object, 2 and 3 its border band, 0
     * outside) inside {@code rect}, {@code iterations} times: a 0 pixel with at
     * least four of its eight neighbours equal to 1 becomes 1. The rectangle,
     * clipped to the picture, is written back into {@code rect}.
     *
     * @return SUCCESS, or ERR_NULL for refused arguments
     */
    public static native int setObjectRegion(byte[] mask, int width, int height, Rect rect, int iterations);

    /**
     * Recolours, in place, the pixels of {@code object} (width x height) whose
     * mask byte is 1 to the colour balance of the whole {@code target} picture;
     * the means of the object are taken over every non-zero mask byte. Alpha is
     * kept; a black object or target keeps its colours.
     *
     * @return SUCCESS, or ERR_NULL for refused arguments
     */
    public static native int runCopyObject(int[] object, byte[] mask, int width, int height, int[] target,
            int targetWidth, int targetHeight);

    /**
     * Writes into {@code out} (width x height) the picture with the object
     * (objWidth x objHeight, with its mask of the same size) pasted with its
     * top-left corner at ({@code rect.left}, {@code rect.top}): object pixels of
     * mask 1 and non-zero alpha are recoloured to the picture's colour balance,
     * and those next to the border band (mask 2 or 3) are blended with the
     * background. Parts reaching outside the picture are left out.
     *
     * @return SUCCESS, or ERR_NULL for refused arguments
     */
    public static native int runCopyPaste(int[] object, int[] picture, byte[] mask, int[] out, int objWidth,
            int objHeight, int width, int height, Rect rect);

    /**
     * Writes into {@code out} the background with every object pixel of mask 1
     * and non-zero alpha copied unchanged to ({@code rect.left} + x,
     * {@code rect.top} + y). Parts reaching outside the picture are left out.
     *
     * @return SUCCESS, or ERR_NULL for refused arguments
     */
    public static native int pasteObject(int[] object, int[] background, byte[] mask, int[] out, int objWidth,
            int objHeight, int width, int height, Rect rect);

    /**
     * Draws the region {@code rect} of {@code src} scaled down by {@code scale}
     * (source pixels per destination pixel) into {@code dst}, at the scaled
     * position: destination rows round(top / scale) .. round(bottom / scale)
     * inclusive, columns round(left / scale) up to but not including
     * round(right / scale). Only pixels inside both pictures are touched.
     *
     * @return 0
     */
    public static native int drawObject(int[] dst, int dstWidth, int dstHeight, int[] src, int srcWidth,
            int srcHeight, float scale, Rect rect);

    // (end of object tools)

    // ---- face analysis ----

    /** Ints a face takes in the report of {@link #analyzeFaces}. */
    public static final int FACE_REPORT_INTS = 11;

    /**
     * Finds the faces of a photo with their eyes and mouths. {@code report} receives, for each face
     * (at most {@code report.length / FACE_REPORT_INTS}, and at most 20): the face box x, y, width,
     * height; 1 when the eyes were found, else 0; the first eye's x, y; the second eye's x, y; the
     * mouth centre x, y (-1 when not found), all in photo pixels. {@code mode} 1 finds upright
     * faces, 3 also faces rolled by about 45 degrees. Returns the number of faces (0..20), or
     * ERR_NULL for refused arguments, ERR_ALLOC when memory is short.
     */
    public static native int analyzeFaces(int[] image, int width, int height, int mode, int[] report);

    // ---- portrait retouching and red-eye ----

    // Red-eye: the user touches a red pupil; the square of half side
    // `radius` around the touch point (clipped to the picture) is searched.

    /**
     * Removes the red of a flash-lit pupil around (x, y), in place: the red
     * pixels of the square are found by colour ratios, the largest connected
     * red area is kept, widened by one pixel, and each of its pixels gets the
     * red (51 R + 614 G + 307 B) >> 10 (green, blue and alpha kept). Fewer
     * than 5 red marks, a square of one row or a touch outside the picture
     * change nothing. Refused arguments (null or short array, bad size) are
     * logged and change nothing.
     *
     * @param image  width * height ARGB pixels, changed in place
     * @param radius half side of the searched square, in pixels
     */
    public static native void removeRedeye(int[] image, int width, int height, int x, int y, int radius);

    /**
     * Quick preview of {@link #removeRedeye}: every pixel of the square with
     * R > 2.5 G is written into {@code out} with the red 0.05 R + 0.6 G + 0.3 B
     * (no area analysis); every other pixel of {@code out} is left as the
     * caller passed it, so pass a copy of {@code in}.
     *
     * @param in  width * height ARGB pixels, only read
     * @param out width * height ARGB pixels
     */
    public static native void removeRedeyePreview(int[] in, int[] out, int width, int height, int x, int y,
            int radius);

    /** Automatic red-eye removal is not offered: does nothing, neither array is touched. */
    public static native void removeRedeyeAuto(int[] in, int[] out, int width, int height);

    // Portrait session: initPortrait analyses one photo (faces, eyes, mouths)
    // and keeps the result until finishPortrait, so the beautifier, lighting
    // and out-focus can be applied and re-applied without detecting again.
    // One session at a time, kept in the library (not locked: callers
    // serialise these methods). Every method that works on the session
    // returns ERR_NULL when none is open. Full-size forms take
    // (in, out, width, height, ...) and write all of out; preview forms take
    // (in, width, height, preview, previewWidth, previewHeight, ...) and
    // reduce the full-size result by nearest neighbour with one Q12 step,
    // (int) ((float) (width << 12) / previewWidth), for both axes (preview
    // pixels whose source falls outside the photo are left as they were).
    // Arrays: in holds width * height pixels and is only read; out
    // width * height; preview previewWidth * previewHeight; the caller owns
    // them all. Levels are not clamped unless said.

    /** Status returned by {@link #getportraitstatus} while a session is open. */
    public static final int PORTRAIT_OPEN = 1;

    /**
     * Opens a portrait session on {@code image} (only read): applies the
     * settings as {@link #setFacebeauty} does, finds faces, eyes and mouths,
     * and reports them through {@code listener.setFaceInfo(faceCount, faces)}
     * (9 ints per face; see {@link FaceInfoListener}) before returning. A
     * session still open is released and replaced.
     *
     * @param maxFace  most faces to keep, 1..10 (anything else means 10)
     * @param level    beautifier level 1..5 (else the setting stays)
     * @param option   detection 1..4: 1 and 2 upright faces, 3 and 4 also faces
     *                 turned by 45 degrees (else the setting stays)
     * @param listener receives the faces; null to skip the report
     * @return SUCCESS; ERR_NULL for a refused array or size (nothing
     *         opened); ERR_ALLOC when memory ran
     *         out (an open session stays as it was)
     */
    public static native int initPortrait(int[] image, int width, int height, int maxFace, int level, int option,
            FaceInfoListener listener);

    /** Closes the portrait session and frees its analysis; harmless without one. */
    public static native void finishPortrait();

    /** {@link #PORTRAIT_OPEN} while a session is open, else 0. */
    public static native int getportraitstatus();

    /** The detection setting 1..4 (default 3). */
    public static native int getDetectOption();

    /** The beautifier level setting 1..5 (default 3). */
    public static native int getBeautyLevel();

    /** The most faces a session keeps, 1..10 (default 2). */
    public static native int get_maxFaceCnt();

    /**
     * Settings for the next session (they outlive sessions): maxFace 1..10
     * (anything else becomes 10), level 1..5 and option 1..4 (out of range:
     * the old value stays).
     */
    public static native void setFacebeauty(int maxFace, int level, int option);

    /**
     * One-shot beautifier, no session needed: {@code out} gets {@code in} with
     * every face found (current settings) smoothed; when no face is found the
     * whole picture is brightened by a fixed tone curve instead. Alpha kept.
     *
     * @return SUCCESS, ERR_ALLOC, or ERR_NULL for refused arguments
     */
    public static native int runFacebeauty(int[] in, int[] out, int width, int height);

    /**
     * Skin beautifier on every face of the session: {@code out} = {@code in}
     * with the skin of each face smoothed, strongest at the face centre.
     * Level 1..5 is stored in the session for later calls.
     *
     * @param level 0 (out untouched), 1 light .. 5 strongest
     * @return SUCCESS (out untouched when the session has no face); ERR_NULL
     *         for a level outside 0..5, no session or refused arguments;
     *         ERR_ALLOC when memory ran short while smoothing (out then holds
     *         the photo with the faces smoothed before that)
     */
    public static native int runBeautyInPortrait(int[] in, int[] out, int width, int height, int level);

    /**
     * As {@link #runBeautyInPortrait} for the face {@code face} (0-based, in
     * the order reported by initPortrait); an index outside the faces returns
     * SUCCESS with out untouched.
     */
    public static native int runBeautyInPortraitSingleFace(int[] in, int[] out, int width, int height, int level,
            int face);

    /**
     * Preview of {@link #runBeautyInPortrait}: level 0 writes {@code in}
     * reduced; 1..5 the beautified photo reduced (no face: preview untouched).
     *
     * @return SUCCESS, ERR_ALLOC, or ERR_NULL (level outside 0..5, no session,
     *         refused arguments, a preview array shorter than
     *         previewWidth * previewHeight)
     */
    public static native int runBeautyInPortraitPreview(int[] in, int width, int height, int[] preview,
            int previewWidth, int previewHeight, int level);

    /** Preview of {@link #runBeautyInPortraitSingleFace}. */
    public static native int runBeautyInPortraitSingleFacePreview(int[] in, int width, int height, int[] preview,
            int previewWidth, int previewHeight, int level, int face);

    /**
     * Lighting: {@code out} = {@code in} with a round area around each face
     * (radius the larger side of the face box) lightened or darkened by
     * 3 * level - 30 at its centre: 10 neutral (exact copy), 20 lightens by
     * 30, 0 darkens by 30.
     *
     * @return SUCCESS, or ERR_NULL for no session or refused arguments
     */
    public static native int runLightenInPortrait(int[] in, int[] out, int width, int height, int level);

    /** Lighting of one face; an index outside the faces gives the plain copy. */
    public static native int runLightenInPortraitSingleFace(int[] in, int[] out, int width, int height, int level,
            int face);

    /** Preview of {@link #runLightenInPortrait}; level 10 writes nothing. SUCCESS, ERR_ALLOC or ERR_NULL. */
    public static native int runLightenInPortraitPreview(int[] in, int width, int height, int[] preview,
            int previewWidth, int previewHeight, int level);

    /** Preview of {@link #runLightenInPortraitSingleFace}; level 10 writes nothing. */
    public static native int runLightenInPortraitSingleFacePreview(int[] in, int width, int height, int[] preview,
            int previewWidth, int previewHeight, int level, int face);

    /**
     * Out-focus: the photo blurred at {@code strength} (1..7, as
     * {@link #applyBlur}) except for a sharp area around each face and the
     * body below it, with soft edges. Mixed pixels become opaque. Strength 0
     * leaves out untouched.
     *
     * @return SUCCESS, ERR_ALLOC, ERR_EFFECT for a negative strength, or
     *         ERR_NULL for no session or refused arguments
     */
    public static native int runOutfocusInPortrait(int[] in, int[] out, int width, int height, int strength);

    /**
     * Preview of out-focus with the faster out-focus blur (strength 0..7:
     * radius 3, 7, 15, 31, 41, 49, 55, 63 pixels). The photo is reduced
     * first (nearest neighbour, the step of the other previews) and
     * out-focused at the preview's scale: radius and faces divided by the
     * step, the radius at least 1. It costs what it shows.
     *
     * @return SUCCESS, ERR_ALLOC, ERR_EFFECT (negative strength or the blur
     *         failed), or ERR_NULL
     */
    public static native int runOutfocusInPortraitPreview(int[] in, int width, int height, int[] preview,
            int previewWidth, int previewHeight, int strength);

    // (end of portrait retouching and red-eye)

    // ---- backlight correction ----
    // A dark subject in front of a bright sky or window is brightened while
    // the bright background stays nearly as it was. Sequence: autoBLCInit
    // analyses the picture once; applyGammaTransformPreview and applyBLCSave
    // render the correction at a strength as often as wanted; DeInitBLC frees
    // the analysis. The analysis is kept in the library between calls (not
    // locked: callers serialise these methods). The caller owns every array.

    /**
     * Analyses a picture for backlight correction and keeps the result,
     * replacing any earlier analysis (its memory is freed).
     *
     * @param in     the picture, width * height ARGB pixels (only read)
     * @param width  picture width, positive
     * @param height picture height, positive
     * @return SUCCESS; ERR_NULL for a null or too short array or a bad size
     *         (the earlier analysis is kept); ERR_ALLOC when memory ran out
     */
    public static native int autoBLCInit(int[] in, int width, int height);

    /**
     * Renders the correction quickly for display. The picture should show the
     * analysed scene and may be a reduced copy of it (any size: the analysis
     * is scaled). The per-pixel weights of this picture are kept, so further
     * calls with the same picture and another strength only redo the tone
     * mapping. Gives exactly the pixels applyBLCSave gives for the same input.
     *
     * @param in       the picture, width * height ARGB pixels (only read)
     * @param out      receives width * height pixels; alpha from the input; may be {@code in}
     * @param width    picture width, positive
     * @param height   picture height, positive
     * @param strength 0..100 (clamped): 0 unchanged, 100 full correction; a
     *                 picture that does not look backlit changes little at any strength
     * @return SUCCESS; ERR_NULL when autoBLCInit has not succeeded since the
     *         last DeInitBLC, or for a null or too short array or a bad size
     *         (nothing written); ERR_ALLOC when memory ran out (nothing written)
     */
    public static native int applyGammaTransformPreview(int[] in, int[] out, int width, int height, int strength);

    /**
     * Renders the correction of the full-size picture; arguments and result
     * codes as {@link #applyGammaTransformPreview}. Keeps nothing.
     */
    public static native int applyBLCSave(int[] in, int[] out, int width, int height, int strength);

    /** Frees the analysis and the preview weights (each that is present). Returns 0; harmless when nothing is held. */
    public static native int DeInitBLC();

    // (end of backlight correction)

    // ---- saved regions ----------------------------------------------------

    // Unlike the region methods, the saved-region methods take an empty
    // rectangle (right < left or top > bottom) as an empty region, not as the
    // whole picture: storing it saves an empty region (a saved state that holds
    // nothing), and recovering into it, or recovering an empty region, writes
    // nothing and returns 0. A rectangle reaching outside the picture is
    // clipped to it; one wholly outside is refused with ERR_NULL.

    /**
     * Saves the rectangle of the mask (row length width), replacing the saved
     * mask; an empty rectangle saves an empty region. Returns 0, ERR_NULL for
     * refused arguments (the saved mask stays) or ERR_ALLOC.
     */
    public static native int storeMask(byte[] mask, int width, int height, Rect rect);

    /** Saves the rectangle of the picture, replacing the saved object; as {@link #storeMask}. */
    public static native int storeObject(int[] image, int width, int height, Rect rect);

    /**
     * Copies the saved mask back into the rectangle, at most the saved
     * region's width and height from its top-left corner; -1 when none is
     * saved; nothing for an empty rectangle.
     */
    public static native int recoverMask(byte[] mask, int width, int height, Rect rect);

    /** Copies the saved object back into the rectangle; as {@link #recoverMask}. */
    public static native int recoverObject(int[] image, int width, int height, Rect rect);

    /** Frees the saved mask. */
    public static native void deleteStoredMask();

    /** Frees the saved object. */
    public static native void deleteStoredObject();

    /** The effect library's version text. */
    public static native String LibVersion();

    // ---- selection tools: edge-snapping lasso, tap-to-select, refine ----
    //
    // The lasso is a session: selectionStart keeps a copy of the picture and
    // computes its edge cost once; each tap adds a point, and between two
    // consecutive points the outline follows the strongest edges (the cheapest
    // path over the edge cost within a band around the straight segment).
    // Outline coordinates are pixel corners: corner (x, y) is the top-left
    // corner of pixel (x, y), corners run 0..width and 0..height, and the
    // outline runs along pixel edges, so a closed outline selects whole pixels.
    // A tap is snapped to the strongest edge corner within 2 pixels. Points to
    // remove or move are found within 10 pixels of where they were tapped or
    // snapped to. Pictures above 1.1 megapixels are searched on a reduced copy
    // first and refined at full size near that path. A refused call (no
    // session, a point outside the picture: ERR_NULL; no point there:
    // ERR_NO_POINT) or one that ran short of memory (ERR_ALLOC) changes
    // nothing. The session lives until selectionFinish or the next
    // selectionStart; callers must not use it from two threads at once.

    /** A linked point to be removed or moved was not found (the list is empty or no point is near). */
    public static final int ERR_NO_POINT = 40968;
    /** {@link #selectTap} mode: the tapped region replaces the selection. */
    public static final int SELECT_REPLACE = 0;
    /** {@link #selectTap} mode: the tapped region is added to the selection. */
    public static final int SELECT_ADD = 1;
    /** {@link #selectTap} mode: the tapped region is taken out of the selection. */
    public static final int SELECT_SUBTRACT = 2;

    /**
     * Starts a lasso selection on a picture, ending any earlier one. SUCCESS,
     * ERR_NULL (null or short array, bad size), or ERR_ALLOC (no session is
     * left then).
     */
    public static native int selectionStart(int[] image, int width, int height);

    /**
     * Appends the point tapped at pixel (x, y) and joins it to the previous
     * point along the picture's edges. Returns the new outline segment's
     * length in steps (0 for the first point; always below 40960), or
     * ERR_NULL (no session, or the point is outside the picture) or ERR_ALLOC.
     */
    public static native int selectionAddPoint(int x, int y);

    /**
     * Removes the point nearest (x, y) within 10 pixels and joins its two
     * neighbours by a new path. SUCCESS, ERR_NO_POINT (the list is empty or no
     * point is that near), ERR_NULL (no session, (x, y) outside the picture),
     * ERR_ALLOC.
     */
    public static native int selectionRemovePoint(int x, int y);

    /**
     * Moves the point nearest (x, y) within 10 pixels to (toX, toY), snapping
     * it again and recomputing the segments on both sides. Codes as for
     * {@link #selectionRemovePoint}; ERR_NULL also for a destination outside
     * the picture.
     */
    public static native int selectionMovePoint(int x, int y, int toX, int toY);

    /** The number of points in the list (0 without a session). */
    public static native int selectionPointCount();

    /** The number of corners in the open outline (0 without a session or points). */
    public static native int selectionOutlineLength();

    /**
     * Writes the open outline (the first point, then the path to each later
     * point, in order) as x, y pairs of corner coordinates into {@code xy},
     * which must hold 2 * {@link #selectionOutlineLength()} ints. SUCCESS, or
     * ERR_NULL (no session, null or short array).
     */
    public static native int selectionGetOutline(int[] xy);

    /**
     * Closes the outline with a path from the last point back to the first
     * and writes the selection into {@code mask} (width * height bytes of the
     * session's picture size): 1 inside, 0 outside (non-zero winding for an
     * outline that crosses itself). {@code bounds} receives the bounding
     * rectangle of the selected pixels, or the empty rectangle (0, -1, 0, -1)
     * when none is; note that an empty rectangle means the whole picture to
     * the region methods. The session stays open, so points can still be
     * moved and the outline closed again. SUCCESS, ERR_NULL (no session,
     * fewer than 3 points, another size, null or short mask), ERR_ALLOC.
     */
    public static native int selectionClose(byte[] mask, int width, int height, Rect bounds);

    /** Ends the lasso session and frees its state. Always SUCCESS. */
    public static native int selectionFinish();

    /**
     * Tap-to-select: the 4-connected region of similar colour around pixel
     * (x, y), combined with {@code mask} by {@code mode} ({@link #SELECT_REPLACE},
     * {@link #SELECT_ADD}, {@link #SELECT_SUBTRACT}). With tolerance t in
     * 0..100 (clamped) a neighbour joins when its summed |dR| + |dG| + |dB| to
     * the pixel it is reached from is below 1 + (38 t + 50) / 100 (20 at 50,
     * the eraser's segmentation step; 1 at 0: equal colours only) and its
     * summed difference to the tapped pixel is below six times that. The
     * mask comes back as 1 and 0 (other byte values count as unselected);
     * {@code bounds} receives the bounding rectangle of the result. SUCCESS,
     * ERR_NULL (null or short arrays, a point outside, a bad mode; nothing is
     * written), ERR_ALLOC (the mask is unchanged).
     */
    public static native int selectTap(int[] image, byte[] mask, int width, int height, int x, int y, int tolerance,
            int mode, Rect bounds);

    /**
     * Grows the selection by {@code pixels} (every pixel within that
     * Euclidean distance of a selected one) or, for a negative value, shrinks
     * it (a pixel stays when no unselected pixel lies within the distance;
     * the picture's border does not shrink it). 0 only turns the mask into 1
     * and 0. {@code bounds} receives the result's bounding rectangle.
     * SUCCESS, ERR_NULL, ERR_ALLOC (the mask is unchanged).
     */
    public static native int selectGrow(byte[] mask, int width, int height, int pixels, Rect bounds);

    /**
     * Fills the holes of a selection: every unselected 4-connected region that
     * does not reach the picture's border becomes selected. {@code bounds}
     * receives the result's bounding rectangle. SUCCESS, ERR_NULL, ERR_ALLOC.
     */
    public static native int selectFillHoles(byte[] mask, int width, int height, Rect bounds);
}
