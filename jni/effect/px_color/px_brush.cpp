// Brushes, pixelize, colour splash, invert and lens tints.
#include "px_brush.h"

#include <cmath>
#include <cstdint>
#include <cstring>

#include "../kalo/if_utils_and.h"
#include "../kalo/px_mem.h"
#include "px_fixed.h"
#include "px_region.h"

namespace {

// The brush box, clipped to the picture; empty when lo > hi.
struct Box {
  int x0, x1, y0, y1;
  bool empty() const { return x0 > x1 || y0 > y1; }
};

Box brush_box(int cx, int cy, int r, int width, int height) {
  const int64_t x0 = static_cast<int64_t>(cx) - r, x1 = static_cast<int64_t>(cx) + r;
  const int64_t y0 = static_cast<int64_t>(cy) - r, y1 = static_cast<int64_t>(cy) + r;
  return {static_cast<int>(x0 < 0 ? 0 : x0), static_cast<int>(x1 > width - 1 ? width - 1 : x1),
          static_cast<int>(y0 < 0 ? 0 : y0), static_cast<int>(y1 > height - 1 ? height - 1 : y1)};
}

bool usable(const int* image, int width, int height) { return image && width > 0 && height > 0; }

// Calls fn(pixel, d2, r2) for every pixel strictly inside the brush.
template <class Fn>
void for_brush(int* image, int cx, int cy, int width, int height, int r, Fn fn) {
  if (!usable(image, width, height) || r <= 0) return;
  const Box b = brush_box(cx, cy, r, width, height);
  if (b.empty()) return;
  const int64_t r2 = static_cast<int64_t>(r) * r;
  for (int y = b.y0; y <= b.y1; ++y) {
    const int64_t dy = static_cast<int64_t>(cy) - y;
    uint32_t* row = reinterpret_cast<uint32_t*>(image) + static_cast<size_t>(y) * static_cast<size_t>(width);
    for (int x = b.x0; x <= b.x1; ++x) {
      const int64_t dx = static_cast<int64_t>(cx) - x;
      const int64_t d2 = dx * dx + dy * dy;
      if (d2 < r2) row[x] = fn(row[x], x, y, d2, r2);
    }
  }
}

template <class Channel>
uint32_t per_channel(uint32_t p, Channel ch) {
  return (p & 0xFF000000u) | static_cast<uint32_t>(ch(static_cast<int>((p >> 16) & 255))) << 16 |
         static_cast<uint32_t>(ch(static_cast<int>((p >> 8) & 255))) << 8 |
         static_cast<uint32_t>(ch(static_cast<int>(p & 255)));
}

// 2^22 / r^2 in single precision, truncated (the falloff step of the
// quadratic brushes).
int64_t quadratic_step(int r) {
  const float r2 = static_cast<float>(static_cast<int64_t>(r) * r);
  return static_cast<int64_t>(4194304.0f / r2);
}

// One pixel of the lighten brush at squared distance d2 < r2.
uint32_t lighten_pixel(uint32_t p, int64_t d2, int64_t r2, int64_t inv, int strength) {
  const int64_t e = r2 - d2;
  return per_channel(p, [&](int c) {
    int64_t v = ((c * d2 + (c + static_cast<int64_t>(strength)) * e) * inv) >> 22;
    if (v > 255) v = 255;
    return static_cast<int>(v < c ? c : v);
  });
}

void lighten(int* image, int cx, int cy, int width, int height, int strength, int r) {
  if (r <= 0) return;
  const int64_t inv = quadratic_step(r);
  for_brush(image, cx, cy, width, height, r, [&](uint32_t p, int, int, int64_t d2, int64_t r2) {
    return lighten_pixel(p, d2, r2, inv, strength);
  });
}

void darken_quadratic(int* image, int cx, int cy, int width, int height, int strength, int r) {
  if (r <= 0) return;
  const int64_t inv = quadratic_step(r);
  for_brush(image, cx, cy, width, height, r, [&](uint32_t p, int, int, int64_t d2, int64_t r2) {
    const int64_t e = r2 - d2;
    return per_channel(p, [&](int c) {
      int64_t v = ((c * d2 + (c - static_cast<int64_t>(strength)) * e) * inv) >> 22;
      if (v < 0) v = 0;
      return static_cast<int>(v > c ? c : v);
    });
  });
}

// Rewrites the preview over the changed box of the full picture.
void refresh_preview(const int* image, int width, int height, int* preview, int pw, int ph, Box changed) {
  if (!preview || pw <= 0 || ph <= 0 || changed.empty()) return;
  // 12-bit scale factors in single precision, truncated; heights use the
  // width-based factors (the preview keeps the aspect ratio).
  const int64_t f = static_cast<int64_t>(static_cast<float>(static_cast<int64_t>(pw) << 12) / static_cast<float>(width));
  const int64_t g = static_cast<int64_t>(static_cast<float>(static_cast<int64_t>(width) << 12) / static_cast<float>(pw));
  int64_t px0 = ((changed.x0 - 1) * f) >> 12, px1 = ((changed.x1 + 1) * f) >> 12;
  int64_t py0 = ((changed.y0 - 1) * f) >> 12, py1 = ((changed.y1 + 1) * f) >> 12;
  if (px0 < 0) px0 = 0;
  if (py0 < 0) py0 = 0;
  if (px1 > pw - 1) px1 = pw - 1;
  if (py1 > ph - 1) py1 = ph - 1;
  for (int64_t py = py0; py <= py1; ++py) {
    const int64_t sy = (py * g) >> 12;
    if (sy >= height) continue;
    for (int64_t px = px0; px <= px1; ++px) {
      const int64_t sx = (px * g) >> 12;
      if (sx >= width) continue;
      preview[py * pw + px] = image[sy * width + sx];
    }
  }
}

// The rounded square root of a squared distance (the bitwise root where it
// fits in 31 bits, as for every brush that fits a picture).
int64_t distance(int64_t d2) {
  if (d2 <= 0x7FFFFFFF) return isqrt_(static_cast<int>(d2));
  return static_cast<int64_t>(std::sqrt(static_cast<double>(d2)) + 0.5);
}

// One pixel of the full-picture darken brush at squared distance d2 < r^2;
// k = 2^20 / r.
uint32_t darken_pixel(uint32_t p, int64_t d2, int r, int64_t k, int strength) {
  const int64_t d = distance(d2);
  return per_channel(p, [&](int c) {
    int64_t v = ((c * d + (c - static_cast<int64_t>(strength)) * (r - d)) * k) >> 20;
    // A negative strength lightens: keep the channel within a byte.
    return static_cast<int>(v < 0 ? 0 : (v > 255 ? 255 : v));
  });
}

// Calls fn(pixel, d2, r2) for the sampled pixels strictly inside the brush:
// pixel (i, j) of `pixels` (rows `stride` apart) is the photo pixel
// (xs[i], ys[j]).
template <class Fn>
void for_brush_at(int* pixels, int stride, const int* xs, int nx, const int* ys, int ny, int cx, int cy, int r,
                  Fn fn) {
  if (!pixels || !xs || !ys || r <= 0) return;
  const int64_t r2 = static_cast<int64_t>(r) * r;
  for (int j = 0; j < ny; ++j) {
    const int64_t dy = static_cast<int64_t>(cy) - ys[j];
    if (dy * dy >= r2) continue;
    uint32_t* row = reinterpret_cast<uint32_t*>(pixels) + static_cast<size_t>(j) * static_cast<size_t>(stride);
    for (int i = 0; i < nx; ++i) {
      const int64_t dx = static_cast<int64_t>(cx) - xs[i];
      const int64_t d2 = dx * dx + dy * dy;
      if (d2 < r2) row[i] = fn(row[i], d2, r2);
    }
  }
}

// Cell arithmetic with the target's shift rule: a shift of 32 or more (low
// byte of the count) clears everything.
inline int cell_of(int v, int s) { return s >= 32 ? (v < 0 ? -1 : 0) : v >> s; }
inline int cell_origin(int v, int s) { return s >= 32 ? 0 : (v >> s) << s; }

// ---- splash -----------------------------------------------------------------

struct Splash {
  int* colour = nullptr;
  int width = 0, height = 0;
};
Splash g_splash;

inline uint32_t grey_of(uint32_t p) {
  const uint32_t g = (((p >> 16) & 255) + 2 * ((p >> 8) & 255) + (p & 255)) >> 2;
  return (p & 0xFF000000u) | g << 16 | g << 8 | g;
}

bool splash_matches(const int* image, int width, int height) {
  return usable(image, width, height) && g_splash.colour && g_splash.width == width && g_splash.height == height;
}

// ---- lens ---------------------------------------------------------------------

struct Tint {
  int t[3];  // R, G, B of the tint (up to 256)
  uint32_t pull(uint32_t p, fixed a) const {
    int c[3] = {static_cast<int>((p >> 16) & 255), static_cast<int>((p >> 8) & 255), static_cast<int>(p & 255)};
    for (int k = 0; k < 3; ++k) {
      if (c[k] > t[k]) {
        const int v = fixtoi(c[k] * a + t[k] * (65536 - a));
        c[k] = v > 255 ? 255 : v;
      }
    }
    return (p & 0xFF000000u) | static_cast<uint32_t>(c[0]) << 16 | static_cast<uint32_t>(c[1]) << 8 |
           static_cast<uint32_t>(c[2]);
  }
};

bool lens_start(int* in, int* out, int width, int height, int level, Tint* tint) {
  int r, g, b;
  px_hsv2rgb(static_cast<int>(static_cast<uint32_t>(level) * 18u), 65536, 256, &r, &g, &b);
  *tint = {{r, g, b}};
  if (width < 1 || height < 1) return false;
  if (in != out) std::memmove(out, in, static_cast<size_t>(width) * static_cast<size_t>(height) * 4);
  return true;
}

}  // namespace

