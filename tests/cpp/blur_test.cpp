#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <random>
#include <vector>

#include "effect/blur/px_blur.h"
#include "effect/kalo/iel/iel.h"
#include "effect/kalo/iel/iel_variable_blur.h"
#include "effect/kalo/px_mem.h"
#include "effect/kalo/px_parallel.h"
#include "effect/px_color/px_tone.h"
#include "log_capture.h"

namespace {
std::vector<int> random_picture(int w, int h, unsigned seed) {
  std::mt19937 rng(seed);
  std::vector<int> p(static_cast<size_t>(w) * h);
  for (int& v : p) v = static_cast<int>(rng());
  return p;
}

int chan(int pixel, int c) { return (static_cast<uint32_t>(pixel) >> (16 - 8 * c)) & 255; }

int rgb(int r, int g, int b, uint32_t a = 0xFF) { return static_cast<int>(a << 24 | r << 16 | g << 8 | b); }

// The selective blur reads the "whole picture" flag left by the last
// initialisation; a rectangle initialisation clears it.
void clear_whole_flag() {
  int px = 0;
  unsigned char m = 0;
  px_Init_blur(&px, &m, 1, 1, 0, 0, 0, 0);
  px_destroy_blur();
}

struct BlurState : ::testing::Test {
  void SetUp() override {
    clear_whole_flag();
    px_destroy_tiltshift();
  }
  void TearDown() override {
    px_destroy_blur();
    px_destroy_tiltshift();
  }
};
}  // namespace

TEST(BlurSteps, ReductionShiftByLongerSide) {
  EXPECT_EQ(px_blur_reduction_shift(420, 300), 0);
  EXPECT_EQ(px_blur_reduction_shift(300, 421), 1);
  EXPECT_EQ(px_blur_reduction_shift(850, 10), 1);
  EXPECT_EQ(px_blur_reduction_shift(851, 10), 2);
  EXPECT_EQ(px_blur_reduction_shift(1650, 1650), 2);
  EXPECT_EQ(px_blur_reduction_shift(1651, 8), 3);
  EXPECT_EQ(px_blur_reduction_shift(3250, 3000), 3);
  EXPECT_EQ(px_blur_reduction_shift(4000, 3000), 4);
  // A thin strip is reduced only as far as its short side allows.
  EXPECT_EQ(px_blur_reduction_shift(1000, 3), 1);
  EXPECT_EQ(px_blur_reduction_shift(5000, 1), 0);
}

TEST(BlurSteps, ReductionSamplesWithCrossedSteps) {
  // 10 x 4 into 3 x 2: along a row the step is 4 / 2 = 2, between rows 10 / 3 = 3.
  std::vector<int> src(40);
  for (int y = 0; y < 4; ++y) {
    for (int x = 0; x < 10; ++x) src[y * 10 + x] = rgb(x, y, 7, 0x12);
  }
  std::vector<unsigned char> dst(18, 99);
  scale_down_img(src.data(), 10, 4, dst.data(), 3, 2);
  const std::vector<unsigned char> want = {0, 0, 7, 2, 0, 7, 4, 0, 7, 0, 3, 7, 2, 3, 7, 4, 3, 7};
  EXPECT_EQ(dst, want);

  std::vector<unsigned char> mask(40, 0), small(6, 9);
  mask[3 * 10 + 4] = 1;
  mask[3 * 10 + 5] = 1;
  scale_down_depth(mask.data(), 10, 4, small.data(), 3, 2);
  EXPECT_EQ(small, (std::vector<unsigned char>{0, 0, 0, 0, 0, 1}));
}

