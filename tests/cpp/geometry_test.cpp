#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <random>
#include <vector>

#include "effect/geometry/px_geometry.h"
#include "effect/geometry/px_geometry_tables.h"
#include "effect/kalo/px_parallel.h"

namespace {
std::vector<int> random_picture(int w, int h, unsigned seed) {
  std::mt19937 rng(seed);
  std::vector<int> p(static_cast<size_t>(w) * h);
  for (int& v : p) v = static_cast<int>(rng());
  return p;
}

// Pixel whose value names its position: 0xFF000000 | y << 8 | x.
std::vector<int> positions(int w, int h) {
  std::vector<int> p(static_cast<size_t>(w) * h);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) p[static_cast<size_t>(y) * w + x] = static_cast<int>(0xFF000000u | y << 8 | x);
  }
  return p;
}
int pos(int x, int y) { return static_cast<int>(0xFF000000u | y << 8 | x); }

constexpr int kSentinel = 0x5A5A5A5A;

// ---- angles, quarter turns and flips --------------------------------------------

TEST(GeometryAngle, NinetyDegreesPassesThroughTruncatedPiAndFloat) {
  EXPECT_EQ(px_geometry_angle(90), 4194316);
  EXPECT_EQ(px_geometry_angle(0), 0);
  EXPECT_EQ(px_geometry_scale8(1.0f), 256);
  EXPECT_EQ(px_geometry_scale8(0.5f), 128);
  EXPECT_EQ(px_geometry_scale8(NAN), 0);
  EXPECT_EQ(px_geometry_scale8(1e30f), 0x7FFFFFFF >> 8);
}

TEST(RotateFlip, QuarterTurnOfThreeByTwo) {
  // a b c / d e f
  const int a = 1, b = 2, c = 3, d = 4, e = 5, f = 6;
  std::vector<int> src{a, b, c, d, e, f}, dst(6, 0);
  ASSERT_EQ(px_rotate_flip(src.data(), dst.data(), 3, 2, 1, 0, 0), 1);
  // 2 wide, 3 tall; the first row is the first column read bottom-up.
  EXPECT_EQ(dst, (std::vector<int>{d, a, e, b, f, c}));

  std::fill(dst.begin(), dst.end(), 0);
  px_rotate_flip(src.data(), dst.data(), 3, 2, 3, 0, 0);
  EXPECT_EQ(dst, (std::vector<int>{c, f, b, e, a, d}));
  px_rotate_flip(src.data(), dst.data(), 3, 2, 2, 0, 0);
  EXPECT_EQ(dst, (std::vector<int>{f, e, d, c, b, a}));
  px_rotate_flip(src.data(), dst.data(), 3, 2, 0, 0, 0);
  EXPECT_EQ(dst, src);
}

TEST(RotateFlip, FlipsComeFirstAndChangeTheSourceInPlace) {
  std::vector<int> src{1, 2, 3, 4, 5, 6}, dst(6, 0);
  px_rotate_flip(src.data(), dst.data(), 3, 2, 0, 1, 0);
  EXPECT_EQ(src, (std::vector<int>{3, 2, 1, 6, 5, 4}));
  EXPECT_EQ(dst, src);
  src = {1, 2, 3, 4, 5, 6};
  px_rotate_flip(src.data(), dst.data(), 3, 2, 1, 1, 1);  // both flips = half turn, then a quarter turn
  EXPECT_EQ(src, (std::vector<int>{6, 5, 4, 3, 2, 1}));
  EXPECT_EQ(dst, (std::vector<int>{3, 6, 2, 5, 1, 4}));
}

TEST(RotateFlip, CodeFourFlipsOnlyOrLeavesTheZeroFill) {
  std::vector<int> src{1, 2, 3, 4, 5, 6}, dst(6, 0);
  EXPECT_EQ(px_rotate_flip(src.data(), dst.data(), 3, 2, 4, 0, 0), 1);
  EXPECT_EQ(dst, std::vector<int>(6, 0));
  EXPECT_EQ(px_rotate_flip(src.data(), dst.data(), 3, 2, 4, 0, 1), 1);
  EXPECT_EQ(dst, (std::vector<int>{4, 5, 6, 1, 2, 3}));
}

TEST(RotateFlip, CodeOutsideRangeTouchesNothing) {
  std::vector<int> src{1, 2, 3, 4, 5, 6}, dst(6, kSentinel);
  EXPECT_EQ(px_rotate_flip(src.data(), dst.data(), 3, 2, 5, 1, 1), 0);
  EXPECT_EQ(px_rotate_flip(src.data(), dst.data(), 3, 2, -1, 1, 1), 0);
  EXPECT_EQ(src, (std::vector<int>{1, 2, 3, 4, 5, 6}));
  EXPECT_EQ(dst, std::vector<int>(6, kSentinel));
}

