// Mirror, twirl and sphericity.
#include <array>
#include <atomic>
#include <cmath>
#include <cstdint>
#include <cstring>

#include "../kalo/px_mem.h"
#include "../kalo/px_parallel.h"
#include "../px_types.h"
#include "px_geometry.h"
#include "px_geometry_tables.h"

namespace {
constexpr int kDeg = 1 << 19;  // one degree in the twirl's angle units
constexpr int kTurn = 360 * kDeg;

size_t at(int x, int y, int width) { return static_cast<size_t>(y) * static_cast<size_t>(width) + x; }

void copy_row(int* dst, const int* src, int count) {
  if (count > 0) std::memcpy(dst, src, static_cast<size_t>(count) * 4);
}

int clamp(int v, int lo, int hi) { return v < lo ? lo : (v > hi ? hi : v); }

// Bilinear_Fixed's arithmetic, inlined into the samplers.
// The three channels written out (gcc keeps the loop over them rolled).
[[gnu::always_inline]] inline uint32_t bilinear(int fx, int fy, uint32_t topLeft, uint32_t topRight,
                                                uint32_t bottomLeft, uint32_t bottomRight) {
  auto channel = [&](int shift) {
    const int tl = (topLeft >> shift) & 255, tr = (topRight >> shift) & 255;
    const int bl = (bottomLeft >> shift) & 255, br = (bottomRight >> shift) & 255;
    const int top = tr * fx + tl * (2048 - fx);
    const int bottom = br * fx + bl * (2048 - fx);
    const int value = ((2048 - fy) * top + fy * bottom) >> 22;
    return static_cast<uint32_t>(value & 255) << shift;
  };
  return 0xFF000000u | channel(16) | channel(8) | channel(0);
}

// The pixel at a sub-pixel position (xi + fx / 2048, yi + fy / 2048), its
// four neighbours clamped to the picture near the border. Always inlined:
// clang kept it as a call per pixel (a fifth slower than gcc's inlined
// loops).
[[gnu::always_inline]] inline uint32_t sample(const int* src, int width, int height, int xi, int yi, int fx, int fy) {
  int x0 = xi, x1 = xi + 1, y0 = yi, y1 = yi + 1;
  if (!(xi >= 0 && xi < width - 1 && yi >= 0 && yi < height - 1)) {
    x0 = clamp(x0, 0, width - 1);
    x1 = clamp(x1, 0, width - 1);
    y0 = clamp(y0, 0, height - 1);
    y1 = clamp(y1, 0, height - 1);
  }
  const auto* s = reinterpret_cast<const uint32_t*>(src);
  return bilinear(fx, fy, s[at(x0, y0, width)], s[at(x1, y0, width)], s[at(x0, y1, width)], s[at(x1, y1, width)]);
}

// Writes an interpolated colour at (x, y) with that pixel's alpha; in half
// resolution also at its right, lower and diagonal neighbours (with the same
// alpha of (x, y)) where they are inside the picture.
[[gnu::always_inline]] inline void put(const int* src, int* dst, int width, int height, int x, int y, uint32_t colour,
                                       bool half) {
  const uint32_t alpha = static_cast<uint32_t>(src[at(x, y, width)]) & 0xFF000000u;
  const int v = static_cast<int>(alpha | (colour & 0xFFFFFFu));
  dst[at(x, y, width)] = v;
  if (!half) return;
  const bool right = x + 1 < width, below = y + 1 < height;
  if (below) dst[at(x, y + 1, width)] = v;
  if (right) dst[at(x + 1, y, width)] = v;
  if (right && below) dst[at(x + 1, y + 1, width)] = v;
}

// The visited positions of an inclusive range stepping by `step` from `lo`,
// kept inside 0..limit-1 without changing which positions are visited.
struct Span {
  int first;
  int count;
};
Span span(int lo, int hi, int limit, int step) {
  long long first = lo;
  if (first < 0) first += ((-first + step - 1) / step) * step;
  const long long last = hi < limit - 1 ? hi : limit - 1;
  if (first > last) return {0, 0};
  return {static_cast<int>(first), static_cast<int>((last - first) / step + 1)};
}

// Where a visited pixel samples the source: (xi + fx / 2048, yi + fy / 2048).
struct Sample {
  int x, xi, yi, fx, fy;
};

// A row's mapper: map(x, sample) says whether (x, y) is moved and from
// where; it moves nothing left of x_lo or right of x_hi.
template <class F>
struct RowMap {
  long long x_lo, x_hi;
  F map;
};
template <class F>
RowMap<F> row_map(long long x_lo, long long x_hi, F map) {
  return {x_lo, x_hi, map};
}
constexpr long long kNoBound = 1LL << 40;

// Largest e >= 0 with e * e <= n (n >= 0).
long long floor_sqrt(long long n) {
  long long e = static_cast<long long>(std::sqrt(static_cast<double>(n)));
  while (e > 0 && e * e > n) --e;
  while ((e + 1) * (e + 1) <= n) ++e;
  return e;
}

// Runs the mapper make_row(y) returns over the visited positions of each
// visited row of the rectangle, row groups on worker threads. The samples of
// up to kChunk visited pixels of a row are worked out first (their source
// rows fetched ahead), then read and written: the reads of scattered source
// rows overlap instead of waiting one by one. Each visited row writes only
// its own row (and, in half resolution, the row below it, which is never
// visited), so the result does not depend on the split.
constexpr int kChunk = 128;
template <class MakeRow>
void visit_rows(const int* src, int* dst, int width, int height, int left, int right, int top, int bottom, bool half,
                MakeRow make_row) {
  const int step = half ? 2 : 1;
  const Span rows = span(top, bottom, height, step), cols = span(left, right, width, step);
  if (rows.count == 0 || cols.count == 0) return;
  // In place, a row reads pixels that rows above it have written: the rows
  // then run in order on the calling thread, as the plain path runs them.
  const size_t pixels = static_cast<size_t>(width) * static_cast<size_t>(height);
  const bool overlap = dst < src + pixels && src < dst + pixels;
  auto band = [&](int r0, int r1) {
    Sample buf[kChunk];
    for (int r = r0; r < r1; ++r) {
      const int y = rows.first + r * step;
      auto row = make_row(y);
      // The visited columns within the mapper's bounds.
      const long long last = cols.first + static_cast<long long>(cols.count - 1) * step;
      const long long lo = row.x_lo > cols.first ? row.x_lo : cols.first;
      const long long hi = row.x_hi < last ? row.x_hi : last;
      if (lo > hi) continue;
      const int c_begin = static_cast<int>((lo - cols.first + step - 1) / step);
      const int c_end = static_cast<int>((hi - cols.first) / step + 1);
      for (int c0 = c_begin; c0 < c_end; c0 += kChunk) {
        const int c1 = c0 + kChunk < c_end ? c0 + kChunk : c_end;
        int n = 0;
        for (int c = c0, x = cols.first + c0 * step; c < c1; ++c, x += step) {
          Sample& sm = buf[n];
          if (!row.map(x, sm)) continue;
          sm.x = x;
          const int px = clamp(sm.xi, 0, width - 1), py = clamp(sm.yi, 0, height - 1);
          __builtin_prefetch(src + at(px, py, width));
          __builtin_prefetch(src + at(px, py + 1 < height ? py + 1 : py, width));
          ++n;
        }
        for (int i = 0; i < n; ++i) {
          const Sample& sm = buf[i];
          put(src, dst, width, height, sm.x, y, sample(src, width, height, sm.xi, sm.yi, sm.fx, sm.fy), half);
        }
      }
    }
  };
  if (overlap) {
    band(0, rows.count);
  } else {
    px_for_rows(rows.count, [&](int r0, int r1) { band(r0, r1); }, half ? 32 : 64);
  }
}

// The columns of row y within the disc dx^2 + dy^2 <= limit around cx (none
// when the row misses it). Unbounded where the plain path's 32-bit squares
// could wrap (a side above 32768), so that it moves the same pixels, and on
// the plain path, which tests every pixel.
struct Columns {
  long long lo, hi;
};
Columns disc_columns(int width, int height, int cx, int cy, int y, long long limit) {
  if (width > 32768 || height > 32768 || px_scalar_only()) return {-kNoBound, kNoBound};
  const long long dy = y - cy, room = limit - dy * dy;
  if (room < 0) return {1, 0};
  const long long e = floor_sqrt(room);
  return {cx - e, cx + e};
}

// sqrt of t (0..2^30) with 2^30 -> 0x80000, through the step tables.
int sqrt_step(int t) {
  if ((t >> 8) <= 127) return SQRT_STEP_1[t >> 8];
  if ((t >> 10) < 512) return SQRT_STEP_2[(t >> 10) - 32];
  if ((t >> 11) < 1024) return SQRT_STEP_3[(t >> 11) - 256];
  return SQRT_STEP_4[t >> 14];
}

struct Axis {
  int whole;
  int weight;  // 0..2048
};

// centre + D * trig, where D is a distance in 2^19 units and trig a Q15
// sine or cosine. The middle and low bytes of D are deliberately weighted
// above their place value; this is the twirl's look and is kept.
inline Axis twirl_offset(int center, int D, int trig) {
  const int c = trig < 0 ? -trig : trig;
  const int hi = D >> 16, mid = (D >> 8) & 0xFF, lo = D & 0xFF;
  const int A = lo * c, B = mid * c, H = hi * c;
  const int F = (A & 0x1FFFFFF) + (B & 0x1FFFFFF) + ((H & 0x3FFFF) << 7);
  const int n = (A >> 25) + (B >> 25) + (H >> 18) + (F >> 25);
  const int f = F & 0x1FFFFFF;
  if (trig >= 0) return {center + n, f >> 14};
  return {center - 1 - n, (0x2000000 - f) >> 14};
}

// Exact truncating division of a 32-bit int by a divisor of at least 2 known
// in advance: |n| * m >> 64 with m = floor(2^64 / d) + 1 is floor(|n| / d)
// for every |n| < 2^32 (the error stays below 1 / d), so the fast path
// divides without a divide instruction.
struct Divisor {
  uint32_t m_hi, m_lo;
};
Divisor divisor_of(uint32_t d) {
  // floor(2^64 / d) + 1; for a power of 2 this gives 2^64 / d itself, which
  // divides exactly too.
  const uint64_t m = (~uint64_t{0}) / d + 1;
  return {static_cast<uint32_t>(m >> 32), static_cast<uint32_t>(m)};
}
inline int divide(int n, Divisor d) {
  const uint32_t a = n < 0 ? 0u - static_cast<uint32_t>(n) : static_cast<uint32_t>(n);
  const uint64_t hi = static_cast<uint64_t>(a) * d.m_hi + ((static_cast<uint64_t>(a) * d.m_lo) >> 32);
  const uint32_t q = static_cast<uint32_t>(hi >> 32);
  return n < 0 ? -static_cast<int>(q) : static_cast<int>(q);
}

// Magnitude product with the sign of d restored.
int signed_product(int d, int n) {
  const uint32_t mag = (d < 0 ? 0u - static_cast<uint32_t>(d) : static_cast<uint32_t>(d)) * static_cast<uint32_t>(n);
  return static_cast<int>(d < 0 ? 0u - mag : mag);
}
}  // namespace

