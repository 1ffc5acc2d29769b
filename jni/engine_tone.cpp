// Engine methods of the tone adjustments (region family: in, mask, out,
// width, height, level, rect; no status).
#include "bridge.h"
#include "effect/px_color/px_tone.h"

namespace {
using RegionOp = void (*)(int*, unsigned char*, int*, int, int, int, px_rect);

void tone(JNIEnv* env, const char* func, jintArray in, jbyteArray mask, jintArray out, jint width, jint height,
          jint level, jobject rect, RegionOp op) {
  bridge::Call call(env, func);
  bridge::region(call, in, mask, out, width, height, rect, [&](const bridge::Region& a) {
    op(a.in, a.mask, a.out, a.width, a.height, level, a.rect);
  });
}
}  // namespace

#define TONE_METHOD(name, op)                                                                              \
  ENGINE_METHOD(void, name)                                                                                \
  (JNIEnv * env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jint level, \
   jobject rect) {                                                                                         \
    tone(env, __func__, in, mask, out, width, height, level, rect, op);                                    \
  }

TONE_METHOD(controlBrightness, px_control_brightness)
TONE_METHOD(controlBrightnessRange100, px_control_brightness_range100)
TONE_METHOD(controlContrast, px_control_contrast)
TONE_METHOD(controlContrastRange100, px_control_contrast_range100)
TONE_METHOD(controlSaturation, px_control_saturation)
TONE_METHOD(controlSaturationRange100, px_control_saturation_range100)
TONE_METHOD(controlTemperature, px_control_temperature)
TONE_METHOD(controlTemperatureRange100, px_control_temperature_range100)
TONE_METHOD(controlGreyscale, px_control_greyscale)
// The operation's own status is not reported by this family.
TONE_METHOD(controlExposure, [](int* i, unsigned char* m, int* o, int w, int h, int l, px_rect r) {
  px_control_exposure(i, m, o, w, h, l, r);
})
TONE_METHOD(controlFadedColour, [](int* i, unsigned char* m, int* o, int w, int h, int l, px_rect r) {
  px_control_fadedcolor(i, m, o, w, h, l, r);
})
