// Selective blur, tilt-shift, miniature and out-focus blur on a reduced copy
// of the picture.
#include "../px_math.h"
#include "px_blur.h"

#include <atomic>
#include <cstdint>
#include <cstring>

#include "../kalo/iel/iel.h"
#include "../kalo/px_mem.h"
#include "../kalo/px_parallel.h"
#include "../px_color/px_tone.h"
#include "../px_types.h"

namespace {
// Kept between calls.
unsigned char* g_ssrc = nullptr;   // reduced picture, packed RGB
unsigned char* g_tempd = nullptr;  // reduced mask (selective blur only)
unsigned char* g_sblur = nullptr;  // blurred reduced picture
int g_scaled_wd = 0;
int g_scaled_ht = 0;
int resize_ratio = 0;  // reduction shift of the tilt-shift initialisation
int all = 0;           // 1: the selective blur covers the whole picture

// Weights by distance from the centre tap.
constexpr int kKernel[5] = {9, 8, 7, 5, 3};

// Tap range [start, end) of the selective blur by level; odd levels reach one
// tap further left than right.
struct Taps {
  int start, end;
};
constexpr Taps kTaps[9] = {{0, 1}, {-1, 1}, {-1, 2}, {-2, 2}, {-2, 3}, {-3, 3}, {-3, 4}, {-4, 4}, {-4, 5}};

Taps taps_of(int level) {
  if (level < 0) level = 0;  // no blur for a negative level, as for level 0
  return kTaps[level > 8 ? 8 : level];
}

// Radius of the out-focus blur by level.
constexpr int kOutfocusRadius[8] = {3, 7, 15, 31, 41, 49, 55, 63};

bool is_empty(int left, int right, int top, int bottom) { return left > right || top > bottom; }

size_t area(int w, int h) { return static_cast<size_t>(w) * static_cast<size_t>(h); }


// Sampling position of one output row or column on the reduced picture:
// 17.15 accumulator, index masked to `bits` (11 bits, so a reduced side above
// 2048 wraps, except for thin strips: see px_blur_thin), 5-bit fraction, an
// index at or beyond the last one clamped to the last but one. A reduced side
// of 1 pairs its only row with itself.
struct Sample {
  int i0, i1, f;
};
Sample sample(int pos, int64_t step, int n, int64_t bits) {
  const int64_t a = static_cast<int64_t>(pos) * step;
  int i = static_cast<int>((a >> 15) & bits);
  const int f = static_cast<int>((a >> 10) & 31);
  if (i >= n - 1) i = n >= 2 ? n - 2 : 0;
  return {i, i + 1 < n ? i + 1 : i, f};
}

// The index mask of the upsampling of a full-size picture.
int64_t index_bits(int width, int height) { return px_blur_thin(width, height) ? INT32_MAX : 0x7FF; }

// The reduction shift of the size table alone.
int table_shift(int width, int height) {
  const int m = width > height ? width : height;
  return m > 3250 ? 4 : m > 1650 ? 3 : m > 850 ? 2 : m > 420 ? 1 : 0;
}

// 17.15 step from a full-size side to its reduced side (64-bit so that huge
// sides cannot overflow).
int64_t step_of(int reduced, int full) { return (static_cast<int64_t>(reduced) << 15) / full; }

// One separable pass: for every pixel, the taps [start, end) along the pass
// direction (stride `along` bytes between neighbours, `n` pixels on the line,
// `pos` the pixel's place on it). Masked passes replace an unselected
// neighbour by the centre pixel with weight 9.
template <bool kMasked>
void blur_line(const unsigned char* src, unsigned char* dst, const unsigned char* mask, int n, int along_px,
               Taps taps) {
  for (int pos = 0; pos < n; ++pos) {
    const unsigned char* c = src + static_cast<size_t>(pos) * along_px * 3;
    int sum[3] = {0, 0, 0};
    int weight = 0;
    for (int o = taps.start; o < taps.end; ++o) {
      const int q = pos + o;
      if (q < 0 || q >= n) continue;
      const int k = kKernel[o < 0 ? -o : o];
      if (!kMasked || mask[static_cast<size_t>(q) * along_px] == 1) {
        const unsigned char* p = src + static_cast<size_t>(q) * along_px * 3;
        sum[0] += p[0] * k;
        sum[1] += p[1] * k;
        sum[2] += p[2] * k;
        weight += k;
      } else {
        sum[0] += c[0] * 9;
        sum[1] += c[1] * 9;
        sum[2] += c[2] * 9;
        weight += 9;
      }
    }
    unsigned char* d = dst + static_cast<size_t>(pos) * along_px * 3;
    for (int ch = 0; ch < 3; ++ch) d[ch] = static_cast<unsigned char>(px_clamp255(((sum[ch] << 10) / weight) >> 10));
  }
}

// Horizontal pass into a scratch buffer (the one given, or one of its own),
// then vertical pass into dst.
template <bool kMasked>
bool separable_blur(const unsigned char* src, unsigned char* dst, const unsigned char* mask, int w, int h,
                    Taps taps, unsigned char* scratch = nullptr) {
  if (!src || !dst || w <= 0 || h <= 0) return false;
  auto* tmp = scratch ? scratch : static_cast<unsigned char*>(px_malloc(area(w, h), 3));
  if (!tmp) return false;
  for (int y = 0; y < h; ++y) {
    const size_t row = area(w, y);
    blur_line<kMasked>(src + row * 3, tmp + row * 3, kMasked ? mask + row : nullptr, w, 1, taps);
  }
  for (int x = 0; x < w; ++x) {
    blur_line<kMasked>(tmp + static_cast<size_t>(x) * 3, dst + static_cast<size_t>(x) * 3,
                       kMasked ? mask + x : nullptr, h, w, taps);
  }
  if (tmp != scratch) px_free(tmp);
  return true;
}

// The reduced picture (and mask) for a full-size picture; owns its buffers.
struct Reduced {
  int w = 0, h = 0;
  unsigned char* pic = nullptr;
  unsigned char* mask = nullptr;
  unsigned char* blurred = nullptr;
  void release() {
    px_free(pic);
    px_free(mask);
    px_free(blurred);
    pic = mask = blurred = nullptr;
  }
};

// Allocates the reduced buffers (blurred one zero-filled); false (all freed)
// on failure.
bool allocate(Reduced& r, int width, int height, bool with_mask) {
  const int k = px_blur_reduction_shift(width, height);
  r.w = width >> k;
  r.h = height >> k;
  const size_t n = area(r.w, r.h);
  r.pic = static_cast<unsigned char*>(px_malloc(n, 3));
  r.blurred = static_cast<unsigned char*>(px_calloc(n * 3, 1));
  r.mask = with_mask ? static_cast<unsigned char*>(px_malloc(n, 1)) : nullptr;
  if (!r.pic || !r.blurred || (with_mask && !r.mask)) {
    r.release();
    return false;
  }
  return true;
}

// The reduced mask; an empty rectangle fills the caller's mask with 1 while
// it is reduced and with 0 afterwards.
void reduce_mask(unsigned char* mask, bool whole, int width, int height, const Reduced& r) {
  if (whole && mask) std::memset(mask, 1, area(width, height));
  scale_down_depth(mask, width, height, r.mask, r.w, r.h);
  if (whole && mask) std::memset(mask, 0, area(width, height));
}
}  // namespace

