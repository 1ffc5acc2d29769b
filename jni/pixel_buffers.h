// Conversions between the caller's 0xAARRGGBB pixels and the packed R, G, B
// working buffer, and the masked merge back. Each does nothing when
// width * height < 1. Alpha always comes from `alphaSource` / `source` (the
// caller's input picture), never from the output.
#pragma once

#include "effect/px_types.h"

void convertIntArrayToByteArray(const int* argb, unsigned char* rgb, int width, int height);
void convertByteArraytoIntArray(const unsigned char* rgb, int* out, const int* alphaSource, int width, int height);
// Empty rectangle: as convertByteArraytoIntArray. Otherwise, over the whole
// picture (the rectangle only decides between the two cases): the converted
// pixel where mask == 1, the untouched source pixel elsewhere.
void convertByteArraytoIntArrayUsingMask(const unsigned char* rgb, int* out, const int* source,
                                         const unsigned char* mask, int width, int height, px_rect rect);
