// Touch tools and small whole-picture operations: lighten and darken
// brushes, pixelize (whole picture and as a brush), the colour splash
// session, invert and the two lens tints. Every pixel keeps its alpha.
//
// A brush of radius r centred on (cx, cy) covers the pixels with
// dx^2 + dy^2 < r^2 (strictly), inside the picture. The _with_preview forms
// also refresh the part of a smaller preview picture (same aspect ratio)
// that covers the changed box, by nearest-neighbour sampling.
#pragma once

#include "../px_types.h"

// Raises each channel by up to `strength` at the centre, falling off
// linearly in d^2 to nothing at the rim; never darkens. Radii above 2048 have
// no effect (the 22-bit falloff step rounds to 0).
void px_apply_lighten(int* image, int cx, int cy, int width, int height, int strength, int r);
void px_apply_lighten_with_preview(int* image, int cx, int cy, int width, int height, int* preview,
                                   int preview_width, int preview_height, int strength, int r);
// Full-picture darken: linear in the distance d (integer square root,
// rounded). Logs "px_apply_darken effect: Low memory" and changes nothing
// when its distance table cannot be allocated.
void px_apply_darken(int* image, int cx, int cy, int width, int height, int strength, int r);
// The lighten brush and the full-picture darken brush on sampled pixels:
// pixel (i, j) of `pixels` (rows `stride` ints apart, i < nx, j < ny) holds
// the photo pixel (xs[i], ys[j]) and changes exactly as that photo pixel
// would. A nearest-neighbour preview thus costs what it shows.
void px_apply_lighten_at(int* pixels, int stride, const int* xs, int nx, const int* ys, int ny, int cx, int cy,
                         int strength, int r);
void px_apply_darken_at(int* pixels, int stride, const int* xs, int nx, const int* ys, int ny, int cx, int cy,
                        int strength, int r);
// Preview darken: quadratic like the lighten brush; never lightens.
void px_apply_darken_with_preview(int* image, int cx, int cy, int width, int height, int* preview,
                                  int preview_width, int preview_height, int strength, int r);

// Cells of 2^shift pixels take their top-left pixel. A shift whose low byte
// is 32 or more makes the whole output the first input pixel. `in` may
// equal `out`.
void px_apply_pixelize(int* in, int* out, int width, int height, int shift);
// In place, on the cells within r >> shift cells (diamond distance) of the
// centre's cell, over the box from the cell origin of cx - r to the cell
// origin of cx + r (likewise in y).
void px_rub_pixelize(int* image, int width, int height, int shift, int cx, int cy, int r);
void px_rub_pixelize_with_preview(int* image, int width, int height, int* preview, int preview_width,
                                  int preview_height, int shift, int cx, int cy, int r);

// Colour splash session. Init keeps a copy of the colour picture (replacing
// and freeing any earlier one) and turns the picture grey, (R + 2G + B) / 4.
// Draw brings the kept colour back under the brush; recover restores the
// whole picture; finish frees the copy. Draw and recover do nothing without
// a kept copy of the same size. When the copy cannot be allocated, init
// leaves the picture in colour and keeps nothing.
void px_init_splash(int* image, int width, int height);
void px_set_gray_splash(int* in, int* out, int width, int height);
void px_draw_splash(int* image, int cx, int cy, int width, int height, int r);
void px_draw_splash_with_preview(int* image, int cx, int cy, int width, int height, int* preview,
                                 int preview_width, int preview_height, int r);
void px_recover_splash(int* image, int width, int height);
void px_finish_splash();
// True while a splash copy is kept (for tests and callers that check).
bool px_splash_active();

// 255 - c on every channel of the selected pixels (region rule of
// px_region.h). 40962 when in, mask or out is null, else 40960.
int px_apply_invert(int* in, unsigned char* mask, int* out, int width, int height, px_rect rect);

// Lens tints: a band along the picture edges (edge lens, up to half the
// longer side at size 100) or down from the top (top lens, the whole height
// at size 100) is pulled towards the fully saturated hue `level * 18`, fully
// at the border and not at all at the band's inner edge, where the picture is
// brighter than the tint. size 0..100. 40962 for a null picture or size above
// 100, else 40960; a band narrower than one pixel leaves the copy.
int px_control_edgelens(int* in, int* out, int width, int height, int level, int size);
int px_control_toplens(int* in, int* out, int width, int height, int level, int size);
