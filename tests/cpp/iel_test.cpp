#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include "effect/kalo/iel/iel.h"
#include "effect/kalo/iel/iel_effects.h"
#include "effect/kalo/iel/iel_internal.h"
#include "effect/kalo/iel/iel_luma.h"
#include "log_capture.h"

namespace {
struct Images {
  std::vector<unsigned char> a, b;
  structIELImage in, out;
  Images(int w, int h, int16_t format) {
    size_t bytes = static_cast<size_t>(w) * h * (format == IEL_FORMAT_TYPE4 ? 3 : 4);
    a.assign(bytes, 0x55);
    b.assign(bytes, 0);
    in = {w, h, format, a.data()};
    out = {w, h, format, b.data()};
  }
};

int apply(Images& im, int effect, int32_t level = 0, int tx = 0, int ty = 0) {
  structIELEffectParams p{static_cast<int16_t>(effect), &level, nullptr, tx, ty};
  return IEL_Apply_Effect(&im.in, &im.out, &p);
}
}  // namespace

TEST(EffectLibrary, NullArgumentsAndBuffers) {
  LogCapture log;
  Images im(4, 4, IEL_FORMAT_ARGB_PACK);
  structIELEffectParams p{IEL_EFFECT_VARIABLE_BRIGHTNESS, nullptr, nullptr, 0, 0};
  EXPECT_EQ(IEL_Apply_Effect(nullptr, &im.out, &p), IEL_ERR_NULL);
  EXPECT_TRUE(log.contains("Null parameters: Input = 0x0 Output = 0x"));
  im.in.buffer = nullptr;
  EXPECT_EQ(IEL_Apply_Effect(&im.in, &im.out, &p), IEL_ERR_NULL);
  EXPECT_TRUE(log.contains("Null Buffers: Input = 0, Output = "));
}

TEST(EffectLibrary, ChecksInOrder) {
  LogCapture log;
  Images rgb565(4, 4, IEL_FORMAT_RGB565);
  EXPECT_EQ(apply(rgb565, IEL_EFFECT_SEPIA), IEL_ERR_FORMAT);
  EXPECT_TRUE(log.contains("Unsupported format: In(1) \n"));

  Images mismatch(4, 4, IEL_FORMAT_ARGB_PACK);
  mismatch.out.height = 3;
  EXPECT_EQ(apply(mismatch, IEL_EFFECT_VARIABLE_BRIGHTNESS), IEL_ERR_DIMENSION);
  EXPECT_TRUE(log.contains("Input and Output Mismatch In(4x4 Fmt:3 ) Out(4x3 Fmt:3 ): \n"));
}

TEST(EffectLibrary, PlanarFormatsNeedEvenSizesAboveOne) {
  LogCapture log;
  Images ok(2, 2, IEL_FORMAT_TYPE4);
  EXPECT_EQ(apply(ok, 7), IEL_ERR_NULL);  // passes the size checks, then unsupported
  Images thin(1, 2, IEL_FORMAT_TYPE4);
  EXPECT_EQ(apply(thin, 7), IEL_ERR_DIMENSION);
  Images odd(3, 2, IEL_FORMAT_TYPE6);
  EXPECT_EQ(apply(odd, 7), IEL_ERR_DIMENSION);
  EXPECT_TRUE(log.contains("Dimensions must be even In(3 x 2) and >1 \n"));
}

TEST(EffectLibrary, UnsupportedEffectsAreRefusedWithReturnCode) {
  for (int effect : {0, 1, 7, 10, 14, 17, 25, 34, 40, 1000}) {
    LogCapture log;
    Images im(4, 4, IEL_FORMAT_ARGB_PACK);
    EXPECT_EQ(apply(im, effect), IEL_ERR_NULL) << effect;
    ASSERT_EQ(log.all().size(), 2u) << effect;
    EXPECT_NE(log.all()[0].find("Unsupported Effect type: " + std::to_string(effect) + " \n"), std::string::npos);
    EXPECT_NE(log.all()[1].find("Return code is:  1 \n"), std::string::npos);
  }
}

