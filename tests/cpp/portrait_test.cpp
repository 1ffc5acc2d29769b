// Portrait retouching and red-eye removal: red-eye marking, labelling and
// correction; the session settings, level table, face-box enlargement, skin
// test, range kernels and beautifier; lighting and the out-focus weight map.
// Golden values are worked out by hand from the rules.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstdio>
#include <random>
#include <string>
#include <vector>

#include "effect/blur/px_blur.h"
#include "effect/portrait/px_beautifier.h"
#include "effect/portrait/px_portrait.h"
#include "effect/portrait/px_redeye.h"
#include "effect/px_color/px_brush.h"

namespace {

int argb(int r, int g, int b, unsigned alpha = 0xFF) {
  return static_cast<int>(alpha << 24 | static_cast<unsigned>(r) << 16 | static_cast<unsigned>(g) << 8 |
                          static_cast<unsigned>(b));
}

struct Photo {
  int w, h;
  std::vector<int> px;
  Photo(int w_, int h_, int fill) : w(w_), h(h_), px(static_cast<size_t>(w_) * h_, fill) {}
  int& at(int x, int y) { return px[static_cast<size_t>(y) * w + x]; }
  void block(int x0, int y0, int bw, int bh, int v) {
    for (int y = y0; y < y0 + bh; ++y)
      for (int x = x0; x < x0 + bw; ++x) at(x, y) = v;
  }
};

const int kGrey = argb(100, 100, 100, 0x40);
const int kGreyFixed = argb(94, 100, 100, 0x40);  // (51 + 614 + 307) * 100 >> 10 = 94
const int kRed = argb(255, 0, 0, 0x80);
const int kRedFixed = argb(12, 0, 0, 0x80);  // 51 * 255 >> 10 = 12

}  // namespace

// ---- red-eye -------------------------------------------------------------------

TEST(RedEye, PupilBecomesDarkWithOnePixelRim) {
  Photo p(15, 15, kGrey);
  p.block(6, 6, 3, 3, kRed);
  EXPECT_EQ(px_remove_redeye_manual(p.px.data(), p.w, p.h, 7, 7, 6), 1);
  for (int y = 0; y < p.h; ++y)
    for (int x = 0; x < p.w; ++x) {
      const bool pupil = x >= 6 && x <= 8 && y >= 6 && y <= 8;
      const bool rim = !pupil && x >= 5 && x <= 9 && y >= 5 && y <= 9;
      EXPECT_EQ(p.at(x, y), pupil ? kRedFixed : rim ? kGreyFixed : kGrey) << x << "," << y;
    }
}

TEST(RedEye, FewerThanFiveMarksOrOneRowChangesNothing) {
  Photo p(15, 15, kGrey);
  p.block(6, 6, 2, 2, kRed);  // 4 marks
  const std::vector<int> before = p.px;
  EXPECT_EQ(px_remove_redeye_manual(p.px.data(), p.w, p.h, 7, 7, 6), 0);
  EXPECT_EQ(p.px, before);

  Photo row(20, 1, kRed);  // plenty of marks, but one row
  EXPECT_EQ(px_remove_redeye_manual(row.px.data(), row.w, row.h, 10, 0, 5), 0);
  EXPECT_EQ(row.px, std::vector<int>(20, kRed));
}

TEST(RedEye, APixelMeetingTwoRulesCountsTwice) {
  // Ratio 3 everywhere red: the largest ratio is exactly 3, so B > G marks
  // these pixels a second time; 3 pixels give 6 counts.
  const int pink = argb(210, 70, 80);
  Photo p(15, 15, kGrey);
  p.block(6, 7, 3, 1, pink);
  EXPECT_EQ(px_remove_redeye_manual(p.px.data(), p.w, p.h, 7, 7, 6), 1);
  EXPECT_EQ(p.at(7, 7), argb((51 * 210 + 614 * 70 + 307 * 80) >> 10, 70, 80));
  // Two such pixels count 4: nothing happens.
  Photo q(15, 15, kGrey);
  q.block(6, 7, 2, 1, pink);
  const std::vector<int> before = q.px;
  EXPECT_EQ(px_remove_redeye_manual(q.px.data(), q.w, q.h, 7, 7, 6), 0);
  EXPECT_EQ(q.px, before);
}

TEST(RedEye, OnlyTheLargerOfTwoSpotsIsCorrected) {
  Photo p(21, 21, kGrey);
  p.block(3, 3, 3, 3, kRed);    // 9 pixels
  p.block(14, 14, 4, 4, kRed);  // 16 pixels
  EXPECT_EQ(px_remove_redeye_manual(p.px.data(), p.w, p.h, 10, 10, 10), 1);
  EXPECT_EQ(p.at(4, 4), kRed);
  EXPECT_EQ(p.at(2, 2), kGrey);
  EXPECT_EQ(p.at(15, 15), kRedFixed);
  EXPECT_EQ(p.at(13, 13), kGreyFixed);  // rim, diagonal too
  EXPECT_EQ(p.at(18, 18), kGreyFixed);
  EXPECT_EQ(p.at(19, 19), kGrey);
}

