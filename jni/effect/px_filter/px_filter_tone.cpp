// Tone-curve filters: named looks from fixed recipes of the whole-picture
// adjustments, gamma curves and levels remappings, and the looks built on
// them (old photo, down-light, pop art, soft glow, sharpen).
#include <cmath>
#include <cstdint>
#include <cstring>

#include "../kalo/iel/iel.h"
#include "../kalo/px_mem.h"
#include "../px_color/px_auto_adjust.h"
#include "../px_color/px_fixed.h"
#include "../px_color/px_hue.h"
#include "../px_color/px_region.h"
#include "../px_color/px_tone.h"
#include "../px_color/px_tone_pixels.h"
#include "px_filter.h"
#include "px_filter_internal.h"

// ---- recipes ---------------------------------------------------------------

namespace {
using namespace px_tone;

// Retro in one pass over the picture, in short runs of pixels: the seven
// steps below, one loop each, the per-channel steps (faded colour and both
// contrasts) by their maps and the steps that mix channels (saturation and
// brightness) in loops that vectorise; a table look-up in the same loop
// would keep them from it.
void retro_fused(int* in, int* out, int width, int height) {
  const Saturation16 s5(Saturation(saturation_of(5))), s7(Saturation(saturation_of(7)));
  const ChannelMaps faded = faded_maps(50);
  const Curve lowc = contrast_curve(-1), highc = contrast_curve(2);
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    // Local copies: the stores must not look as if they could change them.
    constexpr size_t kRun = 256;
    uint32_t run[kRun];
    const Saturation16 first = s5, second = s7;
    for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; i += kRun) {
      const size_t n = end - i < kRun ? end - i : kRun;
      const uint32_t* s = src + i;
      uint32_t* d = dst + i;
      for (size_t j = 0; j < n; ++j) run[j] = Brightness16{20}(first(s[j]));
      for (size_t j = 0; j < n; ++j) run[j] = faded(run[j]);
      for (size_t j = 0; j < n; ++j) run[j] = second(run[j]);
      for (size_t j = 0; j < n; ++j) run[j] = lowc(run[j]);
      for (size_t j = 0; j < n; ++j) run[j] = Brightness16{10}(run[j]);
      for (size_t j = 0; j < n; ++j) d[j] = highc(run[j]);
    }
  });
}
}  // namespace

void px_apply_retro(int* in, int* out, int width, int height) {
  if (!px_scalar_only()) {
    retro_fused(in, out, width, height);
    return;
  }
  px_control_saturation_all(in, out, width, height, 5);
  px_control_brightness_all(out, out, width, height, 12);
  px_control_fadedcolor_all(out, out, width, height, 50);
  px_control_saturation_all(out, out, width, height, 7);
  px_control_contrast_all(out, out, width, height, 9);
  px_control_brightness_all(out, out, width, height, 11);
  px_control_contrast_all(out, out, width, height, 12);
}

void px_apply_yellowglow(int* in, int* out, int width, int height) {
  px_control_fadedcolor_all(in, out, width, height, 50);
  px_control_temperature_all(out, out, width, height, 12);
  px_control_exposure_all(out, out, width, height, 13);
  px_control_saturation_all(out, out, width, height, 8);
  px_adjust_RGB_all(out, out, width, height, 13, 14, 9);
  px_control_contrast_all(out, out, width, height, 13);
}

void px_apply_nostalgia(int* in, int* out, int width, int height) {
  px_control_brightness_all(in, out, width, height, 12);
  px_control_fadedcolor_all(out, out, width, height, 50);
  px_control_exposure_all(out, out, width, height, 11);
  px_control_saturation_all(out, out, width, height, 7);
  px_control_temperature_all(out, out, width, height, 13);
}

void px_apply_bluewash(int* in, int* out, int width, int height) {
  px_control_contrast_all(in, out, width, height, 12);
  px_control_saturation_all(out, out, width, height, 7);
  px_control_temperature_all(out, out, width, height, 6);
  px_control_exposure_all(out, out, width, height, 11);
  px_adjust_RGB_all(out, out, width, height, 10, 9, 11);
}

void px_apply_sunshine(int* in, int* out, int width, int height) {
  px_control_contrast_all(in, out, width, height, 11);
  px_control_temperature_all(out, out, width, height, 14);
  px_adjust_RGB_all(out, out, width, height, 11, 12, 8);
  px_control_contrast_all(out, out, width, height, 11);
}

