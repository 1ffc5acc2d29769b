// Colour tools: hue, RGB balance, point colour, colour tone, automatic
// adjustment, levels remapping, brushes, splash, pixelize, invert and lens
// tints. Golden values are worked out by hand from the rules.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <random>
#include <vector>

#include "effect/px_color/px_auto_adjust.h"
#include "effect/px_color/px_hue.h"
#include "log_capture.h"

namespace {
constexpr px_rect kWhole{0, -1, 0, -1};

std::vector<int> random_picture(int w, int h, unsigned seed) {
  std::mt19937 rng(seed);
  std::vector<int> p(static_cast<size_t>(w) * h);
  for (int& v : p) v = static_cast<int>(rng());
  return p;
}

uint32_t rgb(int r, int g, int b, uint32_t alpha = 0xFF) {
  return alpha << 24 | static_cast<uint32_t>(r) << 16 | static_cast<uint32_t>(g) << 8 | static_cast<uint32_t>(b);
}

// One pixel through a whole-picture operation.
template <class Op>
uint32_t whole1(Op op, uint32_t pixel) {
  int in = static_cast<int>(pixel), out = 0;
  op(&in, &out, 1, 1);
  return static_cast<uint32_t>(out);
}

uint32_t hue1(int level, uint32_t pixel, bool range100 = false) {
  int in = static_cast<int>(pixel), out = 0;
  unsigned char mask = 1;
  int rc = range100 ? px_control_hue_range100(&in, &mask, &out, 1, 1, level, px_rect{0, 0, 0, 0})
                    : px_control_hue(&in, &mask, &out, 1, 1, level, px_rect{0, 0, 0, 0});
  EXPECT_EQ(rc, PX_OK);
  return static_cast<uint32_t>(out);
}

uint32_t balance1(int r, int g, int b, uint32_t pixel, bool range100 = false) {
  int in = static_cast<int>(pixel), out = 0;
  unsigned char mask = 1;
  if (range100) {
    px_adjust_RGB_range100(&in, &mask, &out, 1, 1, r, g, b, px_rect{0, 0, 0, 0});
  } else {
    px_adjust_RGB(&in, &mask, &out, 1, 1, r, g, b, px_rect{0, 0, 0, 0});
  }
  return static_cast<uint32_t>(out);
}
}  // namespace

// ---- hue ---------------------------------------------------------------------

TEST(Hue, NeutralLevelCopiesExactly) {
  std::vector<int> in = random_picture(9, 7, 1), out(in.size(), 0);
  std::vector<unsigned char> mask(in.size(), 1);
  EXPECT_EQ(px_control_hue(in.data(), mask.data(), out.data(), 9, 7, 0, px_rect{2, 5, 1, 4}), PX_OK);
  EXPECT_EQ(in, out);
  std::fill(out.begin(), out.end(), 0);
  EXPECT_EQ(px_control_hue_range100(in.data(), mask.data(), out.data(), 9, 7, 50, kWhole), PX_OK);
  EXPECT_EQ(in, out);
}

TEST(Hue, HalfTurnOnPureRedGivesCyan) {
  EXPECT_EQ(hue1(10, rgb(255, 0, 0, 0x37)), rgb(0, 255, 255, 0x37));
  EXPECT_EQ(hue1(0, rgb(255, 0, 0), true), rgb(0, 255, 255));  // table entry 180
  // Green (h 120) by 6 * 18 = 108 degrees lands at h 228: sector 3.
  uint32_t p = hue1(6, rgb(0, 255, 0));
  EXPECT_EQ(p & 0xFF, 255u);
  EXPECT_EQ((p >> 16) & 255, 0u);
}

TEST(Hue, TableEndsAndGreys) {
  EXPECT_EQ(LUT_HueValue_Range100[0], 180);
  EXPECT_EQ(LUT_HueValue_Range100[50], 0);
  EXPECT_EQ(LUT_HueValue_Range100[100], 179);
  for (int level : {1, 7, 13, 20}) {
    EXPECT_EQ(hue1(level, rgb(77, 77, 77, 0x10)), rgb(77, 77, 77, 0x10));
    EXPECT_EQ(hue1(level, rgb(0, 0, 0)), rgb(0, 0, 0));
  }
  EXPECT_EQ(hue1(100, rgb(200, 200, 200), true), rgb(200, 200, 200));
  // Outside the scale the nearest end of the table is used.
  EXPECT_EQ(hue1(-5, rgb(255, 0, 0), true), rgb(0, 255, 255));
}

