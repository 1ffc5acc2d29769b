// Colour tools: hue, RGB balance, point colour, colour tone, automatic
// adjustment, levels remapping, brushes, splash, pixelize, invert and lens
// tints. Golden values are worked out by hand from the rules.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <random>
#include <vector>

#include "effect/px_color/px_auto_adjust.h"
#include "effect/px_color/px_brush.h"
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

// ---- brushes -------------------------------------------------------------------

namespace {
std::vector<int> flat(int w, int h, uint32_t pixel) { return std::vector<int>(static_cast<size_t>(w) * h, static_cast<int>(pixel)); }
uint32_t at(const std::vector<int>& p, int w, int x, int y) { return static_cast<uint32_t>(p[static_cast<size_t>(y) * w + x]); }
}  // namespace

TEST(Brush, LightenCentreRimAndStrengthZero) {
  std::vector<int> img = random_picture(40, 30, 5), copy = img;
  px_apply_lighten(img.data(), 20, 15, 40, 30, 0, 9);
  EXPECT_EQ(img, copy);
  // r = 8: the step 2^22 / 64 is exact, so the centre gets the full strength.
  img = flat(40, 30, rgb(100, 100, 250, 0x66));
  px_apply_lighten(img.data(), 20, 15, 40, 30, 50, 8);
  EXPECT_EQ(at(img, 40, 20, 15), rgb(150, 150, 255, 0x66));
  EXPECT_EQ(at(img, 40, 28, 15), rgb(100, 100, 250, 0x66));  // distance exactly r
  EXPECT_EQ(at(img, 40, 20, 23), rgb(100, 100, 250, 0x66));
  // d^2 = 16 of 64: 100 + 50 * 48 / 64.
  EXPECT_EQ(at(img, 40, 24, 15), rgb(137, 137, 255, 0x66));
  // Partly outside the picture: clipped, corner pixel brightened.
  img = flat(40, 30, rgb(10, 10, 10));
  px_apply_lighten(img.data(), 0, 0, 40, 30, 40, 8);
  EXPECT_EQ(at(img, 40, 0, 0), rgb(50, 50, 50));
}

TEST(Brush, TheTwoDarkenFalloffsDiffer) {
  std::vector<int> full = flat(32, 32, rgb(100, 100, 30, 0x12)), preview_form = full;
  std::vector<int> preview(16 * 16, 0);
  px_apply_darken(full.data(), 16, 16, 32, 32, 50, 8);
  px_apply_darken_with_preview(preview_form.data(), 16, 16, 32, 32, preview.data(), 16, 16, 50, 8);
  // Centre: both take the full strength.
  EXPECT_EQ(at(full, 32, 16, 16), rgb(50, 50, 0, 0x12));
  EXPECT_EQ(at(preview_form, 32, 16, 16), rgb(50, 50, 0, 0x12));
  // Half way (d = 4): linear in d gives 75, quadratic in d^2 gives 62.
  EXPECT_EQ(at(full, 32, 20, 16), rgb(75, 75, 5, 0x12));
  EXPECT_EQ(at(preview_form, 32, 20, 16), rgb(62, 62, 0, 0x12));
  // At the rim nothing changes.
  EXPECT_EQ(at(full, 32, 24, 16), rgb(100, 100, 30, 0x12));
  EXPECT_EQ(at(preview_form, 32, 16, 24), rgb(100, 100, 30, 0x12));
  // Strength 0 leaves the quadratic form unchanged where its step 2^22 / r^2
  // is exact; otherwise the truncated step may take one level off.
  std::vector<int> img = random_picture(20, 20, 8), copy = img;
  px_apply_darken_with_preview(img.data(), 9, 9, 20, 20, preview.data(), 16, 16, 0, 8);
  EXPECT_EQ(img, copy);
  px_apply_darken_with_preview(img.data(), 9, 9, 20, 20, preview.data(), 16, 16, 0, 7);
  for (size_t i = 0; i < img.size(); ++i) {
    for (int sh : {0, 8, 16}) {
      const int a = (img[i] >> sh) & 255, b = (copy[i] >> sh) & 255;
      ASSERT_TRUE(a == b || a == b - 1) << i;
    }
  }
}

TEST(Brush, PreviewIsRedrawnUnderTheBrush) {
  std::vector<int> img = flat(16, 16, rgb(100, 100, 100)), preview(8 * 8, 0);
  px_apply_lighten_with_preview(img.data(), 8, 8, 16, 16, preview.data(), 8, 8, 40, 3);
  // Box 5..11 maps to preview 2..6, each sampling the picture at (2x, 2y).
  for (int y = 0; y < 8; ++y) {
    for (int x = 0; x < 8; ++x) {
      const bool redrawn = x >= 2 && x <= 6 && y >= 2 && y <= 6;
      EXPECT_EQ(static_cast<uint32_t>(preview[y * 8 + x]), redrawn ? at(img, 16, 2 * x, 2 * y) : 0u) << x << "," << y;
    }
  }
  // 2^22 / 9 truncated: the centre reaches 139 rather than 140.
  EXPECT_EQ(static_cast<uint32_t>(preview[4 * 8 + 4]), rgb(139, 139, 139));
}