// ---- gamma, greyscale, vignette ----------------------------------------------

void px_make_gamma_table(double gamma, uint8_t table[256]) {
  for (int i = 0; i < 256; ++i) {
    const double v = 255.0 * std::pow(i / 255.0, 1.0 / gamma) + 0.5;
    const int t = v >= 255.0 ? 255 : (v > 0.0 ? static_cast<int>(v) : 0);  // NaN gives 0
    table[i] = static_cast<uint8_t>(t);
  }
}

void control_gamma(int* in, int* out, int width, int height, int channel, double gamma) {
  if (!in || !out || channel < 0 || channel > 3) return;
  uint8_t t[256];
  px_make_gamma_table(gamma, t);
  // Byte shift of each selected channel; the other bytes pass unchanged.
  const bool r = channel == 0 || channel == 1, g = channel == 0 || channel == 2, b = channel == 0 || channel == 3;
  px_map_pixels(in, out, width, height, [&](uint32_t p) -> uint32_t {
    uint32_t o = p;
    if (r) o = (o & 0xFF00FFFFu) | static_cast<uint32_t>(t[(p >> 16) & 255]) << 16;
    if (g) o = (o & 0xFFFF00FFu) | static_cast<uint32_t>(t[(p >> 8) & 255]) << 8;
    if (b) o = (o & 0xFFFFFF00u) | t[p & 255];
    return o;
  });
}

void px_apply_greyscale_all(int* in, int* out, int width, int height) {
  if (!in || !out) return;
  px_map_pixels(in, out, width, height, [](uint32_t p) -> uint32_t {
    const int v = px_clamp255((static_cast<int>((p >> 16) & 255) + static_cast<int>(p & 255) +
                               2 * static_cast<int>((p >> 8) & 255)) >> 2);
    return static_cast<uint32_t>(px_pack_rgb888(static_cast<int>(p), v, v, v));
  });
}

namespace {
// The vignette's darkening: factor f(x, y) in 20 fractional bits, applied to
// each channel with the shifts below.
struct Vignette {
  int hx, hy;
  int64_t kx, ky;
  Vignette(int width, int height)
      : hx(width >> 1),
        hy(height >> 1),
        kx((int64_t{1} << 28) / (static_cast<int64_t>(hx) * hx)),
        ky((int64_t{1} << 28) / (static_cast<int64_t>(hy) * hy)) {}
  int64_t row(int y) const {
    const int64_t dy = y - hy;
    return (int64_t{1} << 28) - ((7 * ky * dy * dy) >> 4);
  }
  uint32_t factor(int64_t fy, int x) const {
    const int64_t dx = x - hx;
    return static_cast<uint32_t>((fy - ((7 * kx * dx * dx) >> 4)) >> 8);  // 2^20 is one
  }
  static uint32_t apply(uint32_t p, uint32_t f) {
    const uint32_t b = ((p & 255u) * f << 4) >> 24;
    const uint32_t r = ((((p >> 16) & 255u) * f) >> 4) & 0x00FF0000u;
    const uint32_t g = ((((p >> 8) & 255u) * f) >> 12) & 0x0000FF00u;
    return (p & 0xFF000000u) | r | g | b;
  }
};

// out = after(vignette(before(in))) over the picture in row bands; a picture
// under 2 x 2 has no vignette.
template <class Before, class After>
void vignette_between(const int* in, int* out, int width, int height, Before before, After after) {
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  if (width < 2 || height < 2) {
    px_map_pixels(in, out, width, height, [&](uint32_t p) { return after(before(p)); });
    return;
  }
  const Vignette v(width, height);
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const int64_t fy = v.row(y);
      const uint32_t* s = src + static_cast<size_t>(y) * w;
      uint32_t* d = dst + static_cast<size_t>(y) * w;
      for (int x = 0; x < width; ++x) d[x] = after(Vignette::apply(before(s[x]), v.factor(fy, x)));
    }
  });
}
}  // namespace

void px_apply_vignette(int* in, int* out, int width, int height) {
  if (!in || !out || width <= 0 || height <= 0) return;
  if (width < 2 || height < 2) {
    if (in != out) std::memmove(out, in, static_cast<size_t>(width) * static_cast<size_t>(height) * 4);
    return;
  }
  const Vignette v(width, height);
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const int64_t fy = v.row(y);
      for (int x = 0; x < width; ++x) {
        const size_t i = static_cast<size_t>(y) * w + static_cast<size_t>(x);
        dst[i] = Vignette::apply(src[i], v.factor(fy, x));
      }
    }
  });
}