int px_blur_all() { return all; }

int px_blur_reduction_shift(int width, int height) {
  int k = table_shift(width, height);
  // A very thin picture is reduced less, so that no reduced side is empty.
  while (k > 0 && ((width >> k) < 1 || (height >> k) < 1)) --k;
  return k;
}

bool px_blur_thin(int width, int height) { return px_blur_reduction_shift(width, height) != table_shift(width, height); }

namespace {
// Steps of the point-sampled reduction: crossed on purpose (along a row the
// height ratio, between rows the width ratio; equal for the reduced sizes of
// the size table on ordinary pictures), except for a thin strip, whose sides
// are reduced by different amounts and so take each its own ratio.
bool reduction_steps(int width, int height, int dstWidth, int dstHeight, int* along, int* between) {
  if (width <= 0 || height <= 0 || dstWidth <= 0 || dstHeight <= 0) return false;
  const bool thin = px_blur_thin(width, height);
  *along = thin ? width / dstWidth : height / dstHeight;
  *between = thin ? height / dstHeight : width / dstWidth;
  return *along > 0 && *between > 0 && width / dstWidth > 0;
}
}  // namespace

void scale_down_img(const int* src, int width, int height, unsigned char* dst, int dstWidth, int dstHeight) {
  int stepX, stepY;
  if (!src || !dst || !reduction_steps(width, height, dstWidth, dstHeight, &stepX, &stepY)) return;
  int count = width / (width / dstWidth);
  if (count > dstWidth) count = dstWidth;
  for (int r = 0; r < dstHeight; ++r) {
    int sy = static_cast<int>(static_cast<int64_t>(r) * stepY < height ? r * stepY : height - 1);
    const int* row = src + area(width, sy);
    unsigned char* out = dst + area(dstWidth, r) * 3;
    for (int i = 0; i < count; ++i) {
      const int64_t sx64 = static_cast<int64_t>(i) * stepX;
      const auto v = static_cast<uint32_t>(row[sx64 < width ? sx64 : width - 1]);
      out[3 * i] = static_cast<unsigned char>(v >> 16);
      out[3 * i + 1] = static_cast<unsigned char>(v >> 8);
      out[3 * i + 2] = static_cast<unsigned char>(v);
    }
    std::memset(out + 3 * count, 0, static_cast<size_t>(dstWidth - count) * 3);
  }
}

