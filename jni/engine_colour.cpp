// Engine methods of the colour tools: hue, RGB balance, point colour and the
// automatic adjustment with its settings, the brushes, colour splash,
// pixelize, invert and the lens tints.
#include "bridge.h"
#include <climits>

#include "effect/px_color/px_auto_adjust.h"
#include "effect/px_color/px_brush.h"
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

// ---- brushes ------------------------------------------------------------------
// Brush methods take (image, [preview,] cx, cy, radius, strength or cell
// shift, width, height[, previewWidth, previewHeight]) and change the image
// in place.

namespace {
// Checks and pins a full-size image and its preview; false (logged) when
// either is refused.
struct Brush {
  jint* image = nullptr;
  jint* preview = nullptr;
};

bool pin_brush(bridge::Call& call, jintArray image, jintArray preview, jint width, jint height, jint pw, jint ph,
               Brush* out) {
  if (!call.picture(width, height)) return false;
  if (preview) {
    if (pw <= 0 || ph <= 0 || static_cast<long long>(pw) * ph > INT_MAX / 4) {
      call.refuse("preview size is not positive or too large");
      return false;
    }
  }
  if (!call.check(image, call.pixels(), "image")) return false;
  if (preview && !call.check(preview, static_cast<size_t>(pw) * static_cast<size_t>(ph), "preview")) return false;
  out->image = call.pin(image, JNI_ABORT, bridge::kWrites);
  if (!out->image) return false;
  if (preview) {
    out->preview = call.pin(preview, JNI_ABORT, bridge::kWrites);
    if (!out->preview) return false;
  }
  return true;
}
}  // namespace

ENGINE_METHOD(jint, rubLighten)
(JNIEnv* env, jobject, jintArray image, jint cx, jint cy, jint radius, jint strength, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::in_place(call, image, width, height, JNI_ABORT,
                          [&](int* px) { px_apply_lighten(px, cx, cy, width, height, strength, radius); });
}

ENGINE_METHOD(jint, rubDarken)
(JNIEnv* env, jobject, jintArray image, jint cx, jint cy, jint radius, jint strength, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::in_place(call, image, width, height, JNI_ABORT,
                          [&](int* px) { px_apply_darken(px, cx, cy, width, height, strength, radius); });
}

ENGINE_METHOD(jint, rubLightenPreview)
(JNIEnv* env, jobject, jintArray image, jintArray preview, jint cx, jint cy, jint radius, jint strength, jint width,
 jint height, jint preview_width, jint preview_height) {
  bridge::Call call(env, __func__);
  if (!preview) return call.refuse("preview array is null"), PX_ERR_NULL;
  Brush b;
  if (!pin_brush(call, image, preview, width, height, preview_width, preview_height, &b)) return PX_ERR_NULL;
  px_apply_lighten_with_preview(b.image, cx, cy, width, height, b.preview, preview_width, preview_height, strength,
                                radius);
  return PX_OK;
}

ENGINE_METHOD(jint, rubDarkenPreview)
(JNIEnv* env, jobject, jintArray image, jintArray preview, jint cx, jint cy, jint radius, jint strength, jint width,
 jint height, jint preview_width, jint preview_height) {
  bridge::Call call(env, __func__);
  if (!preview) return call.refuse("preview array is null"), PX_ERR_NULL;
  Brush b;
  if (!pin_brush(call, image, preview, width, height, preview_width, preview_height, &b)) return PX_ERR_NULL;
  px_apply_darken_with_preview(b.image, cx, cy, width, height, b.preview, preview_width, preview_height, strength,
                               radius);
  return PX_OK;
}

// ---- pixelize -------------------------------------------------------------------

ENGINE_METHOD(void, applyPixelize)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint shift) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height,
                [&](int* src, int* dst) { px_apply_pixelize(src, dst, width, height, shift); });
}

ENGINE_METHOD(void, rubPixelize)
(JNIEnv* env, jobject, jintArray image, jint cx, jint cy, jint radius, jint shift, jint width, jint height) {
  bridge::Call call(env, __func__);
  bridge::in_place(call, image, width, height, JNI_ABORT,
                   [&](int* px) { px_rub_pixelize(px, width, height, shift, cx, cy, radius); });
}

ENGINE_METHOD(void, rubPixelizePreview)
(JNIEnv* env, jobject, jintArray image, jintArray preview, jint cx, jint cy, jint radius, jint shift, jint width,
 jint height, jint preview_width, jint preview_height) {
  bridge::Call call(env, __func__);
  if (!preview) return call.refuse("preview array is null");
  Brush b;
  if (!pin_brush(call, image, preview, width, height, preview_width, preview_height, &b)) return;
  px_rub_pixelize_with_preview(b.image, width, height, b.preview, preview_width, preview_height, shift, cx, cy,
                               radius);
}

// ---- colour splash ----------------------------------------------------------------

ENGINE_METHOD(jint, initSplash)(JNIEnv* env, jobject, jintArray image, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::in_place(call, image, width, height, 0, [&](int* px) { px_init_splash(px, width, height); });
}

ENGINE_METHOD(jint, setGrayInSplash)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::status(call, in, out, width, height, [&](int* src, int* dst) {
    px_set_gray_splash(src, dst, width, height);
    return PX_OK;
  });
}

ENGINE_METHOD(jint, drawSplash)
(JNIEnv* env, jobject, jintArray image, jint cx, jint cy, jint radius, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::in_place(call, image, width, height, JNI_ABORT,
                          [&](int* px) { px_draw_splash(px, cx, cy, width, height, radius); });
}

ENGINE_METHOD(jint, drawSplashPreview)
(JNIEnv* env, jobject, jintArray image, jintArray preview, jint cx, jint cy, jint radius, jint width, jint height,
 jint preview_width, jint preview_height) {
  bridge::Call call(env, __func__);
  if (!preview) return call.refuse("preview array is null"), PX_ERR_NULL;
  Brush b;
  if (!pin_brush(call, image, preview, width, height, preview_width, preview_height, &b)) return PX_ERR_NULL;
  px_draw_splash_with_preview(b.image, cx, cy, width, height, b.preview, preview_width, preview_height, radius);
  return PX_OK;
}

ENGINE_METHOD(jint, recoverSplash)(JNIEnv* env, jobject, jintArray image, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::in_place(call, image, width, height, 0, [&](int* px) { px_recover_splash(px, width, height); });
}

ENGINE_METHOD(void, finishSplash)(JNIEnv*, jobject) { px_finish_splash(); }

// ---- invert and lens tints ------------------------------------------------------------

ENGINE_METHOD(void, applyInvert)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  bridge::region(call, in, mask, out, width, height, rect, [&](const bridge::Region& a) {
    px_apply_invert(a.in, a.mask, a.out, a.width, a.height, a.rect);
  });
}

ENGINE_METHOD(void, controlEdgeLens)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint level, jint size) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height,
                [&](int* src, int* dst) { px_control_edgelens(src, dst, width, height, level, size); });
}

ENGINE_METHOD(void, controlTopLens)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint level, jint size) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height,
                [&](int* src, int* dst) { px_control_toplens(src, dst, width, height, level, size); });
}
