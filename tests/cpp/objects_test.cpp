#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>
#include <thread>
#include <vector>

#include "effect/object/px_copy_paste.h"
#include "effect/object/px_eraser.h"

namespace {
int argb(int a, int r, int g, int b) {
  return static_cast<int>(static_cast<uint32_t>(a) << 24 | static_cast<uint32_t>(r) << 16 |
                          static_cast<uint32_t>(g) << 8 | static_cast<uint32_t>(b));
}
int grey(int v, int a = 255) { return argb(a, v, v, v); }

// ---- eraser set-up ---------------------------------------------------------------

TEST(EraserSetup, RectangleIsEvenedWithinThePicture) {
  px_rect r = px_eraser_even_rect(px_rect{5, 8, 3, 6}, 11, 9);
  EXPECT_EQ(4, r.left);
  EXPECT_EQ(9, r.right);
  EXPECT_EQ(2, r.top);
  EXPECT_EQ(7, r.bottom);
  // An even right edge on the last column of an odd-width picture stays.
  r = px_eraser_even_rect(px_rect{0, 10, 0, 8}, 11, 9);
  EXPECT_EQ(0, r.left);
  EXPECT_EQ(10, r.right);
  EXPECT_EQ(8, r.bottom);
}

TEST(EraserSetup, SizesFollowTheLongerSide) {
  int p, w;
  px_eraser_sizes(2000, 1000, &p, &w);
  EXPECT_EQ(50, p);
  EXPECT_EQ(6, w);
  px_eraser_sizes(1000, 700, &p, &w);
  EXPECT_EQ(30, p);
  EXPECT_EQ(3, w);
  px_eraser_sizes(600, 600, &p, &w);
  EXPECT_EQ(20, p);
  EXPECT_EQ(2, w);
  px_eraser_sizes(300, 1280, &p, &w);  // the height when it is longer
  EXPECT_EQ(50, p);
  px_eraser_sizes(1279, 10, &p, &w);
  EXPECT_EQ(30, p);
  px_eraser_sizes(639, 639, &p, &w);
  EXPECT_EQ(20, p);
}

TEST(EraserSetup, FrontNormalIsPerpendicularToTheFrontOffset) {
  int32_t nx, ny;
  px_eraser_normal(0, 0, &nx, &ny);
  EXPECT_EQ(39332, nx);
  EXPECT_EQ(52429, ny);
  px_eraser_normal(1, 0, &nx, &ny);  // horizontal front: vertical normal
  EXPECT_EQ(0, nx);
  EXPECT_EQ(65536, ny);
  px_eraser_normal(0, 2, &nx, &ny);
  EXPECT_EQ(-65536, nx);
  EXPECT_EQ(0, ny);
  px_eraser_normal(1, 1, &nx, &ny);  // diagonal: 1/sqrt(2) = 46341 in 16.16
  EXPECT_EQ(-46341, nx);
  EXPECT_EQ(46341, ny);
  px_eraser_normal(-2, 1, &nx, &ny);  // (-1, -2) / sqrt(5)
  EXPECT_EQ(-29309, nx);
  EXPECT_EQ(-58617, ny);  // 2 / sqrt(5) = 0.894427
}

// ---- segmentation ------------------------------------------------------------------

TEST(Segmentation, FindPointsOnlyTheQueriedElementAtTheRoot) {
  px_dset_elt s[4] = {{0, 4}, {0, 1}, {1, 1}, {2, 1}};  // chain 3 -> 2 -> 1 -> 0
  EXPECT_EQ(0, px_dset_find(s, 3));
  EXPECT_EQ(0, s[3].parent);
  EXPECT_EQ(1, s[2].parent);  // not compressed
  EXPECT_EQ(0, s[1].parent);
}

TEST(Segmentation, JoinHangsTheSmallerUnderTheLargerAndTheFirstOnEqualSizes) {
  px_dset_elt s[4] = {{0, 1}, {1, 1}, {2, 3}, {3, 2}};
  EXPECT_EQ(1, px_dset_join(s, 0, 1));  // equal: first under second
  EXPECT_EQ(1, s[0].parent);
  EXPECT_EQ(2, s[1].size);
  EXPECT_EQ(2, px_dset_join(s, 2, 3));  // larger first keeps the root
  EXPECT_EQ(2, s[3].parent);
  EXPECT_EQ(5, s[2].size);
  EXPECT_EQ(2, px_dset_join(s, 1, 2));
  EXPECT_EQ(7, s[2].size);
}

TEST(Segmentation, OnlyStepsBelowTwentyJoin) {
  // A path 0-1-2-3-4 with stored weights 0, 20, 0, 765 (a step below 20 is stored as 0).
  std::vector<px_seg_edge> e = {{0, 0, 1}, {20, 1, 2}, {0, 2, 3}, {765, 3, 4}};
  int32_t root[5];
  EXPECT_EQ(3, px_segment_graph(e.data(), 4, 5, 0, root));
  EXPECT_EQ(root[0], root[1]);
  EXPECT_EQ(root[2], root[3]);
  EXPECT_NE(root[1], root[2]);
  EXPECT_NE(root[3], root[4]);
  // Sorted ascending, equal weights in their first order.
  EXPECT_EQ(0, e[0].w);
  EXPECT_EQ(0, e[0].a);
  EXPECT_EQ(2, e[1].a);
  EXPECT_EQ(20, e[2].w);
  EXPECT_EQ(765, e[3].w);
}

TEST(Segmentation, SmallComponentsJoinTheirMostSimilarNeighbour) {
  // Components {0,1,2}, {3} and {4,5,6}; size bound 10 makes components below
  // 2 samples small. Vertex 3 joins over its cheaper edge (40 < 300).
  std::vector<px_seg_edge> e = {{0, 0, 1}, {0, 1, 2}, {300, 2, 3}, {40, 3, 4}, {0, 4, 5}, {0, 5, 6}};
  int32_t root[7];
  EXPECT_EQ(2, px_segment_graph(e.data(), 6, 7, 10, root));
  EXPECT_EQ(root[3], root[4]);
  EXPECT_NE(root[2], root[3]);
}

// ---- eraser control ----------------------------------------------------------------

struct EraserReset {
  ~EraserReset() {
    set_status_photoeraser(PX_ERASER_IDLE);
    px_eraser_set_progress(nullptr, nullptr);
  }
};

TEST(EraserControl, RefusalsFollowTheStatus) {
  EraserReset reset;
  set_status_photoeraser(PX_ERASER_IDLE);
  EXPECT_EQ(40965, stop_photoeraser());
  EXPECT_EQ(40965, restart_photoeraser());
  EXPECT_EQ(40965, exit_photoeraser());
  set_status_photoeraser(PX_ERASER_RUNNING);
  EXPECT_EQ(40966, restart_photoeraser());
  EXPECT_EQ(40960, stop_photoeraser());
  EXPECT_EQ(1, g_bStop.load());
  set_status_photoeraser(PX_ERASER_PAUSED);
  EXPECT_EQ(40960, restart_photoeraser());
  EXPECT_EQ(0, g_bStop.load());
  EXPECT_EQ(40960, exit_photoeraser());
  EXPECT_EQ(1, g_bExit.load());
  g_bExit.store(0);
}

// ---- erasing -----------------------------------------------------------------------

// A vertical ramp: every row has its own grey, so a window's known pixels
// identify their row and an exemplar fill must reproduce each row's colour.
struct Ramp {
  int w = 60, h = 50;
  std::vector<int> pic;
  std::vector<unsigned char> mask;
  Ramp() : pic(static_cast<size_t>(w) * h), mask(pic.size()) {
    for (int y = 0; y < h; ++y) {
      for (int x = 0; x < w; ++x) pic[y * w + x] = grey(40 + 3 * y);
    }
    // A disc of radius 8 at (30, 25) with a foreign colour and alpha 0x80.
    for (int y = 0; y < h; ++y) {
      for (int x = 0; x < w; ++x) {
        if ((x - 30) * (x - 30) + (y - 25) * (y - 25) <= 64) {
          mask[y * w + x] = 1;
          pic[y * w + x] = argb(0x80, 255, 0, 0);
        }
      }
    }
  }
};

TEST(Eraser, FillsTheHoleFromTheMatchingRowsAndKeepsAlpha) {
  EraserReset reset;
  Ramp r;
  std::vector<int> before = r.pic;
  // An extra mask pixel outside the rectangle is neither filled nor used.
  r.mask[2 * r.w + 2] = 1;
  EXPECT_EQ(40960, process_photoeraser(r.pic.data(), r.mask.data(), r.w, r.h, 21, 39, 16, 34));
  EXPECT_EQ(PX_ERASER_IDLE, get_status_photoeraser());
  for (int y = 0; y < r.h; ++y) {
    for (int x = 0; x < r.w; ++x) {
      const int i = y * r.w + x;
      if (r.mask[i] == 1 && !(x == 2 && y == 2)) {
        ASSERT_EQ(static_cast<uint32_t>(grey(40 + 3 * y, 0x80)), static_cast<uint32_t>(r.pic[i])) << x << "," << y;
      } else {
        ASSERT_EQ(before[i], r.pic[i]) << x << "," << y;
      }
    }
  }
}

TEST(Eraser, EachSideOfAnEdgeIsFilledFromItsOwnSegment) {
  EraserReset reset;
  const int w = 64, h = 48;
  std::vector<int> pic(static_cast<size_t>(w) * h);
  std::vector<unsigned char> mask(pic.size());
  // Left half red, right half blue, both with a fine checker texture; a
  // green square over the edge.
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const int t = ((x + y) & 1) * 8;
      pic[y * w + x] = x < 32 ? argb(255, 200 + t, 30, 30) : argb(255, 30, 30, 200 + t);
      if (x >= 24 && x < 40 && y >= 16 && y < 32) {
        mask[y * w + x] = 1;
        pic[y * w + x] = argb(255, 0, 255, 0);
      }
    }
  }
  EXPECT_EQ(40960, process_photoeraser(pic.data(), mask.data(), w, h, 24, 39, 16, 31));
  for (int y = 16; y < 32; ++y) {
    for (int x = 24; x < 40; ++x) {
      const int p = pic[y * w + x];
      if (x < 30) {
        EXPECT_GE((p >> 16) & 255, 200) << x << "," << y;
      }
      if (x > 33) {
        EXPECT_GE(p & 255, 200) << x << "," << y;
      }
      EXPECT_EQ(30, (p >> 8) & 255) << x << "," << y;
    }
  }
}

