// Painterly, halftone, kaleidoscope, reflection, region and vintage effects.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <random>
#include <thread>
#include <vector>

#include "effect/kalo/iel/iel.h"
#include "effect/kalo/iel/iel_artistic.h"
#include "effect/kalo/iel/iel_internal.h"
#include "effect/kalo/px_parallel.h"
#include "log_capture.h"

namespace {
using Bytes = std::vector<unsigned char>;

struct Rgb {
  int w, h;
  Bytes in, out;
  structIELImage a, b;
  Rgb(int w_, int h_, int16_t format = IEL_FORMAT_RGB888) : w(w_), h(h_) {
    const int bpp = IEL_BytesPerPixel(format);
    in.assign(static_cast<size_t>(w) * h * bpp, 0);
    out.assign(in.size(), 0xAB);
    a = {w, h, format, in.data()};
    b = {w, h, format, out.data()};
  }
  void fill(unsigned char r, unsigned char g, unsigned char bl) {
    for (size_t i = 0; i + 2 < in.size(); i += 3) in[i] = r, in[i + 1] = g, in[i + 2] = bl;
  }
  void random(unsigned seed) {
    std::mt19937 gen(seed);
    for (auto& v : in) v = static_cast<unsigned char>(gen());
  }
  const unsigned char* px(int x, int y) const { return &out[(static_cast<size_t>(y) * w + x) * 3]; }
};

struct Argb {
  int w, h;
  std::vector<uint32_t> in, out;
  structIELImage a, b;
  Argb(int w_, int h_, uint32_t fill = 0xFF808080u) : w(w_), h(h_), in(static_cast<size_t>(w_) * h_, fill),
                                                     out(in.size(), 0x12345678u) {
    a = {w, h, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(in.data())};
    b = {w, h, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(out.data())};
  }
  void random(unsigned seed) {
    std::mt19937 gen(seed);
    for (auto& v : in) v = gen();
  }
  uint32_t at(int x, int y) const { return out[static_cast<size_t>(y) * w + x]; }
};

uint32_t grey(uint32_t v, uint32_t alpha = 0xFF) { return alpha << 24 | v << 16 | v << 8 | v; }
}  // namespace

// ---- painterly ------------------------------------------------------------------

TEST(Posterize, SixLevelsStretchedByContrast) {
  // 42 falls in the first level (L[0] = 0), 43 opens the second (L[43] =
  // 127.5 + (43 - 127.5) * 1.21 = 25.3), 255 the last (L[215] = 233.4).
  Rgb im(2, 1);
  im.in = {42, 43, 255, 0, 86, 129};
  ASSERT_EQ(IEL_PosterizeNew(&im.a, &im.b), IEL_OK);
  EXPECT_EQ(im.out, (Bytes{0, 25, 233, 0, 77, 129}));
}

TEST(Posterize, FourBytePixelsKeepTheirFourthByteAndRgb565IsRepacked) {
  Rgb argb(1, 1, IEL_FORMAT_ARGB_PACK);
  argb.in = {43, 43, 43, 7};
  argb.out = {0, 0, 0, 0x5A};
  ASSERT_EQ(IEL_PosterizeNew(&argb.a, &argb.b), IEL_OK);
  EXPECT_EQ(argb.out, (Bytes{25, 25, 25, 0x5A}));

  // 0xFFFF unpacks to (248, 252, 248) -> level 215 -> 233 each; repacked.
  Rgb rgb565(1, 1, IEL_FORMAT_RGB565);
  rgb565.in = {0xFF, 0xFF};
  ASSERT_EQ(IEL_PosterizeNew(&rgb565.a, &rgb565.b), IEL_OK);
  const uint16_t v = static_cast<uint16_t>(rgb565.out[0] | rgb565.out[1] << 8);
  EXPECT_EQ(v, (233 & 0xF8) << 8 | (233 & 0xFC) << 3 | 233 >> 3);
}