TEST(RotateSize, BoundingBoxOfTurnedPicture) {
  // At 90 degrees the table cosine is 0 and the sine 1: the sides swap.
  EXPECT_EQ(px_get_rotate_width(4, 3, 90), 3);
  EXPECT_EQ(px_get_rotate_height(4, 3, 90), 4);
  EXPECT_EQ(px_get_rotate_width(640, 480, 0), 640);
  EXPECT_EQ(px_get_rotate_height(640, 480, 0), 480);
  // Any angle: within a pixel or two of the true bounding box.
  for (int angle : {-170, -45, -10, 7, 30, 60, 135}) {
    const double r = angle * M_PI / 180;
    const double bw = 640 * std::fabs(std::cos(r)) + 480 * std::fabs(std::sin(r));
    const double bh = 640 * std::fabs(std::sin(r)) + 480 * std::fabs(std::cos(r));
    EXPECT_NEAR(px_get_rotate_width(640, 480, angle), bw, 4.0) << angle;
    EXPECT_NEAR(px_get_rotate_height(640, 480, angle), bh, 4.0) << angle;
  }
}

// ---- free rotation of a region -----------------------------------------------------

TEST(RotateN, AngleZeroOneToOneCopiesRegionAndMask) {
  const auto src = positions(6, 5);
  std::vector<unsigned char> smask(30);
  for (size_t i = 0; i < smask.size(); ++i) smask[i] = static_cast<unsigned char>(i);
  std::vector<int> dst(3 * 2, kSentinel);
  std::vector<unsigned char> dmask(6, 99);
  // Region x 2..4, y 1..2 into a 3 x 2 output at one source pixel a pixel.
  px_rotate_n(src.data(), smask.data(), dst.data(), dmask.data(), 6, 5, 3, 2, 0, 2, 4, 1, 2, 3, 2);
  EXPECT_EQ(dst, (std::vector<int>{pos(2, 1), pos(3, 1), pos(4, 1), pos(2, 2), pos(3, 2), pos(4, 2)}));
  EXPECT_EQ(dmask, (std::vector<unsigned char>{8, 9, 10, 14, 15, 16}));
}

TEST(RotateN, QuarterTurnAndSourcesOutsideLeaveOutputUnchanged) {
  const auto src = positions(3, 2);
  std::vector<unsigned char> smask(6, 1);
  std::vector<int> dst(2 * 3, kSentinel);
  std::vector<unsigned char> dmask(6, 7);
  px_rotate_n(src.data(), smask.data(), dst.data(), dmask.data(), 3, 2, 2, 3, 90, 0, 2, 0, 1, 3, 2);
  // out(i, j) = src(j, 2 - i): column 0 would read row 2, outside the picture.
  for (int j = 0; j < 3; ++j) {
    EXPECT_EQ(dst[j * 2 + 0], kSentinel);
    EXPECT_EQ(dmask[j * 2 + 0], 7);
    EXPECT_EQ(dst[j * 2 + 1], pos(j, 1));
    EXPECT_EQ(dmask[j * 2 + 1], 1);
  }
}

TEST(RotateN, ZeroDivisorWritesNothing) {
  const auto src = positions(4, 4);
  std::vector<unsigned char> smask(16, 1), dmask(16, 0);
  std::vector<int> dst(16, kSentinel);
  px_rotate_n(src.data(), smask.data(), dst.data(), dmask.data(), 4, 4, 4, 4, 10, 0, 3, 0, 3, 0, 4);
  EXPECT_EQ(dst, std::vector<int>(16, kSentinel));
  EXPECT_EQ(dmask, std::vector<unsigned char>(16, 0));
}

// ---- straighten -----------------------------------------------------------------------

TEST(Straighten, AngleZeroScaleOneIsAnExactCopy) {
  const auto src = random_picture(17, 11, 3);
  std::vector<int> dst(src.size(), 0);
  px_straighten(src.data(), dst.data(), 17, 11, 0, 1.0f);
  EXPECT_EQ(dst, src);
}

TEST(Straighten, HalfScaleZoomsAboutTheCentre) {
  const auto src = positions(8, 8);
  std::vector<int> dst(64, 0);
  px_straighten(src.data(), dst.data(), 8, 8, 0, 0.5f);
  // source = fixtoi((i - 4) / 2) + 4, halves rounding up.
  const int map[8] = {2, 3, 3, 4, 4, 5, 5, 6};
  for (int j = 0; j < 8; ++j) {
    for (int i = 0; i < 8; ++i) EXPECT_EQ(dst[j * 8 + i], pos(map[i], map[j]));
  }
}

