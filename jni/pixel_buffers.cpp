#include "pixel_buffers.h"

#include <cstddef>
#include <cstdint>

#include "effect/kalo/px_parallel.h"

// Each conversion runs in row bands (px_parallel.h); the loops are plain
// byte and word moves the compiler vectorises.
namespace {
bool empty_picture(int width, int height) {
  return width < 1 || height < 1 || static_cast<long long>(width) * height < 1;
}

inline uint32_t from_rgb(const unsigned char* rgb, uint32_t alpha_source) {
  return (alpha_source & 0xFF000000u) | static_cast<uint32_t>(rgb[0]) << 16 | static_cast<uint32_t>(rgb[1]) << 8 |
         rgb[2];
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
  for_pixels(width, height, [&](size_t i0, size_t i1) {
    unsigned char* d = rgb + i0 * 3;
    for (size_t i = i0; i < i1; ++i, d += 3) {
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
  for_pixels(width, height, [&](size_t i0, size_t i1) {
    const unsigned char* s = rgb + i0 * 3;
    for (size_t i = i0; i < i1; ++i, s += 3) dst[i] = from_rgb(s, alpha[i]);
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
  for_pixels(width, height, [&](size_t i0, size_t i1) {
    const unsigned char* s = rgb + i0 * 3;
    for (size_t i = i0; i < i1; ++i, s += 3) {
      // Branch-free select so the loop vectorises.
      const uint32_t keep = mask[i] == 1 ? 0u : ~0u;
      dst[i] = (src[i] & keep) | (from_rgb(s, src[i]) & ~keep);
    }
  });
}