TEST(Eraser, IsDeterministic) {
  EraserReset reset;
  std::vector<int> a, b;
  for (auto* out : {&a, &b}) {
    Ramp r;
    // Texture: a seeded pattern on top of the ramp.
    uint32_t s = 12345;
    for (int& p : r.pic) {
      s = s * 1103515245u + 12345u;
      p ^= static_cast<int>((s >> 16) & 0x1F1F1F);
    }
    process_photoeraser(r.pic.data(), r.mask.data(), r.w, r.h, 21, 39, 16, 34);
    *out = r.pic;
  }
  EXPECT_EQ(a, b);
}

struct Progress {
  std::vector<int> rounds;
  int exit_at = -1;
};

TEST(Eraser, PublishesEveryFourRoundsAndHonoursExit) {
  EraserReset reset;
  Ramp r;
  std::vector<int> before = r.pic;
  Progress prog;
  prog.exit_at = 8;
  px_eraser_set_progress(
      [](void* c, int round) {
        auto* p = static_cast<Progress*>(c);
        p->rounds.push_back(round);
        if (round == p->exit_at) {
          EXPECT_EQ(40960, exit_photoeraser());
        }
      },
      &prog);
  EXPECT_EQ(40967, process_photoeraser(r.pic.data(), r.mask.data(), r.w, r.h, 21, 39, 16, 34));
  EXPECT_EQ((std::vector<int>{0, 4, 8}), prog.rounds);
  EXPECT_EQ(PX_ERASER_IDLE, get_status_photoeraser());
  EXPECT_EQ(0, g_bExit.load());
  int untouched = 0;
  for (size_t i = 0; i < r.pic.size(); ++i) untouched += r.mask[i] == 1 && r.pic[i] == before[i];
  EXPECT_GT(untouched, 0);  // 9 rounds cannot fill a disc of 197 pixels
}