TEST(StraightenMove, CentresPictureAndClearsTheRest) {
  std::vector<int> src(16, static_cast<int>(0x80123456u));
  std::vector<int> dst(64, kSentinel);
  px_straighten_move(src.data(), 4, 4, dst.data(), 8, 8, 0, 1.0f);
  for (int j = 0; j < 8; ++j) {
    for (int i = 0; i < 8; ++i) {
      const bool inside = i >= 2 && i < 6 && j >= 2 && j < 6;
      EXPECT_EQ(dst[j * 8 + i], inside ? static_cast<int>(0x80123456u) : 0) << i << "," << j;
    }
  }
}

TEST(StraightenMove, VisitedBoxFollowsTheScaleOnlyHorizontally) {
  const auto src = positions(4, 4);
  std::vector<int> dst(64, kSentinel);
  px_straighten_move(src.data(), 4, 4, dst.data(), 8, 8, 0, 2.0f);
  // Columns 0..7 are visited, rows only 2..5: the doubled picture would
  // reach rows 0..7, but the vertical extent ignores the scale.
  for (int i = 0; i < 8; ++i) {
    EXPECT_EQ(dst[0 * 8 + i], 0);
    EXPECT_EQ(dst[1 * 8 + i], 0);
    EXPECT_EQ(dst[6 * 8 + i], 0);
  }
  // Inside: source = fixtoi((i - 4) / 2) + 2; column 7 reads x = 4, outside.
  EXPECT_EQ(dst[2 * 8 + 0], pos(0, 1));
  EXPECT_EQ(dst[3 * 8 + 1], pos(1, 2));
  EXPECT_EQ(dst[5 * 8 + 6], pos(3, 3));
  EXPECT_EQ(dst[4 * 8 + 7], 0);
}

TEST(StraightenUp, DrawsOnlyTheCentredSourceArea) {
  const auto src = positions(4, 4);
  std::vector<int> dst(64, kSentinel);
  px_straighten_up(src.data(), 4, 4, dst.data(), 8, 8, 0, 0.5f);
  for (int j = 0; j < 8; ++j) {
    for (int i = 0; i < 8; ++i) {
      if (i < 2 || i >= 6 || j < 2 || j >= 6) {
        EXPECT_EQ(dst[j * 8 + i], 0) << i << "," << j;
      }
    }
  }
  // Forward scale: source = fixtoi((i - 4) / 2) + 2.
  EXPECT_EQ(dst[2 * 8 + 2], pos(1, 1));
  EXPECT_EQ(dst[5 * 8 + 5], pos(3, 3));
}

TEST(StraightenUp, CanvasSmallerThanSourceStaysInside) {
  const auto src = random_picture(9, 9, 5);
  std::vector<int> dst(3 * 3 + 1, kSentinel);
  px_straighten_up(src.data(), 9, 9, dst.data(), 3, 3, 15, 1.0f);
  EXPECT_EQ(dst[9], kSentinel);
}

// ---- crop -------------------------------------------------------------------------------

TEST(Crop, PacksTheRectangleRows) {
  const auto src = positions(4, 3);
  std::vector<int> dst(12, 0);
  EXPECT_EQ(px_crop(src.data(), dst.data(), 4, 3, 1, 2, 1, 2), dst.data());
  EXPECT_EQ(dst, (std::vector<int>{pos(1, 1), pos(2, 1), pos(1, 2), pos(2, 2), 0, 0, 0, 0, 0, 0, 0, 0}));
  std::vector<int> untouched(12, 0);
  EXPECT_EQ(px_crop(src.data(), untouched.data(), 4, 3, 0, 3, 2, 1), untouched.data());
  EXPECT_EQ(untouched, std::vector<int>(12, 0));
}

// ---- mirror -------------------------------------------------------------------------------

TEST(MirrorSize, SelectorsAndOutOfRangePositions) {
  EXPECT_EQ(px_get_mirror_out_width(5, 0, MIRROR_KEEP_LEFT, MIRROR_AXIS_LEFT_RIGHT), 2);
  EXPECT_EQ(px_get_mirror_out_width(5, 3, MIRROR_KEEP_RIGHT, MIRROR_AXIS_LEFT_RIGHT), 4);
  EXPECT_EQ(px_get_mirror_out_width(5, 3, MIRROR_KEEP_TOP, MIRROR_AXIS_LEFT_RIGHT), 5);
  EXPECT_EQ(px_get_mirror_out_width(5, 0, MIRROR_KEEP_LEFT, MIRROR_AXIS_UP_DOWN), 5);
  EXPECT_EQ(px_get_mirror_out_width(5, 5, MIRROR_KEEP_LEFT, MIRROR_AXIS_LEFT_RIGHT), 5);
  EXPECT_EQ(px_get_mirror_out_width(5, -1, MIRROR_KEEP_LEFT, MIRROR_AXIS_LEFT_RIGHT), 5);
  EXPECT_EQ(px_get_mirror_out_height(6, 1, MIRROR_KEEP_TOP, MIRROR_AXIS_UP_DOWN), 4);
  EXPECT_EQ(px_get_mirror_out_height(6, 1, MIRROR_KEEP_BOTTOM, MIRROR_AXIS_UP_DOWN), 10);
  EXPECT_EQ(px_get_mirror_out_height(6, 1, MIRROR_KEEP_TOP, MIRROR_AXIS_LEFT_RIGHT), 6);
}

