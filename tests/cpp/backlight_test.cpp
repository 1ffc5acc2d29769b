#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <random>
#include <vector>

#include "effect/backlight/px_backlight.h"
#include "effect/backlight/px_blc_math.h"
#include "effect/kalo/iel/iel_luma.h"
#include "effect/kalo/px_parallel.h"

namespace {

using Picture = std::vector<int>;

int argb(int a, int r, int g, int b) { return static_cast<int>(static_cast<uint32_t>(a) << 24 | r << 16 | g << 8 | b); }
int red(int p) { return (p >> 16) & 255; }
int green(int p) { return (p >> 8) & 255; }
int blue(int p) { return p & 255; }
int luma(int p) { return IEL_Luma(red(p), green(p), blue(p)); }

// A subject (an upright ellipse in the lower middle) in front of a bright sky.
bool in_subject(int x, int y, int w, int h) {
  const double dx = (x - 0.5 * w) / (0.25 * w), dy = (y - 0.65 * h) / (0.4 * h);
  return dx * dx + dy * dy <= 1;
}

// Backlit scene: a dark, textured, brownish subject against a bright bluish
// sky that fades towards the horizon; alpha varies.
Picture backlit(int w, int h, unsigned seed) {
  std::mt19937 rng(seed);
  Picture p(static_cast<size_t>(w) * h);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const int n = static_cast<int>(rng() % 17) - 8;
      const int a = 0x80 + (x + y) % 128;
      if (in_subject(x, y, w, h)) {
        p[static_cast<size_t>(y) * w + x] = argb(a, 52 + n, 38 + n, 30 + n);
      } else {
        const int sky = 200 + 30 * y / h;
        p[static_cast<size_t>(y) * w + x] = argb(a, sky - 25 + n / 2, sky - 5 + n / 2, 250 - n / 4);
      }
    }
  }
  return p;
}

// Evenly lit scene: smooth mid-tones with texture, no dark/bright split.
Picture evenly_lit(int w, int h, unsigned seed) {
  std::mt19937 rng(seed);
  Picture p(static_cast<size_t>(w) * h);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const int v = 110 + 40 * x / w + static_cast<int>(rng() % 21) - 10;
      p[static_cast<size_t>(y) * w + x] = argb(255, v, v - 5, v + 8);
    }
  }
  return p;
}

Picture save(const Picture& in, int w, int h, int strength) {
  Picture out(in.size(), 0x01020304);
  EXPECT_EQ(PX_OK, px_blc_save(in.data(), out.data(), w, h, strength));
  return out;
}

// Mean luma of the subject and largest channel change of the sky.
struct Change {
  double subject_before, subject_after;
  int sky_max_change;
};
Change change(const Picture& in, const Picture& out, int w, int h) {
  Change c{0, 0, 0};
  long n = 0;
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const int i = y * w + x;
      if (in_subject(x, y, w, h)) {
        c.subject_before += luma(in[i]);
        c.subject_after += luma(out[i]);
        ++n;
      } else {
        for (int d : {red(in[i]) - red(out[i]), green(in[i]) - green(out[i]), blue(in[i]) - blue(out[i])}) {
          if (std::abs(d) > c.sky_max_change) c.sky_max_change = std::abs(d);
        }
      }
    }
  }
  c.subject_before /= static_cast<double>(n);
  c.subject_after /= static_cast<double>(n);
  return c;
}

class Backlight : public ::testing::Test {
 protected:
  void SetUp() override { px_blc_deinit(); }
  void TearDown() override {
    px_blc_deinit();
    px_set_scalar_only(scalar_);
  }
  bool scalar_ = px_scalar_only();
};

// ---- integer gamma arithmetic ----------------------------------------------------