TEST(Eraser, PausesOnStopUntilRestartedFromAnotherThread) {
  EraserReset reset;
  Ramp r;
  Ramp full;
  process_photoeraser(full.pic.data(), full.mask.data(), full.w, full.h, 21, 39, 16, 34);
  std::atomic<int> seen_paused{0};
  px_eraser_set_progress(
      [](void*, int round) {
        if (round == 4) {
          EXPECT_EQ(40960, stop_photoeraser());
        }
      },
      nullptr);
  std::thread helper([&] {
    while (get_status_photoeraser() != PX_ERASER_PAUSED) std::this_thread::yield();
    seen_paused = 1;
    EXPECT_EQ(40960, restart_photoeraser());
  });
  EXPECT_EQ(40960, process_photoeraser(r.pic.data(), r.mask.data(), r.w, r.h, 21, 39, 16, 34));
  helper.join();
  EXPECT_EQ(1, seen_paused.load());
  EXPECT_EQ(full.pic, r.pic);  // a pause changes nothing in the result
}

TEST(Eraser, NothingToFillLeavesThePicture) {
  EraserReset reset;
  Ramp r;
  std::vector<int> before = r.pic;
  std::vector<unsigned char> none(r.mask.size());
  EXPECT_EQ(40960, process_photoeraser(r.pic.data(), none.data(), r.w, r.h, 0, r.w - 1, 0, r.h - 1));
  EXPECT_EQ(40960, process_photoeraser(r.pic.data(), r.mask.data(), r.w, r.h, 10, 5, 0, r.h - 1));
  EXPECT_EQ(before, r.pic);
  EXPECT_EQ(PX_ERASER_IDLE, get_status_photoeraser());
}

