// Painterly effects: cartoon, oil paint (Gaussian blur and mode filter),
// posterize, magic pen, pencil sketch, sketch on texture, spread.
#include <atomic>
#include <cmath>
#include <cstdint>
#include <cstring>

#include "../if_utils_and.h"
#include "../px_parallel.h"
#include "iel_artistic.h"
#include "iel_internal.h"
#include "iel_luma.h"

namespace {
bool rgb888_only(int format) { return format == IEL_FORMAT_RGB888; }
// Pixel formats whose buffer holds width * height pixels of 2, 3 or 4 bytes.
// The planar layouts (4 to 6) hold fewer bytes than a 3-byte reading would
// touch, so the effects that work pixel by pixel refuse them.
bool packed_pixels(int format) {
  return format == IEL_FORMAT_RGB565 || format == IEL_FORMAT_RGB888 || format == IEL_FORMAT_ARGB_PACK;
}

int clampi(int v, int lo, int hi) { return v < lo ? lo : (v > hi ? hi : v); }

size_t pixel_count(const structIELImage* im) {
  return static_cast<size_t>(im->width) * static_cast<size_t>(im->height);
}

void copy_image(const structIELImage* in, structIELImage* out) {
  std::memcpy(out->buffer, in->buffer, pixel_count(in) * IEL_BytesPerPixel(in->format));
}

inline uint32_t luma_sum(const unsigned char* p) { return IEL_LumaSum(p[0], p[1], p[2]); }
inline int luma(const unsigned char* p) { return static_cast<int>((luma_sum(p) >> 10) & 255); }

// Channels of one pixel of a packed format (565 unpacked to 8-bit values).
inline void read_channels(const unsigned char* p, int bpp, int* c) {
  if (bpp == 2) {
    uint16_t v;
    std::memcpy(&v, p, 2);
    c[0] = (v & 0xF800) >> 8;
    c[1] = (v & 0x07E0) >> 3;
    c[2] = (v << 3) & 0xF8;
    return;
  }
  for (int i = 0; i < bpp; ++i) c[i] = p[i];
}

inline void write_channels(unsigned char* p, int bpp, const int* c) {
  if (bpp == 2) {
    uint16_t v = static_cast<uint16_t>((c[0] & 0xF8) << 8 | (c[1] & 0xFC) << 3 | c[2] >> 3);
    std::memcpy(p, &v, 2);
    return;
  }
  for (int i = 0; i < bpp; ++i) p[i] = static_cast<unsigned char>(c[i]);
}
}  // namespace

// ---- cartoon ------------------------------------------------------------------

int IEL_CartoonNew3(structIELImage* input, structIELImage* output, int level) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, rgb888_only)) return rc;
  const int r = clampi(level, 1, 4);
  const int w = input->width, h = input->height;
  // A picture with no pixel r away from every border has nothing to draw
  // from: it is passed through unchanged.
  if (w < 2 * r + 1 || h < 2 * r + 1) {
    copy_image(input, output);
    return IEL_OK;
  }
  const size_t n = pixel_count(input);
  auto* lum = static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(n)));
  auto* hmax = static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(n)));
  if (!lum || !hmax) {
    IF_ERROR("Failed to allocate \n");
    IF_FREE(lum);
    IF_FREE(hmax);
    return IEL_ERR_ALLOC;
  }
  const unsigned char* src = input->buffer;
  unsigned char* dst = output->buffer;
  px_for_rows(h, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const unsigned char* p = src + static_cast<size_t>(y) * w * 3;
      unsigned char* l = lum + static_cast<size_t>(y) * w;
      for (int x = 0; x < w; ++x) l[x] = static_cast<unsigned char>(luma(p + 3 * x));
      unsigned char* m = hmax + static_cast<size_t>(y) * w;
      for (int x = r; x < w - r; ++x) {
        int best = 0;
        for (int k = -r; k <= r; ++k) best = l[x + k] > best ? l[x + k] : best;
        m[x] = static_cast<unsigned char>(best);
      }
    }
  });
  px_for_rows(h - 2 * r, [&](int b0, int b1) {
    for (int y = b0 + r; y < b1 + r; ++y) {
      const unsigned char* srow = src + static_cast<size_t>(y) * w * 3;
      unsigned char* drow = dst + static_cast<size_t>(y) * w * 3;
      for (int x = r; x < w - r; ++x) {
        int big = 0;
        for (int k = -r; k <= r; ++k) {
          int v = hmax[static_cast<size_t>(y + k) * w + x];
          big = v > big ? v : big;
        }
        const int yl = lum[static_cast<size_t>(y) * w + x];
        int e = yl * 255 / (big + 1);
        if (e > 255) e = 255;
        const int s = e * e >> 8;
        const int q = yl >> 2;
        const unsigned char* p = srow + 3 * x;
        unsigned char* o = drow + 3 * x;
        for (int c = 0; c < 3; ++c) {
          int v = p[c];
          if (yl > 89) {
            const int a = yl > 160 ? q + 25 : q + 5;
            v = s * (v + a > 255 ? 255 : v + a) >> 8;
          } else {
            // Dark areas lose q + 5 first, then q + 30 more, as the mid-tones do.
            if (yl <= 30) v = v - (q + 5) < 0 ? 0 : v - (q + 5);
            v = s * (v - (q + 30) < 0 ? 0 : v - (q + 30)) >> 8;
          }
          o[c] = static_cast<unsigned char>(v);
        }
      }
      for (int x = r; x > 0; --x) std::memcpy(drow + 3 * (x - 1), drow + 3 * x, 3);
      for (int x = w - r - 1; x < w - 1; ++x) std::memcpy(drow + 3 * (x + 1), drow + 3 * x, 3);
    }
  });
  const size_t row = static_cast<size_t>(w) * 3;
  for (int y = r; y > 0; --y) std::memcpy(dst + (y - 1) * row, dst + y * row, row);
  for (int y = h - r - 1; y < h - 1; ++y) std::memcpy(dst + (y + 1) * row, dst + y * row, row);
  IF_FREE(lum);
  IF_FREE(hmax);
  return IEL_OK;
}