// ---- brushes -------------------------------------------------------------------

void px_apply_lighten(int* image, int cx, int cy, int width, int height, int strength, int r) {
  lighten(image, cx, cy, width, height, strength, r);
}

void px_apply_lighten_with_preview(int* image, int cx, int cy, int width, int height, int* preview,
                                   int preview_width, int preview_height, int strength, int r) {
  if (!usable(image, width, height) || r <= 0) return;
  lighten(image, cx, cy, width, height, strength, r);
  refresh_preview(image, width, height, preview, preview_width, preview_height, brush_box(cx, cy, r, width, height));
}

void px_apply_darken_with_preview(int* image, int cx, int cy, int width, int height, int* preview,
                                  int preview_width, int preview_height, int strength, int r) {
  if (!usable(image, width, height) || r <= 0) return;
  darken_quadratic(image, cx, cy, width, height, strength, r);
  refresh_preview(image, width, height, preview, preview_width, preview_height, brush_box(cx, cy, r, width, height));
}

void px_apply_darken(int* image, int cx, int cy, int width, int height, int strength, int r) {
  if (!usable(image, width, height) || r <= 0) return;
  // Squared horizontal distances 0..r.
  auto* sq = static_cast<int64_t*>(IF_CALLOC(static_cast<int>(sizeof(int64_t)), r + 1));
  if (!sq) {
    IF_ERROR("px_apply_darken effect: Low memory\n");
    return;
  }
  for (int i = 0; i <= r; ++i) sq[i] = static_cast<int64_t>(i) * i;
  const int64_t k = 0x100000 / r;
  const Box b = brush_box(cx, cy, r, width, height);
  const int64_t r2 = static_cast<int64_t>(r) * r;
  for (int y = b.y0; y <= b.y1; ++y) {
    const int64_t dy2 = sq[cy > y ? cy - y : y - cy];
    uint32_t* row = reinterpret_cast<uint32_t*>(image) + static_cast<size_t>(y) * static_cast<size_t>(width);
    for (int x = b.x0; x <= b.x1; ++x) {
      const int64_t d2 = sq[cx > x ? cx - x : x - cx] + dy2;
      if (d2 >= r2) continue;
      row[x] = darken_pixel(row[x], d2, r, k, strength);
    }
  }
  IF_FREE(sq);
}