TEST(Posterize, ChecksAndStaleCancel) {
  LogCapture log;
  Rgb im(4, 4);
  EXPECT_EQ(IEL_PosterizeNew(nullptr, &im.b), IEL_ERR_NULL);
  EXPECT_TRUE(log.contains("IEL_PosterizeNew() \t Line:"));
  EXPECT_TRUE(log.contains("Failed with input image = 0,output image = "));
  im.a.width = 0;
  EXPECT_EQ(IEL_PosterizeNew(&im.a, &im.b), IEL_ERR_DIMENSION);
  EXPECT_TRUE(log.contains("Failed with input image width= 0,input image height = 4"));
  im.a.width = 4;
  im.a.format = 7;
  EXPECT_EQ(IEL_PosterizeNew(&im.a, &im.b), IEL_ERR_FORMAT);
  EXPECT_TRUE(log.contains("Failed with input image format= 7"));

  im.a.format = IEL_FORMAT_RGB888;
  // A cancel left over from before the effect started does not stop it.
  iel_progress::cancel_request.store(1);
  EXPECT_EQ(IEL_PosterizeNew(&im.a, &im.b), IEL_OK);
  EXPECT_EQ(iel_progress::cancel_request.load(), 0);
  EXPECT_EQ(iel_progress::busy.load(), 0u);
  EXPECT_EQ(IEL_GetProgress(), 100u);
}

TEST(Posterize, CancelFromAnotherThreadStopsIt) {
  // One band, so the canceller has a core of its own.
  const bool scalar = px_scalar_only();
  px_set_scalar_only(true);
  Rgb im(2400, 2000);
  im.random(5);
  std::atomic<bool> running{true};
  int rc = -1;
  std::thread worker([&] {
    structIELEffectParams p{IEL_EFFECT_POSTERIZE, nullptr, nullptr, 0, 0};
    rc = IEL_Apply_Effect(&im.a, &im.b, &p);
    running = false;
  });
  while (running) IEL_CancelOperation();
  worker.join();
  px_set_scalar_only(scalar);
  EXPECT_EQ(rc, IEL_ERR_CANCELLED);
  EXPECT_EQ(iel_progress::busy.load(), 0u);
  iel_progress::cancel_request.store(0);  // a request racing the effect's end
}

TEST(Cartoon, ToneBandsOnFlatAreas) {
  // Flat picture: the window maximum equals the pixel's own luminance Y, so
  // e = Y * 255 / (Y + 1) and s = e * e >> 8.
  struct Case {
    int v, want;
  } cases[] = {
      {128, 250 * 165 >> 8},  // Y > 89: q + 5 = 37 added, scaled by s = 250
      {60, 244 * 15 >> 8},    // 31..89: q + 30 = 45 taken off, s = 244
      {20, 0},                // <= 30: 10 then 35 taken off
      {200, 250 * 255 >> 8},  // > 160: q + 25 = 75 added (capped at 255), s = 250
  };
  for (const Case& c : cases) {
    Rgb im(11, 9);
    im.fill(c.v, c.v, c.v);
    ASSERT_EQ(IEL_CartoonNew3(&im.a, &im.b, 3), IEL_OK);
    for (size_t i = 0; i < im.out.size(); ++i) ASSERT_EQ(im.out[i], c.want) << c.v << " at " << i;
  }
}

TEST(Cartoon, LevelsClampAndBordersRepeatTheProcessedPixels) {
  Rgb a(24, 20), b(24, 20);
  a.random(1);
  b.in = a.in;
  ASSERT_EQ(IEL_CartoonNew3(&a.a, &a.b, 9), IEL_OK);
  ASSERT_EQ(IEL_CartoonNew3(&b.a, &b.b, 4), IEL_OK);
  EXPECT_EQ(a.out, b.out);
  ASSERT_EQ(IEL_CartoonNew3(&a.a, &a.b, 0), IEL_OK);
  ASSERT_EQ(IEL_CartoonNew3(&b.a, &b.b, 1), IEL_OK);
  EXPECT_EQ(a.out, b.out);
  // r = 1: column 0 repeats column 1, row 0 repeats row 1, the last row the one above.
  for (int y = 0; y < 20; ++y) EXPECT_EQ(0, memcmp(a.px(0, y), a.px(1, y), 3)) << y;
  for (int y = 0; y < 20; ++y) EXPECT_EQ(0, memcmp(a.px(23, y), a.px(22, y), 3)) << y;
  EXPECT_EQ(0, memcmp(a.px(0, 0), a.px(0, 1), 24 * 3));
  EXPECT_EQ(0, memcmp(a.px(0, 19), a.px(0, 18), 24 * 3));
}