TEST(Hue, OneWrapOnlyKeepsPixelsBeyondTheCircle) {
  // Level 40 shifts by 720: one correction leaves h + 360, which only pure
  // red (h 0 -> 360) can rebuild; other hues fall outside the six sectors
  // and keep their input.
  EXPECT_EQ(hue1(40, rgb(255, 128, 0)), rgb(255, 128, 0));
  EXPECT_EQ(hue1(40, rgb(255, 0, 0)), rgb(255, 0, 0));
  // A negative shift wraps once upwards.
  EXPECT_EQ(hue1(-10, rgb(255, 0, 0)), rgb(0, 255, 255));
}

TEST(Hue, RegionChangesOnlySelectedPixels) {
  std::vector<int> in(4 * 3, static_cast<int>(rgb(255, 0, 0))), out(in.size());
  std::vector<unsigned char> mask(in.size(), 0);
  mask[1 * 4 + 1] = 1;
  mask[1 * 4 + 2] = 2;
  mask[0] = 1;  // outside the rectangle
  px_control_hue(in.data(), mask.data(), out.data(), 4, 3, 10, px_rect{1, 3, 1, 2});
  for (int i = 0; i < 12; ++i) {
    EXPECT_EQ(static_cast<uint32_t>(out[i]), i == 5 ? rgb(0, 255, 255) : rgb(255, 0, 0)) << i;
  }
  EXPECT_EQ(px_control_hue(nullptr, mask.data(), out.data(), 4, 3, 10, kWhole), PX_ERR_NULL);
}

// ---- RGB balance ---------------------------------------------------------------

TEST(RgbBalance, FullPushIsSixtyAndPullsThirty) {
  EXPECT_EQ(balance1(20, 10, 10, rgb(100, 100, 100, 0x80)), rgb(160, 70, 70, 0x80));
  EXPECT_EQ(balance1(10, 0, 10, rgb(100, 100, 100)), rgb(130, 40, 130));
  EXPECT_EQ(balance1(100, 50, 50, rgb(100, 100, 100), true), rgb(160, 70, 70));
  EXPECT_EQ(balance1(50, 50, 0, rgb(100, 100, 100), true), rgb(130, 130, 40));
  // 53 -> (3 * 0.6f) = 1.8, truncated to 1.
  EXPECT_EQ(balance1(53, 50, 50, rgb(100, 100, 100), true), rgb(102, 99, 99));
  // Clamping: 256 and above to 255, negatives to 0.
  EXPECT_EQ(balance1(20, 10, 10, rgb(250, 20, 30)), rgb(255, 0, 0));
  EXPECT_EQ(balance1(10, 10, 10, rgb(1, 2, 3, 0)), rgb(1, 2, 3, 0));
}

TEST(RgbBalance, OffsetsSumToZero) {
  std::mt19937 rng(7);
  for (int i = 0; i < 200; ++i) {
    int r = static_cast<int>(rng() % 21), g = static_cast<int>(rng() % 21), b = static_cast<int>(rng() % 21);
    uint32_t p = balance1(r, g, b, rgb(128, 128, 128));
    ASSERT_EQ(((p >> 16) & 255) + ((p >> 8) & 255) + (p & 255), 384u) << r << "," << g << "," << b;
    r = static_cast<int>(rng() % 101), g = static_cast<int>(rng() % 101), b = static_cast<int>(rng() % 101);
    p = balance1(r, g, b, rgb(128, 128, 128), true);
    ASSERT_EQ(((p >> 16) & 255) + ((p >> 8) & 255) + (p & 255), 384u) << r << "," << g << "," << b;
  }
}

TEST(RgbBalance, WholePictureFormMatchesTheRegionForm) {
  std::vector<int> in = random_picture(130, 70, 3), a(in.size()), b(in.size());
  px_adjust_RGB_all(in.data(), a.data(), 130, 70, 14, 6, 11);
  px_adjust_RGB(in.data(), nullptr, b.data(), 130, 70, 14, 6, 11, kWhole);
  EXPECT_EQ(a, b);
  px_adjust_RGB_all(in.data(), in.data(), 130, 70, 14, 6, 11);  // in place
  EXPECT_EQ(in, a);
}