TEST(Mirror, KeepLeftAtZeroRepeatsTheFirstPixel) {
  std::vector<int> src{10, 11, 12, 13, 14}, dst(2, 0);
  EXPECT_EQ(px_mirror(src.data(), 5, 1, dst.data(), 2, 1, 0, MIRROR_KEEP_LEFT, MIRROR_AXIS_LEFT_RIGHT), PX_OK);
  EXPECT_EQ(dst, (std::vector<int>{10, 10}));
}

TEST(Mirror, EachSideReflectsAcrossTheLine) {
  std::vector<int> row{10, 11, 12, 13, 14};
  std::vector<int> dst(4, 0);
  EXPECT_EQ(px_mirror(row.data(), 5, 1, dst.data(), 4, 1, 3, MIRROR_KEEP_RIGHT, MIRROR_AXIS_LEFT_RIGHT), PX_OK);
  EXPECT_EQ(dst, (std::vector<int>{14, 13, 13, 14}));
  dst.assign(6, 0);
  px_mirror(row.data(), 5, 1, dst.data(), 6, 1, 2, MIRROR_KEEP_LEFT, MIRROR_AXIS_LEFT_RIGHT);
  EXPECT_EQ(dst, (std::vector<int>{10, 11, 12, 12, 11, 10}));
  // Columns of one pixel: rows 10..14.
  dst.assign(4, 0);
  EXPECT_EQ(px_mirror(row.data(), 1, 5, dst.data(), 1, 4, 1, MIRROR_KEEP_TOP, MIRROR_AXIS_UP_DOWN), PX_OK);
  EXPECT_EQ(dst, (std::vector<int>{10, 11, 11, 10}));
  dst.assign(6, 0);
  EXPECT_EQ(px_mirror(row.data(), 1, 5, dst.data(), 1, 6, 2, MIRROR_KEEP_BOTTOM, MIRROR_AXIS_UP_DOWN), PX_OK);
  EXPECT_EQ(dst, (std::vector<int>{14, 13, 12, 12, 13, 14}));
}

TEST(Mirror, RefusesUnknownAxisMismatchedModeAndWrongSize) {
  std::vector<int> src(10, 1), dst(20, kSentinel);
  EXPECT_EQ(px_mirror(src.data(), 5, 2, dst.data(), 5, 2, 1, MIRROR_KEEP_LEFT, 0), PX_ERR_NULL);
  EXPECT_EQ(px_mirror(src.data(), 5, 2, dst.data(), 5, 2, 1, MIRROR_KEEP_TOP, MIRROR_AXIS_LEFT_RIGHT), PX_ERR_NULL);
  EXPECT_EQ(px_mirror(src.data(), 5, 2, dst.data(), 8, 2, 1, MIRROR_KEEP_LEFT, MIRROR_AXIS_LEFT_RIGHT), PX_ERR_NULL);
  EXPECT_EQ(dst, std::vector<int>(20, kSentinel));
  // A line outside the picture: unchanged size, unchanged picture.
  const auto pic = random_picture(5, 2, 9);
  EXPECT_EQ(px_mirror(pic.data(), 5, 2, dst.data(), 5, 2, 7, MIRROR_KEEP_LEFT, MIRROR_AXIS_LEFT_RIGHT), PX_OK);
  EXPECT_EQ(std::vector<int>(dst.begin(), dst.begin() + 10), pic);
}

// ---- tables, angle and interpolation --------------------------------------------------