// ---- copy and paste -------------------------------------------------------------------

TEST(MaskClosing, NotchesCloseAndSparseZerosStay) {
  // 5 x 5: a 0 surrounded by eight 1s at (1,1); a 0 at (4,4) with three 1 neighbours.
  std::vector<unsigned char> m = {1, 1, 1, 0, 0,  //
                                  1, 0, 1, 0, 0,  //
                                  1, 1, 1, 0, 0,  //
                                  0, 0, 0, 1, 1,  //
                                  0, 0, 0, 1, 0};
  px_set_paste_object(m.data(), 5, 5, px_rect{0, 4, 0, 4}, 1);
  EXPECT_EQ(1, m[1 * 5 + 1]);
  EXPECT_EQ(0, m[4 * 5 + 4]);
  // (3,1) has 1s at (2,0), (2,1), (2,2) only: stays; (2,3) has (1,2),(3,3),(3,4)... and (2,2): four -> 1.
  EXPECT_EQ(0, m[1 * 5 + 3]);
  EXPECT_EQ(1, m[3 * 5 + 2]);
}

TEST(MaskClosing, PixelsSetInAPassDoNotCountAsOnesInThatPass) {
  // Row 0: 1 1 1 1; row 1: 1 0 0 0. (1,1) has four 1s and closes; (2,1) has
  // three 1s and reaches four only with (1,1), which counts from the next
  // pass on.
  std::vector<unsigned char> m = {1, 1, 1, 1, 1, 0, 0, 0, 0, 0, 0, 0};
  px_set_paste_object(m.data(), 4, 3, px_rect{0, 3, 0, 2}, 1);
  EXPECT_EQ(1, m[5]);
  EXPECT_EQ(0, m[6]);
  std::vector<unsigned char> n = {1, 1, 1, 1, 1, 0, 0, 0, 0, 0, 0, 0};
  px_set_paste_object(n.data(), 4, 3, px_rect{0, 3, 0, 2}, 2);
  EXPECT_EQ(1, n[6]);
  EXPECT_EQ(0, n[7]);  // (3,1): three 1s, (2,1) only a 2 in the second pass
  // Only the rectangle is closed.
  std::vector<unsigned char> o = {1, 1, 1, 1, 1, 0, 0, 0, 0, 0, 0, 0};
  px_set_paste_object(o.data(), 4, 3, px_rect{2, 3, 0, 2}, 1);
  EXPECT_EQ(0, o[5]);
}