// ---- oil paint ------------------------------------------------------------------

int IEL_GaussianBlur(structIELImage* input, structIELImage* output) {
  if (!input || !output || !input->buffer || !output->buffer) {
    IF_ERROR("Invalid Image pointer:\n");
    return IEL_ERR_NULL;
  }
  const int w = input->width, h = input->height;
  if (w < 1 || h < 1) return IEL_OK;
  const unsigned char* src = input->buffer;
  unsigned char* dst = output->buffer;
  const size_t row = static_cast<size_t>(w) * 3;
  px_for_rows(h, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const unsigned char* rows[3] = {src + (y > 0 ? y - 1 : 0) * row, src + y * row,
                                      src + (y < h - 1 ? y + 1 : h - 1) * row};
      unsigned char* o = dst + y * row;
      for (int x = 0; x < w; ++x) {
        const int xl = 3 * (x > 0 ? x - 1 : 0), xc = 3 * x, xr = 3 * (x < w - 1 ? x + 1 : w - 1);
        for (int c = 0; c < 3; ++c) {
          int s = 0;
          for (int k = 0; k < 3; ++k) {
            const int wk = k == 1 ? 2 : 1;
            s += wk * (rows[k][xl + c] + 2 * rows[k][xc + c] + rows[k][xr + c]);
          }
          o[xc + c] = static_cast<unsigned char>(s / 16);
        }
      }
    }
  });
  return IEL_OK;
}

namespace {
// The mode filter of packed RGB with each pixel's 16-level luminance taken
// once into a plane: the same 3 x 3 window, visited in the same order (left,
// middle, right column, each top to bottom), picks the same pixel. False,
// with nothing written, when the plane could not be allocated.
bool oilify_rgb_levels(const unsigned char* src, unsigned char* dst, int w, int h) {
  const size_t n = static_cast<size_t>(w) * static_cast<size_t>(h);
  auto* level = n <= 0x7FFFFFFF ? static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(n))) : nullptr;
  if (!level) return false;
  const size_t row = static_cast<size_t>(w);
  px_for_rows(h, [&](int y0, int y1) {
    for (size_t i = y0 * row; i < y1 * row; ++i) {
      const unsigned char* p = src + 3 * i;
      level[i] = static_cast<unsigned char>(IEL_LumaSum(p[0], p[1], p[2]) >> 14);
    }
  });
  px_for_rows(h, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const size_t ys[3] = {(y > 0 ? y - 1 : 0) * row, y * row, (y < h - 1 ? y + 1 : h - 1) * row};
      unsigned char* o = dst + y * row * 3;
      for (int x = 0; x < w; ++x) {
        const int xs[3] = {x > 0 ? x - 1 : 0, x, x < w - 1 ? x + 1 : w - 1};
        unsigned char hist[16] = {};
        int best = 0;
        size_t pick = 0;
        for (int cx : xs) {
          for (size_t cy : ys) {
            const size_t at = cy + cx;
            if (++hist[level[at]] > best) {
              best = hist[level[at]];
              pick = at;
            }
          }
        }
        std::memcpy(o + 3 * x, src + 3 * pick, 3);
      }
    }
  });
  IF_FREE(level);
  return true;
}
}  // namespace

int IEL_OilifyFix(structIELImage* input, structIELImage* output) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, packed_pixels)) return rc;
  const int w = input->width, h = input->height;
  const int bpp = IEL_BytesPerPixel(input->format);
  // (An output that is the input itself needs the plain path's order.)
  if (bpp == 3 && !px_scalar_only() && input->buffer != output->buffer) {
    if (oilify_rgb_levels(input->buffer, output->buffer, w, h)) return IEL_OK;
    return IEL_ERR_ALLOC;
  }
  const unsigned char* src = input->buffer;
  unsigned char* dst = output->buffer;
  px_for_rows(h, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const int ys[3] = {y > 0 ? y - 1 : 0, y, y < h - 1 ? y + 1 : h - 1};
      for (int x = 0; x < w; ++x) {
        const int xs[3] = {x > 0 ? x - 1 : 0, x, x < w - 1 ? x + 1 : w - 1};
        unsigned char hist[16] = {};
        int best = 0;
        const unsigned char* pick = nullptr;
        for (int cx : xs) {
          for (int cy : ys) {
            const unsigned char* p = src + (static_cast<size_t>(cy) * w + cx) * bpp;
            int ch[4] = {};
            read_channels(p, bpp, ch);
            const int lv = static_cast<int>(IEL_LumaSum(ch[0], ch[1], ch[2]) >> 14);
            if (++hist[lv] > best) {
              best = hist[lv];
              pick = p;
            }
          }
        }
        std::memcpy(dst + (static_cast<size_t>(y) * w + x) * bpp, pick, bpp);
      }
    }
  });
  return IEL_OK;
}

