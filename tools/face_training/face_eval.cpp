// Measures the face engine with the shipped tables on held-out data:
//  - composite photos: held-out landmark faces pasted at several sizes into
//    held-out scene photos; recall and false positives at IoU >= 0.3, beside
//    OpenCV's Haar and LBP frontal cascades when their files are installed;
//  - eye and mouth localisation error on held-out landmark faces, as a
//    fraction of the eye distance.
// Usage: face_eval DATA_DIR [OPENCV_DATA_DIR]
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdlib>
#include <cstdio>
#include <opencv2/imgcodecs.hpp>
#include <opencv2/imgproc.hpp>
#include <opencv2/objdetect.hpp>
#include <fstream>
#include <map>
#include <random>
#include <sstream>

#include "common.h"
#include "effect/face/face_engine.h"
#include "effect/face/fd_detector.h"
#include "effect/face/models/face_models.h"
#include "effect/face/sm_image.h"

namespace {
double now() {
  return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

std::vector<int> to_argb(const cv::Mat& bgr) {
  std::vector<int> p(bgr.rows * bgr.cols);
  for (int y = 0; y < bgr.rows; ++y)
    for (int x = 0; x < bgr.cols; ++x) {
      cv::Vec3b v = bgr.at<cv::Vec3b>(y, x);
      p[y * bgr.cols + x] = static_cast<int>(0xFF000000u | v[2] << 16 | v[1] << 8 | v[0]);
    }
  return p;
}

double iou(const cv::Rect2d& a, const cv::Rect2d& b) {
  double in = (a & b).area();
  return in / (a.area() + b.area() - in);
}

// Face sizes (width of the box implied by the eyes) for recall per size.
constexpr int kSizeBins = 4;
const int kSizeEdges[kSizeBins - 1] = {60, 90, 130};
int size_bin(double w) {
  int b = 0;
  while (b < kSizeBins - 1 && w >= kSizeEdges[b]) ++b;
  return b;
}

struct Tally {
  int faces = 0, found = 0, fp = 0;
  int binFaces[kSizeBins] = {}, binFound[kSizeBins] = {};
  double seconds = 0;
  void add(const std::vector<cv::Rect2d>& truth, const std::vector<cv::Rect2d>& det) {
    std::vector<bool> used(det.size());
    faces += truth.size();
    for (const auto& t : truth) {
      int best = -1;
      double bi = 0.3;
      for (size_t k = 0; k < det.size(); ++k)
        if (!used[k] && iou(t, det[k]) >= bi) bi = iou(t, det[k]), best = k;
      ++binFaces[size_bin(t.width)];
      if (best >= 0) used[best] = true, ++found, ++binFound[size_bin(t.width)];
    }
    for (bool u : used) fp += !u;
  }
};

std::vector<cv::Rect2d> run_engine(const cv::Mat& bgr, int mode, FaceEngineInfo* out = nullptr) {
  FaceEngineInfo info{};
  InitFaceBeautyPlus(&info, mode, 20, 1, 16, 3, 0);
  std::vector<int> argb = to_argb(bgr);
  RunFaceAnalyzer(&info, argb.data(), bgr.cols, bgr.rows);
  std::vector<cv::Rect2d> r;
  for (int i = 0; i < info.faceCount; ++i)
    r.emplace_back(info.faceRect[i].x, info.faceRect[i].y, info.faceRect[i].width, info.faceRect[i].height);
  if (out)
    *out = info;
  else
    ReleaseFaceBeautyPlus(&info);
  return r;
}

// enlarge > 1: the photo is first enlarged by that whole factor (nearest
// neighbour, which gives the analyser the very working image it makes of the
// small photo itself), so that the eye and mouth points come back at the
// working resolution instead of truncated to the 80 x 80 photo's pixels.
void landmark_eval(const char* title, const std::vector<LandmarkFace>& test, int enlarge);

std::vector<cv::Rect2d> run_cv(cv::CascadeClassifier& c, const cv::Mat& bgr) {
  cv::Mat g;
  cv::cvtColor(bgr, g, cv::COLOR_BGR2GRAY);
  std::vector<cv::Rect> f;
  c.detectMultiScale(g, f, 1.1, 3, 0, cv::Size(20, 20));
  return std::vector<cv::Rect2d>(f.begin(), f.end());
}

// Whole real photos with annotated face boxes (the usual box: brows to chin,
// cheek to cheek): recall at IoU 0.3 and 0.5, false positives (detections
// matching no face at IoU 0.3), recall by face width at the analyser's
// 640-pixel working size, median IoU of the faces found, and how the found
// boxes sit against the annotated ones. A validation set only: nothing here
// feeds the training.
struct RealTally {
  int faces = 0, found3 = 0, found5 = 0, fp = 0;
  static constexpr int kBins = 5;
  static constexpr int kEdges[kBins - 1] = {30, 45, 60, 100};  // face width at the working size
  int binFaces[kBins] = {}, binFound3[kBins] = {}, binFound5[kBins] = {};
  std::vector<double> ious;                   // IoU of each face found at 0.3
  double widthRatio = 0, dx = 0, dy = 0, heightRatio = 0;  // detected against annotated, over the found faces
  double seconds = 0;
  std::vector<std::string> missed;            // photo and box of faces not found at 0.3
  static int bin(double w) {
    int b = 0;
    while (b < kBins - 1 && w >= kEdges[b]) ++b;
    return b;
  }
  // Greedy matching, each face to its best unused detection at the given IoU.
  static std::vector<int> match(const std::vector<cv::Rect2d>& truth, const std::vector<cv::Rect2d>& det, double at) {
    std::vector<int> m(truth.size(), -1);
    std::vector<bool> used(det.size());
    for (size_t t = 0; t < truth.size(); ++t) {
      double bi = at;
      for (size_t k = 0; k < det.size(); ++k)
        if (!used[k] && iou(truth[t], det[k]) >= bi) bi = iou(truth[t], det[k]), m[t] = k;
      if (m[t] >= 0) used[m[t]] = true;
    }
    return m;
  }
  void add(const std::string& photo, const std::vector<cv::Rect2d>& truth, const std::vector<cv::Rect2d>& det,
           double working) {
    std::vector<int> m3 = match(truth, det, 0.3), m5 = match(truth, det, 0.5);
    std::vector<bool> used(det.size());
    faces += truth.size();
    for (size_t t = 0; t < truth.size(); ++t) {
      const int b = bin(truth[t].width * working);
      ++binFaces[b];
      if (m5[t] >= 0) ++found5, ++binFound5[b];
      if (m3[t] < 0) {
        char buf[128];
        std::snprintf(buf, sizeof buf, "%s %.0f %.0f %.0f %.0f", photo.c_str(), truth[t].x, truth[t].y,
                      truth[t].x + truth[t].width, truth[t].y + truth[t].height);
        missed.push_back(buf);
        continue;
      }
      const cv::Rect2d& d = det[m3[t]];
      used[m3[t]] = true;
      ++found3, ++binFound3[b];
      ious.push_back(iou(truth[t], d));
      widthRatio += d.width / truth[t].width;
      heightRatio += d.height / truth[t].height;
      dx += (d.x + d.width / 2 - truth[t].x - truth[t].width / 2) / truth[t].width;
      dy += (d.y + d.height / 2 - truth[t].y - truth[t].height / 2) / truth[t].width;
    }
    for (bool u : used) fp += !u;
  }
  double median_iou() const {
    if (ious.empty()) return 0;
    std::vector<double> v = ious;
    std::sort(v.begin(), v.end());
    return v[v.size() / 2];
  }
};

std::map<std::string, std::vector<cv::Rect2d>> real_boxes(const std::string& dir) {
  std::map<std::string, std::vector<cv::Rect2d>> boxes;
  std::ifstream in(dir + "/boxes.txt");
  std::string line;
  while (std::getline(in, line)) {
    if (line.empty() || line[0] == '#') continue;
    std::istringstream ss(line);
    std::string photo;
    double l, t, r, b;
    if (ss >> photo >> l >> t >> r >> b) boxes[photo].emplace_back(l, t, r - l, b - t);
  }
  return boxes;
}

// Each real photo with its annotated boxes (green) and the mode 1 faces
// (red, eyes and mouth as small crosses), for looking at.
void draw_real(const std::string& data, const std::string& out) {
  const std::string dir = data + "/real-photo-faces";
  for (const auto& [photo, truth] : real_boxes(dir)) {
    cv::Mat bgr = cv::imread(dir + "/photos/" + photo, cv::IMREAD_COLOR);
    if (bgr.empty()) continue;
    FaceEngineInfo info{};
    run_engine(bgr, 1, &info);
    for (const cv::Rect2d& t : truth) cv::rectangle(bgr, t, cv::Scalar(0, 200, 0), 1);
    for (int i = 0; i < info.faceCount; ++i) {
      const caFaceBox& f = info.faceRect[i];
      cv::rectangle(bgr, cv::Rect(f.x, f.y, f.width, f.height), cv::Scalar(0, 0, 255), 1);
      const caEyePair& e = info.eyePoints[i];
      if (e.x1 >= 0) {
        cv::drawMarker(bgr, cv::Point(e.x1, e.y1), cv::Scalar(255, 200, 0), cv::MARKER_CROSS, 5);
        cv::drawMarker(bgr, cv::Point(e.x2, e.y2), cv::Scalar(255, 200, 0), cv::MARKER_CROSS, 5);
      }
      if (info.mouthRect[i].width > 0)
        cv::drawMarker(bgr, cv::Point(info.mouthCenter[i].x, info.mouthCenter[i].y), cv::Scalar(255, 0, 255),
                       cv::MARKER_CROSS, 5);
    }
    ReleaseFaceBeautyPlus(&info);
    cv::imwrite(out + "/" + photo.substr(0, photo.rfind('.')) + ".png", bgr);
  }
}


// ---- Where the missed real faces are lost (face_eval --diagnose DATA_DIR) ----
// The upright pass replayed step by step with the detector's rules: every
// window of every pyramid level through the cascade (fd_eval_window), the
// hits enrolled into the candidate list (joining the first candidate they
// overlap, the least confident hit giving the box, overlapping candidates
// merged), candidates with three or more hits kept and overlapping faces
// resolved. The replay must give exactly the engine's mode 1 faces on every
// photo; it records where each hit went, so that each face missed at IoU 0.5
// can be put in the first of these classes that applies:
//   no hit: no window passing all four stages has IoU >= 0.5 with it;
//   list full: its hits came after the candidate list had its 20 entries
//     (all of them, or some and a replay with an unbounded list finds it);
//   merged: its hits ended in a candidate of three or more hits whose box
//     lies elsewhere (a neighbouring face, a larger or shifted stray box),
//     or in a face that an overlapping face of lower confidence removed;
//   box off: its hits made a face whose box overlaps it at 0.3 <= IoU < 0.5;
//   too few hits: its hits ended in candidates of fewer than three hits.
// A face the detector finds as its eleventh or later is reported in working
// coordinates (the analyser maps only ten faces back); such faces are
// counted apart.
struct DiagHit {
  SMyRect2 box;  // working-image coordinates
  int conf;
};

struct DiagReplay {
  int limit;
  std::vector<SMyRect2> rect;
  std::vector<int> conf, count, parent;
  std::vector<unsigned char> valid;
  std::vector<int> where;  // candidate of each hit, -1 when the list was full
  int n = 0;
  void enrol(const DiagHit& h) {
    if (n > limit - 1) {
      where.push_back(-1);
      return;
    }
    int joined = -1;
    for (int i = 0; i < n; ++i) {
      if (!valid[i] || !fd_isintersection(rect[i], h.box)) continue;
      count[i] += 1;
      if (conf[i] > h.conf) rect[i] = h.box, conf[i] = h.conf;
      joined = i;
      break;
    }
    if (joined < 0) {
      rect.push_back(h.box), conf.push_back(h.conf), count.push_back(1), valid.push_back(1), parent.push_back(-1);
      joined = n++;
    }
    where.push_back(joined);
    for (int i = 0; i < n; ++i) {
      if (!valid[i]) continue;
      for (int j = i + 1; j < n; ++j) {
        if (!valid[j] || !fd_isintersection(rect[i], rect[j])) continue;
        if (conf[j] < conf[i]) {
          valid[i] = 0, count[j] += count[i], parent[i] = j;
        } else {
          valid[j] = 0, count[i] += count[j], parent[j] = i;
        }
      }
    }
  }
  // The candidate a hit's candidate ended in (following the merges).
  int root(int c) const {
    for (int steps = 0; c >= 0 && parent[c] >= 0 && steps < 64; ++steps) c = parent[c];
    return c;
  }
  // Kept candidates (three hits or more), then overlapping faces resolved as
  // the final step does: the indices of the candidates that end as faces.
  std::vector<int> faces() const {
    std::vector<int> kept;
    for (int i = 0; i < n; ++i)
      if (valid[i] && count[i] >= 3 && static_cast<int>(kept.size()) < kFdListSize) kept.push_back(i);
    std::vector<unsigned char> ok(kept.size(), 1);
    for (size_t i = 0; i < kept.size(); ++i) {
      if (!ok[i]) continue;
      for (size_t j = i + 1; j < kept.size(); ++j) {
        if (!ok[j] || !fd_isintersection(rect[kept[i]], rect[kept[j]])) continue;
        if (conf[kept[i]] > conf[kept[j]])
          ok[i] = 0;
        else
          ok[j] = 0;
      }
    }
    std::vector<int> out;
    for (size_t i = 0; i < kept.size(); ++i)
      if (ok[i]) out.push_back(kept[i]);
    return out;
  }
};

void diagnose_real(const std::string& data) {
  const std::string dir = data + "/real-photo-faces";
  std::map<std::string, std::vector<cv::Rect2d>> boxes = real_boxes(dir);
  for (const std::string& p : list_images(dir + "/photos")) boxes[p.substr(dir.size() + 8)];
  enum { kNoHit, kListFull, kMerged, kBoxOff, kTooFew, kUnmapped, kClasses };
  const char* names[kClasses] = {"no window passes the cascade at IoU >= 0.5",
                                 "dropped: the candidate list already had its 20 entries",
                                 "merged into a neighbouring candidate or face",
                                 "found, but the box has IoU < 0.5",
                                 "passes, but fewer than three hits in its candidate",
                                 "found, but after the tenth face: left in working coordinates"};
  int cls[kClasses] = {}, clsBin[kClasses][RealTally::kBins] = {};
  int faces = 0, found = 0, agree = 0, photos = 0;
  int noHitNear3 = 0, noHitLast = 0;  // no-hit faces with a hit at IoU >= 0.3; with a window reaching the last stage
  int tooFewHits[4] = {};             // too-few faces by their windows passing at IoU >= 0.5: 1, 2, 3, more
  int tooFewSplit = 0;                // too-few faces whose hits fell into more than one candidate
  int unboundedFound = 0;
  std::vector<double> lastMargins;  // no-hit faces: least last-stage sum near them over the threshold, minus 1
  std::map<std::string, int> perPhoto;
  std::map<std::string, std::string> perPhotoClass;  // one letter per missed face
  for (const auto& [photo, truth] : boxes) {
    cv::Mat bgr = cv::imread(dir + "/photos/" + photo, cv::IMREAD_COLOR);
    if (bgr.empty()) continue;
    ++photos;
    std::vector<int> argb = to_argb(bgr);
    int ww, wh;
    caIF_WorkingSize(bgr.cols, bgr.rows, &ww, &wh);
    const int64_t k = (static_cast<int64_t>(bgr.cols) << 15) / ww;
    std::vector<unsigned char> grey(static_cast<size_t>(ww) * wh);
    Resize_NN_Color2Gray(argb.data(), bgr.cols, bgr.rows, grey.data(), ww, wh);
    auto to_photo = [k](const SMyRect2& r) {
      auto m = [k](int v) { return static_cast<double>(static_cast<int32_t>((v * k) >> 15)); };
      return cv::Rect2d(m(r.left), m(r.top), m(r.right - r.left), m(r.bottom - r.top));
    };
    // Every window of every level, in the scan's order.
    std::vector<DiagHit> hits;
    std::vector<cv::Rect2d> lastStage;  // windows reaching the last stage (photo coordinates)
    std::vector<int> lastSum;           // and their last-stage sums
    const int longer = std::max(ww, wh), shorter = std::min(ww, wh);
    const int r = static_cast<int>((static_cast<int64_t>(shorter) << 15) / longer);
    for (int lev = 0; lev < fd_pyramid_count(1); ++lev) {
      const int s = kFdPyramid[lev];
      if (s > longer) break;
      int other = ww == wh ? s : static_cast<int>((static_cast<int64_t>(s) * r) >> 15);
      other = std::max(other, 4);
      const int lw = ww >= wh ? s : other, lh = ww >= wh ? other : s;
      std::vector<unsigned char> level(static_cast<size_t>(lw) * lh);
      const unsigned char* img = grey.data();
      if (lw != ww || lh != wh) {
        Resize_NN(grey.data(), ww, wh, level.data(), lw, lh);
        img = level.data();
      }
      std::vector<unsigned short> mct(static_cast<size_t>(lw) * lh, 0);
      image2MCT_FD(img, lw, lh, mct.data());
      if (lh <= kFdWindowH || lw <= kFdWindowW) continue;
      const int64_t scale = (static_cast<int64_t>(ww) << 15) / lw;
      for (int y = 0; y < lh - kFdWindowH; y += 2)
        for (int x = 0; x < lw - kFdWindowW; ++x) {
          int sum = 0;
          const int passed = fd_eval_window(mct.data(), lw, x, y, &sum);
          if (passed < kFdStageCount - 1) continue;
          const int bx = static_cast<int>((x * scale) >> 15), by = static_cast<int>((y * scale) >> 15);
          SMyRect2 box{bx, by, bx + static_cast<int>((kFdWindowW * scale) >> 15),
                       by + static_cast<int>((kFdWindowH * scale) >> 15)};
          if (passed == kFdStageCount)
            hits.push_back({box, sum / 2});
          else
            lastStage.push_back(to_photo(box)), lastSum.push_back(sum);
        }
    }
    DiagReplay bounded{kFdListSize, {}, {}, {}, {}, {}, {}}, unbounded{1 << 30, {}, {}, {}, {}, {}, {}};
    for (const DiagHit& h : hits) bounded.enrol(h), unbounded.enrol(h);
    std::vector<int> finals = bounded.faces(), finalsU = unbounded.faces();
    std::vector<cv::Rect2d> replayed, replayedU;
    // The analyser maps only its first ten faces back to photo coordinates;
    // the later ones keep working coordinates (a rule of the analyser).
    std::vector<cv::Rect2d> mapped;
    for (int c : finals) {
      const SMyRect2& q = bounded.rect[c];
      mapped.push_back(to_photo(q));
      replayed.push_back(replayed.size() < 10 ? to_photo(q) : cv::Rect2d(q.left, q.top, q.right - q.left, q.bottom - q.top));
    }
    for (int c : finalsU) replayedU.push_back(to_photo(unbounded.rect[c]));
    // The replay against the engine itself.
    std::vector<cv::Rect2d> engine = run_engine(bgr, 1);
    bool same = engine.size() == replayed.size();
    for (size_t i = 0; same && i < engine.size(); ++i) same = engine[i] == replayed[i];
    agree += same;
    if (!same) {
      std::printf("  replay differs from the engine on %s (%zu against %zu faces)\n", photo.c_str(), replayed.size(), engine.size());
      for (size_t i = 0; i < std::max(engine.size(), replayed.size()); ++i) {
        if (i < replayed.size()) std::printf("   replay %.0f %.0f %.0f %.0f", replayed[i].x, replayed[i].y, replayed[i].width, replayed[i].height);
        if (i < engine.size()) std::printf("   engine %.0f %.0f %.0f %.0f", engine[i].x, engine[i].y, engine[i].width, engine[i].height);
        std::printf("\n");
      }
    }
    std::vector<int> m5 = RealTally::match(truth, engine, 0.5), m5u = RealTally::match(truth, replayedU, 0.5);
    std::vector<int> m5m = RealTally::match(truth, mapped, 0.5);
    std::vector<cv::Rect2d> hitPhoto;
    for (const DiagHit& h : hits) hitPhoto.push_back(to_photo(h.box));
    for (size_t t = 0; t < truth.size(); ++t) {
      ++faces;
      if (m5[t] >= 0) {
        ++found;
        continue;
      }
      const double working = 640.0 / std::max(bgr.cols, bgr.rows);
      const int b = RealTally::bin(truth[t].width * working);
      std::vector<size_t> near;
      bool near3 = false;
      for (size_t h = 0; h < hits.size(); ++h) {
        const double v = iou(truth[t], hitPhoto[h]);
        if (v >= 0.5) near.push_back(h);
        near3 |= v >= 0.3;
      }
      int c = kTooFew;
      if (m5m[t] >= 0) {
        c = kUnmapped;
      } else if (near.empty()) {
        c = kNoHit;
        noHitNear3 += near3;
        int best = -1;
        for (size_t w = 0; w < lastStage.size(); ++w)
          if (iou(truth[t], lastStage[w]) >= 0.5 && (best < 0 || lastSum[w] < best)) best = lastSum[w];
        noHitLast += best >= 0;
        if (best >= 0) lastMargins.push_back(double(best) / kFdStageThresholds[kFdStageCount - 1] - 1);
      } else {
        int dropped = 0;
        std::vector<int> roots;
        for (size_t h : near) {
          if (bounded.where[h] < 0) {
            ++dropped;
            continue;
          }
          const int rt = bounded.root(bounded.where[h]);
          if (std::find(roots.begin(), roots.end(), rt) == roots.end()) roots.push_back(rt);
        }
        if (dropped == static_cast<int>(near.size()) || (dropped > 0 && m5u[t] >= 0)) {
          c = kListFull;
        } else {
          bool boxOff = false, merged = false;
          for (int rt : roots) {
            const bool isFace = std::find(finals.begin(), finals.end(), rt) != finals.end();
            if (isFace && iou(truth[t], to_photo(bounded.rect[rt])) >= 0.3)
              boxOff = true;
            else if (bounded.count[rt] >= 3)
              merged = true;
          }
          c = boxOff ? kBoxOff : merged ? kMerged : kTooFew;
          if (c == kTooFew) {
            ++tooFewHits[std::min<size_t>(near.size(), 4) - 1];
            tooFewSplit += roots.size() > 1;
          }
        }
      }
      unboundedFound += m5u[t] >= 0;
      ++cls[c], ++clsBin[c][b];
      ++perPhoto[photo];
      perPhotoClass[photo] += "nlmbtw"[c];
    }
  }
  std::printf("Where the faces missed at IoU 0.5 are lost (mode 1, upright pass replayed; replay equal to the engine on "
              "%d of %d photos)\n",
              agree, photos);
  std::printf("%d faces, %d found at IoU 0.5, %d missed\n", faces, found, faces - found);
  std::printf("| lost at | faces | by width <30 / 30-45 / 45-60 / 60-100 / >=100 |\n|---|---|---|\n");
  for (int c = 0; c < kClasses; ++c) {
    std::printf("| %s | %d |", names[c], cls[c]);
    for (int b = 0; b < RealTally::kBins; ++b) std::printf("%s%d", b ? " / " : " ", clsBin[c][b]);
    std::printf(" |\n");
  }
  std::printf("no window: %d of them have a hit at IoU >= 0.3, %d a window reaching the last stage at IoU >= 0.5\n",
              noHitNear3, noHitLast);
  std::sort(lastMargins.begin(), lastMargins.end());
  if (!lastMargins.empty()) {
    std::printf("no window: their least last-stage sum at IoU >= 0.5 exceeds the threshold by (quartiles)");
    for (int q = 0; q <= 4; ++q) std::printf(" %.3f", lastMargins[std::min(lastMargins.size() - 1, q * lastMargins.size() / 4)]);
    std::printf(" of it\n");
  }
  std::printf("too few hits: windows passing at IoU >= 0.5: 1: %d, 2: %d, 3: %d, 4 or more: %d; hits split over more "
              "than one candidate: %d\n",
              tooFewHits[0], tooFewHits[1], tooFewHits[2], tooFewHits[3], tooFewSplit);
  std::printf("missed faces an unbounded candidate list would find: %d\n", unboundedFound);
  std::printf("missed faces by photo (n no window, l list, m merged, b box, t too few, w working coordinates):");
  for (const auto& [p, n] : perPhoto) std::printf(" %s %d %s;", p.c_str(), n, perPhotoClass[p].c_str());
  std::printf("\n");
}

void real_eval(const std::string& data, const std::string& cvdir) {
  const std::string dir = data + "/real-photo-faces";
  std::map<std::string, std::vector<cv::Rect2d>> boxes = real_boxes(dir);
  if (boxes.empty()) {
    std::printf("no %s/boxes.txt: real photos not measured\n", dir.c_str());
    return;
  }
  // Photos without faces are listed too when they exist (none annotated).
  for (const std::string& p : list_images(dir + "/photos")) boxes[p.substr(dir.size() + 8)];
  struct Det {
    const char* name;
    int mode;  // engine mode, or 0 for an OpenCV cascade
    cv::CascadeClassifier cascade;
    RealTally tally;
  };
  std::vector<Det> dets;
  dets.push_back({"engine, upright (mode 1)", 1, {}, {}});
  dets.push_back({"engine, upright and +-45 (mode 3)", 3, {}, {}});
  for (const char* c : {"haarcascades/haarcascade_frontalface_default.xml", "haarcascades/haarcascade_frontalface_alt2.xml",
                        "lbpcascades/lbpcascade_frontalface.xml"}) {
    Det d{c, 0, {}, {}};
    if (std::getenv("FACE_EVAL_NO_CV") || !d.cascade.load(cvdir + "/" + c)) continue;
    dets.push_back(std::move(d));
  }
  int photos = 0;
  // FACE_EVAL_REAL_LIST=1: every missed face and every false positive of mode 1.
  const bool list = std::getenv("FACE_EVAL_REAL_LIST") != nullptr;
  for (const auto& [photo, truth] : boxes) {
    cv::Mat bgr = cv::imread(dir + "/photos/" + photo, cv::IMREAD_COLOR);
    if (bgr.empty()) continue;
    ++photos;
    const double working = 640.0 / std::max(bgr.cols, bgr.rows);
    for (Det& d : dets) {
      const double t0 = now();
      std::vector<cv::Rect2d> found = d.mode ? run_engine(bgr, d.mode) : run_cv(d.cascade, bgr);
      d.tally.seconds += now() - t0;
      const int fp0 = d.tally.fp;
      d.tally.add(photo, truth, found, working);
      if (list && d.mode == 1 && d.tally.fp > fp0) std::printf("  false positives in %s: %d\n", photo.c_str(), d.tally.fp - fp0);
    }
  }
  std::printf("Real photos: %d photos, %d annotated faces (validation set; OpenCV detectMultiScale(grey, 1.1, 3, 0, "
              "20 x 20) on the photo as it is)\n",
              photos, dets.empty() ? 0 : dets[0].tally.faces);
  std::printf("| detector | recall IoU>=0.3 | recall IoU>=0.5 | false positives | median IoU | ms per photo | found at "
              "0.3 (0.5) by face width at 640: <30 / 30-45 / 45-60 / 60-100 / >=100 |\n|---|---|---|---|---|---|---|\n");
  for (const Det& d : dets) {
    const RealTally& t = d.tally;
    std::printf("| %s | %.3f (%d) | %.3f (%d) | %d | %.3f | %.1f |", d.name, double(t.found3) / std::max(1, t.faces),
                t.found3, double(t.found5) / std::max(1, t.faces), t.found5, t.fp, t.median_iou(),
                1000 * t.seconds / std::max(1, photos));
    for (int b = 0; b < RealTally::kBins; ++b)
      std::printf("%s%d (%d) / %d", b ? ", " : " ", t.binFound3[b], t.binFound5[b], t.binFaces[b]);
    std::printf(" |\n");
  }
  std::printf("found boxes against the annotated ones (mean over faces found at 0.3): width, height ratio; centre "
              "offset in annotated widths\n");
  for (const Det& d : dets) {
    const RealTally& t = d.tally;
    const int n = std::max(1, t.found3);
    std::printf("  %s: %.3f, %.3f; (%.3f, %.3f)\n", d.name, t.widthRatio / n, t.heightRatio / n, t.dx / n, t.dy / n);
  }
  if (list)
    for (const std::string& m : dets[0].tally.missed) std::printf("  missed by mode 1: %s\n", m.c_str());
}
}  // namespace

int main(int argc, char** argv) {
  if (argc == 5 && std::string(argv[1]) == "--pgm") {  // face_eval --pgm IN OUT LONGER_SIDE: test pictures
    cv::Mat g = load_grey(argv[2]);
    double k = std::atof(argv[4]) / std::max(g.cols, g.rows);
    cv::resize(g, g, cv::Size(), k, k, cv::INTER_AREA);
    return cv::imwrite(argv[3], g) ? 0 : 1;
  }
  if (argc == 4 && std::string(argv[1]) == "--draw") {  // face_eval --draw DATA_DIR OUT_DIR: the real photos with boxes
    draw_real(argv[2], argv[3]);
    return 0;
  }
  if (argc == 3 && std::string(argv[1]) == "--diagnose") {  // face_eval --diagnose DATA_DIR: where missed faces are lost
    diagnose_real(argv[2]);
    return 0;
  }
  if (argc < 2) {
    std::fprintf(stderr, "usage: face_eval DATA_DIR [OPENCV_DATA_DIR]\n");
    return 2;
  }
  const std::string data = argv[1];
  const std::string cvdir = argc > 2 ? argv[2] : "/usr/share/opencv4";
  std::mt19937 rng(7);
  // FACE_EVAL_LABELS=dlib: the eyes and mouths are measured against the
  // points of face_relabel instead of the MTFL annotation.
  const std::string labels = std::getenv("FACE_EVAL_LABELS") ? std::getenv("FACE_EVAL_LABELS") : "";
  std::vector<LandmarkFace> test = load_landmarks(data, "new_testing");
  std::vector<LandmarkFace> testLabels = labels.empty() ? test : load_landmarks(data, "new_testing", labels);
  std::vector<LandmarkFace> heldTrain = load_landmarks(data, "new_training", labels);
  {
    std::vector<LandmarkFace> held;
    split_held_out(heldTrain, &held);
    heldTrain.swap(held);
  }
  // Held-out scene photos and wallpapers (when extracted).
  std::vector<std::string> scenes, all = list_images(data + "/images_notfaces");
  for (size_t i = 0; i < all.size(); ++i)
    if (is_held_out_scene(i)) scenes.push_back(all[i]);
  const size_t sceneCount = scenes.size();
  all = list_images(data + "/wallpapers");
  for (size_t i = 0; i < all.size(); ++i)
    if (is_held_out_scene(i)) scenes.push_back(all[i]);
  cv::CascadeClassifier haar, lbp;
  // FACE_EVAL_QUICK=1: composites with the upright engine only (for training experiments).
  const bool quick = std::getenv("FACE_EVAL_QUICK") != nullptr;
  bool haveCv = !quick && haar.load(cvdir + "/haarcascades/haarcascade_frontalface_default.xml") &&
                lbp.load(cvdir + "/lbpcascades/lbpcascade_frontalface_improved.xml");

  // FACE_EVAL_REAL_ONLY=1: only the real photos.
  if (!std::getenv("FACE_EVAL_LANDMARKS_ONLY")) real_eval(data, cvdir);
  if (std::getenv("FACE_EVAL_REAL_ONLY")) return 0;
  // Composite photos from the held-out scenes (every fifth) and faces.
  Tally eng, engRot, th, tl, sceneOnly, haarOnly, lbpOnly;
  size_t next = 0;
  int photos = 0;
  for (size_t i = 0; i < scenes.size() && !std::getenv("FACE_EVAL_LANDMARKS_ONLY"); ++i) {
    cv::Mat scene = cv::imread(scenes[i], cv::IMREAD_COLOR);
    if (scene.empty()) continue;
    double k = 640.0 / std::max(scene.cols, scene.rows);
    cv::resize(scene, scene, cv::Size(), k, k, cv::INTER_AREA);
    sceneOnly.add({}, run_engine(scene, 1));
    if (haveCv) haarOnly.add({}, run_cv(haar, scene)), lbpOnly.add({}, run_cv(lbp, scene));
    std::vector<cv::Rect2d> truth;
    std::vector<cv::Rect> placed;
    for (int n = 0; n < 3 && next < test.size(); ++n) {
      const LandmarkFace& f = test[next++];
      cv::Mat face = cv::imread(f.path, cv::IMREAD_COLOR);
      if (face.empty()) continue;
      int size = 60 + static_cast<int>(rng() % 140);
      if (size >= std::min(scene.cols, scene.rows)) continue;
      double s = double(size) / face.cols;
      cv::Mat fs;
      cv::resize(face, fs, cv::Size(size, size), 0, 0, cv::INTER_AREA);
      cv::Rect at;
      bool ok = false;
      for (int tries = 0; tries < 50 && !ok; ++tries) {
        at = cv::Rect(rng() % (scene.cols - size), rng() % (scene.rows - size), size, size);
        ok = true;
        for (const auto& p : placed) ok &= (p & at).area() == 0;
      }
      if (!ok) continue;
      placed.push_back(at);
      fs.copyTo(scene(at));
      cv::Rect2d fb = face_box_from_eyes(f.x[0] * s, f.y[0] * s, f.x[1] * s, f.y[1] * s);
      truth.emplace_back(fb.x + at.x, fb.y + at.y, fb.width, fb.height);
    }
    ++photos;
    double t0 = now();
    eng.add(truth, run_engine(scene, 1));
    eng.seconds += now() - t0;
    if (!quick || std::getenv("FACE_EVAL_ROT")) {
      t0 = now();
      engRot.add(truth, run_engine(scene, 3));
      engRot.seconds += now() - t0;
    }
    if (haveCv) {
      t0 = now();
      th.add(truth, run_cv(haar, scene));
      th.seconds += now() - t0;
      t0 = now();
      tl.add(truth, run_cv(lbp, scene));
      tl.seconds += now() - t0;
    }
  }
  std::printf("Composite photos: %d (%zu held-out scenes and %zu held-out wallpapers, longer side 640, held-out faces "
              "60..200 px)\n",
              photos, sceneCount, scenes.size() - sceneCount);
  std::printf("| detector | faces | found | recall | false positives | ms per photo | recall by box width <60 / 60-90 / "
              "90-130 / >=130 |\n|---|---|---|---|---|---|---|\n");
  auto row = [&](const char* name, const Tally& t) {
    std::printf("| %s | %d | %d | %.3f | %d | %.1f |", name, t.faces, t.found, t.faces ? double(t.found) / t.faces : 0.0,
                t.fp, 1000 * t.seconds / std::max(1, photos));
    for (int b = 0; b < kSizeBins; ++b)
      std::printf("%s%d/%d", b ? " / " : " ", t.binFound[b], t.binFaces[b]);
    std::printf(" |\n");
  };
  row("engine, upright (mode 1)", eng);
  row("engine, upright and +-45 (mode 3)", engRot);
  if (haveCv) {
    row("OpenCV haarcascade_frontalface_default", th);
    row("OpenCV lbpcascade_frontalface_improved", tl);
  }
  std::printf("False positives on the %d held-out scenes alone: engine (mode 1) %d, Haar %d, LBP %d\n", photos,
              sceneOnly.fp, haarOnly.fp, lbpOnly.fp);
  if (quick) return 0;
  if (!labels.empty()) std::printf("\neyes and mouths against the %s points\n", labels.c_str());
  for (int enlarge : {1, 8}) {
    if (enlarge == 1 && std::getenv("FACE_EVAL_ENLARGED_ONLY")) continue;
    std::printf("\n== landmark photos %s ==\n", enlarge == 1 ? "as they are (80 x 80): points truncated to whole photo pixels"
                                                             : "enlarged to 640 x 640 (the same working image)");
    landmark_eval("held-out MTFL test faces (AFLW)", testLabels, enlarge);
    landmark_eval("held-out training-list faces (LFW, net_7876: every tenth)", heldTrain, enlarge);
  }
  return 0;
}

namespace {
void landmark_eval(const char* title, const std::vector<LandmarkFace>& test0, int enlarge) {
  // Landmarks in the enlarged photo: pixel centres at whole coordinates.
  std::vector<LandmarkFace> test = test0;
  for (LandmarkFace& f : test)
    for (int j = 0; j < 5; ++j) f.x[j] = f.x[j] * enlarge + (enlarge - 1) / 2.0f, f.y[j] = f.y[j] * enlarge + (enlarge - 1) / 2.0f;

  // Eyes and mouth on held-out landmark faces (photo 80 x 80, analysed whole).
  int n = 0, faceFound = 0, eyesFound = 0, eyesWithin = 0, mouthFound = 0, mouthWithin = 0;
  std::vector<double> worse;
  double sd[4] = {}, e1 = 0, e2 = 0;
  double eyeErr = 0, mouthErr = 0, boxScale = 0, boxDx = 0, boxDy = 0;
  for (size_t i = 0; i < test.size(); ++i) {
    const LandmarkFace& f = test[i];
    cv::Mat img = cv::imread(f.path, cv::IMREAD_COLOR);
    if (img.empty()) continue;
    if (enlarge > 1) cv::resize(img, img, cv::Size(), enlarge, enlarge, cv::INTER_NEAREST);
    ++n;
    FaceEngineInfo info{};
    run_engine(img, 1, &info);
    double d = std::hypot(f.x[1] - f.x[0], f.y[1] - f.y[0]);
    cv::Rect2d truth = face_box_from_eyes(f.x[0], f.y[0], f.x[1], f.y[1]);
    int best = -1;
    double bi = 0.3;
    for (int k = 0; k < info.faceCount; ++k) {
      cv::Rect2d r(info.faceRect[k].x, info.faceRect[k].y, info.faceRect[k].width, info.faceRect[k].height);
      if (iou(truth, r) >= bi) bi = iou(truth, r), best = k;
    }
    if (best >= 0) {
      ++faceFound;
      const caFaceBox& fb = info.faceRect[best];
      boxScale += fb.width / truth.width;
      boxDx += (fb.x + fb.width / 2.0 - truth.x - truth.width / 2) / truth.width;
      boxDy += (fb.y + fb.height / 2.0 - truth.y - truth.height / 2) / truth.width;
      const caEyePair& e = info.eyePoints[best];
      if (e.x1 >= 0 && e.x2 >= 0) {
        ++eyesFound;
        double err = std::max(std::hypot(e.x1 - f.x[0], e.y1 - f.y[0]), std::hypot(e.x2 - f.x[1], e.y2 - f.y[1])) / d;
        eyeErr += err;
        sd[0] += (e.x1 - f.x[0]) / d, sd[1] += (e.y1 - f.y[0]) / d, sd[2] += (e.x2 - f.x[1]) / d, sd[3] += (e.y2 - f.y[1]) / d;
        e1 += std::hypot(e.x1 - f.x[0], e.y1 - f.y[0]) / d, e2 += std::hypot(e.x2 - f.x[1], e.y2 - f.y[1]) / d;
        eyesWithin += err <= 0.1;
        worse.push_back(err);
        const SMyPoint2& m = info.mouthCenter[best];
        if (info.mouthRect[best].width > 0) {
          ++mouthFound;
          double me = std::hypot(m.x - (f.x[3] + f.x[4]) / 2, m.y - (f.y[3] + f.y[4]) / 2) / d;
          mouthErr += me;
          mouthWithin += me <= 0.2;
        }
      }
    }
    ReleaseFaceBeautyPlus(&info);
  }
  std::printf("\n%s: %d; face found %d (%.3f)\n", title, n, faceFound, double(faceFound) / std::max(1, n));
  std::printf("detected box against the landmark box: width ratio %.3f, centre offset (%.3f, %.3f) widths\n",
              boxScale / std::max(1, faceFound), boxDx / std::max(1, faceFound), boxDy / std::max(1, faceFound));
  std::printf("eyes found in %d of the found faces (%.3f); worse eye error: mean %.4f of the eye distance, "
              "%d (%.3f) within 0.10\n",
              eyesFound, double(eyesFound) / std::max(1, faceFound), eyeErr / std::max(1, eyesFound), eyesWithin,
              double(eyesWithin) / std::max(1, eyesFound));
  std::sort(worse.begin(), worse.end());
  if (!worse.empty())
    std::printf("worse eye error median %.3f, 90th percentile %.3f\n", worse[worse.size() / 2], worse[worse.size() * 9 / 10]);
  std::printf("signed mean eye offsets (eye distances): first (%.3f, %.3f), second (%.3f, %.3f); mean error first %.3f, "
              "second %.3f\n",
              sd[0] / std::max(1, eyesFound), sd[1] / std::max(1, eyesFound), sd[2] / std::max(1, eyesFound),
              sd[3] / std::max(1, eyesFound), e1 / std::max(1, eyesFound), e2 / std::max(1, eyesFound));
  std::printf("mouth found in %d faces with eyes; centre error mean %.4f of the eye distance, %d (%.3f) within 0.20\n",
              mouthFound, mouthErr / std::max(1, mouthFound), mouthWithin, double(mouthWithin) / std::max(1, mouthFound));
}
}  // namespace