// ---- mirror ------------------------------------------------------------------

int px_get_mirror_out_width(int width, int pos, int mode, int axis) {
  if (!(pos >= 0 && pos < width && width >= 0 && axis == MIRROR_AXIS_LEFT_RIGHT)) return width;
  if (mode == MIRROR_KEEP_LEFT) return (pos + 1) * 2;
  if (mode == MIRROR_KEEP_RIGHT) return (width - pos) * 2;
  return width;
}

int px_get_mirror_out_height(int height, int pos, int mode, int axis) {
  if (!(pos >= 0 && pos < height && height >= 0 && axis == MIRROR_AXIS_UP_DOWN)) return height;
  if (mode == MIRROR_KEEP_TOP) return (pos + 1) * 2;
  if (mode == MIRROR_KEEP_BOTTOM) return (height - pos) * 2;
  return height;
}

int px_mirror(const int* src, int srcWidth, int srcHeight, int* dst, int dstWidth, int dstHeight, int pos, int mode,
              int axis) {
  const bool left_right = axis == MIRROR_AXIS_LEFT_RIGHT, up_down = axis == MIRROR_AXIS_UP_DOWN;
  if (!left_right && !up_down) return PX_ERR_NULL;
  if (left_right && mode != MIRROR_KEEP_LEFT && mode != MIRROR_KEEP_RIGHT) return PX_ERR_NULL;
  if (up_down && mode != MIRROR_KEEP_TOP && mode != MIRROR_KEEP_BOTTOM) return PX_ERR_NULL;
  if (srcWidth <= 0 || srcHeight <= 0) return PX_ERR_NULL;
  if (dstWidth != px_get_mirror_out_width(srcWidth, pos, mode, axis) ||
      dstHeight != px_get_mirror_out_height(srcHeight, pos, mode, axis)) {
    return PX_ERR_NULL;
  }
  const int limit = left_right ? srcWidth : srcHeight;
  if (pos < 0 || pos >= limit) {
    // A line outside the picture keeps nothing to reflect: the sizes stay
    // as they are and the picture is copied unchanged.
    std::memmove(dst, src, static_cast<size_t>(srcWidth) * static_cast<size_t>(srcHeight) * 4);
    return PX_OK;
  }
  const int sw = srcWidth, dw = dstWidth;
  if (mode == MIRROR_KEEP_LEFT) {
    for (int y = 0; y < dstHeight; ++y) {
      const int* s = src + at(0, y, sw);
      int* d = dst + at(0, y, dw);
      copy_row(d, s, pos + 1);
      for (int x = pos + 1; x < dw; ++x) d[x] = s[dw - 1 - x];
    }
  } else if (mode == MIRROR_KEEP_RIGHT) {
    for (int y = 0; y < dstHeight; ++y) {
      const int* s = src + at(0, y, sw);
      int* d = dst + at(0, y, dw);
      for (int x = 0; x < dw / 2; ++x) d[x] = s[sw - 1 - x];
      copy_row(d + dw / 2, s + pos, sw - pos);
    }
  } else if (mode == MIRROR_KEEP_TOP) {
    for (int r = 0; r <= pos; ++r) copy_row(dst + at(0, r, sw), src + at(0, r, sw), sw);
    for (int r = pos + 1; r < dstHeight; ++r) copy_row(dst + at(0, r, sw), src + at(0, dstHeight - 1 - r, sw), sw);
  } else {
    for (int r = 0; r < dstHeight / 2; ++r) copy_row(dst + at(0, r, sw), src + at(0, srcHeight - 1 - r, sw), sw);
    for (int r = dstHeight / 2, from = pos; r < dstHeight; ++r, ++from) {
      copy_row(dst + at(0, r, sw), src + at(0, from, sw), sw);
    }
  }
  return PX_OK;
}

