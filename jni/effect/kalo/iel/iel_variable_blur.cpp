// Effect 38, the variable blur: a smooth, Gaussian-looking blur of a given
// radius on ARGB pixels whose cost does not grow with the radius.
//
// Design: three box filters one after the other in each direction. Their
// radii b1 >= b2 >= b3 add up to the requested radius r (b1 = (r + 2) / 3,
// b2 = (r + 1) / 3, b3 = r / 3), so the combined kernel reaches exactly r
// pixels on each side and, being the convolution of three boxes, is close to
// a Gaussian of sigma about r / 3. Each box is a running sum (one add and one
// subtract per value whatever its size); every box repeats the border values
// of its own input beyond the edge. The sums are not divided between the
// boxes: the third box's sum is the exact weighted sum of the 8-bit input,
// divided once by N = (2 b1 + 1)(2 b2 + 1)(2 b3 + 1) and rounded (a
// multiplication by the 32-bit reciprocal rounded up, which gives every
// constant picture back exactly). So each direction rounds once, and the
// horizontal result is stored as 8-bit values before the vertical direction.
// Sums stay below 2^31 because N is kept at most 2^23: radii above
// kMaxRadius blur as kMaxRadius.
//
// Lanes: a pixel's four bytes are four lanes (the alpha lane is summed too
// and thrown away: the result keeps the input's alpha), so a box step is one
// add and one subtract on a pixel's worth of lanes. The horizontal direction
// runs along each row (rows on worker threads); the vertical direction runs
// down stripes of kStripe columns, 4 * kStripe lanes side by side (stripes
// on worker threads; the last columns that do not fill a stripe run one by
// one). Every row or stripe is computed the same way whichever thread takes
// it, so the result does not depend on the number of threads (nor on
// GLIMMER_SCALAR). The output may be the input itself.
#include <atomic>
#include <cstdint>
#include <cstring>

#include "../if_utils_and.h"
#include "../px_parallel.h"
#include "iel_variable_blur.h"
#include "iel_internal.h"

namespace {
constexpr int kStripe = 8;              // columns of one vertical stripe
constexpr int kMaxLanes = 4 * kStripe;  // lanes of one position
constexpr int kMaxRadius = 300;         // (2 * 100 + 1)^3 < 2^23

struct Boxes {
  int b[3];
  uint32_t half;        // N / 2
  uint32_t reciprocal;  // ceil(2^32 / N)
};

Boxes boxes_of(int radius) {
  if (radius > kMaxRadius) radius = kMaxRadius;
  Boxes boxes{{(radius + 2) / 3, (radius + 1) / 3, radius / 3}, 0, 0};
  uint64_t n = 1;
  for (int b : boxes.b) n *= 2 * static_cast<uint64_t>(b) + 1;
  boxes.half = static_cast<uint32_t>(n / 2);
  boxes.reciprocal = static_cast<uint32_t>(((uint64_t{1} << 32) + n - 1) / n);
  return boxes;
}

inline int clamp_index(int i, int n) { return i < 0 ? 0 : (i >= n ? n - 1 : i); }

// The lanes of position p: P pixels from base + p * stride.
template <int P>
inline const uint8_t* pixel_lanes(const uint32_t* base, size_t stride, int p) {
  return reinterpret_cast<const uint8_t*>(base + static_cast<size_t>(p) * stride);
}

// First box, from pixels: out[p] = sum of the lanes at positions p - b .. p + b.
template <int P>
void box_from_pixels(const uint32_t* base, size_t stride, int n, int b, uint32_t* out) {
  constexpr int L = 4 * P;
  uint32_t sum[L] = {};
  for (int q = -b; q <= b; ++q) {
    const uint8_t* v = pixel_lanes<P>(base, stride, clamp_index(q, n));
    for (int l = 0; l < L; ++l) sum[l] += v[l];
  }
  for (int p = 0; p < n; ++p) {
    uint32_t* o = out + static_cast<size_t>(p) * L;
    for (int l = 0; l < L; ++l) o[l] = sum[l];
    const uint8_t* add = pixel_lanes<P>(base, stride, clamp_index(p + b + 1, n));
    const uint8_t* sub = pixel_lanes<P>(base, stride, clamp_index(p - b, n));
    for (int l = 0; l < L; ++l) sum[l] += static_cast<uint32_t>(add[l]) - sub[l];
  }
}

// Second box, between line buffers.
template <int P>
void box_between(const uint32_t* in, int n, int b, uint32_t* out) {
  constexpr int L = 4 * P;
  uint32_t sum[L] = {};
  for (int q = -b; q <= b; ++q) {
    const uint32_t* v = in + static_cast<size_t>(clamp_index(q, n)) * L;
    for (int l = 0; l < L; ++l) sum[l] += v[l];
  }
  for (int p = 0; p < n; ++p) {
    uint32_t* o = out + static_cast<size_t>(p) * L;
    for (int l = 0; l < L; ++l) o[l] = sum[l];
    const uint32_t* add = in + static_cast<size_t>(clamp_index(p + b + 1, n)) * L;
    const uint32_t* sub = in + static_cast<size_t>(clamp_index(p - b, n)) * L;
    for (int l = 0; l < L; ++l) sum[l] += add[l] - sub[l];
  }
}

// Third box into pixels: each R, G, B lane becomes round(sum / N); the
// alpha byte comes from the line's source pixel.
template <int P>
void box_to_pixels(const uint32_t* in, int n, int b, const Boxes& boxes, const uint32_t* alpha, uint32_t* base,
                   size_t stride) {
  constexpr int L = 4 * P;
  uint32_t sum[L] = {};
  for (int q = -b; q <= b; ++q) {
    const uint32_t* v = in + static_cast<size_t>(clamp_index(q, n)) * L;
    for (int l = 0; l < L; ++l) sum[l] += v[l];
  }
  for (int p = 0; p < n; ++p) {
    uint32_t* px = base + static_cast<size_t>(p) * stride;
    const uint32_t* al = alpha + static_cast<size_t>(p) * stride;
    uint32_t value[L];
    for (int l = 0; l < L; ++l)
      value[l] = static_cast<uint32_t>((static_cast<uint64_t>(sum[l] + boxes.half) * boxes.reciprocal) >> 32);
    for (int k = 0; k < P; ++k)
      px[k] = (al[k] & 0xFF000000u) | value[4 * k + 2] << 16 | value[4 * k + 1] << 8 | value[4 * k];
    const uint32_t* add = in + static_cast<size_t>(clamp_index(p + b + 1, n)) * L;
    const uint32_t* sub = in + static_cast<size_t>(clamp_index(p - b, n)) * L;
    for (int l = 0; l < L; ++l) sum[l] += add[l] - sub[l];
  }
}

// One line of n positions of P pixels (stride apart) from src into dst.
template <int P>
void blur_line(const uint32_t* src, uint32_t* dst, size_t stride, int n, const Boxes& boxes, uint32_t* a,
               uint32_t* b) {
  box_from_pixels<P>(src, stride, n, boxes.b[0], a);
  box_between<P>(a, n, boxes.b[1], b);
  box_to_pixels<P>(b, n, boxes.b[2], boxes, src, dst, stride);
}

struct Job {
  const uint32_t* src;
  uint32_t* dst;
  int width, height;
  Boxes boxes;
  unsigned char* memory;
  size_t slot_bytes;
  std::atomic<int> next_slot{0};

