// Signed 16.16 fixed point (1.0 = 0x10000) with table trigonometry on a
// circle of 256.0 (0x400000 is a right angle), rounded integer division, an
// integer square root, ARGB packing and RGB <-> HSV.
//
// Failures set the process-wide fix_errno (34 range, 33 domain) and give the
// saturated values 0x7FFFFFFF / 0x80000001; 0x80000000 is never produced by
// saturation. fix_errno is never cleared except by fixatan2.
#pragma once

#include <cstdint>

using fixed = int32_t;

extern int fix_errno;

enum { PX_FIX_ERANGE = 34, PX_FIX_EDOM = 33 };
constexpr fixed PX_FIX_MAX = 0x7FFFFFFF;
constexpr fixed PX_FIX_MIN = -0x7FFFFFFF;

constexpr fixed itofix(int i) { return static_cast<fixed>(static_cast<uint32_t>(i) << 16); }
constexpr int fixfloor(fixed x) { return x >> 16; }
// Rounds to the nearest integer, halves up.
constexpr int fixtoi(fixed x) { return fixfloor(x) + ((x >> 15) & 1); }
int fixceil(fixed x);
fixed ftofix(double d);
constexpr double fixtof(fixed x) { return x * (1 / 65536.0); }

fixed fixadd(fixed x, fixed y);
fixed fixsub(fixed x, fixed y);
fixed fixmul(fixed x, fixed y);  // through double, saturating
// (x << 16) / y with the shift kept to 32 bits: exact only for |x| < 0x8000.
fixed fixdiv(fixed x, fixed y);

fixed fixcos(fixed angle);
fixed fixsin(fixed angle);
fixed fixtan(fixed angle);
fixed fixacos(fixed x);
fixed fixasin(fixed x);
fixed fixatan(fixed x);
fixed fixatan2(fixed y, fixed x);

// a / b rounded by the remainder: the step is 1 when |a mod b| >= (b >> 1),
// negated when a * b (32-bit) is negative. So idiv(5, 1) = 6 and
// idiv(4, 3) = 2; callers depend on this rounding.
int idiv(int a, int b);
// a / b (towards zero), minus one when a * b (32-bit) is negative, even when
// the division is exact: iidiv(-4, 2) = -3.
int iidiv(int a, int b);
// Square root rounded to nearest, for 0 <= x <= 0x7FFFFFFF (0 otherwise).
int isqrt_(int x);

inline int px_pack_rgb888(int argb, int r, int g, int b) {
  return static_cast<int>((static_cast<uint32_t>(argb) & 0xFF000000u) | (static_cast<uint32_t>(r & 255) << 16) |
                          (static_cast<uint32_t>(g & 255) << 8) | static_cast<uint32_t>(b & 255));
}
inline void px_unpack_rgb888(int argb, int* r, int* g, int* b) {
  *r = (argb >> 16) & 255;
  *g = (argb >> 8) & 255;
  *b = argb & 255;
}

// h in whole degrees 0..360, s fixed 0..65536, v = max channel.
void px_rgb2hsv(int r, int g, int b, int* h, int* s, int* v);
void px_hsv2rgb(int h, fixed s, int v, int* r, int* g, int* b);
