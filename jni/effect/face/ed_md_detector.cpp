#include "ed_md_detector.h"

#include <cstdint>
#include <cstring>

#include "effect/kalo/px_mem.h"
#include "fd_detector.h"
#include "models/face_models.h"

const int kEdStageFeatures[3] = {22, 36, 100};
const int kEdStageThresholds[3] = {7270, 10956, 17510};
const int kMdStageFeatures[3] = {10, 20, 30};
const int kMdStageThresholds[3] = {5836, 8499, 12390};

namespace {
// One candidate list with confidence sums (eyes: left and right; mouth).
struct CandidateList {
  SMyRect2 rect[kEdListSize];
  int confidence[kEdListSize];
  int intersections[kEdListSize];
  int confidenceSum[kEdListSize];
  unsigned char valid[kEdListSize];
  int count;
};

CandidateList m_ed_left, m_ed_right, m_md_list;
SMyRect2 m_ed_rcEyeCandidateLeft, m_ed_rcEyeCandidateRight, m_md_rcMouthCandidate;
SMyRect2 m_ed_rcLeft, m_ed_rcRight, m_md_rcMouth;

struct MouthHit {
  uint16_t left, top, right, bottom, confidence;
  uint8_t cls;
};
MouthHit m_md_log[m_nMouthTotalLimit];
int m_nMouthTotal = 0;

void clear(CandidateList* l) { std::memset(l, 0, sizeof *l); }

// Enrols a hit; returns the candidate index it went to, or -1 when the list
// is full.
int enroll(CandidateList* l, SMyRect2 hit, int confidence) {
  if (l->count > kEdListSize - 1) return -1;
  int target = -1;
  for (int i = 0; i < l->count; ++i) {
    if (!l->valid[i] || !ed_isintersection(l->rect[i], hit)) continue;
    l->intersections[i] += 1;
    l->confidenceSum[i] += confidence;
    if (l->confidence[i] > confidence) {
      l->rect[i] = hit;
      l->confidence[i] = confidence;
    }
    target = i;
    break;
  }
  if (target < 0) {
    target = l->count++;
    l->rect[target] = hit;
    l->confidence[target] = confidence;
    l->intersections[target] = 1;
    l->confidenceSum[target] = confidence;
    l->valid[target] = 1;
  }
  for (int i = 0; i < l->count; ++i) {
    if (!l->valid[i]) continue;
    for (int j = i + 1; j < l->count; ++j) {
      if (!l->valid[j] || !ed_isintersection(l->rect[i], l->rect[j])) continue;
      if (l->confidence[j] < l->confidence[i]) {
        l->valid[i] = 0;
        l->intersections[j] += l->intersections[i];
        l->confidenceSum[j] += l->confidenceSum[i];
      } else {
        l->valid[j] = 0;
        l->intersections[i] += l->intersections[j];
        l->confidenceSum[i] += l->confidenceSum[j];
      }
    }
  }
  return target;
}

// Largest intersection count; the walk starts from candidate 0 whether or
// not it is valid.
int select_largest(const CandidateList* l) {
  int best = 0, bestCount = l->intersections[0];
  for (int i = 1; i < l->count; ++i)
    if (l->valid[i] && l->intersections[i] > bestCount) {
      best = i;
      bestCount = l->intersections[i];
    }
  return bestCount < 3 ? -1 : best;
}

int eval(const unsigned short* mct, int lw, int x, int y, const uint16_t* fx, const uint16_t* fy,
         const int32_t* alpha, const int* features, const int* thresholds, int* lastSum) {
  int f = 0, sum = 0;
  for (int s = 0; s < 3; ++s) {
    sum = 0;
    for (int e = f + features[s]; f < e; ++f) sum += alpha[f * kMctCodes + mct[(y + fy[f]) * lw + x + fx[f]]];
    if (sum > thresholds[s]) {
      if (lastSum) *lastSum = sum;
      return s;
    }
  }
  if (lastSum) *lastSum = sum;
  return 3;
}

// Scans one level with a ww x wh window; every hit goes to `hit` in region
// coordinates.
template <typename Hit>
void scan(const unsigned short* mct, int lw, int lh, int regionWidth, int ww, int wh, const uint16_t* fx,
          const uint16_t* fy, const int32_t* alpha, const int* features, const int* thresholds, Hit hit) {
  const int64_t scale = (static_cast<int64_t>(regionWidth) << 15) / lw;
  for (int y = 0; y < lh - wh; ++y)
    for (int x = 0; x < lw - ww; ++x) {
      int sum = 0;
      if (eval(mct, lw, x, y, fx, fy, alpha, features, thresholds, &sum) != 3) continue;
      SMyRect2 box;
      box.left = static_cast<int>((x * scale) >> 15);
      box.top = static_cast<int>((y * scale) >> 15);
      box.right = box.left + static_cast<int>((ww * scale) >> 15);
      box.bottom = box.top + static_cast<int>((wh * scale) >> 15);
      hit(box, static_cast<int>((sum * 256) / 17408.0));
    }
}

// Resamples, codes and scans every level of one region.
template <typename Hit>
void scan_region(const unsigned char* region, int rw, int rh, int minH, int ww, int wh, const uint16_t* fx,
                 const uint16_t* fy, const int32_t* alpha, const int* features, const int* thresholds, Hit hit) {
  int widths[4], heights[4];
  int n = edmd_levels(rw, rh, minH, widths, heights);
  if (n == 0) return;
  size_t cap = static_cast<size_t>(widths[0]) * heights[0];
  auto* level = static_cast<unsigned char*>(px_malloc(cap, 1));
  auto* mct = static_cast<unsigned short*>(px_calloc(cap, sizeof(unsigned short)));
  if (level && mct)
    for (int k = 0; k < n; ++k) {
      Resize_BI(region, rw, rh, level, widths[k], heights[k]);
      std::memset(mct, 0, cap * sizeof(unsigned short));
      image2MCT9_1(level, widths[k], heights[k], mct);
      scan(mct, widths[k], heights[k], rw, ww, wh, fx, fy, alpha, features, thresholds, hit);
    }
  px_free(level);
  px_free(mct);
}

int width_of(SMyRect2 r) { return r.right - r.left; }
int height_of(SMyRect2 r) { return r.bottom - r.top; }
}  // namespace