TEST(RedEye, AreasJoinedThroughALeftNeighbourCountAsOne) {
  // A U: two bars labelled apart from the top, joined by the bottom row
  // (the join is seen between a pixel and its left neighbour). 5 + 5 + 1 =
  // 11 pixels beat a 3 x 3 spot, while each bar alone would not.
  Photo p(25, 25, kGrey);
  p.block(4, 4, 1, 5, kRed);
  p.block(6, 4, 1, 5, kRed);
  p.at(5, 8) = kRed;
  p.block(15, 15, 3, 3, kRed);
  EXPECT_EQ(px_remove_redeye_manual(p.px.data(), p.w, p.h, 12, 12, 12), 1);
  EXPECT_EQ(p.at(4, 4), kRedFixed);
  EXPECT_EQ(p.at(6, 4), kRedFixed);
  EXPECT_EQ(p.at(5, 8), kRedFixed);
  EXPECT_EQ(p.at(16, 16), kRed);
}

TEST(RedEye, CornerTouchClipsTheSquare) {
  Photo p(12, 10, kGrey);
  p.block(1, 1, 3, 3, kRed);
  p.block(9, 7, 3, 3, kRed);  // outside the clipped square: untouched
  EXPECT_EQ(px_remove_redeye_manual(p.px.data(), p.w, p.h, 0, 0, 5), 1);
  EXPECT_EQ(p.at(2, 2), kRedFixed);
  EXPECT_EQ(p.at(4, 4), kGreyFixed);
  EXPECT_EQ(p.at(0, 0), kGrey);  // the square's border is not widened into
  EXPECT_EQ(p.at(10, 8), kRed);
  // A touch wholly outside the photo does nothing.
  const std::vector<int> before = p.px;
  EXPECT_EQ(px_remove_redeye_manual(p.px.data(), p.w, p.h, -20, 40, 5), 0);
  EXPECT_EQ(p.px, before);
}

TEST(RedEye, QuickPreviewWritesOnlyStronglyRedPixelsOfTheSquare) {
  Photo src(9, 9, kGrey);
  src.block(0, 0, 9, 9, kRed);
  src.at(4, 4) = argb(200, 80, 0);  // 200 = 2.5 * 80: not strongly red
  Photo dst(9, 9, 7);
  EXPECT_EQ(px_remove_redeye_manual_prev(src.px.data(), dst.px.data(), 9, 9, 1, 1, 2), 5);
  for (int y = 0; y < 9; ++y)
    for (int x = 0; x < 9; ++x) {
      const bool in = x <= 3 && y <= 3 && !(x == 4 && y == 4);
      EXPECT_EQ(dst.at(x, y), in ? kRedFixed : 7) << x << "," << y;  // (int)(0.05 * 255) = 12
    }
  dst.px.assign(81, 7);
  EXPECT_EQ(px_remove_redeye_manual_prev(src.px.data(), dst.px.data(), 9, 9, 4, 4, 0), 1);
  EXPECT_EQ(dst.at(4, 4), 7);
  EXPECT_EQ(px_remove_redeye_manual_prev(src.px.data(), dst.px.data(), 9, 9, 4, 4, -1), -1);
  EXPECT_EQ(dst.px, std::vector<int>(81, 7));
}

TEST(RedEye, WithPreviewCorrectsThePhotoAndRefreshesTheReducedCopy) {
  Photo p(16, 16, kGrey);
  p.block(6, 6, 4, 4, kRed);
  Photo prev(8, 8, 0);
  EXPECT_EQ(px_remove_redeye_manual_with_preview(p.px.data(), 16, 16, prev.px.data(), 8, 8, 8, 8, 5), 1);
  EXPECT_EQ(p.at(7, 7), kRedFixed);
  for (int y = 0; y < 8; ++y)
    for (int x = 0; x < 8; ++x) EXPECT_EQ(prev.at(x, y), p.at(2 * x, 2 * y));
  // A taller preview than the photo's shape: rows past the photo stay.
  Photo tall(8, 10, 5);
  px_remove_redeye_manual_with_preview(p.px.data(), 16, 16, tall.px.data(), 8, 10, 8, 8, 5);
  EXPECT_EQ(tall.at(3, 9), 5);
  EXPECT_EQ(tall.at(3, 7), p.at(6, 14));
}

TEST(RedEye, AutomaticRemovalDoesNothing) {
  Photo src(4, 4, kRed), dst(4, 4, 3);
  px_remove_redeye_auto(src.px.data(), dst.px.data(), 4, 4);
  EXPECT_EQ(dst.px, std::vector<int>(16, 3));
  EXPECT_EQ(src.px, std::vector<int>(16, kRed));
}

// ---- settings, level table, boxes, skin test, kernels ------------------------------

TEST(PortraitSettings, RangesAndDefaults) {
  EXPECT_EQ(px_get_maxFaceCnt(), 2);
  EXPECT_EQ(px_get_beautyLevel(), 3);
  EXPECT_EQ(px_get_detectOption(), 3);
  EXPECT_EQ(px_get_portraitmode_status(), 0);
  px_set_facebeauty(0, 6, 5);  // maxFace out of range becomes 10; the others stay
  EXPECT_EQ(px_get_maxFaceCnt(), 10);
  EXPECT_EQ(px_get_beautyLevel(), 3);
  EXPECT_EQ(px_get_detectOption(), 3);
  px_set_facebeauty(4, 5, 1);
  EXPECT_EQ(px_get_maxFaceCnt(), 4);
  EXPECT_EQ(px_get_beautyLevel(), 5);
  EXPECT_EQ(px_get_detectOption(), 1);
  px_set_facebeauty(11, 0, 0);
  EXPECT_EQ(px_get_maxFaceCnt(), 10);
  EXPECT_EQ(px_get_beautyLevel(), 5);
  px_set_facebeauty(2, 3, 3);
}