TEST(BacklightMath, LogAndRootsAgainstHandValues) {
  EXPECT_EQ(103872, blc::log2_q16(3));      // floor(log2(3) * 65536)
  EXPECT_EQ(523917, blc::log2_q16(255));    // floor(log2(255) * 65536)
  EXPECT_EQ(1518500249u, blc::exp2_frac_q30(32768));  // sqrt(2) in Q30
  EXPECT_EQ(1u << 30, blc::exp2_frac_q30(0));
  EXPECT_NEAR(32675, blc::gamma_for_q16(64, 128), 2);  // ln(128/255) / ln(64/255)
  EXPECT_EQ(65536, blc::gamma_for_q16(255, 100));       // no dark level to lift
}

TEST(BacklightMath, GammaCurveFollowsThePowerLaw) {
  EXPECT_NEAR(523263, blc::gamma_q12(64, 32768), 8);  // 255 * sqrt(64 / 255)
  EXPECT_EQ(0, blc::gamma_q12(0, 20000));
  EXPECT_EQ(255 << 12, blc::gamma_q12(255, 20000));
  for (int32_t g : {19661, 32768, 52429, 65536, 70000, 131072}) {
    for (int y = 1; y < 255; ++y) {
      const double exact = 255 * std::pow(y / 255.0, g / 65536.0) * 4096;
      // Within 1/128 of a level.
      EXPECT_NEAR(exact, blc::gamma_q12(y, g), 32) << "y " << y << " gamma " << g;
    }
  }
}

// ---- life cycle and result codes --------------------------------------------------

TEST_F(Backlight, RenderingWithoutAnalysisDoesNothing) {
  const int w = 16, h = 12;
  Picture in = backlit(w, h, 1), out(in.size(), 7);
  EXPECT_EQ(PX_ERR_NULL, px_blc_save(in.data(), out.data(), w, h, 50));
  EXPECT_EQ(PX_ERR_NULL, px_blc_preview(in.data(), out.data(), w, h, 50));
  EXPECT_EQ(Picture(in.size(), 7), out);
  EXPECT_EQ(0, px_blc_deinit());
  EXPECT_EQ(0, px_blc_deinit());

  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  EXPECT_EQ(0, px_blc_deinit());
  EXPECT_EQ(PX_ERR_NULL, px_blc_save(in.data(), out.data(), w, h, 50));
  EXPECT_EQ(0, px_blc_get_info().ready);
}

TEST_F(Backlight, BadArgumentsAreRefusedAndKeepTheAnalysis) {
  const int w = 40, h = 30;
  Picture in = backlit(w, h, 2), out(in.size(), 7);
  EXPECT_EQ(PX_ERR_NULL, px_blc_init(nullptr, w, h));
  EXPECT_EQ(PX_ERR_NULL, px_blc_init(in.data(), 0, h));
  EXPECT_EQ(0, px_blc_get_info().ready);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  EXPECT_EQ(PX_ERR_NULL, px_blc_init(in.data(), w, -1));
  EXPECT_EQ(w, px_blc_get_info().width);
  EXPECT_EQ(PX_ERR_NULL, px_blc_save(nullptr, out.data(), w, h, 50));
  EXPECT_EQ(PX_ERR_NULL, px_blc_preview(in.data(), nullptr, w, h, 50));
  EXPECT_EQ(PX_ERR_NULL, px_blc_save(in.data(), out.data(), 0, h, 50));
  EXPECT_EQ(Picture(in.size(), 7), out);
}

TEST_F(Backlight, SecondInitReplacesTheAnalysisAndDropsPreviewWeights) {
  Picture lit = backlit(64, 48, 3), even = evenly_lit(30, 20, 3);
  Picture out(lit.size());
  ASSERT_EQ(PX_OK, px_blc_init(lit.data(), 64, 48));
  ASSERT_EQ(PX_OK, px_blc_preview(lit.data(), out.data(), 64, 48, 60));
  EXPECT_EQ(1, px_blc_get_info().preview_cached);
  ASSERT_EQ(PX_OK, px_blc_init(even.data(), 30, 20));
  const px_blc_info info = px_blc_get_info();
  EXPECT_EQ(30, info.width);
  EXPECT_EQ(20, info.height);
  EXPECT_EQ(0, info.preview_cached);
  EXPECT_EQ(0, info.score);
}

