// Effect 38, the variable blur (see iel_variable_blur.cpp for its design).
#pragma once

#include "iel.h"

// Blurs the RGB of ARGB pixels with a Gaussian-looking kernel of sigma roughly
// radius / 3 reaching `radius` pixels on each side up to radius 3 and at
// most radius + 2 beyond (0 or less: a copy; above 300 as 300); alpha kept;
// output may be the input. 0, or 1/3/4 from the image checks. A failed working allocation
// logs "Failed to allocate \n" and also returns 0 (output not written).
int IEL_VariableBlur_ARGB8888(structIELImage* input, structIELImage* output, int radius);

// The dispatcher's entry for effect 38: a format other than ARGB_PACK logs
// "Written for ARGB format only \n" and returns 0 without writing the output;
// otherwise the blur with radius *level (0 for a null level).
int IEL_Apply_VariableBlur(structIELImage* input, structIELImage* output, structIELEffectParams* params);
