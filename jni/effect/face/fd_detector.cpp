#include "fd_detector.h"

#include <atomic>
#include <cmath>
#include <cstring>

#include "effect/kalo/px_mem.h"
#include "effect/kalo/px_parallel.h"
#include "models/face_models.h"

const int kFdStageFeatures[kFdStageCount] = {24, 50, 170, 440};
const int kFdStageThresholds[kFdStageCount] = {1609, 1942, 2904, 7122};
const int kFdPyramid[15] = {40, 49, 60, 74, 90, 110, 134, 164, 200, 245, 300, 367, 449, 550, 673};

namespace {
// Candidate list of the current pass.
SMyRect2 m_rcFaceCandidateFrontal[kFdListSize];
int m_nFaceCandidateConfidenceFrontal[kFdListSize];
int m_nFaceCandidateIntersectionCountFrontal[kFdListSize];
unsigned char m_bFaceCandidateValidFrontal[kFdListSize];
int m_nFaceCandidateCountFrontal = 0;
// Face list over all passes.
SMyRect2 m_rcFace[kFdListSize];
int m_nFaceConfidence[kFdListSize];
int m_nFaceRIP[kFdListSize];
unsigned char m_bFaceValid[kFdListSize];
int m_nFaceCount = 0;
// Final list.
SMyRect2 m_rcFinalFace[kFdListSize];
int m_nFaceFinalRIP[kFdListSize];
int m_nFaceFinalCount = 0;

constexpr double kPi = 3.14159265358979323846;
}  // namespace

int fd_pyramid_count(int precision) {
  if (precision == 1) return 14;
  if (precision == 2) return 11;
  return 8;
}

int fd_isintersection(SMyRect2 a, SMyRect2 b) {
  int ma = (a.right - a.left) >> 3, mb = (b.right - b.left) >> 3;
  int al = a.left + ma, ar = a.right - ma, at = a.top + ma, ab = a.bottom - ma;
  int bl = b.left + mb, br = b.right - mb, bt = b.top + mb, bb = b.bottom - mb;
  int l = al > bl ? al : bl, r = ar < br ? ar : br;
  int t = at > bt ? at : bt, btm = ab < bb ? ab : bb;
  return (l <= r && t <= btm) ? 1 : 0;
}

void fd_reset_candidates() {
  m_nFaceCandidateCountFrontal = 0;
  std::memset(m_nFaceCandidateConfidenceFrontal, 0, sizeof m_nFaceCandidateConfidenceFrontal);
  std::memset(m_nFaceCandidateIntersectionCountFrontal, 0, sizeof m_nFaceCandidateIntersectionCountFrontal);
  std::memset(m_bFaceCandidateValidFrontal, 0, sizeof m_bFaceCandidateValidFrontal);
}

void fd_reset_faces() {
  m_nFaceCount = 0;
  m_nFaceFinalCount = 0;
  std::memset(m_nFaceConfidence, 0, sizeof m_nFaceConfidence);
  std::memset(m_nFaceRIP, 0, sizeof m_nFaceRIP);
  std::memset(m_bFaceValid, 0, sizeof m_bFaceValid);
}