// ---- what the correction does -------------------------------------------------------

TEST_F(Backlight, AnalysisFindsTheDarkSubjectAndTheBrightSky) {
  const int w = 600, h = 400;
  Picture in = backlit(w, h, 4);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  const px_blc_info info = px_blc_get_info();
  EXPECT_EQ(3, info.factor);  // 600 / 256 rounded up
  EXPECT_EQ(200, info.grid_w);
  EXPECT_EQ(134, info.grid_h);
  EXPECT_NEAR(41, info.subject_mean, 3);     // luma of 52, 38, 30
  EXPECT_NEAR(210, info.background_mean, 6);
  EXPECT_GT(info.threshold, 60);
  EXPECT_LT(info.threshold, 190);
  EXPECT_NEAR(1000 * M_PI * 0.25 * 0.4, info.subject_permille, 40);  // the ellipse's area, less the cut bottom
  EXPECT_EQ(256, info.score);
}

TEST_F(Backlight, DarkSubjectBrightensWhileTheSkyKeepsItsLevels) {
  const int w = 320, h = 240;
  Picture in = backlit(w, h, 5);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  const Change half = change(in, save(in, w, h, 50), w, h);
  const Change full = change(in, save(in, w, h, 100), w, h);
  EXPECT_GT(half.subject_after, half.subject_before + 20);
  EXPECT_GT(full.subject_after, half.subject_after + 20);
  EXPECT_LT(full.subject_after, 135);  // still darker than the sky
  // Every sky pixel, also those next to the subject's outline (no halo).
  EXPECT_LE(half.sky_max_change, 4);
  EXPECT_LE(full.sky_max_change, 6);
}

TEST_F(Backlight, StrengthZeroAndClampedStrengths) {
  const int w = 50, h = 40;
  Picture in = backlit(w, h, 6);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  EXPECT_EQ(in, save(in, w, h, 0));
  EXPECT_EQ(in, save(in, w, h, -20));
  EXPECT_EQ(save(in, w, h, 100), save(in, w, h, 250));
}

TEST_F(Backlight, EvenlyLitPictureIsLeftAlone) {
  const int w = 200, h = 150;
  Picture in = evenly_lit(w, h, 7);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  EXPECT_EQ(0, px_blc_get_info().score);
  EXPECT_EQ(in, save(in, w, h, 100));
}

TEST_F(Backlight, ModeratelyContrastyPictureChangesLittle) {
  // A plain left-to-right ramp from 60 to 200: a split exists but nothing is
  // backlit about it.
  const int w = 256, h = 64;
  Picture in(static_cast<size_t>(w) * h);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) in[y * w + x] = argb(255, 60 + x * 140 / w, 60 + x * 140 / w, 60 + x * 140 / w);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  EXPECT_LT(px_blc_get_info().score, 64);
  Picture out = save(in, w, h, 100);
  for (size_t i = 0; i < in.size(); ++i) ASSERT_LE(std::abs(luma(out[i]) - luma(in[i])), 8) << i;
}

TEST_F(Backlight, ColourAndAlphaAreKept) {
  const int w = 120, h = 90;
  Picture in = backlit(w, h, 8);
  const int at = (h * 65 / 100) * w + w / 2;  // centre of the subject
  in[at] = argb(0x33, 90, 20, 10);              // a saturated dark red
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  Picture out = save(in, w, h, 100);
  for (size_t i = 0; i < in.size(); ++i) ASSERT_EQ(in[i] & 0xFF000000, out[i] & 0xFF000000) << i;
  EXPECT_GT(red(out[at]), 90);
  // One gain on all channels: the ratios stay within rounding.
  EXPECT_NEAR(90.0 / 20, static_cast<double>(red(out[at])) / green(out[at]), 0.25);
  EXPECT_NEAR(2.0, static_cast<double>(green(out[at])) / blue(out[at]), 0.2);
}