namespace {
typedef int8_t i8x16 __attribute__((vector_size(16)));

// Oil paint of packed RGB in one pass over row bands, with no picture-sized
// buffer: each band keeps the darkened rows (the work picture) and their
// 16-level luminances in rings of three rows, each padded by a copy of its
// edge pixel on either side, so that the border windows read the same
// clamped neighbours as the plain path.
//
// Only the blurred red decides whether a pixel darkens, so only the red of
// the 3 x 3 binomial blur is formed (a column pass, then a row pass). The
// mode filter visits its window in the plain order k = 0..8 (left, middle,
// right column, each top to bottom); the plain running maximum picks the
// first visit whose running count of its level reaches the window's highest
// count, so for sixteen pixels at once each visit's running count is
// 1 + (earlier visits of the same level), their maximum is taken, and the
// first visit reaching it is the pick.
struct OilBand {
  unsigned char* work[3];   // (w + 2) pixels, padded
  unsigned char* level[3];  // w + 2 + 16 levels, padded
  uint16_t* column;         // red column sums, w
  unsigned char* pick;      // visit picked per pixel, w + 16
};

size_t oil_band_bytes(int w) {
  const size_t wp = static_cast<size_t>(w) + 2;
  auto up = [](size_t n) { return (n + 15) & ~static_cast<size_t>(15); };
  return 3 * up(3 * wp) + 3 * up(wp + 16) + up(2 * static_cast<size_t>(w)) + up(static_cast<size_t>(w) + 16);
}

OilBand oil_band(unsigned char* base, int w) {
  const size_t wp = static_cast<size_t>(w) + 2;
  auto up = [](size_t n) { return (n + 15) & ~static_cast<size_t>(15); };
  OilBand b;
  for (auto& r : b.work) {
    r = base;
    base += up(3 * wp);
  }
  for (auto& r : b.level) {
    r = base;
    std::memset(r, 0, wp + 16);  // the lanes past the row read defined bytes
    base += up(wp + 16);
  }
  b.column = reinterpret_cast<uint16_t*>(base);
  base += up(2 * static_cast<size_t>(w));
  b.pick = base;
  return b;
}

// Work row y (the pixel, or its channels squared over 255 where the blurred
// red is at least two above its own) and its levels, padded.
void oil_work_row(const unsigned char* src, int w, int h, int y, uint16_t* column, unsigned char* work,
                  unsigned char* level) {
  const size_t row = static_cast<size_t>(w) * 3;
  const unsigned char* up = src + (y > 0 ? y - 1 : 0) * row;
  const unsigned char* mid = src + y * row;
  const unsigned char* down = src + (y < h - 1 ? y + 1 : h - 1) * row;
  for (int x = 0; x < w; ++x) column[x] = static_cast<uint16_t>(up[3 * x] + 2 * mid[3 * x] + down[3 * x]);
  unsigned char* o = work + 3;
  unsigned char* l = level + 1;
  for (int x = 0; x < w; ++x) {
    const int xl = x > 0 ? x - 1 : 0, xr = x < w - 1 ? x + 1 : w - 1;
    const int red = (column[xl] + 2 * column[x] + column[xr]) >> 4;
    const unsigned char* p = mid + 3 * x;
    unsigned char* q = o + 3 * x;
    if (red - p[0] >= 2) {
      q[0] = static_cast<unsigned char>(p[0] * p[0] / 255);
      q[1] = static_cast<unsigned char>(p[1] * p[1] / 255);
      q[2] = static_cast<unsigned char>(p[2] * p[2] / 255);
    } else {
      q[0] = p[0];
      q[1] = p[1];
      q[2] = p[2];
    }
    l[x] = static_cast<unsigned char>(IEL_LumaSum(q[0], q[1], q[2]) >> 14);
  }
  std::memcpy(work, o, 3);
  std::memcpy(o + row, o + row - 3, 3);
  level[0] = l[0];
  l[w] = l[w - 1];
}

i8x16 load16(const unsigned char* p) {
  i8x16 v;
  std::memcpy(&v, p, 16);
  return v;
}

// The mode filter's picks for one output row from the padded level rows
// above, at and below it.
void oil_picks(const unsigned char* const rows[3], int w, unsigned char* pick) {
  for (int x = 0; x < w; x += 16) {
    i8x16 lv[9], count[9];
    for (int k = 0; k < 9; ++k) lv[k] = load16(rows[k % 3] + x + k / 3);
    i8x16 best = {};
    for (int k = 0; k < 9; ++k) {
      i8x16 c = {1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1};
      for (int j = 0; j < k; ++j) c -= static_cast<i8x16>(lv[j] == lv[k]);
      count[k] = c;
      const i8x16 more = static_cast<i8x16>(c > best);
      best = (c & more) | (best & ~more);
    }
    i8x16 first = {};
    for (int k = 8; k >= 0; --k) {
      const i8x16 hit = static_cast<i8x16>(count[k] == best);
      first = (hit & static_cast<int8_t>(k)) | (first & ~hit);
    }
    std::memcpy(pick + x, &first, 16);
  }
}

bool oil_paint_fused(const unsigned char* src, unsigned char* dst, int w, int h) {
  const int bands = px_band_count(h, 64);
  const size_t per_band = oil_band_bytes(w);
  const size_t total = per_band * static_cast<size_t>(bands);
  auto* scratch = total <= 0x7FFFFFFF ? static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(total))) : nullptr;
  if (!scratch) return false;
  std::atomic<int> next{0};
  const size_t row = static_cast<size_t>(w) * 3;
  px_for_rows(h, [&](int y0, int y1) {
    OilBand b = oil_band(scratch + per_band * static_cast<size_t>(next++), w);
    const int first = y0 > 0 ? y0 - 1 : 0;
    for (int y = first; y <= y0; ++y) oil_work_row(src, w, h, y, b.column, b.work[y % 3], b.level[y % 3]);
    for (int y = y0; y < y1; ++y) {
      const int ym = y > 0 ? y - 1 : 0, yp = y < h - 1 ? y + 1 : h - 1;
      if (yp > y) oil_work_row(src, w, h, yp, b.column, b.work[yp % 3], b.level[yp % 3]);
      const unsigned char* levels[3] = {b.level[ym % 3], b.level[y % 3], b.level[yp % 3]};
      oil_picks(levels, w, b.pick);
      // Visit k reads column x + k / 3 - 1 of row k % 3 of the window.
      const unsigned char* from[9];
      for (int k = 0; k < 9; ++k) from[k] = b.work[(k % 3 == 0 ? ym : k % 3 == 1 ? y : yp) % 3] + 3 * (k / 3);
      unsigned char* o = dst + y * row;
      for (int x = 0; x < w; ++x) {
        const unsigned char* p = from[b.pick[x]] + 3 * x;
        o[3 * x] = p[0];
        o[3 * x + 1] = p[1];
        o[3 * x + 2] = p[2];
      }
    }
  });
  IF_FREE(scratch);
  return true;
}
}  // namespace

