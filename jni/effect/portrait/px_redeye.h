// Red-eye removal around a touched point. Pixels are 0xAARRGGBB; every
// changed pixel keeps its alpha, green and blue: only its red is replaced by
// (51 R + 614 G + 307 B) >> 10 (full form) or 0.05 R + 0.6 G + 0.3 B
// (quick preview).
#pragma once

// Finds the red pixels of the square of half side `radius` around (x, y)
// (clipped to the photo), keeps the largest connected red area, widens it by
// one pixel and corrects it in place. 1 when a pixel changed, else 0 (fewer
// than 5 red marks, a square of one row, a touch outside the photo, or
// memory ran out).
int px_remove_redeye_manual(int* argb, int width, int height, int x, int y, int radius);

// Quick preview: every pixel of the square inside the photo with
// R > 2.5 G is written recoloured from `src` into `dst`; other pixels of
// `dst` are not written. Returns 2 * radius + 1 (nothing done below 1).
int px_remove_redeye_manual_prev(const int* src, int* dst, int width, int height, int x, int y, int radius);

// The full correction of `src` in place, then the whole preview
// (previewWidth x previewHeight) refreshed from it by nearest neighbour:
// preview pixel (i, j) takes photo pixel ((i << 12) / f, (j << 12) / f) with
// the Q12 factor f = (float)(previewWidth << 12) / width truncated (64-bit); preview
// pixels whose source lies outside the photo are left as they were. Returns
// the full form's result.
int px_remove_redeye_manual_with_preview(int* src, int width, int height, int* dst, int previewWidth,
                                         int previewHeight, int x, int y, int radius);

// Automatic red-eye removal is not offered: does nothing at all.
void px_remove_redeye_auto(const int* src, int* dst, int width, int height);
