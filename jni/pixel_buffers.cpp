#include "pixel_buffers.h"

#include <cstddef>
#include <bit>
#include <cstdint>
#include <cstring>

#if defined(__ARM_NEON)
#include <arm_neon.h>
#endif

#include "effect/kalo/px_parallel.h"

// Each conversion runs in row bands (px_parallel.h), four pixels (twelve
// bytes of packed RGB) at a time, sixteen with NEON; the scalar switch keeps
// the byte loops.
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

// A pixel's R, G, B as the low three bytes of a word in memory order (R first).
inline uint32_t rgb_bytes(uint32_t p) { return __builtin_bswap32(p) >> 8; }

// One 64-bit and one 32-bit store, built in registers (written through a
// word array, gcc went through the stack and took six times longer).
inline void pack4(const uint32_t* p, unsigned char* rgb) {
  const uint64_t q2 = rgb_bytes(p[2]);
  const uint64_t lo = rgb_bytes(p[0]) | static_cast<uint64_t>(rgb_bytes(p[1])) << 24 | q2 << 48;
  const uint32_t hi = static_cast<uint32_t>(q2 >> 16) | rgb_bytes(p[3]) << 8;
  std::memcpy(rgb, &lo, 8);
  std::memcpy(rgb + 8, &hi, 4);
}

// The four pixels' R, G, B (alpha zero). The two compilers each do well with
// one form and twice as slowly with the other; the values are the same.
inline void unpack4(const unsigned char* rgb, uint32_t* p) {
#if defined(__clang__)
  uint32_t w[3];
  std::memcpy(w, rgb, 12);
  p[0] = (w[0] & 0xFFu) << 16 | (w[0] & 0xFF00u) | ((w[0] >> 16) & 0xFFu);
  p[1] = (w[0] >> 24) << 16 | (w[1] & 0xFFu) << 8 | ((w[1] >> 8) & 0xFFu);
  p[2] = (w[1] & 0xFF0000u) | (w[1] >> 24) << 8 | (w[2] & 0xFFu);
  p[3] = ((w[2] >> 8) & 0xFFu) << 16 | ((w[2] >> 16) & 0xFFu) << 8 | (w[2] >> 24);
#else
  uint64_t lo;
  uint32_t hi;
  std::memcpy(&lo, rgb, 8);
  std::memcpy(&hi, rgb + 8, 4);
  p[0] = rgb_bytes(static_cast<uint32_t>(lo));
  p[1] = rgb_bytes(static_cast<uint32_t>(lo >> 24));
  p[2] = rgb_bytes(static_cast<uint32_t>(lo >> 48) | hi << 16);
  p[3] = rgb_bytes(hi >> 8);
#endif
}

#if defined(__ARM_NEON)
// Sixteen pixels at a time: the 0xAARRGGBB words are B, G, R, A in memory,
// split into four byte planes and stored back interleaved.
constexpr size_t kNeonPixels = 16;

inline void pack16(const uint32_t* p, unsigned char* rgb) {
  const uint8x16x4_t bgra = vld4q_u8(reinterpret_cast<const uint8_t*>(p));
  vst3q_u8(rgb, uint8x16x3_t{{bgra.val[2], bgra.val[1], bgra.val[0]}});
}

inline void unpack16(const unsigned char* rgb, const uint32_t* alpha, uint32_t* out) {
  const uint8x16x3_t c = vld3q_u8(rgb);
  const uint8x16x4_t a = vld4q_u8(reinterpret_cast<const uint8_t*>(alpha));
  vst4q_u8(reinterpret_cast<uint8_t*>(out), uint8x16x4_t{{c.val[2], c.val[1], c.val[0], a.val[3]}});
}

// The converted pixel where the mask byte is 1, the source pixel elsewhere.
inline void merge16(const unsigned char* rgb, const uint32_t* source, const unsigned char* mask, uint32_t* out) {
  const uint8x16x3_t c = vld3q_u8(rgb);
  uint8x16x4_t s = vld4q_u8(reinterpret_cast<const uint8_t*>(source));
  const uint8x16_t take = vceqq_u8(vld1q_u8(mask), vdupq_n_u8(1));
  s.val[0] = vbslq_u8(take, c.val[2], s.val[0]);
  s.val[1] = vbslq_u8(take, c.val[1], s.val[1]);
  s.val[2] = vbslq_u8(take, c.val[0], s.val[2]);
  vst4q_u8(reinterpret_cast<uint8_t*>(out), s);
}
#endif

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
#if defined(__ARM_NEON)
      for (; i + kNeonPixels <= i1; i += kNeonPixels, d += 3 * kNeonPixels) pack16(src + i, d);
#endif
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
#if defined(__ARM_NEON)
      for (; i + kNeonPixels <= i1; i += kNeonPixels, s += 3 * kNeonPixels) unpack16(s, alpha + i, dst + i);
#endif
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
#if defined(__ARM_NEON)
      for (; i + kNeonPixels <= i1; i += kNeonPixels, s += 3 * kNeonPixels) merge16(s, src + i, mask + i, dst + i);
#endif
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