void scale_down_depth(const unsigned char* src, int width, int height, unsigned char* dst, int dstWidth,
                      int dstHeight) {
  int stepX, stepY;
  if (!dst || !reduction_steps(width, height, dstWidth, dstHeight, &stepX, &stepY)) return;
  int count = width / (width / dstWidth);
  if (count > dstWidth) count = dstWidth;
  for (int r = 0; r < dstHeight; ++r) {
    int sy = static_cast<int>(static_cast<int64_t>(r) * stepY < height ? r * stepY : height - 1);
    unsigned char* out = dst + area(dstWidth, r);
    for (int i = 0; i < count; ++i) {
      const int64_t sx64 = static_cast<int64_t>(i) * stepX;
      out[i] = src ? src[area(width, sy) + (sx64 < width ? sx64 : width - 1)] : 1;
    }
    std::memset(out + count, 0, static_cast<size_t>(dstWidth - count));
  }
}

bool make_gaussian_blur(const unsigned char* src, unsigned char* dst, const unsigned char* mask, int w, int h,
                        int level) {
  if (!mask) return false;
  return separable_blur<true>(src, dst, mask, w, h, taps_of(level));
}

bool make_tiltshift(const unsigned char* src, unsigned char* dst, int w, int h) {
  return separable_blur<false>(src, dst, nullptr, w, h, Taps{-4, 5});
}

