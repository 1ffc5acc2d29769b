#include "pixel_buffers.h"

#include <cstddef>
#include <bit>
#include <cstdint>
#include <cstring>

#include "effect/kalo/px_parallel.h"

// Each conversion runs in row bands (px_parallel.h), four pixels (three
// words of packed RGB) at a time; the scalar switch keeps the byte loops.
namespace {
bool empty_picture(int width, int height) {
  return width < 1 || height < 1 || static_cast<long long>(width) * height < 1;
}

inline uint32_t from_rgb(const unsigned char* rgb, uint32_t alpha_source) {
  return (alpha_source & 0xFF000000u) | static_cast<uint32_t>(rgb[0]) << 16 | static_cast<uint32_t>(rgb[1]) << 8 |
         rgb[2];
}

// Four pixels are three little-endian words of packed RGB.
static_assert(std::endian::native == std::endian::little);

inline void pack4(const uint32_t* p, unsigned char* rgb) {
  const uint32_t w[3] = {
      ((p[0] >> 16) & 0xFFu) | (p[0] & 0xFF00u) | (p[0] & 0xFFu) << 16 | ((p[1] >> 16) & 0xFFu) << 24,
      ((p[1] >> 8) & 0xFFu) | (p[1] & 0xFFu) << 8 | (p[2] & 0xFF0000u) | ((p[2] >> 8) & 0xFFu) << 24,
      (p[2] & 0xFFu) | ((p[3] >> 16) & 0xFFu) << 8 | (p[3] & 0xFF00u) << 8 | (p[3] & 0xFFu) << 24};
  std::memcpy(rgb, w, 12);
}

// The four pixels' R, G, B (alpha zero).
inline void unpack4(const unsigned char* rgb, uint32_t* p) {
  uint32_t w[3];
  std::memcpy(w, rgb, 12);
  p[0] = (w[0] & 0xFFu) << 16 | (w[0] & 0xFF00u) | ((w[0] >> 16) & 0xFFu);
  p[1] = (w[0] >> 24) << 16 | (w[1] & 0xFFu) << 8 | ((w[1] >> 8) & 0xFFu);
  p[2] = (w[1] & 0xFF0000u) | (w[1] >> 24) << 8 | (w[2] & 0xFFu);
  p[3] = ((w[2] >> 8) & 0xFFu) << 16 | ((w[2] >> 16) & 0xFFu) << 8 | (w[2] >> 24);
}

// body(i0, i1) over disjoint pixel ranges made of whole rows.
template <class Body>
void for_pixels(int width, int height, Body&& body) {
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) { body(static_cast<size_t>(y0) * w, static_cast<size_t>(y1) * w); });
}
}  // namespace

void convertIntArrayToByteArray(const int* argb, unsigned char* rgb, int width, int height) {
  if (empty_picture(width, height)) return;
  const auto* src = reinterpret_cast<const uint32_t*>(argb);
  for_pixels(width, height, [&](size_t i, size_t i1) {
    unsigned char* d = rgb + i * 3;
    if (!px_scalar_only()) {
      for (; i + 4 <= i1; i += 4, d += 12) pack4(src + i, d);
    }
    for (; i < i1; ++i, d += 3) {
      const uint32_t p = src[i];
      d[0] = static_cast<unsigned char>(p >> 16);
      d[1] = static_cast<unsigned char>(p >> 8);
      d[2] = static_cast<unsigned char>(p);
    }
  });
}

void convertByteArraytoIntArray(const unsigned char* rgb, int* out, const int* alphaSource, int width, int height) {
  if (empty_picture(width, height)) return;
  const auto* alpha = reinterpret_cast<const uint32_t*>(alphaSource);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  for_pixels(width, height, [&](size_t i, size_t i1) {
    const unsigned char* s = rgb + i * 3;
    if (!px_scalar_only()) {
      for (; i + 4 <= i1; i += 4, s += 12) {
        uint32_t p[4];
        unpack4(s, p);
        for (int k = 0; k < 4; ++k) dst[i + k] = (alpha[i + k] & 0xFF000000u) | p[k];
      }
    }
    for (; i < i1; ++i, s += 3) dst[i] = from_rgb(s, alpha[i]);
  });
}

void convertByteArraytoIntArrayUsingMask(const unsigned char* rgb, int* out, const int* source,
                                         const unsigned char* mask, int width, int height, px_rect rect) {
  if (px_rect_empty(rect)) {
    convertByteArraytoIntArray(rgb, out, source, width, height);
    return;
  }
  if (empty_picture(width, height)) return;
  const auto* src = reinterpret_cast<const uint32_t*>(source);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  for_pixels(width, height, [&](size_t i, size_t i1) {
    const unsigned char* s = rgb + i * 3;
    if (!px_scalar_only()) {
      for (; i + 4 <= i1; i += 4, s += 12) {
        uint32_t p[4];
        unpack4(s, p);
        for (int k = 0; k < 4; ++k) {
          const uint32_t a = src[i + k];
          dst[i + k] = mask[i + k] == 1 ? (a & 0xFF000000u) | p[k] : a;
        }
      }
    }
    for (; i < i1; ++i, s += 3) {
      // Branch-free select so the loop vectorises.
      const uint32_t keep = mask[i] == 1 ? 0u : ~0u;
      dst[i] = (src[i] & keep) | (from_rgb(s, src[i]) & ~keep);
    }
  });
}