void px_apply_lighten_at(int* pixels, int stride, const int* xs, int nx, const int* ys, int ny, int cx, int cy,
                         int strength, int r) {
  if (r <= 0) return;
  const int64_t inv = quadratic_step(r);
  for_brush_at(pixels, stride, xs, nx, ys, ny, cx, cy, r,
               [&](uint32_t p, int64_t d2, int64_t r2) { return lighten_pixel(p, d2, r2, inv, strength); });
}

void px_apply_darken_at(int* pixels, int stride, const int* xs, int nx, const int* ys, int ny, int cx, int cy,
                        int strength, int r) {
  if (r <= 0) return;
  const int64_t k = 0x100000 / r;
  for_brush_at(pixels, stride, xs, nx, ys, ny, cx, cy, r,
               [&](uint32_t p, int64_t d2, int64_t) { return darken_pixel(p, d2, r, k, strength); });
}

// ---- pixelize ---------------------------------------------------------------------

void px_apply_pixelize(int* in, int* out, int width, int height, int shift) {
  if (!in || !out || width < 1 || height < 1) return;
  const int s = shift & 255;
  const size_t w = static_cast<size_t>(width);
  if (s >= 32) {
    const int first = in[0];
    for (size_t i = 0, n = w * static_cast<size_t>(height); i < n; ++i) out[i] = first;
    return;
  }
  // A cell's top-left pixel maps to itself and is never rewritten, so the
  // rows may be done in any order, also in place.
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const int* src = in + static_cast<size_t>(cell_origin(y, s)) * w;
      int* dst = out + static_cast<size_t>(y) * w;
      for (int x = 0; x < width; ++x) {
        const int ox = cell_origin(x, s);
        if (src + ox != dst + x) dst[x] = src[ox];
      }
    }
  });
}

