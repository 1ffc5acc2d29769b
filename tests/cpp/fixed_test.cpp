#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <random>

#include "effect/px_color/px_fixed.h"
#include "effect/px_color/px_fixed_tables.h"

namespace {
int32_t round_away(double v) { return v >= 0 ? static_cast<int32_t>(v + 0.5) : -static_cast<int32_t>(-v + 0.5); }
}  // namespace

// The compile-time tables equal their rules evaluated with the C library.
TEST(FixedTables, MatchTheirRules) {
  const double pi = std::acos(-1.0);
  for (int i = 0; i < 512; ++i) EXPECT_EQ(px_cos_table[i], round_away(65536 * std::cos(i * pi / 256))) << i;
  for (int i = 0; i < 256; ++i) {
    if (i == 128) continue;
    EXPECT_EQ(px_tan_table[i], round_away(65536 * std::tan(i * pi / 256))) << i;
  }
  EXPECT_EQ(px_tan_table[128], -0x7FFFFFFF);
  for (int i = 0; i <= 512; ++i) {
    EXPECT_EQ(px_acos_table[i], round_away(std::acos(-1.0 + i / 256.0) * 8388608.0 / pi)) << i;
  }
  for (uint32_t i = 1; i < 256; ++i) {
    EXPECT_EQ(LUT_DELTA[i], 65536u / i);
    EXPECT_EQ(LUT_DELTA2[i], 60u * (65536u / i));
  }
  EXPECT_EQ(LUT_DELTA[0], 0u);
  EXPECT_EQ(LUT_DELTA2[0], 0u);
}

TEST(Fixed, RoundingAndConversion) {
  EXPECT_EQ(fixtoi(0x18000), 2);
  EXPECT_EQ(fixtoi(-0x18000), -1);
  EXPECT_EQ(fixfloor(-1), -1);
  EXPECT_EQ(fixceil(0x10001), 2);
  fix_errno = 0;
  EXPECT_EQ(fixceil(0x7FFF0001), 32767);
  EXPECT_EQ(fix_errno, PX_FIX_ERANGE);
  EXPECT_EQ(ftofix(1.5), 0x18000);
  EXPECT_EQ(ftofix(-1.5 / 65536), -2);  // halves away from zero
  EXPECT_EQ(ftofix(40000.0), 0x7FFFFFFF);
  EXPECT_EQ(ftofix(-40000.0), static_cast<fixed>(0x80000001));
  EXPECT_DOUBLE_EQ(fixtof(0x8000), 0.5);
}

TEST(Fixed, SaturatingArithmetic) {
  fix_errno = 0;
  EXPECT_EQ(fixadd(0x7FFF0000, 0x10000), 0x7FFFFFFF);
  EXPECT_EQ(fix_errno, PX_FIX_ERANGE);
  EXPECT_EQ(fixadd(-0x7FFF0000, -0x20000), static_cast<fixed>(0x80000001));
  EXPECT_EQ(fixsub(0x7FFF0000, -0x20000), 0x7FFFFFFF);
  EXPECT_EQ(fixsub(-0x7FFF0000, 0x20000), static_cast<fixed>(0x80000001));
  EXPECT_EQ(fixsub(5, 3), 2);
  EXPECT_EQ(fixmul(0x20000, 0x18000), 0x30000);
  EXPECT_EQ(fixmul(0x7FFF0000, 0x20000), 0x7FFFFFFF);
}

TEST(Fixed, DivisionKeepsTheThirtyTwoBitShift) {
  EXPECT_EQ(fixdiv(0x10000, 0x20000), 0);  // the shift drops the top bits
  EXPECT_EQ(fixdiv(0x4000, 0x20000), 0x2000);
  EXPECT_EQ(fixdiv(0, 0), 0);
  fix_errno = 0;
  EXPECT_EQ(fixdiv(-3, 0), static_cast<fixed>(0x80000001));
  EXPECT_EQ(fix_errno, PX_FIX_ERANGE);
  EXPECT_EQ(fixdiv(0x8000, -1), INT32_MIN);  // wraps instead of trapping
}

TEST(Fixed, TableTrigonometry) {
  EXPECT_EQ(fixcos(0), 65536);
  EXPECT_EQ(fixcos(0x800000), -65536);
  EXPECT_EQ(fixsin(0x400000), 65536);
  EXPECT_EQ(fixsin(0), px_cos_table[(-0x3FC000 >> 15) & 511]);
  EXPECT_EQ(fixtan(0x200000), 65536);
  fix_errno = 0;
  EXPECT_EQ(fixacos(65537), 0);
  EXPECT_EQ(fix_errno, PX_FIX_EDOM);
  EXPECT_EQ(fixacos(-65536), 0x800000);
  EXPECT_EQ(fixacos(0), 0x400000);
  EXPECT_EQ(fixasin(65536), 0x400000);
  EXPECT_EQ(fixatan(65536), 64 << 15);
  EXPECT_EQ(fixatan(0), 0);
  EXPECT_EQ(fixatan(-65536), (192 << 15) - 0x800000);
}

