#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <random>
#include <string>
#include <vector>

#include "effect/face/ed_md_detector.h"
#include "effect/face/face_engine.h"
#include "effect/face/fd_detector.h"
#include "effect/face/sm_image.h"

namespace {
// A binary PGM from tests/data.
std::vector<unsigned char> read_pgm(const char* name, int* w, int* h) {
  std::string path = std::string(__FILE__);
  path = path.substr(0, path.rfind('/')) + "/../data/" + name;
  std::vector<unsigned char> px;
  FILE* f = std::fopen(path.c_str(), "rb");
  if (!f) return px;
  int maxv = 0;
  if (std::fscanf(f, "P5 %d %d %d", w, h, &maxv) == 3 && std::fgetc(f) != EOF) {
    px.resize(static_cast<size_t>(*w) * *h);
    if (std::fread(px.data(), 1, px.size(), f) != px.size()) px.clear();
  }
  std::fclose(f);
  return px;
}

std::vector<int> grey_to_argb(const std::vector<unsigned char>& g) {
  std::vector<int> p(g.size());
  for (size_t i = 0; i < g.size(); ++i) p[i] = static_cast<int>(0xFF000000u | g[i] * 0x010101u);
  return p;
}

SMyRect2 R(int l, int t, int r, int b) { return SMyRect2{l, t, r, b}; }
}  // namespace

TEST(FaceCensus, CodeBitsAndTheFlatBufferWrap) {
  // One bright pixel in a dark block: only its own bit is set.
  unsigned char centre[9] = {0, 0, 0, 0, 90, 0, 0, 0, 0};
  unsigned short code[9] = {};
  image2MCT_FD(centre, 3, 3, code);
  EXPECT_EQ(code[4], 16);
  unsigned char flat[9] = {7, 7, 7, 7, 7, 7, 7, 7, 7};
  image2MCT_FD(flat, 3, 3, code);
  EXPECT_EQ(code[4], 0);  // 9 * p == sum is not brighter

  // 3 x 4 picture, dark but for row 1, column 0. The walk covers flat
  // indices 4..7, so the blocks centred on the last column (5) and the first
  // column (6) reach across the row ends.
  unsigned char g[12] = {};
  g[3] = 90;
  unsigned short m[12];
  for (auto& v : m) v = 999;
  image2MCT_FD(g, 3, 4, m);
  EXPECT_EQ(m[4], 1 << 3);  // middle-left of the ordinary block
  EXPECT_EQ(m[5], 1 << 2);  // its top-right comes from the next row's first pixel
  EXPECT_EQ(m[6], 1 << 1);  // top-centre
  EXPECT_EQ(m[7], 1 << 0);  // top-left of a block whose left column wraps back
  for (int i : {0, 1, 2, 3, 8, 9, 10, 11}) EXPECT_EQ(m[i], 999) << i;

  // All nine bits are never set: codes stay within 0..510.
  std::mt19937 rng(3);
  std::vector<unsigned char> r(40 * 30);
  for (auto& v : r) v = static_cast<unsigned char>(rng());
  std::vector<unsigned short> rc(r.size(), 0);
  image2MCT9_1(r.data(), 40, 30, rc.data());
  for (unsigned short v : rc) EXPECT_LE(v, 510);
}

