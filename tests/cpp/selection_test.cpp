#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <random>
#include <vector>

#include "effect/kalo/px_mem.h"
#include "effect/selection/px_selection.h"

namespace {
int rgb(int r, int g, int b) {
  return static_cast<int>(0xFF000000u | static_cast<uint32_t>(r) << 16 | static_cast<uint32_t>(g) << 8 |
                          static_cast<uint32_t>(b));
}
int grey(int v) { return rgb(v, v, v); }

using Mask = std::vector<unsigned char>;

// A picture of an object (mask 1) in one colour on a background of another,
// with seeded noise of +-3 levels.
std::vector<int> object_picture(const Mask& m, int w, int h, unsigned seed) {
  std::mt19937 rng(seed);
  std::uniform_int_distribution<int> noise(-3, 3);
  std::vector<int> p(static_cast<size_t>(w) * h);
  for (size_t i = 0; i < p.size(); ++i) {
    const int n = noise(rng);
    p[i] = m[i] == 1 ? rgb(200 + n, 170 + n, 60 + n) : rgb(40 + n, 60 + n, 110 + n);
  }
  return p;
}

// Whether corner (x, y) separates object pixels from others.
bool boundary_corner(const Mask& m, int w, int h, int x, int y) {
  int in = 0;
  for (int dy = -1; dy <= 0; ++dy) {
    for (int dx = -1; dx <= 0; ++dx) {
      const int px = x + dx, py = y + dy;
      in += px >= 0 && py >= 0 && px < w && py < h && m[static_cast<size_t>(py) * w + px] == 1;
    }
  }
  return in > 0 && in < 4;
}

std::vector<int> outline() {
  std::vector<int> xy(static_cast<size_t>(px_selection_outline_length()) * 2);
  EXPECT_EQ(static_cast<int>(xy.size() / 2), px_selection_outline(xy.data(), static_cast<int>(xy.size())));
  return xy;
}

// A disc of radius 14 joined to a rectangle, on a 61 x 47 picture.
Mask blob(int w, int h) {
  Mask m(static_cast<size_t>(w) * h, 0);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const double dx = x + 0.5 - 22, dy = y + 0.5 - 23;
      m[static_cast<size_t>(y) * w + x] = dx * dx + dy * dy <= 14 * 14 || (x >= 30 && x <= 50 && y >= 15 && y <= 30);
    }
  }
  return m;
}

struct SelectionEnd {
  ~SelectionEnd() { px_selection_finish(); }
};

// ---- edge cost -------------------------------------------------------------------------

TEST(SelectionEdgeCost, PeaksOnTheCornersBetweenTwoColumns) {
  // Black columns 0..4, white 5..10: the corners at x = 5 lie on the step.
  const int w = 11, h = 6;
  std::vector<int> p(w * h);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) p[y * w + x] = grey(x >= 5 ? 255 : 0);
  }
  std::vector<uint8_t> cost((w + 1) * (h + 1));
  ASSERT_TRUE(px_selection_edge_cost(p.data(), w, h, cost.data()));
  // Per channel 8 * (2 * 255 + 255) = 6120 across x = 5, M = isqrt(3 * 6120^2) = 10600,
  // cost 1 + (254 * 100 + 5350) / 10700 = 3; at x = 4 and 6 the step is one column
  // away: 8 * 255 = 2040, M = 3533, cost 1 + (25400 + 1816) / 3633 = 8; farther
  // away the picture is flat: 1 + (25400 + 50) / 100 = 255.
  const int golden[12] = {255, 255, 255, 255, 8, 3, 8, 255, 255, 255, 255, 255};
  for (int y = 0; y <= h; ++y) {
    for (int x = 0; x <= w; ++x) EXPECT_EQ(golden[x], cost[y * (w + 1) + x]) << "corner " << x << "," << y;
  }
}

TEST(SelectionEdgeCost, SeesColourStepsOfEqualGreyAndRowsAlike) {
  // Red above green of the same luma: no grey edge, but a colour one, across rows.
  const int w = 7, h = 9;
  std::vector<int> p(w * h);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) p[y * w + x] = y < 4 ? rgb(150, 76, 0) : rgb(0, 153, 78);
  }
  std::vector<uint8_t> cost((w + 1) * (h + 1));
  ASSERT_TRUE(px_selection_edge_cost(p.data(), w, h, cost.data()));
  for (int x = 0; x <= w; ++x) {
    EXPECT_LT(cost[4 * (w + 1) + x], cost[3 * (w + 1) + x]);
    EXPECT_LT(cost[4 * (w + 1) + x], cost[5 * (w + 1) + x]);
    EXPECT_EQ(255, cost[0 * (w + 1) + x]);
    EXPECT_LT(cost[4 * (w + 1) + x], 10);
  }
}