int IEL_OilPaintEdge(structIELImage* input, structIELImage* output) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, rgb888_only)) return rc;
  // (An output that is the input itself takes the route through a whole
  // work picture: the bands would overwrite rows their neighbours read.)
  if (!px_scalar_only() && input->buffer != output->buffer) {
    if (oil_paint_fused(input->buffer, output->buffer, input->width, input->height)) return IEL_OK;
    IF_ERROR("Failed to allocate \n");
    return IEL_ERR_ALLOC;
  }
  const size_t n = pixel_count(input);
  auto* work = static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(n * 3)));
  if (!work) {
    IF_ERROR("Failed to allocate \n");
    return IEL_ERR_ALLOC;
  }
  structIELImage blurred{input->width, input->height, input->format, work};
  if (int rc = IEL_GaussianBlur(input, &blurred)) {
    IF_ERROR("Error in Guassian Blur\n");
    IF_FREE(work);
    return rc;
  }
  const unsigned char* src = input->buffer;
  const size_t row = static_cast<size_t>(input->width);
  px_for_rows(input->height, [&](int y0, int y1) {
    for (size_t i = y0 * row; i < y1 * row; ++i) {
      const unsigned char* p = src + 3 * i;
      unsigned char* q = work + 3 * i;
      const int d = q[0] - p[0];
      // Only a blurred red at least two above the pixel's own darkens it.
      if (d > 0 && d != 1) {
        for (int c = 0; c < 3; ++c) q[c] = static_cast<unsigned char>(p[c] * p[c] / 255);
      } else {
        std::memcpy(q, p, 3);
      }
    }
  });
  int rc = IEL_OilifyFix(&blurred, output);
  IF_FREE(work);
  return rc;
}

// ---- posterize ------------------------------------------------------------------

namespace {
constexpr int kPosterizeSteps = 255 / 43;

// o[i] = base plus the rise of every step p[i] has reached, by byte compares
// and masks, which vectorise (a table look-up per byte does not); on mixed
// bytes the compilers' branching forms were slower than the look-up.
void posterize_steps(const uint8_t* p, uint8_t* o, size_t n, uint8_t base, const uint8_t* rise) {
  const uint8_t r0 = rise[0], r1 = rise[1], r2 = rise[2], r3 = rise[3], r4 = rise[4];
  static_assert(kPosterizeSteps == 5);
  for (size_t i = 0; i < n; ++i) {
    const uint8_t v = p[i];
    uint8_t q = base;
    q = static_cast<uint8_t>(q + (static_cast<uint8_t>(-static_cast<uint8_t>(v >= 43)) & r0));
    q = static_cast<uint8_t>(q + (static_cast<uint8_t>(-static_cast<uint8_t>(v >= 86)) & r1));
    q = static_cast<uint8_t>(q + (static_cast<uint8_t>(-static_cast<uint8_t>(v >= 129)) & r2));
    q = static_cast<uint8_t>(q + (static_cast<uint8_t>(-static_cast<uint8_t>(v >= 172)) & r3));
    q = static_cast<uint8_t>(q + (static_cast<uint8_t>(-static_cast<uint8_t>(v >= 215)) & r4));
    o[i] = q;
  }
}

// In place, the vectorised loops' overlap check fails and both compilers fall
// back to their scalar loop: the bytes go through a local copy a run at a time.
void posterize_bytes(const uint8_t* p, uint8_t* o, size_t n, uint8_t base, const uint8_t* rise) {
  if (p != o) {
    posterize_steps(p, o, n, base, rise);
    return;
  }
  uint8_t run[256];
  for (size_t i = 0; i < n; i += sizeof run) {
    const size_t len = n - i < sizeof run ? n - i : sizeof run;
    std::memcpy(run, p + i, len);
    posterize_steps(run, o + i, len, base, rise);
  }
}
}  // namespace

int IEL_PosterizeNew(structIELImage* input, structIELImage* output) {
  IELProgressScope progress;
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, packed_pixels)) return rc;
  const int bpp = IEL_BytesPerPixel(input->format);
  int table[256];
  table[0] = 0;
  for (int i = 1; i < 256; ++i) {
    const double v = (0.5 + (i / 255.0 - 0.5) * 1.2100000000000002) * 255.0;
    table[i] = v < 0 ? 0 : (v > 255 ? 255 : static_cast<int>(v));
  }
  int level[256];
  for (int i = 0; i < 256; ++i) level[i] = table[(i / 43) * 43];
  // The levels are a staircase with a step at every multiple of 43, so the
  // fast path adds each step a byte reaches instead of looking it up.
  uint8_t rise[kPosterizeSteps];
  for (int k = 0; k < kPosterizeSteps; ++k) {
    rise[k] = static_cast<uint8_t>(level[43 * (k + 1)] - level[43 * (k + 1) - 1]);
  }
  const uint8_t base = static_cast<uint8_t>(level[0]);
  const int w = input->width, h = input->height;
  progress.start(static_cast<uint32_t>(h));
  if (progress.cancelled()) return IEL_ERR_CANCELLED;
  std::atomic<bool> stopped{false};
  const unsigned char* src = input->buffer;
  unsigned char* dst = output->buffer;
  const size_t row = static_cast<size_t>(w) * bpp;
  // Packed RGB on the fast path: every byte of a row through the levels.
  const bool bytewise = bpp == 3 && !px_scalar_only();
  px_for_rows(
      h,
      [&](int y0, int y1) {
        for (int y = y0; y < y1; ++y) {
          if (progress.cancelled() || stopped.load(std::memory_order_relaxed)) {
            stopped.store(true);
            return;
          }
          const unsigned char* p = src + y * row;
          unsigned char* o = dst + y * row;
          if (bytewise) {
            posterize_bytes(p, o, row, base, rise);
            progress.advance();
            continue;
          }
          for (int x = 0; x < w; ++x, p += bpp, o += bpp) {
            int c[4] = {};
            read_channels(p, bpp, c);
            // A 4-byte pixel keeps its fourth byte as the output holds it.
            c[0] = level[c[0]], c[1] = level[c[1]], c[2] = level[c[2]];
            write_channels(o, bpp == 4 ? 3 : bpp, c);
          }
          progress.advance();
        }
      },
      16);
  return stopped.load() ? IEL_ERR_CANCELLED : IEL_OK;
}