namespace {
// The compositing of run_blur, sped up: the column samples are taken once
// for the whole picture, and each output row first blends its two reduced
// rows vertically, v = p_top * (32 - fy) + p_bottom * fy, kept unshifted;
// a pixel whose four reduced neighbours are all selected is then
// (v0 * (32 - fx) + v1 * fx) >> 10, the same integer as the plain bilinear
// sum. Pixels with an unselected neighbour take the plain per-channel form.
// False when the working memory cannot be had.
bool run_blur_rows(const int* src, const unsigned char* blurred, const unsigned char* mask,
                   const unsigned char* reducedMask, int* dst, int width, int height, int w, int h) {
  const int64_t stepY = step_of(h, height);
  const int64_t stepX = step_of(w, width);
  const int64_t bits = index_bits(width, height);
  const bool whole = all != 0;
  constexpr int kMinRows = 64;
  const int bands = px_band_count(height, kMinRows);
  // Per band: the blended reduced row (3 ints a reduced pixel) and its
  // "both rows selected" flags.
  // (Rounded up to 16 bytes, so that every band's ints are aligned.)
  const size_t per_band = (static_cast<size_t>(w) * 3 * sizeof(int32_t) + static_cast<size_t>(w) + 15) & ~size_t{15};
  auto* cols = static_cast<Sample*>(px_malloc(static_cast<size_t>(width), sizeof(Sample)));
  auto* work = static_cast<unsigned char*>(px_malloc(per_band, static_cast<size_t>(bands)));
  if (!cols || !work) {
    px_free(cols);
    px_free(work);
    return false;
  }
  for (int x = 0; x < width; ++x) cols[x] = sample(x, stepX, w, bits);
  std::atomic<int> next{0};
  px_for_rows(
      height,
      [&](int y0, int y1) {
        unsigned char* mine = work + per_band * static_cast<size_t>(next.fetch_add(1));
        auto* v = reinterpret_cast<int32_t*>(mine);
        unsigned char* both = mine + static_cast<size_t>(w) * 3 * sizeof(int32_t);
        for (int y = y0; y < y1; ++y) {
          const Sample sy = sample(y, stepY, h, bits);
          const size_t top = area(w, sy.i0), bottom = area(w, sy.i1);
          const int wy0 = 32 - sy.f, wy1 = sy.f;
          for (int j = 0; j < w; ++j) {
            const unsigned char* pt = blurred + (top + j) * 3;
            const unsigned char* pb = blurred + (bottom + j) * 3;
            for (int c = 0; c < 3; ++c) v[3 * j + c] = pt[c] * wy0 + pb[c] * wy1;
            both[j] = reducedMask[top + j] == 1 && reducedMask[bottom + j] == 1;
          }
          const size_t row = area(width, y);
          for (int x = 0; x < width; ++x) {
            const size_t i = row + x;
            const auto s = static_cast<uint32_t>(src[i]);
            if (!whole && mask && mask[i] != 1) {
              dst[i] = src[i];
              continue;
            }
            const Sample sx = cols[x];
            const int wx0 = 32 - sx.f, wx1 = sx.f;
            uint32_t out = s & 0xFF000000u;
            if (both[sx.i0] && both[sx.i1]) {
              const int32_t* a = v + 3 * sx.i0;
              const int32_t* b = v + 3 * sx.i1;
              for (int c = 0; c < 3; ++c)
                out |= static_cast<uint32_t>((a[c] * wx0 + b[c] * wx1) >> 10) << (16 - 8 * c);
            } else {
              const size_t corner[4] = {top + sx.i0, top + sx.i1, bottom + sx.i0, bottom + sx.i1};
              for (int c = 0; c < 3; ++c) {
                const int own = static_cast<int>((s >> (16 - 8 * c)) & 255);
                int p[4];
                for (int k = 0; k < 4; ++k) p[k] = reducedMask[corner[k]] == 1 ? blurred[corner[k] * 3 + c] : own;
                const int t = p[0] * wx0 + p[1] * wx1, bt = p[2] * wx0 + p[3] * wx1;
                out |= static_cast<uint32_t>((t * wy0 + bt * wy1) >> 10) << (16 - 8 * c);
              }
            }
            dst[i] = static_cast<int>(out);
          }
        }
      },
      kMinRows);
  px_free(work);
  px_free(cols);
  return true;
}
}  // namespace

