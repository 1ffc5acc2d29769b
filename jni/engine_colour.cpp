// Engine methods of the colour tools: hue, RGB balance, point colour and the
// automatic adjustment with its settings.
#include "bridge.h"
#include "effect/px_color/px_auto_adjust.h"
#include "effect/px_color/px_hue.h"

// ---- region methods (in, mask, out, width, height, levels..., rect; no status)

ENGINE_METHOD(void, controlHue)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jint level,
 jobject rect) {
  bridge::Call call(env, __func__);
  bridge::region(call, in, mask, out, width, height, rect, [&](const bridge::Region& a) {
    px_control_hue(a.in, a.mask, a.out, a.width, a.height, level, a.rect);
  });
}

ENGINE_METHOD(void, controlHueRange100)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jint level,
 jobject rect) {
  bridge::Call call(env, __func__);
  bridge::region(call, in, mask, out, width, height, rect, [&](const bridge::Region& a) {
    px_control_hue_range100(a.in, a.mask, a.out, a.width, a.height, level, a.rect);
  });
}

ENGINE_METHOD(void, adjustRGB)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jint red, jint green,
 jint blue, jobject rect) {
  bridge::Call call(env, __func__);
  bridge::region(call, in, mask, out, width, height, rect, [&](const bridge::Region& a) {
    px_adjust_RGB(a.in, a.mask, a.out, a.width, a.height, red, green, blue, a.rect);
  });
}

ENGINE_METHOD(void, adjustRGBRange100)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jint red, jint green,
 jint blue, jobject rect) {
  bridge::Call call(env, __func__);
  bridge::region(call, in, mask, out, width, height, rect, [&](const bridge::Region& a) {
    px_adjust_RGB_range100(a.in, a.mask, a.out, a.width, a.height, red, green, blue, a.rect);
  });
}

// ---- whole-picture methods (in, out, width, height; no status) -------------

#define POINT_COLOUR_METHOD(name, op)                                                                  \
  ENGINE_METHOD(void, name)(JNIEnv * env, jobject, jintArray in, jintArray out, jint width, jint height) { \
    bridge::Call call(env, __func__);                                                                  \
    bridge::whole(call, in, out, width, height, [&](int* src, int* dst) { op(src, dst, width, height); }); \
  }

POINT_COLOUR_METHOD(applyPointColorRed, px_point_color_red)
POINT_COLOUR_METHOD(applyPointColorGreen, px_point_color_green)
POINT_COLOUR_METHOD(applyPointColorBlue, px_point_color_blue)
POINT_COLOUR_METHOD(applyPointColorYellow, px_point_color_yellow)

// ---- automatic adjustment ---------------------------------------------------

ENGINE_METHOD(jint, applyAutoAdjust)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::status(call, in, out, width, height,
                        [&](int* src, int* dst) { return px_process_hdr(src, dst, width, height); });
}

ENGINE_METHOD(void, setAutoAdjust)(JNIEnv*, jobject, jint threshold, jint cutoff, jint weight1, jint weight2) {
  px_set_hdr(threshold, cutoff, weight1, weight2);
}
ENGINE_METHOD(jint, getAutoAdjustThreshold)(JNIEnv*, jobject) { return px_get_threshold_hdr(); }
ENGINE_METHOD(jint, getAutoAdjustCutoff)(JNIEnv*, jobject) { return px_get_cutoff_hdr(); }
ENGINE_METHOD(jint, getAutoAdjustWeight1)(JNIEnv*, jobject) { return px_get_weight1_hdr(); }
ENGINE_METHOD(jint, getAutoAdjustWeight2)(JNIEnv*, jobject) { return px_get_weight2_hdr(); }
