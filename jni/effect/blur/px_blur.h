// Selective blur, tilt-shift, miniature and out-focus blur.
//
// Both depth-of-field tools work on a copy of the picture reduced by a power
// of two (see px_blur_reduction_shift), blur it there with a small separable
// kernel and bring it back to full size with 5-bit bilinear interpolation.
// Full-size pictures are 0xAARRGGBB; reduced pictures are packed R, G, B
// bytes. A blur mask byte of 1 marks a pixel to blur (background); any other
// value keeps the pixel sharp (subject).
//
// State kept between calls (one set for the whole library, no lock; the
// caller serialises): the reduced picture, the reduced mask, the buffer for
// the blurred reduced picture, the reduced size, the tilt-shift reduction
// shift and the "whole picture" flag of the last selective-blur
// initialisation. Blur and tilt-shift share the reduced picture and the
// blurred buffer; px_init_tiltshift releases a selective-blur state first.
#pragma once

// ---- selective blur -----------------------------------------------------

// Releases any previous blur state, then keeps the reduced picture, the
// reduced mask and an empty blurred buffer. An empty rectangle (left > right
// or top > bottom) means the whole picture: the flag "all" is set and the
// caller's mask (when given) is filled with 1 while it is reduced and left
// all 0 afterwards. A null mask counts as all 1. Returns 40960, 40962 for a
// null picture or a size that is not positive, 40961 when the state could not
// be allocated (no state is then kept).
int px_Init_blur(const int* src, unsigned char* mask, int width, int height, int left, int right, int top,
                 int bottom);

// Blurs the kept reduced picture at `level` and composites it into `dst`
// (width x height; may differ from the initialised size). Does nothing when
// no blur state is kept. A null mask counts as all 1.
void px_make_blur_preview(const int* src, const unsigned char* mask, int* dst, int width, int height, int level);

// The full-quality selective blur with buffers of its own; of the kept state
// it only reads the "all" flag. An empty rectangle blurs the whole picture:
// the caller's mask (when given) is filled with 1 first and with 0 at the
// end. Returns 40960, 40962 or 40961 (nothing written).
int px_make_blur(const int* src, unsigned char* mask, int* dst, int width, int height, int level, int left,
                 int right, int top, int bottom);

// Frees the reduced picture, reduced mask and blurred buffer; harmless twice.
void px_destroy_blur();

// ---- tilt-shift and miniature ----------------------------------------------

// Releases a selective-blur state, then keeps the reduced picture and an
// empty blurred buffer. Returns 40960, 40962 or 40961 (no state kept).
int px_init_tiltshift(const int* src, int width, int height);

// Blurs the kept reduced picture and restores it into `dst` (width x height)
// with the sharp band of half height `halfBand` around row `center`. Does
// nothing when no reduced picture is kept.
void px_tiltshift_preview(const int* src, int* dst, int width, int height, int center, int halfBand);

// The full tilt-shift with buffers of its own; `src` may equal `dst`.
// Returns 40960, 40962 or 40961 (nothing written).
int px_apply_tiltshift(const int* src, int* dst, int width, int height, int center, int halfBand);

// Saturation 16 into dst, then tilt-shift of dst around the middle row with
// a half band of height / 8.
int px_apply_miniature(const int* src, int* dst, int width, int height);

// Frees the reduced picture and the blurred buffer; harmless twice.
void px_destroy_tiltshift();

// ---- out-focus ----------------------------------------------------------------

// The effect library's variable blur (effect 38) on ARGB pixels with the
// radius 3, 7, 15, 31, 41, 49, 55, 63 of level 0..7 (levels above 7 use 63,
// negative levels 3). Returns the effect library's result code.
int px_blur_outfocus(int* src, int* dst, int width, int height, int level);
// The radius of an out-focus level, and the variable blur at any radius
// (through the effect library, as px_blur_outfocus).
int px_blur_outfocus_radius(int level);
int px_blur_variable(int* src, int* dst, int width, int height, int radius);

// ---- steps, exposed for the tests --------------------------------------------

// Reduction shift k for a picture: max side > 3250: 4, > 1650: 3, > 850: 2,
// > 420: 1, else 0; lowered while a reduced side would be 0.
int px_blur_reduction_shift(int width, int height);

// Whether the shift had to be lowered (a thin strip). A thin strip is reduced
// with each side's own step and brought back without cutting the reduced
// index to 11 bits; other pictures keep the crossed steps and the 11-bit
// index, so a reduced side above 2048 (a side above 32767) wraps.
bool px_blur_thin(int width, int height);

// Point-sampled reduction of ARGB pixels into packed RGB (the step along a
// row is the height ratio, the step between rows the width ratio; a thin
// strip's steps are its own sides' ratios).
void scale_down_img(const int* src, int width, int height, unsigned char* dst, int dstWidth, int dstHeight);
// The same for mask bytes; a null mask counts as all 1.
void scale_down_depth(const unsigned char* src, int width, int height, unsigned char* dst, int dstWidth,
                      int dstHeight);

// Masked separable blur of a reduced picture at level 0..7 (higher levels use
// level 8's taps, negative ones level 0's). False when its scratch buffer
// could not be allocated (dst untouched).
bool make_gaussian_blur(const unsigned char* src, unsigned char* dst, const unsigned char* mask, int w, int h,
                        int level);
// Unmasked separable blur with taps -4..4. False on allocation failure.
bool make_tiltshift(const unsigned char* src, unsigned char* dst, int w, int h);

// Selective-blur compositing of the blurred reduced picture into dst. False,
// with dst untouched, when the working memory cannot be had.
bool run_blur(const int* src, const unsigned char* blurred, const unsigned char* mask,
              const unsigned char* reducedMask, int* dst, int width, int height, int w, int h);
// Tilt-shift restore of the blurred reduced picture into dst. False, with dst
// untouched, when the working memory cannot be had.
bool restore_tiltshift(const int* src, const unsigned char* blurred, int* dst, int width, int height, int w, int h,
                       int center, int halfBand);

// The "whole picture" flag of the last selective-blur initialisation.
int px_blur_all();
