// The pixel functions of the tone adjustments, shared by the adjustments
// themselves and by the filter chains that fuse several of them into one
// pass. Each maps one 0xAARRGGBB pixel to its new value and keeps alpha.
#pragma once

#include <array>
#include <cstdint>

#include "px_fixed.h"
#include "px_region.h"

// Before a pixel loop of the fused forms whose 16-bit products clang's cost
// model turns down on x86 (it prices them as 32-bit multiplies) where the
// vectorised loop was measured faster (dawn cast's blend: twice as fast); no
// result changes.
#if defined(__clang__)
#define PX_VECTORISE _Pragma("clang loop vectorize(enable)")
#else
#define PX_VECTORISE
#endif

namespace px_tone {
struct Rgb {
  int r, g, b;
};
inline Rgb unpack(uint32_t p) {
  return {static_cast<int>((p >> 16) & 255), static_cast<int>((p >> 8) & 255), static_cast<int>(p & 255)};
}

// Luma/chroma with integer weights (arithmetic shifts) and its inverse, each
// channel clamped to 0..255.
struct Ycc {
  int y, cb, cr;
};
inline Ycc to_ycc(Rgb c) {
  return {(77 * c.r + 150 * c.g + 29 * c.b) >> 8, (-43 * c.r - 85 * c.g + 128 * c.b) >> 8,
          (128 * c.r - 107 * c.g - 21 * c.b) >> 8};
}
inline uint32_t from_ycc(uint32_t alpha_source, Ycc v) {
  return px_argb(alpha_source, px_clamp255(v.y + ((v.cr * 359) >> 8)),
                 px_clamp255(v.y - ((88 * v.cb + 183 * v.cr) >> 8)), px_clamp255(v.y + ((v.cb * 454) >> 8)));
}

// The same conversions in 16-bit arithmetic for the fast paths, so loops
// vectorise eight pixels to a register: luma fits 16 bits unsigned and the
// chroma sums 16 bits signed (|sum| <= 128 * 255); the inverse's large
// weights are split as c * 359 = c * 256 + c * 103, c * 454 = c * 256 + c * 198
// and 88 cb + 183 cr = 256 cr + (88 cb - 73 cr), which leaves the floors of
// the shifted sums unchanged (c * 256 is a whole multiple of 256). The split
// products fit 16 bits while |cb| and |cr| are at most kYcc16Chroma.
constexpr int kYcc16Chroma = 165;
// The fast paths' functions below take the 16-bit forms where they are the
// faster: with gcc; clang vectorises the 32-bit forms better (measured on
// 12 MP pictures). Both give the same values.
#if defined(__clang__)
inline constexpr bool kYccIn16Bits = false;
#else
inline constexpr bool kYccIn16Bits = true;
#endif
inline Ycc to_ycc16(Rgb c) {
  return {static_cast<uint16_t>(77 * c.r + 150 * c.g + 29 * c.b) >> 8,
          static_cast<int16_t>(-43 * c.r - 85 * c.g + 128 * c.b) >> 8,
          static_cast<int16_t>(128 * c.r - 107 * c.g - 21 * c.b) >> 8};
}
// Channel sums and the clamp in 16 bits as well (|y| stays far below 2^14).
inline uint32_t clamp255_16(int v) {
  const int16_t c = static_cast<int16_t>(v);
  return static_cast<uint8_t>(c < 0 ? 0 : (c > 255 ? 255 : c));
}
inline uint32_t from_ycc16(uint32_t alpha_source, Ycc v) {
  return (alpha_source & 0xFF000000u) | clamp255_16(v.y + v.cr + (static_cast<int16_t>(v.cr * 103) >> 8)) << 16 |
         clamp255_16(v.y - v.cr - (static_cast<int16_t>(88 * v.cb - 73 * v.cr) >> 8)) << 8 |
         clamp255_16(v.y + v.cb + (static_cast<int16_t>(v.cb * 198) >> 8));
}

// ---- pixel functions -------------------------------------------------------

struct Brightness {
  int offset;
  uint32_t operator()(uint32_t p) const {
    Ycc v = to_ycc(unpack(p));
    v.y += offset;
    return from_ycc(p, v);
  }
};

struct Temperature {
  int cb_shift, cr_shift;
  explicit Temperature(int t) : cb_shift(t - 128), cr_shift((235 - ((858 * t) >> 10)) - 128) {}
  uint32_t operator()(uint32_t p) const {
    Ycc v = to_ycc(unpack(p));
    v.cb += cb_shift;
    v.cr += cr_shift;
    return from_ycc(p, v);
  }
};

// Brightness and Temperature through the 16-bit conversions (the fast paths).
struct Brightness16 {
  int offset;
  // Exact while the luma with the offset stays well inside 16 bits.
  static constexpr int kMaxOffset = 16384;
  static bool fits(int offset) { return offset >= -kMaxOffset && offset <= kMaxOffset; }
  uint32_t operator()(uint32_t p) const {
    Ycc v = kYccIn16Bits ? to_ycc16(unpack(p)) : to_ycc(unpack(p));
    v.y += offset;
    return kYccIn16Bits ? from_ycc16(p, v) : from_ycc(p, v);
  }
};
struct Temperature16 {
  int cb_shift, cr_shift;
  // Exact while the shifted chroma stays within kYcc16Chroma (chroma before
  // the shift is -128..127); every level of both scales keeps it there.
  static bool fits(const Temperature& t) {
    const int limit = kYcc16Chroma - 128;
    return t.cb_shift >= -limit && t.cb_shift <= limit && t.cr_shift >= -limit && t.cr_shift <= limit;
  }
  uint32_t operator()(uint32_t p) const {
    Ycc v = kYccIn16Bits ? to_ycc16(unpack(p)) : to_ycc(unpack(p));
    v.cb += cb_shift;
    v.cr += cr_shift;
    return kYccIn16Bits ? from_ycc16(p, v) : from_ycc(p, v);
  }
};

// Saturation matrix in 1/1024: s = 1024 keeps the colour, 0 gives grey.
struct Saturation {
  int ra, gc, bb;  // diagonal: a + s, c + s, b + s
  int a, c, b;
  explicit Saturation(int s) {
    int w = 1024 - s;
    a = (316 * w) >> 10;
    c = (624 * w) >> 10;
    b = (84 * w) >> 10;
    ra = a + s, gc = c + s, bb = b + s;
  }
  uint32_t operator()(uint32_t p) const {
    Rgb x = unpack(p);
    return px_argb(p, px_clamp255((x.r * ra + x.g * c + x.b * b) >> 10),
                   px_clamp255((x.r * a + x.g * gc + x.b * b) >> 10),
                   px_clamp255((x.r * a + x.g * c + x.b * bb) >> 10));
  }
};

// Saturation with its weights and the channels as 16-bit values (every
// weight is below 2^12 and each product below 2^20), so the products are
// 16 x 16 -> 32-bit multiplies, which vector units have (the fast paths).
struct Saturation16 {
  int16_t ra, gc, bb, a, c, b;
  explicit Saturation16(const Saturation& s)
      : ra(static_cast<int16_t>(s.ra)),
        gc(static_cast<int16_t>(s.gc)),
        bb(static_cast<int16_t>(s.bb)),
        a(static_cast<int16_t>(s.a)),
        c(static_cast<int16_t>(s.c)),
        b(static_cast<int16_t>(s.b)) {}
  uint32_t operator()(uint32_t p) const {
    const int16_t r = static_cast<int16_t>((p >> 16) & 255), g = static_cast<int16_t>((p >> 8) & 255),
                  bl = static_cast<int16_t>(p & 255);
    return px_argb(p, px_clamp255((r * ra + g * c + bl * b) >> 10), px_clamp255((r * a + g * gc + bl * b) >> 10),
                   px_clamp255((r * a + g * c + bl * bb) >> 10));
  }
};

// A 256-entry curve applied to R, G and B.
struct Curve {
  std::array<uint8_t, 256> map;
  uint32_t operator()(uint32_t p) const {
    return px_argb(p, map[(p >> 16) & 255], map[(p >> 8) & 255], map[p & 255]);
  }
};

// Contrast step of a channel: (c - 128) / 10 rounded away from zero, so every
// channel but the middle one moves.
constexpr std::array<int, 256> make_contrast_steps() {
  std::array<int, 256> t{};
  for (int c = 0; c < 256; ++c) {
    int d = c - 128;
    t[c] = d < 0 ? -((-d + 9) / 10) : (d + 9) / 10;
  }
  return t;
}
inline constexpr std::array<int, 256> kContrastStep = make_contrast_steps();
static_assert(kContrastStep[0] == -13 && kContrastStep[127] == -1 && kContrastStep[128] == 0 &&
              kContrastStep[129] == 1 && kContrastStep[255] == 13);

// A channel never crosses the middle value.
inline uint8_t contrast_clamp(int c, int v) {
  if (c < 128) return static_cast<uint8_t>(v < 0 ? 0 : (v > 128 ? 128 : v));
  return static_cast<uint8_t>(v < 128 ? 128 : (v > 255 ? 255 : v));
}

inline Curve contrast_curve(int k) {
  Curve curve{};
  for (int c = 0; c < 256; ++c) curve.map[c] = contrast_clamp(c, c + kContrastStep[c] * k);
  return curve;
}

// The 0..100 scale steps in single-precision floats, truncated.
inline Curve contrast_curve_range100(int level) {
  const float k = static_cast<float>(level - 50) * 0.2f;
  Curve curve{};
  for (int c = 0; c < 256; ++c) {
    float v = static_cast<float>(c) + static_cast<float>(kContrastStep[c]) * k;
    curve.map[c] = contrast_clamp(c, static_cast<int>(v));
  }
  return curve;
}

// Exposure gain: 16.16, 1.0 at level 10; c * gain wraps in 32 bits as on
// the target.
inline Curve exposure_curve(int level) {
  const fixed gain = itofix(static_cast<int>(static_cast<uint32_t>(level) * 10u)) / 100;
  Curve curve{};
  for (int c = 0; c < 256; ++c) {
    int v = fixtoi(static_cast<fixed>(static_cast<uint32_t>(c) * static_cast<uint32_t>(gain)));
    curve.map[c] = static_cast<uint8_t>((v > 255 ? 255 : v) & 255);
  }
  return curve;
}

// Faded colour: each channel moves toward a warm, flat tone by f percent.
struct Faded {
  int f, g;
  static int channel(int c, int g, int f, int mul, int add) {
    int v = (255 * c * g + (mul * c + add) * f) / 25500;
    return v > 255 ? 255 : (v < 0 ? 0 : v);
  }
  uint32_t operator()(uint32_t p) const {
    Rgb x = unpack(p);
    return static_cast<uint32_t>(px_pack_rgb888(static_cast<int>(p), channel(x.r, g, f, 141, 26520),
                                                channel(x.g, g, f, 188, 13260), channel(x.b, g, f, 107, 18360)));
  }
};

struct Greyscale {
  int gain;  // 16.16
  uint32_t operator()(uint32_t p) const {
    Rgb x = unpack(p);
    int m = (x.r + x.g + x.b) / 3;
    int v = px_clamp255((m * gain) >> 16);  // 32-bit product, wrapping as on the target
    return px_argb(p, v, v, v);
  }
};

// ---- level scales ----------------------------------------------------------

inline int saturation_of(int level) {
  int s = 103 * (level - 10) + 1024;
  return s < 0 ? 0 : (s > 2048 ? 2048 : s);
}
inline int saturation_of_range100(int level) {
  int s = static_cast<int>(((level - 50) * 103) * 0.2 + 1024.0);
  return s < 0 ? 0 : (s > 2048 ? 2048 : s);
}
inline int temperature_of(int level) { return (10 - level) * 3 + 128; }
inline int temperature_of_range100(int level) { return static_cast<int>((50 - level) * 0.6 + 128.0); }
inline int greyscale_gain_of(int level) { return 4000 * (level - 10) + 65536; }

// Three 256-entry maps, one for each of R, G and B.
struct ChannelMaps {
  std::array<uint8_t, 256> r, g, b;
  uint32_t operator()(uint32_t p) const {
    return (p & 0xFF000000u) | static_cast<uint32_t>(r[(p >> 16) & 255]) << 16 |
           static_cast<uint32_t>(g[(p >> 8) & 255]) << 8 | b[p & 255];
  }
};

// The maps of a chain of steps that each treat R, G and B on their own:
// `steps(in, out, width, height)` is run on the 256 greys, so the composed
// maps are exactly what the steps give one after another.
template <class Steps>
ChannelMaps channel_maps_of(Steps steps) {
  int grey[256];
  for (int v = 0; v < 256; ++v) grey[v] = static_cast<int>(0xFF000000u | static_cast<uint32_t>(v) * 0x010101u);
  steps(grey, grey, 256, 1);
  ChannelMaps m{};
  for (int v = 0; v < 256; ++v) {
    const uint32_t p = static_cast<uint32_t>(grey[v]);
    m.r[v] = static_cast<uint8_t>(p >> 16);
    m.g[v] = static_cast<uint8_t>(p >> 8);
    m.b[v] = static_cast<uint8_t>(p);
  }
  return m;
}

// Faded colour's channels each depend on that channel alone: one map each,
// so no division per pixel.
inline ChannelMaps faded_maps(int level) {
  const Faded f{level, 100 - level};
  ChannelMaps m{};
  for (int c = 0; c < 256; ++c) {
    m.r[c] = static_cast<uint8_t>(Faded::channel(c, f.g, f.f, 141, 26520));
    m.g[c] = static_cast<uint8_t>(Faded::channel(c, f.g, f.f, 188, 13260));
    m.b[c] = static_cast<uint8_t>(Faded::channel(c, f.g, f.f, 107, 18360));
  }
  return m;
}

// Greyscale with the mean of the channels taken by a reciprocal:
// s / 3 = (s * 43691) >> 17 for every channel sum s = 0..765.
struct GreyscaleFast {
  int gain;  // 16.16
  uint32_t operator()(uint32_t p) const {
    const int s = static_cast<int>(((p >> 16) & 255) + ((p >> 8) & 255) + (p & 255));
    const int m = (s * 43691) >> 17;
    const int v = px_clamp255((m * gain) >> 16);  // 32-bit product, wrapping as on the target
    return px_argb(p, v, v, v);
  }
};

}  // namespace px_tone