// ---- point colour --------------------------------------------------------------

TEST(PointColour, RedKeepsRedAndGreysGreen) {
  EXPECT_EQ(whole1(px_point_color_red, rgb(0, 255, 0, 0x44)), rgb(149, 149, 149, 0x44));
  EXPECT_EQ(whole1(px_point_color_red, rgb(255, 0, 0)), rgb(254, 0, 0));
  EXPECT_EQ(whole1(px_point_color_green, rgb(0, 255, 0)), rgb(0, 255, 0));
}

TEST(PointColour, FamiliesAndBoundaries) {
  // Magenta has Cb >= 0 and Cr >= 0: kept by none.
  const uint32_t magenta = rgb(255, 0, 255);
  const int y = (77 * 255 + 29 * 255) >> 8;
  for (auto op : {px_point_color_red, px_point_color_green, px_point_color_blue, px_point_color_yellow}) {
    EXPECT_EQ(whole1(op, magenta), rgb(y, y, y));
  }
  // Pure blue: Cb 127, Cr -21: only the blue family keeps it.
  EXPECT_EQ(whole1(px_point_color_green, rgb(0, 0, 255)), rgb(28, 28, 28));
  EXPECT_NE(whole1(px_point_color_blue, rgb(0, 0, 255)), rgb(28, 28, 28));
  // Where Cr = -Cb, red and yellow both keep the colour.
  int found = 0;
  for (int r = 0; r < 256; r += 5) {
    for (int g = 0; g < 256; g += 5) {
      const int cb = (-43 * r - 85 * g + 128 * 40) >> 8, cr = (128 * r - 107 * g - 21 * 40) >> 8;
      if (cr < 1 || cb >= 0 || cr != -cb) continue;
      ++found;
      const uint32_t p = rgb(r, g, 40);
      const uint32_t red = whole1(px_point_color_red, p), yellow = whole1(px_point_color_yellow, p);
      EXPECT_EQ(red, yellow);
      EXPECT_NE((red >> 16) & 255, red & 255);  // still coloured
    }
  }
  EXPECT_GT(found, 0);
}

// ---- colour tone ----------------------------------------------------------------

TEST(ColourTone, ValueCurveAndTint) {
  // Grey 128 keeps value 128; at hue 0 and saturation 0.3 it becomes
  // (128, 90, 90).
  EXPECT_EQ(whole1([](int* i, int* o, int w, int h) { px_change_colortone(i, o, w, h, 0); }, rgb(128, 128, 128, 9)),
            rgb(128, 90, 90, 9));
  auto value = [](int v) {
    uint32_t p = whole1([](int* i, int* o, int w, int h) { px_change_colortone(i, o, w, h, 0); }, rgb(v, 0, v / 2));
    return static_cast<int>((p >> 16) & 255);  // red carries the value at hue 0
  };
  EXPECT_EQ(value(64), 48);
  EXPECT_EQ(value(200), 255);
  EXPECT_EQ(value(0), 0);
  // At hue 240 blue carries the value.
  uint32_t p = whole1([](int* i, int* o, int w, int h) { px_change_colortone(i, o, w, h, 240); }, rgb(10, 128, 3));
  EXPECT_EQ(p & 255, 128u);
}

TEST(ColourTone, RefusesHueAbove360) {
  int in = static_cast<int>(rgb(1, 2, 3)), out = 12345;
  EXPECT_EQ(px_change_colortone(&in, &out, 1, 1, 400), PX_ERR_NULL);
  EXPECT_EQ(out, 12345);
  EXPECT_EQ(px_change_colortone(nullptr, &out, 1, 1, 10), PX_ERR_NULL);
  EXPECT_EQ(px_change_colortone(&in, &out, 1, 0, 10), PX_OK);
  EXPECT_EQ(out, 12345);
  EXPECT_EQ(px_change_colortone(&in, &out, 1, 1, 360), PX_OK);
}

// ---- automatic adjustment -------------------------------------------------------

