// Automatic tone correction and the levels remappings.
//
// px_process_hdr measures the luminance histogram in 101 percentage bins,
// flattens it by a logarithmic weighting into a 51-point tone curve and
// scales each pixel so its luminance follows the curve while its hue is
// kept. Pictures above 2,000,000 pixels take one cheap global adjustment
// instead. Four settings tune it; they live for the life of the library.
#pragma once

#include "../px_types.h"

// Stores each setting that lies in its range (threshold 0..127, cutoff
// 0..100, weights 300..8196; negative values are out of range); the others
// keep their value. Defaults: 70, 100, 1000, 5120.
void px_set_hdr(int threshold, int cutoff, int weight1, int weight2);
int px_get_threshold_hdr();
int px_get_cutoff_hdr();
int px_get_weight1_hdr();
int px_get_weight2_hdr();

// 512 * log2(v / 1024) rounded, sampled at v = 1024..1132 step 2, ..1232
// step 4, ..1536 step 8, ..2560 step 16, ..4096 step 32.
extern const int log_new_FIX[230];
// Piecewise linear interpolation of the table for 1024 <= v (1024 from 4096
// on; 0 below 1024, where the table has no samples).
int log_interp_FIX(const int* table, int v);
// ln(x / 1024) scaled by 1420 * 512 an octave, for 1 and 5..0x400000;
// 21811200 for every other x.
int log_e_FIX_new(int x);

// 40960; 40961 when a work buffer cannot be allocated (output untouched;
// the fast path for large pictures needs none). `in` may equal `out`.
int px_process_hdr(int* in, int* out, int width, int height);

// The least s = 218 R + 732 G + 74 B whose luminance percentage is 50 or
// more: the large-picture path counts bright pixels as s >= this.
int px_auto_adjust_bright_sum();

// Levels remappings over the whole picture. channel: 0 = red, green and
// blue, 1 = red, 2 = green, 3 = blue; other channels and alpha are copied.
// Input levels: low..high is stretched to 0..255 (nothing written unless
// low < high). Output levels: 0..255 is squeezed into low..high.
void changeHistogramByInput(int* in, int* out, int width, int height, int channel, int low, int high);
void changeHistogramByOutput(int* in, int* out, int width, int height, int channel, int low, int high);
