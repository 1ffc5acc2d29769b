// Brightness, contrast, saturation, temperature, exposure, faded colour and
// greyscale. Each is a small pixel function built once per call from the
// level; the region, _range100 and _all forms only differ in how the level
// becomes the function's parameter and in which pixels they visit.
#include "px_tone.h"

#include <array>
#include <cstdint>

#include "../kalo/if_utils_and.h"
#include "../kalo/iel/iel.h"
#include "px_region.h"
#include "px_tone_pixels.h"

namespace {
using namespace px_tone;

// Whole-picture brightness goes through the effect library's variable
// brightness (a plain per-channel offset); the masked form uses the luma rule.
void brightness_region(int* in, unsigned char* mask, int* out, int width, int height, int offset, px_rect rect) {
  if (!px_rect_empty(rect)) {
    if (px_scalar_only() || !Brightness16::fits(offset)) {
      px_region_map(in, mask, out, width, height, rect, Brightness{offset});
    } else {
      px_region_map(in, mask, out, width, height, rect, Brightness16{offset});
    }
    return;
  }
  structIELImage src{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(in)};
  structIELImage dst{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(out)};
  int32_t level = offset;
  structIELEffectParams params{IEL_EFFECT_VARIABLE_BRIGHTNESS, &level, nullptr, 0, 0};
  IEL_Apply_Effect(&src, &dst, &params);
}

template <class Map>
void saturation_map(Map map, Saturation s) {
  if (px_scalar_only()) {
    map(s);
  } else {
    map(Saturation16(s));
  }
}

template <class Map>
void temperature_map(Map map, Temperature t) {
  if (!px_scalar_only() && Temperature16::fits(t)) {
    map(Temperature16{t.cb_shift, t.cr_shift});
  } else {
    map(t);
  }
}

}  // namespace

void px_control_brightness(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect) {
  brightness_region(in, mask, out, width, height, (level - 10) * 10, rect);
}
void px_control_brightness_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                                    px_rect rect) {
  brightness_region(in, mask, out, width, height, (level - 50) * 2, rect);
}
void px_control_contrast(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect) {
  px_region_map(in, mask, out, width, height, rect, contrast_curve(level - 10));
}
void px_control_contrast_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                                  px_rect rect) {
  px_region_map(in, mask, out, width, height, rect, contrast_curve_range100(level));
}
void px_control_saturation(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect) {
  saturation_map([&](auto fn) { px_region_map(in, mask, out, width, height, rect, fn); },
                 Saturation(saturation_of(level)));
}
void px_control_saturation_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                                    px_rect rect) {
  saturation_map([&](auto fn) { px_region_map(in, mask, out, width, height, rect, fn); },
                 Saturation(saturation_of_range100(level)));
}
void px_control_temperature(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect) {
  temperature_map([&](auto fn) { px_region_map(in, mask, out, width, height, rect, fn); },
                  Temperature(temperature_of(level)));
}
void px_control_temperature_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                                     px_rect rect) {
  temperature_map([&](auto fn) { px_region_map(in, mask, out, width, height, rect, fn); },
                  Temperature(temperature_of_range100(level)));
}

int px_control_exposure(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect) {
  if (!in || !out || level < 0) {
    IF_ERROR("ERROR : Invalid Input Parameters");
    return PX_ERR_NULL;
  }
  px_region_map(in, mask, out, width, height, rect, exposure_curve(level));
  return PX_OK;
}

int px_control_fadedcolor(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect) {
  if (!in || !mask || !out || level > 100) return PX_ERR_NULL;
  if (px_scalar_only()) {
    px_region_map(in, mask, out, width, height, rect, Faded{level, 100 - level});
  } else {
    px_region_map(in, mask, out, width, height, rect, faded_maps(level));
  }
  return PX_OK;
}

void px_control_greyscale(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect) {
  if (px_scalar_only()) {
    px_region_map(in, mask, out, width, height, rect, Greyscale{greyscale_gain_of(level)});
  } else {
    px_region_map(in, mask, out, width, height, rect, GreyscaleFast{greyscale_gain_of(level)});
  }
}

void px_control_brightness_all(int* in, int* out, int width, int height, int level) {
  const int offset = static_cast<int>(static_cast<uint32_t>(level - 10) * 10u);
  if (px_scalar_only() || !Brightness16::fits(offset)) {
    px_map_pixels(in, out, width, height, Brightness{offset});
  } else {
    px_map_pixels(in, out, width, height, Brightness16{offset});
  }
}
void px_control_contrast_all(int* in, int* out, int width, int height, int level) {
  px_map_pixels(in, out, width, height, contrast_curve(level - 10));
}
void px_control_saturation_all(int* in, int* out, int width, int height, int level) {
  if (px_scalar_only()) {
    px_map_pixels(in, out, width, height, Saturation(saturation_of(level)));
  } else {
    px_map_pixels(in, out, width, height, Saturation16(Saturation(saturation_of(level))));
  }
}
void px_control_temperature_all(int* in, int* out, int width, int height, int level) {
  temperature_map([&](auto fn) { px_map_pixels(in, out, width, height, fn); }, Temperature(temperature_of(level)));
}
int px_control_fadedcolor_all(int* in, int* out, int width, int height, int level) {
  if (!in || !out || level > 100) return PX_ERR_NULL;
  if (px_scalar_only()) {
    px_map_pixels(in, out, width, height, Faded{level, 100 - level});
  } else {
    px_map_pixels(in, out, width, height, faded_maps(level));
  }
  return PX_OK;
}
int px_control_exposure_all(int* in, int* out, int width, int height, int level) {
  if (!in || !out) return PX_ERR_NULL;
  px_map_pixels(in, out, width, height, exposure_curve(level));
  return PX_OK;
}