// ---- vintage -------------------------------------------------------------------

namespace {
// Steps 1 to 8 of the vintage recipe: gamma curves and levels remappings per
// channel with brightness and contrast between them.
// The steps around the brightness step work on each channel alone, so the
// fast path composes each group into one map per channel.
void vintage_tones_before(int* in, int* out, int w, int h) {
  control_gamma(in, out, w, h, 0, 0.77);
  changeHistogramByInput(out, out, w, h, 1, 28, 255);
  control_gamma(out, out, w, h, 1, 1.09);
  control_gamma(out, out, w, h, 2, 1.06);
  control_gamma(out, out, w, h, 3, 1.15);
  changeHistogramByOutput(out, out, w, h, 3, 45, 255);
}
void vintage_tones_after(int* in, int* out, int w, int h) {
  px_control_contrast_all(in, out, w, h, 12);
  changeHistogramByInput(out, out, w, h, 0, 15, 243);
  control_gamma(out, out, w, h, 0, 1.03);
  changeHistogramByOutput(out, out, w, h, 0, 0, 238);
  changeHistogramByInput(out, out, w, h, 1, 49, 255);
  control_gamma(out, out, w, h, 1, 2.35);
  changeHistogramByOutput(out, out, w, h, 1, 11, 232);
  control_gamma(out, out, w, h, 2, 1.15);
  changeHistogramByOutput(out, out, w, h, 2, 0, 250);
  control_gamma(out, out, w, h, 3, 0.58);
  changeHistogramByOutput(out, out, w, h, 3, 56, 238);
  px_control_contrast_all(out, out, w, h, 12);
  changeHistogramByOutput(out, out, w, h, 3, 0, 241);
  changeHistogramByOutput(out, out, w, h, 3, 14, 255);
}
void vintage_tones(int* in, int* out, int w, int h) {
  vintage_tones_before(in, out, w, h);
  px_control_brightness_all(out, out, w, h, 12);
  vintage_tones_after(out, out, w, h);
}}  // namespace

namespace {
// The vintage colours in one pass: the per-channel steps before and after
// the brightness step composed into one map each, then (for the finished
// picture) the vignette and the saturation step.
struct VintageMaps {
  ChannelMaps before, after;
};
VintageMaps vintage_maps() {
  VintageMaps m;
  m.before = channel_maps_of(vintage_tones_before);
  m.after = channel_maps_of(vintage_tones_after);
  return m;
}

// The fused vintage in short runs of pixels, so the maps' table look-ups
// stay out of the arithmetic steps, which vectorise: the vignette's column
// terms are worked out once per call in 64 bits and kept in 32 (the row and
// column terms are below 2^29 and 2^27, so their difference and its shift
// are the same in 32 bits). False when the column terms cannot be allocated.
bool vintage_in_runs(const int* in, int* out, int width, int height, const VintageMaps& m, const Saturation16& s3) {
  if (width < 2 || height < 2) return false;
  auto* col = static_cast<int32_t*>(px_malloc(static_cast<size_t>(width), sizeof(int32_t)));
  if (!col) return false;
  const Vignette v(width, height);
  for (int x = 0; x < width; ++x) {
    const int64_t dx = x - v.hx;
    col[x] = static_cast<int32_t>((7 * v.kx * dx * dx) >> 4);
  }
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    constexpr int kRun = 256;
    uint32_t run[kRun];
    const Saturation16 sat = s3;
    const int32_t* cols = col;
    for (int y = y0; y < y1; ++y) {
      const int32_t fy = static_cast<int32_t>(v.row(y));
      const uint32_t* s = src + static_cast<size_t>(y) * w;
      uint32_t* d = dst + static_cast<size_t>(y) * w;
      for (int x0 = 0; x0 < width; x0 += kRun) {
        const int n = width - x0 < kRun ? width - x0 : kRun;
        for (int j = 0; j < n; ++j) run[j] = m.before(s[x0 + j]);
        for (int j = 0; j < n; ++j) run[j] = Brightness16{20}(run[j]);
        for (int j = 0; j < n; ++j) run[j] = m.after(run[j]);
        for (int j = 0; j < n; ++j) {
          const uint32_t f = static_cast<uint32_t>((fy - cols[x0 + j]) >> 8);
          d[x0 + j] = sat(Vignette::apply(run[j], f));
        }
      }
    }
  });
  px_free(col);
  return true;
}
}  // namespace