TEST(SelectionEdgeCost, EveryCornerFollowsTheRuleOnRandomPictures) {
  // The rule, corner by corner: per channel, across columns
  // sum over rows y-2..y+1 (weights 1, 3, 3, 1) of 2 (P[x] - P[x-1]) + (P[x+1] - P[x-2]),
  // likewise down rows, pixels beyond the border repeating it; M^2 summed over
  // channels, cost 1 + (25400 + k / 2) / k with k = 100 + floor(M).
  const int sizes[][2] = {{1, 1}, {1, 9}, {9, 1}, {2, 2}, {3, 5}, {17, 11}, {40, 3}};
  std::mt19937 rng(5);
  for (const auto& sz : sizes) {
    const int w = sz[0], h = sz[1];
    std::vector<int> p(static_cast<size_t>(w) * h);
    for (int& v : p) v = static_cast<int>(rng());
    auto at = [&](int x, int y, int ch) {
      x = std::clamp(x, 0, w - 1);
      y = std::clamp(y, 0, h - 1);
      return (p[static_cast<size_t>(y) * w + x] >> (16 - 8 * ch)) & 255;
    };
    std::vector<uint8_t> cost(static_cast<size_t>(w + 1) * (h + 1));
    ASSERT_TRUE(px_selection_edge_cost(p.data(), w, h, cost.data()));
    const int wk[4] = {1, 3, 3, 1};
    for (int y = 0; y <= h; ++y) {
      for (int x = 0; x <= w; ++x) {
        long m2 = 0;
        for (int ch = 0; ch < 3; ++ch) {
          long gx = 0, gy = 0;
          for (int k = 0; k < 4; ++k) {
            const int r = y - 2 + k, c = x - 2 + k;
            gx += wk[k] * (2 * (at(x, r, ch) - at(x - 1, r, ch)) + at(x + 1, r, ch) - at(x - 2, r, ch));
            gy += wk[k] * (2 * (at(c, y, ch) - at(c, y - 1, ch)) + at(c, y + 1, ch) - at(c, y - 2, ch));
          }
          m2 += gx * gx + gy * gy;
        }
        const long k = 100 + static_cast<long>(std::sqrt(static_cast<double>(m2)));
        ASSERT_EQ(1 + (25400 + k / 2) / k, cost[static_cast<size_t>(y) * (w + 1) + x])
            << w << "x" << h << " corner " << x << "," << y;
      }
    }
  }
}

// ---- polygon fill and bounds ------------------------------------------------------------

TEST(SelectionFill, SamplesPixelCentresByNonZeroWinding) {
  const int w = 9, h = 7;
  Mask m(w * h, 7);
  // A rectangle of corners (2,1)-(6,4): pixels 2..5 x 1..3.
  const int rect[] = {2, 1, 6, 1, 6, 4, 2, 4};
  ASSERT_TRUE(px_selection_fill_polygon(rect, 4, m.data(), w, h));
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) EXPECT_EQ(x >= 2 && x <= 5 && y >= 1 && y <= 3, m[y * w + x]) << x << "," << y;
  }
  px_rect b = px_selection_bounds(m.data(), w, h);
  EXPECT_EQ(2, b.left);
  EXPECT_EQ(5, b.right);
  EXPECT_EQ(1, b.top);
  EXPECT_EQ(3, b.bottom);
  // A triangle (0,0), (6,0), (0,6): pixel centres with x + y + 1 < 6 are inside,
  // and those on the slanted edge too (a centre on an edge counts with the
  // pixels left of it).
  const int tri[] = {0, 0, 6, 0, 0, 6};
  ASSERT_TRUE(px_selection_fill_polygon(tri, 3, m.data(), w, h));
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) EXPECT_EQ(x + y + 1 <= 6, m[y * w + x]) << x << "," << y;
  }
  // The same square traced twice (winding 2) is still inside; reversed, too.
  const int twice[] = {1, 1, 4, 1, 4, 4, 1, 4, 1, 1, 4, 1, 4, 4, 1, 4};
  ASSERT_TRUE(px_selection_fill_polygon(twice, 8, m.data(), w, h));
  EXPECT_EQ(9, std::count(m.begin(), m.end(), 1));
  const int reversed[] = {1, 1, 1, 4, 4, 4, 4, 1};
  ASSERT_TRUE(px_selection_fill_polygon(reversed, 4, m.data(), w, h));
  EXPECT_EQ(9, std::count(m.begin(), m.end(), 1));
  // Reaching outside the picture is clipped.
  const int big[] = {-5, -5, 20, -5, 20, 20, -5, 20};
  ASSERT_TRUE(px_selection_fill_polygon(big, 4, m.data(), w, h));
  EXPECT_EQ(w * h, std::count(m.begin(), m.end(), 1));
  EXPECT_EQ(0, px_selection_bounds(Mask(w * h, 2).data(), w, h).left);
  EXPECT_EQ(-1, px_selection_bounds(Mask(w * h, 2).data(), w, h).right);
}

// ---- the lasso ----------------------------------------------------------------------------