TEST(FaceImages, NearestNeighbourBilinearAndGrey) {
  unsigned char src[5] = {10, 20, 30, 40, 50}, dst[3];
  Resize_NN(src, 5, 1, dst, 3, 1);  // step 54613: indices 0, 1, 3
  EXPECT_EQ(dst[0], 10);
  EXPECT_EQ(dst[1], 20);
  EXPECT_EQ(dst[2], 40);
  int argb[2] = {static_cast<int>(0xFF0A141Eu), static_cast<int>(0x80010100u)};
  unsigned char grey[2];
  Resize_NN_Color2Gray(argb, 2, 1, grey, 2, 1);
  EXPECT_EQ(grey[0], 20);  // (10 + 20 + 30) / 3
  EXPECT_EQ(grey[1], 0);   // (1 + 1 + 0) / 3, alpha ignored
  // Bilinear doubling of 0, 100: x = 1 samples at 0.5.
  unsigned char two[2] = {0, 100}, four[4];
  Resize_BI(two, 2, 1, four, 4, 1);
  EXPECT_EQ(four[0], 0);
  EXPECT_EQ(four[1], 50);
  EXPECT_EQ(four[2], 100);
  EXPECT_EQ(four[3], 100);  // the right neighbour is clamped to the last column
  unsigned char row[4] = {1, 2, 3, 4};
  FlipX(row, 4, 1);
  EXPECT_EQ(row[0], 4);
  EXPECT_EQ(row[3], 1);

  caByteImage a, b, c;
  ASSERT_EQ(smAllocByteImage(&a, 4, 2, 3), 1);
  for (int i = 0; i < 24; ++i) a.data[i] = static_cast<unsigned char>(i * 10);
  ASSERT_EQ(smColorToGray(&a, &b), 1);
  EXPECT_EQ(b.data[1], (30 + 40 + 50) / 3);
  ASSERT_EQ(smCropImage(&b, &c, R(2, 1, 9, 9)), 1);  // clipped to 2 x 1
  EXPECT_EQ(c.width, 2);
  EXPECT_EQ(c.height, 1);
  EXPECT_EQ(c.data[0], b.data[6]);
  smThresholdImage(&c, 200);
  EXPECT_EQ(c.data[0], 0);
  EXPECT_EQ(c.data[1], 255);
  smReleaseByteImage(&a);
  smReleaseByteImage(&b);
  smReleaseByteImage(&c);
  EXPECT_EQ(a.data, nullptr);
}

TEST(FaceFrame, WorkingSizeRollCheckAndInit) {
  int w, h;
  caIF_WorkingSize(100, 100, &w, &h);
  EXPECT_EQ(w, 640);
  EXPECT_EQ(h, 640);
  caIF_WorkingSize(300, 200, &w, &h);  // 640 * 21845 >> 15
  EXPECT_EQ(w, 640);
  EXPECT_EQ(h, 426);
  caIF_WorkingSize(200, 300, &w, &h);
  EXPECT_EQ(w, 426);
  EXPECT_EQ(h, 640);

  // (dx * 1024) / (dx^2 + dy^2) > 950: only eyes a pixel apart count as rolled.
  EXPECT_EQ(CheckRipRotation(0, 0, 1, 0), 1);
  EXPECT_EQ(CheckRipRotation(0, 0, 2, 0), 0);   // 512
  EXPECT_EQ(CheckRipRotation(0, 0, 1, 1), 0);   // 512
  EXPECT_EQ(CheckRipRotation(0, 5, 30, 7), 0);  // ordinary eyes: 33
  EXPECT_EQ(CheckRipRotation(5, 0, 4, 0), 0);   // negative dx

  FaceEngineInfo info{};
  ASSERT_EQ(InitFaceBeautyPlus(&info, 1, 0, 7, 16, 3, 9), 1);
  EXPECT_EQ(info.maxFace, 3);
  EXPECT_EQ(info.precision, 3);
  EXPECT_EQ(info.beautyLevel, 3);
  EXPECT_EQ(info.reserved, 9);
  EXPECT_EQ(info.eyeValid[2], 0);
  std::vector<int> flat(300 * 200, static_cast<int>(0xFF808080u));
  EXPECT_EQ(RunFaceAnalyzer(&info, flat.data(), 300, 200), 1);
  EXPECT_EQ(info.faceCount, 0);
  ReleaseFaceBeautyPlus(&info);
  EXPECT_EQ(info.faceRect, nullptr);
  EXPECT_EQ(info.eyePoints, nullptr);
  EXPECT_EQ(info.eyeValid, nullptr);
  EXPECT_EQ(info.mouthAux, nullptr);
  ASSERT_EQ(InitFaceBeautyPlus(&info, 3, 25, 2, 0, 1, 0), 1);
  EXPECT_EQ(info.maxFace, 25);
  EXPECT_EQ(info.precision, 2);
  ReleaseFaceBeautyPlus(&info);
}

