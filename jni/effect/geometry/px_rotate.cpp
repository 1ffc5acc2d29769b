// Quarter turns, flips, free rotation, straighten and crop.
#include <climits>
#include <cstring>

#include "../kalo/px_parallel.h"
#include "../px_types.h"
#include "px_geometry.h"

namespace {
// A double converted to int with saturation instead of undefined behaviour;
// NaN gives 0. Inside the int range it truncates towards zero like a cast.
int saturating_int(double v) {
  if (!(v == v)) return 0;
  if (v >= 2147483647.0) return INT_MAX;
  if (v <= -2147483648.0) return INT_MIN;
  return static_cast<int>(v);
}

// Signed division that wraps INT_MIN / -1 instead of trapping.
int div_wrap(int a, int b) { return (a == INT_MIN && b == -1) ? INT_MIN : a / b; }

struct Trig {
  fixed cos;
  fixed sin;
};

Trig trig(int degrees) {
  const fixed a = px_geometry_angle(degrees);
  return {fixcos(a), fixsin(a)};
}

int max4(int a, int b, int c, int d) {
  int m = a > b ? a : b;
  m = m > c ? m : c;
  return m > d ? m : d;
}
int min4(int a, int b, int c, int d) {
  int m = a < b ? a : b;
  m = m < c ? m : c;
  return m < d ? m : d;
}

size_t area(int w, int h) { return static_cast<size_t>(w) * static_cast<size_t>(h); }
}  // namespace

fixed px_geometry_angle(int degrees) {
  const double radians = static_cast<double>(degrees) / 180.0 * 3.141592;
  const float narrowed = static_cast<float>(radians);
  return fixmul(ftofix(static_cast<double>(narrowed)), 2670177);
}

int px_geometry_scale8(float scale) {
  const float product = scale * 65536.0f;
  return saturating_int(static_cast<double>(product)) >> 8;
}

int px_rotate_flip(int* src, int* dst, int width, int height, int rotation, int flipHorizontal, int flipVertical) {
  if (rotation < 0 || rotation > 4) return 0;
  if (width <= 0 || height <= 0) return 1;
  const size_t w = static_cast<size_t>(width), h = static_cast<size_t>(height), n = w * h;
  if (flipHorizontal) {
    for (size_t y = 0; y < h; ++y) {
      const int* s = src + y * w;
      int* d = dst + y * w;
      for (size_t x = 0; x < w; ++x) d[w - 1 - x] = s[x];
    }
    std::memcpy(src, dst, n * 4);
  }
  if (flipVertical) {
    for (size_t y = 0; y < h; ++y) std::memcpy(dst + (h - 1 - y) * w, src + y * w, w * 4);
    std::memcpy(src, dst, n * 4);
  }
  switch (rotation) {
    case 0:
      std::memcpy(dst, src, n * 4);
      break;
    case 1:
    case 2:
    case 3:
      // Each source row writes its own set of destination pixels. The turns
      // walk 32 x 32 tiles so the destination columns stay in cache.
      px_for_rows(height, [&](int y0, int y1) {
        constexpr size_t kTile = 32;
        for (size_t ty = static_cast<size_t>(y0); ty < static_cast<size_t>(y1); ty += kTile) {
          const size_t ty1 = ty + kTile < static_cast<size_t>(y1) ? ty + kTile : static_cast<size_t>(y1);
          for (size_t tx = 0; tx < w; tx += kTile) {
            const size_t tx1 = tx + kTile < w ? tx + kTile : w;
            for (size_t y = ty; y < ty1; ++y) {
              const int* s = src + y * w;
              for (size_t x = tx; x < tx1; ++x) {
                size_t at;
                if (rotation == 1) {
                  at = x * h + (h - 1 - y);
                } else if (rotation == 2) {
                  at = (h - 1 - y) * w + (w - 1 - x);
                } else {
                  at = (w - 1 - x) * h + y;
                }
                dst[at] = s[x];
              }
            }
          }
        }
      });
      break;
    default:  // 4: flips only; dst holds what the flips left there
      break;
  }
  return 1;
}

int px_get_rotate_width(int width, int height, int angle) {
  const Trig t = trig(angle);
  const int hw = width / 2, hh = height / 2;
  const int a = fixtoi((width - hw) * t.cos + (hh - height) * t.sin);
  const int b = fixtoi(-hw * t.cos + (hh - height) * t.sin);
  const int c = fixtoi(hh * t.sin + (width - hw) * t.cos);
  const int d = fixtoi(hh * t.sin - hw * t.cos);
  return max4(a, b, c, d) - min4(a, b, c, d);
}