TEST(Beautifier, LevelTable) {
  int s = 0, r = 0;
  const int strengths[5] = {0, 511, 1022, 1533, 1533};
  for (int level = 1; level <= 5; ++level) {
    SetVar(level, 140, &s, &r);  // base 140 / 52 = 2
    EXPECT_EQ(s, strengths[level - 1]);
    EXPECT_EQ(r, level == 5 ? 3 : 2);
  }
  SetVar(5, 30, &s, &r);  // base at least 1: (3 + 1) >> 1
  EXPECT_EQ(r, 2);
  SetVar(0, 140, &s, &r);
  EXPECT_EQ(s, -1);
}

TEST(Beautifier, BoxEnlargementFollowsTheWidthAndClamps) {
  caFaceBox b[3] = {{0, 10, 50, 50}, {180, 100, 50, 50}, {50, 50, 20, 60}};
  NewFaceBox(b, 3, 200, 300, 2);
  // nw 70, nh 98: dx 10, dy 24; the box at the left edge keeps x 0.
  EXPECT_EQ(b[0].x, 0);
  EXPECT_EQ(b[0].y, 0);
  EXPECT_EQ(b[0].width, 70);
  EXPECT_EQ(b[0].height, 98);
  EXPECT_EQ(b[1].x, 170);
  EXPECT_EQ(b[1].width, 29);  // at most width - 1 - x
  EXPECT_EQ(b[1].y, 76);
  // A tall box still grows: nw 28, nh 39, dy = |39 - 60| / 2 = 10.
  EXPECT_EQ(b[2].x, 46);
  EXPECT_EQ(b[2].width, 28);
  EXPECT_EQ(b[2].y, 40);
  EXPECT_EQ(b[2].height, 80);
  caFaceBox whole{5, 5, 5, 5};
  NewFaceBox(&whole, 1, 64, 48, 3);
  EXPECT_EQ(whole.width, 64);
  EXPECT_EQ(whole.height, 48);
}

TEST(Beautifier, SkinTestKeepsThePlusOneFiftyTwo) {
  EXPECT_TRUE(IsSkin(200, 150, 130));  // Cb 171, Cr 151
  EXPECT_FALSE(IsSkin(100, 100, 100));  // Cr 128
  EXPECT_FALSE(IsSkin(255, 0, 0));      // Cr 240
  EXPECT_FALSE(IsSkin(100, 75, 65));    // Cr 139: dark skin tones are left
}

TEST(Beautifier, RangeKernels) {
  const int d[3] = {3, 10, 20};
  const int k1[3] = {948, 436, 34}, k3[3] = {996, 753, 299};
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(RangeLUT1024(1)[255 + d[i]], k1[i]);
    EXPECT_EQ(RangeLUT1024(3)[255 - d[i]], k3[i]);
  }
  EXPECT_EQ(RangeLUT1024(0)[255 + 5], 633);  // 1024 exp(-25 / 52.02)
  for (int k = 0; k < 4; ++k) {
    const int32_t* K = RangeLUT1024(k);
    EXPECT_EQ(K[255], 1024);
    for (int v = 1; v <= 255; ++v) {
      EXPECT_EQ(K[255 + v], K[255 - v]);
      EXPECT_LE(K[255 + v], K[254 + v]);
      EXPECT_GE(K[255 + v], 1);
      if (k > 0) {
        EXPECT_GE(K[255 + v], RangeLUT1024(k - 1)[255 + v]);  // wider with the level
      }
    }
  }
}

TEST(Beautifier, UniformSkinAndItsDistanceWeight) {
  // Uniform (200, 150, 130): Y 162 falls in bin 20, so the local mean is 160.
  Photo p(300, 400, argb(200, 150, 130, 0x33));
  p.at(100, 110) = argb(20, 40, 200, 0x33);  // not skin
  const caFaceBox face{50, 50, 100, 100};  // enlarged: (30, 2, 140, 196), centre (100, 100)
  const int wmin = DistanceWeightBase(140, 196);
  EXPECT_EQ(DistanceWeight(0, 0, 140, 196, wmin), 256);
  EXPECT_EQ(DistanceWeight(70, 0, 140, 196, wmin), 0);
  EXPECT_EQ(DistanceWeight(-69, 0, 140, 196, wmin), 6);
  Face_BeautifierRGB(p.px.data(), p.h, p.w, 3, &face, 1);
  EXPECT_EQ(p.at(100, 100), argb(195, 148, 127, 0x33));  // Y' 160, own chroma
  EXPECT_EQ(p.at(32, 3), argb(197, 150, 129, 0x33));     // weight 0: Y 162 rebuilt
  EXPECT_EQ(p.at(100, 110), argb(20, 40, 200, 0x33));
  EXPECT_EQ(p.at(29, 100), argb(200, 150, 130, 0x33));   // outside the box
  EXPECT_EQ(p.at(100, 198), argb(200, 150, 130, 0x33));
  Photo q(300, 400, argb(200, 150, 130));
  Face_BeautifierRGB(q.px.data(), q.h, q.w, 0, &face, 1);
  EXPECT_EQ(q.px, std::vector<int>(q.px.size(), argb(200, 150, 130)));
}

