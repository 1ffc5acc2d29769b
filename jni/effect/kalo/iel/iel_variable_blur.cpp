// Effect 38, the variable blur: a smooth, Gaussian-looking blur of a given
// radius r on ARGB pixels (sigma roughly r / 3, at least 0.7; reaching about
// r pixels) whose cost hardly grows with the radius.
//
// Design. The blur proper has a small radius q: the binomial kernel of 2q + 1
// taps C(2q, j) / 4^q (sigma sqrt(q / 2)), applied as one weighted sum of
// bytes per direction and rounded once per direction; the horizontal result
// is kept as 8-bit values for the vertical direction. Borders repeat the
// edge pixel.
//
// Radii up to kDirectRadius (3) blur at full size with q = r. Larger radii
// blur a reduced picture: blocks of k x k pixels, k = max(2, round(2r / 9)),
// become their rounded means (the blocks of the last column and row may be
// smaller), the reduced picture is blurred with q = 3 (q = 2 for radii 5 to
// 8 and q = 1 for radius 4, whose blocks are 2 x 2: a sigma nearer r / 3, and
// less work), and every output pixel is interpolated bilinearly from the blurred blocks around its centre
// (pixel x lies at block coordinate (x + 0.5) / k - 0.5, clamped at the
// borders; the weights are that position in 256ths, across first, each
// direction rounded). The three steps add up to a sigma of about 1.3 k
// (q = 3), 1.1 k (q = 2) or 0.85 k (q = 1), near r / 3, and an impulse spreads at most r + 2 pixels
// (k (q + 1) + (k - 1) / 2 of them); a constant picture stays constant. So
// above the direct radii the cost is one reduction and one interpolation of
// the picture whatever the radius.
//
// Lanes: a pixel's four bytes are four lanes worked alike (alpha too: the
// result keeps the input's alpha), eight 16-bit lanes at a time (every sum
// fits 16 bits). Rows go to the row-band workers: a band of the blur makes
// the horizontal rows it needs (the q rows around it too) in a ring of
// 2q + 1 rows and writes its own output rows; reduction and interpolation
// write their own rows. Every row is computed the same way whichever band
// takes it, so the result does not depend on the number of threads (nor on
// GLIMMER_SCALAR). The output may be the input itself (the full-size blur
// then works from a copy of it). Radii above kMaxRadius blur as kMaxRadius.
#include <array>
#include <atomic>
#include <cstdint>
#include <cstring>

#include "../if_utils_and.h"
#include "../px_parallel.h"
#include "iel_variable_blur.h"
#include "iel_internal.h"

