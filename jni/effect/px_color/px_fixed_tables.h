// The fixed-point tables, generated at compile time from their rules:
//   cosine   512 entries, round(65536 * cos(i * pi / 256))
//   tangent  256 entries, round(65536 * tan(i * pi / 256)), entry 128 (the
//            pole) = -0x7FFFFFFF
//   arccos   513 entries, acos(-1 + i / 256) in circle-256 angle units
//            (0x800000 = half circle), rounded
//   LUT_DELTA  floor(65536 / i), entry 0 = 0
//   LUT_DELTA2 60 * floor(65536 / i), entry 0 = 0 (kept in this form: it sets
//            the hue values of the colour tools)
// Rounding is half away from zero. The trigonometry below works on exact
// table indices, folding every angle into [0, pi/4] by symmetry first, so the
// series are evaluated where they converge fastest.
#pragma once

#include <array>
#include <cstdint>

namespace px_tables_detail {

constexpr double kPi = 3.14159265358979323846;

// Taylor series for |x| <= pi/4.
constexpr double sin_small(double x) {
  double term = x, sum = x;
  for (int n = 1; n < 14; ++n) {
    term *= -x * x / ((2 * n) * (2 * n + 1));
    sum += term;
  }
  return sum;
}
constexpr double cos_small(double x) {
  double term = 1.0, sum = 1.0;
  for (int n = 1; n < 14; ++n) {
    term *= -x * x / ((2 * n - 1) * (2 * n));
    sum += term;
  }
  return sum;
}

// cos(k * pi / 256) for any k >= 0.
constexpr double cos_index(int k) {
  k %= 512;
  if (k > 256) k = 512 - k;
  double sign = 1.0;
  if (k > 128) {
    k = 256 - k;
    sign = -1.0;
  }
  if (k > 64) return sign * sin_small((128 - k) * kPi / 256);
  return sign * cos_small(k * kPi / 256);
}

// tan(k * pi / 256) for 0 <= k < 128.
constexpr double tan_index(int k) {
  if (k > 64) return 1.0 / tan_index(128 - k);
  double a = k * kPi / 256;
  return sin_small(a) / cos_small(a);
}

constexpr double sqrt_newton(double x) {
  if (x <= 0) return 0;
  double r = x < 1 ? 1 : x;
  for (int i = 0; i < 200; ++i) {
    double next = 0.5 * (r + x / r);
    if (next == r) break;
    r = next;
  }
  return r;
}

// asin by its series, for 0 <= x <= 0.5.
constexpr double asin_small(double x) {
  double term = x, sum = x;
  for (int n = 0; n < 60; ++n) {
    term *= x * x * (2 * n + 1) * (2 * n + 1) / ((2 * n + 2) * (2 * n + 3));
    sum += term;
  }
  return sum;
}

constexpr double acos_any(double x) {
  if (x < 0) return kPi - acos_any(-x);
  if (x <= 0.5) return kPi / 2 - asin_small(x);
  return 2 * asin_small(sqrt_newton((1 - x) / 2));
}

constexpr int32_t round_away(double v) {
  return v >= 0 ? static_cast<int32_t>(v + 0.5) : -static_cast<int32_t>(-v + 0.5);
}

constexpr std::array<int32_t, 512> make_cos() {
  std::array<int32_t, 512> t{};
  for (int i = 0; i < 512; ++i) t[i] = round_away(65536.0 * cos_index(i));
  return t;
}

constexpr std::array<int32_t, 256> make_tan() {
  std::array<int32_t, 256> t{};
  for (int i = 0; i < 256; ++i) {
    if (i == 128) {
      t[i] = -0x7FFFFFFF;
    } else if (i < 128) {
      t[i] = round_away(65536.0 * tan_index(i));
    } else {
      t[i] = -round_away(65536.0 * tan_index(256 - i));
    }
  }
  return t;
}

constexpr std::array<int32_t, 513> make_acos() {
  std::array<int32_t, 513> t{};
  for (int i = 0; i <= 512; ++i) t[i] = round_away(acos_any(-1.0 + i / 256.0) * (8388608.0 / kPi));
  return t;
}

constexpr std::array<uint32_t, 256> make_delta(uint32_t times) {
  std::array<uint32_t, 256> t{};
  for (uint32_t i = 1; i < 256; ++i) t[i] = times * (65536u / i);
  return t;
}

}  // namespace px_tables_detail

inline constexpr std::array<int32_t, 512> px_cos_table = px_tables_detail::make_cos();
inline constexpr std::array<int32_t, 256> px_tan_table = px_tables_detail::make_tan();
inline constexpr std::array<int32_t, 513> px_acos_table = px_tables_detail::make_acos();
inline constexpr std::array<uint32_t, 256> LUT_DELTA = px_tables_detail::make_delta(1);
inline constexpr std::array<uint32_t, 256> LUT_DELTA2 = px_tables_detail::make_delta(60);

static_assert(px_cos_table[0] == 65536 && px_cos_table[256] == -65536);
static_assert(px_tan_table[64] == 65536 && px_tan_table[255] == -804);
static_assert(px_acos_table[0] == 0x800000 && px_acos_table[256] == 0x400000 && px_acos_table[512] == 0);
static_assert(LUT_DELTA2[3] == 1310700 && LUT_DELTA2[100] == 39300 && LUT_DELTA2[255] == 15420);