TEST(CopyObject, ObjectTakesTheTargetsColourBalance) {
  int object[2] = {grey(100, 0x40), grey(100)};
  unsigned char mask[2] = {1, 3};  // the 3 counts for the means, only the 1 is recoloured
  int target[2] = {argb(255, 200, 100, 100), argb(255, 200, 100, 100)};
  px_copy_object(object, mask, 2, 1, target, 2, 1);
  // Object chromaticity 21845 each; target 32768, 16384, 16384; gains
  // 98689, 49344, 49344; 100 * gain rounds to 151 and 75.
  EXPECT_EQ(static_cast<uint32_t>(argb(0x40, 151, 75, 75)), static_cast<uint32_t>(object[0]));
  EXPECT_EQ(grey(100), object[1]);
}

TEST(CopyObject, BlackObjectOrTargetKeepsItsColours) {
  int object[1] = {argb(255, 0, 0, 0)};
  unsigned char mask[1] = {1};
  int target[1] = {grey(90)};
  px_copy_object(object, mask, 1, 1, target, 1, 1);
  EXPECT_EQ(argb(255, 0, 0, 0), object[0]);
  int red[1] = {argb(255, 120, 0, 0)};  // green and blue chromaticity 0: those channels keep theirs
  px_copy_object(red, mask, 1, 1, target, 1, 1);
  EXPECT_EQ(0, red[0] & 0xFFFF);
  int black[1] = {argb(255, 0, 0, 0)};
  int obj2[1] = {grey(70)};
  px_copy_object(obj2, mask, 1, 1, black, 1, 1);
  EXPECT_EQ(grey(70), obj2[0]);
}

// A 3 x 3 object whose centre (mask 1) is grey 100 and whose top-left
// neighbour (mask 2) is given; pasted at (1, 1) on a grey-20 picture.
int paste_centre(int neighbour, unsigned char neighbour_mask = 2) {
  int object[9];
  for (int& o : object) o = grey(100);
  object[0] = neighbour;
  unsigned char mask[9] = {neighbour_mask, 0, 0, 0, 1, 0, 0, 0, 0};
  std::vector<int> pic(25, grey(20)), dst(25, 0);
  px_copy_paste_fixed(object, pic.data(), mask, dst.data(), 3, 3, 5, 5, 1, 99, 1, 99, 100, 100, 100);
  return dst[2 * 5 + 2];
}

TEST(CopyPaste, BorderBlendsAtDistance49AndHalvesAt50) {
  // Equal chromaticities give the gain 65792: grey 100 stays 100.
  EXPECT_EQ(grey(30), paste_centre(argb(255, 149, 100, 100)));  // (100 + 7 * 20) >> 3
  EXPECT_EQ(grey(60), paste_centre(argb(255, 150, 100, 100)));  // (100 + 20) >> 1
  EXPECT_EQ(grey(30), paste_centre(argb(255, 149, 100, 100), 3));
  EXPECT_EQ(grey(100), paste_centre(argb(255, 150, 100, 100), 0));  // no border neighbour
}