// ---- twirl and sphericity -------------------------------------------------------

namespace {
// The source copied to the output (the pixels a distortion leaves), on the
// fast path in row bands on the workers; returns dst as memmove does.
void* copy_picture(int* dst, const int* src, int width, int height) {
  const size_t row = static_cast<size_t>(width), n = row * static_cast<size_t>(height);
  const bool overlap = dst < src + n && src < dst + n;
  if (px_scalar_only() || overlap) return std::memmove(dst, src, n * 4);
  px_for_rows(height, [&](int y0, int y1) {
    std::memcpy(dst + y0 * row, src + y0 * row, (y1 - y0) * row * 4);
  });
  return dst;
}


// FATAN2 with the quotient 0x20000000 / big supplied by `quotient(big)`.
template <class Quotient>
inline int fatan2_with(int x, int y, Quotient quotient) {
  if (y == 0) return x > 0 ? 90 * kDeg : (x < 0 ? 270 * kDeg : 0);
  if (x == 0) return y > 0 ? 0 : 180 * kDeg;
  const uint32_t ax = x < 0 ? 0u - static_cast<uint32_t>(x) : static_cast<uint32_t>(x);
  const uint32_t ay = y < 0 ? 0u - static_cast<uint32_t>(y) : static_cast<uint32_t>(y);
  const uint32_t big = ax > ay ? ax : ay, small = ax > ay ? ay : ax;
  const uint32_t i = (small * quotient(big)) >> 18;
  int a = i >= 2048 ? 45 * kDeg : ATAN[i];
  if (ay < ax) a = 90 * kDeg - a;
  if (x >= 0 && y >= 0) return a;
  if (y > 0 && x < 0) return kTurn - a;
  if (x > 0 && y < 0) return 180 * kDeg - a;
  return a + 180 * kDeg;
}
}  // namespace