void px_apply_vintage(int* in, int* out, int width, int height) {
  if (!px_scalar_only() && in && out && width > 0 && height > 0) {
    const VintageMaps m = vintage_maps();
    const Saturation16 s3(Saturation(saturation_of(3)));
    if (vintage_in_runs(in, out, width, height, m, s3)) return;
    vignette_between(
        in, out, width, height, [&](uint32_t p) { return m.after(Brightness16{20}(m.before(p))); },
        [&](uint32_t p) { return s3(p); });
    return;
  }
  vintage_tones(in, out, width, height);
  px_apply_vignette(out, out, width, height);
  px_control_saturation_all(out, out, width, height, 3);
}

// Vintage preview: the same colours without the vignette. A preview is often
// a zoomed or cropped view of the picture, where a darkened frame would sit
// on the wrong edges; the vignette belongs to the finished picture. The
// centre pixel, where the vignette is neutral, matches px_apply_vintage.
void px_apply_vintage_prev(int* in, int* out, int width, int height) {
  if (!px_scalar_only() && in && out) {
    const VintageMaps m = vintage_maps();
    const Saturation16 s3(Saturation(saturation_of(3)));
    px_map_pixels(in, out, width, height, [&](uint32_t p) { return s3(m.after(Brightness16{20}(m.before(p)))); });
    return;
  }
  vintage_tones(in, out, width, height);
  px_control_saturation_all(out, out, width, height, 3);
}

// Partial vintage: the effect library's vintage look (the one applyVintage
// shows) on the picture's ARGB pixels, merged by the partial rule. If the
// effect library refuses the picture, the output is left as it was.
void px_apply_vintage_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                              int top, int bottom) {
  if (!in) return;
  px_filter::partial(__func__, out, mask, width, height, left, right, top, bottom, [&](int* s) {
    structIELImage a{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(in)};
    structIELImage b{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(s)};
    int32_t level = 0;
    structIELEffectParams params{IEL_EFFECT_VINTAGE, &level, nullptr, 0, 0};
    return IEL_Apply_Effect(&a, &b, &params) == 0;
  });
}

// ---- designed looks ------------------------------------------------------------

namespace {
// Luma with weights 77, 150, 29 (/256).
inline int luma(uint32_t p) {
  return (77 * static_cast<int>((p >> 16) & 255) + 150 * static_cast<int>((p >> 8) & 255) +
          29 * static_cast<int>(p & 255)) >> 8;
}
}  // namespace

// Sepia: red rises and blue falls by v * (255 - v) / 512, the most in the
// middle greys (128 -> red 159, blue 97) and not at all at black or white.
int px_get_sepia_r(int v) {
  v = px_clamp255(v);
  return px_clamp255(v + ((v * (255 - v)) >> 9));
}
int px_get_sepia_b(int v) {
  v = px_clamp255(v);
  return px_clamp255(v - ((v * (255 - v)) >> 9));
}

// Old photo: a faded sepia print. The luma v is squeezed into 20..224 (grey
// blacks and dull whites of an aged print, v' = 20 + (v * 205 >> 8)), then
// toned brown: red = sepia_r(v'), green = v', blue = sepia_b(v').
void px_apply_oldphoto(int* in, int* out, int width, int height) {
  if (!in || !out) return;
  px_map_pixels(in, out, width, height, [](uint32_t p) -> uint32_t {
    const int v = 20 + ((luma(p) * 205) >> 8);
    return px_argb(p, px_get_sepia_r(v), v, px_get_sepia_b(v));
  });
}

// Down-light: light falling from above. Each channel is scaled by a factor
// running linearly from 296/256 (about 1.16) on the top row to 136/256
// (about 0.53) on the bottom row, clamped to 255, so the top brightens, the
// middle stays near its value and the foot of the picture sinks into shade.
void px_apply_downlight(int* in, int* out, int width, int height) {
  if (!in || !out || width <= 0 || height <= 0) return;
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  const int span = height > 1 ? height - 1 : 1;
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const int f = 296 - (160 * y) / span;
      for (size_t i = static_cast<size_t>(y) * w, end = i + w; i < end; ++i) {
        const uint32_t p = src[i];
        dst[i] = px_argb(p, px_clamp255((static_cast<int>((p >> 16) & 255) * f) >> 8),
                         px_clamp255((static_cast<int>((p >> 8) & 255) * f) >> 8),
                         px_clamp255((static_cast<int>(p & 255) * f) >> 8));
      }
    }
  });
}

