// Texture-overlay filters: a prepared look from a fixed chain of the
// whole-picture adjustments, then the caller's texture screened or overlaid.
#include <cstdint>

#include "../px_color/px_hue.h"
#include "../px_color/px_region.h"
#include "../px_color/px_tone.h"
#include "../px_color/px_tone_pixels.h"
#include "px_filter.h"
#include "px_filter_internal.h"

namespace {
using namespace px_tone;

// Each channel written out (no loop over the channel shifts), so the
// fused loop below needs no inner loop.
inline uint32_t screen_channel(uint32_t p, uint32_t t, int s) {
  const uint32_t c = (p >> s) & 255, k = (t >> s) & 255;
  return (255u - (((255u - c) * (255u - k)) >> 8)) << s;  // divides by 256: 0 with 0 gives 1
}

inline uint32_t screen_pixel(uint32_t p, uint32_t t) {
  if ((p >> 24) == 0) return 0;
  return (p & 0xFF000000u) | screen_channel(p, t, 16) | screen_channel(p, t, 8) | screen_channel(p, t, 0);
}

inline uint32_t overlay_channel(uint32_t p, uint32_t t, int s) {
  const uint32_t ia = p >> 24, ta = t >> 24;
  const uint32_t c = (p >> s) & 255, k = (t >> s) & 255;
  const uint32_t v = c < 128 ? (k * c) >> 7 : 255u - (((255u - k) * (255u - c)) >> 7);
  // The mix weight of the picture is ta XOR ia (255 - ta when opaque).
  // For a translucent picture the sum can pass 255; it is held at 255.
  const uint32_t m = (ta * v + c * (ta ^ ia)) >> 8;
  return (m > 255u ? 255u : m) << s;
}

inline uint32_t overlay_pixel(uint32_t p, uint32_t t) {
  if ((p >> 24) == 0) return 0;
  return (p & 0xFF000000u) | overlay_channel(p, t, 16) | overlay_channel(p, t, 8) | overlay_channel(p, t, 0);
}

// The screen and overlay blends in 16-bit arithmetic for the fused loop,
// eight channels to a vector register: every product of two channels fits
// 16 bits, and the overlay's sum of two such products (up to 17 bits) is
// halved first, a + b >> 8 = (a / 2 + b / 2 + (a & b & 1)) >> 7 (the half a
// single odd term leaves never reaches the next multiple of 128).
inline uint32_t screen_channel16(uint32_t p, uint32_t t, int s) {
  const uint32_t c = (p >> s) & 255, k = (t >> s) & 255;
  return (255u - (static_cast<uint16_t>((255u - c) * (255u - k)) >> 8)) << s;
}
inline uint32_t screen_pixel16(uint32_t p, uint32_t t) {
  if ((p >> 24) == 0) return 0;
  return (p & 0xFF000000u) | screen_channel16(p, t, 16) | screen_channel16(p, t, 8) | screen_channel16(p, t, 0);
}
inline uint32_t overlay_channel16(uint32_t p, uint32_t t, int s) {
  const uint32_t ia = p >> 24, ta = t >> 24;
  const uint32_t c = (p >> s) & 255, k = (t >> s) & 255;
  const uint32_t v =
      c < 128 ? static_cast<uint16_t>(k * c) >> 7 : 255u - (static_cast<uint16_t>((255u - k) * (255u - c)) >> 7);
  const uint16_t a = static_cast<uint16_t>(ta * v), b = static_cast<uint16_t>(c * (ta ^ ia));
  const uint32_t m = static_cast<uint16_t>((a >> 1) + (b >> 1) + (a & b & 1)) >> 7;
  return (m > 255u ? 255u : m) << s;
}
inline uint32_t overlay_pixel16(uint32_t p, uint32_t t) {
  if ((p >> 24) == 0) return 0;
  return (p & 0xFF000000u) | overlay_channel16(p, t, 16) | overlay_channel16(p, t, 8) | overlay_channel16(p, t, 0);
}

// Dawn cast in one pass: brightness, then contrast, exposure and RGB balance
// composed into one map per channel, saturation, the screen texture and the
// overlay texture. Only when neither texture is the output array, whose
// pixels the step-by-step form overwrites before it reads the textures.
bool dawncast_fused(const int* in, int* out, const int* overlay, const int* screen, int width, int height) {
  if (px_scalar_only() || !in || !out || !overlay || !screen || overlay == out || screen == out) return false;
  if (width <= 0 || height <= 0) return true;
  const ChannelMaps tones = channel_maps_of([](int* i, int* o, int w, int h) {
    px_control_contrast_all(i, o, w, h, 13);
    px_control_exposure_all(o, o, w, h, 8);
    px_adjust_RGB_all(o, o, w, h, 11, 10, 10);
  });
  const Saturation16 s9(Saturation(saturation_of(9)));
  const Brightness16 b9{-10};
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  const auto* ov = reinterpret_cast<const uint32_t*>(overlay);
  const auto* sc = reinterpret_cast<const uint32_t*>(screen);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  // In short runs of pixels, three loops: the maps' table look-ups stay out
  // of the arithmetic steps before and after them, which then vectorise.
  px_for_rows(height, [&](int y0, int y1) {
    // Local copies: the stores must not look as if they could change them.
    constexpr size_t kRun = 256;
    uint32_t run[kRun];
    const Brightness16 bright = b9;
    const Saturation16 sat = s9;
    for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; i += kRun) {
      const size_t n = end - i < kRun ? end - i : kRun;
      const uint32_t *s = src + i, *scr = sc + i, *ovl = ov + i;
      uint32_t* d = dst + i;
      for (size_t j = 0; j < n; ++j) run[j] = bright(s[j]);
      for (size_t j = 0; j < n; ++j) run[j] = tones(run[j]);
      PX_VECTORISE
      for (size_t j = 0; j < n; ++j) d[j] = overlay_pixel16(screen_pixel16(sat(run[j]), scr[j]), ovl[j]);
    }
  });
  return true;
}
}  // namespace

