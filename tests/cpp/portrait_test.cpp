// Portrait retouching and red-eye removal: red-eye marking, labelling and
// correction; the session settings, level table, face-box enlargement, skin
// test, range kernels and beautifier; lighting and the out-focus weight map.
// Golden values are worked out by hand from the rules.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "effect/portrait/px_redeye.h"

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
