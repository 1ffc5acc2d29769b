#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <random>
#include <vector>

#include "effect/kalo/px_parallel.h"
#include "effect/px_color/px_tone.h"
#include "log_capture.h"

namespace {
constexpr px_rect kWhole{0, -1, 0, -1};

using RegionOp = std::function<void(int*, unsigned char*, int*, int, int, int, px_rect)>;

// One selected pixel through a region operation.
uint32_t one(const RegionOp& op, uint32_t pixel, int level) {
  int in = static_cast<int>(pixel), out = 0;
  unsigned char mask = 1;
  op(&in, &mask, &out, 1, 1, level, px_rect{0, 0, 0, 0});
  return static_cast<uint32_t>(out);
}

uint32_t grey(int v, uint32_t alpha = 0xFF) { return alpha << 24 | v << 16 | v << 8 | v; }

std::vector<int> random_picture(int w, int h, unsigned seed) {
  std::mt19937 rng(seed);
  std::vector<int> p(static_cast<size_t>(w) * h);
  for (int& v : p) v = static_cast<int>(rng());
  return p;
}

const std::vector<std::pair<const char*, RegionOp>>& region_ops() {
  static const std::vector<std::pair<const char*, RegionOp>> ops = {
      {"brightness", px_control_brightness},
      {"brightness100", px_control_brightness_range100},
      {"contrast", px_control_contrast},
      {"contrast100", px_control_contrast_range100},
      {"saturation", px_control_saturation},
      {"saturation100", px_control_saturation_range100},
      {"temperature", px_control_temperature},
      {"temperature100", px_control_temperature_range100},
      {"exposure", [](int* i, unsigned char* m, int* o, int w, int h, int l,
                      px_rect r) { px_control_exposure(i, m, o, w, h, l, r); }},
      {"faded", [](int* i, unsigned char* m, int* o, int w, int h, int l,
                   px_rect r) { px_control_fadedcolor(i, m, o, w, h, l, r); }},
      {"greyscale", px_control_greyscale},
  };
  return ops;
}
}  // namespace

TEST(Tone, BrightnessMovesLuma) {
  EXPECT_EQ(one(px_control_brightness, 0xFF808080, 20), 0xFFE4E4E4u);
  EXPECT_EQ(one(px_control_brightness, 0x33808080, 0), 0x331C1C1Cu);
  EXPECT_EQ(one(px_control_brightness_range100, 0xFF808080, 100), 0xFFE4E4E4u);
  // Colour is kept through the luma/chroma round trip, with clamping.
  EXPECT_EQ(one(px_control_brightness, 0xFFFF0000, 20), 0xFFFF6463u);
}

TEST(Tone, WholePictureBrightnessOffsetsEveryChannel) {
  std::vector<int> in = {static_cast<int>(0x80102030), static_cast<int>(0xFFF0F0F0)}, out(2);
  std::vector<unsigned char> mask(2, 0);
  px_control_brightness(in.data(), mask.data(), out.data(), 2, 1, 12, kWhole);
  EXPECT_EQ(static_cast<uint32_t>(out[0]), 0x80243444u);
  EXPECT_EQ(static_cast<uint32_t>(out[1]), 0xFFFFFFFFu);
}

TEST(Tone, ContrastNeverCrossesTheMiddle) {
  auto channel = [](int c, int level) { return static_cast<int>(one(px_control_contrast, grey(c), level) & 255); };
  EXPECT_EQ(channel(100, 20), 70);
  EXPECT_EQ(channel(120, 20), 110);
  EXPECT_EQ(channel(128, 20), 128);
  EXPECT_EQ(channel(250, 20), 255);
  EXPECT_EQ(channel(127, 0), 128);
  EXPECT_EQ(channel(129, 0), 128);
  EXPECT_EQ(channel(0, 0), 128);
  auto c100 = [](int c, int level) {
    return static_cast<int>(one(px_control_contrast_range100, grey(c), level) & 255);
  };
  EXPECT_EQ(c100(100, 100), 70);  // k = 10
  EXPECT_EQ(c100(100, 53), 98);   // 100 - 3 * 0.6f = 98.2, truncated
}