TEST(Beautifier, NoiseIsSmoothedTowardsTheLocalMean) {
  Photo p(120, 240, 0);
  unsigned seed = 7;
  for (int& v : p.px) {
    seed = seed * 1103515245u + 12345u;
    const int n = static_cast<int>((seed >> 16) % 9) - 4;
    v = argb(200 + n, 150 + n, 130 + n);
  }
  const std::vector<int> before = p.px;
  const caFaceBox face{30, 60, 60, 60};
  Face_BeautifierRGB(p.px.data(), p.h, p.w, 4, &face, 1);
  // Around the centre the luminance spread shrinks.
  auto spread = [&](const std::vector<int>& px) {
    int lo = 255, hi = 0;
    for (int y = 85; y < 95; ++y)
      for (int x = 55; x < 65; ++x) {
        const int g = (px[static_cast<size_t>(y) * 120 + x] >> 8) & 0xFF;
        lo = g < lo ? g : lo;
        hi = g > hi ? g : hi;
      }
    return hi - lo;
  };
  EXPECT_LT(spread(p.px), spread(before));
}

// ---- the session -----------------------------------------------------------------------

namespace {
// The astronaut of the face tests, tinted towards skin so that the
// beautifier has pixels to work on.
bool astronaut(std::vector<int>* px, int* w, int* h) {
  std::string path = std::string(__FILE__);
  path = path.substr(0, path.rfind('/')) + "/../data/astronaut_256.pgm";
  FILE* f = std::fopen(path.c_str(), "rb");
  if (!f) return false;
  int maxv = 0;
  bool ok = std::fscanf(f, "P5 %d %d %d", w, h, &maxv) == 3 && std::fgetc(f) != EOF;
  std::vector<unsigned char> g(ok ? static_cast<size_t>(*w) * *h : 0);
  ok = ok && std::fread(g.data(), 1, g.size(), f) == g.size();
  std::fclose(f);
  px->resize(g.size());
  for (size_t i = 0; i < g.size(); ++i) {
    const int v = g[i];
    (*px)[i] = argb(v, v * 3 / 4, v * 13 / 20, 0x7F);
  }
  return ok;
}
}  // namespace

TEST(PortraitSession, NoSessionGuardsAndAFacelessPhoto) {
  Photo src(32, 24, argb(100, 100, 100, 0x11)), dst(32, 24, 5), prev(16, 12, 5);
  EXPECT_EQ(px_apply_beautifier(src.px.data(), dst.px.data(), 32, 24, 3), 40962);
  EXPECT_EQ(px_apply_beautifier(src.px.data(), dst.px.data(), 32, 24, 0), 40960);  // level 0: untouched
  EXPECT_EQ(px_apply_beautifier_singleface(src.px.data(), dst.px.data(), 32, 24, 3, 0), 40962);
  EXPECT_EQ(px_control_light_in_portrait(src.px.data(), dst.px.data(), 32, 24, 15), 40962);
  EXPECT_EQ(px_control_outfocusing_in_portrait(src.px.data(), dst.px.data(), 32, 24, 3), 40962);
  EXPECT_EQ(px_control_outfocusing_in_portrait_preview(src.px.data(), 32, 24, prev.px.data(), 16, 12, 3), 40962);
  EXPECT_EQ(dst.px, std::vector<int>(dst.px.size(), 5));

  ASSERT_NE(px_init_portrait(2, 3, 1, src.px.data(), 32, 24), nullptr);
  EXPECT_EQ(px_get_portraitmode_status(), 1);
  EXPECT_EQ(px_portrait_session()->faceCount, 0);
  EXPECT_EQ(px_apply_beautifier(src.px.data(), dst.px.data(), 32, 24, 6), 40962);
  EXPECT_EQ(px_apply_beautifier(src.px.data(), dst.px.data(), 32, 24, 4), 40960);
  EXPECT_EQ(px_portrait_session()->beautyLevel, 4);  // stored for the later operations
  EXPECT_EQ(dst.px, std::vector<int>(dst.px.size(), 5));  // no face: untouched
  EXPECT_EQ(px_apply_beautifier_preview(src.px.data(), 32, 24, prev.px.data(), 16, 12, 2), 40960);
  EXPECT_EQ(prev.px, std::vector<int>(prev.px.size(), 5));
  EXPECT_EQ(px_apply_beautifier_preview(src.px.data(), 32, 24, prev.px.data(), 16, 12, 0), 40960);
  EXPECT_EQ(prev.px, std::vector<int>(prev.px.size(), argb(100, 100, 100, 0x11)));

  // One-shot beautifier without faces: the fallback table, 100 -> 100 + 2 * 19.
  EXPECT_EQ(px_facebeauty(src.px.data(), dst.px.data(), 32, 24), 40960);
  EXPECT_EQ(dst.px, std::vector<int>(dst.px.size(), argb(138, 138, 138, 0x11)));

  // Out-focus without faces blurs everything; strength 0 writes nothing.
  Photo noisy(32, 24, 0);
  for (size_t i = 0; i < noisy.px.size(); ++i) noisy.px[i] = argb(static_cast<int>(i * 37 % 256), 90, 40);
  dst.px.assign(dst.px.size(), 5);
  EXPECT_EQ(px_control_outfocusing_in_portrait(noisy.px.data(), dst.px.data(), 32, 24, 0), 40960);
  EXPECT_EQ(dst.px, std::vector<int>(dst.px.size(), 5));
  EXPECT_EQ(px_control_outfocusing_in_portrait(noisy.px.data(), dst.px.data(), 32, 24, 3), 40960);
  std::vector<int> blurred(noisy.px.size());
  std::vector<unsigned char> ones(noisy.px.size(), 1);
  px_make_blur(noisy.px.data(), ones.data(), blurred.data(), 32, 24, 3, 0, 31, 0, 23);
  EXPECT_EQ(dst.px, blurred);
  EXPECT_EQ(px_control_outfocusing_in_portrait(noisy.px.data(), dst.px.data(), 32, 24, -1), 40971);

  // A second open replaces the first; finish closes; a second finish is harmless.
  ASSERT_NE(px_init_portrait(2, 3, 1, src.px.data(), 32, 24), nullptr);
  px_finish_portrait();
  EXPECT_EQ(px_get_portraitmode_status(), 0);
  EXPECT_EQ(px_portrait_session(), nullptr);
  px_finish_portrait();
  px_set_facebeauty(2, 3, 3);
}