namespace {
// Pop-art palette by luma band (0..63, 64..127, 128..191, 192..255): deep
// blue, magenta, orange, lemon yellow: flat poster inks.
constexpr uint32_t kPopPalette[4] = {0x1A237Eu, 0xE6287Fu, 0xFF9A1Eu, 0xFFEB50u};
uint32_t popart_pixel(uint32_t p) { return (p & 0xFF000000u) | kPopPalette[luma(p) >> 6]; }
}  // namespace

// Pop art: a silkscreen print in four flat inks. Contrast 13 first spreads
// the tones over the bands, then each pixel takes the ink of its luma band
// (see kPopPalette).
void px_apply_popart(int* in, int* out, int width, int height) {
  if (!in || !out) return;
  px_control_contrast_all(in, out, width, height, 13);
  px_map_pixels(out, out, width, height, popart_pixel);
}

// Pop-art preview: the inks straight from the picture's luma, in one pass
// (no contrast step), for quick previews.
void px_apply_popart_prev(int* in, int* out, int width, int height) {
  if (!in || !out) return;
  px_map_pixels(in, out, width, height, popart_pixel);
}

namespace {
// Box blur of radius r (window 2r + 1, edges repeated) of `in` into `out`,
// per colour channel with integer sums and rounding; alpha from `in`.
// `tmp` holds width * height words.
void box_blur(const uint32_t* in, uint32_t* tmp, uint32_t* out, int width, int height, int r) {
  const int win = 2 * r + 1;
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {  // horizontal
    for (int y = y0; y < y1; ++y) {
      const uint32_t* row = in + static_cast<size_t>(y) * w;
      int s[3] = {0, 0, 0};
      for (int k = -r; k <= r; ++k) {
        const uint32_t p = row[k < 0 ? 0 : (k >= width ? width - 1 : k)];
        s[0] += (p >> 16) & 255, s[1] += (p >> 8) & 255, s[2] += p & 255;
      }
      for (int x = 0; x < width; ++x) {
        tmp[static_cast<size_t>(y) * w + x] =
            static_cast<uint32_t>((s[0] + r) / win) << 16 | static_cast<uint32_t>((s[1] + r) / win) << 8 |
            static_cast<uint32_t>((s[2] + r) / win);
        const int xo = x - r < 0 ? 0 : x - r, xi = x + r + 1 >= width ? width - 1 : x + r + 1;
        const uint32_t a = row[xo], b = row[xi];
        s[0] += static_cast<int>((b >> 16) & 255) - static_cast<int>((a >> 16) & 255);
        s[1] += static_cast<int>((b >> 8) & 255) - static_cast<int>((a >> 8) & 255);
        s[2] += static_cast<int>(b & 255) - static_cast<int>(a & 255);
      }
    }
  });
  px_for_rows(width, [&](int x0, int x1) {  // vertical, a band of columns each
    for (int x = x0; x < x1; ++x) {
      int s[3] = {0, 0, 0};
      for (int k = -r; k <= r; ++k) {
        const uint32_t p = tmp[static_cast<size_t>(k < 0 ? 0 : (k >= height ? height - 1 : k)) * w + x];
        s[0] += (p >> 16) & 255, s[1] += (p >> 8) & 255, s[2] += p & 255;
      }
      for (int y = 0; y < height; ++y) {
        const size_t i = static_cast<size_t>(y) * w + x;
        out[i] = (in[i] & 0xFF000000u) | static_cast<uint32_t>((s[0] + r) / win) << 16 |
                 static_cast<uint32_t>((s[1] + r) / win) << 8 | static_cast<uint32_t>((s[2] + r) / win);
        const int yo = y - r < 0 ? 0 : y - r, yi = y + r + 1 >= height ? height - 1 : y + r + 1;
        const uint32_t a = tmp[static_cast<size_t>(yo) * w + x], b = tmp[static_cast<size_t>(yi) * w + x];
        s[0] += static_cast<int>((b >> 16) & 255) - static_cast<int>((a >> 16) & 255);
        s[1] += static_cast<int>((b >> 8) & 255) - static_cast<int>((a >> 8) & 255);
        s[2] += static_cast<int>(b & 255) - static_cast<int>(a & 255);
      }
    }
  }, 16);
}
}  // namespace