int ed_isintersection(SMyRect2 a, SMyRect2 b) { return fd_isintersection(a, b); }
int md_isintersection(SMyRect2 a, SMyRect2 b) { return fd_isintersection(a, b); }

int edmd_levels(int rw, int rh, int minH, int* widths, int* heights) {
  if (rw < 1 || rh < 1) return 0;
  const double ratio = static_cast<double>(rh) / rw;
  int w = 33, h = static_cast<int>(33 * ratio + 0.5), n = 0;
  while (n < 4 && w > 22 && h > minH) {
    widths[n] = w;
    heights[n] = h;
    ++n;
    w -= 3;
    h = static_cast<int>(w * ratio + 0.5);
  }
  return n;
}

void edmd_copy_region(const unsigned char* grey, int width, int height, SMyRect2 r, unsigned char* dst) {
  const int rw = width_of(r), rh = height_of(r);
  for (int y = 0; y < rh; ++y) {
    int sy = r.top + y;
    sy = sy < 0 ? 0 : (sy >= height ? height - 1 : sy);
    for (int x = 0; x < rw; ++x) {
      int sx = r.left + x;
      sx = sx < 0 ? 0 : (sx >= width ? width - 1 : sx);
      dst[static_cast<size_t>(y) * rw + x] = grey[static_cast<size_t>(sy) * width + sx];
    }
  }
}