TEST(Pixelize, CellsTakeTheirTopLeftPixel) {
  std::vector<int> in = random_picture(21, 13, 9), out(in.size());
  px_apply_pixelize(in.data(), out.data(), 21, 13, 0);
  EXPECT_EQ(out, in);
  px_apply_pixelize(in.data(), out.data(), 21, 13, 3);
  for (int y = 0; y < 13; ++y) {
    for (int x = 0; x < 21; ++x) ASSERT_EQ(at(out, 21, x, y), at(in, 21, x & ~7, y & ~7));
  }
  std::vector<int> same = in;
  px_apply_pixelize(same.data(), same.data(), 21, 13, 3);
  EXPECT_EQ(same, out);
  px_apply_pixelize(in.data(), out.data(), 21, 13, 32);  // the whole output takes the first pixel
  EXPECT_EQ(out, std::vector<int>(in.size(), in[0]));
  px_apply_pixelize(in.data(), out.data(), 21, 13, 256 + 1);  // only the low byte counts
  EXPECT_EQ(at(out, 21, 1, 1), at(in, 21, 0, 0));
}

TEST(Pixelize, RubChangesOnlyTheCellUnderTheCentre) {
  // Shift 3, radius 3 < 8: the diamond holds one cell, (8..15, 8..15).
  std::vector<int> img = random_picture(32, 32, 10), before = img;
  px_rub_pixelize(img.data(), 32, 32, 3, 15, 15, 3);
  for (int y = 0; y < 32; ++y) {
    for (int x = 0; x < 32; ++x) {
      const bool cell = x >= 8 && x <= 15 && y >= 8 && y <= 15;
      ASSERT_EQ(at(img, 32, x, y), cell ? at(before, 32, 8, 8) : at(before, 32, x, y)) << x << "," << y;
    }
  }
  // The box runs from the cell origin of cx - r to the cell origin of cx + r:
  // with both in the centre cell only its origin pixel is visited.
  img = before;
  px_rub_pixelize(img.data(), 32, 32, 3, 12, 12, 2);
  EXPECT_EQ(img, before);
  // Radius 16: two cells of reach; cells at diamond distance 3 stay.
  img = before;
  std::vector<int> preview(16 * 16, 0);
  px_rub_pixelize_with_preview(img.data(), 32, 32, preview.data(), 16, 16, 3, 12, 12, 16);
  EXPECT_EQ(at(img, 32, 3, 13), at(before, 32, 0, 8));       // cell (0, 1): distance 1 + 0
  EXPECT_EQ(at(img, 32, 17, 17), at(before, 32, 16, 16));    // cell (2, 2): distance 1 + 1
  EXPECT_EQ(at(img, 32, 3, 27), at(before, 32, 3, 27));      // cell (0, 3): distance 3, untouched
  EXPECT_EQ(static_cast<uint32_t>(preview[6 * 16 + 5]), at(img, 32, 10, 12));
}

// ---- colour splash -----------------------------------------------------------------

TEST(Splash, SessionKeepsAndRestoresTheColour) {
  px_finish_splash();
  std::vector<int> img = random_picture(24, 18, 11), colour = img;
  std::vector<int> before = img;
  px_draw_splash(img.data(), 5, 5, 24, 18, 4);  // no session: nothing happens
  px_recover_splash(img.data(), 24, 18);
  EXPECT_EQ(img, before);

  px_init_splash(img.data(), 24, 18);
  ASSERT_TRUE(px_splash_active());
  for (size_t i = 0; i < img.size(); ++i) {
    const uint32_t c = static_cast<uint32_t>(colour[i]);
    const uint32_t g = (((c >> 16) & 255) + 2 * ((c >> 8) & 255) + (c & 255)) >> 2;
    ASSERT_EQ(static_cast<uint32_t>(img[i]), (c & 0xFF000000u) | g << 16 | g << 8 | g);
  }
  std::vector<int> grey = img, grey2(img.size());
  px_set_gray_splash(colour.data(), grey2.data(), 24, 18);
  EXPECT_EQ(grey2, grey);

  px_draw_splash(img.data(), 10, 8, 24, 18, 3);
  for (int y = 0; y < 18; ++y) {
    for (int x = 0; x < 24; ++x) {
      const bool inside = (x - 10) * (x - 10) + (y - 8) * (y - 8) < 9;
      ASSERT_EQ(at(img, 24, x, y), inside ? at(colour, 24, x, y) : at(grey, 24, x, y)) << x << "," << y;
    }
  }
  std::vector<int> other = flat(12, 9, rgb(1, 2, 3));
  px_draw_splash(other.data(), 5, 5, 12, 9, 4);  // another size: ignored
  px_recover_splash(other.data(), 12, 9);
  EXPECT_EQ(other, flat(12, 9, rgb(1, 2, 3)));

  std::vector<int> preview(12 * 9, 0);
  px_draw_splash_with_preview(img.data(), 20, 14, 24, 18, preview.data(), 12, 9, 3);
  EXPECT_EQ(at(img, 24, 20, 14), at(colour, 24, 20, 14));
  EXPECT_EQ(static_cast<uint32_t>(preview[7 * 12 + 10]), at(colour, 24, 20, 14));

  px_recover_splash(img.data(), 24, 18);
  EXPECT_EQ(img, colour);

  // A second init replaces the kept copy (the earlier one is freed).
  px_init_splash(grey.data(), 24, 18);
  px_recover_splash(img.data(), 24, 18);
  EXPECT_EQ(img, grey);
  px_finish_splash();
  EXPECT_FALSE(px_splash_active());
  px_recover_splash(img.data(), 24, 18);
  EXPECT_EQ(img, grey);
}