namespace {
// The glow screened over a pixel: the glow g squared (g * g / 255) and
// screened, each rounded.
inline uint32_t glow_pixel(uint32_t p, uint32_t g) {
  uint32_t o = p & 0xFF000000u;
  for (int s = 0; s <= 16; s += 8) {
    const uint32_t c = (p >> s) & 255, gv = (g >> s) & 255;
    const uint32_t gg = (gv * gv + 127) / 255;
    o |= (255u - ((255u - c) * (255u - gg) + 127) / 255) << s;
  }
  return o;
}

// glow_pixel by tables: [g] the squared glow, [gg][c] the screen.
struct GlowTables {
  unsigned char square[256];
  unsigned char screen[256][256];
};
constexpr GlowTables make_glow_tables() {
  GlowTables t{};
  for (uint32_t g = 0; g < 256; ++g) t.square[g] = static_cast<unsigned char>((g * g + 127) / 255);
  for (uint32_t gg = 0; gg < 256; ++gg)
    for (uint32_t c = 0; c < 256; ++c)
      t.screen[gg][c] = static_cast<unsigned char>(255u - ((255u - c) * (255u - gg) + 127) / 255);
  return t;
}
constexpr GlowTables kGlow = make_glow_tables();

inline uint32_t glow_pixel_tables(uint32_t p, uint32_t r, uint32_t g, uint32_t b) {
  return (p & 0xFF000000u) | static_cast<uint32_t>(kGlow.screen[kGlow.square[r]][(p >> 16) & 255]) << 16 |
         static_cast<uint32_t>(kGlow.screen[kGlow.square[g]][(p >> 8) & 255]) << 8 |
         kGlow.screen[kGlow.square[b]][p & 255];
}

// floor(v / n) as a multiplication by the reciprocal rounded up: exact for
// v below 2^32 / n, which the box sums keep while n < 4096.
struct Reciprocal {
  uint64_t m;
  explicit Reciprocal(int n) : m(((uint64_t{1} << 32) + static_cast<uint64_t>(n) - 1) / static_cast<uint64_t>(n)) {}
  uint32_t operator()(uint32_t v) const { return static_cast<uint32_t>((v * m) >> 32); }
};

// Soft glow with the box blur's divisions as multiplications, the vertical
// direction walking rows in bands of columns (sums of a band's columns held
// side by side) and the screen done as each glow pixel comes out. The same
// sums, hence the same pixels, as box_blur followed by the screen.
// False when the working picture cannot be had.
bool softglow_fast(const uint32_t* in, uint32_t* out, int width, int height, int r) {
  const int win = 2 * r + 1;
  const size_t w = static_cast<size_t>(width);
  const size_t n = w * static_cast<size_t>(height);
  auto* tmp = static_cast<uint32_t*>(px_malloc(n, 4));
  const int bands = px_band_count(width, 16);
  auto* sums = static_cast<uint32_t*>(px_malloc(w * 3 + static_cast<size_t>(bands), sizeof(uint32_t)));
  if (!tmp || !sums) {
    px_free(tmp);
    px_free(sums);
    return false;
  }
  const Reciprocal div(win);
  px_for_rows(height, [&](int y0, int y1) {  // horizontal, as box_blur
    for (int y = y0; y < y1; ++y) {
      const uint32_t* row = in + static_cast<size_t>(y) * w;
      uint32_t* t = tmp + static_cast<size_t>(y) * w;
      uint32_t s[3] = {0, 0, 0};
      for (int k = -r; k <= r; ++k) {
        const uint32_t p = row[k < 0 ? 0 : (k >= width ? width - 1 : k)];
        s[0] += (p >> 16) & 255, s[1] += (p >> 8) & 255, s[2] += p & 255;
      }
      for (int x = 0; x < width; ++x) {
        t[x] = div(s[0] + r) << 16 | div(s[1] + r) << 8 | div(s[2] + r);
        const int xo = x - r < 0 ? 0 : x - r, xi = x + r + 1 >= width ? width - 1 : x + r + 1;
        const uint32_t a = row[xo], b = row[xi];
        s[0] += ((b >> 16) & 255) - ((a >> 16) & 255);
        s[1] += ((b >> 8) & 255) - ((a >> 8) & 255);
        s[2] += (b & 255) - (a & 255);
      }
    }
  });
  // Vertical: each band of columns keeps its columns' sums side by side and
  // walks the rows; out may be in itself (each pixel of in is read just
  // before its own output is written).
  px_for_rows(
      width,
      [&](int x0, int x1) {
        uint32_t* s = sums + static_cast<size_t>(x0) * 3;
        const int cols = x1 - x0;
        for (int c = 0; c < 3 * cols; ++c) s[c] = 0;
        for (int k = -r; k <= r; ++k) {
          const uint32_t* t = tmp + static_cast<size_t>(k < 0 ? 0 : (k >= height ? height - 1 : k)) * w + x0;
          for (int c = 0; c < cols; ++c) {
            s[3 * c] += (t[c] >> 16) & 255, s[3 * c + 1] += (t[c] >> 8) & 255, s[3 * c + 2] += t[c] & 255;
          }
        }
        for (int y = 0; y < height; ++y) {
          const size_t row = static_cast<size_t>(y) * w + x0;
          const int yo = y - r < 0 ? 0 : y - r, yi = y + r + 1 >= height ? height - 1 : y + r + 1;
          const uint32_t* a = tmp + static_cast<size_t>(yo) * w + x0;
          const uint32_t* b = tmp + static_cast<size_t>(yi) * w + x0;
          for (int c = 0; c < cols; ++c) {
            out[row + c] =
                glow_pixel_tables(in[row + c], div(s[3 * c] + r), div(s[3 * c + 1] + r), div(s[3 * c + 2] + r));
            s[3 * c] += ((b[c] >> 16) & 255) - ((a[c] >> 16) & 255);
            s[3 * c + 1] += ((b[c] >> 8) & 255) - ((a[c] >> 8) & 255);
            s[3 * c + 2] += (b[c] & 255) - (a[c] & 255);
          }
        }
      },
      16);
  px_free(sums);
  px_free(tmp);
  return true;
}
}  // namespace