TEST(CopyPaste, TransparentObjectPixelsAndOutsidePositionsLeaveThePicture) {
  int object[4] = {grey(100, 0), grey(100), grey(100), grey(100)};
  unsigned char mask[4] = {1, 1, 1, 1};
  std::vector<int> pic(9, grey(20)), dst(9, 0);
  px_copy_paste_fixed(object, pic.data(), mask, dst.data(), 2, 2, 3, 3, -1, 0, -1, 0, 100, 100, 100);
  // Only object pixel (1,1) lands, at (0,0).
  EXPECT_EQ(grey(100), dst[0]);
  for (int i = 1; i < 9; ++i) EXPECT_EQ(grey(20), dst[i]);
  px_copy_paste_fixed(object, pic.data(), mask, dst.data(), 2, 2, 3, 3, 2, 0, 2, 0, 100, 100, 100);
  EXPECT_EQ(grey(20), dst[8]);  // object pixel (0,0) has alpha 0
}

TEST(PasteObject, OnlyMaskOneWithAlphaOverwritesAndPositionsAreClipped) {
  int object[4] = {0x00FFFFFF, grey(1), grey(2), grey(3)};
  unsigned char mask[4] = {1, 1, 2, 1};
  std::vector<int> bg(9, grey(50)), dst(9, 0);
  px_paste_object(object, bg.data(), mask, dst.data(), 2, 2, 3, 3, 2, 0, 2);
  EXPECT_EQ((std::vector<int>{grey(50), grey(50), grey(50), grey(50), grey(50), grey(50), grey(50), grey(50),
                              grey(50)}),
            dst);
  px_paste_object(object, bg.data(), mask, dst.data(), 2, 2, 3, 3, 1, 0, 1);
  EXPECT_EQ(grey(50), dst[4]);  // alpha 0
  EXPECT_EQ(grey(1), dst[5]);
  EXPECT_EQ(grey(50), dst[7]);  // mask 2
  EXPECT_EQ(grey(3), dst[8]);
}

TEST(DrawObject, LastColumnExcludedLastRowIncluded) {
  std::vector<int> src(16);
  for (int i = 0; i < 16; ++i) src[i] = i + 1;
  std::vector<int> dst(16, 0);
  EXPECT_EQ(0, drawObject(dst.data(), 4, 4, src.data(), 4, 4, 1.0f, px_rect{0, 3, 0, 3}));
  for (int y = 0; y < 4; ++y) {
    for (int x = 0; x < 4; ++x) EXPECT_EQ(x < 3 ? src[y * 4 + x] : 0, dst[y * 4 + x]) << x << "," << y;
  }
  // Scale 2: region 0..3 maps to 0..2 (1.5 + 0.5), columns 0..1, rows 0..2,
  // sampling source (2x, 2y); row 2 reads source row 4, outside: skipped.
  std::vector<int> d2(9, 0);
  drawObject(d2.data(), 3, 3, src.data(), 4, 4, 2.0f, px_rect{-5, 3, -5, 3});
  EXPECT_EQ((std::vector<int>{1, 3, 0, 9, 11, 0, 0, 0, 0}), d2);
  // A rectangle far outside draws within the destination only.
  std::vector<int> d3(4, 7);
  drawObject(d3.data(), 2, 2, src.data(), 4, 4, 0.5f, px_rect{0, 100, 0, 100});
  EXPECT_EQ((std::vector<int>{1, 1, 1, 1}), d3);
  std::vector<int> d4(4, 7);
  drawObject(d4.data(), 2, 2, src.data(), 4, 4, 1.0f, px_rect{2, 3, 3, 1});  // y1 < y0
  EXPECT_EQ((std::vector<int>{7, 7, 7, 7}), d4);
}
}  // namespace
