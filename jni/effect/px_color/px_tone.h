// Tone adjustments on 0xAARRGGBB pixels; every pixel keeps its alpha.
//
// Region forms (in, mask, out, width, height, level, rect) follow the region
// rule of px_region.h. Levels run 0..20 with 10 neutral; the _range100 forms
// 0..100 with 50 neutral; faded colour 0..100 with 0 neutral; exposure 0
// upwards with 10 neutral. The _all forms work on the whole picture, row by
// row, and `in` may equal `out`.
#pragma once

#include "../px_types.h"

void px_control_brightness(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect);
void px_control_brightness_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                                    px_rect rect);
void px_control_contrast(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect);
void px_control_contrast_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                                  px_rect rect);
void px_control_saturation(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect);
void px_control_saturation_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                                    px_rect rect);
void px_control_temperature(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect);
void px_control_temperature_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                                     px_rect rect);
// 40962 (logged) for a null picture or a negative level, else 40960.
int px_control_exposure(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect);
// 40962 for a null array or a level above 100 (nothing written), else 40960.
int px_control_fadedcolor(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect);
void px_control_greyscale(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect);

void px_control_brightness_all(int* in, int* out, int width, int height, int level);
void px_control_contrast_all(int* in, int* out, int width, int height, int level);
void px_control_saturation_all(int* in, int* out, int width, int height, int level);
void px_control_temperature_all(int* in, int* out, int width, int height, int level);
int px_control_fadedcolor_all(int* in, int* out, int width, int height, int level);
int px_control_exposure_all(int* in, int* out, int width, int height, int level);