  // Two line buffers of one band.
  uint32_t* take_slot() {
    return reinterpret_cast<uint32_t*>(memory + slot_bytes * static_cast<size_t>(next_slot.fetch_add(1)));
  }
  // Elements of one line buffer: a row of pixels or a stripe of all rows.
  uint64_t line_elements() const {
    const uint64_t row = static_cast<uint64_t>(width) * 4;
    const uint64_t stripe = static_cast<uint64_t>(height) * kMaxLanes;
    return row > stripe ? row : stripe;
  }
};

void horizontal(Job& job, int y0, int y1) {
  uint32_t* a = job.take_slot();
  uint32_t* b = a + job.line_elements();
  const size_t w = static_cast<size_t>(job.width);
  for (int y = y0; y < y1; ++y) blur_line<1>(job.src + y * w, job.dst + y * w, 1, job.width, job.boxes, a, b);
}

// Stripes s0..s1 of kStripe columns; the band holding the last stripe also
// does the columns past the whole stripes.
void vertical(Job& job, int s0, int s1) {
  uint32_t* a = job.take_slot();
  uint32_t* b = a + job.line_elements();
  const size_t w = static_cast<size_t>(job.width);
  const int whole = job.width / kStripe;
  for (int s = s0; s < s1; ++s) {
    if (s < whole) {
      uint32_t* col = job.dst + static_cast<size_t>(s) * kStripe;
      blur_line<kStripe>(col, col, w, job.height, job.boxes, a, b);
    } else {
      for (int x = whole * kStripe; x < job.width; ++x) blur_line<1>(job.dst + x, job.dst + x, w, job.height, job.boxes, a, b);
    }
  }
}

constexpr int kMinRowsPerBand = 32;
constexpr int kMinStripesPerBand = 2;
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
  Job job{src, dst, w, h, boxes_of(radius), nullptr, 0};
  // Whole stripes, plus one for the columns left over.
  const int stripes = (w + kStripe - 1) / kStripe;
  const int row_bands = px_band_count(h, kMinRowsPerBand);
  const int stripe_bands = px_band_count(stripes, kMinStripesPerBand);
  const int slots = row_bands + stripe_bands;
  // Sizes are worked out in 64 bits: one allocation holds at most 2^31 - 1 bytes.
  const uint64_t slot = (2 * job.line_elements() * sizeof(uint32_t) + 15) & ~15ull;
  const uint64_t total = slot * static_cast<uint64_t>(slots);
  job.slot_bytes = static_cast<size_t>(slot);
  job.memory = total <= 0x7FFFFFFF ? static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(total))) : nullptr;
  if (!job.memory) {
    // Kept as it always was: the failure is logged and reported as success.
    IF_ERROR("Failed to allocate \n");
    IF_FREE(job.memory);
    return IEL_OK;
  }
  progress.start(2);
  px_for_rows(h, [&job](int y0, int y1) { horizontal(job, y0, y1); }, kMinRowsPerBand);
  progress.advance();
  px_for_rows(stripes, [&job](int s0, int s1) { vertical(job, s0, s1); }, kMinStripesPerBand);
  progress.advance();
  IF_FREE(job.memory);
  return IEL_OK;
}