TEST(OilPaint, OnlyABlurredRedTwoAboveDarkens) {
  // Three pixels in a row; the middle one's blurred red is
  // (A + 2 * 100 + A) / 4. With every level equal, the mode filter gives
  // pixel 0 the colour of pixel 1 (the last of the visits that all tie
  // upwards); a darkened middle pixel drops to another level instead, and
  // pixel 0 keeps its own colour.
  for (int side : {102, 104}) {
    Rgb im(3, 1);
    im.in = {static_cast<unsigned char>(side), 100, 100, 100, 100, 100, static_cast<unsigned char>(side), 100, 100};
    ASSERT_EQ(IEL_OilPaintEdge(&im.a, &im.b), IEL_OK);
    if (side == 102) {
      EXPECT_EQ(Bytes(im.out.begin(), im.out.begin() + 3), (Bytes{100, 100, 100}));  // d = 1: kept
    } else {
      EXPECT_EQ(Bytes(im.out.begin(), im.out.begin() + 3), (Bytes{104, 100, 100}));  // d = 2: darkened
    }
  }
}

TEST(OilPaint, GaussianWeightsAndNullImage) {
  LogCapture log;
  Rgb im(3, 3);
  im.in[4 * 3] = 160;  // centre red
  ASSERT_EQ(IEL_GaussianBlur(&im.a, &im.b), IEL_OK);
  EXPECT_EQ(im.px(1, 1)[0], 40);  // 4 / 16
  EXPECT_EQ(im.px(0, 1)[0], 20);  // 2 / 16
  EXPECT_EQ(im.px(0, 0)[0], 10);  // 1 / 16
  EXPECT_EQ(IEL_GaussianBlur(nullptr, &im.b), IEL_ERR_NULL);
  EXPECT_TRUE(log.contains("Invalid Image pointer:\n"));
}

TEST(OilPaint, ModeFilterTiesGoToTheEarlierVisit) {
  // 3 x 3, centre pixel: levels 0 (black) x 4, 15 (white) x 4, one grey.
  // Visit order is column by column, top to bottom: white reaches its fourth
  // visit at (2, 1), before black's fourth at (2, 2); a later tie does not win.
  Rgb im(3, 3);
  const unsigned char k[9] = {0, 255, 0, 255, 128, 255, 0, 255, 0};  // row-major
  for (int i = 0; i < 9; ++i) std::memset(&im.in[3 * i], k[i], 3);
  ASSERT_EQ(IEL_OilifyFix(&im.a, &im.b), IEL_OK);
  EXPECT_EQ(im.px(1, 1)[0], 255);
}

TEST(MagicPen, SobelMagnitudeWithCopiedBorders) {
  Rgb im(5, 3);
  const int col[5] = {0, 0, 10, 10, 10};
  for (int y = 0; y < 3; ++y)
    for (int x = 0; x < 5; ++x) std::memset(&im.in[(y * 5 + x) * 3], col[x], 3);
  ASSERT_EQ(IEL_MagicPenNew_RGB(&im.a, &im.b), IEL_OK);
  const int want[5] = {40, 40, 40, 0, 0};  // gx = 10 * (1 + 2 + 1)
  for (int y = 0; y < 3; ++y)
    for (int x = 0; x < 5; ++x) EXPECT_EQ(im.px(x, y)[1], want[x]) << x << "," << y;
  // A strong edge saturates at 255.
  Rgb hard(3, 3);
  for (int y = 0; y < 3; ++y) std::memset(&hard.in[(y * 3 + 2) * 3], 255, 3);
  ASSERT_EQ(IEL_MagicPenNew_RGB(&hard.a, &hard.b), IEL_OK);
  EXPECT_EQ(hard.px(1, 1)[0], 255);
}

TEST(Sketch, BoxSizesFollowTheLevel) {
  Rgb im(11, 11);
  std::memset(&im.in[(5 * 11 + 5) * 3], 225, 3);
  ASSERT_EQ(IEL_Variable_Blur_preview(&im.a, &im.b, 0), IEL_OK);
  EXPECT_EQ(im.px(4, 4)[0], 25);  // 225 / 9
  EXPECT_EQ(im.px(3, 3)[0], 0);
  ASSERT_EQ(IEL_Variable_Blur_preview(&im.a, &im.b, 1), IEL_OK);
  EXPECT_EQ(im.px(3, 3)[0], 9);  // 225 / 25
  ASSERT_EQ(IEL_Variable_Blur_preview(&im.a, &im.b, 9), IEL_OK);
  EXPECT_EQ(im.px(0, 0)[2], 1);  // 11 x 11: 225 / 121
}

