// Tables of the twirl and sphericity distortions, generated at compile time
// from their rules:
//   SIN          4097 entries, round(32768 * sin(i * 2 pi / 16384)): a quarter
//                wave, a full turn having 16384 steps
//   ATAN         2048 entries, round(atan(i / 2048) in degrees * 2^19)
//   SQRT_STEP_1  128 entries,  round(16 * sqrt(k * 2^8))
//   SQRT_STEP_2  480 entries,  round(16 * sqrt((k + 32) * 2^10))
//   SQRT_STEP_3  768 entries,  round(16 * sqrt((k + 256) * 2^11))
//   SQRT_STEP_4  65536 entries, round(16 * sqrt(k * 2^14))
//                (together: the square root of 0..2^30 with 2^30 -> 0x80000)
//   EXP_n7       256 falloff weights close to 2^26 * exp(-7 i / 256), through
//                the fixed entries 66974646 (0), 11654811 (64), 2019149 (128)
//                and 18969 (255); between them the ratio to the pure
//                exponential is interpolated (linearly up to 128, with a
//                quadratic ease towards the steeper tail after), so the
//                falloff stays smooth and strictly decreasing.
#pragma once

#include <array>
#include <cstdint>

#include "../px_color/px_fixed_tables.h"

namespace px_geometry_detail {

using px_tables_detail::kPi;

constexpr int32_t round_half_up(double v) { return static_cast<int32_t>(v + 0.5); }

constexpr std::array<int32_t, 4097> make_sin() {
  std::array<int32_t, 4097> t{};
  for (int i = 0; i <= 4096; ++i) {
    // i * 2 pi / 16384 = i * pi / 8192; fold above pi/4 onto the cosine.
    const double v = i <= 2048 ? px_tables_detail::sin_small(i * kPi / 8192)
                               : px_tables_detail::cos_small((4096 - i) * kPi / 8192);
    t[i] = round_half_up(32768.0 * v);
  }
  return t;
}

// atan(x) for 0 <= x <= 1: two half-angle steps bring x below 0.2, then the
// series.
constexpr double atan_unit(double x) {
  for (int k = 0; k < 2; ++k) x = x / (1.0 + px_tables_detail::sqrt_newton(1.0 + x * x));
  double term = x, sum = x;
  for (int n = 1; n < 30; ++n) {
    term *= -x * x;
    sum += term / (2 * n + 1);
  }
  return 4.0 * sum;
}

constexpr std::array<int32_t, 2048> make_atan() {
  std::array<int32_t, 2048> t{};
  for (int i = 0; i < 2048; ++i) t[i] = round_half_up(atan_unit(i / 2048.0) * (180.0 / kPi) * 524288.0);
  return t;
}

// round(16 * sqrt((k + offset) << shift)) = round(sqrt(N)) with
// N = (k + offset) << (shift + 8): the integer root n, plus one when
// N - n^2 > n (sqrt(N) >= n + 1/2 exactly then, as N is an integer).
template <size_t Size>
constexpr std::array<int32_t, Size> make_sqrt_step(uint64_t offset, int shift) {
  std::array<int32_t, Size> t{};
  uint64_t n = 0;
  for (size_t k = 0; k < Size; ++k) {
    const uint64_t big = (k + offset) << (shift + 8);
    while ((n + 1) * (n + 1) <= big) ++n;
    t[k] = static_cast<int32_t>(big - n * n > n ? n + 1 : n);
  }
  return t;
}

constexpr std::array<uint32_t, 256> make_exp_n7() {
  // exp(-7 i / 256) by repeated multiplication with exp(-7 / 256).
  double step = 1.0, term = 1.0;
  const double x = -7.0 / 256.0;
  for (int n = 1; n < 25; ++n) {
    term *= x / n;
    step += term;
  }
  std::array<double, 256> pure{};
  pure[0] = 67108864.0;
  for (int i = 1; i < 256; ++i) pure[i] = pure[i - 1] * step;
  const double r0 = 66974646.0 / pure[0], r64 = 11654811.0 / pure[64], r128 = 2019149.0 / pure[128],
               r255 = 18969.0 / pure[255];
  std::array<uint32_t, 256> t{};
  for (int i = 0; i < 256; ++i) {
    double ratio;
    if (i <= 64) {
      ratio = r0 + (r64 - r0) * i / 64.0;
    } else if (i <= 128) {
      ratio = r64 + (r128 - r64) * (i - 64) / 64.0;
    } else {
      const double u = (i - 128) / 127.0;
      ratio = r128 + (r255 - r128) * u * u;
    }
    t[i] = static_cast<uint32_t>(pure[i] * ratio + 0.5);
  }
  return t;
}

constexpr bool strictly_decreasing(const std::array<uint32_t, 256>& t) {
  for (int i = 1; i < 256; ++i) {
    if (t[i] >= t[i - 1]) return false;
  }
  return true;
}

}  // namespace px_geometry_detail

inline constexpr std::array<int32_t, 4097> SIN = px_geometry_detail::make_sin();
inline constexpr std::array<int32_t, 2048> ATAN = px_geometry_detail::make_atan();
inline constexpr std::array<int32_t, 128> SQRT_STEP_1 = px_geometry_detail::make_sqrt_step<128>(0, 8);
inline constexpr std::array<int32_t, 480> SQRT_STEP_2 = px_geometry_detail::make_sqrt_step<480>(32, 10);
inline constexpr std::array<int32_t, 768> SQRT_STEP_3 = px_geometry_detail::make_sqrt_step<768>(256, 11);
inline constexpr std::array<int32_t, 65536> SQRT_STEP_4 = px_geometry_detail::make_sqrt_step<65536>(0, 14);
inline constexpr std::array<uint32_t, 256> EXP_n7 = px_geometry_detail::make_exp_n7();

static_assert(SIN[0] == 0 && SIN[1] == 13 && SIN[4096] == 32768);
static_assert(ATAN[0] == 0 && ATAN[1] == 14668);
static_assert(SQRT_STEP_1[2] == 362 && SQRT_STEP_2[0] == 2896);
static_assert(SQRT_STEP_4[65535] < 0x80000 && SQRT_STEP_3[767] < SQRT_STEP_4[65535]);
static_assert(EXP_n7[0] == 66974646 && EXP_n7[64] == 11654811 && EXP_n7[128] == 2019149 && EXP_n7[255] == 18969);
static_assert(px_geometry_detail::strictly_decreasing(EXP_n7));