// The distance and the sine and cosine of the turned angle of a twirled pixel.
struct TwirlAt {
  int D, sn, cs;
};

namespace {
// The twirl's fast path over pairs of pixels mirrored through the centre,
// (x, y) and (2 cx - x, 2 cy - y): they have the same distance, and their
// angles differ by exactly half a turn (the angle table is read with the
// same quotient, and its quadrants mirror), so the turned angles differ by
// half a turn, step k by 8192 of 16384, and the sine and cosine only change
// sign. One pixel's twirl_at serves both; twirl_offset of the negated sine
// and cosine places the mirror. A job is a visited row with its mirror row
// when that is visited too (the row through the centre pairs its own
// columns); the mirror row's columns whose mirror column is not visited are
// worked out on their own. Each job writes only its rows (and in half
// resolution the rows below them, never visited), so the result does not
// depend on the split. False, with nothing written, when the job list
// cannot be had.
template <class At>
bool twirl_in_pairs(const int* src, int* dst, int width, int height, int cx, int cy, int r2, int left, int right,
                    int top, int bottom, bool half, At twirl_at) {
  const int step = half ? 2 : 1;
  const Span rows = span(top, bottom, height, step), cols = span(left, right, width, step);
  if (rows.count == 0 || cols.count == 0) return true;
  const long long row_last = rows.first + static_cast<long long>(rows.count - 1) * step;
  const long long col_last = cols.first + static_cast<long long>(cols.count - 1) * step;
  // A mirror keeps the parity of its row and column, so within the bounds
  // it is a visited position.
  auto row_visited = [&](long long y) { return y >= rows.first && y <= row_last; };
  auto col_visited = [&](long long x) { return x >= cols.first && x <= col_last; };
  auto* jobs = static_cast<int*>(px_malloc(static_cast<size_t>(rows.count), sizeof(int)));
  if (!jobs) return false;
  int count = 0;
  for (int r = 0; r < rows.count; ++r) {
    const int y = rows.first + r * step;
    const long long mirror = 2LL * cy - y;
    if (!(row_visited(mirror) && mirror < y)) jobs[count++] = y;
  }
  struct Job {
    int x, y, xi, yi, fx, fy;
  };
  constexpr int kBlock = 4;  // jobs taken at a time
  std::atomic<int> next{0};
  const int blocks = (count + kBlock - 1) / kBlock;
  px_for_rows(
      blocks,
      [&](int, int) {
        Job buf[2 * kChunk];
        int n = 0;
        auto add = [&](int x, int y, Axis ax, Axis ay) {
          buf[n++] = {x, y, ax.whole, ay.whole, ax.weight, ay.weight};
          const int px = clamp(ax.whole, 0, width - 1), py = clamp(ay.whole, 0, height - 1);
          __builtin_prefetch(src + at(px, py, width));
          __builtin_prefetch(src + at(px, py + 1 < height ? py + 1 : py, width));
        };
        auto flush = [&] {
          for (int i = 0; i < n; ++i) {
            const Job& j = buf[i];
            put(src, dst, width, height, j.x, j.y, sample(src, width, height, j.xi, j.yi, j.fx, j.fy), half);
          }
          n = 0;
        };
        // The visited columns of row y inside the circle, as c_begin..c_end.
        auto columns = [&](int y, int* c_begin, int* c_end) {
          const Columns in = disc_columns(width, height, cx, cy, y, static_cast<long long>(r2) - 1);
          const long long lo = in.lo > cols.first ? in.lo : cols.first;
          const long long hi = in.hi < col_last ? in.hi : col_last;
          *c_begin = lo > hi ? 0 : static_cast<int>((lo - cols.first + step - 1) / step);
          *c_end = lo > hi ? 0 : static_cast<int>((hi - cols.first) / step + 1);
        };
        for (int b = next.fetch_add(1); b < blocks; b = next.fetch_add(1)) {
          for (int jb = b * kBlock; jb < count && jb < (b + 1) * kBlock; ++jb) {
            const int y = jobs[jb];
            const long long mirror_row = 2LL * cy - y;
            const bool paired = row_visited(mirror_row);  // then mirror_row >= y
            const int y2 = static_cast<int>(mirror_row);
            int c_begin, c_end;
            columns(y, &c_begin, &c_end);
            for (int c = c_begin; c < c_end; ++c) {
              const int x = cols.first + c * step;
              const long long x2 = 2LL * cx - x;
              const bool pair = paired && col_visited(x2) && !(y2 == y && x2 == x);
              if (pair && y2 == y && x2 < x) continue;  // done with its mirror
              TwirlAt a;
              if (!twirl_at(x - cx, y - cy, &a)) continue;
              add(x, y, twirl_offset(cx, a.D, a.sn), twirl_offset(cy, a.D, a.cs));
              if (pair) add(static_cast<int>(x2), y2, twirl_offset(cx, a.D, -a.sn), twirl_offset(cy, a.D, -a.cs));
              if (n >= 2 * kChunk - 1) flush();
            }
            if (paired && y2 != y) {
              // The mirror row's columns whose mirror column is not visited.
              columns(y2, &c_begin, &c_end);
              for (int c = c_begin; c < c_end; ++c) {
                const int x = cols.first + c * step;
                if (col_visited(2LL * cx - x)) continue;
                TwirlAt a;
                if (!twirl_at(x - cx, y2 - cy, &a)) continue;
                add(x, y2, twirl_offset(cx, a.D, a.sn), twirl_offset(cy, a.D, a.cs));
                if (n >= 2 * kChunk - 1) flush();
              }
            }
            flush();
          }
        }
      },
      1);
  px_free(jobs);
  return true;
}
}  // namespace