TEST(FaceDetector, IntersectionUsesTheWidthMarginOnAllSides) {
  EXPECT_EQ(fd_isintersection(R(0, 0, 16, 16), R(16, 0, 32, 16)), 0);  // 2..14 and 18..30
  EXPECT_EQ(fd_isintersection(R(0, 0, 16, 16), R(12, 0, 28, 16)), 1);  // touching at 14
  EXPECT_EQ(fd_isintersection(R(0, 0, 16, 16), R(13, 0, 29, 16)), 0);
  // Tall boxes: the margin is width-based (1) vertically too.
  EXPECT_EQ(fd_isintersection(R(0, 0, 8, 100), R(0, 98, 8, 200)), 1);
  EXPECT_EQ(fd_isintersection(R(0, 0, 8, 100), R(0, 99, 8, 200)), 0);
  EXPECT_EQ(ed_isintersection(R(0, 0, 16, 16), R(12, 0, 28, 16)), 1);
}

TEST(FaceDetector, EnrolmentMergingAndTheListBound) {
  fd_reset_candidates();
  fd_enroll_Frontal(0, 0, 16, 16, 10);
  fd_enroll_Frontal(20, 0, 16, 16, 8);  // apart: a second candidate
  FdCandidateView c = fd_candidates();
  ASSERT_EQ(c.count, 2);
  // A better hit joins candidate 0 and moves it onto candidate 1, which is
  // then merged into it: candidate 1's confidence 8 is not below 3.
  fd_enroll_Frontal(10, 0, 16, 16, 3);
  c = fd_candidates();
  EXPECT_EQ(c.count, 2);
  EXPECT_EQ(c.rect[0].left, 10);
  EXPECT_EQ(c.confidence[0], 3);
  EXPECT_EQ(c.intersections[0], 3);
  EXPECT_EQ(c.valid[1], 0);
  // A worse hit only counts.
  fd_enroll_Frontal(11, 0, 16, 16, 50);
  EXPECT_EQ(c.rect[0].left, 10);
  EXPECT_EQ(c.intersections[0], 4);
  // Equal confidences: the earlier box stays.
  fd_enroll_Frontal(9, 0, 16, 16, 3);
  EXPECT_EQ(c.rect[0].left, 10);

  fd_reset_candidates();
  for (int i = 0; i < 20; ++i) fd_enroll_Frontal(i * 40, 0, 16, 16, 5);
  EXPECT_EQ(fd_candidates().count, 20);
  fd_enroll_Frontal(2000, 0, 16, 16, 1);  // dropped
  fd_enroll_Frontal(0, 0, 16, 16, 1);     // dropped too: nothing is counted or moved
  c = fd_candidates();
  EXPECT_EQ(c.count, 20);
  EXPECT_EQ(c.intersections[0], 1);
  EXPECT_EQ(c.confidence[0], 5);
}

TEST(FaceDetector, FinalSelectionKeepsTheEarlierOnTies) {
  fd_reset_faces();
  fd_add_face(R(0, 0, 40, 40), 7, 0);
  fd_add_face(R(4, 4, 44, 44), 7, 45);    // tie: dropped
  fd_add_face(R(200, 0, 240, 40), 9, 0);  // apart
  fd_add_face(R(202, 0, 242, 40), 4, -45);
  fd_final();
  FdCandidateView f = fd_faces();
  EXPECT_EQ(f.valid[0], 1);
  EXPECT_EQ(f.valid[1], 0);
  EXPECT_EQ(f.valid[2], 0);
  EXPECT_EQ(f.valid[3], 1);
  for (int i = 0; i < 30; ++i) fd_add_face(R(0, 0, 1, 1), 1, 0);
  EXPECT_EQ(fd_faces().count, kFdListSize);
}

