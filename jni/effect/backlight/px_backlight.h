// Backlight correction: brightens a dark subject in front of a bright sky or
// window while leaving the bright background nearly as it was. The design is
// described at the top of px_backlight.cpp.
//
// Life cycle: px_blc_init analyses a picture once and keeps the result (the
// analysis handle); px_blc_preview and px_blc_save render the correction at a
// strength from it; px_blc_deinit frees both handles. Calls may come in any
// order: rendering without an analysis does nothing and returns 40962, a
// second init replaces the analysis, deinit without init is harmless.
// The state is process-wide and not locked: callers serialise the calls.
#pragma once

#include "effect/px_types.h"

// Analyses an ARGB picture. Returns PX_OK, PX_ERR_NULL (no picture or a
// size that is not positive) or PX_ERR_ALLOC; on failure the previous
// analysis, if any, is kept.
int px_blc_init(const int* argb, int width, int height);

// Renders the correction of `in` into `out` (both width * height ARGB pixels;
// they may be the same array). The picture should show the analysed scene; it
// may be of another size (a display copy): the analysis is scaled to it.
// strength 0..100 (clamped): 0 copies the picture, 100 is the full
// correction. Alpha is kept from the input. Returns PX_OK, PX_ERR_NULL (no
// analysis, no arrays, bad size; nothing written) or PX_ERR_ALLOC.
int px_blc_save(const int* in, int* out, int width, int height, int strength);

// As px_blc_save, with the per-pixel subject weights kept (the preview
// handle) for the next preview of the same picture, so that moving the
// strength slider only redoes the tone mapping. Same pixels as px_blc_save.
int px_blc_preview(const int* in, int* out, int width, int height, int strength);

// Frees each handle that is present and clears it. Returns 0.
int px_blc_deinit();

// What the analysis found (for tests, measurement and the log).
struct px_blc_info {
  int ready;          // 1 when an analysis is held
  int width, height;  // analysed picture
  int factor;         // reduction factor of the analysis grid
  int grid_w, grid_h;
  int threshold;      // luma splitting subject (<=) from background (>)
  int subject_mean, background_mean;
  int subject_permille;  // share of the grid in the subject class
  int score;             // 0..256: how backlit the picture looks
  int preview_cached;    // 1 when the preview handle holds weights
};
px_blc_info px_blc_get_info();

// Test hook: renders as px_blc_save but walks the rows in chunks of
// `band_rows` on the calling thread (the split must not change the result).
int px_blc_save_chunked(const int* in, int* out, int width, int height, int strength, int band_rows);