TEST(AutoAdjust, LogarithmTableAndInterpolation) {
  auto sample = [](int i) {
    if (i <= 54) return 1024 + 2 * i;
    if (i <= 79) return 1136 + 4 * (i - 55);
    if (i <= 117) return 1240 + 8 * (i - 80);
    if (i <= 181) return 1552 + 16 * (i - 118);
    return 2592 + 32 * (i - 182);
  };
  for (int i = 0; i < 230; ++i) {
    const int v = sample(i);
    ASSERT_EQ(log_new_FIX[i], static_cast<int>(std::lround(512.0 * std::log2(v / 1024.0)))) << i;
    ASSERT_EQ(log_interp_FIX(log_new_FIX, v), log_new_FIX[i]) << v;
  }
  // Between samples: a quarter of the way from 1132 to 1136.
  EXPECT_EQ(log_interp_FIX(log_new_FIX, 1133), log_new_FIX[54] + ((log_new_FIX[55] - log_new_FIX[54]) >> 2));
  EXPECT_EQ(log_interp_FIX(log_new_FIX, 5000), 1024);
}

TEST(AutoAdjust, NaturalLogarithmByOctaves) {
  EXPECT_EQ(log_e_FIX_new(1), 0);
  EXPECT_EQ(log_e_FIX_new(1024), 0);
  EXPECT_EQ(log_e_FIX_new(2048), 1420 * 512);
  EXPECT_EQ(log_e_FIX_new(4096), 1420 * 1024);
  EXPECT_EQ(log_e_FIX_new(8192), 1420 * 1536);
  EXPECT_EQ(log_e_FIX_new(16), -1420 * 512 * 6);
  EXPECT_EQ(log_e_FIX_new(0x400000), 1420 * 1024 * 6);
  // Cases the adjustment never passes.
  for (int x : {0, -7, 2, 3, 4, 0x400001}) EXPECT_EQ(log_e_FIX_new(x), 21811200) << x;
}

TEST(AutoAdjust, SettingsAreCheckedOneByOne) {
  EXPECT_EQ(px_get_threshold_hdr(), 70);
  EXPECT_EQ(px_get_cutoff_hdr(), 100);
  EXPECT_EQ(px_get_weight1_hdr(), 1000);
  EXPECT_EQ(px_get_weight2_hdr(), 5120);
  px_set_hdr(128, 101, 299, 8197);
  px_set_hdr(-1, -1, -300, -8196);
  EXPECT_EQ(px_get_threshold_hdr(), 70);
  EXPECT_EQ(px_get_cutoff_hdr(), 100);
  EXPECT_EQ(px_get_weight1_hdr(), 1000);
  EXPECT_EQ(px_get_weight2_hdr(), 5120);
  px_set_hdr(0, 0, 300, 8196);
  EXPECT_EQ(px_get_threshold_hdr(), 0);
  EXPECT_EQ(px_get_cutoff_hdr(), 0);
  EXPECT_EQ(px_get_weight1_hdr(), 300);
  EXPECT_EQ(px_get_weight2_hdr(), 8196);
  px_set_hdr(70, 1000, 1000, 5120);  // cutoff 1000 is refused: stays 0
  EXPECT_EQ(px_get_cutoff_hdr(), 0);
  px_set_hdr(70, 100, 1000, 5120);
}

TEST(AutoAdjust, BlackStaysAndMidGreyFollowsTheCurve) {
  std::vector<int> black(10 * 10, static_cast<int>(rgb(0, 0, 0, 0x33))), out(100, 7);
  EXPECT_EQ(px_process_hdr(black.data(), out.data(), 10, 10), PX_OK);
  EXPECT_EQ(out, black);
  // Mid-grey: every pixel in bin 50, the picture counts as bright (weight
  // 5120); the curve reaches 94 % there, so 128 becomes 239.
  std::vector<int> grey(10 * 10, static_cast<int>(rgb(128, 128, 128, 0x80)));
  EXPECT_EQ(px_process_hdr(grey.data(), out.data(), 10, 10), PX_OK);
  EXPECT_EQ(out, std::vector<int>(100, static_cast<int>(rgb(239, 239, 239, 0x80))));
  // In place gives the same.
  EXPECT_EQ(px_process_hdr(grey.data(), grey.data(), 10, 10), PX_OK);
  EXPECT_EQ(out, grey);
}