void px_rub_pixelize(int* image, int width, int height, int shift, int cx, int cy, int r) {
  if (!usable(image, width, height)) return;
  const int s = shift & 255;
  const int64_t lo_x = static_cast<int64_t>(cx) - r, hi_x = static_cast<int64_t>(cx) + r;
  const int64_t lo_y = static_cast<int64_t>(cy) - r, hi_y = static_cast<int64_t>(cy) + r;
  auto origin64 = [&](int64_t v) -> int64_t { return s >= 32 ? 0 : (v >> s) << s; };
  const int64_t x0 = origin64(lo_x) < 0 ? 0 : origin64(lo_x), x1 = origin64(hi_x) > width - 1 ? width - 1 : origin64(hi_x);
  const int64_t y0 = origin64(lo_y) < 0 ? 0 : origin64(lo_y), y1 = origin64(hi_y) > height - 1 ? height - 1 : origin64(hi_y);
  const int reach = s >= 32 ? (r < 0 ? -1 : 0) : r >> s;
  const int ccx = cell_of(cx, s), ccy = cell_of(cy, s);
  const size_t w = static_cast<size_t>(width);
  for (int64_t y = y0; y <= y1; ++y) {
    const int yy = static_cast<int>(y);
    const int dyc = ccy - cell_of(yy, s);
    const int* src = image + static_cast<size_t>(cell_origin(yy, s)) * w;
    int* dst = image + static_cast<size_t>(yy) * w;
    for (int64_t x = x0; x <= x1; ++x) {
      const int xx = static_cast<int>(x);
      const int dxc = ccx - cell_of(xx, s);
      if ((dxc < 0 ? -dxc : dxc) + (dyc < 0 ? -dyc : dyc) <= reach) dst[xx] = src[cell_origin(xx, s)];
    }
  }
}

void px_rub_pixelize_with_preview(int* image, int width, int height, int* preview, int preview_width,
                                  int preview_height, int shift, int cx, int cy, int r) {
  if (!usable(image, width, height)) return;
  px_rub_pixelize(image, width, height, shift, cx, cy, r);
  refresh_preview(image, width, height, preview, preview_width, preview_height, brush_box(cx, cy, r, width, height));
}

// ---- splash --------------------------------------------------------------------------