TEST(DistortTables, FollowTheirRules) {
  EXPECT_EQ(SIN[2048], 23170);
  EXPECT_EQ(SIN[4095], 32768);
  EXPECT_EQ(ATAN[1024], static_cast<int>(std::lround(std::atan(0.5) * 180 / M_PI * 524288)));
  for (int t : {0, 256, 127 << 8, 128 << 8, 511 << 10, 512 << 10, 1023 << 11, 1024 << 11, 0x3FFFFFFF}) {
    const int k = t >> 8;
    int s;
    if (k <= 127) {
      s = SQRT_STEP_1[k];
    } else if ((t >> 10) < 512) {
      s = SQRT_STEP_2[(t >> 10) - 32];
    } else if ((t >> 11) < 1024) {
      s = SQRT_STEP_3[(t >> 11) - 256];
    } else {
      s = SQRT_STEP_4[t >> 14];
    }
    // Each step table truncates t to its own grain before the root.
    EXPECT_NEAR(s, 16 * std::sqrt(static_cast<double>(t)), 16 * std::sqrt(16384.0) / 2) << t;
  }
  EXPECT_EQ(SQRT_STEP_4[65535], static_cast<int>(std::lround(16 * std::sqrt(65535.0 * 16384))));
}

TEST(Fatan2, AxesQuadrantsAndDiagonals) {
  const int deg = 1 << 19;
  EXPECT_EQ(FATAN2(0, 0), 0);
  EXPECT_EQ(FATAN2(0, 5), 0);
  EXPECT_EQ(FATAN2(5, 0), 90 * deg);
  EXPECT_EQ(FATAN2(0, -5), 180 * deg);
  EXPECT_EQ(FATAN2(-5, 0), 270 * deg);
  EXPECT_EQ(FATAN2(1, 1), 45 * deg);
  EXPECT_EQ(FATAN2(1, -1), 135 * deg);
  EXPECT_EQ(FATAN2(-1, -1), 225 * deg);
  EXPECT_EQ(FATAN2(-1, 1), 315 * deg);
  // 3 * (0x20000000 / 3) falls just short of 2^29: index 2047, not 45 degrees.
  EXPECT_EQ(FATAN2(3, 3), ATAN[2047]);
  EXPECT_EQ(FATAN2(-3, -3), ATAN[2047] + 180 * deg);
  // (1, 2): atan(1/2) from the y axis, the table entry 1024.
  EXPECT_EQ(FATAN2(1, 2), ATAN[1024]);
  EXPECT_EQ(FATAN2(2, 1), 90 * deg - ATAN[1024]);
}

TEST(BilinearFixed, CornersAndMiddle) {
  uint32_t out = 0;
  const uint32_t tl = 0x00000000, tr = 0x00FF0000, bl = 0x0000FF00, br = 0x000000FF;
  EXPECT_EQ(Bilinear_Fixed(0, 0, tl | 0x12345678, tr, bl, br, &out), 0xFF345678u);
  EXPECT_EQ(out, 0xFF345678u);
  EXPECT_EQ(Bilinear_Fixed(2048, 0, tl, tr, bl, br, &out), 0xFFFF0000u);
  EXPECT_EQ(Bilinear_Fixed(0, 2048, tl, tr, bl, br, &out), 0xFF00FF00u);
  EXPECT_EQ(Bilinear_Fixed(2048, 2048, tl, tr, bl, br, &out), 0xFF0000FFu);
  // A quarter of 255 in each channel: (1024 * 255 * 1024) >> 22 = 63.
  EXPECT_EQ(Bilinear_Fixed(1024, 1024, tl, tr, bl, br, &out), 0xFF3F3F3Fu);
}

// ---- twirl ---------------------------------------------------------------------------------

TEST(Twirl, AngleZeroIsACopyAndReturnsTheOutputAddress) {
  const auto src = random_picture(9, 7, 11);
  std::vector<int> dst(src.size(), 0);
  const int rc = px_twirl(src.data(), dst.data(), 9, 7, 4, 3, 3, 0, 0, 8, 0, 6, 0);
  EXPECT_EQ(rc, static_cast<int>(reinterpret_cast<intptr_t>(dst.data())));
  EXPECT_EQ(dst, src);
}

TEST(Twirl, CentreMapsToItselfAtAFullTurn) {
  const auto src = random_picture(9, 9, 12);
  std::vector<int> dst(src.size(), 0);
  EXPECT_EQ(px_twirl(src.data(), dst.data(), 9, 9, 4, 4, 4, 360, 0, 8, 0, 8, 0), PX_OK);
  EXPECT_EQ(dst[4 * 9 + 4], src[4 * 9 + 4]);
  // Pixels on or outside the rim stay as copied.
  EXPECT_EQ(dst[4 * 9 + 0], src[4 * 9 + 0]);
  EXPECT_EQ(dst[0], src[0]);
}