TEST(Tone, SaturationMatrix) {
  std::vector<int> in = random_picture(64, 3, 11), out(in.size());
  std::vector<unsigned char> mask(in.size(), 1);
  px_control_saturation(in.data(), mask.data(), out.data(), 64, 3, 10, kWhole);
  EXPECT_EQ(in, out);
  for (int v : in) {
    uint32_t p = static_cast<uint32_t>(v);
    int r = (p >> 16) & 255, g = (p >> 8) & 255, b = p & 255;
    int y = (316 * r + 624 * g + 84 * b) >> 10;
    ASSERT_EQ(one(px_control_saturation, p, 0), (p & 0xFF000000u) | grey(y, 0));
  }
  EXPECT_EQ(one(px_control_saturation, 0xFF804020, 20), 0xFFAE2E00u);  // s = 2048: twice the distance from grey
  EXPECT_EQ(one(px_control_saturation_range100, 0xFF804020, 50), 0xFF804020u);
}

TEST(Tone, TemperatureShiftsChroma) {
  EXPECT_EQ(one(px_control_temperature, 0xFF777777, 10), 0xFF777777u);
  EXPECT_EQ(one(px_control_temperature_range100, 0xFF777777, 50), 0xFF777777u);
  uint32_t cool = one(px_control_temperature, 0xFF808080, 0);
  EXPECT_GT(cool & 255, (cool >> 16) & 255);  // bluer
  uint32_t warm = one(px_control_temperature, 0xFF808080, 20);
  EXPECT_GT((warm >> 16) & 255, warm & 255);  // redder
}

TEST(Tone, ExposureFadedGreyscale) {
  auto exposure = [](uint32_t p, int level) {
    return one([](int* i, unsigned char* m, int* o, int w, int h, int l,
                  px_rect r) { px_control_exposure(i, m, o, w, h, l, r); },
               p, level);
  };
  EXPECT_EQ(exposure(0x40648CC8, 20), 0x40C8FFFFu);
  EXPECT_EQ(exposure(0x40648CC8, 10), 0x40648CC8u);
  EXPECT_EQ(exposure(0x40648CC8, 5), 0x40324664u);

  auto faded = [](uint32_t p, int level) {
    return one([](int* i, unsigned char* m, int* o, int w, int h, int l,
                  px_rect r) { px_control_fadedcolor(i, m, o, w, h, l, r); },
               p, level);
  };
  EXPECT_EQ(faded(0xFF000000, 100), 0xFF683448u);  // 26520/255, 13260/255, 18360/255
  EXPECT_EQ(faded(0xFFFFFFFF, 100), 0xFFF5F0B3u);
  EXPECT_EQ(faded(0x12345678, 0), 0x12345678u);

  EXPECT_EQ(one(px_control_greyscale, 0x7F0A141E, 10), 0x7F141414u);
  EXPECT_EQ(one(px_control_greyscale, 0xFFFFFFFF, 20), 0xFFFFFFFFu);
  EXPECT_EQ(one(px_control_greyscale, 0xFF646464, 0), 0xFF262626u);  // 100 * 25536 >> 16
}

TEST(Tone, StatusOfExposureAndFaded) {
  LogCapture log;
  int in = 0x01020304, out = 0x55;
  unsigned char mask = 1;
  EXPECT_EQ(px_control_exposure(&in, &mask, &out, 1, 1, -1, kWhole), PX_ERR_NULL);
  EXPECT_TRUE(log.contains("Func: px_control_exposure() \t Line:"));
  EXPECT_TRUE(log.contains("ERROR : Invalid Input Parameters"));
  EXPECT_EQ(px_control_exposure(nullptr, &mask, &out, 1, 1, 10, kWhole), PX_ERR_NULL);
  EXPECT_EQ(px_control_fadedcolor(&in, &mask, &out, 1, 1, 101, kWhole), PX_ERR_NULL);
  EXPECT_EQ(px_control_fadedcolor(&in, nullptr, &out, 1, 1, 50, kWhole), PX_ERR_NULL);
  EXPECT_EQ(out, 0x55);
  EXPECT_EQ(px_control_fadedcolor(&in, &mask, &out, 1, 1, 100, kWhole), PX_OK);
  EXPECT_EQ(px_control_fadedcolor_all(&in, &out, 1, 1, 101), PX_ERR_NULL);
  EXPECT_EQ(px_control_exposure_all(nullptr, &out, 1, 1, 10), PX_ERR_NULL);
  EXPECT_EQ(px_control_exposure_all(&in, &out, 0, 0, 10), PX_OK);
}