TEST_F(Backlight, TinyAndThinPicturesWork) {
  for (auto [w, h] : {std::pair{1, 1}, {1, 300}, {500, 1}, {2, 2}}) {
    Picture in = backlit(w, h, 9);
    ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h)) << w << "x" << h;
    Picture out(in.size());
    EXPECT_EQ(PX_OK, px_blc_save(in.data(), out.data(), w, h, 100));
    EXPECT_EQ(PX_OK, px_blc_preview(in.data(), out.data(), w, h, 100));
  }
}

// ---- same pixels whatever the path -------------------------------------------------

TEST_F(Backlight, ResultDoesNotDependOnThreadsOrRowSplit) {
  const int w = 333, h = 257;
  Picture in = backlit(w, h, 10);
  px_set_scalar_only(false);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  const Picture threaded = save(in, w, h, 77);
  const px_blc_info threaded_info = px_blc_get_info();
  px_set_scalar_only(true);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  EXPECT_EQ(threaded_info.threshold, px_blc_get_info().threshold);
  EXPECT_EQ(threaded, save(in, w, h, 77));
  for (int rows : {1, 7, 64, 1000}) {
    Picture out(in.size());
    ASSERT_EQ(PX_OK, px_blc_save_chunked(in.data(), out.data(), w, h, 77, rows));
    EXPECT_EQ(threaded, out) << rows << " rows a band";
  }
}

TEST_F(Backlight, PreviewGivesTheSavePixelsAlsoFromKeptWeights) {
  const int w = 160, h = 120;
  Picture in = backlit(w, h, 11);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  Picture out(in.size());
  for (int s : {30, 90, 30}) {  // the second and third reuse the weights
    ASSERT_EQ(PX_OK, px_blc_preview(in.data(), out.data(), w, h, s));
    EXPECT_EQ(save(in, w, h, s), out) << "strength " << s;
  }
  // Another picture of the same size is not mistaken for the kept one.
  Picture other = backlit(w, h, 12);
  ASSERT_EQ(PX_OK, px_blc_preview(other.data(), out.data(), w, h, 90));
  EXPECT_EQ(save(other, w, h, 90), out);
  // In place.
  Picture same = in;
  ASSERT_EQ(PX_OK, px_blc_preview(same.data(), same.data(), w, h, 90));
  EXPECT_EQ(save(in, w, h, 90), same);
}

TEST_F(Backlight, ReducedDisplayCopyIsCorrectedLikeTheFullPicture) {
  const int w = 640, h = 480, pw = 160, ph = 120;
  Picture full = backlit(w, h, 13);
  ASSERT_EQ(PX_OK, px_blc_init(full.data(), w, h));
  Picture small = backlit(pw, ph, 14);  // the same scene drawn at a quarter size
  Picture out(small.size());
  ASSERT_EQ(PX_OK, px_blc_preview(small.data(), out.data(), pw, ph, 100));
  const Change c = change(small, out, pw, ph);
  EXPECT_GT(c.subject_after, c.subject_before + 40);
  EXPECT_LE(c.sky_max_change, 6);
}

// The same pixels on every platform (32-bit ARM included): a fingerprint of
// one rendering, recorded once and checked on each build.
TEST_F(Backlight, SamePixelsOnEveryPlatform) {
  const int w = 301, h = 203;
  Picture in = backlit(w, h, 15);
  ASSERT_EQ(PX_OK, px_blc_init(in.data(), w, h));
  const Picture out = save(in, w, h, 85);
  uint64_t fnv = 1469598103934665603ull;
  for (int p : out) fnv = (fnv ^ static_cast<uint32_t>(p)) * 1099511628211ull;
  EXPECT_EQ(4066598476316705936ull, fnv);
}

}  // namespace