int FATAN2(int x, int y) {
  return fatan2_with(x, y, [](uint32_t big) { return 0x20000000u / big; });
}

uint32_t Bilinear_Fixed(int fx, int fy, uint32_t topLeft, uint32_t topRight, uint32_t bottomLeft,
                        uint32_t bottomRight, uint32_t* out) {
  *out = bilinear(fx, fy, topLeft, topRight, bottomLeft, bottomRight);
  return *out;
}

int px_twirl(const int* src, int* dst, int width, int height, int centerX, int centerY, int radius, int angle,
             int left, int right, int top, int bottom, int half) {
  if (!(centerX >= 0 && centerX < width && centerY >= 0 && centerY < height && radius >= 1 && angle >= -360 &&
        angle <= 360)) {
    return PX_ERR_NULL;
  }
  void* copied = copy_picture(dst, src, width, height);
  // Angle 0 answers with what the copy returned (the output's address, cut
  // to an int), not 0xA000; callers of old see it that way.
  if (angle == 0) return static_cast<int>(reinterpret_cast<intptr_t>(copied));
  if (bottom < top) return PX_OK;
  const int r2 = radius * radius;
  if (r2 <= 0) return PX_OK;  // the square wrapped past 32 bits: no pixel is inside
  const int per = 0x40000000 / r2;
  // The angle's quotient 0x20000000 / max(|dx|, |dy|): on the fast path from
  // a table of every such distance (both below the longer side), the same
  // quotients without a division per pixel.
  const int longer = width > height ? width : height;
  uint32_t* quotients = px_scalar_only() ? nullptr : static_cast<uint32_t*>(px_malloc(static_cast<size_t>(longer), 4));
  if (quotients) {
    quotients[0] = 0;  // never read: big is 0 only where the angle needs no quotient
    for (int d = 1; d < longer; ++d) quotients[d] = 0x20000000u / static_cast<uint32_t>(d);
  }
  // The turned position of the pixel (dx, dy) from the centre: its distance
  // D and the sine and cosine of its angle; false outside the circle.
  auto twirl_at = [&](int dx, int dy, TwirlAt* at) {
    const int d2 = dx * dx + dy * dy;
    if (d2 >= r2) return false;
    const int t = d2 * per;
    if (t < 0 || t >= 0x40000000) return false;  // reached only through wrapped sizes
    const int s = sqrt_step(t);
    const int D = s * radius;
    int w = (0x80000 - s) * angle;
    if (angle < 0) w += kTurn;
    const int angle_of = quotients ? fatan2_with(dx, dy, [&](uint32_t big) { return quotients[big]; }) : FATAN2(dx, dy);
    const uint32_t theta = static_cast<uint32_t>(w + angle_of) % static_cast<uint32_t>(kTurn);
    const int k = static_cast<int>(theta / 360) >> 5;
    int sn, cs;
    if (k <= 4096) {
      cs = SIN[4096 - k];
      sn = SIN[k];
    } else if (k < 8192) {
      sn = SIN[8192 - k];
      cs = -SIN[k - 4096];
    } else if (k <= 12288) {
      cs = -SIN[12288 - k];
      sn = -SIN[k - 8192];
    } else {
      cs = SIN[k - 12288];
      sn = -SIN[16384 - k];
    }
    *at = {D, sn, cs};
    return true;
  };
  // (In place, a pair's mirror would be read after being written.)
  if (quotients && src != dst &&
      twirl_in_pairs(src, dst, width, height, centerX, centerY, r2, left, right, top, bottom, half != 0, twirl_at)) {
    px_free(quotients);
    return PX_OK;
  }
  visit_rows(src, dst, width, height, left, right, top, bottom, half != 0, [&](int y) {
    // Inside the circle: dx^2 + dy^2 <= r2 - 1.
    const Columns in = disc_columns(width, height, centerX, centerY, y, static_cast<long long>(r2) - 1);
    return row_map(in.lo, in.hi, [&, y](int x, Sample& sm) {
      TwirlAt at;
      if (!twirl_at(x - centerX, y - centerY, &at)) return false;
      const Axis ax = twirl_offset(centerX, at.D, at.sn), ay = twirl_offset(centerY, at.D, at.cs);
      sm = {x, ax.whole, ay.whole, ax.weight, ay.weight};
      return true;
    });
  });
  px_free(quotients);
  return PX_OK;
}