bool run_blur(const int* src, const unsigned char* blurred, const unsigned char* mask,
              const unsigned char* reducedMask, int* dst, int width, int height, int w, int h) {
  if (!src || !blurred || !reducedMask || !dst || width <= 0 || height <= 0 || w <= 0 || h <= 0) return true;
  // The fast form without its working memory writes nothing: the caller
  // reports the shortage.
  if (!px_scalar_only()) return run_blur_rows(src, blurred, mask, reducedMask, dst, width, height, w, h);
  const int64_t stepY = step_of(h, height);
  const int64_t stepX = step_of(w, width);
  const int64_t bits = index_bits(width, height);
  const bool whole = all != 0;
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const Sample sy = sample(y, stepY, h, bits);
      const size_t row = area(width, y);
      for (int x = 0; x < width; ++x) {
        const size_t i = row + x;
        const auto s = static_cast<uint32_t>(src[i]);
        if (!whole && mask && mask[i] != 1) {
          dst[i] = src[i];
          continue;
        }
        const Sample sx = sample(x, stepX, w, bits);
        const size_t corner[4] = {area(w, sy.i0) + sx.i0, area(w, sy.i0) + sx.i1, area(w, sy.i1) + sx.i0,
                                  area(w, sy.i1) + sx.i1};
        int ch[3];
        for (int c = 0; c < 3; ++c) {
          const int own = static_cast<int>((s >> (16 - 8 * c)) & 255);
          int p[4];
          for (int k = 0; k < 4; ++k) p[k] = reducedMask[corner[k]] == 1 ? blurred[corner[k] * 3 + c] : own;
          const int top = p[0] * (32 - sx.f) + p[1] * sx.f;
          const int bottom = p[2] * (32 - sx.f) + p[3] * sx.f;
          ch[c] = (top * (32 - sy.f) + bottom * sy.f) >> 10;
        }
        dst[i] = static_cast<int>((s & 0xFF000000u) | static_cast<uint32_t>(ch[0]) << 16 |
                                  static_cast<uint32_t>(ch[1]) << 8 | static_cast<uint32_t>(ch[2]));
      }
    }
  });
  return true;
}

namespace {
// restore_tiltshift with the rows blended first, as run_blur_rows (a = the
// row's sharpness weight). False when the working memory cannot be had.
constexpr int kTiltRows = 64;  // rows per band of the tilt-shift restore

// The working memory of restore_tiltshift_rows, taken before anything is
// written where a caller needs that.
struct TiltMemory {
  Sample* cols = nullptr;
  unsigned char* work = nullptr;
  bool take(int width, int height, int w) {
    cols = static_cast<Sample*>(px_malloc(static_cast<size_t>(width), sizeof(Sample)));
    work = static_cast<unsigned char*>(
        px_malloc(static_cast<size_t>(w) * 3 * sizeof(int32_t), static_cast<size_t>(px_band_count(height, kTiltRows))));
    if (cols && work) return true;
    release();
    return false;
  }
  void release() {
    px_free(cols);
    px_free(work);
    cols = nullptr;
    work = nullptr;
  }
};

bool restore_tiltshift_rows(const int* src, const unsigned char* blurred, int* dst, int width, int height, int w,
                            int h, int64_t d, int64_t k, int center, int halfBand, const TiltMemory& memory) {
  const int64_t stepY = step_of(h, height);
  const int64_t stepX = step_of(w, width);
  const int64_t bits = index_bits(width, height);
  constexpr int kMinRows = kTiltRows;
  const size_t per_band = static_cast<size_t>(w) * 3 * sizeof(int32_t);
  Sample* cols = memory.cols;
  unsigned char* work = memory.work;
  for (int x = 0; x < width; ++x) cols[x] = sample(x, stepX, w, bits);
  std::atomic<int> next{0};
  px_for_rows(
      height,
      [&](int y0, int y1) {
        auto* v = reinterpret_cast<int32_t*>(work + per_band * static_cast<size_t>(next.fetch_add(1)));
        for (int y = y0; y < y1; ++y) {
          int64_t beyond =
              (y > center ? static_cast<int64_t>(y) - center : static_cast<int64_t>(center) - y) - halfBand;
          if (beyond < 0) beyond = 0;
          int64_t a64 = ((d - beyond) * k) >> 20;
          const int a = a64 < 0 ? 0 : static_cast<int>(a64);
          const Sample sy = sample(y, stepY, h, bits);
          const unsigned char* pt = blurred + area(w, sy.i0) * 3;
          const unsigned char* pb = blurred + area(w, sy.i1) * 3;
          const int wy0 = 32 - sy.f, wy1 = sy.f;
          for (int j = 0; j < 3 * w; ++j) v[j] = pt[j] * wy0 + pb[j] * wy1;
          const size_t row = area(width, y);
          for (int x = 0; x < width; ++x) {
            const size_t i = row + x;
            const auto s = static_cast<uint32_t>(src[i]);
            const Sample sx = cols[x];
            const int32_t* p0 = v + 3 * sx.i0;
            const int32_t* p1 = v + 3 * sx.i1;
            const int wx0 = 32 - sx.f, wx1 = sx.f;
            uint32_t out = s & 0xFF000000u;
            for (int c = 0; c < 3; ++c) {
              int b = (p0[c] * wx0 + p1[c] * wx1) >> 10;
              if (b > 255) b = 255;
              const int own = static_cast<int>((s >> (16 - 8 * c)) & 255);
              out |= static_cast<uint32_t>(px_clamp255((b * (256 - a) + own * a) >> 8)) << (16 - 8 * c);
            }
            dst[i] = static_cast<int>(out);
          }
        }
      },
      kMinRows);
  return true;
}

bool restore_tiltshift_with(const int* src, const unsigned char* blurred, int* dst, int width, int height, int w,
                            int h, int center, int halfBand, const TiltMemory* held);
}  // namespace