TEST(PortraitSession, BeautifyAndLightTheAstronaut) {
  std::vector<int> src;
  int w = 0, h = 0;
  ASSERT_TRUE(astronaut(&src, &w, &h));
  const FaceEngineInfo* fe = px_init_portrait(5, 3, 1, src.data(), w, h);
  ASSERT_NE(fe, nullptr);
  ASSERT_EQ(fe->faceCount, 1);
  caFaceBox box = fe->faceRect[0];
  caFaceBox big = box;
  NewFaceBox(&big, 1, w, h, 2);

  std::vector<int> dst(src.size(), 0);
  ASSERT_EQ(px_apply_beautifier(src.data(), dst.data(), w, h, 5), 40960);
  int changed = 0;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      const size_t i = static_cast<size_t>(y) * w + x;
      const bool inside = x >= big.x && x < big.x + big.width && y >= big.y && y < big.y + big.height;
      if (!inside) {
        EXPECT_EQ(dst[i], src[i]);
      }
      if (dst[i] != src[i]) {
        ++changed;
        EXPECT_EQ(static_cast<unsigned>(dst[i]) >> 24, 0x7Fu);
      }
    }
  EXPECT_GT(changed, 50);
  std::vector<int> single(src.size(), 0);
  ASSERT_EQ(px_apply_beautifier_singleface(src.data(), single.data(), w, h, 5, 0), 40960);
  EXPECT_EQ(single, dst);
  std::vector<int> untouched(src.size(), 9);
  ASSERT_EQ(px_apply_beautifier_singleface(src.data(), untouched.data(), w, h, 5, 1), 40960);
  EXPECT_EQ(untouched, std::vector<int>(src.size(), 9));
  // The preview is the full result reduced by the Q12 step (2.0 here).
  std::vector<int> prev(static_cast<size_t>(w / 2) * (h / 2), 0);
  ASSERT_EQ(px_apply_beautifier_preview(src.data(), w, h, prev.data(), w / 2, h / 2, 5), 40960);
  for (int y = 0; y < h / 2; ++y)
    for (int x = 0; x < w / 2; ++x)
      EXPECT_EQ(prev[static_cast<size_t>(y) * (w / 2) + x], dst[static_cast<size_t>(2 * y) * w + 2 * x]);

  // Lighting: level 10 is an exact copy; 20 lightens around the face centre
  // within its reach; a face index out of range leaves the copy.
  std::vector<int> lit(src.size(), 0);
  ASSERT_EQ(px_control_light_in_portrait(src.data(), lit.data(), w, h, 10), 40960);
  EXPECT_EQ(lit, src);
  ASSERT_EQ(px_control_light_in_portrait(src.data(), lit.data(), w, h, 20), 40960);
  const int cx = box.x + (box.width >> 1), cy = box.y + (box.height >> 1);
  const int reach = box.width > box.height ? box.width : box.height;
  const size_t c = static_cast<size_t>(cy) * w + cx;
  EXPECT_GT((lit[c] >> 8) & 0xFF, (src[c] >> 8) & 0xFF);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      const long long d2 = static_cast<long long>(x - cx) * (x - cx) + static_cast<long long>(y - cy) * (y - cy);
      if (d2 >= static_cast<long long>(reach) * reach) {
        EXPECT_EQ(lit[static_cast<size_t>(y) * w + x], src[static_cast<size_t>(y) * w + x]);
      }
    }
  std::vector<int> dark(src.size(), 0);
  ASSERT_EQ(px_control_light_in_portrait_singleface(src.data(), dark.data(), w, h, 0, 0), 40960);
  EXPECT_LT((dark[c] >> 8) & 0xFF, (src[c] >> 8) & 0xFF);
  ASSERT_EQ(px_control_light_in_portrait_singleface(src.data(), dark.data(), w, h, 0, 3), 40960);
  EXPECT_EQ(dark, src);
  std::vector<int> lprev(prev.size(), 4);
  ASSERT_EQ(px_control_light_in_portrait_preview(src.data(), w, h, lprev.data(), w / 2, h / 2, 10), 40960);
  EXPECT_EQ(lprev, std::vector<int>(prev.size(), 4));  // level 10 writes nothing
  ASSERT_EQ(px_control_light_in_portrait_singleface_preview(src.data(), w, h, lprev.data(), w / 2, h / 2, 20, 0),
            40960);
  EXPECT_EQ(lprev[static_cast<size_t>(cy / 2) * (w / 2) + cx / 2], lit[static_cast<size_t>(cy / 2 * 2) * w + cx / 2 * 2]);

  // Out-focus keeps the face sharp and blurs the corners.
  std::vector<int> of(src.size(), 0);
  ASSERT_EQ(px_control_outfocusing_in_portrait(src.data(), of.data(), w, h, 5), 40960);
  EXPECT_EQ(of[c] & 0xFFFFFF, ((((src[c] >> 16) & 0xFF) * 255) >> 8) << 16 | ((((src[c] >> 8) & 0xFF) * 255) >> 8) << 8 |
                                  (((src[c] & 0xFF) * 255) >> 8));
  px_finish_portrait();
  px_set_facebeauty(2, 3, 3);
}