TEST(Twirl, HalfRadiusPixelTurnsByHalfTheAngle) {
  // Radius 2, angle 180: (3, 2) is at half the radius, so it turns by 90
  // degrees and takes the colour of (2, 1), keeping its own alpha.
  const auto src = random_picture(5, 5, 13);
  std::vector<int> dst(src.size(), 0);
  ASSERT_EQ(px_twirl(src.data(), dst.data(), 5, 5, 2, 2, 2, 180, 0, 4, 0, 4, 0), PX_OK);
  const uint32_t want = (static_cast<uint32_t>(src[2 * 5 + 3]) & 0xFF000000u) |
                        (static_cast<uint32_t>(src[1 * 5 + 2]) & 0xFFFFFFu);
  EXPECT_EQ(static_cast<uint32_t>(dst[2 * 5 + 3]), want);
}

TEST(Twirl, RectangleBoundsVisitedPixelsAndHalfWritesBlocks) {
  const auto src = random_picture(20, 20, 14);
  std::vector<int> whole(src.size()), part(src.size()), half(src.size());
  px_twirl(src.data(), whole.data(), 20, 20, 10, 10, 9, 120, 0, 19, 0, 19, 0);
  px_twirl(src.data(), part.data(), 20, 20, 10, 10, 9, 120, 0, 9, 0, 19, 0);
  for (int y = 0; y < 20; ++y) {
    for (int x = 0; x < 20; ++x) {
      const size_t i = static_cast<size_t>(y) * 20 + x;
      EXPECT_EQ(part[i], x <= 9 ? whole[i] : src[i]);
    }
  }
  px_twirl(src.data(), half.data(), 20, 20, 10, 10, 9, 120, 0, 19, 0, 19, 1);
  // (12, 10) is visited; its colour fills the 2 x 2 block with its alpha.
  const uint32_t v = static_cast<uint32_t>(half[10 * 20 + 12]);
  EXPECT_EQ(v & 0xFFFFFFu, static_cast<uint32_t>(whole[10 * 20 + 12]) & 0xFFFFFFu);
  for (int at : {10 * 20 + 13, 11 * 20 + 12, 11 * 20 + 13}) EXPECT_EQ(static_cast<uint32_t>(half[at]), v);
}

TEST(Twirl, FastPathMatchesThePlainPath) {
  const bool was = px_scalar_only();
  // Circles cut by the picture's borders and by rectangles (the fast path
  // visits only each row's columns inside the circle), a single row and
  // column, both directions, half resolution.
  struct Case {
    int w, h, cx, cy, radius, angle, half;
  };
  for (const Case& c : {Case{37, 29, 18, 14, 13, 200, 0}, Case{37, 29, 0, 28, 25, -90, 1},
                        Case{1, 41, 0, 20, 15, 300, 0}, Case{41, 1, 40, 0, 15, -360, 0}, Case{23, 31, 22, 9, 40, 45, 0},
                        Case{64, 48, 31, 23, 5, 360, 1}, Case{129, 67, 64, 33, 50, -200, 0}}) {
    const std::vector<int> src = random_picture(c.w, c.h, c.w * 5 + c.radius);
    std::vector<int> fast(src.size()), plain(src.size());
    for (auto [left, right] : {std::pair{0, c.w - 1}, {c.w / 3, c.w - 2}}) {
      px_set_scalar_only(false);
      ASSERT_EQ(
          px_twirl(src.data(), fast.data(), c.w, c.h, c.cx, c.cy, c.radius, c.angle, left, right, 1, c.h - 1, c.half),
          PX_OK);
      px_set_scalar_only(true);
      ASSERT_EQ(
          px_twirl(src.data(), plain.data(), c.w, c.h, c.cx, c.cy, c.radius, c.angle, left, right, 1, c.h - 1, c.half),
          PX_OK);
      EXPECT_EQ(fast, plain) << c.w << "x" << c.h << " angle " << c.angle << " left " << left;
    }
  }
  px_set_scalar_only(was);
}

TEST(Twirl, RefusesBadArgumentsAndLeavesOutput) {
  const auto src = random_picture(6, 6, 15);
  std::vector<int> dst(src.size(), kSentinel);
  EXPECT_EQ(px_twirl(src.data(), dst.data(), 6, 6, 6, 2, 3, 90, 0, 5, 0, 5, 0), PX_ERR_NULL);
  EXPECT_EQ(px_twirl(src.data(), dst.data(), 6, 6, 2, -1, 3, 90, 0, 5, 0, 5, 0), PX_ERR_NULL);
  EXPECT_EQ(px_twirl(src.data(), dst.data(), 6, 6, 2, 2, 0, 90, 0, 5, 0, 5, 0), PX_ERR_NULL);
  EXPECT_EQ(px_twirl(src.data(), dst.data(), 6, 6, 2, 2, 3, 361, 0, 5, 0, 5, 0), PX_ERR_NULL);
  EXPECT_EQ(dst, std::vector<int>(src.size(), kSentinel));
  // An empty rectangle: the copy only. A huge radius wraps: nothing inside.
  EXPECT_EQ(px_twirl(src.data(), dst.data(), 6, 6, 2, 2, 3, 90, 0, 5, 3, 2, 0), PX_OK);
  EXPECT_EQ(dst, src);
  EXPECT_EQ(px_twirl(src.data(), dst.data(), 6, 6, 2, 2, 65536, 90, -100, 100, -100, 100, 1), PX_OK);
  EXPECT_EQ(dst, src);
}

