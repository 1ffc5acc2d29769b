// Hue rotation, red/green/blue balance, point colour and colour tone on
// 0xAARRGGBB pixels; every pixel keeps its alpha.
//
// Region forms (in, mask, out, width, height, levels..., rect) follow the
// region rule of px_region.h: the output is a copy of the input in which the
// selected pixels of the rectangle, or every pixel for an empty rectangle,
// are changed. The point colours and the colour tone work on the whole
// picture; `in` may equal `out` in every whole-picture form.
#pragma once

#include "../px_types.h"

// Hue shift table of the 0..100 scale, degrees (50 -> 0). About 3.6 degrees
// a step; the last entry is 179.
extern const int LUT_HueValue_Range100[101];

// Rotates the hue by level * 18 degrees (0 = exact copy). Greys stay grey.
// 40962 for a null picture, else 40960.
int px_control_hue(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect);
// As px_control_hue with the shift taken from LUT_HueValue_Range100[level]
// (levels outside 0..100 are clamped to it).
int px_control_hue_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                            px_rect rect);

// Red, green, blue balance 0..20 (10 neutral): a channel's own level pushes
// it by 6 a step and pulls the other two by 3, so the offsets sum to zero.
void px_adjust_RGB(int* in, unsigned char* mask, int* out, int width, int height, int red, int green, int blue,
                   px_rect rect);
// 0..100 (50 neutral): steps of 0.6, truncated, pushing by 2 and pulling by 1.
void px_adjust_RGB_range100(int* in, unsigned char* mask, int* out, int width, int height, int red, int green,
                            int blue, px_rect rect);
// The 0..20 balance on the whole picture.
void px_adjust_RGB_all(int* in, int* out, int width, int height, int red, int green, int blue);

// Keep one hue family in colour, turn every other pixel into its luma grey.
void px_point_color_red(int* in, int* out, int width, int height);
void px_point_color_green(int* in, int* out, int width, int height);
void px_point_color_blue(int* in, int* out, int width, int height);
void px_point_color_yellow(int* in, int* out, int width, int height);

// Tints the picture with `hue` (degrees 0..360) at saturation 0.3 over a
// contrast curve of its value. 40962 for a null picture or hue > 360,
// else 40960.
int px_change_colortone(int* in, int* out, int width, int height, int hue);