TEST(Sketch, FlatPictureIsPaperAndStrokesDarkenBySquaring) {
  // Flat grey: the dodge gives 255, the squaring 254, 252, 248.
  const int want[4] = {0, 254, 252, 248};
  for (int darkness = 1; darkness <= 3; ++darkness) {
    Rgb im(9, 9);
    im.fill(90, 90, 90);
    ASSERT_EQ(IEL_SketchNew2(&im.a, &im.b, darkness, 1), IEL_OK);
    for (unsigned char v : im.out) ASSERT_EQ(v, want[darkness]);
  }
  Rgb black(9, 9);
  ASSERT_EQ(IEL_SketchNew2(&black.a, &black.b, 3, 1), IEL_OK);
  for (unsigned char v : black.out) ASSERT_EQ(v, 0);
}

TEST(Sketch, BlurLevelAboveTwoActsAsTwo) {
  Rgb a(30, 20), b(30, 20), c(30, 20);
  a.random(3);
  b.in = c.in = a.in;
  ASSERT_EQ(IEL_SketchNew2(&a.a, &a.b, 3, 5), IEL_OK);
  ASSERT_EQ(IEL_SketchNew2(&b.a, &b.b, 3, 2), IEL_OK);
  ASSERT_EQ(IEL_SketchNew2(&c.a, &c.b, 3, 1), IEL_OK);
  EXPECT_EQ(a.out, b.out);
  EXPECT_NE(a.out, c.out);
}

TEST(Sketch, TextureThroughTheDispatcherUsesItsLowestByte) {
  // Flat grey sketch value s = 248; v = (s * s + (t - 15) * (255 - s)) / 255.
  Rgb im(6, 4);
  im.fill(90, 90, 90);
  std::vector<uint32_t> tex(24, 0xFF000000u);
  tex[0] = 0x00FFFF00u;  // lowest byte 0
  tex[1] = 0x000000FFu;  // lowest byte 255
  structIELImage t{6, 4, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(tex.data())};
  structIELEffectParams p{IEL_EFFECT_SKETCH_TEXTURE, nullptr, &t, 0, 0};
  ASSERT_EQ(IEL_Apply_Effect(&im.a, &im.b, &p), IEL_OK);
  EXPECT_EQ(im.px(0, 0)[0], (248 * 248 - 15 * 7) / 255);
  EXPECT_EQ(im.px(1, 0)[2], (248 * 248 + 240 * 7) / 255);
}

TEST(Spread, AmountZeroShiftsByOneAndLargeAmountsActAsFour) {
  Argb im(5, 3);
  for (int i = 0; i < 15; ++i) im.in[i] = 0xFF000000u | i;
  ASSERT_EQ(IEL_Spread_ARGB(&im.a, &im.b, 0), IEL_OK);
  for (int y = 0; y < 3; ++y)
    for (int x = 0; x < 5; ++x) EXPECT_EQ(im.at(x, y) & 255, static_cast<uint32_t>((y < 2 ? y + 1 : 2) * 5 + (x + 1) % 5));

  Argb big(40, 30), four(40, 30);
  big.random(8);
  four.in = big.in;
  srand48(77);
  ASSERT_EQ(IEL_Spread_ARGB(&big.a, &big.b, 9), IEL_OK);
  srand48(77);
  ASSERT_EQ(IEL_Spread_ARGB(&four.a, &four.b, 4), IEL_OK);
  EXPECT_EQ(big.out, four.out);

  LogCapture log;
  big.a.height = 0;
  EXPECT_EQ(IEL_Spread_ARGB(&big.a, &big.b, 1), IEL_ERR_NULL);
  EXPECT_TRUE(log.contains("Failed with Error = 1"));
}