// ---- out-focus weight map and compose ------------------------------------------------

TEST(Outfocus, WeightMapOfTwoFacesAndTheBottomEdge) {
  const int W = 100, H = 100;
  std::vector<unsigned char> map(W * H, 255);
  const caFaceBox faces[2] = {{10, 10, 10, 10}, {30, 10, 10, 10}};  // a 15, R 25; centres (15, 25), (35, 25)
  px_outfocus_weight_map(map.data(), W, H, faces, 2);
  auto m = [&](int x, int y) { return static_cast<int>(map[static_cast<size_t>(y) * W + x]); };
  EXPECT_EQ(m(15, 24), 0);        // inside the head disc
  EXPECT_EQ(m(15, 0), 255);       // d2 = R2: outside
  EXPECT_EQ(m(15, 5), 111);       // 255 * (400 - 225) / 400; the second face does not reach
  EXPECT_EQ(m(60, 5), 255);       // right of the second face's columns
  EXPECT_EQ(m(50, 20), 15);       // second face: d2 = 250, 255 * 25 / 400
  EXPECT_EQ(m(15, 50), 0);        // body of the first face
  EXPECT_EQ(m(35, 50), 0);        // the first face's ramp (127) loses to the second's 0
  EXPECT_EQ(m(52, 50), 51);       // (52 - 35 - 15) * 255 / 10
  EXPECT_EQ(m(60, 50), 255);
  EXPECT_EQ(m(99, 99), 255);

  std::vector<unsigned char> one(W * H, 255);
  const caFaceBox low{10, 10, 10, 10};
  px_outfocus_weight_map(one.data(), W, H, &low, 1);
  EXPECT_EQ(one[5 * W + 15], 111);  // 255 * (400 - 225) / 400
  EXPECT_EQ(one[50 * W + 35], 127); // right ramp: 5 * 255 / 10
  EXPECT_EQ(one[50 * W + 39], 229);
  EXPECT_EQ(one[50 * W + 40], 255);

  std::vector<unsigned char> edge(W * H, 255);
  const caFaceBox bottom{10, 90, 10, 10};  // cy = min(105, 99): the body is the last row
  px_outfocus_weight_map(edge.data(), W, H, &bottom, 1);
  EXPECT_EQ(edge[99 * W + 29], 0);
  EXPECT_EQ(edge[99 * W + 35], 127);
  EXPECT_EQ(edge[98 * W + 15], 0);  // head, row above
  EXPECT_EQ(edge[98 * W + 29], 0);   // d2 = 196 + 1 <= a2
  EXPECT_EQ(edge[98 * W + 38], 194); // d2 = 530: 255 * 305 / 400
}

TEST(Outfocus, ComposeShiftsByEightAndMakesMixedPixelsOpaque) {
  const int sharp[3] = {argb(200, 100, 0, 0x10), argb(200, 100, 0, 0x10), argb(200, 100, 0, 0x10)};
  const int blurred[3] = {argb(10, 20, 30, 0x20), argb(10, 20, 30, 0x20), argb(10, 20, 30, 0x20)};
  const unsigned char map[3] = {255, 0, 128};
  int out[3];
  px_outfocus_compose(sharp, blurred, map, out, 3);
  EXPECT_EQ(out[0], argb(10, 20, 30, 0x20));
  EXPECT_EQ(out[1], argb(199, 99, 0));
  EXPECT_EQ(out[2], argb((128 * 10 + 127 * 200) >> 8, (128 * 20 + 127 * 100) >> 8, (128 * 30) >> 8));
}

// ---- previews that cost what they show -------------------------------------------------

namespace {
// The Q12 nearest-neighbour reduction of the previews, written out: the
// preview pixels whose source lies outside the photo keep `fill`.
std::vector<int> reduced(const std::vector<int>& full, int w, int h, int pw, int ph, int fill) {
  const long long step = static_cast<long long>(static_cast<float>(static_cast<long long>(w) << 12) / static_cast<float>(pw));
  std::vector<int> out(static_cast<size_t>(pw) * ph, fill);
  for (int j = 0; j < ph; ++j)
    for (int i = 0; i < pw; ++i) {
      const long long sx = (i * step) >> 12, sy = (j * step) >> 12;
      if (sx < w && sy < h) out[static_cast<size_t>(j) * pw + i] = full[static_cast<size_t>(sy) * w + sx];
    }
  return out;
}

// Seeded skin-toned noise: most pixels pass the skin test.
std::vector<int> skin_noise(int w, int h, unsigned seed) {
  std::vector<int> px(static_cast<size_t>(w) * h);
  unsigned s = seed;
  for (int& p : px) {
    s = s * 1103515245u + 12345u;
    const int d = static_cast<int>((s >> 16) % 41) - 20;
    p = argb(200 + d / 2, 150 + d, 130 + d, 0x30 + static_cast<int>((s >> 8) & 0x3F));
  }
  return px;
}
}  // namespace