void px_init_splash(int* image, int width, int height) {
  if (!usable(image, width, height)) return;
  px_finish_splash();  // a second init replaces the earlier copy
  const size_t n = static_cast<size_t>(width) * static_cast<size_t>(height);
  auto* copy = static_cast<int*>(px_calloc(n, 4));
  if (!copy) return;
  std::memcpy(copy, image, n * 4);
  g_splash = {copy, width, height};
  px_set_gray_splash(image, image, width, height);
}

void px_set_gray_splash(int* in, int* out, int width, int height) {
  if (!in || !out) return;
  px_map_pixels(in, out, width, height, grey_of);
}

void px_draw_splash(int* image, int cx, int cy, int width, int height, int r) {
  if (!splash_matches(image, width, height)) return;
  const uint32_t* colour = reinterpret_cast<const uint32_t*>(g_splash.colour);
  const size_t w = static_cast<size_t>(width);
  for_brush(image, cx, cy, width, height, r,
            [&](uint32_t, int x, int y, int64_t, int64_t) { return colour[static_cast<size_t>(y) * w + x]; });
}

void px_draw_splash_with_preview(int* image, int cx, int cy, int width, int height, int* preview,
                                 int preview_width, int preview_height, int r) {
  if (!splash_matches(image, width, height) || r <= 0) return;
  px_draw_splash(image, cx, cy, width, height, r);
  refresh_preview(image, width, height, preview, preview_width, preview_height, brush_box(cx, cy, r, width, height));
}

void px_recover_splash(int* image, int width, int height) {
  if (!splash_matches(image, width, height)) return;
  std::memcpy(image, g_splash.colour, static_cast<size_t>(width) * static_cast<size_t>(height) * 4);
}

void px_finish_splash() {
  px_free(g_splash.colour);
  g_splash = {};
}

bool px_splash_active() { return g_splash.colour != nullptr; }

// ---- invert and lens tints ---------------------------------------------------------------

int px_apply_invert(int* in, unsigned char* mask, int* out, int width, int height, px_rect rect) {
  if (!in || !mask || !out) return PX_ERR_NULL;
  px_region_map(in, mask, out, width, height, rect, [](uint32_t p) { return p ^ 0x00FFFFFFu; });
  return PX_OK;
}

int px_control_edgelens(int* in, int* out, int width, int height, int level, int size) {
  if (!in || !out || size > 100) return PX_ERR_NULL;
  Tint tint;
  if (!lens_start(in, out, width, height, level, &tint)) return PX_OK;
  const int longer = width > height ? width : height;
  const int band = static_cast<int>((longer >> 1) * (size / 100.0));
  // A band narrower than one pixel has no weight to give (and would divide
  // by zero): the copy stands.
  if (band < 1) return PX_OK;
  auto* px = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  auto apply = [&](int x, int y, int e) {
    uint32_t& p = px[static_cast<size_t>(y) * w + x];
    p = tint.pull(p, itofix(e) / band);
  };
  for (int y = 0; y < height; ++y) {
    const int ey = y < height - y ? y : height - y;
    for (int x = 0; x < width; ++x) {
      const int ex = x < width - x ? x : width - x;
      const int e = ex < ey ? ex : ey;
      if (e <= band) {
        apply(x, y, e);
      } else if (ey > band && x > band && x < width - band) {
        x = width - band - 1;  // skip the untouched middle of the row
      }
    }
  }
  return PX_OK;
}

int px_control_toplens(int* in, int* out, int width, int height, int level, int size) {
  if (!in || !out || size > 100) return PX_ERR_NULL;
  Tint tint;
  if (!lens_start(in, out, width, height, level, &tint)) return PX_OK;
  int band = static_cast<int>(height * (size / 100.0));
  if (band < 1) return PX_OK;
  if (band > height) band = height;
  auto* px = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  for (int y = 0; y < band; ++y) {
    const fixed a = itofix(y) / band;
    uint32_t* row = px + static_cast<size_t>(y) * w;
    for (size_t x = 0; x < w; ++x) row[x] = tint.pull(row[x], a);
  }
  return PX_OK;
}