TEST(SelectionLasso, SquareTracedByItsFourCornersIsThatSquare) {
  SelectionEnd end;
  const int w = 37, h = 29;
  Mask sq(w * h, 0);
  for (int y = 6; y <= 20; ++y) {
    for (int x = 9; x <= 27; ++x) sq[y * w + x] = 1;
  }
  std::vector<int> p = object_picture(sq, w, h, 5);
  ASSERT_EQ(PX_OK, px_selection_start(p.data(), w, h));
  // Taps on the corners; each may snap along an edge, the path follows the edges.
  int len = 1;
  EXPECT_EQ(0, px_selection_add_point(9, 6));
  const int corners[3][2] = {{28, 6}, {28, 21}, {9, 21}};
  for (const auto& t : corners) {
    const int steps = px_selection_add_point(t[0], t[1]);
    ASSERT_GT(steps, 0);
    len += steps;
  }
  EXPECT_EQ(len, px_selection_outline_length());
  Mask m(w * h, 9);
  px_rect b;
  ASSERT_EQ(PX_OK, px_selection_close(m.data(), &b));
  EXPECT_EQ(sq, m);
  EXPECT_EQ(9, b.left);
  EXPECT_EQ(27, b.right);
  EXPECT_EQ(6, b.top);
  EXPECT_EQ(20, b.bottom);
  // The outline runs on the square's border corners only.
  std::vector<int> xy = outline();
  for (size_t i = 0; i < xy.size(); i += 2) EXPECT_TRUE(boundary_corner(sq, w, h, xy[i], xy[i + 1]));
}

TEST(SelectionLasso, OutlineFollowsACurvedEdgeExactly) {
  SelectionEnd end;
  const int w = 61, h = 47;
  const Mask obj = blob(w, h);
  std::vector<int> p = object_picture(obj, w, h, 11);
  ASSERT_EQ(PX_OK, px_selection_start(p.data(), w, h));
  // Taps near the outline, each up to 2 pixels off.
  const double taps[][2] = {{8, 21}, {12, 11}, {24, 7}, {31, 14}, {50, 13}, {53, 31}, {31, 33}, {20, 39}};
  for (const auto& t : taps) ASSERT_GE(px_selection_add_point(static_cast<int>(t[0]), static_cast<int>(t[1])), 0);
  std::vector<int> xy = outline();
  for (size_t i = 0; i < xy.size(); i += 2) {
    EXPECT_TRUE(boundary_corner(obj, w, h, xy[i], xy[i + 1])) << xy[i] << "," << xy[i + 1];
    if (i) {
      EXPECT_EQ(1, std::abs(xy[i] - xy[i - 2]) + std::abs(xy[i + 1] - xy[i - 1]));  // 4-neighbour steps
    }
  }
  Mask m(w * h);
  ASSERT_EQ(PX_OK, px_selection_close(m.data(), nullptr));
  EXPECT_EQ(obj, m);
}

TEST(SelectionLasso, TwoScalesOnALargePictureStillFollowTheEdge) {
  SelectionEnd end;
  // 1.4 megapixels: the path is found on the half-size picture first.
  const int w = 1401, h = 1003;
  Mask disc(static_cast<size_t>(w) * h, 0);
  const double cx = 700.5, cy = 480.3, r = 380;
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const double dx = x + 0.5 - cx, dy = y + 0.5 - cy;
      disc[static_cast<size_t>(y) * w + x] = dx * dx + dy * dy <= r * r;
    }
  }
  std::vector<int> p = object_picture(disc, w, h, 3);
  ASSERT_EQ(PX_OK, px_selection_start(p.data(), w, h));
  for (int k = 0; k < 10; ++k) {
    const double a = k * 2 * 3.14159265358979 / 10 + 0.2;
    // Taps a pixel outside the circle, rounded: within the snap radius of the edge.
    ASSERT_GE(px_selection_add_point(static_cast<int>(std::lround(cx + (r + 1) * std::cos(a))),
                                     static_cast<int>(std::lround(cy + (r + 1) * std::sin(a)))),
              0);
  }
  std::vector<int> xy = outline();
  for (size_t i = 0; i < xy.size(); i += 2) EXPECT_TRUE(boundary_corner(disc, w, h, xy[i], xy[i + 1]));
  Mask m(disc.size());
  ASSERT_EQ(PX_OK, px_selection_close(m.data(), nullptr));
  EXPECT_EQ(disc, m);
}