TEST(EffectLibrary, TouchPointMustLieInside) {
  LogCapture log;
  Images im(8, 6, IEL_FORMAT_ARGB_PACK);
  EXPECT_EQ(apply(im, IEL_EFFECT_REGION_BRIGHTNESS, 1, 8, 0), IEL_ERR_DIMENSION);
  EXPECT_TRUE(log.contains("35 :Touch coordinate mismatch error: X: 8, Y: 0, W: 8, H: 6 \n"));
  EXPECT_EQ(apply(im, IEL_EFFECT_REGION_CONTRAST, 1, 0, -1), IEL_ERR_DIMENSION);
}

TEST(EffectLibrary, SepiaRefusesArgbSilently) {
  LogCapture log;
  Images im(4, 4, IEL_FORMAT_ARGB_PACK);
  EXPECT_EQ(apply(im, IEL_EFFECT_SEPIA, 15), IEL_ERR_FORMAT);
  EXPECT_TRUE(log.all().empty());
}

TEST(EffectLibrary, WrongFormatForAnEffectLogsTheReturnCode) {
  LogCapture log;
  Images im(4, 4, IEL_FORMAT_RGB888);
  EXPECT_EQ(apply(im, IEL_EFFECT_VARIABLE_BRIGHTNESS, 3), IEL_ERR_FORMAT);
  EXPECT_TRUE(log.contains("Return code is:  4 \n"));
}

TEST(EffectLibrary, VariableBrightnessAddsAndKeepsAlpha) {
  uint32_t in[3] = {0x12000000, 0x80FF7F01, 0xFF102030};
  uint32_t out[3] = {};
  structIELImage a{3, 1, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(in)};
  structIELImage b{3, 1, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(out)};
  int32_t level = 10;
  structIELEffectParams p{IEL_EFFECT_VARIABLE_BRIGHTNESS, &level, nullptr, 0, 0};
  ASSERT_EQ(IEL_Apply_Effect(&a, &b, &p), IEL_OK);
  EXPECT_EQ(out[0], 0x120A0A0Au);
  EXPECT_EQ(out[1], 0x80FF890Bu);
  EXPECT_EQ(out[2], 0xFF1A2A3Au);
  level = -20;
  ASSERT_EQ(IEL_Apply_Effect(&a, &b, &p), IEL_OK);
  EXPECT_EQ(out[1], 0x80EB6B00u);
}

TEST(EffectLibrary, SepiaLevelsAndClamps) {
  // Luma of (R, G, B) is the sum of the tables >> 10; Y is raised to the level
  // and capped at 255 - level / 2, then tinted.
  auto sepia = [](unsigned char r, unsigned char g, unsigned char b, int level) {
    unsigned char in[3] = {r, g, b}, out[3] = {};
    structIELImage a{1, 1, IEL_FORMAT_RGB888, in}, o{1, 1, IEL_FORMAT_RGB888, out};
    EXPECT_EQ(IEL_SepiaFast(&a, &o, level), IEL_OK);
    return std::vector<int>{out[0], out[1], out[2]};
  };
  EXPECT_EQ(sepia(0, 0, 0, 15), (std::vector<int>{31, 12, 0}));         // raised to 15
  EXPECT_EQ(sepia(255, 255, 255, 15), (std::vector<int>{255, 245, 214}));  // capped at 248
  EXPECT_EQ(sepia(255, 255, 255, 75), sepia(255, 255, 255, 50));  // 51..99 act as 50
  EXPECT_EQ(sepia(255, 255, 255, 0), (std::vector<int>{255, 252, 221}));
  EXPECT_EQ(sepia(0, 0, 0, 0), (std::vector<int>{16, 0, 0}));
  int y = IEL_Luma(100, 150, 200);
  EXPECT_EQ(sepia(100, 150, 200, 15), (std::vector<int>{y + 16, y - 3, y - 34}));
}

TEST(EffectLibrary, SepiaOnRgb565) {
  uint16_t in = 0xFFFF, out = 0;
  structIELImage a{1, 1, IEL_FORMAT_RGB565, reinterpret_cast<unsigned char*>(&in)};
  structIELImage o{1, 1, IEL_FORMAT_RGB565, reinterpret_cast<unsigned char*>(&out)};
  ASSERT_EQ(IEL_SepiaFast(&a, &o, 15), IEL_OK);
  // Channels 0xF8, 0xFC, 0xF8 give Y = 250, capped at 248: (255, 245, 214).
  EXPECT_EQ(out, (0xF8 << 8) | (0xF4 << 3) | (214 >> 3));
}

