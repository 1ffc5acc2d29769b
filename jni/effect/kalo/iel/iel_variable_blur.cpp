// Effect 38, the variable blur: a smooth, Gaussian-looking blur of a given
// radius on ARGB pixels whose cost does not grow with the radius.
//
// Design: three box filters one after the other in each direction. Their
// radii b1 >= b2 >= b3 add up to the requested radius r (b1 = (r + 2) / 3,
// b2 = (r + 1) / 3, b3 = r / 3), so the combined kernel reaches exactly r
// pixels on each side and, being the convolution of three boxes, is close to
// a Gaussian of sigma about r / 3. Each box is a running sum (one add and one
// subtract per pixel whatever its size); the picture's border pixels are
// repeated beyond the edge. Values travel as 8.8 fixed point between the
// boxes of one direction (each box rounds to nearest); they are rounded to
// whole 0..255 values once between the horizontal and the vertical
// direction, when the horizontal result is stored in the output.
//
// Threads: the horizontal direction splits rows over worker threads, the
// vertical direction splits the picture into fixed stripes of 16 columns and
// hands stripes to worker threads. Every row or stripe is computed the same
// way whichever thread takes it, so the result does not depend on the number
// of threads (nor on GLIMMER_SCALAR). Alpha is kept from the input. The
// output may be the input itself.
#include <atomic>
#include <cstdint>
#include <cstring>

#include "../if_utils_and.h"
#include "../px_parallel.h"
#include "iel_variable_blur.h"
#include "iel_internal.h"

namespace {
constexpr int kStripe = 16;          // columns of one vertical stripe
constexpr int kLanes = kStripe * 3;  // R, G, B of each stripe column
constexpr int kMaxBox = 8191;        // keeps a running sum of 8.8 values in 32 bits

struct Boxes {
  int b[3];
};

Boxes boxes_of(int radius) {
  if (radius > 3 * kMaxBox) radius = 3 * kMaxBox;
  return {{(radius + 2) / 3, (radius + 1) / 3, radius / 3}};
}

// Rounded division by n = 2b + 1 of a running sum, as a multiplication by a
// 32-bit reciprocal.
struct Divider {
  uint32_t half;
  uint32_t reciprocal;
  explicit Divider(int b) {
    const uint64_t n = 2 * static_cast<uint64_t>(b) + 1;
    half = static_cast<uint32_t>(n / 2);
    reciprocal = static_cast<uint32_t>(((uint64_t{1} << 32) + n - 1) / n);
  }
  uint32_t operator()(uint32_t sum) const {
    return static_cast<uint32_t>((static_cast<uint64_t>(sum + half) * reciprocal) >> 32);
  }
};

int clamp_index(int i, int n) { return i < 0 ? 0 : (i >= n ? n - 1 : i); }

// One box of radius b along `n` positions of `lanes` interleaved lanes:
// out[p][l] = rounded mean of in[p - b .. p + b][l], edges repeated.
void box(const uint16_t* in, uint16_t* out, int n, int lanes, int b, uint32_t* sums) {
  const Divider div(b);
  for (int l = 0; l < lanes; ++l) sums[l] = 0;
  for (int q = -b; q <= b; ++q) {
    const uint16_t* row = in + static_cast<size_t>(clamp_index(q, n)) * lanes;
    for (int l = 0; l < lanes; ++l) sums[l] += row[l];
  }
  for (int p = 0; p < n; ++p) {
    uint16_t* o = out + static_cast<size_t>(p) * lanes;
    for (int l = 0; l < lanes; ++l) o[l] = static_cast<uint16_t>(div(sums[l]));
    const uint16_t* add = in + static_cast<size_t>(clamp_index(p + b + 1, n)) * lanes;
    const uint16_t* sub = in + static_cast<size_t>(clamp_index(p - b, n)) * lanes;
    for (int l = 0; l < lanes; ++l) sums[l] += add[l] - sub[l];
  }
}

// The three boxes from a into a (b used as the other buffer); zero-radius
// boxes are skipped.
void three_boxes(uint16_t*& a, uint16_t*& b, int n, int lanes, const Boxes& boxes, uint32_t* sums) {
  for (int k = 0; k < 3; ++k) {
    if (boxes.b[k] == 0) continue;
    box(a, b, n, lanes, boxes.b[k], sums);
    uint16_t* t = a;
    a = b;
    b = t;
  }
}

uint32_t to8(uint32_t v) {
  v = (v + 128) >> 8;
  return v > 255 ? 255 : v;
}

// Working memory of one band: two line buffers and the running sums.
struct Scratch {
  uint16_t* a;
  uint16_t* b;
  uint32_t* sums;
};

struct Job {
  const uint32_t* src;
  uint32_t* dst;
  int width, height;
  Boxes boxes;
  unsigned char* memory;
  size_t slot_bytes;
  std::atomic<int> next_slot{0};

