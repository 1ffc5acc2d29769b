// Object copy and paste: closing a selected object's mask, recolouring an
// object to the colour balance of a target picture, pasting it with its
// border blended into the new background, and drawing a scaled view of a
// region.
//
// Object mask values: 1 object, 2 and 3 the object's border band, 0 outside.
// Eight-neighbour order of every neighbour scan: (dy, dx) = (-1,-1), (-1,0),
// (-1,1), (0,-1), (0,1), (1,-1), (1,0), (1,1).
//
// Positions and rectangles that reach outside a picture are clipped: nothing
// is read or written outside the arrays.
#pragma once

#include "../px_types.h"

// Closes notches of the object mask inside `rect`, `iterations` times: a 0
// pixel with at least 4 of its in-picture neighbours equal to 1 becomes 1.
void px_set_paste_object(unsigned char* mask, int width, int height, px_rect rect, int iterations);

// Channel means of the object pixels whose mask byte is non-zero (integer
// quotients; all 0 when there are none).
void px_object_means(const int* object, const unsigned char* mask, int width, int height, int* meanR, int* meanG,
                     int* meanB);

// Recolours, in place, the pixels of `object` whose mask byte is 1 to the
// colour balance of the whole `target`; alpha is kept.
void px_copy_object(int* object, const unsigned char* mask, int width, int height, const int* target,
                    int targetWidth, int targetHeight);

// dst = picture with the recoloured object (mask 1, non-zero alpha) pasted
// at (left, top) and its border band blended. `right` and `bottom` are not
// used.
void px_copy_paste_fixed(const int* object, const int* picture, const unsigned char* mask, int* dst, int objWidth,
                         int objHeight, int width, int height, int left, int right, int top, int bottom, int meanR,
                         int meanG, int meanB);

// dst = background with every object pixel of mask 1 and non-zero alpha
// written at (left + j, top + i).
void px_paste_object(const int* object, const int* background, const unsigned char* mask, int* dst, int objWidth,
                     int objHeight, int width, int height, int left, int right, int top);

// Draws the region `rect` of src, scaled by 1 / scale (scale = source pixels
// per destination pixel), into dst. The last column of the range is left
// out, the last row drawn. Returns 0.
int drawObject(int* dst, int dstWidth, int dstHeight, const int* src, int srcWidth, int srcHeight, float scale,
               px_rect rect);