// ---- magic pen --------------------------------------------------------------------

int IEL_MagicPenNew_RGB(structIELImage* input, structIELImage* output) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, rgb888_only)) return rc;
  const int w = input->width, h = input->height;
  // Without interior pixels there is no gradient to draw: passed through.
  if (w < 3 || h < 3) {
    copy_image(input, output);
    return IEL_OK;
  }
  const size_t row = static_cast<size_t>(w) * 3;
  const unsigned char* src = input->buffer;
  unsigned char* dst = output->buffer;
  px_for_rows(h - 2, [&](int b0, int b1) {
    for (int y = b0 + 1; y < b1 + 1; ++y) {
      const unsigned char* a = src + (y - 1) * row;
      const unsigned char* b = src + y * row;
      const unsigned char* c = src + (y + 1) * row;
      unsigned char* o = dst + y * row;
      // Each tap its own pointer and the bound a local, so the index is the
      // only thing that moves: with wrapping signed arithmetic an offset
      // added to the index would hide that the reads are contiguous, and the
      // loop would not vectorise.
      const unsigned char *al = a, *am = a + 3, *ar = a + 6;
      const unsigned char *bl = b, *br = b + 6;
      const unsigned char *cl = c, *cm = c + 3, *cr = c + 6;
      unsigned char* out = o + 3;
      const int n = static_cast<int>(row) - 6;
      for (int k = 0; k < n; ++k) {
        const int gx = (ar[k] - al[k]) + 2 * (br[k] - bl[k]) + (cr[k] - cl[k]);
        const int gy = (cl[k] + 2 * cm[k] + cr[k]) - (al[k] + 2 * am[k] + ar[k]);
        const double g = std::sqrt(static_cast<double>(gx * gx + gy * gy));
        out[k] = g >= 255.0 ? 255 : static_cast<unsigned char>(g);
      }
      std::memcpy(o, o + 3, 3);
      std::memcpy(o + row - 3, o + row - 6, 3);
    }
  });
  std::memcpy(dst, dst + row, row);
  std::memcpy(dst + (h - 1) * row, dst + (h - 2) * row, row);
  return IEL_OK;
}

// ---- box blur and sketch -----------------------------------------------------------

int IEL_Variable_Blur_preview(structIELImage* input, structIELImage* output, unsigned int level) {
  IELProgressScope progress;
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, packed_pixels)) return rc;
  static const int kSizes[5] = {3, 5, 7, 9, 11};
  const int k = kSizes[level > 4 ? 4 : level];
  const int r = k / 2, area = k * k;
  const int w = input->width, h = input->height;
  const int bpp = IEL_BytesPerPixel(input->format);
  const int ch = bpp == 2 ? 3 : bpp;
  // Column sums of one output row: width * channels ints a band.
  const int bands = px_band_count(h, 16);
  const size_t sum_bytes = sizeof(int) * static_cast<size_t>(w) * ch * bands;
  auto* sums = sum_bytes <= 0x7FFFFFFF ? static_cast<int*>(IF_MALLOC(static_cast<int>(sum_bytes))) : nullptr;
  if (!sums) {
    IF_ERROR("Failed to allocate \n");
    return IEL_ERR_ALLOC;
  }
  progress.start(static_cast<uint32_t>(h));
  std::atomic<bool> stopped{false};
  std::atomic<int> next_band{0};
  const unsigned char* src = input->buffer;
  unsigned char* dst = output->buffer;
  const size_t row = static_cast<size_t>(w) * bpp;
  px_for_rows(
      h,
      [&](int y0, int y1) {
        int* col = sums + static_cast<size_t>(next_band.fetch_add(1)) * w * ch;
        for (int y = y0; y < y1; ++y) {
          if (progress.cancelled() || stopped.load(std::memory_order_relaxed)) {
            stopped.store(true);
            return;
          }
          std::memset(col, 0, sizeof(int) * w * ch);
          for (int dy = -r; dy <= r; ++dy) {
            const int sy = clampi(y + dy, 0, h - 1);
            const unsigned char* p = src + sy * row;
            for (int x = 0; x < w; ++x, p += bpp) {
              int c[4] = {};
              read_channels(p, bpp, c);
              for (int i = 0; i < ch; ++i) col[x * ch + i] += c[i];
            }
          }
          unsigned char* o = dst + y * row;
          for (int x = 0; x < w; ++x, o += bpp) {
            int acc[4] = {};
            for (int dx = -r; dx <= r; ++dx) {
              const int sx = clampi(x + dx, 0, w - 1);
              for (int i = 0; i < ch; ++i) acc[i] += col[sx * ch + i];
            }
            for (int i = 0; i < ch; ++i) acc[i] /= area;
            write_channels(o, bpp, acc);
          }
          progress.advance();
        }
      },
      16);
  IF_FREE(sums);
  return stopped.load() ? IEL_ERR_CANCELLED : IEL_OK;
}