int px_get_rotate_height(int width, int height, int angle) {
  const Trig t = trig(angle);
  const int hw = width / 2, hh = height / 2;
  const int a = fixtoi((height - hh) * t.cos + (width - hw) * t.sin);
  const int b = fixtoi((height - hh) * t.cos - hw * t.sin);
  const int c = fixtoi((width - hw) * t.sin - hh * t.cos);
  const int d = fixtoi(-hw * t.sin - hh * t.cos);
  return max4(a, b, c, d) - min4(a, b, c, d);
}

void px_rotate_n(const int* src, const unsigned char* srcMask, int* dst, unsigned char* dstMask, int srcWidth,
                 int srcHeight, int dstWidth, int dstHeight, int angle, int left, int right, int top, int bottom,
                 int divisorX, int divisorY) {
  if (divisorX == 0 || divisorY == 0 || dstWidth <= 0 || dstHeight <= 0) return;
  const int cw = right + 1 - left, ch = bottom + 1 - top;
  const int stepX = div_wrap(itofix(cw), divisorX) >> 8;
  const int stepY = div_wrap(itofix(ch), divisorY) >> 8;
  const Trig t = trig(angle);
  const int C = t.cos >> 8, S = t.sin >> 8;
  const int baseX = cw / 2 + left, baseY = ch / 2 + top;
  const int hw = dstWidth / 2, hh = dstHeight / 2;
  const size_t ow = static_cast<size_t>(dstWidth);
  px_for_rows(dstHeight, [&](int j0, int j1) {
    for (int j = j0; j < j1; ++j) {
      // The row's start; stepping by the column increments gives the same
      // 32-bit values as the closed form.
      int x = stepX * ((0 - hw) * C + (j - hh) * S);
      int y = stepY * ((j - hh) * C - (0 - hw) * S);
      const int dx = C * stepX, dy = S * stepY;
      for (int i = 0; i < dstWidth; ++i, x += dx, y -= dy) {
        const int sx = fixtoi(x) + baseX, sy = fixtoi(y) + baseY;
        if (sx < 0 || sx >= srcWidth || sy < 0 || sy >= srcHeight) continue;
        const size_t from = static_cast<size_t>(sy) * static_cast<size_t>(srcWidth) + static_cast<size_t>(sx);
        const size_t to = static_cast<size_t>(j) * ow + static_cast<size_t>(i);
        dst[to] = src[from];
        if (srcMask && dstMask) dstMask[to] = srcMask[from];
      }
    }
  });
}

void px_straighten(const int* src, int* dst, int width, int height, int angle, float scale) {
  if (width <= 0 || height <= 0) return;
  const Trig t = trig(angle);
  const int s8 = px_geometry_scale8(scale);
  const int Cs = s8 * (t.cos >> 8), Ss = s8 * (t.sin >> 8);
  const int hw = width / 2, hh = height / 2;
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int j0, int j1) {
    for (int j = j0; j < j1; ++j) {
      int x = (0 - hw) * Cs + (j - hh) * Ss;
      int y = -(0 - hw) * Ss + (j - hh) * Cs;
      for (int i = 0; i < width; ++i, x += Cs, y -= Ss) {
        const int sx = fixtoi(x) + hw, sy = fixtoi(y) + hh;
        if (sx < 0 || sx >= width || sy < 0 || sy >= height) continue;
        dst[static_cast<size_t>(j) * w + static_cast<size_t>(i)] = src[static_cast<size_t>(sy) * w + sx];
      }
    }
  });
}