void fd_enroll_Frontal(int x, int y, int w, int h, int confidence) {
  int& n = m_nFaceCandidateCountFrontal;
  if (n > kFdListSize - 1) return;
  SMyRect2 hit{x, y, x + w, y + h};
  bool joined = false;
  for (int i = 0; i < n; ++i) {
    if (!m_bFaceCandidateValidFrontal[i] || !fd_isintersection(m_rcFaceCandidateFrontal[i], hit)) continue;
    m_nFaceCandidateIntersectionCountFrontal[i] += 1;
    if (m_nFaceCandidateConfidenceFrontal[i] > confidence) {
      m_rcFaceCandidateFrontal[i] = hit;
      m_nFaceCandidateConfidenceFrontal[i] = confidence;
    }
    joined = true;
    break;
  }
  if (!joined) {
    m_rcFaceCandidateFrontal[n] = hit;
    m_nFaceCandidateConfidenceFrontal[n] = confidence;
    m_nFaceCandidateIntersectionCountFrontal[n] = 1;
    m_bFaceCandidateValidFrontal[n] = 1;
    ++n;
  }
  // Merge overlapping candidates; a dropped i keeps being compared with the
  // later ones.
  for (int i = 0; i < n; ++i) {
    if (!m_bFaceCandidateValidFrontal[i]) continue;
    for (int j = i + 1; j < n; ++j) {
      if (!m_bFaceCandidateValidFrontal[j]) continue;
      if (!fd_isintersection(m_rcFaceCandidateFrontal[i], m_rcFaceCandidateFrontal[j])) continue;
      if (m_nFaceCandidateConfidenceFrontal[j] < m_nFaceCandidateConfidenceFrontal[i]) {
        m_bFaceCandidateValidFrontal[i] = 0;
        m_nFaceCandidateIntersectionCountFrontal[j] += m_nFaceCandidateIntersectionCountFrontal[i];
      } else {
        m_bFaceCandidateValidFrontal[j] = 0;
        m_nFaceCandidateIntersectionCountFrontal[i] += m_nFaceCandidateIntersectionCountFrontal[j];
      }
    }
  }
}

int fd_eval_window(const unsigned short* mct, int levelWidth, int x, int y, int* lastSum) {
  int f = 0, sum = 0;
  for (int s = 0; s < kFdStageCount; ++s) {
    sum = 0;
    for (int e = f + kFdStageFeatures[s]; f < e; ++f) {
      int code = mct[(y + m_nFrontalMCTFeatureY0[f]) * levelWidth + x + m_nFrontalMCTFeatureX0[f]];
      sum += m_nFrontalMCTAlpha[f * kMctCodes + code];
    }
    if (sum > kFdStageThresholds[s]) {
      if (lastSum) *lastSum = sum;
      return s;
    }
  }
  if (lastSum) *lastSum = sum;
  return kFdStageCount;
}