TEST(BlurSteps, SelectiveBlurTapsAreLopsidedAndMasked) {
  // One row of greys 0, 90, 180. Level 0 is a copy.
  const std::vector<unsigned char> src = {0, 0, 0, 90, 90, 90, 180, 180, 180};
  std::vector<unsigned char> mask = {1, 1, 1}, dst(9);
  ASSERT_TRUE(make_gaussian_blur(src.data(), dst.data(), mask.data(), 3, 1, 0));
  EXPECT_EQ(dst, src);
  // Level 1 takes the left neighbour only: (0*8 + 90*9) / 17, (90*8 + 180*9) / 17.
  ASSERT_TRUE(make_gaussian_blur(src.data(), dst.data(), mask.data(), 3, 1, 1));
  EXPECT_EQ(dst, (std::vector<unsigned char>{0, 0, 0, 47, 47, 47, 137, 137, 137}));
  // A sharp neighbour is replaced by the centre pixel with weight 9.
  mask = {1, 0, 1};
  ASSERT_TRUE(make_gaussian_blur(src.data(), dst.data(), mask.data(), 3, 1, 1));
  EXPECT_EQ(dst, (std::vector<unsigned char>{0, 0, 0, 47, 47, 47, 180, 180, 180}));
  // Level 2 reaches one tap right as well; the same along a column.
  mask = {1, 1, 1};
  ASSERT_TRUE(make_gaussian_blur(src.data(), dst.data(), mask.data(), 1, 3, 2));
  // (0*9 + 90*8) / 17 = 42; (0*8 + 90*9 + 180*8) / 25 = 90; (90*8 + 180*9) / 17 = 137.
  EXPECT_EQ(dst, (std::vector<unsigned char>{42, 42, 42, 90, 90, 90, 137, 137, 137}));
}

TEST(BlurSteps, TiltShiftKernelNormalisesByUsedTaps) {
  std::vector<unsigned char> src(27, 0), dst(27);
  src[12] = src[13] = src[14] = 255;  // x = 4 of a 9 x 1 row
  ASSERT_TRUE(make_tiltshift(src.data(), dst.data(), 9, 1));
  EXPECT_EQ(dst[12], 255 * 9 / 55);  // all nine taps used
  EXPECT_EQ(dst[0], 255 * 3 / 32);   // taps 0..4 only
  EXPECT_EQ(dst[3], 255 * 5 / 40);   // taps -1..4
  EXPECT_EQ(dst[24], 255 * 3 / 32);
}

TEST(BlurSteps, TiltShiftRestoreWeightsRowsByDistanceFromTheBand) {
  // Source 200, blurred picture 0: each output row shows the sharp weight a.
  const int w = 4, h = 100;
  std::vector<int> src(w * h, rgb(200, 200, 200, 0x7F)), dst(w * h);
  std::vector<unsigned char> blurred(w * h * 3, 0);
  restore_tiltshift(src.data(), blurred.data(), dst.data(), w, h, w, h, 50, 10);
  // D = (100 - 50 - 10) / 2 = 20, K = (0x100000 / 20) * 256.
  EXPECT_EQ(dst[50 * w], rgb(199, 199, 199, 0x7F));  // a = 255 inside the band
  EXPECT_EQ(dst[40 * w], rgb(199, 199, 199, 0x7F));
  EXPECT_EQ(dst[70 * w + 3], rgb(99, 99, 99, 0x7F));  // half way: a = 127
  EXPECT_EQ(dst[80 * w], rgb(0, 0, 0, 0x7F));          // D rows beyond: blurred
  EXPECT_EQ(dst[0], rgb(0, 0, 0, 0x7F));

  // A band reaching the farther edge (D would be 0) keeps the band sharp.
  restore_tiltshift(src.data(), blurred.data(), dst.data(), w, h, w, h, 50, 50);
  EXPECT_EQ(dst, src);
  restore_tiltshift(src.data(), blurred.data(), dst.data(), w, h, w, h, 50, 49);
  EXPECT_EQ(dst[0], rgb(0, 0, 0, 0x7F));
  EXPECT_EQ(dst[w], src[w]);
}