TEST(AutoAdjust, GainIsCappedKeepingTheHue) {
  // Dark grey everywhere and one warm pixel at 46 %: the curve lifts it to
  // about twice its luminance, which would push red past the top. The gain
  // becomes 0xFF00000 / ((200 << 10) + 1) = 1305 for all three channels, so
  // red lands just below the top (the gain is truncated).
  std::vector<int> in(16 * 16, static_cast<int>(rgb(40, 40, 40))), out(in.size());
  in[37] = static_cast<int>(rgb(200, 100, 50, 0x11));
  EXPECT_EQ(px_process_hdr(in.data(), out.data(), 16, 16), PX_OK);
  EXPECT_EQ(static_cast<uint32_t>(out[37]), rgb(254, 127, 63, 0x11));
}

TEST(AutoAdjust, LargePicturesTakeOneGlobalStep) {
  const int w = 2000001;
  std::vector<int> in(w, static_cast<int>(rgb(255, 255, 255, 0x7F))), out(w);
  EXPECT_EQ(px_process_hdr(in.data(), out.data(), w, 1), PX_OK);
  EXPECT_EQ(static_cast<uint32_t>(out[0]), rgb(245, 245, 245, 0x7F));  // brightness 9
  EXPECT_EQ(static_cast<uint32_t>(out[w - 1]), rgb(245, 245, 245, 0x7F));
  std::fill(in.begin(), in.end(), static_cast<int>(rgb(30, 30, 30)));
  EXPECT_EQ(px_process_hdr(in.data(), out.data(), w, 1), PX_OK);
  EXPECT_EQ(static_cast<uint32_t>(out[w / 2]), rgb(40, 40, 40));  // brightness 11
  for (int i = 0; i < w; i += 2) in[i] = static_cast<int>(rgb(200, 200, 200));  // half bright: contrast 12
  EXPECT_EQ(px_process_hdr(in.data(), out.data(), w, 1), PX_OK);
  EXPECT_EQ(static_cast<uint32_t>(out[0]), rgb(216, 200 + 8 * 2, 216));
  EXPECT_EQ(static_cast<uint32_t>(out[1]), rgb(30 - 10 * 2, 30 - 10 * 2, 30 - 10 * 2));
}

// ---- levels remapping ----------------------------------------------------------

TEST(Levels, InputLevelsStretch) {
  auto in_levels = [](uint32_t p, int channel, int low, int high) {
    int in = static_cast<int>(p), out = 99;
    changeHistogramByInput(&in, &out, 1, 1, channel, low, high);
    return static_cast<uint32_t>(out);
  };
  // scale = 261120 / 150 = 1740: 50 -> 0, 125 -> 127, 200 -> 254, 201 -> 255.
  EXPECT_EQ(in_levels(rgb(50, 125, 200, 0x44), 0, 50, 200), rgb(0, 127, 254, 0x44));
  EXPECT_EQ(in_levels(rgb(201, 10, 255), 0, 50, 200), rgb(255, 0, 255));
  EXPECT_EQ(in_levels(rgb(125, 125, 125), 2, 50, 200), rgb(125, 127, 125));
  EXPECT_EQ(in_levels(rgb(125, 125, 125), 4, 50, 200), rgb(125, 125, 125));  // no channel selected
  EXPECT_EQ(in_levels(rgb(1, 2, 3), 0, 200, 200), 99u);                     // nothing written
}

TEST(Levels, OutputLevelsSqueeze) {
  auto out_levels = [](uint32_t p, int channel, int low, int high) {
    int in = static_cast<int>(p), out = 99;
    changeHistogramByOutput(&in, &out, 1, 1, channel, low, high);
    return static_cast<uint32_t>(out);
  };
  // scale = 150 * 1024 / 255 = 602: 0 -> 50, 255 -> 50 + 149.
  EXPECT_EQ(out_levels(rgb(0, 255, 128, 0x01), 0, 50, 200), rgb(50, 199, 125, 0x01));
  EXPECT_EQ(out_levels(rgb(0, 255, 128), 1, 50, 200), rgb(50, 255, 128));
  EXPECT_EQ(out_levels(rgb(0, 255, 128), 3, 50, 200), rgb(0, 255, 125));
  EXPECT_EQ(out_levels(rgb(1, 2, 3), 0, 10, 5), 99u);
  int in = 5, out = 99;
  changeHistogramByOutput(&in, &out, 1, 0, 0, 0, 255);
  EXPECT_EQ(out, 99);
}
