// The skin beautifier: a luminance filter over the skin of each face,
// strongest at the face centre and fading out at half the face width.
#pragma once

#include <cstdint>

#include "../face/face_engine.h"

// Face-box enlargement. Mode 2: nw = 14 w / 10, nh = 14 nw / 10 (both kept to
// 16 bits), the box grows by (nw - w) / 2 on each side and by |nh - h| / 2
// above and below (the height follows the width, so a box that was taller
// still grows), then is clamped to the photo (x, y >= 0, x + w <= width - 1,
// y + h <= height - 1). Mode 1 leaves the boxes; mode 3 makes the first box
// the whole photo.
void NewFaceBox(caFaceBox* boxes, int count, int width, int height, int mode);

// Strength and radius of a level: strength 0, 511, 1022, 1533, 1533 for
// levels 1..5 (kernel strength / 511), radius base = firstBoxWidth / 52 (at
// least 1), level 5 (3 base + 1) >> 1. Any other level gives strength -1 and
// radius 0 (nothing is filtered).
void SetVar(int level, int firstBoxWidth, int* strength, int* radius);

// Skin test on Cb = (152 R - 298 G + 450 B + 131072) >> 10 and
// Cr = (450 R - 377 G - 73 B + 131072) >> 10: 140 <= Cr <= 165 and
// 140 <= Cb <= 195. The +152 on red is intended; the ranges are tuned to it.
bool IsSkin(int r, int g, int b);

// Range kernels: 511 entries indexed by luminance difference + 255, 1024 at
// 0, symmetric, at least 1. Kernel k is the Gaussian of sigma 5.1 * (1 + k / 2).
const int32_t* RangeLUT1024(int kernel);

// Distance weight of a pixel (dx, dy) from the centre of a w x h box: 256 at
// the centre, 0 from a distance of w / 2 on. `wmin` from DistanceWeightBase.
int DistanceWeightBase(int w, int h);
int DistanceWeight(int dx, int dy, int w, int h, int wmin);

// The beautifier as the face engine calls it: the photo (ARGB, width x
// height) in place, the level (1..5; anything else does nothing) and the face
// boxes in photo coordinates.
void Face_BeautifierRGB(int* argb, int height, int width, int level, const caFaceBox* faces, int count);

// The beautifier's result at sampled pixels, without touching the photo:
// out[j * stride + i] = the pixel (xs[i], ys[j]) (each inside the photo) of
// the photo as Face_BeautifierRGB would leave it. Only those pixels and the
// boxes' luminance sample points are filtered, so a preview costs what it
// shows. False (out untouched) when memory ran out.
bool Face_BeautifierRGB_At(const int* argb, int height, int width, int level, const caFaceBox* faces, int count,
                           const int* xs, int nx, const int* ys, int ny, int* out, int stride);

// The tile working limits and the histogram size.
constexpr int MAXW = 400;
constexpr int MAXH = 560;
constexpr int kBeautyBins = 32;