TEST_F(BlurState, LevelZeroIsBilinearUpsamplingOfTheReducedPicture) {
  // 430 x 6 is halved to 215 x 3. Red = x / 2 and green = 40 y make the
  // reduced picture red = column, green = 80 * row.
  const int w = 430, h = 6;
  std::vector<int> src(w * h), dst(w * h);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) src[y * w + x] = rgb(x >> 1, 40 * y, 5, 0x80 + y);
  }
  std::vector<unsigned char> mask(w * h, 0);
  ASSERT_EQ(px_make_blur(src.data(), mask.data(), dst.data(), w, h, 0, 0, -1, 0, -1), PX_OK);
  // Rows at or beyond the last reduced one take the last but one with their
  // own fraction: green 0, 40, 80, 120, then 80, 120 again.
  const int green[h] = {0, 40, 80, 120, 80, 120};
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const int red = (x >> 1) < 213 ? x >> 1 : 213;
      ASSERT_EQ(dst[y * w + x], rgb(red, green[y], 5, 0x80 + y)) << x << "," << y;
    }
  }
  // The empty rectangle blurred everything and left the mask all zero.
  EXPECT_EQ(mask, std::vector<unsigned char>(w * h, 0));
}

TEST_F(BlurState, SmallPictureIsNotReduced) {
  const int w = 420, h = 5;
  std::vector<int> src = random_picture(w, h, 3), dst(w * h);
  std::vector<unsigned char> mask(w * h, 1);
  ASSERT_EQ(px_make_blur(src.data(), mask.data(), dst.data(), w, h, 0, 0, w - 1, 0, h - 1), PX_OK);
  // Every pixel but the last row and column is its own reduced sample.
  for (int y = 0; y < h - 1; ++y) {
    for (int x = 0; x < w - 1; ++x) ASSERT_EQ(dst[y * w + x], src[y * w + x]) << x << "," << y;
  }
}

TEST_F(BlurState, SubjectStaysSharpAndDoesNotBleed) {
  // Black subject on the left (mask 0), white background (mask 1).
  const int w = 64, h = 16;
  std::vector<int> src(w * h), dst(w * h);
  std::vector<unsigned char> mask(w * h);
  for (int i = 0; i < w * h; ++i) {
    const bool background = i % w >= 32;
    src[i] = background ? rgb(255, 255, 255, 0x11) : rgb(0, 0, 0, 0x22);
    mask[i] = background ? 1 : (i % 7 == 0 ? 2 : 0);  // 2 does not select
  }
  ASSERT_EQ(px_make_blur(src.data(), mask.data(), dst.data(), w, h, 8, 0, w - 1, 0, h - 1), PX_OK);
  EXPECT_EQ(dst, src);
}

TEST_F(BlurState, EmptyRectangleBlursEverythingAndClearsTheMask) {
  const int w = 40, h = 30;
  std::vector<int> src = random_picture(w, h, 5), whole(w * h), selected(w * h);
  std::vector<unsigned char> mask(w * h, 0), ones(w * h, 1);
  mask[17] = 1;
  ASSERT_EQ(px_make_blur(src.data(), mask.data(), whole.data(), w, h, 4, 3, 2, 0, 10), PX_OK);
  ASSERT_EQ(px_make_blur(src.data(), ones.data(), selected.data(), w, h, 4, 0, w - 1, 0, h - 1), PX_OK);
  EXPECT_EQ(whole, selected);
  EXPECT_NE(whole, src);
  EXPECT_EQ(mask, std::vector<unsigned char>(w * h, 0));
  // Without a mask at all the result is the same.
  std::vector<int> nomask(w * h);
  ASSERT_EQ(px_make_blur(src.data(), nullptr, nomask.data(), w, h, 4, 3, 2, 0, 10), PX_OK);
  EXPECT_EQ(nomask, whole);
}