TEST(FaceDetector, TurnBackFormulaAndRoundTrip) {
  // Angle 0: centre kept, the box becomes square with the width as side.
  SMyRect2 b = InvRotate(R(10, 20, 30, 44), 100, 100, 0);
  EXPECT_EQ(b.left, 10);
  EXPECT_EQ(b.top, 22);
  EXPECT_EQ(b.right, 30);
  EXPECT_EQ(b.bottom, 42);

  // A bright square turned by +-45 degrees: a box around it in the turned
  // picture turns back onto the square.
  const int W = 200, H = 160;
  std::vector<unsigned char> img(W * H, 0), turned(W * H);
  for (int y = 30; y < 50; ++y)
    for (int x = 130; x < 150; ++x) img[y * W + x] = 255;
  for (int angle : {45, -45}) {
    Rotate(img.data(), turned.data(), W, H, angle);
    long sx = 0, sy = 0, n = 0;
    for (int y = 0; y < H; ++y)
      for (int x = 0; x < W; ++x)
        if (turned[y * W + x]) sx += x, sy += y, ++n;
    ASSERT_GT(n, 100);
    int cx = static_cast<int>(sx / n), cy = static_cast<int>(sy / n);
    SMyRect2 back = InvRotate(R(cx - 10, cy - 10, cx + 10, cy + 10), W, H, angle);
    EXPECT_NEAR((back.left + back.right) / 2, 140, 2) << angle;
    EXPECT_NEAR((back.top + back.bottom) / 2, 40, 2) << angle;
  }
  // Pixels turned in from outside the picture are 0.
  std::vector<unsigned char> white(W * H, 255);
  Rotate(white.data(), turned.data(), W, H, 45);
  EXPECT_EQ(turned[0], 0);
  EXPECT_EQ(turned[(H / 2) * W + W / 2], 255);
}

TEST(FaceDetector, PyramidAndSmallPictures) {
  EXPECT_EQ(fd_pyramid_count(1), 14);
  EXPECT_EQ(fd_pyramid_count(2), 11);
  EXPECT_EQ(fd_pyramid_count(3), 8);
  EXPECT_EQ(fd_pyramid_count(0), 8);
  std::vector<unsigned char> small(39 * 30, 128);
  EXPECT_EQ(fd_find(small.data(), 39, 30, 1, 0, 1), 0);
  SMyRect2 out[kFdListSize];
  EXPECT_EQ(fd_where(out), 0);
  // A window's rejection: the stage it stops at had a sum above its threshold.
  std::mt19937 rng(11);
  std::vector<unsigned char> noise(64 * 64);
  for (auto& v : noise) v = static_cast<unsigned char>(rng());
  std::vector<unsigned short> mct(noise.size(), 0);
  image2MCT_FD(noise.data(), 64, 64, mct.data());
  for (int y = 0; y < 40; y += 3)
    for (int x = 0; x < 42; x += 3) {
      int sum = 0, stage = fd_eval_window(mct.data(), 64, x, y, &sum);
      if (stage < kFdStageCount)
        EXPECT_GT(sum, kFdStageThresholds[stage]);
      else
        EXPECT_LE(sum, kFdStageThresholds[kFdStageCount - 1]);
    }
}

TEST(FaceParts, RegionsAndLevels) {
  SMyRect2 l, r;
  ed_regions(R(10, 20, 31, 41), &l, &r);  // half sizes round: 11
  EXPECT_EQ(l.left, 10);
  EXPECT_EQ(l.right, 21);
  EXPECT_EQ(l.bottom, 31);
  EXPECT_EQ(r.left, 21);
  EXPECT_EQ(r.right, 31);
  SMyRect2 m = md_region(R(100, 100, 200, 200), 180);
  EXPECT_EQ(m.left, 105);
  EXPECT_EQ(m.top, 150);
  EXPECT_EQ(m.right, 195);
  EXPECT_EQ(m.bottom, 179);  // clipped to the last row
  EXPECT_EQ(md_region(R(100, 100, 200, 200), 400).bottom, 205);

  int ws[4], hs[4];
  ASSERT_EQ(edmd_levels(100, 100, 22, ws, hs), 4);
  EXPECT_EQ(ws[3], 24);
  EXPECT_EQ(hs[3], 24);
  EXPECT_EQ(edmd_levels(10, 6, 22, ws, hs), 0);  // first height 20: nothing scanned
  ASSERT_EQ(edmd_levels(100, 50, 13, ws, hs), 3);  // 33x17, 30x15, 27x14; 24x12 stops
  EXPECT_EQ(hs[0], 17);
  EXPECT_EQ(hs[2], 14);
}