namespace {
// Per-level feature offsets (x + y * levelWidth), so a window is look-ups only.
void fd_feature_offsets(int sw, int* offset) {
  for (int f = 0; f < kFrontalFeatureCount; ++f) offset[f] = m_nFrontalMCTFeatureY0[f] * sw + m_nFrontalMCTFeatureX0[f];
}

// Stages 2 to 4 of the window at `base` (its top-left code); true when all
// pass, with the last stage sum in *sum. The weights are bytes, so a stage's
// running sum never falls: once it exceeds the threshold the window is
// rejected without adding the stage's remaining features (checked every
// eight features; the decision is the one the full sum gives).
bool fd_window_later_stages(const unsigned short* base, const int* offset, int* sum) {
  // Walked with pointers: with int arithmetic wrapping (-fwrapv) indexed
  // forms cost an extra sign extension per feature.
  const int* off = offset + kFdStageFeatures[0];
  const uint8_t* alpha = m_nFrontalMCTAlpha + kFdStageFeatures[0] * kMctCodes;
  int s = 0;
  for (int stage = 1; stage < kFdStageCount; ++stage) {
    const int threshold = kFdStageThresholds[stage];
    const int* end = off + kFdStageFeatures[stage];
    s = 0;
    for (; end - off >= 8; off += 8, alpha += 8 * kMctCodes) {
      s += alpha[0 * kMctCodes + base[off[0]]] + alpha[1 * kMctCodes + base[off[1]]] +
           alpha[2 * kMctCodes + base[off[2]]] + alpha[3 * kMctCodes + base[off[3]]] +
           alpha[4 * kMctCodes + base[off[4]]] + alpha[5 * kMctCodes + base[off[5]]] +
           alpha[6 * kMctCodes + base[off[6]]] + alpha[7 * kMctCodes + base[off[7]]];
      if (s > threshold) return false;
    }
    for (; off < end; ++off, alpha += kMctCodes) s += alpha[base[*off]];
    if (s > threshold) return false;
  }
  *sum = s;
  return true;
}

// First-stage sums of the windows x = 0 .. xs - 1 of one window row, feature
// by feature across the row (four features at a time): each feature reads a
// run of neighbouring codes, and nearly all windows end in this stage.
constexpr int kFdMaxLevelSide = 673;  // the largest pyramid size
void fd_first_stage_row(const unsigned short* line, const int* offset, int xs, int* acc) {
  for (int x = 0; x < xs; ++x) acc[x] = 0;
  const int* off = offset;
  const int* end = offset + kFdStageFeatures[0];
  const uint8_t* a0 = m_nFrontalMCTAlpha;
  for (; end - off >= 4; off += 4, a0 += 4 * kMctCodes) {
    const unsigned short *c0 = line + off[0], *c1 = line + off[1], *c2 = line + off[2], *c3 = line + off[3];
    const uint8_t *a1 = a0 + kMctCodes, *a2 = a1 + kMctCodes, *a3 = a2 + kMctCodes;
    for (int x = 0; x < xs; ++x) acc[x] += a0[c0[x]] + a1[c1[x]] + a2[c2[x]] + a3[c3[x]];
  }
  for (; off < end; ++off, a0 += kMctCodes) {
    const unsigned short* c = line + *off;
    for (int x = 0; x < xs; ++x) acc[x] += a0[c[x]];
  }
}

// Scans the window row at top y of a level of width w (codes `mct`), calling
// hit(x, lastStageSum) for every window that passes, x left to right.
template <class Hit>
void fd_scan_row(const unsigned short* mct, int w, int y, const int* offset, Hit&& hit) {
  int acc[kFdMaxLevelSide];
  const int xs = w - kFdWindowW;
  const unsigned short* line = mct + static_cast<ptrdiff_t>(y) * w;
  fd_first_stage_row(line, offset, xs, acc);
  for (int x = 0; x < xs; ++x) {
    int sum;
    if (acc[x] <= kFdStageThresholds[0] && fd_window_later_stages(line + x, offset, &sum)) hit(x, sum);
  }
}

void fd_enroll_hit(int x, int y, int scale, int sum) {
  const int64_t s64 = scale;
  fd_enroll_Frontal(static_cast<int>((x * s64) >> 15), static_cast<int>((y * s64) >> 15),
                    static_cast<int>((kFdWindowW * s64) >> 15), static_cast<int>((kFdWindowH * s64) >> 15),
                    sum / 2);
}
}  // namespace

void fd_scan_frontal(int sw, int sh, int width, int height, const unsigned short* mct) {
  (void)height;
  if (sh <= kFdWindowH || sw <= kFdWindowW || !mct) return;
  const int scale = static_cast<int>((static_cast<int64_t>(width) << 15) / sw);
  // Offsets of every feature inside this level, so a window is look-ups only.
  int offset[kFrontalFeatureCount];
  for (int f = 0; f < kFrontalFeatureCount; ++f)
    offset[f] = m_nFrontalMCTFeatureY0[f] * sw + m_nFrontalMCTFeatureX0[f];
  for (int y = 0; y < sh - kFdWindowH; y += 2) {
    for (int x = 0; x < sw - kFdWindowW; ++x) {
      const unsigned short* base = mct + static_cast<ptrdiff_t>(y) * sw + x;
      int f = 0, sum = 0;
      bool pass = true;
      for (int s = 0; s < kFdStageCount && pass; ++s) {
        sum = 0;
        const uint8_t* alpha = m_nFrontalMCTAlpha + f * kMctCodes;
        for (int e = f + kFdStageFeatures[s]; f < e; ++f, alpha += kMctCodes) sum += alpha[base[offset[f]]];
        pass = sum <= kFdStageThresholds[s];
      }
      if (!pass) continue;
      int64_t s64 = scale;
      fd_enroll_Frontal(static_cast<int>((x * s64) >> 15), static_cast<int>((y * s64) >> 15),
                        static_cast<int>((kFdWindowW * s64) >> 15), static_cast<int>((kFdWindowH * s64) >> 15), sum / 2);
    }
  }
}