TEST_F(BlurState, PreviewMatchesApplyAndNeedsInitialisation) {
  const int w = 500, h = 300;
  std::vector<int> src = random_picture(w, h, 7), preview(w * h, 0x5A5A5A5A), full(w * h);
  std::vector<unsigned char> mask(w * h, 0);
  for (int y = 100; y < 200; ++y) {
    for (int x = 0; x < 250; ++x) mask[y * w + x] = 1;
  }
  // No state: nothing is written.
  px_make_blur_preview(src.data(), mask.data(), preview.data(), w, h, 5);
  EXPECT_EQ(preview, std::vector<int>(w * h, 0x5A5A5A5A));

  ASSERT_EQ(px_Init_blur(src.data(), mask.data(), w, h, 0, w - 1, 0, h - 1), PX_OK);
  EXPECT_EQ(px_blur_all(), 0);
  for (int level : {2, 6, 5}) {
    px_make_blur_preview(src.data(), mask.data(), preview.data(), w, h, level);
    ASSERT_EQ(px_make_blur(src.data(), mask.data(), full.data(), w, h, level, 0, w - 1, 0, h - 1), PX_OK);
    EXPECT_EQ(preview, full) << level;
  }
  // A preview of another size stays inside its own arrays.
  std::vector<int> small_src = random_picture(50, 30, 8), small_dst(50 * 30);
  std::vector<unsigned char> small_mask(50 * 30, 1);
  px_make_blur_preview(small_src.data(), small_mask.data(), small_dst.data(), 50, 30, 3);
  EXPECT_NE(small_dst, std::vector<int>(50 * 30, 0));

  // Tilt-shift initialisation releases the blur state.
  ASSERT_EQ(px_init_tiltshift(src.data(), w, h), PX_OK);
  std::fill(preview.begin(), preview.end(), 0x5A5A5A5A);
  px_make_blur_preview(src.data(), mask.data(), preview.data(), w, h, 5);
  EXPECT_EQ(preview, std::vector<int>(w * h, 0x5A5A5A5A));
  px_destroy_blur();
  px_destroy_blur();
  px_destroy_tiltshift();
  px_destroy_tiltshift();
}

TEST_F(BlurState, EmptyRectangleInitialisationCoversEverything) {
  const int w = 60, h = 40;
  std::vector<int> src = random_picture(w, h, 9), preview(w * h), full(w * h);
  std::vector<unsigned char> mask(w * h, 0);
  ASSERT_EQ(px_Init_blur(src.data(), mask.data(), w, h, 5, 4, 0, 0), PX_OK);
  EXPECT_EQ(px_blur_all(), 1);
  EXPECT_EQ(mask, std::vector<unsigned char>(w * h, 0));
  // The full-size mask is not read: every pixel is blurred.
  px_make_blur_preview(src.data(), mask.data(), preview.data(), w, h, 3);
  std::vector<unsigned char> ones(w * h, 1);
  ASSERT_EQ(px_make_blur(src.data(), ones.data(), full.data(), w, h, 3, 0, w - 1, 0, h - 1), PX_OK);
  EXPECT_EQ(preview, full);
}

TEST_F(BlurState, TiltShiftPreviewMatchesApplyAndKeepsTheBand) {
  const int w = 900, h = 600;  // reduced by 4
  std::vector<int> src = random_picture(w, h, 11), preview(w * h, 0x77), full(w * h);
  px_tiltshift_preview(src.data(), preview.data(), w, h, 300, 50);
  EXPECT_EQ(preview, std::vector<int>(w * h, 0x77));  // no state yet
  ASSERT_EQ(px_init_tiltshift(src.data(), w, h), PX_OK);
  px_tiltshift_preview(src.data(), preview.data(), w, h, 300, 50);
  ASSERT_EQ(px_apply_tiltshift(src.data(), full.data(), w, h, 300, 50), PX_OK);
  EXPECT_EQ(preview, full);
  for (int y = 250; y <= 350; ++y) {
    for (int x = 0; x < w; ++x) {
      const int i = y * w + x;
      ASSERT_EQ(full[i] & 0xFF000000, src[i] & 0xFF000000);
      for (int c = 0; c < 3; ++c) ASSERT_LE(std::abs(chan(full[i], c) - chan(src[i], c)), 1) << x << "," << y;
    }
  }
  // The top row lies beyond the transition: fully blurred.
  int changed = 0;
  for (int x = 0; x < w; ++x) changed += chan(full[x], 0) != chan(src[x], 0);
  EXPECT_GT(changed, w / 2);
}