TEST(FaceParts, EyeSelectionAndMouthLocalisation) {
  ed_reset();
  ed_enroll(0, R(0, 0, 15, 15), 30);
  ed_enroll(0, R(1, 0, 16, 15), 20);
  EXPECT_EQ(ed_select(0), -1);  // count 2
  ed_enroll(0, R(0, 1, 15, 16), 25);
  EXPECT_EQ(ed_select(0), 0);
  EdCandidateView v = ed_candidates(0);
  EXPECT_EQ(v.intersections[0], 3);
  EXPECT_EQ(v.confidenceSum[0], 75);
  EXPECT_EQ(v.confidence[0], 20);
  EXPECT_EQ(ed_select(1), -1);  // empty list

  md_reset();
  md_enroll(R(0, 0, 15, 9), 10);
  md_enroll(R(1, 0, 16, 9), 20);
  md_enroll(R(2, 0, 17, 9), 12);
  ASSERT_EQ(md_localize(), 1);  // mean 14: the hits with 10 and 12 are averaged
  md_reset();
  md_enroll(R(0, 0, 15, 9), 10);
  md_enroll(R(2, 0, 17, 9), 12);
  md_enroll(R(1, 0, 16, 9), 20);
  ASSERT_EQ(md_localize(), 1);
  md_reset();
  md_enroll(R(0, 0, 15, 9), 10);
  md_enroll(R(1, 0, 16, 9), 10);
  EXPECT_EQ(md_localize(), 0);  // nothing below the mean
}

namespace {
int g_beautified = -1;
void count_faces(int*, int, int, int, const caFaceBox*, int count) { g_beautified = count; }
}  // namespace

TEST(FaceEngine, FindsTheAstronautAndNothingInTheCoffee) {
  int w = 0, h = 0;
  std::vector<unsigned char> g = read_pgm("astronaut_256.pgm", &w, &h);
  ASSERT_FALSE(g.empty());
  std::vector<int> argb = grey_to_argb(g);
  FaceEngineInfo info{};
  ASSERT_EQ(InitFaceBeautyPlus(&info, 1, 5, 1, 0, 2, 0), 1);
  RunFaceAnalyzer(&info, argb.data(), w, h);
  ASSERT_EQ(info.faceCount, 1);
  // The face of the 256-pixel astronaut spans about x 88..135, y 30..90.
  const caFaceBox& f = info.faceRect[0];
  EXPECT_GT(f.x + f.width / 2, 100);
  EXPECT_LT(f.x + f.width / 2, 125);
  EXPECT_GT(f.y + f.height / 2, 45);
  EXPECT_LT(f.y + f.height / 2, 75);
  EXPECT_GT(f.width, 35);
  EXPECT_LT(f.width, 75);
  EXPECT_EQ(info.eyeValid[0], 1);

  caIF_SetBeautifier(count_faces);
  g_beautified = -1;
  EXPECT_EQ(RunFaceBeautyPlus(&info, argb.data(), w, h), 0);
  EXPECT_EQ(g_beautified, -1);  // beautyMode 0: not called
  info.beautyMode = 16;
  RunFaceBeautyPlus(&info, argb.data(), w, h);
  EXPECT_EQ(g_beautified, 1);
  g_beautified = -1;
  RunFaceBeautyPlusSingleFace(&info, argb.data(), w, h, 3);
  EXPECT_EQ(g_beautified, -1);  // no such face
  caIF_SetBeautifier(nullptr);
  ReleaseFaceBeautyPlus(&info);

  g = read_pgm("coffee_256.pgm", &w, &h);
  ASSERT_FALSE(g.empty());
  argb = grey_to_argb(g);
  ASSERT_EQ(InitFaceBeautyPlus(&info, 3, 5, 1, 0, 2, 0), 1);
  RunFaceAnalyzer(&info, argb.data(), w, h);
  EXPECT_EQ(info.faceCount, 0);
  ReleaseFaceBeautyPlus(&info);
}