void fd_add_face(SMyRect2 r, int confidence, int rip) {
  if (m_nFaceCount >= kFdListSize) return;  // the list is bounded; later passes' extra faces are dropped
  m_rcFace[m_nFaceCount] = r;
  m_nFaceConfidence[m_nFaceCount] = confidence;
  m_nFaceRIP[m_nFaceCount] = rip;
  m_bFaceValid[m_nFaceCount] = 1;
  ++m_nFaceCount;
}

void Rotate(const unsigned char* src, unsigned char* dst, int width, int height, int angle) {
  if (!src || !dst || width < 1 || height < 1) return;
  int c, s;  // Q10
  switch (angle) {
    case 45: c = 724; s = 724; break;
    case -45: c = 724; s = -724; break;
    case 90: c = 0; s = 1024; break;
    case -90: c = 0; s = -1024; break;
    default: c = 1024; s = 0; break;
  }
  const int cx = width >> 1, cy = height >> 1;
  px_for_rows(height, [&](int y0, int y1) {  // every row on its own: bands on worker threads
    for (int oy = y0; oy < y1; ++oy) {
      const int dy = cy - oy;
      for (int ox = 0; ox < width; ++ox) {
        const int dx = ox - cx;
        const int sx = cx + ((dx * c - dy * s) >> 10);
        const int sy = cy - ((dx * s + dy * c) >> 10);
        dst[static_cast<size_t>(oy) * width + ox] =
            (sx >= 0 && sx < width && sy >= 0 && sy < height) ? src[static_cast<size_t>(sy) * width + sx] : 0;
      }
    }
  });
}

SMyRect2 InvRotate(SMyRect2 b, int width, int height, int angle) {
  const int cx = width >> 1, cy = height >> 1;
  const double a = angle * kPi / 180.0;
  const int dx = ((b.left + b.right) >> 1) - cx;
  const int dy = cy - ((b.top + b.bottom) >> 1);
  const int side = b.right - b.left, half = side >> 1;
  const double xr = dx * std::cos(a) - dy * std::sin(a);
  const double yr = dx * std::sin(a) + dy * std::cos(a);
  SMyRect2 r;
  r.left = cx - half + static_cast<int>(xr);
  r.top = cy - static_cast<int>(yr) - half;
  r.right = r.left + side;
  r.bottom = r.top + side;
  return r;
}