TEST(Miniature, KeepsTheMiddleRowsSharp) {
  const int w = 64, h = 800;
  std::vector<int> src = random_picture(w, h, 13), saturated(w * h), dst(w * h);
  px_control_saturation_all(src.data(), saturated.data(), w, h, 16);
  ASSERT_EQ(px_apply_miniature(src.data(), dst.data(), w, h), PX_OK);
  for (int y = 300; y <= 500; ++y) {
    for (int x = 0; x < w; ++x) {
      const int i = y * w + x;
      ASSERT_EQ(dst[i] & 0xFF000000, src[i] & 0xFF000000);
      for (int c = 0; c < 3; ++c) ASSERT_LE(std::abs(chan(dst[i], c) - chan(saturated[i], c)), 1) << x << "," << y;
    }
  }
  EXPECT_NE(std::vector<int>(dst.begin(), dst.begin() + w), std::vector<int>(saturated.begin(), saturated.begin() + w));
  // In place gives the same.
  std::vector<int> inplace = src;
  ASSERT_EQ(px_apply_miniature(inplace.data(), inplace.data(), w, h), PX_OK);
  EXPECT_EQ(inplace, dst);
}

TEST(BlurSteps, DegeneratePicturesStayInBounds) {
  // Strips and single pixels through every tool (ASan checks the bounds).
  for (auto [w, h] : {std::pair{1, 1}, {1, 2000}, {3, 1000}, {2000, 1}, {5000, 3}}) {
    std::vector<int> src = random_picture(w, h, 17), dst(static_cast<size_t>(w) * h);
    std::vector<unsigned char> mask(static_cast<size_t>(w) * h, 1);
    EXPECT_EQ(px_make_blur(src.data(), mask.data(), dst.data(), w, h, 7, 0, w - 1, 0, h - 1), PX_OK);
    EXPECT_EQ(px_apply_tiltshift(src.data(), dst.data(), w, h, h / 2, 0), PX_OK);
    EXPECT_EQ(px_apply_miniature(src.data(), dst.data(), w, h), PX_OK);
    EXPECT_EQ(px_blur_outfocus(src.data(), dst.data(), w, h, 7), IEL_OK);
  }
  EXPECT_EQ(px_make_blur(nullptr, nullptr, nullptr, 4, 4, 1, 0, 3, 0, 3), PX_ERR_NULL);
  EXPECT_EQ(px_apply_tiltshift(nullptr, nullptr, 4, 4, 1, 1), PX_ERR_NULL);
}

namespace {
// A grey ramp along the longer side, one level step per `run` pixels.
std::vector<int> ramp(int w, int h) {
  std::vector<int> p(static_cast<size_t>(w) * h);
  const int n = w > h ? w : h;
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const int v = static_cast<int>(static_cast<int64_t>(w > h ? x : y) * 255 / n);
      p[static_cast<size_t>(y) * w + x] = rgb(v, v, v);
    }
  }
  return p;
}

int max_difference(const std::vector<int>& a, const std::vector<int>& b) {
  int worst = 0;
  for (size_t i = 0; i < a.size(); ++i) {
    for (int c = 0; c < 3; ++c) worst = std::max(worst, std::abs(chan(a[i], c) - chan(b[i], c)));
  }
  return worst;
}
}  // namespace