// Preview sizes with awkward steps: halves, thirds, a preview wider than the
// photo (repeated columns, rows past the photo), one row and one column.
struct PreviewSize {
  int pw, ph;
};
const PreviewSize kPreviewSizes[] = {{48, 40}, {33, 27}, {101, 70}, {137, 200}, {1, 97}, {97, 1}, {7, 5}};

TEST(PreviewSampling, SampledBeautifierMatchesTheFullOneWithOverlappingFaces) {
  const int w = 97, h = 83;
  const std::vector<int> src = skin_noise(w, h, 7);
  // Two overlapping boxes (the second samples pixels the first has changed)
  // and one reaching past the right edge.
  const caFaceBox faces[3] = {{20, 15, 30, 28}, {35, 30, 26, 30}, {80, 50, 25, 20}};
  for (int level = 1; level <= 5; ++level) {
    std::vector<int> full = src;
    Face_BeautifierRGB(full.data(), h, w, level, faces, 3);
    ASSERT_NE(full, src);
    for (const PreviewSize& p : kPreviewSizes) {
      // Columns and rows in any order of the photo, repeated ones too.
      std::vector<int> xs, ys;
      for (int i = 0; i < p.pw; ++i) xs.push_back(static_cast<int>((static_cast<long long>(i) * 7 + 3) % w));
      for (int j = 0; j < p.ph; ++j) ys.push_back(static_cast<int>((static_cast<long long>(j) * 5 + 1) % h));
      std::vector<int> out(static_cast<size_t>(p.pw + 2) * p.ph, 9);
      ASSERT_TRUE(Face_BeautifierRGB_At(src.data(), h, w, level, faces, 3, xs.data(), p.pw, ys.data(), p.ph,
                                        out.data(), p.pw + 2));
      for (int j = 0; j < p.ph; ++j) {
        for (int i = 0; i < p.pw; ++i)
          ASSERT_EQ(out[static_cast<size_t>(j) * (p.pw + 2) + i], full[static_cast<size_t>(ys[j]) * w + xs[i]])
              << "level " << level << " at " << xs[i] << "," << ys[j];
        EXPECT_EQ(out[static_cast<size_t>(j) * (p.pw + 2) + p.pw], 9);  // the stride's gap stays
      }
    }
  }
  // Level 0 filters nothing: the samples are the photo's pixels.
  const int xs[2] = {0, 96}, ys[2] = {82, 0};
  int out[4] = {};
  ASSERT_TRUE(Face_BeautifierRGB_At(src.data(), h, w, 0, faces, 3, xs, 2, ys, 2, out, 2));
  EXPECT_EQ(out[0], src[82 * w]);
  EXPECT_EQ(out[3], src[96]);
}

TEST(PreviewSampling, SampledBrushesMatchTheFullBrushes) {
  const int w = 61, h = 45;
  std::vector<int> src(static_cast<size_t>(w) * h);
  std::mt19937 rng(3);
  for (int& p : src) p = static_cast<int>(rng());
  std::vector<int> xs, ys;
  for (int i = 0; i < w; i += 2) xs.push_back(i);
  for (int j = h - 1; j >= 0; j -= 3) ys.push_back(j);
  const int nx = static_cast<int>(xs.size()), ny = static_cast<int>(ys.size());
  struct Brush {
    int cx, cy, strength, r;
  };
  // Centred, off the picture, beyond the 2048 lighten limit, one pixel.
  for (const Brush& b : {Brush{30, 20, 45, 17}, Brush{-5, 50, 12, 30}, Brush{10, 10, 60, 3000}, Brush{4, 4, 90, 1}}) {
    std::vector<int> lit = src, dark = src;
    px_apply_lighten(lit.data(), b.cx, b.cy, w, h, b.strength, b.r);
    px_apply_darken(dark.data(), b.cx, b.cy, w, h, b.strength, b.r);
    std::vector<int> slit(static_cast<size_t>(nx) * ny), sdark;
    for (int j = 0; j < ny; ++j)
      for (int i = 0; i < nx; ++i) slit[static_cast<size_t>(j) * nx + i] = src[static_cast<size_t>(ys[j]) * w + xs[i]];
    sdark = slit;
    px_apply_lighten_at(slit.data(), nx, xs.data(), nx, ys.data(), ny, b.cx, b.cy, b.strength, b.r);
    px_apply_darken_at(sdark.data(), nx, xs.data(), nx, ys.data(), ny, b.cx, b.cy, b.strength, b.r);
    for (int j = 0; j < ny; ++j)
      for (int i = 0; i < nx; ++i) {
        ASSERT_EQ(slit[static_cast<size_t>(j) * nx + i], lit[static_cast<size_t>(ys[j]) * w + xs[i]]) << b.r;
        ASSERT_EQ(sdark[static_cast<size_t>(j) * nx + i], dark[static_cast<size_t>(ys[j]) * w + xs[i]]) << b.r;
      }
  }
}