namespace {
// floor(v / d) as (v * kReciprocal[d]) >> 32 with the reciprocal rounded up:
// exact for every v below 2^32 / d (the sketch divides at most 255 * 255 by
// d <= 255 and 255 * 121 by the box areas).
struct Reciprocals {
  uint32_t v[256];
};
constexpr Reciprocals make_reciprocals() {
  Reciprocals r{};
  for (int d = 1; d < 256; ++d) r.v[d] = static_cast<uint32_t>(((uint64_t{1} << 32) + d - 1) / d);
  return r;
}
constexpr Reciprocals kReciprocal = make_reciprocals();
inline uint32_t divide(uint32_t v, int d) {
  return static_cast<uint32_t>((static_cast<uint64_t>(v) * kReciprocal.v[d]) >> 32);
}

// IEL_Variable_Blur_preview on a picture whose three channels are equal,
// done once on one grey plane: running column sums down each band, a running
// sum along each row, the division by the box area as a multiplication.
// Progress and cancellation as the blur reports them.
int grey_box_blur(const unsigned char* in, unsigned char* out, int w, int h, unsigned level) {
  IELProgressScope progress;
  static const int kSizes[5] = {3, 5, 7, 9, 11};
  const int k = kSizes[level > 4 ? 4 : level];
  const int r = k / 2, area = k * k;
  const int bands = px_band_count(h, 16);
  const size_t sum_bytes = sizeof(uint32_t) * static_cast<size_t>(w) * bands;
  auto* sums = sum_bytes <= 0x7FFFFFFF ? static_cast<uint32_t*>(IF_MALLOC(static_cast<int>(sum_bytes))) : nullptr;
  if (!sums) {
    IF_ERROR("Failed to allocate \n");
    return IEL_ERR_ALLOC;
  }
  progress.start(static_cast<uint32_t>(h));
  std::atomic<bool> stopped{false};
  std::atomic<int> next_band{0};
  const size_t row = static_cast<size_t>(w);
  px_for_rows(
      h,
      [&](int y0, int y1) {
        uint32_t* col = sums + static_cast<size_t>(next_band.fetch_add(1)) * row;
        for (int x = 0; x < w; ++x) col[x] = 0;
        for (int dy = -r; dy <= r; ++dy) {
          const unsigned char* p = in + clampi(y0 + dy, 0, h - 1) * row;
          for (int x = 0; x < w; ++x) col[x] += p[x];
        }
        for (int y = y0; y < y1; ++y) {
          if (progress.cancelled() || stopped.load(std::memory_order_relaxed)) {
            stopped.store(true);
            return;
          }
          if (y > y0) {
            const unsigned char* add = in + clampi(y + r, 0, h - 1) * row;
            const unsigned char* sub = in + clampi(y - r - 1, 0, h - 1) * row;
            for (int x = 0; x < w; ++x) col[x] += static_cast<uint32_t>(add[x]) - sub[x];
          }
          unsigned char* o = out + y * row;
          uint32_t acc = 0;
          for (int dx = -r; dx <= r; ++dx) acc += col[clampi(dx, 0, w - 1)];
          for (int x = 0; x < w; ++x) {
            o[x] = static_cast<unsigned char>(divide(acc, area));
            acc += col[x + r + 1 < w ? x + r + 1 : w - 1] - col[x - r > 0 ? x - r : 0];
          }
          progress.advance();
        }
      },
      16);
  IF_FREE(sums);
  return stopped.load() ? IEL_ERR_CANCELLED : IEL_OK;
}

// The sketch on grey planes: every step works on one byte a pixel (the plain
// path below carries three equal channels), rows on worker threads.
int sketch_planes(structIELImage* input, structIELImage* output, int strokeDarkness, int blurLevel) {
  const int w = input->width, h = input->height;
  const size_t n = pixel_count(input);
  auto* a = n * 2 <= 0x7FFFFFFF ? static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(n * 2))) : nullptr;
  if (!a) {
    IF_ERROR("Failed to allocate \n");
    return IEL_ERR_ALLOC;
  }
  unsigned char* b = a + n;
  const unsigned char* src = input->buffer;
  unsigned char* dst = output->buffer;
  const size_t row = static_cast<size_t>(w);
  px_for_rows(h, [&](int y0, int y1) {
    for (size_t i = y0 * row; i < y1 * row; ++i) a[i] = static_cast<unsigned char>(255 - luma(src + 3 * i));
  });
  int rc = grey_box_blur(a, b, w, h, static_cast<unsigned>(blurLevel));
  if (rc != IEL_OK) {
    IF_ERROR("Error in Blur:\n");
    IF_FREE(a);
    return rc;
  }
  px_for_rows(h, [&](int y0, int y1) {
    for (size_t i = y0 * row; i < y1 * row; ++i) {
      const int d = 255 - b[i];
      const uint32_t v = divide(static_cast<uint32_t>(luma(src + 3 * i) * 255), d < 4 ? 4 : d);
      a[i] = static_cast<unsigned char>(v > 255 ? 255 : v);
    }
  });
  rc = grey_box_blur(a, b, w, h, 0);
  if (rc == IEL_OK) {
    px_for_rows(h, [&](int y0, int y1) {
      for (size_t i = y0 * row; i < y1 * row; ++i) {
        int c = b[i];
        for (int k = 0; k < strokeDarkness; ++k) c = c * c >> 8;
        std::memset(dst + 3 * i, c, 3);
      }
    });
  }
  IF_FREE(a);
  return rc;
}

// The sketch (and, given a texture, its blend with the texture) streamed
// over row bands without picture-sized planes. Each band keeps the inverted
// luma of the rows its blur window spans in a ring of eight rows, the blur's
// running column sums, and the dodged rows (luma * 255 over 255 minus the
// blurred inverse) in a ring of three; every output row is the 3 x 3 box of
// those, darkened and, with a texture, blended with it through a table of
// every (darkened grey, texture byte) pair. The same sums and divisions as
// the planes above, row borders clamped the same way.
struct SketchBand {
  unsigned char* inverse[8];
  unsigned char* dodged[3];
  uint32_t* column;
  uint16_t* triple;
  unsigned char* grey;
};

