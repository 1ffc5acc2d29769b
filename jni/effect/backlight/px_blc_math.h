// Integer logarithm and power for the backlight correction's gamma curves.
// Everything here is integer so that every platform builds the same curves
// bit for bit (no libm in the pixel path).
#pragma once

#include <array>
#include <cstdint>

#include "../px_math.h"

namespace blc {

// kRootQ30[k] = 2^(2^-k) in Q30, k = 0..16, each the integer square root of
// the one before.
constexpr std::array<uint64_t, 17> make_roots() {
  std::array<uint64_t, 17> t{};
  t[0] = uint64_t{2} << 30;
  for (int k = 1; k < 17; ++k) t[k] = px_isqrt_floor(t[k - 1] << 30);
  return t;
}
inline constexpr std::array<uint64_t, 17> kRootQ30 = make_roots();
static_assert(kRootQ30[1] == 1518500249);  // sqrt(2) * 2^30

// 2^(f / 65536) in Q30 for f in 0..65535: the product of the roots of the
// set bits of f.
constexpr uint32_t exp2_frac_q30(uint32_t f) {
  uint64_t r = uint64_t{1} << 30;
  for (int j = 0; j < 16; ++j) {
    if (f & (1u << j)) r = (r * kRootQ30[16 - j] + (uint64_t{1} << 29)) >> 30;
  }
  return static_cast<uint32_t>(r);
}

// floor(log2(x) * 65536) for x >= 1 (0 gives 0).
constexpr int32_t log2_q16(uint32_t x) {
  if (x == 0) return 0;
  int n = 31;
  while (!(x & (1u << n))) --n;
  uint64_t m = n <= 30 ? uint64_t{x} << (30 - n) : uint64_t{x} >> 1;  // Q30 in [1, 2)
  int32_t r = n << 16;
  for (int i = 1; i <= 16; ++i) {
    m = (m * m) >> 30;
    if (m >= (uint64_t{2} << 30)) {
      m >>= 1;
      r |= 1 << (16 - i);
    }
  }
  return r;
}
static_assert(log2_q16(1) == 0 && log2_q16(2) == 65536 && log2_q16(256) == 8 << 16);

// 255 * (y / 255)^gamma in Q12 (0 .. 255 << 12), gamma in Q16 (> 0), y 0..255.
constexpr int32_t gamma_q12(int y, int32_t gamma_q16) {
  if (y <= 0) return 0;
  if (y >= 255) return 255 << 12;
  const int64_t l = log2_q16(255) - log2_q16(static_cast<uint32_t>(y));  // > 0
  const int64_t ne = (gamma_q16 * l + 32768) >> 16;  // -exponent, Q16
  const int ip = static_cast<int>(ne >> 16);
  const uint32_t fr = static_cast<uint32_t>(ne & 0xFFFF);
  // 2^-ne = 2^-(ip + 1) * 2^(1 - fr/65536) when fr > 0.
  const int shift = ip + (fr ? 1 : 0);
  if (shift > 40) return 0;
  const uint64_t v = fr ? exp2_frac_q30(65536 - fr) : (uint64_t{1} << 30);
  return static_cast<int32_t>((255 * v + (uint64_t{1} << (17 + shift))) >> (18 + shift));
}

// The gamma that takes level `from` to level `to` (both 1..254):
// log(to / 255) / log(from / 255), in Q16.
constexpr int32_t gamma_for_q16(int from, int to) {
  const int64_t lf = log2_q16(255) - log2_q16(static_cast<uint32_t>(from));
  const int64_t lt = log2_q16(255) - log2_q16(static_cast<uint32_t>(to));
  if (lf <= 0) return 65536;
  return static_cast<int32_t>((lt * 65536 + lf / 2) / lf);
}

}  // namespace blc