int px_sphericity(const int* src, int* dst, int width, int height, int centerX, int centerY, int radius, int strength,
                  int left, int right, int top, int bottom, int half) {
  if (!(centerX >= 0 && centerX < width && centerY >= 0 && centerY < height && radius > 0 && strength >= -100 &&
        strength <= 100)) {
    return PX_ERR_NULL;
  }
  copy_picture(dst, src, width, height);
  if (bottom < top) return PX_OK;
  // The working radius is enlarged on purpose (about 1.4 times).
  const int R2 = (500 * radius * radius + 128) >> 8;
  if (R2 <= 0) return PX_OK;  // wrapped past 32 bits: no pixel is inside
  const int per = 0x40000000 / R2;
  // The bulge's divisor depends only on the falloff step i (0..255, or none
  // outside): on the fast path its quotients come from tables.
  struct Step {
    uint32_t m;
    int Dn, inv;
    Divisor div;
  };
  Step steps[257];
  const bool fast = strength >= 0 && !px_scalar_only();
  if (fast) {
    for (int i = 0; i <= 256; ++i) {
      const uint32_t L = i < 256 ? EXP_n7[i] >> 7 : 0;
      const uint32_t m = (L * 75u * static_cast<uint32_t>(strength)) >> 12;
      const int Dn = static_cast<int>(m + 0x40000);
      steps[i] = {m, Dn, 0x40000000 / Dn, divisor_of(static_cast<uint32_t>(Dn))};
    }
  }
  visit_rows(src, dst, width, height, left, right, top, bottom, half != 0, [&](int y) {
    // On the fast path the row's source row and its weight for every step:
    // they depend on the row and the step only.
    struct Down {
      int yi, fy;
    };
    std::array<Down, 257> down;
    if (fast) {
      for (int i = 0; i <= 256; ++i) {
        const Step& st = steps[i];
        const int Y = static_cast<int>((static_cast<uint32_t>(y) << 18) + st.m * static_cast<uint32_t>(centerY));
        const int yi = divide(Y, st.div);
        down[i] = {yi, (st.inv * (Y - st.Dn * yi)) >> 19};
      }
    }
    const Columns in = disc_columns(width, height, centerX, centerY, y, R2);
    return row_map(in.lo, in.hi, [&, down, y](int x, Sample& sm) {
      const int dx = x - centerX, dy = y - centerY;
      const int d2 = dx * dx + dy * dy;
      if (d2 > R2) return false;
      const int i = (per * d2) >> 22;
      const uint32_t L = (i >= 0 && i < 256) ? EXP_n7[i] >> 7 : 0;
      int xi, yi, fx, fy;
      if (fast) {
        const int at_step = (i >= 0 && i < 256) ? i : 256;
        const Step& st = steps[at_step];
        const int X = static_cast<int>((static_cast<uint32_t>(x) << 18) + st.m * static_cast<uint32_t>(centerX));
        xi = divide(X, st.div);
        fx = (st.inv * (X - st.Dn * xi)) >> 19;
        yi = down[at_step].yi;
        fy = down[at_step].fy;
      } else if (strength >= 0) {
        const uint32_t m = (L * 75u * static_cast<uint32_t>(strength)) >> 12;
        const int X = static_cast<int>((static_cast<uint32_t>(x) << 18) + m * static_cast<uint32_t>(centerX));
        const int Y = static_cast<int>((static_cast<uint32_t>(y) << 18) + m * static_cast<uint32_t>(centerY));
        const int Dn = static_cast<int>(m + 0x40000);
        xi = X / Dn;
        yi = Y / Dn;
        const int inv = 0x40000000 / Dn;
        fx = (inv * (X - Dn * xi)) >> 19;
        fy = (inv * (Y - Dn * yi)) >> 19;
      } else {
        const int n = (static_cast<int>(L) * (-30 * strength)) >> 12;
        const int X = static_cast<int>(static_cast<uint32_t>(x) << 18) + signed_product(dx, n);
        const int Y = static_cast<int>(static_cast<uint32_t>(y) << 18) + signed_product(dy, n);
        xi = X >> 18;
        yi = Y >> 18;
        fx = (X - static_cast<int>(static_cast<uint32_t>(xi) << 18)) >> 7;
        fy = (Y - static_cast<int>(static_cast<uint32_t>(yi) << 18)) >> 7;
      }
      sm = {x, xi, yi, fx, fy};
      return true;
    });
  });
  return PX_OK;
}