namespace {
// Size of pyramid level k of a pass over a width x height picture whose
// shorter / longer side ratio is r (Q15); false from the first size above the
// longer side on.
bool fd_level_size(int k, int width, int height, int r, int* lw, int* lh) {
  const int longer = width > height ? width : height;
  const int s = kFdPyramid[k];
  if (s > longer) return false;
  int other = width == height ? s : static_cast<int>((static_cast<int64_t>(s) * r) >> 15);
  if (other < 4) other = 4;
  *lw = width >= height ? s : other;
  *lh = width >= height ? other : s;
  return true;
}

// The plain pass: one grey and one code buffer for the largest level, levels
// built and scanned one after the other on the calling thread.
void fd_scan_levels_plain(const unsigned char* grey, int width, int height, int r, int levels) {
  const int longer = width > height ? width : height;
  const int top = kFdPyramid[levels - 1] < longer ? kFdPyramid[levels - 1] : longer;
  const size_t cap = static_cast<size_t>(top) * top;
  auto* level = static_cast<unsigned char*>(px_malloc(cap, 1));
  auto* mct = static_cast<unsigned short*>(px_calloc(cap, sizeof(unsigned short)));
  if (level && mct) {
    int lw, lh;
    for (int k = 0; k < levels && fd_level_size(k, width, height, r, &lw, &lh); ++k) {
      const unsigned char* img = grey;
      if (lw != width || lh != height) {
        Resize_NN(grey, width, height, level, lw, lh);
        img = level;
      }
      image2MCT_FD(img, lw, lh, mct);
      fd_scan_frontal(lw, lh, width, height, mct);
    }
  }
  px_free(level);
  px_free(mct);
}

// ---- The threaded pass ----
// Every level gets buffers of its own. The levels are resampled, turned into
// codes in bands of rows and scanned in bands of window rows on worker
// threads; each scan band keeps its hits. The hits are then enrolled on the
// calling thread band by band, in the order the plain scan meets them (level
// by level, rows top to bottom, x left to right), so the candidate lists end
// exactly as after the plain pass.
constexpr int kFdMaxLevels = 15;
constexpr int kFdCodeRows = 32;  // picture rows per code band
constexpr int kFdScanRows = 6;   // window rows (y step 2) per scan band
constexpr int kFdBandHits = 32;  // hits kept per scan band

struct FdLevel {
  int w, h;
  int scale;                  // (width << 15) / w
  const unsigned char* grey;  // the picture itself or `own`
  unsigned char* own;         // the resampled level, null when not needed
  unsigned short* mct;
  int codeBand0, scanBand0;   // index of the level's first code and scan band
};

struct FdHit {
  int x, y, sum;
};

struct FdScanBand {
  int level, row0, row1;  // window rows row0 .. row1 - 1 (window top y = 2 * row)
  int hits;
  bool full;              // more hits than room: scanned again while enrolling
  FdHit hit[kFdBandHits];
};

// Runs task(i) for i = 0 .. count - 1 on the worker threads; each worker takes
// the next task not yet taken, so uneven tasks still share out well. The
// tasks write only their own results, so the order they run in does not matter.
template <class Task>
void fd_run_tasks(int count, Task&& task) {
  std::atomic<int> next{0};
  px_for_rows(
      count,
      [&](int, int) {
        for (int i = next.fetch_add(1); i < count; i = next.fetch_add(1)) task(i);
      },
      1);
}

// The level a band index belongs to (bands are numbered level after level).
int fd_band_level(const FdLevel* level, int n, int band, bool scan) {
  int k = 0;
  while (k + 1 < n && band >= (scan ? level[k + 1].scanBand0 : level[k + 1].codeBand0)) ++k;
  return k;
}

// Window rows of a level: tops y = 0, 2, ... below h - 24 (none when the
// level is not larger than the window).
int fd_window_rows(const FdLevel& L) {
  return (L.h > kFdWindowH && L.w > kFdWindowW) ? (L.h - kFdWindowH + 1) / 2 : 0;
}

void fd_scan_band(const FdLevel& L, FdScanBand* band) {
  int offset[kFrontalFeatureCount];
  fd_feature_offsets(L.w, offset);
  band->hits = 0;
  band->full = false;
  for (int row = band->row0; row < band->row1 && !band->full; ++row) {
    fd_scan_row(L.mct, L.w, 2 * row, offset, [&](int x, int sum) {
      if (band->hits == kFdBandHits)
        band->full = true;  // the rest of this row is dropped too: the band is scanned again
      else
        band->hit[band->hits++] = FdHit{x, 2 * row, sum};
    });
  }
}

// The same band scanned on the calling thread, enrolling as it goes.
void fd_scan_band_enrolling(const FdLevel& L, const FdScanBand& band) {
  int offset[kFrontalFeatureCount];
  fd_feature_offsets(L.w, offset);
  for (int row = band.row0; row < band.row1; ++row)
    fd_scan_row(L.mct, L.w, 2 * row, offset, [&](int x, int sum) { fd_enroll_hit(x, 2 * row, L.scale, sum); });
}

// One picture's threaded pass: its levels, buffers and scan bands.
struct FdPlan {
  const unsigned char* grey;
  int width, height;
  FdLevel level[kFdMaxLevels];
  int n, codeBands, scanBands;
  unsigned char* greys;
  unsigned short* codes;
  FdScanBand* bands;
};

void fd_plan_free(FdPlan* P) {
  px_free(P->greys);
  px_free(P->codes);
  px_free(P->bands);
  P->greys = nullptr;
  P->codes = nullptr;
  P->bands = nullptr;
}

// Lays out the levels and takes their buffers; false (nothing kept) when
// the buffers cannot be had.
bool fd_plan(FdPlan* P, const unsigned char* grey, int width, int height, int r, int levels) {
  *P = FdPlan{};
  P->grey = grey;
  P->width = width;
  P->height = height;
  size_t greyTotal = 0, codeTotal = 0;
  int lw, lh;
  for (int k = 0; k < levels && k < kFdMaxLevels && fd_level_size(k, width, height, r, &lw, &lh); ++k) {
    FdLevel& L = P->level[P->n++];
    L = FdLevel{lw, lh, static_cast<int>((static_cast<int64_t>(width) << 15) / lw), grey, nullptr, nullptr,
                P->codeBands, P->scanBands};
    const size_t size = static_cast<size_t>(lw) * lh;
    if (lw != width || lh != height) greyTotal += size;
    codeTotal += size;
    P->codeBands += (lh + kFdCodeRows - 1) / kFdCodeRows;
    P->scanBands += (fd_window_rows(L) + kFdScanRows - 1) / kFdScanRows;
  }
  if (P->n == 0) return true;
  P->greys = static_cast<unsigned char*>(px_malloc(greyTotal > 0 ? greyTotal : 1, 1));
  P->codes = static_cast<unsigned short*>(px_malloc(codeTotal, sizeof(unsigned short)));
  P->bands = static_cast<FdScanBand*>(px_malloc(P->scanBands > 0 ? P->scanBands : 1, sizeof(FdScanBand)));
  if (!P->greys || !P->codes || !P->bands) {
    fd_plan_free(P);
    return false;
  }
  size_t greyAt = 0, codeAt = 0;
  for (int k = 0; k < P->n; ++k) {
    FdLevel& L = P->level[k];
    const size_t size = static_cast<size_t>(L.w) * L.h;
    if (L.w != width || L.h != height) {
      L.own = P->greys + greyAt;
      L.grey = L.own;
      greyAt += size;
    }
    L.mct = P->codes + codeAt;
    codeAt += size;
    // The codes the census walk leaves out (the first row and the first code
    // of the second, the last row and the last code before it) are zero, as
    // in a cleared buffer; the scan never reads them.
    std::memset(L.mct, 0, (static_cast<size_t>(L.w) + 1) * sizeof(unsigned short));
    std::memset(L.mct + size - L.w - 1, 0, (static_cast<size_t>(L.w) + 1) * sizeof(unsigned short));
    const int rows = fd_window_rows(L);
    for (int row = 0, b = L.scanBand0; row < rows; row += kFdScanRows, ++b) {
      P->bands[b].level = k;
      P->bands[b].row0 = row;
      P->bands[b].row1 = row + kFdScanRows < rows ? row + kFdScanRows : rows;
    }
  }
  return true;
}

// The plans' resampling, census codes and scans, all of one kind at once
// over the worker threads (the tasks of every plan in one pool, so several
// pictures keep both cores busy where one alone leaves gaps).
void fd_run_plans(FdPlan* plans, int count) {
  int levels[4] = {}, codes[4] = {}, scans[4] = {};  // task counts before plan p
  for (int p = 0; p < count; ++p) {
    levels[p + 1] = levels[p] + plans[p].n;
    codes[p + 1] = codes[p] + plans[p].codeBands;
    scans[p + 1] = scans[p] + plans[p].scanBands;
  }
  auto plan_of = [&](const int* first, int task) {
    int p = 0;
    while (p + 1 < count && task >= first[p + 1]) ++p;
    return p;
  };
  fd_run_tasks(levels[count], [&](int t) {
    FdPlan& P = plans[plan_of(levels, t)];
    const FdLevel& L = P.level[t - levels[&P - plans]];
    if (L.own) Resize_NN(P.grey, P.width, P.height, L.own, L.w, L.h);
  });
  fd_run_tasks(codes[count], [&](int t) {
    FdPlan& P = plans[plan_of(codes, t)];
    const int b = t - codes[&P - plans];
    const FdLevel& L = P.level[fd_band_level(P.level, P.n, b, false)];
    const int row0 = (b - L.codeBand0) * kFdCodeRows;
    image2MCT_FD_rows(L.grey, L.w, L.h, row0, row0 + kFdCodeRows < L.h ? row0 + kFdCodeRows : L.h, L.mct);
  });
  fd_run_tasks(scans[count], [&](int t) {
    FdPlan& P = plans[plan_of(scans, t)];
    const int b = t - scans[&P - plans];
    fd_scan_band(P.level[P.bands[b].level], &P.bands[b]);
  });
}

// Enrols a plan's hits on the calling thread in the plain scan's order.
void fd_enrol_plan(const FdPlan& P) {
  for (int b = 0; b < P.scanBands; ++b) {
    const FdLevel& L = P.level[P.bands[b].level];
    if (P.bands[b].full) {
      fd_scan_band_enrolling(L, P.bands[b]);
      continue;
    }
    for (int i = 0; i < P.bands[b].hits; ++i) {
      const FdHit& hit = P.bands[b].hit[i];
      fd_enroll_hit(hit.x, hit.y, L.scale, hit.sum);
    }
  }
}

// False when the buffers cannot be had (the caller then takes the plain pass).
bool fd_scan_levels_threaded(const unsigned char* grey, int width, int height, int r, int levels) {
  FdPlan plan;
  if (!fd_plan(&plan, grey, width, height, r, levels)) return false;
  fd_run_plans(&plan, 1);
  fd_enrol_plan(plan);
  fd_plan_free(&plan);
  return true;
}

// The picture's r (shorter over longer side, Q15).
int fd_ratio(int width, int height) {
  const int longer = width > height ? width : height, shorter = width > height ? height : width;
  return static_cast<int>((static_cast<int64_t>(shorter) << 15) / longer);
}

// A pass's candidates that stand become faces (turned back for the turned
// passes).
void fd_keep_candidates(int width, int height, int rotated, int angle) {
  for (int i = 0; i < m_nFaceCandidateCountFrontal; ++i) {
    if (!m_bFaceCandidateValidFrontal[i] || m_nFaceCandidateIntersectionCountFrontal[i] < 3) continue;
    SMyRect2 box = m_rcFaceCandidateFrontal[i];
    if (rotated) box = InvRotate(box, width, height, angle);
    fd_add_face(box, m_nFaceCandidateConfidenceFrontal[i], rotated ? angle : 0);
  }
}

// The upright and the two turned passes scanned together: their tasks share
// the workers, then each pass enrols its hits and keeps its faces in the
// order of the passes one after the other. False (nothing done) when the
// buffers cannot be had.
bool fd_three_passes(const unsigned char* grey, int width, int height, int precision) {
  const size_t n = static_cast<size_t>(width) * height;
  auto* turned = static_cast<unsigned char*>(px_malloc(n, 2));
  if (!turned) return false;
  Rotate(grey, turned, width, height, 45);
  Rotate(grey, turned + n, width, height, -45);
  const int r = fd_ratio(width, height), levels = fd_pyramid_count(precision);
  FdPlan plans[3];
  const unsigned char* pictures[3] = {grey, turned, turned + n};
  int planned = 0;
  while (planned < 3 && fd_plan(&plans[planned], pictures[planned], width, height, r, levels)) ++planned;
  if (planned == 3) {
    fd_run_plans(plans, 3);
    static const int kAngle[3] = {0, 45, -45};
    for (int p = 0; p < 3; ++p) {
      fd_reset_candidates();
      fd_enrol_plan(plans[p]);
      fd_keep_candidates(width, height, p > 0, kAngle[p]);
    }
  }
  for (int p = 0; p < planned; ++p) fd_plan_free(&plans[p]);
  px_free(turned);
  return planned == 3;
}
}  // namespace

