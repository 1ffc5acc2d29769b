#include "fd_detector.h"

#include <cmath>
#include <cstring>

#include "effect/kalo/px_mem.h"
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
  for (int oy = 0; oy < height; ++oy) {
    const int dy = cy - oy;
    for (int ox = 0; ox < width; ++ox) {
      const int dx = ox - cx;
      const int sx = cx + ((dx * c - dy * s) >> 10);
      const int sy = cy - ((dx * s + dy * c) >> 10);
      dst[static_cast<size_t>(oy) * width + ox] =
          (sx >= 0 && sx < width && sy >= 0 && sy < height) ? src[static_cast<size_t>(sy) * width + sx] : 0;
    }
  }
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

int fd_find_run(const unsigned char* grey, int width, int height, int unusedFlag, int rotated, int angle,
                int precision) {
  (void)unusedFlag;
  fd_reset_candidates();
  if (!grey || width < 1 || height < 1) return m_nFaceCount;
  const int longer = width > height ? width : height, shorter = width > height ? height : width;
  const int r = static_cast<int>((static_cast<int64_t>(shorter) << 15) / longer);
  const int levels = fd_pyramid_count(precision);
  // One buffer pair for the largest level used.
  const int top = kFdPyramid[levels - 1] < longer ? kFdPyramid[levels - 1] : longer;
  const size_t cap = static_cast<size_t>(top) * top;
  auto* level = static_cast<unsigned char*>(px_malloc(cap, 1));
  auto* mct = static_cast<unsigned short*>(px_calloc(cap, sizeof(unsigned short)));
  if (level && mct) {
    for (int k = 0; k < levels; ++k) {
      const int s = kFdPyramid[k];
      if (s > longer) break;
      int other = width == height ? s : static_cast<int>((static_cast<int64_t>(s) * r) >> 15);
      if (other < 4) other = 4;
      const int lw = width >= height ? s : other, lh = width >= height ? other : s;
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
  for (int i = 0; i < m_nFaceCandidateCountFrontal; ++i) {
    if (!m_bFaceCandidateValidFrontal[i] || m_nFaceCandidateIntersectionCountFrontal[i] < 3) continue;
    SMyRect2 box = m_rcFaceCandidateFrontal[i];
    if (rotated) box = InvRotate(box, width, height, angle);
    fd_add_face(box, m_nFaceCandidateConfidenceFrontal[i], rotated ? angle : 0);
  }
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
  fd_find_run(grey, width, height, unusedFlag, 0, 0, precision);
  if (rotatedPasses && grey && width > 0 && height > 0) {
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