TEST(BlurSteps, ThinStripsKeepTheirPlace) {
  // A strip whose short side the size table would empty is reduced less, with
  // each side's own step and an index that is not cut to 11 bits: level 0 and
  // the far rows of a tilt-shift stay on the ramp, however long the strip.
  for (auto [w, h] : {std::pair{1, 2469}, {3422, 3}, {2, 5000}, {9000, 5}}) {
    SCOPED_TRACE(testing::Message() << w << " x " << h);
    EXPECT_TRUE(px_blur_thin(w, h));
    const std::vector<int> src = ramp(w, h);
    std::vector<int> dst(src.size());
    EXPECT_EQ(px_make_blur(src.data(), nullptr, dst.data(), w, h, 0, 0, -1, 0, -1), PX_OK);
    EXPECT_LE(max_difference(src, dst), 3);
    const int centre = h > w ? h / 2 : 0;
    EXPECT_EQ(px_apply_tiltshift(src.data(), dst.data(), w, h, centre, 0), PX_OK);
    EXPECT_LE(max_difference(src, dst), 4);
  }
  // Ordinary pictures keep the size table's shift and the crossed steps.
  EXPECT_FALSE(px_blur_thin(4000, 3000));
  EXPECT_FALSE(px_blur_thin(4000, 40));
  EXPECT_FALSE(px_blur_thin(40000, 20));
}

// ---- effect 38 ------------------------------------------------------------------

namespace {
int variable_blur(std::vector<int>& in, std::vector<int>& out, int w, int h, int radius,
                  int16_t format = IEL_FORMAT_ARGB_PACK) {
  structIELImage a{w, h, format, reinterpret_cast<unsigned char*>(in.data())};
  structIELImage b{w, h, format, reinterpret_cast<unsigned char*>(out.data())};
  int32_t level = radius;
  structIELEffectParams p{IEL_EFFECT_VARIABLE_BLUR, &level, nullptr, 0, 0};
  return IEL_Apply_Effect(&a, &b, &p);
}
}  // namespace

TEST(VariableBlur, ImpulseSpreadsToTheRadiusKeepingItsEnergy) {
  const int w = 41, h = 41, c = 20;
  // 1 and 3 blur at full size, 4 and 7 a picture reduced by 2 (4 with the
  // smallest blur of it), 15 reduced by 3.
  for (int radius : {1, 3, 4, 7, 15}) {
    const bool direct = radius <= 3;
    std::vector<int> in(w * h, rgb(0, 0, 0, 0x40)), out(w * h);
    in[c * w + c] = rgb(255, 255, 255, 0x90);
    ASSERT_EQ(variable_blur(in, out, w, h, radius), IEL_OK);
    EXPECT_EQ(static_cast<uint32_t>(out[c * w + c]) >> 24, 0x90u);  // alpha from the input
    EXPECT_EQ(static_cast<uint32_t>(out[0]) >> 24, 0x40u);
    // At full size exactly the radius; reduced, at most two pixels more.
    const int reach = direct ? radius : radius + 2;
    int total = 0;
    for (int y = 0; y < h; ++y) {
      for (int x = 0; x < w; ++x) {
        const int v = chan(out[y * w + x], 1);
        total += v;
        if (std::abs(x - c) > reach || std::abs(y - c) > reach) {
          ASSERT_EQ(v, 0) << radius;
        }
        ASSERT_EQ(v, chan(out[y * w + x], 0));  // every channel alike
        if (direct) {
          ASSERT_EQ(v, chan(out[y * w + (2 * c - x)], 1));  // mirror left-right
          ASSERT_EQ(v, chan(out[(2 * c - y) * w + x], 1));  // mirror up-down
        }
      }
    }
    EXPECT_GT(chan(out[c * w + c + radius / 4], 1), 0) << radius;
    if (direct) {
      for (int x = c; x < c + radius; ++x) EXPECT_GE(chan(out[c * w + x], 1), chan(out[c * w + x + 1], 1));
    }
    EXPECT_NEAR(total, 255, 255 / 5 + 10) << radius;
  }
}