bool restore_tiltshift(const int* src, const unsigned char* blurred, int* dst, int width, int height, int w, int h,
                       int center, int halfBand) {
  return restore_tiltshift_with(src, blurred, dst, width, height, w, h, center, halfBand, nullptr);
}

namespace {
// restore_tiltshift with the fast form's memory already held (or taken here
// when `held` is null); false, with nothing written, when it cannot be had.
bool restore_tiltshift_with(const int* src, const unsigned char* blurred, int* dst, int width, int height, int w, int h,
                            int center, int halfBand, const TiltMemory* held) {
  if (!src || !blurred || !dst || width <= 0 || height <= 0 || w <= 0 || h <= 0) return true;
  const int64_t stepY = step_of(h, height);
  const int64_t stepX = step_of(w, width);
  const int64_t bits = index_bits(width, height);
  // Half the distance from the band's edge to the farther picture edge. A
  // band reaching that edge would make it 0 (or less): it is taken as 1, so
  // the band is sharp and any row beyond it fully blurred.
  int64_t d = static_cast<int64_t>(height) - center < center
                  ? (static_cast<int64_t>(center) - halfBand) >> 1
                  : (static_cast<int64_t>(height) - center - halfBand) >> 1;
  if (d < 1) d = 1;
  const int64_t k = d > 0x100000 ? 0 : (0x100000 / d) * 256;
  if (!px_scalar_only()) {
    if (held) return restore_tiltshift_rows(src, blurred, dst, width, height, w, h, d, k, center, halfBand, *held);
    TiltMemory memory;
    if (!memory.take(width, height, w)) return false;
    restore_tiltshift_rows(src, blurred, dst, width, height, w, h, d, k, center, halfBand, memory);
    memory.release();
    return true;
  }
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      int64_t beyond = (y > center ? static_cast<int64_t>(y) - center : static_cast<int64_t>(center) - y) - halfBand;
      if (beyond < 0) beyond = 0;
      int64_t a64 = ((d - beyond) * k) >> 20;
      const int a = a64 < 0 ? 0 : static_cast<int>(a64);
      const Sample sy = sample(y, stepY, h, bits);
      const size_t row = area(width, y);
      for (int x = 0; x < width; ++x) {
        const size_t i = row + x;
        const auto s = static_cast<uint32_t>(src[i]);
        const Sample sx = sample(x, stepX, w, bits);
        const unsigned char* p00 = blurred + (area(w, sy.i0) + sx.i0) * 3;
        const unsigned char* p01 = blurred + (area(w, sy.i0) + sx.i1) * 3;
        const unsigned char* p10 = blurred + (area(w, sy.i1) + sx.i0) * 3;
        const unsigned char* p11 = blurred + (area(w, sy.i1) + sx.i1) * 3;
        uint32_t out = s & 0xFF000000u;
        for (int c = 0; c < 3; ++c) {
          const int top = p00[c] * (32 - sx.f) + p01[c] * sx.f;
          const int bottom = p10[c] * (32 - sx.f) + p11[c] * sx.f;
          int b = (top * (32 - sy.f) + bottom * sy.f) >> 10;
          if (b > 255) b = 255;
          const int own = static_cast<int>((s >> (16 - 8 * c)) & 255);
          out |= static_cast<uint32_t>(px_clamp255((b * (256 - a) + own * a) >> 8)) << (16 - 8 * c);
        }
        dst[i] = static_cast<int>(out);
      }
    }
  });
  return true;
}
}  // namespace