// ---- sphericity ------------------------------------------------------------------------------

std::vector<int> gradient(int w, int h) {
  std::vector<int> p(static_cast<size_t>(w) * h);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) p[static_cast<size_t>(y) * w + x] = static_cast<int>(0x80000000u | (x * 10) << 16);
  }
  return p;
}

TEST(Sphericity, StrengthZeroIsAnExactCopy) {
  const auto src = random_picture(15, 13, 16);
  std::vector<int> dst(src.size(), 0);
  EXPECT_EQ(px_sphericity(src.data(), dst.data(), 15, 13, 7, 6, 6, 0, 0, 14, 0, 12, 0), PX_OK);
  EXPECT_EQ(dst, src);
}

TEST(Sphericity, BulgeAndPinchNextToTheCentre) {
  const auto src = gradient(33, 33);
  std::vector<int> dst(src.size(), 0);
  // Bulge 100: (17, 16) samples x = 16 + 439 / 2048 -> red 162.
  ASSERT_EQ(px_sphericity(src.data(), dst.data(), 33, 33, 16, 16, 16, 100, 0, 32, 0, 32, 0), PX_OK);
  EXPECT_EQ(static_cast<uint32_t>(dst[16 * 33 + 17]), 0x80A20000u);
  EXPECT_EQ(dst[16 * 33 + 16], src[16 * 33 + 16]);
  // Pinch 100: (17, 16) samples x = 18 + 945 / 2048 -> red 184.
  ASSERT_EQ(px_sphericity(src.data(), dst.data(), 33, 33, 16, 16, 16, -100, 0, 32, 0, 32, 0), PX_OK);
  EXPECT_EQ(static_cast<uint32_t>(dst[16 * 33 + 17]), 0x80B80000u);
  EXPECT_EQ(dst[16 * 33 + 16], src[16 * 33 + 16]);
}

TEST(Sphericity, EnlargedRadiusReachesPastTheGivenOne) {
  // 500 / 256 times the squared radius: radius 10 works out to about 14.
  const auto src = gradient(40, 40);
  std::vector<int> dst(src.size(), 0);
  px_sphericity(src.data(), dst.data(), 40, 40, 20, 20, 10, 100, 0, 39, 0, 39, 0);
  EXPECT_NE(dst[20 * 40 + 32], src[20 * 40 + 32]);  // distance 12
  EXPECT_EQ(dst[20 * 40 + 35], src[20 * 40 + 35]);  // distance 15
}

TEST(Sphericity, FastPathMatchesThePlainPath) {
  const bool was = px_scalar_only();
  // Odd sizes, a single row and column, centres at the borders, both
  // directions of strength, half resolution and a rectangle cutting the circle.
  struct Case {
    int w, h, cx, cy, radius, strength, half;
  };
  for (const Case& c : {Case{37, 29, 18, 14, 20, 100, 0}, Case{37, 29, 0, 28, 30, 37, 1}, Case{1, 41, 0, 20, 15, 80, 0},
                        Case{41, 1, 40, 0, 15, 55, 0}, Case{23, 31, 11, 9, 40, -100, 0}, Case{64, 48, 31, 23, 6, 1, 1}}) {
    const std::vector<int> src = random_picture(c.w, c.h, c.w * 7 + c.strength);
    std::vector<int> fast(src.size()), plain(src.size());
    for (auto [left, right] : {std::pair{0, c.w - 1}, {c.w / 3, c.w - 2}}) {
      px_set_scalar_only(false);
      ASSERT_EQ(px_sphericity(src.data(), fast.data(), c.w, c.h, c.cx, c.cy, c.radius, c.strength, left, right, 0,
                              c.h - 1, c.half),
                PX_OK);
      px_set_scalar_only(true);
      ASSERT_EQ(px_sphericity(src.data(), plain.data(), c.w, c.h, c.cx, c.cy, c.radius, c.strength, left, right, 0,
                              c.h - 1, c.half),
                PX_OK);
      EXPECT_EQ(fast, plain) << c.w << "x" << c.h << " strength " << c.strength << " left " << left;
    }
  }
  px_set_scalar_only(was);
}