TEST(Painterly, DispatcherReachesEachEffectAndRefusesOtherFormatsCleanly) {
  LogCapture log;
  for (int effect : {IEL_EFFECT_MAGIC_PEN, IEL_EFFECT_CARTOON, IEL_EFFECT_POSTERIZE, IEL_EFFECT_OIL_PAINT}) {
    Rgb im(16, 12);
    im.random(effect);
    int32_t level = 2;
    structIELEffectParams p{static_cast<int16_t>(effect), &level, nullptr, 0, 0};
    EXPECT_EQ(IEL_Apply_Effect(&im.a, &im.b, &p), IEL_OK) << effect;
    // The planar layout holds fewer bytes than 3-byte pixels: refused.
    std::vector<unsigned char> planar(16 * 12 * 3 / 2), planar_out(planar.size());
    structIELImage a{16, 12, IEL_FORMAT_TYPE4, planar.data()}, b{16, 12, IEL_FORMAT_TYPE4, planar_out.data()};
    EXPECT_EQ(IEL_Apply_Effect(&a, &b, &p), IEL_ERR_FORMAT) << effect;
  }
}

// ---- region effects ------------------------------------------------------------

TEST(Region, TouchNearTheBorderIsAnalysedAsDark) {
  Argb bright(8, 8, grey(200));
  EXPECT_EQ(IEL_AnalyseIntensity_ARGB8888(1, 1, &bright.a), 0);
  EXPECT_EQ(IEL_AnalyseIntensity_ARGB8888(6, 3, &bright.a), 0);  // x >= width - 2
  EXPECT_EQ(IEL_AnalyseIntensity_ARGB8888(2, 2, &bright.a), 1);
  // A mean intensity of exactly 128 counts as bright, 127 as dark.
  Argb mid(8, 8, 0xFF800080u | 128 << 8);  // (128 + 128 + 2 * 128) / 4
  EXPECT_EQ(IEL_AnalyseIntensity_ARGB8888(4, 4, &mid.a), 1);
  Argb below(8, 8, grey(127));
  EXPECT_EQ(IEL_AnalyseIntensity_ARGB8888(4, 4, &below.a), 0);
}

TEST(Region, BrightnessChangesTheTouchedHalfAndFeathersItsEdge) {
  Argb im(6, 1);
  im.in = {grey(97, 0x10), grey(98), grey(110), grey(200), grey(128), grey(158)};
  ASSERT_EQ(IEL_RegionBrightness_ARGB8888(&im.a, &im.b, 1, 40), IEL_OK);
  EXPECT_EQ(im.out[0], grey(97));                            // kept, made opaque
  EXPECT_EQ(im.out[1], grey((1 * 200 + 128 * 98) >> 7));     // feather[29] = 1
  EXPECT_EQ(im.out[2], grey((24 * 200 + 128 * 110) >> 7));   // feather[127 - 110] = 24
  EXPECT_EQ(im.out[3], grey(255));                           // 200 + 200 clamped
  ASSERT_EQ(IEL_RegionBrightness_ARGB8888(&im.a, &im.b, 0, -10), IEL_OK);
  EXPECT_EQ(im.out[0], grey(47));                            // dark half: 97 - 50
  EXPECT_EQ(im.out[4], grey(std::max(0, (126 * -50 + 128 * 128) >> 7)));  // feather[0]
  EXPECT_EQ(im.out[5], grey(158));                           // above 157: kept
}

TEST(Region, ContrastStretchesOneHalfWithoutCrossingMidGrey) {
  Argb im(5, 1);
  im.in = {grey(200), grey(128), grey(50), grey(127), grey(130)};
  ASSERT_EQ(IEL_VariableContrast_ARGB8888(&im.a, &im.b, 1, 2), IEL_OK);
  EXPECT_EQ(im.out[0], grey(200 + 8 * 2));  // step[200] = 8
  EXPECT_EQ(im.out[1], grey(128));          // below 129: kept
  ASSERT_EQ(IEL_VariableContrast_ARGB8888(&im.a, &im.b, 1, -10), IEL_OK);
  EXPECT_EQ(im.out[4], grey(128));          // 130 - 10 stops at 128
  ASSERT_EQ(IEL_VariableContrast_ARGB8888(&im.a, &im.b, 0, 3), IEL_OK);
  EXPECT_EQ(im.out[2], grey(50 - 8 * 3));   // step[50] = -8
  EXPECT_EQ(im.out[3], grey(124));
  EXPECT_EQ(im.out[0], grey(200));
}