TEST(SelectionLasso, RemovingAndMovingPointsRestoreTheEarlierOutline) {
  SelectionEnd end;
  const int w = 61, h = 47;
  const Mask obj = blob(w, h);
  std::vector<int> p = object_picture(obj, w, h, 12);
  ASSERT_EQ(PX_OK, px_selection_start(p.data(), w, h));
  ASSERT_GE(px_selection_add_point(8, 22), 0);
  ASSERT_GE(px_selection_add_point(22, 9), 0);
  const int before_len = px_selection_outline_length();
  const int seg = px_selection_add_point(50, 15);
  ASSERT_GE(seg, 0);
  EXPECT_EQ(before_len + seg, px_selection_outline_length());  // the length returned is the new segment's
  ASSERT_GE(px_selection_add_point(51, 31), 0);
  const std::vector<int> three = outline();
  // A point added at the end and removed again.
  ASSERT_GE(px_selection_add_point(30, 33), 0);
  EXPECT_NE(three, outline());
  EXPECT_EQ(PX_OK, px_selection_remove_point(31, 34));  // near, not on it
  EXPECT_EQ(three, outline());
  EXPECT_EQ(4, px_selection_point_count());
  // A point on the edge between two others changes nothing when removed: the
  // path along the edge passes there anyway.
  ASSERT_EQ(PX_OK, px_selection_remove_point(50, 15));
  EXPECT_EQ(three, outline());
  EXPECT_EQ(3, px_selection_point_count());
  ASSERT_GE(px_selection_add_point(51, 31), 0);
  ASSERT_EQ(PX_OK, px_selection_remove_point(51, 31));
  const std::vector<int> without = outline();
  // A point off the edge in the middle of the list, removed again, restores it:
  // (42, 41) lies in the background, more than 3 pixels from the object.
  ASSERT_EQ(PX_OK, px_selection_start(p.data(), w, h));
  ASSERT_GE(px_selection_add_point(8, 22), 0);
  ASSERT_GE(px_selection_add_point(42, 41), 0);
  ASSERT_GE(px_selection_add_point(22, 9), 0);
  ASSERT_GE(px_selection_add_point(51, 31), 0);
  EXPECT_NE(without, outline());
  ASSERT_EQ(PX_OK, px_selection_remove_point(42, 41));
  EXPECT_EQ(without, outline());
  // Moving a point off the edge and back restores the outline.
  ASSERT_EQ(PX_OK, px_selection_move_point(22, 9, 42, 41));
  EXPECT_NE(without, outline());
  ASSERT_EQ(PX_OK, px_selection_move_point(42, 41, 22, 9));
  EXPECT_EQ(without, outline());
  // Removing the first point leaves the second as the start.
  ASSERT_EQ(PX_OK, px_selection_remove_point(8, 22));
  std::vector<int> rest = outline();
  ASSERT_FALSE(rest.empty());
  EXPECT_TRUE(boundary_corner(obj, w, h, rest[0], rest[1]));
  EXPECT_EQ(2, px_selection_point_count());
  EXPECT_EQ(PX_OK, px_selection_remove_point(rest[0], rest[1]));
  EXPECT_EQ(PX_OK, px_selection_remove_point(rest[rest.size() - 2], rest[rest.size() - 1]));
  EXPECT_EQ(0, px_selection_outline_length());
}

TEST(SelectionLasso, RefusalsChangeNothing) {
  SelectionEnd end;
  const int w = 23, h = 19;
  std::vector<int> p(w * h, grey(90));
  Mask m(w * h, 5);
  // No session.
  EXPECT_EQ(PX_ERR_NULL, px_selection_add_point(3, 3));
  EXPECT_EQ(PX_ERR_NULL, px_selection_remove_point(3, 3));
  EXPECT_EQ(PX_ERR_NULL, px_selection_move_point(3, 3, 4, 4));
  EXPECT_EQ(PX_ERR_NULL, px_selection_close(m.data(), nullptr));
  EXPECT_EQ(0, px_selection_outline_length());
  EXPECT_EQ(PX_ERR_NULL, px_selection_start(p.data(), 0, h));
  EXPECT_EQ(PX_ERR_NULL, px_selection_start(nullptr, w, h));
  EXPECT_FALSE(px_selection_active());
  ASSERT_EQ(PX_OK, px_selection_start(p.data(), w, h));
  // Empty list: 40968.
  EXPECT_EQ(PX_ERR_NO_POINT, px_selection_remove_point(3, 3));
  EXPECT_EQ(PX_ERR_NO_POINT, px_selection_move_point(3, 3, 4, 4));
  // Outside the picture: 40962.
  EXPECT_EQ(PX_ERR_NULL, px_selection_add_point(-1, 3));
  EXPECT_EQ(PX_ERR_NULL, px_selection_add_point(w, 3));
  EXPECT_EQ(PX_ERR_NULL, px_selection_add_point(3, h));
  EXPECT_EQ(0, px_selection_point_count());
  ASSERT_EQ(0, px_selection_add_point(2, 2));
  ASSERT_GE(px_selection_add_point(20, 3), 0);
  const std::vector<int> two = outline();
  // Fewer than 3 points cannot close; the mask is untouched.
  EXPECT_EQ(PX_ERR_NULL, px_selection_close(m.data(), nullptr));
  EXPECT_EQ(Mask(w * h, 5), m);
  // No point within 10 pixels: 40968; a move to outside: 40962.
  EXPECT_EQ(PX_ERR_NO_POINT, px_selection_remove_point(10, 16));
  EXPECT_EQ(PX_ERR_NO_POINT, px_selection_move_point(10, 16, 11, 11));
  EXPECT_EQ(PX_ERR_NULL, px_selection_move_point(2, 2, 2, h + 4));
  EXPECT_EQ(PX_ERR_NULL, px_selection_remove_point(-3, 2));
  EXPECT_EQ(two, outline());
  // A short array for the outline is refused.
  std::vector<int> shortxy(two.size() - 1);
  EXPECT_EQ(-1, px_selection_outline(shortxy.data(), static_cast<int>(shortxy.size())));
  // Finish, then everything is refused again.
  EXPECT_EQ(PX_OK, px_selection_finish());
  EXPECT_EQ(PX_ERR_NULL, px_selection_add_point(2, 2));
  EXPECT_EQ(0, px_selection_point_count());
}

