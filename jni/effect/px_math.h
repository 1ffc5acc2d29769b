// Small integer helpers shared by every area of the engine.
#pragma once

#include <cstdint>

constexpr int px_clamp255(int v) { return v < 0 ? 0 : (v > 255 ? 255 : v); }

// Largest r with r * r <= v (digit-by-digit, two bits a step).
constexpr uint64_t px_isqrt_floor(uint64_t v) {
  uint64_t r = 0, bit = uint64_t{1} << 62;
  while (bit > v) bit >>= 2;
  while (bit) {
    if (v >= r + bit) {
      v -= r + bit;
      r = (r >> 1) + bit;
    } else {
      r >>= 1;
    }
    bit >>= 2;
  }
  return r;
}
static_assert(px_isqrt_floor(0) == 0 && px_isqrt_floor(15) == 3 && px_isqrt_floor(16) == 4 &&
              px_isqrt_floor(0xFFFFFFFFFFFFFFFFull) == 0xFFFFFFFFull);
