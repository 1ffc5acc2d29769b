// The effects of the library, as the dispatcher calls them.
#pragma once

#include "iel.h"

// Sepia tone on RGB888, ARGB_PACK or RGB565 (level clamped to 0..50).
int IEL_SepiaFast(structIELImage* input, structIELImage* output, int level);

// Adds level to R, G and B of every ARGB pixel (clamped); alpha kept.
int IEL_VariableBrightness_ARGB8888(structIELImage* input, structIELImage* output, int level);