// ---- selective blur -----------------------------------------------------------

int px_Init_blur(const int* src, unsigned char* mask, int width, int height, int left, int right, int top,
                 int bottom) {
  px_destroy_blur();
  if (!src || width <= 0 || height <= 0) return PX_ERR_NULL;
  const bool whole = is_empty(left, right, top, bottom);
  all = whole ? 1 : 0;
  Reduced r;
  if (!allocate(r, width, height, true)) return PX_ERR_ALLOC;
  scale_down_img(src, width, height, r.pic, r.w, r.h);
  reduce_mask(mask, whole, width, height, r);
  g_ssrc = r.pic;
  g_tempd = r.mask;
  g_sblur = r.blurred;
  g_scaled_wd = r.w;
  g_scaled_ht = r.h;
  return PX_OK;
}

void px_make_blur_preview(const int* src, const unsigned char* mask, int* dst, int width, int height, int level) {
  if (!g_ssrc || !g_tempd || !g_sblur || !src || !dst || width <= 0 || height <= 0) return;
  if (!make_gaussian_blur(g_ssrc, g_sblur, g_tempd, g_scaled_wd, g_scaled_ht, level)) return;
  run_blur(src, g_sblur, mask, g_tempd, dst, width, height, g_scaled_wd, g_scaled_ht);  // short of memory: dst as it was
}

int px_make_blur(const int* src, unsigned char* mask, int* dst, int width, int height, int level, int left,
                 int right, int top, int bottom) {
  if (!src || !dst || width <= 0 || height <= 0) return PX_ERR_NULL;
  const bool whole = is_empty(left, right, top, bottom);
  Reduced r;
  if (!allocate(r, width, height, true)) return PX_ERR_ALLOC;
  if (whole && mask) std::memset(mask, 1, area(width, height));
  scale_down_img(src, width, height, r.pic, r.w, r.h);
  scale_down_depth(mask, width, height, r.mask, r.w, r.h);
  int rc = PX_ERR_ALLOC;
  if (make_gaussian_blur(r.pic, r.blurred, r.mask, r.w, r.h, level)) {
    if (run_blur(src, r.blurred, mask, r.mask, dst, width, height, r.w, r.h)) rc = PX_OK;
  }
  r.release();
  if (whole && mask) std::memset(mask, 0, area(width, height));
  return rc;
}

void px_destroy_blur() {
  px_free(g_ssrc);
  px_free(g_tempd);
  px_free(g_sblur);
  g_ssrc = g_tempd = g_sblur = nullptr;
}