namespace {
constexpr int kMaxRadius = 300;
constexpr int kDirectRadius = 3;   // larger radii blur a reduced picture
constexpr int kReducedRadius = 3;  // the blur of the reduced picture
constexpr int kSmallReduced = 8;   // up to this radius the reduced picture blurs with q = 2 (radius 4: q = 1)
constexpr int kMinRowsPerBand = 16;

// Eight byte lanes widened to 16 bits (GCC/Clang vector extensions: SSE2
// on the host, NEON on ARM, plain code elsewhere).
typedef uint8_t u8x8 __attribute__((vector_size(8)));
typedef uint16_t u16x8 __attribute__((vector_size(16)));
typedef uint16_t u16x4 __attribute__((vector_size(8)));
typedef uint32_t u32x4 __attribute__((vector_size(16)));
typedef uint32_t u32x2 __attribute__((vector_size(8)));

// gcc on x86 lowers the widening conversion into two loads and shuffles per
// lane group; an interleave with zero bytes (one load, one PUNPCKLBW) gives
// the same lanes.
#if defined(__SSE2__) && !defined(__clang__)
typedef uint8_t u8x16 __attribute__((vector_size(16)));
typedef uint64_t u64x2l __attribute__((vector_size(16)));
inline u16x8 load8(const uint8_t* p) {
  uint64_t bits;
  std::memcpy(&bits, p, 8);
  const u8x16 v = reinterpret_cast<u8x16>(u64x2l{bits, 0});
  return reinterpret_cast<u16x8>(
      __builtin_shufflevector(v, u8x16{}, 0, 16, 1, 17, 2, 18, 3, 19, 4, 20, 5, 21, 6, 22, 7, 23));
}
#else
inline u16x8 load8(const uint8_t* p) {
  u8x8 v;
  std::memcpy(&v, p, 8);
  return __builtin_convertvector(v, u16x8);
}
#endif
inline void store8(uint8_t* p, u16x8 v) {
  const u8x8 b = __builtin_convertvector(v, u8x8);
  std::memcpy(p, &b, 8);
}

// Two pixels' colour bytes from v with the alpha bytes of the two pixels at a.
inline void store8_alpha(uint8_t* p, u16x8 v, const uint8_t* a) {
  const u8x8 colour = __builtin_convertvector(v, u8x8);
  u8x8 alpha;
  std::memcpy(&alpha, a, 8);
  const u8x8 mask = {0, 0, 0, 0xFF, 0, 0, 0, 0xFF};
  const u8x8 b = (colour & ~mask) | (alpha & mask);
  std::memcpy(p, &b, 8);
}

// The binomial kernel of radius Q: C(2Q, j) for j = 0..2Q, summing to 4^Q
// (at most 64: Q <= 3).
template <int Q>
constexpr std::array<uint16_t, 2 * Q + 1> binomial() {
  std::array<uint16_t, 2 * Q + 1> w{};
  w[0] = 1;
  for (int n = 1; n <= 2 * Q; ++n) {
    for (int j = n; j > 0; --j) w[j] = static_cast<uint16_t>(w[j] + w[j - 1]);
  }
  return w;
}

// The taps of a kernel unrolled (gcc's -O2 keeps such short loops rolled and
// then reloads the weights and the lanes at every tap).
#if defined(__clang__)
#define PX_UNROLL _Pragma("clang loop unroll(full)")
#elif defined(__GNUC__)
#define PX_UNROLL _Pragma("GCC unroll 8")
#else
#define PX_UNROLL
#endif

inline int clamp_index(int i, int n) { return i < 0 ? 0 : (i >= n ? n - 1 : i); }

// One row of n pixels (4n bytes) blurred along itself into out.
template <int Q>
void blur_row(const uint8_t* in, uint8_t* out, int n) {
  static constexpr std::array<uint16_t, 2 * Q + 1> W = binomial<Q>();
  constexpr int shift = 2 * Q;
  constexpr uint16_t half = 1u << (shift - 1);
  auto edge = [&](int x) {
    for (int c = 0; c < 4; ++c) {
      unsigned s = half;
      for (int j = 0; j < 2 * Q + 1; ++j) s += W[j] * in[4 * clamp_index(x + j - Q, n) + c];
      out[4 * x + c] = static_cast<uint8_t>(s >> shift);
    }
  };
  const int inner0 = Q < n ? Q : n, inner1 = n - Q > inner0 ? n - Q : inner0;
  for (int x = 0; x < inner0; ++x) edge(x);
  // Inner pixels, eight lanes (two pixels) at a time; the last odd pixel by itself.
  int x = inner0;
  for (; x + 2 <= inner1; x += 2) {
    const uint8_t* p = in + 4 * x;
    u16x8 s = u16x8{} + half + W[Q] * load8(p);
    PX_UNROLL for (int j = 0; j < Q; ++j) s += W[j] * (load8(p + 4 * (j - Q)) + load8(p + 4 * (Q - j)));
    store8(out + 4 * x, s >> shift);
  }
  for (; x < n; ++x) edge(x);
}

// The binomial sum of 2Q + 1 rows of `bytes` bytes (a multiple of 4) into
// out, each pixel's alpha byte taken from `alpha`.
template <int Q>
void blur_column(const uint8_t* const* rows, uint8_t* out, const uint8_t* alpha, int bytes) {
  static constexpr std::array<uint16_t, 2 * Q + 1> W = binomial<Q>();
  constexpr int shift = 2 * Q;
  constexpr uint16_t half = 1u << (shift - 1);
  int i = 0;
  for (; i + 8 <= bytes; i += 8) {
    u16x8 s = u16x8{} + half + W[Q] * load8(rows[Q] + i);
    PX_UNROLL for (int j = 0; j < Q; ++j) s += W[j] * (load8(rows[j] + i) + load8(rows[2 * Q - j] + i));
    store8_alpha(out + i, s >> shift, alpha + i);
  }
  for (; i < bytes; ++i) {
    if (i % 4 == 3) {
      out[i] = alpha[i];
      continue;
    }
    unsigned s = half;
    for (int j = 0; j < 2 * Q + 1; ++j) s += W[j] * rows[j][i];
    out[i] = static_cast<uint8_t>(s >> shift);
  }
}

// Rows y0..y1 of the blur of src (w x h) into dst with the alpha of
// alpha_src; `work` holds 2Q + 1 rows of w pixels.
template <int Q>
void blur_band(const uint32_t* src, const uint32_t* alpha_src, uint32_t* dst, int w, int h, int y0, int y1,
               uint8_t* work) {
  const size_t row_bytes = static_cast<size_t>(w) * 4;
  uint8_t* ring = work;
  auto slot = [&](int y) { return ring + static_cast<size_t>(y % (2 * Q + 1)) * row_bytes; };
  int made = y0 - Q > 0 ? y0 - Q : 0;  // next horizontal row to make
  for (int y = y0; y < y1; ++y) {
    const int last = y + Q < h ? y + Q : h - 1;
    for (; made <= last; ++made) {
      blur_row<Q>(reinterpret_cast<const uint8_t*>(src + static_cast<size_t>(made) * w), slot(made), w);
    }
    const uint8_t* rows[2 * Q + 1];
    for (int j = 0; j < 2 * Q + 1; ++j) rows[j] = slot(clamp_index(y + j - Q, h));
    blur_column<Q>(rows, reinterpret_cast<uint8_t*>(dst + static_cast<size_t>(y) * w),
                   reinterpret_cast<const uint8_t*>(alpha_src + static_cast<size_t>(y) * w), static_cast<int>(row_bytes));
  }
}

// Bytes of one band's working memory for the blur of radius q on rows of w pixels.
uint64_t blur_work_bytes(int q, int w) { return static_cast<uint64_t>(2 * q + 1) * static_cast<uint64_t>(w) * 4; }

// round(v / d) by a 32-bit reciprocal rounded up (d >= 2; exact for the
// sums of a constant picture).
inline uint32_t reciprocal_of(uint32_t d) { return static_cast<uint32_t>(((uint64_t{1} << 32) + d - 1) / d); }
inline uint32_t divide(uint32_t v, uint32_t half, uint32_t reciprocal) {
  return static_cast<uint32_t>((static_cast<uint64_t>(v + half) * reciprocal) >> 32);
}

struct Job {
  const uint32_t* src;  // the picture read (a copy when blurring in place at full size)
  const uint32_t* alpha;
  uint32_t* dst;
  int w, h;
  int q;  // radius of the blur proper
  int k;  // block side (1: full size)
  int rw, rh;
  uint32_t* reduced;  // rw x rh
  uint32_t* blurred;  // rw x rh
  uint16_t phase[kMaxRadius];  // interpolation across: weight of the right block (of 256) by phase in a span
  unsigned char* slots;
  size_t slot_bytes;
  std::atomic<int> next_slot{0};