TEST(Distort, InPlaceRunsAsThePlainPathDoes) {
  // Output and input the same array: rows read pixels that rows above them
  // have already moved, so the result depends on the order rows run in; it
  // must be the plain path's order whatever the number of threads.
  const bool was = px_scalar_only();
  const int w = 150, h = 260;
  const std::vector<int> src = random_picture(w, h, 4242);
  auto run = [&](bool scalar, bool twirl) {
    px_set_scalar_only(scalar);
    std::vector<int> pic = src;
    const int rc = twirl ? px_twirl(pic.data(), pic.data(), w, h, 75, 130, 120, 170, 0, w - 1, 0, h - 1, 0)
                         : px_sphericity(pic.data(), pic.data(), w, h, 75, 130, 110, 90, 0, w - 1, 0, h - 1, 0);
    EXPECT_EQ(rc, PX_OK);
    return pic;
  };
  for (bool twirl : {true, false}) {
    const std::vector<int> plain = run(true, twirl);
    for (int repeat = 0; repeat < 3; ++repeat) EXPECT_EQ(run(false, twirl), plain) << (twirl ? "twirl" : "sphericity");
  }
  px_set_scalar_only(was);
}

TEST(Sphericity, RefusesBadArguments) {
  const auto src = random_picture(6, 6, 17);
  std::vector<int> dst(src.size(), kSentinel);
  EXPECT_EQ(px_sphericity(src.data(), dst.data(), 6, 6, 2, 2, 0, 50, 0, 5, 0, 5, 0), PX_ERR_NULL);
  EXPECT_EQ(px_sphericity(src.data(), dst.data(), 6, 6, 2, 2, 3, 101, 0, 5, 0, 5, 0), PX_ERR_NULL);
  EXPECT_EQ(px_sphericity(src.data(), dst.data(), 6, 6, 2, 6, 3, 50, 0, 5, 0, 5, 0), PX_ERR_NULL);
  EXPECT_EQ(dst, std::vector<int>(src.size(), kSentinel));
}

// ---- threads ------------------------------------------------------------------------------------

TEST(GeometryThreads, EachColumnMovesAsInTheWholeRun) {
  // A row is sampled in chunks of visited pixels; a run restricted to one
  // column (a chunk of one) must give that column exactly as the whole run,
  // at full and half resolution, for both distortions, across widths that
  // are not multiples of a chunk.
  const int w = 301, h = 23;
  const auto src = random_picture(w, h, 29);
  for (int which = 0; which < 4; ++which) {
    const int half = which & 1;
    auto run = [&](std::vector<int>& out, int left, int right) {
      if (which < 2) return px_twirl(src.data(), out.data(), w, h, 150, 11, 140, 170, left, right, 0, h - 1, half);
      return px_sphericity(src.data(), out.data(), w, h, 150, 11, 120, 90, left, right, 0, h - 1, half);
    };
    std::vector<int> whole(src.size()), one(src.size());
    ASSERT_EQ(run(whole, 0, w - 1), PX_OK);
    ASSERT_NE(whole, src);
    for (int x = 0; x < w; x += 1 + half) {
      ASSERT_EQ(run(one, x, x), PX_OK);
      for (int y = 0; y < h; ++y) {
        for (int dx = 0; dx <= half && x + dx < w; ++dx) {
          ASSERT_EQ(one[y * w + x + dx], whole[y * w + x + dx]) << which << " at " << x + dx << "," << y;
        }
      }
    }
  }
}

TEST(GeometryThreads, SplitWorkMatchesTheScalarPath) {
  const int w = 301, h = 257;
  const auto src = random_picture(w, h, 21);
  auto run_all = [&]() {
    std::vector<int> out;
    std::vector<int> a(src.size()), b(src.size()), c(src.size()), d(src.size());
    px_twirl(src.data(), a.data(), w, h, 150, 120, 110, -250, 0, w - 1, 0, h - 1, 0);
    px_twirl(src.data(), b.data(), w, h, 150, 120, 110, 200, 3, w - 1, 1, h - 1, 1);
    px_sphericity(src.data(), c.data(), w, h, 140, 130, 90, 70, 0, w - 1, 0, h - 1, 1);
    px_straighten(src.data(), d.data(), w, h, 13, 0.8f);
    for (auto* v : {&a, &b, &c, &d}) out.insert(out.end(), v->begin(), v->end());
    std::vector<int> q(src.size(), 0);
    std::vector<int> copy = src;
    px_rotate_flip(copy.data(), q.data(), w, h, 3, 0, 0);
    out.insert(out.end(), q.begin(), q.end());
    return out;
  };
  const bool was = px_scalar_only();
  px_set_scalar_only(true);
  const auto scalar = run_all();
  px_set_scalar_only(false);
  const auto split = run_all();
  px_set_scalar_only(was);
  EXPECT_EQ(scalar, split);
}
}  // namespace