int sketch_streamed(const unsigned char* src, unsigned char* dst, int w, int h, int strokeDarkness, int blurLevel,
                    const unsigned char* texture) {
  IELProgressScope progress;
  static const int kSizes[5] = {3, 5, 7, 9, 11};
  const int r = kSizes[blurLevel] / 2, area = kSizes[blurLevel] * kSizes[blurLevel];
  const size_t wu = (static_cast<size_t>(w) + 15) & ~static_cast<size_t>(15);
  const size_t per_band = 11 * wu + 4 * wu + 2 * wu + wu;
  const int bands = px_band_count(h, 16);
  const size_t table_bytes = texture ? 65536 : 0;
  const size_t total = per_band * static_cast<size_t>(bands) + table_bytes;
  auto* scratch = total <= 0x7FFFFFFF ? static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(total))) : nullptr;
  if (!scratch) {
    IF_ERROR("Failed to allocate \n");
    return IEL_ERR_ALLOC;
  }
  // The darkening of every grey; the texture blend of every darkened grey
  // and texture byte.
  unsigned char dark[256];
  for (int c = 0; c < 256; ++c) {
    int v = c;
    for (int k = 0; k < strokeDarkness; ++k) v = v * v >> 8;
    dark[c] = static_cast<unsigned char>(v);
  }
  unsigned char* blend = scratch + per_band * static_cast<size_t>(bands);
  if (texture) {
    for (int s = 0; s < 256; ++s)
      for (int t = 0; t < 256; ++t) {
        blend[s * 256 + t] = static_cast<unsigned char>(clampi((s * s + (t - 15) * (255 - s)) / 255, 0, 255));
      }
  }
  progress.start(static_cast<uint32_t>(h));
  std::atomic<bool> stopped{false};
  std::atomic<int> next_band{0};
  const size_t row = static_cast<size_t>(w);
  px_for_rows(
      h,
      [&](int y0, int y1) {
        unsigned char* base = scratch + per_band * static_cast<size_t>(next_band.fetch_add(1));
        SketchBand b;
        for (auto& v : b.inverse) v = base, base += wu;
        for (auto& v : b.dodged) v = base, base += wu;
        b.column = reinterpret_cast<uint32_t*>(base);
        base += 4 * wu;
        b.triple = reinterpret_cast<uint16_t*>(base);
        base += 2 * wu;
        b.grey = base;
        int made = -1;  // inverse rows 0..made are in the ring (the last eight of them)
        auto inverse = [&](int y) {
          y = clampi(y, 0, h - 1);
          for (; made < y; ++made) {
            const unsigned char* p = src + (made + 1) * row * 3;
            unsigned char* a = b.inverse[(made + 1) & 7];
            for (int x = 0; x < w; ++x) a[x] = static_cast<unsigned char>(255 - luma(p + 3 * x));
          }
          return b.inverse[y & 7];
        };
        // Dodged rows from the first one the band reads on; the column sums
        // follow the row being dodged.
        int dodge_row = clampi(y0 - 1, 0, h - 1);
        made = dodge_row - r - 1 < -1 ? -1 : dodge_row - r - 1;
        for (int x = 0; x < w; ++x) b.column[x] = 0;
        for (int dy = -r; dy <= r; ++dy) {
          const unsigned char* a = inverse(dodge_row + dy);
          for (int x = 0; x < w; ++x) b.column[x] += a[x];
        }
        auto dodge = [&](int y) {
          for (; dodge_row < y; ++dodge_row) {
            const unsigned char* add = inverse(dodge_row + 1 + r);
            const unsigned char* sub = inverse(dodge_row - r);
            for (int x = 0; x < w; ++x) b.column[x] += static_cast<uint32_t>(add[x]) - sub[x];
          }
          const unsigned char* a = inverse(y);
          unsigned char* o = b.dodged[y % 3];
          const uint32_t* col = b.column;
          uint32_t acc = 0;
          for (int dx = -r; dx <= r; ++dx) acc += col[clampi(dx, 0, w - 1)];
          for (int x = 0; x < w; ++x) {
            const int d = 255 - static_cast<int>(divide(acc, area));
            const uint32_t v = divide(static_cast<uint32_t>((255 - a[x]) * 255), d < 4 ? 4 : d);
            o[x] = static_cast<unsigned char>(v > 255 ? 255 : v);
            acc += col[x + r + 1 < w ? x + r + 1 : w - 1] - col[x - r > 0 ? x - r : 0];
          }
        };
        dodge(dodge_row);
        if (y0 > dodge_row) dodge(y0);
        for (int y = y0; y < y1; ++y) {
          if (progress.cancelled() || stopped.load(std::memory_order_relaxed)) {
            stopped.store(true);
            return;
          }
          const int ym = y > 0 ? y - 1 : 0, yp = y < h - 1 ? y + 1 : h - 1;
          if (yp > y) dodge(yp);
          const unsigned char* u = b.dodged[ym % 3];
          const unsigned char* m = b.dodged[y % 3];
          const unsigned char* d = b.dodged[yp % 3];
          uint16_t* t3 = b.triple;
          for (int x = 0; x < w; ++x) t3[x] = static_cast<uint16_t>(u[x] + m[x] + d[x]);
          uint32_t acc = t3[0] + t3[0] + t3[w > 1 ? 1 : 0];
          unsigned char* g = b.grey;
          for (int x = 0; x < w; ++x) {
            g[x] = dark[divide(acc, 9)];
            acc += t3[x + 2 < w ? x + 2 : w - 1] - t3[x - 1 > 0 ? x - 1 : 0];
          }
          unsigned char* o = dst + y * row * 3;
          if (texture) {
            const unsigned char* t = texture + y * row * 4;
            for (int x = 0; x < w; ++x) {
              uint32_t tp;
              std::memcpy(&tp, t + 4 * x, 4);
              g[x] = blend[g[x] * 256 + (tp & 0xFF)];
            }
          }
          for (int x = 0; x < w; ++x) o[3 * x] = o[3 * x + 1] = o[3 * x + 2] = g[x];
          progress.advance();
        }
      },
      16);
  IF_FREE(scratch);
  return stopped.load() ? IEL_ERR_CANCELLED : IEL_OK;
}
}  // namespace

