// Touch-driven region brightness, contrast and exposure on ARGB pictures, and
// the intensity analysis that decides which half of the tonal range a touch
// selects.
#include <array>
#include <cstdint>

#include "../if_utils_and.h"
#include "iel_artistic.h"
#include "iel_internal.h"

namespace {
constexpr std::array<int32_t, 256> make_steps() {
  std::array<int32_t, 256> t{};
  for (int i = 0; i < 256; ++i) t[i] = i <= 127 ? -((127 - i) / 10 + 1) : (i - 128) / 10 + 1;
  return t;
}
constexpr std::array<int32_t, 256> kSteps = make_steps();
static_assert(kSteps[0] == -13 && kSteps[7] == -13 && kSteps[8] == -12 && kSteps[127] == -1 && kSteps[128] == 1 &&
              kSteps[247] == 12 && kSteps[248] == 13 && kSteps[255] == 13);

bool argb_only(int format) { return format == IEL_FORMAT_ARGB_PACK; }
int clamp(int v, int lo, int hi) { return v < lo ? lo : (v > hi ? hi : v); }
inline int intensity(uint32_t p) {
  return static_cast<int>(((p >> 16) & 255) + (p & 255) + 2 * ((p >> 8) & 255)) >> 2;
}
inline uint32_t pack(int r, int g, int b) {
  return 0xFF000000u | static_cast<uint32_t>(r) << 16 | static_cast<uint32_t>(g) << 8 | static_cast<uint32_t>(b);
}

// Runs fn(r, g, b, &r2, &g2, &b2) on every pixel; the output is opaque.
template <class Fn>
int map_opaque(const char* func, structIELImage* input, structIELImage* output, Fn fn) {
  if (int rc = IEL_CheckEffectImages(func, input, output, 1, 1, argb_only)) return rc;
  const size_t n = static_cast<size_t>(input->width) * static_cast<size_t>(input->height);
  const auto* src = reinterpret_cast<const uint32_t*>(input->buffer);
  auto* dst = reinterpret_cast<uint32_t*>(output->buffer);
  for (size_t i = 0; i < n; ++i) dst[i] = fn(src[i]);
  return IEL_OK;
}
}  // namespace

const int32_t IEL_StepTable[256] = {
#define S(i) kSteps[i]
#define S8(i) S(i), S(i + 1), S(i + 2), S(i + 3), S(i + 4), S(i + 5), S(i + 6), S(i + 7)
#define S64(i) S8(i), S8(i + 8), S8(i + 16), S8(i + 24), S8(i + 32), S8(i + 40), S8(i + 48), S8(i + 56)
    S64(0), S64(64), S64(128), S64(192)
#undef S64
#undef S8
#undef S
};

const uint8_t IEL_FeatherTable[32] = {126, 125, 121, 117, 112, 106, 99, 92, 84, 76, 69, 61, 53, 47, 40, 34,
                                      29,  24,  20,  16,  14,  10,  8,  6,  5,  3,  2,  1,  1,  1,  0,  0};

int IEL_AnalyseIntensity_ARGB8888(int x, int y, const structIELImage* image) {
  if (!image || !image->buffer) return 0;
  const int w = image->width, h = image->height;
  if (x < 2 || x >= w - 2 || y < 2 || y >= h - 2) return 0;
  const auto* px = reinterpret_cast<const uint32_t*>(image->buffer);
  int sum = 0;
  for (int dy = -2; dy <= 2; ++dy) {
    for (int dx = -2; dx <= 2; ++dx) sum += intensity(px[static_cast<size_t>(y + dy) * w + (x + dx)]);
  }
  return sum >= 3200 ? 1 : 0;
}

int IEL_RegionBrightness_ARGB8888(structIELImage* input, structIELImage* output, int bright, int level) {
  int table[256];
  for (int i = 0; i < 256; ++i) table[i] = clamp(i + 5 * level, 0, 255);
  const int lift = 5 * level;
  return map_opaque(__func__, input, output, [&](uint32_t p) {
    const int r = (p >> 16) & 255, g = (p >> 8) & 255, b = p & 255;
    const int in = intensity(p);
    int w = -1;  // -1: full change, 0..128: feather weight, else kept
    if (bright == 1) {
      if (in > 127) return pack(table[r], table[g], table[b]);
      if (in < 98) return pack(r, g, b);
      w = IEL_FeatherTable[127 - in];
    } else {
      if (in <= 127) return pack(table[r], table[g], table[b]);
      if (in > 157) return pack(r, g, b);
      w = IEL_FeatherTable[in - 128];
    }
    auto f = [&](int c) { return clamp((w * lift + 128 * c) >> 7, 0, 255); };
    return pack(f(r), f(g), f(b));
  });
}

int IEL_VariableContrast_ARGB8888(structIELImage* input, structIELImage* output, int bright, int level) {
  int table[256];
  for (int c = 0; c < 256; ++c) {
    if (bright == 1) {
      table[c] = c >= 129 ? clamp(c + kSteps[c] * level, 128, 255) : c;
    } else {
      table[c] = c <= 127 ? clamp(c + kSteps[c] * level, 0, 128) : c;
    }
  }
  return map_opaque(__func__, input, output,
                    [&](uint32_t p) { return pack(table[(p >> 16) & 255], table[(p >> 8) & 255], table[p & 255]); });
}

int IEL_VariableExposure_ARGB8888(structIELImage* input, structIELImage* output, int bright, int level) {
  if (level < -7 || level > 7) {
    IF_ERROR("Max allowed level is : +/- %d. Passed: %d \n", 7, level);
    return IEL_ERR_NULL;
  }
  const int e = bright == 1 ? 5 * level : -5 * level;
  int table[256];
  for (int c = 0; c < 256; ++c) {
    const int f = kSteps[c] * e + 512;
    const bool touched = bright == 1 ? c > 128 : c < 128;
    table[c] = touched ? clamp(c * f >> 9, 0, 255) : c;
  }
  return map_opaque(__func__, input, output,
                    [&](uint32_t p) { return pack(table[(p >> 16) & 255], table[(p >> 8) & 255], table[p & 255]); });
}
