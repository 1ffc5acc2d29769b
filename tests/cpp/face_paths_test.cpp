// The face detector's fast path (worker threads, vectorisable census codes,
// row-wise first stage) against the plain single-threaded path: every list,
// box, confidence, eye and mouth point must be the same.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "effect/face/face_engine.h"
#include "effect/face/fd_detector.h"
#include "effect/face/sm_image.h"
#include "effect/kalo/px_parallel.h"

namespace {
struct Picture {
  int width = 0, height = 0;
  std::vector<unsigned char> grey;
};

Picture read_pgm(const char* name) {
  std::string path = std::string(__FILE__);
  path = path.substr(0, path.rfind('/')) + "/../data/" + name;
  Picture p;
  FILE* f = std::fopen(path.c_str(), "rb");
  if (!f) return p;
  int maxv = 0;
  if (std::fscanf(f, "P5 %d %d %d", &p.width, &p.height, &maxv) == 3 && std::fgetc(f) != EOF) {
    p.grey.resize(static_cast<size_t>(p.width) * p.height);
    if (std::fread(p.grey.data(), 1, p.grey.size(), f) != p.grey.size()) p.grey.clear();
  }
  std::fclose(f);
  return p;
}

// Bilinear enlargement (as the benchmark makes its 640 picture): smooth
// areas let many windows run deep into the cascade.
Picture enlarge(const Picture& s, int w, int h) {
  Picture p{w, h, std::vector<unsigned char>(static_cast<size_t>(w) * h)};
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      const double sx = (x + 0.5) * s.width / w - 0.5, sy = (y + 0.5) * s.height / h - 0.5;
      const int x0 = sx < 0 ? 0 : static_cast<int>(sx), y0 = sy < 0 ? 0 : static_cast<int>(sy);
      const int x1 = x0 + 1 < s.width ? x0 + 1 : s.width - 1, y1 = y0 + 1 < s.height ? y0 + 1 : s.height - 1;
      const double fx = sx < 0 ? 0 : sx - x0, fy = sy < 0 ? 0 : sy - y0;
      const double top = s.grey[y0 * s.width + x0] * (1 - fx) + s.grey[y0 * s.width + x1] * fx;
      const double bottom = s.grey[y1 * s.width + x0] * (1 - fx) + s.grey[y1 * s.width + x1] * fx;
      p.grey[static_cast<size_t>(y) * w + x] = static_cast<unsigned char>(top * (1 - fy) + bottom * fy + 0.5);
    }
  return p;
}

// The astronaut's face (about 64 x 80 pixels of the 256 picture) repeated
// over the picture: many faces side by side, so one band of window rows
// holds more hits than it keeps and is scanned again while enrolling.
Picture tiled_faces(const Picture& s, int w, int h) {
  Picture p{w, h, std::vector<unsigned char>(static_cast<size_t>(w) * h)};
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) p.grey[static_cast<size_t>(y) * w + x] = s.grey[(20 + y % 80) * s.width + 80 + x % 64];
  return p;
}

Picture random_picture(int w, int h, unsigned seed, bool smooth) {
  Picture p{w, h, std::vector<unsigned char>(static_cast<size_t>(w) * h)};
  std::mt19937 rng(seed);
  if (!smooth) {
    for (auto& v : p.grey) v = static_cast<unsigned char>(rng());
    return p;
  }
  // Gradients with a few blobs and stripes: long runs of similar codes.
  const int cx = static_cast<int>(rng() % w), cy = static_cast<int>(rng() % h);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      int v = (x * 160) / w + (y * 90) / h;
      const int dx = x - cx, dy = y - cy;
      if (dx * dx + dy * dy < (w / 6) * (w / 6)) v = 255 - v / 2;
      if ((y / 7) % 5 == 0) v /= 2;
      v += static_cast<int>(rng() % 9);
      p.grey[static_cast<size_t>(y) * w + x] = static_cast<unsigned char>(v > 255 ? 255 : v);
    }
  return p;
}

