// Trains the face, eye and mouth cascades: boosted 511-entry look-up tables
// over census codes, cut from the pictures exactly as the detectors see them
// at run time, with hard negatives mined by the stages trained so far.
// Writes jni/effect/face/models/*_model.inc (data compiled in by face_models.cpp). Usage: face_train DATA_DIR OUT_DIR
#include <algorithm>
#include <chrono>
#include <climits>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "common.h"
#include "effect/face/ed_md_detector.h"
#include "effect/face/face_engine.h"
#include "effect/face/fd_detector.h"
#include "effect/face/sm_image.h"

namespace {
std::mt19937 rng(20240611);
double uni(double a, double b) { return std::uniform_real_distribution<double>(a, b)(rng); }

// Training knobs, overridable from the environment for experiments
// (FACE_KEEP="a,b,c,d", FACE_SCALE="lo,hi", ...); the defaults are the
// settings of the shipped tables.
std::vector<double> env_list(const char* name, std::vector<double> def) {
  const char* v = std::getenv(name);
  if (!v || !*v) return def;
  std::vector<double> out;
  for (const char* p = v; *p;) {
    char* end;
    out.push_back(std::strtod(p, &end));
    if (end == p) break;
    p = *end == ',' ? end + 1 : end;
  }
  return out.size() == def.size() ? out : def;
}
double env_num(const char* name, double def) { return env_list(name, {def})[0]; }

double now() {
  return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

// A detector's window geometry and stage layout.
struct Spec {
  const char* name;
  int ww, wh;                  // window
  std::vector<int> px, py;     // candidate feature positions inside the window
  std::vector<int> features;   // per stage
  std::vector<int> thresholds; // per stage
  int cap;                     // largest table value (255 for bytes)
  std::vector<double> keep;    // share of positive windows each stage keeps
  double eps = 0.5;            // table smoothing: weight eps / N added to both classes in every bin
  double lastNegFactor = 1;    // the last stage mines this many times more negatives
  // Signed tables (eyes, mouth): the scale of the last stage's values. Its sum
  // is also the hits' confidence, sum * 256 / 17408 in whole numbers, so a
  // larger scale ranks neighbouring windows more finely; 0 keeps the byte-like
  // scale of the other stages.
  double lastScale = 0;
  int lastRounds = 0;          // bootstrapping rounds of the last stage
};

struct Stage {
  std::vector<int> pos;          // position index per feature
  std::vector<int32_t> table;    // features x 511
  int threshold;
};

// Samples: codes at every candidate position, one row per sample.
struct Samples {
  int P = 0;
  std::vector<uint16_t> codes;
  size_t size() const { return P ? codes.size() / P : 0; }
  const uint16_t* row(size_t i) const { return codes.data() + i * P; }
};

void add_window(Samples& s, const Spec& sp, const uint16_t* mct, int lw, int x, int y) {
  for (size_t p = 0; p < sp.px.size(); ++p) s.codes.push_back(mct[(y + sp.py[p]) * lw + x + sp.px[p]]);
}

// Stage sums of a sample row (positions indexed) or a window in a level.
int stage_sum_row(const Stage& st, const uint16_t* row) {
  int sum = 0;
  for (size_t f = 0; f < st.pos.size(); ++f) sum += st.table[f * 511 + row[st.pos[f]]];
  return sum;
}

bool cascade_row(const std::vector<Stage>& c, const uint16_t* row) {
  for (const Stage& st : c)
    if (stage_sum_row(st, row) > st.threshold) return false;
  return true;
}

bool cascade_window(const std::vector<Stage>& c, const Spec& sp, const uint16_t* mct, int lw, int x, int y) {
  for (const Stage& st : c) {
    int sum = 0;
    for (size_t f = 0; f < st.pos.size(); ++f) {
      int p = st.pos[f];
      sum += st.table[f * 511 + mct[(y + sp.py[p]) * lw + x + sp.px[p]]];
    }
    if (sum > st.threshold) return false;
  }
  return true;
}

// Real AdaBoost over per-position look-up tables; returns the stage in
// real-valued form (h per code), then quantised so that "sum <= threshold"
// keeps the wanted share of the calibration positives (windows of faces the
// boosting never saw: the keep rate measured on the training windows
// themselves is far too optimistic for a 440-table stage).
struct RawStage {
  std::vector<int> chosen;               // position index per feature
  std::vector<std::vector<double>> hs;   // real-valued table per feature
};
Stage quantise(const Spec& sp, int stageIndex, const RawStage& raw, const Samples& cal, double keep);

RawStage train_raw(const Spec& sp, int stageIndex, const Samples& pos, const Samples& neg) {
  const int P = sp.px.size(), n = sp.features[stageIndex];
  const size_t np = pos.size(), nn = neg.size(), N = np + nn;
  // Column-major copy for histogramming.
  std::vector<uint16_t> col(static_cast<size_t>(P) * N);
  for (size_t i = 0; i < np; ++i)
    for (int p = 0; p < P; ++p) col[p * N + i] = pos.row(i)[p];
  for (size_t i = 0; i < nn; ++i)
    for (int p = 0; p < P; ++p) col[p * N + np + i] = neg.row(i)[p];
  std::vector<double> w(N);
  for (size_t i = 0; i < N; ++i) w[i] = i < np ? 0.5 / np : 0.5 / nn;
  const double eps = sp.eps / N, clip = 3.0;
  std::vector<int> chosen;
  std::vector<std::vector<double>> hs;
  std::vector<double> Wp(511), Wn(511);
  for (int r = 0; r < n; ++r) {
    double bestZ = 1e300;
    int best = 0;
    for (int p = 0; p < P; ++p) {
      std::fill(Wp.begin(), Wp.end(), 0.0);
      std::fill(Wn.begin(), Wn.end(), 0.0);
      const uint16_t* c = &col[p * N];
      for (size_t i = 0; i < np; ++i) Wp[c[i]] += w[i];
      for (size_t i = np; i < N; ++i) Wn[c[i]] += w[i];
      double z = 0;
      for (int k = 0; k < 511; ++k) z += std::sqrt(Wp[k] * Wn[k]);
      if (z < bestZ) bestZ = z, best = p;
    }
    std::fill(Wp.begin(), Wp.end(), 0.0);
    std::fill(Wn.begin(), Wn.end(), 0.0);
    const uint16_t* c = &col[best * N];
    for (size_t i = 0; i < np; ++i) Wp[c[i]] += w[i];
    for (size_t i = np; i < N; ++i) Wn[c[i]] += w[i];
    std::vector<double> h(511);
    for (int k = 0; k < 511; ++k) h[k] = std::clamp(0.5 * std::log((Wp[k] + eps) / (Wn[k] + eps)), -clip, clip);
    double total = 0;
    for (size_t i = 0; i < N; ++i) {
      w[i] *= std::exp((i < np ? -1 : 1) * h[c[i]]);
      total += w[i];
    }
    for (double& v : w) v /= total;
    chosen.push_back(best);
    hs.push_back(h);
  }
  return RawStage{chosen, hs};
}

// Signed last stage at a fine scale: values s * (max h - h) with s chosen so
// that every possible sum stays within +-2^31 / 256 (the confidence is
// computed as sum * 256 in 32 bits), then the whole stage shifted (values may
// go negative) so that "sum <= T" keeps the wanted share of the calibration
// windows.
Stage quantise_fine(const Spec& sp, const RawStage& raw, const Samples& cal, double keep, int T,
                    const std::vector<double>& hmax) {
  const int n = static_cast<int>(raw.chosen.size());
  double span = 0;  // largest possible sum of s = 1
  for (int f = 0; f < n; ++f) span += hmax[f] - *std::min_element(raw.hs[f].begin(), raw.hs[f].end());
  const double limit = (2147483647.0 / 256) * 0.45;  // room for the shift on either side
  const double s = std::min(sp.lastScale, limit / std::max(1e-6, span));
  Stage st;
  st.pos = raw.chosen;
  st.table.assign(static_cast<size_t>(n) * 511, 0);
  for (int f = 0; f < n; ++f)
    for (int k = 0; k < 511; ++k) st.table[f * 511 + k] = static_cast<int32_t>(std::lround(s * (hmax[f] - raw.hs[f][k])));
  const size_t nc = cal.size();
  std::vector<int> S(nc);
  for (size_t i = 0; i < nc; ++i) S[i] = stage_sum_row(st, cal.row(i));
  std::sort(S.begin(), S.end());
  const int V = S[std::min(nc - 1, static_cast<size_t>(std::ceil(keep * nc)) - 1)];
  const int shift = T - V;  // may be negative: the values are signed
  for (int k = 0; k < 511; ++k) st.table[k] += shift;  // on the first feature: every sum moves by the shift
  st.threshold = T;
  std::fprintf(stderr, "%s last stage: scale %.1f, shift %d\n", sp.name, s, shift);
  return st;
}

Stage quantise(const Spec& sp, int stageIndex, const RawStage& raw, const Samples& cal, double keep) {
  const std::vector<int>& chosen = raw.chosen;
  const std::vector<std::vector<double>>& hs = raw.hs;
  const int n = static_cast<int>(chosen.size());
  // Quantise: value = s * (max h - h), so a lower sum is more like the target.
  const int T = sp.thresholds[stageIndex];
  std::vector<double> hmax(n);
  double sumMax = 0;
  for (int f = 0; f < n; ++f) sumMax += hmax[f] = *std::max_element(hs[f].begin(), hs[f].end());
  const size_t nc = cal.size();
  std::vector<double> H(nc);
  for (size_t i = 0; i < nc; ++i) {
    double v = 0;
    for (int f = 0; f < n; ++f) v += hs[f][cal.row(i)[chosen[f]]];
    H[i] = v;
  }
  std::vector<double> Hs = H;
  std::sort(Hs.begin(), Hs.end());
  const double theta = Hs[static_cast<size_t>((1.0 - keep) * nc)];
  if (sp.lastScale > 0 && stageIndex + 1 == static_cast<int>(sp.features.size()))
    return quantise_fine(sp, raw, cal, keep, T, hmax);
  double s = 0.97 * T / std::max(1e-6, sumMax - theta);
  Stage st;
  for (int attempt = 0; attempt < 40; ++attempt, s *= 0.95) {
    st.pos = chosen;
    st.table.assign(static_cast<size_t>(n) * 511, 0);
    for (int f = 0; f < n; ++f)
      for (int k = 0; k < 511; ++k) {
        double v = std::round(s * (hmax[f] - hs[f][k]));
        st.table[f * 511 + k] = static_cast<int32_t>(std::min<double>(v, sp.cap));
      }
    std::vector<int> S(nc);
    for (size_t i = 0; i < nc; ++i) S[i] = stage_sum_row(st, cal.row(i));
    std::sort(S.begin(), S.end());
    const int V = S[std::min(nc - 1, static_cast<size_t>(std::ceil(keep * nc)) - 1)];
    int shift = T - V;
    if (shift < 0) continue;
    for (int f = 0; f < n && shift > 0; ++f) {
      int mx = *std::max_element(st.table.begin() + f * 511, st.table.begin() + (f + 1) * 511);
      int add = std::min(shift, sp.cap - mx);
      for (int k = 0; k < 511; ++k) st.table[f * 511 + k] += add;
      shift -= add;
    }
    if (shift > 0) continue;
    st.threshold = T;
    return st;
  }
  std::fprintf(stderr, "quantisation failed for %s stage %d\n", sp.name, stageIndex);
  st.threshold = T;
  return st;
}

// Reservoir of negatives mined from windows that pass the cascade so far.
struct Reservoir {
  size_t cap;
  Samples s;
  size_t seen = 0;
  void offer(const Spec& sp, const uint16_t* mct, int lw, int x, int y) {
    ++seen;
    if (s.size() < cap) {
      add_window(s, sp, mct, lw, x, y);
      return;
    }
    size_t j = std::uniform_int_distribution<size_t>(0, seen - 1)(rng);
    if (j < cap) {
      uint16_t* row = s.codes.data() + j * s.P;
      for (size_t p = 0; p < sp.px.size(); ++p) row[p] = mct[(y + sp.py[p]) * lw + x + sp.px[p]];
    }
  }
};

struct Level {
  int w, h;
  std::vector<uint16_t> mct;
  int tx = -1, ty = -1;  // window that centres on the target (eyes, mouth), -1 for scenes
  double fx = 0, fy = 0, fw = 0, fh = 0;  // face box in level coordinates (face levels of landmark photos)
};

// Overlap of a face window with the level's face: intersection over union.
double face_iou(const Level& L, int x, int y) {
  if (L.fw <= 0) return 0;
  double ix = std::max(0.0, std::min(x + 22.0, L.fx + L.fw) - std::max<double>(x, L.fx));
  double iy = std::max(0.0, std::min(y + 24.0, L.fy + L.fh) - std::max<double>(y, L.fy));
  double in = ix * iy;
  return in / (22.0 * 24.0 + L.fw * L.fh - in);
}

// The pyramid levels of a photo as the face detector scans them: the
// analyser's working image, turned by `angle` degrees (with its black
// corners) for the +-45 degree passes.
void add_face_levels(const cv::Mat& g, std::vector<Level>& levels, const cv::Rect2d* face, int angle = 0) {
  int ww, wh;
  caIF_WorkingSize(g.cols, g.rows, &ww, &wh);
  std::vector<uint8_t> work(ww * wh);
  Resize_NN(g.data, g.cols, g.rows, work.data(), ww, wh);
  if (angle) {
    std::vector<uint8_t> turned(ww * wh);
    Rotate(work.data(), turned.data(), ww, wh, angle);
    work.swap(turned);
  }
  int longer = std::max(ww, wh), r = (std::min(ww, wh) << 15) / longer;
  for (int s : {40, 49, 60, 74, 90, 110, 134, 164, 200, 245, 300, 367, 449, 550}) {
    if (s > longer) break;
    int other = std::max(4, ww == wh ? s : (s * r) >> 15);
    int lw = ww >= wh ? s : other, lh = ww >= wh ? other : s;
    std::vector<uint8_t> lv(lw * lh);
    Resize_NN(work.data(), ww, wh, lv.data(), lw, lh);
    Level L{lw, lh, std::vector<uint16_t>(lw * lh, 0)};
    image2MCT_FD(lv.data(), lw, lh, L.mct.data());
    if (face) {
      double k = double(lw) / g.cols;
      L.fx = face->x * k, L.fy = face->y * k, L.fw = face->width * k, L.fh = face->height * k;
      if (L.fw < 8) continue;  // the face is smaller than any window here: nothing to learn
    }
    levels.push_back(std::move(L));
  }
}

// The last stage before quantisation, kept for writing variants with other
// keep rates.
struct Sweep {
  RawStage raw;
  Samples cal;
};

// How many times a window is offered as a negative for the given stage (0:
// it is no negative; more than 1 weighs it up in the sample).
using LevelScan = std::function<int(const Level&, int x, int y, size_t stage)>;

std::vector<Stage> train_cascade(const Spec& sp, const Samples& allPos, const Samples& allCal,
                                 const std::vector<Level>& levels, int ystep, const LevelScan& negOk, size_t negCount,
                                 FILE* report, Sweep* sweep = nullptr) {
  std::vector<Stage> cascade;
  for (size_t k = 0; k < sp.features.size(); ++k) {
    double t0 = now();
    Samples pos;
    pos.P = allPos.P;
    for (size_t i = 0; i < allPos.size(); ++i)
      if (cascade_row(cascade, allPos.row(i))) pos.codes.insert(pos.codes.end(), allPos.row(i), allPos.row(i) + allPos.P);
    Samples cal;
    cal.P = allCal.P;
    for (size_t i = 0; i < allCal.size(); ++i)
      if (cascade_row(cascade, allCal.row(i))) cal.codes.insert(cal.codes.end(), allCal.row(i), allCal.row(i) + allCal.P);
    // Hard negatives: windows that pass the stages so far. When the earlier
    // stages leave too few, the last of them is relaxed step by step, so that
    // the new stage learns from the near misses instead of from nothing.
    const size_t cap = k + 1 == sp.features.size() ? static_cast<size_t>(negCount * sp.lastNegFactor) : negCount;
    Reservoir res{cap, {}, 0};
    res.s.P = allPos.P;
    size_t windows = 0;
    for (int relax = 0; relax <= 6; ++relax) {
      std::vector<Stage> mining = cascade;
      if (relax && !mining.empty()) mining.back().threshold += mining.back().threshold * relax / 20;
      res = Reservoir{cap, {}, 0};
      res.s.P = allPos.P;
      windows = 0;
      for (const Level& L : levels)
        for (int y = 0; y < L.h - sp.wh; y += ystep)
          for (int x = 0; x < L.w - sp.ww; ++x) {
            const int copies = negOk(L, x, y, k);
            if (!copies) continue;
            ++windows;
            if (cascade_window(mining, sp, L.mct.data(), L.w, x, y))
              for (int c = 0; c < copies; ++c) res.offer(sp, L.mct.data(), L.w, x, y);
          }
      if (res.seen >= cap / 4 || cascade.empty()) break;
      std::fprintf(report, "  only %zu negatives pass (last stage relaxed by %d %%); relaxing further\n", res.seen,
                   relax * 5);
    }
    std::fprintf(report, "%s stage %zu: %zu positives, %zu of %zu negative windows mined (%.2e)\n", sp.name, k,
                 pos.size(), res.seen, windows, windows ? double(res.seen) / windows : 0.0);
    if (res.s.size() < 100) {
      std::fprintf(report, "  too few negatives left; stage trained on what there is\n");
      if (res.s.size() == 0) res.s = pos;  // degenerate, never expected
    }
    RawStage raw = train_raw(sp, k, pos, res.s);
    cascade.push_back(quantise(sp, k, raw, cal, sp.keep[k]));
    // Bootstrapping rounds of the last stage: the windows that still pass the
    // whole cascade are added to the stage's negatives and the stage is
    // trained again, while their share keeps falling.
    for (int round = 0; k + 1 == sp.features.size() && round < sp.lastRounds; ++round) {
      Reservoir hard{cap / 2, {}, 0};
      hard.s.P = allPos.P;
      size_t scanned = 0;
      for (const Level& L : levels)
        for (int y = 0; y < L.h - sp.wh; y += ystep)
          for (int x = 0; x < L.w - sp.ww; ++x) {
            const int copies = negOk(L, x, y, k);
            if (!copies) continue;
            ++scanned;
            if (cascade_window(cascade, sp, L.mct.data(), L.w, x, y))
              for (int c = 0; c < copies; ++c) hard.offer(sp, L.mct.data(), L.w, x, y);
          }
      std::fprintf(report, "  round %d: %zu of %zu windows pass the cascade (%.2e)\n", round + 1, hard.seen, scanned,
                   scanned ? double(hard.seen) / scanned : 0.0);
      std::fflush(report);
      if (hard.s.size() < 100) break;
      res.s.codes.insert(res.s.codes.end(), hard.s.codes.begin(), hard.s.codes.end());
      raw = train_raw(sp, k, pos, res.s);
      cascade.back() = quantise(sp, k, raw, cal, sp.keep[k]);
    }
    if (k + 1 == sp.features.size() && sweep) *sweep = Sweep{raw, cal};
    size_t kept = 0, calKept = 0;
    for (size_t i = 0; i < allPos.size(); ++i) kept += cascade_row(cascade, allPos.row(i));
    for (size_t i = 0; i < allCal.size(); ++i) calKept += cascade_row(cascade, allCal.row(i));
    size_t negPass = 0;
    for (size_t i = 0; i < res.s.size(); ++i) negPass += cascade_row(cascade, res.s.row(i));
    std::fprintf(report,
                 "  trained in %.1f s: keeps %.4f of the training and %.4f of the calibration positives, passes %.4f "
                 "of its negatives\n",
                 now() - t0, double(kept) / allPos.size(), double(calKept) / allCal.size(),
                 double(negPass) / res.s.size());
    std::fflush(report);
  }
  size_t windows = 0, pass = 0;
  for (const Level& L : levels)
    for (int y = 0; y < L.h - sp.wh; y += ystep)
      for (int x = 0; x < L.w - sp.ww; ++x) {
        if (!negOk(L, x, y, sp.features.size() - 1)) continue;
        ++windows;
        pass += cascade_window(cascade, sp, L.mct.data(), L.w, x, y);
      }
  std::fprintf(report, "%s cascade: %zu of %zu negative windows pass (%.2e)\n", sp.name, pass, windows,
               windows ? double(pass) / windows : 0.0);
  return cascade;
}

// NN sampling of an aligned window through a similarity transform; stretch
// != 1 widens (> 1) or narrows the face across, a crude slight yaw.
void sample_window(const cv::Mat& g, double mx, double my, double angle, double s, double cx, double cy, int ww, int wh,
                   std::vector<uint8_t>& out, double stretch = 1) {
  out.resize(ww * wh);
  const double c = std::cos(angle) * s, sn = std::sin(angle) * s;
  for (int v = 0; v < wh; ++v)
    for (int u = 0; u < ww; ++u) {
      double du = (u - cx) / stretch, dv = v - cy;
      int sx = static_cast<int>(std::floor(mx + c * du - sn * dv + 0.5));
      int sy = static_cast<int>(std::floor(my + sn * du + c * dv + 0.5));
      sx = std::clamp(sx, 0, g.cols - 1);
      sy = std::clamp(sy, 0, g.rows - 1);
      out[v * ww + u] = g.at<uint8_t>(sy, sx);
    }
}

// What real photos do to a face, applied to a sampled window with the given
// probability of each effect: low or high contrast and a brightness offset,
// gamma, light from one side, blur, sensor noise, JPEG-like blocks (each
// block pulled toward its mean, as coarse quantisation does), and the
// rounding and clipping to bytes.
struct Augment {
  double contrast = 0.6, gamma = 0.5, side = 0.4, blur = 0.35, noise = 0.5, blocks = 0.2;
};
void augment(std::vector<uint8_t>& win, int ww, int wh, const Augment& a) {
  const int n = ww * wh;
  std::vector<double> v(win.begin(), win.end());
  double mean = 0;
  for (double x : v) mean += x;
  mean /= n;
  if (uni(0, 1) < a.contrast) {
    const double k = std::exp(uni(std::log(0.4), std::log(1.5))), off = uni(-30, 30);
    for (double& x : v) x = mean + off + k * (x - mean);
  }
  if (uni(0, 1) < a.gamma) {
    const double gm = std::exp(uni(std::log(0.55), std::log(1.8)));
    for (double& x : v) x = 255 * std::pow(std::clamp(x, 0.0, 255.0) / 255, gm);
  }
  if (uni(0, 1) < a.side) {
    // Light falling off across the face in a random direction: a gain from
    // 1 - depth on one side to 1 + depth on the other.
    const double dir = uni(0, 2 * M_PI), depth = uni(0.1, 0.45);
    const double cx = std::cos(dir) / ww, cy = std::sin(dir) / wh;
    for (int y = 0; y < wh; ++y)
      for (int x = 0; x < ww; ++x) v[y * ww + x] *= 1 + depth * 2 * ((x - ww / 2.0) * cx + (y - wh / 2.0) * cy);
  }
  if (uni(0, 1) < a.blur) {
    const double t = uni(0.3, 1.0);  // share of a 1-2-1 blur
    std::vector<double> b(n);
    for (int y = 0; y < wh; ++y)
      for (int x = 0; x < ww; ++x) {
        double sum = 0, wsum = 0;
        for (int dy = -1; dy <= 1; ++dy)
          for (int dx = -1; dx <= 1; ++dx) {
            const int xx = std::clamp(x + dx, 0, ww - 1), yy = std::clamp(y + dy, 0, wh - 1);
            const double w = (2 - std::abs(dx)) * (2 - std::abs(dy));
            sum += w * v[yy * ww + xx], wsum += w;
          }
        b[y * ww + x] = (1 - t) * v[y * ww + x] + t * sum / wsum;
      }
    v.swap(b);
  }
  if (uni(0, 1) < a.blocks) {
    const int bs = uni(0, 1) < 0.5 ? 3 : 4;
    const double t = uni(0.3, 0.8), ox = std::floor(uni(0, bs)), oy = std::floor(uni(0, bs));
    for (int by = -static_cast<int>(oy); by < wh; by += bs)
      for (int bx = -static_cast<int>(ox); bx < ww; bx += bs) {
        double sum = 0;
        int cnt = 0;
        for (int y = std::max(0, by); y < std::min(wh, by + bs); ++y)
          for (int x = std::max(0, bx); x < std::min(ww, bx + bs); ++x) sum += v[y * ww + x], ++cnt;
        for (int y = std::max(0, by); y < std::min(wh, by + bs); ++y)
          for (int x = std::max(0, bx); x < std::min(ww, bx + bs); ++x) v[y * ww + x] += t * (sum / cnt - v[y * ww + x]);
      }
  }
  if (uni(0, 1) < a.noise) {
    std::normal_distribution<double> nd(0, uni(1, 5));
    for (double& x : v) x += nd(rng);
  }
  for (int i = 0; i < n; ++i) win[i] = static_cast<uint8_t>(std::clamp(std::lround(v[i]), 0L, 255L));
}

cv::Mat flip(const cv::Mat& g) {
  cv::Mat f = g.clone();
  for (int y = 0; y < g.rows; ++y)
    for (int x = 0; x < g.cols; ++x) f.at<uint8_t>(y, x) = g.at<uint8_t>(y, g.cols - 1 - x);
  return f;
}

// The face with its eyes and mouth, optionally mirrored (eyes swapped).
struct Pts {
  double lx, ly, rx, ry, mx, my;
};
Pts points(const LandmarkFace& f, bool mirror, int width) {
  Pts p{f.x[0], f.y[0], f.x[1], f.y[1], (f.x[3] + f.x[4]) / 2, (f.y[3] + f.y[4]) / 2};
  if (mirror) {
    double w1 = width - 1;
    p = Pts{w1 - f.x[1], f.y[1], w1 - f.x[0], f.y[0], w1 - p.mx, p.my};
  }
  return p;
}

template <typename T>
void write_table(std::ofstream& o, const char* type, const char* name, const std::vector<T>& v, int perLine) {
  o << "const " << type << " " << name << "[" << v.size() << "] = {";
  for (size_t i = 0; i < v.size(); ++i) {
    if (i % perLine == 0) o << "\n   ";
    o << " " << static_cast<long long>(v[i]) << ",";
  }
  o << "\n};\n\n";
}

void write_model(const std::string& path, const Spec& sp, const std::vector<Stage>& c, const char* type16,
                 const char* nx, const char* ny, const char* alphaType, const char* na, const std::string& note) {
  std::vector<long long> X, Y, A;
  for (const Stage& st : c)
    for (size_t f = 0; f < st.pos.size(); ++f) {
      X.push_back(sp.px[st.pos[f]]);
      Y.push_back(sp.py[st.pos[f]]);
      for (int k = 0; k < 511; ++k) A.push_back(st.table[f * 511 + k]);
    }
  std::ofstream o(path);
  o << "// Generated by tools/face_training/face_train (" << note << "); do not edit.\n"
    << "// " << sp.name << " cascade: window " << sp.ww << " x " << sp.wh << ", stages";
  for (size_t k = 0; k < c.size(); ++k) o << " " << sp.features[k] << " (<= " << c[k].threshold << ")";
  o << ".\n#include \"face_models.h\"\n\n// clang-format off\n";
  write_table(o, type16, nx, X, 24);
  write_table(o, type16, ny, Y, 24);
  write_table(o, alphaType, na, A, 24);
  o << "// clang-format on\n";
}
}  // namespace

int main(int argc, char** argv) {
  // FACE_SEED: another random sequence, to see how much a result owes to it.
  rng.seed(static_cast<unsigned>(env_num("FACE_SEED", 20240611)));
  if (argc < 3) {
    std::fprintf(stderr, "usage: face_train DATA_DIR OUT_DIR [face|eye|mouth ...]\n");
    return 2;
  }
  const std::string data = argv[1], out = argv[2];
  bool doFace = argc == 3, doEye = argc == 3, doMouth = argc == 3;
  for (int i = 3; i < argc; ++i) {
    doFace |= !std::strcmp(argv[i], "face");
    doEye |= !std::strcmp(argv[i], "eye");
    doMouth |= !std::strcmp(argv[i], "mouth");
  }
  FILE* report = stdout;
  double t0 = now();
  // FACE_LABELS: "dlib" or "mean" train on the second annotation (see
  // face_relabel) or the mean of both; "agree" on the MTFL points of the
  // faces where the two annotations place the eyes within 0.1 eye distances.
  const std::string labels = std::getenv("FACE_LABELS") ? std::getenv("FACE_LABELS") : "";
  std::vector<LandmarkFace> faces = load_landmarks(data, "new_training", labels == "agree" ? "" : labels);
  std::vector<LandmarkFace> held;
  split_held_out(faces, &held);
  if (labels == "agree") keep_agreeing(faces, load_landmarks(data, "new_training", "dlib"), 0.1);
  std::fprintf(report, "%zu training faces with checked landmarks (%zu held out)\n", faces.size(), held.size());
  std::vector<cv::Mat> greys;
  for (const auto& f : faces) greys.push_back(load_grey(f.path));

  if (doFace) {
    Spec sp{"face", 22, 24, {}, {}, {24, 50, 170, 440}, {1609, 1942, 2904, 7122}, 255,
            env_list("FACE_KEEP", {0.999, 0.999, 0.998, 0.90}), env_num("FACE_EPS", 10),
            env_num("FACE_LAST_NEG", 8)};
    sp.lastRounds = static_cast<int>(env_num("FACE_ROUNDS", 1));
    for (int y = 1; y <= 22; ++y)
      for (int x = 1; x <= 20; ++x) sp.px.push_back(x), sp.py.push_back(y);
    // Positive windows: each face aligned by its eyes, mirrored, several
    // copies with random scale (about one pyramid step), roll and shift.
    const std::vector<double> scaleRange = env_list("FACE_SCALE", {0.87, 1.15});
    const double shift = env_num("FACE_SHIFT", 1.2), rollRange = env_num("FACE_ROLL", 0.17);
    // FACE_SHIFT_Y: vertical shift range when it should differ (the scan
    // steps two rows at a time, one column).
    const double shiftY = env_num("FACE_SHIFT_Y", shift);
    const int copies = static_cast<int>(env_num("FACE_COPIES", 8));
    // FACE_AUG: scale of every augmentation probability (0: clean copies only);
    // FACE_YAW: largest stretch across (1.1: the face 10 % wider or narrower).
    const double augScale = env_num("FACE_AUG", 0.6), yaw = env_num("FACE_YAW", 1.1);
    Augment aug;
    for (double* q : {&aug.contrast, &aug.gamma, &aug.side, &aug.blur, &aug.noise, &aug.blocks}) *q *= augScale;
    std::fprintf(report, "face: keep %g %g %g %g, eps %g, scale %g..%g, shift %g, roll %g, %d copies\n", sp.keep[0],
                 sp.keep[1], sp.keep[2], sp.keep[3], sp.eps, scaleRange[0], scaleRange[1], shift, rollRange, copies);
    Samples trainPos, calPos;
    trainPos.P = calPos.P = sp.px.size();
    std::vector<uint8_t> win;
    std::vector<uint16_t> mct(22 * 24);
    for (size_t i = 0; i < faces.size(); ++i) {
      if (greys[i].empty()) continue;
      cv::Mat fl = flip(greys[i]);
      // Every eighth face calibrates the stage thresholds only.
      Samples& pos = i % 8 == 5 ? calPos : trainPos;
      for (int m = 0; m < 2; ++m) {
        const cv::Mat& g = m ? fl : greys[i];
        Pts p = points(faces[i], m, g.cols);
        double d = std::hypot(p.rx - p.lx, p.ry - p.ly);
        if (d < 6) continue;
        double a = std::atan2(p.ry - p.ly, p.rx - p.lx);
        for (int j = 0; j < copies; ++j) {
          // Log-uniform scale: the pyramid steps are geometric.
          double scale = std::exp(uni(std::log(scaleRange[0]), std::log(scaleRange[1])));
          double roll = uni(-rollRange, rollRange);
          double s = d / kEyeDist * scale;
          const double stretch = std::exp(uni(-std::log(yaw), std::log(yaw)));
          sample_window(g, (p.lx + p.rx) / 2, (p.ly + p.ry) / 2, a + roll, s, kEyeMidX + uni(-shift, shift),
                        kEyeMidY + uni(-shiftY, shiftY), 22, 24, win, stretch);
          if (augScale > 0) augment(win, 22, 24, aug);
          std::fill(mct.begin(), mct.end(), 0);
          image2MCT_FD(win.data(), 22, 24, mct.data());
          add_window(pos, sp, mct.data(), 22, 0, 0);
        }
      }
    }
    // Scenes without faces (every fifth one held out for evaluation), at the
    // working size of the analyser and every pyramid level.
    std::vector<std::string> scenes = list_images(data + "/images_notfaces");
    const size_t sceneCount = scenes.size();
    for (const std::string& w : list_images(data + "/wallpapers")) scenes.push_back(w);
    size_t wallpapers = 0;
    std::vector<Level> levels;
    // Share of the training wallpapers used (FACE_WALLPAPERS, tenths).
    // The scenes turned by +-45 degrees, as the turned passes see them (FACE_TURNED=0: upright only).
    const bool turnedNegatives = env_num("FACE_TURNED", 1) != 0;
    // Negatives from every face-free photo (FACE_ALL_SCENES=0: without the
    // fifth that the composites of face_eval are made of, as before).
    const bool allScenes = env_num("FACE_ALL_SCENES", 1) != 0;
    const int wallTenths = static_cast<int>(std::lround(10 * env_num("FACE_WALLPAPERS", 1.0)));
    for (size_t i = 0, w = 0; i < scenes.size(); ++i) {
      if (!allScenes && is_held_out_scene(i < sceneCount ? i : i - sceneCount)) continue;
      if (i >= sceneCount && static_cast<int>(w++ % 10) >= wallTenths) continue;
      wallpapers += i >= sceneCount;
      cv::Mat g = load_grey(scenes[i]);
      if (g.empty()) continue;
      add_face_levels(g, levels, nullptr);
      add_face_levels(flip(g), levels, nullptr);
      if (turnedNegatives) {
        add_face_levels(g, levels, nullptr, 45);
        add_face_levels(g, levels, nullptr, -45);
      }
    }
    // The surroundings of faces in landmark photos: windows off the face.
    for (size_t i = 0; i < faces.size(); i += 12) {
      if (greys[i].empty()) continue;
      Pts p = points(faces[i], false, greys[i].cols);
      cv::Rect2d fb = face_box_from_eyes(p.lx, p.ly, p.rx, p.ry);
      add_face_levels(greys[i], levels, &fb);
    }
    std::fprintf(report, "face: %zu + %zu calibration positive windows, %zu levels (%zu training wallpapers) (%.0f s)\n",
                 trainPos.size(), calPos.size(), levels.size(), wallpapers, now() - t0);
    Sweep sweep;
    auto cascade = train_cascade(sp, trainPos, calPos, levels, 1, [](const Level& L, int x, int y, size_t) { return face_iou(L, x, y) < 0.25; },
                                 30000, report, &sweep);
    // Variants with other keep rates of the last stage (FACE_SWEEP="0.98,0.95"),
    // written beside the model as frontal_model.inc.<keep>.
    if (const char* sw = std::getenv("FACE_SWEEP"))
      for (const char* p = sw; *p;) {
        char* end;
        double keep = std::strtod(p, &end);
        if (end == p) break;
        p = *end == ',' ? end + 1 : end;
        std::vector<Stage> variant = cascade;
        variant.back() = quantise(sp, sp.features.size() - 1, sweep.raw, sweep.cal, keep);
        char name[64];
        std::snprintf(name, sizeof name, "/frontal_model.inc.%.4f", keep);
        write_model(out + name, sp, variant, "uint8_t", "m_nFrontalMCTFeatureX0", "m_nFrontalMCTFeatureY0", "uint8_t",
                    "m_nFrontalMCTAlpha", "face windows from MTFL training faces, negatives from scene photos");
      }
    // The written table keeps FACE_FINAL_KEEP of the calibration windows at
    // the last stage (chosen on the real validation photos); the last stage is
    // trained and bootstrapped at the keep rate of FACE_KEEP.
    const double finalKeep = env_num("FACE_FINAL_KEEP", 0.83);
    if (finalKeep != sp.keep.back())
      cascade.back() = quantise(sp, sp.features.size() - 1, sweep.raw, sweep.cal, finalKeep);
    std::fprintf(report, "face table written with the last stage keeping %g of the calibration windows\n", finalKeep);
    write_model(out + "/frontal_model.inc", sp, cascade, "uint8_t", "m_nFrontalMCTFeatureX0", "m_nFrontalMCTFeatureY0",
                "uint8_t", "m_nFrontalMCTAlpha", "face windows from MTFL training faces, negatives from scene photos");
  }

  // Eye and mouth: regions of jittered face boxes, at the detectors' levels.
  for (int part = 0; part < 2; ++part) {
    if (part == 0 && !doEye) continue;
    if (part == 1 && !doMouth) continue;
    const bool eye = part == 0;
    // The mouth draws its own random sequence, so that eye settings do not
    // change the mouth table.
    if (!eye) rng.seed(static_cast<unsigned>(env_num("FACE_SEED", 20240611)) + 1);
    Spec sp = eye ? Spec{"eye", 15, 15, {}, {}, {22, 36, 100}, {7270, 10956, 17510}, INT_MAX,
                         env_list("EYE_KEEP", {0.995, 0.98, 0.93}), env_num("EYE_EPS", 10), 1,
                         env_num("EYE_SCALE", 6000)}
                  : Spec{"mouth", 15, 9, {}, {}, {10, 20, 30}, {5836, 8499, 12390}, INT_MAX,
                         env_list("MOUTH_KEEP", {0.995, 0.99, 0.97}), env_num("MOUTH_EPS", 10), 1,
                         env_num("MOUTH_SCALE", 0)};
    for (int y = 1; y <= sp.wh - 2; ++y)
      for (int x = 1; x <= sp.ww - 2; ++x) sp.px.push_back(x), sp.py.push_back(y);
    Samples trainPos, calPos;
    trainPos.P = calPos.P = sp.px.size();
    std::vector<Level> levels;
    int missed = 0;
    // Positives: the window on the target and (PART_NEIGHBOURS=1) its four neighbours.
    const bool neighbours = env_num(eye ? "EYE_NEIGHBOURS" : "MOUTH_NEIGHBOURS", 0) != 0;
    // Levels (33, 30, 27, 24 wide) whose target windows are positives.
    const std::vector<double> posLevels = env_list(eye ? "EYE_POS_LEVELS" : "MOUTH_POS_LEVELS", {1, 1, 1, 1});
    const std::vector<double> tolv = eye ? env_list("EYE_TOL", {3, 3, 3}) : env_list("MOUTH_TOL", {2, 1, 1});
    // Faces whose regions give negatives (every Nth), and the negatives mined per stage.
    const size_t negEvery = static_cast<size_t>(std::max(1.0, eye ? env_num("EYE_NEG_EVERY", 1) : env_num("MOUTH_NEG_EVERY", 2)));
    const size_t negCount = static_cast<size_t>(eye ? env_num("EYE_NEGS", 300000) : env_num("MOUTH_NEGS", 40000));
    const int copies = static_cast<int>(std::max(1.0, env_num(eye ? "EYE_COPIES" : "MOUTH_COPIES", 1)));
    for (size_t i = 0; i < faces.size(); ++i) {
      if (greys[i].empty()) continue;
      cv::Mat fl = flip(greys[i]);
      Samples& pos = i % 8 == 5 ? calPos : trainPos;  // every eighth face calibrates the thresholds
      for (int m = 0; m < 2; ++m) {
        const cv::Mat& g0 = m ? fl : greys[i];
        Pts p = points(faces[i], m, g0.cols);
        // The analyser's working image, and the face box its detector finds
        // there; where it misses, the landmark box jittered by the spread of
        // the detected boxes (scale +-10 %, shift +-5 %).
        int gw, gh;
        caIF_WorkingSize(g0.cols, g0.rows, &gw, &gh);
        std::vector<uint8_t> g(gw * gh);
        Resize_NN(g0.data, g0.cols, g0.rows, g.data(), gw, gh);
        const double f = double(gw) / g0.cols;
        auto sc = [f](double v) { return v * f + (f - 1) / 2.0; };
        cv::Rect2d fb = face_box_from_eyes(sc(p.lx), sc(p.ly), sc(p.rx), sc(p.ry));
        SMyRect2 box{};
        int found = fd_find(g.data(), gw, gh, 0, 0, 3);
        SMyRect2 boxes[kFdListSize];
        double bestIou = 0.3;
        if (found > 0 && fd_where(boxes))
          for (int k = 0; k < found; ++k) {
            cv::Rect2d d(boxes[k].left, boxes[k].top, boxes[k].right - boxes[k].left, boxes[k].bottom - boxes[k].top);
            double in = (d & fb).area(), u = in / (d.area() + fb.area() - in);
            if (u >= bestIou) bestIou = u, box = boxes[k];
          }
        if (bestIou == 0.3) {
          ++missed;
          double js = uni(0.9, 1.1), jx = uni(-0.05, 0.05) * fb.width, jy = uni(-0.05, 0.05) * fb.width;
          double cx = fb.x + fb.width / 2 + jx, cy = fb.y + fb.height / 2 + jy;
          double bw = fb.width * js, bh = fb.height * js;
          box = SMyRect2{static_cast<int>(cx - bw / 2), static_cast<int>(cy - bh / 2), 0, 0};
          box.right = box.left + static_cast<int>(bw);
          box.bottom = box.top + static_cast<int>(bh);
        }
        // Extra copies (PART_COPIES > 1): the same face with the box jittered
        // by +-7 % in scale and +-4 % in position; they add positives only.
        const SMyRect2 found0 = box;
        for (int copy = 0; copy < copies; ++copy) {
          if (copy) {
            double js = uni(0.93, 1.07), bw0 = found0.right - found0.left, bh0 = found0.bottom - found0.top;
            double cx = found0.left + bw0 / 2 + uni(-0.04, 0.04) * bw0,
                   cy = found0.top + bh0 / 2 + uni(-0.04, 0.04) * bw0;
            box = SMyRect2{static_cast<int>(cx - bw0 * js / 2), static_cast<int>(cy - bh0 * js / 2), 0, 0};
            box.right = box.left + static_cast<int>(bw0 * js);
            box.bottom = box.top + static_cast<int>(bh0 * js);
          }
          for (int side = 0; side < (eye ? 2 : 1); ++side) {
            SMyRect2 r;
            double tx, ty;
            if (eye) {
              SMyRect2 L, R;
              ed_regions(box, &L, &R);
              r = side ? R : L;
              tx = side ? r.right - sc(p.rx) : sc(p.lx) - r.left;
              ty = (side ? sc(p.ry) : sc(p.ly)) - r.top;
            } else {
              r = md_region(box, gh);
              tx = sc(p.mx) - r.left;
              ty = sc(p.my) - r.top;
            }
            int rw = r.right - r.left, rh = r.bottom - r.top;
            if (rw < 4 || rh < 4) continue;
            std::vector<uint8_t> region(rw * rh);
            edmd_copy_region(g.data(), gw, gh, r, region.data());
            if (eye && side) FlipX(region.data(), rw, rh);
            int widths[4], heights[4];
            int n = edmd_levels(rw, rh, eye ? 22 : 13, widths, heights);
            for (int k = 0; k < n; ++k) {
              int lw = widths[k], lh = heights[k];
              std::vector<uint8_t> lv(lw * lh);
              Resize_BI(region.data(), rw, rh, lv.data(), lw, lh);
              Level L{lw, lh, std::vector<uint16_t>(lw * lh, 0)};
              image2MCT9_1(lv.data(), lw, lh, L.mct.data());
              double k2 = double(lw) / rw;
              L.tx = static_cast<int>(std::lround(tx * k2 - sp.ww / 2.0));
              L.ty = static_cast<int>(std::lround(ty * k2 - sp.wh / 2.0));
              for (int dy = -1; dy <= 1; ++dy)
                for (int dx = -1; dx <= 1; ++dx) {
                  if ((dx && dy) || ((dx || dy) && !neighbours)) continue;
                  int x = L.tx + dx, y = L.ty + dy;
                  if (posLevels[k] != 0 && x >= 0 && y >= 0 && x < lw - sp.ww && y < lh - sp.wh)
                    add_window(pos, sp, L.mct.data(), lw, x, y);
                }
              if (copy == 0 && i % negEvery == 0)
                levels.push_back(std::move(L));  // every negEvery-th face serves as a negative source
            }
          }
        }
      }
    }
    std::fprintf(report,
                 "%s: %zu + %zu calibration positive windows, %zu region levels, detector missed %d faces (%.0f s)\n",
                 sp.name, trainPos.size(), calPos.size(), levels.size(), missed, now() - t0);
    // Windows off the target are negatives; the later stages also learn to
    // reject windows close to it, so that the best hit sits on the target.
    // The last stage may weigh up the windows just outside its tolerance
    // (up to `ring` level pixels off), the ones that compete with the target.
    const int ring = static_cast<int>(env_num(eye ? "EYE_RING" : "MOUTH_RING", 0));
    const int ringCopies = static_cast<int>(env_num(eye ? "EYE_RING_COPIES" : "MOUTH_RING_COPIES", 1));
    const int tol[3] = {static_cast<int>(tolv[0]), static_cast<int>(tolv[1]), static_cast<int>(tolv[2])};
    std::fprintf(report, "%s: keep %g %g %g, eps %g, neighbours %d, tolerance %d %d %d, negatives from every %zu. face, %zu per stage\n",
                 sp.name, sp.keep[0], sp.keep[1], sp.keep[2], sp.eps, neighbours, tol[0], tol[1], tol[2], negEvery, negCount);
    auto cascade = train_cascade(
        sp, trainPos, calPos, levels, 1,
        [&tol, ring, ringCopies](const Level& L, int x, int y, size_t stage) {
          const int d = std::max(std::abs(x - L.tx), std::abs(y - L.ty));
          if (d <= tol[stage]) return 0;
          return stage == 2 && d <= ring ? ringCopies : 1;
        },
        negCount, report);
    if (eye)
      write_model(out + "/eye_model.inc", sp, cascade, "uint16_t", "m_nEyeMCTFeatureX", "m_nEyeMCTFeatureY", "int32_t",
                  "m_nEDMCTAlpha", "eye windows from MTFL training faces, negatives from the rest of the eye regions");
    else
      write_model(out + "/mouth_model.inc", sp, cascade, "uint16_t", "m_nMouthMCTFeatureX", "m_nMouthMCTFeatureY",
                  "int32_t", "m_nMDMCTAlpha",
                  "mouth windows from MTFL training faces, negatives from the rest of the mouth regions");
  }
  std::fprintf(report, "done in %.0f s\n", now() - t0);
  return 0;
}