TEST(SelectionLasso, FailedAllocationsLeaveTheSessionAsItWas) {
  const int w = 61, h = 47;
  const Mask obj = blob(w, h);
  std::vector<int> p = object_picture(obj, w, h, 13);
  const long live = px_mem_live_blocks();
  ASSERT_EQ(PX_OK, px_selection_start(p.data(), w, h));
  ASSERT_GE(px_selection_add_point(8, 22), 0);
  ASSERT_GE(px_selection_add_point(22, 9), 0);
  ASSERT_GE(px_selection_add_point(50, 15), 0);
  const std::vector<int> before = outline();
  int failures = 0;
  for (int n = 1; n < 40; ++n) {
    px_mem_fail_nth(n);
    const int rc = px_selection_add_point(51, 31);
    const bool failed = !px_mem_fail_pending();
    px_mem_fail_nth(0);
    if (!failed) {
      ASSERT_EQ(PX_OK, px_selection_remove_point(51, 31));
      break;
    }
    ++failures;
    EXPECT_EQ(PX_ERR_ALLOC, rc);
    EXPECT_EQ(before, outline());
  }
  // Moving and removing a middle point, their first allocation failing.
  px_mem_fail_nth(1);
  EXPECT_EQ(PX_ERR_ALLOC, px_selection_move_point(22, 9, 30, 33));
  px_mem_fail_nth(1);
  EXPECT_EQ(PX_ERR_ALLOC, px_selection_remove_point(22, 9));
  px_mem_fail_nth(0);
  EXPECT_GT(failures, 2);
  EXPECT_EQ(before, outline());
  px_selection_finish();
  EXPECT_EQ(live, px_mem_live_blocks());
  // A start that runs short leaves no session behind.
  px_mem_fail_nth(2);
  EXPECT_EQ(PX_ERR_ALLOC, px_selection_start(p.data(), w, h));
  px_mem_fail_nth(0);
  EXPECT_FALSE(px_selection_active());
  EXPECT_EQ(live, px_mem_live_blocks());
}

TEST(SelectionLasso, RandomCallSequencesLeaveNothingBehind) {
  std::mt19937 rng(2024);
  const long live = px_mem_live_blocks();
  for (int round = 0; round < 30; ++round) {
    const int w = 1 + static_cast<int>(rng() % 40), h = 1 + static_cast<int>(rng() % 30);
    std::vector<int> p(static_cast<size_t>(w) * h);
    for (int& v : p) v = static_cast<int>(rng() | 0xFF000000u);
    Mask m(static_cast<size_t>(w) * h);
    ASSERT_EQ(PX_OK, px_selection_start(p.data(), w, h));
    for (int k = 0; k < 25; ++k) {
      const int x = static_cast<int>(rng() % (w + 6)) - 3, y = static_cast<int>(rng() % (h + 6)) - 3;
      const bool in = x >= 0 && y >= 0 && x < w && y < h;
      const int count = px_selection_point_count();
      int rc = 0;
      switch (rng() % 5) {
        case 0:
          rc = px_selection_add_point(x, y);
          EXPECT_EQ(in, rc < PX_OK) << rc;
          EXPECT_EQ(count + (in ? 1 : 0), px_selection_point_count());
          break;
        case 1:
          rc = px_selection_remove_point(x, y);
          EXPECT_TRUE(rc == PX_OK || rc == (in ? PX_ERR_NO_POINT : PX_ERR_NULL)) << rc;
          EXPECT_EQ(count - (rc == PX_OK ? 1 : 0), px_selection_point_count());
          break;
        case 2:
          rc = px_selection_move_point(x, y, static_cast<int>(rng() % w), static_cast<int>(rng() % h));
          EXPECT_TRUE(rc == PX_OK || rc == (in ? PX_ERR_NO_POINT : PX_ERR_NULL)) << rc;
          break;
        case 3:
          rc = px_selection_close(m.data(), nullptr);
          EXPECT_EQ(count >= 3 ? PX_OK : PX_ERR_NULL, rc);
          break;
        default: {
          std::vector<int> xy = outline();
          for (size_t i = 0; i < xy.size(); i += 2) {
            EXPECT_TRUE(xy[i] >= 0 && xy[i] <= w && xy[i + 1] >= 0 && xy[i + 1] <= h);
          }
        }
      }
    }
    if (round % 3 == 0) px_selection_finish();  // the others are ended by the next start
  }
  px_selection_finish();
  EXPECT_FALSE(px_selection_active());
  EXPECT_EQ(live, px_mem_live_blocks());
}

// ---- tap-to-select -------------------------------------------------------------------------

