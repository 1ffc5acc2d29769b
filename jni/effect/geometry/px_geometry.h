// Geometry of the whole picture: quarter turns and flips, free rotation of a
// region, straighten (live and final), crop, mirror, twirl and sphericity.
// All work on 0xAARRGGBB pixels copied whole (alpha included), except twirl
// and sphericity, which interpolate the colour and keep each pixel's alpha.
//
// Angles arrive in whole degrees and become a fixed angle (a full turn is
// 256.0) through px_geometry_angle; sampling of the rotations is
// nearest-neighbour in 16.16.
//
// Every function reads and writes only inside the sizes it is given: a
// source position outside the picture is never read, and a rectangle or
// position reaching outside is clipped or skipped.
#pragma once

#include <cstdint>

#include "../px_color/px_fixed.h"
#include "../px_types.h"

// Degrees to the fixed angle: degrees / 180.0 * 3.141592 (that six-decimal
// pi), narrowed to float and back, ftofix, then fixmul by 2670177
// (256 / (2 pi) in 16.16). 90 degrees gives 4194316, a little past 64.0.
fixed px_geometry_angle(int degrees);

// Scale factor to its 8.8 step: (int)(scale * 65536.0f) >> 8. A scale whose
// product does not fit an int saturates (NaN gives 0).
int px_geometry_scale8(float scale);

// Flips (horizontal first, each done through dst and copied back over src),
// then the rotation code: 0 copy, 1 quarter turn clockwise (height wide,
// width tall), 2 half turn, 3 quarter turn counter-clockwise, 4 nothing more
// (dst keeps the flipped picture, or its prior contents without a flip).
// Both buffers hold width * height pixels. Returns 0 for a code outside
// 0..4 (nothing touched), else 1.
int px_rotate_flip(int* src, int* dst, int width, int height, int rotation, int flipHorizontal, int flipVertical);

// Bounding box of the picture turned by `angle` degrees.
int px_get_rotate_width(int width, int height, int angle);
int px_get_rotate_height(int width, int height, int angle);

// The region left..right x top..bottom of src (inclusive), turned by `angle`
// degrees about its centre and stretched by (region size / divisor) source
// pixels an output pixel, into the dstWidth x dstHeight output. Pixel and
// mask byte are copied together; outputs whose source falls outside the
// picture keep their prior contents. A zero divisor writes nothing.
void px_rotate_n(const int* src, const unsigned char* srcMask, int* dst, unsigned char* dstMask, int srcWidth,
                 int srcHeight, int dstWidth, int dstHeight, int angle, int left, int right, int top, int bottom,
                 int divisorX, int divisorY);

// Same-size rotation with zoom (scale below 1 zooms in); outputs whose source
// falls outside are not written.
void px_straighten(const int* src, int* dst, int width, int height, int angle, float scale);

// Live preview: the picture turned and scaled by `scale`, centred in a
// dstWidth x dstHeight canvas cleared to 0 first.
void px_straighten_move(const int* src, int srcWidth, int srcHeight, int* dst, int dstWidth, int dstHeight,
                        int angle, float scale);

// Final rendering: only the centred srcWidth x srcHeight area of the cleared
// dstWidth x dstHeight canvas is drawn, sampling with the forward scale.
void px_straighten_up(const int* src, int srcWidth, int srcHeight, int* dst, int dstWidth, int dstHeight,
                      int angle, float scale);

// Copies the rectangle's rows into dst packed with row length
// right - left + 1; an empty rectangle copies nothing. The rectangle is
// clipped to the picture first (the row length is then the clipped one).
// Returns dst.
int* px_crop(const int* src, int* dst, int width, int height, int left, int right, int top, int bottom);

// ---- mirror ------------------------------------------------------------------

enum : int {
  MIRROR_AXIS_UP_DOWN = 0xE001,
  MIRROR_AXIS_LEFT_RIGHT = 0xE002,
  MIRROR_KEEP_LEFT = 0xE003,
  MIRROR_KEEP_RIGHT = 0xE004,
  MIRROR_KEEP_TOP = 0xE005,
  MIRROR_KEEP_BOTTOM = 0xE006,
};

int px_get_mirror_out_width(int width, int pos, int mode, int axis);
int px_get_mirror_out_height(int height, int pos, int mode, int axis);

// Keeps one side of the line at `pos` and reflects it onto the other.
// dstWidth x dstHeight must be the size the two functions above give.
// 0xA000; 0xA002 for an unknown axis, a mode of the other axis, or a
// destination size other than that (nothing written then).
int px_mirror(const int* src, int srcWidth, int srcHeight, int* dst, int dstWidth, int dstHeight, int pos, int mode,
              int axis);

// ---- twirl and sphericity -------------------------------------------------------

// Angle of (x, y) from the +y axis towards +x, 0..360 degrees in 2^19 units.
int FATAN2(int x, int y);

// Bilinear interpolation with 11-bit weights (2048 = a whole pixel) of the
// colour bytes; stores and returns the result with alpha 0xFF.
uint32_t Bilinear_Fixed(int fx, int fy, uint32_t topLeft, uint32_t topRight, uint32_t bottomLeft,
                        uint32_t bottomRight, uint32_t* out);

// Copies src into dst, then turns the inside of the circle by an angle
// fading from `angle` degrees (-360..360) at the centre to none at the rim,
// over the pixels of the inclusive rectangle (each second row and column,
// each written as a 2 x 2 block, when `half` is set). 0xA000; 0xA002 for a
// centre outside the picture, a radius below 1 or an angle out of range.
// Angle 0 returns the value of the copy, the address of dst.
int px_twirl(const int* src, int* dst, int width, int height, int centerX, int centerY, int radius, int angle,
             int left, int right, int top, int bottom, int half);

// Copies src into dst, then bulges (strength > 0) or pinches (< 0) the
// circle, strength -100..100. Results as px_twirl (no angle quirk).
int px_sphericity(const int* src, int* dst, int width, int height, int centerX, int centerY, int radius,
                  int strength, int left, int right, int top, int bottom, int half);
