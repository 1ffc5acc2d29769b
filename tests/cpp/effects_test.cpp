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

[[maybe_unused]] uint32_t grey(uint32_t v, uint32_t alpha = 0xFF) { return alpha << 24 | v << 16 | v << 8 | v; }
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

TEST(Posterize, ChecksAndPendingCancel) {
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
  iel_progress::cancel_request.store(1);
  EXPECT_EQ(IEL_PosterizeNew(&im.a, &im.b), IEL_ERR_CANCELLED);
  EXPECT_EQ(iel_progress::cancel_request.load(), 0);
  EXPECT_EQ(iel_progress::busy.load(), 0u);
  EXPECT_EQ(IEL_PosterizeNew(&im.a, &im.b), IEL_OK);
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
