// Shared luminance tables: entry i = round(i * w * 1024) for w = 0.299 (red),
// 0.587 (green), 0.114 (blue). Y = (R + G + B tables) >> 10 is 0..255; a
// further shift gives coarser levels (>> 14: 16 levels).
#pragma once

#include <array>
#include <cstdint>

namespace iel_luma_detail {
constexpr std::array<uint32_t, 256> make(double w) {
  std::array<uint32_t, 256> t{};
  for (int i = 0; i < 256; ++i) t[i] = static_cast<uint32_t>(i * w * 1024 + 0.5);
  return t;
}
}  // namespace iel_luma_detail

inline constexpr std::array<uint32_t, 256> IEL_LumaR = iel_luma_detail::make(0.299);
inline constexpr std::array<uint32_t, 256> IEL_LumaG = iel_luma_detail::make(0.587);
inline constexpr std::array<uint32_t, 256> IEL_LumaB = iel_luma_detail::make(0.114);
static_assert(IEL_LumaR[255] == 78075 && IEL_LumaG[255] == 153277 && IEL_LumaB[255] == 29768);

inline uint32_t IEL_LumaSum(int r, int g, int b) { return IEL_LumaR[r] + IEL_LumaG[g] + IEL_LumaB[b]; }
inline int IEL_Luma(int r, int g, int b) { return static_cast<int>(IEL_LumaSum(r, g, b) >> 10); }