// ---- tilt-shift -----------------------------------------------------------------

int px_init_tiltshift(const int* src, int width, int height) {
  px_destroy_blur();
  if (!src || width <= 0 || height <= 0) return PX_ERR_NULL;
  Reduced r;
  if (!allocate(r, width, height, false)) return PX_ERR_ALLOC;
  resize_ratio = px_blur_reduction_shift(width, height);
  scale_down_img(src, width, height, r.pic, r.w, r.h);
  g_ssrc = r.pic;
  g_sblur = r.blurred;
  g_scaled_wd = r.w;
  g_scaled_ht = r.h;
  return PX_OK;
}

void px_tiltshift_preview(const int* src, int* dst, int width, int height, int center, int halfBand) {
  if (!g_ssrc || !g_sblur || !src || !dst || width <= 0 || height <= 0) return;
  if (!make_tiltshift(g_ssrc, g_sblur, g_scaled_wd, g_scaled_ht)) return;
  restore_tiltshift(src, g_sblur, dst, width, height, g_scaled_wd, g_scaled_ht, center, halfBand);  // short of memory: dst as it was
}

namespace {
// Tilt-shift with every buffer taken before the picture is read or written,
// so that a shortage of memory leaves dst as it was. `before(dst)` runs once
// the buffers are held (the miniature's saturation).
template <class Before>
int tiltshift(const int* src, int* dst, int width, int height, int center, int halfBand, Before before) {
  if (!src || !dst || width <= 0 || height <= 0) return PX_ERR_NULL;
  Reduced r;
  if (!allocate(r, width, height, false)) return PX_ERR_ALLOC;
  auto* scratch = static_cast<unsigned char*>(px_malloc(area(r.w, r.h), 3));
  TiltMemory rows;
  if (!scratch || (!px_scalar_only() && !rows.take(width, height, r.w))) {
    px_free(scratch);
    r.release();
    return PX_ERR_ALLOC;
  }
  before();
  scale_down_img(src, width, height, r.pic, r.w, r.h);
  separable_blur<false>(r.pic, r.blurred, nullptr, r.w, r.h, Taps{-4, 5}, scratch);
  px_free(scratch);
  px_free(r.pic);
  r.pic = nullptr;
  restore_tiltshift_with(src, r.blurred, dst, width, height, r.w, r.h, center, halfBand,
                         px_scalar_only() ? nullptr : &rows);
  rows.release();
  r.release();
  return PX_OK;
}
}  // namespace

int px_apply_tiltshift(const int* src, int* dst, int width, int height, int center, int halfBand) {
  return tiltshift(src, dst, width, height, center, halfBand, [] {});
}

int px_apply_miniature(const int* src, int* dst, int width, int height) {
  if (!src || !dst || width <= 0 || height <= 0) return PX_ERR_NULL;
  return tiltshift(dst, dst, width, height, height >> 1, height >> 3,
                   [&] { px_control_saturation_all(const_cast<int*>(src), dst, width, height, 16); });
}

void px_destroy_tiltshift() {
  px_free(g_ssrc);
  px_free(g_sblur);
  g_ssrc = g_sblur = nullptr;
}

// ---- out-focus ---------------------------------------------------------------------

int px_blur_outfocus_radius(int level) { return kOutfocusRadius[level < 0 ? 0 : (level > 7 ? 7 : level)]; }

int px_blur_outfocus(int* src, int* dst, int width, int height, int level) {
  return px_blur_variable(src, dst, width, height, px_blur_outfocus_radius(level));
}

int px_blur_variable(int* src, int* dst, int width, int height, int radius) {
  structIELImage in{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(src)};
  structIELImage out{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(dst)};
  structIELEffectParams params{IEL_EFFECT_VARIABLE_BLUR, &radius, nullptr, 0, 0};
  return IEL_Apply_Effect(&in, &out, &params);
}