TEST(Region, ExposureLevelsAndFactors) {
  LogCapture log;
  Argb im(3, 1);
  im.in = {grey(200), grey(128), grey(50)};
  EXPECT_EQ(IEL_VariableExposure_ARGB8888(&im.a, &im.b, 1, 8), IEL_ERR_NULL);
  EXPECT_TRUE(log.contains("Max allowed level is : +/- 7. Passed: 8 \n"));
  EXPECT_EQ(im.out[0], 0x12345678u);
  ASSERT_EQ(IEL_VariableExposure_ARGB8888(&im.a, &im.b, 1, 2), IEL_OK);
  EXPECT_EQ(im.out[0], grey(200 * (8 * 10 + 512) >> 9));
  EXPECT_EQ(im.out[1], grey(128));
  EXPECT_EQ(im.out[2], grey(50));
  ASSERT_EQ(IEL_VariableExposure_ARGB8888(&im.a, &im.b, 0, 2), IEL_OK);  // E = -10
  EXPECT_EQ(im.out[2], grey(50 * (-8 * -10 + 512) >> 9));
}

TEST(Region, DispatcherAnalysesTheTouchPoint) {
  Argb im(9, 9, grey(60));
  int32_t level = 4;
  structIELEffectParams p{IEL_EFFECT_REGION_BRIGHTNESS, &level, nullptr, 4, 4};
  ASSERT_EQ(IEL_Apply_Effect(&im.a, &im.b, &p), IEL_OK);
  EXPECT_EQ(im.out[0], grey(80));  // dark touched, dark pixels lifted by 5 * 4
  p.effect = IEL_EFFECT_REGION_EXPOSURE;
  level = -8;
  EXPECT_EQ(IEL_Apply_Effect(&im.a, &im.b, &p), IEL_ERR_NULL);
}

// ---- reflection ---------------------------------------------------------------

TEST(Reflection, HeightChecks) {
  LogCapture log;
  Argb im(4, 201);
  EXPECT_EQ(IEL_ReflectionEffect(&im.a, &im.b, 100), IEL_ERR_NULL);
  EXPECT_TRUE(log.contains("Invalid Reflection Height(100) Height(201) \n"));
  Argb same(4, 100);
  EXPECT_EQ(IEL_ReflectionEffect(&same.a, &same.b, 100), IEL_ERR_NULL);
  Argb half(4, 200);
  EXPECT_EQ(IEL_ReflectionEffect(&half.a, &half.b, 100), IEL_OK);
}

TEST(Reflection, MirrorRowsFadeToTheLastRow) {
  // Height 200, reflection height 100: output row 100 + i is input row
  // 100 - i with f = 819 + (-819 * i / 100); the last row (i = 99) mirrors
  // row 1 with f = 819 - 810 = 9 (the quotient is truncated before the
  // subtraction).
  Argb im(3, 200);
  for (int y = 0; y < 200; ++y)
    for (int x = 0; x < 3; ++x) im.in[y * 3 + x] = 0x40000000u | (y << 8) | x;
  im.in[1 * 3 + 0] = 0x40FFFFFFu;
  im.in[100 * 3 + 1] = 0x00FF0000u;
  ASSERT_EQ(IEL_ReflectionEffect(&im.a, &im.b, 100), IEL_OK);
  for (int y = 0; y < 100; ++y) ASSERT_EQ(im.out[y * 3 + 2], im.in[y * 3 + 2]) << y;
  EXPECT_EQ(im.at(0, 199), grey(255 * 9 >> 10));  // white: Y = 255, Y' = 2
  // Row 100 mirrors itself at f = 819: pure red, Y = 76, Y' = 60, each
  // channel moves by -16.
  EXPECT_EQ(im.at(1, 100), 0xFFEF0000u);
  EXPECT_EQ(im.at(2, 150) & 0xFF000000u, 0xFF000000u);
}