// Soft glow: the highlights bloom softly into their surroundings. The
// picture is box-blurred with radius max(1, min(width, height) / 32); the
// blur is squared (g * g / 255) so only its bright parts glow; that glow is
// screened over the picture (255 - (255 - c)(255 - g') / 255, rounded).
// Dark areas stay as they were; skies, skin and lights turn dreamy. When the
// working pictures cannot be allocated the failure is logged and the output
// is not written.
void px_softglow(int* in, int* out, int width, int height) {
  if (!in || !out || width <= 0 || height <= 0) return;
  const int side = width < height ? width : height;
  const int r = side / 32 > 1 ? side / 32 : 1;
  if (!px_scalar_only() && 2 * r + 1 < 4096) {
    if (!softglow_fast(reinterpret_cast<const uint32_t*>(in), reinterpret_cast<uint32_t*>(out), width, height, r))
      IF_ERROR("Low memory: %s\n", __func__);
    return;
  }
  const size_t n = static_cast<size_t>(width) * static_cast<size_t>(height);
  auto* tmp = static_cast<uint32_t*>(px_malloc(n, 4));
  auto* glow = static_cast<uint32_t*>(px_malloc(n, 4));
  if (!tmp || !glow) {
    IF_ERROR("Low memory: %s\n", __func__);
    px_free(tmp);
    px_free(glow);
    return;
  }
  box_blur(reinterpret_cast<const uint32_t*>(in), tmp, glow, width, height, r);
  px_free(tmp);
  px_filter::map2(in, reinterpret_cast<int*>(glow), out, width, height, glow_pixel);
  px_free(glow);
}

// ---- sharpen -------------------------------------------------------------------