TEST(PreviewSampling, SessionPreviewsAreTheReducedFullResults) {
  std::vector<int> src;
  int w = 0, h = 0;
  ASSERT_TRUE(astronaut(&src, &w, &h));
  ASSERT_NE(px_init_portrait(5, 3, 1, src.data(), w, h), nullptr);
  ASSERT_EQ(px_portrait_session()->faceCount, 1);
  for (int level : {1, 4, 5}) {
    std::vector<int> full(src.size());
    ASSERT_EQ(px_apply_beautifier(src.data(), full.data(), w, h, level), 40960);
    for (const PreviewSize& p : kPreviewSizes) {
      std::vector<int> prev(static_cast<size_t>(p.pw) * p.ph, 3);
      ASSERT_EQ(px_apply_beautifier_preview(src.data(), w, h, prev.data(), p.pw, p.ph, level), 40960);
      EXPECT_EQ(prev, reduced(full, w, h, p.pw, p.ph, 3)) << p.pw << "x" << p.ph;
      prev.assign(prev.size(), 3);
      ASSERT_EQ(px_apply_beautifier_singleface_preview(src.data(), w, h, prev.data(), p.pw, p.ph, level, 0), 40960);
      EXPECT_EQ(prev, reduced(full, w, h, p.pw, p.ph, 3));
    }
  }
  for (int level : {0, 3, 17, 20}) {
    std::vector<int> full(src.size());
    ASSERT_EQ(px_control_light_in_portrait(src.data(), full.data(), w, h, level), 40960);
    for (const PreviewSize& p : kPreviewSizes) {
      std::vector<int> prev(static_cast<size_t>(p.pw) * p.ph, 3);
      ASSERT_EQ(px_control_light_in_portrait_preview(src.data(), w, h, prev.data(), p.pw, p.ph, level), 40960);
      EXPECT_EQ(prev, reduced(full, w, h, p.pw, p.ph, 3)) << level << " " << p.pw << "x" << p.ph;
      prev.assign(prev.size(), 3);
      ASSERT_EQ(px_control_light_in_portrait_singleface_preview(src.data(), w, h, prev.data(), p.pw, p.ph, level, 2),
                40960);
      EXPECT_EQ(prev, reduced(src, w, h, p.pw, p.ph, 3));  // no such face: the plain reduction
    }
  }
  px_finish_portrait();
  px_set_facebeauty(2, 3, 3);
}

TEST(PreviewSampling, OutfocusPreviewBlursTheReducedPhoto) {
  std::vector<int> src;
  int w = 0, h = 0;
  ASSERT_TRUE(astronaut(&src, &w, &h));
  ASSERT_NE(px_init_portrait(5, 3, 1, src.data(), w, h), nullptr);
  const caFaceBox face = px_portrait_session()->faceRect[0];
  // A quarter of the photo's side (step 4.0): the blur radius 31 of strength
  // 3 becomes 8 (rounded); the faces shrink by 4 as well.
  ASSERT_EQ(w % 4, 0);
  const int pw = w / 4, ph = h / 4 + 3;
  std::vector<int> prev(static_cast<size_t>(pw) * ph, 6);
  ASSERT_EQ(px_control_outfocusing_in_portrait_preview(src.data(), w, h, prev.data(), pw, ph, 3), 40960);
  std::vector<int> small = reduced(src, w, h, pw, ph, 6);
  const int nx = pw, ny = h / 4;
  for (int j = ny; j < ph; ++j)  // rows without a source stay
    for (int i = 0; i < pw; ++i) ASSERT_EQ(prev[static_cast<size_t>(j) * pw + i], 6);
  std::vector<int> blurred(static_cast<size_t>(nx) * ny), compact(blurred.size());
  for (int j = 0; j < ny; ++j)
    for (int i = 0; i < nx; ++i) compact[static_cast<size_t>(j) * nx + i] = small[static_cast<size_t>(j) * pw + i];
  ASSERT_EQ(px_blur_variable(compact.data(), blurred.data(), nx, ny, 8), 0);
  // The face centre is sharp (weight 0, the >> 8 of the mix), the top corners
  // (far from the face and the body below it) fully blurred.
  const int cx = (face.x + face.width / 2) / 4, cy = (face.y + face.height / 2) / 4;
  const int c = compact[static_cast<size_t>(cy) * nx + cx];
  int sharp = static_cast<int>(0xFF000000u);
  for (int shift = 0; shift <= 16; shift += 8) sharp |= ((((c >> shift) & 0xFF) * 255) >> 8) << shift;
  EXPECT_EQ(prev[static_cast<size_t>(cy) * pw + cx], sharp);
  EXPECT_EQ(prev[0], blurred[0]);
  EXPECT_EQ(prev[static_cast<size_t>(nx - 1)], blurred[static_cast<size_t>(nx - 1)]);
  // Strength 0 still blurs the preview a little (radius 3 -> 1); a negative
  // strength is refused.
  EXPECT_EQ(px_control_outfocusing_in_portrait_preview(src.data(), w, h, prev.data(), pw, ph, -2), 40971);
  // A preview more than 4096 times wider than the photo: every sample is the
  // first pixel (a step below one 4096th is 0), and it is not divided by.
  const int wide = w * 4096 + 1;
  std::vector<int> line(static_cast<size_t>(wide), 6);
  ASSERT_EQ(px_control_outfocusing_in_portrait_preview(src.data(), w, h, line.data(), wide, 1, 3), 40960);
  for (int shift = 0; shift <= 16; shift += 8) {
    const int want = (src[0] >> shift) & 0xFF;
    for (int i : {0, wide / 2, wide - 1}) EXPECT_NEAR((line[static_cast<size_t>(i)] >> shift) & 0xFF, want, 1) << i;
  }
  px_finish_portrait();
  px_set_facebeauty(2, 3, 3);
}