TEST(Reflection, PlanarLayoutFadesBrightnessInRowPairsAndOtherFormatsAreUntouched) {
  const int w = 4, h = 8, rh = 4;
  std::vector<unsigned char> in(w * h * 3 / 2), out(in.size(), 0);
  for (size_t i = 0; i < in.size(); ++i) in[i] = 200;
  for (int x = 0; x < w; ++x) in[1 * w + x] = 100;  // brightness row 1
  structIELImage a{w, h, IEL_FORMAT_TYPE4, in.data()}, b{w, h, IEL_FORMAT_TYPE4, out.data()};
  ASSERT_EQ(IEL_ReflectionEffect(&a, &b, rh), IEL_OK);
  EXPECT_EQ(out[4 * w], 200 * 819 >> 10);                   // row 4 <- row 4, f = 819
  EXPECT_EQ(out[5 * w], 200 * 819 >> 10);                   // row 5 <- row 3, same pair
  EXPECT_EQ(out[7 * w], 100 * (819 - 1638 * 1 / 4) >> 10);  // row 7 <- row 1, second pair
  EXPECT_EQ(out[w * h + 3 * w], 200);                       // colour rows mirrored as they are

  Rgb rgb(2, 3);
  ASSERT_EQ(IEL_ReflectionEffect(&rgb.a, &rgb.b, 2), IEL_OK);
  for (unsigned char v : rgb.out) ASSERT_EQ(v, 0xAB);
}

// ---- kaleidoscope ------------------------------------------------------------------

TEST(Kaleidoscope, EightFoldMirrorOnWhite) {
  Argb im(22, 13);
  im.random(4);
  ASSERT_EQ(IEL_TriMirrorKaliedoscope_ARGB888(&im.a, &im.b), IEL_OK);
  // m = 13, S = 12, square from column (22 - 13) / 2 = 4 -> 4, rows 0..11.
  const int S = 12, x0 = 4;
  for (int y = 0; y < 13; ++y) {
    for (int x = 0; x < 22; ++x) {
      if (y >= S || x < x0 || x >= x0 + S) {
        ASSERT_EQ(im.at(x, y), 0xFFFFFFFFu) << x << "," << y;
      }
    }
  }
  for (int r = 0; r < S; ++r) {
    for (int c = 0; c < S; ++c) {
      EXPECT_EQ(im.at(x0 + c, r), im.at(x0 + S - 1 - c, r));  // left-right mirror
      EXPECT_EQ(im.at(x0 + c, r), im.at(x0 + c, S - 1 - r));  // top-bottom mirror
      EXPECT_EQ(im.at(x0 + c, r), im.at(x0 + r, c));          // diagonal mirror
    }
  }
  // The corner shows the source region's corner: (11 - 3) & ~3 = 8, (6 - 3) & ~3 = 0.
  EXPECT_EQ(im.at(x0, 0), im.in[0 * 22 + 8]);
  // Every pattern pixel comes from the centred source region.
  for (int r = 0; r < S; ++r) {
    for (int c = 0; c < S; ++c) {
      bool found = false;
      for (int y = 0; y <= 8 && !found; ++y)
        for (int x = 8; x <= 16 && !found; ++x) found = im.in[y * 22 + x] == im.at(x0 + c, r);
      ASSERT_TRUE(found) << c << "," << r;
    }
  }
}

TEST(Kaleidoscope, NeedsArgb) {
  LogCapture log;
  Rgb im(8, 8);
  structIELEffectParams p{IEL_EFFECT_KALEIDOSCOPE, nullptr, nullptr, 0, 0};
  EXPECT_EQ(IEL_Apply_Effect(&im.a, &im.b, &p), IEL_ERR_FORMAT);
  EXPECT_TRUE(log.contains("Return code is:  4 \n"));
}

// ---- halftone -----------------------------------------------------------------------

TEST(Halftone, SeparationOfBlackRedAndWhite) {
  const unsigned char rgb[9] = {0, 0, 0, 255, 0, 0, 255, 255, 255};
  unsigned char c[3], m[3], y[3], k[3];
  IEL_Halftone_RGBtoCMYKconversion(rgb, 3, 1, c, m, y, k);
  EXPECT_EQ((Bytes{c[0], m[0], y[0], k[0]}), (Bytes{1, 1, 1, 255}));  // pure black
  EXPECT_EQ((Bytes{c[1], m[1], y[1], k[1]}), (Bytes{1, 255, 255, 1}));  // 0 stores as 1.28
  EXPECT_EQ((Bytes{c[2], m[2], y[2], k[2]}), (Bytes{1, 1, 1, 1}));
}