// ---- invert and lens tints ------------------------------------------------------------

TEST(Invert, RegionRuleAndNullMask) {
  std::vector<int> in = {static_cast<int>(rgb(0, 128, 255, 0x40)), static_cast<int>(rgb(10, 20, 30))}, out(2, 5);
  std::vector<unsigned char> mask = {0, 1};
  EXPECT_EQ(px_apply_invert(in.data(), nullptr, out.data(), 2, 1, kWhole), PX_ERR_NULL);
  EXPECT_EQ(out, std::vector<int>(2, 5));
  EXPECT_EQ(px_apply_invert(in.data(), mask.data(), out.data(), 2, 1, kWhole), PX_OK);
  EXPECT_EQ(static_cast<uint32_t>(out[0]), rgb(255, 127, 0, 0x40));
  EXPECT_EQ(px_apply_invert(in.data(), mask.data(), out.data(), 2, 1, px_rect{0, 1, 0, 0}), PX_OK);
  EXPECT_EQ(out[0], in[0]);
  EXPECT_EQ(static_cast<uint32_t>(out[1]), rgb(245, 235, 225));
}

TEST(Lens, TopBandPullsTowardsTheTint) {
  // Hue level 0: the tint is (256, 0, 0). Size 50 of 10 rows: a 5-row band.
  std::vector<int> in = flat(4, 10, rgb(255, 255, 255, 0x70)), out(in.size());
  EXPECT_EQ(px_control_toplens(in.data(), out.data(), 4, 10, 0, 50), PX_OK);
  EXPECT_EQ(at(out, 4, 0, 0), rgb(255, 0, 0, 0x70));     // the border takes the tint where brighter
  EXPECT_EQ(at(out, 4, 3, 2), rgb(255, 102, 102, 0x70)); // weight 2/5
  EXPECT_EQ(at(out, 4, 0, 5), rgb(255, 255, 255, 0x70)); // below the band
  EXPECT_EQ(px_control_toplens(in.data(), out.data(), 4, 10, 0, 101), PX_ERR_NULL);
  std::vector<int> copy(in.size(), 0);
  EXPECT_EQ(px_control_toplens(in.data(), copy.data(), 4, 10, 3, 0), PX_OK);
  EXPECT_EQ(copy, in);
}

TEST(Lens, EdgeBandAndSizeZero) {
  std::vector<int> in = flat(10, 10, rgb(255, 255, 255)), out(in.size());
  EXPECT_EQ(px_control_edgelens(in.data(), out.data(), 10, 10, 0, 100), PX_OK);
  EXPECT_EQ(at(out, 10, 0, 5), rgb(255, 0, 0));     // e = 0
  EXPECT_EQ(at(out, 10, 9, 5), rgb(255, 51, 51));   // e = width - x = 1: weight 1/5
  EXPECT_EQ(at(out, 10, 5, 5), rgb(255, 255, 255)); // e = 5 = band: untouched
  // Size 0 gives a band of 0: the copy stands (no division by zero).
  std::vector<int> copy(in.size(), 0);
  EXPECT_EQ(px_control_edgelens(in.data(), copy.data(), 10, 10, 0, 0), PX_OK);
  EXPECT_EQ(copy, in);
  EXPECT_EQ(px_control_edgelens(nullptr, copy.data(), 10, 10, 0, 10), PX_ERR_NULL);
  // Darker than the tint: a channel at or below the tint's stays.
  in = flat(10, 10, rgb(0, 0, 0));
  EXPECT_EQ(px_control_edgelens(in.data(), out.data(), 10, 10, 7, 100), PX_OK);
  EXPECT_EQ(out, in);
}