void px_blend_texture_with_screen(int* image, int* out, int* texture, int width, int height) {
  px_filter::map2(image, texture, out, width, height, screen_pixel);
}

void px_blend_texture_with_overlay(int* image, int* out, int* texture, int width, int height) {
  px_filter::map2(image, texture, out, width, height, overlay_pixel);
}

void px_apply_dawncast_texture(int* in, int* out, int* overlay, int* screen, int width, int height) {
  if (dawncast_fused(in, out, overlay, screen, width, height)) return;
  px_control_brightness_all(in, out, width, height, 9);
  px_control_contrast_all(out, out, width, height, 13);
  px_control_exposure_all(out, out, width, height, 8);
  px_adjust_RGB_all(out, out, width, height, 11, 10, 10);
  px_control_saturation_all(out, out, width, height, 9);
  px_blend_texture_with_screen(out, out, screen, width, height);
  px_blend_texture_with_overlay(out, out, overlay, width, height);
}

void px_apply_lightstreak_texture(int* in, int* out, int* texture, int width, int height) {
  px_control_contrast_all(in, out, width, height, 12);
  px_control_exposure_all(out, out, width, height, 8);
  px_control_saturation_all(out, out, width, height, 9);
  px_blend_texture_with_screen(out, out, texture, width, height);
}

void px_apply_stardust_texture(int* in, int* out, int* texture, int width, int height) {
  px_control_exposure_all(in, out, width, height, 9);
  px_control_contrast_all(out, out, width, height, 12);
  px_adjust_RGB_all(out, out, width, height, 12, 10, 10);
  px_control_brightness_all(out, out, width, height, 11);
  px_control_saturation_all(out, out, width, height, 9);
  px_blend_texture_with_screen(out, out, texture, width, height);
}

void px_apply_sunburst_texture(int* in, int* out, int* texture, int width, int height) {
  px_control_exposure_all(in, out, width, height, 11);
  px_control_contrast_all(out, out, width, height, 13);
  px_control_saturation_all(out, out, width, height, 9);
  px_blend_texture_with_screen(out, out, texture, width, height);
}

void px_apply_lightflare_texture(int* in, int* out, int* texture, int width, int height) {
  px_control_exposure_all(in, out, width, height, 8);
  px_control_contrast_all(out, out, width, height, 12);
  px_control_brightness_all(out, out, width, height, 13);
  px_control_saturation_all(out, out, width, height, 12);
  px_blend_texture_with_screen(out, out, texture, width, height);
}

// Colour tone of 14 degrees, three parts picture to one part texture, then a
// little less contrast. A pixel left transparent by the tone becomes the
// texture's alpha moved to the lowest byte (texture >> 24), as it always has.
void px_apply_oldphoto_texture(int* in, int* out, int* texture, int width, int height) {
  px_change_colortone(in, out, width, height, 14);
  px_filter::map2(out, texture, out, width, height, [](uint32_t p, uint32_t t) -> uint32_t {
    if ((p >> 24) == 0) return t >> 24;
    uint32_t o = p & 0xFF000000u;
    for (int s = 0; s <= 16; s += 8) {
      o |= (((3u * ((p >> s) & 255)) + ((t >> s) & 255)) >> 2) << s;
    }
    return o;
  });
  px_control_contrast_all(out, out, width, height, 9);
}

// ---- partial forms -----------------------------------------------------------

void px_apply_dawncast_texture_partial(int* in, int* out, int* overlay, int* screen, unsigned char* mask, int width,
                                       int height, int left, int right, int top, int bottom) {
  px_filter::partial(__func__, out, mask, width, height, left, right, top, bottom,
                     [&](int* s) { px_apply_dawncast_texture(in, s, overlay, screen, width, height); });
}

#define PX_TEXTURE_PARTIAL(name)                                                                             \
  void px_apply_##name##_texture_partial(int* in, int* out, int* texture, unsigned char* mask, int width,    \
                                         int height, int left, int right, int top, int bottom) {             \
    px_filter::partial(__func__, out, mask, width, height, left, right, top, bottom,                         \
                       [&](int* s) { px_apply_##name##_texture(in, s, texture, width, height); });           \
  }

PX_TEXTURE_PARTIAL(lightstreak)
PX_TEXTURE_PARTIAL(stardust)
PX_TEXTURE_PARTIAL(sunburst)
PX_TEXTURE_PARTIAL(lightflare)
PX_TEXTURE_PARTIAL(oldphoto)