int IEL_SketchNew2(structIELImage* input, structIELImage* output, int strokeDarkness, int blurLevel) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, rgb888_only)) return rc;
  strokeDarkness = clampi(strokeDarkness, 1, 3);
  blurLevel = clampi(blurLevel, 1, 2);
  if (!px_scalar_only()) {
    // (In place, the planes: the streamed bands would overwrite rows their
    // neighbours still read.)
    if (input->buffer == output->buffer) return sketch_planes(input, output, strokeDarkness, blurLevel);
    return sketch_streamed(input->buffer, output->buffer, input->width, input->height, strokeDarkness, blurLevel,
                           nullptr);
  }
  const size_t n = pixel_count(input);
  auto* grey = static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(n * 3)));
  if (!grey) {
    IF_ERROR("Failed to allocate \n");
    return IEL_ERR_ALLOC;
  }
  structIELImage work{input->width, input->height, input->format, grey};
  const unsigned char* src = input->buffer;
  unsigned char* dst = output->buffer;
  for (size_t i = 0; i < n; ++i) std::memset(dst + 3 * i, 255 - luma(src + 3 * i), 3);
  int rc = IEL_Variable_Blur_preview(output, &work, static_cast<unsigned>(blurLevel));
  if (rc != IEL_OK) {
    IF_ERROR("Error in Blur:\n");
    IF_FREE(grey);
    return rc;
  }
  for (size_t i = 0; i < n; ++i) {
    int d = 255 - grey[3 * i];
    if (d < 4) d = 4;
    int v = luma(src + 3 * i) * 255 / d;
    std::memset(dst + 3 * i, v > 255 ? 255 : v, 3);
  }
  rc = IEL_Variable_Blur_preview(output, &work, 0);
  if (rc == IEL_OK) {
    for (size_t i = 0; i < n; ++i) {
      int c = grey[3 * i];
      for (int k = 0; k < strokeDarkness; ++k) c = c * c >> 8;
      std::memset(dst + 3 * i, c, 3);
    }
  }
  IF_FREE(grey);
  return rc;
}

int IEL_Sketch_Texture(structIELImage* input, structIELImage* output, structIELImage* texture, int, int) {
  if (!texture || !texture->buffer) {
    IF_ERROR("Texture image structure in NULL \n");
    return IEL_ERR_NULL;
  }
  const bool fits =
      texture->width == input->width && texture->height == input->height && texture->format == IEL_FORMAT_ARGB_PACK;
  if (fits && !px_scalar_only()) {
    // The sketch's checks as it logs them, then its clamped darkness 3 and
    // blur level 2, blended as it goes.
    if (int rc = IEL_CheckEffectImages("IEL_SketchNew2", input, output, 1, 1, rgb888_only)) return rc;
    if (input->buffer != output->buffer) {
      return sketch_streamed(input->buffer, output->buffer, input->width, input->height, 3, 2, texture->buffer);
    }
  }
  if (int rc = IEL_SketchNew2(input, output, 3, 3)) return rc;
  if (!fits) {
    IF_ERROR("Textrue image dims(%d x %d) MUST match Input Dims \n", texture->width, texture->height);
    return IEL_ERR_DIMENSION;
  }
  unsigned char* dst = output->buffer;
  const size_t row = static_cast<size_t>(input->width);
  px_for_rows(input->height, [&](int y0, int y1) {
    for (size_t i = y0 * row; i < y1 * row; ++i) {
      uint32_t tp;
      std::memcpy(&tp, texture->buffer + 4 * i, 4);
      const int t = static_cast<int>(tp & 0xFF);
      const int s = dst[3 * i];
      const int v = (s * s + (t - 15) * (255 - s)) / 255;
      std::memset(dst + 3 * i, clampi(v, 0, 255), 3);
    }
  });
  return IEL_OK;
}

// ---- spread ---------------------------------------------------------------------------

int IEL_Spread_ARGB(structIELImage* input, structIELImage* output, unsigned char amount) {
  const int k = amount == 0 ? 1 : (1 << (amount > 4 ? 4 : amount)) - 1;
  if (!input || !output || !input->buffer || !output->buffer) {
    return IEL_CheckEffectImages(__func__, input, output, 1, 1, nullptr);
  }
  const int w = input->width, h = input->height;
  if (w <= 0 || h <= 0) {
    IF_ERROR("Failed with Error = %d", 1);
    return IEL_ERR_NULL;
  }
  if (input->format != IEL_FORMAT_ARGB_PACK || output->format != IEL_FORMAT_ARGB_PACK) {
    IF_ERROR("Failed with input image format= %d", input->format);
    return IEL_ERR_FORMAT;
  }
  const auto* src = reinterpret_cast<const uint32_t*>(input->buffer);
  auto* dst = reinterpret_cast<uint32_t*>(output->buffer);
  std::memset(dst, 0, pixel_count(input) * 4);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const long a = if_lrand();
      const long b = if_lrand();
      int sx = x + k - 2 * static_cast<int>((a + 1) % k);
      int sy = y + k - 2 * static_cast<int>((b + 1) % k);
      if (sx >= w) {
        sx %= w;
      } else if (sx < 0) {
        sx = -(sx % w);
      }
      sy = clampi(sy, 0, h - 1);
      dst[static_cast<size_t>(y) * w + x] = src[static_cast<size_t>(sy) * w + sx];
    }
  }
  return IEL_OK;
}