TEST(SelectionTap, JoinsStepsBelowTheToleranceLimit) {
  // A ramp whose steps (summed over channels) are 19 up to column 5, then one of 20.
  const int w = 9, h = 3;
  std::vector<int> p(w * h);
  int v[9];
  v[0] = 30;
  for (int x = 1; x < w; ++x) v[x] = v[x - 1] + (x == 6 ? 20 : 19);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) p[y * w + x] = rgb(v[x], 0, 0);
  }
  Mask m(w * h, 4);
  px_rect b;
  // Tolerance 50: steps below 20 join; the tapped colour 30 may drift by less than 120.
  ASSERT_EQ(PX_OK, px_selection_tap(p.data(), m.data(), w, h, 0, 1, 50, PX_SELECT_REPLACE, &b));
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) EXPECT_EQ(x <= 5 ? 1 : 0, m[y * w + x]) << x;
  }
  EXPECT_EQ(0, b.left);
  EXPECT_EQ(5, b.right);
  EXPECT_EQ(0, b.top);
  EXPECT_EQ(2, b.bottom);
  // Tapped at column 6, the step back to 5 is 20: only 6..8 (drift 38 < 120).
  ASSERT_EQ(PX_OK, px_selection_tap(p.data(), m.data(), w, h, 6, 0, 50, PX_SELECT_REPLACE, &b));
  for (int x = 0; x < w; ++x) EXPECT_EQ(x >= 6 ? 1 : 0, m[x]) << x;
  // Tolerance 0: only equal colours; tolerance 100: limit 39, all, as long as
  // the drift from 30 stays under 234.
  ASSERT_EQ(PX_OK, px_selection_tap(p.data(), m.data(), w, h, 3, 1, 0, PX_SELECT_REPLACE, &b));
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) EXPECT_EQ(x == 3 ? 1 : 0, m[y * w + x]);
  }
  ASSERT_EQ(PX_OK, px_selection_tap(p.data(), m.data(), w, h, 0, 0, 100, PX_SELECT_REPLACE, &b));
  EXPECT_EQ(w * h, std::count(m.begin(), m.end(), 1));
}

TEST(SelectionTap, SeedLimitStopsDriftAndModesCombine) {
  // A slow ramp of 10 per column on every channel (30 summed): tolerance 50
  // joins each step but stops where the drift from the tapped colour reaches 120.
  const int w = 17, h = 5;
  std::vector<int> p(w * h);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) p[y * w + x] = grey(x * 6);
  }
  Mask m(w * h, 0);
  ASSERT_EQ(PX_OK, px_selection_tap(p.data(), m.data(), w, h, 8, 2, 50, PX_SELECT_REPLACE, nullptr));
  // Drift |x - 8| * 18 < 120: columns 2..14.
  for (int x = 0; x < w; ++x) EXPECT_EQ(std::abs(x - 8) * 18 < 120 ? 1 : 0, m[2 * w + x]) << x;
  // Two separate squares: add the second, subtract the first.
  const int w2 = 19, h2 = 13;
  std::vector<int> q(w2 * h2, grey(20));
  for (int y = 2; y < 6; ++y) {
    for (int x = 2; x < 7; ++x) q[y * w2 + x] = rgb(220, 30, 30);
  }
  for (int y = 7; y < 12; ++y) {
    for (int x = 11; x < 17; ++x) q[y * w2 + x] = rgb(30, 30, 220);
  }
  Mask s(w2 * h2, 3);  // not 1: unselected
  px_rect b;
  ASSERT_EQ(PX_OK, px_selection_tap(q.data(), s.data(), w2, h2, 3, 3, 30, PX_SELECT_ADD, &b));
  EXPECT_EQ(20, std::count(s.begin(), s.end(), 1));
  EXPECT_EQ(w2 * h2 - 20, std::count(s.begin(), s.end(), 0));
  ASSERT_EQ(PX_OK, px_selection_tap(q.data(), s.data(), w2, h2, 15, 10, 30, PX_SELECT_ADD, &b));
  EXPECT_EQ(50, std::count(s.begin(), s.end(), 1));
  EXPECT_EQ(2, b.left);
  EXPECT_EQ(16, b.right);
  EXPECT_EQ(2, b.top);
  EXPECT_EQ(11, b.bottom);
  ASSERT_EQ(PX_OK, px_selection_tap(q.data(), s.data(), w2, h2, 2, 2, 30, PX_SELECT_SUBTRACT, &b));
  EXPECT_EQ(30, std::count(s.begin(), s.end(), 1));
  EXPECT_EQ(11, b.left);
  EXPECT_EQ(7, b.top);
  // Subtracting where nothing is selected changes nothing.
  ASSERT_EQ(PX_OK, px_selection_tap(q.data(), s.data(), w2, h2, 0, 0, 30, PX_SELECT_SUBTRACT, &b));
  EXPECT_EQ(30, std::count(s.begin(), s.end(), 1));
  // Refusals.
  const Mask keep = s;
  EXPECT_EQ(PX_ERR_NULL, px_selection_tap(q.data(), s.data(), w2, h2, w2, 0, 30, PX_SELECT_ADD, &b));
  EXPECT_EQ(PX_ERR_NULL, px_selection_tap(q.data(), s.data(), w2, h2, 0, 0, 30, 3, &b));
  EXPECT_EQ(keep, s);
}