void px_straighten_move(const int* src, int srcWidth, int srcHeight, int* dst, int dstWidth, int dstHeight,
                        int angle, float scale) {
  if (dstWidth <= 0 || dstHeight <= 0) return;
  std::memset(dst, 0, area(dstWidth, dstHeight) * 4);
  if (srcWidth <= 0 || srcHeight <= 0) return;
  const Trig t = trig(angle);
  const int C = t.cos >> 8, S = t.sin >> 8;
  const int s8 = px_geometry_scale8(scale);
  const int Cs = s8 * C, Ss = s8 * S;
  const int sw = srcWidth, sh = srcHeight, hw = sw / 2, hh = sh / 2;
  // Horizontal extent of the scaled, turned corners; the vertical extent
  // deliberately uses the unscaled 16.16 cosine and sine.
  const int xa = fixtoi((sw - hw) * Cs + (hh - sh) * Ss), xb = fixtoi(-hw * Cs + (hh - sh) * Ss);
  const int xc = fixtoi(hh * Ss + (sw - hw) * Cs), xd = fixtoi(hh * Ss - hw * Cs);
  const int ya = fixtoi((sh - hh) * t.cos + (sw - hw) * t.sin), yb = fixtoi((sh - hh) * t.cos - hw * t.sin);
  const int yc = fixtoi((sw - hw) * t.sin - hh * t.cos), yd = fixtoi(-hw * t.sin - hh * t.cos);
  const int ow = dstWidth / 2, oh = dstHeight / 2;
  const long long cx0 = static_cast<long long>(ow) + min4(xa, xb, xc, xd);
  const long long cx1 = static_cast<long long>(ow) + max4(xa, xb, xc, xd);
  const long long cy0 = static_cast<long long>(oh) + min4(ya, yb, yc, yd);
  const long long cy1 = static_cast<long long>(oh) + max4(ya, yb, yc, yd);
  const int x0 = cx0 > 0 ? static_cast<int>(cx0) : 0, x1 = cx1 < dstWidth ? static_cast<int>(cx1) : dstWidth;
  const int y0 = cy0 > 0 ? static_cast<int>(cy0) : 0, y1 = cy1 < dstHeight ? static_cast<int>(cy1) : dstHeight;
  if (x0 >= x1 || y0 >= y1) return;
  const int inv = saturating_int(65536.0 / static_cast<double>(scale)) >> 8;
  const size_t w = static_cast<size_t>(dstWidth);
  px_for_rows(y1 - y0, [&](int r0, int r1) {
    for (int j = y0 + r0; j < y0 + r1; ++j) {
      for (int i = x0; i < x1; ++i) {
        const int sx = fixtoi(inv * ((i - ow) * C + (j - oh) * S)) + hw;
        const int sy = fixtoi(inv * ((j - oh) * C - (i - ow) * S)) + hh;
        const bool inside = sx >= 0 && sx < sw && sy >= 0 && sy < sh;
        dst[static_cast<size_t>(j) * w + static_cast<size_t>(i)] =
            inside ? src[static_cast<size_t>(sy) * static_cast<size_t>(sw) + static_cast<size_t>(sx)] : 0;
      }
    }
  });
}

void px_straighten_up(const int* src, int srcWidth, int srcHeight, int* dst, int dstWidth, int dstHeight, int angle,
                      float scale) {
  if (dstWidth <= 0 || dstHeight <= 0) return;
  std::memset(dst, 0, area(dstWidth, dstHeight) * 4);
  if (srcWidth <= 0 || srcHeight <= 0) return;
  const Trig t = trig(angle);
  const int C = t.cos >> 8, S = t.sin >> 8;
  const int s8 = px_geometry_scale8(scale);
  const int sw = srcWidth, sh = srcHeight, hw = sw / 2, hh = sh / 2;
  const int ox = (dstWidth - sw) >> 1, oy = (dstHeight - sh) >> 1;
  // The centred source-sized area, kept inside the canvas.
  const int x0 = ox > 0 ? ox : 0, x1 = ox + sw < dstWidth ? ox + sw : dstWidth;
  const int y0 = oy > 0 ? oy : 0, y1 = oy + sh < dstHeight ? oy + sh : dstHeight;
  if (x0 >= x1 || y0 >= y1) return;
  const int ow = dstWidth / 2, oh = dstHeight / 2;
  const size_t w = static_cast<size_t>(dstWidth);
  px_for_rows(y1 - y0, [&](int r0, int r1) {
    for (int j = y0 + r0; j < y0 + r1; ++j) {
      for (int i = x0; i < x1; ++i) {
        const int sx = fixtoi(s8 * ((i - ow) * C + (j - oh) * S)) + hw;
        const int sy = fixtoi(s8 * ((j - oh) * C - (i - ow) * S)) + hh;
        if (sx < 0 || sx >= sw || sy < 0 || sy >= sh) continue;
        dst[static_cast<size_t>(j) * w + static_cast<size_t>(i)] =
            src[static_cast<size_t>(sy) * static_cast<size_t>(sw) + static_cast<size_t>(sx)];
      }
    }
  });
}

int* px_crop(const int* src, int* dst, int width, int height, int left, int right, int top, int bottom) {
  if (width <= 0 || height <= 0 || right < left || bottom < top) return dst;
  const px_rect r = px_rect_clip(px_rect{left, right, top, bottom}, width, height);
  if (px_rect_empty(r)) return dst;
  const size_t row = static_cast<size_t>(r.right - r.left + 1);
  for (int y = r.top; y <= r.bottom; ++y) {
    std::memcpy(dst + static_cast<size_t>(y - r.top) * row, src + static_cast<size_t>(y) * width + r.left, row * 4);
  }
  return dst;
}
