// Engine methods of portrait retouching and red-eye removal.
#include "bridge.h"

#include "effect/portrait/px_redeye.h"

// ---- red-eye (in place or input to output; no status) ------------------------

ENGINE_METHOD(void, removeRedeye)
(JNIEnv* env, jobject, jintArray image, jint width, jint height, jint x, jint y, jint radius) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(image, call.pixels(), "image")) return;
  jint* px = call.pin(image, JNI_ABORT, bridge::kWrites);
  if (!px) return;
  px_remove_redeye_manual(px, width, height, x, y, radius);
}

ENGINE_METHOD(void, removeRedeyePreview)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint x, jint y, jint radius) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height,
                [&](int* src, int* dst) { px_remove_redeye_manual_prev(src, dst, width, height, x, y, radius); });
}

// Automatic red-eye removal is not offered: the arrays are not touched.
ENGINE_METHOD(void, removeRedeyeAuto)(JNIEnv*, jobject, jintArray, jintArray, jint, jint) {}