void ed_regions(SMyRect2 face, SMyRect2* left, SMyRect2* right) {
  const int hw = static_cast<int>((face.right - face.left) * 0.5 + 0.5);
  const int hh = static_cast<int>((face.bottom - face.top) * 0.5 + 0.5);
  *left = SMyRect2{face.left, face.top, face.left + hw, face.top + hh};
  *right = SMyRect2{face.left + hw, face.top, face.right, face.top + hh};
}

SMyRect2 md_region(SMyRect2 face, int height) {
  const int h = face.bottom - face.top, m = h / 20;
  SMyRect2 r{face.left + m, face.top + h / 2, face.right - m, face.bottom + m};
  if (r.bottom >= height) r.bottom = height - 1;
  return r;
}

int ed_eval_window(const unsigned short* mct, int lw, int x, int y, int* lastSum) {
  return eval(mct, lw, x, y, m_nEyeMCTFeatureX, m_nEyeMCTFeatureY, m_nEDMCTAlpha, kEdStageFeatures,
              kEdStageThresholds, lastSum);
}

int md_eval_window(const unsigned short* mct, int lw, int x, int y, int* lastSum) {
  return eval(mct, lw, x, y, m_nMouthMCTFeatureX, m_nMouthMCTFeatureY, m_nMDMCTAlpha, kMdStageFeatures,
              kMdStageThresholds, lastSum);
}

void ed_reset() {
  clear(&m_ed_left);
  clear(&m_ed_right);
  m_ed_rcLeft = m_ed_rcRight = SMyRect2{0, 0, 0, 0};
}

void ed_enroll(int list, SMyRect2 hit, int confidence) { enroll(list ? &m_ed_right : &m_ed_left, hit, confidence); }

EdCandidateView ed_candidates(int list) {
  const CandidateList* l = list == 2 ? &m_md_list : (list ? &m_ed_right : &m_ed_left);
  return {l->count, l->rect, l->confidence, l->intersections, l->confidenceSum, l->valid};
}

int ed_select(int list) { return select_largest(list ? &m_ed_right : &m_ed_left); }

int ed_find(const unsigned char* grey, int width, int height, SMyRect2 face) {
  ed_reset();
  if (!grey || width < 1 || height < 1) return 0;
  ed_regions(face, &m_ed_rcEyeCandidateLeft, &m_ed_rcEyeCandidateRight);
  for (int side = 0; side < 2; ++side) {
    SMyRect2 r = side ? m_ed_rcEyeCandidateRight : m_ed_rcEyeCandidateLeft;
    const int rw = width_of(r), rh = height_of(r);
    if (rw < 1 || rh < 1) continue;
    auto* region = static_cast<unsigned char*>(px_malloc(static_cast<size_t>(rw) * rh, 1));
    if (!region) continue;
    edmd_copy_region(grey, width, height, r, region);
    if (side) FlipX(region, rw, rh);
    CandidateList* l = side ? &m_ed_right : &m_ed_left;
    scan_region(region, rw, rh, 22, kEdWindow, kEdWindow, m_nEyeMCTFeatureX, m_nEyeMCTFeatureY, m_nEDMCTAlpha,
                kEdStageFeatures, kEdStageThresholds, [l](SMyRect2 box, int conf) { enroll(l, box, conf); });
    px_free(region);
  }
  const int left = select_largest(&m_ed_left);
  if (left < 0) return 0;
  const int right = select_largest(&m_ed_right);
  if (right < 0) return 0;
  m_ed_rcLeft = m_ed_left.rect[left];
  m_ed_rcRight = m_ed_right.rect[right];
  return 1;
}

void ed_where(SMyPoint2* first, SMyPoint2* second) {
  const SMyRect2 &a = m_ed_rcLeft, &b = m_ed_rcRight;
  if (first) {
    first->x = m_ed_rcEyeCandidateLeft.left + a.left + ((a.right - a.left) >> 1);
    first->y = m_ed_rcEyeCandidateLeft.top + a.top + ((a.bottom - a.top) >> 1);
  }
  if (second) {
    second->x = m_ed_rcEyeCandidateRight.right - b.left - ((b.right - b.left) >> 1);
    second->y = m_ed_rcEyeCandidateRight.top + b.top + ((b.bottom - b.top) >> 1);
  }
}