  unsigned char* take_slot() { return slots + slot_bytes * static_cast<size_t>(next_slot.fetch_add(1)); }
};

void blur(Job& job, const uint32_t* src, const uint32_t* alpha, uint32_t* dst, int w, int h, int q, int y0, int y1) {
  auto* work = job.take_slot();
  switch (q) {
    case 1: blur_band<1>(src, alpha, dst, w, h, y0, y1, work); break;
    case 2: blur_band<2>(src, alpha, dst, w, h, y0, y1, work); break;
    default: blur_band<3>(src, alpha, dst, w, h, y0, y1, work); break;
  }
}

// Reduced row j for blocks of 2 x 2 (k = 2) with both rows inside the
// picture: the same rounded means, (sum + 2) >> 2 a lane, two blocks at a
// time. A 64-bit lane holds one block's two pixels of a row; masking every
// other byte spreads them into 16-bit fields (blue and red, or green and
// alpha, of both pixels), the rows and then the lane's halves are added, and
// the low half holds the block's four sums. The last block of an odd width
// goes the general way.
typedef uint64_t u64x2 __attribute__((vector_size(16)));
void reduce_pairs(const Job& job, int j) {
  const auto* r0 = reinterpret_cast<const uint8_t*>(job.src + static_cast<size_t>(2 * j) * job.w);
  const auto* r1 = r0 + static_cast<size_t>(job.w) * 4;
  uint32_t* out = job.reduced + static_cast<size_t>(j) * job.rw;
  const int full_blocks = job.w / 2;
  const u64x2 mask = u64x2{} + 0x00FF00FF00FF00FFull, round = u64x2{} + 0x0002000200020002ull;
  int i = 0;
  for (; i + 2 <= full_blocks; i += 2) {
    u64x2 a, b;
    std::memcpy(&a, r0 + 8 * i, 16);
    std::memcpy(&b, r1 + 8 * i, 16);
    u64x2 lo = (a & mask) + (b & mask), hi = ((a >> 8) & mask) + ((b >> 8) & mask);
    lo = (((lo + (lo >> 32)) + round) >> 2) & mask;
    hi = (((hi + (hi >> 32)) + round) >> 2) & mask;
    const u64x2 px = lo | hi << 8;
    out[i] = 0xFF000000u | static_cast<uint32_t>(px[0]);
    out[i + 1] = 0xFF000000u | static_cast<uint32_t>(px[1]);
  }
  for (; i < full_blocks; ++i) {
    const uint8_t* a = r0 + 8 * i;
    const uint8_t* b = r1 + 8 * i;
    uint32_t v = 0xFF000000u;
    for (int c = 0; c < 3; ++c) v |= static_cast<uint32_t>((a[c] + a[c + 4] + b[c] + b[c + 4] + 2) >> 2) << (8 * c);
    out[i] = v;
  }
}

// Reduced rows j0..j1: the rounded means of the k x k blocks. The column
// sums of a block row fit 16 bits (k <= 67).
void reduce(Job& job, int j0, int j1) {
  auto* sums = reinterpret_cast<uint16_t*>(job.take_slot());
  const int w = job.w, k = job.k;
  const int lanes = 4 * w;
  for (int j = j0; j < j1; ++j) {
    const int y0 = j * k, y1 = y0 + k < job.h ? y0 + k : job.h;
    const bool pairs = k == 2 && y1 - y0 == 2 && !px_scalar_only();
    if (pairs) {
      reduce_pairs(job, j);
      if (w % 2 == 0) continue;  // otherwise the last block below
    }
    std::memset(sums, 0, static_cast<size_t>(lanes) * 2);
    for (int y = y0; y < y1; ++y) {
      const auto* row = reinterpret_cast<const uint8_t*>(job.src + static_cast<size_t>(y) * w);
      int i = 0;
      for (; i + 8 <= lanes; i += 8) {
        u16x8 s;
        std::memcpy(&s, sums + i, 16);
        s += load8(row + i);
        std::memcpy(sums + i, &s, 16);
      }
      for (; i < lanes; ++i) sums[i] = static_cast<uint16_t>(sums[i] + row[i]);
    }
    uint32_t* out = job.reduced + static_cast<size_t>(j) * job.rw;
    const uint32_t full = static_cast<uint32_t>(k * (y1 - y0));
    const uint32_t full_rec = full > 1 ? reciprocal_of(full) : 0;
    // A power of 2 divides by a shift (the reciprocal then is exact: the same values).
    int full_shift = -1;
    if ((full & (full - 1)) == 0) {
      full_shift = 0;
      while ((1u << full_shift) < full) ++full_shift;
    }
    for (int i = pairs ? w / 2 : 0; i < job.rw; ++i) {
      const int x0 = i * k, x1 = x0 + k < w ? x0 + k : w;
      const uint32_t count = static_cast<uint32_t>((x1 - x0) * (y1 - y0));
      const uint32_t rec = count == full ? full_rec : (count > 1 ? reciprocal_of(count) : 0);
      u32x4 s = {};
      for (int x = x0; x < x1; ++x) {
        u16x4 v;
        std::memcpy(&v, sums + 4 * x, 8);
        s += __builtin_convertvector(v, u32x4);
      }
      if (count == full && full_shift >= 0) {
        const u32x4 m = (s + (full >> 1)) >> full_shift;
        out[i] = 0xFF000000u | m[2] << 16 | m[1] << 8 | m[0];
        continue;
      }
      if (count == 1) {  // a corner block of one pixel (the reciprocal needs 33 bits)
        out[i] = 0xFF000000u | s[2] << 16 | s[1] << 8 | s[0];
        continue;
      }
      out[i] = 0xFF000000u | divide(s[2], count / 2, rec) << 16 | divide(s[1], count / 2, rec) << 8 |
               divide(s[0], count / 2, rec);
    }
  }
}

// The blurred block row i enlarged across to w pixels (each lane rounded).
// Pixels left of the first block centre and right of the last take those
// blocks; in between, the k pixels of a span between two centres share the
// pair of blocks and take the weights of their phase (the same for every
// span), two pixels at a time.
void enlarge_row(const Job& job, int i, uint8_t* out) {
  const auto* row = reinterpret_cast<const uint32_t*>(job.blurred + static_cast<size_t>(i) * job.rw);
  auto* o = reinterpret_cast<uint32_t*>(out);
  const int w = job.w, k = job.k, x0 = k / 2 < w ? k / 2 : w;
  for (int x = 0; x < x0; ++x) o[x] = row[0];
  // The weights of each pair of phases, lane by lane.
  u16x8 pair[kMaxRadius / 2 + 1];
  for (int p = 0; p + 1 < k; p += 2) {
    const uint16_t f0 = job.phase[p], f1 = job.phase[p + 1];
    pair[p / 2] = u16x8{f0, f0, f0, f0, f1, f1, f1, f1};
  }
  int x = x0;
  u16x8 q = __builtin_convertvector(reinterpret_cast<u8x8>(u32x2{row[0], row[0]}), u16x8);
  for (int b = 0; b + 1 < job.rw && x < w; ++b) {
    const u16x8 p = q;
    q = __builtin_convertvector(reinterpret_cast<u8x8>(u32x2{row[b + 1], row[b + 1]}), u16x8);
    const int end = x + k < w ? x + k : w;
    int phase = 0;
    for (; x + 2 <= end; x += 2, phase += 2) {
      const u16x8 wq = pair[phase / 2];
      store8(out + 4 * static_cast<size_t>(x), ((256 - wq) * p + wq * q + 128) >> 8);
    }
    for (; x < end; ++x, ++phase) {
      const unsigned wq = job.phase[phase], wp = 256 - wq;
      const auto* pb = reinterpret_cast<const uint8_t*>(row + b);
      const auto* qb = reinterpret_cast<const uint8_t*>(row + b + 1);
      for (int c = 0; c < 4; ++c) out[4 * x + c] = static_cast<uint8_t>((wp * pb[c] + wq * qb[c] + 128) >> 8);
    }
  }
  for (; x < w; ++x) o[x] = row[job.rw - 1];
}

// Output rows y0..y1: the blurred blocks interpolated back to full size,
// across first (block rows enlarged once each and kept while rows use
// them), then down.
void enlarge(Job& job, int y0, int y1) {
  auto* work = job.take_slot();
  const size_t row_bytes = static_cast<size_t>(job.w) * 4;
  uint8_t* across[2] = {work, work + row_bytes};
  int held[2] = {-1, -1};  // the block rows in across[]
  const int k2 = 2 * job.k;
  for (int y = y0; y < y1; ++y) {
    // Block coordinate of the row's centre in units of 1 / 2k.
    const int t = 2 * y + 1 - job.k;
    const int i0 = t >= 0 ? t / k2 : -((-t + k2 - 1) / k2);
    const int a = clamp_index(i0, job.rh), b = clamp_index(i0 + 1, job.rh);
    const uint8_t* rows[2];
    for (int n = 0; n < 2; ++n) {
      const int want = n == 0 ? a : b;
      int at = held[0] == want ? 0 : (held[1] == want ? 1 : -1);
      if (at < 0) {
        at = (held[0] == a || held[0] == b) ? 1 : 0;
        enlarge_row(job, want, across[at]);
        held[at] = want;
      }
      rows[n] = across[at];
    }
    const uint16_t fb = static_cast<uint16_t>(((t - i0 * k2) * 256 + job.k) / k2), fa = static_cast<uint16_t>(256 - fb);
    const int lanes = static_cast<int>(row_bytes);
    auto* d = reinterpret_cast<uint8_t*>(job.dst + static_cast<size_t>(y) * job.w);
    const auto* al = reinterpret_cast<const uint8_t*>(job.alpha + static_cast<size_t>(y) * job.w);
    int i = 0;
    for (; i + 8 <= lanes; i += 8) {
      store8_alpha(d + i, (fa * load8(rows[0] + i) + fb * load8(rows[1] + i) + 128) >> 8, al + i);
    }
    for (; i < lanes; ++i) {
      d[i] = i % 4 == 3 ? al[i] : static_cast<uint8_t>((fa * rows[0][i] + fb * rows[1][i] + 128) >> 8);
    }
  }
}
}  // namespace

