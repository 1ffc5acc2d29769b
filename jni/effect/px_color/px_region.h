// The region rule shared by every region operation, and the pixel loop
// shared by the whole-picture forms.
//
// A region operation copies the input to the output, then recomputes the
// pixels of the rectangle whose mask byte is exactly 1 (mask row stride =
// width). An empty rectangle (right < left or top > bottom) means the whole
// picture and the mask is not read. A rectangle reaching outside the picture
// is clipped to it; one lying wholly outside selects nothing.
//
// `fn` maps one 0xAARRGGBB pixel to its new value. Whole-picture work is
// split over row bands (see px_parallel.h); the result is the same either way.
#pragma once

#include <cstdint>
#include <cstring>

#include "../kalo/px_parallel.h"
#include "../px_math.h"
#include "../px_types.h"

template <class PixelFn>
void px_map_pixels(const int* in, int* out, int width, int height, PixelFn fn) {
  if (width <= 0 || height <= 0) return;
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; ++i) {
      dst[i] = fn(src[i]);
    }
  });
}

template <class PixelFn>
void px_region_map(const int* in, const unsigned char* mask, int* out, int width, int height, px_rect rect,
                   PixelFn fn) {
  if (width <= 0 || height <= 0) return;
  if (px_rect_empty(rect)) {
    px_map_pixels(in, out, width, height, fn);
    return;
  }
  const px_rect r = px_rect_clip(rect, width, height);
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  if (!px_scalar_only()) {
    // One pass in row bands: each row copied where it lies outside the
    // rectangle, recomputed where its mask byte is 1.
    const size_t w = static_cast<size_t>(width);
    const bool none = px_rect_empty(r);
    px_for_rows(height, [&](int y0, int y1) {
      for (int y = y0; y < y1; ++y) {
        const uint32_t* s = src + static_cast<size_t>(y) * w;
        uint32_t* d = dst + static_cast<size_t>(y) * w;
        if (none || y < r.top || y > r.bottom) {
          if (s != d) std::memcpy(d, s, w * 4);
          continue;
        }
        if (s != d) {
          std::memcpy(d, s, static_cast<size_t>(r.left) * 4);
          std::memcpy(d + r.right + 1, s + r.right + 1, (w - static_cast<size_t>(r.right) - 1) * 4);
        }
        const unsigned char* m = mask + static_cast<size_t>(y) * w;
        // Computed for every pixel of the rectangle and then selected, so
        // the loop has no branch and vectorises; the cost is bounded by the
        // whole-picture form's.
        const size_t n = static_cast<size_t>(r.right - r.left) + 1;
        const uint32_t* sr = s + r.left;
        const unsigned char* mr = m + r.left;
        uint32_t* dr = d + r.left;
        for (size_t x = 0; x < n; ++x) {
          const uint32_t p = sr[x];
          const uint32_t v = fn(p);
          dr[x] = mr[x] == 1 ? v : p;
        }
      }
    });
    return;
  }
  if (in != out) std::memmove(out, in, static_cast<size_t>(width) * static_cast<size_t>(height) * 4);
  if (px_rect_empty(r)) return;
  for (int y = r.top; y <= r.bottom; ++y) {
    const size_t row = static_cast<size_t>(y) * static_cast<size_t>(width);
    for (int x = r.left; x <= r.right; ++x) {
      if (mask[row + x] == 1) dst[row + x] = fn(src[row + x]);
    }
  }
}

// Copies a whole-picture result into the output by the partial rule: for an
// empty rectangle every pixel; otherwise the pixels of the rectangle (clipped
// to the picture) whose mask byte is exactly 1. Other output pixels keep
// what they held.
inline void px_merge_selected(const int* result, int* out, const unsigned char* mask, int width, int height,
                              px_rect rect) {
  if (width <= 0 || height <= 0) return;
  if (px_rect_empty(rect)) {
    std::memcpy(out, result, static_cast<size_t>(width) * static_cast<size_t>(height) * 4);
    return;
  }
  if (!mask) return;
  const px_rect c = px_rect_clip(rect, width, height);
  for (int y = c.top; y <= c.bottom; ++y) {
    const size_t row = static_cast<size_t>(y) * static_cast<size_t>(width);
    for (int x = c.left; x <= c.right; ++x) {
      if (mask[row + x] == 1) out[row + x] = result[row + x];
    }
  }
}

// Channel helpers for the pixel functions.
inline uint32_t px_argb(uint32_t alpha_source, int r, int g, int b) {
  return (alpha_source & 0xFF000000u) | static_cast<uint32_t>(r) << 16 | static_cast<uint32_t>(g) << 8 |
         static_cast<uint32_t>(b);
}