void ed_whereBox(SMyRect2* left, SMyRect2* right) {
  if (left) *left = m_ed_rcLeft;
  if (right) *right = m_ed_rcRight;
}

void md_reset() {
  clear(&m_md_list);
  m_nMouthTotal = 0;
  m_md_rcMouth = SMyRect2{0, 0, 0, 0};
}

static uint16_t u16(int v) { return static_cast<uint16_t>(v < 0 ? 0 : (v > 65535 ? 65535 : v)); }

void md_enroll(SMyRect2 hit, int confidence) {
  int target = enroll(&m_md_list, hit, confidence);
  if (target >= 0 && m_nMouthTotal < m_nMouthTotalLimit)
    m_md_log[m_nMouthTotal++] = MouthHit{u16(hit.left), u16(hit.top), u16(hit.right), u16(hit.bottom),
                                         u16(confidence), static_cast<uint8_t>(target)};
}

int md_localize() {
  const CandidateList* l = &m_md_list;
  if (l->count == 0) return 0;
  int best = -1;
  for (int i = 0; i < l->count; ++i)
    if (l->valid[i] && (best < 0 || l->confidence[i] < l->confidence[best])) best = i;
  if (best < 0 || l->intersections[best] < 1) return 0;
  int64_t total = 0;
  int n = 0;
  for (int k = 0; k < m_nMouthTotal; ++k)
    if (m_md_log[k].cls == best) {
      total += m_md_log[k].confidence;
      ++n;
    }
  if (n == 0) return 0;
  const int64_t mean = total / n;
  int64_t sl = 0, st = 0, sr = 0, sb = 0;
  int below = 0;
  for (int k = 0; k < m_nMouthTotal; ++k) {
    const MouthHit& h = m_md_log[k];
    if (h.cls != best || h.confidence >= mean) continue;
    sl += h.left;
    st += h.top;
    sr += h.right;
    sb += h.bottom;
    ++below;
  }
  if (below == 0) return 0;  // every hit had the mean confidence: nothing to average
  const double d = below;
  m_md_rcMouth = SMyRect2{static_cast<int>(sl / d + 0.5), static_cast<int>(st / d + 0.5),
                          static_cast<int>(sr / d + 0.5), static_cast<int>(sb / d + 0.5)};
  return 1;
}

int md_find(const unsigned char* grey, int width, int height, SMyRect2 face) {
  md_reset();
  if (!grey || width < 1 || height < 1) return 0;
  const SMyRect2 r = md_region(face, height);
  m_md_rcMouthCandidate = r;
  const int rw = width_of(r), rh = height_of(r);
  if (rw < 1 || rh < 1) return 0;
  auto* region = static_cast<unsigned char*>(px_malloc(static_cast<size_t>(rw) * rh, 1));
  if (!region) return 0;
  edmd_copy_region(grey, width, height, r, region);
  scan_region(region, rw, rh, m_nMouthLowerH, kMdWindowW, kMdWindowH, m_nMouthMCTFeatureX, m_nMouthMCTFeatureY,
              m_nMDMCTAlpha, kMdStageFeatures, kMdStageThresholds,
              [](SMyRect2 box, int conf) { md_enroll(box, conf); });
  px_free(region);
  if (!md_localize()) return 0;
  m_md_rcMouth.left += r.left;
  m_md_rcMouth.right += r.left;
  m_md_rcMouth.top += r.top;
  m_md_rcMouth.bottom += r.top;
  return 1;
}

void md_whereBox(SMyRect2* box) {
  if (box) *box = m_md_rcMouth;
}