// The region rule: selected pixels of the rectangle change, everything else is
// the input; an all-zero mask gives an exact copy; an empty rectangle ignores
// the mask; a rectangle reaching outside the picture is clipped.
TEST(Tone, RegionRuleForEveryOperation) {
  const int w = 23, h = 17;
  const std::vector<int> in = random_picture(w, h, 3);
  std::vector<unsigned char> mask(in.size());
  std::mt19937 rng(5);
  for (auto& m : mask) m = static_cast<unsigned char>(rng() % 3);  // 0, 1 and 2
  const px_rect rect{3, 30, -4, 9};                                 // right and top outside
  for (const auto& [name, op] : region_ops()) {
    const int level = std::string(name).find("100") != std::string::npos || std::string(name) == "faded" ? 80 : 16;
    std::vector<int> whole(in.size()), region(in.size()), copy(in.size());
    op(const_cast<int*>(in.data()), mask.data(), whole.data(), w, h, level, kWhole);
    op(const_cast<int*>(in.data()), mask.data(), region.data(), w, h, level, rect);
    std::vector<unsigned char> zero(in.size(), 0);
    op(const_cast<int*>(in.data()), zero.data(), copy.data(), w, h, level, rect);
    EXPECT_EQ(copy, in) << name;
    for (int y = 0; y < h; ++y) {
      for (int x = 0; x < w; ++x) {
        const size_t i = static_cast<size_t>(y) * w + x;
        const bool selected = x >= 3 && y <= 9 && mask[i] == 1;
        // Whole-picture brightness is a different rule (per-channel offset).
        if (std::string(name).rfind("brightness", 0) == 0) {
          if (!selected) {
            ASSERT_EQ(region[i], in[i]) << name;
          }
          continue;
        }
        ASSERT_EQ(region[i], selected ? whole[i] : in[i]) << name << " at " << x << "," << y;
      }
    }
  }
}

TEST(Tone, AllFormsMatchWholePictureRegionAndWorkInPlace) {
  const int w = 31, h = 9;
  const std::vector<int> in = random_picture(w, h, 9);
  std::vector<unsigned char> mask(in.size(), 1);
  const px_rect all{0, w - 1, 0, h - 1};
  struct Pair {
    RegionOp region;
    std::function<void(int*, int*, int, int, int)> whole;
    int level;
  };
  const std::vector<Pair> pairs = {
      {px_control_brightness, px_control_brightness_all, 17},
      {px_control_contrast, px_control_contrast_all, 3},
      {px_control_saturation, px_control_saturation_all, 19},
      {px_control_temperature, px_control_temperature_all, 2},
      {[](int* i, unsigned char* m, int* o, int ww, int hh, int l, px_rect r) { px_control_fadedcolor(i, m, o, ww, hh, l, r); },
       [](int* i, int* o, int ww, int hh, int l) { px_control_fadedcolor_all(i, o, ww, hh, l); }, 60},
      {[](int* i, unsigned char* m, int* o, int ww, int hh, int l, px_rect r) { px_control_exposure(i, m, o, ww, hh, l, r); },
       [](int* i, int* o, int ww, int hh, int l) { px_control_exposure_all(i, o, ww, hh, l); }, 13},
  };
  for (size_t k = 0; k < pairs.size(); ++k) {
    std::vector<int> a(in.size()), b = in;
    pairs[k].region(const_cast<int*>(in.data()), mask.data(), a.data(), w, h, pairs[k].level, all);
    pairs[k].whole(b.data(), b.data(), w, h, pairs[k].level);
    EXPECT_EQ(a, b) << "pair " << k;
  }
}

// The banded (threaded) path and the scalar path agree bit for bit.
TEST(Tone, FastPathMatchesScalar) {
  const int w = 97, h = 301;
  const std::vector<int> in = random_picture(w, h, 21);
  std::vector<unsigned char> mask(in.size(), 0);
  const bool was = px_scalar_only();
  for (const auto& [name, op] : region_ops()) {
    std::vector<int> fast(in.size()), scalar(in.size());
    px_set_scalar_only(false);
    op(const_cast<int*>(in.data()), mask.data(), fast.data(), w, h, 14, kWhole);
    px_set_scalar_only(true);
    op(const_cast<int*>(in.data()), mask.data(), scalar.data(), w, h, 14, kWhole);
    EXPECT_EQ(fast, scalar) << name;
  }
  px_set_scalar_only(was);
}