namespace {
double box_iou(const caFaceBox& a, int l, int t, int r, int b) {
  const double ix = std::max(0, std::min(a.x + a.width, r) - std::max(a.x, l));
  const double iy = std::max(0, std::min(a.y + a.height, b) - std::max(a.y, t));
  const double in = ix * iy;
  return in / (double(a.width) * a.height + double(r - l) * (b - t) - in);
}
}  // namespace

// The astronaut photo pasted unscaled into larger canvases (tiled coffee
// photo, mirrored every other tile, with seeded noise) so that the analyser's
// 640-pixel working image shows her face at each width band from about 35 to
// 170 pixels. The face is found in every band, once, and its box is the usual
// face box: brows to chin and cheek to cheek as annotated on real photos,
// (79, 26) to (145, 97) in the 256-pixel photo, covered at IoU >= 0.5.
TEST(FaceEngine, FindsTheAstronautAtEveryFaceWidthWithTheUsualBox) {
  int aw = 0, ah = 0, cw = 0, ch = 0;
  const std::vector<unsigned char> astro = read_pgm("astronaut_256.pgm", &aw, &ah);
  const std::vector<unsigned char> coffee = read_pgm("coffee_256.pgm", &cw, &ch);
  ASSERT_FALSE(astro.empty());
  ASSERT_FALSE(coffee.empty());
  std::mt19937 rng(15);
  struct Case {
    int width, height, atX, atY;
  };
  // Working face widths about 170, 110, 80, 55, 40 and 35 pixels.
  for (const Case& c : {Case{256, 256, 0, 0}, Case{397, 301, 77, 45}, Case{535, 333, 200, 60},
                        Case{777, 512, 333, 101}, Case{1061, 700, 601, 313}, Case{1225, 901, 17, 600}}) {
    std::vector<int> argb(static_cast<size_t>(c.width) * c.height);
    for (int y = 0; y < c.height; ++y)
      for (int x = 0; x < c.width; ++x) {
        const int tx = x / cw, ty = y / ch;
        const int sx = (tx + ty) % 2 ? cw - 1 - x % cw : x % cw;
        int g = coffee[(y % ch) * cw + sx] + static_cast<int>(rng() % 9) - 4;
        if (x >= c.atX && y >= c.atY && x < c.atX + aw && y < c.atY + ah) g = astro[(y - c.atY) * aw + x - c.atX];
        g = std::clamp(g, 0, 255);
        argb[static_cast<size_t>(y) * c.width + x] = static_cast<int>(0xFF000000u | g * 0x010101u);
      }
    FaceEngineInfo info{};
    ASSERT_EQ(InitFaceBeautyPlus(&info, 1, 5, 1, 0, 2, 0), 1);
    RunFaceAnalyzer(&info, argb.data(), c.width, c.height);
    const int workingFace = 66 * 640 / std::max(c.width, c.height);
    int best = -1;
    double bestIou = 0;
    for (int i = 0; i < info.faceCount; ++i) {
      const double v = box_iou(info.faceRect[i], c.atX + 79, c.atY + 26, c.atX + 145, c.atY + 97);
      if (v > bestIou) bestIou = v, best = i;
    }
    EXPECT_GE(bestIou, 0.5) << "face about " << workingFace << " px wide at the working size, " << info.faceCount
                            << " faces";
    if (best >= 0) {
      // Both eyes found, in the upper half of the box, left of and right of its middle.
      const caFaceBox& f = info.faceRect[best];
      const caEyePair& e = info.eyePoints[best];
      EXPECT_EQ(info.eyeValid[best], 1);
      EXPECT_GE(e.x1, c.atX + 90) << workingFace;
      EXPECT_LE(e.x1, c.atX + 112) << workingFace;
      EXPECT_GE(e.x2, c.atX + 114) << workingFace;
      EXPECT_LE(e.x2, c.atX + 134) << workingFace;
      EXPECT_LT(e.y1, f.y + f.height / 2) << workingFace;
      EXPECT_LT(e.y2, f.y + f.height / 2) << workingFace;
    }
    ReleaseFaceBeautyPlus(&info);
  }
}
