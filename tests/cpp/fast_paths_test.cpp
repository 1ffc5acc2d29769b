// The fast paths of the per-pixel operations (row bands, fused chains,
// tables and reciprocals in place of divisions) against the plain path of
// the scalar switch, bit for bit, on seeded random pictures of awkward sizes;
// and the replaced divisions checked over every value they can meet.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <functional>
#include <random>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "effect/kalo/iel/iel.h"
#include "effect/kalo/iel/iel_artistic.h"
#include "effect/kalo/iel/iel_effects.h"
#include "effect/kalo/px_parallel.h"
#include "effect/px_color/px_auto_adjust.h"
#include "effect/px_color/px_hue.h"
#include "effect/px_color/px_tone.h"
#include "effect/px_color/px_tone_pixels.h"
#include "effect/px_filter/px_filter.h"
#include "effect/px_gpu_effects/px_gpu_effects.h"
#include "pixel_buffers.h"

namespace {

using Pic = std::vector<int>;

// 1 x N, N x 1, odd widths, and enough rows for several bands.
const std::pair<int, int> kSizes[] = {{1, 1}, {1, 157}, {157, 1}, {3, 5}, {17, 9}, {31, 131}, {129, 130}};

Pic random_picture(int w, int h, unsigned seed) {
  std::mt19937 rng(seed);
  Pic p(static_cast<size_t>(w) * h);
  for (int& v : p) v = static_cast<int>(rng());
  return p;
}

// Mask bytes 0, 1, 2 and 255: only 1 selects.
std::vector<unsigned char> random_mask(size_t n, unsigned seed) {
  std::mt19937 rng(seed);
  static const unsigned char kBytes[4] = {0, 1, 2, 255};
  std::vector<unsigned char> m(n);
  for (auto& b : m) b = kBytes[rng() & 3];
  return m;
}

// Runs op once on the fast path and once on the plain path; both start from
// the same output contents.
template <class Out, class Op>
std::pair<Out, Out> both_paths(const Out& start, Op op) {
  const bool was = px_scalar_only();
  Out fast = start, plain = start;
  px_set_scalar_only(false);
  op(fast);
  px_set_scalar_only(true);
  op(plain);
  px_set_scalar_only(was);
  return {fast, plain};
}

template <class... Parts>
std::string label(const Parts&... parts) {
  std::ostringstream s;
  (s << ... << parts);
  return s.str();
}

template <class Out, class Op>
void expect_same_both_ways(const Out& start, Op op, const std::string& what) {
  auto [fast, plain] = both_paths(start, op);
  EXPECT_EQ(fast, plain) << what;
}

// ---- the bridge's conversions ------------------------------------------------

TEST(PixelBuffersFast, ConversionsAndMaskedMergeMatchThePlainLoops) {
  for (const auto& pair_ : kSizes) {
    const auto w = pair_.first;
    const auto h = pair_.second;
    const size_t n = static_cast<size_t>(w) * h;
    const Pic in = random_picture(w, h, 11 + w), alpha = random_picture(w, h, 12 + h);
    const auto mask = random_mask(n, 13 + w * h);
    std::vector<unsigned char> rgb(n * 3, 0x5A);
    expect_same_both_ways(
        rgb, [&](auto& o) { convertIntArrayToByteArray(in.data(), o.data(), w, h); }, label(w, "x", h));
    convertIntArrayToByteArray(in.data(), rgb.data(), w, h);
    const Pic start(n, 0x13579BDF);
    expect_same_both_ways(
        start, [&](Pic& o) { convertByteArraytoIntArray(rgb.data(), o.data(), alpha.data(), w, h); }, label(w, "x", h));
    for (px_rect r : {px_rect{0, -1, 0, -1}, px_rect{0, w - 1, 0, h - 1}}) {
      expect_same_both_ways(
          start,
          [&](Pic& o) {
            convertByteArraytoIntArrayUsingMask(rgb.data(), o.data(), alpha.data(), mask.data(), w, h, r);
          },
          label(w, "x", h, " rect ", r.left, ",", r.right));
    }
  }
}

// The bridge hands the effects buffers that are not zero-filled: every effect
// it runs on packed RGB must write every byte of its output.
TEST(PixelBuffersFast, RgbEffectsWriteEveryOutputByte) {
  const int16_t effects[] = {IEL_EFFECT_SEPIA,     IEL_EFFECT_CARTOON,  IEL_EFFECT_MAGIC_PEN,     IEL_EFFECT_OIL_PAINT,
                             IEL_EFFECT_POSTERIZE, IEL_EFFECT_HALFTONE, IEL_EFFECT_SKETCH_TEXTURE};
  for (const auto& pair_ : {std::pair{1, 1}, {2, 9}, {9, 2}, {33, 17}}) {
    const auto w = pair_.first;
    const auto h = pair_.second;
    const size_t n = static_cast<size_t>(w) * h;
    const Pic argb = random_picture(w, h, 21 + w), texture = random_picture(w, h, 22);
    std::vector<unsigned char> rgb(n * 3);
    convertIntArrayToByteArray(argb.data(), rgb.data(), w, h);
    for (int16_t effect : effects) {
      std::vector<unsigned char> zeros(n * 3, 0), filled(n * 3, 0xA5);
      structIELImage in{w, h, IEL_FORMAT_RGB888, rgb.data()};
      structIELImage tex{w, h, IEL_FORMAT_ARGB_PACK,
                         reinterpret_cast<unsigned char*>(const_cast<int*>(texture.data()))};
      int32_t level = effect == IEL_EFFECT_SEPIA ? 15 : (effect == IEL_EFFECT_CARTOON ? 2 : 0);
      structIELEffectParams params{effect, &level, effect == IEL_EFFECT_SKETCH_TEXTURE ? &tex : nullptr, 0, 0};
      structIELImage a{w, h, IEL_FORMAT_RGB888, zeros.data()}, b{w, h, IEL_FORMAT_RGB888, filled.data()};
      const int rc_a = IEL_Apply_Effect(&in, &a, &params), rc_b = IEL_Apply_Effect(&in, &b, &params);
      ASSERT_EQ(rc_a, IEL_OK) << "effect " << effect << " at " << w << "x" << h;
      ASSERT_EQ(rc_b, IEL_OK);
      EXPECT_EQ(zeros, filled) << "effect " << effect << " at " << w << "x" << h;
    }
  }
}

// ---- effect library ----------------------------------------------------------

TEST(EffectsFast, SepiaMatchesThePlainLoopInEveryFormatAndLevel) {
  for (const auto& pair_ : kSizes) {
    const auto w = pair_.first;
    const auto h = pair_.second;
    const size_t n = static_cast<size_t>(w) * h;
    std::vector<unsigned char> src(n * 4);
    std::mt19937 rng(31 + w);
    for (auto& b : src) b = static_cast<unsigned char>(rng());
    for (int16_t format : {IEL_FORMAT_RGB565, IEL_FORMAT_RGB888, IEL_FORMAT_ARGB_PACK}) {
      for (int level : {-5, 0, 1, 17, 50, 51, 99, 100}) {
        const std::vector<unsigned char> start(n * 4, 0x77);
        expect_same_both_ways(
            start,
            [&](std::vector<unsigned char>& o) {
              structIELImage a{w, h, format, src.data()}, b{w, h, format, o.data()};
              ASSERT_EQ(IEL_SepiaFast(&a, &b, level), IEL_OK);
            },
            label(w, "x", h, " format ", format, " level ", level));
      }
    }
  }
}

TEST(EffectsFast, PosterizeMatchesThePlainLoopInEveryFormat) {
  for (const auto& pair_ : kSizes) {
    const auto w = pair_.first;
    const auto h = pair_.second;
    const size_t n = static_cast<size_t>(w) * h;
    std::vector<unsigned char> src(n * 4);
    std::mt19937 rng(35 + w);
    for (auto& b : src) b = static_cast<unsigned char>(rng());
    for (int16_t format : {IEL_FORMAT_RGB565, IEL_FORMAT_RGB888, IEL_FORMAT_ARGB_PACK}) {
      expect_same_both_ways(
          std::vector<unsigned char>(n * 4, 0x66),
          [&](std::vector<unsigned char>& o) {
            structIELImage a{w, h, format, src.data()}, b{w, h, format, o.data()};
            ASSERT_EQ(IEL_PosterizeNew(&a, &b), IEL_OK);
          },
          label(w, "x", h, " format ", format));
    }
  }
}

// The bridge runs posterize in place on packed RGB; every byte value, in rows
// longer and shorter than the in-place runs of bytes.
TEST(EffectsFast, PosterizeInPlaceMatchesThePlainLoopForEveryByte) {
  for (const auto& pair_ : {std::pair{1, 1}, {86, 1}, {1, 256}, {129, 3}, {301, 5}}) {
    const auto w = pair_.first;
    const auto h = pair_.second;
    std::vector<unsigned char> src(static_cast<size_t>(w) * h * 3);
    for (size_t i = 0; i < src.size(); ++i) src[i] = static_cast<unsigned char>(i * 7 + i / 256);
    const auto [fast, plain] = both_paths(src, [&](std::vector<unsigned char>& o) {
      structIELImage a{w, h, IEL_FORMAT_RGB888, o.data()};
      ASSERT_EQ(IEL_PosterizeNew(&a, &a), IEL_OK);
    });
    EXPECT_EQ(fast, plain) << w << "x" << h;
  }
}

TEST(EffectsFast, VintageCurvesMatchThePlainLoop) {
  for (const auto& pair_ : kSizes) {
    const auto w = pair_.first;
    const auto h = pair_.second;
    const Pic in = random_picture(w, h, 41 + h);
    expect_same_both_ways(
        Pic(in.size(), 0),
        [&](Pic& o) {
          IEL_Vintage_ARGB_Pack(reinterpret_cast<const uint32_t*>(in.data()), reinterpret_cast<uint32_t*>(o.data()), w,
                                h);
        },
        label(w, "x", h));
  }
}

// ---- auto adjust ----------------------------------------------------------------

// The large-picture path counts bright pixels by comparing the luma sum with
// one threshold instead of dividing each pixel's luminance by 255.
TEST(AutoAdjustFast, BrightThresholdAgreesWithTheDivisionForEverySum) {
  const int threshold = px_auto_adjust_bright_sum();
  for (int32_t s = 0; s <= 218 * 255 + 732 * 255 + 74 * 255; ++s) {
    const int32_t l = static_cast<int32_t>(static_cast<uint32_t>(s) << 10);
    const bool bright = (((l / 255) * 100) >> 20) > 49;
    ASSERT_EQ(bright, s >= threshold) << "sum " << s;
  }
}

// Pictures just above the large-picture size, dark, bright and mixed, so each
// of the three global adjustments is taken; 1 x N and N x 1 as well.
TEST(AutoAdjustFast, LargePicturesMatchThePlainPath) {
  struct Case {
    int w, h;
    unsigned lo, hi;  // channel range
  };
  for (Case c : {Case{1001, 1999, 0, 90}, Case{1999, 1001, 150, 255}, Case{1417, 1413, 0, 255},
                 Case{1, 2000003, 0, 255}, Case{2000003, 1, 100, 200}}) {
    const size_t n = static_cast<size_t>(c.w) * c.h;
    std::mt19937 rng(51 + c.w);
    std::uniform_int_distribution<unsigned> ch(c.lo, c.hi);
    Pic in(n);
    for (int& v : in) v = static_cast<int>((rng() & 0xFF000000u) | ch(rng) << 16 | ch(rng) << 8 | ch(rng));
    expect_same_both_ways(
        Pic(n, 0), [&](Pic& o) { ASSERT_EQ(px_process_hdr(in.data(), o.data(), c.w, c.h), 40960); },
        label(c.w, "x", c.h));
  }
}

// ---- filter chains ------------------------------------------------------------

using WholeFilter = void (*)(int*, int*, int, int);

TEST(FilterChainsFast, FusedChainsMatchTheStepByStepChains) {
  const std::pair<const char*, WholeFilter> chains[] = {{"retro", px_apply_retro},
                                                        {"vintage", px_apply_vintage},
                                                        {"vintage preview", px_apply_vintage_prev},
                                                        {"gothic noir", gpu_gothicnoir}};
  for (const auto& pair_ : chains) {
    const auto name = pair_.first;
    const auto fn = pair_.second;
    // Rows longer than the fused loops' runs of 256 pixels as well.
    for (const auto& pair_ : {kSizes[1], kSizes[2], kSizes[4], kSizes[6], std::pair{601, 5}, std::pair{513, 2}}) {
      const auto w = pair_.first;
      const auto h = pair_.second;
      Pic in = random_picture(w, h, 61 + w * 7 + h);
      expect_same_both_ways(
          Pic(in.size(), 0), [&](Pic& o) { fn(in.data(), o.data(), w, h); }, label(name, " ", w, "x", h));
      // In place.
      expect_same_both_ways(
          in, [&](Pic& o) { fn(o.data(), o.data(), w, h); }, label(name, " in place ", w, "x", h));
    }
  }
}

// Gothic noir's fast path multiplies by the inverse span in its luma and
// redness smoothsteps; the same values as the division for every colour's
// luma and every difference of two channel values.
TEST(FilterChainsFast, GothicNoirSmoothstepsByInverseMatchTheDivisionEverywhere) {
  long luma_differs = 0, red_differs = 0;
  for (int r = 0; r < 256; ++r) {
    const double cr = r / 255.0;
    for (int g = 0; g < 256; ++g) {
      const double cg = g / 255.0;
      const double x = cr - cg;
      if (smoothstep(0.25, 0.45, x) != smoothstep_by_inverse(0.25, kNoirRednessInverse, x)) {
        ADD_FAILURE() << "redness of " << r << " - " << g;
        ++red_differs;
      }
      for (int b = 0; b < 256; ++b) {
        const double l = 0.299 * cr + 0.587 * cg + 0.114 * (b / 255.0);
        if (smoothstep(0.12, 0.78, l) != smoothstep_by_inverse(0.12, kNoirLumaInverse, l) && ++luma_differs < 5) {
          ADD_FAILURE() << "luma of " << r << ", " << g << ", " << b;
        }
      }
    }
  }
  EXPECT_EQ(luma_differs, 0);
  EXPECT_EQ(red_differs, 0);
}

// The fused dawn cast's overlay sums two 16-bit products by halving them
// first: the same shifted sum for every pair of products that can occur.
TEST(FilterChainsFast, HalvedSumOfTwoProductsShiftsAsTheSum) {
  for (uint32_t a = 0; a <= 255u * 255u; ++a) {
    for (uint32_t b = 0; b <= 255u * 255u; b += (b < 300 || b > 64700) ? 1 : 97) {
      ASSERT_EQ((a + b) >> 8, ((a >> 1) + (b >> 1) + (a & b & 1)) >> 7) << a << " " << b;
    }
  }
}

TEST(FilterChainsFast, DawnCastMatchesTheStepByStepChainWithAnyArraysShared) {
  for (const auto& pair_ : {kSizes[0], kSizes[1], kSizes[2], kSizes[3], kSizes[5], kSizes[6], std::pair{601, 3}}) {
    const auto w = pair_.first;
    const auto h = pair_.second;
    const Pic in = random_picture(w, h, 71 + w), overlay = random_picture(w, h, 72 + h),
              screen = random_picture(w, h, 73);
    Pic ov = overlay, sc = screen;
    expect_same_both_ways(
        Pic(in.size(), 0),
        [&](Pic& o) {
          Pic i = in;
          px_apply_dawncast_texture(i.data(), o.data(), ov.data(), sc.data(), w, h);
        },
        label(w, "x", h));
    // The output array also serving as picture and as either texture.
    expect_same_both_ways(
        in, [&](Pic& o) { px_apply_dawncast_texture(o.data(), o.data(), ov.data(), sc.data(), w, h); },
        label("in place ", w, "x", h));
    expect_same_both_ways(
        screen,
        [&](Pic& o) {
          Pic i = in;
          px_apply_dawncast_texture(i.data(), o.data(), ov.data(), o.data(), w, h);
        },
        label("screen is out ", w, "x", h));
    expect_same_both_ways(
        overlay,
        [&](Pic& o) {
          Pic i = in;
          px_apply_dawncast_texture(i.data(), o.data(), o.data(), sc.data(), w, h);
        },
        label("overlay is out ", w, "x", h));
  }
}

}  // namespace