int fd_find_run(const unsigned char* grey, int width, int height, int unusedFlag, int rotated, int angle,
                int precision) {
  (void)unusedFlag;
  fd_reset_candidates();
  if (!grey || width < 1 || height < 1) return m_nFaceCount;
  const int r = fd_ratio(width, height);
  const int levels = fd_pyramid_count(precision);
  if (px_scalar_only() || !fd_scan_levels_threaded(grey, width, height, r, levels))
    fd_scan_levels_plain(grey, width, height, r, levels);
  fd_keep_candidates(width, height, rotated, angle);
  return m_nFaceCount;
}

void fd_final() {
  for (int i = 0; i < m_nFaceCount; ++i) {
    if (!m_bFaceValid[i]) continue;
    for (int j = i + 1; j < m_nFaceCount; ++j) {
      if (!m_bFaceValid[j] || !fd_isintersection(m_rcFace[i], m_rcFace[j])) continue;
      if (m_nFaceConfidence[i] > m_nFaceConfidence[j])
        m_bFaceValid[i] = 0;
      else
        m_bFaceValid[j] = 0;
    }
  }
}

int fd_find(const unsigned char* grey, int width, int height, int rotatedPasses, int unusedFlag, int precision) {
  fd_reset_faces();
  const bool together = rotatedPasses && grey && width > 0 && height > 0 && !px_scalar_only() &&
                        fd_three_passes(grey, width, height, precision);
  if (!together) fd_find_run(grey, width, height, unusedFlag, 0, 0, precision);
  if (!together && rotatedPasses && grey && width > 0 && height > 0) {
    auto* turned = static_cast<unsigned char*>(px_malloc(static_cast<size_t>(width) * height, 1));
    if (turned) {
      Rotate(grey, turned, width, height, 45);
      fd_find_run(turned, width, height, unusedFlag, 1, 45, precision);
      Rotate(grey, turned, width, height, -45);
      fd_find_run(turned, width, height, unusedFlag, 1, -45, precision);
      px_free(turned);
    }
  }
  fd_final();
  m_nFaceFinalCount = 0;
  for (int i = 0; i < m_nFaceCount; ++i) {
    if (!m_bFaceValid[i]) continue;
    m_rcFinalFace[m_nFaceFinalCount] = m_rcFace[i];
    m_nFaceFinalRIP[m_nFaceFinalCount] = m_nFaceRIP[i];
    ++m_nFaceFinalCount;
  }
  return m_nFaceFinalCount;
}

int fd_where(SMyRect2* out) {
  if (m_nFaceFinalCount == 0 || !out) return 0;
  for (int i = 0; i < m_nFaceFinalCount; ++i) out[i] = m_rcFinalFace[i];
  return 1;
}

int fd_final_rip(int i) { return (i >= 0 && i < m_nFaceFinalCount) ? m_nFaceFinalRIP[i] : 0; }

FdCandidateView fd_candidates() {
  return {m_nFaceCandidateCountFrontal, m_rcFaceCandidateFrontal, m_nFaceCandidateConfidenceFrontal,
          m_nFaceCandidateIntersectionCountFrontal, m_bFaceCandidateValidFrontal};
}

FdCandidateView fd_faces() { return {m_nFaceCount, m_rcFace, m_nFaceConfidence, m_nFaceRIP, m_bFaceValid}; }
