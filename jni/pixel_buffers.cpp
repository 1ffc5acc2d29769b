#include "pixel_buffers.h"

#include <cstddef>
#include <cstdint>

namespace {
long long pixel_count(int width, int height) { return static_cast<long long>(width) * height; }

inline int from_rgb(const unsigned char* rgb, int alpha_source) {
  return static_cast<int>((static_cast<uint32_t>(alpha_source) & 0xFF000000u) | static_cast<uint32_t>(rgb[0]) << 16 |
                          static_cast<uint32_t>(rgb[1]) << 8 | rgb[2]);
}
}  // namespace

void convertIntArrayToByteArray(const int* argb, unsigned char* rgb, int width, int height) {
  const long long n = pixel_count(width, height);
  if (width < 1 || height < 1 || n < 1) return;
  for (long long i = 0; i < n; ++i, rgb += 3) {
    const uint32_t p = static_cast<uint32_t>(argb[i]);
    rgb[0] = static_cast<unsigned char>(p >> 16);
    rgb[1] = static_cast<unsigned char>(p >> 8);
    rgb[2] = static_cast<unsigned char>(p);
  }
}

void convertByteArraytoIntArray(const unsigned char* rgb, int* out, const int* alphaSource, int width, int height) {
  const long long n = pixel_count(width, height);
  if (width < 1 || height < 1 || n < 1) return;
  for (long long i = 0; i < n; ++i, rgb += 3) out[i] = from_rgb(rgb, alphaSource[i]);
}

void convertByteArraytoIntArrayUsingMask(const unsigned char* rgb, int* out, const int* source,
                                         const unsigned char* mask, int width, int height, px_rect rect) {
  if (px_rect_empty(rect)) {
    convertByteArraytoIntArray(rgb, out, source, width, height);
    return;
  }
  const long long n = pixel_count(width, height);
  if (width < 1 || height < 1 || n < 1) return;
  for (long long i = 0; i < n; ++i, rgb += 3) out[i] = mask[i] == 1 ? from_rgb(rgb, source[i]) : source[i];
}