// The region by its definition, as a fixed point: a pixel joins when one of its
// 4-neighbours is in and the step to it is below the limit, and it is within
// the limit of the tapped colour; repeated until nothing changes.
Mask reference_region(const std::vector<int>& p, int w, int h, int x, int y, int tolerance) {
  auto diff = [&](int a, int b) {
    int d = 0;
    for (int sh = 0; sh <= 16; sh += 8) d += std::abs(((p[a] >> sh) & 255) - ((p[b] >> sh) & 255));
    return d;
  };
  const int step = 1 + (38 * tolerance + 50) / 100;
  const int seed = y * w + x;
  Mask in(p.size(), 0);
  in[seed] = 1;
  for (bool changed = true; changed;) {
    changed = false;
    for (int i = 0; i < w * h; ++i) {
      if (in[i] || diff(seed, i) >= 6 * step) continue;
      const int cx = i % w, cy = i / w;
      const int nb[4][2] = {{cx - 1, cy}, {cx + 1, cy}, {cx, cy - 1}, {cx, cy + 1}};
      for (const auto& q : nb) {
        if (q[0] < 0 || q[1] < 0 || q[0] >= w || q[1] >= h) continue;
        const int j = q[1] * w + q[0];
        if (in[j] && diff(i, j) < step) {
          in[i] = 1;
          changed = true;
          break;
        }
      }
    }
  }
  return in;
}

TEST(SelectionTap, MatchesTheRegionsDefinitionOnRandomPictures) {
  // Few colours with small per-channel jitter: regions with holes, spirals
  // and one-pixel bridges, which a scan that fills runs of a row must follow
  // back up and down.
  const int sizes[][2] = {{37, 23}, {1, 41}, {43, 1}, {64, 3}, {5, 59}, {29, 31}};
  std::mt19937 rng(17);
  int checked = 0;
  for (const auto& sz : sizes) {
    const int w = sz[0], h = sz[1];
    for (int round = 0; round < 6; ++round) {
      std::vector<int> p(static_cast<size_t>(w) * h);
      const int levels[4] = {40, 47, 60, 200};
      for (int& v : p) {
        const int l = levels[rng() % (round < 3 ? 2 : 4)];
        v = rgb(l + static_cast<int>(rng() % 4), l + static_cast<int>(rng() % 4), l);
      }
      for (const int tolerance : {0, 8, 30, 50, 100}) {
        const int x = static_cast<int>(rng() % w), y = static_cast<int>(rng() % h);
        const Mask want = reference_region(p, w, h, x, y, tolerance);
        Mask prior(p.size());
        for (auto& b : prior) b = static_cast<unsigned char>(rng() % 3);  // 2 counts as unselected
        Mask m = prior;
        px_rect b;
        ASSERT_EQ(PX_OK, px_selection_tap(p.data(), m.data(), w, h, x, y, tolerance, PX_SELECT_REPLACE, &b));
        EXPECT_EQ(want, m) << w << "x" << h << " round " << round << " tolerance " << tolerance;
        const px_rect wb = px_selection_bounds(want.data(), w, h);
        EXPECT_TRUE(b.left == wb.left && b.top == wb.top && b.right == wb.right && b.bottom == wb.bottom);
        m = prior;
        ASSERT_EQ(PX_OK, px_selection_tap(p.data(), m.data(), w, h, x, y, tolerance, PX_SELECT_ADD, nullptr));
        for (size_t i = 0; i < m.size(); ++i) ASSERT_EQ((prior[i] == 1 || want[i]) ? 1 : 0, m[i]) << i;
        m = prior;
        ASSERT_EQ(PX_OK, px_selection_tap(p.data(), m.data(), w, h, x, y, tolerance, PX_SELECT_SUBTRACT, nullptr));
        for (size_t i = 0; i < m.size(); ++i) ASSERT_EQ((prior[i] == 1 && !want[i]) ? 1 : 0, m[i]) << i;
        checked += std::count(want.begin(), want.end(), 1) > 1;
      }
    }
  }
  EXPECT_GT(checked, 60);  // most taps grew beyond their own pixel
}

TEST(SelectionTap, RunningShortOfMemoryLeavesTheMaskAsItWas) {
  // A comb: a uniform top row over 4501 one-pixel teeth, separated by another
  // colour, so the fill holds thousands of runs at once and its stack grows.
  const int w = 9001, h = 3;
  std::vector<int> p(static_cast<size_t>(w) * h, grey(90));
  for (int y = 1; y < h; ++y) {
    for (int x = 1; x < w; x += 2) p[static_cast<size_t>(y) * w + x] = grey(230);
  }
  Mask prior(p.size());
  for (size_t i = 0; i < prior.size(); ++i) prior[i] = static_cast<unsigned char>(i % 7 == 0 ? 1 : i % 5 == 0 ? 2 : 0);
  // The top row and every tooth of the first colour, added to the prior mask.
  Mask want = prior;
  for (size_t i = 0; i < want.size(); ++i) want[i] = want[i] == 1 || i < static_cast<size_t>(w) || (i % w) % 2 == 0;
  const long live = px_mem_live_blocks();
  int failures = 0;
  for (int n = 1; n < 20; ++n) {
    Mask m = prior;
    px_mem_fail_nth(n);
    const int rc = px_selection_tap(p.data(), m.data(), w, h, 0, 0, 50, PX_SELECT_ADD, nullptr);
    const bool failed = !px_mem_fail_pending();
    px_mem_fail_nth(0);
    EXPECT_EQ(live, px_mem_live_blocks());
    if (!failed) {
      ASSERT_EQ(PX_OK, rc);
      EXPECT_EQ(want, m);
      break;
    }
    ++failures;
    EXPECT_EQ(PX_ERR_ALLOC, rc);
    EXPECT_EQ(prior, m);
  }
  EXPECT_GE(failures, 3);  // the region, the run stack, the stack's growth
}