TEST(VariableBlur, ConstantStaysConstantAndRadiusZeroCopies) {
  // 33 x 17 leaves partial blocks, down to a corner of one pixel at radius 5.
  for (int radius : {2, 5, 63, 300}) {
    std::vector<int> in(33 * 17, rgb(12, 200, 77, 0x33)), out(33 * 17);
    ASSERT_EQ(variable_blur(in, out, 33, 17, radius), IEL_OK);
    EXPECT_EQ(out, in) << radius;
  }
  std::vector<int> pic = random_picture(19, 7, 21), copy(19 * 7);
  ASSERT_EQ(variable_blur(pic, copy, 19, 7, 0), IEL_OK);
  EXPECT_EQ(copy, pic);
}

TEST(VariableBlur, SameResultForAnyThreadCountAndInPlace) {
  const bool was = px_scalar_only();
  // Odd widths (pixels left over from the pairs and lanes of the wide
  // steps, partial blocks), one row, one column, pictures smaller than a block.
  for (auto [w, h] : {std::pair{517, 389}, {16, 900}, {1000, 3}, {1, 77}, {77, 1}, {13, 5}, {3, 2}}) {
    for (int radius : {1, 4, 5, 7, 15, 63}) {
      std::vector<int> in = random_picture(w, h, 23 + radius), fast(in.size()), scalar(in.size());
      px_set_scalar_only(false);
      ASSERT_EQ(variable_blur(in, fast, w, h, radius), IEL_OK);
      px_set_scalar_only(true);
      ASSERT_EQ(variable_blur(in, scalar, w, h, radius), IEL_OK);
      EXPECT_EQ(fast, scalar) << w << "x" << h << " r" << radius;
      px_set_scalar_only(was);
      std::vector<int> inplace = in;
      ASSERT_EQ(variable_blur(inplace, inplace, w, h, radius), IEL_OK);
      EXPECT_EQ(inplace, scalar) << w << "x" << h << " r" << radius;
    }
  }
  px_set_scalar_only(was);
}

TEST(VariableBlur, BinomialRoundsOnceAndLargeRadiiStopAt300) {
  // Radius 3 at full size: the binomial 1, 6, 15, 20, 15, 6, 1 over 64. An
  // impulse of 255, rounded once: 255 * 20 / 64 = 79.7 -> 80, 255 * 15 / 64
  // = 59.8 -> 60, 255 * 6 / 64 = 23.9 -> 24, 255 / 64 = 3.98 -> 4. (A
  // picture of one row: the vertical direction repeats the row and changes
  // nothing.)
  std::vector<int> in(11, rgb(0, 0, 0, 0x10)), out(11);
  in[5] = rgb(255, 0, 0, 0x20);
  ASSERT_EQ(variable_blur(in, out, 11, 1, 3), IEL_OK);
  const int expect[11] = {0, 0, 4, 24, 60, 80, 60, 24, 4, 0, 0};
  for (int x = 0; x < 11; ++x) EXPECT_EQ(chan(out[x], 0), expect[x]) << x;
  EXPECT_EQ(static_cast<uint32_t>(out[5]) >> 24, 0x20u);
  EXPECT_EQ(static_cast<uint32_t>(out[4]) >> 24, 0x10u);
  // Radii above 300 blur as 300.
  std::vector<int> pic = random_picture(23, 9, 5), a(pic.size()), b(pic.size());
  ASSERT_EQ(variable_blur(pic, a, 23, 9, 300), IEL_OK);
  ASSERT_EQ(variable_blur(pic, b, 23, 9, 5000), IEL_OK);
  EXPECT_EQ(a, b);
  // A picture of one constant channel per half keeps its extremes beyond
  // the reach (radius 9: blocks of 2, at most 11 pixels).
  std::vector<int> halves(40 * 3), blurred(halves.size());
  for (int i = 0; i < 120; ++i) halves[i] = (i % 40) < 20 ? rgb(0, 10, 250) : rgb(255, 10, 0);
  ASSERT_EQ(variable_blur(halves, blurred, 40, 3, 9), IEL_OK);
  for (int i = 0; i < 120; ++i) EXPECT_EQ(chan(blurred[i], 1), 10);
  for (int y = 0; y < 3; ++y) {
    EXPECT_EQ(chan(blurred[y * 40 + 8], 0), 0);
    EXPECT_EQ(chan(blurred[y * 40 + 31], 0), 255);
    for (int x = 0; x + 1 < 40; ++x) EXPECT_LE(chan(blurred[y * 40 + x], 0), chan(blurred[y * 40 + x + 1], 0));
  }
}