  Scratch take_slot() {
    unsigned char* m = memory + slot_bytes * static_cast<size_t>(next_slot.fetch_add(1));
    const auto line = static_cast<size_t>(line_elements());  // fits: the slot was allocated
    auto* a = reinterpret_cast<uint16_t*>(m);
    return {a, a + line, reinterpret_cast<uint32_t*>(a + 2 * line)};
  }
  // Elements of one line buffer: a row of R, G, B or a stripe of all rows.
  uint64_t line_elements() const {
    const uint64_t row = static_cast<uint64_t>(width) * 3;
    const uint64_t stripe = static_cast<uint64_t>(height) * kLanes;
    return row > stripe ? row : stripe;
  }
};

void horizontal(Job& job, int y0, int y1) {
  Scratch s = job.take_slot();
  const int w = job.width;
  for (int y = y0; y < y1; ++y) {
    const uint32_t* in = job.src + static_cast<size_t>(y) * w;
    uint32_t* out = job.dst + static_cast<size_t>(y) * w;
    uint16_t* a = s.a;
    uint16_t* b = s.b;
    for (int x = 0; x < w; ++x) {
      a[3 * x] = static_cast<uint16_t>(((in[x] >> 16) & 255) << 8);
      a[3 * x + 1] = static_cast<uint16_t>(((in[x] >> 8) & 255) << 8);
      a[3 * x + 2] = static_cast<uint16_t>((in[x] & 255) << 8);
    }
    three_boxes(a, b, w, 3, job.boxes, s.sums);
    for (int x = 0; x < w; ++x) {
      out[x] = (in[x] & 0xFF000000u) | to8(a[3 * x]) << 16 | to8(a[3 * x + 1]) << 8 | to8(a[3 * x + 2]);
    }
  }
}

void vertical(Job& job, int s0, int s1) {
  Scratch s = job.take_slot();
  const int w = job.width;
  const int h = job.height;
  for (int stripe = s0; stripe < s1; ++stripe) {
    const int x0 = stripe * kStripe;
    const int cols = w - x0 < kStripe ? w - x0 : kStripe;
    const int lanes = cols * 3;
    uint16_t* a = s.a;
    uint16_t* b = s.b;
    for (int y = 0; y < h; ++y) {
      const uint32_t* px = job.dst + static_cast<size_t>(y) * w + x0;
      uint16_t* line = a + static_cast<size_t>(y) * lanes;
      for (int c = 0; c < cols; ++c) {
        line[3 * c] = static_cast<uint16_t>(((px[c] >> 16) & 255) << 8);
        line[3 * c + 1] = static_cast<uint16_t>(((px[c] >> 8) & 255) << 8);
        line[3 * c + 2] = static_cast<uint16_t>((px[c] & 255) << 8);
      }
    }
    three_boxes(a, b, h, lanes, job.boxes, s.sums);
    for (int y = 0; y < h; ++y) {
      uint32_t* px = job.dst + static_cast<size_t>(y) * w + x0;
      const uint16_t* line = a + static_cast<size_t>(y) * lanes;
      for (int c = 0; c < cols; ++c) {
        px[c] = (px[c] & 0xFF000000u) | to8(line[3 * c]) << 16 | to8(line[3 * c + 1]) << 8 | to8(line[3 * c + 2]);
      }
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
  const int stripes = (w + kStripe - 1) / kStripe;
  const int row_bands = px_band_count(h, kMinRowsPerBand);
  const int stripe_bands = px_band_count(stripes, kMinStripesPerBand);
  const int slots = row_bands + stripe_bands;
  const uint64_t line = job.line_elements();
  // Sizes are worked out in 64 bits: one allocation holds at most 2^31 - 1 bytes.
  const uint64_t slot = (2 * line * sizeof(uint16_t) + kLanes * sizeof(uint32_t) + 15) & ~15ull;
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