// ---- refinements ----------------------------------------------------------------------------

Mask brute_grow(const Mask& m, int w, int h, int n) {
  Mask out(m.size());
  const bool grow = n > 0;
  const long r2 = static_cast<long>(n) * n;
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      long best = -1;
      for (int v = 0; v < h; ++v) {
        for (int u = 0; u < w; ++u) {
          if ((m[v * w + u] == 1) != grow) continue;
          const long d = static_cast<long>(u - x) * (u - x) + static_cast<long>(v - y) * (v - y);
          if (best < 0 || d < best) best = d;
        }
      }
      out[y * w + x] = grow ? best >= 0 && best <= r2 : best < 0 || best > r2;
    }
  }
  return out;
}

TEST(SelectionRefine, GrowAndShrinkByEuclideanDistance) {
  const int w = 13, h = 11;
  Mask m(w * h, 0);
  m[5 * w + 6] = 1;
  ASSERT_EQ(PX_OK, px_selection_grow(m.data(), w, h, 2, nullptr));
  // Distance <= 2 from one pixel: 13 pixels.
  EXPECT_EQ(13, std::count(m.begin(), m.end(), 1));
  EXPECT_EQ(1, m[3 * w + 6]);
  EXPECT_EQ(1, m[4 * w + 5]);
  EXPECT_EQ(0, m[4 * w + 4]);
  // A 10 x 8 rectangle shrunk by 2 is 6 x 4.
  Mask r(w * h, 0);
  for (int y = 1; y < 9; ++y) {
    for (int x = 2; x < 12; ++x) r[y * w + x] = 1;
  }
  px_rect b;
  ASSERT_EQ(PX_OK, px_selection_grow(r.data(), w, h, -2, &b));
  EXPECT_EQ(24, std::count(r.begin(), r.end(), 1));
  EXPECT_EQ(4, b.left);
  EXPECT_EQ(9, b.right);
  EXPECT_EQ(3, b.top);
  EXPECT_EQ(6, b.bottom);
  // Shrinking a full mask keeps it: outside the picture is not unselected.
  Mask full(w * h, 1);
  ASSERT_EQ(PX_OK, px_selection_grow(full.data(), w, h, -3, nullptr));
  EXPECT_EQ(Mask(w * h, 1), full);
  // Growing an empty mask keeps it empty; huge n is clamped.
  Mask none(w * h, 2);
  ASSERT_EQ(PX_OK, px_selection_grow(none.data(), w, h, 1 << 30, nullptr));
  EXPECT_EQ(Mask(w * h, 0), none);
  // Seeded random masks of awkward sizes against a brute-force search.
  std::mt19937 rng(77);
  for (int round = 0; round < 12; ++round) {
    const int rw = 1 + static_cast<int>(rng() % 23), rh = 1 + static_cast<int>(rng() % 17);
    Mask q(rw * rh);
    for (auto& v : q) v = rng() % 7 == 0 ? 1 : (rng() % 5 == 0 ? 2 : 0);
    const int n = static_cast<int>(rng() % 9) - 4;
    if (n == 0) continue;
    Mask got = q;
    ASSERT_EQ(PX_OK, px_selection_grow(got.data(), rw, rh, n, nullptr));
    EXPECT_EQ(brute_grow(q, rw, rh, n), got) << rw << "x" << rh << " n " << n;
  }
}

TEST(SelectionRefine, FillHolesKeepsOpeningsToTheBorder) {
  const int w = 12, h = 9;
  Mask m(w * h, 0);
  // A ring 1..6 x 1..6 with a hole 3..4 x 3..4, and a U open to the right border.
  for (int y = 1; y <= 6; ++y) {
    for (int x = 1; x <= 6; ++x) m[y * w + x] = !(x >= 3 && x <= 4 && y >= 3 && y <= 4);
  }
  for (int y = 2; y <= 6; ++y) {
    m[y * w + 8] = 1;
    m[y * w + 11] = y == 2 || y == 6;
    m[y * w + 9] = m[y * w + 10] = y == 2 || y == 6;
  }
  Mask expect = m;
  for (int y = 3; y <= 4; ++y) {
    for (int x = 3; x <= 4; ++x) expect[y * w + x] = 1;
  }
  px_rect b;
  ASSERT_EQ(PX_OK, px_selection_fill_holes(m.data(), w, h, &b));
  EXPECT_EQ(expect, m);
  EXPECT_EQ(1, b.left);
  EXPECT_EQ(11, b.right);
  EXPECT_EQ(1, b.top);
  EXPECT_EQ(6, b.bottom);
}

}  // namespace