TEST(VariableBlur, ReducedBlocksAreRoundedMeans) {
  // Radius 7 blurs blocks of 2 x 2. A picture whose blocks hold four values
  // of one mean m blurs exactly like the picture filled with m in blocks:
  // the reduction sees only the means.
  const int w = 22, h = 14;
  std::mt19937 rng(7);
  std::vector<int> spread(w * h), flat(w * h), a(w * h), b(w * h);
  for (int by = 0; by < h / 2; ++by) {
    for (int bx = 0; bx < w / 2; ++bx) {
      const int m = static_cast<int>(rng() % 200) + 20, d = static_cast<int>(rng() % 20);
      const int vals[4] = {m - d, m + d, m + d, m - d};
      for (int k = 0; k < 4; ++k) {
        const int x = 2 * bx + k % 2, y = 2 * by + k / 2;
        spread[y * w + x] = rgb(vals[k], m, vals[3 - k]);
        flat[y * w + x] = rgb(m, m, m);
      }
    }
  }
  ASSERT_EQ(variable_blur(spread, a, w, h, 7), IEL_OK);
  ASSERT_EQ(variable_blur(flat, b, w, h, 7), IEL_OK);
  EXPECT_EQ(a, b);
}

TEST(VariableBlur, KeptOddities) {
  LogCapture log;
  std::vector<int> in = random_picture(4, 4, 1), out(16, 0x1234);
  // Packed RGB input: logged, success, nothing written.
  EXPECT_EQ(variable_blur(in, out, 4, 4, 7, IEL_FORMAT_RGB888), IEL_OK);
  EXPECT_TRUE(log.contains("Written for ARGB format only \n"));
  EXPECT_EQ(out, std::vector<int>(16, 0x1234));
  // Working memory refused (at full size and reduced): logged, success,
  // nothing written.
  for (int radius : {3, 40}) {
    px_mem_fail_nth(1);
    EXPECT_EQ(variable_blur(in, out, 4, 4, radius), IEL_OK);
    EXPECT_FALSE(px_mem_fail_pending());
    px_mem_fail_nth(0);
    EXPECT_EQ(out, std::vector<int>(16, 0x1234));
  }
  EXPECT_TRUE(log.contains("Failed to allocate \n"));
}

TEST(VariableBlur, OutfocusUsesTheRadiusTable) {
  // A white line on black: the blurred line is as wide as the radius allows.
  const int w = 300, h = 3, c = 150;
  std::vector<int> in(w * h, rgb(0, 0, 0));
  for (int y = 0; y < h; ++y) in[y * w + c] = rgb(255, 255, 255);
  for (auto [level, radius] : {std::pair{-2, 3}, {0, 3}, {1, 7}, {3, 31}, {7, 63}, {12, 63}}) {
    std::vector<int> out(w * h), direct(w * h);
    ASSERT_EQ(px_blur_outfocus(in.data(), out.data(), w, h, level), IEL_OK);
    structIELImage a{w, h, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(in.data())};
    structIELImage b{w, h, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(direct.data())};
    ASSERT_EQ(IEL_VariableBlur_ARGB8888(&a, &b, radius), IEL_OK);
    EXPECT_EQ(out, direct) << level;
    EXPECT_EQ(chan(out[c + radius + 3], 0), 0) << level;
    EXPECT_NE(chan(out[c + radius / 2], 0), 0) << level;
  }
}