TEST(Fixed, Atan2Quadrants) {
  fix_errno = 0;
  EXPECT_EQ(fixatan2(0, 0), 0);
  EXPECT_EQ(fix_errno, PX_FIX_EDOM);
  EXPECT_EQ(fixatan2(5, 0), 0x400000);
  EXPECT_EQ(fixatan2(-5, 0), -0x400000);
  EXPECT_EQ(fixatan2(0x4000, 0x4000), 0x200000);
  EXPECT_EQ(fixatan2(0x4000, -0x4000), 0x600000);
  EXPECT_EQ(fixatan2(-0x4000, -0x4000), -0x600000);
  EXPECT_EQ(fixatan2(-0x4000, 0x4000), -0x200000);
  // A quotient that cannot be formed gives the vertical direction.
  EXPECT_EQ(fixatan2(0x10000, 1), 0);  // shift loses the bits: quotient 0
  EXPECT_EQ(fix_errno, 0);
}

TEST(Fixed, RoundedIntegerDivision) {
  EXPECT_EQ(idiv(7, 2), 4);
  EXPECT_EQ(idiv(6, 1), 7);  // b = 1 adds one
  EXPECT_EQ(idiv(5, 1), 6);
  EXPECT_EQ(idiv(4, 3), 2);
  EXPECT_EQ(idiv(-7, 2), -4);
  EXPECT_EQ(idiv(0, 0), 0);
  EXPECT_EQ(idiv(3, 0), 0x7FFFFFFF);
  EXPECT_EQ(iidiv(-4, 2), -3);
  EXPECT_EQ(iidiv(-5, 2), -3);
  EXPECT_EQ(iidiv(5, 2), 2);
  EXPECT_EQ(iidiv(-3, 0), static_cast<int>(0x80000001));
}

TEST(Fixed, IntegerSquareRootRoundsToNearest) {
  EXPECT_EQ(isqrt_(0), 0);
  EXPECT_EQ(isqrt_(2), 1);
  EXPECT_EQ(isqrt_(3), 2);
  EXPECT_EQ(isqrt_(0x7FFFFFFF), 46341);
  for (int r = 1; r < 46340; r += 7) {
    ASSERT_EQ(isqrt_(r * r), r);
    ASSERT_EQ(isqrt_(r * r + r), r);
    ASSERT_EQ(isqrt_(r * r + r + 1), r + 1);
  }
}

TEST(Fixed, PackAndUnpack) {
  EXPECT_EQ(px_pack_rgb888(0x12345678, 0x1FF, 0x80, -1), static_cast<int>(0x12FF80FF));
  int r, g, b;
  px_unpack_rgb888(static_cast<int>(0x80A0B0C0), &r, &g, &b);
  EXPECT_EQ(r, 0xA0);
  EXPECT_EQ(g, 0xB0);
  EXPECT_EQ(b, 0xC0);
}

TEST(Hsv, PrimariesAndGreys) {
  int h, s, v;
  px_rgb2hsv(255, 0, 0, &h, &s, &v);
  EXPECT_EQ(h, 0);
  EXPECT_EQ(s, 65535);  // LUT_DELTA[255] * 255 = 257 * 255; 65536 only when max = 1
  EXPECT_EQ(v, 255);
  px_rgb2hsv(0, 0, 255, &h, &s, &v);
  EXPECT_EQ(h, 240);
  px_rgb2hsv(0, 255, 0, &h, &s, &v);
  EXPECT_EQ(h, 120);
  px_rgb2hsv(77, 77, 77, &h, &s, &v);
  EXPECT_EQ(h, 0);
  EXPECT_EQ(s, 0);
  EXPECT_EQ(v, 77);
  px_rgb2hsv(0, 0, 0, &h, &s, &v);
  EXPECT_EQ(v, 0);
  int r, g, b;
  px_hsv2rgb(360, 65536, 255, &r, &g, &b);
  EXPECT_EQ(r, 255);
  EXPECT_EQ(g, 0);
  EXPECT_EQ(b, 0);
  px_hsv2rgb(-1, 0, 90, &r, &g, &b);
  EXPECT_EQ(r + g + b, 0);
  px_hsv2rgb(400, 30000, 90, &r, &g, &b);  // beyond the last sector
  EXPECT_EQ(r + g + b, 0);
}

// Round trips stay within the precision of whole-degree hues.
TEST(Hsv, RoundTripIsClose) {
  std::mt19937 rng(7);
  for (int i = 0; i < 20000; ++i) {
    int r0 = rng() & 255, g0 = rng() & 255, b0 = rng() & 255;
    int h, s, v, r, g, b;
    px_rgb2hsv(r0, g0, b0, &h, &s, &v);
    ASSERT_GE(h, 0);
    ASSERT_LE(h, 360);
    px_hsv2rgb(h, s, v, &r, &g, &b);
    ASSERT_NEAR(r, r0, 3) << r0 << "," << g0 << "," << b0;
    ASSERT_NEAR(g, g0, 3) << r0 << "," << g0 << "," << b0;
    ASSERT_NEAR(b, b0, 3) << r0 << "," << g0 << "," << b0;
  }
}