TEST(Halftone, DotSizesGrowAtDifferentRates) {
  auto radius = [](int value, int channel) {
    Bytes plane(20 * 20, static_cast<unsigned char>(value));
    return IEL_Halftone_AnalyseCircleRadius(plane.data(), 20, 20, 10, 10, 9, channel);
  };
  EXPECT_EQ(radius(2, 1), 0);
  EXPECT_EQ(radius(3, 1), 2);
  EXPECT_EQ(radius(100, 1), 4);
  EXPECT_EQ(radius(0, 2), 1);
  EXPECT_EQ(radius(150, 2), 5);
  EXPECT_EQ(radius(99, 3), 1);
  EXPECT_EQ(radius(255, 3), 3);
  // The mean is over 9 x 9 (81 pixels): one bright pixel of 255 gives 3.
  Bytes spot(20 * 20, 0);
  spot[10 * 20 + 14] = 255;
  EXPECT_EQ(IEL_Halftone_AnalyseCircleRadius(spot.data(), 20, 20, 10, 10, 9, 1), 2);
  EXPECT_EQ(IEL_Halftone_AnalyseCircleRadius(spot.data(), 20, 20, 9, 10, 9, 1), 0);
}

TEST(Halftone, BlackStaysBlackAndNothingGetsLighter) {
  Rgb black(40, 30);
  structIELEffectParams p{IEL_EFFECT_HALFTONE, nullptr, nullptr, 0, 0};
  ASSERT_EQ(IEL_Apply_Effect(&black.a, &black.b, &p), IEL_OK);
  for (unsigned char v : black.out) ASSERT_EQ(v, 0);

  Rgb photo(64, 48);
  photo.random(12);
  ASSERT_EQ(IEL_Apply_Effect(&photo.a, &photo.b, &p), IEL_OK);
  size_t darker = 0;
  for (size_t i = 0; i < photo.out.size(); ++i) {
    ASSERT_LE(photo.out[i], photo.in[i]);
    darker += photo.out[i] < photo.in[i];
  }
  EXPECT_GT(darker, photo.out.size() / 10);  // the dots do print
}

TEST(Halftone, WhitePaperGetsTheSmallestDotsOnly) {
  // White separates to C = M = Y = K = 1. Cyan's mean 1 draws no dot, so the
  // screened cyan is paper (0) and red is 255 * (1 - 1 / 255) = 254
  // everywhere; magenta and yellow draw radius-1 dots, spots without green or
  // without blue.
  Rgb white(60, 60);
  white.fill(255, 255, 255);
  ASSERT_EQ(IEL_Halftone_Colored_CMYK(&white.a, &white.b), IEL_OK);
  size_t inked = 0;
  for (size_t i = 0; i < white.out.size(); i += 3) {
    ASSERT_EQ(white.out[i], 254) << i;
    inked += white.out[i + 1] == 0 || white.out[i + 2] == 0;
  }
  EXPECT_GT(inked, 0u);
  EXPECT_LT(inked, white.out.size() / 3 / 4);
}

// ---- vintage ----------------------------------------------------------------------

TEST(Vintage, WarmFadedCurvesAndAlphaKept) {
  uint8_t r[256], g[256], b[256];
  IEL_Vintage_Curves(r, g, b);
  // Black is lifted to a warm brown, white faded below 255.
  EXPECT_EQ((Bytes{r[0], g[0], b[0]}), (Bytes{43, 13, 13}));
  EXPECT_EQ((Bytes{r[255], g[255], b[255]}), (Bytes{240, 238, 238}));
  for (int i = 1; i < 256; ++i) {
    EXPECT_GE(r[i], r[i - 1]) << i;
    EXPECT_GE(g[i], g[i - 1]) << i;
    EXPECT_LE(b[i], g[i]) << i;
  }
  Argb im(2, 1);
  im.in = {0x00000000u, 0x7FFFFFFFu};
  structIELEffectParams p{IEL_EFFECT_VINTAGE, nullptr, nullptr, 0, 0};
  ASSERT_EQ(IEL_Apply_Effect(&im.a, &im.b, &p), IEL_OK);
  EXPECT_EQ(im.out[0], 0x002B0D0Du);
  EXPECT_EQ(im.out[1], 0x7FF0EEEEu);
}