namespace {

// ---- tone, hue, point colour -----------------------------------------------------

using RegionOp = void (*)(int*, unsigned char*, int*, int, int, int, px_rect);

int exposure(int* in, unsigned char* mask, int* out, int w, int h, int level, px_rect r) {
  return px_control_exposure(in, mask, out, w, h, level, r);
}
int faded(int* in, unsigned char* mask, int* out, int w, int h, int level, px_rect r) {
  return px_control_fadedcolor(in, mask, out, w, h, level, r);
}
int hue(int* in, unsigned char* mask, int* out, int w, int h, int level, px_rect r) {
  return px_control_hue(in, mask, out, w, h, level, r);
}
int hue100(int* in, unsigned char* mask, int* out, int w, int h, int level, px_rect r) {
  return px_control_hue_range100(in, mask, out, w, h, level, r);
}

struct RegionCase {
  const char* name;
  std::function<void(int*, unsigned char*, int*, int, int, int, px_rect)> op;
  int lo, hi;  // levels, every one tried
};

const RegionCase kRegionOps[] = {
    {"brightness", px_control_brightness, -1, 21},
    {"brightness100", px_control_brightness_range100, 0, 100},
    {"contrast", px_control_contrast, 0, 20},
    {"saturation", px_control_saturation, -1, 21},
    {"saturation100", px_control_saturation_range100, 0, 100},
    {"temperature", px_control_temperature, 0, 20},
    {"temperature100", px_control_temperature_range100, 0, 100},
    {"greyscale", px_control_greyscale, -2, 22},
    {"exposure", exposure, 0, 20},
    {"faded", faded, -3, 100},
    {"hue", hue, -41, 61},
    {"hue100", hue100, -1, 101},
};

// Whole picture, a rectangle reaching outside it and one wholly outside it,
// each with a random mask; in place as well.
TEST(RegionOpsFast, EveryLevelMatchesThePlainPath) {
  for (const RegionCase& c : kRegionOps) {
    for (const auto& pair_ : {std::pair{1, 37}, {37, 1}, {17, 9}, {31, 131}}) {
      const auto w = pair_.first;
      const auto h = pair_.second;
      Pic in = random_picture(w, h, 81 + w);
      const auto mask = random_mask(in.size(), 82 + h);
      auto m = mask;
      for (int level = c.lo; level <= c.hi; ++level) {
        for (px_rect r : {px_rect{0, -1, 0, -1}, px_rect{w / 3, w + 4, -2, h / 2}, px_rect{w + 1, w + 5, 0, h}}) {
          const std::string what = label(c.name, " level ", level, " ", w, "x", h, " rect ", r.left, ",", r.right);
          expect_same_both_ways(
              Pic(in.size(), 0x0BADF00D), [&](Pic& o) { c.op(in.data(), m.data(), o.data(), w, h, level, r); }, what);
          expect_same_both_ways(
              in, [&](Pic& o) { c.op(o.data(), m.data(), o.data(), w, h, level, r); }, "in place " + what);
        }
      }
      EXPECT_EQ(m, mask) << c.name << ": the mask is only read";
    }
  }
}

// Hue on a lattice of colours through the whole cube (every HSV sector, the
// greys and both ends of every channel), for every level of both scales.
TEST(RegionOpsFast, HueOverTheColourCube) {
  Pic cube;
  for (int r = 0; r < 256; r += 5)
    for (int g = 0; g < 256; g += 5)
      for (int b = 0; b < 256; b += 3) cube.push_back(static_cast<int>(0x80000000u | r << 16 | g << 8 | b));
  const int w = 401, h = static_cast<int>(cube.size() / 401);
  cube.resize(static_cast<size_t>(w) * h);
  const px_rect whole{0, -1, 0, -1};
  for (int level = 0; level <= 100; ++level) {
    expect_same_both_ways(
        Pic(cube.size()), [&](Pic& o) { hue100(cube.data(), nullptr, o.data(), w, h, level, whole); },
        label("hue100 ", level));
    if (level <= 20) {
      expect_same_both_ways(
          Pic(cube.size()), [&](Pic& o) { hue(cube.data(), nullptr, o.data(), w, h, level, whole); },
          label("hue ", level));
    }
  }
}

// Hue's table of turned hues against the plain conversions for every colour
// of the cube (each alpha kept), on two turns of each scale: sector edges,
// the greys, v = 255 and the colours whose hue rounds up to 360.
TEST(RegionOpsFast, HueTurnsEveryColourAsThePlainPath) {
  const int w = 4096, h = 4096;
  Pic cube(static_cast<size_t>(w) * h);
  for (uint32_t c = 0; c < cube.size(); ++c) cube[c] = static_cast<int>((c * 0x9E3779B9u & 0xFF000000u) | c);
  const px_rect whole{0, -1, 0, -1};
  // The first colour that differs, rather than 16 M pixels.
  const auto first_difference = [&](const Pic& a, const Pic& b) {
    const auto at = std::mismatch(a.begin(), a.end(), b.begin());
    return at.first == a.end() ? std::string("none") : label(std::hex, cube[static_cast<size_t>(at.first - a.begin())]);
  };
  for (int level : {13, 77}) {
    auto [fast, plain] =
        both_paths(Pic(cube.size()), [&](Pic& o) { hue100(cube.data(), nullptr, o.data(), w, h, level, whole); });
    EXPECT_EQ(first_difference(fast, plain), "none") << "hue100 " << level;
  }
  // Masked, rows of the rectangle longer than the fast path's runs.
  auto mask = random_mask(cube.size(), 7);
  auto [fast, plain] = both_paths(Pic(cube.size(), 0x0BADF00D), [&](Pic& o) {
    hue100(cube.data(), mask.data(), o.data(), w, h, 31, px_rect{3, 4000, 1, 4094});
  });
  EXPECT_EQ(first_difference(fast, plain), "none") << "hue100 masked";
  for (int level : {-3, 7}) {
    auto [fast, plain] =
        both_paths(Pic(cube.size()), [&](Pic& o) { hue(cube.data(), nullptr, o.data(), w, h, level, whole); });
    EXPECT_EQ(first_difference(fast, plain), "none") << "hue " << level;
  }
}

// Faded colour's maps against its division, every channel value and level;
// greyscale's reciprocal against its division by 3 for every channel sum.
TEST(RegionOpsFast, FadedMapsAndGreyscaleReciprocalAgreeWithTheDivisions) {
  for (int s = 0; s <= 765; ++s) ASSERT_EQ(s / 3, (s * 43691) >> 17) << s;
  Pic greys(256);
  for (int v = 0; v < 256; ++v) greys[v] = static_cast<int>(0xFF000000u | static_cast<uint32_t>(v) * 0x010101u);
  // Channel sums 0..765 with different channel splits.
  Pic sums;
  for (int s = 0; s <= 765; ++s) {
    const int r = s > 510 ? 255 : (s > 255 ? s - 255 : s), g = s > 510 ? s - 510 : (s > 255 ? 255 : 0),
              b = s > 510 ? 255 : 0;
    sums.push_back(static_cast<int>(0xFF000000u | r << 16 | g << 8 | b));
    sums.push_back(static_cast<int>(0xFF000000u | g << 16 | b << 8 | r));
  }
  const px_rect whole{0, -1, 0, -1};
  for (int level = -3; level <= 100; ++level) {
    expect_same_both_ways(
        Pic(256), [&](Pic& o) { px_control_fadedcolor_all(greys.data(), o.data(), 256, 1, level); },
        label("faded ", level));
  }
  for (int level = -2; level <= 22; ++level) {
    const int n = static_cast<int>(sums.size());
    expect_same_both_ways(
        Pic(sums.size()), [&](Pic& o) { px_control_greyscale(sums.data(), nullptr, o.data(), n, 1, level, whole); },
        label("greyscale ", level));
  }
}

// The 16-bit conversions of the fast paths against the plain ones: every
// colour forwards; backwards every chroma pair up to the bound, over the
// lumas the tone steps produce and the ends of the brightness bound.
TEST(YccFast, SixteenBitConversionsAgreeWithThePlainOnes) {
  using namespace px_tone;
  for (int c = 0; c < (1 << 24); ++c) {
    const Rgb x{c >> 16, (c >> 8) & 255, c & 255};
    const Ycc a = to_ycc(x), b = to_ycc16(x);
    ASSERT_TRUE(a.y == b.y && a.cb == b.cb && a.cr == b.cr) << std::hex << c;
  }
  std::vector<int> lumas;
  for (int y = -140; y <= 400; ++y) lumas.push_back(y);
  for (int end : {-Brightness16::kMaxOffset, Brightness16::kMaxOffset + 255}) {
    for (int d = -3; d <= 3; ++d) lumas.push_back(end + d);
  }
  const uint32_t alpha = 0x5A000000u;
  for (int y : lumas) {
    for (int cb = -kYcc16Chroma; cb <= kYcc16Chroma; ++cb) {
      for (int cr = -kYcc16Chroma; cr <= kYcc16Chroma; ++cr) {
        ASSERT_EQ(from_ycc(alpha, {y, cb, cr}), from_ycc16(alpha, {y, cb, cr})) << y << " " << cb << " " << cr;
      }
    }
  }
}

// Brightness and temperature levels far outside their scales take the plain
// pixel function on the fast path too (the 16-bit one would overflow).
TEST(YccFast, LevelsBeyondTheSixteenBitBoundsMatchThePlainPath) {
  const Pic in = random_picture(67, 5, 97);
  const px_rect whole{0, -1, 0, -1}, part{2, 40, 1, 3};
  const auto mask = random_mask(in.size(), 98);
  auto m = mask;
  for (int level : {-1000000, -1629, -1628, 1648, 1649, 3300, 1000000}) {
    for (px_rect r : {whole, part}) {
      expect_same_both_ways(
          Pic(in.size()),
          [&](Pic& o) { px_control_brightness(const_cast<int*>(in.data()), m.data(), o.data(), 67, 5, level, r); },
          label("brightness ", level));
    }
    expect_same_both_ways(
        Pic(in.size()), [&](Pic& o) { px_control_brightness_all(const_cast<int*>(in.data()), o.data(), 67, 5, level); },
        label("brightness all ", level));
  }
  for (int level : {-500, -3, -2, 22, 23, 40, 500}) {
    expect_same_both_ways(
        Pic(in.size()),
        [&](Pic& o) { px_control_temperature(const_cast<int*>(in.data()), m.data(), o.data(), 67, 5, level, whole); },
        label("temperature ", level));
    expect_same_both_ways(
        Pic(in.size()),
        [&](Pic& o) { px_control_temperature_all(const_cast<int*>(in.data()), o.data(), 67, 5, level); },
        label("temperature all ", level));
  }
  for (int level : {-200, -12, 112, 300}) {
    expect_same_both_ways(
        Pic(in.size()),
        [&](Pic& o) {
          px_control_temperature_range100(const_cast<int*>(in.data()), m.data(), o.data(), 67, 5, level, whole);
        },
        label("temperature100 ", level));
  }
}

// Point colour on a lattice through the whole colour cube (every chroma
// quarter and its edges).
TEST(PointColourFast, ColourCubeKeptOrGreyedAsThePlainPath) {
  Pic cube;
  for (int r = 0; r < 256; r += 3)
    for (int g = 0; g < 256; g += 3)
      for (int b = 0; b < 256; b += 5) cube.push_back(static_cast<int>(0x3C000000u | r << 16 | g << 8 | b));
  using Whole = void (*)(int*, int*, int, int);
  for (Whole fn : {px_point_color_red, px_point_color_yellow, px_point_color_green, px_point_color_blue}) {
    const int n = static_cast<int>(cube.size());
    expect_same_both_ways(
        Pic(cube.size()), [&](Pic& o) { fn(cube.data(), o.data(), n, 1); }, "point colour cube");
  }
}

TEST(PointColourFast, EveryColourKeptOrGreyedAsThePlainPath) {
  using Whole = void (*)(int*, int*, int, int);
  const std::pair<const char*, Whole> ops[] = {{"red", px_point_color_red},
                                               {"yellow", px_point_color_yellow},
                                               {"green", px_point_color_green},
                                               {"blue", px_point_color_blue}};
  for (const auto& pair_ : ops) {
    const auto name = pair_.first;
    const auto fn = pair_.second;
    for (const auto& pair_ : kSizes) {
      const auto w = pair_.first;
      const auto h = pair_.second;
      const Pic in = random_picture(w, h, 91 + w);
      expect_same_both_ways(
          Pic(in.size()), [&](Pic& o) { fn(const_cast<int*>(in.data()), o.data(), w, h); },
          label(name, " ", w, "x", h));
    }
  }
}

}  // namespace
