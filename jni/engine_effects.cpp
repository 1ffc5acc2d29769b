// Engine methods that run an effect of the effect library.
#include "bridge.h"
#include "effect/kalo/iel/iel_artistic.h"
#include "effect/kalo/px_mem.h"
#include "pixel_buffers.h"

ENGINE_METHOD(jint, applySepia)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb(call, in, out, width, height, {IEL_EFFECT_SEPIA, 15, 0, 0, true});
}

ENGINE_METHOD(jint, applySepiaPartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb_partial(call, in, mask, out, width, height, rect, {IEL_EFFECT_SEPIA, 15, 0, 0, true});
}

// ---- effects of the effect library: painterly, halftone, kaleidoscope,
// reflection, region, vintage --------------------------------------------------


namespace {
// The cartoon methods take no level from Java: the outline window of radius
// 2 (5 x 5) draws clear outlines without thickening them on small pictures.
constexpr int32_t kCartoonLevel = 2;
// The plain pencil sketch: strokes of medium darkness (2 of 1..3) over the
// wider 7 x 7 dodge blur (level 2), which keeps outlines readable on photos
// without the heavy look of the sketch on paper texture.
constexpr int kSketchStrokeDarkness = 2;
constexpr int kSketchBlurLevel = 2;

// Family A and C around the sketch itself, which no effect identifier
// selects: the same checks, conversion and merge, with IEL_SketchNew2 in
// place of the dispatcher. A null mask or rectangle marks the whole-picture
// form.
jint sketch_rgb(bridge::Call& call, jintArray in, jbyteArray mask, jintArray out, jint width, jint height,
                jobject rect, bool partial) {
  px_rect r{0, -1, 0, -1};
  if (!call.picture(width, height)) return PX_ERR_NULL;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(out, n, "out")) return PX_ERR_NULL;
  if (partial && !call.rect(rect, &r)) return PX_ERR_NULL;
  if (partial && !px_rect_empty(r) && !call.check(mask, n, "mask")) return PX_ERR_NULL;
  jint* src = call.pin(in, 0, bridge::kReads);
  jbyte* m = partial && mask ? call.pin(mask, JNI_ABORT, bridge::kReads) : nullptr;
  jint* dst = call.pin(out, 0, bridge::kWrites);
  if (!src || !dst || (partial && mask && !m)) return PX_ERR_ALLOC;
  auto* a = static_cast<unsigned char*>(px_calloc(n * 3, 1));
  auto* b = static_cast<unsigned char*>(px_calloc(n * 3, 1));
  jint rc = PX_ERR_ALLOC;
  if (a && b) {
    convertIntArrayToByteArray(src, a, width, height);
    structIELImage ia{width, height, IEL_FORMAT_RGB888, a};
    structIELImage ib{width, height, IEL_FORMAT_RGB888, b};
    rc = IEL_SketchNew2(&ia, &ib, kSketchStrokeDarkness, kSketchBlurLevel) == IEL_OK ? PX_OK : PX_ERR_EFFECT;
    if (rc == PX_OK && partial) {
      convertByteArraytoIntArrayUsingMask(b, dst, src, reinterpret_cast<unsigned char*>(m), width, height, r);
    } else if (rc == PX_OK) {
      convertByteArraytoIntArray(b, dst, src, width, height);
    }
  }
  px_free(a);
  px_free(b);
  return rc;
}

// Kaleidoscope and reflection report success whatever the effect library
// answered; refused arguments still give their codes.
jint success_unless_refused(jint rc) { return rc == PX_ERR_NULL || rc == PX_ERR_ALLOC ? rc : PX_OK; }
}  // namespace

// Family A: whole picture.

ENGINE_METHOD(jint, applyCartoonize)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb(call, in, out, width, height, {IEL_EFFECT_CARTOON, kCartoonLevel});
}

ENGINE_METHOD(jint, applyMagicPen)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb(call, in, out, width, height, {IEL_EFFECT_MAGIC_PEN, 0});
}

ENGINE_METHOD(jint, applyOilpaint)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb(call, in, out, width, height, {IEL_EFFECT_OIL_PAINT, 0});
}

ENGINE_METHOD(jint, applyPosterize)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb(call, in, out, width, height, {IEL_EFFECT_POSTERIZE, 0, 0, 0, true});
}

ENGINE_METHOD(jint, applySketch)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return sketch_rgb(call, in, nullptr, out, width, height, nullptr, false);
}