namespace {
inline uint32_t sharpen_pixel(uint32_t l, uint32_t p, uint32_t r) {
  uint32_t o = p & 0xFF000000u;
  for (int s = 0; s <= 16; s += 8) {
    const int c = static_cast<int>((p >> s) & 255);
    const int v = 2 * c - ((static_cast<int>((l >> s) & 255) + static_cast<int>((r >> s) & 255)) >> 1);
    o |= static_cast<uint32_t>(px_clamp255(v)) << s;
  }
  return o;
}

// One channel of sharpen_pixel in a form both compilers vectorise: the
// clamp as a minimum and a maximum.
inline uint32_t sharpen_channel(uint32_t l, uint32_t p, uint32_t r, int s) {
  const int c = static_cast<int>((p >> s) & 255);
  int v = 2 * c - ((static_cast<int>((l >> s) & 255) + static_cast<int>((r >> s) & 255)) >> 1);
  v = v < 0 ? 0 : v;
  v = v > 255 ? 255 : v;
  return static_cast<uint32_t>(v) << s;
}

// The inner pixels x = 1 .. width - 2 of one row: every one sharpened.
void sharpen_row(const uint32_t* __restrict s, uint32_t* __restrict d, int width) {
  for (int x = 1; x + 1 < width; ++x) {
    const uint32_t l = s[x - 1], p = s[x], r = s[x + 1];
    d[x] = (p & 0xFF000000u) | sharpen_channel(l, p, r, 16) | sharpen_channel(l, p, r, 8) |
           sharpen_channel(l, p, r, 0);
  }
}

// Sharpens the pixels selected by `sel` (all when null) into a scratch
// picture, then copies it to the output.
void sharpen(const int* in, const unsigned char* sel, int* out, int width, int height) {
  if (!in || !out || width <= 0 || height <= 0) return;
  const size_t n = static_cast<size_t>(width) * static_cast<size_t>(height);
  // An output apart from the input takes the pixels straight away (the
  // scratch picture only serves sharpening in place).
  const bool direct = !px_scalar_only() && out != in;
  auto* scratch = direct ? reinterpret_cast<uint32_t*>(out) : static_cast<uint32_t*>(px_calloc(n, 4));
  if (!scratch) {
    IF_ERROR("Low memory: sharpen\n");
    return;
  }
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  const size_t w = static_cast<size_t>(width);
  if (!px_scalar_only()) {
    // Rows without a selection sharpen every inner pixel (vectorised);
    // with one, the unselected pixels are put back from the input.
    px_for_rows(height, [&](int y0, int y1) {
      for (int y = y0; y < y1; ++y) {
        const size_t row = static_cast<size_t>(y) * w;
        const uint32_t* s = src + row;
        uint32_t* d = scratch + row;
        sharpen_row(s, d, width);
        d[0] = s[0];
        d[width - 1] = s[width - 1];
        if (!sel) continue;
        const unsigned char* m = sel + row;
        for (int x = 1; x + 1 < width; ++x) d[x] = m[x] != 1 ? s[x] : d[x];
      }
    });
  } else {
    px_for_rows(height, [&](int y0, int y1) {
      for (int y = y0; y < y1; ++y) {
        const size_t row = static_cast<size_t>(y) * w;
        for (int x = 0; x < width; ++x) {
          const size_t i = row + x;
          const bool edge = x == 0 || x == width - 1;
          scratch[i] = edge || (sel && sel[i] != 1) ? src[i] : sharpen_pixel(src[i - 1], src[i], src[i + 1]);
        }
      }
    });
  }
  if (direct) return;
  std::memcpy(out, scratch, n * 4);
  px_free(scratch);
}
}  // namespace

void px_apply_sharpen_all(int* in, int* out, int width, int height) { sharpen(in, nullptr, out, width, height); }

void px_apply_sharpen(int* in, unsigned char* mask, int* out, int width, int height, int left, int right, int top,
                      int bottom) {
  if (!in || !out || width <= 0 || height <= 0) return;
  const size_t n = static_cast<size_t>(width) * static_cast<size_t>(height);
  const bool whole = left > right || top > bottom;
  if (whole) {
    // The caller's mask is set to all 1 for the run and left all 0 after it.
    if (mask) std::memset(mask, 1, n);
    sharpen(in, mask, out, width, height);
    if (mask) std::memset(mask, 0, n);
    return;
  }
  if (!mask) return;
  sharpen(in, mask, out, width, height);
}

// ---- partial forms -------------------------------------------------------------

#define PX_TONE_PARTIAL(fn, whole)                                                                          \
  void fn(int* in, unsigned char* mask, int* out, int width, int height, int left, int right, int top,      \
          int bottom) {                                                                                     \
    px_filter::partial(__func__, out, mask, width, height, left, right, top, bottom,                        \
                       [&](int* s) { whole(in, s, width, height); });                                       \
  }

PX_TONE_PARTIAL(px_apply_retro_partial, px_apply_retro)
PX_TONE_PARTIAL(px_apply_yellowglow_partial, px_apply_yellowglow)
PX_TONE_PARTIAL(px_apply_nostalgia_partial, px_apply_nostalgia)
PX_TONE_PARTIAL(px_apply_bluewash_partial, px_apply_bluewash)
PX_TONE_PARTIAL(px_apply_sunshine_partial, px_apply_sunshine)
PX_TONE_PARTIAL(px_apply_oldphoto_partial, px_apply_oldphoto)
PX_TONE_PARTIAL(px_apply_downlight_partial, px_apply_downlight)
PX_TONE_PARTIAL(px_softglow_partial, px_softglow)