// Everything the detector leaves behind after fd_find.
struct DetectorResult {
  int found = 0;
  std::vector<int> words;  // final boxes and rolls, face list, last candidate list
};

void put(std::vector<int>& w, SMyRect2 r) { w.insert(w.end(), {r.left, r.top, r.right, r.bottom}); }

DetectorResult detect(const Picture& p, int rotated, int precision, bool plain) {
  const bool was = px_scalar_only();
  px_set_scalar_only(plain);
  DetectorResult r;
  r.found = fd_find(p.grey.data(), p.width, p.height, rotated, 0, precision);
  px_set_scalar_only(was);
  SMyRect2 out[kFdListSize];
  if (fd_where(out))
    for (int i = 0; i < r.found; ++i) {
      put(r.words, out[i]);
      r.words.push_back(fd_final_rip(i));
    }
  for (FdCandidateView v : {fd_faces(), fd_candidates()}) {
    r.words.push_back(v.count);
    for (int i = 0; i < v.count; ++i) {
      put(r.words, v.rect[i]);
      r.words.insert(r.words.end(), {v.confidence[i], v.intersections[i], v.valid[i]});
    }
  }
  return r;
}

// Precision 1 scans the most levels; 2 and 3 end the pyramid earlier.
void expect_same_detection(const Picture& p, const char* what, bool allPrecisions = false) {
  for (int rotated : {0, 1})
    for (int precision : {1, 2, 3}) {
      if (precision > 1 && !allPrecisions) break;
      DetectorResult fast = detect(p, rotated, precision, false);
      DetectorResult plain = detect(p, rotated, precision, true);
      EXPECT_EQ(fast.found, plain.found) << what << " rotated " << rotated << " precision " << precision;
      EXPECT_EQ(fast.words, plain.words) << what << " rotated " << rotated << " precision " << precision;
    }
}

// Every array of the analyser record, faces, eyes and mouths.
std::vector<int> analyse(const Picture& p, int mode, bool plain) {
  std::vector<int> argb(p.grey.size());
  for (size_t i = 0; i < p.grey.size(); ++i) argb[i] = static_cast<int>(0xFF000000u | p.grey[i] * 0x010101u);
  FaceEngineInfo info{};
  std::vector<int> w;
  if (InitFaceBeautyPlus(&info, mode, 10, 1, 0, 3, 0) != 1) return w;
  std::memset(info.faceRotated, 0, sizeof(int32_t) * info.maxFace);  // only set for faces with eyes
  const bool was = px_scalar_only();
  px_set_scalar_only(plain);
  RunFaceAnalyzer(&info, argb.data(), p.width, p.height);
  px_set_scalar_only(was);
  w.push_back(info.faceCount);
  for (int i = 0; i < info.maxFace; ++i) {
    const caFaceBox& f = info.faceRect[i];
    const caEyePair& e = info.eyePoints[i];
    const SMyPoint2& mc = info.mouthCenter[i];
    const caFaceBox& mr = info.mouthRect[i];
    const caFaceBox& ma = info.mouthAux[i];
    w.insert(w.end(), {f.x, f.y, f.width, f.height, e.x1, e.y1, e.x2, e.y2});
    w.insert(w.end(), {info.faceRotated[i], info.eyeValid[i], mc.x, mc.y});
    w.insert(w.end(), {mr.x, mr.y, mr.width, mr.height, ma.x, ma.y, ma.width, ma.height});
  }
  ReleaseFaceBeautyPlus(&info);
  return w;
}

// The census code of the block centred on flat index i, bit by bit.
unsigned short census_reference(const unsigned char* g, int w, int i) {
  const int at[9] = {i - w - 1, i - w, i - w + 1, i - 1, i, i + 1, i + w - 1, i + w, i + w + 1};
  int sum = 0;
  for (int k : at) sum += g[k];
  unsigned short code = 0;
  for (int k = 0; k < 9; ++k)
    if (9 * g[at[k]] > sum) code = static_cast<unsigned short>(code | (1 << k));
  return code;
}
}  // namespace