TEST(EffectLibrary, EffectOwnChecks) {
  LogCapture log;
  unsigned char px[3] = {};
  structIELImage a{0, 1, IEL_FORMAT_RGB888, px}, o{0, 1, IEL_FORMAT_RGB888, px};
  EXPECT_EQ(IEL_SepiaFast(&a, &o, 15), IEL_ERR_DIMENSION);
  EXPECT_TRUE(log.contains("Func: IEL_SepiaFast() \t Line:"));
  EXPECT_TRUE(log.contains("Failed with input image width= 0,input image height = 1"));
  EXPECT_EQ(IEL_SepiaFast(nullptr, &o, 15), IEL_ERR_NULL);
  structIELImage bad{1, 1, 9, px};
  EXPECT_EQ(IEL_SepiaFast(&bad, &bad, 15), IEL_ERR_FORMAT);
  EXPECT_TRUE(log.contains("Failed with input image format= 9"));
}

TEST(EffectLibrary, InitNeedsEvenSizes) {
  LogCapture log;
  EXPECT_EQ(IEL_Init_Effect(IEL_EFFECT_SEPIA, IEL_FORMAT_RGB888, 641, 480), nullptr);
  EXPECT_TRUE(log.contains("EVEN dimension supported ONLY(641x480) \n"));
  void* h = IEL_Init_Effect(IEL_EFFECT_SEPIA, IEL_FORMAT_RGB888, 640, 480);
  ASSERT_NE(h, nullptr);
  EXPECT_EQ(static_cast<IELEffectHandle*>(h)->work, nullptr);
  IEL_DeInit_Effect(&h);
  EXPECT_EQ(h, nullptr);
  void* w = IEL_Init_Effect(static_cast<enumIELeffect>(14), IEL_FORMAT_RGB888, 64, 2);
  ASSERT_NE(w, nullptr);
  EXPECT_EQ(static_cast<IELEffectHandle*>(w)->work_size, 256);
  IEL_DeInit_Effect(&w);
  IEL_DeInit_Effect(&w);  // twice is harmless
  IEL_DeInit_Effect(nullptr);
}

TEST(EffectLibrary, CancelOnlyWhileBusy) {
  IEL_CancelOperation();
  EXPECT_EQ(iel_progress::cancel_request.load(), 0);
  {
    IELProgressScope scope;
    scope.start(200, 50);
    EXPECT_EQ(IEL_GetProgress(), 25u);
    std::thread other([] { IEL_CancelOperation(); });
    other.join();
    EXPECT_TRUE(scope.cancelled());
    scope.advance(150);
    EXPECT_EQ(IEL_GetProgress(), 100u);
  }
  // Consumed when the effect ends.
  EXPECT_EQ(iel_progress::cancel_request.load(), 0);
  EXPECT_EQ(iel_progress::busy.load(), 0u);
}

TEST(EffectLibrary, ProgressNeverPassesAHundred) {
  {
    IELProgressScope scope;
    // A count left by a long effect read against a short effect's total
    // (a stale read from another thread) is reported as done, not as 36900 %.
    scope.start(1000, 0);
    scope.advance(1000);
    iel_progress::total.store(1);
    iel_progress::done.store(369);
    EXPECT_EQ(IEL_GetProgress(), 100u);
    // A new total starts from a cleared count; large counts do not wrap.
    scope.start(50000000, 0);
    scope.advance(49999999);
    EXPECT_EQ(IEL_GetProgress(), 99u);
  }
}

TEST(EffectLibrary, Version) {
  LogCapture log;
  EXPECT_STREQ(IEL_Lib_Version(), "KALO_FXL_PE_ENG_QT13_REL_5.1__Nov 15 201315:50:20");
  EXPECT_TRUE(log.contains("IEL Lib version: KALO_FXL_PE_ENG_QT13_REL_5.1 [Nov 15 2013:15:50:20] \n"));
}