ENGINE_METHOD(jint, applySketchTexture)
(JNIEnv* env, jobject, jintArray in, jintArray texture, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  if (!texture) {
    call.refuse("texture array is null");
    return PX_ERR_NULL;
  }
  return bridge::effect_rgb(call, in, out, width, height, {IEL_EFFECT_SKETCH_TEXTURE, 0}, texture);
}

ENGINE_METHOD(jint, applyHalftone)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb(call, in, out, width, height, {IEL_EFFECT_HALFTONE, 0});
}

// Family C: merged into the output by mask and rectangle.

ENGINE_METHOD(jint, applyCartoonizePartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb_partial(call, in, mask, out, width, height, rect, {IEL_EFFECT_CARTOON, kCartoonLevel});
}

ENGINE_METHOD(jint, applyMagicPenPartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb_partial(call, in, mask, out, width, height, rect, {IEL_EFFECT_MAGIC_PEN, 0});
}

ENGINE_METHOD(jint, applyOilpaintPartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb_partial(call, in, mask, out, width, height, rect, {IEL_EFFECT_OIL_PAINT, 0});
}

ENGINE_METHOD(jint, applyPosterizePartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb_partial(call, in, mask, out, width, height, rect, {IEL_EFFECT_POSTERIZE, 0, 0, 0, true});
}

ENGINE_METHOD(jint, applySketchPartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  return sketch_rgb(call, in, mask, out, width, height, rect, true);
}

ENGINE_METHOD(jint, applySketchTexturePartial)
(JNIEnv* env, jobject, jintArray in, jintArray texture, jintArray out, jbyteArray mask, jint width, jint height,
 jobject rect) {
  bridge::Call call(env, __func__);
  if (!texture) {
    call.refuse("texture array is null");
    return PX_ERR_NULL;
  }
  return bridge::effect_rgb_partial(call, in, mask, out, width, height, rect, {IEL_EFFECT_SKETCH_TEXTURE, 0},
                                    texture);
}

ENGINE_METHOD(jint, applyHalftonePartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb_partial(call, in, mask, out, width, height, rect, {IEL_EFFECT_HALFTONE, 0});
}

// Family B: on the caller's ARGB pixels.

ENGINE_METHOD(jint, applyKaleidoscope)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return success_unless_refused(bridge::effect_argb(call, in, out, width, height, {IEL_EFFECT_KALEIDOSCOPE, 0}));
}

ENGINE_METHOD(jint, applyReflection)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint reflectionHeight) {
  bridge::Call call(env, __func__);
  return success_unless_refused(
      bridge::effect_argb(call, in, out, width, height, {IEL_EFFECT_REFLECTION, reflectionHeight}));
}

ENGINE_METHOD(jint, applyRegionBasedBrightness)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint touchX, jint touchY, jint level) {
  bridge::Call call(env, __func__);
  return bridge::effect_argb(call, in, out, width, height, {IEL_EFFECT_REGION_BRIGHTNESS, level, touchX, touchY});
}

ENGINE_METHOD(jint, applyRegionBasedContrast)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint touchX, jint touchY, jint level) {
  bridge::Call call(env, __func__);
  return bridge::effect_argb(call, in, out, width, height, {IEL_EFFECT_REGION_CONTRAST, level, touchX, touchY});
}

ENGINE_METHOD(jint, applyRegionBasedExposure)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint touchX, jint touchY, jint level) {
  bridge::Call call(env, __func__);
  return bridge::effect_argb(call, in, out, width, height, {IEL_EFFECT_REGION_EXPOSURE, level, touchX, touchY});
}

// Family E: vintage on the caller's ARGB pixels, no status.

ENGINE_METHOD(void, applyVintage)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height, [&](jint* src, jint* dst) {
    structIELImage a{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(src)};
    structIELImage b{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(dst)};
    int32_t level = 0;
    structIELEffectParams params{IEL_EFFECT_VINTAGE, &level, nullptr, 0, 0};
    IEL_Apply_Effect(&a, &b, &params);
  });
}

// Progress and cancellation of the running effect, for a second thread.

ENGINE_METHOD(jint, getEffectProgress)(JNIEnv*, jobject) { return static_cast<jint>(IEL_GetProgress()); }

ENGINE_METHOD(void, cancelEffect)(JNIEnv*, jobject) { IEL_CancelOperation(); }
