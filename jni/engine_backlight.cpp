// Engine methods of the backlight correction: analyse once, render previews
// and the full picture at a strength, free the two handles.
#include "bridge.h"
#include "effect/backlight/px_backlight.h"

namespace {
using RenderOp = int (*)(const int*, int*, int, int, int);

jint render(JNIEnv* env, const char* func, jintArray in, jintArray out, jint width, jint height, jint strength,
            RenderOp op) {
  bridge::Call call(env, func);
  if (!px_blc_get_info().ready) {
    call.refuse("no backlight analysis: call autoBLCInit first");
    return PX_ERR_NULL;
  }
  return bridge::status(call, in, out, width, height,
                        [&](int* src, int* dst) { return op(src, dst, width, height, strength); });
}
}  // namespace

ENGINE_METHOD(jint, autoBLCInit)(JNIEnv* env, jobject, jintArray in, jint width, jint height) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(in, call.pixels(), "in")) return PX_ERR_NULL;
  const jint* src = call.pin(in, JNI_ABORT, bridge::kReads);
  if (!src) return PX_ERR_ALLOC;
  return px_blc_init(src, width, height);
}

ENGINE_METHOD(jint, applyGammaTransformPreview)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint strength) {
  return render(env, __func__, in, out, width, height, strength, px_blc_preview);
}

ENGINE_METHOD(jint, applyBLCSave)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint strength) {
  return render(env, __func__, in, out, width, height, strength, px_blc_save);
}

ENGINE_METHOD(jint, DeInitBLC)(JNIEnv*, jobject) { return px_blc_deinit(); }