TEST(FaceCensusFast, EqualsTheBitByBitCodeOnOddSizes) {
  std::mt19937 rng(21);
  const int sizes[][2] = {{3, 3}, {3, 4}, {4, 3}, {5, 7}, {17, 3}, {18, 5}, {31, 9}, {33, 21}, {101, 37}, {64, 64}};
  for (auto [w, h] : sizes)
    for (int kind = 0; kind < 3; ++kind) {
      std::vector<unsigned char> g(static_cast<size_t>(w) * h);
      for (size_t i = 0; i < g.size(); ++i)  // noise, few levels (many ties with the mean), ramps
        g[i] = static_cast<unsigned char>(kind == 0 ? rng() : kind == 1 ? rng() % 3 * 40 : (i * 7) % 256);
      std::vector<unsigned short> want(g.size(), 777);
      for (int i = w + 1; i < w * (h - 1) - 1; ++i) want[i] = census_reference(g.data(), w, i);
      for (bool plain : {false, true}) {
        const bool was = px_scalar_only();
        px_set_scalar_only(plain);
        std::vector<unsigned short> got(g.size(), 777);
        image2MCT_FD(g.data(), w, h, got.data());
        px_set_scalar_only(was);
        EXPECT_EQ(got, want) << w << " x " << h << " kind " << kind << " plain " << plain;
      }
      // In bands of rows, cut anywhere: the same codes, the wrap columns too.
      std::vector<unsigned short> banded(g.size(), 777);
      for (int row = 0; row < h;) {
        const int next = row + 1 + static_cast<int>(rng() % 4);
        image2MCT_FD_rows(g.data(), w, h, row, next < h ? next : h, banded.data());
        row = next;
      }
      EXPECT_EQ(banded, want) << w << " x " << h << " kind " << kind << " in bands";
    }
}

TEST(FaceFastPath, DetectorListsEqualThePlainPath) {
  Picture astronaut = read_pgm("astronaut_256.pgm");
  ASSERT_FALSE(astronaut.grey.empty());
  expect_same_detection(astronaut, "astronaut 256", true);
  Picture big = enlarge(astronaut, 640, 640);
  expect_same_detection(big, "astronaut 640", true);
  EXPECT_GE(detect(big, 0, 1, false).found, 1);
  expect_same_detection(enlarge(astronaut, 480, 300), "astronaut 480 x 300");
  Picture tiles = tiled_faces(astronaut, 640, 400);
  expect_same_detection(tiles, "tiled faces");
  EXPECT_GE(detect(tiles, 0, 1, false).found, 2);
  for (unsigned seed = 1; seed <= 3; ++seed) {
    expect_same_detection(random_picture(200 + 37 * seed, 150 + 53 * seed, seed, false), "noise");
    expect_same_detection(random_picture(320 + 41 * seed, 240 + 29 * seed, seed, true), "structured");
  }
  expect_same_detection(random_picture(41, 700, 9, true), "tall and narrow");
}

TEST(FaceFastPath, AnalyserResultsEqualThePlainPath) {
  Picture astronaut = read_pgm("astronaut_256.pgm");
  ASSERT_FALSE(astronaut.grey.empty());
  const Picture pictures[] = {astronaut, enlarge(astronaut, 640, 640), tiled_faces(astronaut, 512, 400),
                              random_picture(300, 220, 5, true)};
  for (const Picture& p : pictures)
    for (int mode : {1, 3}) {
      std::vector<int> fast = analyse(p, mode, false), plain = analyse(p, mode, true);
      ASSERT_FALSE(fast.empty());
      EXPECT_EQ(fast, plain) << p.width << " x " << p.height << " mode " << mode;
    }
  std::vector<int> found = analyse(enlarge(astronaut, 640, 640), 1, false);
  EXPECT_EQ(found[0], 1);  // the astronaut's face
}