int IEL_Apply_VariableBlur(structIELImage* input, structIELImage* output, structIELEffectParams* params) {
  if (input->format != IEL_FORMAT_ARGB_PACK) {
    // Kept as it always was: reported as success, the output is not written.
    if_error_msg("IEL_Apply_Effect", __LINE__, "Written for ARGB format only \n");
    return IEL_OK;
  }
  return IEL_VariableBlur_ARGB8888(input, output, params->level ? *params->level : 0);
}

int IEL_VariableBlur_ARGB8888(structIELImage* input, structIELImage* output, int radius) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1,
                                     [](int f) { return f == IEL_FORMAT_ARGB_PACK; })) {
    return rc;
  }
  IELProgressScope progress;
  const int w = input->width;
  const int h = input->height;
  const auto* src = reinterpret_cast<const uint32_t*>(input->buffer);
  auto* dst = reinterpret_cast<uint32_t*>(output->buffer);
  if (radius <= 0) {  // no blur: a copy
    if (dst != src) std::memmove(dst, src, static_cast<size_t>(w) * static_cast<size_t>(h) * 4);
    return IEL_OK;
  }
  if (radius > kMaxRadius) radius = kMaxRadius;
  Job job{src, src, dst, w, h, radius, 1, w, h, nullptr, nullptr, {}, nullptr, 0};
  if (radius > kDirectRadius) {
    job.q = radius <= kSmallReduced ? (radius == kDirectRadius + 1 ? 1 : kReducedRadius - 1) : kReducedRadius;
    job.k = (2 * radius + 4) / 9 > 2 ? (2 * radius + 4) / 9 : 2;
    job.rw = (w + job.k - 1) / job.k;
    job.rh = (h + job.k - 1) / job.k;
  }
  const bool direct = job.k == 1;
  const uint64_t pixels = static_cast<uint64_t>(w) * static_cast<uint64_t>(h);
  const uint64_t reduced_pixels = static_cast<uint64_t>(job.rw) * static_cast<uint64_t>(job.rh);
  // Working memory, sized in 64 bits: one allocation holds at most 2^31 - 1 bytes.
  uint64_t slot = blur_work_bytes(job.q, job.rw);
  if (!direct) {
    const uint64_t sums = static_cast<uint64_t>(w) * 8, rows = static_cast<uint64_t>(w) * 8;
    if (sums > slot) slot = sums;
    if (rows > slot) slot = rows;
  }
  slot = (slot + 15) & ~15ull;
  const int row_bands = px_band_count(h, kMinRowsPerBand);
  const int reduced_bands = px_band_count(job.rh, kMinRowsPerBand);
  const int slots = row_bands > reduced_bands ? row_bands : reduced_bands;
  const bool copy = direct && dst == src;
  uint64_t total = slot * static_cast<uint64_t>(slots);
  const uint64_t pictures = direct ? (copy ? pixels * 4 : 0) : reduced_pixels * 8;
  total += pictures;
  unsigned char* memory = total <= 0x7FFFFFFF ? static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(total))) : nullptr;
  if (!memory) {
    // Kept as it always was: the failure is logged and reported as success.
    IF_ERROR("Failed to allocate \n");
    IF_FREE(memory);
    return IEL_OK;
  }
  job.slots = memory;
  job.slot_bytes = static_cast<size_t>(slot);
  unsigned char* rest = memory + slot * static_cast<uint64_t>(slots);
  if (direct) {
    if (copy) {
      std::memcpy(rest, src, static_cast<size_t>(pixels) * 4);
      job.src = job.alpha = reinterpret_cast<const uint32_t*>(rest);
    }
    progress.start(1);
    px_for_rows(
        h, [&job](int y0, int y1) { blur(job, job.src, job.alpha, job.dst, job.w, job.h, job.q, y0, y1); },
        kMinRowsPerBand);
    progress.advance();
    IF_FREE(memory);
    return IEL_OK;
  }
  job.reduced = reinterpret_cast<uint32_t*>(rest);
  job.blurred = job.reduced + reduced_pixels;
  const int k2 = 2 * job.k;
  for (int p = 0; p < job.k; ++p) {
    // Pixel k / 2 + p lies 2 (k / 2 + p) + 1 - k 2k-ths past its left block's centre.
    const int f = 2 * (job.k / 2 + p) + 1 - job.k;
    job.phase[p] = static_cast<uint16_t>((f * 256 + job.k) / k2);
  }
  progress.start(3);
  px_for_rows(job.rh, [&job](int j0, int j1) { reduce(job, j0, j1); }, kMinRowsPerBand);
  progress.advance();
  job.next_slot = 0;
  px_for_rows(
      job.rh,
      [&job](int j0, int j1) { blur(job, job.reduced, job.reduced, job.blurred, job.rw, job.rh, job.q, j0, j1); },
      kMinRowsPerBand);
  progress.advance();
  // The output is written last, so it may be the input.
  job.next_slot = 0;
  px_for_rows(h, [&job](int y0, int y1) { enlarge(job, y0, y1); }, kMinRowsPerBand);
  progress.advance();
  IF_FREE(memory);
  return IEL_OK;
}
