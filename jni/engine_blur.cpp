// Engine methods of the blur and depth-of-field tools: selective blur with
// its preview state, tilt-shift with its preview state, miniature and the
// out-focus blur.
#include "bridge.h"
#include "effect/blur/px_blur.h"

namespace {
// The mask is required for a non-empty rectangle. With an empty one it may be
// null; when given it is zero-filled by the blur, so it is checked and pinned
// for writing.
bool check_blur_mask(bridge::Call& call, jbyteArray mask, const px_rect& r) {
  if (!px_rect_empty(r) || mask) return call.check(mask, call.pixels(), "mask");
  return true;
}
}  // namespace

ENGINE_METHOD(jint, initBlur)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  px_rect r;
  if (!call.picture(width, height) || !call.rect(rect, &r)) return PX_ERR_NULL;
  if (!call.check(in, call.pixels(), "in") || !check_blur_mask(call, mask, r)) return PX_ERR_NULL;
  jint* src = call.pin(in, 0, bridge::kReads);
  jbyte* m = mask ? call.pin(mask, 0, px_rect_empty(r) ? bridge::kWrites : bridge::kReads) : nullptr;
  if (!src || (mask && !m)) return PX_ERR_ALLOC;
  return px_Init_blur(src, reinterpret_cast<unsigned char*>(m), width, height, r.left, r.right, r.top, r.bottom);
}

ENGINE_METHOD(void, runBlurinPreview)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jint level) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height)) return;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(mask, n, "mask") || !call.check(out, n, "out")) return;
  jint* src = call.pin(in, JNI_ABORT, bridge::kReads);
  jbyte* m = call.pin(mask, JNI_ABORT, bridge::kReads);
  jint* dst = call.pin(out, JNI_ABORT, bridge::kWrites);
  if (!src || !m || !dst) return;
  px_make_blur_preview(src, reinterpret_cast<unsigned char*>(m), dst, width, height, level);
}

ENGINE_METHOD(void, applyBlur)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jint level,
 jobject rect) {
  bridge::Call call(env, __func__);
  px_rect r;
  if (!call.picture(width, height) || !call.rect(rect, &r)) return;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(out, n, "out") || !check_blur_mask(call, mask, r)) return;
  jint* src = call.pin(in, JNI_ABORT, bridge::kReads);
  jbyte* m = mask ? call.pin(mask, JNI_ABORT, px_rect_empty(r) ? bridge::kWrites : bridge::kReads) : nullptr;
  jint* dst = call.pin(out, JNI_ABORT, bridge::kWrites);
  if (!src || !dst || (mask && !m)) return;
  px_make_blur(src, reinterpret_cast<unsigned char*>(m), dst, width, height, level, r.left, r.right, r.top,
               r.bottom);
}

ENGINE_METHOD(void, destroyBlur)(JNIEnv*, jobject) { px_destroy_blur(); }

ENGINE_METHOD(void, initTiltShift)(JNIEnv* env, jobject, jintArray in, jint width, jint height) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(in, call.pixels(), "in")) return;
  jint* src = call.pin(in, JNI_ABORT, bridge::kReads);
  if (src) px_init_tiltshift(src, width, height);
}

ENGINE_METHOD(void, makeTiltShift)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint center, jint halfBand) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height,
                [&](int* src, int* dst) { px_tiltshift_preview(src, dst, width, height, center, halfBand); });
}

ENGINE_METHOD(void, applyTiltShift)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint center, jint halfBand) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height,
                [&](int* src, int* dst) { px_apply_tiltshift(src, dst, width, height, center, halfBand); });
}

ENGINE_METHOD(void, applyMiniature)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height,
                [&](int* src, int* dst) { px_apply_miniature(src, dst, width, height); });
}

ENGINE_METHOD(void, destroyTiltShift)(JNIEnv*, jobject) { px_destroy_tiltshift(); }

// Not one of the original methods: reaches the out-focus blur directly.
ENGINE_METHOD(jint, applyOutfocusBlur)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint level) {
  bridge::Call call(env, __func__);
  return bridge::status(call, in, out, width, height, [&](int* src, int* dst) -> jint {
    return px_blur_outfocus(src, dst, width, height, level) == IEL_OK ? PX_OK : PX_ERR_EFFECT;
  });
}
